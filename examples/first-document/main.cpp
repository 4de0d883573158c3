// The smallest host of documents: one kind of object, which writes itself and is read back.

#include <korvane/korvane.h>

#include <iostream>

namespace {

enum Token : unsigned int { kShot = 1, kShotName = 1, kShotStart = 2 };

/// Gives the tokens their names in the text form.
KVScope shotScope[] = {
    {"shot", kShot, 0},
    {"name", kShot, kShotName},
    {"start", kShot, kShotStart},
    {nullptr, 0, 0},
};

struct Shot : KVSerializer {
    KVString name;
    CMTime start = CMTimeMake(0, 1);
    KVString comment;

    void writeHeader(KVSerializerWriteStream&, bool) override {}
    void markFactoriesForSerialization(KVSerializerWriteStream&, bool) override {}
    void writeBody(KVSerializerWriteStream& stream, bool, bool, bool) override
    {
        stream.pushScope(shotScope);
        stream.startElement(kShot);
        stream.writeAttribute(kShotName, name);
        stream.writeAttribute(kShotStart, start);
        stream.writeValue(comment);
        stream.endElement();
        stream.popScope();
    }

    bool parseBegin(KVSerializerReadStream& stream) override
    {
        stream.pushScope(shotScope);
        return true;
    }
    bool parseElement(KVSerializerReadStream&, KVStreamElement& element) override
    {
        return element.getAttributeAsString(kShotName, &name) &&
               element.getAttributeAsVexTime(kShotStart, &start) && element.getAsString(&comment);
    }
    bool parseEnd(KVSerializerReadStream&) override { return true; }
};

/// The document's root element stands in front of the host's own ones.
struct Root : KVSerializer {
    explicit Root(Shot& first) : shot(first) {}
    Shot& shot;

    void writeHeader(KVSerializerWriteStream&, bool) override {}
    void markFactoriesForSerialization(KVSerializerWriteStream&, bool) override {}
    void writeBody(KVSerializerWriteStream&, bool, bool, bool) override {}
    bool parseBegin(KVSerializerReadStream& stream) override
    {
        static KVScope rootScope[] = {{"vzml", 1, 0}, {nullptr, 0, 0}};
        stream.pushScope(rootScope);
        return true;
    }
    bool parseElement(KVSerializerReadStream& stream, KVStreamElement&) override
    {
        return stream.pushHandler(&shot);
    }
    bool parseEnd(KVSerializerReadStream&) override { return true; }
};

} // namespace

int main()
{
    Shot shot;
    shot.name = "Harbour";
    shot.start = CMTimeMake(96096, 24000);
    shot.comment = "Dawn & fog";

    KVBufferWriteStream bytes(4096, 1024);
    KVXMLWriteStream out(bytes, 1, 0);
    shot.writeBody(out, false, false, false);
    out.close();
    std::string const text(reinterpret_cast<char const*>(bytes.getBuffer()), bytes.getBufferSize());
    std::cout << text;

    Shot again;
    Root root(again);
    KVXMLReadStream in(text.data(), static_cast<int>(text.size()));
    in.pushHandler(&root);
    bool const whole = in.parse();
    std::cout << "read back: " << again.name << " at " << CMTimeGetSeconds(again.start) << " s, "
              << again.comment << '\n';
    return whole && again.name == shot.name ? 0 : 1;
}

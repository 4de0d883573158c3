// The text reader, under a table that names a few elements and takes every other one.

#include <korvane/korvane.h>

#include <limits>

namespace {

KVScope everything[] = {
    {"vzml", 1, 0},  {"version", 1, 1}, {"clip", 2, 0},  {"name", 2, 1},
    {"start", 2, 2}, {"*", 3, 0},       {nullptr, 0, 0},
};

/// Reads what it is given in every way that there is, and its children as well.
struct Reader : KVSerializer {
    void writeHeader(KVSerializerWriteStream&, bool) override {}
    void writeBody(KVSerializerWriteStream&, bool, bool, bool) override {}
    void markFactoriesForSerialization(KVSerializerWriteStream&, bool) override {}
    bool parseBegin(KVSerializerReadStream& stream) override
    {
        stream.pushScope(everything);
        return true;
    }
    bool parseEnd(KVSerializerReadStream&) override { return true; }
    bool readSignificantWhiteSpace() override { return true; }
    bool parseElement(KVSerializerReadStream& stream, KVStreamElement& element) override
    {
        KVString text;
        int integer;
        double real;
        CMTime time;
        element.getAttributeAsString(1, &text);
        element.getAttributeAsVexTime(2, &time);
        while (element.getAsDouble(&real) && ++numbers < 1000)
            element.getAsInt32(&integer);
        delete element.getAsUUID();
        element.getAsVexTime(&time);
        element.getAsString(&text);
        if (element.token == 3 && text.size() == 7)
            stream.ignoreElement();
        return stream.pushHandler(this);
    }
    int numbers = 0;
};

} // namespace

extern "C" int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    if (size > static_cast<std::size_t>(std::numeric_limits<int>::max()))
        return 0;
    Reader reader;
    KVXMLReadStream stream(reinterpret_cast<char const*>(data), static_cast<int>(size));
    stream.pushHandler(&reader);
    stream.parse();
    // Whatever came in, nothing is left on the stacks.
    if (stream.currentHandler())
        __builtin_trap();
    return 0;
}

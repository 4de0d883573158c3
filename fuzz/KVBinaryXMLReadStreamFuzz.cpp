// Any bytes as a document in binary form, with handlers that ask every element for everything.

#include <korvane/korvane.h>

#include <cstdint>
#include <memory>

namespace {

KVScope table[] = {{"a", 1, 0}, {"b", 2, 0}, {"c", 3, 0}, {nullptr, 0, 0}};
KVScope wildcard[] = {{"*", 9, 0}, {nullptr, 0, 0}};

class Handler : public KVIgnoreElement {
public:
    explicit Handler(KVScope* scope) : scope_(scope) {}
    bool parseBegin(KVSerializerReadStream& stream) override
    {
        stream.pushScope(scope_);
        return true;
    }
    bool parseElement(KVSerializerReadStream& stream, KVStreamElement& element) override
    {
        KVString text;
        int int32;
        unsigned int uint32;
        long long int64;
        unsigned long long uint64;
        float single;
        double number;
        bool flag;
        CMTime time;
        element.getAsString(&text);
        element.getAsInt32(&int32);
        element.getAsUInt32(&uint32);
        element.getAsInt64(&int64);
        element.getAsUInt64(&uint64);
        element.getAsFloat(&single);
        element.getAsDouble(&number);
        element.getAsBool(&flag);
        element.getAsVexTime(&time);
        std::unique_ptr<KVUUID> const uuid(element.getAsUUID());
        for (unsigned int token = 0; token < 4; ++token) {
            element.getAttributeAsString(token, &text);
            element.getAttributeAsInt32(token, &int32);
            element.getAttributeAsUInt64(token, &uint64);
            element.getAttributeAsDouble(token, &number);
            element.getAttributeAsVexTime(token, &time);
            std::unique_ptr<KVUUID> const attribute(element.getAttributeAsUUID(token));
        }
        // Now and then an element is passed over, or its children go to the handler above.
        switch (++count_ % 16) {
        case 5:
            stream.ignoreElement();
            return true;
        case 9:
            return true;
        default:
            return stream.pushHandler(this);
        }
    }

private:
    KVScope* scope_;
    unsigned int count_ = 0;
};

} // namespace

extern "C" int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    for (KVScope* scope : {table, wildcard}) {
        KVBufferReadStream bytes(data, size);
        KVBinaryXMLReadStream stream(bytes);
        Handler handler(scope);
        stream.pushHandler(&handler);
        stream.parse();
        if (scope == wildcard)
            stream.popAllHandlers();
    }
    return 0;
}

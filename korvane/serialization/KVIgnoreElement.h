#pragma once

#include <korvane/serialization/KVSerializer.h>

/// A handler that passes everything over. It pushes no scopes, so no child element is found as
/// long as it is the handler. See KVSerializerReadStream::ignoreElement.
class KV_EXPORT KVIgnoreElement : public KVSerializer {
public:
    ~KVIgnoreElement() override;
    /// The one instance that all streams use, made at the first call. It holds no state.
    static KVIgnoreElement& sharedInstance();

    void writeHeader(KVSerializerWriteStream&, bool) override {}
    void writeBody(KVSerializerWriteStream&, bool, bool, bool) override {}
    void markFactoriesForSerialization(KVSerializerWriteStream&, bool) override {}
    bool parseBegin(KVSerializerReadStream&) override { return true; }
    bool parseEnd(KVSerializerReadStream&) override { return true; }
    bool parseElement(KVSerializerReadStream&, KVStreamElement&) override { return true; }
};

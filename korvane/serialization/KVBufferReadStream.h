#pragma once

#include <korvane/foundation/KVCFRef.h>
#include <korvane/platform/CFData.h>
#include <korvane/serialization/KVStream.h>

/// Reads a block of memory.
///
///     KVBufferReadStream stream(data);     // a CFDataRef, which it retains
///     unsigned char head[8];
///     bool const whole = stream.read(head, 8) == 8;
class KV_EXPORT KVBufferReadStream : public KVStream {
public:
    /// Retains the block; null reads as an empty one. The bytes must not change meanwhile.
    explicit KVBufferReadStream(CFDataRef data);
    /// The bytes are not copied and must outlive the stream.
    KVBufferReadStream(void const* bytes, unsigned long long length);
    ~KVBufferReadStream() override;

    /// Returns how many bytes came, the smaller of `length` and what is left.
    long long read(void* data, unsigned long long length) override;
    /// Nothing is written: 0.
    long long write(void const* data, unsigned long long length) override;
    unsigned long long getPos() override;
    /// A position behind the end becomes the end.
    void setPos(unsigned long long position) override;
    /// 0: reading memory does not fail.
    int getError() const override;

private:
    KVCFRef<CFDataRef> data_;
    unsigned char const* start_;
    unsigned char const* end_;
    unsigned char const* current_;
};

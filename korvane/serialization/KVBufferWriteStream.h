#pragma once

#include <korvane/foundation/KVCFRef.h>
#include <korvane/platform/CFData.h>
#include <korvane/serialization/KVStream.h>

#include <cstdlib>
#include <memory>

/// Writes to a block of memory that grows.
///
///     KVBufferWriteStream stream(4096, 1024);
///     stream << "Reel 12";
///     KVCFRef<CFDataRef> data = stream.copyData();
///
/// It holds up to 4 GiB less one byte. What lies between the end of the data and a position set
/// behind it becomes zero with the next write.
class KV_EXPORT KVBufferWriteStream : public KVStream {
public:
    /// `initial` bytes at the start, and at least `step` more each time it grows. Throws
    /// KVException_WriteError for a negative size and when there is no memory.
    KVBufferWriteStream(int initial, int step);
    ~KVBufferWriteStream() override;

    /// Nothing is read: 0.
    long long read(void* data, unsigned long long length) override;
    /// Writes at the current position and returns `length`. Throws KVException_WriteError when
    /// the block cannot grow that far; nothing is written then.
    long long write(void const* data, unsigned long long length) override;
    unsigned long long getPos() override;
    /// Any position: the size of the data is extended by a write only.
    void setPos(unsigned long long position) override;
    /// 0: failures throw.
    int getError() const override;

    /// Goes back to the start with no data, and keeps the block.
    void reset() noexcept;
    /// The data; valid until the next write.
    unsigned char const* getBuffer() const noexcept { return block_.get(); }
    /// Up to the farthest position written.
    unsigned long long getBufferSize() const noexcept { return size_; }
    /// A `malloc`ed copy of the data, which the caller frees; null when there is no memory.
    void* copyBuffer() const;
    /// The same as a block. Throws std::bad_alloc when there is no memory.
    KVCFRef<CFDataRef> copyData() const;

private:
    struct Free {
        void operator()(unsigned char* block) const noexcept { std::free(block); }
    };

    void grow(unsigned long long end);

    std::unique_ptr<unsigned char, Free> block_;
    unsigned long long capacity_;
    unsigned long long position_ = 0;
    unsigned long long size_ = 0;
    int step_;
};

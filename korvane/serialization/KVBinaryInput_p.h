#pragma once

#include <korvane/serialization/KVStream.h>

#include <cstddef>
#include <memory>

/// The bytes of a stream, taken through a window of 64 KiB. The window runs ahead of what has been
/// taken; between `attach` and `detach` the stream's own position means nothing.
class KVBinaryInput {
public:
    /// The most bytes that `take` gives at once.
    static constexpr std::size_t windowSize = 65536;
    /// So many bytes behind those that `take` gives may be read as well; they mean nothing.
    static constexpr std::size_t slack = 8;

    explicit KVBinaryInput(KVStream& stream) noexcept : stream_(stream) {}

    /// Goes on from where the stream stands.
    void attach();
    /// Puts the stream behind what has been taken.
    void detach();

    unsigned long long position() const noexcept
    {
        return start_ + static_cast<unsigned long long>(cursor_ - window_.get());
    }

    /// The next `count` bytes, valid until the next call; null when there are fewer.
    unsigned char const* take(std::size_t count)
    {
        if (static_cast<std::size_t>(end_ - cursor_) < count && !fill(count))
            return nullptr;
        unsigned char const* const taken = cursor_;
        cursor_ += count;
        return taken;
    }

    /// Goes forward to a position. A stream may stop at its end.
    void skipTo(unsigned long long position);

private:
    /// Brings at least `count` bytes into the window; false when there are fewer.
    bool fill(std::size_t count);

    KVStream& stream_;
    std::unique_ptr<unsigned char[]> window_;
    // Of the window's first byte in the stream.
    unsigned long long start_ = 0;
    unsigned char* cursor_ = nullptr;
    unsigned char* end_ = nullptr;
};

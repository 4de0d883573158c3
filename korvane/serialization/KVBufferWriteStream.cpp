#include <korvane/serialization/KVBufferWriteStream.h>

#include <korvane/foundation/KVException.h>

#include <algorithm>
#include <cstring>

namespace {

constexpr unsigned long long mostBytes = 0xFFFFFFFFu;

} // namespace

KVBufferWriteStream::KVBufferWriteStream(int initial, int step)
    : capacity_(static_cast<unsigned long long>(initial)), step_(step)
{
    if (initial >= 0)
        block_.reset(static_cast<unsigned char*>(std::malloc(std::max<std::size_t>(capacity_, 1))));
    if (!block_)
        throw KVException_WriteError();
}

KVBufferWriteStream::~KVBufferWriteStream() = default;

long long KVBufferWriteStream::read(void*, unsigned long long)
{
    return 0;
}

long long KVBufferWriteStream::write(void const* data, unsigned long long length)
{
    unsigned long long end;
    if (__builtin_add_overflow(position_, length, &end))
        throw KVException_WriteError();
    // A write that lands on the end of the block grows it as well.
    if (end >= capacity_)
        grow(end);
    if (position_ > size_)
        std::memset(block_.get() + size_, 0, position_ - size_);
    if (length != 0)
        std::memcpy(block_.get() + position_, data, length);
    position_ = end;
    size_ = std::max(size_, end);
    return static_cast<long long>(length);
}

void KVBufferWriteStream::grow(unsigned long long end)
{
    if (end > mostBytes)
        throw KVException_WriteError();
    // Half as much again, so that a long document is not copied once for every step.
    unsigned long long const step = std::max(
        {static_cast<unsigned long long>(std::max(step_, 0)), end - capacity_, capacity_ / 2});
    unsigned long long const capacity = std::min(capacity_ + step, mostBytes);
    auto* const grown =
        static_cast<unsigned char*>(std::realloc(block_.get(), std::max<std::size_t>(capacity, 1)));
    if (!grown)
        throw KVException_WriteError();
    static_cast<void>(block_.release());
    block_.reset(grown);
    capacity_ = capacity;
}

unsigned long long KVBufferWriteStream::getPos()
{
    return position_;
}

void KVBufferWriteStream::setPos(unsigned long long position)
{
    position_ = position;
}

int KVBufferWriteStream::getError() const
{
    return 0;
}

void KVBufferWriteStream::reset() noexcept
{
    position_ = 0;
    size_ = 0;
}

void* KVBufferWriteStream::copyBuffer() const
{
    void* const copy = std::malloc(std::max<std::size_t>(size_, 1));
    if (copy)
        std::memcpy(copy, block_.get(), size_);
    return copy;
}

KVCFRef<CFDataRef> KVBufferWriteStream::copyData() const
{
    return KVCFRef<CFDataRef>::adopt(new __CFData(block_.get(), size_));
}

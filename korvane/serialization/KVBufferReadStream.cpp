#include <korvane/serialization/KVBufferReadStream.h>

#include <algorithm>
#include <cstring>

KVBufferReadStream::KVBufferReadStream(CFDataRef data)
    : KVBufferReadStream(data ? data->bytes() : nullptr, data ? data->length() : 0)
{
    data_ = data;
}

KVBufferReadStream::KVBufferReadStream(void const* bytes, unsigned long long length)
    : start_(static_cast<unsigned char const*>(bytes)), end_(start_ + length), current_(start_)
{}

KVBufferReadStream::~KVBufferReadStream() = default;

long long KVBufferReadStream::read(void* data, unsigned long long length)
{
    auto const left = static_cast<unsigned long long>(end_ - current_);
    std::size_t const count = std::min(length, left);
    if (count != 0)
        std::memcpy(data, current_, count);
    current_ += count;
    return static_cast<long long>(count);
}

long long KVBufferReadStream::write(void const*, unsigned long long)
{
    return 0;
}

unsigned long long KVBufferReadStream::getPos()
{
    return static_cast<unsigned long long>(current_ - start_);
}

void KVBufferReadStream::setPos(unsigned long long position)
{
    current_ = start_ + std::min(position, static_cast<unsigned long long>(end_ - start_));
}

int KVBufferReadStream::getError() const
{
    return 0;
}

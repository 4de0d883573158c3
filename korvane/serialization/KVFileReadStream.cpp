#include <korvane/serialization/KVFileReadStream.h>

#include <korvane/serialization/KVFileDescriptor_p.h>

#include <algorithm>
#include <cstring>

struct KVFileReadStream::File {
    static constexpr unsigned long long capacity = 65536;

    explicit File(KVURL const& location)
        : url(location),
          error(descriptor.openForReading(url)),
          window(std::make_unique<unsigned char[]>(capacity))
    {}

    long long read(unsigned char* data, unsigned long long length);
    void setPosition(unsigned long long target);

    unsigned long long takeFromWindow(unsigned char* data, unsigned long long length) noexcept;
    void keep(int failure) noexcept
    {
        if (error == 0)
            error = failure;
    }

    KVURL const url;
    KVFileDescriptor descriptor;
    int error;
    unsigned long long position = 0;
    // Where the descriptor stands. The window holds the bytes in front of that; those up to `used`
    // have been read.
    unsigned long long offset = 0;
    std::unique_ptr<unsigned char[]> const window;
    unsigned long long used = 0;
    unsigned long long filled = 0;
};

unsigned long long KVFileReadStream::File::takeFromWindow(unsigned char* data,
                                                          unsigned long long length) noexcept
{
    unsigned long long const count = std::min(length, filled - used);
    if (count != 0)
        std::memcpy(data, window.get() + used, count);
    used += count;
    return count;
}

long long KVFileReadStream::File::read(unsigned char* data, unsigned long long length)
{
    unsigned long long count = takeFromWindow(data, length);
    int failure = 0;
    if (count < length) {
        unsigned long long const left = length - count;
        unsigned long long got = 0;
        if (left >= capacity) {
            failure = descriptor.read(data + count, left, &got);
            offset += got;
            // What the window holds no longer lies in front of the descriptor's offset.
            used = 0;
            filled = 0;
        } else {
            used = 0;
            failure = descriptor.read(window.get(), capacity, &filled);
            offset += filled;
            got = takeFromWindow(data + count, left);
        }
        count += got;
    }
    keep(failure);
    long long const result = failure != 0 && count == 0 ? -1 : static_cast<long long>(count);
    position += static_cast<unsigned long long>(result);
    return result;
}

void KVFileReadStream::File::setPosition(unsigned long long target)
{
    // Not from `position`, which a failure has lowered.
    unsigned long long const windowStart = offset - filled;
    if (target >= windowStart && target - windowStart <= filled) {
        used = target - windowStart;
    } else if (int const failure = descriptor.seek(target)) {
        keep(failure);
        return;
    } else {
        offset = target;
        used = 0;
        filled = 0;
    }
    position = target;
}

KVFileReadStream::KVFileReadStream(KVURL const& url) : file_(std::make_unique<File>(url)) {}

KVFileReadStream::~KVFileReadStream() = default;

long long KVFileReadStream::read(void* data, unsigned long long length)
{
    return file_->read(static_cast<unsigned char*>(data), length);
}

long long KVFileReadStream::write(void const*, unsigned long long)
{
    return 0;
}

unsigned long long KVFileReadStream::getPos()
{
    return file_->position;
}

void KVFileReadStream::setPos(unsigned long long position)
{
    file_->setPosition(position);
}

int KVFileReadStream::getError() const
{
    return file_->error;
}

KVURL const& KVFileReadStream::getURL() const noexcept
{
    return file_->url;
}

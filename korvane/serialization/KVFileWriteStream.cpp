#include <korvane/serialization/KVFileWriteStream.h>

#include <korvane/foundation/KVException.h>
#include <korvane/serialization/KVFileDescriptor_p.h>

#include <algorithm>
#include <cstring>
#include <system_error>

// The buffer stands for the bytes of the file from `base` on. `current` is where the next byte goes
// and `filled` the end of what the buffer holds, which is more when the position was set back.
// A position in front of the buffer is kept in `patch`: writes that end in front of the buffer,
// such as sizes that are put in afterwards, go past the buffer, which stays as it is.
struct KVFileWriteStream::File {
    static constexpr unsigned long long capacity = 51200;

    explicit File(KVURL const& location)
        : url(location),
          error(descriptor.openForWriting(url)),
          buffer(std::make_unique<unsigned char[]>(capacity))
    {}

    void write(unsigned char const* data, unsigned long long length);
    unsigned long long position() const noexcept { return patching ? patch : base + current; }
    void setPosition(unsigned long long target);
    void close();

    void flush();
    bool writePatch(unsigned char const* data, unsigned long long length);
    void leavePatch();

    [[noreturn]] void fail() const
    {
        std::string const reason =
            error != 0 ? std::system_category().message(error) : "the stream is closed";
        throw KVException_WriteError(url.getAsFileSystemString().toUTF8() + ": " + reason);
    }
    void checkOpen() const
    {
        if (error != 0 || closed)
            fail();
    }
    void check(int result)
    {
        error = result;
        if (error != 0)
            fail();
    }

    KVURL const url;
    KVFileDescriptor descriptor;
    int error;
    std::unique_ptr<unsigned char[]> const buffer;
    unsigned long long base = 0;
    unsigned long long current = 0;
    unsigned long long filled = 0;
    unsigned long long patch = 0;
    bool patching = false;
    bool closed = false;
};

void KVFileWriteStream::File::write(unsigned char const* data, unsigned long long length)
{
    checkOpen();
    if (patching) {
        if (writePatch(data, length))
            return;
        leavePatch();
    }
    if (length >= capacity || length > capacity - current) {
        flush();
        if (length >= capacity) {
            check(descriptor.writeAll(data, length));
            base += length;
            return;
        }
    }
    if (length != 0)
        std::memcpy(buffer.get() + current, data, length);
    current += length;
    filled = std::max(filled, current);
}

void KVFileWriteStream::File::setPosition(unsigned long long target)
{
    checkOpen();
    patching = target < base;
    if (patching) {
        patch = target;
    } else if (target <= base + filled) {
        current = target - base;
    } else {
        flush();
        check(descriptor.seek(target));
        base = target;
    }
}

/// Empties the buffer; the position stays.
void KVFileWriteStream::File::flush()
{
    check(descriptor.writeAll(buffer.get(), filled));
    bool const atEnd = current == filled;
    base += current;
    current = 0;
    filled = 0;
    if (!atEnd)
        check(descriptor.seek(base));
}

/// Writes in front of the buffer, if all the bytes go there.
bool KVFileWriteStream::File::writePatch(unsigned char const* data, unsigned long long length)
{
    if (length > base - patch)
        return false;
    check(descriptor.writeAllAt(data, length, patch));
    patch += length;
    return true;
}

/// Lets the buffer start at the position in front of it.
void KVFileWriteStream::File::leavePatch()
{
    flush();
    check(descriptor.seek(patch));
    base = patch;
    patching = false;
}

void KVFileWriteStream::File::close()
{
    if (closed)
        return;
    closed = true;
    if (error == 0)
        flush();
    int const closing = descriptor.close();
    if (error == 0)
        error = closing;
    if (error != 0)
        fail();
}

KVFileWriteStream::KVFileWriteStream(KVURL const& url) : file_(std::make_unique<File>(url)) {}

KVFileWriteStream::~KVFileWriteStream()
{
    try {
        file_->close();
    } catch (KVException_WriteError const&) {
        // Told by close() to those who ask.
    }
}

long long KVFileWriteStream::read(void*, unsigned long long)
{
    return 0;
}

long long KVFileWriteStream::write(void const* data, unsigned long long length)
{
    file_->write(static_cast<unsigned char const*>(data), length);
    return static_cast<long long>(length);
}

unsigned long long KVFileWriteStream::getPos()
{
    return file_->position();
}

void KVFileWriteStream::setPos(unsigned long long position)
{
    file_->setPosition(position);
}

int KVFileWriteStream::getError() const
{
    return file_->error;
}

void KVFileWriteStream::close()
{
    file_->close();
}

KVURL const& KVFileWriteStream::getURL() const noexcept
{
    return file_->url;
}

#include <korvane/platform/NSStringFile.h>

#include <korvane/platform/CFURL.h>

#include <cerrno>
#include <cstring>
#include <fcntl.h>
#include <optional>
#include <sys/stat.h>
#include <unistd.h>

// --- Decoding ---

namespace {

/// What Windows-1252 assigns to the bytes 0x80 to 0x9F.
constexpr char16_t windows1252[32] = {
    0x20AC, 0x0081, 0x201A, 0x0192, 0x201E, 0x2026, 0x2020, 0x2021, 0x02C6, 0x2030, 0x0160,
    0x2039, 0x0152, 0x008D, 0x017D, 0x008F, 0x0090, 0x2018, 0x2019, 0x201C, 0x201D, 0x2022,
    0x2013, 0x2014, 0x02DC, 0x2122, 0x0161, 0x203A, 0x0153, 0x009D, 0x017E, 0x0178,
};

KVString fromWindows1252(std::string_view bytes)
{
    std::u16string units(bytes.size(), u'\0');
    for (std::size_t i = 0; i < bytes.size(); ++i) {
        auto const byte = static_cast<unsigned char>(bytes[i]);
        units[i] = byte >= 0x80 && byte < 0xA0 ? windows1252[byte - 0x80] : byte;
    }
    return KVString::fromUTF16(units);
}

/// The number in `width` bytes at `position`.
std::uint32_t readUnit(std::string_view bytes, std::size_t position, std::size_t width,
                       bool bigEndian)
{
    std::uint32_t unit = 0;
    for (std::size_t i = 0; i < width; ++i) {
        std::size_t const place = bigEndian ? i : width - 1 - i;
        unit = unit << 8 | static_cast<unsigned char>(bytes[position + place]);
    }
    return unit;
}

KVString fromUTF16Bytes(std::string_view bytes, bool bigEndian)
{
    if (bytes.size() % 2 != 0)
        return KVString();
    std::u16string units(bytes.size() / 2, u'\0');
    for (std::size_t i = 0; i < units.size(); ++i)
        units[i] = static_cast<char16_t>(readUnit(bytes, 2 * i, 2, bigEndian));
    return KVString::fromUTF16(units);
}

KVString fromUTF32Bytes(std::string_view bytes, bool bigEndian)
{
    if (bytes.size() % 4 != 0)
        return KVString();
    std::u16string units;
    units.reserve(bytes.size() / 4);
    for (std::size_t i = 0; i < bytes.size(); i += 4) {
        std::uint32_t const character = readUnit(bytes, i, 4, bigEndian);
        if (character > 0x10FFFF || (character >= 0xD800 && character < 0xE000))
            return KVString();
        if (character >= 0x10000) {
            units += static_cast<char16_t>(0xD7C0 + (character >> 10));
            units += static_cast<char16_t>(0xDC00 + (character & 0x3FF));
        } else {
            units += static_cast<char16_t>(character);
        }
    }
    return KVString::fromUTF16(units);
}

struct Mark {
    std::string_view bytes;
    NSStringEncoding encoding;
};

/// UTF-32 comes first: its little-endian mark begins with that of UTF-16.
constexpr Mark marks[] = {
    {std::string_view("\0\0\xFE\xFF", 4), NSUTF32BigEndianStringEncoding},
    {std::string_view("\xFF\xFE\0\0", 4), NSUTF32LittleEndianStringEncoding},
    {"\xEF\xBB\xBF", NSUTF8StringEncoding},
    {"\xFE\xFF", NSUTF16BigEndianStringEncoding},
    {"\xFF\xFE", NSUTF16LittleEndianStringEncoding},
};

KVString fromEncoding(std::string_view bytes, NSStringEncoding encoding)
{
    switch (encoding) {
    case NSUTF16BigEndianStringEncoding:
    case NSUTF16LittleEndianStringEncoding:
        return fromUTF16Bytes(bytes, encoding == NSUTF16BigEndianStringEncoding);
    case NSUTF32BigEndianStringEncoding:
    case NSUTF32LittleEndianStringEncoding:
        return fromUTF32Bytes(bytes, encoding == NSUTF32BigEndianStringEncoding);
    case NSWindowsCP1252StringEncoding:
        return fromWindows1252(bytes);
    case NSUTF8StringEncoding:
        break;
    }
    return KVString::fromUTF8(bytes);
}

} // namespace

KVString NSStringWithBytes(std::string_view bytes, NSStringEncoding* used)
{
    NSStringEncoding encoding = NSUTF8StringEncoding;
    bool marked = false;
    for (Mark const& mark : marks) {
        if (bytes.starts_with(mark.bytes)) {
            encoding = mark.encoding;
            bytes.remove_prefix(mark.bytes.size());
            marked = true;
            break;
        }
    }
    KVString text = fromEncoding(bytes, encoding);
    if (text.isNull() && !marked) {
        encoding = NSWindowsCP1252StringEncoding;
        text = fromEncoding(bytes, encoding);
    }
    if (used)
        *used = encoding;
    return text;
}

// --- Files ---

namespace {

KVNSRef<NSError*> systemError(int code)
{
    return KVMakeRef<NSError>("NSPOSIXErrorDomain", code);
}

/// A file descriptor that closes itself.
class File {
public:
    /// On failure `error()` tells why. A URL of another scheme, and a path with a zero in it, name
    /// no file.
    File(KVURL const& url, int flags)
    {
        std::string const text = url.getAbsoluteString();
        bool const isElsewhere = text.find("://") != text.npos && !text.starts_with("file://");
        std::string const path = CFURLGetFileSystemPath(url.cf_url());
        if (isElsewhere || path.empty() || path.find('\0') != path.npos)
            error_ = ENOENT;
        else if ((descriptor_ = ::open(path.c_str(), flags | O_CLOEXEC, 0666)) < 0)
            error_ = errno;
    }
    ~File()
    {
        if (descriptor_ >= 0)
            ::close(descriptor_);
    }
    File(File const&) = delete;
    File& operator=(File const&) = delete;

    int error() const noexcept { return error_; }

    /// All bytes up to the end of the file; what is there already is kept as room.
    int readAll(std::string& bytes)
    {
        struct stat status;
        if (::fstat(descriptor_, &status) != 0)
            return errno;
        if (S_ISREG(status.st_mode) && status.st_size > off_t(NSStringFileLimit))
            return EFBIG;
        // One byte more than a regular file has shows its end in the first read.
        std::size_t const room = S_ISREG(status.st_mode) ? std::size_t(status.st_size) + 1 : 65536;
        std::size_t filled = 0;
        bytes.resize(room);
        for (;;) {
            ssize_t const count = ::read(descriptor_, bytes.data() + filled, bytes.size() - filled);
            if (count < 0 && errno != EINTR)
                return errno;
            if (count == 0)
                break;
            filled += count > 0 ? std::size_t(count) : 0;
            if (filled > NSStringFileLimit)
                return EFBIG;
            if (filled == bytes.size())
                bytes.resize(2 * bytes.size());
        }
        bytes.resize(filled);
        return 0;
    }

    int writeAll(std::string_view bytes)
    {
        while (!bytes.empty()) {
            ssize_t const count = ::write(descriptor_, bytes.data(), bytes.size());
            if (count < 0 && errno != EINTR)
                return errno;
            if (count > 0)
                bytes.remove_prefix(std::size_t(count));
        }
        int const descriptor = std::exchange(descriptor_, -1);
        return ::close(descriptor) == 0 ? 0 : errno;
    }

private:
    int descriptor_ = -1;
    int error_ = 0;
};

} // namespace

KVString NSStringWithContentsOfURL(KVURL const& url, NSStringEncoding* used,
                                   KVNSRef<NSError*>* error)
{
    File file(url, O_RDONLY);
    std::string bytes;
    int code = file.error();
    if (code == 0)
        code = file.readAll(bytes);
    KVString text;
    if (code == 0) {
        text = NSStringWithBytes(bytes, used);
        code = text.isNull() ? EILSEQ : 0;
    }
    if (error)
        *error = code == 0 ? nullptr : systemError(code);
    return text;
}

KVNSRef<NSError*> NSStringWriteToURL(std::string_view bytes, KVURL const& url)
{
    File file(url, O_WRONLY | O_CREAT | O_TRUNC);
    int code = file.error();
    if (code == 0)
        code = file.writeAll(bytes);
    return code == 0 ? nullptr : systemError(code);
}

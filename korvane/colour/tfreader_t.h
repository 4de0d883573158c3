#pragma once

#include <korvane/foundation/KVExport.h>

#include <cstddef>
#include <string>
#include <string_view>

namespace cc {

/// A result code is a 32-bit word; those that are not 0 or -1 read as four characters, the first
/// one in the most significant byte.
constexpr int resultCode(char const (&text)[5]) noexcept
{
    int code = 0;
    for (int i = 0; i < 4; ++i)
        code = code << 8 | text[i];
    return code;
}

inline constexpr int kSuccess = 0;
/// `open` on a reader that is open already.
inline constexpr int kAlreadyOpen = resultCode("!cls");
/// The file cannot be opened, or cannot be read a second time as a pipe cannot.
inline constexpr int kCannotOpen = resultCode("!fd ");
/// No known format's header was found.
inline constexpr int kUnknownFormat = resultCode("!lut");
/// The data do not fit the header.
inline constexpr int kBadData = -1;

/// A text file that is open, and how its bytes are to be understood.
class KV_EXPORT tfhandler_t {
public:
    /// Mac OS Roman, UTF-8 or any other superset of ASCII, UTF-16.
    enum encoding_t : int { kMacRoman = 0, kUTF8 = 1, kUTF16 = 2 };

    tfhandler_t(tfhandler_t const&) = delete;
    tfhandler_t& operator=(tfhandler_t const&) = delete;
    virtual ~tfhandler_t();

    int encoding() const noexcept { return encoding_; }
    /// The file that was opened last.
    std::string const& path() const noexcept { return path_; }
    bool isOpen() const noexcept { return fd_ >= 0; }
    /// The size of the open file in bytes, -1 where it has none, as a pipe.
    long long fileSize() const noexcept;
    /// Does nothing if no file is open.
    void close() noexcept;

protected:
    explicit tfhandler_t(int encoding) noexcept : encoding_(encoding) {}

    enum flag_t : unsigned int { kStartOfFile = 1, kEndOfInput = 2, kSwapBytes = 4 };

    int encoding_;
    std::string path_;
    int fd_ = -1;
    unsigned int flags_ = 0;
    char buffer_[4096];
    /// Bytes in the buffer, and where the next line begins in it.
    std::size_t valid_ = 0;
    std::size_t position_ = 0;
};

/// Reads a text file line by line, whatever ends its lines.
///
///     cc::tfreader_t reader;
///     if (reader.open("/looks/warm.cube") == cc::kSuccess)
///         for (std::string line; reader.readln(line);)
///             use(line);
///
/// A line ends at CR, at LF, or at the pair CR LF or LF CR, which is one ending. The last line
/// needs none. Lines come out as UTF-8: Mac OS Roman and UTF-16 are converted (half a surrogate
/// pair becomes U+FFFD), UTF-8 is passed as it is. A byte-order mark at the start is dropped and
/// decides the order of UTF-16, which is otherwise the machine's. In UTF-16 the unit 0D0A, a CR LF
/// of single bytes, ends a line as well.
///
/// Used by one thread at a time.
class KV_EXPORT tfreader_t : public tfhandler_t {
public:
    /// `encoding` as above. Of a line longer than `lineLimit` bytes (units of UTF-16) the rest is
    /// dropped, so that no file can make a reader hold more.
    explicit tfreader_t(int encoding = kUTF8, std::size_t lineLimit = std::string::npos) noexcept
        : tfhandler_t(encoding), lineLimit_(lineLimit)
    {}

    /// Opens a file for reading: kSuccess, kAlreadyOpen or kCannotOpen.
    int open(char const* path);
    /// Back to the first line. False, and at the end, where the file cannot go back.
    bool rewind() noexcept;
    /// False with an empty line at the end of the file, on a read error, and while no file is open.
    bool readln(std::string& line);
    /// The same without the copy: the line is valid until the next call.
    bool readView(std::string_view& line);
    /// Whether the open file's UTF-16 is in the other order than the machine's; a mark overrules
    /// it.
    void setSwapBytes(bool swap) noexcept;

private:
    bool readBytes(std::string_view& line);
    bool readUnits(std::u16string& line);
    bool nextUnit(char16_t& unit) noexcept;
    bool refill() noexcept;
    void dropByteOrderMark() noexcept;
    void keep(std::string_view piece);

    std::size_t lineLimit_;
    /// The other half of the pair that the last line may have ended with.
    char16_t pairEnd_ = 0;
    /// A line that did not lie in the buffer whole, or was converted.
    std::string text_;
};

/// Mac OS Roman as UTF-8: at most 3 bytes for one.
KV_EXPORT std::string convertMacRomanBytes2UTF8(std::string_view bytes);
/// UTF-16 in the machine's order as UTF-8.
KV_EXPORT std::string convertUTF16Bytes2UTF8(std::u16string_view units);

} // namespace cc

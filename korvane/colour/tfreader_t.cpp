#include <korvane/colour/tfreader_t.h>

#include <korvane/colour/text_word_p.h>
#include <korvane/platform/CFString.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>
#include <utility>

namespace cc {

namespace {

/// The other half of a pair that ends a line.
constexpr char16_t partner(char16_t ending) noexcept
{
    return ending == u'\r' ? u'\n' : u'\r';
}

std::size_t findLineEnd(char const* bytes, std::size_t from, std::size_t end) noexcept
{
    for (; end - from >= kWordSize; from += kWordSize) {
        std::uint64_t const word = wordAt(bytes + from);
        std::size_t const before =
            bytesBefore(zeroBytes(word ^ repeated('\n')) | zeroBytes(word ^ repeated('\r')));
        if (before < kWordSize)
            return from + before;
    }
    while (from < end && bytes[from] != '\n' && bytes[from] != '\r')
        ++from;
    return from;
}

} // namespace

tfhandler_t::~tfhandler_t()
{
    close();
}

void tfhandler_t::close() noexcept
{
    if (fd_ >= 0)
        ::close(fd_);
    fd_ = -1;
}

long long tfhandler_t::fileSize() const noexcept
{
    struct stat status;
    bool const isFile = fd_ >= 0 && ::fstat(fd_, &status) == 0 && S_ISREG(status.st_mode);
    return isFile ? static_cast<long long>(status.st_size) : -1;
}

int tfreader_t::open(char const* path)
{
    if (isOpen())
        return kAlreadyOpen;
    if (!path)
        return kCannotOpen;
    path_ = path;
    fd_ = ::open(path, O_RDONLY | O_CLOEXEC);
    if (fd_ < 0)
        return kCannotOpen;
    flags_ = kStartOfFile;
    valid_ = position_ = 0;
    pairEnd_ = 0;
    return kSuccess;
}

bool tfreader_t::rewind() noexcept
{
    bool const moved = isOpen() && ::lseek(fd_, 0, SEEK_SET) == 0;
    flags_ = (flags_ & kSwapBytes) | (moved ? kStartOfFile : kEndOfInput);
    valid_ = position_ = 0;
    pairEnd_ = 0;
    return moved;
}

void tfreader_t::setSwapBytes(bool swap) noexcept
{
    flags_ = swap ? flags_ | kSwapBytes : flags_ & ~unsigned{kSwapBytes};
}

bool tfreader_t::readln(std::string& line)
{
    std::string_view view;
    bool const found = readView(view);
    line.assign(view);
    return found;
}

bool tfreader_t::readView(std::string_view& line)
{
    line = {};
    if (!isOpen())
        return false;
    if (flags_ & kStartOfFile)
        dropByteOrderMark();
    if (encoding_ == kUTF16) {
        std::u16string units;
        if (!readUnits(units))
            return false;
        text_ = convertUTF16Bytes2UTF8(units);
        line = text_;
        return true;
    }
    if (!readBytes(line))
        return false;
    if (encoding_ == kMacRoman) {
        text_ = convertMacRomanBytes2UTF8(line);
        line = text_;
    }
    return true;
}

bool tfreader_t::readBytes(std::string_view& line)
{
    if (pairEnd_ && (position_ < valid_ || refill())) {
        position_ += buffer_[position_] == static_cast<char>(pairEnd_);
        pairEnd_ = 0;
    }
    if (!text_.empty())
        text_.clear();
    for (;;) {
        std::size_t const end = findLineEnd(buffer_, position_, valid_);
        std::string_view const piece(buffer_ + position_, end - position_);
        if (end < valid_) {
            position_ = end + 1;
            pairEnd_ = partner(static_cast<unsigned char>(buffer_[end]));
            if (text_.empty()) {
                line = piece.substr(0, lineLimit_);
            } else {
                keep(piece);
                line = text_;
            }
            return true;
        }
        keep(piece);
        position_ = valid_;
        if (!refill()) {
            line = text_;
            return !text_.empty();
        }
    }
}

void tfreader_t::keep(std::string_view piece)
{
    text_.append(piece.substr(0, lineLimit_ - std::min(lineLimit_, text_.size())));
}

bool tfreader_t::readUnits(std::u16string& line)
{
    char16_t unit = 0;
    bool found = false;
    while (nextUnit(unit)) {
        if (std::exchange(pairEnd_, u'\0') == unit && unit != 0)
            continue;
        found = true;
        if (unit == u'\r' || unit == u'\n')
            pairEnd_ = partner(unit);
        if (unit == u'\r' || unit == u'\n' || unit == 0x0D0A)
            break;
        if (line.size() < lineLimit_)
            line += unit;
    }
    return found;
}

bool tfreader_t::nextUnit(char16_t& unit) noexcept
{
    unsigned char bytes[2];
    for (unsigned char& byte : bytes) {
        if (position_ == valid_ && !refill())
            return false; // half a unit at the end is dropped
        byte = static_cast<unsigned char>(buffer_[position_++]);
    }
    if (flags_ & kSwapBytes)
        std::swap(bytes[0], bytes[1]);
    std::memcpy(&unit, bytes, sizeof unit);
    return true;
}

bool tfreader_t::refill() noexcept
{
    position_ = valid_ = 0;
    if (flags_ & kEndOfInput)
        return false;
    ssize_t count;
    do {
        count = ::read(fd_, buffer_, sizeof buffer_);
    } while (count < 0 && errno == EINTR);
    if (count <= 0) {
        flags_ |= kEndOfInput;
        return false;
    }
    valid_ = static_cast<std::size_t>(count);
    return true;
}

void tfreader_t::dropByteOrderMark() noexcept
{
    flags_ &= ~unsigned{kStartOfFile};
    if (!refill())
        return;
    if (encoding_ == kUTF8 && std::string_view(buffer_, valid_).starts_with("\xEF\xBB\xBF"))
        position_ = 3;
    if (encoding_ == kUTF16 && valid_ >= 2) {
        char16_t unit;
        std::memcpy(&unit, buffer_, sizeof unit);
        if (unit == 0xFEFF || unit == 0xFFFE) {
            position_ = 2;
            setSwapBytes(unit == 0xFFFE);
        }
    }
}

std::string convertMacRomanBytes2UTF8(std::string_view bytes)
{
    std::u16string units;
    units.reserve(bytes.size());
    for (char const byte : bytes)
        units += CFCharacterFromMacRoman(static_cast<std::uint8_t>(byte));
    return convertUTF16Bytes2UTF8(units);
}

std::string convertUTF16Bytes2UTF8(std::u16string_view units)
{
    std::string result(CFStringGetMaximumUTF8Length(units.size()), '\0');
    result.resize(CFStringEncodeUTF8(units, result.data()));
    return result;
}

} // namespace cc

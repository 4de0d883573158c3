#include <korvane/serialization/KVAsciiStream.h>

#include <algorithm>
#include <array>
#include <cstring>

namespace {

constexpr char alphabet[] = "*-0123456789ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz";
static_assert(sizeof alphabet == 65);

constexpr std::array<unsigned char, 256> decodeTable = [] {
    std::array<unsigned char, 256> table{};
    for (unsigned char value = 0; value < 64; ++value)
        table[static_cast<unsigned char>(alphabet[value])] = value;
    return table;
}();

constexpr std::size_t headerLength = 12;

} // namespace

bool KVAsciiStream::open(char const* text)
{
    return open(text, text ? std::strlen(text) : 0);
}

bool KVAsciiStream::open(char const* text, unsigned long long length)
{
    clear();
    if (!text || length < headerLength)
        return fail("Not enough data");
    text_.assign(text, length);
    unsigned char header[9];
    for (std::size_t group = 0; group < 3; ++group)
        decodeGroup(4 * group, header + 3 * group);
    if (header[8] != '*')
        return fail("Magic Number does not match");
    for (int i = 0; i < 8; ++i)
        byteTotal_ = byteTotal_ << 8 | header[i];
    byteTotal_ = std::min<unsigned long long>(byteTotal_, (length - headerLength) / 4 * 3);
    position_ = headerLength;
    use_ = Use::reading;
    return true;
}

bool KVAsciiStream::fail(char const* error)
{
    clear();
    error_ = error;
    return false;
}

void KVAsciiStream::decodeGroup(std::size_t at, unsigned char* bytes) const
{
    unsigned int group = 0;
    for (std::size_t i = 0; i < 4; ++i)
        group = group << 6 | decodeTable[static_cast<unsigned char>(text_[at + i])];
    bytes[0] = static_cast<unsigned char>(group >> 16);
    bytes[1] = static_cast<unsigned char>(group >> 8);
    bytes[2] = static_cast<unsigned char>(group);
}

void KVAsciiStream::encodeGroup(unsigned char const* bytes, char* characters) const
{
    unsigned int const group = static_cast<unsigned int>(bytes[0] << 16 | bytes[1] << 8 | bytes[2]);
    for (int i = 0; i < 4; ++i)
        characters[i] = alphabet[group >> (18 - 6 * i) & 63];
}

long long KVAsciiStream::read(void* data, unsigned long long length)
{
    if (use_ != Use::reading)
        return 0;
    unsigned long long const count = std::min(length, byteTotal_ - bytePosition_);
    auto* out = static_cast<unsigned char*>(data);
    for (unsigned long long left = count; left > 0;) {
        if (pendingCount_ == 0) {
            decodeGroup(position_, pending_);
            position_ += 4;
            pendingCount_ = 3;
        }
        auto const taken =
            static_cast<unsigned int>(std::min<unsigned long long>(left, pendingCount_));
        out = std::copy_n(pending_ + 3 - pendingCount_, taken, out);
        pendingCount_ -= taken;
        left -= taken;
    }
    bytePosition_ += count;
    return static_cast<long long>(count);
}

long long KVAsciiStream::write(void const* data, unsigned long long length)
{
    if (use_ == Use::none) {
        use_ = Use::writing;
        encodeNewSize();
    }
    if (use_ != Use::writing)
        return 0;
    auto const* bytes = static_cast<unsigned char const*>(data);
    for (unsigned long long i = 0; i < length; ++i) {
        pending_[pendingCount_++] = bytes[i];
        if (pendingCount_ == 3)
            appendPending();
    }
    bytePosition_ += length;
    byteTotal_ += length;
    return static_cast<long long>(length);
}

void KVAsciiStream::appendPending()
{
    std::fill(pending_ + pendingCount_, pending_ + 3, static_cast<unsigned char>(0));
    char characters[4];
    encodeGroup(pending_, characters);
    text_.append(characters, 4);
    pendingCount_ = 0;
}

void KVAsciiStream::encodeNewSize()
{
    if (text_.empty())
        text_.assign(headerLength, alphabet[0]);
    unsigned char header[9];
    for (int i = 0; i < 8; ++i)
        header[i] = static_cast<unsigned char>(byteTotal_ >> (56 - 8 * i));
    header[8] = '*';
    for (std::size_t group = 0; group < 3; ++group)
        encodeGroup(header + 3 * group, text_.data() + 4 * group);
}

void KVAsciiStream::close()
{
    if (use_ == Use::reading || use_ == Use::closed)
        return;
    if (pendingCount_ != 0)
        appendPending();
    encodeNewSize();
    use_ = Use::closed;
}

void KVAsciiStream::clear()
{
    *this = KVAsciiStream();
}

KVString KVAsciiStream::getString() const
{
    return KVString::fromUTF8(text_);
}

KVString KVAsciiStream::getError() const
{
    return error_;
}

bool KVAsciiStream::validChar(unsigned char character)
{
    return character == '*' || decodeTable[character] != 0;
}

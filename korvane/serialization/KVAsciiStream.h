#pragma once

#include <korvane/foundation/KVString.h>

#include <string>

/// Carries bytes as printable characters: three bytes in four of the 64 characters
/// "*-0123456789ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz".
///
///     KVAsciiStream out;
///     out.write(bytes, 5);
///     out.close();
///     KVString armour = out.getString();      // 12 + 8 characters
///
///     KVAsciiStream in;
///     if (in.open(armour.toUTF8().c_str()))
///         in.read(bytes, 5);                  // 5
///
/// The value of a character is its place in that row. A group of bytes b0 b1 b2 becomes
///
///     b0 >> 2    (b0 & 3) << 4 | b1 >> 4    (b1 & 15) << 2 | b2 >> 6    b2 & 63
///
/// and the text begins with a header of 12 characters, which stand for 9 bytes: the number of
/// bytes as a big-endian 64-bit value, and "*". The last group is filled up with zero bytes.
///
/// A stream is written to or read from, as the first `write` or `open` decides, until `clear`. It
/// belongs to one thread.
class KV_EXPORT KVAsciiStream {
public:
    KVAsciiStream() = default;

    /// Starts to read a copy of the text. False with "Not enough data" in `getError()` for fewer
    /// than 12 characters or none, with "Magic Number does not match" when the header does not
    /// end in "*". A number of bytes that the text is too short for becomes what it has room for.
    bool open(char const* text);
    /// The same for so many characters, which need not be terminated.
    bool open(char const* text, unsigned long long length);
    /// Returns how many bytes came, the smaller of `length` and what is left. A character outside
    /// the 64 reads as value 0.
    long long read(void* data, unsigned long long length);
    /// Returns `length`; 0 when the stream is being read or has been closed.
    long long write(void const* data, unsigned long long length);
    /// Ends writing: writes the last group and the header, also for no bytes at all. Does nothing
    /// when the stream is being read or has been closed.
    void close();
    /// Forgets everything: the stream may be written to or read from anew.
    void clear();

    /// The text. Its header holds the number of bytes when the stream is closed, 0 before.
    KVString getString() const;
    /// Why `open` failed; empty when it did not.
    KVString getError() const;
    /// Whether a character is one of the 64.
    static bool validChar(unsigned char character);

private:
    enum class Use { none, reading, writing, closed };

    bool fail(char const* error);
    void decodeGroup(std::size_t at, unsigned char* bytes) const;
    void encodeGroup(unsigned char const* bytes, char* characters) const;
    void appendPending();
    void encodeNewSize();

    Use use_ = Use::none;
    std::string text_;
    /// Where the next group is read.
    std::size_t position_ = 0;
    /// Bytes that wait for their group to fill up, or decoded bytes that wait to be read, which
    /// stand at the end.
    unsigned char pending_[3] = {};
    unsigned int pendingCount_ = 0;
    unsigned long long bytePosition_ = 0;
    unsigned long long byteTotal_ = 0;
    char const* error_ = "";
};

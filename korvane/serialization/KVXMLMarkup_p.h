#pragma once

#include <korvane/serialization/KVXMLProlog_p.h>

#include <cstddef>
#include <string_view>

/// Watches long markup. libxml2 waits for all of a tag, a comment or the like before it reads it,
/// and some of its ways then take time by the square of the length: it compares each attribute of a
/// tag with all others, copies a comment for each "--" in it, and goes through all that it waits
/// with for every 512 bytes that come once there are ten million. Ordinary markup is never looked
/// at here.
class KVXMLMarkup {
public:
    /// Markup up to that many bytes is quick to read, whatever is in it.
    static constexpr std::size_t harmless = 4096;

    explicit KVXMLMarkup(KVXMLEncoding encoding = {}) noexcept : encoding_(encoding) {}

    /// `waiting` are the bytes that libxml2 waits with, from `offset` of the document on. Null when
    /// it may go on; else why the document is refused.
    char const* check(unsigned long long offset, std::string_view waiting);

private:
    enum class Kind { tag, comment, other };

    void start(std::string_view waiting);
    bool isBad(char character) noexcept;

    KVXMLEncoding encoding_;
    unsigned long long offset_ = 0;
    std::size_t scanned_ = 0;
    Kind kind_ = Kind::other;
    /// Of a tag: the quote that the value ends with, 0 outside of values.
    char quote_ = 0;
    unsigned int attributes_ = 0;
    /// Of a comment: the dashes just met.
    unsigned int dashes_ = 0;
};

#include <korvane/serialization/KVXMLMarkup_p.h>

#include <string>

namespace {

constexpr std::size_t mostBytes = 9'000'000;
constexpr unsigned int mostAttributes = 1024;
constexpr std::string_view commentStart = "<!--";

} // namespace

char const* KVXMLMarkup::check(unsigned long long offset, std::string_view waiting)
{
    if (waiting.size() > mostBytes)
        return "a tag or comment is longer than 9000000 bytes";
    if (offset != offset_ || scanned_ == 0) {
        *this = KVXMLMarkup(encoding_);
        offset_ = offset;
        start(waiting);
    }
    std::string narrowed;
    std::string_view const fresh = kvNarrowed(encoding_, waiting.substr(scanned_), narrowed);
    scanned_ += fresh.size() * static_cast<std::size_t>(encoding_.width);
    if (kind_ == Kind::other)
        return nullptr;
    for (char const character : fresh)
        if (isBad(character))
            return kind_ == Kind::tag ? "a tag has more than 1024 attributes"
                                      : "a comment holds two dashes";
    return nullptr;
}

/// Finds out what the markup is.
void KVXMLMarkup::start(std::string_view waiting)
{
    std::string narrowed;
    std::string_view const head = kvNarrowed(encoding_, waiting.substr(0, 8), narrowed);
    if (head.starts_with(commentStart)) {
        kind_ = Kind::comment;
        scanned_ = commentStart.size() * static_cast<std::size_t>(encoding_.width);
    } else if (head.starts_with('<') && !head.starts_with("<!") && !head.starts_with("<?")) {
        kind_ = Kind::tag;
    }
}

bool KVXMLMarkup::isBad(char character) noexcept
{
    if (kind_ == Kind::tag) {
        if (quote_ != 0) {
            if (character == quote_)
                quote_ = 0;
        } else if (character == '"' || character == '\'') {
            quote_ = character;
            return ++attributes_ > mostAttributes;
        } else if (character == '>') {
            kind_ = Kind::other;
        }
    } else if (kind_ == Kind::comment) {
        if (dashes_ == 2) {
            if (character != '>')
                return true;
            kind_ = Kind::other;
        }
        dashes_ = character == '-' ? dashes_ + 1 : 0;
    }
    return false;
}

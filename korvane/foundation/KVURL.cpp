#include <korvane/foundation/KVURL.h>

#include <algorithm>
#include <charconv>
#include <optional>

namespace {

KVCFRef<CFURLRef> urlOfPath(std::string_view path, bool isDirectory)
{
    return KVCFRef<CFURLRef>::adopt(CFURLCreateFromFileSystemRepresentation(
        nullptr, path.data(), static_cast<CFIndex>(path.size()), isDirectory));
}

KVCFRef<CFURLRef> urlOfText(KVString const& text)
{
    return KVCFRef<CFURLRef>::adopt(CFURLCreateWithString(nullptr, text.cf_str(), nullptr));
}

std::string_view lastComponent(std::string_view path) noexcept
{
    std::size_t const slash = path.rfind('/');
    return slash == std::string_view::npos ? path : path.substr(slash + 1);
}

/// Where the extension's dot stands; the length when there is none. A leading dot is part of the
/// name.
std::size_t extensionDot(std::string_view filename) noexcept
{
    std::size_t const dot = filename.rfind('.');
    return dot == std::string_view::npos || dot == 0 || dot + 1 == filename.size() ? filename.size()
                                                                                   : dot;
}

/// The directory of a path: "/a/b" gives "/a", "/a" and "/" give "/".
std::string_view containingFolder(std::string_view path) noexcept
{
    std::size_t const slash = path.rfind('/');
    return slash == 0 ? path.substr(0, 1) : path.substr(0, slash);
}

/// The bracketed run of "#" and "@" in the last component of a path, brackets included.
std::optional<std::string_view> sequencePattern(std::string_view path) noexcept
{
    if (path.size() < 2 || path.back() == '/')
        return std::nullopt;
    std::size_t close = 0;
    for (std::size_t i = path.size(); i-- > 0;) {
        char const c = path[i];
        if (close == 0) {
            if (c == '/')
                return std::nullopt;
            if (c == ']')
                close = i;
        } else if (c == '[') {
            return path.substr(i, close - i + 1);
        } else if (c != '#' && c != '@') {
            return std::nullopt;
        }
    }
    return std::nullopt;
}

/// The number behind the `ordinal`-th colon from the end of the last component; -1 when it is
/// missing or no `int`. As "%d" reads it: behind white space, with a sign or without one.
int numberBehindColon(std::string_view path, int ordinal) noexcept
{
    std::string_view const name = lastComponent(path);
    std::size_t colon = name.size();
    for (int i = 0; i < ordinal; ++i) {
        colon = colon == 0 ? std::string_view::npos : name.rfind(':', colon - 1);
        if (colon == std::string_view::npos)
            return -1;
    }
    int number = -1;
    std::string_view digits = name.substr(colon + 1);
    digits.remove_prefix(std::min(digits.find_first_not_of(" \t\n\v\f\r"), digits.size()));
    if (digits.starts_with('+') && !digits.starts_with("+-"))
        digits.remove_prefix(1);
    auto const result = std::from_chars(digits.data(), digits.data() + digits.size(), number);
    return result.ec == std::errc() ? number : -1;
}

/// The text without a ":start:end", one colon or two, at its end.
std::string withoutFrameRange(std::string text)
{
    std::size_t cut = text.size();
    int colons = 0;
    for (std::size_t i = text.size(); i-- > 0 && colons < 2;) {
        if (text[i] == ':') {
            cut = i;
            ++colons;
        } else if (text[i] < '0' || text[i] > '9') {
            break;
        }
    }
    text.resize(cut);
    return text;
}

/// The pattern as it stands in a URL's string.
std::string encodedPattern(std::string_view pattern)
{
    std::string encoded;
    for (char c : pattern)
        encoded += c == '[' ? "%5B" : c == ']' ? "%5D" : c == '#' ? "%23" : "@";
    return encoded;
}

/// The frame's number as the pattern asks: bare with an "@" in it, else zero-padded to the count of
/// "#".
std::string frameText(std::string_view pattern, long long frame)
{
    std::string digits = std::to_string(frame < 0 ? -frame : frame);
    std::string const sign = frame < 0 ? "-" : "";
    if (pattern.find('@') == std::string_view::npos) {
        std::size_t const width = pattern.size() - 2;
        std::size_t const used = digits.size() + sign.size();
        digits.insert(0, width > used ? width - used : 0, '0');
    }
    return sign + digits;
}

} // namespace

KVURL::KVURL(char const* path, bool isDirectory) : url_(urlOfPath(path ? path : "", isDirectory)) {}

KVURL::KVURL(char const* path, unsigned int start, unsigned int end)
{
    if (path && *path)
        url_ = urlOfPath(
            path + KVString::ssprintf(":%d:%d", static_cast<int>(start), static_cast<int>(end))
                       .toUTF8(),
            false);
}

KVURL::KVURL(KVString const& text, bool isDirectory)
    : url_(text.find("://") != KVString::npos ? urlOfText(text)
                                              : urlOfPath(text.toUTF8(), isDirectory))
{}

KVString KVURL::getHostnameAndPrefixString() const
{
    if (isNull())
        return "";
    std::string const text = getAbsoluteString();
    std::size_t const host = text.find("://");
    if (host == std::string::npos)
        return "file://";
    return "file://" + text.substr(host + 3, text.find('/', host + 3) - (host + 3));
}

KVString KVURL::getAbsoluteString() const
{
    return isNull() ? KVString("") : KVString(CFURLGetString(url_));
}

KVString KVURL::getAsURLString() const
{
    return getAbsoluteString();
}

KVString KVURL::getAsFileSystemString() const
{
    return CFURLGetFileSystemPath(url_);
}

KVString KVURL::getPathAsFileSystemString() const
{
    return getContainingFolder();
}

KVString KVURL::getContainingFolder() const
{
    std::string const path = CFURLGetFileSystemPath(url_);
    return KVString::fromUTF8(containingFolder(path));
}

KVString KVURL::getContainingFolderAsURLString() const
{
    if (isNull())
        return "";
    return KVURL(getContainingFolder(), true).getAbsoluteString();
}

KVString KVURL::getFilename() const
{
    return KVString::fromUTF8(lastComponent(CFURLGetFileSystemPath(url_)));
}

KVString KVURL::getShortFilename() const
{
    std::string const name = getFilename();
    return name.substr(0, extensionDot(name));
}

KVString KVURL::getExtension() const
{
    std::string const name = getFilename();
    std::size_t const dot = extensionDot(name);
    return dot < name.size() ? name.substr(dot + 1) : std::string();
}

bool KVURL::getFSRef(FSRef*) const noexcept
{
    return false;
}

char* KVURL::getString(unsigned int* length) const
{
    if (isNull())
        return nullptr;
    KVString const path = getAsFileSystemString();
    char* const text = new char[path.size() + 1u];
    for (unsigned int i = 0; i < path.size(); ++i) {
        char16_t const unit = path.u_str()[i];
        text[i] = unit < 0x80 ? static_cast<char>(unit) : '?';
    }
    text[path.size()] = '\0';
    if (length)
        *length = path.size();
    return text;
}

bool KVURL::isSequence() const
{
    return sequencePattern(CFURLGetFileSystemPath(url_)).has_value();
}

int KVURL::getSequenceStart() const
{
    return numberBehindColon(CFURLGetFileSystemPath(url_), 2);
}

int KVURL::getSequenceEnd() const
{
    return numberBehindColon(CFURLGetFileSystemPath(url_), 1);
}

int KVURL::getSequenceLength() const
{
    return static_cast<int>(static_cast<long long>(getSequenceEnd()) - getSequenceStart() + 1);
}

KVURL* KVURL::getURLforIndex(unsigned int index) const
{
    std::string const path = CFURLGetFileSystemPath(url_);
    auto const pattern = sequencePattern(path);
    if (!pattern)
        return nullptr;
    long long const start = getSequenceStart();
    long long const end = getSequenceEnd();
    if (start != -1 && end != -1 && static_cast<long long>(index) > end - start)
        return nullptr;
    std::string text = getAbsoluteString();
    std::string const encoded = encodedPattern(*pattern);
    // The last one: a directory may bear the same pattern.
    std::size_t const place = text.rfind(encoded);
    if (place == std::string::npos)
        return nullptr;
    text.replace(place, encoded.size(), frameText(*pattern, (start == -1 ? 0 : start) + index));
    return new KVURL(KVString(withoutFrameRange(text)), false);
}

KVURL KVURL::getSequenceURL() const
{
    if (isNull())
        return {};
    return KVURL(KVString(withoutFrameRange(getAbsoluteString())), false);
}

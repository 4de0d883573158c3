#include <korvane/platform/CFURL.h>

#include <unistd.h>

#include <cstdlib>
#include <memory>

namespace {

constexpr std::string_view hexDigits = "0123456789ABCDEF";
constexpr std::string_view unreserved = "-._~!$&'()*+,;=:@/";

bool staysInPath(char c) noexcept
{
    return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9') ||
           (c != '\0' && unreserved.find(c) != std::string_view::npos);
}

int hexValue(char c) noexcept
{
    if (c >= '0' && c <= '9')
        return c - '0';
    if (c >= 'a' && c <= 'f')
        return c - 'a' + 10;
    return c >= 'A' && c <= 'F' ? c - 'A' + 10 : -1;
}

std::string workingDirectory()
{
    std::unique_ptr<char, decltype(&std::free)> const directory(::getcwd(nullptr, 0), &std::free);
    return directory ? directory.get() : "/";
}

} // namespace

bool __CFURL::hasDirectoryPath() const noexcept
{
    return absolute_->view().ends_with(u'/');
}

bool __CFURL::isEqual(NSObject const* other) const
{
    auto const* url = dynamic_cast<__CFURL const*>(other);
    return url && CFEqual(url->absolute_, absolute_);
}

std::size_t __CFURL::hash() const
{
    return absolute_->hash();
}

CFURLRef CFURLCreateFromFileSystemRepresentation(CFAllocatorRef, void const* path, CFIndex length,
                                                 bool isDirectory)
{
    if (!path || length <= 0)
        return nullptr;
    std::string absolute(static_cast<char const*>(path), static_cast<std::size_t>(length));
    if (absolute.front() != '/') {
        std::string directory = workingDirectory();
        if (directory.back() != '/')
            directory += '/';
        absolute.insert(0, directory);
    }
    if (isDirectory && absolute.back() != '/')
        absolute += '/';
    // The check for well-formed UTF-8 comes before the encoding hides the bytes.
    CFStringRef const decoded = CFStringCreateWithBytes(
        nullptr, absolute.data(), static_cast<CFIndex>(absolute.size()), kCFStringEncodingUTF8);
    if (!decoded)
        return nullptr;
    CFRelease(decoded);
    CFStringRef const text = __CFString::createASCII("file://" + CFURLEncodePath(absolute));
    auto const* const url = new __CFURL(text);
    CFRelease(text);
    return url;
}

CFURLRef CFURLCreateWithString(CFAllocatorRef, CFStringRef text, CFURLRef)
{
    return text && text->length() ? new __CFURL(text) : nullptr;
}

CFStringRef CFURLGetString(CFURLRef url) noexcept
{
    return url ? url->absoluteString() : nullptr;
}

std::string CFURLGetFileSystemPath(CFURLRef url)
{
    if (!url)
        return {};
    std::string const text = CFStringGetUTF8(url->absoluteString());
    std::size_t begin = text.find("://");
    begin = begin == std::string::npos ? 0 : text.find('/', begin + 3);
    if (begin == std::string::npos)
        return {};
    std::string path = CFURLDecodePath(std::string_view(text).substr(begin));
    if (path.size() > 1 && path.back() == '/')
        path.pop_back();
    return path;
}

std::string CFURLEncodePath(std::string_view path)
{
    std::string encoded;
    encoded.reserve(path.size());
    for (char c : path) {
        if (staysInPath(c)) {
            encoded += c;
            continue;
        }
        auto const byte = static_cast<unsigned char>(c);
        encoded += '%';
        encoded += hexDigits[byte >> 4];
        encoded += hexDigits[byte & 15];
    }
    return encoded;
}

std::string CFURLDecodePath(std::string_view path)
{
    std::string decoded;
    decoded.reserve(path.size());
    for (std::size_t i = 0; i < path.size(); ++i) {
        int const high = path[i] == '%' && i + 2 < path.size() ? hexValue(path[i + 1]) : -1;
        int const low = high >= 0 ? hexValue(path[i + 2]) : -1;
        if (low < 0) {
            decoded += path[i];
            continue;
        }
        decoded += static_cast<char>(high << 4 | low);
        i += 2;
    }
    return decoded;
}

#include <korvane/serialization/KVXMLSource_p.h>

#include <algorithm>
#include <cstring>

namespace {

constexpr std::size_t windowSize = 65536;
/// A document's root element must start within that many bytes.
constexpr std::size_t mostOfProlog = 1 << 20;

} // namespace

int KVXMLSource::openFile(KVURL const& url)
{
    int const failure = file_.openForReading(url);
    if (failure != 0)
        return failure;
    window_.resize(windowSize);
    atEnd_ = false;
    fillWindow(windowSize);
    return error_;
}

void KVXMLSource::fillWindow(std::size_t size)
{
    std::size_t const kept = bytes_.size();
    if (window_.size() < size)
        window_.resize(size);
    unsigned long long count;
    error_ = file_.read(window_.data() + kept, size - kept, &count);
    atEnd_ = error_ != 0 || count < size - kept;
    bytes_ = std::string_view(window_.data(), kept + count);
}

KVXMLProlog KVXMLSource::scanProlog()
{
    for (;;) {
        KVXMLProlog prolog = kvScanProlog(bytes_.substr(0, mostOfProlog));
        if (prolog.kind != KVXMLProlog::Kind::incomplete ||
            (atEnd_ && bytes_.size() <= mostOfProlog))
            return prolog;
        if (bytes_.size() >= mostOfProlog)
            return {KVXMLProlog::Kind::refused, "no root element starts in the first 1048576 bytes",
                    prolog.line};
        fillWindow(2 * window_.size());
    }
}

int KVXMLSource::read(char* out, int length) noexcept
{
    if (bytes_.empty() && !atEnd_)
        fillWindow(windowSize);
    if (bytes_.empty())
        return error_ != 0 ? -1 : 0;
    std::size_t count = std::min(bytes_.size(), static_cast<std::size_t>(length));
    if (lineByLine_)
        if (std::size_t const newline = bytes_.substr(0, count).find('\n');
            newline != std::string_view::npos)
            count = newline + 1;
    std::memcpy(out, bytes_.data(), count);
    bytes_.remove_prefix(count);
    return static_cast<int>(count);
}

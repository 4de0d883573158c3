#include <korvane/serialization/KVXMLSource_p.h>

#include <algorithm>
#include <cstring>

namespace {

constexpr std::size_t windowSize = 65536;
/// A document's root element must start within that many bytes.
constexpr std::size_t mostOfProlog = 1 << 20;
/// libxml2 moves all that it holds after each kilobyte that it has read: let it not hold much.
constexpr int mostOfPiece = 1024;

} // namespace

int KVXMLSource::openFile(KVURL const& url)
{
    int const failure = file_.openForReading(url);
    if (failure != 0)
        return failure;
    atEnd_ = false;
    fillWindow();
    return error_;
}

void KVXMLSource::fillWindow()
{
    window_.erase(window_.begin(), window_.begin() + static_cast<std::ptrdiff_t>(unneeded_));
    start_ += unneeded_;
    given_ -= unneeded_;
    unneeded_ = 0;
    std::size_t const kept = window_.size();
    window_.resize(kept + windowSize);
    unsigned long long count;
    error_ = file_.read(window_.data() + kept, windowSize, &count);
    atEnd_ = error_ != 0 || count < windowSize;
    window_.resize(kept + count);
    bytes_ = std::string_view(window_.data(), window_.size());
}

KVXMLProlog KVXMLSource::scanProlog()
{
    for (std::size_t scanned = 0;; fillWindow()) {
        // Twice as much each time, so that looking again costs no more than looking once.
        if (bytes_.size() < 2 * scanned && !atEnd_)
            continue;
        scanned = std::min(bytes_.size(), mostOfProlog);
        KVXMLProlog const prolog = kvScanProlog(encoding(), bytes_.substr(0, scanned));
        if (prolog.kind != KVXMLProlog::Kind::incomplete || (atEnd_ && bytes_.size() == scanned))
            return prolog;
        if (scanned == mostOfProlog)
            return {KVXMLProlog::Kind::refused, "no root element starts in the first 1048576 bytes",
                    prolog.line};
    }
}

int KVXMLSource::read(char* out, int length)
{
    if (given_ == bytes_.size() && !atEnd_)
        fillWindow();
    std::string_view const left = bytes_.substr(given_);
    if (left.empty())
        return error_ != 0 ? -1 : 0;
    std::size_t count =
        std::min(left.size(), static_cast<std::size_t>(std::min(length, mostOfPiece)));
    if (lineByLine_)
        if (std::size_t const newline = left.substr(0, count).find('\n');
            newline != std::string_view::npos)
            count = newline + 1;
    std::memcpy(out, left.data(), count);
    given_ += count;
    return static_cast<int>(count);
}

std::string_view KVXMLSource::givenFrom(unsigned long long position) noexcept
{
    if (position > start_)
        unneeded_ = std::max(unneeded_, static_cast<std::size_t>(std::min<unsigned long long>(
                                            position - start_, given_)));
    return bytes_.substr(unneeded_, given_ - unneeded_);
}

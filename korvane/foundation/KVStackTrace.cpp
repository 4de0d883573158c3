#include <korvane/foundation/KVStackTrace.h>

#include <korvane/foundation/KVStackSymbols_p.h>
#include <korvane/foundation/KVString.h>

#include <cxxabi.h>
#include <dlfcn.h>
#include <execinfo.h>

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <ostream>

namespace {

template <class T>
using MallocPtr = std::unique_ptr<T, decltype(&std::free)>;

/// Up to `wanted` return addresses; the array grows as the stack turns out to be deep. Always part
/// of its caller, so that the innermost frame is the caller's own.
[[gnu::always_inline]] inline std::vector<void*> captureFrames(long long wanted)
{
    std::vector<void*> frames;
    if (wanted <= 0)
        return frames;
    for (long long room = std::min(wanted, 64LL);; room = std::min(wanted, 2 * room)) {
        frames.resize(static_cast<std::size_t>(room));
        int const count = ::backtrace(frames.data(), static_cast<int>(room));
        if (count < room || room == wanted) {
            frames.resize(static_cast<std::size_t>(std::max(count, 0)));
            return frames;
        }
    }
}

std::string demangled(char const* symbol)
{
    int status = -1;
    MallocPtr<char> const name(abi::__cxa_demangle(symbol, nullptr, nullptr, &status), &std::free);
    return status == 0 && name ? name.get() : symbol;
}

char const* lastComponent(char const* path) noexcept
{
    char const* const slash = std::strrchr(path, '/');
    return slash ? slash + 1 : path;
}

std::string formatLine(std::size_t number, char const* binary, void const* address,
                       std::string const& symbol)
{
    char head[96];
    std::snprintf(head, sizeof head, "%-3zu %-35.35s 0x%016lx ", number, binary,
                  reinterpret_cast<unsigned long>(address));
    return head + symbol;
}

bool isLeftOut(std::string const& symbol) noexcept
{
    return symbol.starts_with("KVStackTrace") || symbol.starts_with("KVLiveObjects");
}

} // namespace

KVStackTrace::KVStackTrace(int count)
{
    for (void* const frame : captureFrames(count + 5LL)) {
        Dl_info info;
        if (!::dladdr(frame, &info)) {
            lines_.push_back(
                formatLine(lines_.size(), "<unknown binary>", frame, "<unknown function>"));
        } else if (!info.dli_sname) {
            // The function has no symbol that the dynamic linker could see.
            lines_.push_back(formatLine(lines_.size(), lastComponent(info.dli_fname), frame,
                                        "<unknown function> + 0"));
        } else {
            std::string const symbol = demangled(info.dli_sname);
            if (isLeftOut(symbol))
                continue;
            auto const distance =
                static_cast<char const*>(frame) - static_cast<char const*>(info.dli_saddr);
            lines_.push_back(formatLine(lines_.size(), lastComponent(info.dli_fname),
                                        info.dli_saddr, symbol + " + " + std::to_string(distance)));
        }
        // Equality, after a line was kept: a count of 0 is never met and keeps what there is.
        if (lines_.size() == static_cast<std::size_t>(static_cast<long long>(count)))
            break;
    }
}

void KVStackTrace::print(std::ostream& stream) const
{
    for (std::string const& line : lines_)
        stream << "  " << line << '\n';
}

namespace kv {

KVCFRef<CFArrayRef> copyCallStackSymbols()
{
    std::vector<void*> const frames = captureFrames(4096);
    MallocPtr<char*> const symbols(
        ::backtrace_symbols(frames.data(), static_cast<int>(frames.size())), &std::free);
    std::vector<KVString> texts;
    // The first frame is this function.
    for (std::size_t i = 1; symbols && i < frames.size(); ++i)
        texts.emplace_back(symbols.get()[i]);
    std::vector<NSObject const*> objects;
    for (KVString const& text : texts)
        objects.push_back(text.cf_str());
    return KVCFRef<CFArrayRef>::adopt(new __CFArray(objects));
}

std::string callStackText()
{
    std::string text;
    KVCFRef<CFArrayRef> const symbols = copyCallStackSymbols();
    for (NSObject const* symbol : symbols->objects())
        text += (text.empty() ? "" : "\n") + symbol->description().toUTF8();
    return text;
}

} // namespace kv

#include <korvane/serialization/KVStream.h>

#include <korvane/foundation/KVString.h>

#include <algorithm>
#include <cstring>

namespace {

// 39 blanks and the terminator, which belongs to what a full block writes.
constexpr char forty_spaces[] = "                                       ";
static_assert(sizeof forty_spaces == 40);

constexpr unsigned int levelsOfBlock = 20;

} // namespace

KVStream::~KVStream() = default;

KVStream& KVStream::indent(unsigned int levels)
{
    for (; levels > levelsOfBlock; levels -= levelsOfBlock)
        write(forty_spaces, sizeof forty_spaces);
    write(forty_spaces, 2 * levels);
    return *this;
}

KVStream& KVStream::operator<<(char const* text)
{
    if (text && *text)
        write(text, std::strlen(text));
    return *this;
}

KVStream& KVStream::operator<<(KVString const& text)
{
    if (unsigned int const size = text.size()) {
        std::string const utf8 = text.toUTF8();
        write(utf8.data(), std::min<std::size_t>(size, utf8.size()));
    }
    return *this;
}

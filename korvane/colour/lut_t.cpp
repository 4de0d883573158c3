#include <korvane/colour/lut_t.h>

#include <korvane/colour/lut_text_p.h>

#include <algorithm>
#include <cerrno>
#include <cmath>
#include <cstdio>
#include <fcntl.h>
#include <unistd.h>

namespace cc {

namespace {

constexpr std::size_t longestName = 255;

struct format_entry_t {
    unsigned int format;
    int (lut_t::*read)(tfreader_t&, unsigned long);
    int (lut_t::*write)(int, char const*, int*) const;
};

constexpr format_entry_t formats[] = {
    {lut_t::kMGA, &lut_t::readMGA, &lut_t::writeMGA},
    {lut_t::kCUBE, &lut_t::readCUBE, &lut_t::writeCUBE},
};

format_entry_t const* findFormat(unsigned int format)
{
    auto const* const entry =
        std::find_if(std::begin(formats), std::end(formats),
                     [&](format_entry_t const& candidate) { return candidate.format == format; });
    return entry == std::end(formats) ? nullptr : entry;
}

std::string_view lastComponent(std::string_view path)
{
    return path.substr(path.rfind('/') + 1);
}

std::string nameOf(std::string_view path)
{
    std::string result(lastComponent(path));
    std::string const lower = toLower(result);
    for (std::string_view const extension : {".cube", ".mga"})
        if (lower.ends_with(extension)) {
            result.resize(result.size() - extension.size());
            break;
        }
    return result;
}

std::size_t cubed(int edge)
{
    auto const n = static_cast<std::size_t>(edge);
    return n * n * n;
}

} // namespace

lut_t::processor_t::~processor_t() = default;

void lut_t::reset()
{
    makeCube(0);
    title.clear();
    name.clear();
    format_ = 0;
}

void lut_t::makeCube(int edge, float minimum, float maximum)
{
    bool const valid = edge >= 1 && edge <= kLongestEdge;
    table.clear();
    table.resize(valid ? 3 * cubed(edge) : 0);
    kind = valid ? k3D : kNone;
    size = valid ? edge : 0;
    domainMin = minimum;
    domainMax = maximum;
}

bool lut_t::isCube() const noexcept
{
    return kind == k3D && size >= 1 && size <= kLongestEdge && table.size() == 3 * cubed(size);
}

// --- Reading ---

int lut_t::read(char const* path, unsigned long index)
{
    reset();
    tfreader_t reader(tfreader_t::kUTF8, kLongestLine);
    if (int const code = reader.open(path))
        return code;
    format_ = detectFormat(reader);
    format_entry_t const* const entry = findFormat(format_);
    if (!entry)
        return kUnknownFormat;
    if (!reader.rewind())
        return kCannotOpen;
    if (int const code = (this->*entry->read)(reader, index))
        return code;
    name = nameOf(path);
    if (title.empty())
        title = name;
    return kSuccess;
}

unsigned int lut_t::detectFormat(tfreader_t& reader)
{
    std::string_view line;
    std::string_view value;
    while (reader.readView(line)) {
        if (tok(line, "#type:", value) && namesMGA(value))
            return kMGA;
        if (tok(line, "TITLE", value)) {
            std::string_view text;
            if (quoted(line, text))
                title = text;
            else
                std::fprintf(stderr,
                             "TITLE keyword was expecting a quotes surround a text value in: %.*s "
                             "Adobe Specification wants: TITLE <sp> \"<text>\"\n",
                             static_cast<int>(line.size()), line.data());
            return kCUBE;
        }
        for (char const* const key :
             {"LUT_1D_SIZE", "LUT_3D_SIZE", "LUT_1D_INPUT_RANGE", "LUT_3D_INPUT_RANGE"})
            if (tok(line, key, value))
                return kCUBE;
    }
    return 0;
}

// --- Writing ---

int lut_t::write(char const* path, unsigned int format, int* error) const
{
    int failure = EINVAL;
    if (format_entry_t const* const entry = findFormat(format)) {
        failure = 0;
        int const fd = ::open(path, O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0755);
        if (fd >= 0) {
            std::string fileName(lastComponent(path).substr(0, longestName));
            fileName.resize(std::min(fileName.rfind('.'), fileName.size()));
            (this->*entry->write)(fd, fileName.c_str(), &failure);
        }
        if ((fd < 0 || ::close(fd) != 0) && failure == 0)
            failure = errno;
    }
    if (error)
        *error = failure;
    return kSuccess;
}

std::string lut_t::titleFor(char const* fileName) const
{
    std::string result = title.empty() ? std::string(fileName) : title;
    // A line break would end the line that the title stands on.
    std::replace_if(
        result.begin(), result.end(), [](char c) { return c == '\n' || c == '\r'; }, ' ');
    return result;
}

// --- Filling ---

void lut_t::process(processor_t const& processor)
{
    if (!isCube())
        return;
    auto const edge = static_cast<std::size_t>(size);
    float const range = domainMax - domainMin;
    float const step = edge > 1 ? range / static_cast<float>(edge - 1) : 0.0f;
    std::array<float, kLongestEdge> grid;
    float input = domainMin;
    for (std::size_t i = 0; i < edge; ++i, input += step)
        grid[i] = input;

    unsigned short* value = table.data();
    for (std::size_t b = 0; b < edge; ++b)
        for (std::size_t g = 0; g < edge; ++g)
            for (std::size_t r = 0; r < edge; ++r)
                for (float const out : processor.process({grid[r], grid[g], grid[b]})) {
                    float const scaled = (out - domainMin) / range;
                    float const v = !(scaled > 0.0f) ? 0.0f : scaled >= 1.0f ? 1.0f : scaled;
                    *value++ = static_cast<unsigned short>(
                        std::floor(static_cast<double>(v) * 65535.0 + 0.5));
                }
}

} // namespace cc

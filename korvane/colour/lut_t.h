#pragma once

#include <korvane/colour/tfreader_t.h>
#include <korvane/colour/vec_t.h>

#include <array>
#include <string>

namespace cc {

class multilut_t;

/// A colour in floats: red, green, blue.
using rgb_t = std::array<float, 3>;

/// A colour lookup table, read from and written to text files.
///
///     cc::lut_t lut;
///     if (int const code = lut.read("/looks/warm.cube", 0))
///         return code;
///     lut.write("/looks/warm.mga", cc::lut_t::kMGA);
///
/// | Format | Extension | Read | Written |
/// |---|---|---|---|
/// | Adobe Cube LUT 1.0 | .cube | 1D and 3D, several tables in a file | 3D |
/// | Pandora 3D LUT | .mga | 3D | 3D |
///
/// Values are 16-bit, 0 to 65535 over the domain. A .mga file keeps each as it is; a .cube file has
/// six decimals, of which a value comes back as it was or one lower, if the domain is at least 0.1
/// wide.
///
/// Used by one thread at a time.
class KV_EXPORT lut_t {
public:
    enum kind_t : int {
        kNone = 0,
        k1D = 5, ///< one curve for all channels: 1024 values
        k3D = 6, ///< a cube of `size` points along each edge: 3 * size^3 values
    };
    enum format_t : unsigned int { kMGA = 1, kCUBE = 2 };

    /// What fills a table: from a colour in the table's domain to a colour in the same domain.
    class KV_EXPORT processor_t {
    public:
        virtual ~processor_t();
        virtual rgb_t process(rgb_t const& colour) const = 0;
    };

    /// For kind 3D: red, green and blue of grid point (r, g, b) begin at
    /// 3 * ((b * size + g) * size + r).
    vec_t<unsigned short> table;
    std::string title;
    /// The file's name without its folder and without ".cube" or ".mga".
    std::string name;
    int kind = kNone;
    /// Points along an edge; 1024 for kind 1D.
    int size = 0;
    /// The range of colours that the table covers, the same for all channels.
    float domainMin = 0.0f;
    float domainMax = 1.0f;

    /// Makes this an empty cube of 1 to 256 points along an edge, for `process` to fill; any other
    /// edge leaves an empty table of kind 0. The texts stay.
    void makeCube(int edge, float minimum = 0.0f, float maximum = 1.0f);

    /// Reads table number `index`, 0 for the first one, whatever was here before: kSuccess,
    /// kCannotOpen, kUnknownFormat or kBadData, which leaves what was read so far: kind and size as
    /// the file tells them, and maybe fewer rows than that. An index beyond the last table of a
    /// .cube file is a success with an empty table of kind 0; of a .mga file any index reads its
    /// one table. A file without a title has its name as title.
    ///
    /// Limits: 256 points along an edge and 65536 rows for a curve (Adobe Cube LUT 1.0), 16777216
    /// entries for .mga, 1 MiB of a line; no memory is taken for rows that the file is too short
    /// for.
    int read(char const* path, unsigned long index);
    /// The readers of one format, for a file that stands at its first line. They set neither `name`
    /// nor, for .cube, `title`.
    int readMGA(tfreader_t& reader, unsigned long index);
    int readCUBE(tfreader_t& reader, unsigned long index);

    /// The format that `read` found, 0 for none.
    unsigned int format() const noexcept { return format_; }

    /// Writes the table as a cube, to a file of mode 0755. Always 0: whether all bytes reached the
    /// file is told by `error`, which gets the `errno` of the first failure or 0. An unknown format
    /// touches no file (EINVAL). A table of kind 1D has no written form: the file says a cube of
    /// 1024 and holds no more rows than the table; make a cube of it first.
    int write(char const* path, unsigned int format, int* error = nullptr) const;
    /// The writers of one format; `fileName` is the name without folder and extension, and the
    /// title where there is none.
    int writeMGA(int fd, char const* fileName, int* error = nullptr) const;
    int writeCUBE(int fd, char const* fileName, int* error = nullptr) const;

    /// Fills the table: each grid point's colour goes through the processor, red fastest, and what
    /// comes out is clamped to the domain, NaN to its lower end. Nothing happens unless this is a
    /// whole cube. What the processor throws leaves the points so far filled.
    void process(processor_t const& processor);

private:
    friend class multilut_t;

    void reset();
    unsigned int detectFormat(tfreader_t& reader);
    /// The title in one line, or the file's name where there is none.
    std::string titleFor(char const* fileName) const;
    bool isCube() const noexcept;

    static constexpr std::size_t kLongestLine = std::size_t(1) << 20;
    /// Points along an edge of a cube.
    static constexpr int kLongestEdge = 256;

    unsigned int format_ = 0;
};

} // namespace cc

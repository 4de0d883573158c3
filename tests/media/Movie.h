#pragma once

#include <support/TemporaryFolder.h>

#include <korvane/foundation/KVURL.h>
#include <korvane/media/KVAtomBox.h>
#include <korvane/media/KVImageDescAtomBox.h>
#include <korvane/platform/CFData.h>
#include <korvane/platform/CFDictionary.h>

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

// Movies for the tests: made from bytes, kept in files, and read back by code that shares nothing
// with the library.

// --- Bytes ---

/// The low `size` bytes, most significant first.
std::string be(std::uint64_t value, int size);
inline std::string be16(std::uint64_t value)
{
    return be(value, 2);
}
inline std::string be32(std::uint64_t value)
{
    return be(value, 4);
}
inline std::string be64(std::uint64_t value)
{
    return be(value, 8);
}
std::uint64_t numberAt(std::string_view bytes, std::size_t position, int size);

/// An atom with an 8-byte header.
std::string atom(std::string_view type, std::string_view payload = {});
/// An atom with a 16-byte header.
std::string longAtom(std::string_view type, std::string_view payload = {});
/// Hexadecimal digits, blanks between them allowed, as bytes.
std::string fromHex(std::string_view digits);
std::string toHex(std::string_view bytes);

/// The path of an atom in `bytes`, as in "moov/trak/mdia", each name the first of its kind. Empty
/// if it is not there.
std::string_view findPayload(std::string_view bytes, std::string_view path);

// --- Movies ---

struct Track {
    std::string handler = "vide";
    int flags = 1;
    std::string stsd;                  ///< the payload
    std::vector<std::uint64_t> chunks; ///< one sample of 4 bytes in each
    bool wide = false;                 ///< `co64` in place of `stco`
};

/// `stsd` payload with one description: 78 fixed bytes and the extensions behind them.
std::string videoDescription(std::string_view extensions = {}, std::string_view codec = "avc1");
std::string trackAtom(Track const& track);
std::string movieAtom(std::vector<Track> const& tracks);

/// The bytes of every sample that the tables of a movie lead to, track by track; a sample that lies
/// outside the file is "outside".
std::vector<std::string> samplesOf(std::string const& movie);

// --- Files ---

std::string fileBytes(std::string const& path);
/// One of tests/data/media.
std::string sampleMovie(std::string const& name);
/// The names of the sample movies that are not fragmented.
std::vector<std::string> const& plainSamples();

/// Runs as another user for its life where the tests run as root, which may read everything.
class Unprivileged {
public:
    Unprivileged();
    ~Unprivileged();
};

// --- Objects ---

KVCFRef<CFDataRef> makeData(std::string_view bytes);
/// Empty for null.
std::string bytesOf(CFDataRef data);
/// Keys and strings.
KVCFRef<CFMutableDictionaryRef>
makeDictionary(std::vector<std::pair<char const*, std::string>> const& entries);
/// A dictionary on one line, in its order: {a:"1" b:{c:"2"}}; data in hexadecimal, null as "null".
std::string show(NSObject const* value);
/// The tree of an atom on one line: moov(mvhd trak(tkhd)). A type of 0 is "0".
std::string show(KVAtomBox const& atom);

#include "media/Movie.h"

#include <cstdlib>
#include <fstream>
#include <iterator>
#include <stdexcept>
#include <unistd.h>

// --- Bytes ---

std::string be(std::uint64_t value, int size)
{
    std::string bytes;
    for (int shift = 8 * (size - 1); shift >= 0; shift -= 8)
        bytes.push_back(static_cast<char>(value >> shift & 0xFF));
    return bytes;
}

std::uint64_t numberAt(std::string_view bytes, std::size_t position, int size)
{
    std::uint64_t value = 0;
    for (char const byte : bytes.substr(position, static_cast<std::size_t>(size)))
        value = value << 8 | static_cast<unsigned char>(byte);
    return value;
}

std::string atom(std::string_view type, std::string_view payload)
{
    return be32(payload.size() + 8).append(type).append(payload);
}

std::string longAtom(std::string_view type, std::string_view payload)
{
    return be32(1).append(type).append(be64(payload.size() + 16)).append(payload);
}

std::string fromHex(std::string_view digits)
{
    std::string bytes, pair;
    for (char const digit : digits) {
        if (digit != ' ')
            pair.push_back(digit);
        if (pair.size() == 2) {
            bytes.push_back(static_cast<char>(std::stoi(pair, nullptr, 16)));
            pair.clear();
        }
    }
    return bytes;
}

std::string toHex(std::string_view bytes)
{
    std::string digits;
    for (char const byte : bytes)
        for (int const shift : {4, 0})
            digits.push_back("0123456789ABCDEF"[byte >> shift & 15]);
    return digits;
}

namespace {

struct Piece {
    std::string_view type, payload;
};

/// The atoms one after another, up to the first that does not fit.
std::vector<Piece> atomsIn(std::string_view bytes)
{
    std::vector<Piece> pieces;
    while (bytes.size() >= 8) {
        std::uint64_t size = numberAt(bytes, 0, 4);
        std::size_t header = 8;
        if (size == 0)
            size = bytes.size();
        if (size == 1 && bytes.size() >= 16) {
            size = numberAt(bytes, 8, 8);
            header = 16;
        }
        if (size < header || size > bytes.size())
            break;
        pieces.push_back({bytes.substr(4, 4), bytes.substr(header, size - header)});
        bytes.remove_prefix(size);
    }
    return pieces;
}

} // namespace

std::string_view findPayload(std::string_view bytes, std::string_view path)
{
    std::string_view const type = path.substr(0, 4);
    for (Piece const& piece : atomsIn(bytes))
        if (piece.type == type)
            return path.size() > 5 ? findPayload(piece.payload, path.substr(5)) : piece.payload;
    return {};
}

// --- Movies ---

std::string videoDescription(std::string_view extensions, std::string_view codec)
{
    std::string fields(78, '\0');
    fields[7] = 1;                    // data reference index
    fields[76] = fields[77] = '\xFF'; // no colour table
    return be32(0) + be32(1) + atom(codec, fields.append(extensions));
}

std::string trackAtom(Track const& track)
{
    std::string chunks;
    for (std::uint64_t const offset : track.chunks)
        chunks += be(offset, track.wide ? 8 : 4);
    std::size_t const count = track.chunks.size();
    std::string const table = atom("stsd", track.stsd) +
                              atom("stsc", be32(0) + be32(1) + be32(1) + be32(1) + be32(1)) +
                              atom("stsz", be32(0) + be32(4) + be32(count)) +
                              atom(track.wide ? "co64" : "stco", be32(0) + be32(count) + chunks);
    return atom("trak", atom("tkhd", be32(static_cast<unsigned int>(track.flags)) + be64(0)) +
                            atom("mdia", atom("hdlr", be64(0) + track.handler + be32(0)) +
                                             atom("minf", atom("hdlr", be64(0) + "url " + be32(0)) +
                                                              atom("stbl", table))));
}

std::string movieAtom(std::vector<Track> const& tracks)
{
    std::string payload = atom("mvhd", be64(0));
    for (Track const& track : tracks)
        payload += trackAtom(track);
    return atom("moov", payload);
}

std::vector<std::string> samplesOf(std::string const& movie)
{
    std::vector<std::string> samples;
    for (Piece const& track : atomsIn(findPayload(movie, "moov"))) {
        if (track.type != "trak")
            continue;
        std::string_view const table = findPayload(track.payload, "mdia/minf/stbl");
        std::string_view const sizes = findPayload(table, "stsz");
        std::string_view const runs = findPayload(table, "stsc");
        std::string_view chunks = findPayload(table, "stco");
        int const width = chunks.empty() ? 8 : 4;
        if (chunks.empty())
            chunks = findPayload(table, "co64");
        std::size_t sample = 0;
        for (std::uint64_t chunk = 0; chunk < numberAt(chunks, 4, 4); ++chunk) {
            std::uint64_t inChunk = 0;
            for (std::size_t run = 0; run < numberAt(runs, 4, 4); ++run)
                if (numberAt(runs, 8 + 12 * run, 4) <= chunk + 1)
                    inChunk = numberAt(runs, 12 + 12 * run, 4);
            std::uint64_t offset =
                numberAt(chunks, 8 + chunk * static_cast<std::size_t>(width), width);
            for (std::uint64_t i = 0; i < inChunk; ++i, ++sample) {
                std::uint64_t size = numberAt(sizes, 4, 4);
                if (size == 0)
                    size = numberAt(sizes, 12 + 4 * sample, 4);
                samples.push_back(offset + size <= movie.size() ? movie.substr(offset, size)
                                                                : "outside");
                offset += size;
            }
        }
    }
    return samples;
}

// --- Files ---

std::string fileBytes(std::string const& path)
{
    std::ifstream file(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(file), {}};
}

std::string sampleMovie(std::string const& name)
{
    return std::string(KORVANE_TEST_DATA) + "/media/" + name;
}

std::vector<std::string> const& plainSamples()
{
    static std::vector<std::string> const names = {"colr.mp4",           "hdr10.mp4",
                                                   "head-moov.mp4",      "quicktime.mov",
                                                   "quicktime-colr.mov", "tail-moov.mp4"};
    return names;
}

Unprivileged::Unprivileged()
{
    if (geteuid() == 0 && seteuid(65534) != 0)
        throw std::runtime_error("can not leave root");
}

Unprivileged::~Unprivileged()
{
    if (getuid() == 0 && seteuid(0) != 0)
        std::abort();
}

// --- Objects ---

KVCFRef<CFDataRef> makeData(std::string_view bytes)
{
    return KVCFRef<CFDataRef>::adopt(new __CFData(bytes.data(), bytes.size()));
}

std::string bytesOf(CFDataRef data)
{
    return data ? std::string(data->span().begin(), data->span().end()) : std::string();
}

KVCFRef<CFMutableDictionaryRef>
makeDictionary(std::vector<std::pair<char const*, std::string>> const& entries)
{
    auto dictionary = KVCFRef<CFMutableDictionaryRef>::adopt(new __CFDictionary());
    for (auto const& [key, text] : entries)
        dictionary->setValue(key, KVString(text).cf_str());
    return dictionary;
}

std::string show(NSObject const* value)
{
    if (!value)
        return "null";
    if (auto const* data = dynamic_cast<CFDataRef>(value))
        return toHex(bytesOf(data));
    auto const* dictionary = dynamic_cast<CFDictionaryRef>(value);
    if (!dictionary)
        return "\"" + value->description().toUTF8() + "\"";
    std::string text = "{";
    for (std::size_t i = 0; i < dictionary->count(); ++i)
        text += (i ? " " : "") + dictionary->keyAtIndex(i)->description().toUTF8() + ":" +
                show(dictionary->valueAtIndex(i));
    return text + "}";
}

std::string show(KVAtomBox const& atom)
{
    std::string text = atom.getType() ? be32(atom.getType()) : "0";
    for (int i = 0; i < atom.getChildCount(); ++i)
        text += (i ? " " : "(") + show(*atom.getChild(i));
    return atom.getChildCount() ? text + ")" : text;
}

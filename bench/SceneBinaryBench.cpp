// The document of the text benchmark in both forms, to and from memory, and an element of 100 MB
// that is passed over in a file.

#include "SceneDocument.h"

#include <benchmark/benchmark.h>

#include <cstdio>
#include <filesystem>

#include <unistd.h>

namespace {

std::string bytesOf(KVBufferWriteStream const& stream)
{
    return {reinterpret_cast<char const*>(stream.getBuffer()), stream.getBufferSize()};
}

struct Documents {
    /// Is full when it is asked as often as the text form was until it had its size.
    auto sameClips() const
    {
        return [count = std::size_t(0), end = fullAt]() mutable { return ++count >= end; };
    }

    Documents()
    {
        KVBufferWriteStream bytes(1 << 20, 1 << 20);
        KVXMLWriteStream stream(bytes, 5, 10);
        std::size_t asked = 0;
        writeClips(stream, [&] {
            ++asked;
            bool const full = bytes.getPos() >= documentSize;
            if (full && fullAt == 0)
                fullAt = asked;
            return full;
        });
        text = bytesOf(bytes);
        for (std::size_t at = 0; (at = text.find("<clip ", at)) != std::string::npos; ++at)
            ++clipCount;
        KVBufferWriteStream compact(1 << 20, 1 << 20);
        KVBinaryXMLWriteStream other(compact, 5, 10);
        writeClips(other, sameClips());
        binary = bytesOf(compact);
    }

    std::size_t fullAt = 0;
    std::size_t clipCount = 0;
    std::string text;
    std::string binary;
};

Documents const& documents()
{
    static Documents const made;
    return made;
}

template <class Stream>
void write(benchmark::State& state, std::string const& expected)
{
    for (auto _ : state) {
        KVBufferWriteStream bytes(1 << 25, 1 << 20);
        Stream stream(bytes, 5, 10);
        writeClips(stream, documents().sameClips());
        if (bytes.getBufferSize() != expected.size())
            state.SkipWithError("another document");
    }
    state.counters["size"] = static_cast<double>(expected.size());
}

void writeBinary(benchmark::State& state)
{
    write<KVBinaryXMLWriteStream>(state, documents().binary);
}

void writeText(benchmark::State& state)
{
    write<KVXMLWriteStream>(state, documents().text);
}

void read(benchmark::State& state, KVSerializerReadStream& stream)
{
    Taker taker;
    stream.pushHandler(&taker);
    if (!stream.parse() || taker.taken != 6 * documents().clipCount)
        state.SkipWithError("not all was read");
    stream.popAllHandlers();
}

void readBinary(benchmark::State& state)
{
    std::string const& document = documents().binary;
    for (auto _ : state) {
        KVBufferReadStream bytes(document.data(), document.size());
        KVBinaryXMLReadStream stream(bytes);
        read(state, stream);
    }
}

void readText(benchmark::State& state)
{
    std::string const& document = documents().text;
    for (auto _ : state) {
        KVXMLReadStream stream(document.data(), static_cast<int>(document.size()));
        read(state, stream);
    }
}

BENCHMARK(writeBinary)->Name("SceneBinaryWrite/ours")->Unit(benchmark::kMillisecond);
BENCHMARK(writeText)->Name("SceneBinaryWrite/peer:text")->Unit(benchmark::kMillisecond);
BENCHMARK(readBinary)->Name("SceneBinaryRead/ours")->Unit(benchmark::kMillisecond);
BENCHMARK(readText)->Name("SceneBinaryRead/peer:text")->Unit(benchmark::kMillisecond);

/// The bytes of an unknown element are a hole in the file: only its size is read.
void skip(benchmark::State& state)
{
    std::string const path =
        std::filesystem::temp_directory_path() / ("korvane-skip-" + std::to_string(getpid()));
    constexpr long size = 100'000'000;
    if (std::FILE* const file = std::fopen(path.c_str(), "wb")) {
        unsigned char const head[] = {'V',
                                      'Z',
                                      'B',
                                      'M',
                                      'L',
                                      0,
                                      0x55,
                                      size & 0xFF,
                                      size >> 8 & 0xFF,
                                      size >> 16 & 0xFF,
                                      size >> 24 & 0xFF};
        std::fwrite(head, 1, sizeof head, file);
        std::fseek(file, size, SEEK_CUR);
        unsigned char const clip[] = {kClip, 1, 0, 0, 0, 0};
        std::fwrite(clip, 1, sizeof clip, file);
        std::fclose(file);
    }
    KVURL const url(path.c_str());
    for (auto _ : state) {
        KVFileReadStream file(url);
        KVBinaryXMLReadStream stream(file);
        Taker taker;
        stream.pushHandler(&taker);
        if (!stream.parse() || file.getPos() < static_cast<unsigned long long>(size))
            state.SkipWithError("the document was not read to its end");
    }
    std::filesystem::remove(path);
}
BENCHMARK(skip)->Name("SceneBinarySkip/ours");

} // namespace

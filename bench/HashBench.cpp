// The 128-bit hash and MD5 over 64 MiB against OpenSSL's MD5, and the hash stream fed with small
// values against the same bytes in one block.

#include <korvane/serialization/KVHashWriteStream.h>
#include <korvane/serialization/KVMD5.h>

#include <benchmark/benchmark.h>

#ifdef HAVE_OPENSSL
#include <openssl/evp.h>
#endif

#include <cstdint>
#include <vector>

namespace {

std::vector<unsigned char> bytesOf(std::size_t count)
{
    std::vector<unsigned char> bytes(count);
    for (std::size_t i = 0; i < count; ++i)
        bytes[i] = static_cast<unsigned char>(i * 131 >> 3);
    return bytes;
}

std::vector<unsigned char> const& block()
{
    static auto const bytes = bytesOf(64 << 20);
    return bytes;
}

void hashBlock(benchmark::State& state)
{
    for (auto _ : state) {
        KVHash128 hash;
        hash.addData(block().data(), static_cast<unsigned int>(block().size()));
        benchmark::DoNotOptimize(hash);
    }
    state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations() * block().size()));
}

void md5(benchmark::State& state)
{
    for (auto _ : state)
        benchmark::DoNotOptimize(KVMD5HashWithBytes(block().data(), block().size()));
    state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations() * block().size()));
}

BENCHMARK(hashBlock)->Name("HashBlock/ours")->Unit(benchmark::kMillisecond);
BENCHMARK(md5)->Name("MD5/ours")->Unit(benchmark::kMillisecond);

#ifdef HAVE_OPENSSL
void evpMD5(benchmark::State& state)
{
    unsigned char digest[EVP_MAX_MD_SIZE];
    for (auto _ : state) {
        EVP_Digest(block().data(), block().size(), digest, nullptr, EVP_md5(), nullptr);
        benchmark::DoNotOptimize(digest);
    }
    state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations() * block().size()));
}
BENCHMARK(evpMD5)->Name("MD5/peer:EVP")->Unit(benchmark::kMillisecond);
#endif

constexpr int rounds = 100000;

/// Through the interface that an object sees.
template <class Write>
void smallValues(benchmark::State& state, Write write)
{
    for (auto _ : state) {
        KVHashWriteStream stream;
        KVSerializerWriteStream& values = stream;
        benchmark::DoNotOptimize(&values);
        for (int i = 0; i < rounds; ++i)
            write(values, i);
        benchmark::DoNotOptimize(stream.getHash());
    }
}

void oneBlock(benchmark::State& state, std::size_t bytesPerRound)
{
    auto const bytes = bytesOf(rounds * bytesPerRound);
    for (auto _ : state) {
        KVHash128 hash;
        hash.addData(bytes.data(), static_cast<unsigned int>(bytes.size()));
        benchmark::DoNotOptimize(hash);
    }
}

void writeMixed(KVSerializerWriteStream& values, int i)
{
    values.writeValue(i);
    values.writeValue(0.5f);
    values.writeValue(1.0 / 3);
    values.writeValue(CMTimeMake(i, 600));
}

void writeInt(KVSerializerWriteStream& values, int i)
{
    values.writeValue(i);
}

BENCHMARK_CAPTURE(smallValues, mixed, writeMixed)->Name("MixedValues/ours");
BENCHMARK_CAPTURE(oneBlock, mixed, 40)->Name("MixedValues/peer:one block");
BENCHMARK_CAPTURE(smallValues, int, writeInt)->Name("Ints/ours");
BENCHMARK_CAPTURE(oneBlock, int, 4)->Name("Ints/peer:one block");

} // namespace

// A cube of 65 points along each edge: reading it against OpenColorIO and against a bare pass of
// std::from_chars over the same bytes, writing it, and filling it.

#include <korvane/colour/lut_t.h>

#include <benchmark/benchmark.h>

#ifdef HAVE_OPENCOLORIO
#include <OpenColorIO/OpenColorIO.h>
#endif

#include <charconv>
#include <cmath>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <unistd.h>

namespace {

/// A curve on each channel and some of each in the others, so that no value comes twice in a row.
class Look final : public cc::lut_t::processor_t {
public:
    cc::rgb_t process(cc::rgb_t const& c) const override
    {
        float const luma = 0.2126f * c[0] + 0.7152f * c[1] + 0.0722f * c[2];
        cc::rgb_t result;
        for (std::size_t i = 0; i < 3; ++i)
            result[i] = std::pow(0.9f * c[i] + 0.1f * luma, 0.8f);
        return result;
    }
};

cc::lut_t const& look()
{
    static cc::lut_t const lut = [] {
        cc::lut_t result;
        result.makeCube(65);
        result.title = "Look";
        result.process(Look());
        return result;
    }();
    return lut;
}

/// The table as a file, gone with the process.
class File {
public:
    File() : path_("/tmp/lut-bench-" + std::to_string(::getpid()) + ".cube")
    {
        look().write(path_.c_str(), cc::lut_t::kCUBE);
    }
    File(File const&) = delete;
    File& operator=(File const&) = delete;
    ~File() { std::filesystem::remove(path_); }

    std::string const& path() const { return path_; }
    std::string const& bytes() const
    {
        static std::string const result = [this] {
            std::ifstream stream(path_);
            return std::string(std::istreambuf_iterator<char>(stream), {});
        }();
        return result;
    }

private:
    std::string path_;
};

File const& file()
{
    static File const result;
    return result;
}

void load(benchmark::State& state)
{
    std::string const path = file().path();
    for (auto _ : state) {
        cc::lut_t lut;
        if (lut.read(path.c_str(), 0) != cc::kSuccess)
            state.SkipWithError("not read");
        benchmark::DoNotOptimize(lut.table.data());
    }
}
BENCHMARK(load)->Name("Load/ours")->Unit(benchmark::kMillisecond);

void fromChars(benchmark::State& state)
{
    std::string const& bytes = file().bytes();
    auto const data = bytes.find("\n\n") + 2;
    for (auto _ : state) {
        char const* at = bytes.data() + data;
        char const* const end = bytes.data() + bytes.size();
        float sum = 0;
        while (at < end) {
            float value = 0;
            at = std::from_chars(at, end, value).ptr + 1;
            sum += value;
        }
        benchmark::DoNotOptimize(sum);
    }
}
BENCHMARK(fromChars)->Name("Load/peer:from_chars")->Unit(benchmark::kMillisecond);

#ifdef HAVE_OPENCOLORIO
namespace OCIO = OCIO_NAMESPACE;

void loadOpenColorIO(benchmark::State& state)
{
    // A config would give the processor that it made of the file before.
    OCIO::ConfigRcPtr const config = OCIO::Config::CreateRaw()->createEditableCopy();
    config->setProcessorCacheFlags(OCIO::PROCESSOR_CACHE_OFF);
    auto const transform = OCIO::FileTransform::Create();
    transform->setSrc(file().path().c_str());
    for (auto _ : state) {
        OCIO::ClearAllCaches();
        benchmark::DoNotOptimize(config->getProcessor(transform));
    }
}
BENCHMARK(loadOpenColorIO)->Name("Load/peer:OpenColorIO")->Unit(benchmark::kMillisecond);
#endif

void write(benchmark::State& state, cc::lut_t::format_t format)
{
    std::string const path = file().path() + ".written";
    for (auto _ : state) {
        look().write(path.c_str(), format);
        // Writing over a file would measure how long the file system holds on to the old one.
        state.PauseTiming();
        std::filesystem::remove(path);
        state.ResumeTiming();
    }
}
BENCHMARK_CAPTURE(write, cube, cc::lut_t::kCUBE)->Name("Write/ours")->Unit(benchmark::kMillisecond);
BENCHMARK_CAPTURE(write, mga, cc::lut_t::kMGA)
    ->Name("WriteMGA/ours")
    ->Unit(benchmark::kMillisecond);

void process(benchmark::State& state)
{
    class Identity final : public cc::lut_t::processor_t {
        cc::rgb_t process(cc::rgb_t const& c) const override { return c; }
    };
    cc::lut_t lut;
    lut.makeCube(65);
    for (auto _ : state)
        lut.process(Identity());
    benchmark::DoNotOptimize(lut.table.data());
}
BENCHMARK(process)->Name("Process/ours")->Unit(benchmark::kMillisecond);

} // namespace

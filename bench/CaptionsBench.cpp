// SubRip files of 10 MB in and out, and captions into groups.

#include <korvane/korvane.h>

#include <benchmark/benchmark.h>

#include <cstdio>
#include <filesystem>
#include <fstream>
#include <malloc.h>
#include <string>

#ifdef HAVE_LIBAV
extern "C" {
#include <libavcodec/avcodec.h>
#include <libavformat/avformat.h>
}
#endif

namespace {

constexpr int captionCount = 110'000;
CMTime const frame = CMTimeMake(1, 25);

/// A file that goes with the program.
struct TemporaryFile {
    std::filesystem::path path;
    ~TemporaryFile() { std::filesystem::remove(path); }
};

/// A file of some 11 MB: two lines a caption, tags in two of three, accents and a second script.
std::filesystem::path const& sampleFile()
{
    static TemporaryFile const sample = [] {
        static constexpr char const* texts[] = {
            "<i>She left before the rain began,</i>\nand <b>nobody</b> saw her go.",
            "Où vas-tu si tard, mon ami ?\n<font color=\"#ffcc00\">— À la gare.</font>",
            "Πού πηγαίνεις τόσο αργά;\nA plain second line.",
        };
        auto result = std::filesystem::temp_directory_path() / "korvane-captions-bench.srt";
        std::ofstream file(result, std::ios::binary);
        for (int i = 0; i < captionCount; ++i) {
            char block[400];
            auto const clock = [](char* out, std::size_t size, int ms) {
                std::snprintf(out, size, "%02d:%02d:%02d,%03d", ms / 3600000, ms / 60000 % 60,
                              ms / 1000 % 60, ms % 1000);
            };
            char from[32];
            char to[32];
            clock(from, sizeof from, i * 2000);
            clock(to, sizeof to, i * 2000 + 1800);
            std::snprintf(block, sizeof block, "%d\n%s --> %s\n%s\n\n", i + 1, from, to,
                          texts[i % 3]);
            file << block;
        }
        return TemporaryFile{result};
    }();
    return sample.path;
}

KVURL sampleURL()
{
    return KVURL(sampleFile().c_str());
}

std::vector<KVCaptionArray> importSample()
{
    std::vector<KVCaptionArray> captions;
    auto const importer = KVMakeRef<KVSRTCaptionsImporter>();
    importer->importCaptionsFromURL(sampleURL(), captions, frame, kCMTimeZero);
    return captions;
}

/// A number of kilobytes from /proc/self/status; 0 where there is none.
double statusKilobytes(std::string const& field)
{
    std::ifstream status("/proc/self/status");
    for (std::string name; status >> name;) {
        double value = 0;
        if (name == field + ":" && status >> value)
            return value;
    }
    return 0;
}

/// How much the peak of resident memory rises during an import, in sizes of the file.
double importMemory()
{
    malloc_trim(0);
    std::ofstream("/proc/self/clear_refs") << "5";
    double const before = statusKilobytes("VmRSS");
    auto const captions = importSample();
    return (statusKilobytes("VmHWM") - before) * 1024 /
           static_cast<double>(std::filesystem::file_size(sampleFile()));
}

void import(benchmark::State& state)
{
    state.counters["memoryPerFile"] = importMemory();
    for (auto _ : state) {
        auto const captions = importSample();
        if (captions.size() != captionCount)
            state.SkipWithError("captions are missing");
    }
    state.SetBytesProcessed(state.iterations() *
                            static_cast<std::int64_t>(std::filesystem::file_size(sampleFile())));
}
BENCHMARK(import)->Name("ImportSubRip/ours")->Unit(benchmark::kMillisecond);

#ifdef HAVE_LIBAV
void importPeer(benchmark::State& state)
{
    std::string const path = sampleFile();
    for (auto _ : state) {
        AVFormatContext* input = nullptr;
        if (avformat_open_input(&input, path.c_str(), nullptr, nullptr) < 0) {
            state.SkipWithError("libavformat cannot open the file");
            return;
        }
        AVCodec const* codec = avcodec_find_decoder(input->streams[0]->codecpar->codec_id);
        AVCodecContext* decoder = avcodec_alloc_context3(codec);
        avcodec_parameters_to_context(decoder, input->streams[0]->codecpar);
        decoder->pkt_timebase = input->streams[0]->time_base;
        avcodec_open2(decoder, codec, nullptr);
        AVPacket* packet = av_packet_alloc();
        int count = 0;
        while (av_read_frame(input, packet) >= 0) {
            AVSubtitle subtitle;
            int got = 0;
            if (avcodec_decode_subtitle2(decoder, &subtitle, &got, packet) >= 0 && got) {
                ++count;
                avsubtitle_free(&subtitle);
            }
            av_packet_unref(packet);
        }
        av_packet_free(&packet);
        avcodec_free_context(&decoder);
        avformat_close_input(&input);
        if (count != captionCount)
            state.SkipWithError("captions are missing");
    }
}
BENCHMARK(importPeer)->Name("ImportSubRip/peer:libav")->Unit(benchmark::kMillisecond);
#endif

void exportWithTags(benchmark::State& state)
{
    KVCaptionArray captions;
    for (KVCaptionArray const& one : importSample())
        captions.push_back(one[0]);
    TemporaryFile const out{sampleFile().string() + ".out"};
    KVURL const target(out.path.c_str());
    for (auto _ : state) {
        if (KVSRTCaptionsExporter::exportCaptionsToURL(target, captions, frame, kCMTimeZero, true))
            state.SkipWithError("the file cannot be written");
    }
}
BENCHMARK(exportWithTags)->Name("ExportSubRip/ours")->Unit(benchmark::kMillisecond);
// What an export is compared with.
BENCHMARK(import)->Name("ExportSubRip/peer:import")->Unit(benchmark::kMillisecond);

/// 100 000 captions that start a second apart and last `seconds` each.
void group(benchmark::State& state)
{
    auto const text = KVMakeRef<NSAttributedString>("Twenty-four letters here");
    KVCaptionArray captions;
    for (int i = 0; i < 100'000; ++i) {
        CMTimeRange const range = CMTimeRangeMake(CMTimeMake(i, 1), CMTimeMake(state.range(0), 1));
        captions.push_back(KVMakeRef<KVCaptionSRT>(text, range));
    }
    for (auto _ : state)
        benchmark::DoNotOptimize(KVGroupOverlappingCaptions(captions, false));
}
BENCHMARK(group)
    ->Name("GroupCaptions/ours")
    ->ArgName("seconds")
    ->Arg(1)
    ->Arg(3)
    ->Arg(1'000'000)
    ->Unit(benchmark::kMillisecond);

} // namespace

// A movie of 450 MB rewritten by copy, beside cp and ffmpeg; the tree of a file of many atoms.

#include <korvane/korvane.h>

#include <benchmark/benchmark.h>

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <string>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

namespace {

std::string be32(std::uint64_t value)
{
    std::string bytes(4, '\0');
    for (char& byte : bytes)
        byte = static_cast<char>(value >> (24 - 8 * (&byte - bytes.data())) & 0xFF);
    return bytes;
}

/// The files of this run, on the disk of the folder for temporary files.
struct Files {
    std::filesystem::path folder =
        std::filesystem::temp_directory_path() / ("media-bench-" + std::to_string(getpid()));
    std::string movie = folder / "movie.mov";
    std::string copy = folder / "copy.mov";
    std::string atoms = folder / "atoms.mp4";

    Files()
    {
        std::filesystem::create_directories(folder);
        writeMovie();
        std::ofstream out(atoms, std::ios::binary);
        for (int i = 0; i < 100'000; ++i)
            out << be32(8 + 24) << "free" << std::string(24, 'x');
    }
    ~Files() { std::filesystem::remove_all(folder); }

    /// Made by ffmpeg where it is installed, so that it can be measured too; else without tracks.
    void writeMovie()
    {
        std::string const make =
            "head -c 450000000 /dev/urandom | ffmpeg -v error -y -f rawvideo -pixel_format uyvy422 "
            "-video_size 1250x600 -i - -c copy -f mov '" +
            movie + "' 2>/dev/null";
        if (std::system(make.c_str()) == 0 && std::filesystem::file_size(movie) > 440'000'000)
            return;
        std::ofstream out(movie, std::ios::binary);
        out << be32(12) << "ftypqt  " << be32(450'000'008) << "mdat";
        std::string const block(1'000'000, 'm');
        for (int i = 0; i < 450; ++i)
            out << block;
        out << be32(8) << "moov";
    }
};

Files const& files()
{
    static Files const made;
    return made;
}

/// The same start for each: no copy there, and a disk that has nothing left to write.
void clearDisk()
{
    std::filesystem::remove(files().copy);
    ::sync();
}

bool rewrite(KVAtomBoxFile& file)
{
    Files const& f = files();
    if (file.openInputFile(KVURL(f.movie.c_str()).cf_url()) != 0 ||
        file.readAllTrackMediaAtomBoxes() != 0)
        return false;
    // Grown in front of or behind the media data, as it comes.
    KVAtomBox* const moov = file.findFirstChild(false, KVAtomType("moov"));
    auto* const grown = new KVAtomBox(KVAtomType("free"));
    grown->setParent(moov);
    moov->addChild(grown);
    __CFData const payload("grown", 5);
    grown->setPayloadData(&payload);
    grown->updateSize();
    grown->updateParentSizes();
    return file.openOutputFile(KVURL(f.copy.c_str()).cf_url()) == 0 &&
           file.writeAtomBoxFileWithUpdates() == 0;
}

void rewriteOurs(benchmark::State& state)
{
    for (auto _ : state) {
        state.PauseTiming();
        clearDisk();
        state.ResumeTiming();
        KVAtomBoxFile file;
        if (!rewrite(file))
            return state.SkipWithError("the movie could not be rewritten");
        file.closeOutputFile();
    }
    clearDisk();
}
BENCHMARK(rewriteOurs)->Name("Rewrite/ours")->Unit(benchmark::kMillisecond)->UseRealTime();

/// A program on the same two files.
void runPeer(benchmark::State& state, std::string const& line)
{
    for (auto _ : state) {
        state.PauseTiming();
        clearDisk();
        state.ResumeTiming();
        if (std::system(line.c_str()) != 0)
            return state.SkipWithError("not installed");
    }
    clearDisk();
}

void rewriteCp(benchmark::State& state)
{
    runPeer(state, "cp '" + files().movie + "' '" + files().copy + "'");
}
BENCHMARK(rewriteCp)->Name("Rewrite/peer:cp")->Unit(benchmark::kMillisecond)->UseRealTime();

void rewriteFfmpeg(benchmark::State& state)
{
    runPeer(state, "ffmpeg -v error -y -i '" + files().movie + "' -map 0 -c copy '" + files().copy +
                       "' 2>/dev/null");
}
BENCHMARK(rewriteFfmpeg)->Name("Rewrite/peer:ffmpeg")->Unit(benchmark::kMillisecond)->UseRealTime();

long peakKB()
{
    std::ifstream status("/proc/self/status");
    for (std::string line; std::getline(status, line);)
        if (line.starts_with("VmHWM:"))
            return std::atol(line.c_str() + 6);
    return 0;
}

/// In a process of its own, so that nothing else counts: the peak of the resident set above what it
/// was before.
void rewriteMemory(benchmark::State& state)
{
    files();
    double grown = 0;
    for (auto _ : state) {
        int pipes[2];
        if (pipe(pipes) != 0)
            std::abort();
        pid_t const child = fork();
        if (child == 0) {
            // The peak starts anew at what is in use now.
            std::ofstream("/proc/self/clear_refs") << 5;
            long const before = peakKB();
            KVAtomBoxFile file;
            long const result = rewrite(file) ? peakKB() - before : -1;
            _exit(write(pipes[1], &result, sizeof result) == sizeof result ? 0 : 1);
        }
        long result = -1;
        if (read(pipes[0], &result, sizeof result) != sizeof result || result < 0)
            state.SkipWithError("the movie could not be rewritten");
        close(pipes[0]);
        close(pipes[1]);
        waitpid(child, nullptr, 0);
        grown = static_cast<double>(result) * 1024;
        std::filesystem::remove(files().copy);
    }
    state.counters["grown"] = grown;
}
BENCHMARK(rewriteMemory)->Name("RewriteMemory/ours")->Iterations(1)->UseRealTime();

void readTree(benchmark::State& state)
{
    files();
    for (auto _ : state) {
        KVAtomBoxFile file;
        file.openInputFile(KVURL(files().atoms.c_str()).cf_url());
        file.readTopLevelAtomBoxHeaders();
        if (file.getChildCount() != 100'000)
            state.SkipWithError("not all atoms were read");
        benchmark::DoNotOptimize(file.findFirstChild(true, KVAtomType("moov")));
    }
}
BENCHMARK(readTree)->Name("ReadTree/ours")->Unit(benchmark::kMillisecond)->UseRealTime();

} // namespace

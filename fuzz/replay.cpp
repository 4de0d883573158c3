// Runs a fuzz entry over files, for builds without libFuzzer: every file of the
// folders and every file named as an argument, once each, and the empty input.

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

extern "C" int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size);

namespace {

namespace fs = std::filesystem;

std::vector<fs::path> filesOf(fs::path const& argument)
{
    if (!fs::is_directory(argument))
        return {argument};
    std::vector<fs::path> files;
    for (fs::directory_entry const& entry : fs::recursive_directory_iterator(argument))
        if (entry.is_regular_file())
            files.push_back(entry.path());
    std::sort(files.begin(), files.end());
    return files;
}

bool replay(fs::path const& path)
{
    std::ifstream file(path, std::ios::binary);
    std::vector<char> const bytes((std::istreambuf_iterator<char>(file)), {});
    if (!file) {
        std::fprintf(stderr, "%s: cannot be read\n", path.c_str());
        return false;
    }
    // An exact copy on the heap, so that a read past the end is seen.
    std::vector<std::uint8_t> const input(bytes.begin(), bytes.end());
    std::printf("%s (%zu bytes)\n", path.c_str(), input.size());
    std::fflush(stdout);
    LLVMFuzzerTestOneInput(input.data(), input.size());
    return true;
}

} // namespace

int main(int count, char** arguments)
{
    LLVMFuzzerTestOneInput(nullptr, 0);
    std::size_t files = 0;
    for (int i = 1; i < count; ++i) {
        if (!fs::exists(arguments[i])) {
            std::fprintf(stderr, "%s: no such file or folder\n", arguments[i]);
            return 1;
        }
        for (fs::path const& path : filesOf(arguments[i])) {
            if (!replay(path))
                return 1;
            ++files;
        }
    }
    std::printf("%zu files\n", files);
    return files > 0 ? 0 : 1;
}

#pragma once

#include <korvane/korvane.h>

#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <sstream>
#include <string>
#include <string_view>

#include <unistd.h>

/// A folder of its own, removed with its holder.
class TemporaryFolder {
public:
    TemporaryFolder()
    {
        std::string pattern = std::filesystem::temp_directory_path() / "korvane-test-XXXXXX";
        path_ = mkdtemp(pattern.data());
    }
    ~TemporaryFolder() { std::filesystem::remove_all(path_); }
    std::string file(std::string const& name) const { return path_ / name; }

private:
    std::filesystem::path path_;
};

inline KVURL urlOf(std::string const& path)
{
    return KVURL(path.c_str());
}

inline std::string contentsOf(std::string const& path)
{
    std::ostringstream text;
    text << std::ifstream(path, std::ios::binary).rdbuf();
    return text.str();
}

inline void writeFile(std::string const& path, std::string_view contents)
{
    std::ofstream(path, std::ios::binary) << contents;
}

/// What has been written to a memory stream.
inline std::string textOf(KVBufferWriteStream const& stream)
{
    return {reinterpret_cast<char const*>(stream.getBuffer()), stream.getBufferSize()};
}

/// What `body` prints to standard output.
template <class Body>
std::string printedBy(Body body)
{
    testing::internal::CaptureStdout();
    body();
    std::fflush(stdout);
    return testing::internal::GetCapturedStdout();
}

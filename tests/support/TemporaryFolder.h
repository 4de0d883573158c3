#pragma once

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include <stdlib.h>

/// A folder of its own, gone with the object.
class TemporaryFolder {
public:
    explicit TemporaryFolder(
        std::filesystem::path const& above = std::filesystem::temp_directory_path())
    {
        std::string pattern = above / "korvane-test-XXXXXX";
        if (!::mkdtemp(pattern.data()))
            throw std::runtime_error("no folder for the test");
        path_ = pattern;
    }
    TemporaryFolder(TemporaryFolder const&) = delete;
    TemporaryFolder& operator=(TemporaryFolder const&) = delete;
    ~TemporaryFolder()
    {
        std::error_code ignored;
        std::filesystem::remove_all(path_, ignored);
    }

    std::string path(std::string const& name) const { return path_ / name; }
    /// Makes a file with these bytes and gives its path.
    std::string write(std::string const& name, std::string_view bytes) const
    {
        std::ofstream(path(name), std::ios::binary) << bytes;
        return path(name);
    }
    std::string read(std::string const& name) const
    {
        std::ostringstream text;
        text << std::ifstream(path(name), std::ios::binary).rdbuf();
        return text.str();
    }
    /// The names of the files in it, sorted.
    std::vector<std::string> names() const
    {
        std::vector<std::string> names;
        for (auto const& entry : std::filesystem::directory_iterator(path_))
            names.push_back(entry.path().filename());
        std::sort(names.begin(), names.end());
        return names;
    }

private:
    std::filesystem::path path_;
};

#pragma once

#include <korvane/serialization/KVFileDescriptor_p.h>
#include <korvane/serialization/KVXMLProlog_p.h>

#include <string_view>
#include <vector>

/// The bytes of a document, from a file or from memory.
class KVXMLSource {
public:
    /// 0, or the `errno` value of the failure.
    int openFile(KVURL const& url);
    void openMemory(std::string_view bytes) noexcept { bytes_ = bytes; }

    /// Looks at the start of the document; nothing is used up.
    KVXMLProlog scanProlog();

    /// Gives at most one line at a time.
    void setLineByLine(bool lineByLine) noexcept { lineByLine_ = lineByLine; }
    /// Copies up to `length` bytes; 0 at the end, -1 for a failure.
    int read(char* out, int length) noexcept;
    /// The `errno` value of the failure to read; 0 for none.
    int error() const noexcept { return error_; }

private:
    /// Reads on behind what is in the window, up to `size` bytes in all.
    void fillWindow(std::size_t size);

    KVFileDescriptor file_;
    std::vector<char> window_;
    /// What has not been given out.
    std::string_view bytes_;
    bool lineByLine_ = false;
    bool atEnd_ = true;
    int error_ = 0;
};

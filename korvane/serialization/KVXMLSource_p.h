#pragma once

#include <korvane/serialization/KVFileDescriptor_p.h>
#include <korvane/serialization/KVXMLProlog_p.h>

#include <string_view>
#include <vector>

/// The bytes of a document, from a file or from memory. Positions count from its start.
class KVXMLSource {
public:
    /// 0, or the `errno` value of the failure.
    int openFile(KVURL const& url);
    void openMemory(std::string_view bytes) noexcept { bytes_ = bytes; }

    /// Looks at the start of the document; nothing is given out.
    KVXMLProlog scanProlog();
    KVXMLEncoding encoding() const { return kvDetectEncoding(bytes_); }

    /// Gives at most one line at a time.
    void setLineByLine(bool lineByLine) noexcept { lineByLine_ = lineByLine; }
    /// Copies up to `length` bytes; 0 at the end, -1 for a failure.
    int read(char* out, int length);
    /// What has been given out, from `position` on. It may not be asked for from an earlier
    /// position later.
    std::string_view givenFrom(unsigned long long position) noexcept;
    unsigned long long given() const noexcept { return start_ + given_; }
    /// The `errno` value of the failure to read; 0 for none.
    int error() const noexcept { return error_; }

private:
    /// Reads on, behind what may still be asked for.
    void fillWindow();

    KVFileDescriptor file_;
    std::vector<char> window_;
    /// What is in memory: from `start_` of the document on. Of it `given_` bytes have been given
    /// out, and the first `unneeded_` of those are not asked for again.
    std::string_view bytes_;
    unsigned long long start_ = 0;
    std::size_t given_ = 0;
    std::size_t unneeded_ = 0;
    bool lineByLine_ = false;
    bool atEnd_ = true;
    int error_ = 0;
};

#pragma once

#include <korvane/foundation/KVURL.h>

/// An open file, closed with its holder. Calls that a signal interrupted are made again.
class KVFileDescriptor {
public:
    KVFileDescriptor() noexcept = default;
    KVFileDescriptor(KVFileDescriptor const&) = delete;
    KVFileDescriptor& operator=(KVFileDescriptor const&) = delete;
    ~KVFileDescriptor() { close(); }

    /// Each answers 0 or the `errno` value of its failure.
    int openForReading(KVURL const& url);
    /// Makes the file or empties it.
    int openForWriting(KVURL const& url);
    int close() noexcept;
    int seek(unsigned long long position) noexcept;
    /// All bytes, in as many calls as it takes.
    int writeAll(void const* data, unsigned long long length) noexcept;
    int writeAllAt(void const* data, unsigned long long length,
                   unsigned long long position) noexcept;
    /// As many bytes as there are, up to `length`: fewer only at the end of the file or at a
    /// failure. `*count` tells how many came in both cases.
    int read(void* data, unsigned long long length, unsigned long long* count) noexcept;

    bool isOpen() const noexcept { return descriptor_ >= 0; }

private:
    int open(KVURL const& url, int flags);

    int descriptor_ = -1;
};

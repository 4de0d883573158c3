#pragma once

#include <korvane/foundation/KVURL.h>
#include <korvane/serialization/KVStream.h>

#include <memory>

/// Reads a file through a window of 64 KiB.
///
///     KVFileReadStream file(url);
///     if (file.getError())
///         ...                        // could not be opened
class KV_EXPORT KVFileReadStream : public KVStream {
public:
    explicit KVFileReadStream(KVURL const& url);
    ~KVFileReadStream() override;

    /// Fewer bytes than `length` at the end or in front of a failure; -1 when nothing could be read
    /// because of one. What it returns is added to the position, so -1 takes 1 off: `setPos` makes
    /// it good, and reading can go on from there.
    long long read(void* data, unsigned long long length) override;
    /// Nothing is written: 0.
    long long write(void const* data, unsigned long long length) override;
    unsigned long long getPos() override;
    /// Behind the end, `read` returns 0 then. A file that has no positions (a pipe) stays where it
    /// is and keeps the failure.
    void setPos(unsigned long long position) override;
    int getError() const override;

    KVURL const& getURL() const noexcept;

private:
    struct File;
    std::unique_ptr<File> file_;
};

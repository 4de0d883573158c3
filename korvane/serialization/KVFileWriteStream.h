#pragma once

#include <korvane/foundation/KVURL.h>
#include <korvane/serialization/KVStream.h>

#include <memory>

/// Writes a file, which it makes or empties when it is built, through a buffer of 51200 bytes.
///
///     KVFileWriteStream file(url);
///     file << "Reel 12\n";
///     file.close();                  // throws if the disk is full
///
/// A file that could not be opened shows in `getError()` at once, and throws at the first write.
/// After a failure the stream stays failed, and what the buffer held is lost.
class KV_EXPORT KVFileWriteStream : public KVStream {
public:
    explicit KVFileWriteStream(KVURL const& url);
    /// Writes what is in the buffer and closes the file. It does not tell of a failure: call
    /// `close()` to learn of one.
    ~KVFileWriteStream() override;

    /// Nothing is read: 0.
    long long read(void* data, unsigned long long length) override;
    /// Returns `length`. Throws KVException_WriteError when the bytes, or those that had to leave
    /// the buffer for them, cannot be written.
    long long write(void const* data, unsigned long long length) override;
    unsigned long long getPos() override;
    /// Anywhere, also behind the end: the gap then reads as zeros. In a file that has no positions
    /// (a pipe), this or the next write throws KVException_WriteError.
    void setPos(unsigned long long position) override;
    int getError() const override;

    /// Writes what is in the buffer and closes the file. Throws KVException_WriteError when that
    /// fails or something failed before. A second call does nothing.
    void close();
    KVURL const& getURL() const noexcept;

private:
    struct File;
    std::unique_ptr<File> file_;
};

#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>

// The two ends of a rewrite. Each call that fails leaves the reason in `errno`, or 0
// there when it is not the system's (the end of the file).

/// A file that is open for reading. Reads at a position go past a window of a page, so that
/// the small ones, the headers, do not each cost a call.
class KVAtomInputStream {
public:
    /// Null, with `errno` set, unless the path leads to a regular file of at least one byte.
    static std::unique_ptr<KVAtomInputStream> open(std::string const& path);
    ~KVAtomInputStream();
    KVAtomInputStream(KVAtomInputStream const&) = delete;
    KVAtomInputStream& operator=(KVAtomInputStream const&) = delete;

    std::uint64_t length() const noexcept { return length_; }
    /// Whether that open file is this very file.
    bool isSameFile(int file) const noexcept;

    /// Where `read` goes on.
    void seek(std::uint64_t position) noexcept { position_ = position; }
    std::uint64_t position() const noexcept { return position_; }
    /// Exactly `count` bytes, through the window when they are few.
    bool read(std::uint8_t* bytes, std::size_t count);
    /// Exactly `count` bytes straight from the file; the position of `read` stays.
    bool readAt(std::uint64_t position, std::uint8_t* bytes, std::size_t count);
    /// How many of the bytes from `position` on lie in a hole, where the file takes no space and
    /// reads as zeros; not above `limit`.
    std::uint64_t holeAt(std::uint64_t position, std::uint64_t limit);
    /// Tells the system that the whole file will be read from front to back.
    void expectSequentialReads() noexcept;

private:
    KVAtomInputStream(int file, std::uint64_t length, std::uint64_t device,
                      std::uint64_t node) noexcept;

    static constexpr std::size_t kWindow = 4096;

    int file_;
    std::uint64_t length_;
    std::uint64_t device_;
    std::uint64_t node_;
    std::uint64_t position_ = 0;
    std::uint64_t windowStart_ = 0;
    std::size_t windowLength_ = 0;
    std::uint8_t window_[kWindow];
    /// The range that `holeAt` found to be without holes.
    std::uint64_t denseStart_ = 0;
    std::uint64_t denseEnd_ = 0;
};

/// A file that is open for writing, and the block in which what is written is gathered.
class KVAtomOutputStream {
public:
    /// Creates the file or empties it. Null, with `errno` set, on failure, and when the path leads
    /// to `input`, which may be null.
    static std::unique_ptr<KVAtomOutputStream> open(std::string const& path,
                                                    KVAtomInputStream const* input);
    ~KVAtomOutputStream();
    KVAtomOutputStream(KVAtomOutputStream const&) = delete;
    KVAtomOutputStream& operator=(KVAtomOutputStream const&) = delete;

    /// Back to an empty file. A pipe or a device goes on where it is.
    bool rewind();
    bool write(std::uint8_t const* bytes, std::size_t count);
    /// The free end of the block, `room()` bytes, at least one: fill it and `commit` what was
    /// filled.
    std::uint8_t* free() noexcept { return block_.get() + filled_; }
    std::size_t room() const noexcept { return kBlock - filled_; }
    /// Counts the next `count` bytes of the free end as written.
    bool commit(std::size_t count);
    /// Whether `skip` can be used: a regular file.
    bool canSkip() const noexcept { return regular_; }
    /// Leaves a hole of `count` bytes.
    bool skip(std::uint64_t count);
    /// Hands all to the system and gives the file its length. Not after a failure.
    bool finish();

private:
    using Block = std::unique_ptr<std::uint8_t[]>;

    KVAtomOutputStream(int file, bool regular, Block block) noexcept;
    bool flush();

    /// Measured: smaller blocks cost calls. With blocks of 128 KB and more, file systems that cache
    /// in large folios must find that much memory in one piece for each, and take several times as
    /// long where the machine's memory is fragmented or comes from a host as it is touched.
    static constexpr std::size_t kBlock = 32 * 1024;

    int file_;
    bool regular_;
    bool endsInHole_ = false;
    std::size_t filled_ = 0;
    /// Of what has been handed to the system, holes included.
    std::uint64_t length_ = 0;
    Block block_;
};

#pragma once

#include <korvane/media/KVAtomBox.h>
#include <korvane/platform/CFURL.h>

#include <atomic>

class KVAtomInputStream;
class KVAtomOutputStream;

/// A QuickTime or MP4 file: the root of its atom tree, and the writer of a changed copy.
///
///     KVAtomBoxFile movie;
///     if (movie.openInputFile(source.cf_url()) != 0 || movie.readAllTrackMediaAtomBoxes() != 0)
///         return;
///     change(*movie.findFirstChild(true, KVAtomType("udta")));      // and updateParentSizes()
///     if (movie.openOutputFile(copy.cf_url()) == 0)
///         movie.writeAtomBoxFileWithUpdates();
///
/// A file is never edited in place. The writer copies the input atom by atom, puts in what was
/// changed in memory, and moves the chunk offsets (`stco`, `co64`) by what the atoms in front of
/// the media data gained or lost. The media data is never held in memory.
///
/// The root's type is 0, its parent null, its offset 0; its size and payload size are the file's
/// length.
///
/// Numbers in the file are big-endian (ISO/IEC 14496-12, 4.2). Status results are 0 for success or
///
///     -1  anything that is not below      -4  EPERM, EACCES
///     -2  ENOENT                          -5  EIO
///     -3  EFBIG, ENOSPC                   -6  EBUSY
///                                         -7  EROFS
///
/// and 2 for a write that was cancelled. Nothing throws; when memory runs out the answer is -1.
///
/// One thread reads, changes and writes. While it writes, others may call `getWriteDoneResult`,
/// `getWritePercentDone` and `cancelWrite`.
///
/// What the writer leaves to its caller:
///
/// - `stco` entries are 32 bits wide and wrap: offsets beyond 4 GiB are damaged without a word.
/// - Only the tables that are in the tree are moved, all of them by `getMediaDataShift`.
/// - Offsets of other kinds (`moof`, `mfra`, `saio`) are not moved.
/// - Bytes behind the last atom that could be read, of the file or of a container whose children
///   were read, are not written.
/// - A failed or cancelled write leaves a partial output file.
class KV_EXPORT KVAtomBoxFile : public KVAtomBox {
public:
    KVAtomBoxFile();
    /// Copies the tree, with its parent pointers leading upward in the copy, and what is known of
    /// the file. No files are open in the copy.
    KVAtomBoxFile(KVAtomBoxFile const& other);
    KVAtomBoxFile& operator=(KVAtomBoxFile const&) = delete;
    ~KVAtomBoxFile() override;

    /// The code for the current `errno`.
    static int getErrorCode() noexcept;

    // --- Read ---

    /// Opens a regular file and forgets the tree of the one before. A null URL gives -1 and changes
    /// nothing; an empty file, a directory or a device -1, and then no input is open.
    virtual int openInputFile(CFURLRef url);
    void closeInputFile() noexcept;
    /// This object.
    KVAtomBox* getTopAtomBox() noexcept { return this; }

    /// Reads one header where the input stands and leaves it behind the header. `available` is what
    /// is left in the parent; a 32-bit size of 0 stands for all of it. Null pointers are passed
    /// over. -1 for a size that exceeds `available` or does not hold its own header.
    int readAtomBoxHeader(unsigned int* type, unsigned long long* size,
                          unsigned long long* payloadSize, unsigned long long available);
    /// Replaces the parent's children and payload data by the headers in its payload. The first one
    /// that can not be read ends the list quietly: junk at the end of a parent is not in the tree.
    /// At most 2^22 children are read.
    int readChildAtomBoxHeaders(KVAtomBox* parent);
    /// The root's children.
    int readTopLevelAtomBoxHeaders();
    /// The payload as it is in the file, whatever is in memory. -1 when it does not lie in the file
    /// or exceeds its parent's.
    int readAtomBoxPayload(KVAtomBox const* atom, CFMutableDataRef data);

    /// The brand from `ftyp` (ISO/IEC 14496-12, 4.3): the major brand if it is valid, else the
    /// first compatible one that is, else the major brand. 0 without `ftyp`. Read once a file, with
    /// the top-level headers if they are not there yet.
    unsigned int getFileType();
    bool isFileValidType() { return isValidType(getFileType()); }
    /// avc1, iso2 to iso6, isom, mp41, mp42, "M4A ", "M4V ", "qt  ".
    static bool isValidType(unsigned int type) noexcept;

    // --- Tracks ---

    /// Reads down to the children of `stbl` in every track. -1 unless there is exactly one `moov`;
    /// one that already has children is left as it is.
    int readAllTrackMediaAtomBoxes();
    /// Appends the tracks with that handler ("vide", "soun", ...) that are enabled (flag 0 of
    /// `tkhd`) if `enabled` is not 0 and disabled if it is. The first track that can not be read
    /// ends the search with its code. No track at all gives 0.
    int findTracks(std::vector<KVAtomBox*>& found, unsigned int handlerType, int enabled);
    /// From `tkhd` and the first `hdlr` of a track. Null pointers are passed over.
    int readTrackInfo(KVAtomBox const* track, unsigned int* handlerType, int* enabled);
    /// The payload of the track's first `stsd`.
    int readTrackSampleDescription(KVAtomBox const* track, CFMutableDataRef data);

    // --- Write ---

    /// Creates or truncates. A null URL, and one that leads to the open input, gives -1.
    int openOutputFile(CFURLRef url);
    void closeOutputFile() noexcept;
    /// By how many bytes the chunk offsets move: the sizes of the top-level atoms in front of the
    /// first `mdat`, less its offset in the input. Atoms made in memory have offset 0 and count as
    /// in front of it wherever they stand, so new top-level atoms belong before `mdat`. Containers
    /// that their children do not fill are re-measured first.
    long long getMediaDataShift();
    /// Writes the whole file. Chunk tables are read from the input each time, so a file may be
    /// written again. Atoms that were not touched are copied as they are, in pieces of at most 4096
    /// bytes with a look at the cancel flag before each; holes of the input become holes.
    int writeAtomBoxFileWithUpdates();

    /// 0 while no write has ended, 1 after success, 2 after a cancelled one, else its code.
    int getWriteDoneResult() const noexcept { return writeDoneResult_; }
    /// In percent of the input, so that a file which grows passes 100.
    double getWritePercentDone() const noexcept;
    /// Makes a running write end with 2. The next write starts afresh.
    void cancelWrite() noexcept { cancelWrite_ = true; }

protected:
    /// `count` bytes of the payload in the file from its start on; -1 if it is shorter.
    int readPayloadStart(KVAtomBox const* atom, std::uint8_t* bytes, std::size_t count);

private:
    unsigned int readFileType();
    int updateSampleChunkOffsetTables();
    static void updateSampleChunkOffsetTable(KVAtomBox const& atom, CFMutableDataRef data,
                                             long long delta) noexcept;
    void dropMovedTables(std::vector<KVAtomBox*> const& tables);
    int writeAtomBox(KVAtomBox const& root);
    int writeAtomBoxHeader(KVAtomBox const& atom);
    int copyAtomBox(KVAtomBox const& atom);

    std::unique_ptr<KVAtomInputStream> input_;
    std::unique_ptr<KVAtomOutputStream> output_;
    unsigned int fileType_ = 0;
    long long fileLength_ = 0;
    unsigned long long mediaDataOffset_ = 0;
    std::atomic<int> writeDoneResult_{0};
    std::atomic<bool> cancelWrite_{false};
    std::atomic<long long> writeAmountDone_{0};
};

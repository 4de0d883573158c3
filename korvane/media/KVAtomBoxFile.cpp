#include <korvane/media/KVAtomBoxFile.h>

#include <korvane/media/KVAtomBytes_p.h>
#include <korvane/media/KVAtomStatus_p.h>
#include <korvane/media/KVAtomStreams_p.h>

#include <algorithm>
#include <cerrno>
#include <utility>

namespace {

constexpr std::uint64_t kPiece = 4096;
/// A hole shorter than this is copied as zeros.
constexpr std::uint64_t kSmallestHole = 64 * 1024;
constexpr int kCancelled = 2;

} // namespace

KVAtomBoxFile::KVAtomBoxFile() = default;

KVAtomBoxFile::KVAtomBoxFile(KVAtomBoxFile const& other)
    : KVAtomBox(other),
      fileType_(other.fileType_),
      fileLength_(other.fileLength_),
      mediaDataOffset_(other.mediaDataOffset_)
{
    repairParents();
}

KVAtomBoxFile::~KVAtomBoxFile() = default;

int KVAtomBoxFile::getErrorCode() noexcept
{
    switch (errno) {
    case ENOENT:
        return -2;
    case EFBIG:
    case ENOSPC:
        return -3;
    case EPERM:
    case EACCES:
        return -4;
    case EIO:
        return -5;
    case EBUSY:
        return -6;
    case EROFS:
        return -7;
    default:
        return -1;
    }
}

int KVAtomBoxFile::openInputFile(CFURLRef url)
{
    if (!url)
        return -1;
    closeInputFile();
    removeAllChildren();
    setPayloadData(nullptr);
    setOffset(0);
    setSize(0);
    setPayloadSize(0);
    setType(0);
    setParent(nullptr);
    fileType_ = 0;
    fileLength_ = 0;
    mediaDataOffset_ = 0;
    return orOutOfMemory([&] {
        input_ = KVAtomInputStream::open(CFURLGetFileSystemPath(url));
        if (!input_)
            return getErrorCode();
        fileLength_ = static_cast<long long>(input_->length());
        setSize(input_->length());
        setPayloadSize(input_->length());
        return 0;
    });
}

void KVAtomBoxFile::closeInputFile() noexcept
{
    input_ = nullptr;
}

int KVAtomBoxFile::readAtomBoxHeader(unsigned int* type, unsigned long long* size,
                                     unsigned long long* payloadSize, unsigned long long available)
{
    if (!input_)
        return -1;
    AtomHeader header;
    auto const next = [&](std::uint8_t(&bytes)[8]) {
        return input_->read(bytes, sizeof bytes) ? 0 : getErrorCode();
    };
    if (int const code = ::readAtomHeader(next, available, header))
        return code;
    if (type)
        *type = header.type;
    if (size)
        *size = header.size;
    if (payloadSize)
        *payloadSize = header.payloadSize;
    return 0;
}

int KVAtomBoxFile::readChildAtomBoxHeaders(KVAtomBox* parent)
{
    if (!parent || !input_)
        return -1;
    parent->removeAllChildren();
    parent->setPayloadData(nullptr);
    return orOutOfMemory([&] {
        unsigned long long offset = parent->getOffset() + parent->getHeaderSize();
        unsigned long long available = parent->getPayloadSize();
        while (parent->getChildCount() < kMostChildAtoms) {
            auto child = std::make_unique<KVAtomBox>();
            input_->seek(offset);
            if (readAtomBoxHeader(&child->type_, &child->size_, &child->payloadSize_, available) !=
                0)
                break;
            child->offset_ = offset;
            child->parent_ = parent;
            offset += child->size_;
            available -= child->size_;
            parent->children_.push_back(std::move(child));
        }
        return 0;
    });
}

int KVAtomBoxFile::readTopLevelAtomBoxHeaders()
{
    if (readChildAtomBoxHeaders(this) != 0)
        return -1;
    KVAtomBox const* const mediaData = findFirstChild(true, KVAtomType("mdat"));
    mediaDataOffset_ = mediaData ? mediaData->getOffset() : 0;
    return 0;
}

int KVAtomBoxFile::readAtomBoxPayload(KVAtomBox const* atom, CFMutableDataRef data)
{
    if (!atom || !data || !input_)
        return -1;
    std::uint64_t const size = atom->getPayloadSize();
    std::uint64_t const start = atom->getOffset() + atom->getHeaderSize();
    std::uint64_t const fileSize = input_->length();
    if (atom->getParent() && size > atom->getParent()->getPayloadSize())
        return -1;
    if (size > fileSize || start > fileSize - size)
        return -1;
    return orOutOfMemory([&] {
        data->setLength(static_cast<std::size_t>(size));
        return input_->readAt(start, data->mutableBytes(), data->length()) ? 0 : getErrorCode();
    });
}

int KVAtomBoxFile::readPayloadStart(KVAtomBox const* atom, std::uint8_t* bytes, std::size_t count)
{
    if (!atom || !input_ || atom->getPayloadSize() < count)
        return -1;
    return input_->readAt(atom->getOffset() + atom->getHeaderSize(), bytes, count) ? 0
                                                                                   : getErrorCode();
}

unsigned int KVAtomBoxFile::getFileType()
{
    if (fileType_ == 0)
        fileType_ = readFileType();
    return fileType_;
}

unsigned int KVAtomBoxFile::readFileType()
{
    if (!input_)
        return 0;
    if (getChildCount() == 0)
        readTopLevelAtomBoxHeaders();
    KVAtomBox const* const atom = findFirstChild(false, KVAtomType("ftyp"));
    // Major brand, minor version, compatible brands.
    std::uint8_t word[4];
    if (readPayloadStart(atom, word, sizeof word) != 0)
        return 0;
    auto const major = static_cast<unsigned int>(readBigEndian(word, 4));
    if (isValidType(major))
        return major;
    input_->seek(atom->getOffset() + atom->getHeaderSize() + 8);
    for (std::uint64_t position = 8; position + 4 <= atom->getPayloadSize(); position += 4) {
        if (!input_->read(word, sizeof word))
            return 0;
        auto const brand = static_cast<unsigned int>(readBigEndian(word, 4));
        if (isValidType(brand))
            return brand;
    }
    return major;
}

bool KVAtomBoxFile::isValidType(unsigned int type) noexcept
{
    static constexpr unsigned int kValid[] = {
        KVAtomType("avc1"), KVAtomType("iso2"), KVAtomType("iso3"), KVAtomType("iso4"),
        KVAtomType("iso5"), KVAtomType("iso6"), KVAtomType("isom"), KVAtomType("mp41"),
        KVAtomType("mp42"), KVAtomType("M4A "), KVAtomType("M4V "), KVAtomType("qt  ")};
    return std::find(std::begin(kValid), std::end(kValid), type) != std::end(kValid);
}

int KVAtomBoxFile::readAllTrackMediaAtomBoxes()
{
    if (!input_)
        return -1;
    if (getChildCount() == 0)
        readTopLevelAtomBoxHeaders();
    return orOutOfMemory([&] {
        std::vector<KVAtomBox*> movies;
        findAllChildren(movies, true, KVAtomType("moov"));
        if (movies.size() != 1)
            return -1;
        // A tree that is there may hold changes.
        if (movies[0]->getChildCount() > 0)
            return 0;
        readChildAtomBoxHeaders(movies[0]);
        std::vector<KVAtomBox*> tracks;
        movies[0]->findAllChildren(tracks, false, KVAtomType("trak"));
        for (KVAtomBox* atom : tracks) {
            readChildAtomBoxHeaders(atom);
            for (unsigned int type : {KVAtomType("mdia"), KVAtomType("minf"), KVAtomType("stbl")}) {
                atom = atom->findFirstChild(false, type);
                if (!atom)
                    break;
                readChildAtomBoxHeaders(atom);
            }
        }
        return 0;
    });
}

int KVAtomBoxFile::findTracks(std::vector<KVAtomBox*>& found, unsigned int handlerType, int enabled)
{
    return orOutOfMemory([&] {
        std::vector<KVAtomBox*> tracks;
        findAllChildren(tracks, true, KVAtomType("trak"));
        for (KVAtomBox* track : tracks) {
            unsigned int trackHandler = 0;
            int trackEnabled = 0;
            if (int const code = readTrackInfo(track, &trackHandler, &trackEnabled))
                return code;
            if (trackHandler == handlerType && (trackEnabled != 0) == (enabled != 0))
                found.push_back(track);
        }
        return 0;
    });
}

int KVAtomBoxFile::readTrackInfo(KVAtomBox const* track, unsigned int* handlerType, int* enabled)
{
    if (!track || !input_)
        return -1;
    // Version and flags (ISO/IEC 14496-12, 8.3.2); bit 0 of the flags is "enabled".
    std::uint8_t header[4];
    if (int const code = readPayloadStart(track->findFirstChild(true, KVAtomType("tkhd")), header,
                                          sizeof header))
        return code;
    // Version and flags, a reserved word, the handler (8.4.3).
    std::uint8_t handler[12];
    if (int const code = readPayloadStart(track->findFirstChild(true, KVAtomType("hdlr")), handler,
                                          sizeof handler))
        return code;
    if (enabled)
        *enabled = header[3] & 1;
    if (handlerType)
        *handlerType = static_cast<unsigned int>(readBigEndian(handler + 8, 4));
    return 0;
}

int KVAtomBoxFile::readTrackSampleDescription(KVAtomBox const* track, CFMutableDataRef data)
{
    if (!track)
        return -1;
    return readAtomBoxPayload(track->findFirstChild(true, KVAtomType("stsd")), data);
}

int KVAtomBoxFile::openOutputFile(CFURLRef url)
{
    if (!url)
        return -1;
    closeOutputFile();
    return orOutOfMemory([&] {
        output_ = KVAtomOutputStream::open(CFURLGetFileSystemPath(url), input_.get());
        if (!output_)
            return getErrorCode();
        writeDoneResult_ = 0;
        cancelWrite_ = false;
        writeAmountDone_ = 0;
        return 0;
    });
}

void KVAtomBoxFile::closeOutputFile() noexcept
{
    output_ = nullptr;
}

double KVAtomBoxFile::getWritePercentDone() const noexcept
{
    return fileLength_ > 0
               ? static_cast<double>(writeAmountDone_) * 100.0 / static_cast<double>(fileLength_)
               : 0.0;
}

long long KVAtomBoxFile::getMediaDataShift()
{
    fitSizes();
    unsigned long long inFront = 0;
    for (auto const& child : children_)
        if (child->offset_ < mediaDataOffset_)
            inFront += child->size_;
    return children_.empty() ? 0 : static_cast<long long>(inFront - mediaDataOffset_);
}

int KVAtomBoxFile::updateSampleChunkOffsetTables()
{
    std::vector<KVAtomBox*> tables;
    findAllChildren(tables, true, KVAtomType("stco"));
    findAllChildren(tables, true, KVAtomType("co64"));
    dropMovedTables(tables);
    if (getMediaDataShift() == 0)
        return 0;

    std::vector<KVCFRef<CFMutableDataRef>> payloads;
    for (KVAtomBox const* table : tables) {
        payloads.push_back(KVCFRef<CFMutableDataRef>::adopt(CFDataCreateMutable(nullptr, 0)));
        if (int const code = readAtomBoxPayload(table, payloads.back()))
            return code;
    }
    for (std::size_t i = 0; i < tables.size(); ++i) {
        KVAtomBox& table = *tables[i];
        table.removeAllChildren();
        table.payloadData_ = payloads[i].get();
        table.holdsMovedTable_ = true;
        // A table that had a 16-byte header and is now written with one of 8 shrinks.
        if (table.getHeaderSize() != table.getWrittenHeaderSize()) {
            table.updateSize();
            table.updateParentSizes();
        }
    }
    long long const shift = getMediaDataShift();
    for (std::size_t i = 0; i < tables.size(); ++i)
        updateSampleChunkOffsetTable(*tables[i], payloads[i], shift);
    return 0;
}

void KVAtomBoxFile::updateSampleChunkOffsetTable(KVAtomBox const& atom, CFMutableDataRef data,
                                                 long long delta) noexcept
{
    // Version and flags, a 32-bit count, the entries (ISO/IEC 14496-12, 8.7.5). Sums wrap.
    int const width = atom.getType() == KVAtomType("co64") ? 8 : 4;
    std::size_t const length = data->length();
    if (length < 8)
        return;
    std::uint8_t* const bytes = data->mutableBytes();
    std::uint64_t const count = readBigEndian(bytes + 4, 4);
    if (8 + count * static_cast<std::uint64_t>(width) > length)
        return;
    for (std::uint8_t* entry = bytes + 8; entry != bytes + 8 + count * width; entry += width)
        writeBigEndian(entry, width,
                       readBigEndian(entry, width) + static_cast<std::uint64_t>(delta));
}

void KVAtomBoxFile::dropMovedTables(std::vector<KVAtomBox*> const& tables)
{
    // The tables that an earlier write adjusted: this write may need another shift, or none.
    for (KVAtomBox* table : tables) {
        if (!table->holdsMovedTable_)
            continue;
        table->setPayloadData(nullptr);
        input_->seek(table->offset_);
        unsigned long long const size = table->size_;
        readAtomBoxHeader(nullptr, &table->size_, &table->payloadSize_,
                          input_->length() - table->offset_);
        if (table->size_ != size)
            table->updateParentSizes();
    }
}

int KVAtomBoxFile::writeAtomBoxFileWithUpdates()
{
    if (!input_ || !output_)
        return -1;
    if (int const code = orOutOfMemory([&] { return updateSampleChunkOffsetTables(); }))
        return code;
    input_->seek(0);
    input_->expectSequentialReads();
    writeDoneResult_ = 0;
    cancelWrite_ = false;
    writeAmountDone_ = 0;
    int result = orOutOfMemory([&] {
        int const code = output_->rewind() ? writeAtomBox(*this) : getErrorCode();
        // What is still gathered goes out also when cancelled, but after a failure it would only
        // fail again.
        if ((code == 0 || code == kCancelled) && !output_->finish() && code == 0)
            return getErrorCode();
        return code;
    });
    if (cancelWrite_)
        result = kCancelled;
    writeDoneResult_ = result == 0 ? 1 : result;
    return result;
}

int KVAtomBoxFile::writeAtomBox(KVAtomBox const& root)
{
    // The containers that are being written, each with the child that comes next.
    std::vector<std::pair<KVAtomBox const*, std::size_t>> path;
    auto const begin = [&](KVAtomBox const& atom) -> int {
        CFDataRef const data = atom.payloadData_;
        if (!data && atom.children_.empty() && atom.payloadSize_ > 0)
            return copyAtomBox(atom);
        if (!data && atom.children_.empty() && atom.size_ == 0)
            return 0;
        if (int const code = writeAtomBoxHeader(atom))
            return code;
        if (data) {
            if (!output_->write(data->bytes(), data->length()))
                return getErrorCode();
            writeAmountDone_ += static_cast<long long>(atom.size_);
            return cancelWrite_ ? kCancelled : 0;
        }
        if (atom.children_.empty())
            writeAmountDone_ += static_cast<long long>(atom.size_);
        else
            path.emplace_back(&atom, 0);
        return 0;
    };

    int code = begin(root);
    while (code == 0 && !path.empty()) {
        auto& [container, next] = path.back();
        if (next == container->children_.size())
            path.pop_back();
        else
            code = begin(*container->children_[next++]);
    }
    return code;
}

int KVAtomBoxFile::writeAtomBoxHeader(KVAtomBox const& atom)
{
    std::uint8_t header[16];
    unsigned int const length = atom.getWrittenHeaderSize();
    writeBigEndian(header, 4, length == 16 ? 1 : atom.size_);
    writeBigEndian(header + 4, 4, atom.type_);
    writeBigEndian(header + 8, 8, atom.size_);
    return output_->write(header, length) ? 0 : getErrorCode();
}

int KVAtomBoxFile::copyAtomBox(KVAtomBox const& atom)
{
    std::uint64_t position = atom.offset_;
    std::uint64_t left = atom.size_;
    while (left > 0) {
        std::uint64_t const hole = output_->canSkip() ? input_->holeAt(position, left) : 0;
        bool const skipping = hole >= kSmallestHole;
        std::uint64_t const count =
            skipping ? hole : std::min<std::uint64_t>(left, output_->room());
        // The bytes are fetched by the block, then given away by the piece.
        bool const fetched =
            skipping ? output_->skip(count)
                     : input_->readAt(position, output_->free(), static_cast<std::size_t>(count));
        if (!fetched)
            return cancelWrite_ ? kCancelled : getErrorCode();
        for (std::uint64_t done = 0; done < count;) {
            std::uint64_t const piece = std::min(kPiece, count - done);
            if (cancelWrite_ || !(skipping || output_->commit(static_cast<std::size_t>(piece))))
                return cancelWrite_ ? kCancelled : getErrorCode();
            writeAmountDone_ += static_cast<long long>(piece);
            done += piece;
        }
        position += count;
        left -= count;
    }
    return 0;
}

#include <korvane/media/KVAtomBoxFile.h>

#include "media/Movie.h"

#include <cerrno>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <memory>
#include <sys/stat.h>
#include <unistd.h>

namespace {

int open(KVAtomBoxFile& file, std::string const& path)
{
    return file.openInputFile(KVURL(path.c_str()).cf_url());
}

/// A file with these bytes, open.
class Opened {
public:
    explicit Opened(std::string_view bytes)
    {
        EXPECT_EQ(open(*file_, folder_.write("in", bytes)), 0);
    }
    KVAtomBoxFile* operator->() { return file_.get(); }
    KVAtomBoxFile& operator*() { return *file_; }

private:
    TemporaryFolder folder_;
    std::unique_ptr<KVAtomBoxFile> file_ = std::make_unique<KVAtomBoxFile>();
};

KVCFRef<CFMutableDataRef> emptyData()
{
    return KVCFRef<CFMutableDataRef>::adopt(new __CFData());
}

} // namespace

TEST(KVAtomBoxFile, ErrorCodesFollowErrno)
{
    struct Row {
        int error;
        int code;
    } const rows[] = {{ENOENT, -2},  {EFBIG, -3},  {ENOSPC, -3}, {EPERM, -4},
                      {EACCES, -4},  {EIO, -5},    {EBUSY, -6},  {EROFS, -7},
                      {ENOTDIR, -1}, {EISDIR, -1}, {EINTR, -1},  {0, -1}};
    for (Row const& row : rows) {
        errno = row.error;
        EXPECT_EQ(KVAtomBoxFile::getErrorCode(), row.code) << row.error;
    }
}

TEST(KVAtomBoxFile, OpeningGivesTheStatedCodes)
{
    TemporaryFolder const folder;
    std::string const movie = folder.write("movie", atom("free"));
    ASSERT_EQ(mkfifo(folder.path("pipe").c_str(), 0600), 0);
    ASSERT_EQ(chmod(folder.write("secret", atom("free")).c_str(), 0), 0);
    std::filesystem::permissions(folder.path("."), std::filesystem::perms::all);
    struct Row {
        std::string path;
        int code;
    } const rows[] = {
        {movie, 0},
        {folder.path("missing"), -2},
        {folder.path("."), -1},
        {folder.path("pipe"), -1},
        {folder.write("empty", ""), -1},
        {folder.path("secret"), -4},
    };
    Unprivileged const unprivileged;
    for (Row const& row : rows) {
        KVAtomBoxFile file;
        EXPECT_EQ(open(file, row.path), row.code) << row.path;
        // Of a failure nothing is left.
        EXPECT_EQ(file.getSize(), row.code == 0 ? 8u : 0u);
        EXPECT_EQ(file.readTopLevelAtomBoxHeaders(), row.code == 0 ? 0 : -1);
    }
}

TEST(KVAtomBoxFile, AnotherInputForgetsTheFirst)
{
    Opened file(atom("ftyp", "qt  ") + atom("mdat"));
    EXPECT_EQ(file->getFileType(), KVAtomType("qt  "));
    EXPECT_EQ(file->openInputFile(nullptr), -1);
    EXPECT_EQ(show(*file), "0(ftyp mdat)") << "a null URL changes nothing";
    EXPECT_EQ(open(*file, "/none/movie"), -2);
    EXPECT_EQ(show(*file), "0");
    EXPECT_EQ(file->getFileType(), 0u);
}

TEST(KVAtomBoxFile, HeadersAreReadByTheRulesOfSizes)
{
    struct Row {
        std::string header; // hexadecimal, without the type
        std::uint64_t available;
        int code;
        std::uint64_t size, payloadSize;
    } const rows[] = {
        {"00000008", 7, -1, 0, 0},
        {"00000014", 20, 0, 20, 12},
        {"00000014", 19, -1, 0, 0},
        {"00000000", 100, 0, 100, 92},
        {"00000007", 100, -1, 0, 0},
        {"FFFFFFFF", 0xFFFFFFFF, 0, 0xFFFFFFFF, 0xFFFFFFF7},
        {"FFFFFFFF", 0xFFFFFFFE, -1, 0, 0},
        {"00000001 0000000000000010", 16, 0, 16, 0},
        {"00000001 0000000000000010", 15, -1, 0, 0},
        // Below 16 the payload size wraps, and is refused.
        {"00000001 000000000000000F", 100, -1, 0, 0},
        {"00000001 8000000000000000", 0x8000000000000000, 0, 0x8000000000000000,
         0x7FFFFFFFFFFFFFF0},
        {"00000001", 100, -1, 0, 0}, // the file ends before the 64-bit size
    };
    for (Row const& row : rows) {
        std::string const header = fromHex(row.header);
        Opened file(header.substr(0, 4) + "moov" + header.substr(4));
        unsigned int type = 0;
        unsigned long long size = 0, payloadSize = 0;
        EXPECT_EQ(file->readAtomBoxHeader(&type, &size, &payloadSize, row.available), row.code)
            << row.header;
        EXPECT_EQ(size, row.size) << row.header;
        EXPECT_EQ(payloadSize, row.payloadSize) << row.header;
        EXPECT_EQ(type, row.code == 0 ? KVAtomType("moov") : 0u);
    }
    unsigned long long size = 0;
    EXPECT_EQ(KVAtomBoxFile().readAtomBoxHeader(nullptr, &size, nullptr, 100), -1) << "no input";
}

TEST(KVAtomBoxFile, TheFirstUnreadableHeaderEndsAParentQuietly)
{
    struct Row {
        char const* name;
        std::string bytes;
        char const* tree;
        std::uint64_t lastSize;
    } const rows[] = {
        {"sound", atom("ftyp", "isom") + longAtom("mdat", "12"), "0(ftyp mdat)", 18},
        {"size 0 spans to the end", atom("ftyp") + be32(0) + "mdat" + "12345", "0(ftyp mdat)", 13},
        {"size 4", atom("ftyp") + be32(4) + atom("mdat"), "0(ftyp)", 8},
        {"junk shorter than a header", atom("ftyp") + "junk", "0(ftyp)", 8},
        {"cut short", atom("ftyp") + atom("mdat", "1234").substr(0, 11), "0(ftyp)", 8},
        {"nothing but junk", "not a movie at all", "0", 18},
    };
    for (Row const& row : rows) {
        Opened file(row.bytes);
        EXPECT_EQ(file->readTopLevelAtomBoxHeaders(), 0) << row.name;
        EXPECT_EQ(show(*file), row.tree) << row.name;
        KVAtomBox const* const last = file->getChild(file->getChildCount() - 1);
        EXPECT_EQ((last ? last : &*file)->getSize(), row.lastSize) << row.name;
    }
}

TEST(KVAtomBoxFile, ATreeMayBeAsDeepAsTheFileAllows)
{
    constexpr int kDepth = 100'000;
    std::string bytes;
    for (int level = kDepth; level > 0; --level)
        bytes += be32(static_cast<std::uint64_t>(level) * 8) + "deep";
    Opened file(bytes);
    int depth = 0;
    for (KVAtomBox* node = &*file; node; node = node->getChild(0), ++depth)
        ASSERT_EQ(file->readChildAtomBoxHeaders(node), 0);
    EXPECT_EQ(depth, kDepth + 1);

    TemporaryFolder const folder;
    ASSERT_EQ(file->openOutputFile(KVURL(folder.path("out").c_str()).cf_url()), 0);
    EXPECT_EQ(file->writeAtomBoxFileWithUpdates(), 0);
    EXPECT_TRUE(fileBytes(folder.path("out")) == bytes);
}

TEST(KVAtomBoxFile, PayloadsLieInTheirParentAndInTheFile)
{
    Opened file(atom("moov", atom("name", "abcdef")) + atom("free"));
    ASSERT_EQ(file->readTopLevelAtomBoxHeaders(), 0);
    KVAtomBox* const moov = file->getChild(0);
    ASSERT_EQ(file->readChildAtomBoxHeaders(moov), 0);
    KVAtomBox* const name = moov->getChild(0);
    auto const data = emptyData();
    name->setPayloadData(makeData("changed"));
    EXPECT_EQ(file->readAtomBoxPayload(name, data), 0);
    EXPECT_EQ(bytesOf(data), "abcdef") << "from the file, whatever is in memory";

    EXPECT_EQ(file->readAtomBoxPayload(nullptr, data), -1);
    EXPECT_EQ(file->readAtomBoxPayload(name, nullptr), -1);
    struct Row {
        std::uint64_t offset, size, payloadSize;
    } const rows[] = {
        {8, 15 + 8, 15}, // beyond its parent
        {26, 14, 6},     // beyond the end of the file
        {4, 0, 6},       // a header that wraps to before the start
        {0xFFFFFFFFFFFFFFF0, 14, 6},
        {8, 0xFFFFFFFFFFFFFFFF, 0xFFFFFFFFFFFFFFF7},
    };
    for (Row const& row : rows) {
        name->setOffset(row.offset);
        name->setSize(row.size);
        name->setPayloadSize(row.payloadSize);
        EXPECT_EQ(file->readAtomBoxPayload(name, data), -1) << row.offset;
    }
}

TEST(KVAtomBoxFile, TheFileTypeIsTheFirstValidBrand)
{
    std::string const valid = "avc1 iso2 iso3 iso4 iso5 iso6 isom mp41 mp42 M4A  M4V  qt  ";
    for (std::size_t at = 0; at < valid.size(); at += 5)
        EXPECT_TRUE(KVAtomBoxFile::isValidType(static_cast<unsigned>(numberAt(valid, at, 4))));
    for (char const* brand : {"iso1", "iso7", "M4B ", "QT  "})
        EXPECT_FALSE(KVAtomBoxFile::isValidType(static_cast<unsigned>(numberAt(brand, 0, 4))));
    struct Row {
        char const* name;
        std::string bytes;
        std::string type;
        bool valid;
    } const rows[] = {
        {"major", atom("ftyp", "mp42" + be32(0) + "isom"), "mp42", true},
        {"compatible", atom("ftyp", "abcd" + be32(0) + "xxxxisomqt  "), "isom", true},
        {"the minor version is no brand", atom("ftyp", "abcdisom"), "abcd", false},
        {"a word cut short is none", atom("ftyp", "abcd" + be32(0) + "iso"), "abcd", false},
        {"none valid", atom("ftyp", "abcd" + be32(0) + "efgh"), "abcd", false},
        {"too short", atom("ftyp", "qt "), be32(0), false},
        {"no ftyp", atom("moov"), be32(0), false},
        {"not at the top", atom("moov", atom("ftyp", "isom")), be32(0), false},
        {"the first one counts", atom("ftyp", "abcd") + atom("ftyp", "isom"), "abcd", false},
    };
    for (Row const& row : rows) {
        Opened file(row.bytes);
        EXPECT_EQ(file->isFileValidType(), row.valid) << row.name;
        EXPECT_EQ(be32(file->getFileType()), row.type) << row.name;
    }
    EXPECT_EQ(KVAtomBoxFile().getFileType(), 0u);
}

TEST(KVAtomBoxFile, TracksAreReadDownToTheirTables)
{
    Opened file(fileBytes(sampleMovie("colr.mp4")));
    ASSERT_EQ(file->readAllTrackMediaAtomBoxes(), 0);
    EXPECT_EQ(show(*file), "0(ftyp moov(mvhd trak(tkhd edts mdia(mdhd hdlr minf(vmhd dinf stbl("
                           "stsd stts stss ctts stsc stsz stco)))) udta) free mdat)");
    KVAtomBox* const moov = file->getChild(1);
    moov->removeChild(2);
    EXPECT_EQ(file->readAllTrackMediaAtomBoxes(), 0);
    EXPECT_EQ(moov->getChildCount(), 2) << "a tree that is there may hold changes";

    struct Row {
        char const* name;
        std::string bytes;
        int code;
        char const* tree;
    } const rows[] = {
        {"no moov", atom("ftyp") + atom("mdat"), -1, "0(ftyp mdat)"},
        {"two", atom("moov", atom("mvhd")) + atom("moov"), -1, "0(moov moov)"},
        {"no minf", atom("moov", atom("trak", atom("mdia", atom("mdhd")))), 0,
         "0(moov(trak(mdia(mdhd))))"},
        {"stbl only below minf", atom("moov", atom("trak", atom("stbl", atom("stsd")))), 0,
         "0(moov(trak(stbl)))"},
    };
    for (Row const& row : rows) {
        Opened other(row.bytes);
        EXPECT_EQ(other->readAllTrackMediaAtomBoxes(), row.code) << row.name;
        EXPECT_EQ(show(*other), row.tree) << row.name;
    }
    EXPECT_EQ(KVAtomBoxFile().readAllTrackMediaAtomBoxes(), -1);
    EXPECT_EQ(KVAtomBoxFile().readChildAtomBoxHeaders(moov), -1);
    EXPECT_EQ(file->readChildAtomBoxHeaders(nullptr), -1);
}

TEST(KVAtomBoxFile, TracksAreFoundByHandlerAndFlag)
{
    Opened file(atom("ftyp", "isom") + movieAtom({{"vide", 2, "first", {}},
                                                  {"soun", 1, "second", {}},
                                                  {"vide", 0xF, "third", {}},
                                                  {"vide", 1, "fourth", {}}}));
    ASSERT_EQ(file->readAllTrackMediaAtomBoxes(), 0);
    struct Row {
        char const* handler;
        int enabled;
        std::vector<std::string> found;
    } const rows[] = {
        {"vide", 1, {"third", "fourth"}},
        {"vide", 0, {"first"}},
        {"soun", 1, {"second"}},
        {"soun", 0, {}},
        {"url ", 1, {}},
    };
    for (Row const& row : rows) {
        std::vector<KVAtomBox*> tracks{nullptr};
        auto const type = static_cast<unsigned int>(numberAt(row.handler, 0, 4));
        EXPECT_EQ(file->findTracks(tracks, type, row.enabled), 0);
        ASSERT_EQ(tracks.size(), row.found.size() + 1) << "the vector is not cleared";
        for (std::size_t i = 0; i < row.found.size(); ++i) {
            auto const data = emptyData();
            EXPECT_EQ(file->readTrackSampleDescription(tracks[i + 1], data), 0);
            EXPECT_EQ(bytesOf(data), row.found[i]);
        }
    }
}

TEST(KVAtomBoxFile, ATrackThatCanNotBeReadEndsTheSearch)
{
    std::string const good = trackAtom({"vide", 1, "stsd", {}}), tkhd = atom("tkhd", be32(1));
    auto const hdlr = [](std::string const& end) {
        return atom("mdia", atom("hdlr", be64(0) + end));
    };
    struct Row {
        char const* name;
        std::string track;
        int code;
    } const rows[] = {
        {"sound", good, 0},
        {"no tkhd", atom("trak", hdlr("vide")), -1},
        {"no hdlr", atom("trak", tkhd), -1},
        {"tkhd of 3 bytes", atom("trak", atom("tkhd", "123") + hdlr("vide")), -1},
        {"hdlr of 11 bytes", atom("trak", tkhd + hdlr("vid")), -1},
        {"shortest", atom("trak", tkhd + hdlr("vide")), 0},
    };
    for (Row const& row : rows) {
        Opened file(atom("moov", good + row.track + good));
        ASSERT_EQ(file->readAllTrackMediaAtomBoxes(), 0);
        std::vector<KVAtomBox*> tracks;
        EXPECT_EQ(file->findTracks(tracks, KVAtomType("vide"), 1), row.code) << row.name;
        EXPECT_EQ(tracks.size(), row.code == 0 ? 3u : 1u) << row.name;
    }
    Opened file(atom("moov", good));
    ASSERT_EQ(file->readAllTrackMediaAtomBoxes(), 0);
    KVAtomBox* const track = file->findFirstChild(true, KVAtomType("trak"));
    EXPECT_EQ(file->readTrackInfo(nullptr, nullptr, nullptr), -1);
    EXPECT_EQ(file->readTrackSampleDescription(nullptr, emptyData()), -1);
    EXPECT_EQ(file->readTrackSampleDescription(track, nullptr), -1);
    EXPECT_EQ(file->readTrackSampleDescription(track->getChild(0), emptyData()), -1) << "no stsd";
    file->closeInputFile();
    EXPECT_EQ(file->readTrackInfo(track, nullptr, nullptr), -1);
}

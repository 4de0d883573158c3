#include <korvane/media/KVAtomBoxFile.h>

#include "media/Movie.h"

#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <thread>
#include <unistd.h>

using namespace std::string_literals;

namespace {

KVURL url(std::string const& path)
{
    return KVURL(path.c_str());
}

/// Opens the bytes, reads the tree down to the tables, and lets `change` at it.
struct Rewrite {
    TemporaryFolder folder;
    KVAtomBoxFile file;

    explicit Rewrite(std::string_view bytes) : Rewrite() { openAndRead(folder.write("in", bytes)); }
    Rewrite() = default;
    void openAndRead(std::string const& path)
    {
        EXPECT_EQ(file.openInputFile(url(path).cf_url()), 0);
        EXPECT_EQ(file.readTopLevelAtomBoxHeaders(), 0);
        file.readAllTrackMediaAtomBoxes();
    }

    KVAtomBox& find(char const (&type)[5]) { return *file.findFirstChild(true, KVAtomType(type)); }
    /// The bytes of the output.
    std::string write(int expected = 0, std::string const& name = "out")
    {
        EXPECT_EQ(file.openOutputFile(url(folder.path(name)).cf_url()), 0);
        EXPECT_EQ(file.getWriteDoneResult(), 0);
        EXPECT_EQ(file.writeAtomBoxFileWithUpdates(), expected);
        EXPECT_EQ(file.getWriteDoneResult(), expected == 0 ? 1 : expected);
        file.closeOutputFile();
        return fileBytes(folder.path(name));
    }
};

/// A new child with a payload, everything above it measured.
void insertAtom(KVAtomBox& parent, char const (&type)[5], std::string_view payload, int index)
{
    auto* const child = new KVAtomBox(KVAtomType(type));
    child->setParent(&parent);
    parent.insertChild(child, index);
    child->setPayloadData(makeData(payload));
    child->updateSize();
    child->updateParentSizes();
}

void grow(Rewrite& rewrite, std::size_t by)
{
    insertAtom(rewrite.find("moov"), "free", std::string(by - 8, 'x'), 999);
}

std::string makePipe(TemporaryFolder const& folder)
{
    std::string const path = folder.path("pipe");
    EXPECT_EQ(mkfifo(path.c_str(), 0600), 0);
    return path;
}

/// Reads the pipe to its end, at most so many bytes at once, and tells after each how many there
/// were up to there.
template <class See>
std::thread readPipe(std::string const& path, std::size_t most, See see)
{
    return std::thread([=] {
        int const file = ::open(path.c_str(), O_RDONLY);
        char bytes[4096];
        std::size_t total = 0;
        for (ssize_t got; (got = ::read(file, bytes, std::min(most, sizeof bytes))) > 0;)
            see(total += static_cast<std::size_t>(got));
        ::close(file);
    });
}

} // namespace

// --- Movies ---

TEST(KVAtomBoxFileWrite, WhatIsNotTouchedIsCopiedByteForByte)
{
    for (std::string const& name : plainSamples()) {
        Rewrite rewrite;
        rewrite.openAndRead(sampleMovie(name));
        EXPECT_TRUE(rewrite.write() == fileBytes(sampleMovie(name))) << name;
        EXPECT_GT(rewrite.file.getWritePercentDone(), 99) << name;
    }
    Rewrite unread;
    std::string const junk = atom("free") + longAtom("mdat", "123") + "junk";
    ASSERT_EQ(unread.file.openInputFile(url(unread.folder.write("in", junk)).cf_url()), 0);
    EXPECT_EQ(unread.write(), junk) << "a tree that was not read is one piece";
}

TEST(KVAtomBoxFileWrite, SamplesStayTheSameWhateverStandsInFrontOfThem)
{
    for (std::string const& name : plainSamples()) {
        std::string const original = fileBytes(sampleMovie(name));
        std::vector<std::string> const samples = samplesOf(original);
        ASSERT_GE(samples.size(), 24u);
        for (std::size_t const by : {8u, 9u, 5000u}) {
            Rewrite rewrite;
            rewrite.openAndRead(sampleMovie(name));
            grow(rewrite, by);
            bool const inFront = original.find("moov") < original.find("mdat");
            EXPECT_EQ(rewrite.file.getMediaDataShift(), inFront ? static_cast<long long>(by) : 0);
            std::string const changed = rewrite.write();
            EXPECT_EQ(changed.size(), original.size() + by);
            EXPECT_TRUE(samplesOf(changed) == samples) << name << by;
        }
    }
}

TEST(KVAtomBoxFileWrite, ASecondWriteStartsFromTheTablesOfTheInput)
{
    std::string const original = fileBytes(sampleMovie("head-moov.mp4"));
    Rewrite rewrite(original);
    grow(rewrite, 100);
    std::string const first = rewrite.write();
    EXPECT_EQ(rewrite.write(0, "again"), first) << "shifts do not add up";
    KVAtomBox& moov = rewrite.find("moov");
    auto const removeLast = [&] {
        moov.removeChild(moov.getChildCount() - 1);
        moov.updateSize();
        moov.updateParentSizes();
    };
    removeLast();
    EXPECT_TRUE(rewrite.write(0, "back") == original) << "no shift, so the tables of the input";
    removeLast(); // udta: now it is smaller than the input
    EXPECT_TRUE(samplesOf(rewrite.write(0, "less")) == samplesOf(original));
}

// --- Tables ---

TEST(KVAtomBoxFileWrite, TablesMoveByWhatStandsInFrontOfTheFirstMediaData)
{
    struct Row {
        char const* name;
        bool wide;
        std::string entries; // hexadecimal, behind version and flags
        std::string moved;   // by 16
    } const rows[] = {
        {"narrow", false, "00000002 00000100 00000200", "00000002 00000110 00000210"},
        {"wraps", false, "00000001 FFFFFFF8", "00000001 00000008"}, // never widened: meant
        {"wraps too", true, "00000001 FFFFFFFFFFFFFFFF", "00000001 000000000000000F"},
        {"bytes behind stay", false, "00000001 00000001 00000001", "00000001 00000011 00000001"},
        {"too many for its length", false, "00000003 00000100 00000200",
         "00000003 00000100 00000200"},
        {"far too many", true, "FFFFFFFF 0000000000000001", "FFFFFFFF 0000000000000001"},
        {"no count", false, "0000", "0000"},
        {"long header", false, "00000001 00000100", "00000001 00000108"}, // becomes 8 shorter
    };
    for (Row const& row : rows) {
        auto const make = row.name == "long header"s ? longAtom : atom;
        std::string const table = make(row.wide ? "co64" : "stco", be32(0) + fromHex(row.entries));
        std::string const movie =
            atom("moov", atom("trak", atom("mdia", atom("minf", atom("stbl", table)))));
        Rewrite rewrite(movie + atom("mdat", "1234"));
        grow(rewrite, 16);
        std::string const out = rewrite.write();
        EXPECT_EQ(toHex(findPayload(out, row.wide ? "moov/trak/mdia/minf/stbl/co64"
                                                  : "moov/trak/mdia/minf/stbl/stco")),
                  toHex(be32(0) + fromHex(row.moved)))
            << row.name;
    }
}

TEST(KVAtomBoxFileWrite, NewTopLevelAtomsCountAsInFrontWhereverTheyStand)
{
    std::string const movie = atom("ftyp", "isom") + movieAtom({{"vide", 1, "", {112, 116}}});
    struct Row {
        char const* name;
        int index;
        unsigned long long offset;
        int moved;
    } const rows[] = {
        {"in front", 1, 0, 40},
        {"behind, where it moves nothing: meant, the tables are wrong then", 99, 0, 40},
        {"behind, with an offset behind", 99, 5000, 0},
    };
    for (Row const& row : rows) {
        Rewrite rewrite(movie + atom("mdat", "abcdefgh"));
        insertAtom(rewrite.file, "uuid", std::string(32, 'x'), row.index);
        rewrite.file.findFirstChild(false, KVAtomType("uuid"))->setOffset(row.offset);
        EXPECT_EQ(rewrite.file.getMediaDataShift(), row.moved) << row.name;
        std::string const out = rewrite.write();
        std::string_view const table = findPayload(out, "moov/trak/mdia/minf/stbl/stco");
        EXPECT_EQ(numberAt(table, 8, 4), 112u + static_cast<unsigned int>(row.moved)) << row.name;
    }
    // Without media data nothing moves, and neither does it with media data at the very start.
    for (std::string const& bytes : {movie, atom("mdat", "abcdefgh") + movie}) {
        Rewrite rewrite(bytes);
        insertAtom(rewrite.file, "uuid", "x", 0);
        EXPECT_EQ(rewrite.file.getMediaDataShift(), 0);
        rewrite.write();
    }
}

TEST(KVAtomBoxFileWrite, AnInputThatShrankFailsAndATableThatCanNotBeReadStopsTheWriteBeforeItStarts)
{
    Rewrite shrunk(fileBytes(sampleMovie("head-moov.mp4")));
    ASSERT_EQ(truncate(shrunk.folder.path("in").c_str(), 5000), 0);
    shrunk.write(-1);

    Rewrite rewrite(fileBytes(sampleMovie("head-moov.mp4")));
    grow(rewrite, 16);
    rewrite.find("stco").setOffset(1'000'000);
    ASSERT_EQ(rewrite.file.openOutputFile(url(rewrite.folder.path("out")).cf_url()), 0);
    EXPECT_EQ(rewrite.file.writeAtomBoxFileWithUpdates(), -1);
    EXPECT_EQ(rewrite.file.getWriteDoneResult(), 0) << "no state changes";
    EXPECT_EQ(fileBytes(rewrite.folder.path("out")), "");
}

// --- Headers ---

TEST(KVAtomBoxFileWrite, HeadersTakeTheLongFormAbove7FFFFFFE)
{
    struct Row {
        std::uint64_t size, payloadSize;
        std::string written;
    } const rows[] = {
        {0x7FFFFFFE, 1, be32(0x7FFFFFFE) + "uuid"},
        {0x7FFFFFFF, 1, be32(1) + "uuid" + be64(0x7FFFFFFF)},
        {5, 5, ""}, // no header when size is not above payload size
        {0, 0, ""},
    };
    for (Row const& row : rows) {
        Rewrite rewrite(atom("free"));
        insertAtom(rewrite.file, "uuid", "x", 0);
        KVAtomBox& uuid = rewrite.find("uuid");
        uuid.setSize(row.size);
        uuid.setPayloadSize(row.payloadSize);
        EXPECT_EQ(toHex(rewrite.write()), toHex(row.written + "x" + atom("free"))) << row.size;
    }
}

TEST(KVAtomBoxFileWrite, ARebuiltAtomBetweenTheTwoLimitsIsEightBytesShortInItsSize)
{
    // updateSize allows for 16 bytes of header above 0xFFFFFFFE only, the writer uses them above
    // 0x7FFFFFFE: meant.
    TemporaryFolder const folder;
    std::string const path = folder.write(
        "in",
        atom("moov", atom("free") + be32(0x80000000) + "skip").replace(0, 4, be32(0x80000010)));
    ASSERT_EQ(truncate(path.c_str(), 0x80000010), 0);
    Rewrite rewrite;
    rewrite.openAndRead(path);
    ASSERT_EQ(show(rewrite.file), "0(moov(free skip))");
    KVAtomBox& moov = rewrite.find("moov");
    moov.updateSize();
    EXPECT_EQ(moov.getSize(), 0x80000010u);
    ASSERT_EQ(rewrite.file.openOutputFile(url(folder.path("out")).cf_url()), 0);
    EXPECT_EQ(rewrite.file.writeAtomBoxFileWithUpdates(), 0);
    EXPECT_EQ(std::filesystem::file_size(folder.path("out")), 0x80000018u);
    std::string start(32, '\0');
    std::ifstream(folder.path("out"), std::ios::binary).read(start.data(), 32);
    EXPECT_EQ(toHex(start), toHex(be32(1) + "moov" + be64(0x80000010) + atom("free") +
                                  be32(0x80000000) + "skip"));
}

TEST(KVAtomBoxFileWrite, WhatReadingDropsIsMeasuredBeforeTheWrite)
{
    std::string const track = trackAtom({"vide", 1, "", {0}});
    struct Row {
        char const* name;
        std::string front;    // before mdat
        std::string expected; // the same as written
    } const rows[] = {
        {"junk in a container", atom("moov", track + "junk!"), atom("moov", track)},
        {"long header on a small container", longAtom("moov", track), atom("moov", track)},
        {"long header on an empty atom", longAtom("free") + atom("moov", track),
         atom("free") + atom("moov", track)},
        {"untouched leaves keep their long header", longAtom("free", "1") + atom("moov", track),
         longAtom("free", "1") + atom("moov", track)},
    };
    for (Row const& row : rows) {
        std::string front = row.front, expected = row.expected;
        // The chunk is the payload of mdat.
        std::size_t const from = front.find("stco") + 12, to = expected.find("stco") + 12;
        front.replace(from, 4, be32(front.size() + 8));
        expected.replace(to, 4, be32(expected.size() + 8));
        Rewrite rewrite(front + atom("mdat", "data"));
        EXPECT_EQ(toHex(rewrite.write()), toHex(expected + atom("mdat", "data"))) << row.name;
    }
    Rewrite trailing(fileBytes(sampleMovie("tail-moov.mp4")) + "trailing");
    EXPECT_TRUE(trailing.write() == fileBytes(sampleMovie("tail-moov.mp4"))) << "junk is dropped";
}

// --- Large files ---

TEST(KVAtomBoxFileWrite, AFileOf5GiBKeepsItsHoles)
{
    constexpr std::uint64_t kFar = 5ull << 30;
    auto const movie = [](std::uint64_t wideOffset, std::uint64_t narrowOffset) {
        return atom("ftyp", "isom") + movieAtom({{"vide", 1, "", {wideOffset}, true},
                                                 {"soun", 1, "", {narrowOffset & 0xFFFFFFFF}}});
    };
    Rewrite rewrite;
    std::string const path = rewrite.folder.write("in", movie(kFar, kFar) + be32(1) + "mdat" +
                                                            be64(kFar + 4 - movie(0, 0).size()));
    std::filesystem::resize_file(path, kFar);
    std::ofstream(path, std::ios::binary | std::ios::app) << "data";
    rewrite.openAndRead(path);
    grow(rewrite, 32);
    std::string const out = rewrite.folder.path("out");
    ASSERT_EQ(rewrite.file.openOutputFile(url(out).cf_url()), 0);
    ASSERT_EQ(rewrite.file.writeAtomBoxFileWithUpdates(), 0);

    EXPECT_EQ(std::filesystem::file_size(out), kFar + 4 + 32);
    struct stat info = {};
    ASSERT_EQ(stat(out.c_str(), &info), 0);
    EXPECT_LT(info.st_blocks * 512, 16 << 20) << "the hole stays one";
    std::string start(movie(0, 0).size() + 32 + 16, '\0'), sample(4, '\0');
    std::ifstream file(out, std::ios::binary);
    file.read(start.data(), static_cast<std::streamsize>(start.size()));
    file.seekg(kFar + 32).read(sample.data(), 4);
    EXPECT_EQ(sample, "data");
    EXPECT_EQ(toHex(findPayload(start, "moov/trak/mdia/minf/stbl/co64")),
              toHex(be32(0) + be32(1) + be64(kFar + 32)));
    // The narrow table never held the place and wraps further: meant.
    EXPECT_EQ(numberAt(start, start.rfind("stco") + 12, 4), ((kFar + 32) & 0xFFFFFFFF));
}

TEST(KVAtomBoxFileWrite, HolesAtTheEndOfTheFileAreKept)
{
    TemporaryFolder const folder;
    std::string const path = folder.write("in", be32(4 << 20) + "mdat" + "start");
    ASSERT_EQ(truncate(path.c_str(), 4 << 20), 0);
    Rewrite rewrite;
    rewrite.openAndRead(path);
    rewrite.folder.write("out", std::string(5 << 20, 'x')); // what was there is gone
    EXPECT_TRUE(rewrite.write() == fileBytes(path));
}

// --- Failures ---

TEST(KVAtomBoxFileWrite, OutputsThatCanNotBeOpenedGiveTheStatedCodes)
{
    Rewrite rewrite(atom("free", "1234"));
    TemporaryFolder const& folder = rewrite.folder;
    std::filesystem::permissions(folder.path("."), std::filesystem::perms::owner_all);
    std::filesystem::create_hard_link(folder.path("in"), folder.path("hard"));
    std::filesystem::create_symlink(folder.path("in"), folder.path("soft"));
    EXPECT_EQ(rewrite.file.openOutputFile(nullptr), -1);
    struct Row {
        char const* name;
        int code;
    } const rows[] = {{"missing/out", -2}, {".", -1}, {"in", -1}, {"hard", -1}, {"soft", -1}};
    for (Row const& row : rows) {
        EXPECT_EQ(rewrite.file.openOutputFile(url(folder.path(row.name)).cf_url()), row.code)
            << row.name;
        EXPECT_EQ(rewrite.file.writeAtomBoxFileWithUpdates(), -1) << "no output is open";
        EXPECT_EQ(fileBytes(folder.path("in")), atom("free", "1234"))
            << "the input is never touched";
    }
    {
        Unprivileged const unprivileged;
        int const code = rewrite.file.openOutputFile(url(folder.path("out")).cf_url());
        EXPECT_EQ(code, getuid() == 0 ? -4 : 0);
    }
    ASSERT_EQ(rewrite.file.openOutputFile(url(folder.path("out")).cf_url()), 0);
    rewrite.file.closeInputFile();
    EXPECT_EQ(rewrite.file.writeAtomBoxFileWithUpdates(), -1) << "no input is open";
}

TEST(KVAtomBoxFileWrite, AFullDiskIsNoSuccess)
{
    // Small ones fail when the last block is handed over, large ones on the way.
    for (std::size_t const size : {10u, 3u << 20}) {
        Rewrite rewrite(atom("mdat", std::string(size, 'x')));
        insertAtom(rewrite.file, "free", std::string(size, 'x'), 0);
        ASSERT_EQ(rewrite.file.openOutputFile(url("/dev/full").cf_url()), 0);
        EXPECT_EQ(rewrite.file.writeAtomBoxFileWithUpdates(), -3);
        EXPECT_EQ(rewrite.file.getWriteDoneResult(), -3);
        EXPECT_EQ(rewrite.write().size(), 2 * size + 16) << "and can be started again";
    }
}

// --- From another thread ---

TEST(KVAtomBoxFileWrite, ProgressIsSeenFromAnotherThread)
{
    std::string const input = atom("mdat", std::string(2 << 20, 'm'));
    Rewrite rewrite(input);
    std::string const pipe = makePipe(rewrite.folder);
    std::thread reader = readPipe(pipe, 4096, [&](std::size_t total) {
        double const done = rewrite.file.getWritePercentDone() / 100 * double(input.size());
        // A piece is counted once it is written; what is ahead lies in the block and in the pipe.
        EXPECT_GE(done, double(total) - 4096.5);
        EXPECT_LE(done, double(total) + (1 << 18));
        EXPECT_TRUE(rewrite.file.getWriteDoneResult() == 0 || total > input.size() / 2);
    });
    EXPECT_EQ(rewrite.file.openOutputFile(url(pipe).cf_url()), 0);
    EXPECT_EQ(rewrite.file.writeAtomBoxFileWithUpdates(), 0);
    rewrite.file.closeOutputFile();
    reader.join();
    EXPECT_EQ(rewrite.file.getWritePercentDone(), 100);
}

TEST(KVAtomBoxFileWrite, CancellingEndsTheWriteAtEveryStage)
{
    std::string const media(2 << 20, 'm');
    // After so many bytes have come out: in the header and payload in memory, in the copied media
    // data.
    for (std::size_t const after : {1u, 5000u, 400'000u}) {
        Rewrite rewrite(atom("free") + atom("mdat", media));
        insertAtom(rewrite.file, "uuid", std::string(300'000, 'u'), 1);
        std::string const pipe = makePipe(rewrite.folder);
        std::size_t total = 0;
        std::thread reader = readPipe(pipe, after, [&](std::size_t read) {
            total = read;
            if (total >= after)
                rewrite.file.cancelWrite();
        });
        EXPECT_EQ(rewrite.file.openOutputFile(url(pipe).cf_url()), 0);
        EXPECT_EQ(rewrite.file.writeAtomBoxFileWithUpdates(), 2) << after;
        EXPECT_EQ(rewrite.file.getWriteDoneResult(), 2) << after;
        rewrite.file.closeOutputFile();
        reader.join();
        EXPECT_LT(total, media.size()) << "it does not go on to the end";

        rewrite.file.cancelWrite();
        EXPECT_EQ(rewrite.write().size(), media.size() + 300'024) << "the next write starts afresh";
    }
}

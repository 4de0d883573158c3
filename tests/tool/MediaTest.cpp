#include "MovieRewrite.h"
#include "ToolError.h"
#include "media/Movie.h"
#include "tool/Tool.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <iterator>
#include <nlohmann/json.hpp>
#include <sstream>
#include <unistd.h>

using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::Not;

namespace {

using Json = nlohmann::ordered_json;

ToolResult media(std::vector<std::string> arguments)
{
    arguments.insert(arguments.begin(), "media");
    return runTool(arguments);
}

/// `media set` of two files with options as one would type them.
ToolResult set(std::string const& in, std::string const& out, std::string const& options)
{
    std::istringstream words(options);
    std::vector<std::string> arguments{std::istream_iterator<std::string>(words), {}};
    arguments.insert(arguments.begin(), {"set", in, out});
    return media(arguments);
}

/// A movie with two samples in its `mdat`, which follows `moov`; sound throughout.
std::string plainMovie(std::string const& extensions = {}, bool wide = false)
{
    auto const parts = [&](std::uint64_t start) {
        return atom("ftyp", "isom" + be32(0) + "isom") +
               movieAtom({{"vide", 1, videoDescription(extensions), {start, start + 4}, wide}});
    };
    std::string const front = parts(0);
    return parts(front.size() + 8) + atom("mdat", "onlytest");
}

/// With another number at the place of the first entry of the chunk table.
std::string withChunkAt(std::string movie, std::uint64_t offset)
{
    std::size_t const table = movie.find("stco");
    return movie.replace(table + 12, 4, be32(offset));
}

Json jsonOf(ToolResult const& result)
{
    EXPECT_EQ(result.exitCode, 0) << result.messages;
    return Json::parse(result.out);
}

} // namespace

TEST(ToolMedia, TreesShowOffsetsAndSizes)
{
    ScratchFolder const folder;
    std::string const path =
        folder.write("m", plainMovie(atom("pasp", be32(1) + be32(1))) + "junk");
    std::string const text = media({"tree", path}).out;
    for (char const* line :
         {"           0           20  ftyp\n", "          52           20      tkhd\n",
          "         246           16                pasp\n",
          "         350            4  (no atom)\n"})
        EXPECT_THAT(text, HasSubstr(line));
    Json const json = jsonOf(media({"tree", path, "--json"}));
    EXPECT_EQ(json["size"], 354);
    EXPECT_EQ(json["unread_from"], 350);
    EXPECT_EQ(json["atoms"][1]["atoms"][1]["atoms"][0]["offset"], 52);
}

TEST(ToolMedia, TreesOfTwoFilesAreCompared)
{
    ScratchFolder const folder;
    std::string const pasp = atom("pasp", be32(1) + be32(1));
    std::string const before = folder.write("before", plainMovie(pasp + atom("fiel", "12")));
    std::string const after =
        folder.write("after", plainMovie(atom("pasp", be32(4) + be32(3)) + atom("colr", "nclc")));
    std::string const text = media({"tree", after, "--against", before}).out;
    for (char const* line : {"   ftyp\n", " * moov\n", "    mvhd\n", " *               pasp\n",
                             " +               colr\n", " -               fiel\n",
                             " >           stsz\n", " *           stco\n", " > mdat\n"})
        EXPECT_THAT(text, HasSubstr(line));
    EXPECT_EQ(jsonOf(media({"tree", after, "--against", before, "--json"}))["atoms"][2]["change"],
              "moved");
    EXPECT_THAT(media({"tree", before, "--against", before}).out, Not(HasSubstr("*")));
}

TEST(ToolMedia, MetadataIsListed)
{
    Json const quickTime = jsonOf(media({"info", sampleMovie("quicktime-colr.mov"), "--json"}));
    EXPECT_EQ(quickTime["type"], "'qt  '");
    EXPECT_EQ(quickTime["metadata"]["Standard Extensions Metadata"]["color_transfer"], "16");
    // What the library does not tell: "nclx", and the second number of a pair.
    ScratchFolder const folder;
    std::string const path =
        folder.write("m", plainMovie(atom("colr", "nclx" + be16(1) + be16(13) + be16(6) + "\x80") +
                                     atom("pasp", be32(40) + be32(33)) + atom("fiel", "\2\x9")));
    EXPECT_EQ(media({"info", path}).out, "File type 'isom'\n"
                                         "Standard Extensions Metadata\n"
                                         "  field_fields                    2\n"
                                         "  field_detail                    9\n"
                                         "  pixel_aspect_h                  40\n"
                                         "  pixel_aspect_v                  33\n"
                                         "  color_primaries                 1\n"
                                         "  color_transfer                  13\n"
                                         "  color_matrix                    6\n");
    EXPECT_EQ(media({"info", sampleMovie("audio-only.m4a")}).out, "File type 'M4A '\n");
    EXPECT_EQ(media({"info", folder.write("x", atom("ftyp", "abcd"))}).exitCode, 3);
}

TEST(ToolMedia, MetadataIsSetAndStripped)
{
    ScratchFolder const folder;
    std::string const mastering = folder.write(
        "mastering.json", R"({"white_point_x": 15635, "max_content_light_level": "1000"})");
    for (std::string const& name : plainSamples()) {
        std::string const out = folder.path("out"), again = folder.path("again");
        ToolResult const result =
            set(sampleMovie(name), out,
                "--spherical equirectangular --stereo top-bottom --yaw 10 --pitch=-20.5 "
                "--bounds 0,0,0.25,0.5 --colour 9,16,9 --pixel-aspect 4:3 --field 2,9 "
                "--source <a>&\"b' --first-generation --hdr " +
                    mastering);
        EXPECT_EQ(result.exitCode, 0) << name << result.messages;
        EXPECT_THAT(result.messages, HasSubstr("bytes of samples compared"));
        EXPECT_TRUE(samplesOf(fileBytes(out)) == samplesOf(fileBytes(sampleMovie(name)))) << name;
        Json metadata = jsonOf(media({"info", out, "--json"}))["metadata"];
        EXPECT_EQ(
            metadata["Google Version 2 Metadata"].dump(),
            R"({"stereo_mode":"1","metadata_source":"<a>&\"b'","pose_yaw_degrees":"10.000000",)"
            R"("pose_pitch_degrees":"-20.500000","pose_roll_degrees":"0.000000",)"
            R"("projection_bounds_top":"0","projection_bounds_bottom":"0",)"
            R"("projection_bounds_left":"1073741824","projection_bounds_right":"-2147483648"})");
        Json const& first = metadata["Google Version 1 Metadata"];
        EXPECT_EQ(first["GSpherical:StereoMode"], "top-bottom");
        EXPECT_EQ(first["GSpherical:StitchingSoftware"], "<a>&\"b'");
        EXPECT_EQ(metadata["HDR Color and Light Level Metadata"]["white_point_x"], "15635");
        Json const& standard = metadata["Standard Extensions Metadata"];
        EXPECT_EQ(standard["color_transfer"], "16") << "in a form that can be read";

        // Some of it changed, and the rest stays.
        std::string const more = folder.write("more.json", R"({"max_content_light_level": 7})");
        EXPECT_EQ(set(out, again, "--spherical cubemap --hdr " + more).exitCode, 0);
        metadata = jsonOf(media({"info", again, "--json"}))["metadata"];
        Json const& sphere = metadata["Google Version 2 Metadata"];
        EXPECT_EQ(sphere["pose_yaw_degrees"], "10.000000");
        EXPECT_EQ(sphere["cube_layout"], "0");
        EXPECT_FALSE(sphere.contains("projection_bounds_top"));
        EXPECT_EQ(metadata["HDR Color and Light Level Metadata"]["white_point_x"], "15635");
        EXPECT_EQ(metadata["HDR Color and Light Level Metadata"]["max_content_light_level"], "7");

        EXPECT_EQ(media({"strip", out, again, "--spherical", "--hdr"}).exitCode, 0);
        metadata = jsonOf(media({"info", again, "--json"}))["metadata"];
        EXPECT_EQ(metadata.size(), 1u) << metadata;
        EXPECT_TRUE(samplesOf(fileBytes(again)) == samplesOf(fileBytes(out))) << name;
    }
}

TEST(ToolMedia, APlanTellsWhatWouldHappenAndWritesNothing)
{
    ScratchFolder const folder;
    std::string const in = folder.write("in", plainMovie()), out = folder.path("out");
    ToolResult const result = set(in, out, "--pixel-aspect 4:3 --dry-run");
    EXPECT_EQ(result.exitCode, 0);
    EXPECT_EQ(result.out, "* moov: changed, 298 to 314 bytes\n"
                          "* moov/trak: changed, 274 to 290 bytes\n"
                          "* moov/trak/mdia: changed, 246 to 262 bytes\n"
                          "* moov/trak/mdia/minf: changed, 214 to 230 bytes\n"
                          "* moov/trak/mdia/minf/stbl: changed, 182 to 198 bytes\n"
                          "* moov/trak/mdia/minf/stbl/stsd: changed, 102 to 118 bytes\n"
                          "* moov/trak/mdia/minf/stbl/stsd/avc1: changed, 86 to 102 bytes\n"
                          "+ moov/trak/mdia/minf/stbl/stsd/avc1/pasp: new, 16 bytes\n"
                          "> mdat: 16 bytes move from 318 to 334\n"
                          "  moov/trak/mdia/minf/stbl/stco: 2 offsets, shifted by 16\n"
                          "16 bytes move.\n");
    EXPECT_THAT(folder.names(), ElementsAre("in"));
    Json const json = jsonOf(set(in, out, "--pixel-aspect 4:3 --dry-run --json"));
    EXPECT_EQ(json["bytes_moved"], 16);
}

TEST(ToolMedia, RewritesThatWouldDamageAreRefused)
{
    std::string const movie = plainMovie();
    std::string const fragmented = fileBytes(sampleMovie("fragmented.mp4"));
    std::string relative = fragmented; // data offsets from the fragment's own start, and no index
    for (std::size_t at = 0; (at = relative.find("tfhd", at)) != std::string::npos; ++at)
        relative[at + 7] = static_cast<char>(relative[at + 7] & ~1);
    std::string const indexed = relative;
    relative.resize(relative.find("mfra") - 4);
    std::string const external = [&] {
        std::string const dinf =
            atom("dinf", atom("dref", be32(0) + be32(1) + atom("url ", be32(0) + "elsewhere")));
        std::string track = trackAtom({"vide", 1, videoDescription(), {5}});
        return atom("ftyp", "qt  ") + atom("moov", atom("trak", track.substr(8) + dinf)) +
               atom("mdat", "x");
    }();
    std::string const twoMedia = [&] {
        auto const parts = [](std::uint64_t a, std::uint64_t b) {
            return atom("mdat", "4444") + movieAtom({{"vide", 1, videoDescription(), {a, b}}});
        };
        std::uint64_t const second = parts(0, 0).size() + 8;
        return atom("ftyp", "isom") + parts(20, 12 + second) + atom("mdat", "8888");
    }();
    std::string lossy = videoDescription("loss");
    lossy = atom("ftyp", "isom") + movieAtom({{"vide", 1, lossy, {}}});
    struct Row {
        char const* name;
        std::string movie;
        int code;
        char const* message;
    } const rows[] = {
        {"sound", movie, 0, "written"},
        {"cut short", movie.substr(0, movie.size() - 1), 3, "the bytes from 318 on are no atom"},
        {"junk at the end", movie + "junk", 3, "the bytes from 334 on are no atom"},
        {"a sample outside the file", withChunkAt(movie, 0xFFFFFFFB), 3,
         "the file has no such bytes"},
        {"a sample in no media data", withChunkAt(movie, 40), 1,
         "does not lie in an atom that is copied"},
        {"contradicting tables", std::string(movie).replace(movie.find("stco") + 8, 4, be32(3)), 3,
         "contradict each other"},
        {"media data on both sides", twoMedia, 1, "but the table by"},
        {"samples elsewhere", external, 1, "the samples lie in another file"},
        {"absolute fragments", fragmented, 1, "counts its data from the start of the file"},
        {"index of fragments", indexed, 1, "its mfra atom holds the places"},
        {"relative fragments", relative, 0, "written"},
        {"bytes in the description", lossy, 1, "sample description of a video track holds bytes"},
        {"no movie", "hello", 3, "is no QuickTime or MP4 file"},
        {"empty", "", 3, "is empty"},
    };
    for (Row const& row : rows) {
        ScratchFolder const folder;
        std::string const in = folder.write("in", row.movie), out = folder.path("out");
        ToolResult const result = set(in, out, "--spherical equirectangular");
        EXPECT_EQ(result.exitCode, row.code) << row.name;
        EXPECT_THAT(result.messages, HasSubstr(row.message)) << row.name;
        EXPECT_EQ(folder.names().size(), row.code == 0 ? 2u : 1u) << row.name << ": no half files";
        EXPECT_TRUE(fileBytes(in) == row.movie) << row.name;
    }
}

TEST(ToolMedia, OffsetsPastTheir32BitsAreRefused)
{
    ScratchFolder const folder;
    constexpr std::uint64_t kFar = 0xFFFFFFF8;
    for (bool const wide : {false, true}) {
        std::string const front =
            atom("ftyp", "isom") + movieAtom({{"vide", 1, videoDescription(), {kFar}, wide}});
        std::string const in =
            folder.write("in", front + be32(1) + "mdat" + be64(kFar + 4 - front.size()));
        ASSERT_EQ(truncate(in.c_str(), kFar + 4), 0);
        ToolResult const result =
            set(in, folder.path("out"), "--spherical equirectangular --no-verify");
        EXPECT_EQ(result.exitCode, wide ? 0 : 1) << result.messages;
        EXPECT_THAT(result.messages, HasSubstr(wide ? "written" : "past what its 32 bits hold"));
    }
}

TEST(ToolMedia, PathsAndOptionsAreChecked)
{
    ScratchFolder const folder;
    std::string const in = folder.write("in", plainMovie()), out = folder.path("out");
    std::filesystem::create_symlink(in, folder.path("link"));
    struct Row {
        std::string in, out, options;
        int code;
    } const rows[] = {
        {in, in, "--yaw 1", 2},
        {in, folder.path("link"), "--yaw 1", 2},
        {folder.path("missing"), out, "", 4},
        {in, folder.path("missing/out"), "", 4},
        {in, "/dev/full", "", 4},
        {in, "-", "", 4},
        {in, out, "--yaw 181", 2},
        {in, out, "--spherical mesh", 2},
        {in, out, "--spherical cubemap --bounds 0,0,0,0", 2},
        {in, out, "--spherical equirectangular --cube-layout 1", 2},
        {in, out, "--bounds 0,0,0.5,0.5", 2},
        {in, out, "--bounds 0,0,0", 2},
        {in, out, "--colour 9,16,0", 2},
        {in, out, "--pixel-aspect 4/3", 2},
        {in, out, "--field 256,1", 2},
        {in, out, "--source " + std::string(252, 's'), 2},
        {in, out, "--hdr " + folder.write("bad.json", R"({"white_point_x": 70000})"), 3},
        {in, out, "--hdr " + folder.write("unknown.json", R"({"white": 1})"), 3},
        {in, out, "--hdr " + folder.write("text.json", "not json"), 3},
    };
    std::size_t const files = folder.names().size();
    for (Row const& row : rows) {
        ToolResult const result = set(row.in, row.out, row.options);
        EXPECT_EQ(result.exitCode, row.code) << row.out << row.options;
        EXPECT_THAT(result.messages, Not(IsEmpty()));
        EXPECT_EQ(folder.names().size(), files);
    }
    EXPECT_TRUE(fileBytes(in) == plainMovie());
    EXPECT_EQ(media({"strip", in, out}).exitCode, 2);
}

TEST(ToolMedia, AProfileIsNotReplacedByCodePoints)
{
    ScratchFolder const folder;
    std::string const in = folder.write("in", plainMovie(atom("colr", "profile bytes")));
    EXPECT_EQ(set(in, folder.path("out"), "--colour 9,16,9").exitCode, 1);
    // The form that is there stays, with its range.
    std::string const nclx = folder.write(
        "nclx", plainMovie(atom("colr", "nclx" + be16(1) + be16(1) + be16(1) + "\x80")));
    EXPECT_EQ(set(nclx, folder.path("out"), "--colour 9,16,9").exitCode, 0);
    EXPECT_THAT(fileBytes(folder.path("out")),
                HasSubstr("nclx" + be16(9) + be16(16) + be16(9) + "\x80"));
}

TEST(ToolMedia, AFailureOrAKillLeavesNoFileUnderTheFinalName)
{
    ScratchFolder const folder;
    std::string const in =
        folder.write("in", plainMovie() + atom("free", std::string(1 << 20, 'x')));
    std::string const line = "media set '" + in + "' '" + folder.path("out") + "' --yaw 1";
    ToolResult const full = runShell("trap '' XFSZ; ulimit -f 100; \"$KORVANE\" " + line);
    EXPECT_EQ(full.exitCode, 4);
    EXPECT_THAT(full.messages, HasSubstr("the disk is full, or the file too large"));
    EXPECT_THAT(folder.names(), ElementsAre("in"));

    // Killed in the middle of a write by a signal that can not be caught in time.
    runShell("ulimit -c 0; ulimit -f 100; \"$KORVANE\" " + line);
    EXPECT_THAT(folder.names(), Not(::testing::Contains("out")));
}

TEST(ToolMedia, VerifyingFindsWhatIsNotTheSame)
{
    ScratchFolder const folder;
    std::string const movie = plainMovie();
    std::string fragment = fileBytes(sampleMovie("fragmented.mp4"));
    std::string const fragmented = fragment;
    fragment[5000] ^= 1;
    struct Row {
        char const* name;
        std::string before, after;
        int compared; // -1: found to differ
    } const rows[] = {
        {"moved, with its table", movie,
         [&] {
             std::string shifted = atom("free", "x") + movie;
             std::size_t const table = shifted.find("stco") + 12;
             for (std::size_t const entry : {table, table + 4})
                 shifted.replace(entry, 4, be32(numberAt(shifted, entry, 4) + 9));
             return shifted;
         }(),
         8},
        {"moved, without it", movie, atom("free", "x") + movie, -1},
        {"another byte in a sample", movie, std::string(movie).replace(movie.size() - 3, 1, "X"),
         -1},
        {"another number of chunks", movie,
         std::string(movie).replace(movie.find("stco") + 8, 4, be32(1)), -1},
        {"fragments", fragmented, fragmented, 748 + 10982},
        {"another byte in a fragment", fragmented, fragment, -1},
    };
    for (Row const& row : rows) {
        std::string const before = folder.write("before", row.before);
        std::string const after = folder.write("after", row.after);
        int compared = -1;
        try {
            compared = static_cast<int>(verifyRewrite(before, after));
        } catch (ToolError const& error) {
            EXPECT_EQ(error.code(), ExitCode::Failed) << row.name;
        }
        EXPECT_EQ(compared, row.compared) << row.name;
    }
}

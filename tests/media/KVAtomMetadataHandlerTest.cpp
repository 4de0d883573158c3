#include <korvane/media/KVAtomMetadataHandler.h>

#include "media/Movie.h"

#include <cstdio>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

using ::testing::HasSubstr;
using namespace std::string_literals;

namespace {

std::string const kXMPUUID = fromHex("BE7ACFCB 97A9 42E8 9C71 999491E3AFAC");
std::string const kV1UUID = fromHex("FFCC8263 F855 4A93 8814 587A02521FDD");
char const kStsd[] = "moov/trak/mdia/minf/stbl/stsd";

KVURL url(std::string const& path)
{
    return KVURL(path.c_str());
}

/// A movie with one video track, of type "isom" unless told otherwise.
struct MovieParts {
    std::string extensions;
    std::string inTrack;
    std::string atTop;
    std::string brand = "isom";
};

std::string makeMovie(MovieParts const& parts)
{
    std::string const track = trackAtom({"vide", 1, videoDescription(parts.extensions), {}});
    return atom("ftyp", parts.brand) + parts.atTop +
           atom("moov", atom("trak", track.substr(8) + parts.inTrack));
}

/// A movie that is opened and read, and can be written.
struct Session {
    TemporaryFolder folder;
    KVAtomMetadataHandler handler;

    explicit Session(std::string_view movie, int expected = 0)
    {
        EXPECT_EQ(handler.openInputFile(url(folder.write("in", movie)).cf_url()), 0);
        EXPECT_EQ(handler.readMetadata(), expected);
    }

    std::string section(char const* key) const { return show(handler.copyMetadata()->value(key)); }
    /// The section's values with blanks between them; "null" without one.
    std::string values(char const* key) const
    {
        auto const metadata = handler.copyMetadata();
        auto const* dictionary = dynamic_cast<CFDictionaryRef>(metadata->value(key));
        std::string text = dictionary ? "" : "null";
        for (std::size_t i = 0; dictionary && i < dictionary->count(); ++i)
            text += (i ? " " : "") + dictionary->valueAtIndex(i)->description().toUTF8();
        return text;
    }
    std::string all() const { return show(handler.copyMetadata()); }

    void set(char const* key, KVCFRef<CFDictionaryRef> const& values)
    {
        auto const metadata = makeDictionary({});
        metadata->setValue(key, values);
        handler.setMetadata(metadata);
    }
    std::string write(int expected = 0)
    {
        EXPECT_EQ(handler.openOutputFile(url(folder.path("out")).cf_url()), 0);
        EXPECT_EQ(handler.writeMetadataWithUpdates(), expected);
        handler.closeOutputFile();
        return fileBytes(folder.path("out"));
    }
    /// The extensions of the first description that was written.
    std::string writeExtensions()
    {
        return std::string(findPayload(write(), kStsd).substr(8 + 86));
    }
};

std::string spherical(std::string const& elements)
{
    return "<?xml version=\"1.0\"?><rdf:SphericalVideo xmlns:GSpherical=\"u\">" + elements +
           "</rdf:SphericalVideo>";
}

/// What a shell line prints.
std::string output(std::string const& line)
{
    std::string text;
    FILE* const pipe = popen((line + " 2>/dev/null").c_str(), "r");
    char bytes[4096];
    while (std::size_t const got = std::fread(bytes, 1, sizeof bytes, pipe))
        text.append(bytes, got);
    pclose(pipe);
    return text;
}

KVCFRef<CFMutableDictionaryRef> fullPose()
{
    return makeDictionary({{"stereo_mode", "1"},
                           {"metadata_source", "Test"},
                           {"pose_yaw_degrees", "10.5"},
                           {"pose_pitch_degrees", "-20"},
                           {"pose_roll_degrees", "30"},
                           {"projection_bounds_top", "0"},
                           {"projection_bounds_bottom", "1073741824"},
                           {"projection_bounds_left", "2"},
                           {"projection_bounds_right", "3"}});
}

KVCFRef<CFMutableDictionaryRef> mastering()
{
    return makeDictionary({{"display_primaries_x0", "8500"},
                           {"display_primaries_y0", "39850"},
                           {"display_primaries_x1", "6550"},
                           {"display_primaries_y1", "2300"},
                           {"display_primaries_x2", "35400"},
                           {"display_primaries_y2", "14600"},
                           {"white_point_x", "15635"},
                           {"white_point_y", "16450"},
                           {"max_display_mastering_luminance", "10000000"},
                           {"min_display_mastering_luminance", "50"},
                           {"max_content_light_level", "1000"},
                           {"max_pic_average_light_level", "400"}});
}

KVCFRef<CFMutableDictionaryRef> both()
{
    auto const metadata = makeDictionary({});
    metadata->setValue(kKVGoogleV2Metadata, fullPose());
    metadata->setValue(kKVHDRMetadata, mastering());
    return metadata;
}

} // namespace

// --- Reading ---

TEST(KVAtomMetadataHandler, PayloadsAreReadAsStrings)
{
    auto const sv3d = [](std::string const& type, char const* payload) {
        return atom("sv3d", atom("proj", atom(type, fromHex(payload))));
    };
    auto const svhd = [](std::string const& payload) {
        return atom("sv3d", atom("svhd", payload));
    };
    char const* const kV2 = kKVGoogleV2Metadata;
    char const* const kHDR = kKVHDRMetadata;
    char const* const kStd = kKVStandardExtensionsMetadata;
    struct Row {
        char const* key;
        std::string extensions;
        std::string values; // of the section
    } const rows[] = {
        {kV2, atom("st3d", fromHex("00000000 FF")), "255"},
        {kV2, atom("st3d", fromHex("00000000")), "null"},
        {kV2, svhd(be32(0) + "abc" + '\0'), "abc"},
        {kV2, svhd(be32(0) + be16(0) + "abc" + be16(0)), "abc\0"s},
        {kV2, svhd(be32(0) + "\xEF\xBB\xBF" + "abc"), "abc"},
        {kV2, svhd(be32(0) + be32(0)), ""},
        {kV2, svhd(be32(0) + "\xFF\xFE"), "null"},
        {kV2, svhd(be32(0)), "null"},
        {kV2, sv3d("prhd", "00000000 00B40000 FFA60000 FF4C0000"),
         "180.000000 -90.000000 -180.000000"},
        {kV2, sv3d("prhd", "00000000 00C80000 7FFFFFFF 80000000"),
         "180.000000 90.000000 -180.000000"},
        {kV2, sv3d("prhd", "00000000 00000001 FFFFFFFF 000A8000 FF"),
         "0.000015 -0.000015 10.500000"},
        {kV2, sv3d("prhd", "00000000 00000001 FFFFFFFF 000A80"), "null"},
        {kV2, sv3d("cbmp", "00000000 00000007 FFFFFFFF"), "7 -1"},
        {kV2, sv3d("cbmp", "00000000 00000007 FFFFFF"), "null"},
        {kV2, sv3d("equi", "00000000 00000001 00000002 00000003 80000000"), "1 2 3 -2147483648"},
        {kV2, sv3d("equi", "00000000 00000001 00000002 00000003 800000"), "null"},
        {kV2, sv3d("mshp", "00000000 00000001"), "null"},
        {kHDR, atom("clli", fromHex("03E8 FFFF")), "1000 65535"},
        {kHDR, atom("clli", fromHex("03")), "768 0"},
        {kHDR, atom("clli"), "null"},
        {kHDR, atom("mdcv", fromHex("0001 0002 0003 0004 0005 FFFF 0007 0008 FFFFFFFF 0000000A")),
         "1 2 3 4 5 65535 7 8 -1 10"},
        {kStd, atom("colr", "nclc" + fromHex("0009 0010 0009")), "9 16 9"},
        {kStd, atom("colr", "nclx" + fromHex("0009 0010 0009 00")), "null"},
        // Meant: both keys of a pair hold the first value.
        {kStd, atom("fiel", fromHex("0209")), "2 2"},
        {kStd, atom("pasp", be32(4) + be32(3)), "4 4"},
        {kStd, atom("pasp", be32(4)), "null"},
    };
    for (Row const& row : rows) {
        Session session(makeMovie({row.extensions, {}, {}}));
        EXPECT_EQ(session.values(row.key), row.values) << toHex(row.extensions);
        EXPECT_EQ(session.handler.copyMetadata()->count(), row.values == "null" ? 0u : 1u);
    }
}

TEST(KVAtomMetadataHandler, UUIDAtomsHoldXMPAndTheFirstGeneration)
{
    std::string const sphere =
        spherical("<GSpherical:ProjectionType>equirectangular</GSpherical:ProjectionType>");
    auto const xmp = [](std::string const& text) { return atom("uuid", kXMPUUID + text); };
    auto const v1 = [](std::string const& text) { return atom("uuid", kV1UUID + text); };
    struct Row {
        char const* name;
        std::string atTop, inTrack;
        std::string metadata;
    } const rows[] = {
        {"PanoMeta", xmp("<a proj:type='p' GPano:ProjectionType='q' xmlns:exif='r'/>"), "",
         R"({PanoMeta XMP Metadata:{proj:type:"p" GPano:ProjectionType:"q" xmlns:exif:"r"}})"},
        {"PhotoSphere", xmp("<a xmlns:exif='r' GPano:ProjectionType='q'/>"), "",
         R"({PhotoSphere XMP Metadata:{xmlns:exif:"r" GPano:ProjectionType:"q"}})"},
        {"EXIF", xmp("<a xmlns:exif='r'/>"), "", R"({EXIF XMP Metadata:{xmlns:exif:"r"}})"},
        {"other", xmp("<a><b>1</b></a>"), "", R"({Adobe XMP Format Metadata:{b:"1"}})"},
        {"nothing in it stays text", xmp("<a/>"), "", R"({Adobe XMP Format Metadata:"<a/>"})"},
        {"not parsed stays text", xmp("<a"), "", R"({Adobe XMP Format Metadata:"<a"})"},
        {"a deeper key takes the place of one before it",
         xmp("<r><b>1</b><rdf:RDF><b>2</b></rdf:RDF></r>"), "",
         R"({Adobe XMP Format Metadata:{b:"2"}})"},
        {"first generation", "", v1(sphere),
         R"({Google Version 1 Metadata:{xmlns:GSpherical:"u" GSpherical:ProjectionType:"equirectangular"}})"},
        {"without a projection it stays text", v1("<a>1</a>"), "",
         R"({Google Version 1 Metadata:"<a>1</a>"})"},
        {"the later one counts", xmp("<a><b>1</b></a>"), xmp("<a><b>2</b></a>"),
         R"({Adobe XMP Format Metadata:{b:"2"}})"},
        {"another kind", atom("uuid", std::string(16, 'u') + "<a>1</a>"), "", "{}"},
        {"no UTF-8", xmp("<a>\xFF</a>"), "", "{}"},
    };
    for (Row const& row : rows) {
        Session session(makeMovie({"", row.inTrack, row.atTop}));
        EXPECT_EQ(session.all(), row.metadata) << row.name;
    }
}

TEST(KVAtomMetadataHandler, WithoutAVideoTrackTextStaysText)
{
    std::string const text = atom("uuid", kXMPUUID + "<a><b>1</b></a>");
    Session session(fileBytes(sampleMovie("audio-only.m4a")) + text);
    EXPECT_EQ(session.all(), R"({Adobe XMP Format Metadata:"<a><b>1</b></a>"})");
    EXPECT_FALSE(session.handler.getImageDesc());
    EXPECT_FALSE(session.handler.getVideoTrack());
    session.write(-1);

    Session disabled(text + atom("ftyp", "isom") +
                     movieAtom({{"vide", 0, videoDescription(atom("st3d", be64(1))), {}}}));
    EXPECT_EQ(disabled.all(), session.all());
    Session wrongType(atom("ftyp", "abcd") + movieAtom({}), -1);
    Session noMovie(atom("ftyp", "isom"), -1);
    EXPECT_EQ(noMovie.handler.readFileStructure(), -1);
    EXPECT_EQ(KVAtomMetadataHandler().readMetadata(), -1);
}

// --- Writing ---

TEST(KVAtomMetadataHandler, ThePoseIsWrittenInSixteenDotSixteen)
{
    struct Row {
        char const* text;
        char const* yaw;
        char const* pitch;
    } const rows[] = {
        {"95", "005F0000", "005A0000"},
        {"-95.5", "FFA08000", "FFA60000"},
        {"1e9", "00B40000", "005A0000"},
        {"-1e999", "FF4C0000", "FFA60000"},
        {"1e-999", "00000000", "00000000"},
        {" +1.5e1 degrees", "000F0000", "000F0000"},
        // Halves go away from zero: 1/131072 is half a unit.
        {"0.00000762939453125", "00000001", "00000001"},
        {"-0.00000762939453125", "FFFFFFFF", "FFFFFFFF"},
        {"0x1", "00000000", "00000000"},
        {"nan", "00000000", "00000000"},
        {"+-5", "00000000", "00000000"},
        {"\xD9\xA1", "00000000", "00000000"}, // a digit of another script
    };
    for (Row const& row : rows) {
        Session session(makeMovie({}));
        session.set(kKVGoogleV2Metadata, makeDictionary({{"pose_yaw_degrees", row.text},
                                                         {"pose_pitch_degrees", row.text}}));
        std::string const written = session.writeExtensions();
        EXPECT_EQ(toHex(findPayload(written, "sv3d/proj/prhd")),
                  "00000000" + std::string(row.yaw) + row.pitch + "00000000")
            << row.text;
    }
}

TEST(KVAtomMetadataHandler, IntegersAreReadAsFarAsTheyGo)
{
    struct Row {
        char const* text;
        char const* written; // 32 bits of layout, 8 bits of stereo mode
    } const rows[] = {
        {" \t-1x", "FFFFFFFF FF"},     {"+300", "0000012C 2C"},
        {"2147483648", "7FFFFFFF FF"}, {"-99999999999999999999", "80000000 00"},
        {"- 1", "00000000 00"},
    };
    for (Row const& row : rows) {
        Session session(makeMovie({}));
        session.set(kKVGoogleV2Metadata,
                    makeDictionary({{"cube_layout", row.text}, {"stereo_mode", row.text}}));
        std::string const written = session.writeExtensions();
        EXPECT_EQ(toHex(findPayload(written, "sv3d/proj/cbmp").substr(4, 4)) + " " +
                      toHex(findPayload(written, "st3d").substr(4)),
                  row.written)
            << row.text;
    }
}

TEST(KVAtomMetadataHandler, SectionsAreWrittenAsAtoms)
{
    auto const v2 = [](std::string const& source, std::string const& projection) {
        return atom("st3d", be32(0) + '\0') +
               atom("sv3d", atom("svhd", be32(0) + source + '\0') +
                                atom("proj", atom("prhd", be64(0) + be64(0)) + projection));
    };
    std::string const brovo = "Brovo Vantor", longest(251, 's'), tooLong(252, 's');
    std::string const equi = atom("equi", be32(0) + be32(5) + be32(0) + be64(0));
    std::string const cbmp = atom("cbmp", be32(0) + be32(0) + be32(6));
    char const* const kV2 = kKVGoogleV2Metadata;
    char const* const kStd = kKVStandardExtensionsMetadata;
    struct Row {
        char const* key;
        std::vector<std::pair<char const*, std::string>> values;
        std::string extensions;
    } const rows[] = {
        {kV2, {{"x", "1"}}, v2(brovo, "")},
        {kV2, {{"metadata_source", "ü"}}, v2("ü", "")},
        {kV2, {{"metadata_source", longest}}, v2(longest, "")},
        {kV2, {{"metadata_source", tooLong}}, v2(brovo, "")},
        {kV2, {{"projection_bounds_top", "5"}}, v2(brovo, equi)},
        {kV2, {{"cube_layout", "x"}, {"cube_padding", "6"}}, v2(brovo, cbmp)},
        {kV2, {{"cube_layout", "1"}, {"projection_bounds_top", "5"}}, v2(brovo, equi)},
        // Both are written, whatever is given.
        {kKVHDRMetadata,
         {{"white_point_x", "65537"}},
         atom("mdcv", std::string(12, '\0') + be16(1) + be16(0) + be64(0)) + atom("clli", be32(0))},
        // Meant: not the layout that is read. These need all of their numbers.
        {kStd,
         {{"color_primaries", "9"}, {"color_transfer", "16"}, {"color_matrix", "9"}},
         atom("colr", fromHex("0009 0000 0000 0010 0009"))},
        {kStd, {{"color_primaries", "9"}, {"color_transfer", "0"}, {"color_matrix", "9"}}, ""},
        {kStd, {{"field_fields", "2"}, {"field_detail", "14"}}, atom("fiel", fromHex("020E"))},
        {kStd, {{"field_fields", "2"}}, ""},
        {kStd, {{"pixel_aspect_h", "4"}, {"pixel_aspect_v", "3"}}, atom("pasp", be32(4) + be32(3))},
        {kStd, {{"pixel_aspect_h", "4"}, {"pixel_aspect_v", "-3"}}, ""},
    };
    for (Row const& row : rows) {
        Session session(makeMovie({}));
        session.set(row.key, makeDictionary(row.values));
        EXPECT_EQ(toHex(session.writeExtensions()), toHex(row.extensions)) << row.values[0].first;
    }
    Session hdr(makeMovie({})), noStrings(makeMovie({}));
    hdr.set(kKVHDRMetadata, mastering());
    EXPECT_EQ(
        toHex(hdr.writeExtensions()),
        toHex(atom("mdcv", fromHex("2134 9BAA 1996 08FC 8A48 3908 3D13 4042 00989680 00000032")) +
              atom("clli", fromHex("03E8 0190"))));
    // What is no string counts as 0, as a key it is there.
    auto const values = makeDictionary({});
    values->setValue("projection_bounds_top", makeData("x"));
    noStrings.set(kV2, values);
    EXPECT_EQ(toHex(noStrings.writeExtensions()),
              toHex(v2(brovo, atom("equi", be32(0) + be64(0) + be64(0)))));
}

TEST(KVAtomMetadataHandler, TheFirstGenerationIsWrittenAsXML)
{
    Session session(makeMovie({}));
    session.set(kKVGoogleV1Metadata,
                makeDictionary({{"GSpherical:FullPanoWidthPixels", "<4096 & more>"},
                                {"GSpherical:ProjectionType", "cubic"},
                                {"GSpherical:SourceCount", "6"}}));
    std::string const text =
        "<rdf:SphericalVideo\n"
        "xmlns:rdf=\"http://www.w3.org/1999/02/22-rdf-syntax-ns#\"\n"
        "xmlns:GSpherical=\"http://ns.google.com/videos/1.0/spherical/\">\n"
        "<GSpherical:Spherical>true</GSpherical:Spherical>\n"
        "<GSpherical:Stitched>true</GSpherical:Stitched>\n"
        "<GSpherical:ProjectionType>equirectangular</GSpherical:ProjectionType>\n"
        "<GSpherical:SourceCount>6</GSpherical:SourceCount>\n"
        "<GSpherical:StereoMode><GSpherical:StereoMode>mono</GSpherical:StereoMode></"
        "GSpherical:StereoMode>\n"
        "<GSpherical:StitchingSoftware><GSpherical:StitchingSoftware>Brovo Vantor"
        "</GSpherical:StitchingSoftware></GSpherical:StitchingSoftware>\n"
        "<GSpherical:FullPanoWidthPixels><4096 & more></GSpherical:FullPanoWidthPixels>\n"
        "</rdf:SphericalVideo>\n";
    std::string const written = session.write();
    EXPECT_EQ(std::string(findPayload(written, "moov/trak/uuid")), kV1UUID + text)
        << "meant: defaults stand inside themselves, values as they are";

    // Once more: the same atom, and read back.
    session.set(kKVGoogleV1Metadata, makeDictionary({{"GSpherical:StereoMode", "top-bottom"},
                                                     {"GSpherical:StitchingSoftware", "us"}}));
    std::string const again = session.write();
    EXPECT_EQ(again.find("uuid"), again.rfind("uuid"));
    EXPECT_EQ(Session(again).section(kKVGoogleV1Metadata),
              "{xmlns:rdf:\"http://www.w3.org/1999/02/22-rdf-syntax-ns#\" "
              "xmlns:GSpherical:\"http://ns.google.com/videos/1.0/spherical/\" "
              "GSpherical:Spherical:\"true\" GSpherical:Stitched:\"true\" "
              "GSpherical:ProjectionType:\"equirectangular\" GSpherical:StereoMode:\"top-bottom\" "
              "GSpherical:StitchingSoftware:\"us\"}");
}

TEST(KVAtomMetadataHandler, OnlyRawXMPTextIsWrittenAndAsItStands)
{
    std::string const raw = "<not xml";
    std::string const before = atom("uuid", kXMPUUID + raw);
    Session session(makeMovie({"", "", before}));
    EXPECT_EQ(std::string(findPayload(session.write(), "uuid")), raw) << "meant: without its UUID";
    Session parsed(makeMovie({"", "", atom("uuid", kXMPUUID + "<a>1</a>")}));
    EXPECT_EQ(std::string(findPayload(parsed.write(), "uuid")), kXMPUUID + "<a>1</a>")
        << "a dictionary writes nothing";
    Session inTrack(makeMovie({"", before, ""}));
    EXPECT_EQ(std::string(findPayload(inTrack.write(), "uuid")), raw) << "a new one, at the top";
}

TEST(KVAtomMetadataHandler, SettingReplacesTheFiveSectionsAndNoOther)
{
    Session session(
        makeMovie({atom("st3d", be64(1)), "", atom("uuid", kXMPUUID + "<a xmlns:exif='1'/>")}));
    EXPECT_EQ(
        session.all(),
        R"({EXIF XMP Metadata:{xmlns:exif:"1"} Google Version 2 Metadata:{stereo_mode:"0"}})");
    session.handler.setMetadata(nullptr);
    EXPECT_EQ(session.handler.copyMetadata()->count(), 2u);
    auto const metadata = makeDictionary({{kKVGoogleV1Metadata, "no string"}, {"other", "no"}});
    auto const values = makeDictionary({{"white_point_x", "1"}});
    metadata->setValue(kKVHDRMetadata, values);
    auto const before = session.handler.copyMetadata();
    session.handler.setMetadata(metadata);
    values->removeAllValues();
    EXPECT_EQ(session.all(), "{EXIF XMP Metadata:{xmlns:exif:\"1\"} "
                             "HDR Color and Light Level Metadata:{white_point_x:\"1\"}}");
    EXPECT_EQ(before->count(), 2u) << "a copy stays as it was";
    EXPECT_TRUE(before->value(kKVGoogleV2Metadata));
}

TEST(KVAtomMetadataHandler, SampleMoviesGainMetadataAndKeepTheirSamples)
{
    for (std::string const& name : plainSamples()) {
        std::string const original = fileBytes(sampleMovie(name));
        bool const quickTime = name.find(".mov") != std::string::npos;
        Session session(original);
        session.handler.setMetadata(both());
        std::string const first = session.write();
        EXPECT_TRUE(samplesOf(first) == samplesOf(original)) << name;
        std::string const stsd(findPayload(first, kStsd));
        EXPECT_EQ(stsd.substr(stsd.size() - 4) == be32(0), quickTime) << name;

        Session second(first);
        EXPECT_EQ(second.values(kKVGoogleV2Metadata),
                  "1 Test 10.500000 -20.000000 30.000000 0 1073741824 2 3");
        EXPECT_EQ(second.section(kKVHDRMetadata), show(mastering()));

        // A second write starts from what the first one wrote: the same again, and more.
        EXPECT_TRUE(session.write() == first) << name;
        session.set(kKVGoogleV1Metadata, makeDictionary({{"GSpherical:SourceCount", "2"}}));
        std::string const third = session.write();
        EXPECT_TRUE(samplesOf(third) == samplesOf(original)) << name;
        EXPECT_TRUE(findPayload(third, kStsd) == stsd) << name;
        EXPECT_NE(third.find("SourceCount>2<"), std::string::npos);
    }
}

TEST(KVAtomMetadataHandler, CopiesStandOnTheirOwn)
{
    auto original = std::make_unique<Session>(fileBytes(sampleMovie("quicktime.mov")));
    original->set(kKVGoogleV2Metadata, fullPose());
    KVAtomMetadataHandler copy(original->handler);
    KVAtomBox* const track = copy.getVideoTrack();
    ASSERT_TRUE(track);
    EXPECT_NE(track, original->handler.getVideoTrack());
    original->set(kKVGoogleV2Metadata, makeDictionary({{"stereo_mode", "2"}}));
    original.reset();
    EXPECT_EQ(show(copy.copyMetadata()->value(kKVGoogleV2Metadata)), show(fullPose()));
    ASSERT_TRUE(copy.getImageDesc());
    EXPECT_EQ(copy.updateAtomsWithMetadata(), 0) << "no file is needed for that";
    EXPECT_TRUE(track->findFirstChild(true, KVAtomType("stsd"))->getPayloadData());
    EXPECT_EQ(copy.writeMetadataWithUpdates(), -1) << "for that, one is";
    EXPECT_FALSE(KVAtomMetadataHandler(KVAtomMetadataHandler()).getVideoTrack());
}

TEST(KVAtomMetadataHandler, AnotherInputKeepsTheMetadataAndForgetsTheTrack)
{
    Session session(makeMovie({atom("st3d", be64(1)), {}, {}}));
    TemporaryFolder const folder;
    std::string const other = folder.write("other", makeMovie({}));
    EXPECT_EQ(session.handler.openInputFile(nullptr), -1);
    EXPECT_TRUE(session.handler.getImageDesc());
    ASSERT_EQ(session.handler.openInputFile(url(other).cf_url()), 0);
    EXPECT_FALSE(session.handler.getImageDesc());
    EXPECT_FALSE(session.handler.getVideoTrack());
    EXPECT_EQ(session.handler.writeMetadataWithUpdates(), -1) << "the tree is not read yet";
    ASSERT_EQ(session.handler.readFileStructure(), 0);
    EXPECT_EQ(toHex(session.writeExtensions().substr(0, 13)), toHex(atom("st3d", be32(0) + '\0')));

    // A host that reads the tree anew takes the track away under it.
    ASSERT_EQ(session.handler.readTopLevelAtomBoxHeaders(), 0);
    EXPECT_FALSE(session.handler.getVideoTrack());
    session.write(-1);
}

// --- An independent reader ---

TEST(KVAtomMetadataHandler, FfprobeReadsWhatIsWritten)
{
    if (output("command -v ffprobe && command -v ffmpeg").empty())
        GTEST_SKIP() << "ffprobe is not installed";
    for (std::string const& name : plainSamples()) {
        Session session(fileBytes(sampleMovie(name)));
        session.handler.setMetadata(both());
        session.write();
        std::string const out = session.folder.path("out");
        std::string const probed =
            output("ffprobe -v error -show_streams -select_streams v -of flat '" + out + "'");
        for (char const* expected :
             {"side_data_type=\"Stereo 3D\"", "type=\"top and bottom\"",
              "side_data_type=\"Spherical Mapping\"", "projection=\"tiled equirectangular\"",
              "yaw=10", "pitch=-20", "roll=30", "bound_bottom=53",
              "side_data_type=\"Mastering display metadata\"", "red_x=\"35400/50000\"",
              "green_x=\"8500/50000\"", "max_luminance=\"10000000/10000\"",
              "side_data_type=\"Content light level metadata\"", "max_content=1000",
              "max_average=400"})
            EXPECT_THAT(probed, HasSubstr(expected)) << name;
        auto const samples = [](std::string const& path) {
            return output("ffmpeg -v error -i '" + path +
                          "' -map 0 -c copy -f framemd5 - | sed 's/, S=.*//'");
        };
        std::string const before = samples(sampleMovie(name));
        EXPECT_GT(before.size(), 1000u);
        EXPECT_TRUE(samples(out) == before) << name;
    }
}

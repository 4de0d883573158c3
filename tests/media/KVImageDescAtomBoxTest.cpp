#include <korvane/media/KVImageDescAtomBox.h>

#include "media/Movie.h"

#include <korvane/media/KVAtomBoxFile.h>

#include <gtest/gtest.h>

namespace {

std::string const kPasp = atom("pasp", be32(4) + be32(3));

KVImageDescAtomBox parse(std::string const& payload)
{
    return KVImageDescAtomBox(payload.data(), payload.size());
}

std::string tree(KVImageDescAtomBox const& descriptions)
{
    return show(descriptions.getTopAtomBox());
}

std::string full(KVImageDescAtomBox& descriptions, bool quickTime = false)
{
    return bytesOf(descriptions.copyFullImageDescToData(quickTime));
}

/// The first description of a payload, header included.
std::string first(std::string const& payload)
{
    return payload.substr(8);
}

/// A description without a colour table field: one of so many entries follows the fixed bytes.
std::string withColourTable(int lastIndex, std::string const& entries,
                            std::string const& extensions)
{
    std::string payload =
        videoDescription(be32(0) + be16(0) + be16(static_cast<unsigned int>(lastIndex)) + be64(0) +
                         entries + extensions);
    return payload.replace(8 + 84, 2, be16(0));
}

} // namespace

TEST(KVImageDescAtomBox, PayloadsAreReadIntoATree)
{
    std::string const spherical =
        atom("sv3d", atom("svhd", "x") + atom("proj", atom("prhd") + atom("equi")));
    struct Row {
        char const* name;
        std::string payload;
        char const* tree;
        std::uint64_t size; // of the first description
    } const rows[] = {
        {"extensions", videoDescription(kPasp + atom("colr", "nclc"), "hvc1"),
         "0(hvc1(stsd pasp colr))", 86 + 16 + 12},
        {"spherical", videoDescription(spherical), "0(avc1(stsd sv3d(svhd proj(prhd equi))))",
         86 + spherical.size()},
        {"proj anywhere", videoDescription(atom("proj", kPasp)), "0(avc1(stsd proj(pasp)))",
         86 + 24},
        {"other containers stay closed", videoDescription(atom("sinf", kPasp)),
         "0(avc1(stsd sinf))", 86 + 24},
        {"colour table", withColourTable(1, be64(1), kPasp), "0(avc1(stsd clut pasp))",
         86 + 24 + 16},
        {"four zeros at the end fall away", videoDescription(kPasp + be32(0)), "0(avc1(stsd pasp))",
         86 + 16},
        {"so does junk", videoDescription(kPasp + be32(99) + "junk"), "0(avc1(stsd pasp))",
         86 + 16},
        {"long header of an extension", videoDescription(longAtom("pasp", be64(5))),
         "0(avc1(stsd pasp))", 86 + 24},
        // Malformed: what was read stays.
        {"fixed fields cut short", be64(1) + atom("avc1", std::string(77, '\0')) + "x", "0(avc1)",
         85},
        {"no room for a colour table", withColourTable(0, "", "").replace(8, 4, be32(86 + 15)),
         "0(avc1(stsd))", 101},
        {"colour table of negative size", withColourTable(0x8000, "", kPasp), "0(avc1(stsd))", 118},
        {"colour table beyond the end", withColourTable(3, be64(1), ""), "0(avc1(stsd))", 86 + 24},
        {"description beyond the end", videoDescription().replace(8, 4, be32(87)), "0", 0},
        {"count beyond the end", videoDescription().replace(4, 4, be32(2)), "0", 0},
        {"nothing", "", "0", 0},
    };
    for (Row const& row : rows) {
        KVImageDescAtomBox const descriptions = parse(row.payload);
        EXPECT_EQ(tree(descriptions), row.tree) << row.name;
        KVAtomBox const* const description = descriptions.getTopAtomBox().getChild(0);
        EXPECT_EQ(description ? description->getSize() : 0, row.size) << row.name;
    }
    EXPECT_EQ(KVImageDescAtomBox(nullptr).getImageDescCount(), 0);
    EXPECT_EQ(KVImageDescAtomBox(nullptr, 100).getImageDescCount(), 0);
}

TEST(KVImageDescAtomBox, DescriptionsFollowEachOtherByTheirWrittenSize)
{
    std::string const payload = be32(0) + be32(3) + first(videoDescription(kPasp + be32(0))) +
                                first(videoDescription("", "mp4v")) +
                                first(videoDescription(kPasp, "hvc1"));
    KVImageDescAtomBox const descriptions = parse(payload);
    EXPECT_EQ(tree(descriptions), "0(avc1(stsd pasp) mp4v(stsd) hvc1(stsd pasp))");
    EXPECT_EQ(descriptions.getImageDescCodec(1), KVAtomType("mp4v"));
    EXPECT_EQ(descriptions.getImageDescCodec(-1), 0u);
    EXPECT_EQ(descriptions.getImageDescCodec(3), 0u);
    EXPECT_EQ(parse(payload.substr(0, payload.size() - 1)).getImageDescCount(), 2)
        << "the sound ones stay";
}

TEST(KVImageDescAtomBox, SampleMoviesComeOutAsTheyWere)
{
    for (std::string const& name : plainSamples()) {
        std::string const payload(
            findPayload(fileBytes(sampleMovie(name)), "moov/trak/mdia/minf/stbl/stsd"));
        KVImageDescAtomBox descriptions = parse(payload);
        ASSERT_EQ(descriptions.getImageDescCount(), 1) << name;
        EXPECT_TRUE(full(descriptions) == payload) << name;
    }
    // Every kind of part at once; version and flags are not kept.
    std::string payload = withColourTable(1, be64(1),
                                          longAtom("uuid", "x") + atom("free") + kPasp +
                                              atom("sv3d", atom("proj", atom("mshp", "y"))));
    KVImageDescAtomBox descriptions = parse(be32(0x01000007) + payload.substr(4));
    EXPECT_EQ(toHex(full(descriptions)), toHex(payload));
    KVImageDescAtomBox none = parse("");
    EXPECT_FALSE(none.copyFullImageDescToData(false));
}

TEST(KVImageDescAtomBox, PayloadsAreCopiedFromWhereverTheyLie)
{
    KVImageDescAtomBox descriptions = parse(
        videoDescription(atom("sv3d", atom("proj", atom("prhd", "abc"))) + atom("free") + kPasp));
    auto const payload = [&](char const(&type)[5]) {
        auto const data = descriptions.copyImageDescData(0, KVAtomType(type));
        return data ? bytesOf(data) : "none";
    };
    EXPECT_EQ(payload("pasp"), be32(4) + be32(3));
    EXPECT_EQ(payload("prhd"), "abc");
    EXPECT_EQ(payload("proj"), atom("prhd", "abc")) << "a container: its children";
    EXPECT_EQ(payload("free"), "");
    EXPECT_EQ(payload("colr"), "none");
    EXPECT_FALSE(descriptions.copyImageDescData(1, KVAtomType("pasp")));
    descriptions.setImageDescData(0, KVAtomType("prhd"), makeData("set"));
    EXPECT_EQ(payload("prhd"), "set");
}

TEST(KVImageDescAtomBox, PlacesInTheSourceAreCutTo16Bits)
{
    // Meant: an atom that starts beyond 64 KiB reads from where the low 16 bits of its place lead.
    std::string const large(0x10000 - 94 - 8 - 8, 'L');
    KVImageDescAtomBox const descriptions = parse(videoDescription(atom("avcC", large) + kPasp));
    EXPECT_EQ(bytesOf(descriptions.copyImageDescData(0, KVAtomType("avcC"))), large);
    EXPECT_EQ(toHex(bytesOf(descriptions.copyImageDescData(0, KVAtomType("pasp")))),
              toHex(videoDescription().substr(0, 8)));
    KVImageDescAtomBox const container = parse(videoDescription(
        atom("sv3d", atom("svhd", std::string(0x10003 - 16, 's')) + atom("proj"))));
    EXPECT_EQ(bytesOf(container.copyImageDescData(0, KVAtomType("sv3d"))), std::string(3, '\0'))
        << "the first child no longer fits";
}

TEST(KVImageDescAtomBox, SettingReplacesOrAppends)
{
    KVImageDescAtomBox descriptions = parse(videoDescription(atom("fiel", "12") + kPasp));
    descriptions.setImageDescData(0, KVAtomType("fiel"), makeData("34"));
    descriptions.setImageDescData(0, KVAtomType("pasp"), makeData("longer than before"));
    descriptions.setImageDescData(0, KVAtomType("colr"), makeData("new"));
    std::string const expected = videoDescription(
        atom("fiel", "34") + atom("pasp", "longer than before") + atom("colr", "new"));
    for (auto const& [index, data] :
         {std::pair{-1, "x"}, std::pair{1, "x"}, std::pair<int, char const*>{0, nullptr}})
        descriptions.setImageDescData(index, KVAtomType("pasp"), data ? makeData(data) : nullptr);
    EXPECT_EQ(toHex(full(descriptions)), toHex(expected));
    EXPECT_EQ(descriptions.getTopAtomBox().getSize(), expected.size() - 8);

    EXPECT_TRUE(descriptions.removeImageDescData(0, KVAtomType("pasp")));
    EXPECT_FALSE(descriptions.removeImageDescData(0, KVAtomType("pasp")));
    EXPECT_FALSE(descriptions.removeImageDescData(1, KVAtomType("colr")));
    EXPECT_FALSE(descriptions.removeImageDescData(0, KVAtomType("stsd"))) << "the fixed fields";
    EXPECT_EQ(toHex(full(descriptions)),
              toHex(videoDescription(atom("fiel", "34") + atom("colr", "new"))));
}

TEST(KVImageDescAtomBox, ColourIsWrittenInAnotherLayoutThanItIsRead)
{
    struct Row {
        char const* colr; // null: no such atom
        int code;
    } const rows[] = {
        {"6E636C63 0009 0010 0009", 0},
        {"6E636C63 0009 0010 00", -1},
        {"6E636C78 0009 0010 0009 00", -1}, // nclx
        {nullptr, -1},
    };
    for (Row const& row : rows) {
        KVImageDescAtomBox const descriptions =
            parse(videoDescription(row.colr ? atom("colr", fromHex(row.colr)) : ""));
        int primaries = 0, transfer = 0, matrix = 0;
        EXPECT_EQ(descriptions.getImageDescColorInfo(0, &primaries, &transfer, &matrix), row.code);
        EXPECT_EQ(descriptions.getImageDescColorInfo(0, nullptr, nullptr, nullptr), row.code);
        EXPECT_EQ(std::tuple(primaries, transfer, matrix),
                  row.code == 0 ? std::tuple(9, 16, 9) : std::tuple(0, 0, 0));
    }
    KVImageDescAtomBox descriptions = parse(videoDescription());
    descriptions.setImageDescColorInfo(0, 0x10102, 0x304, 0x506);
    descriptions.setImageDescColorInfo(1, 1, 1, 1);
    EXPECT_EQ(toHex(full(descriptions)),
              toHex(videoDescription(atom("colr", fromHex("0102 0000 0000 0304 0506")))));
    EXPECT_EQ(descriptions.getImageDescColorInfo(0, nullptr, nullptr, nullptr), -1)
        << "meant: what was written is refused";
}

TEST(KVImageDescAtomBox, FieldsAndPixelAspect)
{
    KVImageDescAtomBox original = parse(videoDescription());
    KVImageDescAtomBox descriptions(original);
    int a = 0, b = 0;
    EXPECT_EQ(descriptions.getImageDescFieldInfo(0, &a, &b), -1);
    EXPECT_EQ(descriptions.getImageDescPixelAspectInfo(0, &a, &b), -1);
    descriptions.setImageDescFieldInfo(0, 0x102, 14);
    descriptions.setImageDescPixelAspectInfo(0, 40, -33);
    EXPECT_EQ(toHex(full(descriptions)),
              toHex(videoDescription(atom("fiel", fromHex("020E")) +
                                     atom("pasp", be32(40) + be32(-33)))));
    EXPECT_EQ(full(original), videoDescription()) << "copies are deep";
    original = descriptions;
    EXPECT_EQ(original.getImageDescFieldInfo(0, &a, &b), 0);
    EXPECT_EQ(std::pair(a, b), std::pair(2, 14));
    EXPECT_EQ(original.getImageDescPixelAspectInfo(0, &a, &b), 0);
    EXPECT_EQ(std::pair(a, b), std::pair(40, -33));
    descriptions.setImageDescData(0, KVAtomType("fiel"), makeData("1"));
    descriptions.setImageDescData(0, KVAtomType("pasp"), makeData("1234567"));
    EXPECT_EQ(descriptions.getImageDescFieldInfo(0, &a, &b), -1);
    EXPECT_EQ(descriptions.getImageDescPixelAspectInfo(0, &a, &b), -1);
}

TEST(KVImageDescAtomBox, HDRAndSphericalPayloadsGoInAndOutAsDictionaries)
{
    KVImageDescAtomBox descriptions = parse(videoDescription(atom("clli", "old!") + kPasp));
    EXPECT_EQ(show(descriptions.copyImageDescHDRInfo(0)), "{clli:6F6C6421}");
    EXPECT_EQ(show(descriptions.copyImageDescHDRInfo(1)), "{}");
    EXPECT_EQ(show(descriptions.copyImageDescGoogleV2Info(-1)), "{}");

    auto const info = makeDictionary({{"clli", "a string is passed over"}});
    info->setValue("mdcv", makeData("mmmm"));
    info->setValue("pasp", makeData("not one of these"));
    descriptions.setImageDescHDRInfo(0, info);
    descriptions.setImageDescHDRInfo(5, info);
    descriptions.setImageDescHDRInfo(0, nullptr);
    std::string const hdr = atom("clli", "old!") + kPasp + atom("mdcv", "mmmm");
    EXPECT_EQ(toHex(full(descriptions)), toHex(videoDescription(hdr)));

    auto const spherical = makeDictionary({});
    for (char const* name : {"equi", "st3d", "svhd", "mshp"})
        spherical->setValue(name, makeData(name));
    descriptions.setImageDescGoogleV2Info(0, spherical);
    std::string const sv3d = atom(
        "sv3d", atom("svhd", "svhd") + atom("proj", atom("equi", "equi") + atom("mshp", "mshp")));
    EXPECT_EQ(toHex(full(descriptions)),
              toHex(videoDescription(hdr + atom("st3d", "st3d") + sv3d)));

    // Into what is there already; what is not named stays.
    KVImageDescAtomBox again = parse(full(descriptions));
    EXPECT_EQ(show(again.copyImageDescGoogleV2Info(0)),
              "{st3d:73743364 svhd:73766864 equi:65717569 mshp:6D736870}");
    auto const pose = makeDictionary({});
    pose->setValue("prhd", makeData("pose"));
    pose->setValue("equi", makeData("other"));
    again.setImageDescGoogleV2Info(0, pose);
    EXPECT_EQ(show(again.copyImageDescGoogleV2Info(0)),
              "{st3d:73743364 svhd:73766864 equi:6571756900 mshp:6D736870}")
        << "meant: read from the source, at its old place with its new length";
    EXPECT_EQ(toHex(full(again)),
              toHex(videoDescription(
                  hdr + atom("st3d", "st3d") +
                  atom("sv3d", atom("svhd", "svhd") +
                                   atom("proj", atom("equi", "other") + atom("mshp", "mshp") +
                                                    atom("prhd", "pose"))))));
}

TEST(KVImageDescAtomBox, QuickTimeDescriptionsEndInFourZeros)
{
    struct Row {
        char const* name;
        std::string payload, quickTime, after;
    } const rows[] = {
        {"extended", videoDescription(kPasp), videoDescription(kPasp + be32(0)),
         videoDescription(kPasp)},
        {"not extended", videoDescription(), videoDescription(), videoDescription()},
        {"ends in its colour table", withColourTable(0, "", ""), withColourTable(0, "", ""),
         withColourTable(0, "", "")},
        // Meant: an empty last extension passes for the zeros, and is taken off with them.
        {"ends in an empty extension", videoDescription(kPasp + atom("free")),
         videoDescription(kPasp + atom("free")), videoDescription(kPasp)},
    };
    for (Row const& row : rows) {
        KVImageDescAtomBox descriptions = parse(row.payload);
        EXPECT_EQ(toHex(full(descriptions, true)), toHex(row.quickTime)) << row.name;
        EXPECT_EQ(toHex(full(descriptions)), toHex(row.after)) << row.name;
    }
    KVImageDescAtomBox descriptions = parse(videoDescription(kPasp));
    for (int i = 0; i < 2; ++i)
        descriptions.setQuickTimeCompatibility(true);
    EXPECT_EQ(tree(descriptions), "0(avc1(stsd pasp 0))") << "not twice";
    EXPECT_EQ(descriptions.getTopAtomBox().getSize(), 86u + 16u + 4u);
}

TEST(KVImageDescAtomBox, AnExtensionToTheEndGetsItsSizeWhenAnotherFollows)
{
    std::string const toTheEnd = be32(0) + kPasp.substr(4);
    KVImageDescAtomBox descriptions = parse(videoDescription(toTheEnd));
    EXPECT_EQ(full(descriptions), videoDescription(toTheEnd));
    descriptions.setImageDescFieldInfo(0, 1, 6);
    EXPECT_EQ(full(descriptions), videoDescription(kPasp + atom("fiel", "\1\6")));
}

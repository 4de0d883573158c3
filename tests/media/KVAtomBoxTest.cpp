#include <korvane/media/KVAtomBox.h>

#include "media/Movie.h"

#include <gtest/gtest.h>

namespace {

KVAtomBox* addAtom(KVAtomBox& parent, char const (&type)[5], unsigned long long size = 8)
{
    auto* const child = new KVAtomBox(KVAtomType(type));
    child->setSize(size);
    child->setPayloadSize(size - 8);
    child->setParent(&parent);
    parent.addChild(child);
    return child;
}

} // namespace

TEST(KVAtomBox, PayloadDataAndChildrenExcludeEachOther)
{
    KVAtomBox box(KVAtomType("udta"));
    addAtom(box, "name");
    box.setPayloadData(nullptr);
    EXPECT_EQ(box.getChildCount(), 1) << "null leaves the children alone";

    auto const data = KVCFRef<CFMutableDataRef>::adopt(new __CFData("abc", 3));
    box.setSize(77);
    box.setPayloadData(data);
    EXPECT_EQ(box.getChildCount(), 0);
    EXPECT_EQ(box.getSize(), 77u);
    data->setLength(1);
    box.setPayloadData(box.getPayloadData());
    EXPECT_EQ(bytesOf(box.getPayloadData()), "abc") << "a private copy";

    box.insertChild(nullptr, 0);
    EXPECT_TRUE(box.getPayloadData());
    addAtom(box, "name");
    EXPECT_FALSE(box.getPayloadData());
}

TEST(KVAtomBox, ChildrenAreInsertedAndRemovedByIndex)
{
    KVAtomBox box;
    for (auto const& [type, index] : {std::pair("aaaa", 7), std::pair("bbbb", -3),
                                      std::pair("cccc", 1), std::pair("dddd", 3)}) {
        auto* const child = new KVAtomBox(static_cast<unsigned int>(numberAt(type, 0, 4)));
        box.insertChild(child, index);
        EXPECT_FALSE(child->getParent()) << "the caller sets the parent";
    }
    EXPECT_EQ(show(box), "0(bbbb cccc aaaa dddd)");
    for (int const index : {-1, 4, 1})
        box.removeChild(index);
    EXPECT_EQ(show(box), "0(bbbb aaaa dddd)");
    EXPECT_FALSE(box.getChild(-1));
    EXPECT_FALSE(box.getChild(3));
}

TEST(KVAtomBox, SearchGoesInDocumentOrder)
{
    KVAtomBox root;
    root.setSize(100);
    KVAtomBox* const moov = addAtom(root, "moov");
    KVAtomBox* const hdlr = addAtom(*addAtom(*moov, "mdia"), "hdlr");
    KVAtomBox* const outer = addAtom(root, "hdlr");
    KVAtomBox* const nested = addAtom(*outer, "hdlr");
    KVAtomBox* const hollow = addAtom(root, "meta");
    hollow->setSize(0);
    KVAtomBox* const below = addAtom(*hollow, "name");

    EXPECT_EQ(root.findFirstChild(true, KVAtomType("hdlr")), hdlr);
    EXPECT_EQ(root.findFirstChild(false, KVAtomType("hdlr")), outer);
    EXPECT_EQ(root.findFirstChild(true, KVAtomType("meta")), hollow);
    EXPECT_FALSE(root.findFirstChild(true, KVAtomType("name"))) << "nothing below size 0";
    EXPECT_FALSE(hollow->findFirstChild(false, KVAtomType("name")));

    std::vector<KVAtomBox*> found{moov};
    root.findAllChildren(found, true, KVAtomType("hdlr"));
    EXPECT_EQ(found, (std::vector<KVAtomBox*>{moov, hdlr, outer, nested}));
    found.clear();
    root.findAllChildren(found, true, KVAtomType("name"));
    EXPECT_EQ(found, std::vector<KVAtomBox*>{below}) << "this search looks below size 0 too";
}

TEST(KVAtomBox, SizeIsThePayloadAndAHeaderByItsLimit)
{
    struct Row {
        unsigned long long childSize;
        bool isRoot;
        unsigned long long size;
    } const rows[] = {
        {100, true, 100},
        {100, false, 108},
        {0xFFFFFFFE, false, 0x100000006},
        {0xFFFFFFFF, false, 0x10000000F},
        {0xFFFFFFFF, true, 0xFFFFFFFF},
    };
    for (Row const& row : rows) {
        KVAtomBox parent, box;
        if (!row.isRoot)
            box.setParent(&parent);
        addAtom(box, "mdat")->setSize(row.childSize);
        box.updateSize();
        EXPECT_EQ(box.getPayloadSize(), row.childSize);
        EXPECT_EQ(box.getSize(), row.size) << row.childSize;
    }
}

TEST(KVAtomBox, CopiesAreDeepAndKeepTheParentsOfTheirOriginals)
{
    KVAtomBox root, assigned(KVAtomType("junk"));
    KVAtomBox* const moov = addAtom(root, "moov", 90);
    KVAtomBox* const uuid = addAtom(*moov, "uuid", 20);
    uuid->setOffset(1234);
    uuid->setPayloadData(makeData("abc"));
    addAtom(assigned, "gone");
    assigned = root;

    KVAtomBox copy(root);
    for (KVAtomBox* const one : {&copy, &assigned}) {
        EXPECT_EQ(show(*one), "0(moov(uuid))");
        KVAtomBox* const box = one->getChild(0)->getChild(0);
        EXPECT_NE(box, uuid);
        EXPECT_EQ(box->getOffset(), 1234u);
        EXPECT_EQ(box->getSize(), 20u);
        EXPECT_EQ(bytesOf(box->getPayloadData()), "abc");
        EXPECT_EQ(box->getParent(), moov) << "meant: the original's parent";
        one->repairParents();
        EXPECT_EQ(box->getParent(), one->getChild(0));
        EXPECT_EQ(one->getChild(0)->getParent(), one);
    }
    copy = *copy.getChild(0);
    auto& itself = copy;
    copy = itself;
    EXPECT_EQ(show(copy), "moov(uuid)");
    EXPECT_EQ(show(root), "0(moov(uuid))");
}

TEST(KVAtomBox, DepthCostsNoMachineStack)
{
    constexpr int kDepth = 300'000;
    KVAtomBox root;
    root.setSize(8);
    KVAtomBox* deepest = &root;
    for (int i = 0; i < kDepth; ++i)
        deepest = addAtom(*deepest, "deep", 16);
    KVAtomBox* const last = addAtom(*deepest, "last");

    EXPECT_EQ(root.findFirstChild(true, KVAtomType("last")), last);
    std::vector<KVAtomBox*> found;
    root.findAllChildren(found, true, KVAtomType("deep"));
    EXPECT_EQ(found.size(), static_cast<std::size_t>(kDepth));
    KVAtomBox copy(root);
    copy.repairParents();
    KVAtomBox* const lastCopy = copy.findFirstChild(true, KVAtomType("last"));
    ASSERT_TRUE(lastCopy);
    lastCopy->updateParentSizes();
    EXPECT_EQ(copy.getSize(), 8ull * (kDepth + 1));
    copy = KVAtomBox();
    EXPECT_EQ(copy.getChildCount(), 0);
}

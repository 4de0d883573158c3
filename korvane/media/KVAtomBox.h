#pragma once

#include <korvane/foundation/KVCFRef.h>
#include <korvane/platform/CFData.h>

#include <memory>
#include <vector>

/// A four-character code with its first character in the most significant byte:
/// `KVAtomType("moov")` is 0x6D6F6F76.
constexpr unsigned int KVAtomType(char const (&code)[5]) noexcept
{
    unsigned int type = 0;
    for (int i = 0; i < 4; ++i)
        type = type << 8 | static_cast<unsigned char>(code[i]);
    return type;
}

/// One node of the atom tree of a QuickTime or MP4 file ("box" in ISO/IEC 14496-12, 4.2).
///
///     auto* box = new KVAtomBox(KVAtomType("uuid"));
///     box->setParent(&moov);
///     moov.addChild(box);                       // `moov` owns it from here on
///     box->setPayloadData(data);
///     box->updateSize();                        // 8 + the data's length
///     box->updateParentSizes();
///
/// A node stands for the bytes [offset, offset + size) of its source file. Its payload stays in
/// that file until `setPayloadData` puts one in memory. A node has payload data or children, never
/// both.
///
/// Sizes are bytes and are kept as they are set: after a change, `updateSize` and
/// `updateParentSizes` bring them up to date. The size of the header is not kept, it is size minus
/// payload size.
///
/// Trees may be of any depth: nothing here uses the machine's stack in proportion to it. A tree
/// belongs to one thread at a time.
class KV_EXPORT KVAtomBox {
public:
    // --- Make ---

    /// Offset and sizes 0, no parent, no payload data, no children.
    explicit KVAtomBox(unsigned int type = 0) noexcept : type_(type) {}
    /// Copies the fields, the payload data and the whole tree of children. Every copied node keeps
    /// the parent pointer of its original: call `repairParents` before walking upward in a copy.
    KVAtomBox(KVAtomBox const& other);
    /// The same; what was here before is deleted.
    KVAtomBox& operator=(KVAtomBox const& other);
    /// Deletes the children.
    virtual ~KVAtomBox();

    /// Points each node below this one to the node that it is a child of.
    void repairParents();

    // --- Fields ---

    /// The first byte, header included, in the source file; 0 for a node made in memory.
    unsigned long long getOffset() const noexcept { return offset_; }
    void setOffset(unsigned long long offset) noexcept { offset_ = offset; }
    /// The whole size, header included.
    unsigned long long getSize() const noexcept { return size_; }
    void setSize(unsigned long long size) noexcept { size_ = size; }
    unsigned long long getPayloadSize() const noexcept { return payloadSize_; }
    void setPayloadSize(unsigned long long size) noexcept { payloadSize_ = size; }
    unsigned long long getHeaderSize() const noexcept { return size_ - payloadSize_; }
    unsigned int getType() const noexcept { return type_; }
    void setType(unsigned int type) noexcept { type_ = type; }
    /// Unowned; null at the root.
    KVAtomBox* getParent() const noexcept { return parent_; }
    void setParent(KVAtomBox* parent) noexcept { parent_ = parent; }

    // --- Payload ---

    /// Unowned; null while the payload stays in the file.
    CFDataRef getPayloadData() const noexcept { return payloadData_; }
    /// Keeps a copy of the data and deletes the children. Null drops the payload data and leaves
    /// the children alone. Sizes stay as they are.
    void setPayloadData(CFDataRef data);

    // --- Children ---

    /// Appends; see `insertChild`.
    void addChild(KVAtomBox* child);
    /// Takes the child over and drops this node's payload data. An index below 1 inserts first, one
    /// at or past the count appends; a null child is ignored. The child's parent stays as it is:
    /// set it too.
    void insertChild(KVAtomBox* child, int index);
    /// Deletes the child and all below it; ignored out of range.
    void removeChild(int index);
    /// From the last to the first.
    void removeAllChildren() noexcept;
    /// Unowned; null out of range.
    KVAtomBox* getChild(int index) const noexcept;
    int getChildCount() const noexcept { return static_cast<int>(children_.size()); }

    /// The first node of that type below this one, in document order; null if there is none. Not
    /// recursive, it looks at direct children alone. Nothing is found below a node whose size is 0.
    /// Unowned.
    KVAtomBox* findFirstChild(bool recursive, unsigned int type) const;
    /// Appends every node of that type to `found`, in document order, also those below another
    /// match. Unowned.
    void findAllChildren(std::vector<KVAtomBox*>& found, bool recursive, unsigned int type) const;

    // --- Sizes ---

    /// Payload size becomes the children's sizes plus the length of the payload data. Size is that
    /// for a node without parent, 16 more when it exceeds 0xFFFFFFFE, else 8 more.
    void updateSize() noexcept;
    /// `updateSize` for each node above this one, up to the root.
    void updateParentSizes() noexcept;

private:
    friend class KVAtomBoxFile;
    friend class KVImageDescAtomBox;

    /// All but the children.
    void copyFields(KVAtomBox const& other) noexcept;
    /// How many bytes the header takes when it is written: 0 when size is not above payload size,
    /// 16 when size exceeds 0x7FFFFFFE, else 8. That limit is lower than the one of `updateSize`,
    /// so a node rebuilt with a size between the two comes out 8 bytes longer than its size says.
    unsigned int getWrittenHeaderSize() const noexcept;
    /// Re-measures, from the leaves up, every container that its children do not fill and every
    /// empty atom with a 16-byte header that would be written with one of 8. In a tree read from a
    /// sound file nothing changes.
    void fitSizes();

    unsigned long long offset_ = 0;
    unsigned long long size_ = 0;
    unsigned long long payloadSize_ = 0;
    unsigned int type_ = 0;
    /// Whether the payload data is a chunk offset table that the last write put there.
    bool holdsMovedTable_ = false;
    KVAtomBox* parent_ = nullptr;
    KVCFRef<CFDataRef> payloadData_;
    std::vector<std::unique_ptr<KVAtomBox>> children_;
};

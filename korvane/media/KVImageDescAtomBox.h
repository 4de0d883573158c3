#pragma once

#include <korvane/media/KVAtomBox.h>
#include <korvane/platform/CFDictionary.h>

#include <cstdint>
#include <span>
#include <vector>

/// The image descriptions of a video track, that is the payload of its `stsd` atom (ISO/IEC
/// 14496-12, 8.5.2 and 12.1.3; QuickTime File Format, "Video Sample Description"), as a tree that
/// can be edited.
///
///     KVImageDescAtomBox descriptions(stsdPayload);
///     descriptions.setImageDescPixelAspectInfo(0, 4, 3);
///     auto changed = descriptions.copyFullImageDescToData(false);
///
/// The tree, as `getTopAtomBox` shows it, with offsets into the payload:
///
///     root (type 0)
///       avc1, hvc1, ap4h, ...   a description; its type is the codec
///         stsd                  its fixed fields, 78 bytes without a header
///         clut                  its colour table, without a header, if it has one
///         avcC, pasp, colr ...  extensions, each with a header
///         sv3d                  and below it svhd and proj, below proj prhd, cbmp, equi, mshp
///
/// Descriptions are counted from 0. Where one is malformed, what was read of it stays usable and is
/// what gets written; bytes that are in no atom of the tree are not.
///
/// Used by one thread at a time.
class KV_EXPORT KVImageDescAtomBox {
public:
    /// Without descriptions.
    KVImageDescAtomBox() noexcept = default;
    /// Copies the payload and reads it; null gives an object without descriptions, as does a
    /// payload shorter than 8 bytes or one that says it has more descriptions than fit, at 86 bytes
    /// each.
    explicit KVImageDescAtomBox(CFDataRef payload);
    KVImageDescAtomBox(void const* bytes, std::size_t length);
    /// Deep copies.
    KVImageDescAtomBox(KVImageDescAtomBox const& other);
    KVImageDescAtomBox& operator=(KVImageDescAtomBox const& other);
    ~KVImageDescAtomBox() = default;

    int getImageDescCount() const noexcept { return root_.getChildCount(); }
    /// 0 out of range.
    unsigned int getImageDescCodec(int index) const noexcept;
    KVAtomBox const& getTopAtomBox() const noexcept { return root_; }

    // --- Any atom of a description ---

    /// The payload of the first atom of that type, at any depth; null when there is none. From the
    /// original payload it is read with its start and length cut to 16 bits; that of a container is
    /// made from its children, its length cut likewise.
    KVCFRef<CFMutableDataRef> copyImageDescData(int index, unsigned int type) const;
    /// Replaces the payload of the first atom of that type, or adds one at the end of the
    /// description. Nothing for an index out of range or null data.
    void setImageDescData(int index, unsigned int type, CFDataRef data);
    /// Removes the first atom of that type, at any depth, with all below it. False when there is
    /// none.
    bool removeImageDescData(int index, unsigned int type);

    // --- Standard extensions ---
    //
    // The getters answer 0, or -1 for a bad index, a missing atom or one that is too short; null
    // pointers are passed over. The setters do nothing for a bad index.

    /// `colr` of type "nclc": code points of ITU-T H.273. -1 also for a `colr` of another type.
    int getImageDescColorInfo(int index, int* primaries, int* transfer, int* matrix) const;
    /// Stores 10 bytes, numbers of 16 bits and no type code:
    ///
    ///     byte    0 1        2 3  4 5  6 7       8 9
    ///             primaries  0    0    transfer  matrix
    ///
    /// That is not the layout which the getter reads, and it answers -1 afterwards. To store a
    /// `colr` that players understand, give its bytes to `setImageDescData`.
    void setImageDescColorInfo(int index, int primaries, int transfer, int matrix);
    /// `fiel`: number of fields and their order.
    int getImageDescFieldInfo(int index, int* fields, int* detail) const;
    void setImageDescFieldInfo(int index, int fields, int detail);
    /// `pasp`: width and height of a pixel.
    int getImageDescPixelAspectInfo(int index, int* h, int* v) const;
    void setImageDescPixelAspectInfo(int index, int h, int v);

    // --- HDR and spherical video ---
    //
    // Dictionaries from the names of atoms to their payloads (`CFData`), as they stand in the
    // payload that this was made from: what was set since does not show. They are empty for a bad
    // index. When setting, entries with another name or another kind of value are passed over, and
    // atoms that the dictionary does not name stay.

    /// "mdcv" (SMPTE ST 2086) and "clli" (CTA-861.3).
    KVCFRef<CFMutableDictionaryRef> copyImageDescHDRInfo(int index) const;
    void setImageDescHDRInfo(int index, CFDictionaryRef info);
    /// "st3d", "svhd", "prhd", "cbmp", "equi", "mshp" (Spherical Video V2 RFC). Setting makes
    /// `sv3d` and `proj` where they are missing.
    KVCFRef<CFMutableDictionaryRef> copyImageDescGoogleV2Info(int index) const;
    void setImageDescGoogleV2Info(int index, CFDictionaryRef info);

    // --- Write ---

    /// With `enable`, puts the four zero bytes that end a QuickTime description behind the last
    /// extension; without, takes them off again: any last child with an empty payload goes.
    /// Descriptions without extensions, and those whose last is the colour table, stay as they are.
    void setQuickTimeCompatibility(bool enable);
    /// A new `stsd` payload: version, flags, count, descriptions; null when there are none. The
    /// flag ends each with the four zero bytes.
    KVCFRef<CFMutableDataRef> copyFullImageDescToData(bool quickTimeCompatible);

private:
    using Bytes = std::span<std::uint8_t const>;

    void parseAllImageDescriptions();
    std::uint64_t parseImageDescription(std::uint64_t offset);
    std::uint64_t parseChildren(KVAtomBox& parent, std::uint64_t position, std::uint64_t end);
    std::unique_ptr<KVAtomBox> readHeader(std::uint64_t position, std::uint64_t available) const;
    /// The payload's bytes [start, start + length), or none when they do not lie in it.
    Bytes sourceBytes(std::uint64_t start, std::uint64_t length) const noexcept;
    KVAtomBox* findAtom(int index, unsigned int type) const;
    KVCFRef<CFMutableDictionaryRef>
    copyAtomBoxChildPayloads(KVAtomBox const* atom, std::span<unsigned int const> types) const;
    static void setAtomBoxChildPayloads(KVAtomBox& atom, CFDictionaryRef payloads);
    std::size_t writeAtomBox(KVAtomBox const& atom, std::uint8_t* buffer,
                             std::size_t capacity) const;

    std::vector<std::uint8_t> source_;
    KVAtomBox root_;
};

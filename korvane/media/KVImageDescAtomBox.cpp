#include <korvane/media/KVImageDescAtomBox.h>

#include <korvane/foundation/KVNSRef.h>
#include <korvane/media/KVAtomBytes_p.h>

#include <algorithm>
#include <cstring>

namespace {

// Positions in a description, from its first byte (ISO/IEC 14496-12, 12.1.3).
constexpr std::uint64_t kFieldsStart = 8;
constexpr std::uint64_t kFieldsSize = 78;
constexpr std::uint64_t kColourTableField = 84;
constexpr std::uint64_t kSmallestDescription = kFieldsStart + kFieldsSize;

constexpr unsigned int kStsd = KVAtomType("stsd");
constexpr unsigned int kClut = KVAtomType("clut");
constexpr unsigned int kHDRTypes[] = {KVAtomType("mdcv"), KVAtomType("clli")};
constexpr unsigned int kSphericalTypes[] = {KVAtomType("st3d"), KVAtomType("svhd"),
                                            KVAtomType("prhd"), KVAtomType("cbmp"),
                                            KVAtomType("equi"), KVAtomType("mshp")};

std::string typeName(unsigned int type)
{
    std::string name(4, ' ');
    for (int i = 3; i >= 0; --i, type >>= 8)
        name[static_cast<std::size_t>(i)] = static_cast<char>(type & 0xFF);
    return name;
}

/// 0 for a name that is no four characters of a byte each.
unsigned int typeOfName(CFStringRef name) noexcept
{
    unsigned int type = 0;
    if (name->length() != 4)
        return 0;
    for (char16_t const unit : name->view()) {
        if (unit > 0xFF)
            return 0;
        type = type << 8 | unit;
    }
    return type;
}

/// Unowned; null unless the value under the name is data.
CFDataRef dataNamed(CFDictionaryRef dictionary, unsigned int type)
{
    return dynamic_cast<CFDataRef>(dictionary->value(typeName(type)));
}

/// The entries of those names that hold data.
KVCFRef<CFMutableDictionaryRef> selectData(CFDictionaryRef dictionary,
                                           std::span<unsigned int const> types)
{
    auto selected = KVMakeRef<NSMutableDictionary>();
    for (unsigned int const type : types)
        if (CFDataRef const data = dataNamed(dictionary, type))
            selected->setValue(typeName(type), data);
    return selected;
}

/// A new child at the end. Sizes are the caller's.
KVAtomBox& appendAtom(KVAtomBox& parent, unsigned int type)
{
    auto* const atom = new KVAtomBox(type);
    atom->setParent(&parent);
    parent.addChild(atom);
    return *atom;
}

/// A child that stands for bytes without a header.
void appendHeaderless(KVAtomBox& parent, unsigned int type, std::uint64_t offset,
                      std::uint64_t size)
{
    KVAtomBox& atom = appendAtom(parent, type);
    atom.setOffset(offset);
    atom.setSize(size);
    atom.setPayloadSize(size);
}

KVAtomBox& findOrAppend(KVAtomBox& parent, unsigned int type)
{
    KVAtomBox* const found = parent.findFirstChild(true, type);
    return found ? *found : appendAtom(parent, type);
}

std::size_t writeAtomBoxHeader(KVAtomBox const& atom, std::uint8_t* buffer,
                               std::size_t capacity) noexcept
{
    std::uint64_t const size = atom.getSize();
    if (size <= atom.getPayloadSize())
        return 0;
    if (size == 4 && atom.getPayloadSize() == 0 && capacity >= 4) {
        writeBigEndian(buffer, 4, 0);
        return 4;
    }
    bool const shortForm = capacity >= 8 && size < 0x7FFFFFFF;
    if (!shortForm && capacity < 16)
        return 0;
    writeBigEndian(buffer, 4, shortForm ? size : 1);
    writeBigEndian(buffer + 4, 4, atom.getType());
    if (shortForm)
        return 8;
    writeBigEndian(buffer + 8, 8, size);
    return 16;
}

} // namespace

// --- Reading ---

KVImageDescAtomBox::KVImageDescAtomBox(CFDataRef payload)
{
    if (payload)
        source_.assign(payload->span().begin(), payload->span().end());
    parseAllImageDescriptions();
}

KVImageDescAtomBox::KVImageDescAtomBox(void const* bytes, std::size_t length)
{
    auto const* const first = static_cast<std::uint8_t const*>(bytes);
    if (first)
        source_.assign(first, first + length);
    parseAllImageDescriptions();
}

KVImageDescAtomBox::KVImageDescAtomBox(KVImageDescAtomBox const& other)
    : source_(other.source_), root_(other.root_)
{
    root_.repairParents();
}

KVImageDescAtomBox& KVImageDescAtomBox::operator=(KVImageDescAtomBox const& other)
{
    source_ = other.source_;
    root_ = other.root_;
    root_.repairParents();
    return *this;
}

void KVImageDescAtomBox::parseAllImageDescriptions()
{
    // Version and flags, the count, the descriptions.
    if (source_.size() < 8)
        return;
    std::uint64_t const count = readBigEndian(source_.data() + 4, 4);
    if (count * kSmallestDescription + 8 > source_.size())
        return;
    std::uint64_t offset = 8;
    for (std::uint64_t i = 0; i < count; ++i) {
        std::uint64_t const size = parseImageDescription(offset);
        if (size == 0)
            break;
        offset += size;
    }
    root_.updateSize();
}

/// The size of the description, or 0 if it can not be read to its end.
std::uint64_t KVImageDescAtomBox::parseImageDescription(std::uint64_t offset)
{
    auto header = readHeader(offset, source_.size() - offset);
    if (!header)
        return 0;
    KVAtomBox& description = *header;
    description.setParent(&root_);
    root_.addChild(header.release());

    // What follows is taken to stand behind a header of 8 bytes, whatever its form.
    std::uint64_t const size = description.getSize();
    std::uint64_t const end = offset + size;
    if (description.getPayloadSize() < kFieldsSize)
        return 0;
    appendHeaderless(description, kStsd, offset + kFieldsStart, kFieldsSize);
    std::uint64_t position = offset + kSmallestDescription;

    if (readBigEndian(source_.data() + offset + kColourTableField, 2) == 0) {
        // A seed, flags, the index of the last colour, then 8 bytes a colour.
        if (end - position < 16)
            return 0;
        std::uint64_t const last = readBigEndian(source_.data() + position + 6, 2);
        std::uint64_t const tableSize = last * 8 + 16;
        if (last > 0x7FFF || tableSize > end - position)
            return 0;
        appendHeaderless(description, kClut, position, tableSize);
        position += tableSize;
    }

    position = parseChildren(description, position, end);
    for (unsigned int const type : {KVAtomType("sv3d"), KVAtomType("proj")}) {
        if (KVAtomBox* const container = description.findFirstChild(true, type)) {
            std::uint64_t const start = container->getOffset() + container->getHeaderSize();
            parseChildren(*container, start, start + container->getPayloadSize());
        }
    }
    // The four zero bytes behind the extensions of a QuickTime description fall away here.
    if (position < end)
        description.updateSize();
    return size;
}

/// The position of the first byte that is in no child.
std::uint64_t KVImageDescAtomBox::parseChildren(KVAtomBox& parent, std::uint64_t position,
                                                std::uint64_t end)
{
    while (parent.getChildCount() < kMostChildAtoms) {
        auto child = readHeader(position, end - position);
        if (!child)
            break;
        position += child->getSize();
        child->setParent(&parent);
        parent.addChild(child.release());
    }
    return position;
}

std::unique_ptr<KVAtomBox> KVImageDescAtomBox::readHeader(std::uint64_t position,
                                                          std::uint64_t available) const
{
    std::uint64_t next = position;
    auto const read = [&](std::uint8_t(&bytes)[8]) {
        Bytes const source = sourceBytes(next, sizeof bytes);
        if (source.empty())
            return -1;
        std::memcpy(bytes, source.data(), sizeof bytes);
        next += sizeof bytes;
        return 0;
    };
    AtomHeader header;
    if (readAtomHeader(read, available, header) != 0)
        return nullptr;
    auto atom = std::make_unique<KVAtomBox>(header.type);
    atom->setOffset(position);
    atom->setSize(header.size);
    atom->setPayloadSize(header.payloadSize);
    return atom;
}

KVImageDescAtomBox::Bytes KVImageDescAtomBox::sourceBytes(std::uint64_t start,
                                                          std::uint64_t length) const noexcept
{
    if (start > source_.size() || length > source_.size() - start)
        return {};
    return Bytes(source_).subspan(static_cast<std::size_t>(start),
                                  static_cast<std::size_t>(length));
}

unsigned int KVImageDescAtomBox::getImageDescCodec(int index) const noexcept
{
    KVAtomBox const* const description = root_.getChild(index);
    return description ? description->getType() : 0;
}

// --- Any atom ---

KVAtomBox* KVImageDescAtomBox::findAtom(int index, unsigned int type) const
{
    KVAtomBox const* const description = root_.getChild(index);
    return description ? description->findFirstChild(true, type) : nullptr;
}

KVCFRef<CFMutableDataRef> KVImageDescAtomBox::copyImageDescData(int index, unsigned int type) const
{
    using Result = KVCFRef<CFMutableDataRef>;
    KVAtomBox const* const atom = findAtom(index, type);
    if (!atom)
        return nullptr;
    if (CFDataRef const data = atom->getPayloadData())
        return Result::adopt(new __CFData(data->bytes(), data->length()));

    std::size_t const length = atom->getPayloadSize() & 0xFFFF;
    auto result = Result::adopt(new __CFData());
    if (atom->getChildCount() == 0) {
        std::uint64_t const start = (atom->getOffset() + atom->getHeaderSize()) & 0xFFFF;
        Bytes const source = sourceBytes(start, length);
        result->append(source.data(), source.size());
        return result;
    }
    result->setLength(length);
    std::size_t written = 0;
    for (int i = 0; i < atom->getChildCount(); ++i)
        written +=
            writeAtomBox(*atom->getChild(i), result->mutableBytes() + written, length - written);
    return result;
}

void KVImageDescAtomBox::setImageDescData(int index, unsigned int type, CFDataRef data)
{
    KVAtomBox* const description = root_.getChild(index);
    if (!description || !data)
        return;
    KVAtomBox* atom = description->findFirstChild(true, type);
    if (!atom) {
        atom = &appendAtom(*description, type);
        atom->setSize(data->length() + 8);
        atom->setPayloadSize(data->length());
        description->updateSize();
        description->updateParentSizes();
    }
    atom->setPayloadData(data);
    if (atom->getPayloadSize() != data->length()) {
        atom->updateSize();
        atom->updateParentSizes();
    }
}

bool KVImageDescAtomBox::removeImageDescData(int index, unsigned int type)
{
    KVAtomBox* const atom = findAtom(index, type);
    // Without the parts that have no header it would be no description any more.
    if (!atom || atom->getHeaderSize() == 0)
        return false;
    KVAtomBox* const parent = atom->getParent();
    int place = 0;
    while (parent->getChild(place) != atom)
        ++place;
    parent->removeChild(place);
    parent->updateSize();
    parent->updateParentSizes();
    return true;
}

// --- Standard extensions ---

int KVImageDescAtomBox::getImageDescColorInfo(int index, int* primaries, int* transfer,
                                              int* matrix) const
{
    auto const data = copyImageDescData(index, KVAtomType("colr"));
    if (!data || data->length() < 10 || readBigEndian(data->bytes(), 4) != KVAtomType("nclc"))
        return -1;
    int position = 4;
    for (int* const value : {primaries, transfer, matrix}) {
        if (value)
            *value = static_cast<int>(readBigEndian(data->bytes() + position, 2));
        position += 2;
    }
    return 0;
}

void KVImageDescAtomBox::setImageDescColorInfo(int index, int primaries, int transfer, int matrix)
{
    std::uint8_t bytes[10] = {};
    writeBigEndian(bytes, 2, static_cast<std::uint64_t>(primaries));
    writeBigEndian(bytes + 6, 2, static_cast<std::uint64_t>(transfer));
    writeBigEndian(bytes + 8, 2, static_cast<std::uint64_t>(matrix));
    __CFData const data(bytes, sizeof bytes);
    setImageDescData(index, KVAtomType("colr"), &data);
}

int KVImageDescAtomBox::getImageDescFieldInfo(int index, int* fields, int* detail) const
{
    auto const data = copyImageDescData(index, KVAtomType("fiel"));
    if (!data || data->length() < 2)
        return -1;
    if (fields)
        *fields = data->bytes()[0];
    if (detail)
        *detail = data->bytes()[1];
    return 0;
}

void KVImageDescAtomBox::setImageDescFieldInfo(int index, int fields, int detail)
{
    std::uint8_t const bytes[2] = {static_cast<std::uint8_t>(fields),
                                   static_cast<std::uint8_t>(detail)};
    __CFData const data(bytes, sizeof bytes);
    setImageDescData(index, KVAtomType("fiel"), &data);
}

int KVImageDescAtomBox::getImageDescPixelAspectInfo(int index, int* h, int* v) const
{
    auto const data = copyImageDescData(index, KVAtomType("pasp"));
    if (!data || data->length() < 8)
        return -1;
    if (h)
        *h = static_cast<std::int32_t>(readBigEndian(data->bytes(), 4));
    if (v)
        *v = static_cast<std::int32_t>(readBigEndian(data->bytes() + 4, 4));
    return 0;
}

void KVImageDescAtomBox::setImageDescPixelAspectInfo(int index, int h, int v)
{
    std::uint8_t bytes[8];
    writeBigEndian(bytes, 4, static_cast<std::uint64_t>(h));
    writeBigEndian(bytes + 4, 4, static_cast<std::uint64_t>(v));
    __CFData const data(bytes, sizeof bytes);
    setImageDescData(index, KVAtomType("pasp"), &data);
}

// --- HDR and spherical video ---

KVCFRef<CFMutableDictionaryRef>
KVImageDescAtomBox::copyAtomBoxChildPayloads(KVAtomBox const* atom,
                                             std::span<unsigned int const> types) const
{
    auto payloads = KVMakeRef<NSMutableDictionary>();
    for (unsigned int const type : types) {
        KVAtomBox const* const child = atom ? atom->findFirstChild(true, type) : nullptr;
        // One that was made here has no place in the source.
        if (!child || child->getOffset() == 0)
            continue;
        Bytes const source =
            sourceBytes(child->getOffset() + child->getHeaderSize(), child->getPayloadSize());
        if (source.size() == child->getPayloadSize())
            payloads->setValue(typeName(type), KVCFRef<CFDataRef>::adopt(
                                                   new __CFData(source.data(), source.size())));
    }
    return payloads;
}

void KVImageDescAtomBox::setAtomBoxChildPayloads(KVAtomBox& atom, CFDictionaryRef payloads)
{
    for (std::size_t i = 0; i < payloads->count(); ++i) {
        unsigned int const type = typeOfName(payloads->keyAtIndex(i));
        auto const* const data = dynamic_cast<CFDataRef>(payloads->valueAtIndex(i));
        if (type == 0 || !data)
            continue;
        KVAtomBox& child = findOrAppend(atom, type);
        child.setPayloadData(data);
        child.updateSize();
    }
    atom.updateSize();
}

KVCFRef<CFMutableDictionaryRef> KVImageDescAtomBox::copyImageDescHDRInfo(int index) const
{
    return copyAtomBoxChildPayloads(root_.getChild(index), kHDRTypes);
}

void KVImageDescAtomBox::setImageDescHDRInfo(int index, CFDictionaryRef info)
{
    KVAtomBox* const description = root_.getChild(index);
    if (!description || !info)
        return;
    setAtomBoxChildPayloads(*description, selectData(info, kHDRTypes));
    description->updateParentSizes();
}

KVCFRef<CFMutableDictionaryRef> KVImageDescAtomBox::copyImageDescGoogleV2Info(int index) const
{
    return copyAtomBoxChildPayloads(root_.getChild(index), kSphericalTypes);
}

void KVImageDescAtomBox::setImageDescGoogleV2Info(int index, CFDictionaryRef info)
{
    KVAtomBox* const description = root_.getChild(index);
    if (!description || !info)
        return;
    setImageDescData(index, kSphericalTypes[0], dataNamed(info, kSphericalTypes[0]));
    auto const inSpherical = selectData(info, std::span(kSphericalTypes).subspan(1, 1));
    auto const inProjection = selectData(info, std::span(kSphericalTypes).subspan(2));
    if (inSpherical->count() + inProjection->count() == 0)
        return;
    KVAtomBox& spherical = findOrAppend(*description, KVAtomType("sv3d"));
    setAtomBoxChildPayloads(spherical, inSpherical);
    KVAtomBox& projection = findOrAppend(spherical, KVAtomType("proj"));
    setAtomBoxChildPayloads(projection, inProjection);
    spherical.updateSize();
    spherical.updateParentSizes();
}

// --- Writing ---

void KVImageDescAtomBox::setQuickTimeCompatibility(bool enable)
{
    for (int i = 0; i < root_.getChildCount(); ++i) {
        KVAtomBox& description = *root_.getChild(i);
        int const count = description.getChildCount();
        if (count < 2)
            continue;
        KVAtomBox const& last = *description.getChild(count - 1);
        if (last.getType() == kClut)
            continue;
        if (enable && last.getPayloadSize() != 0)
            appendAtom(description, 0).setSize(4);
        else if (!enable && last.getPayloadSize() == 0)
            description.removeChild(count - 1);
        description.updateSize();
    }
    root_.updateSize();
}

KVCFRef<CFMutableDataRef> KVImageDescAtomBox::copyFullImageDescToData(bool quickTimeCompatible)
{
    if (getImageDescCount() == 0)
        return nullptr;
    if (quickTimeCompatible)
        setQuickTimeCompatibility(true);
    root_.fitSizes();

    auto result = KVCFRef<CFMutableDataRef>::adopt(new __CFData());
    result->setLength(8 + static_cast<std::size_t>(root_.getSize()));
    std::uint8_t* const bytes = result->mutableBytes();
    writeBigEndian(bytes + 4, 4, static_cast<std::uint64_t>(getImageDescCount()));
    std::size_t written = 8;
    for (int i = 0; i < getImageDescCount(); ++i)
        written += writeAtomBox(*root_.getChild(i), bytes + written, result->length() - written);
    result->setLength(written);

    if (quickTimeCompatible)
        setQuickTimeCompatibility(false);
    return result;
}

/// The number of bytes written; 0 if the atom does not fit. Goes down four levels at most: a
/// description, `sv3d`, `proj` and what is in that.
std::size_t KVImageDescAtomBox::writeAtomBox(KVAtomBox const& atom, std::uint8_t* buffer,
                                             std::size_t capacity) const
{
    if (atom.getSize() > capacity)
        return 0;
    CFDataRef const data = atom.getPayloadData();
    bool const hasData = data && data->length() == atom.getPayloadSize();
    if (!hasData && atom.getChildCount() == 0 && atom.getPayloadSize() > 0) {
        // Its range in the source, header included.
        Bytes const source = sourceBytes(atom.getOffset(), atom.getSize());
        std::copy(source.begin(), source.end(), buffer);
        return source.size();
    }
    std::size_t written = writeAtomBoxHeader(atom, buffer, capacity);
    if (hasData && data->length() <= capacity - written) {
        std::copy(data->span().begin(), data->span().end(), buffer + written);
        return written + data->length();
    }
    for (int i = 0; i < atom.getChildCount(); ++i) {
        KVAtomBox const& child = *atom.getChild(i);
        std::uint8_t* const start = buffer + written;
        std::size_t const length = writeAtomBox(child, start, capacity - written);
        // A copied size of 0, "to the end", is true of the last atom alone: it would swallow those
        // that have been added behind it.
        if (i + 1 < atom.getChildCount() && child.getHeaderSize() >= 8 && length >= 8 &&
            readBigEndian(start, 4) == 0)
            writeBigEndian(start, 4, length);
        written += length;
    }
    return written;
}

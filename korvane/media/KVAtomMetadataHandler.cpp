#include <korvane/media/KVAtomMetadataHandler.h>

#include <korvane/foundation/KVNSRef.h>
#include <korvane/media/KVAtomStatus_p.h>
#include <korvane/media/KVMovieMetadata_p.h>

#include <algorithm>
#include <string>

namespace {

constexpr unsigned int kUuid = KVAtomType("uuid");
constexpr unsigned int kTrak = KVAtomType("trak");

/// Unowned; null unless the value is a dictionary.
CFDictionaryRef dictionaryOf(CFDictionaryRef metadata, char const* key) noexcept
{
    return dynamic_cast<CFDictionaryRef>(metadata->value(key));
}

/// The value if it is a string, else the null string.
KVString textOf(CFDictionaryRef metadata, char const* key)
{
    return KVString(dynamic_cast<CFStringRef>(metadata->value(key)));
}

void setIfNotEmpty(CFMutableDictionaryRef metadata, char const* key, CFDictionaryRef value)
{
    if (value->count() > 0)
        metadata->setValue(key, value);
}

/// Puts the payload in the first direct child of type `uuid`, or in a new one at the end, and
/// re-measures upward.
void setUUIDAtomBox(KVAtomBox& parent, CFDataRef payload)
{
    KVAtomBox* atom = parent.findFirstChild(false, kUuid);
    if (!atom) {
        atom = new KVAtomBox(kUuid);
        atom->setParent(&parent);
        parent.addChild(atom);
    }
    atom->setPayloadData(payload);
    atom->updateSize();
    atom->updateParentSizes();
}

} // namespace

KVAtomMetadataHandler::KVAtomMetadataHandler() : metadata_(KVMakeRef<NSMutableDictionary>()) {}

KVAtomMetadataHandler::KVAtomMetadataHandler(KVAtomMetadataHandler const& other)
    : KVAtomBoxFile(other),
      metadata_(KVCFRef<CFMutableDictionaryRef>::adopt(
          CFDictionaryCreateMutableCopy(nullptr, 0, other.metadata_))),
      imageDesc_(other.imageDesc_)
{
    // The two trees are alike, so their tracks come in the same order.
    std::vector<KVAtomBox*> originals, copies;
    other.findAllChildren(originals, true, kTrak);
    findAllChildren(copies, true, kTrak);
    auto const place = std::find(originals.begin(), originals.end(), other.videoTrack_);
    if (place != originals.end())
        videoTrack_ = copies[static_cast<std::size_t>(place - originals.begin())];
}

KVAtomMetadataHandler::~KVAtomMetadataHandler() = default;

int KVAtomMetadataHandler::openInputFile(CFURLRef url)
{
    if (url) {
        imageDesc_.reset();
        videoTrack_ = nullptr;
    }
    return KVAtomBoxFile::openInputFile(url);
}

KVImageDescAtomBox* KVAtomMetadataHandler::getImageDesc() noexcept
{
    return imageDesc_ ? &*imageDesc_ : nullptr;
}

KVAtomBox* KVAtomMetadataHandler::getVideoTrack() const
{
    // The host may have changed the tree meanwhile.
    std::vector<KVAtomBox*> tracks;
    findAllChildren(tracks, true, kTrak);
    return std::find(tracks.begin(), tracks.end(), videoTrack_) != tracks.end() ? videoTrack_
                                                                                : nullptr;
}

// --- Reading ---

int KVAtomMetadataHandler::readFileStructure()
{
    return isFileValidType() ? readAllTrackMediaAtomBoxes() : -1;
}

int KVAtomMetadataHandler::readImageDescriptionData()
{
    imageDesc_.reset();
    videoTrack_ = nullptr;
    std::vector<KVAtomBox*> tracks;
    if (findTracks(tracks, KVAtomType("vide"), 1) != 0 || tracks.empty())
        return -1;
    auto const payload = KVCFRef<CFMutableDataRef>::adopt(new __CFData());
    if (readTrackSampleDescription(tracks[0], payload) != 0)
        return -1;
    imageDesc_.emplace(payload);
    videoTrack_ = tracks[0];
    return 0;
}

void KVAtomMetadataHandler::readUUIDAtomBoxes()
{
    std::vector<KVAtomBox*> atoms;
    findAllChildren(atoms, true, kUuid);
    for (KVAtomBox const* atom : atoms) {
        std::array<std::uint8_t, 16> uuid;
        if (readPayloadStart(atom, uuid.data(), uuid.size()) != 0)
            continue;
        char const* const key = uuid == kAdobeXMPUUID   ? kKVAdobeXMPMetadata
                                : uuid == kGoogleV1UUID ? kKVGoogleV1Metadata
                                                        : nullptr;
        auto const payload = KVCFRef<CFMutableDataRef>::adopt(new __CFData());
        if (!key || readAtomBoxPayload(atom, payload) != 0)
            continue;
        std::string_view const bytes(reinterpret_cast<char const*>(payload->bytes()),
                                     payload->length());
        KVString const text = KVString::fromUTF8(bytes.substr(uuid.size()));
        if (!text.isNull())
            metadata_->setValue(key, text.cf_str());
    }
}

int KVAtomMetadataHandler::readMetadata()
{
    return orOutOfMemory([&] {
        if (int const code = readFileStructure())
            return code;
        readUUIDAtomBoxes();
        if (readImageDescriptionData() != 0)
            return 0;

        auto const xmp = createParsedAdobeXMPMetadata(textOf(metadata_, kKVAdobeXMPMetadata));
        if (xmp->count() > 0) {
            char const* const key = xmp->value("proj:type")              ? kKVPanoMetadata
                                    : xmp->value("GPano:ProjectionType") ? kKVPhotoSphereMetadata
                                    : xmp->value("xmlns:exif")           ? kKVEXIFMetadata
                                                                         : kKVAdobeXMPMetadata;
            metadata_->setValue(kKVAdobeXMPMetadata, nullptr);
            metadata_->setValue(key, xmp);
        }
        setIfNotEmpty(metadata_, kKVGoogleV1Metadata,
                      createParsedGoogleV1Metadata(textOf(metadata_, kKVGoogleV1Metadata)));
        setIfNotEmpty(metadata_, kKVGoogleV2Metadata, createParsedGoogleV2Metadata(*imageDesc_));
        setIfNotEmpty(metadata_, kKVHDRMetadata, createParsedHDRMetadata(*imageDesc_));
        setIfNotEmpty(metadata_, kKVStandardExtensionsMetadata,
                      createParsedStandardExtensionData(*imageDesc_));
        return 0;
    });
}

KVCFRef<CFDictionaryRef> KVAtomMetadataHandler::copyMetadata() const
{
    // The dictionaries inside are never changed once they are there.
    return KVCFRef<CFDictionaryRef>::adopt(CFDictionaryCreateCopy(nullptr, metadata_));
}

void KVAtomMetadataHandler::setMetadata(CFDictionaryRef metadata)
{
    if (!metadata)
        return;
    for (char const* const key : {kKVGoogleV1Metadata, kKVGoogleV2Metadata, kKVAdobeXMPMetadata,
                                  kKVHDRMetadata, kKVStandardExtensionsMetadata})
        metadata_->setValue(key, KVCFRef<CFDictionaryRef>::adopt(
                                     CFDictionaryCreateCopy(nullptr, dictionaryOf(metadata, key))));
}

// --- Writing ---

int KVAtomMetadataHandler::writeMetadataWithUpdates()
{
    if (int const code = updateAtomsWithMetadata())
        return code;
    return writeAtomBoxFileWithUpdates();
}

int KVAtomMetadataHandler::updateAtomsWithMetadata()
{
    return orOutOfMemory([&] {
        KVAtomBox* const track = getVideoTrack();
        if ((!track || !imageDesc_) && readImageDescriptionData() != 0)
            return -1;
        writeAdobeXMPMetadata();
        writeGoogleV1Metadata();
        writeGoogleV2Metadata();
        writeHDRMetadata();
        writeStandardExtensionMetadata();

        auto const payload =
            imageDesc_->copyFullImageDescToData(getFileType() == KVAtomType("qt  "));
        KVAtomBox* const atom = videoTrack_->findFirstChild(true, KVAtomType("stsd"));
        if (!payload || !atom)
            return -1;
        atom->setPayloadData(payload);
        atom->updateSize();
        atom->updateParentSizes();
        imageDesc_.emplace(payload);
        return 0;
    });
}

void KVAtomMetadataHandler::writeAdobeXMPMetadata()
{
    // Raw text goes out as it stands, without the UUID that reading it took off. A dictionary has
    // no form in a file.
    NSObject const* const value = metadata_->value(kKVAdobeXMPMetadata);
    KVCFRef<CFDataRef> payload(dynamic_cast<CFDataRef>(value));
    if (auto const* const text = dynamic_cast<CFStringRef>(value)) {
        std::string const utf8 = CFStringGetUTF8(text);
        payload = KVCFRef<CFDataRef>::adopt(new __CFData(utf8.data(), utf8.size()));
    }
    if (payload)
        setUUIDAtomBox(*this, payload);
}

void KVAtomMetadataHandler::writeGoogleV1Metadata()
{
    auto const payload = createRawGoogleV1Metadata(dictionaryOf(metadata_, kKVGoogleV1Metadata));
    if (videoTrack_ && payload)
        setUUIDAtomBox(*videoTrack_, payload);
}

void KVAtomMetadataHandler::writeGoogleV2Metadata()
{
    auto const payloads = createRawGoogleV2Metadata(dictionaryOf(metadata_, kKVGoogleV2Metadata));
    if (payloads)
        imageDesc_->setImageDescGoogleV2Info(0, payloads);
}

void KVAtomMetadataHandler::writeHDRMetadata()
{
    auto const payloads = createRawHDRMetadata(dictionaryOf(metadata_, kKVHDRMetadata));
    if (payloads)
        imageDesc_->setImageDescHDRInfo(0, payloads);
}

void KVAtomMetadataHandler::writeStandardExtensionMetadata()
{
    CFDictionaryRef const values = dictionaryOf(metadata_, kKVStandardExtensionsMetadata);
    if (!values || values->count() == 0)
        return;
    auto const integer = [&](char const* key) { return metadataInteger(values, key, -1); };
    int const primaries = integer("color_primaries");
    int const transfer = integer("color_transfer");
    int const matrix = integer("color_matrix");
    if (primaries >= 1 && transfer >= 1 && matrix >= 1)
        imageDesc_->setImageDescColorInfo(0, primaries, transfer, matrix);
    int const fields = integer("field_fields");
    int const detail = integer("field_detail");
    if (fields >= 1 && detail >= 1)
        imageDesc_->setImageDescFieldInfo(0, fields, detail);
    int const h = integer("pixel_aspect_h");
    int const v = integer("pixel_aspect_v");
    if (h >= 1 && v >= 1)
        imageDesc_->setImageDescPixelAspectInfo(0, h, v);
}

#pragma once

#include <korvane/foundation/KVString.h>
#include <korvane/media/KVAtomBoxFile.h>
#include <korvane/media/KVImageDescAtomBox.h>

#include <optional>

/// Reads and writes the descriptive metadata of a movie's first enabled video track: spherical
/// video of both generations, XMP, mastering display and content light, colour, field order and
/// pixel aspect. The samples are never touched.
///
///     KVAtomMetadataHandler movie;
///     if (movie.openInputFile(source.cf_url()) == 0 && movie.readMetadata() == 0) {
///         auto metadata = KVCFRef<CFMutableDictionaryRef>::adopt(
///             CFDictionaryCreateMutableCopy(nullptr, 0, movie.copyMetadata()));
///         // ... change it ...
///         movie.setMetadata(metadata);
///         if (movie.openOutputFile(copy.cf_url()) == 0)
///             movie.writeMetadataWithUpdates();
///     }
///
/// The metadata is a dictionary of dictionaries of strings, under the keys `kKV...Metadata` below:
///
///     Google Version 2         stereo_mode; metadata_source;
///                              pose_yaw_degrees, pose_pitch_degrees, pose_roll_degrees;
///                              cube_layout, cube_padding;
///                              projection_bounds_top, _bottom, _left, _right
///     HDR Color and            display_primaries_x0, _y0, _x1, _y1, _x2, _y2;
///     Light Level              white_point_x, white_point_y;
///                              max_display_mastering_luminance, min_...;
///                              max_content_light_level, max_pic_average_light_level
///     Standard Extensions      color_primaries, color_transfer, color_matrix;
///                              field_fields, field_detail; pixel_aspect_h, pixel_aspect_v
///     Google Version 1, XMP    the names of XML elements and attributes
///
/// Integers are printed with "%d" (fields of 16 bits unsigned), angles with "%.6f" in degrees. When
/// written, a text is read as far as it is a decimal number, and cut to the range of its field.
/// docs/media.md tells the bytes.
///
/// What is read is not always what can be written back:
///
/// - `field_detail` reads as `field_fields`, and `pixel_aspect_v` as `pixel_aspect_h`.
/// - `colr` is written in a layout that is not the one which is read; see `setImageDescColorInfo`.
/// - First-generation metadata always says "equirectangular".
/// - Elements that it adds by default stand inside an element of their own name.
///
/// So give `setMetadata` what is to change, not all that was read.
///
/// Statuses are those of KVAtomBoxFile.
class KV_EXPORT KVAtomMetadataHandler : public KVAtomBoxFile {
public:
    KVAtomMetadataHandler();
    /// Deep copies; the track is the one at the same place in the copied tree. No files are open in
    /// the copy.
    KVAtomMetadataHandler(KVAtomMetadataHandler const& other);
    KVAtomMetadataHandler& operator=(KVAtomMetadataHandler const&) = delete;
    ~KVAtomMetadataHandler() override;

    /// Also forgets the track and its description; the metadata stays, so that it can be given to
    /// another file.
    int openInputFile(CFURLRef url) override;

    /// Reads the tree down to the sample tables. -1 when the file's type is not valid.
    int readFileStructure();
    /// Reads the tree and adds what the file holds to the metadata. Metadata that can not be parsed
    /// is simply absent; XMP and first-generation metadata stay raw text where parsing gives
    /// nothing, and where there is no video track.
    int readMetadata();

    /// The metadata as it is now, in a copy that later changes do not reach.
    KVCFRef<CFDictionaryRef> copyMetadata() const;
    /// For each of the five keys below: takes the dictionary that `metadata` holds under it, or
    /// removes what was there if it holds none. Other keys stay. Null does nothing.
    void setMetadata(CFDictionaryRef metadata);

    /// `updateAtomsWithMetadata`, then `writeAtomBoxFileWithUpdates`.
    int writeMetadataWithUpdates();
    /// Puts the metadata into the tree, which can then be looked at, and written. What the metadata
    /// does not name stays in the file; raw texts of first generation are not written. -1 without a
    /// video track or descriptions.
    int updateAtomsWithMetadata();

    /// The descriptions of the track, to be changed before the next write; null until the metadata
    /// was read. Unowned, gone with the next read or write.
    KVImageDescAtomBox* getImageDesc() noexcept;
    /// The track; null when none is known. Unowned.
    KVAtomBox* getVideoTrack() const;

private:
    int readImageDescriptionData();
    void readUUIDAtomBoxes();
    void writeAdobeXMPMetadata();
    void writeGoogleV1Metadata();
    void writeGoogleV2Metadata();
    void writeHDRMetadata();
    void writeStandardExtensionMetadata();

    KVCFRef<CFMutableDictionaryRef> metadata_;
    std::optional<KVImageDescAtomBox> imageDesc_;
    KVAtomBox* videoTrack_ = nullptr;
};

/// Keys of the metadata dictionary that are read and written.
inline constexpr char kKVAdobeXMPMetadata[] = "Adobe XMP Format Metadata";
inline constexpr char kKVGoogleV1Metadata[] = "Google Version 1 Metadata";
inline constexpr char kKVGoogleV2Metadata[] = "Google Version 2 Metadata";
inline constexpr char kKVHDRMetadata[] = "HDR Color and Light Level Metadata";
inline constexpr char kKVStandardExtensionsMetadata[] = "Standard Extensions Metadata";
/// Kinds of XMP that are recognised by a name in them; only read.
inline constexpr char kKVPanoMetadata[] = "PanoMeta XMP Metadata";
inline constexpr char kKVPhotoSphereMetadata[] = "PhotoSphere XMP Metadata";
inline constexpr char kKVEXIFMetadata[] = "EXIF XMP Metadata";

#include <korvane/media/KVMovieMetadata_p.h>

#include <korvane/foundation/KVNSRef.h>
#include <korvane/media/KVAtomBytes_p.h>
#include <korvane/media/KVXMPStringParser.h>
#include <korvane/platform/CFNumber.h>

#include <algorithm>
#include <charconv>
#include <cmath>
#include <limits>
#include <string>

namespace {

/// A number in a payload: its key and its size in bytes. Fields follow each other without a gap.
/// Those of 32 bits are signed, shorter ones are not.
struct Field {
    char const* key;
    int size;
};

constexpr Field kMasteringDisplay[] = {{"display_primaries_x0", 2},
                                       {"display_primaries_y0", 2},
                                       {"display_primaries_x1", 2},
                                       {"display_primaries_y1", 2},
                                       {"display_primaries_x2", 2},
                                       {"display_primaries_y2", 2},
                                       {"white_point_x", 2},
                                       {"white_point_y", 2},
                                       {"max_display_mastering_luminance", 4},
                                       {"min_display_mastering_luminance", 4}};
constexpr Field kContentLight[] = {{"max_content_light_level", 2},
                                   {"max_pic_average_light_level", 2}};
constexpr Field kCubemap[] = {{"cube_layout", 4}, {"cube_padding", 4}};
constexpr Field kEquirectangular[] = {{"projection_bounds_top", 4},
                                      {"projection_bounds_bottom", 4},
                                      {"projection_bounds_left", 4},
                                      {"projection_bounds_right", 4}};

struct Angle {
    char const* key;
    double limitDegrees;
};

constexpr Angle kPose[] = {
    {"pose_yaw_degrees", 180}, {"pose_pitch_degrees", 90}, {"pose_roll_degrees", 180}};

constexpr std::size_t kVersionAndFlags = 4;
/// `svhd` text with its zero.
constexpr std::size_t kLongestSource = 252;
constexpr char kWriter[] = "Brovo Vantor";

void setText(CFMutableDictionaryRef dictionary, char const* key, std::string const& text)
{
    if (KVString const string = KVString::fromUTF8(text); !string.isNull())
        dictionary->setValue(key, string.cf_str());
}

/// Unowned; null unless the value is a string.
CFStringRef textOf(CFDictionaryRef metadata, char const* key) noexcept
{
    return dynamic_cast<CFStringRef>(metadata->value(key));
}

CFDataRef payloadOf(CFDictionaryRef payloads, char const* name, std::size_t shortest) noexcept
{
    auto const* const data = dynamic_cast<CFDataRef>(payloads->value(name));
    return data && data->length() >= shortest ? data : nullptr;
}

template <std::size_t N>
void readFields(CFDataRef payload, std::size_t position, Field const (&fields)[N],
                CFMutableDictionaryRef result)
{
    for (Field const& field : fields) {
        // Bytes that a short payload lacks are zero.
        std::uint8_t bytes[4] = {};
        auto const size = static_cast<std::size_t>(field.size);
        for (std::size_t i = 0; i < size && position + i < payload->length(); ++i)
            bytes[i] = payload->bytes()[position + i];
        auto const value = static_cast<std::int32_t>(readBigEndian(bytes, field.size));
        setText(result, field.key, std::to_string(value));
        position += size;
    }
}

template <std::size_t N>
void writeFields(CFDictionaryRef metadata, Field const (&fields)[N],
                 std::vector<std::uint8_t>& payload)
{
    for (Field const& field : fields) {
        auto const value = static_cast<std::uint64_t>(metadataInteger(metadata, field.key, 0));
        payload.resize(payload.size() + static_cast<std::size_t>(field.size));
        writeBigEndian(payload.data() + payload.size() - field.size, field.size, value);
    }
}

void setPayload(CFMutableDictionaryRef payloads, char const* name, std::vector<std::uint8_t> bytes)
{
    payloads->setValue(name, KVCFRef<CFDataRef>::adopt(new __CFData(std::move(bytes))));
}

std::string formatDegrees(double degrees)
{
    char text[32];
    auto const end = std::to_chars(text, text + sizeof text, degrees, std::chars_format::fixed, 6);
    return {text, end.ptr};
}

/// The text as far as it is a decimal number, 0 when it does not begin with one.
double decimalNumber(CFStringRef string)
{
    std::string text;
    for (char16_t const unit : string ? string->view() : std::u16string_view())
        text.push_back(unit < 0x80 ? static_cast<char>(unit) : '?');
    auto const start = std::min(text.find_first_not_of(" \t\n\r"), text.size());
    bool const negative = start < text.size() && text[start] == '-';
    bool const isSigned = negative || (start < text.size() && text[start] == '+');
    char const* const first = text.data() + start + (isSigned ? 1 : 0);
    char const* const last = text.data() + text.size();
    // Else "nan", "inf" and a second sign would be taken.
    if (first == last || !((*first >= '0' && *first <= '9') || *first == '.'))
        return 0;
    double value = 0;
    auto const [end, error] = std::from_chars(first, last, value);
    if (error == std::errc::result_out_of_range)
        value = std::string_view(first, end).find('-') == std::string_view::npos
                    ? std::numeric_limits<double>::infinity()
                    : 0;
    return negative ? -value : value;
}

/// Walks the parser's dictionaries, which nest a handful of levels at most. What comes later takes
/// the place of what has the same name.
void flattenDictionary(CFDictionaryRef source, CFMutableDictionaryRef destination)
{
    for (std::size_t i = 0; i < source->count(); ++i) {
        NSObject const* const value = source->valueAtIndex(i);
        auto const* const text = dynamic_cast<CFStringRef>(value);
        if (auto const* const dictionary = dynamic_cast<CFDictionaryRef>(value))
            flattenDictionary(dictionary, destination);
        else if ((text && text->length() > 0) || dynamic_cast<CFNumberRef>(value))
            destination->setValue(source->keyAtIndex(i), value);
    }
}

} // namespace

int metadataInteger(CFDictionaryRef metadata, char const* key, int otherwise) noexcept
{
    CFStringRef const string = textOf(metadata, key);
    if (!string)
        return otherwise;
    std::u16string_view text = string->view();
    text.remove_prefix(std::min(text.find_first_not_of(u" \t\n\r"), text.size()));
    bool const negative = text.starts_with(u'-');
    if (negative || text.starts_with(u'+'))
        text.remove_prefix(1);
    std::int64_t value = 0;
    for (char16_t const unit : text) {
        if (unit < u'0' || unit > u'9')
            break;
        value = std::min(value * 10 + (unit - u'0'), std::int64_t{1} << 32);
    }
    return static_cast<int>(std::clamp<std::int64_t>(negative ? -value : value,
                                                     std::numeric_limits<int>::min(),
                                                     std::numeric_limits<int>::max()));
}

// --- Reading ---

MetadataRef createParsedAdobeXMPMetadata(KVString const& text)
{
    auto result = KVMakeRef<NSMutableDictionary>();
    KVXMPStringParser parser;
    if (!text.empty() && parser.parseXMPString(text))
        flattenDictionary(parser.parsedData(), result);
    return result;
}

MetadataRef createParsedGoogleV1Metadata(KVString const& text)
{
    auto result = createParsedAdobeXMPMetadata(text);
    return result->value("GSpherical:ProjectionType") ? result : KVMakeRef<NSMutableDictionary>();
}

MetadataRef createParsedGoogleV2Metadata(KVImageDescAtomBox const& descriptions)
{
    auto result = KVMakeRef<NSMutableDictionary>();
    auto const payloads = descriptions.copyImageDescGoogleV2Info(0);
    if (CFDataRef const st3d = payloadOf(payloads, "st3d", 5))
        setText(result, "stereo_mode", std::to_string(st3d->bytes()[kVersionAndFlags]));
    if (CFDataRef const svhd = payloadOf(payloads, "svhd", 5)) {
        std::string text(svhd->span().begin() + kVersionAndFlags, svhd->span().end());
        text.erase(0, std::min(text.find_first_not_of('\0'), text.size()));
        if (text.ends_with('\0'))
            text.pop_back();
        if (text.starts_with("\xEF\xBB\xBF"))
            text.erase(0, 3);
        setText(result, "metadata_source", text);
    }
    if (CFDataRef const prhd = payloadOf(payloads, "prhd", 16)) {
        std::uint8_t const* bytes = prhd->bytes() + kVersionAndFlags;
        for (Angle const& angle : kPose) {
            auto const fixed = static_cast<std::int32_t>(readBigEndian(bytes, 4));
            double const degrees =
                std::clamp(fixed / 65536.0, -angle.limitDegrees, angle.limitDegrees);
            setText(result, angle.key, formatDegrees(degrees));
            bytes += 4;
        }
    }
    if (CFDataRef const cbmp = payloadOf(payloads, "cbmp", 12))
        readFields(cbmp, kVersionAndFlags, kCubemap, result);
    if (CFDataRef const equi = payloadOf(payloads, "equi", 20))
        readFields(equi, kVersionAndFlags, kEquirectangular, result);
    return result;
}

MetadataRef createParsedHDRMetadata(KVImageDescAtomBox const& descriptions)
{
    auto result = KVMakeRef<NSMutableDictionary>();
    auto const payloads = descriptions.copyImageDescHDRInfo(0);
    if (CFDataRef const mdcv = payloadOf(payloads, "mdcv", 1))
        readFields(mdcv, 0, kMasteringDisplay, result);
    if (CFDataRef const clli = payloadOf(payloads, "clli", 1))
        readFields(clli, 0, kContentLight, result);
    return result;
}

MetadataRef createParsedStandardExtensionData(KVImageDescAtomBox const& descriptions)
{
    auto result = KVMakeRef<NSMutableDictionary>();
    int first = 0, second = 0, third = 0;
    if (descriptions.getImageDescColorInfo(0, &first, &second, &third) == 0) {
        setText(result, "color_primaries", std::to_string(first));
        setText(result, "color_transfer", std::to_string(second));
        setText(result, "color_matrix", std::to_string(third));
    }
    // Hosts rely on both keys of these pairs holding the first value.
    if (descriptions.getImageDescFieldInfo(0, &first, &second) == 0) {
        setText(result, "field_fields", std::to_string(first));
        setText(result, "field_detail", std::to_string(first));
    }
    if (descriptions.getImageDescPixelAspectInfo(0, &first, &second) == 0) {
        setText(result, "pixel_aspect_h", std::to_string(first));
        setText(result, "pixel_aspect_v", std::to_string(first));
    }
    return result;
}

// --- Writing ---

KVCFRef<CFDataRef> createRawGoogleV1Metadata(CFDictionaryRef metadata)
{
    if (!metadata || metadata->count() == 0)
        return nullptr;
    auto const values = MetadataRef::adopt(CFDictionaryCreateMutableCopy(nullptr, 0, metadata));
    // Whole elements: each comes to stand inside an element of its own name.
    for (auto const& [key, element] :
         {std::pair{"GSpherical:StitchingSoftware",
                    "<GSpherical:StitchingSoftware>Brovo Vantor</GSpherical:StitchingSoftware>"},
          std::pair{"GSpherical:StereoMode",
                    "<GSpherical:StereoMode>mono</GSpherical:StereoMode>"}})
        if (!values->value(key))
            setText(values, key, element);

    std::string text = "<rdf:SphericalVideo\n"
                       "xmlns:rdf=\"http://www.w3.org/1999/02/22-rdf-syntax-ns#\"\n"
                       "xmlns:GSpherical=\"http://ns.google.com/videos/1.0/spherical/\">\n"
                       "<GSpherical:Spherical>true</GSpherical:Spherical>\n"
                       "<GSpherical:Stitched>true</GSpherical:Stitched>\n"
                       "<GSpherical:ProjectionType>equirectangular</GSpherical:ProjectionType>\n";
    for (std::string const key :
         {"GSpherical:SourceCount", "GSpherical:StereoMode", "GSpherical:StitchingSoftware",
          "GSpherical:Timestamp", "GSpherical:InitialViewHeadingDegrees",
          "GSpherical:InitialViewPitchDegrees", "GSpherical:InitialViewRollDegrees",
          "GSpherical:CroppedAreaImageWidthPixels", "GSpherical:CroppedAreaImageHeightPixels",
          "GSpherical:CroppedAreaLeftPixels", "GSpherical:CroppedAreaTopPixels",
          "GSpherical:FullPanoWidthPixels", "GSpherical:FullPanoHeightPixels"})
        if (NSObject const* const value = values->value(key))
            text += "<" + key + ">" + value->description().toUTF8() + "</" + key + ">\n";
    text += "</rdf:SphericalVideo>\n";

    std::vector<std::uint8_t> payload(kGoogleV1UUID.begin(), kGoogleV1UUID.end());
    payload.insert(payload.end(), text.begin(), text.end());
    return KVCFRef<CFDataRef>::adopt(new __CFData(std::move(payload)));
}

MetadataRef createRawGoogleV2Metadata(CFDictionaryRef metadata)
{
    if (!metadata || metadata->count() == 0)
        return nullptr;
    auto payloads = KVMakeRef<NSMutableDictionary>();
    std::vector<std::uint8_t> const empty(kVersionAndFlags);

    auto st3d = empty;
    st3d.push_back(static_cast<std::uint8_t>(metadataInteger(metadata, "stereo_mode", 0)));
    setPayload(payloads, "st3d", std::move(st3d));

    CFStringRef const source = textOf(metadata, "metadata_source");
    std::string text = source ? CFStringGetUTF8(source) : kWriter;
    if (text.size() + 1 > kLongestSource)
        text = kWriter;
    auto svhd = empty;
    svhd.insert(svhd.end(), text.c_str(), text.c_str() + text.size() + 1);
    setPayload(payloads, "svhd", std::move(svhd));

    auto prhd = empty;
    for (Angle const& angle : kPose) {
        double const degrees = std::clamp(decimalNumber(textOf(metadata, angle.key)),
                                          -angle.limitDegrees, angle.limitDegrees);
        prhd.resize(prhd.size() + 4);
        writeBigEndian(prhd.data() + prhd.size() - 4, 4,
                       static_cast<std::uint64_t>(std::llround(degrees * 65536)));
    }
    setPayload(payloads, "prhd", std::move(prhd));

    // Of the two projections one remains, the equirectangular where both are described.
    if (metadata->value("projection_bounds_top")) {
        auto equi = empty;
        writeFields(metadata, kEquirectangular, equi);
        setPayload(payloads, "equi", std::move(equi));
    } else if (metadata->value("cube_layout")) {
        auto cbmp = empty;
        writeFields(metadata, kCubemap, cbmp);
        setPayload(payloads, "cbmp", std::move(cbmp));
    }
    return payloads;
}

MetadataRef createRawHDRMetadata(CFDictionaryRef metadata)
{
    if (!metadata || metadata->count() == 0)
        return nullptr;
    auto payloads = KVMakeRef<NSMutableDictionary>();
    std::vector<std::uint8_t> mdcv, clli;
    writeFields(metadata, kMasteringDisplay, mdcv);
    writeFields(metadata, kContentLight, clli);
    setPayload(payloads, "mdcv", std::move(mdcv));
    setPayload(payloads, "clli", std::move(clli));
    return payloads;
}

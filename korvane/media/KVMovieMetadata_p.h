#pragma once

#include <korvane/foundation/KVString.h>
#include <korvane/media/KVImageDescAtomBox.h>

#include <array>
#include <cstdint>

// Between the payloads of metadata atoms and dictionaries of strings. Results belong to the caller.

/// The 16 bytes of a UUID that is written out in hexadecimal.
consteval std::array<std::uint8_t, 16> uuidBytes(char const (&text)[37])
{
    std::array<std::uint8_t, 16> bytes{};
    int digits = 0;
    for (char const c : text) {
        if (c == '-' || c == '\0')
            continue;
        int const value = c <= '9' ? c - '0' : c - 'A' + 10;
        auto& byte = bytes[static_cast<std::size_t>(digits++ / 2)];
        byte = static_cast<std::uint8_t>(byte << 4 | value);
    }
    return bytes;
}

/// An XMP packet.
inline constexpr auto kAdobeXMPUUID = uuidBytes("BE7ACFCB-97A9-42E8-9C71-999491E3AFAC");
/// Spherical video XML of the first generation.
inline constexpr auto kGoogleV1UUID = uuidBytes("FFCC8263-F855-4A93-8814-587A02521FDD");

using MetadataRef = KVCFRef<CFMutableDictionaryRef>;

// Readers: what is missing or malformed gives no key; never null.

MetadataRef createParsedAdobeXMPMetadata(KVString const& text);
/// Empty without "GSpherical:ProjectionType".
MetadataRef createParsedGoogleV1Metadata(KVString const& text);
/// These three from the first description.
MetadataRef createParsedGoogleV2Metadata(KVImageDescAtomBox const& descriptions);
MetadataRef createParsedHDRMetadata(KVImageDescAtomBox const& descriptions);
MetadataRef createParsedStandardExtensionData(KVImageDescAtomBox const& descriptions);

// Writers: null for a null or empty dictionary.

/// The payload of a `uuid` atom.
KVCFRef<CFDataRef> createRawGoogleV1Metadata(CFDictionaryRef metadata);
/// Payloads under the names of their atoms.
MetadataRef createRawGoogleV2Metadata(CFDictionaryRef metadata);
MetadataRef createRawHDRMetadata(CFDictionaryRef metadata);

/// The string under the key as an integer, saturated; `otherwise` when there is none.
int metadataInteger(CFDictionaryRef metadata, char const* key, int otherwise) noexcept;

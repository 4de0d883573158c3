#pragma once

#include <korvane/foundation/KVString.h>
#include <korvane/platform/CFData.h>
#include <korvane/platform/CFDictionary.h>

#include <string>

/// Turns an XMP packet (ISO 16684-1), or the XML of first-generation spherical metadata, into
/// nested dictionaries.
///
///     KVXMPStringParser parser;
///     if (parser.parseXMPString(packet))
///         use(parser.parsedData());
///
/// Names are taken as they are written, prefix included. Three levels open a dictionary of their
/// own, kept under the element's name in the level above it when the element ends, unless it is
/// empty:
///
///     top     rdf:SphericalVideo, x:xmpmeta
///     middle  rdf:RDF
///     inner   rdf:Description
///
/// All else goes to the innermost level that is open, under the element's name: its text as a
/// string, its attributes (`xmlns` ones too) as a dictionary. Where a name comes again,
/// `<a>1</a><a>2</a>` gives { a: { "a-0": "1", "a-1": "2" } } and a third one adds "a" inside; text
/// behind attributes goes into their dictionary. Of two `rdf:Description` in one `rdf:RDF` the
/// second takes the first one's place.
///
/// The text is UTF-8 whatever the packet declares. Entities other than the five of XML are not
/// known, nothing is loaded from elsewhere, and elements nest 256 deep at most.
///
/// A parser belongs to one thread at a time.
class KV_EXPORT KVXMPStringParser : public NSObject {
public:
    KVXMPStringParser();
    ~KVXMPStringParser() override;
    KVXMPStringParser(KVXMPStringParser const&) = delete;
    KVXMPStringParser& operator=(KVXMPStringParser const&) = delete;

    /// Parses the string as UTF-8; see `parseXMPData`.
    bool parseXMPString(KVString const& text);
    /// True when the packet is well-formed. Null data is not, and changes nothing.
    bool parseXMPData(CFDataRef data);

    /// What was read, up to the error if there was one. Unowned, valid until the next parse; never
    /// null.
    CFDictionaryRef parsedData() const noexcept { return result_; }
    /// "XML Parse Error %i, Description: %@, Line: %i" of the first error; null when there was
    /// none. The code is libxml2's.
    KVString parseErrorString() const { return error_; }

private:
    struct Handlers;
    struct Level {
        KVString name;
        KVCFRef<CFMutableDictionaryRef> contents;
    };

    void startDocument();
    void startElement(KVString const& name, CFDictionaryRef attributes);
    void characters(char const* text, std::size_t length);
    void endElement(KVString const& name);
    void endDocument();

    __CFDictionary& deepest() noexcept;
    void storeText(KVString const& name);
    void setError(int code, char const* message, int line);

    /// Top, middle, inner. A level is open while it has a name.
    Level levels_[3];
    std::string text_;
    bool hasText_ = false;
    KVCFRef<CFMutableDictionaryRef> result_;
    KVString error_;
};

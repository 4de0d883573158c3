#pragma once

#include <string>
#include <string_view>

/// How ASCII stands in the bytes of a document, as far as its first bytes tell.
struct KVXMLEncoding {
    /// Bytes of a unit: 1, 2 for UTF-16, or 0 for an encoding in which even ASCII looks different.
    int width = 1;
    bool bigEndian = false;
};

KVXMLEncoding kvDetectEncoding(std::string_view bytes);
/// The document's ASCII characters, one byte each, all others as bytes that are none: the bytes
/// themselves or what is put in `buffer`. An incomplete unit at the end is left out.
std::string_view kvNarrowed(KVXMLEncoding encoding, std::string_view bytes, std::string& buffer);

/// What stands in front of a document's root element, looked over before libxml2 reads it. libxml2
/// works through the declarations of a document type at once, nested entities and all, and is told
/// to keep no limits: a document of a few lines could keep it busy for years.
struct KVXMLProlog {
    enum class Kind {
        fine,
        /// All may be fine; the bytes end before the root element.
        incomplete,
        refused,
    };

    Kind kind;
    /// Why it is refused; static text.
    char const* reason = "";
    /// From 1.
    unsigned long line = 0;
};

/// `bytes` are those at the start of the document.
KVXMLProlog kvScanProlog(KVXMLEncoding encoding, std::string_view bytes);

#pragma once

#include <string_view>

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
KVXMLProlog kvScanProlog(std::string_view bytes);

#pragma once

#include <korvane/foundation/KVString.h>
#include <korvane/platform/CFURL.h>

/// A platform file reference; there is none here, so it is never filled in.
struct FSRef;

/// The place of a file, or of a numbered sequence of image files.
///
///     KVURL frames("/shots/a[###].tif", 1, 20);    // a001.tif to a020.tif
///     frames.isSequence();                          // true
///     std::unique_ptr<KVURL> fifth(frames.getURLforIndex(4));   // .../a005.tif
///
/// A sequence has a bracketed pattern of "#" or "@" in its last path component and may end in
/// ":start:end". A pattern with an "@" prints the number as it is; one of "#" alone fills it with
/// zeros to its length.
///
/// A null URL answers every text with the empty string. Texts that are "the URL's string" are
/// percent-encoded (RFC 3986), paths are not. No file is looked for or opened.
///
/// Not synchronised: a value belongs to one thread, what it shares with its copies need not.
class KV_EXPORT KVURL {
public:
    KVURL() noexcept = default;
    /// From a POSIX path in UTF-8; an empty or null path gives a null URL. A relative path is made
    /// absolute at once.
    explicit KVURL(char const* path, bool isDirectory = false);
    /// The path with ":start:end" behind it.
    KVURL(char const* path, unsigned int start, unsigned int end);
    /// Retains; null gives a null URL.
    explicit KVURL(__CFURL const* url) noexcept : url_(url) {}
    /// A text with "://" in it is taken as a URL, any other as a POSIX path.
    explicit KVURL(KVString const& text, bool isDirectory = false);

    bool isNull() const noexcept { return url_.get() == nullptr; }
    /// Unowned; null for a null URL.
    CFURLRef cf_url() const noexcept { return url_; }
    /// By the URL's string, unit by unit; two null URLs are equal.
    friend bool operator==(KVURL const& a, KVURL const& b) { return CFEqual(a.url_, b.url_); }

    /// "file://" and the host name: "file://" alone for a path of this machine.
    KVString getHostnameAndPrefixString() const;
    /// The URL's string; both are the same.
    KVString getAbsoluteString() const;
    KVString getAsURLString() const;
    /// The POSIX path, without a "/" at its end.
    KVString getAsFileSystemString() const;
    /// The path of the directory that it lies in; both are the same. The root lies in itself.
    KVString getPathAsFileSystemString() const;
    KVString getContainingFolder() const;
    /// That directory's URL as a string, with a "/" at its end.
    KVString getContainingFolderAsURLString() const;
    /// The last path component, whole, without its extension, and the extension alone (no dot).
    KVString getFilename() const;
    KVString getShortFilename() const;
    KVString getExtension() const;
    /// False: there are no file references here.
    bool getFSRef(FSRef* reference) const noexcept;
    /// The path as a new array of bytes (`delete[]`), zero-terminated, with "?" for each UTF-16
    /// unit that is not ASCII; its length without the terminator goes to `*length` if not null.
    /// Null for a null URL.
    char* getString(unsigned int* length) const;
    /// Does nothing.
    void debugShow() const noexcept {}

    // --- Image sequences ---

    /// Whether the last path component holds a pattern.
    bool isSequence() const;
    /// The number behind the last colon but one, and behind the last colon, of the last path
    /// component; blanks and a sign may stand in front of it, what follows it is passed over. -1
    /// when there is none.
    int getSequenceStart() const;
    int getSequenceEnd() const;
    /// The number of frames: end minus start plus 1, so 1 where neither is known.
    int getSequenceLength() const;
    /// The file of frame `start + index`, which the caller deletes; a start that is not known
    /// counts as 0. Null for a null URL, one that is no sequence, and an index beyond a known end.
    KVURL* getURLforIndex(unsigned int index) const;
    /// This URL without its ":start:end".
    KVURL getSequenceURL() const;

private:
    KVCFRef<CFURLRef> url_;
};

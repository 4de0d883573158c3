#pragma once

#include <korvane/captions/KVCaption.h>

#include <korvane/foundation/KVURL.h>
#include <korvane/platform/NSError.h>

#include <memory>

/// Reads SubRip files: numbered blocks of a time line and styled text, with an empty line behind
/// each.
///
///     1
///     00:00:01,500 --> 00:00:03,000
///     <i>Who is there?</i>
///
///     std::vector<KVCaptionArray> captions;
///     CMTime const frame = CMTimeMake(1001, 24000);
///     auto importer = KVMakeRef<KVSRTCaptionsImporter>();
///     if (!importer->importCaptionsFromURL(url, captions, frame, kCMTimeZero))
///         captions[0][0]->text();   // "Who is there?"
///
/// Numbers must be 1, 2, 3 and so on; tags are `<b>`, `<i>`, `<u>`, `<br>` and
/// `<font color="...">` in angle or curly brackets; unknown ones of three letters or more are
/// dropped, shorter ones stay as text. Three things that files rely on and that surprise: `</font>`
/// ends nothing, so a colour holds for all text behind it, in later captions too (use one importer
/// a file); a closing tag without an opening one cancels the next opening one; the line behind the
/// time line is text even if it is empty.
///
/// One importer belongs to one thread.
class KV_EXPORT KVSRTCaptionsImporter final : public NSObject {
public:
    /// Codes of errors in the domain "KVSRTCaptionsImporterError". Their user info has
    /// NSLocalizedDescriptionKey and NSLocalizedFailureReasonErrorKey, both empty.
    enum ErrorCode : int {
        /// The file cannot be read, is empty, does not begin with "1", or has a bad number or time
        /// line.
        badFile = 1,
        badTimecode = 2,
        /// A time that is no time, or a caption that has no length on the frame grid.
        badTimeRange = 3,
    };
    /// What `_tagFromToken` answers.
    enum Tag : int {
        notATag = 0,
        unknownTag = 1,
        lineBreak = 2,
        boldOn = 3,
        boldOff = 4,
        italicOn = 5,
        italicOff = 6,
        underlineOn = 7,
        underlineOff = 8,
        font = 9,
        /// Never answered: see above.
        fontOff = 10,
    };

    KVSRTCaptionsImporter();
    ~KVSRTCaptionsImporter() override;

    // --- Import ---

    /// Adds for each caption an array of its own with a KVCaptionSRT. Times are rounded down to the
    /// timescale of `frameDuration`, moved by `startTimeOffset` (added), then rounded up to whole
    /// frames. Null for success; on an error the captions before it stay in `captions`, to be
    /// thrown away.
    ///
    /// How the file's bytes become text: see NSStringWithBytes.
    KVNSRef<NSError*> importCaptionsFromURL(KVURL const& url, std::vector<KVCaptionArray>& captions,
                                            CMTime frameDuration, CMTime startTimeOffset);
    /// The same for text at hand.
    KVNSRef<NSError*> importCaptionsFromString(KVString const& text,
                                               std::vector<KVCaptionArray>& captions,
                                               CMTime frameDuration, CMTime startTimeOffset);

    // --- Properties ---

    /// The characters that begin and end a tag, "<{" and ">}" at first; any of the one goes with
    /// any of the other. Null: no text is found at all.
    KVString const& tagBeginningCharacters() const noexcept { return tagBeginningCharacters_; }
    void setTagBeginningCharacters(KVString const& set) { tagBeginningCharacters_ = set; }
    KVString const& tagEndingCharacters() const noexcept { return tagEndingCharacters_; }
    void setTagEndingCharacters(KVString const& set) { tagEndingCharacters_ = set; }
    /// The name of the space that font colours are made in, "sRGB" at first.
    KVString const& taggedFontColorSpace() const noexcept { return taggedFontColorSpace_; }
    void setTaggedFontColorSpace(KVString const& name);
    /// The colour of the font tag that was met last, unowned, or null.
    NSColor const* taggedFontColor() const noexcept { return taggedFontColor_; }
    void setTaggedFontColor(NSColor const* color) { taggedFontColor_ = color; }
    /// Kept for the host; nothing here reads it.
    KVString const& previousTag() const noexcept { return previousTag_; }
    void setPreviousTag(KVString const& tag) { previousTag_ = tag; }

    // --- The steps of an import ---

    /// "01:02:05,500", or with a "." for the comma, in seconds: any hours, and minutes and seconds
    /// of any size; the last field is a number of milliseconds (",5" is 0.005). An error with
    /// `badTimecode` leaves `*seconds` as it is.
    KVNSRef<NSError*> _parseTimecodeString(KVString const& text, double* seconds) const;
    /// Text in the system font with traits, text colour and underline.
    KVNSRef<NSAttributedString*> _attributedStringFromString(KVString const& text, bool bold,
                                                             bool italic, bool underline,
                                                             NSColor const* color) const;
    /// The text cut into tags, brackets included, and the pieces between. None for an empty text or
    /// a null set.
    std::vector<KVString> _tokenizeString(KVString const& text, KVString const& tokenStartSet,
                                          KVString const& tokenEndSet) const;
    /// A font tag with a colour also sets `taggedFontColor`.
    Tag _tagFromToken(KVString const& token);
    /// Text with its tags turned into attributes.
    KVNSRef<NSAttributedString*> _parseTagsInString(KVString const& text);

private:
    class Styles;
    enum class Background : bool { none, black };

    void takeFontColor(std::u16string_view inner);
    KVNSRef<NSAttributedString*> parseTags(std::u16string_view text, Background background);

    KVString tagBeginningCharacters_;
    KVString tagEndingCharacters_;
    KVString taggedFontColorSpace_;
    KVNSRef<NSColor const*> taggedFontColor_;
    KVString previousTag_;
    std::unique_ptr<Styles> styles_;
};

/// The colour of "#rrggbb" at the start of the text, or of a name that `NSColor::named` knows;
/// white for all else. In the colour space of that name if it converts, else in sRGB.
KV_EXPORT KVNSRef<NSColor const*> KVColorFromStringInColorSpace(KVString const& text,
                                                                KVString const& colorSpaceName);

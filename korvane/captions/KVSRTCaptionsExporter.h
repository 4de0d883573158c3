#pragma once

#include <korvane/captions/KVCaption.h>

#include <korvane/foundation/KVURL.h>
#include <korvane/platform/NSError.h>

#include <string>

/// Writes captions of any format as a SubRip file in UTF-8. May be called from any thread, with
/// captions that nobody changes meanwhile.
///
///     auto error = KVSRTCaptionsExporter::exportCaptionsToURL(url, captions, CMTimeMake(1, 25),
///                                                             kCMTimeZero, true);
class KV_EXPORT KVSRTCaptionsExporter final : public NSObject {
public:
    /// Codes of errors in the domain "QFSRTCaptionsExporterError". Their user info has
    /// NSLocalizedDescriptionKey and NSLocalizedFailureReasonErrorKey.
    enum ErrorCode : int {
        /// Half a surrogate pair stands alone in a text; nothing is written.
        notRepresentable = 0,
    };

    /// Numbers the captions from 1 on, in their order; those without text are left out, and so are
    /// nulls. Times are moved by `startTimeOffset` (added), then rounded up to whole frames; what
    /// lies before zero is written as zero. One newline at a text's end is cut. With
    /// `includeFormattingTags` the styles become tags, see `_taggedTextFromCaptionString`. Between
    /// two blocks stands an empty line, behind the last one none.
    ///
    /// The file is written in place. Null for success; for a file that cannot be written the
    /// system's error, NSPOSIXErrorDomain with an errno.
    static KVNSRef<NSError*> exportCaptionsToURL(KVURL const& url, KVCaptionArray const& captions,
                                                 CMTime frameDuration, CMTime startTimeOffset,
                                                 bool includeFormattingTags);
    /// The same into memory; on an error `utf8` is left as it is.
    static KVNSRef<NSError*> exportCaptionsToString(std::string& utf8,
                                                    KVCaptionArray const& captions,
                                                    CMTime frameDuration, CMTime startTimeOffset,
                                                    bool includeFormattingTags);

    /// The text with `<b>`, `<i>`, `<u>` and `<font color="#rrggbb">` around what is bold,
    /// italic, underlined and coloured. A tag ends where its attribute does, so tags can overlap;
    /// none stands within a grapheme cluster, whose first unit decides.
    static KVString _taggedTextFromCaptionString(NSAttributedString const* string);
};

/// "01:02:05,500" for 3725.5: hours of two digits or more, milliseconds cut (not rounded). Zeros
/// for a negative number and NaN.
KV_EXPORT KVString KVTimecodeStringFromTimeInSeconds(double seconds);

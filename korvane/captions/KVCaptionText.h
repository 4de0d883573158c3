#pragma once

#include <korvane/platform/AVCaption.h>

#include <korvane/captions/KVCaption.h>

class KVMutableCaptioniTT;

/// A copy of the string on black: the background attribute over the whole of it becomes black in
/// the colour space of the text colour at its start (sRGB if there is none). An empty string stays
/// without attributes, null gives null.
KV_EXPORT KVNSRef<NSMutableAttributedString*>
stringWithBlackBackground(NSAttributedString const* string);

/// A caption's text in the system font with its styles: colours, italic and bold traits, underline.
/// Null gives null, a caption without text the empty string.
KV_EXPORT KVNSRef<NSMutableAttributedString*>
KVAttributedStringFromCaption(KVCaption const* caption);
KV_EXPORT KVNSRef<NSMutableAttributedString*>
KVAttributedStringFromCaption(AVCaption const* caption);

// --- To and from the player's captions; null gives null ---

/// The region selects the class: cells make a KVCaptionCEA608, a named region a KVCaptioniTT with
/// its ruby, SubRip's region or none a KVCaptionSRT. The caption's `animation` and the region's
/// `scroll` are the `animationBehavior` and the `scrollBehavior` of a KVCaptionCEA608.
KV_EXPORT KVNSRef<KVCaption*> KVCaptionFromAVCaption(AVCaption const* caption);
KV_EXPORT KVNSRef<AVCaption*> KVCaptionToAVCaption(KVCaption const* caption);
/// By format: SubRip's bottom region for 0 and 3, cells for 1, the named region for 2.
KV_EXPORT KVNSRef<AVCaptionRegion*> AVCaptionRegionFromKVCaption(KVCaption const* caption);
/// Gives the caption the ruby of `from`, whose text is the same. Nothing if either is null.
KV_EXPORT void KVSetRubyFromAVCaption(KVMutableCaptioniTT* caption, AVCaption const* from);
/// Gives the caption the attributes of a string with the same text. Nothing if either is null.
KV_EXPORT void KVSetAttributedStringToCaption(AVCaption* caption, NSAttributedString const* string);

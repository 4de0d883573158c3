#pragma once

#include <korvane/captions/KVCaption.h>

/// Cuts a row of captions, sorted by start, into groups that overlap in time. A caption joins the
/// group before it if it starts before the latest end in there, with `includeTouching` also if it
/// starts just then.
///
///     KVGroupOverlappingCaptions(captions, false);   // [0,2) [2,3) [5,6): three groups
///     KVGroupOverlappingCaptions(captions, true);    // two, the first with two captions
///
/// Nulls are passed over. Captions that equal one of a finished group are dropped with it, although
/// they did not join. Takes time in proportion to the number of captions.
KV_EXPORT std::vector<KVCaptionArray> KVGroupOverlappingCaptions(KVCaptionArray const& captions,
                                                                 bool includeTouching);

#include <korvane/captions/KVCaptionGroups.h>

#include <korvane/time/KVTimeRange.h>

#include <unordered_set>

namespace {

/// A caption by value, its hash taken once.
struct CaptionKey {
    KVCaption const* caption;
    std::size_t hash;

    explicit CaptionKey(KVCaption const* c) : caption(c), hash(c->hash()) {}
    friend bool operator==(CaptionKey const& a, CaptionKey const& b)
    {
        return a.caption->isEqual(b.caption);
    }
    struct Hash {
        std::size_t operator()(CaptionKey const& key) const noexcept { return key.hash; }
    };
};

} // namespace

std::vector<KVCaptionArray> KVGroupOverlappingCaptions(KVCaptionArray const& captions,
                                                       bool includeTouching)
{
    // A finished group takes all captions with it that equal one of its own: a set of the finished
    // ones tells them, so each caption is looked at once.
    std::vector<KVCaptionArray> groups;
    std::unordered_set<CaptionKey, CaptionKey::Hash> finished;
    finished.reserve(captions.size());

    std::vector<CaptionKey> keys;
    KVCaptionArray group;
    CMTime groupEnd = kCMTimeInvalid;
    auto const finishGroup = [&] {
        finished.insert(keys.begin(), keys.end());
        groups.push_back(std::move(group));
        keys.clear();
        group.clear();
    };
    for (KVNSRef<KVCaption*> const& caption : captions) {
        if (!caption)
            continue;
        CaptionKey const key(caption);
        CMTime const start = caption->timeRange().start;
        CMTime const end = KV_CMTimeRangeEnd(caption->timeRange());
        if (!group.empty() && !finished.contains(key)) {
            std::int32_t const order = CMTimeCompare(start, groupEnd);
            if (order > 0 || (order == 0 && !includeTouching))
                finishGroup();
        }
        // Looked up again, as the group that it did not join may hold its equal.
        if (finished.contains(key))
            continue;
        if (group.empty() || CMTimeCompare(end, groupEnd) > 0)
            groupEnd = end;
        keys.push_back(key);
        group.push_back(caption);
    }
    if (!group.empty())
        finishGroup();
    return groups;
}

#include <korvane/captions/KVCaptioniTT.h>

#include <korvane/captions/KVCaptionText_p.h>

#include <korvane/platform/CFArray.h>

#include <algorithm>

KVCaptioniTT::KVCaptioniTT(NSAttributedString const* string, CMTimeRange const& timeRange,
                           KVString const& region)
    : KVCaption(KVCopyOnBlack(string), timeRange),
      regionString_(region),
      rubyText_(nullArrayWithCapacity(text().view().size()))
{}

KVCaptioniTT::KVCaptioniTT(NSCoder& coder)
    : KVCaption(coder),
      regionString_(coder.decodeString("regionString")),
      hasRubyInternal_(coder.decodeBool("hasRuby"))
{
    KVNSRef<NSObject*> const object = coder.decodeObject(
        "rubyText", {&NSArrayCodingClass, &NSNullCodingClass, &NSStringCodingClass});
    if (auto const* entries = dynamic_cast<NSArray const*>(object.get()))
        rubyText_.assign(entries->objects().begin(), entries->objects().end());
}

KVCaptioniTT::RubyText KVCaptioniTT::nullArrayWithCapacity(std::size_t count)
{
    return RubyText(count, KVNSRef<NSObject const*>(NSNull::null()));
}

void KVCaptioniTT::assignAttributedString(NSAttributedString const* string)
{
    KVString const oldText = text();
    attributedStringInternal_ = KVCopyOnBlack(string);
    if (text().view() != oldText.view()) {
        rubyText_ = nullArrayWithCapacity(text().view().size());
        recalculateHasRuby();
    }
}

void KVCaptioniTT::recalculateHasRuby() noexcept
{
    hasRubyInternal_ = std::any_of(rubyText_.begin(), rubyText_.end(),
                                   [](auto const& entry) { return entry != NSNull::null(); });
}

KVString KVCaptioniTT::rubyTextAtIndex(std::size_t index, NSRange* range) const
{
    std::size_t const length = text().view().size();
    // An archive may have brought fewer entries than the text has units.
    auto const entryAt = [this](std::size_t unit) {
        return unit < rubyText_.size() ? rubyText_[unit].get() : NSNull::null();
    };
    if (index >= length) {
        if (range)
            *range = {length, 0};
        return KVString();
    }
    NSObject const* entry = entryAt(index);
    if (range) {
        std::size_t start = index;
        while (start > 0 && entryAt(start - 1) == entry)
            --start;
        std::size_t end = index + 1;
        while (end < length && entryAt(end) == entry)
            ++end;
        *range = {start, end - start};
    }
    return KVString(dynamic_cast<CFStringRef>(entry));
}

bool KVCaptioniTT::isEqual(NSObject const* other) const
{
    if (!KVCaption::isEqual(other))
        return false;
    auto const* caption = dynamic_cast<KVCaptioniTT const*>(other);
    return caption && caption->regionString_.view() == regionString_.view() &&
           std::equal(caption->rubyText_.begin(), caption->rubyText_.end(), rubyText_.begin(),
                      rubyText_.end(),
                      [](auto const& a, auto const& b) { return CFEqual(a.get(), b.get()); });
}

std::size_t KVCaptioniTT::hash() const
{
    std::size_t hash = KVCaption::hash() * 31 + CFHash(regionString_.cf_str());
    for (auto const& entry : rubyText_)
        hash = hash * 31 + CFHash(entry);
    return hash;
}

KVCaption* KVCaptioniTT::newCopy() const
{
    return new KVCaptioniTT(*this);
}

KVCaption* KVCaptioniTT::newMutableCopy() const
{
    return new KVMutableCaptioniTT(*this);
}

KVNSRef<KVCaptioniTT*> KVCaptioniTT::copy() const
{
    return KVNSRef<KVCaptioniTT*>::adopt(static_cast<KVCaptioniTT*>(newCopy()));
}

KVNSRef<KVMutableCaptioniTT*> KVCaptioniTT::mutableCopy() const
{
    return KVMakeRef<KVMutableCaptioniTT>(*this);
}

NSCodingClass const KVCaptioniTT::coding = {
    "KVCaptioniTT",
    [](NSCoder& coder) -> KVNSRef<NSObject*> { return KVMakeRef<KVCaptioniTT>(coder); }};

void KVCaptioniTT::encodeWithCoder(NSCoder& coder) const
{
    KVCaption::encodeWithCoder(coder);
    coder.encodeString(regionString_, "regionString");
    std::vector<NSObject const*> const entries(rubyText_.begin(), rubyText_.end());
    coder.encodeObject(KVMakeRef<NSArray>(entries), "rubyText");
    coder.encodeBool(hasRubyInternal_, "hasRuby");
}

void KVMutableCaptioniTT::setRubyText(KVString const& ruby, NSRange range)
{
    // Entries that an archive left out are there from now on.
    rubyText_.resize(std::max(rubyText_.size(), text().view().size()), NSNull::null());
    std::size_t const start = std::min(range.location, rubyText_.size());
    std::size_t const count = std::min(range.length, rubyText_.size() - start);
    NSObject const* entry =
        ruby.isNull() ? static_cast<NSObject const*>(NSNull::null()) : ruby.cf_str();
    std::fill_n(rubyText_.begin() + static_cast<std::ptrdiff_t>(start), count,
                KVNSRef<NSObject const*>(entry));
    // A text that was set is seen without looking at all the others.
    if (!ruby.isNull() && count > 0)
        hasRubyInternal_ = true;
    else
        recalculateHasRuby();
}

NSCodingClass const KVMutableCaptioniTT::coding = {
    "KVMutableCaptioniTT",
    [](NSCoder& coder) -> KVNSRef<NSObject*> { return KVMakeRef<KVMutableCaptioniTT>(coder); }};

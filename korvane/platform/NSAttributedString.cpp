#include <korvane/platform/NSAttributedString.h>

#include <korvane/platform/CFArray.h>
#include <korvane/platform/CFNumber.h>

#include <algorithm>

// --- NSAttributes ---

namespace {

constexpr std::string_view codingKeys[NSAttributeNameCount] = {"font", "foregroundColor",
                                                               "backgroundColor", "underlineStyle"};

using SharedAttributes = KVNSRef<NSAttributes const*>;

/// The set with one value replaced; the set itself when that changes nothing, null when no
/// attribute is left.
SharedAttributes withValue(SharedAttributes const& attributes, NSAttributeName name,
                           NSObject const* value)
{
    NSObject const* old = attributes ? attributes->value(name) : nullptr;
    if (CFEqual(old, value))
        return attributes;
    NSAttributes::Values values;
    for (unsigned int i = 0; attributes && i < NSAttributeNameCount; ++i)
        values[i] = attributes->value(NSAttributeName(i));
    values[name] = value;
    if (std::all_of(values.begin(), values.end(), [](auto const& v) { return v == nullptr; }))
        return nullptr;
    return KVNSRef<NSAttributes const*>::adopt(new NSAttributes(std::move(values)));
}

} // namespace

bool NSAttributes::isEqual(NSObject const* other) const
{
    if (this == other)
        return true;
    auto const* attributes = dynamic_cast<NSAttributes const*>(other);
    return attributes &&
           std::equal(values_.begin(), values_.end(), attributes->values_.begin(),
                      [](auto const& a, auto const& b) { return CFEqual(a.get(), b.get()); });
}

std::size_t NSAttributes::hash() const
{
    std::size_t hash = 0;
    for (auto const& value : values_)
        hash = hash * 31 + CFHash(value);
    return hash;
}

void NSAttributes::encodeWithCoder(NSCoder& coder) const
{
    for (std::size_t i = 0; i < NSAttributeNameCount; ++i)
        coder.encodeObject(values_[i], codingKeys[i]);
}

NSCodingClass const NSAttributes::coding = {
    "NSAttributes", [](NSCoder& coder) -> KVNSRef<NSObject*> {
        Values values;
        values[NSFontAttributeName] =
            coder.decodeObject(codingKeys[NSFontAttributeName], {&NSFont::coding});
        for (auto color : {NSForegroundColorAttributeName, NSBackgroundColorAttributeName})
            values[color] = coder.decodeObject(codingKeys[color], {&NSColor::coding});
        values[NSUnderlineStyleAttributeName] =
            coder.decodeObject(codingKeys[NSUnderlineStyleAttributeName], {&NSNumberCodingClass});
        return KVMakeRef<NSAttributes>(std::move(values));
    }};

// --- NSAttributedString ---

namespace {

using Run = NSAttributedString::Run;

/// Adds a run that ends at `end`, later than the last one, or lengthens the last one.
void appendRun(std::vector<Run>& runs, std::size_t end, SharedAttributes const& attributes)
{
    if (!runs.empty() && CFEqual(runs.back().attributes.get(), attributes.get()))
        runs.back().end = end;
    else
        runs.push_back({end, attributes});
}

NSRange clipped(NSRange range, std::size_t length)
{
    std::size_t const start = std::min(range.location, length);
    return {start, std::min(range.length, length - start)};
}

} // namespace

NSAttributedString::NSAttributedString(KVString const& text, NSAttributes const* attributes)
    : text_(text.cf_str())
{
    if (length() > 0)
        runs_.push_back({length(), attributes});
}

NSAttributedString::NSAttributedString(KVString const& text, std::vector<Run> runs)
    : text_(text.cf_str()), runs_(std::move(runs))
{
    // Joins neighbours in place: a run moves to the left or stays.
    std::size_t kept = 0;
    std::size_t covered = 0;
    for (Run& run : runs_) {
        std::size_t const end = std::min(run.end, length());
        if (end <= covered)
            continue;
        covered = end;
        if (kept > 0 && CFEqual(runs_[kept - 1].attributes.get(), run.attributes.get())) {
            runs_[kept - 1].end = end;
            continue;
        }
        run.end = end;
        if (&runs_[kept] != &run)
            runs_[kept] = std::move(run);
        ++kept;
    }
    runs_.erase(runs_.begin() + static_cast<std::ptrdiff_t>(kept), runs_.end());
    if (covered < length())
        appendRun(runs_, length(), nullptr);
}

NSObject const* NSAttributedString::attribute(NSAttributeName name, std::size_t index,
                                              NSRange* range) const
{
    auto const valueOf = [name](Run const& run) {
        return run.attributes ? run.attributes->value(name) : nullptr;
    };
    if (index >= length()) {
        if (range)
            *range = {length(), 0};
        return nullptr;
    }
    auto const run =
        std::upper_bound(runs_.begin(), runs_.end(), index,
                         [](std::size_t unit, Run const& other) { return unit < other.end; });
    NSObject const* value = valueOf(*run);
    if (range) {
        auto first = run;
        while (first != runs_.begin() && CFEqual(valueOf(*(first - 1)), value))
            --first;
        auto last = run;
        while (last + 1 != runs_.end() && CFEqual(valueOf(*(last + 1)), value))
            ++last;
        std::size_t const start = first == runs_.begin() ? 0 : (first - 1)->end;
        *range = {start, last->end - start};
    }
    return value;
}

KVNSRef<NSAttributedString*> NSAttributedString::attributedSubstringFromRange(NSRange range) const
{
    range = clipped(range, length());
    if (range.length == length())
        return copy();
    std::vector<Run> runs;
    for (Run const& run : runs_) {
        if (run.end <= range.location)
            continue;
        runs.push_back({run.end - range.location, run.attributes});
        if (run.end >= NSMaxRange(range))
            break;
    }
    return KVMakeRef<NSAttributedString>(
        KVString::fromUTF16(text_.view().substr(range.location, range.length)), std::move(runs));
}

bool NSAttributedString::isEqual(NSObject const* other) const
{
    if (this == other)
        return true;
    auto const* string = dynamic_cast<NSAttributedString const*>(other);
    return string && text_.view() == string->text_.view() &&
           std::equal(runs_.begin(), runs_.end(), string->runs_.begin(), string->runs_.end(),
                      [](Run const& a, Run const& b) {
                          return a.end == b.end && CFEqual(a.attributes.get(), b.attributes.get());
                      });
}

std::size_t NSAttributedString::hash() const
{
    std::size_t hash = CFHash(text_.cf_str());
    for (Run const& run : runs_)
        hash = hash * 31 + run.end + CFHash(run.attributes);
    return hash;
}

KVString NSAttributedString::description() const
{
    return text_;
}

NSObject* NSAttributedString::newCopy() const
{
    return NSObject::newCopy();
}

KVNSRef<NSAttributedString*> NSAttributedString::copy() const
{
    return KVNSRef<NSAttributedString*>::adopt(static_cast<NSAttributedString*>(newCopy()));
}

KVNSRef<NSMutableAttributedString*> NSAttributedString::mutableCopy() const
{
    return KVMakeRef<NSMutableAttributedString>(*this);
}

void NSAttributedString::encodeWithCoder(NSCoder& coder) const
{
    std::vector<KVNSRef<NSObject const*>> ends;
    std::vector<NSObject const*> endPointers;
    std::vector<NSObject const*> attributes;
    for (Run const& run : runs_) {
        ends.push_back(KVMakeRef<NSNumber>(static_cast<long long>(run.end)));
        endPointers.push_back(ends.back());
        attributes.push_back(run.attributes);
    }
    coder.encodeString(text_, "string");
    coder.encodeObject(KVMakeRef<NSArray>(endPointers), "runEnds");
    coder.encodeObject(KVMakeRef<NSArray>(attributes), "runAttributes");
}

NSCodingClass const NSAttributedString::coding = {
    "NSAttributedString", [](NSCoder& coder) -> KVNSRef<NSObject*> {
        KVNSRef<NSObject*> const endsObject =
            coder.decodeObject("runEnds", {&NSArrayCodingClass, &NSNumberCodingClass});
        KVNSRef<NSObject*> const attributesObject = coder.decodeObject(
            "runAttributes", {&NSArrayCodingClass, &NSNullCodingClass, &NSAttributes::coding});
        auto const* ends = dynamic_cast<NSArray const*>(endsObject.get());
        auto const* attributes = dynamic_cast<NSArray const*>(attributesObject.get());
        std::vector<Run> runs;
        std::size_t const count =
            ends && attributes ? std::min(ends->count(), attributes->count()) : 0;
        for (std::size_t i = 0; i < count; ++i) {
            auto const* end = dynamic_cast<NSNumber const*>(ends->objectAtIndex(i));
            if (end && end->int64Value() > 0) {
                runs.push_back({static_cast<std::size_t>(end->int64Value()),
                                dynamic_cast<NSAttributes const*>(attributes->objectAtIndex(i))});
            }
        }
        return KVMakeRef<NSAttributedString>(coder.decodeString("string"), std::move(runs));
    }};

// --- NSMutableAttributedString ---

/// Gives each run within the range, cut at the range's ends, the set that `change` makes of its
/// own.
template <class Change>
void NSMutableAttributedString::changeRuns(NSRange range, Change change)
{
    range = clipped(range, length());
    if (range.length == 0)
        return;
    std::vector<Run> runs;
    runs.reserve(runs_.size() + 2);
    std::size_t start = 0;
    for (Run const& run : runs_) {
        std::size_t const changeStart = std::clamp(range.location, start, run.end);
        std::size_t const changeEnd = std::clamp(NSMaxRange(range), start, run.end);
        if (changeStart > start)
            appendRun(runs, changeStart, run.attributes);
        if (changeEnd > changeStart)
            appendRun(runs, changeEnd, change(run.attributes));
        if (run.end > std::max(changeEnd, start))
            appendRun(runs, run.end, run.attributes);
        start = run.end;
    }
    runs_ = std::move(runs);
}

void NSMutableAttributedString::addAttribute(NSAttributeName name, NSObject const* value,
                                             NSRange range)
{
    changeRuns(range, [&](SharedAttributes const& attributes) {
        return withValue(attributes, name, value);
    });
}

void NSMutableAttributedString::applyFontTraits(std::uint32_t mask, NSRange range)
{
    changeRuns(range, [&](SharedAttributes const& attributes) {
        auto const* font = dynamic_cast<NSFont const*>(
            attributes ? attributes->value(NSFontAttributeName) : nullptr);
        if (!font)
            font = NSFont::systemFont();
        bool const bold = (font->isBold() && !(mask & NSUnboldFontMask)) || (mask & NSBoldFontMask);
        bool const italic =
            (font->isItalic() && !(mask & NSUnitalicFontMask)) || (mask & NSItalicFontMask);
        return withValue(attributes, NSFontAttributeName, font->withTraits(bold, italic).get());
    });
}

void NSMutableAttributedString::append(NSAttributedString const& other)
{
    std::size_t const oldLength = length();
    // Taken first: `other` may be this very string.
    std::vector<Run> const added = other.runs();
    text_.append(other.string());
    for (Run const& run : added)
        appendRun(runs_, oldLength + run.end, run.attributes);
}

NSObject* NSMutableAttributedString::newCopy() const
{
    return new NSAttributedString(*this);
}

#pragma once

#include <korvane/platform/NSColor.h>
#include <korvane/platform/NSFont.h>
#include <korvane/platform/NSRange.h>

#include <array>
#include <vector>

class NSMutableAttributedString;

/// What text can be styled with.
enum NSAttributeName : unsigned int {
    NSFontAttributeName,            ///< an NSFont
    NSForegroundColorAttributeName, ///< an NSColor
    NSBackgroundColorAttributeName, ///< an NSColor
    NSUnderlineStyleAttributeName,  ///< an NSNumber, NSUnderlineStyleSingle for one line
};
inline constexpr std::size_t NSAttributeNameCount = 4;
inline constexpr int NSUnderlineStyleSingle = 1;

/// A set of attributes, each there or not. Immutable, so runs and strings share it.
class KV_EXPORT NSAttributes final : public NSObject, public NSCoding {
public:
    /// Values in the order of NSAttributeName; null for what is not there.
    using Values = std::array<KVNSRef<NSObject const*>, NSAttributeNameCount>;

    explicit NSAttributes(Values values) noexcept : values_(std::move(values)) {}

    /// Unowned; null when it is not there.
    NSObject const* value(NSAttributeName name) const noexcept { return values_[name]; }

    bool isEqual(NSObject const* other) const override;
    std::size_t hash() const override;

    /// Keys "font", "foregroundColor", "backgroundColor", "underlineStyle".
    static NSCodingClass const coding;
    NSCodingClass const& codingClass() const override { return coding; }
    void encodeWithCoder(NSCoder& coder) const override;

private:
    Values values_;
};

/// Immutable text with attributes over ranges of it.
///
///     NSMutableAttributedString text("Wait here");
///     text.addAttribute(NSFontAttributeName, NSFont::systemFont(true), {0, 4});
///     NSRange range;
///     text.attribute(NSFontAttributeName, 2, &range);   // the bold font, range {0, 4}
///
/// Positions count UTF-16 units. The text is cut into runs, as few as its attributes allow, which
/// share their sets. Ranges given from outside are clipped to the text.
class KV_EXPORT NSAttributedString : public NSObject, public NSCoding {
public:
    /// The units from the end of the run before up to `end`, exclusive. Null: no attributes.
    struct Run {
        std::size_t end;
        KVNSRef<NSAttributes const*> attributes;
    };

    NSAttributedString() : NSAttributedString(KVString()) {}
    /// One set of attributes over the whole text. A null text is the empty one.
    explicit NSAttributedString(KVString const& text, NSAttributes const* attributes = nullptr);
    /// Runs in ascending order. Ends beyond the text are clipped, runs that are empty or lie behind
    /// a later end dropped, neighbours with equal sets joined; what the runs do not cover has no
    /// attributes.
    NSAttributedString(KVString const& text, std::vector<Run> runs);

    /// Never the null string.
    KVString const& string() const noexcept { return text_; }
    std::size_t length() const noexcept { return text_.view().size(); }
    /// Ascending, neighbours differ, the last one ends with the text; none for an empty text.
    std::vector<Run> const& runs() const noexcept { return runs_; }

    /// The value of an attribute at a unit, unowned, or null. `*range`, if asked for, becomes the
    /// longest range around the unit over which the value is equal. Beyond the text: null and the
    /// empty range at its end.
    NSObject const* attribute(NSAttributeName name, std::size_t index,
                              NSRange* range = nullptr) const;
    KVNSRef<NSAttributedString*> attributedSubstringFromRange(NSRange range) const;

    /// The same units with equal attributes; an immutable and a mutable string can be equal.
    bool isEqual(NSObject const* other) const override;
    std::size_t hash() const override;
    /// The text alone.
    KVString description() const override;

    /// Immutable: the receiver itself, retained, unless it is mutable.
    NSObject* newCopy() const override;
    KVNSRef<NSAttributedString*> copy() const;
    KVNSRef<NSMutableAttributedString*> mutableCopy() const;

    /// Keys "string", "runEnds" (an array of numbers), "runAttributes" (an array of NSAttributes
    /// and NSNull). Runs that do not fit the text are mended as the constructor does.
    static NSCodingClass const coding;
    NSCodingClass const& codingClass() const override { return coding; }
    void encodeWithCoder(NSCoder& coder) const override;

protected:
    KVString text_;
    std::vector<Run> runs_;
};

/// An attributed string that can be changed. Not synchronised.
class KV_EXPORT NSMutableAttributedString final : public NSAttributedString {
public:
    using NSAttributedString::NSAttributedString;
    explicit NSMutableAttributedString(NSAttributedString const& other) : NSAttributedString(other)
    {}

    /// Retains the value. A null value removes the attribute.
    void addAttribute(NSAttributeName name, NSObject const* value, NSRange range);
    void removeAttribute(NSAttributeName name, NSRange range)
    {
        addAttribute(name, nullptr, range);
    }
    /// Changes the traits of the fonts over the range; text without a font gets the system font
    /// first.
    void applyFontTraits(std::uint32_t mask, NSRange range);
    /// Copies the whole text: to build a long one of many pieces collect text and runs, then
    /// construct.
    void append(NSAttributedString const& other);

    NSObject* newCopy() const override;

private:
    template <class Change>
    void changeRuns(NSRange range, Change change);
};

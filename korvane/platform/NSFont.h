#pragma once

#include <korvane/platform/NSCoder.h>

/// Ways in which `NSMutableAttributedString::applyFontTraits` changes fonts; they combine.
enum NSFontTraitMask : std::uint32_t {
    NSItalicFontMask = 1u << 0,
    NSBoldFontMask = 1u << 1,
    NSUnboldFontMask = 1u << 2,
    NSUnitalicFontMask = 1u << 24,
};

/// A font as far as captions need one: a size and two traits. Immutable.
///
///     NSFont const* plain = NSFont::systemFont();
///     KVNSRef<NSFont const*> bold = plain->withTraits(true, false);
///
/// The four system fonts of the regular size are shared objects.
class KV_EXPORT NSFont final : public NSObject, public NSCoding {
public:
    /// The size of the system font for controls of regular size, in points.
    static constexpr double systemFontSize = 13;

    explicit NSFont(double pointSize, bool bold = false, bool italic = false) noexcept
        : pointSize_(pointSize), bold_(bold), italic_(italic)
    {}

    /// The system font in the regular size; unowned, lives as long as the process.
    static NSFont const* systemFont(bool bold = false, bool italic = false);

    double pointSize() const noexcept { return pointSize_; }
    bool isBold() const noexcept { return bold_; }
    bool isItalic() const noexcept { return italic_; }
    /// The same size with these traits, bold and italic both set anew.
    KVNSRef<NSFont const*> withTraits(bool bold, bool italic) const;

    bool isEqual(NSObject const* other) const override;
    std::size_t hash() const override;
    KVString description() const override;

    /// Keys "size", "bold", "italic".
    static NSCodingClass const coding;
    NSCodingClass const& codingClass() const override { return coding; }
    void encodeWithCoder(NSCoder& coder) const override;

private:
    double pointSize_;
    bool bold_;
    bool italic_;
};

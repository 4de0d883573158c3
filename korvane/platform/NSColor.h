#pragma once

#include <korvane/platform/NSCoder.h>

/// A colour: red, green, blue and alpha in a named colour space, usually 0 to 1. Immutable.
///
///     KVNSRef<NSColor const*> amber = KVMakeRef<NSColor>(1, 0.75, 0, 1);   // in sRGB
///
/// Spaces are known by name. Only a colour's own space and sRGB convert, each to itself.
class KV_EXPORT NSColor final : public NSObject, public NSCoding {
public:
    /// "sRGB".
    static KVString const& sRGBColorSpaceName();

    /// A null `colorSpaceName` is sRGB.
    NSColor(double red, double green, double blue, double alpha,
            KVString const& colorSpaceName = KVString());

    /// One of the named colours, in sRGB: black, white, gray, grey, darkGray, lightGray, red,
    /// green, blue, cyan, yellow, magenta, orange, purple, brown, clear, gold, navy, violet. Null
    /// for any other name; case counts.
    static KVNSRef<NSColor const*> named(KVString const& name);
    static KVNSRef<NSColor const*> blackColor() { return named("black"); }
    static KVNSRef<NSColor const*> whiteColor() { return named("white"); }
    static KVNSRef<NSColor const*> grayColor() { return named("gray"); }
    /// The same as `grayColor`.
    static KVNSRef<NSColor const*> greyColor() { return named("grey"); }
    /// 218, 187, 32 of 255, as near as the stated decimals come.
    static KVNSRef<NSColor const*> goldColor() { return named("gold"); }
    /// 0, 0, 128 of 255, likewise.
    static KVNSRef<NSColor const*> navyColor() { return named("navy"); }
    /// 138, 43, 226 of 255, likewise.
    static KVNSRef<NSColor const*> violetColor() { return named("violet"); }

    double redComponent() const noexcept { return red_; }
    double greenComponent() const noexcept { return green_; }
    double blueComponent() const noexcept { return blue_; }
    double alphaComponent() const noexcept { return alpha_; }
    KVString const& colorSpaceName() const noexcept { return colorSpaceName_; }

    /// The same colour in another space; null when there is no conversion.
    KVNSRef<NSColor const*> usingColorSpace(KVString const& name) const;

    /// Equal components and equal space.
    bool isEqual(NSObject const* other) const override;
    std::size_t hash() const override;
    KVString description() const override;

    /// Keys "red", "green", "blue", "alpha", "colorSpace".
    static NSCodingClass const coding;
    NSCodingClass const& codingClass() const override { return coding; }
    void encodeWithCoder(NSCoder& coder) const override;

private:
    double red_;
    double green_;
    double blue_;
    double alpha_;
    KVString colorSpaceName_;
};

/// The two platform names for a colour stand for one class here.
using CGColor = NSColor;

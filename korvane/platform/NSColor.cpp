#include <korvane/platform/NSColor.h>

#include <functional>

namespace {

struct NamedColor {
    char16_t const* name;
    double red, green, blue, alpha;
};

constexpr NamedColor namedColors[] = {
    {u"black", 0, 0, 0, 1},
    {u"white", 1, 1, 1, 1},
    {u"gray", 0.5, 0.5, 0.5, 1},
    {u"grey", 0.5, 0.5, 0.5, 1},
    {u"darkGray", 1.0 / 3, 1.0 / 3, 1.0 / 3, 1},
    {u"lightGray", 2.0 / 3, 2.0 / 3, 2.0 / 3, 1},
    {u"red", 1, 0, 0, 1},
    {u"green", 0, 1, 0, 1},
    {u"blue", 0, 0, 1, 1},
    {u"cyan", 0, 1, 1, 1},
    {u"yellow", 1, 1, 0, 1},
    {u"magenta", 1, 0, 1, 1},
    {u"orange", 1, 0.5, 0, 1},
    {u"purple", 0.5, 0, 0.5, 1},
    {u"brown", 0.6, 0.4, 0.2, 1},
    {u"clear", 0, 0, 0, 0},
    {u"gold", 0.8549019608, 0.733333333333333, 0.125490196078431, 1},
    {u"navy", 0, 0, 0.5019607843, 1},
    {u"violet", 0.5411764706, 0.168627450980392, 0.886274509803922, 1},
};

} // namespace

KVString const& NSColor::sRGBColorSpaceName()
{
    // Never destroyed: colours may outlive main.
    static KVString const& name = *new KVString("sRGB");
    return name;
}

NSColor::NSColor(double red, double green, double blue, double alpha,
                 KVString const& colorSpaceName)
    : red_(red),
      green_(green),
      blue_(blue),
      alpha_(alpha),
      colorSpaceName_(colorSpaceName.isNull() ? sRGBColorSpaceName() : colorSpaceName)
{}

KVNSRef<NSColor const*> NSColor::named(KVString const& name)
{
    for (NamedColor const& color : namedColors) {
        if (name.view() == color.name)
            return KVMakeRef<NSColor>(color.red, color.green, color.blue, color.alpha);
    }
    return nullptr;
}

KVNSRef<NSColor const*> NSColor::usingColorSpace(KVString const& name) const
{
    if (name.view() == colorSpaceName_.view())
        return this;
    return nullptr;
}

bool NSColor::isEqual(NSObject const* other) const
{
    if (this == other)
        return true;
    auto const* color = dynamic_cast<NSColor const*>(other);
    return color && color->red_ == red_ && color->green_ == green_ && color->blue_ == blue_ &&
           color->alpha_ == alpha_ && color->colorSpaceName_.view() == colorSpaceName_.view();
}

std::size_t NSColor::hash() const
{
    std::size_t hash = CFHash(colorSpaceName_.cf_str());
    for (double component : {red_, green_, blue_, alpha_})
        hash = hash * 31 + std::hash<double>()(component);
    return hash;
}

KVString NSColor::description() const
{
    return KVString::ssprintf("<NSColor: %s %g %g %g %g>", colorSpaceName_.toUTF8().c_str(), red_,
                              green_, blue_, alpha_);
}

void NSColor::encodeWithCoder(NSCoder& coder) const
{
    coder.encodeDouble(red_, "red");
    coder.encodeDouble(green_, "green");
    coder.encodeDouble(blue_, "blue");
    coder.encodeDouble(alpha_, "alpha");
    coder.encodeString(colorSpaceName_, "colorSpace");
}

NSCodingClass const NSColor::coding = {
    "NSColor", [](NSCoder& coder) -> KVNSRef<NSObject*> {
        return KVMakeRef<NSColor>(coder.decodeDouble("red"), coder.decodeDouble("green"),
                                  coder.decodeDouble("blue"), coder.decodeDouble("alpha"),
                                  coder.decodeString("colorSpace"));
    }};

#include <korvane/platform/NSFont.h>

#include <functional>

NSFont const* NSFont::systemFont(bool bold, bool italic)
{
    // Never destroyed: strings that use them may outlive main.
    static NSFont const* const fonts[] = {
        new NSFont(systemFontSize, false, false),
        new NSFont(systemFontSize, false, true),
        new NSFont(systemFontSize, true, false),
        new NSFont(systemFontSize, true, true),
    };
    return fonts[2 * bold + italic];
}

KVNSRef<NSFont const*> NSFont::withTraits(bool bold, bool italic) const
{
    if (bold == bold_ && italic == italic_)
        return this;
    if (pointSize_ == systemFontSize)
        return systemFont(bold, italic);
    return KVMakeRef<NSFont>(pointSize_, bold, italic);
}

bool NSFont::isEqual(NSObject const* other) const
{
    if (this == other)
        return true;
    auto const* font = dynamic_cast<NSFont const*>(other);
    return font && font->pointSize_ == pointSize_ && font->bold_ == bold_ &&
           font->italic_ == italic_;
}

std::size_t NSFont::hash() const
{
    return std::hash<double>()(pointSize_) * 4 + 2 * bold_ + italic_;
}

KVString NSFont::description() const
{
    return KVString::ssprintf("<NSFont: %g pt%s%s>", pointSize_, bold_ ? " bold" : "",
                              italic_ ? " italic" : "");
}

void NSFont::encodeWithCoder(NSCoder& coder) const
{
    coder.encodeDouble(pointSize_, "size");
    coder.encodeBool(bold_, "bold");
    coder.encodeBool(italic_, "italic");
}

NSCodingClass const NSFont::coding = {"NSFont", [](NSCoder& coder) -> KVNSRef<NSObject*> {
                                          return KVMakeRef<NSFont>(coder.decodeDouble("size"),
                                                                   coder.decodeBool("bold"),
                                                                   coder.decodeBool("italic"));
                                      }};

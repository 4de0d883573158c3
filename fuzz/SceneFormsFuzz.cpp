// Any bytes as a project in either form. What could be read is written in both forms and read
// back: the hash stays the same.

#include "MemoryFile.h"
#include "ToolError.h"
#include "scene/SceneFile.h"

#include <korvane/korvane.h>

#include <cmath>
#include <cstdint>
#include <cstdlib>

namespace {

/// What the text form gives back as it is. It has no place for control characters and for bytes
/// that are no characters, decodes "&" twice, drops texts of blanks, and keeps 32 bits of an epoch.
struct SurvivesText {
    bool operator()(KVString const& text) const
    {
        bool blank = true;
        for (char16_t const unit : text.view()) {
            if (unit < 0x20 || unit == u'&' || (unit >= 0xD800 && unit <= 0xDFFF) || unit >= 0xFFFE)
                return false;
            blank = blank && unit == u' ';
        }
        return !blank;
    }
    bool operator()(CMTime const& time) const { return time.epoch >> 32 == 0; }
    bool operator()(float number) const { return !std::isnan(number); }
    bool operator()(double number) const { return !std::isnan(number); }
    template <class T>
    bool operator()(T const&) const
    {
        return true;
    }
};

bool survivesText(scene::Node const& root)
{
    bool result = true;
    auto const look = [&](scene::Node const& node, std::size_t) {
        result = result && std::visit(SurvivesText(), node.content());
        for (auto const& attribute : node.attributes())
            result = result && std::visit(SurvivesText(), attribute.second);
    };
    walk(root, look, [](scene::Node const&, std::size_t) {});
    return result;
}

/// The hash of what comes back through that form.
KVHash128 hashThrough(scene::Form form, scene::Node& root)
{
    KVBufferWriteStream bytes(4096, 4096);
    scene::save(root, form, bytes);
    MemoryFile const file(bytes.getBuffer(), bytes.getBufferSize());
    scene::Document copy;
    scene::load(file.path(), copy);
    return hashOf(copy.root);
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    MemoryFile const file(data, size);
    scene::Document document;
    try {
        scene::load(file.path(), document);
    } catch (ToolError const&) {
        // What has been read up to there is a document too.
    }
    KVHash128 const hash = hashOf(document.root);
    if (!(hashThrough(scene::Form::Binary, document.root) == hash))
        std::abort();
    if (survivesText(document.root) && !(hashThrough(scene::Form::Text, document.root) == hash))
        std::abort();
    return 0;
}

// Shown by docs/platform.md.
#include <korvane/platform/KVKeyedCoder.h>
#include <korvane/platform/NSAttributedString.h>
#include <korvane/platform/NSFont.h>

int main()
{
    NSMutableAttributedString line("Wait here");
    line.addAttribute(NSFontAttributeName, NSFont::systemFont(true), {0, 4});

    KVKeyedCoder archive;
    archive.encodeObject(&line, "line");
    std::vector<std::uint8_t> const bytes = archive.archivedBytes(); // to keep or to send

    auto const reader = KVKeyedCoder::fromBytes(bytes); // null for bytes that are no archive
    if (!reader)
        return 1;
    auto const again =
        reader->decodeObjectOfClass<NSAttributedString>(NSAttributedString::coding, "line");
    NSRange bold{};
    return again && again->attribute(NSFontAttributeName, 2, &bold) && bold.length == 4 ? 0 : 1;
}

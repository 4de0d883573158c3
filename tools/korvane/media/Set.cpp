// korvane media set: a movie copied with other metadata.

#include "../Input.h"
#include "../Json.h"
#include "../Markup.h"
#include "../ToolError.h"
#include "Commands.h"
#include "Metadata.h"
#include "Rewrite.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <optional>

namespace {

struct SetOptions : RewriteOptions {
    std::string spherical, stereo, bounds, source, hdr, colour, pixelAspect, field;
    std::optional<double> yaw, pitch, roll;
    std::optional<int> cubeLayout, cubePadding;
    bool firstGeneration = false;
};

[[noreturn]] void badOption(char const* option, std::string const& text, char const* expected)
{
    throw ToolError(ExitCode::Usage, std::string(option) + ": \"" + text + "\" is not " + expected);
}

/// Numbers between separators; empty when the text is something else.
template <class Number>
std::vector<Number> numbersIn(std::string const& text, char separator)
{
    std::vector<Number> numbers;
    char const *next = text.data(), *const end = text.data() + text.size();
    for (;;) {
        Number number{};
        auto const [rest, error] = std::from_chars(next, end, number);
        if (error != std::errc() || (rest != end && *rest != separator))
            return {};
        numbers.push_back(number);
        if (rest == end)
            return numbers;
        next = rest + 1;
    }
}

std::vector<int> integersOption(char const* option, std::string const& text, char separator,
                                std::size_t count, int least, int most, char const* expected)
{
    auto const numbers = numbersIn<int>(text, separator);
    bool const fit =
        std::all_of(numbers.begin(), numbers.end(), [&](int n) { return n >= least && n <= most; });
    if (numbers.size() != count || !fit)
        badOption(option, text, expected);
    return numbers;
}

using Values = KVCFRef<CFMutableDictionaryRef>;

void setValue(Values const& values, char const* key, std::string const& text)
{
    values->setValue(key, KVString(text).cf_str());
}

/// What a section holds in the file, to be changed.
Values sectionOf(KVAtomMetadataHandler const& handler, char const* key)
{
    auto const metadata = handler.copyMetadata();
    auto const* const section = dynamic_cast<CFDictionaryRef>(metadata->value(key));
    return section ? Values::adopt(CFDictionaryCreateMutableCopy(nullptr, 0, section))
                   : Values::adopt(CFDictionaryCreateMutable(nullptr, 0));
}

/// 0.25 of the frame as an unsigned fraction of 32 bits, in the signed form that the library reads.
std::string fractionText(double part)
{
    auto const bits =
        static_cast<std::uint32_t>(std::min(std::round(part * 4294967296.0), 4294967295.0));
    return std::to_string(static_cast<std::int32_t>(bits));
}

char const* const kStereoNames[] = {"mono", "top-bottom", "left-right", "custom"};
char const* const kBoundKeys[] = {"projection_bounds_top", "projection_bounds_bottom",
                                  "projection_bounds_left", "projection_bounds_right"};
char const* const kCubeKeys[] = {"cube_layout", "cube_padding"};

bool asksForSpherical(SetOptions const& options)
{
    return !options.spherical.empty() || !options.stereo.empty() || !options.bounds.empty() ||
           !options.source.empty() || options.yaw || options.pitch || options.roll ||
           options.cubeLayout || options.cubePadding || options.firstGeneration;
}

void setProjection(SetOptions const& options, KVImageDescAtomBox& descriptions,
                   Values const& values)
{
    bool const toCube = options.spherical == "cubemap";
    bool const toEqui = options.spherical == "equirectangular";
    if ((options.cubeLayout || options.cubePadding) && toEqui)
        throw ToolError(ExitCode::Usage, "--cube-layout and --cube-padding belong to a cubemap");
    if (!options.bounds.empty() && toCube)
        throw ToolError(ExitCode::Usage, "--bounds belongs to an equirectangular projection");
    // The projection that was there goes: the library would leave it beside the new one.
    if (toCube || toEqui) {
        descriptions.removeImageDescData(0, KVAtomType("mshp"));
        descriptions.removeImageDescData(0, toCube ? KVAtomType("equi") : KVAtomType("cbmp"));
        if (toCube)
            for (char const* key : kBoundKeys)
                values->setValue(key, nullptr);
        else
            for (char const* key : kCubeKeys)
                values->setValue(key, nullptr);
        char const* const needed = toCube ? kCubeKeys[0] : kBoundKeys[0];
        if (!values->value(needed))
            setValue(values, needed, "0");
    }
    if (options.cubeLayout)
        setValue(values, kCubeKeys[0], std::to_string(*options.cubeLayout));
    if (options.cubePadding)
        setValue(values, kCubeKeys[1], std::to_string(*options.cubePadding));
    if (options.bounds.empty())
        return;
    auto const bounds = numbersIn<double>(options.bounds, ',');
    bool const fit = std::all_of(bounds.begin(), bounds.end(),
                                 [](double part) { return part >= 0 && part < 1; });
    if (bounds.size() != 4 || !fit || bounds[0] + bounds[1] >= 1 || bounds[2] + bounds[3] >= 1)
        badOption("--bounds", options.bounds,
                  "four parts of the frame, top, bottom, left and right, such as 0,0,0.25,0.25");
    for (std::size_t i = 0; i < 4; ++i)
        setValue(values, kBoundKeys[i], fractionText(bounds[i]));
}

Values sphericalValues(SetOptions const& options, KVAtomMetadataHandler& handler)
{
    Values values = sectionOf(handler, kKVGoogleV2Metadata);
    setProjection(options, *handler.getImageDesc(), values);
    if (!options.stereo.empty()) {
        auto const* const name =
            std::find(std::begin(kStereoNames), std::end(kStereoNames), options.stereo);
        setValue(values, "stereo_mode", std::to_string(name - kStereoNames));
    }
    if (!options.source.empty()) {
        if (options.source.size() > 251)
            badOption("--source", options.source, "at most 251 bytes long");
        setValue(values, "metadata_source", options.source);
    } else if (!values->value("metadata_source")) {
        setValue(values, "metadata_source", "Korvane");
    }
    struct Angle {
        char const* key;
        std::optional<double> degrees;
    } const angles[] = {{"pose_yaw_degrees", options.yaw},
                        {"pose_pitch_degrees", options.pitch},
                        {"pose_roll_degrees", options.roll}};
    for (Angle const& angle : angles)
        if (angle.degrees)
            setValue(values, angle.key, KVString::ssprintf("%.6f", *angle.degrees).toUTF8());
    return values;
}

/// The first generation has its own names, and whole degrees.
Values firstGenerationValues(SetOptions const& options, Values const& second)
{
    Values values = Values::adopt(CFDictionaryCreateMutable(nullptr, 0));
    auto const textOf = [&](char const* key) {
        auto const* const value = second->value(key);
        return value ? value->description().toUTF8() : std::string("0");
    };
    if (options.spherical == "cubemap" || second->value(kCubeKeys[0]))
        throw ToolError(ExitCode::Usage,
                        "--first-generation knows the equirectangular projection alone");
    std::string const stereo = textOf("stereo_mode");
    setValue(values, "GSpherical:StereoMode",
             stereo == "1"   ? "top-bottom"
             : stereo == "2" ? "left-right"
                             : "mono");
    setValue(values, "GSpherical:StitchingSoftware", escaped(textOf("metadata_source")));
    for (auto const& [key, degrees] :
         {std::pair{"GSpherical:InitialViewHeadingDegrees", options.yaw},
          std::pair{"GSpherical:InitialViewPitchDegrees", options.pitch},
          std::pair{"GSpherical:InitialViewRollDegrees", options.roll}})
        if (degrees)
            setValue(values, key, std::to_string(std::lround(*degrees)));
    return values;
}

/// A file of numbers under the keys of the library, each once: those of `info --json`, or its
/// section of HDR metadata alone.
Values hdrValues(std::string const& path)
{
    struct Key {
        char const* name;
        std::int64_t most;
    } const keys[] = {{"display_primaries_x0", 0xFFFF},
                      {"display_primaries_y0", 0xFFFF},
                      {"display_primaries_x1", 0xFFFF},
                      {"display_primaries_y1", 0xFFFF},
                      {"display_primaries_x2", 0xFFFF},
                      {"display_primaries_y2", 0xFFFF},
                      {"white_point_x", 0xFFFF},
                      {"white_point_y", 0xFFFF},
                      {"max_display_mastering_luminance", 0x7FFFFFFF},
                      {"min_display_mastering_luminance", 0x7FFFFFFF},
                      {"max_content_light_level", 0xFFFF},
                      {"max_pic_average_light_level", 0xFFFF}};
    Json document = Json::parse(readFile(path), nullptr, false);
    if (document.is_object() && document.contains("metadata"))
        document = Json(document["metadata"]);
    if (document.is_object() && document.contains(kKVHDRMetadata))
        document = Json(document[kKVHDRMetadata]);
    if (!document.is_object() || document.empty())
        throw badInput(path, "is no JSON object of mastering display numbers");
    Values values = Values::adopt(CFDictionaryCreateMutable(nullptr, 0));
    for (auto const& [name, value] : document.items()) {
        auto const* const key = std::find_if(std::begin(keys), std::end(keys),
                                             [&](Key const& k) { return k.name == name; });
        if (key == std::end(keys))
            throw badInput(path, "\"" + name + "\" is no mastering display number");
        auto const numbers = numbersIn<std::int64_t>(
            value.is_string() ? value.get<std::string>() : value.dump(), '\0');
        if (numbers.size() != 1 || numbers[0] < 0 || numbers[0] > key->most)
            throw badInput(path, "\"" + name + "\" is no whole number from 0 to " +
                                     std::to_string(key->most));
        setValue(values, key->name, std::to_string(numbers[0]));
    }
    return values;
}

/// `colr` in the form that the file has, or that its type calls for. The library's own setter
/// writes a layout that players do not read.
void setColour(SetOptions const& options, KVAtomMetadataHandler& handler)
{
    auto const codes =
        integersOption("--colour", options.colour, ',', 3, 1, 0xFFFF,
                       "primaries, transfer and matrix of ITU-T H.273, such as 9,16,9");
    KVImageDescAtomBox& descriptions = *handler.getImageDesc();
    auto const current = readColour(descriptions);
    if (!current && descriptions.copyImageDescData(0, KVAtomType("colr")))
        throw ToolError(ExitCode::Failed, options.input +
                                              ": its colour is an ICC profile or of a "
                                              "kind that is not known; it would be lost");
    bool const nclx = current ? current->isNclx : handler.getFileType() != KVAtomType("qt  ");
    std::string bytes = nclx ? "nclx" : "nclc";
    for (int const code : codes) {
        bytes.push_back(static_cast<char>(code >> 8));
        bytes.push_back(static_cast<char>(code));
    }
    if (nclx)
        bytes.push_back(current && current->isFullRange ? '\x80' : '\0');
    __CFData const data(bytes.data(), bytes.size());
    descriptions.setImageDescData(0, KVAtomType("colr"), &data);
}

void set(SetOptions const& options)
{
    checkPaths(options);
    KVAtomMetadataHandler handler;
    openMetadata(handler, options.input);
    KVImageDescAtomBox* const descriptions = handler.getImageDesc();
    KVAtomBox const* const track = handler.getVideoTrack();
    if (!descriptions || !track || descriptions->getImageDescCount() == 0)
        throw badInput(options.input, "has no video track that is enabled");
    checkDescriptions(handler, *track, options.input);

    // What is not asked for is not given to the library, and stays as it is in the file.
    Values const metadata = Values::adopt(CFDictionaryCreateMutable(nullptr, 0));
    if (asksForSpherical(options)) {
        Values const values = sphericalValues(options, handler);
        metadata->setValue(kKVGoogleV2Metadata, values);
        if (options.firstGeneration)
            metadata->setValue(kKVGoogleV1Metadata, firstGenerationValues(options, values));
    }
    if (!options.hdr.empty()) {
        Values const values = sectionOf(handler, kKVHDRMetadata);
        Values const given = hdrValues(options.hdr);
        for (std::size_t i = 0; i < given->count(); ++i)
            values->setValue(given->keyAtIndex(i), given->valueAtIndex(i));
        metadata->setValue(kKVHDRMetadata, values);
    }
    if (!options.colour.empty())
        setColour(options, handler);
    if (!options.pixelAspect.empty()) {
        auto const aspect = integersOption("--pixel-aspect", options.pixelAspect, ':', 2, 1,
                                           0x7FFFFFFF, "width and height, such as 4:3");
        descriptions->setImageDescPixelAspectInfo(0, aspect[0], aspect[1]);
    }
    if (!options.field.empty()) {
        auto const field = integersOption("--field", options.field, ',', 2, 0, 255,
                                          "the number of fields and their order, such as 2,9");
        descriptions->setImageDescFieldInfo(0, field[0], field[1]);
    }
    handler.setMetadata(metadata);
    if (handler.updateAtomsWithMetadata() != 0)
        throw badInput(options.input, "its sample description can not be rebuilt");
    rewrite(handler, options);
}

} // namespace

void addMediaSet(CLI::App& media)
{
    auto const setOptions = std::make_shared<SetOptions>();
    CLI::App& setCommand =
        *media.add_subcommand("set", "Copy a movie and give its first video track other metadata");
    addRewriteOptions(setCommand, *setOptions);
    setCommand.add_option("--spherical", setOptions->spherical, "The projection")
        ->check(CLI::IsMember({"equirectangular", "cubemap"}));
    setCommand.add_option("--stereo", setOptions->stereo, "How the pictures of both eyes lie")
        ->check(CLI::IsMember({"mono", "top-bottom", "left-right", "custom"}));
    setCommand.add_option("--yaw", setOptions->yaw, "How far the sphere turns about its vertical")
        ->check(CLI::Range(-180.0, 180.0))
        ->type_name("DEGREES");
    setCommand.add_option("--pitch", setOptions->pitch, "How far it tilts")
        ->check(CLI::Range(-90.0, 90.0))
        ->type_name("DEGREES");
    setCommand.add_option("--roll", setOptions->roll, "How far it turns about the line of sight")
        ->check(CLI::Range(-180.0, 180.0))
        ->type_name("DEGREES");
    setCommand
        .add_option("--bounds", setOptions->bounds,
                    "Parts of the sphere cut off at the top, bottom, left and right, each below 1")
        ->type_name("T,B,L,R");
    setCommand.add_option("--cube-layout", setOptions->cubeLayout, "The number of the layout")
        ->check(CLI::NonNegativeNumber);
    setCommand.add_option("--cube-padding", setOptions->cubePadding, "Pixels around each face")
        ->check(CLI::NonNegativeNumber);
    setCommand.add_option("--source", setOptions->source, "What made the metadata");
    setCommand.add_flag("--first-generation", setOptions->firstGeneration,
                        "Also write spherical metadata of the first generation, for old players");
    setCommand
        .add_option("--hdr", setOptions->hdr,
                    "A JSON file of mastering display and content light numbers")
        ->type_name("FILE");
    setCommand
        .add_option("--colour,--color", setOptions->colour,
                    "Primaries, transfer and matrix of ITU-T H.273, such as 9,16,9")
        ->type_name("P,T,M");
    setCommand
        .add_option("--pixel-aspect", setOptions->pixelAspect,
                    "Width and height of a pixel, such as 4:3")
        ->type_name("RATIO");
    setCommand
        .add_option("--field", setOptions->field,
                    "The number of fields and their order, such as 2,9")
        ->type_name("FIELDS,ORDER");
    setCommand.callback([setOptions] { set(*setOptions); });
}

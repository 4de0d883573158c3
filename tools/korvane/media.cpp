// korvane media tree, info, set, strip: QuickTime and MP4 files looked at and rewritten with other
// metadata.

#include "AtomicOutput.h"
#include "FileBytes.h"
#include "Input.h"
#include "Json.h"
#include "MovieRewrite.h"
#include "MovieTree.h"
#include "Progress.h"
#include "ToolError.h"
#include "commands.h"

#include <korvane/korvane.h>

#include <algorithm>
#include <charconv>
#include <chrono>
#include <cmath>
#include <future>
#include <optional>

namespace {

std::string padded(std::string const& text, std::size_t width)
{
    return std::string(width > text.size() ? width - text.size() : 0, ' ') + text;
}

// --- tree ---

struct TreeOptions {
    std::string file;
    std::string against;
    bool json = false;
};

char const kMarks[] = {' ', '>', '*', '+', '-'}; // by AtomChange::Kind
char const* const kKindNames[] = {"same", "moved", "changed", "new", "gone"};

Json atomsAsJson(std::vector<AtomChange> const& changes, std::size_t& next, int depth, bool marked)
{
    Json atoms = Json::array();
    while (next < changes.size() && changes[next].depth == depth) {
        AtomChange const& change = changes[next++];
        MovieAtom const& atom = change.after ? *change.after : *change.before;
        Json entry = {{"type", atom.type},
                      {"offset", atom.offset},
                      {"size", atom.size},
                      {"header", atom.header}};
        if (marked)
            entry["change"] = kKindNames[change.kind];
        Json children = atomsAsJson(changes, next, depth + 1, marked);
        if (!children.empty())
            entry["atoms"] = std::move(children);
        atoms.push_back(std::move(entry));
    }
    return atoms;
}

void tree(TreeOptions const& options)
{
    MovieComparison const movie = compareMovies(options.file, options.against);
    std::uint64_t const length = movie.length;
    std::uint64_t const end = movie.after.back().offset + movie.after.back().size;
    bool const marked = !options.against.empty();

    if (options.json) {
        std::size_t next = 0;
        Json document = {{"file", options.file},
                         {"size", length},
                         {"atoms", atomsAsJson(movie.changes, next, 0, marked)}};
        if (end != length)
            document["unread_from"] = end;
        return printJson(document);
    }
    std::string text = padded("offset", 12) + padded("size", 13) + "  atom\n";
    for (AtomChange const& change : movie.changes) {
        MovieAtom const& atom = change.after ? *change.after : *change.before;
        text += padded(std::to_string(atom.offset), 12) + padded(std::to_string(atom.size), 13);
        text += marked ? std::string(" ") + kMarks[change.kind] + " " : "  ";
        text += std::string(static_cast<std::size_t>(change.depth) * 2, ' ') + atom.type + "\n";
    }
    if (end != length)
        text += padded(std::to_string(end), 12) + padded(std::to_string(length - end), 13) +
                "  (no atom)\n";
    printOutput(text);
}

// --- info ---

struct InfoOptions {
    std::string file;
    bool json = false;
};

Json metadataAsJson(NSObject const* value)
{
    auto const* const dictionary = dynamic_cast<CFDictionaryRef>(value);
    if (!dictionary)
        return value->description().toUTF8();
    Json entries = Json::object();
    for (std::size_t i = 0; i < dictionary->count(); ++i)
        entries[dictionary->keyAtIndex(i)->description().toUTF8()] =
            metadataAsJson(dictionary->valueAtIndex(i));
    return entries;
}

void openMetadata(KVAtomMetadataHandler& handler, std::string const& path)
{
    openMovie(handler, path);
    if (!handler.isFileValidType())
        throw badInput(path, "is no QuickTime or MP4 file: its brand is not known");
    if (handler.readMetadata() != 0)
        throw badInput(path, "has no moov atom, or more than one");
}

/// `colr` of type "nclx" or "nclc": the code points, and whether the range is full.
struct Colour {
    bool isNclx;
    int codes[3];
    bool isFullRange;
};

std::optional<Colour> readColour(KVImageDescAtomBox const& descriptions)
{
    auto const data = descriptions.copyImageDescData(0, KVAtomType("colr"));
    if (!data || data->length() < 10)
        return std::nullopt;
    std::string_view const bytes(reinterpret_cast<char const*>(data->bytes()), data->length());
    bool const isNclx = bytes.starts_with("nclx");
    if (!isNclx && !bytes.starts_with("nclc"))
        return std::nullopt;
    Colour colour{isNclx, {}, isNclx && bytes.size() > 10 && (bytes[10] & 0x80) != 0};
    for (std::size_t i = 0; i < 3; ++i)
        colour.codes[i] = static_cast<unsigned char>(bytes[4 + 2 * i]) << 8 |
                          static_cast<unsigned char>(bytes[5 + 2 * i]);
    return colour;
}

void info(InfoOptions const& options)
{
    KVAtomMetadataHandler handler;
    openMetadata(handler, options.file);
    Json metadata = metadataAsJson(handler.copyMetadata());
    // The library gives the first value of a pair under both keys, and no "nclx".
    if (KVImageDescAtomBox const* const descriptions = handler.getImageDesc()) {
        Json& standard = metadata[kKVStandardExtensionsMetadata];
        int first = 0, second = 0;
        if (auto const colour = readColour(*descriptions)) {
            standard["color_primaries"] = std::to_string(colour->codes[0]);
            standard["color_transfer"] = std::to_string(colour->codes[1]);
            standard["color_matrix"] = std::to_string(colour->codes[2]);
        }
        if (descriptions->getImageDescFieldInfo(0, &first, &second) == 0)
            standard["field_detail"] = std::to_string(second);
        if (descriptions->getImageDescPixelAspectInfo(0, &first, &second) == 0)
            standard["pixel_aspect_v"] = std::to_string(second);
        if (standard.empty())
            metadata.erase(kKVStandardExtensionsMetadata);
    }
    KVString type;
    type.setOSType(handler.getFileType());
    if (options.json)
        return printJson({{"file", options.file}, {"type", type.toUTF8()}, {"metadata", metadata}});

    std::string text = "File type " + type.toUTF8() + "\n";
    for (auto const& [section, values] : metadata.items()) {
        text += section + "\n";
        if (values.is_string()) {
            text += "  " + values.get<std::string>() + "\n";
            continue;
        }
        for (auto const& [key, value] : values.items())
            text += "  " + key + std::string(key.size() < 32 ? 32 - key.size() : 1, ' ') +
                    value.get<std::string>() + "\n";
    }
    printOutput(text);
}

// --- Rewriting ---

struct RewriteOptions {
    std::string input, output;
    bool dryRun = false;
    bool noVerify = false;
    bool json = false;
};

void addRewriteOptions(CLI::App& command, RewriteOptions& options)
{
    command.add_option("IN", options.input, "A QuickTime or MP4 file")->required();
    command.add_option("OUT", options.output, "The file to write; another one")->required();
    command.add_flag("--dry-run", options.dryRun, "Print what would change and write nothing");
    command.add_flag("--no-verify", options.noVerify,
                     "Do not compare the samples of both files afterwards");
    addJsonFlag(command, options.json);
}

std::uint64_t bytesMoved(RewritePlan const& plan)
{
    std::uint64_t sum = 0;
    for (AtomChange const& change : plan.changes)
        sum += change.depth == 0 && change.kind == AtomChange::Moved ? change.after->size : 0;
    return sum;
}

bool isListed(AtomChange const& change)
{
    return change.kind != AtomChange::Same &&
           (change.depth == 0 || change.kind != AtomChange::Moved);
}

void printPlan(RewritePlan const& plan, RewriteOptions const& options)
{
    auto const shiftOf = [&](ChunkTable const& table) {
        return table.chunks.empty() ? 0 : plan.shift;
    };
    if (options.json) {
        Json document = {{"in", options.input},
                         {"out", options.output},
                         {"bytes_moved", bytesMoved(plan)},
                         {"atoms", Json::array()},
                         {"tables", Json::array()}};
        for (AtomChange const& change : plan.changes) {
            if (!isListed(change))
                continue;
            Json entry = {{"path", change.path}, {"change", kKindNames[change.kind]}};
            for (auto const& [key, atom] :
                 {std::pair{"before", change.before}, std::pair{"after", change.after}})
                if (atom)
                    entry[key] = {{"offset", atom->offset}, {"size", atom->size}};
            document["atoms"].push_back(std::move(entry));
        }
        for (ChunkTable const& table : plan.tables)
            document["tables"].push_back({{"path", table.path},
                                          {"offsets", table.chunks.size()},
                                          {"shift", shiftOf(table)}});
        return printJson(document);
    }
    std::string text;
    for (AtomChange const& change : plan.changes) {
        if (!isListed(change))
            continue;
        text += kMarks[change.kind] + std::string(" ") + change.path + ": ";
        MovieAtom const *before = change.before, *after = change.after;
        switch (change.kind) {
        case AtomChange::New:
            text += "new, " + std::to_string(after->size) + " bytes";
            break;
        case AtomChange::Gone:
            text += "gone, " + std::to_string(before->size) + " bytes";
            break;
        case AtomChange::Moved:
            text += std::to_string(after->size) + " bytes move from " +
                    std::to_string(before->offset) + " to " + std::to_string(after->offset);
            break;
        default:
            text += "changed, " + std::to_string(before->size) + " to " +
                    std::to_string(after->size) + " bytes";
            break;
        }
        text += "\n";
    }
    for (ChunkTable const& table : plan.tables)
        text += "  " + table.path + ": " + std::to_string(table.chunks.size()) +
                " offsets, shifted by " + std::to_string(shiftOf(table)) + "\n";
    text += std::to_string(bytesMoved(plan)) + " bytes move.\n";
    printOutput(text);
}

/// Shows a bar while another thread writes.
int writeWithProgress(KVAtomBoxFile& file)
{
    auto writing =
        std::async(std::launch::async, [&] { return file.writeAtomBoxFileWithUpdates(); });
    Progress progress("writing", 100);
    while (writing.wait_for(std::chrono::milliseconds(50)) != std::future_status::ready)
        progress.update(static_cast<std::uint64_t>(file.getWritePercentDone()));
    return writing.get();
}

char const* describe(int code)
{
    switch (code) {
    case -3:
        return "the disk is full, or the file too large";
    case -4:
        return "not permitted";
    case -5:
        return "the device failed";
    default:
        return "the movie could not be copied";
    }
}

/// Writes what the tree of `file` holds, if that is safe.
void rewrite(KVAtomBoxFile& file, RewriteOptions const& options)
{
    RewritePlan const plan = planRewrite(file, options.input);
    checkRewrite(plan, options.input);
    if (options.dryRun)
        return printPlan(plan, options);

    AtomicOutput output(options.output);
    KVURL const url(output.temporaryPath().c_str());
    if (url.isNull())
        throw inputOutput(options.output, "its name is not UTF-8");
    if (int const code = file.openOutputFile(url.cf_url()))
        throw inputOutput(options.output, describe(code));
    if (int const code = writeWithProgress(file))
        throw inputOutput(options.output, describe(code));
    file.closeOutputFile();
    std::uint64_t const compared =
        options.noVerify ? 0 : verifyRewrite(options.input, output.temporaryPath());
    output.commit();
    if (options.json)
        return printPlan(plan, options);
    printMessage(options.output + ": written" +
                 (options.noVerify
                      ? std::string()
                      : ", " + std::to_string(compared) + " bytes of samples compared"));
}

void checkPaths(RewriteOptions const& options)
{
    checkReadable(options.input);
    if (FileBytes::isSameFile(options.input, options.output))
        throw ToolError(ExitCode::Usage, options.output + ": is the input; write to another file");
}

/// A description that does not come out as it went in would lose bytes.
void checkDescriptions(KVAtomBoxFile& file, KVAtomBox const& track, std::string const& path)
{
    auto const original = KVCFRef<CFMutableDataRef>::adopt(new __CFData());
    if (file.readTrackSampleDescription(&track, original) != 0)
        throw badInput(path, "a video track has no sample description");
    KVImageDescAtomBox descriptions(original);
    for (bool const quickTime : {false, true}) {
        auto const again = descriptions.copyFullImageDescToData(quickTime);
        if (again && CFEqual(again, original))
            return;
    }
    throw ToolError(ExitCode::Failed,
                    path + ": the sample description of a video track holds bytes that are in no "
                           "atom and would be lost; nothing was written");
}

// --- set ---

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
        for (char const* key : {toCube ? kCubeKeys[0] : kBoundKeys[0]})
            if (!values->value(key))
                setValue(values, key, "0");
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
    setValue(values, "GSpherical:StitchingSoftware", [&] {
        std::string escaped;
        for (char const c : textOf("metadata_source"))
            escaped += c == '&' ? "&amp;" : c == '<' ? "&lt;" : std::string(1, c);
        return escaped;
    }());
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

// --- strip ---

struct StripOptions : RewriteOptions {
    bool spherical = false;
    bool hdr = false;
};

/// Whether the atom holds spherical metadata of the first generation.
bool isSphericalUUID(KVAtomBox const& atom, FileBytes const& bytes)
{
    static constexpr unsigned char kUUID[16] = {0xFF, 0xCC, 0x82, 0x63, 0xF8, 0x55, 0x4A, 0x93,
                                                0x88, 0x14, 0x58, 0x7A, 0x02, 0x52, 0x1F, 0xDD};
    unsigned char start[16];
    return atom.getType() == KVAtomType("uuid") &&
           bytes.read(atom.getOffset() + atom.getHeaderSize(), start, 16) == 16 &&
           std::equal(start, start + 16, kUUID);
}

void stripTrack(StripOptions const& options, KVAtomBoxFile& file, KVAtomBox& track)
{
    checkDescriptions(file, track, options.input);
    FileBytes const bytes(options.input);
    if (options.spherical)
        for (int i = track.getChildCount() - 1; i >= 0; --i)
            if (isSphericalUUID(*track.getChild(i), bytes))
                track.removeChild(i);

    auto const data = KVCFRef<CFMutableDataRef>::adopt(new __CFData());
    file.readTrackSampleDescription(&track, data);
    KVImageDescAtomBox descriptions(data);
    std::vector<unsigned int> types;
    if (options.spherical)
        types.insert(types.end(), {KVAtomType("st3d"), KVAtomType("sv3d")});
    if (options.hdr)
        types.insert(types.end(), {KVAtomType("mdcv"), KVAtomType("clli")});
    for (int i = 0; i < descriptions.getImageDescCount(); ++i)
        for (unsigned int const type : types)
            while (descriptions.removeImageDescData(i, type))
                continue;
    auto const stripped =
        descriptions.copyFullImageDescToData(file.getFileType() == KVAtomType("qt  "));
    KVAtomBox* const stsd = track.findFirstChild(true, KVAtomType("stsd"));
    stsd->setPayloadData(stripped);
    stsd->updateSize();
    stsd->updateParentSizes();
}

void strip(StripOptions const& options)
{
    if (!options.spherical && !options.hdr)
        throw ToolError(ExitCode::Usage, "tell what to strip: --spherical, --hdr");
    checkPaths(options);
    KVAtomBoxFile file;
    openMovie(file, options.input);
    if (file.readAllTrackMediaAtomBoxes() != 0)
        throw badInput(options.input, "has no moov atom, or more than one");
    std::vector<KVAtomBox*> tracks;
    for (int const enabled : {1, 0})
        if (file.findTracks(tracks, KVAtomType("vide"), enabled) != 0)
            throw badInput(options.input, "has a track without handler or header");
    for (KVAtomBox* track : tracks)
        stripTrack(options, file, *track);
    rewrite(file, options);
}

} // namespace

void addMediaCommands(CLI::App& program)
{
    CLI::App& media = *program.add_subcommand("media", "QuickTime and MP4 files");
    media.require_subcommand(1);

    auto const treeOptions = std::make_shared<TreeOptions>();
    CLI::App& treeCommand =
        *media.add_subcommand("tree", "Print the atoms of a movie with their offsets and sizes");
    treeCommand.add_option("FILE", treeOptions->file, "A QuickTime or MP4 file")->required();
    treeCommand.add_option("--against", treeOptions->against,
                           "Mark what is not as in this file: * changed, + new, - gone, > moved");
    addJsonFlag(treeCommand, treeOptions->json);
    treeCommand.callback([treeOptions] { tree(*treeOptions); });

    auto const infoOptions = std::make_shared<InfoOptions>();
    CLI::App& infoCommand =
        *media.add_subcommand("info", "Print the metadata of a movie's first video track");
    infoCommand.add_option("FILE", infoOptions->file, "A QuickTime or MP4 file")->required();
    addJsonFlag(infoCommand, infoOptions->json);
    infoCommand.callback([infoOptions] { info(*infoOptions); });

    auto const setOptions = std::make_shared<SetOptions>();
    CLI::App& setCommand =
        *media.add_subcommand("set", "Copy a movie and give its first video track other metadata");
    addRewriteOptions(setCommand, *setOptions);
    setCommand.add_option("--spherical", setOptions->spherical, "equirectangular or cubemap")
        ->check(CLI::IsMember({"equirectangular", "cubemap"}));
    setCommand.add_option("--stereo", setOptions->stereo, "mono, top-bottom, left-right or custom")
        ->check(CLI::IsMember({"mono", "top-bottom", "left-right", "custom"}));
    setCommand.add_option("--yaw", setOptions->yaw, "Degrees, -180 to 180")
        ->check(CLI::Range(-180.0, 180.0));
    setCommand.add_option("--pitch", setOptions->pitch, "Degrees, -90 to 90")
        ->check(CLI::Range(-90.0, 90.0));
    setCommand.add_option("--roll", setOptions->roll, "Degrees, -180 to 180")
        ->check(CLI::Range(-180.0, 180.0));
    setCommand.add_option("--bounds", setOptions->bounds,
                          "T,B,L,R: parts of the whole sphere that are cut off, each below 1");
    setCommand.add_option("--cube-layout", setOptions->cubeLayout, "The number of the layout")
        ->check(CLI::NonNegativeNumber);
    setCommand.add_option("--cube-padding", setOptions->cubePadding, "Pixels around each face")
        ->check(CLI::NonNegativeNumber);
    setCommand.add_option("--source", setOptions->source, "What made the metadata");
    setCommand.add_flag("--first-generation", setOptions->firstGeneration,
                        "Also write spherical metadata of the first generation, for old players");
    setCommand.add_option("--hdr", setOptions->hdr,
                          "A JSON file of mastering display and content light numbers");
    setCommand.add_option("--colour,--color", setOptions->colour,
                          "P,T,M: primaries, transfer, matrix (ITU-T H.273)");
    setCommand.add_option("--pixel-aspect", setOptions->pixelAspect, "H:V");
    setCommand.add_option("--field", setOptions->field, "FIELDS,DETAIL");
    setCommand.callback([setOptions] { set(*setOptions); });

    auto const stripOptions = std::make_shared<StripOptions>();
    CLI::App& stripCommand =
        *media.add_subcommand("strip", "Copy a movie without some of its metadata");
    addRewriteOptions(stripCommand, *stripOptions);
    stripCommand.add_flag("--spherical", stripOptions->spherical,
                          "Spherical metadata of both generations, in every video track");
    stripCommand.add_flag("--hdr", stripOptions->hdr, "Mastering display and content light");
    stripCommand.callback([stripOptions] { strip(*stripOptions); });
}

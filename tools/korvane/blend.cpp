#include "Json.h"
#include "ToolError.h"
#include "commands.h"

#include <korvane/compositing/KVBlend.h>
#include <korvane/foundation/KVException.h>

#include <algorithm>
#include <cctype>
#include <memory>
#include <optional>
#include <sstream>

namespace {

constexpr int modeNumbers = KV_BLEND_TEST + 1;

std::string constantName(KVBlendMode mode)
{
    std::ostringstream stream;
    stream << mode;
    return stream.str();
}

/// The entries of a menu with their names, as the host's user reads them.
void list(bool layer, bool json)
{
    Json entries = Json::array();
    std::string text;
    auto const modes = layer ? KVBlend::getLayerBlendModes() : KVBlend::getElementBlendModes();
    for (std::size_t i = 0; i < modes.size(); ++i) {
        // A menu's names stand at its places; those of the layer menu from its first entry.
        std::string const name = KVBlend::modeName(static_cast<KVBlendMode>(i), layer);
        bool const separator = modes[i] == KV_BLEND_SEPARATOR;
        entries.push_back({{"index", i},
                           {"mode", static_cast<int>(modes[i])},
                           {"constant", constantName(modes[i])},
                           {"name", separator ? Json() : Json(name)}});
        text += separator ? "-\n"
                          : std::to_string(i) + "\t" + std::to_string(static_cast<int>(modes[i])) +
                                "\t" + constantName(modes[i]) + "\t" + name + "\n";
    }
    if (json)
        printJson(entries);
    else
        printOutput(text);
}

/// Yes, no, or none for a mode that the library does not answer for.
std::optional<bool> ask(bool (*property)(KVBlendMode), KVBlendMode mode)
{
    try {
        return property(mode);
    } catch (KVUnsupportedOperationException const&) {
        return {};
    } catch (KVIllegalArgumentException const&) {
        return {};
    }
}

struct Property {
    char const* name;
    bool (*ask)(KVBlendMode);
};

constexpr Property properties[] = {
    {"abelian", [](KVBlendMode mode) { return KVBlend::isAbelian(mode); }},
    {"associative", KVBlend::isAssociative},
    {"normalOverNothing", KVBlend::isNormalOverNothing},
    {"nothingOverNothing", KVBlend::isNothingOverNothing},
    {"blackLikeNormal", KVBlend::treatsBlackLikeNormal},
};

/// A mode by its number, its constant or its constant without "KV_BLEND_", in any case.
KVBlendMode modeFor(std::string const& given)
{
    std::string word(given);
    std::transform(word.begin(), word.end(), word.begin(), [](unsigned char c) {
        return c == '-' ? '_' : static_cast<char>(std::toupper(c));
    });
    for (int number = 0; number < modeNumbers; ++number) {
        auto const mode = static_cast<KVBlendMode>(number);
        std::string const name = constantName(mode);
        if (word == name || "KV_BLEND_" + word == name || word == std::to_string(number))
            return mode;
    }
    throw ToolError(ExitCode::Usage, "\"" + given + "\" is no blend mode");
}

void tell(std::vector<std::string> const& words, bool json)
{
    std::vector<KVBlendMode> modes;
    for (std::string const& word : words)
        modes.push_back(modeFor(word));
    for (int number = 0; words.empty() && number < modeNumbers; ++number)
        modes.push_back(static_cast<KVBlendMode>(number));

    Json rows = Json::array();
    std::string text = "mode";
    for (Property const& property : properties)
        text += std::string("\t") + property.name;
    for (KVBlendMode const mode : modes) {
        Json row = {{"mode", static_cast<int>(mode)}, {"constant", constantName(mode)}};
        text += "\n" + constantName(mode);
        for (Property const& property : properties) {
            std::optional<bool> const answer = ask(property.ask, mode);
            row[property.name] = answer ? Json(*answer) : Json();
            text += !answer ? "\t-" : *answer ? "\tyes" : "\tno";
        }
        rows.push_back(row);
    }
    if (json)
        printJson(rows);
    else
        printOutput(text + "\n");
}

void addList(CLI::App& family)
{
    struct Options {
        bool layer = false;
        bool json = false;
    };
    auto const options = std::make_shared<Options>();
    auto& command = *family.add_subcommand(
        "list", "List a menu: place, number, constant and name of each mode");
    command.add_flag("--layer", options->layer, "The menu for layers, which begins with Combine");
    addJsonFlag(command, options->json);
    command.callback([options] { list(options->layer, options->json); });
}

void addProperties(CLI::App& family)
{
    struct Options {
        std::vector<std::string> modes;
        bool json = false;
    };
    auto const options = std::make_shared<Options>();
    auto& command = *family.add_subcommand(
        "properties", "Tell what a compositor may rely on: yes, no, or - where there is no answer");
    command.add_option("MODE", options->modes,
                       "Modes by number or constant (add, KV_BLEND_ADD); all if left out");
    addJsonFlag(command, options->json);
    command.callback([options] { tell(options->modes, options->json); });
}

} // namespace

void addBlendCommands(CLI::App& program)
{
    auto& family = *program.add_subcommand("blend", "List blend modes and their properties");
    family.require_subcommand(1);
    addList(family);
    addProperties(family);

    addExamples(family, {"korvane blend list --layer", "korvane blend properties add multiply"});
}

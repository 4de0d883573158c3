#include "AtomicOutput.h"
#include "Json.h"
#include "ToolError.h"
#include "commands.h"
#include "scene/Diff.h"
#include "scene/SceneFile.h"

#include <korvane/foundation/KVException.h>
#include <korvane/serialization/KVBufferWriteStream.h>

#include <chrono>
#include <map>
#include <memory>

namespace {

using scene::describe;
using scene::describeChange;
using scene::Document;
using scene::Form;
using scene::isSet;
using scene::Node;
using scene::toJson;

// --- show ---

/// "clip "Opening" start=0 track=1": the name first, the other attributes behind it.
std::string lineOf(Node const& node)
{
    std::string line = node.info().name;
    for (scene::AttributeInfo const& attribute : node.info().attributes) {
        scene::Value const& value = node.attribute(attribute.token);
        if (!isSet(value))
            continue;
        line += ' ';
        if (std::string_view(attribute.name) != "name")
            line += std::string(attribute.name) + "=";
        line += describe(value);
    }
    if (isSet(node.content()))
        line += ": " + describe(node.content());
    return line;
}

std::string treeOf(Node const& root)
{
    // The strokes of the levels above, a piece for each; depth 0 is the document itself.
    std::vector<std::string> strokes{""};
    std::vector<Node const*> last{&root};
    std::string text;
    walk(
        root,
        [&](Node const& node, std::size_t depth) {
            last.resize(depth + 1);
            last[depth] = &node;
            if (depth == 0)
                return;
            bool const isLast = last[depth - 1]->children().back().get() == &node;
            strokes.resize(depth);
            // Beyond a hundred levels a tree is no picture any more.
            if (depth <= 100)
                for (std::size_t i = 1; i < depth; ++i)
                    text += strokes[i];
            else
                text += "(" + std::to_string(depth) + ") ";
            if (depth > 1)
                text += isLast ? "\u2514\u2500 " : "\u251C\u2500 ";
            text += lineOf(node) + '\n';
            strokes.push_back(depth == 1 ? "" : isLast ? "   " : "\u2502  ");
        },
        [](Node const&, std::size_t) {});
    return text;
}

Json jsonOf(Node const& root)
{
    std::vector<Json> open;
    Json result;
    walk(
        root,
        [&](Node const& node, std::size_t) {
            Json element;
            if (*node.info().name)
                element["element"] = node.info().name;
            for (auto const& [token, value] : node.attributes())
                element["attributes"][findAttribute(node.info(), token)->name] = toJson(value);
            if (isSet(node.content()))
                element["content"] = toJson(node.content());
            open.push_back(std::move(element));
        },
        [&](Node const&, std::size_t) {
            Json element = std::move(open.back());
            open.pop_back();
            if (open.empty())
                result = std::move(element);
            else
                open.back()["children"].push_back(std::move(element));
        });
    return result;
}

/// How deep elements stand in one another.
std::size_t depthOf(Node const& root)
{
    std::size_t deepest = 0;
    walk(
        root, [&](Node const&, std::size_t depth) { deepest = std::max(deepest, depth); },
        [](Node const&, std::size_t) {});
    return deepest;
}

void show(std::string const& path, bool json)
{
    auto const document = std::make_unique<Document>();
    load(path, *document);
    if (!json)
        return printOutput(treeOf(document->root));
    // The JSON library prints by recursion.
    if (depthOf(document->root) > 10000)
        throw ToolError(ExitCode::Failed, path + ": nested too deep for JSON");
    printJson(jsonOf(document->root));
}

// --- check ---

void check(std::string const& path, bool json)
{
    auto const document = std::make_unique<Document>();
    load(path, *document, true);
    if (json) {
        Json list = Json::array();
        for (scene::Finding const& finding : document->findings)
            list.push_back({{"line", finding.line}, {"text", finding.text}});
        printJson(
            {{"file", path}, {"form", nameOf(document->form)}, {"findings", std::move(list)}});
    } else {
        std::string const name = inputName(path);
        std::string text;
        for (scene::Finding const& finding : document->findings)
            text += name + ":" + (finding.line ? std::to_string(finding.line) + ":" : "") + " " +
                    finding.text + "\n";
        printOutput(document->findings.empty() ? name + ": in order\n" : text);
    }
    if (!document->findings.empty())
        throw ToolError(ExitCode::BadInput, "");
}

// --- convert ---

/// Writes through `out`; a failure to write is the tool's own.
void write(Node& root, Form form, KVStream& stream, std::string const& path)
{
    try {
        save(root, form, stream);
    } catch (KVException_WriteError const& error) {
        throw stream.getError() ? inputOutput(path, stream.getError())
                                : inputOutput(path, error.getInfo().toUTF8());
    }
}

void convert(std::string const& from, std::string const& to, std::string const& form)
{
    auto const document = std::make_unique<Document>();
    load(from, *document);
    Form target = document->form;
    if (!form.empty())
        target = form == nameOf(Form::Binary) ? Form::Binary : Form::Text;
    // Sizes go in behind what they count, so the bytes gather in memory first.
    KVBufferWriteStream bytes(1 << 16, 1 << 20);
    write(document->root, target, bytes, to);
    AtomicOutput output(to);
    output.write(bytes.getBuffer(), bytes.getBufferSize());
    output.commit();
}

// --- hash ---

void hash(std::vector<std::string> const& paths, bool json)
{
    Json list = Json::array();
    std::string text;
    for (std::string const& path : paths) {
        auto const document = std::make_unique<Document>();
        load(path, *document);
        std::string const digits = hashOf(document->root).getString().toUTF8();
        list.push_back({{"file", path}, {"hash", digits}});
        text += digits + "  " + path + "\n";
    }
    json ? printJson(list) : printOutput(text);
}

// --- diff ---

std::string textOf(scene::Difference const& difference, std::string const& first,
                   std::string const& second)
{
    using What = scene::Difference::What;
    std::string const place = difference.path.empty() ? "" : difference.path + ": ";
    switch (difference.what) {
    case What::Attribute:
        return place + difference.name + ": " + describeChange(difference.first, difference.second);
    case What::Content:
        return place + describeChange(difference.first, difference.second);
    case What::OnlyInFirst:
        return place + "only in " + first + ": " + difference.name;
    case What::OnlyInSecond:
        return place + "only in " + second + ": " + difference.name;
    case What::Order:
        return place + "in another order";
    }
    return place;
}

Json jsonOf(scene::Difference const& difference)
{
    static char const* const names[] = {"attribute", "content", "only in first", "only in second",
                                        "order"};
    Json result{{"path", difference.path}, {"what", names[static_cast<int>(difference.what)]}};
    if (!difference.name.empty())
        result["name"] = difference.name;
    if (isSet(difference.first) || isSet(difference.second)) {
        result["first"] = toJson(difference.first);
        result["second"] = toJson(difference.second);
    }
    return result;
}

void diff(std::string const& first, std::string const& second, bool json)
{
    auto const a = std::make_unique<Document>();
    auto const b = std::make_unique<Document>();
    load(first, *a);
    load(second, *b);
    Json list = Json::array();
    std::string text;
    scene::diff(a->root, b->root, [&](scene::Difference const& difference) {
        if (json)
            list.push_back(jsonOf(difference));
        else
            text += textOf(difference, first, second) + "\n";
    });
    bool const differ = !text.empty() || !list.empty();
    json ? printJson(list) : printOutput(text);
    if (differ)
        throw ToolError(ExitCode::Failed, "");
}

} // namespace

void addSceneCommands(CLI::App& program)
{
    CLI::App& family = *program.add_subcommand("scene", "Show, check and convert scene documents");
    family.require_subcommand(1);

    struct Options {
        std::string file;
        std::string output;
        std::string form;
        std::vector<std::string> files;
        bool json = false;
    };
    auto const options = std::make_shared<Options>();

    CLI::App& showCommand = *family.add_subcommand("show", "Print the document as a tree");
    showCommand.add_option("FILE", options->file, "Document in text or binary form, or -")
        ->required();
    addJsonFlag(showCommand, options->json);
    showCommand.callback([options] { show(options->file, options->json); });

    CLI::App& checkCommand = *family.add_subcommand(
        "check", "Say whether the document is well-formed and all that is in it is known");
    checkCommand.add_option("FILE", options->file, "Document in text or binary form, or -")
        ->required();
    addJsonFlag(checkCommand, options->json);
    checkCommand.callback([options] { check(options->file, options->json); });

    CLI::App& convertCommand =
        *family.add_subcommand("convert", "Write the document anew, without what is not known");
    convertCommand.add_option("IN", options->file, "Document in text or binary form, or -")
        ->required();
    convertCommand.add_option("OUT", options->output, "Where to write, or -")->required();
    convertCommand.add_option("--to", options->form, "The form to write; the same form by default")
        ->check(CLI::IsMember({"text", "binary"}));
    convertCommand.callback([options] { convert(options->file, options->output, options->form); });

    CLI::App& hashCommand = *family.add_subcommand(
        "hash", "Print the 128-bit hash of all values, the same in both forms");
    hashCommand.add_option("FILE", options->files, "Documents in text or binary form, or -")
        ->required();
    addJsonFlag(hashCommand, options->json);
    hashCommand.callback([options] { hash(options->files, options->json); });

    CLI::App& diffCommand = *family.add_subcommand(
        "diff", "Say where two documents differ, whatever their forms: nothing if they are alike");
    diffCommand.add_option("A", options->file, "Document in text or binary form, or -")->required();
    diffCommand.add_option("B", options->output, "The document to compare it with, or -")
        ->required();
    addJsonFlag(diffCommand, options->json);
    diffCommand.callback([options] { diff(options->file, options->output, options->json); });

    addExamples(family, {"korvane scene show showreel.vzml",
                         "korvane scene convert showreel.vzml showreel.vzb --to binary",
                         "korvane scene diff showreel.vzml showreel.vzb"});
}

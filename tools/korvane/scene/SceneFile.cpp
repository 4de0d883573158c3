#include "SceneFile.h"

#include "../FileBytes.h"
#include "../Input.h"
#include "../ToolError.h"

#include <korvane/serialization/KVBinaryXMLReadStream.h>
#include <korvane/serialization/KVBinaryXMLWriteStream.h>
#include <korvane/serialization/KVFileReadStream.h>
#include <korvane/serialization/KVHashWriteStream.h>
#include <korvane/serialization/KVXMLReadStream.h>
#include <korvane/serialization/KVXMLStreamElement.h>
#include <korvane/serialization/KVXMLWriteStream.h>

#include <algorithm>
#include <cstdio>

namespace scene {

namespace {

constexpr std::string_view binarySignature = "VZBML";

/// What a document of a newer kind may hold is not known.
void checkVersion(KVSerializerReadStream const& stream, std::string const& path)
{
    if (stream.versionMajor() > versionMajor)
        throw badInput(path, "version " + std::to_string(stream.versionMajor()) + "." +
                                 std::to_string(stream.versionMinor()) +
                                 " is newer than this tool");
}

/// Stands in front of the text form's root element.
class RootHandler final : public KVSerializer {
public:
    explicit RootHandler(Node& document) : document_(document) {}

    bool found() const noexcept { return found_; }

    void writeHeader(KVSerializerWriteStream&, bool) override {}
    void writeBody(KVSerializerWriteStream&, bool, bool, bool) override {}
    void markFactoriesForSerialization(KVSerializerWriteStream&, bool) override {}
    bool parseBegin(KVSerializerReadStream& stream) override
    {
        static KVScope rootScope[] = {{"vzml", 1, 0}, {"version", 1, 1}, {nullptr, 0, 0}};
        stream.pushScope(rootScope);
        return true;
    }
    bool parseEnd(KVSerializerReadStream&) override { return true; }
    bool parseElement(KVSerializerReadStream& stream, KVStreamElement& element) override
    {
        KVString version;
        found_ = true;
        if (element.getAttributeAsString(1, &version)) {
            int major = 0;
            int minor = 0;
            std::sscanf(version.toUTF8().substr(0, 20).c_str(), "%9d.%9d", &major, &minor);
            stream.setVersion(static_cast<unsigned int>(std::max(major, 0)),
                              static_cast<unsigned int>(std::max(minor, 0)));
        }
        return stream.pushHandler(&document_);
    }

private:
    Node& document_;
    bool found_ = false;
};

/// Gathers what is passed over, with its lines where there are lines.
class FindingList final : public Findings, public KVXMLReadObserver {
public:
    explicit FindingList(std::vector<Finding>& list) : list_(list) {}

    void report(KVStreamElement const& element, std::string const& text) override
    {
        auto const* const inText = dynamic_cast<KVXMLStreamElement const*>(&element);
        list_.push_back({inText ? inText->line() : 0, text});
    }
    void unknownElement(char const* name, unsigned long line) override
    {
        list_.push_back({line, "unknown element " + std::string(name)});
    }
    void unknownAttribute(KVStreamElement const& element, char const* name,
                          unsigned long line) override
    {
        // The root element's table is not the vocabulary's.
        std::string const owner = element.scope == scope() ? infoOf(element.token).name : "vzml";
        list_.push_back({line, owner + ": unknown attribute " + name});
    }

private:
    std::vector<Finding>& list_;
};

void loadText(KVURL const& url, std::string const& path, Document& document, bool strict)
{
    KVXMLReadStream stream(url);
    FindingList findings(document.findings);
    if (strict) {
        stream.setObserver(&findings);
        document.root.setFindings(&findings);
    }
    RootHandler root(document.root);
    stream.pushHandler(&root);
    bool const whole = [&] {
        QuietLibrary const quiet;
        return stream.parse();
    }();
    document.root.setFindings(nullptr);
    if (!whole) {
        std::string const reason =
            stream.errorText().empty() ? "it cannot be read as XML" : stream.errorText().toUTF8();
        throw stream.errorLine() ? badInput(path, stream.errorLine(), reason)
                                 : badInput(path, reason);
    }
    if (!root.found())
        throw badInput(path, "the root element is not vzml");
    checkVersion(stream, path);
}

void loadBinary(KVURL const& url, std::string const& path, Document& document, bool strict)
{
    KVFileReadStream bytes(url);
    FindingList findings(document.findings);
    if (strict)
        document.root.setFindings(&findings);
    KVBinaryXMLReadStream stream(bytes);
    stream.pushHandler(&document.root);
    bool const whole = stream.parse();
    stream.popAllHandlers();
    document.root.setFindings(nullptr);
    if (!whole)
        throw badInput(path, "the document is cut short or damaged");
    checkVersion(stream, path);
}

Form formOf(std::string_view start) noexcept
{
    return start.starts_with(binarySignature) ? Form::Binary : Form::Text;
}

} // namespace

char const* nameOf(Form form) noexcept
{
    return form == Form::Text ? "text" : "binary";
}

void load(std::string const& path, Document& document, bool strict)
{
    ReopenableFile const reopenable(path);
    FileBytes const file(reopenable.path());
    document.bytes = file.length();
    if (document.bytes == 0)
        throw badInput(path, "the file is empty");
    char start[binarySignature.size()];
    document.form = formOf({start, file.read(0, start, sizeof start)});
    KVURL const url(reopenable.path().c_str());
    if (document.form == Form::Binary)
        loadBinary(url, path, document, strict);
    else
        loadText(url, path, document, strict);
}

void save(Node& root, Form form, KVStream& stream)
{
    if (form == Form::Binary) {
        KVBinaryXMLWriteStream out(stream, versionMajor, versionMinor);
        root.writeBody(out, false, false, false);
        out.close();
        return;
    }
    KVXMLWriteStream out(stream, versionMajor, versionMinor);
    root.writeBody(out, false, false, false);
    out.close();
}

KVHash128 hashOf(Node& root)
{
    KVHashWriteStream stream;
    root.writeBody(stream, false, false, false);
    stream.close();
    return stream.getHash();
}

} // namespace scene

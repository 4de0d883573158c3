#include <korvane/media/KVXMPStringParser.h>

#include <korvane/foundation/KVNSRef.h>

#include <algorithm>
#include <exception>
#include <libxml/parser.h>
#include <libxml/parserInternals.h>
#include <limits>
#include <memory>

namespace {

/// The names that open a level, outermost level first.
std::initializer_list<std::u16string_view> const kLevelNames[] = {
    {u"rdf:SphericalVideo", u"x:xmpmeta"}, {u"rdf:RDF"}, {u"rdf:Description"}};
constexpr int kInner = 2;

/// -1 for an element that opens none.
int levelOfName(KVString const& name) noexcept
{
    for (int level = 0; level <= kInner; ++level)
        for (std::u16string_view const known : kLevelNames[level])
            if (name.view() == known)
                return level;
    return -1;
}

/// Comparing each attribute of an element with all before it takes the XML parser quadratic time.
constexpr int kMostAttributes = 1024;

/// Whether an element in the text has more attributes than that. Looks at "=" outside quotes in
/// whatever could be a start tag.
bool hasTooManyAttributes(std::string_view text) noexcept
{
    for (std::size_t at = text.find('<'); at != std::string_view::npos; at = text.find('<', at)) {
        int attributes = 0;
        char quote = 0;
        for (++at; at < text.size(); ++at) {
            char const c = text[at];
            if (quote) {
                quote = c == quote ? '\0' : quote;
            } else if (c == '"' || c == '\'') {
                quote = c;
            } else if (c == '<' || c == '>') {
                break;
            } else if (c == '=' && ++attributes > kMostAttributes) {
                return true;
            }
        }
    }
    return false;
}

KVString fromXML(xmlChar const* text)
{
    return text ? KVString::fromUTF8(reinterpret_cast<char const*>(text)) : KVString("");
}

struct FreeContext {
    void operator()(xmlParserCtxt* context) const noexcept
    {
        xmlFreeDoc(context->myDoc);
        xmlFreeParserCtxt(context);
    }
};

} // namespace

/// What libxml2 calls. No exception may pass through it: the first one is kept, and parsing stops.
struct KVXMPStringParser::Handlers {
    KVXMPStringParser& target;
    xmlParserCtxt* context = nullptr;
    std::exception_ptr exception = nullptr;

    template <class Function>
    static void guard(void* user, Function function) noexcept
    {
        auto& self = *static_cast<Handlers*>(user);
        if (self.exception)
            return;
        try {
            function(self.target);
        } catch (...) {
            self.exception = std::current_exception();
            xmlStopParser(self.context);
        }
    }

    static void startDocument(void* user) noexcept
    {
        guard(user, [](KVXMPStringParser& parser) { parser.startDocument(); });
    }

    static void endDocument(void* user) noexcept
    {
        guard(user, [](KVXMPStringParser& parser) { parser.endDocument(); });
    }

    static void startElement(void* user, xmlChar const* name, xmlChar const** attributes) noexcept
    {
        guard(user, [&](KVXMPStringParser& parser) {
            auto const dictionary = KVMakeRef<NSMutableDictionary>();
            for (; attributes && attributes[0]; attributes += 2)
                dictionary->setValue(fromXML(attributes[0]).cf_str(),
                                     fromXML(attributes[1]).cf_str());
            parser.startElement(fromXML(name), dictionary);
        });
    }

    static void endElement(void* user, xmlChar const* name) noexcept
    {
        guard(user, [&](KVXMPStringParser& parser) { parser.endElement(fromXML(name)); });
    }

    static void characters(void* user, xmlChar const* text, int length) noexcept
    {
        guard(user, [&](KVXMPStringParser& parser) {
            parser.characters(reinterpret_cast<char const*>(text),
                              static_cast<std::size_t>(length));
        });
    }

    // The message arrives as a format with arguments; the context holds it as text.
    static void error(void* user, char const*, ...) noexcept
    {
        guard(user, [&](KVXMPStringParser& parser) {
            xmlError const& last = static_cast<Handlers*>(user)->context->lastError;
            if (last.level == XML_ERR_FATAL && parser.error_.isNull())
                parser.setError(last.code, last.message, last.line);
        });
    }

    static void warning(void*, char const*, ...) noexcept {}
};

KVXMPStringParser::KVXMPStringParser() : result_(KVMakeRef<NSMutableDictionary>()) {}

KVXMPStringParser::~KVXMPStringParser() = default;

bool KVXMPStringParser::parseXMPString(KVString const& text)
{
    if (text.isNull())
        return false;
    std::string const utf8 = text.toUTF8();
    __CFData const data(utf8.data(), utf8.size());
    return parseXMPData(&data);
}

bool KVXMPStringParser::parseXMPData(CFDataRef data)
{
    if (!data)
        return false;
    error_.clear();
    std::string_view const text(reinterpret_cast<char const*>(data->bytes()), data->length());
    bool const tooLong = text.size() > std::numeric_limits<int>::max();
    if (text.empty() || tooLong || hasTooManyAttributes(text)) {
        startDocument();
        if (text.empty())
            setError(XML_ERR_DOCUMENT_EMPTY, "Document is empty", 1);
        else
            setError(XML_ERR_INTERNAL_ERROR, "Document exceeds the limits of the parser", 1);
        return false;
    }
    xmlInitParser();
    std::unique_ptr<xmlParserCtxt, FreeContext> const context(
        xmlCreateMemoryParserCtxt(text.data(), static_cast<int>(text.size())));
    if (!context)
        throw std::bad_alloc();

    // The first interface of SAX, which gives names as they are written and `xmlns` as attributes.
    // Without handlers for entities none is ever expanded or loaded.
    xmlSAXHandler sax = {};
    sax.startDocument = Handlers::startDocument;
    sax.endDocument = Handlers::endDocument;
    sax.startElement = Handlers::startElement;
    sax.endElement = Handlers::endElement;
    sax.characters = Handlers::characters;
    sax.ignorableWhitespace = Handlers::characters;
    sax.cdataBlock = Handlers::characters;
    sax.warning = Handlers::warning;
    sax.error = Handlers::error;
    sax.fatalError = Handlers::error;
    sax.initialized = 1;
    *context->sax = sax;
    Handlers handlers{*this, context.get()};
    context->userData = &handlers;
    xmlCtxtUseOptions(context.get(), XML_PARSE_NONET | XML_PARSE_IGNORE_ENC);
    // A name of an encoding that is there already keeps the parser from guessing one.
    xmlSwitchEncoding(context.get(), XML_CHAR_ENCODING_UTF8);
    context->encoding = xmlCharStrdup("UTF-8");

    xmlParseDocument(context.get());
    if (handlers.exception)
        std::rethrow_exception(handlers.exception);
    return error_.isNull();
}

void KVXMPStringParser::setError(int code, char const* message, int line)
{
    std::string text = message ? message : "";
    while (!text.empty() && text.back() == '\n')
        text.pop_back();
    error_ = KVString("XML Parse Error " + std::to_string(code) + ", Description: " + text +
                      ", Line: " + std::to_string(line));
}

void KVXMPStringParser::startDocument()
{
    for (Level& level : levels_)
        level = Level();
    text_.clear();
    hasText_ = false;
    result_ = KVMakeRef<NSMutableDictionary>();
}

void KVXMPStringParser::startElement(KVString const& name, CFDictionaryRef attributes)
{
    if (int const opened = levelOfName(name); opened >= 0) {
        // A level inside itself, or around one that is inside it, starts anew.
        for (int level = opened; level <= kInner; ++level)
            levels_[level] = Level();
        levels_[opened] = {name, KVMakeRef<NSMutableDictionary>()};
    }
    text_.clear();
    hasText_ = true;
    if (attributes->count() > 0)
        deepest().setValue(name.cf_str(), attributes);
}

void KVXMPStringParser::characters(char const* text, std::size_t length)
{
    if (hasText_)
        text_.append(text, length);
}

void KVXMPStringParser::endElement(KVString const& name)
{
    int const closed = levelOfName(name);
    if (closed < 0)
        return storeText(name);
    for (int level = kInner; level >= closed; --level) {
        Level const done = std::exchange(levels_[level], Level());
        if (done.contents && done.contents->count() > 0)
            deepest().setValue(done.name.cf_str(), done.contents);
    }
}

void KVXMPStringParser::storeText(KVString const& name)
{
    // Behind the end of an element inside this one there is no text.
    if (!hasText_)
        return;
    KVString const text = KVString::fromUTF8(std::exchange(text_, std::string()));
    hasText_ = false;

    __CFDictionary& target = deepest();
    NSObject const* const old = target.value(name.cf_str());
    if (!old) {
        target.setValue(name.cf_str(), text.cf_str());
        return;
    }
    auto const both = KVMakeRef<NSMutableDictionary>();
    if (auto const* const dictionary = dynamic_cast<CFDictionaryRef>(old)) {
        for (std::size_t i = 0; i < dictionary->count(); ++i)
            both->setValue(dictionary->keyAtIndex(i), dictionary->valueAtIndex(i));
        both->setValue(name.cf_str(), text.cf_str());
    } else {
        KVString first = name, second = name;
        first.append("-0");
        second.append("-1");
        both->setValue(first.cf_str(), old);
        both->setValue(second.cf_str(), text.cf_str());
    }
    target.setValue(name.cf_str(), both);
}

void KVXMPStringParser::endDocument()
{
    // Also called after an error, when the state and the message are to stay.
    if (!error_.isNull())
        return;
    for (Level& level : levels_)
        level = Level();
    text_.clear();
    hasText_ = false;
}

__CFDictionary& KVXMPStringParser::deepest() noexcept
{
    for (int level = kInner; level >= 0; --level)
        if (!levels_[level].name.empty())
            return *levels_[level].contents;
    return *result_;
}

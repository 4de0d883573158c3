#include <korvane/serialization/KVXMLReadStream.h>

#include <korvane/serialization/KVNumberText_p.h>
#include <korvane/serialization/KVXMLLocale_p.h>
#include <korvane/serialization/KVXMLMarkup_p.h>
#include <korvane/serialization/KVXMLNameCache_p.h>
#include <korvane/serialization/KVXMLSource_p.h>
#include <korvane/serialization/KVXMLStreamElement.h>

#include <algorithm>
#include <array>
#include <cstdio>
#include <cstring>
#include <new>
#include <string>
#include <system_error>

#include <libxml/parser.h>
#include <libxml/xmlreader.h>

namespace {

constexpr std::size_t elementsOfArena = 16;

/// A document has some hundred different names. libxml2's look-up slows down with their number.
constexpr int mostNames = 100'000;

/// What all attributes of a document together may take from entities, in bytes.
constexpr std::size_t mostFromEntities = 10'000'000;

char const* chars(xmlChar const* text) noexcept
{
    return reinterpret_cast<char const*>(text);
}

} // namespace

KVXMLReadObserver::~KVXMLReadObserver() = default;

struct KVXMLReadStream::Reader {
    /// The place of one element, and the memory for its text, which outlives it.
    struct Slot {
        alignas(KVXMLStreamElement) std::byte element[sizeof(KVXMLStreamElement)];
        KVXMLStreamElement::Storage storage;
        bool used = false;
    };

    Reader() = default;
    Reader(Reader const&) = delete;
    Reader& operator=(Reader const&) = delete;
    ~Reader() { xmlFreeTextReader(reader); }

    void open();
    static int giveBytes(void* self, char* out, int length);
    bool next();
    void beginRoot(xmlDoc& document) noexcept;
    unsigned long line() const noexcept;
    void fail(char const* text, unsigned long atLine);
    static void keepError(void* self, xmlErrorPtr error);
    std::string valueWithEntities(xmlAttr const& attribute);
    Slot* slotOf(KVStreamElement const* element) noexcept;

    KVXMLSource source;
    xmlTextReaderPtr reader = nullptr;
    /// What the last step of the reader gave: 1 for a node, 0 at the end, -1 for a failure.
    int result = 1;
    /// The step to the next node has been made.
    bool hasNext = false;
    /// The document is given up, whatever libxml2 thinks of it.
    bool failed = false;

    KVXMLMarkup markup;

    /// Where libxml2 keeps the names of the document, from the root element on.
    xmlDict* dictionary = nullptr;
    KVXMLNameCache names;
    std::array<Slot, elementsOfArena> arena;
    std::size_t bytesFromEntities = 0;
    KVXMLReadObserver* observer = nullptr;
    std::string errorText;
    unsigned long errorLine = 0;
};

/// With bytes at hand: looks at the document's start and makes the reader.
void KVXMLReadStream::Reader::open()
{
    static bool const initialised = (xmlInitParser(), true);
    static_cast<void>(initialised);
    KVXMLProlog const prolog = source.scanProlog();
    if (prolog.kind == KVXMLProlog::Kind::refused) {
        fail(prolog.reason, prolog.line);
        return;
    }
    markup = KVXMLMarkup(source.encoding());
    auto const close = [](void*) { return 0; };
    reader = xmlReaderForIO(giveBytes, close, this, nullptr, nullptr, XML_PARSE_HUGE);
    if (reader)
        xmlTextReaderSetStructuredErrorHandler(reader, keepError, this);
}

int KVXMLReadStream::Reader::giveBytes(void* self, char* out, int length)
{
    auto& giver = *static_cast<Reader*>(self);
    try {
        long const consumed = giver.reader ? xmlTextReaderByteConsumed(giver.reader) : 0;
        std::string_view const waiting =
            giver.source.givenFrom(consumed > 0 ? static_cast<unsigned long long>(consumed) : 0);
        char const* reason = nullptr;
        if (waiting.size() > KVXMLMarkup::harmless)
            reason = giver.markup.check(giver.source.given() - waiting.size(), waiting);
        else if (giver.dictionary && xmlDictSize(giver.dictionary) > mostNames)
            reason = "it has more than 100000 different names";
        if (!reason)
            return giver.source.read(out, length);
        int const line = xmlTextReaderGetParserLineNumber(giver.reader);
        giver.fail(reason, static_cast<unsigned long>(std::max(line, 0)));
        return -1;
    } catch (std::exception const&) {
        giver.fail("there is not enough memory", 0);
        return -1;
    }
}

/// Goes to the next node, if that has not been done, and answers whether there is one.
bool KVXMLReadStream::Reader::next()
{
    if (!hasNext)
        result = xmlTextReaderRead(reader);
    hasNext = false;
    return result >= 1;
}

void KVXMLReadStream::Reader::beginRoot(xmlDoc& document) noexcept
{
    dictionary = document.dict;
    // A document type that declares nothing is all that a scene has. Without it libxml2 does not
    // look every attribute up there.
    xmlDtd* const type = document.intSubset;
    if (type && !type->elements && !type->attributes && !type->entities && !type->notations &&
        !type->pentities) {
        xmlUnlinkNode(reinterpret_cast<xmlNode*>(type));
        xmlFreeDtd(type);
    }
}

/// Of the node that the reader stands on. libxml2 keeps 16 bits of it; behind those this is how far
/// the parser has come, which is the same when it is given the document line by line.
unsigned long KVXMLReadStream::Reader::line() const noexcept
{
    long const line = xmlGetLineNo(xmlTextReaderCurrentNode(reader));
    if (line > 0 && line < 0xFFFF)
        return static_cast<unsigned long>(line);
    return static_cast<unsigned long>(xmlTextReaderGetParserLineNumber(reader));
}

void KVXMLReadStream::Reader::fail(char const* text, unsigned long atLine)
{
    failed = true;
    errorText = text;
    errorLine = atLine;
}

/// Keeps the first error that ends the document; others, as of namespaces, do not matter.
void KVXMLReadStream::Reader::keepError(void* self, xmlErrorPtr error)
{
    auto& kept = *static_cast<Reader*>(self);
    if (error->level != XML_ERR_FATAL || !error->message || !kept.errorText.empty())
        return;
    kept.errorText = error->message;
    while (kept.errorText.ends_with('\n'))
        kept.errorText.pop_back();
    kept.errorLine = error->line > 0 ? static_cast<unsigned long>(error->line) : 0;
}

std::string KVXMLReadStream::Reader::valueWithEntities(xmlAttr const& attribute)
{
    for (xmlNode const* part = attribute.children; part; part = part->next)
        if (part->type == XML_ENTITY_REF_NODE)
            if (xmlEntity const* const entity = xmlGetDocEntity(attribute.doc, part->name))
                bytesFromEntities += static_cast<std::size_t>(std::max(entity->length, 0));
    if (bytesFromEntities > mostFromEntities) {
        fail("its attributes take too much from entities", line());
        return {};
    }
    std::unique_ptr<xmlBuffer, decltype(&xmlBufferFree)> const buffer(xmlBufferCreate(),
                                                                      &xmlBufferFree);
    xmlNodeBufGetContent(buffer.get(), reinterpret_cast<xmlNode const*>(&attribute));
    xmlChar const* const value = xmlBufferContent(buffer.get());
    return value ? chars(value) : "";
}

/// Null for an element outside the arena.
KVXMLReadStream::Reader::Slot*
KVXMLReadStream::Reader::slotOf(KVStreamElement const* element) noexcept
{
    std::uintptr_t const offset =
        reinterpret_cast<std::uintptr_t>(element) - reinterpret_cast<std::uintptr_t>(arena.data());
    return offset < sizeof arena ? &arena[offset / sizeof(Slot)] : nullptr;
}

// --- Construction ---

KVXMLReadStream::KVXMLReadStream(KVURL const& url) : url_(url), reader_(std::make_unique<Reader>())
{
    fixLocale();
    if (reader_->source.openFile(url) == 0)
        reader_->open();
}

KVXMLReadStream::KVXMLReadStream(char const* bytes, int length)
    : reader_(std::make_unique<Reader>())
{
    fixLocale();
    if (bytes && length >= 0) {
        reader_->source.openMemory({bytes, static_cast<std::size_t>(length)});
        reader_->open();
    }
}

KVXMLReadStream::KVXMLReadStream(__CFData const* data)
    : data_(data), reader_(std::make_unique<Reader>())
{
    fixLocale();
    if (data) {
        reader_->source.openMemory({reinterpret_cast<char const*>(data->bytes()), data->length()});
        reader_->open();
    }
}

KVXMLReadStream::~KVXMLReadStream()
{
    popAllElements();
}

void KVXMLReadStream::fixLocale()
{
    kvFixLocale();
}

// --- Parsing ---

bool KVXMLReadStream::parse()
{
    Reader& reader = *reader_;
    if (!reader.reader && !reader.failed) {
        popAllHandlers();
        return false;
    }
    while (!reader.failed && stopState_ == StopState::running && reader.next())
        processNode();
    popAllHandlers();
    if (!reader.failed && stopState_ == StopState::stopped)
        return true;
    if (!reader.failed && stopState_ == StopState::running && reader.result == 0)
        return true;
    std::fprintf(stderr, "%s : parsing error\n", url_.getFilename().toUTF8().c_str());
    return false;
}

void KVXMLReadStream::abortParse()
{
    stopState_ = StopState::aborted;
}

void KVXMLReadStream::stopParse()
{
    stopState_ = StopState::stopped;
}

void KVXMLReadStream::processNode()
{
    xmlTextReaderPtr const reader = reader_->reader;
    if (!reader)
        return;
    switch (xmlTextReaderNodeType(reader)) {
    case XML_READER_TYPE_ELEMENT:
        startElement();
        break;
    case XML_READER_TYPE_TEXT:
    case XML_READER_TYPE_WHITESPACE:
        addText(false);
        break;
    case XML_READER_TYPE_SIGNIFICANT_WHITESPACE:
        addText(true);
        break;
    case XML_READER_TYPE_ENTITY_REFERENCE:
        addEntity(chars(xmlTextReaderConstName(reader)));
        break;
    case XML_READER_TYPE_END_ELEMENT:
        endElement();
        afterEntity_ = false;
        break;
    default:
        break;
    }
}

void KVXMLReadStream::startElement()
{
    Reader& reader = *reader_;
    if (KVStreamElement* const parent = currentElement(); parent && !parent->processed)
        processElement(*parent);
    if (!reader.dictionary)
        reader.beginRoot(*xmlTextReaderCurrentNode(reader.reader)->doc);

    xmlChar const* const qualifiedName = xmlTextReaderConstName(reader.reader);
    char const* const name = qualifiedName ? chars(qualifiedName) : "--";
    if (KVSerializer* const handler = currentHandler()) {
        for (KVScope* const table : currentScopes()) {
            KVScope const* const row = table ? reader.names.element(table, name) : nullptr;
            if (!row)
                continue;
            pushElement(createElement(row->elementToken, table, handler));
            auto& element = static_cast<KVXMLStreamElement&>(*currentElement());
            if (reader.observer)
                element.line_ = reader.line();
            addAttributes(element);
            if (xmlTextReaderIsEmptyElement(reader.reader) == 1)
                endElement();
            return;
        }
    }
    if (reader.observer)
        reader.observer->unknownElement(name, reader.line());
    // The reader then stands on the node behind the subtree, which is the next one to handle.
    reader.result = xmlTextReaderNext(reader.reader);
    reader.hasNext = true;
}

void KVXMLReadStream::endElement()
{
    KVStreamElement* const element = currentElement();
    if (!element)
        return;
    if (!element->ignored && !element->processed)
        processElement(*element);
    if (element == currentHandlerElement())
        popHandler();
    popElement();
}

void KVXMLReadStream::addAttributes(KVXMLStreamElement& element)
{
    Reader& reader = *reader_;
    xmlNode const* const node = xmlTextReaderCurrentNode(reader.reader);
    auto const add = [&](xmlChar const* prefix, xmlChar const* localName, char const* value) {
        // Names come from libxml2's dictionary, so the cache may know them by their address.
        xmlChar const* const name =
            prefix ? xmlDictQLookup(node->doc->dict, prefix, localName) : localName;
        if (!name)
            return;
        auto const rows = reader.names.attribute(element.scope, element.token, chars(name));
        for (KVScope const* row = rows.first; row != rows.end; ++row)
            if (row + 1 == rows.end ||
                KVXMLNameCache::isAttribute(*row, element.token, chars(name)))
                element.addAttribute(row->attributeToken, value);
        if (!rows.first && reader.observer)
            reader.observer->unknownAttribute(element, chars(name), reader.line());
    };
    for (xmlNs const* space = node->nsDef; space; space = space->next) {
        char const* const value = space->href ? chars(space->href) : "";
        xmlChar const* const xmlns =
            xmlDictLookup(node->doc->dict, reinterpret_cast<xmlChar const*>("xmlns"), 5);
        if (space->prefix)
            add(xmlns, space->prefix, value);
        else
            add(nullptr, xmlns, value);
    }
    for (xmlAttr const* attribute = node->properties; attribute; attribute = attribute->next) {
        xmlChar const* const prefix = attribute->ns ? attribute->ns->prefix : nullptr;
        xmlNode const* const text = attribute->children;
        if (!text)
            add(prefix, attribute->name, "");
        else if (text->type == XML_TEXT_NODE && !text->next)
            add(prefix, attribute->name, text->content ? chars(text->content) : "");
        else
            add(prefix, attribute->name, reader.valueWithEntities(*attribute).c_str());
    }
}

void KVXMLReadStream::addText(bool blanksAlone)
{
    KVStreamElement* const element = currentElement();
    if (!element)
        return;
    if (blanksAlone && !(element->handler && element->handler->readSignificantWhiteSpace()))
        return;
    // The virtual form: a host may have pushed an element of its own.
    if (xmlChar* const text = xmlTextReaderCurrentNode(reader_->reader)->content)
        element->appendContentWithNewline(reinterpret_cast<char*>(text), !afterEntity_);
    afterEntity_ = false;
}

namespace {

/// The number behind "#x" or "#", as sscanf reads it with "%x" or "%d": blanks, a sign, "0x".
char byteOfReference(char const* digits, bool hexadecimal)
{
    unsigned long long value = 0;
    kvParseUInt(digits, value, hexadecimal ? 16 : 10);
    return static_cast<char>(static_cast<unsigned char>(value));
}

} // namespace

void KVXMLReadStream::addEntity(char const* name)
{
    KVStreamElement* const element = currentElement();
    if (!element)
        return;
    static constexpr struct {
        char const* name;
        char text;
    } table[] = {{"amp", '&'},  {"lt", '<'},    {"gt", '>'},
                 {"quot", '"'}, {"apos", '\''}, {"space", ' '}};
    char text[2] = {};
    if (name[0] == '#')
        text[0] =
            name[1] == 'x' ? byteOfReference(name + 2, true) : byteOfReference(name + 1, false);
    else
        for (auto const& entity : table)
            if (std::strcmp(entity.name, name) == 0)
                text[0] = entity.text;
    element->appendContentWithNewline(text, false);
    afterEntity_ = true;
}

// --- Elements ---

KVStreamElement* KVXMLReadStream::createElement(unsigned int token, KVScope* scope,
                                                KVSerializer* handler)
{
    if (elementCount_ < elementsOfArena && !reader_->arena[elementCount_].used) {
        Reader::Slot& slot = reader_->arena[elementCount_++];
        slot.used = true;
        return new (slot.element) KVXMLStreamElement(token, scope, handler, slot.storage);
    }
    auto* const element = new KVXMLStreamElement(token, scope, handler);
    ++elementCount_;
    return element;
}

void KVXMLReadStream::destroyElement(KVStreamElement* element)
{
    if (elementCount_ > 0)
        --elementCount_;
    if (Reader::Slot* const slot = reader_->slotOf(element)) {
        static_cast<KVXMLStreamElement*>(element)->~KVXMLStreamElement();
        slot->used = false;
    } else {
        delete element;
    }
}

// --- What a host may ask ---

KVURL KVXMLReadStream::getURL() const
{
    return url_;
}

void KVXMLReadStream::setObserver(KVXMLReadObserver* observer) noexcept
{
    reader_->observer = observer;
    reader_->source.setLineByLine(observer != nullptr);
}

KVString KVXMLReadStream::errorText() const
{
    int const failure = reader_->source.error();
    return failure != 0 ? std::system_category().message(failure) : reader_->errorText;
}

unsigned long KVXMLReadStream::errorLine() const noexcept
{
    return reader_->source.error() != 0 ? 0 : reader_->errorLine;
}

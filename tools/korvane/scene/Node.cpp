#include "Node.h"

#include <algorithm>

namespace scene {

Node::~Node()
{
    // Takes the children apart in one flat list, so that none of them has any when it goes.
    std::vector<std::unique_ptr<Node>> doomed = std::move(children_);
    while (!doomed.empty()) {
        std::unique_ptr<Node> const node = std::move(doomed.back());
        doomed.pop_back();
        std::ranges::move(node->children_, std::back_inserter(doomed));
        node->children_.clear();
    }
}

Value const& Node::attribute(unsigned int token) const noexcept
{
    static Value const none;
    auto const found =
        std::ranges::find(attributes_, token, &std::pair<unsigned int, Value>::first);
    return found == attributes_.end() ? none : found->second;
}

// --- Writing ---

void Node::writeStart(KVSerializerWriteStream& stream) const
{
    if (element_ == kDocument)
        return;
    stream.startElement(element_);
    for (auto const& [token, value] : attributes_)
        writeAttribute(stream, token, value);
    writeContent(stream, content_);
}

void Node::writeBody(KVSerializerWriteStream& stream, bool, bool, bool)
{
    stream.pushScope(scope());
    walk(
        *this, [&](Node const& node, std::size_t) { node.writeStart(stream); },
        [&](Node const& node, std::size_t) {
            if (node.element_ != kDocument)
                stream.endElement();
        });
    stream.popScope();
}

// --- Reading ---

bool Node::parseBegin(KVSerializerReadStream& stream)
{
    stream.pushScope(scope());
    return true;
}

bool Node::parseElement(KVSerializerReadStream& stream, KVStreamElement& element)
{
    // The stream calls the node that the new element stands in.
    if (!info().mayHold(element.token)) {
        if (findings_)
            findings_->report(
                element,
                std::string(infoOf(element.token).name) + " does not belong " +
                    (element_ == kDocument ? "at the top" : std::string("in ") + info().name));
        stream.ignoreElement();
        return false;
    }
    Node& child =
        *children_.emplace_back(std::make_unique<Node>(static_cast<Element>(element.token)));
    child.findings_ = findings_;
    child.readValues(element);
    return stream.pushHandler(&child);
}

void Node::readValues(KVStreamElement& element)
{
    for (AttributeInfo const& attribute : info().attributes) {
        KVString text;
        if (findings_ && element.getAttributeAsString(attribute.token, &text))
            tellIfMalformed(std::string(info().name) + " " + attribute.name, text, attribute.kind,
                            element);
        // Of a text, none and the empty one are the same.
        Value value = scene::readAttribute(element, attribute);
        if (auto const* string = std::get_if<KVString>(&value); string && string->empty())
            continue;
        if (isSet(value))
            attributes_.emplace_back(attribute.token, std::move(value));
    }
    if (info().content == Kind::None)
        return;
    KVString text;
    element.getAsString(&text);
    if (findings_)
        tellIfMalformed(info().name, text, info().content, element);
    if (text.empty()) // the compact form would read nothing as the number 0
        return;
    content_ = readContent(element, info().content);
}

void Node::tellIfMalformed(std::string const& place, KVString const& text, Kind kind,
                           KVStreamElement& element) const
{
    if (element.isXMLStreamElement() && !isWellWritten(text.toUTF8(), kind))
        findings_->report(element,
                          place + ": found " + describe(text) + ", expected " + nameOf(kind));
}

} // namespace scene

#pragma once

#include <korvane/korvane.h>
#include <support/TemporaryFolder.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <functional>
#include <utility>

inline KVURL urlOf(std::string const& path)
{
    return KVURL(path.c_str());
}

/// What has been written to a memory stream.
inline std::string textOf(KVBufferWriteStream const& stream)
{
    return {reinterpret_cast<char const*>(stream.getBuffer()), stream.getBufferSize()};
}

inline std::string textOf(KVHash128 const& hash)
{
    return hash.getString();
}

/// The hash of bytes added at once; all zeros if there are none.
inline KVHash128 hashOf(std::string_view bytes)
{
    KVHash128 hash;
    if (!bytes.empty())
        hash.addData(reinterpret_cast<unsigned char const*>(bytes.data()),
                     static_cast<unsigned int>(bytes.size()));
    return hash;
}

/// The bytes that a value has in memory.
inline std::string bytesOf(auto const& value)
{
    return {reinterpret_cast<char const*>(&value), sizeof value};
}

/// What `body` prints to standard output.
template <class Body>
std::string printedBy(Body body)
{
    testing::internal::CaptureStdout();
    body();
    std::fflush(stdout);
    return testing::internal::GetCapturedStdout();
}

/// How a writer refuses what `body` asks for: the exception's kind, and what is printed.
template <class Body>
std::string refusal(Body body)
{
    std::string kind = "none";
    std::string const printed = printedBy([&] {
        try {
            body();
        } catch (KVException_ScopeUndefined const&) {
            kind = "scope";
        } catch (KVException_NoElementDefined const&) {
            kind = "element";
        } catch (KVException_AttributeUndefined const&) {
            kind = "attribute";
        }
    });
    return kind + ": " + printed;
}

/// What a getter answers, and what it leaves in a value that was 77.
template <class T, class Object, class Getter, class... Token>
std::pair<bool, T> got(Object&& object, Getter getter, Token... token)
{
    T value(77);
    bool const answer = std::invoke(getter, object, token..., &value);
    return {answer, value};
}

/// A handler that writes down what it is told: "(" and ")name " for its beginning and end, and for
/// each element its name, its attributes 1 and 2, and its text.
class Recorder : public KVIgnoreElement {
public:
    /// Becomes the handler of every element too, but for those of the tokens in `leaves`.
    explicit Recorder(KVScope* scopeTable, std::vector<unsigned> leaves = {})
        : table(scopeTable), leaves_(std::move(leaves))
    {}

    bool parseBegin(KVSerializerReadStream& stream) override
    {
        log += "(";
        stream.pushScope(table);
        return true;
    }
    bool parseEnd(KVSerializerReadStream& stream) override
    {
        KVStreamElement const* const current = stream.currentElement();
        log += current ? ")" + nameOf(current->token) + " " : ") ";
        return true;
    }
    bool parseElement(KVSerializerReadStream& stream, KVStreamElement& element) override
    {
        ++count;
        log += nameOf(element.token);
        KVString text;
        for (unsigned attribute = 1; attribute <= 2; ++attribute)
            if (stream.getAttributeAsString(element, attribute, &text))
                log += "@" + std::to_string(attribute) + "=" + text.toUTF8();
        if (stream.getAsString(element, &text); !text.empty())
            log += ":" + text.toUTF8();
        log += " ";
        if (onElement)
            onElement(stream, element);
        return std::count(leaves_.begin(), leaves_.end(), element.token) ||
               stream.pushHandler(this);
    }
    bool readSignificantWhiteSpace() override { return blanks; }

    std::string nameOf(unsigned token) const
    {
        for (KVScope const* row = table; row->name; ++row)
            if (row->elementToken == token && row->attributeToken == 0)
                return row->name;
        return std::to_string(token);
    }

    KVScope* table;
    std::string log;
    long count = 0; // of elements
    bool blanks = false;
    std::function<void(KVSerializerReadStream&, KVStreamElement&)> onElement;

private:
    std::vector<unsigned> leaves_;
};

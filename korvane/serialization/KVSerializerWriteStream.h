#pragma once

#include <korvane/foundation/KVString.h>
#include <korvane/foundation/KVUUID.h>
#include <korvane/platform/CMTime.h>
#include <korvane/serialization/KVScope.h>

#include <vector>

/// Where an object writes itself, whether that becomes text (KVXMLWriteStream), bytes
/// (KVBinaryXMLWriteStream) or a hash (KVHashWriteStream).
///
///     stream.pushScope(projectScope);
///     stream.startElement(kClip);
///     stream.writeAttribute(kClipName, KVString("Opening"));
///     stream.startElement(kOpacity);
///     stream.writeValue(0.5);
///     stream.endElement();
///     stream.endElement();
///     stream.popScope();
///
/// Elements and attributes are tokens; the scope on top of the stack, and that one alone, gives
/// them their names. `close()` ends the document: no destructor does.
///
/// The forms throw KVException_ScopeUndefined when no scope is pushed,
/// KVException_NoElementDefined for an element that the scope does not name and where an element
/// must be open, KVException_AttributeUndefined for an attribute that the scope does not name for
/// the open element. Where it says so, a line is printed through KVPrint first.
class KV_EXPORT KVSerializerWriteStream {
public:
    KVSerializerWriteStream() = default;
    KVSerializerWriteStream(KVSerializerWriteStream const&) = delete;
    KVSerializerWriteStream& operator=(KVSerializerWriteStream const&) = delete;
    virtual ~KVSerializerWriteStream();

    virtual void startElement(unsigned int token) = 0;
    virtual void endElement() = 0;
    /// Ends the document.
    virtual void close() = 0;
    /// Does nothing by default.
    virtual void reset();

    // --- Values inside the open element ---

    virtual void writeValue(int value) = 0;
    virtual void writeValue(unsigned int value) = 0;
    virtual void writeValue(long long value) = 0;
    virtual void writeValue(unsigned long long value) = 0;
    virtual void writeValue(float value) = 0;
    virtual void writeValue(double value) = 0;
    virtual void writeValue(KVUUID const& value) = 0;
    virtual void writeValue(KVString const& value) = 0;
    virtual void writeValue(CMTime const& value) = 0;

    /// No form that there is stores arrays.
    virtual void writeArray(unsigned int* values, unsigned int count) = 0;
    virtual void writeArray(float* values, unsigned int count) = 0;
    virtual void writeArray(double* values, unsigned int count) = 0;

    // --- Attributes of the open element ---

    virtual void writeAttribute(unsigned int token, unsigned int value) = 0;
    virtual void writeAttribute(unsigned int token, int value) = 0;
    virtual void writeAttribute(unsigned int token, unsigned long long value) = 0;
    virtual void writeAttribute(unsigned int token, long long value) = 0;
    virtual void writeAttribute(unsigned int token, float value) = 0;
    virtual void writeAttribute(unsigned int token, double value) = 0;
    virtual void writeAttribute(unsigned int token, KVUUID const& value) = 0;
    virtual void writeAttribute(unsigned int token, KVString const& value) = 0;
    virtual void writeAttribute(unsigned int token, CMTime const& value) = 0;

    /// An attribute that a form may leave out.
    virtual void writeOptionalAttribute(unsigned int token, KVString const& value) = 0;
    /// Sets the next element apart for a person who reads the document.
    virtual void writeBlankLine() = 0;

    /// Whether what is written becomes a hash, so that an object can leave out what does not
    /// define its appearance. False by default.
    virtual bool isHashStream();

    /// `long` is as wide as `long long` and is written as that.
    void writeValue(long value) { writeValue(static_cast<long long>(value)); }
    void writeValue(unsigned long value) { writeValue(static_cast<unsigned long long>(value)); }
    void writeAttribute(unsigned int token, long value)
    {
        writeAttribute(token, static_cast<long long>(value));
    }
    void writeAttribute(unsigned int token, unsigned long value)
    {
        writeAttribute(token, static_cast<unsigned long long>(value));
    }

    /// Puts a table on top of the scope stack. It is not owned and must outlive the stream.
    void pushScope(KVScope* scope);
    /// Takes the top one off. The stack must not be empty; if it is, nothing happens.
    void popScope();

protected:
    /// Null when the stack is empty.
    KVScope* topScope() const noexcept { return scopes_.empty() ? nullptr : scopes_.back(); }
    /// Prints "scope not defined!" and throws KVException_ScopeUndefined.
    [[noreturn]] static void throwScopeUndefined();
    /// The row of an element in a table, null when there is none.
    static KVScope* findElement(KVScope* scope, unsigned int token) noexcept;
    /// Prints "Token not defined in scope ...!" with the table's first name and throws
    /// KVException_NoElementDefined.
    [[noreturn]] static void throwTokenUndefined(KVScope const* scope);
    /// Prints "endElement() called without startElement()!" and throws
    /// KVException_NoElementDefined.
    [[noreturn]] static void throwNothingToEnd();
    /// The row of an attribute of the element `elementToken` in the top scope. Throws
    /// KVException_ScopeUndefined or KVException_AttributeUndefined, and prints nothing.
    KVScope* findAttribute(unsigned int elementToken, unsigned int attributeToken) const;

private:
    std::vector<KVScope*> scopes_;
};

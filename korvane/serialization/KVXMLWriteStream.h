#pragma once

#include <korvane/foundation/KVURL.h>
#include <korvane/serialization/KVSerializerWriteStream.h>

class KVStream;

/// Writes a document in its text form, an XML dialect with the root element `vzml`.
///
///     KVFileWriteStream file(url);
///     KVXMLWriteStream stream(file, 5, 10);
///     stream.pushScope(projectScope);
///     project.writeBody(stream, ...);
///     stream.close();
///
/// gives
///
///     <?xml version="1.0" encoding="UTF-8"?>
///     <!DOCTYPE vzxmlscene>
///     <vzml version="5.10">
///
///     <project name="Opening">
///     	<opacity>0.5</opacity>
///     </project>
///
///     </vzml>
///
/// Bytes go to the byte stream as they come. An element without values and children closes as
/// "/>", one with values alone on their line, one with children on a line of its own; children
/// are indented by one tab. Values of one element follow each other with nothing between: who
/// writes several writes the separators as text. An attribute that is written after a value or
/// a child lands in the element's text.
///
/// Of text, "&", "<", ">" and the double quote are escaped, and nothing else; it ends at a U+0000.
/// Characters that XML does not allow (most of those below U+0020) are written as they are, and so
/// is the carriage return, which readers take for a line feed. Numbers stand in the C locale's
/// form, "%.10g" for `float` and "%.17g" for `double`.
///
/// Depth has no limit, but n levels take some n^2 bytes of tabs: a thousand a megabyte. The binary
/// form is the one for documents that are deep.
class KV_EXPORT KVXMLWriteStream : public KVSerializerWriteStream {
public:
    /// Writes the header at once. The stream is not owned and must outlive this one. Sets the
    /// process's LC_NUMERIC to "C" if it is not.
    KVXMLWriteStream(KVStream& stream, unsigned int major, unsigned int minor);
    ~KVXMLWriteStream() override;

    void startElement(unsigned int token) override;
    void endElement() override;
    /// Writes the end of the root element.
    void close() override;

    using KVSerializerWriteStream::writeValue;
    void writeValue(int value) override;
    void writeValue(unsigned int value) override;
    void writeValue(long long value) override;
    void writeValue(unsigned long long value) override;
    void writeValue(float value) override;
    void writeValue(double value) override;
    void writeValue(KVUUID const& value) override;
    /// A text for which there is no memory is left out. With no element open this prints "value
    /// not within an element body!" before it throws.
    void writeValue(KVString const& value) override;
    void writeValue(CMTime const& value) override;

    /// Nothing is written.
    void writeArray(unsigned int* values, unsigned int count) override;
    void writeArray(float* values, unsigned int count) override;
    void writeArray(double* values, unsigned int count) override;

    using KVSerializerWriteStream::writeAttribute;
    void writeAttribute(unsigned int token, unsigned int value) override;
    void writeAttribute(unsigned int token, int value) override;
    void writeAttribute(unsigned int token, unsigned long long value) override;
    void writeAttribute(unsigned int token, long long value) override;
    void writeAttribute(unsigned int token, float value) override;
    void writeAttribute(unsigned int token, double value) override;
    void writeAttribute(unsigned int token, KVUUID const& value) override;
    void writeAttribute(unsigned int token, KVString const& value) override;
    void writeAttribute(unsigned int token, CMTime const& value) override;
    /// The same as `writeAttribute`: in this form nothing is optional.
    void writeOptionalAttribute(unsigned int token, KVString const& value) override;
    void writeBlankLine() override;

    /// The place of the file that is written; a null URL when the byte stream is no
    /// KVFileWriteStream.
    KVURL getURL() const;

    /// Puts the ">" of a pending start tag, if it is pending, in a buffer that holds what goes out
    /// next, and returns where in it the text behind goes. Throws KVException_NoElementDefined
    /// when no element is open.
    char* terminateStartTag();

private:
    /// An element that is open.
    struct KVXMLElementInfo {
        char const* name;
        unsigned int token;
        /// Nothing has gone inside.
        bool isEmpty = true;
        /// The ">" of its start tag has been written.
        bool startTagClosed = false;
        /// A child went inside, so the end tag stands on a line of its own.
        bool hasChildLines = false;
    };

    KVScope* getAttributeInfo(unsigned int token) const;
    template <class T>
    void writeNumber(T const& value);
    template <class T>
    void writeNumberAttribute(unsigned int token, T const& value);
    char* startAttribute(char const* name, std::size_t roomForValue);
    char* room(std::size_t size);
    char* closeStartTag(KVXMLElementInfo& element, char* out) noexcept;
    void send(char const* end);

    std::vector<KVXMLElementInfo> elements_;
    KVStream& stream_;
    unsigned int depth_ = 0;
    /// Each piece of output before it is sent.
    std::vector<char> scratch_;
    KVURL url_;
};

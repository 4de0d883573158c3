#pragma once

#include <korvane/foundation/KVURL.h>
#include <korvane/serialization/KVSerializerWriteStream.h>

#include <memory>
#include <vector>

class KVStream;

/// Writes a document in its compact form: tokens in place of names, values in as few bytes as hold
/// them, and the length in front of every element, so that a reader can pass over what it does not
/// know. docs/scene-binary.md tells the format byte by byte.
///
///     KVFileWriteStream file(url);
///     KVBinaryXMLWriteStream stream(file, 5, 10);
///     stream.pushScope(projectScope);
///     project.writeBody(stream, false, false, false);
///     stream.close();
///     file.close();
///
/// Where it does not say what another form says:
///
/// - of several values in one element a reader gives the last;
/// - whole-number floats become integers, so -0.0 comes back as 0;
/// - a `long long`, or a whole `float` or `double`, from -(2^32 - 1) to -(2^31 + 1) comes back
///   2^32 larger: readers cut a negative integer of up to four bytes to an `int`;
/// - an attribute that is an empty string is not counted, so that readers take its bytes for the
///   start of the body, or it is lost if it is the only one: leave it out;
/// - an attribute written after a value or a child of its element is lost;
/// - optional attributes, arrays and blank lines are left out;
/// - of a size above 4 GiB the low 32 bits are written, which is logged.
class KV_EXPORT KVBinaryXMLWriteStream : public KVSerializerWriteStream {
public:
    /// Writes the header at once. The byte stream is not owned, must outlive this one, and must be
    /// able to go back (`setPos`): sizes are put in when an element ends.
    KVBinaryXMLWriteStream(KVStream& stream, unsigned int major, unsigned int minor);
    ~KVBinaryXMLWriteStream() override;

    using KVSerializerWriteStream::writeAttribute;
    using KVSerializerWriteStream::writeValue;

    void startElement(unsigned int token) override;
    void endElement() override;
    /// Does nothing: a document ends with its last element.
    void close() override;

    /// Throws KVException_NoElementDefined, without a message, when no element is open.
    void writeValue(int value) override;
    void writeValue(unsigned int value) override;
    void writeValue(long long value) override;
    void writeValue(unsigned long long value) override;
    void writeValue(float value) override;
    void writeValue(double value) override;
    void writeValue(KVUUID const& value) override;
    void writeValue(KVString const& value) override;
    void writeValue(CMTime const& value) override;

    void writeAttribute(unsigned int token, unsigned int value) override;
    void writeAttribute(unsigned int token, int value) override;
    void writeAttribute(unsigned int token, unsigned long long value) override;
    void writeAttribute(unsigned int token, long long value) override;
    void writeAttribute(unsigned int token, float value) override;
    void writeAttribute(unsigned int token, double value) override;
    void writeAttribute(unsigned int token, KVUUID const& value) override;
    void writeAttribute(unsigned int token, KVString const& value) override;
    void writeAttribute(unsigned int token, CMTime const& value) override;

    // --- Nothing is written by these ---

    void writeOptionalAttribute(unsigned int token, KVString const& value) override;
    void writeArray(unsigned int* values, unsigned int count) override;
    void writeArray(float* values, unsigned int count) override;
    void writeArray(double* values, unsigned int count) override;
    void writeBlankLine() override;

    /// The place of the file that is written; a null URL when the byte stream is no
    /// KVFileWriteStream.
    KVURL const& getURL() const noexcept;

    // --- Encoders ---

    /// Writes the open element's attributes, if that has not been done. Values and children do so
    /// by themselves.
    void flushAttributes();
    /// Groups of 7 bits, the lowest first; all bytes but the last have their top bit set.
    static void writeVarInt(KVStream& stream, unsigned int value);
    /// A tag and as few bytes as hold the value.
    static void writeInt(KVStream& stream, int value);
    static void writeInt(KVStream& stream, unsigned int value);
    static void writeInt(KVStream& stream, long long value);
    static void writeInt(KVStream& stream, long value);
    static void writeInt(KVStream& stream, unsigned long long value);
    static void writeInt(KVStream& stream, unsigned long value);
    /// The magnitude of a value and its sign. A magnitude of 1 is written as 1, whatever its sign.
    static void writeInt(KVStream& stream, unsigned long long value, bool negative);
    static void writeVexTime(KVStream& stream, CMTime const& value);

private:
    struct KVBinaryXMLElementInfo {
        char const* name;
        unsigned int token;
        bool reserved;
        unsigned long long sizePosition;
    };

    bool reserve(std::size_t size) noexcept;
    unsigned char* roomForValue();
    void endAttributes() noexcept;
    unsigned long long send(bool whole);
    void writeSize(KVBinaryXMLElementInfo const& element);
    unsigned int openElementToken() const;
    void useAttribute(unsigned int token);
    template <class T>
    void writeTagged(T const& value);
    template <class T>
    void writeTaggedAttribute(unsigned int token, T const& value);

    std::vector<KVBinaryXMLElementInfo> elements_;
    KVStream& stream_;
    // The attributes and first values of the element that was started last, behind room for its
    // head, as long as it is held back: a small element goes out in one piece and needs no patch.
    std::unique_ptr<unsigned char[]> buffer_;
    std::size_t capacity_ = 0;
    std::size_t held_ = 0;
    unsigned int attributeCount_ = 0;
    bool attributesEnded_ = true;
    bool sent_ = true;
    bool cutSizeLogged_ = false;
    KVScope const* expectedScope_ = nullptr;
    KVScope const* expectedRow_ = nullptr;
    KVURL url_;
};

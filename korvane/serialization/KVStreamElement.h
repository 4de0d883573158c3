#pragma once

#include <korvane/foundation/KVExport.h>
#include <korvane/foundation/KVUUID.h>
#include <korvane/platform/CMTime.h>
#include <korvane/serialization/KVScope.h>

class KVSerializer;
class KVString;

/// An element that is being read: what a handler is given in `parseElement`.
///
///     bool Clip::parseElement(KVSerializerReadStream& stream, KVStreamElement& element)
///     {
///         switch (element.token) {
///         case kClip:
///             element.getAttributeAsString(kClipName, &name_);
///             return stream.pushHandler(this);
///         case kOpacity:
///             return element.getAsDouble(&opacity_);
///         }
///         return true;
///     }
///
/// The getters answer true when there was a value and it could be read; the output is then set,
/// what a class below says apart. Those for a UUID answer a new KVUUID, which the caller deletes,
/// or null. Attributes are asked for by their token. An element lives from its start to its end in
/// the document; keep no pointer to it.
class KV_EXPORT KVStreamElement {
public:
    KVStreamElement(unsigned int elementToken, KVScope* inScope,
                    KVSerializer* elementHandler) noexcept
        : token(elementToken), scope(inScope), handler(elementHandler)
    {}
    KVStreamElement(KVStreamElement const&) = delete;
    KVStreamElement& operator=(KVStreamElement const&) = delete;
    virtual ~KVStreamElement();

    // --- The text or value inside the element ---

    virtual bool getAsString(KVString* value) = 0;
    virtual bool getAsInt32(int* value) = 0;
    virtual bool getAsUInt32(unsigned int* value) = 0;
    virtual bool getAsInt64(long long* value) = 0;
    virtual bool getAsUInt64(unsigned long long* value) = 0;
    virtual bool getAsFloat(float* value) = 0;
    virtual bool getAsDouble(double* value) = 0;
    /// Whether the number is not zero.
    virtual bool getAsBool(bool* value) = 0;
    virtual KVUUID* getAsUUID() = 0;
    virtual bool getAsVexTime(CMTime* value) = 0;

    // --- Attributes, by token ---

    virtual bool getAttributeAsString(unsigned int attribute, KVString* value) const = 0;
    virtual bool getAttributeAsInt32(unsigned int attribute, int* value) const = 0;
    virtual bool getAttributeAsUInt32(unsigned int attribute, unsigned int* value) const = 0;
    virtual bool getAttributeAsInt64(unsigned int attribute, long long* value) const = 0;
    virtual bool getAttributeAsUInt64(unsigned int attribute, unsigned long long* value) const = 0;
    virtual bool getAttributeAsFloat(unsigned int attribute, float* value) const = 0;
    virtual bool getAttributeAsDouble(unsigned int attribute, double* value) const = 0;
    virtual bool getAttributeAsBool(unsigned int attribute, bool* value) const = 0;
    virtual KVUUID* getAttributeAsUUID(unsigned int attribute) const = 0;
    virtual bool getAttributeAsVexTime(unsigned int attribute, CMTime* value) const = 0;

    // --- For the streams ---

    /// Adds text to the element, behind a newline if asked and if there is text already. Does
    /// nothing by default.
    virtual void appendContentWithNewline(char* text, bool newline);
    /// Whether the element comes from a document in text form. False by default.
    virtual bool isXMLStreamElement();

    /// Reads 32 hexadecimal digits, upper or lower case and nothing between them, as the four
    /// words of a UUID in order. Answers a new KVUUID, which the caller deletes, and moves the
    /// cursor behind the last digit; any other character gives null and leaves the cursor.
    static KVUUID* atoUUID(char const** cursor);
    /// Reads a time as "value timescale flags epoch", decimal but for the hexadecimal flags. What
    /// is missing is 0. Of timescale, flags and epoch the low 32 bits are kept, those of the
    /// epoch as a number without sign. False, with the output untouched, for a null cursor, null
    /// text or a number that does not fit 64 bits; on success the cursor moves behind the text
    /// read.
    static bool aToVexTime(char const** cursor, CMTime* time);

    /// The token of the row that the element was found by.
    unsigned int token;
    /// Set when the element has been handed to its handler.
    bool processed = false;
    /// The table that the row is in.
    KVScope* scope;
    /// The handler that the element is for; may be null.
    KVSerializer* handler;
    /// Where the element ends in the byte stream. The binary reader sets it.
    unsigned long long endPosition = 0;
    /// The binary reader sets it when the rest of the element is passed over.
    bool ignored = false;
};

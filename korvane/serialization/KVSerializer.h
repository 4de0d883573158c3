#pragma once

#include <korvane/foundation/KVExport.h>

class KVSerializerReadStream;
class KVSerializerWriteStream;
class KVStreamElement;

/// What an object of a document implements to be written and read.
///
///     class Marker : public KVSerializer {
///     public:
///         void writeBody(KVSerializerWriteStream& stream, bool, bool, bool) override
///         {
///             stream.startElement(kMarker);
///             stream.writeAttribute(kMarkerTime, time_);
///             stream.writeValue(label_);
///             stream.endElement();
///         }
///         bool parseElement(KVSerializerReadStream&, KVStreamElement& element) override
///         {
///             return element.getAttributeAsVexTime(kMarkerTime, &time_) &&
///                    element.getAsString(&label_);
///         }
///         ...
///     };
///
/// An object writes `startElement`, all attributes of the element, then its values and child
/// elements, then `endElement`. On reading, the stream calls the object that is its current
/// handler: `parseBegin` when it becomes that, `parseElement` for each element that its scopes
/// name, `parseEnd` when the element ends during which it became the handler. See
/// KVSerializerReadStream for the order of these calls.
class KV_EXPORT KVSerializer {
public:
    virtual ~KVSerializer();

    /// The three operations of writing are a contract among the objects of a host, who give the
    /// flags their meaning. The streams do not call them.
    virtual void writeHeader(KVSerializerWriteStream& stream, bool) = 0;
    virtual void writeBody(KVSerializerWriteStream& stream, bool, bool, bool) = 0;
    virtual void markFactoriesForSerialization(KVSerializerWriteStream& stream, bool) = 0;

    /// The object has become the handler; it pushes its scopes here.
    virtual bool parseBegin(KVSerializerReadStream& stream) = 0;
    /// The object stops being the handler when this returns.
    virtual bool parseEnd(KVSerializerReadStream& stream) = 0;
    /// An element of this handler, with all its attributes and the text in front of its first
    /// child element. To have the children read, push a handler for them here (it may be this
    /// object again).
    virtual bool parseElement(KVSerializerReadStream& stream, KVStreamElement& element) = 0;
    /// Whether blanks alone between two tags belong to the text of this object's elements. False
    /// by default.
    virtual bool readSignificantWhiteSpace();
};

#pragma once

#include <korvane/foundation/KVURL.h>
#include <korvane/serialization/KVSerializerReadStream.h>

#include <memory>

class KVBinaryInput;
class KVStream;

/// Reads a document that KVBinaryXMLWriteStream wrote. docs/scene-binary.md tells the format byte
/// by byte.
///
///     KVFileReadStream file(url);
///     KVBinaryXMLReadStream stream(file);
///     stream.pushHandler(&project);
///     bool const whole = stream.parse();
///     stream.popAllHandlers();
///
/// Where it differs from the text form:
///
/// - of several values in one element only the last one stays;
/// - an element that no scope names is passed over unread, in one step of the stream;
/// - so is the rest of an element at `ignoreElement`, which pushes no handler;
/// - `parse` leaves the host's own handler on the stack, and after a failure all that there are;
///   call `popAllHandlers`.
///
/// A document may come from anywhere. What it says of lengths and counts is believed as far as
/// there are bytes for it: memory grows with what has really been read. Depth costs memory too, but
/// no stack.
class KV_EXPORT KVBinaryXMLReadStream : public KVSerializerReadStream {
public:
    /// The byte stream is not owned and must outlive this one. It is read ahead: its position holds
    /// only before and after `parse`.
    explicit KVBinaryXMLReadStream(KVStream& stream);
    ~KVBinaryXMLReadStream() override;

    /// Reads the header, sets the version from it, and reads elements to the end of the stream.
    /// False for another header and for a document that is cut within an element; one that is cut
    /// between top-level elements, or right behind the byte that announces a child, is taken for a
    /// shorter one.
    bool parse() override;
    /// Reads the next element with all that is in it, for hosts that find elements without a
    /// header. 1 when it was read or passed over, 0 at the end of the stream and after `stopParse`,
    /// -1 for a failure and after `abortParse`. Elements that a failure left open stay on the
    /// stack.
    int parseElement();
    /// Both take effect when an element is about to start. The `parseElement` of an element with
    /// children is called as its first child starts: that child is still opened and, unless it has
    /// children of its own, told; no further one is.
    void abortParse() override;
    void stopParse() override;
    /// Goes to the end of the current element.
    void ignoreElement() override;

    /// The place of the file that is read; a null URL when the byte stream is no KVFileReadStream.
    KVURL const& getURL() const noexcept;

    // --- Decoders: false when the stream ends too early ---

    /// The low 32 bits of at most five bytes; false for a sixth.
    static bool readVarInt(KVStream& stream, unsigned int* value);
    /// The integer behind `tag`; its low bits when the type is narrower. A tag with bit 16 set
    /// gives the negated number. 128 and 129 are the numbers 0 and 1; tags that leave a number
    /// below 8 without bit 16 are a 0; for any other that is no integer's: false.
    static bool readInt(KVStream& stream, int tag, int* value);
    static bool readInt(KVStream& stream, int tag, unsigned int* value);
    static bool readInt(KVStream& stream, int tag, long long* value);
    static bool readInt(KVStream& stream, int tag, long* value);
    static bool readInt(KVStream& stream, int tag, unsigned long long* value);
    static bool readInt(KVStream& stream, int tag, unsigned long* value);
    /// What stands behind the tag of a time.
    static bool readVextime(KVStream& stream, CMTime* value);

private:
    enum class Start { opened, passed, ended, failed };
    enum class Body { child, end, failed };

    bool readHeader();
    int readElement();
    Start startElement();
    Body readBody();
    void endElement();
    template <class Sink>
    bool readValue(unsigned int tag, Sink sink);
    bool readString(KVString* value);

    KVStream& stream_;
    [[maybe_unused]] void* reserved_ = nullptr;
    KVURL url_;
    bool stopped_ = false;
    bool aborted_ = false;
    bool reading_ = false;
    std::unique_ptr<KVBinaryInput> input_;
};

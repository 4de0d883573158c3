#pragma once

#include <korvane/foundation/KVCFRef.h>
#include <korvane/foundation/KVURL.h>
#include <korvane/platform/CFData.h>
#include <korvane/serialization/KVSerializerReadStream.h>

#include <memory>

class KVXMLStreamElement;

/// Is told of what a document holds that nobody asked for, as it is passed over: for a host that
/// checks documents.
class KV_EXPORT KVXMLReadObserver {
public:
    virtual ~KVXMLReadObserver();
    /// An element that the scopes of the top handler do not name.
    virtual void unknownElement(char const* name, unsigned long line) = 0;
    /// An attribute that the element's table does not name.
    virtual void unknownAttribute(KVStreamElement const& element, char const* name,
                                  unsigned long line) = 0;
};

/// Reads a document in its text form. See KVSerializerReadStream for how it is used and for the
/// order of events.
///
/// It pulls nodes from libxml2's text reader, without limits on depth and length. Elements become
/// KVXMLStreamElements; their text is what stands in text nodes, the pieces joined by newlines
/// where comments or the like stand between. Blanks alone between two tags belong to the text only
/// if the element's handler says so in `readSignificantWhiteSpace`. CDATA sections are passed over.
/// A reference to an entity that the document declares adds, by the entity's name: "amp", "lt",
/// "gt", "quot", "apos" and "space" their character, "#x" and "#" with a number behind that one
/// byte, any other nothing.
///
/// Nothing outside the document is loaded. A document is refused, as one that is not well-formed
/// is, whose document type declares parameter entities, entities that refer to further ones or more
/// than 8192 characters, whose attributes take more than 10 million bytes from entities, which
/// holds a tag or comment of more than 9 million bytes (text has no such limit), or whose encoding
/// is none of UTF-8, UTF-16, US-ASCII, ISO-8859-* and windows-125*.
class KV_EXPORT KVXMLReadStream : public KVSerializerReadStream {
public:
    /// Opens the file. Sets the process's LC_NUMERIC to "C" if it is not; so do the other two.
    explicit KVXMLReadStream(KVURL const& url);
    /// The bytes are not copied and must outlive the stream. Null, or a negative length, is nothing
    /// to read.
    KVXMLReadStream(char const* bytes, int length);
    /// Retains the data; null is nothing to read.
    explicit KVXMLReadStream(__CFData const* data);
    ~KVXMLReadStream() override;

    /// Reads the document and pops all handlers. True when it was read to its end or stopped. False
    /// when the file could not be opened or there are no bytes; and, with the line "<file name> :
    /// parsing error" on standard error, when it is not well-formed, cannot be read or the parse
    /// was aborted.
    bool parse() override;
    void abortParse() override;
    void stopParse() override;

    /// Handles the node that the reader stands on: one step of `parse()`.
    void processNode();
    /// Elements of the first 16 levels live in memory that is used again and again; deeper ones are
    /// allocated.
    KVStreamElement* createElement(unsigned int token, KVScope* scope, KVSerializer* handler);
    void destroyElement(KVStreamElement* element) override;
    /// Sets the process's LC_NUMERIC to "C" if it is not.
    static void fixLocale();

    /// The place of the file that is read; a null URL when it reads from memory.
    KVURL getURL() const;

    /// Not owned; null for none. Set it before `parse()`: it makes the reader go line by line.
    void setObserver(KVXMLReadObserver* observer) noexcept;
    /// Why `parse()` answered false, and the line it stopped at: from 1, or 0 when that is not
    /// known. The text is empty when there is nothing to tell.
    KVString errorText() const;
    unsigned long errorLine() const noexcept;

private:
    struct Reader;

    enum class StopState : int { running = 0, aborted = 1, stopped = 2 };

    void startElement();
    void endElement();
    void addAttributes(KVXMLStreamElement& element);
    void addText(bool blanksAlone);
    void addEntity(char const* name);

    KVCFRef<CFDataRef> data_;
    KVURL url_;
    bool afterEntity_ = false;
    std::unique_ptr<Reader> reader_;
    unsigned int elementCount_ = 0;
    StopState stopState_ = StopState::running;
};

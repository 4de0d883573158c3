#pragma once

#include <korvane/serialization/KVIgnoreElement.h>
#include <korvane/serialization/KVStreamElement.h>

#include <deque>
#include <vector>

/// Reads a document and hands its elements, one at a time, to the objects that make up the
/// handler stack. KVXMLReadStream and KVBinaryXMLReadStream are the two forms.
///
///     KVXMLReadStream stream(url);
///     Project project;                 // a KVSerializer; its parseBegin pushes projectScope
///     stream.pushHandler(&project);
///     if (!stream.parse())
///         ...                          // not a well-formed document
///
/// The order of events, on which an object may rely:
///
/// 1. An element that starts is looked up in the scopes of the handler on top. One that is not
///    found is passed over with all that is inside it.
/// 2. One that is found becomes the current element, with all its attributes.
/// 3. Its text gathers until its first child element starts or the element ends.
/// 4. Then its handler's `parseElement` is called, once. It sees the attributes and the text in
///    front of the first child, never what comes behind.
/// 5. There the object may push a handler, which sees the children, or call `ignoreElement`.
/// 6. When the element ends, the top handler is popped if it was pushed during that element, and
///    its `parseEnd` is called while the element is still the current one.
///
/// So a handler lives as long as the element that was current when it was pushed. Push one
/// handler for each element at most: of two, the end of the element pops the second only, and
/// the first stays until `popAllHandlers`.
///
/// Bad input never throws: getters answer false, unknown names are passed over, `parse()` answers
/// false. Elements and handlers stand on the heap, so the depth of a document is bounded by
/// memory alone. A stream belongs to one thread and is run once.
class KV_EXPORT KVSerializerReadStream {
public:
    /// A handler, the scopes that it pushed, and the element that was current when it came
    /// (null when none was, or when that one is gone).
    struct HandlerInfo {
        std::vector<KVScope*> scopes;
        KVSerializer* handler;
        KVStreamElement* element;
    };

    KVSerializerReadStream() = default;
    KVSerializerReadStream(KVSerializerReadStream const&) = delete;
    KVSerializerReadStream& operator=(KVSerializerReadStream const&) = delete;
    /// Destroys the elements that are left, top first. Handlers are let go without `parseEnd`.
    virtual ~KVSerializerReadStream();

    /// Reads the whole document.
    virtual bool parse() = 0;
    /// Called by a handler: ends the parse after the current step, as a failure.
    virtual void abortParse() = 0;
    /// Called by a handler: ends the parse after the current step, as a success.
    virtual void stopParse() = 0;
    /// Called by a handler in `parseElement`: passes over all that is inside the current element.
    virtual void ignoreElement();
    /// Ends an element that has been taken off the stack: deletes it, if not null.
    virtual void destroyElement(KVStreamElement* element);

    // --- Handlers ---

    /// Makes `handler` the top one and answers what its `parseBegin` answers. Not owned.
    bool pushHandler(KVSerializer* handler);
    /// Calls the top handler's `parseEnd` and takes it off. Does nothing when there is none.
    void popHandler();
    /// Pops all handlers, top first.
    void popAllHandlers();
    /// Adds a table to the top handler, to be searched after those that it has. It ends with
    /// the handler. Without a handler this does nothing.
    void pushScope(KVScope* scope);
    /// The top handler, and the element it came with; null when there is none.
    KVSerializer* currentHandler() const noexcept;
    KVStreamElement* currentHandlerElement() const noexcept;

    // --- Elements ---

    /// Makes `element` the current one and takes it over, to be given to `destroyElement`.
    void pushElement(KVStreamElement* element);
    /// Takes the current element off, if there is one, and gives it to `destroyElement`; the one
    /// around it is the current one by then.
    void popElement();
    KVStreamElement* currentElement() const noexcept
    {
        return elements_.empty() ? nullptr : elements_.back();
    }
    /// Hands the element to its handler, marks it as processed, and answers what `parseElement`
    /// answers. Without a handler: false, and the mark stays.
    bool processElement(KVStreamElement& element);

    /// Looks an element up by name or by token: through the tables of the top handler as they
    /// were pushed, through the rows of each in order; the first match wins, and a row "*"
    /// matches all. Gives the row, its table and the top handler. Without a match false, with
    /// nulls; without a handler false, with the outputs left as they were.
    bool getElementInfo(char const* name, KVScope** row, KVScope** scope, KVSerializer** handler);
    bool getElementInfo(unsigned int token, KVScope** row, KVScope** scope, KVSerializer** handler);

    // --- What the document says of itself ---

    /// The document's version; 0.0 until it is set. The binary form sets it from its header, in
    /// the text form that is up to the host.
    void setVersion(unsigned int major, unsigned int minor) noexcept;
    unsigned int versionMajor() const noexcept { return versionMajor_; }
    unsigned int versionMinor() const noexcept { return versionMinor_; }
    bool isLessThanVersion(unsigned int major, unsigned int minor) const noexcept;

    /// The time base, carried for the objects: 1/1 until it is set.
    void setTimeScale(CMTime const& timeScale) noexcept;
    CMTime const& timeScale() const noexcept { return timeScale_; }
    double timeScaleSeconds() const noexcept { return timeScaleSeconds_; }
    bool hasTimeScale() const noexcept { return hasTimeScale_; }

    // --- The getters of an element, called through the stream ---

    bool getAsString(KVStreamElement& element, KVString* value);
    bool getAsInt32(KVStreamElement& element, int* value);
    bool getAsUInt32(KVStreamElement& element, unsigned int* value);
    bool getAsInt64(KVStreamElement& element, long long* value);
    bool getAsUInt64(KVStreamElement& element, unsigned long long* value);
    bool getAsFloat(KVStreamElement& element, float* value);
    bool getAsDouble(KVStreamElement& element, double* value);
    bool getAsBool(KVStreamElement& element, bool* value);
    KVUUID* getAsUUID(KVStreamElement& element);
    bool getAsVexTime(KVStreamElement& element, CMTime* value);

    bool getAttributeAsString(KVStreamElement const& element, unsigned int token, KVString* value);
    bool getAttributeAsInt32(KVStreamElement const& element, unsigned int token, int* value);
    bool getAttributeAsUInt32(KVStreamElement const& element, unsigned int token,
                              unsigned int* value);
    bool getAttributeAsInt64(KVStreamElement const& element, unsigned int token, long long* value);
    bool getAttributeAsUInt64(KVStreamElement const& element, unsigned int token,
                              unsigned long long* value);
    bool getAttributeAsFloat(KVStreamElement const& element, unsigned int token, float* value);
    bool getAttributeAsDouble(KVStreamElement const& element, unsigned int token, double* value);
    bool getAttributeAsBool(KVStreamElement const& element, unsigned int token, bool* value);
    KVUUID* getAttributeAsUUID(KVStreamElement const& element, unsigned int token);
    bool getAttributeAsVexTime(KVStreamElement const& element, unsigned int token, CMTime* value);

protected:
    /// Pops all elements and lets all handlers go, without `parseEnd`. A derived reader that
    /// overrides `destroyElement` calls this in its own destructor.
    void popAllElements();
    /// The tables of the top handler; there must be one.
    std::vector<KVScope*> const& currentScopes() const noexcept { return handlers_.back().scopes; }

private:
    template <class Matches>
    bool findElement(Matches matches, KVScope** row, KVScope** scope, KVSerializer** handler);

    std::deque<KVStreamElement*> elements_;
    std::deque<HandlerInfo> handlers_;
    unsigned int versionMajor_ = 0;
    unsigned int versionMinor_ = 0;
    CMTime timeScale_ = CMTimeMake(1, 1);
    double timeScaleSeconds_ = 1.0;
    bool hasTimeScale_ = false;
};

#include <korvane/serialization/KVSerializerReadStream.h>

#include <cstring>

KVSerializerReadStream::~KVSerializerReadStream()
{
    popAllElements();
}

// --- Handlers ---

bool KVSerializerReadStream::pushHandler(KVSerializer* handler)
{
    handlers_.push_back({{}, handler, currentElement()});
    return handler && handler->parseBegin(*this);
}

void KVSerializerReadStream::popHandler()
{
    if (handlers_.empty())
        return;
    // parseEnd may push: what goes is the entry that was the top one before.
    std::size_t const index = handlers_.size() - 1;
    if (KVSerializer* const handler = handlers_[index].handler)
        handler->parseEnd(*this);
    if (index < handlers_.size())
        handlers_.erase(handlers_.begin() + static_cast<std::ptrdiff_t>(index));
}

void KVSerializerReadStream::popAllHandlers()
{
    while (!handlers_.empty())
        popHandler();
}

void KVSerializerReadStream::pushScope(KVScope* scope)
{
    if (!handlers_.empty())
        handlers_.back().scopes.push_back(scope);
}

KVSerializer* KVSerializerReadStream::currentHandler() const noexcept
{
    return handlers_.empty() ? nullptr : handlers_.back().handler;
}

KVStreamElement* KVSerializerReadStream::currentHandlerElement() const noexcept
{
    return handlers_.empty() ? nullptr : handlers_.back().element;
}

void KVSerializerReadStream::ignoreElement()
{
    pushHandler(&KVIgnoreElement::sharedInstance());
}

// --- Elements ---

void KVSerializerReadStream::destroyElement(KVStreamElement* element)
{
    delete element;
}

void KVSerializerReadStream::pushElement(KVStreamElement* element)
{
    elements_.push_back(element);
}

void KVSerializerReadStream::popElement()
{
    if (elements_.empty())
        return;
    KVStreamElement* const element = elements_.back();
    // A later element may get the same address: no handler may go on naming this one. Handlers
    // of the elements around it stand further down.
    for (std::size_t i = handlers_.size(); i-- > 0;) {
        HandlerInfo& info = handlers_[i];
        if (info.element == element)
            info.element = nullptr;
        else if (info.element)
            break;
    }
    // Off the stack first: nobody meets a dying element there, and one whose destruction throws or
    // pops again is not destroyed twice.
    elements_.pop_back();
    destroyElement(element);
}

void KVSerializerReadStream::popAllElements()
{
    // Handlers that are left would have to be searched for every element that goes.
    handlers_.clear();
    while (!elements_.empty())
        popElement();
}

bool KVSerializerReadStream::processElement(KVStreamElement& element)
{
    if (!element.handler)
        return false;
    element.processed = true;
    return element.handler->parseElement(*this, element);
}

// --- Look-up ---

namespace {

bool isWildcard(KVScope const& row) noexcept
{
    return row.name[0] == '*' && row.name[1] == '\0';
}

} // namespace

template <class Matches>
bool KVSerializerReadStream::findElement(Matches matches, KVScope** row, KVScope** scope,
                                         KVSerializer** handler)
{
    if (handlers_.empty())
        return false;
    *row = nullptr;
    *scope = nullptr;
    *handler = nullptr;
    HandlerInfo const& top = handlers_.back();
    for (KVScope* const table : top.scopes) {
        if (!table)
            continue;
        for (KVScope* candidate = table; candidate->name; ++candidate) {
            if (candidate->attributeToken == 0 && (matches(*candidate) || isWildcard(*candidate))) {
                *row = candidate;
                *scope = table;
                *handler = top.handler;
                return true;
            }
        }
    }
    return false;
}

bool KVSerializerReadStream::getElementInfo(char const* name, KVScope** row, KVScope** scope,
                                            KVSerializer** handler)
{
    auto const hasName = [name](KVScope const& candidate) {
        return candidate.name[0] == name[0] && std::strcmp(candidate.name, name) == 0;
    };
    return findElement(hasName, row, scope, handler);
}

bool KVSerializerReadStream::getElementInfo(unsigned int token, KVScope** row, KVScope** scope,
                                            KVSerializer** handler)
{
    auto const hasToken = [token](KVScope const& candidate) {
        return candidate.elementToken == token;
    };
    return findElement(hasToken, row, scope, handler);
}

// --- Version and time base ---

void KVSerializerReadStream::setVersion(unsigned int major, unsigned int minor) noexcept
{
    versionMajor_ = major;
    versionMinor_ = minor;
}

bool KVSerializerReadStream::isLessThanVersion(unsigned int major,
                                               unsigned int minor) const noexcept
{
    return versionMajor_ < major || (versionMajor_ == major && versionMinor_ < minor);
}

void KVSerializerReadStream::setTimeScale(CMTime const& timeScale) noexcept
{
    timeScale_ = timeScale;
    timeScaleSeconds_ = CMTimeGetSeconds(timeScale);
    hasTimeScale_ = true;
}

// --- Getters ---

bool KVSerializerReadStream::getAsString(KVStreamElement& element, KVString* value)
{
    return element.getAsString(value);
}

bool KVSerializerReadStream::getAsInt32(KVStreamElement& element, int* value)
{
    return element.getAsInt32(value);
}

bool KVSerializerReadStream::getAsUInt32(KVStreamElement& element, unsigned int* value)
{
    return element.getAsUInt32(value);
}

bool KVSerializerReadStream::getAsInt64(KVStreamElement& element, long long* value)
{
    return element.getAsInt64(value);
}

bool KVSerializerReadStream::getAsUInt64(KVStreamElement& element, unsigned long long* value)
{
    return element.getAsUInt64(value);
}

bool KVSerializerReadStream::getAsFloat(KVStreamElement& element, float* value)
{
    return element.getAsFloat(value);
}

bool KVSerializerReadStream::getAsDouble(KVStreamElement& element, double* value)
{
    return element.getAsDouble(value);
}

bool KVSerializerReadStream::getAsBool(KVStreamElement& element, bool* value)
{
    return element.getAsBool(value);
}

KVUUID* KVSerializerReadStream::getAsUUID(KVStreamElement& element)
{
    return element.getAsUUID();
}

bool KVSerializerReadStream::getAsVexTime(KVStreamElement& element, CMTime* value)
{
    return element.getAsVexTime(value);
}

bool KVSerializerReadStream::getAttributeAsString(KVStreamElement const& element,
                                                  unsigned int token, KVString* value)
{
    return element.getAttributeAsString(token, value);
}

bool KVSerializerReadStream::getAttributeAsInt32(KVStreamElement const& element, unsigned int token,
                                                 int* value)
{
    return element.getAttributeAsInt32(token, value);
}

bool KVSerializerReadStream::getAttributeAsUInt32(KVStreamElement const& element,
                                                  unsigned int token, unsigned int* value)
{
    return element.getAttributeAsUInt32(token, value);
}

bool KVSerializerReadStream::getAttributeAsInt64(KVStreamElement const& element, unsigned int token,
                                                 long long* value)
{
    return element.getAttributeAsInt64(token, value);
}

bool KVSerializerReadStream::getAttributeAsUInt64(KVStreamElement const& element,
                                                  unsigned int token, unsigned long long* value)
{
    return element.getAttributeAsUInt64(token, value);
}

bool KVSerializerReadStream::getAttributeAsFloat(KVStreamElement const& element, unsigned int token,
                                                 float* value)
{
    return element.getAttributeAsFloat(token, value);
}

bool KVSerializerReadStream::getAttributeAsDouble(KVStreamElement const& element,
                                                  unsigned int token, double* value)
{
    return element.getAttributeAsDouble(token, value);
}

bool KVSerializerReadStream::getAttributeAsBool(KVStreamElement const& element, unsigned int token,
                                                bool* value)
{
    return element.getAttributeAsBool(token, value);
}

KVUUID* KVSerializerReadStream::getAttributeAsUUID(KVStreamElement const& element,
                                                   unsigned int token)
{
    return element.getAttributeAsUUID(token);
}

bool KVSerializerReadStream::getAttributeAsVexTime(KVStreamElement const& element,
                                                   unsigned int token, CMTime* value)
{
    return element.getAttributeAsVexTime(token, value);
}

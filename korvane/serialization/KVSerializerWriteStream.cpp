#include <korvane/serialization/KVSerializerWriteStream.h>

#include <korvane/foundation/KVException.h>
#include <korvane/foundation/KVPrint.h>

KVSerializerWriteStream::~KVSerializerWriteStream() = default;

void KVSerializerWriteStream::reset() {}

bool KVSerializerWriteStream::isHashStream()
{
    return false;
}

void KVSerializerWriteStream::pushScope(KVScope* scope)
{
    scopes_.push_back(scope);
}

void KVSerializerWriteStream::popScope()
{
    if (!scopes_.empty())
        scopes_.pop_back();
}

void KVSerializerWriteStream::throwScopeUndefined()
{
    KVPrint("scope not defined!\n");
    throw KVException_ScopeUndefined();
}

KVScope* KVSerializerWriteStream::findElement(KVScope* scope, unsigned int token) noexcept
{
    for (KVScope* row = scope; row->name; ++row)
        if (row->elementToken == token && row->attributeToken == 0)
            return row;
    return nullptr;
}

void KVSerializerWriteStream::throwTokenUndefined(KVScope const* scope)
{
    KVPrint("Token not defined in scope %s!\n", scope->name ? scope->name : "(null)");
    throw KVException_NoElementDefined();
}

void KVSerializerWriteStream::throwNothingToEnd()
{
    KVPrint("endElement() called without startElement()!\n");
    throw KVException_NoElementDefined();
}

KVScope* KVSerializerWriteStream::findAttribute(unsigned int elementToken,
                                                unsigned int attributeToken) const
{
    KVScope* const scope = topScope();
    if (!scope)
        throw KVException_ScopeUndefined();
    // Token 0 would match the row of the element itself.
    if (attributeToken != 0)
        for (KVScope* row = scope; row->name; ++row)
            if (row->elementToken == elementToken && row->attributeToken == attributeToken)
                return row;
    throw KVException_AttributeUndefined();
}

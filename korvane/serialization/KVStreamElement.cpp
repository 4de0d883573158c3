#include <korvane/serialization/KVStreamElement.h>

#include <korvane/serialization/KVNumberText_p.h>

KVStreamElement::~KVStreamElement() = default;

void KVStreamElement::appendContentWithNewline(char*, bool) {}

bool KVStreamElement::isXMLStreamElement()
{
    return false;
}

KVUUID* KVStreamElement::atoUUID(char const** cursor)
{
    KVUUID uuid;
    if (!cursor || !*cursor || !kvParseUUID(*cursor, uuid))
        return nullptr;
    *cursor += 32;
    return new KVUUID(uuid);
}

bool KVStreamElement::aToVexTime(char const** cursor, CMTime* time)
{
    if (!cursor || !*cursor)
        return false;
    char const* text = *cursor;
    long long value, timescale, epoch;
    unsigned long long flags;
    if (!kvParseInt(text, value) || !kvParseInt(text, timescale) || !kvParseUInt(text, flags, 16) ||
        !kvParseInt(text, epoch))
        return false;
    time->value = value;
    time->timescale = static_cast<CMTimeScale>(timescale);
    time->flags = static_cast<std::uint32_t>(flags);
    time->epoch = static_cast<std::uint32_t>(epoch);
    *cursor = text;
    return true;
}

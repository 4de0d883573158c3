#include <korvane/serialization/KVSerializer.h>

KVSerializer::~KVSerializer() = default;

bool KVSerializer::readSignificantWhiteSpace()
{
    return false;
}

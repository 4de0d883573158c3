#pragma once

#include "../Json.h"
#include "Schema.h"

#include <korvane/serialization/KVSerializerWriteStream.h>
#include <korvane/serialization/KVStreamElement.h>

#include <string>
#include <string_view>
#include <variant>

namespace scene {

/// One value of any kind; empty where there is none.
using Value = std::variant<std::monostate, int, unsigned int, long long, unsigned long long, float,
                           double, KVUUID, KVString, CMTime>;

inline bool isSet(Value const& value)
{
    return value.index() != 0;
}

/// Whether a text is a value of that kind from its first to its last character, blanks around it
/// aside. The streams are more patient: they read what they can of it.
bool isWellWritten(std::string_view text, Kind kind);

/// The element's content as the kind that the vocabulary tells; empty if it does not convert.
Value readContent(KVStreamElement& element, Kind kind);
Value readAttribute(KVStreamElement const& element, AttributeInfo const& attribute);

void writeContent(KVSerializerWriteStream& stream, Value const& value);
void writeAttribute(KVSerializerWriteStream& stream, unsigned int token, Value const& value);

/// For a person to read: texts in quotes, times as a fraction of seconds.
std::string describe(Value const& value);
Json toJson(Value const& value);
/// "a 64-bit integer" and the like.
char const* nameOf(Kind kind) noexcept;

} // namespace scene

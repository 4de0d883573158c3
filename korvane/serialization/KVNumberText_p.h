#pragma once

#include <korvane/foundation/KVUUID.h>
#include <korvane/platform/CMTime.h>

/// Numbers to and from the text of documents, in the C locale whatever the process's locale.
/// Shared by the text form and by the strings of the binary form.

// --- To text. Each writes at `out`, unterminated, and returns the end of what it wrote. ---

/// Room for any of them.
inline constexpr int kvNumberTextSize = 96;

/// "%d", "%u", "%lld", "%llu".
char* kvFormat(char* out, int value) noexcept;
char* kvFormat(char* out, unsigned int value) noexcept;
char* kvFormat(char* out, long long value) noexcept;
char* kvFormat(char* out, unsigned long long value) noexcept;
/// "%.10g".
char* kvFormat(char* out, float value) noexcept;
/// "%.17lg", or with that many significant digits, up to 17.
char* kvFormat(char* out, double value, int digits = 17) noexcept;
/// "%08x%08x%08x%08x".
char* kvFormat(char* out, KVUUID const& value) noexcept;
/// "%lld %d %x %lld": value, timescale, flags, epoch.
char* kvFormat(char* out, CMTime const& value) noexcept;

// --- From text ---
// Each reads like the C function that it names, moves the cursor behind what it read and stores the
// result. A result out of range is stored as that function gives it, the cursor stays and the
// answer is false; it is true for all else, also where there is no number (the result is then 0).

/// `strtoll`, base 10.
bool kvParseInt(char const*& cursor, long long& value) noexcept;
/// `strtoull`, base 10 or 16.
bool kvParseUInt(char const*& cursor, unsigned long long& value, unsigned int base = 10) noexcept;
/// `strtof` and `strtod`. A subnormal result is not out of range; zero for a number that is not
/// zero, and infinity for one that is finite, are.
bool kvParseFloat(char const*& cursor, float& value) noexcept;
bool kvParseFloat(char const*& cursor, double& value) noexcept;

/// Exactly 32 hexadecimal digits at the start of the text; false, with the output untouched, for
/// any other. Reads no byte behind the first that is not such a digit.
bool kvParseUUID(char const* text, KVUUID& value) noexcept;

/// Blank, tab, newline, vertical tab, form feed or carriage return.
constexpr bool kvIsSpace(char c) noexcept
{
    return c == ' ' || (c >= '\t' && c <= '\r');
}

#pragma once

#include <cstdarg>
#include <locale.h>
#include <string>

namespace kv {

/// While it lives, the calling thread formats and parses in the C locale, whatever the process is
/// set to.
class CNumericLocale {
public:
    CNumericLocale() noexcept : previous_(::uselocale(instance())) {}
    ~CNumericLocale() { ::uselocale(previous_); }
    CNumericLocale(CNumericLocale const&) = delete;
    CNumericLocale& operator=(CNumericLocale const&) = delete;

    /// The C locale itself, for functions that take one (`strtod_l`).
    static locale_t instance() noexcept
    {
        static locale_t const c = ::newlocale(LC_ALL_MASK, "C", static_cast<locale_t>(nullptr));
        return c;
    }

private:
    locale_t previous_;
};

/// printf with "%@" for objects, in UTF-8.
std::string formatWithObjects(std::string const& format, std::va_list arguments);

} // namespace kv

#pragma once

#include <korvane/foundation/KVExport.h>

#include <compare>
#include <cstdint>

/// 128 bits as four 32-bit words, the first one in front when written. A plain record: making a
/// new, unique one is left to the host. Documents print it as 32 lower-case digits without dashes.
struct KV_EXPORT KVUUID {
    std::uint32_t words[4] = {0, 0, 0, 0};

    /// "XXXXXXXX-XXXX-XXXX-XXXX-XXXXXXXXXXXX" in upper case, in a `calloc`ed block of 41 bytes that
    /// the caller frees.
    char* toCStr() const;

    friend bool operator==(KVUUID const&, KVUUID const&) = default;
    friend auto operator<=>(KVUUID const&, KVUUID const&) = default;
};

#pragma once

#include <korvane/serialization/KVScope.h>

#include <cstdint>
#include <cstring>
#include <memory>

/// Remembers the rows in which names were found. The names are those that libxml2 keeps one copy of
/// for each document, so a name is known by its address. A table stays as it is while a stream
/// knows it.
class KVXMLNameCache {
public:
    /// Some rows of one table that stand next to each other; those that a name meets are among
    /// them.
    struct Rows {
        KVScope* first = nullptr;
        KVScope* end = nullptr;
    };

    KVXMLNameCache() : entries_(std::make_unique<Entry[]>(size)) {}

    /// The first row of an element of that name, or named "*"; null when there is none.
    KVScope* element(KVScope* table, char const* name) noexcept
    {
        Entry& entry = entryFor(table, 0, name);
        if (!entry.holds(table, elementLookup, name))
            entry = {table, elementLookup, name, findElement(table, name)};
        return entry.rows.first;
    }

    /// From the first to the last row of that attribute of the element.
    Rows attribute(KVScope* table, unsigned int elementToken, char const* name) noexcept
    {
        Entry& entry = entryFor(table, elementToken, name);
        if (!entry.holds(table, elementToken, name))
            entry = {table, elementToken, name, findAttribute(table, elementToken, name)};
        return entry.rows;
    }

    static bool isAttribute(KVScope const& row, unsigned int elementToken,
                            char const* name) noexcept
    {
        return row.elementToken == elementToken && row.attributeToken != 0 && equal(row.name, name);
    }

private:
    static constexpr std::size_t size = 512;
    /// In the place of an element's token, which has 32 bits.
    static constexpr std::uint64_t elementLookup = ~std::uint64_t(0);

    struct Entry {
        KVScope* table = nullptr;
        std::uint64_t token = 0;
        char const* name = nullptr;
        Rows rows;

        bool holds(KVScope* wantedTable, std::uint64_t wantedToken,
                   char const* wantedName) const noexcept
        {
            return name == wantedName && table == wantedTable && token == wantedToken;
        }
    };

    static bool equal(char const* a, char const* b) noexcept
    {
        return a[0] == b[0] && std::strcmp(a, b) == 0;
    }

    static Rows findElement(KVScope* table, char const* name) noexcept
    {
        for (KVScope* row = table; row->name; ++row)
            if (row->attributeToken == 0 && (equal(row->name, name) || equal(row->name, "*")))
                return {row, row + 1};
        return {};
    }

    static Rows findAttribute(KVScope* table, unsigned int elementToken, char const* name) noexcept
    {
        Rows rows;
        for (KVScope* row = table; row->name; ++row) {
            if (isAttribute(*row, elementToken, name)) {
                if (!rows.first)
                    rows.first = row;
                rows.end = row + 1;
            }
        }
        return rows;
    }

    Entry& entryFor(KVScope const* table, unsigned int token, char const* name) noexcept
    {
        std::uint64_t const mixed = (reinterpret_cast<std::uintptr_t>(name) ^
                                     reinterpret_cast<std::uintptr_t>(table) << 1 ^ token) *
                                    0x9E3779B97F4A7C15u;
        return entries_[mixed >> 55];
    }

    std::unique_ptr<Entry[]> entries_;
};

#pragma once

#include <korvane/foundation/KVCFRef.h>
#include <korvane/foundation/KVNSRef.h>
#include <korvane/platform/CFString.h>

#include <algorithm>
#include <cstdint>
#include <map>
#include <memory>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <variant>
#include <vector>

// What a keyed archive holds, and its byte form.

namespace kv::archive {

using Bytes = std::vector<std::uint8_t>;

struct Reference {
    std::size_t index;
};
using Value = std::variant<Bytes, std::int64_t, double, bool, Reference>;
using Keys = std::map<std::string, Value, std::less<>>;

/// An object of a class that archives itself.
struct Record {
    std::string className;
    Keys keys;
};

using Elements = std::vector<std::size_t>;
using Content = std::variant<std::monostate, KVCFRef<CFStringRef>, std::int64_t, double, Bytes,
                             Elements, std::unique_ptr<Record>>;

struct Node {
    Content content;
    /// What was made of it, once that has been asked for.
    KVNSRef<NSObject*> object;
    /// Its class was asked and made no object of it.
    bool failed = false;
    /// 1 more than the highest node that it refers to.
    unsigned int height = 1;
};

template <class... Functions>
struct Overloaded : Functions... {
    using Functions::operator()...;
};
template <class... Functions>
Overloaded(Functions...) -> Overloaded<Functions...>;

/// Nodes refer to nodes before them only.
struct Graph {
    std::vector<Node> nodes;
    /// What the archive itself holds.
    Keys keys;
};

inline bool isASCII(std::string_view text)
{
    return std::ranges::all_of(text, [](char c) { return static_cast<unsigned char>(c) < 0x80; });
}

Bytes write(Graph const& graph);
/// Nothing unless the bytes are those of a graph whose nodes are at most `maximumHeight` high.
std::optional<Graph> read(std::span<std::uint8_t const> bytes, unsigned int maximumHeight);

} // namespace kv::archive

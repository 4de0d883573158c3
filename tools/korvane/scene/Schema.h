#pragma once

#include <korvane/serialization/KVScope.h>

#include <span>
#include <string_view>

// The vocabulary of a small finishing project: which elements there are, what each holds and where
// it may stand. It is the model of what a host writes, and has every kind of value as an attribute
// and as an element's content.
//
//     project name id revision created
//       sequence name id frame width height pixelAspect
//         group name enabled colour            (groups nest)
//           clip name id start track digest    (each clip: source, reel, in, length, bytes, lane,
//           flags, gain, opacity)
//             transform x y rotation scale
//             curve parameter interpolation
//               key time value in out
//         marker time colour: label
//       note author created: text

namespace scene {

enum class Kind { None, Int, UInt, Int64, UInt64, Float, Double, UUID, String, Time };

/// Elements, as scope tokens.
enum Element : unsigned int {
    kDocument, ///< not in a file: what the top-level elements stand in
    kProject,
    kSequence,
    kGroup,
    kClip,
    kTransform,
    kCurve,
    kKey,
    kMarker,
    kNote,
    kSource,
    kReel,
    kIn,
    kLength,
    kBytes,
    kLane,
    kFlags,
    kGain,
    kOpacity,
};

struct AttributeInfo {
    char const* name;
    unsigned int token; ///< not 0
    Kind kind;
};

struct ElementInfo {
    char const* name;
    Element element;
    Kind content;
    std::span<AttributeInfo const> attributes;
    /// The elements that may stand in this one.
    std::span<Element const> children;

    bool mayHold(unsigned int child) const noexcept;
};

/// An element's entry; every token of `Element` has one.
ElementInfo const& infoOf(unsigned int element) noexcept;
AttributeInfo const* findAttribute(ElementInfo const& element, unsigned int token) noexcept;
/// The whole vocabulary as a scope table, made from the same entries.
KVScope* scope();

/// The version that documents are written in, and the newest that is read.
inline constexpr unsigned int versionMajor = 1;
inline constexpr unsigned int versionMinor = 0;

} // namespace scene

#include "Schema.h"

#include <algorithm>
#include <vector>

namespace scene {

namespace {

constexpr AttributeInfo projectAttributes[] = {{"name", 1, Kind::String},
                                               {"id", 2, Kind::UUID},
                                               {"revision", 3, Kind::UInt},
                                               {"created", 4, Kind::Int64}};
constexpr AttributeInfo sequenceAttributes[] = {
    {"name", 1, Kind::String}, {"id", 2, Kind::UUID},     {"frame", 3, Kind::Time},
    {"width", 4, Kind::UInt},  {"height", 5, Kind::UInt}, {"pixelAspect", 6, Kind::Double}};
constexpr AttributeInfo groupAttributes[] = {
    {"name", 1, Kind::String}, {"enabled", 2, Kind::UInt}, {"colour", 3, Kind::Int}};
constexpr AttributeInfo clipAttributes[] = {{"name", 1, Kind::String},
                                            {"id", 2, Kind::UUID},
                                            {"start", 3, Kind::Time},
                                            {"track", 4, Kind::Int},
                                            {"digest", 5, Kind::UInt64}};
constexpr AttributeInfo transformAttributes[] = {{"x", 1, Kind::Double},
                                                 {"y", 2, Kind::Double},
                                                 {"rotation", 3, Kind::Double},
                                                 {"scale", 4, Kind::Float}};
constexpr AttributeInfo curveAttributes[] = {{"parameter", 1, Kind::String},
                                             {"interpolation", 2, Kind::UInt}};
constexpr AttributeInfo keyAttributes[] = {{"time", 1, Kind::Time},
                                           {"value", 2, Kind::Double},
                                           {"in", 3, Kind::Float},
                                           {"out", 4, Kind::Float}};
constexpr AttributeInfo markerAttributes[] = {{"time", 1, Kind::Time}, {"colour", 2, Kind::Int}};
constexpr AttributeInfo noteAttributes[] = {{"author", 1, Kind::String},
                                            {"created", 2, Kind::Int64}};

constexpr Element documentChildren[] = {kProject, kSequence, kGroup, kClip, kMarker, kNote};
constexpr Element projectChildren[] = {kSequence, kGroup, kNote};
constexpr Element sequenceChildren[] = {kGroup, kClip, kMarker, kNote};
constexpr Element clipChildren[] = {kSource, kReel,    kIn,        kLength, kBytes,  kLane, kFlags,
                                    kGain,   kOpacity, kTransform, kCurve,  kMarker, kNote};
constexpr Element curveChildren[] = {kKey};

/// In the order of the tokens.
constexpr ElementInfo elements[] = {
    {"", kDocument, Kind::None, {}, documentChildren},
    {"project", kProject, Kind::None, projectAttributes, projectChildren},
    {"sequence", kSequence, Kind::None, sequenceAttributes, sequenceChildren},
    {"group", kGroup, Kind::None, groupAttributes, sequenceChildren},
    {"clip", kClip, Kind::None, clipAttributes, clipChildren},
    {"transform", kTransform, Kind::None, transformAttributes, {}},
    {"curve", kCurve, Kind::None, curveAttributes, curveChildren},
    {"key", kKey, Kind::None, keyAttributes, {}},
    {"marker", kMarker, Kind::String, markerAttributes, {}},
    {"note", kNote, Kind::String, noteAttributes, {}},
    {"source", kSource, Kind::String, {}, {}},
    {"reel", kReel, Kind::UUID, {}, {}},
    {"in", kIn, Kind::Time, {}, {}},
    {"length", kLength, Kind::Int64, {}, {}},
    {"bytes", kBytes, Kind::UInt64, {}, {}},
    {"lane", kLane, Kind::Int, {}, {}},
    {"flags", kFlags, Kind::UInt, {}, {}},
    {"gain", kGain, Kind::Float, {}, {}},
    {"opacity", kOpacity, Kind::Double, {}, {}},
};

std::vector<KVScope> makeScope()
{
    std::vector<KVScope> rows;
    for (ElementInfo const& info : elements) {
        if (info.element == kDocument)
            continue;
        rows.push_back({info.name, info.element, 0});
        for (AttributeInfo const& attribute : info.attributes)
            rows.push_back({attribute.name, info.element, attribute.token});
    }
    rows.push_back({nullptr, 0, 0});
    return rows;
}

} // namespace

bool ElementInfo::mayHold(unsigned int child) const noexcept
{
    return std::ranges::find(children, child) != children.end();
}

ElementInfo const& infoOf(unsigned int element) noexcept
{
    return elements[element];
}

AttributeInfo const* findAttribute(ElementInfo const& element, unsigned int token) noexcept
{
    auto const found = std::ranges::find(element.attributes, token, &AttributeInfo::token);
    return found == element.attributes.end() ? nullptr : &*found;
}

KVScope* scope()
{
    static std::vector<KVScope> rows = makeScope();
    return rows.data();
}

} // namespace scene

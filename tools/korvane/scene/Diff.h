#pragma once

#include "Node.h"

#include <functional>
#include <string>

namespace scene {

/// One place where two documents differ.
struct Difference {
    enum class What { Attribute, Content, OnlyInFirst, OnlyInSecond, Order };

    What what;
    /// The element it is in: "sequence "Main" / clip "Opening""; empty at the top.
    std::string path;
    /// The attribute's name; of an element that only one document has, what `path` would call it.
    std::string name;
    /// The values of an attribute or a content; empty where there is none.
    Value first;
    Value second;
};

/// Tells every difference between two documents, in the order of the first.
///
/// Elements that stand in the same one are compared with each other when they are of a kind and
/// have the same id, or name, or whatever their first attribute tells them apart by; those that are
/// left over, in their order. Elements that are the same but stand in another order are one
/// difference of the element around them.
void diff(Node const& first, Node const& second,
          std::function<void(Difference const&)> const& report);

/// "A -> B" for the two values of a difference, of long ones the part around where they part.
std::string describeChange(Value const& first, Value const& second);

} // namespace scene

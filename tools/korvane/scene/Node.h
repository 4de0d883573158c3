#pragma once

#include "Value.h"

#include <korvane/serialization/KVSerializer.h>
#include <korvane/serialization/KVSerializerReadStream.h>

#include <memory>
#include <string>
#include <utility>
#include <vector>

namespace scene {

/// What is told of a document while it is read: what the vocabulary does not know, and what does
/// not convert.
class Findings {
public:
    virtual ~Findings() = default;
    virtual void report(KVStreamElement const& element, std::string const& text) = 0;
};

/// An element of a project with what stands in it: a host's object, which writes itself into any
/// form and is read back through the handlers of a read stream.
///
/// Nothing here uses the machine's stack for depth: groups may nest as deep as memory reaches.
class Node final : public KVSerializer {
public:
    explicit Node(Element element = kDocument) : element_(element) {}
    Node(Node const&) = delete;
    Node& operator=(Node const&) = delete;
    ~Node() override;

    ElementInfo const& info() const noexcept { return infoOf(element_); }
    /// In the order of the vocabulary; what is not set is left out.
    std::vector<std::pair<unsigned int, Value>> const& attributes() const noexcept
    {
        return attributes_;
    }
    Value const& attribute(unsigned int token) const noexcept;
    Value const& content() const noexcept { return content_; }
    std::vector<std::unique_ptr<Node>> const& children() const noexcept { return children_; }

    /// Where to tell of what is passed over while this node is read; null for nowhere.
    void setFindings(Findings* findings) noexcept { findings_ = findings; }

    // --- KVSerializer ---

    void writeHeader(KVSerializerWriteStream&, bool) override {}
    /// This element with all that stands in it; of a document the elements alone. Pushes the
    /// vocabulary's scope and pops it.
    void writeBody(KVSerializerWriteStream& stream, bool, bool, bool) override;
    void markFactoriesForSerialization(KVSerializerWriteStream&, bool) override {}
    bool parseBegin(KVSerializerReadStream& stream) override;
    bool parseEnd(KVSerializerReadStream&) override { return true; }
    bool parseElement(KVSerializerReadStream& stream, KVStreamElement& element) override;

private:
    void writeStart(KVSerializerWriteStream& stream) const;
    void readValues(KVStreamElement& element);
    void tellIfMalformed(std::string const& place, KVString const& text, Kind kind,
                         KVStreamElement& element) const;

    Element element_;
    std::vector<std::pair<unsigned int, Value>> attributes_;
    Value content_;
    std::vector<std::unique_ptr<Node>> children_;
    Findings* findings_ = nullptr;
};

/// Visits a node and all below it, parents before their children, without recursion: `enter(node,
/// depth)` and then `leave(node, depth)` behind its children.
template <class Enter, class Leave>
void walk(Node const& root, Enter enter, Leave leave)
{
    struct Step {
        Node const* node;
        std::size_t next;
    };
    std::vector<Step> path{{&root, 0}};
    enter(root, std::size_t(0));
    while (!path.empty()) {
        Step& step = path.back();
        std::size_t const depth = path.size() - 1;
        if (step.next == step.node->children().size()) {
            leave(*step.node, depth);
            path.pop_back();
            continue;
        }
        Node const& child = *step.node->children()[step.next++];
        path.push_back({&child, 0});
        enter(child, depth + 1);
    }
}

} // namespace scene

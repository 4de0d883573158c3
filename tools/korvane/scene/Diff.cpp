#include "Diff.h"

#include <algorithm>
#include <unordered_map>

namespace scene {

namespace {

constexpr std::size_t none = ~std::size_t(0);
using Children = std::vector<std::unique_ptr<Node>>;

/// What tells an element from its neighbours of the same kind; empty if nothing does.
std::string identityOf(Node const& node)
{
    if (node.info().attributes.empty())
        return {};
    for (AttributeInfo const& attribute : node.info().attributes)
        if (std::string_view(attribute.name) == "id" && isSet(node.attribute(attribute.token)))
            return describe(node.attribute(attribute.token));
    AttributeInfo const& front = node.info().attributes.front();
    bool const tells = front.kind == Kind::String || front.kind == Kind::Time;
    return tells ? describe(node.attribute(front.token)) : std::string();
}

/// "clip "Opening"".
std::string labelOf(Node const& node)
{
    std::string label = node.info().name;
    if (node.info().attributes.empty())
        return label;
    AttributeInfo const& front = node.info().attributes.front();
    if (Value const& value = node.attribute(front.token); isSet(value))
        label += " " + (front.kind == Kind::String ? "" : std::string(front.name) + "=") +
                 describe(value);
    return label;
}

/// The labels of an element's children. Of those that are alike all but the first get a number.
class Labels {
public:
    explicit Labels(Children const& children) : children_(&children) {}

    std::string of(std::size_t index)
    {
        if (ordinals_.empty())
            count();
        std::string const label = labelOf(*(*children_)[index]);
        return ordinals_[index] == 1 ? label : label + "[" + std::to_string(ordinals_[index]) + "]";
    }

private:
    void count()
    {
        std::unordered_map<std::string, std::size_t> counts;
        for (auto const& child : *children_)
            ordinals_.push_back(++counts[labelOf(*child)]);
    }

    Children const* children_;
    std::vector<std::size_t> ordinals_;
};

/// For each child of the first the one of the second to compare it with, `none` if there is none.
std::vector<std::size_t> partnersOf(Children const& first, Children const& second)
{
    std::vector<std::size_t> partners(first.size(), none);
    std::vector<bool> taken(second.size());
    auto const pairUp = [&](auto keyOf) {
        std::unordered_map<std::string, std::vector<std::size_t>> waiting;
        for (std::size_t i = second.size(); i-- > 0;)
            if (!taken[i])
                waiting[keyOf(*second[i])].push_back(i);
        for (std::size_t i = 0; i < first.size(); ++i) {
            if (partners[i] != none)
                continue;
            auto const found = waiting.find(keyOf(*first[i]));
            if (found == waiting.end() || found->second.empty())
                continue;
            partners[i] = found->second.back();
            found->second.pop_back();
            taken[partners[i]] = true;
        }
    };
    pairUp([](Node const& node) { return node.info().name + (" " + identityOf(node)); });
    pairUp([](Node const& node) { return std::string(node.info().name); });
    return partners;
}

struct Same {
    bool operator()(KVString const& a, KVString const& b) const { return a.view() == b.view(); }
    bool operator()(CMTime const& a, CMTime const& b) const
    {
        return a.value == b.value && a.timescale == b.timescale && a.flags == b.flags &&
               a.epoch == b.epoch;
    }
    template <class T>
    bool operator()(T const& a, T const& b) const
    {
        return a == b || (a != a && b != b); // what is no number is the same as itself
    }
    template <class A, class B>
    bool operator()(A const&, B const&) const
    {
        return false;
    }
};

bool same(Value const& a, Value const& b)
{
    return std::visit(Same(), a, b);
}

class Differ {
public:
    explicit Differ(std::function<void(Difference const&)> const& report) : report_(report) {}

    void compare(Node const& first, Node const& second)
    {
        enter(first, second);
        while (!levels_.empty()) {
            Level& level = levels_.back();
            std::size_t const index = level.next++;
            if (index == level.partners.size())
                levels_.pop_back();
            else if (std::size_t const partner = level.partners[index]; partner != none)
                enter(*level.first->children()[index], *level.second->children()[partner]);
        }
    }

private:
    /// Two elements whose children are being compared, up to the one in front of `next`.
    struct Level {
        Level(Node const& a, Node const& b)
            : first(&a),
              second(&b),
              firstLabels(a.children()),
              secondLabels(b.children()),
              partners(partnersOf(a.children(), b.children()))
        {}

        Node const* first;
        Node const* second;
        Labels firstLabels;
        Labels secondLabels;
        std::vector<std::size_t> partners;
        std::size_t next = 0;
    };

    void enter(Node const& first, Node const& second)
    {
        levels_.emplace_back(first, second);
        for (AttributeInfo const& attribute : first.info().attributes)
            tellValue(Difference::What::Attribute, attribute.name, first.attribute(attribute.token),
                      second.attribute(attribute.token));
        tellValue(Difference::What::Content, "", first.content(), second.content());
        tellChildren(levels_.back());
    }

    void tellValue(Difference::What what, char const* name, Value const& first, Value const& second)
    {
        if (!same(first, second))
            report_({what, path(), name, first, second});
    }

    void tellChildren(Level& level)
    {
        std::vector<bool> taken(level.second->children().size());
        std::size_t last = 0;
        bool ordered = true;
        for (std::size_t i = 0; i < level.partners.size(); ++i) {
            std::size_t const partner = level.partners[i];
            if (partner == none) {
                tellLone(Difference::What::OnlyInFirst, level.firstLabels.of(i));
                continue;
            }
            ordered = ordered && partner >= last;
            last = partner;
            taken[partner] = true;
        }
        for (std::size_t i = 0; i < taken.size(); ++i)
            if (!taken[i])
                tellLone(Difference::What::OnlyInSecond, level.secondLabels.of(i));
        if (!ordered)
            report_({Difference::What::Order, path(), "", {}, {}});
    }

    void tellLone(Difference::What what, std::string const& label)
    {
        report_({what, path(), label, {}, {}});
    }

    std::string path()
    {
        // Beyond a hundred levels a path is no help any more.
        std::size_t const depth = levels_.size() - 1;
        std::string text = depth > 100 ? "(" + std::to_string(depth) + ") " : "";
        for (std::size_t i = depth > 100 ? depth - 1 : 0; i < depth; ++i)
            text += (i > 0 && depth <= 100 ? " / " : "") +
                    levels_[i].firstLabels.of(levels_[i].next - 1);
        return text;
    }

    std::function<void(Difference const&)> const& report_;
    std::vector<Level> levels_;
};

bool isContinuation(char byte) noexcept
{
    return (byte & 0xC0) == 0x80;
}

/// At most so many bytes of a text from a place on, whole characters, with dots for what is left
/// out.
std::string excerpt(std::string const& text, std::size_t from)
{
    constexpr std::size_t most = 80;
    std::size_t end = std::min(from + most, text.size());
    while (from > 0 && from < text.size() && isContinuation(text[from]))
        --from;
    while (end < text.size() && isContinuation(text[end]))
        --end;
    return (from > 0 ? "..." : "") + text.substr(from, end - from) +
           (end < text.size() ? "..." : "");
}

} // namespace

void diff(Node const& first, Node const& second,
          std::function<void(Difference const&)> const& report)
{
    Differ(report).compare(first, second);
}

std::string describeChange(Value const& first, Value const& second)
{
    std::string const a = isSet(first) ? describe(first) : "none";
    std::string const b = isSet(second) ? describe(second) : "none";
    auto const apart = static_cast<std::size_t>(
        std::mismatch(a.begin(), a.end(), b.begin(), b.end()).first - a.begin());
    std::size_t const from = std::max(a.size(), b.size()) > 80 && apart > 30 ? apart - 20 : 0;
    return excerpt(a, from) + " -> " + excerpt(b, from);
}

} // namespace scene

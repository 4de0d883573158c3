#include <korvane/media/KVAtomBox.h>

#include <algorithm>
#include <utility>

namespace {

enum class Next { Below, Over, Stop };

/// Calls `visit(child)` for every node below `root` in document order, on a stack of its own. The
/// visitor says whether to go below the node that it was given, over it, or to stop.
template <class Visitor>
void walk(KVAtomBox const& root, Visitor visit)
{
    std::vector<std::pair<KVAtomBox const*, int>> path{{&root, 0}};
    while (!path.empty()) {
        auto& [node, index] = path.back();
        if (index == node->getChildCount()) {
            path.pop_back();
            continue;
        }
        KVAtomBox* const child = node->getChild(index++);
        switch (visit(child)) {
        case Next::Below:
            path.emplace_back(child, 0);
            break;
        case Next::Over:
            break;
        case Next::Stop:
            return;
        }
    }
}

/// The largest payload that `updateSize` gives an 8-byte header, and the largest atom that is
/// written with one.
constexpr unsigned long long kLargestShortPayload = 0xFFFFFFFE;
constexpr unsigned long long kLargestShortAtom = 0x7FFFFFFE;

} // namespace

KVAtomBox::KVAtomBox(KVAtomBox const& other)
{
    copyFields(other);
    std::vector<std::pair<KVAtomBox const*, KVAtomBox*>> pending{{&other, this}};
    while (!pending.empty()) {
        auto const [from, to] = pending.back();
        pending.pop_back();
        to->children_.reserve(from->children_.size());
        for (auto const& original : from->children_) {
            auto copy = std::make_unique<KVAtomBox>();
            copy->copyFields(*original);
            if (!original->children_.empty())
                pending.emplace_back(original.get(), copy.get());
            to->children_.push_back(std::move(copy));
        }
    }
}

KVAtomBox& KVAtomBox::operator=(KVAtomBox const& other)
{
    KVAtomBox copy(other);
    copyFields(copy);
    children_.swap(copy.children_);
    return *this;
}

KVAtomBox::~KVAtomBox()
{
    removeAllChildren();
}

void KVAtomBox::copyFields(KVAtomBox const& other) noexcept
{
    offset_ = other.offset_;
    size_ = other.size_;
    payloadSize_ = other.payloadSize_;
    type_ = other.type_;
    holdsMovedTable_ = other.holdsMovedTable_;
    parent_ = other.parent_;
    // Nobody changes the data once it is here, so the two may share it.
    payloadData_ = other.payloadData_;
}

void KVAtomBox::repairParents()
{
    std::vector<KVAtomBox*> pending{this};
    while (!pending.empty()) {
        KVAtomBox* const node = pending.back();
        pending.pop_back();
        for (auto const& child : node->children_) {
            child->parent_ = node;
            if (!child->children_.empty())
                pending.push_back(child.get());
        }
    }
}

void KVAtomBox::setPayloadData(CFDataRef data)
{
    auto copy = KVCFRef<CFDataRef>::adopt(CFDataCreateCopy(kCFAllocatorDefault, data));
    if (copy)
        removeAllChildren();
    payloadData_ = std::move(copy);
    holdsMovedTable_ = false;
}

void KVAtomBox::addChild(KVAtomBox* child)
{
    insertChild(child, getChildCount());
}

void KVAtomBox::insertChild(KVAtomBox* child, int index)
{
    if (!child)
        return;
    std::unique_ptr<KVAtomBox> owned(child);
    payloadData_ = nullptr;
    holdsMovedTable_ = false;
    children_.insert(children_.begin() + std::clamp(index, 0, getChildCount()), std::move(owned));
}

void KVAtomBox::removeChild(int index)
{
    if (index >= 0 && index < getChildCount())
        children_.erase(children_.begin() + index);
}

void KVAtomBox::removeAllChildren() noexcept
{
    // Each node is emptied before it is deleted, so that no destructor has a tree to go down. The
    // way back up is kept in the parent pointers of the doomed, which they no longer need.
    KVAtomBox* node = this;
    while (node != this || !children_.empty()) {
        if (node->children_.empty()) {
            KVAtomBox* const above = node->parent_;
            above->children_.pop_back();
            node = above;
        } else {
            KVAtomBox* const last = node->children_.back().get();
            last->parent_ = node;
            node = last;
        }
    }
}

KVAtomBox* KVAtomBox::getChild(int index) const noexcept
{
    return index >= 0 && index < getChildCount() ? children_[static_cast<std::size_t>(index)].get()
                                                 : nullptr;
}

KVAtomBox* KVAtomBox::findFirstChild(bool recursive, unsigned int type) const
{
    KVAtomBox* found = nullptr;
    if (size_ != 0)
        walk(*this, [&](KVAtomBox* child) {
            if (child->type_ == type) {
                found = child;
                return Next::Stop;
            }
            return recursive && child->size_ != 0 ? Next::Below : Next::Over;
        });
    return found;
}

void KVAtomBox::findAllChildren(std::vector<KVAtomBox*>& found, bool recursive,
                                unsigned int type) const
{
    walk(*this, [&](KVAtomBox* child) {
        if (child->type_ == type)
            found.push_back(child);
        return recursive ? Next::Below : Next::Over;
    });
}

void KVAtomBox::updateSize() noexcept
{
    payloadSize_ = static_cast<unsigned long long>(CFDataGetLength(payloadData_));
    for (auto const& child : children_)
        payloadSize_ += child->size_;
    size_ = payloadSize_;
    if (parent_)
        size_ += payloadSize_ > kLargestShortPayload ? 16 : 8;
}

void KVAtomBox::updateParentSizes() noexcept
{
    for (KVAtomBox* node = parent_; node; node = node->parent_)
        node->updateSize();
}

unsigned int KVAtomBox::getWrittenHeaderSize() const noexcept
{
    if (size_ <= payloadSize_)
        return 0;
    return size_ > kLargestShortAtom ? 16 : 8;
}

void KVAtomBox::fitSizes()
{
    std::vector<KVAtomBox*> candidates{this};
    walk(*this, [&](KVAtomBox* child) {
        if (!child->children_.empty() || (child->payloadSize_ == 0 && child->size_ == 16))
            candidates.push_back(child);
        return Next::Below;
    });
    // Backwards, each node comes after all those below it.
    for (auto node = candidates.rbegin(); node != candidates.rend(); ++node) {
        if ((*node)->children_.empty() && (*node)->payloadSize_ != 0)
            continue;
        unsigned long long written = (*node)->getWrittenHeaderSize();
        for (auto const& child : (*node)->children_)
            written += child->size_;
        if (written != (*node)->size_)
            (*node)->updateSize();
    }
}

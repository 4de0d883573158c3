#include <korvane/serialization/KVBinaryInput_p.h>

#include <cstring>

void KVBinaryInput::attach()
{
    if (!window_)
        window_ = std::make_unique_for_overwrite<unsigned char[]>(windowSize + slack);
    cursor_ = window_.get();
    end_ = cursor_;
    start_ = stream_.getPos();
}

void KVBinaryInput::detach()
{
    if (cursor_ == end_)
        return;
    stream_.setPos(position());
    end_ = cursor_;
}

bool KVBinaryInput::fill(std::size_t count)
{
    auto const left = static_cast<std::size_t>(end_ - cursor_);
    start_ = position();
    std::memmove(window_.get(), cursor_, left);
    cursor_ = window_.get();
    end_ = cursor_ + left;
    long long const got = stream_.read(end_, windowSize - left);
    if (got > 0)
        end_ += got;
    return static_cast<std::size_t>(end_ - cursor_) >= count;
}

void KVBinaryInput::skipTo(unsigned long long target)
{
    unsigned long long const here = position();
    if (target <= here)
        return;
    if (target - here <= static_cast<unsigned long long>(end_ - cursor_)) {
        cursor_ += target - here;
        return;
    }
    stream_.setPos(target);
    attach();
}

#include "Progress.h"

#include <algorithm>
#include <iostream>
#include <unistd.h>
#include <utility>

namespace {

constexpr std::size_t barWidth = 40;

} // namespace

Progress::Progress(std::string label, std::uint64_t total)
    : label_(std::move(label)),
      total_(isatty(STDERR_FILENO) != 0 ? total : 0),
      next_(Clock::now() + std::chrono::seconds(1))
{}

Progress::~Progress()
{
    if (drawn_)
        std::cerr << "\r\x1b[K" << std::flush;
}

void Progress::update(std::uint64_t done)
{
    if (total_ == 0 || Clock::now() < next_)
        return;
    next_ = Clock::now() + std::chrono::milliseconds(100);
    drawn_ = true;
    double const fraction =
        static_cast<double>(std::min(done, total_)) / static_cast<double>(total_);
    auto const filled = static_cast<std::size_t>(fraction * static_cast<double>(barWidth));
    std::cerr << '\r' << label_ << " [" << std::string(filled, '#')
              << std::string(barWidth - filled, ' ') << "] " << static_cast<int>(fraction * 100.0)
              << " %" << std::flush;
}

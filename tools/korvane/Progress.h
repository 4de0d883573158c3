#pragma once

#include <chrono>
#include <cstdint>
#include <string>

/// A progress bar on standard error, for work that takes above a second; shown on a terminal only.
///
///     Progress progress("copying", bytesInAll);
///     while (...)
///         progress.update(bytesDone);
///
/// Nothing shows in the first second. The line is wiped when the bar goes.
class Progress {
public:
    /// `total` is the amount at which the work is done, in any unit; 0 shows no bar.
    Progress(std::string label, std::uint64_t total);
    Progress(Progress const&) = delete;
    Progress& operator=(Progress const&) = delete;
    ~Progress();

    /// Cheap to call often: draws ten times a second at most.
    void update(std::uint64_t done);

private:
    using Clock = std::chrono::steady_clock;

    std::string label_;
    std::uint64_t total_;
    Clock::time_point next_;
    bool drawn_ = false;
};

#pragma once

#include <korvane/foundation/KVExport.h>

#include <iosfwd>
#include <string>
#include <vector>

/// The calling thread's stack as text, innermost frame first. Frames of functions whose names
/// begin with "KVStackTrace" or "KVLiveObjects" are left out.
///
/// A line holds: its number (3 columns), the file name of the binary (35 columns), the symbol's
/// address (0x and 16 digits), the symbol, " + " and the distance of the frame from it in bytes.
class KV_EXPORT KVStackTrace {
public:
    /// Keeps up to `count` lines out of the `count + 5` innermost frames. Meant so: 0, and a count
    /// below it, keeps all of those frames that are not left out.
    explicit KVStackTrace(int count);

    /// Writes each line behind two blanks.
    void print(std::ostream& stream) const;
    std::vector<std::string> const& lines() const noexcept { return lines_; }

private:
    std::vector<std::string> lines_;
};

#pragma once

#include <string>
#include <string_view>
#include <vector>

/// One thing that is wrong with a SubRip file.
struct SubRipFinding {
    /// Counted from 1; 0 is the file as a whole.
    std::size_t line;
    /// Whether a strict reader refuses the file for it, or reads something else than what was
    /// meant.
    bool isError;
    std::string kind;
    std::string found;
    /// What ought to stand there.
    std::string expected;
    /// What a repair makes of it; empty where it leaves it alone.
    std::string repair;
};

struct SubRipCaption {
    /// The line of its times.
    std::size_t line;
    long long startMilliseconds;
    long long endMilliseconds;
    /// The lines of text as they stand, tags and all, "\n" between them.
    std::string text;
};

/// A SubRip file as far as a forgiving reader makes it out.
struct SubRipCheck {
    std::string encoding;
    std::vector<SubRipFinding> findings; // in the order of lines
    std::vector<SubRipCaption> captions; // repaired
};

/// Reads any bytes. Nothing is fatal: what cannot be made out becomes a finding.
SubRipCheck checkSubRip(std::string_view bytes);

/// The captions as a file that a strict reader takes: UTF-8, numbered from 1.
std::string repairedSubRip(std::vector<SubRipCaption> const& captions);

/// What of a caption's text is read: without its tags, "\n" between lines.
std::string withoutTags(std::string const& text);

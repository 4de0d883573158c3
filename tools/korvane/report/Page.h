#pragma once

#include <string>
#include <vector>

/// What a report tells of one file.
struct ReportSection {
    std::string name; ///< of the file, from a person or a system: any text
    std::string kind; ///< "Scene document"
    std::string html;
};

/// The whole page: one file that asks for nothing outside itself and runs no script.
std::string reportPage(std::vector<ReportSection> const& sections);

#include "Html.h"
#include "Sections.h"
#include "Timeline.h"

#include "../Markup.h"
#include "../SubRipChecker.h"
#include "../TimeForms.h"
#include "../ToolError.h"

#include <algorithm>

namespace {

double secondsOf(long long milliseconds)
{
    return static_cast<double>(milliseconds) / 1000;
}

std::string millisecondsText(long long milliseconds)
{
    return grouped(static_cast<std::uint64_t>(milliseconds)) + " ms";
}

/// What is shown of a caption's text, which tags may stand in.
std::string plainText(std::string const& text)
{
    return withoutTags(clipped(text, 2 * mostText));
}

std::string timesText(SubRipCaption const& caption)
{
    return timecodeText(secondsOf(caption.startMilliseconds)) + " to " +
           timecodeText(secondsOf(caption.endMilliseconds));
}

/// For each caption the longest time that another one, which begins before it or with it, shares
/// with it: that one's number in the file, from 1, and the milliseconds. 0 where there is none.
struct Shared {
    std::size_t with = 0;
    long long milliseconds = 0;
};

std::vector<Shared> sharedTimes(std::vector<SubRipCaption> const& captions)
{
    std::vector<std::size_t> order(captions.size());
    for (std::size_t i = 0; i < order.size(); ++i)
        order[i] = i;
    std::stable_sort(order.begin(), order.end(), [&](std::size_t a, std::size_t b) {
        return captions[a].startMilliseconds < captions[b].startMilliseconds;
    });
    std::vector<Shared> shared(captions.size());
    std::size_t longest = 0; // the one, of those before, that ends last
    for (std::size_t k = 0; k < order.size(); ++k) {
        SubRipCaption const& caption = captions[order[k]];
        if (k > 0) {
            long long const end =
                std::min(caption.endMilliseconds, captions[longest].endMilliseconds);
            if (end > caption.startMilliseconds)
                shared[order[k]] = {longest + 1, end - caption.startMilliseconds};
        }
        if (k == 0 || caption.endMilliseconds > captions[longest].endMilliseconds)
            longest = order[k];
    }
    return shared;
}

std::string findingsHtml(std::vector<SubRipFinding> const& findings)
{
    if (findings.empty())
        return {};
    Table table("What is wrong with the file", {{"Line", true}, {"Kind"}, {"Found"}, {"Expected"}});
    for (SubRipFinding const& finding : findings) {
        if (table.isFull()) {
            table.skip(1);
            continue;
        }
        table.row({finding.line ? grouped(finding.line) : "", finding.isError ? "error" : "warning",
                   shownText(finding.found), shownText(finding.expected)},
                  finding.isError ? "flag" : "");
    }
    return "<h3>Findings</h3>\n" + table.html("findings");
}

} // namespace

std::string captionsHtml(ReopenableFile const& file, std::string const& id)
{
    SubRipCheck const check = checkSubRip(readFile(file.path()));
    if (check.captions.empty())
        throw badInput(file.shown(), "holds no caption that can be made out");
    std::vector<Shared> const shared = sharedTimes(check.captions);

    Timeline timeline;
    timeline.tracks.push_back({"captions", {}});
    Table table("Captions", {{"Caption", true},
                             {"Start", true},
                             {"End", true},
                             {"Length", true},
                             {"Overlap"},
                             {"Text"}});
    for (std::size_t i = 0; i < check.captions.size(); ++i) {
        SubRipCaption const& caption = check.captions[i];
        std::string const number = std::to_string(i + 1);
        long long const length = caption.endMilliseconds - caption.startMilliseconds;
        std::string const text = clipped(plainText(caption.text), mostText);
        if (!table.isFull())
            table.row({number, timecodeText(secondsOf(caption.startMilliseconds)),
                       timecodeText(secondsOf(caption.endMilliseconds)), millisecondsText(length),
                       shared[i].with ? millisecondsText(shared[i].milliseconds) +
                                            " with caption " + grouped(shared[i].with)
                                      : "",
                       shownText(text)},
                      shared[i].with ? "flag" : "");
        else
            table.skip(1);
        timeline.tracks[0].items.push_back({secondsOf(caption.startMilliseconds),
                                            secondsOf(caption.endMilliseconds), text, number,
                                            number + ", " + timesText(caption) + ": " + text, 0});
    }
    auto const overlaps = static_cast<std::uint64_t>(
        std::count_if(shared.begin(), shared.end(), [](Shared const& s) { return s.with > 0; }));
    auto const errors = static_cast<std::uint64_t>(
        std::count_if(check.findings.begin(), check.findings.end(),
                      [](SubRipFinding const& finding) { return finding.isError; }));
    Facts facts;
    facts.add("Captions", grouped(check.captions.size()))
        .add("Encoding", check.encoding)
        .add("Overlaps", grouped(overlaps))
        .add("Errors", grouped(errors))
        .add("Warnings", grouped(check.findings.size() - errors));
    return facts.html() + "<h3>Captions over time</h3>\n" +
           legend({{"c0", "caption"}, {"overlap", "two captions at once"}}) +
           timelineHtml(std::move(timeline), id + "-captions", "Captions over time") +
           table.html("captions") + findingsHtml(check.findings);
}

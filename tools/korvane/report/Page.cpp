#include "Page.h"

#include "Html.h"

#include "../Markup.h"

#include <korvane/foundation/KVVersion.h>

namespace {

// Fills and the text on them, and lines and the ground behind them, keep the contrasts of
// WCAG 2.1: 4.5 to 1 for text and 3 to 1 for what must be told apart, in both schemes.
char const* const style = R"(
:root {
  color-scheme: light dark;
  --ground: #f4f6f8; --card: #ffffff; --ink: #1a1f26; --soft: #56606c; --edge: #d5dae1;
  --grid: #e3e7ec; --accent: #0a58b0; --head: #eef1f5;
  --f0: #cfe3f8; --s0: #3576b5; --f1: #fbe0bd; --s1: #a9691a; --f2: #cfe9cb; --s2: #3f8442;
  --f3: #e6d4f2; --s3: #8451a8; --f4: #f9d0d2; --s4: #b8434b; --f5: #c4e7e3; --s5: #217f77;
  --same: #e8ebef; --sames: #7b8794; --bad: #b3202c;
  --red: #c62430; --green: #1f8a3b; --blue: #2357d8;
}
@media screen and (prefers-color-scheme: dark) {
  :root {
    --ground: #0e1217; --card: #161b22; --ink: #e7ebf0; --soft: #a3adb9; --edge: #303844;
    --grid: #262d37; --accent: #79b8ff; --head: #1d242d;
    --f0: #1d3f63; --s0: #6ba7e3; --f1: #5a3c12; --s1: #d79a47; --f2: #1f4a26; --s2: #67b36d;
    --f3: #47295b; --s3: #b98bd9; --f4: #5f2429; --s4: #e58088; --f5: #164a46; --s5: #55b5ab;
    --same: #262d37; --sames: #8894a2; --bad: #ff8f96;
    --red: #ff6b72; --green: #58cc74; --blue: #7fa8ff;
  }
}
* { box-sizing: border-box; }
html { -webkit-text-size-adjust: 100%; }
body {
  margin: 0 auto; max-width: 1182px; padding: 0 24px 48px; background: var(--ground);
  color: var(--ink); font: 15px/1.5 system-ui, sans-serif; overflow-wrap: anywhere;
}
a { color: var(--accent); }
:focus-visible { outline: 3px solid var(--accent); outline-offset: 2px; border-radius: 3px; }
.skip { position: absolute; left: -9999px; }
.skip:focus { left: 16px; top: 12px; padding: 8px 14px; background: var(--card); z-index: 1; }
header { padding: 32px 0 4px; }
h1 { font-size: 26px; line-height: 1.2; margin: 0 0 4px; letter-spacing: -.01em; }
h2 { font-size: 19px; line-height: 1.3; margin: 0; }
h3 { font-size: 15px; margin: 22px 0 8px; }
header p, .kind { color: var(--soft); margin: 0; }
nav ul { display: flex; flex-wrap: wrap; gap: 8px; padding: 0; margin: 14px 0 0; list-style: none; }
nav a {
  display: block; padding: 4px 12px; border: 1px solid var(--edge); border-radius: 999px;
  background: var(--card); text-decoration: none;
}
nav a:hover { border-color: var(--accent); }
section {
  margin: 20px 0 0; padding: 18px 16px 16px; background: var(--card);
  border: 1px solid var(--edge); border-radius: 10px;
}
.facts { display: flex; flex-wrap: wrap; gap: 8px 28px; margin: 12px 0 0; }
.facts dt { color: var(--soft); font-size: 12.5px; }
.facts dd { margin: 0; font-variant-numeric: tabular-nums; }
.note { margin: 10px 0 0; padding: 6px 12px; border-left: 3px solid var(--s1); background: var(--head); }
.scroll { overflow-x: auto; max-width: 100%; }
.scroll > svg { display: block; }
.panels { display: flex; flex-wrap: wrap; gap: 16px 20px; align-items: flex-start; }
.panels figure { margin: 0; max-width: 100%; }
.axes { flex: 0 0 100%; margin: 0; color: var(--soft); font-size: 13px; }
.aside { flex: 1 1 340px; min-width: 0; max-width: 720px; gap: 12px 16px; }
.panels svg { max-width: 100%; height: auto; }
figcaption { color: var(--soft); font-size: 13px; margin-top: 4px; max-width: 420px; }
.legend { display: flex; flex-wrap: wrap; gap: 4px 16px; padding: 0; margin: 8px 0 10px; list-style: none; font-size: 13px; color: var(--soft); }
.patch { vertical-align: -1px; margin-right: 6px; }
details > summary { cursor: pointer; }
.rows { max-height: 26em; overflow-y: auto; margin-top: 10px; border: 1px solid var(--edge); border-radius: 6px; }
table { border-collapse: collapse; width: 100%; font-size: 13.5px; }
caption { position: absolute; left: -9999px; }
th, td { text-align: left; padding: 4px 12px; vertical-align: top; border-bottom: 1px solid var(--grid); overflow-wrap: normal; }
th { position: sticky; top: 0; background: var(--head); color: var(--soft); font-weight: 600; white-space: nowrap; }
td.n, th.n { text-align: right; font-variant-numeric: tabular-nums; white-space: nowrap; }
tfoot td { color: var(--soft); font-style: italic; }
td:not(.n) { min-width: 7.5em; white-space: pre-line; }
.rows td:not(.n):last-child { min-width: 15em; }
tr.flag td, tr.gone td { background: color-mix(in srgb, var(--f4) 45%, transparent); }
tr.changed td { background: color-mix(in srgb, var(--f1) 45%, transparent); }
tr.new td { background: color-mix(in srgb, var(--f2) 45%, transparent); }
.tree { margin: 8px 0 0; font-size: 13.5px; }
.tree ul { margin: 0; padding-left: 18px; list-style: none; border-left: 1px solid var(--grid); }
.tree > ul { padding-left: 0; border: 0; }
.tree li.leaf { padding-left: 15px; }
.tree b { font-weight: 600; }
.tree i { font-style: normal; color: var(--soft); }
.matrix td { text-align: right; font-variant-numeric: tabular-nums; }
svg text { font: 12px system-ui, sans-serif; fill: var(--ink); }
svg .soft { fill: var(--soft); font-size: 11px; }
svg .small { font-size: 11px; }
svg .mid { text-anchor: middle; }
svg .end { text-anchor: end; }
.line { stroke: var(--grid); }
.axisline { stroke: var(--sames); }
.lane { fill: var(--head); }
.c0 { fill: var(--f0); stroke: var(--s0); } .c1 { fill: var(--f1); stroke: var(--s1); }
.c2 { fill: var(--f2); stroke: var(--s2); } .c3 { fill: var(--f3); stroke: var(--s3); }
.c4 { fill: var(--f4); stroke: var(--s4); } .c5 { fill: var(--f5); stroke: var(--s5); }
.same { fill: var(--same); stroke: var(--sames); } .moved { fill: var(--f0); stroke: var(--s0); }
.changed { fill: var(--f1); stroke: var(--s1); } .new { fill: var(--f2); stroke: var(--s2); }
.gone { fill: var(--f4); stroke: var(--s4); stroke-dasharray: 4 2; }
.offsets { stroke: var(--s3); stroke-width: 2.5; fill: none; }
.many { stroke-dasharray: 2 2; }
.overlap { fill: var(--bad); fill-opacity: .14; stroke: var(--bad); stroke-dasharray: 3 2; }
.point { fill: var(--s3); stroke: none; }
.pointline { stroke: var(--s3); stroke-dasharray: 2 3; }
.wedge { fill: var(--sames); fill-opacity: .13; stroke: none; }
.move { fill: var(--s0); fill-opacity: .16; stroke: none; }
svg .grid { stroke: var(--grid); }
svg .curve.red { stroke: var(--red); } svg .curve.green { stroke: var(--green); }
svg .curve.blue { stroke: var(--blue); } svg .curve.all { stroke: var(--ink); }
rect.red { fill: var(--red); } rect.green { fill: var(--green); } rect.blue { fill: var(--blue); }
rect.all { fill: var(--ink); }
.frame { fill: none; stroke: var(--edge); }
.unit { fill: none; stroke: var(--sames); stroke-dasharray: 5 4; stroke-width: 1.5; }
.xaxis { stroke: var(--red); stroke-width: 2.5; fill: none; } .yaxis { stroke: var(--green); stroke-width: 2.5; fill: none; }
footer { color: var(--soft); font-size: 13px; margin-top: 24px; }
@media (max-width: 600px) {
  body { padding: 0 10px 32px; }
  section { padding: 14px 10px 12px; }
  h1 { font-size: 22px; }
}
@media (forced-colors: active) { svg { forced-color-adjust: none; background: var(--card); } }
@media print {
  :root { --ground: #fff; --card: #fff; }
  body { max-width: none; padding: 0; }
  nav, .skip { display: none; }
  section { border: 0; padding: 0 0 12px; }
  .scroll { overflow: visible; }
  .rows { max-height: none; border: 0; }
  .scroll > svg { max-width: 100%; height: auto; }
  h2, h3, .kind, .facts, .legend { break-after: avoid; }
  .panels { display: block; }
  .panels figure { display: inline-block; vertical-align: top; margin: 0 16px 12px 0; }
  figure, tr, .matrix, .scroll > svg { break-inside: avoid; }
  ::details-content { content-visibility: visible; }
}
)";

} // namespace

std::string reportPage(std::vector<ReportSection> const& sections)
{
    std::string links, bodies;
    std::size_t number = 0;
    for (ReportSection const& section : sections) {
        std::string const id = "file-" + std::to_string(++number);
        std::string const name = shownText(section.name);
        links += "<li><a href=\"#" + id + "\">" + name + "</a></li>\n";
        bodies += "<section id=\"" + id + "\" aria-labelledby=\"" + id + "-name\">\n<h2 id=\"" +
                  id + "-name\">" + name + "</h2>\n<p class=\"kind\">" + escaped(section.kind) +
                  "</p>\n" + section.html + "</section>\n";
    }
    std::string const title = sections.size() == 1
                                  ? "Report on " + escaped(clipped(sections[0].name, mostText))
                                  : "Report on " + counted(sections.size(), "file");
    unsigned int const version = KVVersion();
    return "<!DOCTYPE html>\n<html lang=\"en\">\n<head>\n<meta charset=\"utf-8\">\n"
           "<meta http-equiv=\"Content-Security-Policy\" content=\"default-src 'none'; style-src "
           "'unsafe-inline'\">\n"
           "<meta name=\"viewport\" content=\"width=device-width, initial-scale=1\">\n<title>" +
           title + "</title>\n<style>" + style +
           "</style>\n</head>\n<body>\n<a class=\"skip\" href=\"#files\">Skip to the files</a>\n"
           "<header>\n<h1>" +
           title +
           "</h1>\n<p>Times in hours, minutes, seconds and milliseconds; exact ones as fractions "
           "of a second.</p>\n<nav aria-label=\"Files\"><ul>\n" +
           links + "</ul></nav>\n</header>\n<main id=\"files\" tabindex=\"-1\">\n" + bodies +
           "</main>\n<footer>Written by korvane report, version " + std::to_string(version >> 16) +
           "." + std::to_string(version >> 8 & 0xFF) + "." + std::to_string(version & 0xFF) +
           ".</footer>\n</body>\n</html>\n";
}

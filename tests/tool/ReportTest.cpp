#include "media/Movie.h"
#include "tool/Tool.h"

#include <korvane/foundation/KVString.h>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdlib>

using ::testing::AllOf;
using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::Not;

namespace {

std::string const data = KORVANE_SOURCE_DIR "/examples/data/";
std::string const original = KORVANE_TEST_DATA "/media/head-moov.mp4";

std::string const overlapping = "1\n00:00:01,000 --> 00:00:03,500\nOne\n\n"
                                "2\n00:00:03,000 --> 00:00:05,000\n<i>Two</i>\n";

/// The page about these files.
std::string page(std::vector<std::string> arguments, std::string_view input = {})
{
    arguments.insert(arguments.begin(), "report");
    arguments.insert(arguments.end(), {"-o", "-"});
    ToolResult const result = runTool(arguments, input);
    EXPECT_EQ(result.exitCode, 0) << result.messages;
    return result.out;
}

std::string scene(std::string const& body)
{
    return "<vzml version=\"1.0\">" + body + "</vzml>";
}

/// The original with metadata that it did not have.
std::string changedMovie(ScratchFolder const& folder)
{
    std::string const path = folder.path("changed.mp4");
    ToolResult const result =
        runTool({"media", "set", original, path, "--spherical", "equirectangular"});
    EXPECT_EQ(result.exitCode, 0) << result.messages;
    return path;
}

std::string repeated(int count, auto const& make)
{
    std::string text;
    for (int i = 0; i < count; ++i)
        text += make(i);
    return text;
}

} // namespace

TEST(ToolReport, ShowsWhatFilesHold)
{
    ScratchFolder const folder;
    std::string const srt = folder.write("over.srt", overlapping);
    std::string const singular = folder.write("m.txt", "1 0 0 0 0 1 0 0 0 0 0 0 0 0 0 1");
    std::string const vanishing = folder.write("w.txt", "1 0 0 0 0 1 0 0 0 0 1 0 -1 0 0 1");
    struct Row {
        std::vector<std::string> arguments;
        std::vector<char const*> facts;
    } const rows[] = {
        {{data + "showreel.vzml"},
         {"<b><bdi>Harbour at dawn</bdi></b>", "Sequence <bdi>Reel</bdi>, frames of 1001/24000 s",
          "<td class=\"n\">00:00:04,004<td class=\"n\">96096/24000 s<td class=\"n\">00:00:05,714"
          "<td class=\"n\">137137/24000 s<td class=\"n\">41",
          "<title>Gulls: 00:00:04,004 to 00:00:05,714, exactly 96096/24000 s to 137137/24000 s"}},
        {{srt},
         {"500 ms with caption 1", "class=\"overlap\"",
          "<title>overlap, 00:00:03,000 to 00:00:03,500</title>", "<bdi>Two</bdi>"}},
        {{changedMovie(folder), "--before", original},
         {"<td>* changed", "<td>+ new", "class=\"offsets\"", "<title>stco: every offset +",
          "<title>mdat, offset ", "moov/trak[2]/mdia/minf/stbl/stco"}},
        {{data + "warm-evening.cube"},
         {"3D, 9 x 9 x 9", "class=\"curve red\"", "Blue 0.333", "0.0135 to 1 in red"}},
        {{KORVANE_TEST_DATA "/lut/opencolorio-1d.cube"}, {"class=\"curve all\"", "A grey ramp"}},
        {{data + "camera.txt"},
         {"-151.7\u00B0", "(1, 1) goes to (2.396, 2.652)", "3. translate", "<td>-0.875048"}},
        {{singular}, {"singular: it has no factors", "(1, 1) goes to (1, 1)"}},
        {{vanishing}, {"goes to infinity or behind it"}},
    };
    for (Row const& row : rows) {
        std::string const html = page(row.arguments);
        for (char const* fact : row.facts)
            EXPECT_THAT(html, HasSubstr(fact)) << row.arguments[0];
    }
}

TEST(ToolReport, StandsAloneAndIsTheSameEachTime)
{
    ScratchFolder const folder;
    std::string const movie = changedMovie(folder);
    std::string const srt = folder.write("over.srt", overlapping);
    auto const make = [&] {
        return page({data + "showreel.vzml", srt, movie, data + "warm-evening.cube",
                     data + "camera.txt", "--before", original});
    };
    std::string html = make();
    EXPECT_EQ(html, make());
    EXPECT_THAT(html, AllOf(Not(HasSubstr(folder.path(""))), Not(HasSubstr(data)),
                            Not(HasSubstr("<script")), Not(HasSubstr("url("))));
    std::string const space = "xmlns=\"http://www.w3.org/2000/svg\"";
    for (std::size_t at = 0; (at = html.find(space, at)) != html.npos;)
        html.erase(at, space.size());
    EXPECT_THAT(html,
                AllOf(Not(HasSubstr("://")), Not(HasSubstr("src=")), Not(HasSubstr("@import"))));
}

TEST(ToolReport, KnowsAFileByItsContentThenByItsName)
{
    ScratchFolder const folder;
    std::string const utf16("\xFF\xFE"
                            "1\0\n\0"
                            "0\0:\0"
                            "0\0:\0"
                            "1\0 \0-\0-\0>\0 \0"
                            "0\0:\0"
                            "0\0:\0"
                            "2\0\n\0"
                            "A\0\n\0",
                            42);
    struct Row {
        std::string bytes;
        char const* name;
        char const* kind;
    } const rows[] = {
        {scene("<clip/>"), "a.mp4", "Scene document"},
        {"\xEF\xBB\xBF<?xml version=\"1.0\"?>" + scene(""), "a.srt", "Scene document"},
        {overlapping, "a.cube", "SubRip captions"},
        {utf16, "A.SRT", "SubRip captions"},
        {folder.read(data + "warm-evening.cube"), "a.txt", "Colour lookup table"},
        {folder.read(original), "a.vzml", "QuickTime or MP4 movie"},
        {"[1 0 0 0] [0 1 0 0] [0 0 1 0] [0 0 0 1e0]", "a.srt", "Transform matrix"},
    };
    for (Row const& row : rows) {
        std::string const kind = "<p class=\"kind\">" + std::string(row.kind) + "</p>";
        EXPECT_THAT(page({folder.write(row.name, row.bytes)}), HasSubstr(kind)) << row.name;
        bool const tellsByName = row.bytes == utf16;
        if (!tellsByName) {
            EXPECT_THAT(page({"-"}, row.bytes), HasSubstr(kind)) << row.kind;
        }
    }
}

TEST(ToolReport, WhatComesFromAFileStaysText)
{
    // In XML a name cannot hold control characters: they come in by the other files.
    std::string const hostile = "</title></svg><script>alert(1)</script>\" onload=\"x' &amp;";
    std::string const inXML = "&lt;/title>&lt;/svg>&lt;script>alert(1)&lt;/script>&quot; "
                              "onload=&quot;x' &amp;amp;";
    std::string const raw = hostile + "\x01\x1B\x7F\xC2\x9F\xFF\xC0\xAF\xED\xA0\x80";
    ScratchFolder const folder;
    std::string const files[] = {
        folder.write("<script>\"\x02.vzml",
                     scene("<project name=\"" + inXML + "\"><sequence name=\"" + inXML +
                           "\" frame=\"1 25 1 0\"><group name=\"" + inXML + "\"><clip name=\"" +
                           inXML +
                           "\" start=\"0 1 1 0\"><length>5</length></clip></group>"
                           "<marker time=\"0 1 1 0\">" +
                           inXML + "</marker></sequence></project>")),
        folder.write("a.srt", "1\n00:00:01,000 --> 00:00:09,000\n" + raw +
                                  "\n\nx\n2\n00:00:02,000 --> 00:00:09,000\n" + raw + "\n"),
        folder.write("a.cube", "TITLE \"" + raw.substr(0, raw.find('"')) +
                                   "\x01\xFF\"\nLUT_1D_SIZE 2\n0 0 0\n1 1 1\n"),
        folder.write("a.mp4", atom("ftyp", "isom") + atom("<\"&'", "x") + atom("\x01\xFF<b", "x")),
    };
    for (std::string const& file : files) {
        std::string const html = page({file});
        EXPECT_THAT(html, AllOf(Not(HasSubstr("<script")), Not(HasSubstr("\" onload")),
                                Not(HasSubstr("<\"")), Not(HasSubstr("<b</"))))
            << file;
        EXPECT_FALSE(KVString::fromUTF8(html).isNull()) << file;
        EXPECT_TRUE(std::none_of(html.begin(), html.end(), [](char c) {
            return (static_cast<unsigned char>(c) < ' ' && c != '\n') || c == 0x7F;
        })) << file;
    }
    EXPECT_THAT(page({files[0]}), HasSubstr("&lt;script&gt;alert(1)&lt;/script&gt;&quot; onload="));
}

TEST(ToolReport, LargeFilesMakePagesOfBoundedSize)
{
    constexpr int many = 100000;
    ScratchFolder const folder;
    auto const clip = [](int i) {
        return "<clip start=\"" + std::to_string(i) + " 25 1 0\" track=\"" +
               std::to_string(i % 40) + "\"><length>" + std::to_string(i % 90) + "</length></clip>";
    };
    auto const caption = [](int i) {
        std::string const second = std::to_string(i % 10);
        return std::to_string(i + 1) + "\n00:00:0" + second + ",000 --> 00:59:0" + second +
               ",500\nText\n\n";
    };
    struct Row {
        std::string bytes;
        char const* more;
    } const rows[] = {
        {scene("<sequence frame=\"1 25 1 0\">" + repeated(many, clip) + "</sequence>"),
         "and 99\u202F600 more clips"},
        {scene(repeated(many, [](int) { return "<group>"; }) +
               repeated(many, [](int) { return "</group>"; })),
         "and 99\u202F960 more elements inside"},
        {scene(
             repeated(many, [](int) { return "<sequence><clip start=\"0 1 1 0\"/></sequence>"; })),
         "and 99\u202F992 more sequences"},
        {scene("<note>" + std::string(10'000'000, 'x') + "</note>"), "\u2026"},
        {repeated(many, caption), "and 99\u202F600 more captions"},
        {atom("ftyp", "isom") + atom("moov", repeated(many, [](int) { return atom("free"); })),
         "and 99\u202F602 more atoms"},
    };
    for (Row const& row : rows) {
        std::string const html = page({folder.write("large", row.bytes)});
        EXPECT_THAT(html, HasSubstr(row.more));
        EXPECT_LT(html.size(), 4'000'000U) << row.more;
    }
}

TEST(ToolReport, FailuresNameTheFileAndTheReason)
{
    ScratchFolder const folder;
    folder.write("out.html", "kept");
    struct Row {
        char const* name;
        std::string bytes;
        char const* reason;
    } const rows[] = {
        {"empty.srt", "", ": the file is empty"},
        {"noise",
         std::string("\x7F"
                     "ELF\2\1\1\0\0\0",
                     10),
         ": is neither a scene, captions, a LUT, a movie nor a matrix"},
        {"bad.vzml", "<vzml><clip>", ":1: "},
        {"bad.srt", "nothing here", ": holds no caption that can be made out"},
        {"bad.cube", "LUT_3D_SIZE 2\n0 0 0\n", ":3: the data end after 1 row"},
        {"bad.txt", "1 2 3", ":1: number 4 is missing"},
        {"bad.mov", "plain text", ": is no QuickTime or MP4 file"},
    };
    for (Row const& row : rows) {
        std::string const path = folder.write(row.name, row.bytes);
        ToolResult const result = runTool({"report", path, "-o", folder.path("out.html")});
        EXPECT_EQ(result.exitCode, 3) << row.name;
        EXPECT_THAT(result.messages, HasSubstr("korvane: " + path + row.reason));
    }
    EXPECT_EQ(folder.read("out.html"), "kept");
    ToolResult const piped = runTool({"report", "-", "-o", "-"}, scene("<clip>"));
    EXPECT_EQ(piped.exitCode, 3);
    EXPECT_THAT(piped.messages, HasSubstr("korvane: standard input:1: "));
    EXPECT_THAT(piped.out, IsEmpty());

    std::string const matrix = data + "camera.txt";
    EXPECT_EQ(runTool({"report", folder.path("missing"), "-o", "-"}).exitCode, 4);
    EXPECT_EQ(runTool({"report", matrix, "-o", "/dev/full"}).exitCode, 4);
    EXPECT_EQ(runTool({"report", original, "--before", folder.path("x"), "-o", "-"}).exitCode, 4);
    EXPECT_EQ(runTool({"report", matrix, "--before", original, "-o", "-"}).exitCode, 2);
    EXPECT_EQ(runTool({"report", "-", "-", "-o", "-"}).exitCode, 2);
    EXPECT_EQ(runTool({"report", original, "-", "--before", "-", "-o", "-"}).exitCode, 2);
    EXPECT_EQ(runTool({"report", matrix}).exitCode, 2);
    std::string const input = folder.write("input", scene(""));
    EXPECT_EQ(runTool({"report", input, "-o", input}).exitCode, 2);
    EXPECT_EQ(folder.read("input"), scene(""));
    // What is wrong with the original is told under the original's name.
    ToolResult const noOriginal = runTool({"report", original, "--before", "-", "-o", "-"}, "x");
    EXPECT_EQ(noOriginal.exitCode, 3);
    EXPECT_EQ(noOriginal.messages, "korvane: standard input: is no QuickTime or MP4 file\n");
}

// --- In a browser ---

namespace {

/// Opens a page, as wide as a phone and as wide as a desk, in headless Chromium. Answers what it
/// found: what it says on its console, pictures without extent, texts that leave them, labels that
/// overlap, a page that scrolls sideways.
std::string faultsInBrowser(std::string const& html)
{
    std::string quoted;
    for (char const c : html)
        quoted += c == '&' ? "&amp;" : c == '"' ? "&quot;" : std::string(1, c);
    std::string frames;
    for (char const* width : {"390", "1280"})
        frames += "<iframe width=\"" + std::string(width) + "\" height=\"800\" srcdoc=\"" + quoted +
                  "\"></iframe>";
    // The frames have the page's own policy, so nothing but this script runs.
    char const* const script = R"(<script>
onload = () => {
  const faults = [];
  let pictures = 0;
  for (const frame of document.querySelectorAll('iframe')) {
    const page = frame.contentDocument, wide = page.documentElement;
    if (wide.scrollWidth > wide.clientWidth)
      faults.push(wide.scrollWidth + ' pixels wide at ' + wide.clientWidth);
    for (const svg of page.querySelectorAll('svg')) {
      const box = svg.getBBox();
      ++pictures;
      if (!(box.width > 0 && box.height > 0)) faults.push('an empty picture');
      const right = svg.getBoundingClientRect().right + 1;
      let line = NaN, end = 0;
      for (const text of svg.querySelectorAll('text')) {
        const label = text.getBoundingClientRect();
        if (label.right > right) faults.push('cut text ' + text.textContent);
        if (!text.classList.contains('soft')) continue;
        if (label.y === line && label.x < end) faults.push('overlap of ' + text.textContent);
        line = label.y;
        end = label.right;
      }
    }
    for (const id of page.querySelectorAll('[aria-labelledby]'))
      for (const name of id.getAttribute('aria-labelledby').split(' '))
        if (page.querySelectorAll('#' + name).length !== 1) faults.push('id ' + name);
  }
  document.body.innerHTML = '<p>MEASURED ' + pictures + ' END ' + faults.join('; ') + '</p>';
};
</script>)";
    ScratchFolder const folder;
    std::string const path = folder.write(
        "page.html", "<!DOCTYPE html><meta charset=\"utf-8\"><body>" + frames + script);
    ToolResult const result = runShell(
        "timeout 50 chromium --headless --no-sandbox --disable-gpu --disable-quic --no-first-run "
        "--disable-background-networking --disable-component-update --disable-sync "
        "--disable-dev-shm-usage --enable-logging=stderr --user-data-dir='" +
        folder.path("profile") + "' --dump-dom 'file://" + path + "'");
    std::string const start = "MEASURED ", middle = " END ";
    std::size_t const at = result.out.find(start), end = result.out.find(middle);
    if (at == result.out.npos || end == result.out.npos)
        return "the browser failed: " + result.messages;
    std::string faults;
    if (result.out.compare(at + start.size(), 2, "0 ") == 0)
        faults += "no picture; ";
    faults +=
        result.out.substr(end + middle.size(), result.out.find("</p>", end) - end - middle.size());
    if (std::size_t const line = result.messages.find("CONSOLE"); line != std::string::npos)
        faults += " console: " + result.messages.substr(line, 200);
    return faults;
}

} // namespace

TEST(ToolReport, ABrowserShowsAllPicturesAndSaysNothing)
{
    if (runShell("command -v chromium").exitCode != 0)
        GTEST_SKIP() << "chromium is not installed";
    ScratchFolder const folder;
    std::string const wide = folder.write("wide.srt", "1\n00:00:00,000 --> 9999:00:00,000\n" +
                                                          std::string(300, 'W') + "\n");
    EXPECT_EQ(faultsInBrowser(page({data + "showreel.vzml", folder.write("over.srt", overlapping),
                                    wide, changedMovie(folder), data + "warm-evening.cube",
                                    KORVANE_TEST_DATA "/lut/opencolorio-1d.cube",
                                    data + "camera.txt", "--before", original})),
              "");
    // The check itself sees what it is to see.
    EXPECT_THAT(
        faultsInBrowser("<!DOCTYPE html><p style=\"width:2000px\">wide</p><svg></svg><svg>"
                        "<text y=\"9\" class=\"soft\">a</text><text y=\"9\" class=\"soft\">b"
                        "</text><text x=\"299\" y=\"20\">long</text></svg>"
                        "<script>console.log('heard')</script>"),
        AllOf(HasSubstr("pixels wide at 390"), HasSubstr("an empty picture"),
              HasSubstr("overlap of b"), HasSubstr("cut text long"), HasSubstr("heard")));
}

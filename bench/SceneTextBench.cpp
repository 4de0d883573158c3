// A document of 20 MB in text form, written and read: nested elements with five attributes each, an
// element with a value among them. What the peers do for the same bytes stands beside it.

#include "SceneDocument.h"

#include <benchmark/benchmark.h>

#include <libxml/xmlreader.h>
#include <libxml/xmlwriter.h>
#ifdef HAVE_PUGIXML
#include <pugixml.hpp>
#endif

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <string>
#include <vector>

#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

namespace {

/// In memory, where there is such a place: the disk is not what is measured.
std::string temporaryPath()
{
    std::filesystem::path const memory = "/dev/shm";
    std::filesystem::path const folder =
        std::filesystem::is_directory(memory) ? memory : std::filesystem::temp_directory_path();
    return folder / ("korvane-bench-" + std::to_string(getpid()) + ".vzml");
}

void writeOurs(KVStream& bytes, std::size_t size)
{
    KVXMLWriteStream stream(bytes, 5, 10);
    writeClips(stream, [&] { return bytes.getPos() >= size; });
}

/// The document that the reading benchmarks read.
std::string const& document()
{
    static std::string const text = [] {
        KVBufferWriteStream bytes(1 << 20, 1 << 20);
        writeOurs(bytes, documentSize);
        return std::string(reinterpret_cast<char const*>(bytes.getBuffer()), bytes.getBufferSize());
    }();
    return text;
}

void countBytes(benchmark::State& state, std::size_t bytes)
{
    state.SetBytesProcessed(static_cast<std::int64_t>(bytes) * state.iterations());
}

/// Reads the file back and compares it with the document.
void checkWritten(benchmark::State& state, std::string const& path)
{
    std::ifstream file(path, std::ios::binary);
    std::string const text((std::istreambuf_iterator<char>(file)), {});
    if (text != document())
        state.SkipWithError("the bytes differ");
    std::filesystem::remove(path);
}

// --- Writing ---

void writeText(benchmark::State& state)
{
    std::string const path = temporaryPath();
    KVURL const url(path.c_str());
    for (auto _ : state) {
        KVFileWriteStream file(url);
        writeOurs(file, documentSize);
        file.close();
    }
    countBytes(state, documentSize);
    checkWritten(state, path);
}
BENCHMARK(writeText)->Name("SceneTextWrite/ours")->Unit(benchmark::kMillisecond);

/// Text with its special characters replaced, as a careful program that prints would do it.
std::string escaped(std::string const& text)
{
    std::string out;
    for (char const c : text) {
        switch (c) {
        case '&':
            out += "&amp;";
            break;
        case '<':
            out += "&lt;";
            break;
        case '>':
            out += "&gt;";
            break;
        case '"':
            out += "&quot;";
            break;
        default:
            out += c;
        }
    }
    return out;
}

/// One call for each tag, tabs included.
void writePrintf(benchmark::State& state)
{
    static char const tabs[] = "\t\t\t\t\t\t\t\t\t\t\t\t";
    std::string const path = temporaryPath();
    for (auto _ : state) {
        std::FILE* const file = std::fopen(path.c_str(), "wb");
        std::size_t size = 0;
        auto const count = [&size](int printed) { size += static_cast<std::size_t>(printed); };
        count(std::fprintf(file,
                           "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<!DOCTYPE vzxmlscene>\n"
                           "<vzml version=\"%d.%d\">\n\n",
                           5, 10));
        int level = 0;
        nest(
            [&](Clip const& clip) {
                count(std::fprintf(file,
                                   "%.*s<clip name=\"%s\" id=\"%llu\" start=\"%lld %d %x %lld\" "
                                   "gain=\"%.10g\" enabled=\"%d\">\n",
                                   level, tabs, escaped(clip.name).c_str(), clip.id,
                                   static_cast<long long>(clip.start.value), clip.start.timescale,
                                   clip.start.flags, static_cast<long long>(clip.start.epoch),
                                   static_cast<double>(clip.gain), clip.enabled));
                ++level;
                count(std::fprintf(file, "%.*s<opacity>%.17lg</opacity>\n", level, tabs,
                                   clip.opacity));
            },
            [&] {
                --level;
                count(std::fprintf(file, "%.*s</clip>\n", level, tabs));
            },
            [&] { return size >= documentSize; });
        std::fprintf(file, "\n</vzml>\n");
        std::fclose(file);
    }
    countBytes(state, documentSize);
    checkWritten(state, path);
}
BENCHMARK(writePrintf)->Name("SceneTextWrite/peer:fprintf")->Unit(benchmark::kMillisecond);

xmlChar const* xml(char const* text)
{
    return reinterpret_cast<xmlChar const*>(text);
}

/// libxml2's writer does not lay lines out in our way, so its bytes differ a little.
void writeLibxml2(benchmark::State& state)
{
    std::string const path = temporaryPath();
    for (auto _ : state) {
        xmlTextWriterPtr const writer = xmlNewTextWriterFilename(path.c_str(), 0);
        xmlTextWriterSetIndent(writer, 1);
        xmlTextWriterSetIndentString(writer, xml("\t"));
        xmlTextWriterStartDocument(writer, nullptr, "UTF-8", nullptr);
        int size = xmlTextWriterStartElement(writer, xml("vzml"));
        nest(
            [&](Clip const& clip) {
                size += xmlTextWriterStartElement(writer, xml("clip"));
                size += xmlTextWriterWriteAttribute(writer, xml("name"), xml(clip.name.c_str()));
                size += xmlTextWriterWriteFormatAttribute(writer, xml("id"), "%llu", clip.id);
                size += xmlTextWriterWriteFormatAttribute(writer, xml("start"), "%lld %d %x %lld",
                                                          static_cast<long long>(clip.start.value),
                                                          clip.start.timescale, clip.start.flags,
                                                          static_cast<long long>(clip.start.epoch));
                size += xmlTextWriterWriteFormatAttribute(writer, xml("gain"), "%.10g",
                                                          static_cast<double>(clip.gain));
                size +=
                    xmlTextWriterWriteFormatAttribute(writer, xml("enabled"), "%d", clip.enabled);
                size +=
                    xmlTextWriterWriteFormatElement(writer, xml("opacity"), "%.17lg", clip.opacity);
            },
            [&] { size += xmlTextWriterEndElement(writer); },
            [&] { return static_cast<std::size_t>(size) >= documentSize; });
        xmlTextWriterEndDocument(writer);
        xmlFreeTextWriter(writer);
    }
    countBytes(state, documentSize);
    std::filesystem::remove(path);
}
BENCHMARK(writeLibxml2)->Name("SceneTextWrite/peer:libxml2")->Unit(benchmark::kMillisecond);

// --- Reading ---

std::size_t elementsOfDocument()
{
    std::size_t count = 0;
    for (std::size_t at = 0; (at = document().find("<clip ", at)) != std::string::npos; ++at)
        ++count;
    return count;
}

void readText(benchmark::State& state)
{
    std::string const& text = document();
    std::size_t const expected = 6 * elementsOfDocument();
    for (auto _ : state) {
        KVXMLReadStream stream(text.data(), static_cast<int>(text.size()));
        Taker taker;
        stream.pushHandler(&taker);
        if (!stream.parse() || taker.taken != expected)
            state.SkipWithError("not all was read");
    }
    countBytes(state, text.size());
}
BENCHMARK(readText)->Name("SceneTextRead/ours")->Unit(benchmark::kMillisecond);

/// The reader by itself: every node, and the text of every attribute and value.
void readLibxml2(benchmark::State& state)
{
    std::string const& text = document();
    for (auto _ : state) {
        xmlTextReaderPtr const reader = xmlReaderForMemory(
            text.data(), static_cast<int>(text.size()), nullptr, nullptr, XML_PARSE_HUGE);
        std::size_t sum = 0;
        while (xmlTextReaderRead(reader) == 1) {
            switch (xmlTextReaderNodeType(reader)) {
            case XML_READER_TYPE_ELEMENT:
                sum += *xmlTextReaderConstName(reader);
                while (xmlTextReaderMoveToNextAttribute(reader) == 1)
                    sum += *xmlTextReaderConstName(reader) + *xmlTextReaderConstValue(reader);
                break;
            case XML_READER_TYPE_TEXT:
            case XML_READER_TYPE_SIGNIFICANT_WHITESPACE:
                sum += *xmlTextReaderConstValue(reader);
                break;
            default:
                break;
            }
        }
        benchmark::DoNotOptimize(sum);
        xmlFreeTextReader(reader);
    }
    countBytes(state, text.size());
}
BENCHMARK(readLibxml2)->Name("SceneTextRead/peer:libxml2")->Unit(benchmark::kMillisecond);

#ifdef HAVE_PUGIXML
/// Builds a whole tree in memory, and then reads the numbers.
void readPugixml(benchmark::State& state)
{
    std::string const& text = document();
    for (auto _ : state) {
        pugi::xml_document tree;
        tree.load_buffer(text.data(), text.size());
        double sum = 0;
        auto const visit = [&sum](auto const& self, pugi::xml_node node) -> void {
            for (pugi::xml_node child : node.children()) {
                if (child.type() != pugi::node_element)
                    continue;
                sum += static_cast<double>(child.attribute("id").as_ullong()) +
                       *child.attribute("name").value() + *child.attribute("start").value() +
                       static_cast<double>(child.attribute("gain").as_float()) +
                       child.attribute("enabled").as_int() + child.text().as_double();
                self(self, child);
            }
        };
        visit(visit, tree);
        benchmark::DoNotOptimize(sum);
    }
    countBytes(state, text.size());
}
BENCHMARK(readPugixml)->Name("SceneTextRead/peer:pugixml")->Unit(benchmark::kMillisecond);
#endif

// --- Memory ---

long peakKB()
{
    rusage usage;
    getrusage(RUSAGE_SELF, &usage);
    return usage.ru_maxrss;
}

/// How much a process of its own grows while it reads a document of that size from a file.
double grownByReading(std::size_t size)
{
    std::string const path = temporaryPath();
    {
        KVFileWriteStream file((KVURL(path.c_str())));
        writeOurs(file, size);
        file.close();
    }
    int pipes[2];
    if (pipe(pipes) != 0)
        std::abort();
    pid_t const child = fork();
    if (child == 0) {
        // The peak starts anew at what is in use now.
        std::ofstream("/proc/self/clear_refs") << 5;
        long const before = peakKB();
        KVXMLReadStream stream((KVURL(path.c_str())));
        Taker taker;
        stream.pushHandler(&taker);
        long const grown = stream.parse() ? peakKB() - before : -1;
        _exit(write(pipes[1], &grown, sizeof grown) == sizeof grown ? 0 : 1);
    }
    long grown = -1;
    if (read(pipes[0], &grown, sizeof grown) != sizeof grown)
        grown = -1;
    close(pipes[0]);
    close(pipes[1]);
    waitpid(child, nullptr, 0);
    std::filesystem::remove(path);
    return grown < 0 ? -1 : static_cast<double>(grown) * 1024;
}

void readMemory(benchmark::State& state)
{
    double small = 0, large = 0;
    for (auto _ : state) {
        small = grownByReading(10'000'000);
        large = grownByReading(100'000'000);
    }
    if (small < 0 || large < 0)
        state.SkipWithError("the document could not be read");
    state.counters["of10MB"] = small;
    state.counters["of100MB"] = large;
}
BENCHMARK(readMemory)->Name("SceneTextMemory/ours")->Iterations(1)->UseRealTime();

} // namespace

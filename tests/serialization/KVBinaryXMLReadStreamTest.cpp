#include "SerializationSupport.h"

#include <support/Allocations.h>

#include <ctime>
#include <limits>
#include <map>

using namespace std::string_literals;

namespace {

KVScope scope[] = {
    {"scene", 1, 0}, {"name", 1, 2}, {"node", 2, 0},
    {"name", 2, 2},  {"leaf", 3, 0}, {nullptr, 0, 0},
};

std::string const header("VZBML 5.10\0", 11);

struct SceneRecorder : Recorder {
    explicit SceneRecorder(std::vector<unsigned> leaves = {}) : Recorder(scope, std::move(leaves))
    {}
};

std::string littleEndian(std::uint32_t number)
{
    return {static_cast<char>(number), static_cast<char>(number >> 8),
            static_cast<char>(number >> 16), static_cast<char>(number >> 24)};
}

std::string element(std::string const& token, std::string const& inside)
{
    return token + littleEndian(static_cast<std::uint32_t>(inside.size())) + inside;
}

/// Parses a document of these bytes, from memory.
bool parse(std::string_view bytes, Recorder& recorder)
{
    KVBufferReadStream memory(bytes.data(), bytes.size());
    KVBinaryXMLReadStream stream(memory);
    stream.pushHandler(&recorder);
    return stream.parse();
}

} // namespace

TEST(KVBinaryXMLReadStream, ReadsTheHeader)
{
    struct Row {
        std::string bytes;
        bool whole;
        unsigned int major, minor;
        long elements = 0;
    } const rows[] = {
        {header + element("\1", "\0"s), true, 5, 10, 1},
        {"VZBML 5.10", true, 5, 10}, // the end of the stream in place of the zero
        {"VZBML"s, true, 0, 0},
        {"VZBML\0"s + element("\1", "\0"s), true, 0, 0, 1},
        {"VZBML3.4x\0"s, true, 3, 4},
        {"VZBML 7.\0"s, true, 7, 0},
        {"VZBML -1.4294967298\0"s, true, 0xFFFFFFFFu, 2},
        {"VZBML 99999999999999999999.1\0"s, true, 0, 0},
        // 32 bytes without a zero; the first element follows at once.
        {"VZBML 5.10                      " + element("\1", "\0"s), true, 5, 10, 1},
        {"VZBM", false, 0, 0},
        {"vzbml 5.10\0"s, false, 0, 0},
        {"<?xml version=\"1.0\"?>", false, 0, 0},
    };
    for (Row const& row : rows) {
        KVBufferReadStream memory(row.bytes.data(), row.bytes.size());
        KVBinaryXMLReadStream stream(memory);
        SceneRecorder recorder;
        stream.pushHandler(&recorder);
        SCOPED_TRACE(row.bytes);
        EXPECT_EQ(stream.parse(), row.whole);
        EXPECT_EQ(stream.versionMajor(), row.major);
        EXPECT_EQ(stream.versionMinor(), row.minor);
        EXPECT_EQ(recorder.count, row.elements);
    }
}

TEST(KVBinaryXMLReadStream, TellsEventsInOrder)
{
    // <scene name=7> "a" <node name="n"/> "b" <?/> <node> <leaf> 1 2 </leaf> </node> </scene>
    // <leaf/>
    std::string const bytes =
        header +
        element("\1", "\1\2\x08\7\x2B\1a" + ("\0"s + element("\2", "\1\2\x2B\1n")) + "\x2B\1b" +
                          ("\0"s + element("\x55", "\0\0\xFF"s)) +
                          ("\0"s + element("\2", "\0\0"s + element("\3", "\0\x81\x08\2"s)))) +
        element("\3", "\0"s);
    SceneRecorder recorder;
    EXPECT_TRUE(parse(bytes, recorder));
    // The scene is told when its first child starts, with the text so far, and ends last.
    EXPECT_EQ(recorder.log,
              "(scene@2=7:a (node@2=n ()node node (leaf:2 ()leaf )node )scene leaf ()leaf ");
}

TEST(KVBinaryXMLReadStream, KeepsValuesByTheirTags)
{
    struct Row {
        std::string value;
        unsigned int kind;
        std::string text;
    } const rows[] = {
        {"\x80", 1, "0"},
        {"\x08\xFF", 1, "255"},
        {"\x0F\xFF\xFF\xFF\xFF\xFF\xFF\xFF\xFF", 1, "18446744073709551615"},
        // Magnitudes of up to four bytes are cut to an int: a long long that needs the 32nd bit is
        // not given back.
        {"\x1B\x00\x00\x00\x80"s, 0, "-2147483648"},
        {"\x1B\x01\x00\x00\x80"s, 0, "2147483647"},
        {"\x1B\xFF\xFF\xFF\xFF"s, 0, "1"},
        // What the lowest int is written as.
        {"\x1F\x00\x00\x00\x80\xFF\xFF\xFF\xFF"s, 0, "2147483648"},
        {"\x1F\x00\x00\x00\x00\x00\x00\x00\x80"s, 0, "-9223372036854775808"},
        {"\x28\0\0\0\x3F"s, 2, "0.5"},
        {"\x29\0\0\0\0\0\0\xE0\x3F"s, 3, "0.5"},
        {"\x2A\1\0\0\0\2\0\0\0\3\0\0\0\xFF\xFF\xFF\xFF"s, 6, "000000010000000200000003ffffffff"},
        {"\x2B\3\xC3\xA9z", 5, "éz"},
        {"\x2B\3a\0b"s, 5, "a"}, // a text ends at a zero
        {"\x2B\2\xC3z", 5, ""},  // no UTF-8
        {"\x32\x04\x01\x58\x02\x01\x00"s, 4, "1 600 1 0"},
        {"\x32\xFF\xFE\xFF\xFF\xFF\xFF\xFF\xFF\xFF\xFF\xFF\xFF\xFF\1\0\0\0\0\0\0\0\0\0\0\x80"s, 4,
         "-2 -1 1 -9223372036854775808"},
    };
    for (Row const& row : rows) {
        SceneRecorder recorder;
        unsigned int kind = 9;
        recorder.onElement = [&](auto&, KVStreamElement& e) {
            kind = dynamic_cast<KVBinaryXMLStreamElement&>(e).content().kind();
            EXPECT_FALSE(e.isXMLStreamElement());
        };
        auto const index = &row - rows;
        EXPECT_TRUE(parse(header + element("\3", "\0"s + row.value), recorder)) << index;
        EXPECT_EQ(kind, row.kind) << index;
        EXPECT_EQ(recorder.log, "(leaf" + (row.text.empty() ? "" : ":" + row.text) + " ()leaf ")
            << index;

        SceneRecorder attribute;
        EXPECT_TRUE(parse(header + element("\1", "\1\2" + row.value), attribute)) << index;
        EXPECT_EQ(attribute.log, "(scene@2=" + row.text + " ()scene ") << index;
    }
}

TEST(KVBinaryXMLReadStream, PassesOverUnknownTags)
{
    SceneRecorder recorder;
    // In a body the next byte is a new tag; an attribute of such a tag uses up one of the count.
    EXPECT_TRUE(
        parse(header + element("\1", "\2\2\x81\2\x33\x82\x34\x10\x07\x08\5\xFF"), recorder));
    EXPECT_EQ(recorder.log, "(scene@2=1:5 ()scene ");
    // An empty string attribute is not counted by the writer: its token, tag and length are then
    // taken for the body.
    SceneRecorder empty;
    EXPECT_TRUE(parse(header + element("\1", "\1\2\x81\2\x2B\0"s), empty));
    EXPECT_EQ(empty.log, "(scene@2=1 ()scene ");
}

TEST(KVBinaryXMLReadStream, KeepsAllAttributes)
{
    std::string inside = "\x0B";
    for (int i = 1; i <= 10; ++i)
        inside += std::string{static_cast<char>(i), 8, static_cast<char>(100 + i)};
    inside += "\4\x08\7"; // the last value of a token counts
    SceneRecorder recorder;
    recorder.onElement = [&](auto&, KVStreamElement& e) {
        using E = KVStreamElement;
        for (int i = 1; i <= 10; ++i)
            EXPECT_EQ(got<int>(e, &E::getAttributeAsInt32, i),
                      std::pair(true, i == 4 ? 7 : 100 + i));
        EXPECT_FALSE(got<bool>(e, &E::getAttributeAsBool, 11).first);
        EXPECT_FALSE(got<double>(e, &E::getAttributeAsDouble, 11).first);
        EXPECT_FALSE(got<unsigned>(e, &E::getAttributeAsUInt32, 11).first);
        EXPECT_EQ(e.getAttributeAsUUID(11), nullptr);
    };
    EXPECT_TRUE(parse(header + element("\1", inside), recorder));
    EXPECT_EQ(recorder.count, 1);
}

TEST(KVBinaryXMLReadStream, ReadsBackWhatIsWritten)
{
    constexpr int lowest = std::numeric_limits<int>::min();
    std::string const longText(200000, 'x'); // longer than the reader's window
    KVBufferWriteStream bytes(0, 4096);
    KVBinaryXMLWriteStream out(bytes, 1, 2);
    out.pushScope(scope);
    out.startElement(1);
    out.writeAttribute(2, lowest);
    out.writeValue(KVString(longText));
    out.endElement();
    SceneRecorder recorder;
    recorder.onElement = [&](auto&, KVStreamElement& e) {
        using E = KVStreamElement;
        EXPECT_EQ(got<int>(e, &E::getAttributeAsInt32, 2), std::pair(true, lowest));
        EXPECT_EQ(got<long long>(e, &E::getAttributeAsInt64, 2), std::pair(true, 2147483648LL))
            << "as 64 bits the lowest int loses its sign";
    };
    EXPECT_TRUE(parse(textOf(bytes), recorder));
    EXPECT_EQ(recorder.log, "(scene@2=2147483648:" + longText + " ()scene ");
}

// Meant: a whole double goes out as an integer, and a negative one of up to four bytes is read as
// an int.
TEST(KVBinaryXMLReadStream, CutsWholeNegativeDoubles)
{
    KVBufferWriteStream bytes(0, 4096);
    KVBinaryXMLWriteStream out(bytes, 1, 2);
    out.pushScope(scope);
    for (double const value : {-0x1p31, -0x1p31 - 1, -3e9, 1 - 0x1p32, -0x1p32}) {
        out.startElement(3);
        out.writeValue(value);
        out.endElement();
    }
    SceneRecorder recorder;
    std::string read;
    recorder.onElement = [&](auto&, KVStreamElement& e) {
        KVString text;
        e.getAsString(&text);
        read += text.toUTF8() + " ";
    };
    EXPECT_TRUE(parse(textOf(bytes), recorder));
    EXPECT_EQ(read, "-2147483648 2147483647 1294967296 1 -4294967296 ");
}

TEST(KVBinaryXMLReadStream, GivesAnElementsValueAsEveryKind)
{
    SceneRecorder recorder;
    recorder.onElement = [](auto&, KVStreamElement& e) {
        using E = KVStreamElement;
        EXPECT_EQ(got<int>(e, &E::getAsInt32), std::pair(true, -2));
        EXPECT_EQ(got<unsigned>(e, &E::getAsUInt32), std::pair(true, 0xFFFFFFFEu));
        EXPECT_EQ(got<long long>(e, &E::getAsInt64), std::pair(true, -2LL));
        EXPECT_EQ(got<unsigned long long>(e, &E::getAsUInt64), std::pair(true, ~1ULL));
        EXPECT_EQ(got<float>(e, &E::getAsFloat), std::pair(true, -2.0f));
        EXPECT_EQ(got<double>(e, &E::getAsDouble), std::pair(true, -2.0));
        EXPECT_EQ(got<bool>(e, &E::getAsBool), std::pair(true, true));
        EXPECT_EQ(e.getAsUUID(), nullptr);
        CMTime time;
        EXPECT_FALSE(e.getAsVexTime(&time));
    };
    EXPECT_TRUE(parse(header + element("\3", "\0\x18\2"s), recorder));
    EXPECT_EQ(recorder.count, 1);
}

TEST(KVBinaryXMLReadStream, JumpsOverIgnoredElements)
{
    // <scene> <node> <leaf/> "?" </node> <leaf/> </scene>
    std::string const bytes =
        header +
        element("\1", "\0\0"s + element("\2", "\0\0"s + element("\3", "\0"s) + "\x2B\xFF") + "\0"s +
                          element("\3", "\0"s));
    SceneRecorder recorder({1, 2, 3});
    recorder.onElement = [](auto& stream, KVStreamElement& e) {
        if (e.token == 2)
            stream.ignoreElement();
    };
    EXPECT_TRUE(parse(bytes, recorder));
    EXPECT_EQ(recorder.log, "(scene node leaf ");

    // A size that ends in front of what has been read must not send the reader back.
    SceneRecorder backward;
    backward.onElement = [](auto& stream, KVStreamElement& e) {
        if (e.token == 1)
            stream.ignoreElement();
    };
    EXPECT_TRUE(parse(header + "\1\2\0\0\0\2\2\x08\1\2\x08\2"s + element("\3", "\0"s), backward));
    EXPECT_TRUE(backward.log.starts_with("(scene@2=2 ")) << backward.log;
    EXPECT_EQ(backward.count, 2);
}

TEST(KVBinaryXMLReadStream, StopsAndAbortsAtTheNextElement)
{
    std::string const bytes =
        header + element("\1", "\0\0"s + element("\2", "\0\0"s + element("\3", "\0"s))) +
        element("\3", "\0"s);
    for (bool const abort : {false, true}) {
        struct Row {
            long at, count;
            bool open; // what a stop within an element leaves on the stack
        } const rows[] = {
            {1, 1, true},
            {2, 3, false}, // told when the leaf starts, which is then read as well
            {3, 3, false},
        };
        for (Row const& row : rows) {
            KVBufferReadStream memory(bytes.data(), bytes.size());
            KVBinaryXMLReadStream stream(memory);
            SceneRecorder recorder;
            recorder.onElement = [&](auto& s, auto&) {
                if (recorder.count == row.at)
                    abort ? s.abortParse() : s.stopParse();
            };
            stream.pushHandler(&recorder);
            EXPECT_EQ(stream.parse(), !abort);
            EXPECT_EQ(recorder.count, row.count);
            EXPECT_EQ(stream.parseElement(), abort ? -1 : 0);
            EXPECT_EQ(stream.currentElement() != nullptr, row.open);
        }
    }
}

TEST(KVBinaryXMLReadStream, ReadsElementsOneByOne)
{
    std::string const bytes = "xx" + element("\1", "\0\x81"s) + element("\3", "\0"s) + "\3";
    KVBufferReadStream memory(bytes.data(), bytes.size());
    memory.setPos(2);
    KVBinaryXMLReadStream stream(memory);
    SceneRecorder recorder;
    stream.pushHandler(&recorder);
    EXPECT_EQ(stream.parseElement(), 1);
    EXPECT_EQ(memory.getPos(), 9u); // nothing is left read ahead
    EXPECT_EQ(stream.parseElement(), 1);
    EXPECT_EQ(stream.parseElement(), -1);
    EXPECT_EQ(recorder.log, "(scene:1 ()scene leaf ()leaf ");
}

TEST(KVBinaryXMLReadStream, DecodesFromAnyStream)
{
    struct Row {
        std::string bytes;
        bool whole;
        unsigned int value;
    } const rows[] = {
        {"\x80\1", true, 128},
        {"\xFF\xFF\xFF\xFF\x0F", true, 0xFFFFFFFFu},
        {"\xFF\xFF\xFF\xFF\x7F", true, 0xFFFFFFFFu}, // only 32 bits are kept
        {"\xFF\xFF\xFF\xFF\xFF\0"s, false, 0},
        {"\x80", false, 0},
        {"", false, 0},
    };
    for (Row const& row : rows) {
        KVBufferReadStream memory(row.bytes.data(), row.bytes.size());
        unsigned int value = 0;
        EXPECT_EQ(KVBinaryXMLReadStream::readVarInt(memory, &value), row.whole);
        EXPECT_EQ(value, row.value);
    }

    struct IntRow {
        int tag;
        bool answer;
        long long int64;
        unsigned int uint32;
        unsigned long long taken;
    } const intRows[] = {
        {129, true, 1, 1, 0},
        {7, true, 0, 0, 0},
        {9, true, 0x201, 0x201, 2},
        {25, true, -0x201, 0xFFFFFDFFu, 2}, // without a sign: the pattern of two's complement
        {31, true, -0x0807060504030201, 0xFBFCFDFFu, 8},
        {32, false, 77, 77, 0}, // would be 25 bytes
        {130, false, 77, 77, 0},
    };
    for (IntRow const& row : intRows) {
        KVBufferReadStream memory("\1\2\3\4\5\6\7\x08", 8);
        auto const read = [&](auto* number) {
            memory.setPos(0);
            EXPECT_EQ(KVBinaryXMLReadStream::readInt(memory, row.tag, number), row.answer)
                << row.tag;
            EXPECT_EQ(memory.getPos(), row.taken) << row.tag;
            return *number;
        };
        long long int64 = 77;
        unsigned int uint32 = 77;
        EXPECT_EQ(read(&int64), row.int64) << row.tag;
        EXPECT_EQ(read(&uint32), row.uint32) << row.tag;
    }
    KVBufferReadStream two("\1\2", 2);
    long long value = 77;
    EXPECT_FALSE(KVBinaryXMLReadStream::readInt(two, 10, &value));
    CMTime time;
    EXPECT_FALSE(KVBinaryXMLReadStream::readVextime(two, &time));
}

TEST(KVBinaryXMLReadStream, ReadsFromFiles)
{
    TemporaryFolder const folder;
    // An unknown element longer than any window stands in between.
    std::string bytes = header + element("\3", "\0\x81"s);
    bytes += element("\x55", std::string(300000, '\xFF'));
    for (int i = 0; i < 30000; ++i)
        bytes += element("\3", "\0\x80"s);
    std::string const path = folder.write("scene", bytes);
    KVFileReadStream file(urlOf(path));
    KVBinaryXMLReadStream stream(file);
    EXPECT_TRUE(stream.getURL() == urlOf(path));
    SceneRecorder recorder;
    stream.pushHandler(&recorder);
    EXPECT_TRUE(stream.parse());
    EXPECT_EQ(recorder.count, 30001);
    EXPECT_EQ(file.getPos(), bytes.size());
}

TEST(KVBinaryXMLReadStream, ReadsAcrossTheEndsOfItsWindow)
{
    std::string const leaf = element("\3", "\2\2\x0E\1\2\3\4\5\6\7\4\x08\7\x2B\3abc"s);
    for (std::size_t shift = 0; shift < leaf.size(); ++shift) {
        std::string const first = element("\x55", std::string(shift, '\xFF'));
        std::string bytes = header + first;
        while (bytes.size() < 140000)
            bytes += leaf;
        SceneRecorder recorder({3});
        long wrong = 0;
        recorder.onElement = [&](auto&, KVStreamElement& e) {
            wrong += got<unsigned long long>(e, &KVStreamElement::getAttributeAsUInt64, 2).second !=
                         0x07060504030201 ||
                     got<int>(e, &KVStreamElement::getAttributeAsInt32, 4).second != 7;
        };
        EXPECT_TRUE(parse(bytes, recorder));
        EXPECT_EQ(recorder.count, (bytes.size() - header.size() - first.size()) / leaf.size());
        EXPECT_EQ(wrong, 0) << shift;
    }
}

// --- Documents that lie ---

namespace {

/// A document with a value of each kind, and the numbers of bytes after which it may be cut without
/// a failure.
struct SmallDocument {
    std::string const leaf = element("\3", "\0\x2B\3abc"s);
    std::string const node =
        element("\2", "\1\2\x08\7\0"s + leaf + "\x29\0\0\0\0\0\0\xE0\x3F"s + "\x28\0\0\0\x3F"s);
    std::string const unknown = element("\x55", "\0\x2B\3abc"s);
    std::string const scene = element("\1", "\2\2\x2B\5title\4\x32\4\1\x58\2\1\0\0"s + node +
                                                "\0"s + unknown + "\x1F\1\1\1\1\1\1\1\1");
    std::string const last = element("\3", "\0\x2A\1\2\3\4\1\2\3\4\1\2\3\4\1\2\3\4"s);
    std::string const bytes = header + scene + last;

    bool mayEndAt(std::size_t length) const
    {
        // In the header behind "VZBML", between top-level elements, and right behind the zero that
        // announces a child.
        return (length >= 5 && length <= header.size()) || length == bytes.find(last) ||
               length == bytes.find(node) || length == bytes.find(leaf) ||
               length == bytes.find(unknown) || length == bytes.size();
    }
};

/// Ten seconds of processor time, for what takes milliseconds if it is not foolish.
class Deadline {
public:
    ~Deadline() { EXPECT_LT(std::clock() - start_, 10 * CLOCKS_PER_SEC); }

private:
    std::clock_t const start_ = std::clock();
};

/// A recorder of a deep document would fill the memory itself.
class Counter : public SceneRecorder {
public:
    bool parseElement(KVSerializerReadStream& stream, KVStreamElement&) override
    {
        ++count;
        return stream.pushHandler(this);
    }
    bool parseEnd(KVSerializerReadStream&) override { return true; }
};

} // namespace

TEST(KVBinaryXMLReadStream, TakesATruncationForAFailureOrAShorterDocument)
{
    SmallDocument const document;
    for (std::size_t length = 0; length <= document.bytes.size(); ++length) {
        SceneRecorder recorder;
        EXPECT_EQ(parse(document.bytes.substr(0, length), recorder), document.mayEndAt(length))
            << length;
        if (length >= document.bytes.find(document.last)) {
            EXPECT_EQ(recorder.count, length < document.bytes.size() ? 3 : 4) << length;
        }
    }
}

TEST(KVBinaryXMLReadStream, SurvivesEveryWrongSize)
{
    Deadline const deadline;
    SmallDocument const document;
    for (std::string const* part :
         {&document.leaf, &document.node, &document.unknown, &document.scene, &document.last}) {
        std::size_t const at = document.bytes.find(*part) + 1;
        for (std::uint32_t size : {0u, 1u, 0x7FFFFFFFu, 0x80000000u, 0xFFFFFFFFu}) {
            std::string bytes = document.bytes;
            bytes.replace(at, 4, littleEndian(size));
            allocations::takeLargest();
            SceneRecorder recorder;
            bool const whole = parse(bytes, recorder);
            EXPECT_LT(allocations::takeLargest(), 100000u);
            // The size of what is passed over may reach beyond the end of the bytes.
            if (size >= 0x7FFFFFFFu) {
                EXPECT_EQ(whole, part == &document.unknown) << size;
            }
        }
    }
}

TEST(KVBinaryXMLReadStream, BelievesNoLengthBeforeTheBytesAreThere)
{
    std::string const huge = "\xFF\xFF\xFF\xFF\x0F";
    struct Row {
        char const* what;
        std::string inside;
    } const rows[] = {
        {"a text of 4 GiB", "\0\x2B"s + huge + "abc"},
        {"a text of 4 GiB with a part of it", "\0\x2B"s + huge + std::string(200000, 'x')},
        {"an attribute of 4 GiB", "\1\2\x2B" + huge + "abc"},
        {"4 billion attributes", huge + "\2\x81\2\x81"},
        {"4 billion attributes of an unknown kind", huge + "\2\x33\2\x33"},
    };
    for (Row const& row : rows) {
        Deadline const deadline;
        std::string const bytes = header + element("\3", row.inside);
        allocations::takeLargest();
        SceneRecorder recorder;
        EXPECT_FALSE(parse(bytes, recorder)) << row.what;
        EXPECT_LT(allocations::takeLargest(), 2 * bytes.size() + 100000) << row.what;
        EXPECT_EQ(recorder.count, 0) << row.what;
    }
}

TEST(KVBinaryXMLReadStream, FollowsAMillionLevels)
{
    constexpr std::uint32_t depth = 1000000;
    for (bool const whole : {false, true}) {
        std::string bytes = header;
        for (std::uint32_t i = depth; i > 0; --i) {
            // Each size is of the count and of what the levels below it take.
            bytes += "\1" + littleEndian(whole ? 7 * i - 6 : 0x7FFFFFFFu) + '\0';
            if (i > 1 || !whole) // or cut right behind the announcement of a child
                bytes += '\0';
        }
        Deadline const deadline; // also for letting go of what is left open
        Counter counter;
        EXPECT_TRUE(parse(bytes, counter));
        EXPECT_EQ(counter.count, depth);
    }
}

TEST(KVBinaryXMLReadStream, AllocatesNothingForIntegers)
{
    auto const allocationsFor = [](int count) {
        KVBufferWriteStream bytes(1 << 20, 1024);
        KVBinaryXMLWriteStream out(bytes, 1, 0);
        out.pushScope(scope);
        out.startElement(3);
        long const before = allocations::count();
        for (int i = 0; i < count; ++i)
            out.writeValue(static_cast<int>(i * 1000003u));
        EXPECT_EQ(allocations::count(), before);
        out.endElement();
        Counter counter;
        long const start = allocations::count();
        EXPECT_TRUE(parse({reinterpret_cast<char const*>(bytes.getBuffer()), bytes.getBufferSize()},
                          counter));
        EXPECT_EQ(counter.count, 1);
        return allocations::count() - start;
    };
    EXPECT_EQ(allocationsFor(10), allocationsFor(100000));
}

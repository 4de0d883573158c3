#include "SerializationSupport.h"

#include <support/Allocations.h>

#include <ctime>
#include <functional>
#include <limits>
#include <map>
#include <memory>

using namespace std::string_literals;

namespace {

KVScope scope[] = {
    {"scene", 1, 0}, {"name", 1, 2}, {"node", 2, 0},
    {"name", 2, 2},  {"leaf", 3, 0}, {nullptr, 0, 0},
};
KVScope wildcard[] = {{"*", 99, 0}, {nullptr, 0, 0}};

std::string const header("VZBML 5.10\0", 11);

/// Notes what it is told, and reads the children of every element.
class Recorder : public KVIgnoreElement {
public:
    explicit Recorder(KVScope* table = scope) : table_(table) {}

    bool parseBegin(KVSerializerReadStream& stream) override
    {
        stream.pushScope(table_);
        return true;
    }
    bool parseEnd(KVSerializerReadStream&) override
    {
        log += "end; ";
        return true;
    }
    bool parseElement(KVSerializerReadStream& stream, KVStreamElement& element) override
    {
        log += std::to_string(element.token);
        KVString text;
        if (element.getAttributeAsString(2, &text))
            log += " name=" + text.toUTF8();
        element.getAsString(&text);
        log += " '" + text.toUTF8() + "'; ";
        ++count;
        if (onElement)
            onElement(stream, element);
        return follow ? stream.pushHandler(this) : true;
    }

    std::string log;
    long count = 0;
    bool follow = true;
    std::function<void(KVSerializerReadStream&, KVStreamElement&)> onElement;

private:
    KVScope* table_;
};

std::string element(std::string const& token, std::string const& inside)
{
    auto const size = static_cast<std::uint32_t>(inside.size());
    return token +
           std::string{static_cast<char>(size), static_cast<char>(size >> 8),
                       static_cast<char>(size >> 16), static_cast<char>(size >> 24)} +
           inside;
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
        {header, true, 5, 10},
        {header + element("\1", "\0"s), true, 5, 10, 1},
        {"VZBML 5.10", true, 5, 10}, // the end of the stream in place of the zero
        {"VZBML"s, true, 0, 0},
        {"VZBML\0"s + element("\1", "\0"s), true, 0, 0, 1},
        {"VZBML3.4x\0"s, true, 3, 4},
        {"VZBML 7\0"s, true, 7, 0},
        {"VZBML 7.\0"s, true, 7, 0},
        {"VZBML -1.4294967298\0"s, true, 0xFFFFFFFFu, 2},
        {"VZBML 99999999999999999999.1\0"s, true, 0, 0},
        // 32 bytes without a zero; the first element follows at once.
        {"VZBML 5.10                      " + element("\1", "\0"s), true, 5, 10, 1},
        {"", false, 0, 0},
        {"VZBM", false, 0, 0},
        {"vzbml 5.10\0"s, false, 0, 0},
        {"<?xml version=\"1.0\"?>", false, 0, 0},
    };
    for (Row const& row : rows) {
        KVBufferReadStream memory(row.bytes.data(), row.bytes.size());
        KVBinaryXMLReadStream stream(memory);
        Recorder recorder;
        stream.pushHandler(&recorder);
        auto const index = &row - rows;
        EXPECT_EQ(stream.parse(), row.whole) << index;
        EXPECT_EQ(stream.versionMajor(), row.major) << index;
        EXPECT_EQ(stream.versionMinor(), row.minor) << index;
        EXPECT_EQ(recorder.count, row.elements) << index;
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
    Recorder recorder;
    EXPECT_TRUE(parse(bytes, recorder));
    // The scene is told when its first child starts, with the text so far, and ends last. The
    // host's own handler stays.
    EXPECT_EQ(recorder.log,
              "1 name=7 'a'; 2 name=n ''; end; 2 ''; 3 '2'; end; end; end; 3 ''; end; ");

    KVBufferReadStream memory(bytes.data(), bytes.size());
    KVBinaryXMLReadStream stream(memory);
    stream.pushHandler(&recorder);
    EXPECT_TRUE(stream.parse());
    EXPECT_EQ(stream.currentHandler(), &recorder);
    EXPECT_EQ(stream.currentElement(), nullptr);
    EXPECT_EQ(memory.getPos(), bytes.size());
}

TEST(KVBinaryXMLReadStream, FindsElementsByTheRowOfTheWildcard)
{
    Recorder recorder(wildcard);
    EXPECT_TRUE(parse(header + element("\5", "\0"s) + element("\x88\x27", "\0"s), recorder));
    EXPECT_EQ(recorder.log, "99 ''; end; 99 ''; end; ");
    // Without a handler nothing is found, and all is passed over.
    std::string const bytes = header + element("\1", "\0"s);
    KVBufferReadStream memory(bytes.data(), bytes.size());
    EXPECT_TRUE(KVBinaryXMLReadStream(memory).parse());
}

TEST(KVBinaryXMLReadStream, KeepsValuesByTheirTags)
{
    struct Row {
        std::string value;
        unsigned int kind;
        std::string text;
    } const rows[] = {
        {"\x80", 1, "0"},
        {"\x81", 1, "1"},
        {"\x08\xFF", 1, "255"},
        {"\x0A\x01\x02\x03", 1, "197121"},
        {"\x0F\xFF\xFF\xFF\xFF\xFF\xFF\xFF\xFF", 1, "18446744073709551615"},
        {"\x18\x01", 0, "-1"},
        {"\x19\x00\x01"s, 0, "-256"},
        // Magnitudes of up to four bytes are cut to an int: a long long that needs the 32nd bit is
        // not given back.
        {"\x1B\x00\x00\x00\x80"s, 0, "-2147483648"},
        {"\x1B\x01\x00\x00\x80"s, 0, "2147483647"},
        {"\x1B\xFF\xFF\xFF\xFF"s, 0, "1"},
        {"\x1C\x00\x00\x00\x00\x01"s, 0, "-4294967296"},
        // What the lowest int is written as.
        {"\x1F\x00\x00\x00\x80\xFF\xFF\xFF\xFF"s, 0, "2147483648"},
        {"\x1F\x00\x00\x00\x00\x00\x00\x00\x80"s, 0, "-9223372036854775808"},
        {"\x28\0\0\0\x3F"s, 2, "0.5"},
        {"\x29\0\0\0\0\0\0\xE0\x3F"s, 3, "0.5"},
        {"\x2A\1\0\0\0\2\0\0\0\3\0\0\0\xFF\xFF\xFF\xFF"s, 6, "000000010000000200000003ffffffff"},
        {"\x2B\0"s, 5, ""},
        {"\x2B\3\xC3\xA9z", 5, "éz"},
        {"\x2B\3a\0b"s, 5, "a"}, // a text ends at a zero
        {"\x2B\2\xC3z", 5, ""},  // no UTF-8
        {"\x32\x04\x01\x58\x02\x01\x00"s, 4, "1 600 1 0"},
        {"\x32\xFF\xFE\xFF\xFF\xFF\xFF\xFF\xFF\xFF\xFF\xFF\xFF\xFF\1\0\0\0\0\0\0\0\0\0\0\x80"s, 4,
         "-2 -1 1 -9223372036854775808"},
    };
    for (Row const& row : rows) {
        Recorder recorder;
        unsigned int kind = 9;
        recorder.onElement = [&](auto&, KVStreamElement& e) {
            kind = dynamic_cast<KVBinaryXMLStreamElement&>(e).content().kind();
            EXPECT_FALSE(e.isXMLStreamElement());
        };
        auto const index = &row - rows;
        EXPECT_TRUE(parse(header + element("\3", "\0"s + row.value), recorder)) << index;
        EXPECT_EQ(kind, row.kind) << index;
        EXPECT_EQ(recorder.log, "3 '" + row.text + "'; end; ") << index;

        Recorder attribute;
        EXPECT_TRUE(parse(header + element("\1", "\1\2" + row.value), attribute)) << index;
        EXPECT_EQ(attribute.log, "1 name=" + row.text + " ''; end; ") << index;
    }
}

TEST(KVBinaryXMLReadStream, PassesOverUnknownTags)
{
    Recorder recorder;
    // In a body the next byte is a new tag; an attribute of such a tag uses up one of the count.
    EXPECT_TRUE(
        parse(header + element("\1", "\2\2\x81\2\x33\x82\x34\x10\x07\x08\5\xFF"), recorder));
    EXPECT_EQ(recorder.log, "1 name=1 '5'; end; ");
    // An empty string attribute is not counted by the writer: its token, tag and length are then
    // taken for the body.
    Recorder empty;
    EXPECT_TRUE(parse(header + element("\1", "\1\2\x81\2\x2B\0"s), empty));
    EXPECT_EQ(empty.log, "1 name=1 ''; end; ");
}

TEST(KVBinaryXMLReadStream, KeepsAllAttributes)
{
    std::string inside = "\x0B";
    for (int i = 1; i <= 10; ++i)
        inside += std::string{static_cast<char>(i), 8, static_cast<char>(100 + i)};
    inside += "\4\x08\7"; // the last value of a token counts
    Recorder recorder;
    std::map<int, int> values;
    recorder.onElement = [&](auto& stream, KVStreamElement& e) {
        for (unsigned int i = 0; i <= 11; ++i)
            if (int value; stream.getAttributeAsInt32(e, i, &value))
                values[static_cast<int>(i)] = value;
        KVString text;
        bool flag;
        CMTime time;
        double number;
        EXPECT_FALSE(e.getAttributeAsString(11, &text));
        EXPECT_FALSE(e.getAttributeAsBool(11, &flag));
        EXPECT_FALSE(e.getAttributeAsVexTime(11, &time));
        EXPECT_FALSE(e.getAttributeAsDouble(11, &number));
        EXPECT_EQ(e.getAttributeAsUUID(11), nullptr);
    };
    EXPECT_TRUE(parse(header + element("\1", inside), recorder));
    EXPECT_EQ(values, (std::map<int, int>{{1, 101},
                                          {2, 102},
                                          {3, 103},
                                          {4, 7},
                                          {5, 105},
                                          {6, 106},
                                          {7, 107},
                                          {8, 108},
                                          {9, 109},
                                          {10, 110}}));
}

TEST(KVBinaryXMLReadStream, ReadsBackWhatIsWritten)
{
    std::string const longText(200000, 'x'); // longer than the reader's window
    CMTime const time{-1, 600, 3, 1LL << 40};
    KVUUID const uuid{{1, 2, 3, 4}};
    KVScope many[] = {{"e", 1, 0}, {"1", 1, 1}, {"2", 1, 2}, {"3", 1, 3}, {"4", 1, 4},
                      {"5", 1, 5}, {"6", 1, 6}, {"7", 1, 7}, {"8", 1, 8}, {nullptr, 0, 0}};
    KVBufferWriteStream bytes(0, 4096);
    KVBinaryXMLWriteStream out(bytes, 1, 2);
    out.pushScope(many);
    out.startElement(1);
    out.writeAttribute(1, std::numeric_limits<int>::min());
    out.writeAttribute(2, std::numeric_limits<unsigned long long>::max());
    out.writeAttribute(3, std::numeric_limits<long long>::min());
    out.writeAttribute(4, 0.1f);
    out.writeAttribute(5, -1e300);
    out.writeAttribute(6, uuid);
    out.writeAttribute(7, time);
    out.writeAttribute(8, KVString("é\U0001F600"));
    out.writeValue(KVString(longText));
    out.endElement();

    Recorder recorder(many);
    recorder.onElement = [&](auto&, KVStreamElement& e) {
        int int32;
        long long int64;
        unsigned long long uint64;
        float single;
        double number;
        CMTime readTime;
        KVString text;
        EXPECT_TRUE(e.getAttributeAsInt32(1, &int32));
        EXPECT_EQ(int32, std::numeric_limits<int>::min());
        EXPECT_TRUE(e.getAttributeAsInt64(1, &int64));
        EXPECT_EQ(int64, 2147483648); // the sign of the lowest int is lost in 64 bits
        EXPECT_TRUE(e.getAttributeAsUInt64(2, &uint64));
        EXPECT_EQ(uint64, std::numeric_limits<unsigned long long>::max());
        EXPECT_TRUE(e.getAttributeAsInt64(3, &int64));
        EXPECT_EQ(int64, std::numeric_limits<long long>::min());
        EXPECT_TRUE(e.getAttributeAsFloat(4, &single));
        EXPECT_EQ(single, 0.1f);
        EXPECT_TRUE(e.getAttributeAsDouble(5, &number));
        EXPECT_EQ(number, -1e300);
        std::unique_ptr<KVUUID> const readUUID(e.getAttributeAsUUID(6));
        ASSERT_TRUE(readUUID);
        EXPECT_TRUE(*readUUID == uuid);
        EXPECT_TRUE(e.getAttributeAsVexTime(7, &readTime));
        EXPECT_EQ(readTime.value, time.value);
        EXPECT_EQ(readTime.epoch, time.epoch);
        EXPECT_TRUE(e.getAttributeAsString(8, &text));
        EXPECT_EQ(text.toUTF8(), "é\U0001F600");
        EXPECT_TRUE(e.getAsString(&text));
        EXPECT_EQ(text.toUTF8(), longText);
    };
    EXPECT_TRUE(parse(textOf(bytes), recorder));
    EXPECT_EQ(recorder.count, 1);
}

TEST(KVBinaryXMLReadStream, JumpsOverIgnoredElements)
{
    // <scene> <node> <leaf/> "?" </node> <leaf/> </scene>
    std::string const bytes =
        header +
        element("\1", "\0\0"s + element("\2", "\0\0"s + element("\3", "\0"s) + "\x2B\xFF") + "\0"s +
                          element("\3", "\0"s));
    Recorder recorder;
    recorder.onElement = [](auto& stream, KVStreamElement& e) {
        if (e.token == 2)
            stream.ignoreElement();
    };
    recorder.follow = false;
    EXPECT_TRUE(parse(bytes, recorder));
    EXPECT_EQ(recorder.log, "1 ''; 2 ''; 3 ''; ");

    // A size that ends in front of what has been read must not send the reader back.
    Recorder backward;
    backward.onElement = [](auto& stream, KVStreamElement& e) {
        if (e.token == 1)
            stream.ignoreElement();
    };
    EXPECT_TRUE(parse(header + "\1\2\0\0\0\2\2\x08\1\2\x08\2"s + element("\3", "\0"s), backward));
    EXPECT_EQ(backward.log.substr(0, 12), "1 name=2 '';");
    EXPECT_EQ(backward.count, 2);

    KVBufferReadStream none(nullptr, 0);
    KVBinaryXMLReadStream(none).ignoreElement(); // no element: nothing
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
            Recorder recorder;
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
    Recorder recorder;
    stream.pushHandler(&recorder);
    EXPECT_EQ(stream.parseElement(), 1);
    EXPECT_EQ(memory.getPos(), 9u); // nothing is left read ahead
    EXPECT_EQ(stream.parseElement(), 1);
    EXPECT_EQ(stream.parseElement(), -1);
    EXPECT_EQ(recorder.log, "1 '1'; end; 3 ''; end; ");
}

TEST(KVBinaryXMLReadStream, DecodesFromAnyStream)
{
    struct Row {
        std::string bytes;
        bool whole;
        unsigned int value;
    } const rows[] = {
        {"\0"s, true, 0},
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
        {128, true, 0, 0, 0},
        {0, true, 0, 0, 0},
        {7, true, 0, 0, 0},
        {23, true, 0, 0, 0},
        {8, true, 1, 1, 1},
        {9, true, 0x201, 0x201, 2},
        {25, true, -0x201, 0xFFFFFDFFu, 2}, // without a sign: the pattern of two's complement
        {15, true, 0x0807060504030201, 0x04030201, 8},
        {31, true, -0x0807060504030201, 0xFBFCFDFFu, 8},
        {32, false, 77, 77, 0}, // would be 25 bytes
        {40, false, 77, 77, 0},
        {130, false, 77, 77, 0},
        {255, false, 77, 77, 0},
    };
    for (IntRow const& row : intRows) {
        std::string const bytes = "\1\2\3\4\5\6\7\x08";
        KVBufferReadStream memory(bytes.data(), bytes.size());
        long long int64 = 77;
        unsigned int uint32 = 77;
        EXPECT_EQ(KVBinaryXMLReadStream::readInt(memory, row.tag, &int64), row.answer) << row.tag;
        EXPECT_EQ(int64, row.int64) << row.tag;
        EXPECT_EQ(memory.getPos(), row.taken) << row.tag;
        memory.setPos(0);
        EXPECT_EQ(KVBinaryXMLReadStream::readInt(memory, row.tag, &uint32), row.answer) << row.tag;
        EXPECT_EQ(uint32, row.uint32) << row.tag;
    }
    KVBufferReadStream two("\1\2", 2);
    long long value = 77;
    EXPECT_FALSE(KVBinaryXMLReadStream::readInt(two, 10, &value));
    two.setPos(0);
    CMTime time;
    EXPECT_FALSE(KVBinaryXMLReadStream::readVextime(two, &time));
}

TEST(KVBinaryXMLReadStream, ReadsFromFiles)
{
    TemporaryFolder const folder;
    std::string const path = folder.file("scene");
    // An unknown element longer than any window stands in between.
    std::string bytes = header + element("\3", "\0\x81"s);
    bytes += element("\x55", std::string(300000, '\xFF'));
    for (int i = 0; i < 30000; ++i)
        bytes += element("\3", "\0\x80"s);
    writeFile(path, bytes);
    KVFileReadStream file(urlOf(path));
    KVBinaryXMLReadStream stream(file);
    EXPECT_TRUE(stream.getURL() == urlOf(path));
    Recorder recorder;
    stream.pushHandler(&recorder);
    EXPECT_TRUE(stream.parse());
    EXPECT_EQ(recorder.count, 30001);
    EXPECT_EQ(recorder.log.substr(0, 8), "3 '1'; e");
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
        Recorder recorder;
        long wrong = 0;
        recorder.onElement = [&](auto&, KVStreamElement& e) {
            unsigned long long number = 0;
            int small = 0;
            e.getAttributeAsUInt64(2, &number);
            e.getAttributeAsInt32(4, &small);
            wrong += number != 0x07060504030201 || small != 7;
        };
        recorder.follow = false;
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

/// A second of processor time.
class Deadline {
public:
    ~Deadline() { EXPECT_LT(std::clock() - start_, slowness * CLOCKS_PER_SEC); }

private:
#ifdef __SANITIZE_ADDRESS__
    static constexpr std::clock_t slowness = 10;
#else
    static constexpr std::clock_t slowness = 1;
#endif
    std::clock_t const start_ = std::clock();
};

/// A recorder of a deep document would fill the memory itself.
class Counter : public Recorder {
public:
    using Recorder::Recorder;
    bool parseElement(KVSerializerReadStream& stream, KVStreamElement&) override
    {
        ++count;
        return follow ? stream.pushHandler(this) : true;
    }
    bool parseEnd(KVSerializerReadStream&) override { return true; }
};

} // namespace

TEST(KVBinaryXMLReadStream, TakesATruncationForAFailureOrAShorterDocument)
{
    SmallDocument const document;
    for (std::size_t length = 0; length <= document.bytes.size(); ++length) {
        Recorder recorder;
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
            for (int i = 0; i < 4; ++i)
                bytes[at + i] = static_cast<char>(size >> 8 * i);
            allocations::takeLargest();
            Recorder recorder;
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
        Recorder recorder;
        EXPECT_FALSE(parse(bytes, recorder)) << row.what;
        EXPECT_LT(allocations::takeLargest(), 2 * bytes.size() + 100000) << row.what;
        EXPECT_EQ(recorder.count, 0) << row.what;
    }
}

TEST(KVBinaryXMLReadStream, FollowsAMillionLevels)
{
    std::string bytes = header;
    std::string const level = "\1\xFF\xFF\xFF\x7F\0\0"s;
    for (int i = 0; i < 1000000; ++i)
        bytes += level;
    Counter counter;
    {
        Deadline const deadline;            // also for letting go of what is left open
        EXPECT_TRUE(parse(bytes, counter)); // cut right behind the announcement of a child
        EXPECT_EQ(counter.count, 1000000);
    }
    // The same with true sizes, all the way back to the top.
    std::uint32_t const depth = 1000000;
    std::string nested = header;
    for (std::uint32_t i = depth; i > 0; --i) {
        std::uint32_t const size = 7 * i - 6; // the count, and what the levels below it take
        nested += {'\1',
                   static_cast<char>(size),
                   static_cast<char>(size >> 8),
                   static_cast<char>(size >> 16),
                   static_cast<char>(size >> 24),
                   '\0'};
        if (i > 1)
            nested += '\0';
    }
    Counter whole;
    Deadline const deadline;
    EXPECT_TRUE(parse(nested, whole));
    EXPECT_EQ(whole.count, depth);
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
        EXPECT_TRUE(parse(std::string_view(reinterpret_cast<char const*>(bytes.getBuffer()),
                                           bytes.getBufferSize()),
                          counter));
        EXPECT_EQ(counter.count, 1);
        return allocations::count() - start;
    };
    EXPECT_EQ(allocationsFor(10), allocationsFor(100000));
}

#include "SerializationSupport.h"

#include <limits>

using namespace std::string_literals;

namespace {

KVScope scope[] = {
    {"scene", 1, 0}, {"name", 1, 2},    {"far", 1, 300},     {"node", 2, 0},
    {"name", 2, 2},  {"wide", 5000, 0}, {"wide", 70000u, 0}, {nullptr, 0, 0},
};

std::string const header("VZBML 5.10\0", 11);

using Write = std::function<void(KVBinaryXMLWriteStream&)>;

/// What the stream writes behind the header.
std::string written(Write const& write)
{
    KVBufferWriteStream bytes(0, 64);
    KVBinaryXMLWriteStream stream(bytes, 5, 10);
    stream.pushScope(scope);
    write(stream);
    std::string const text = textOf(bytes);
    EXPECT_EQ(text.substr(0, header.size()), header);
    return text.substr(std::min(header.size(), text.size()));
}

/// The body of an element without attributes.
template <class T>
std::string bodyWith(T value)
{
    std::string const text = written([&](auto& stream) {
        stream.startElement(1);
        stream.writeValue(value);
        stream.endElement();
    });
    return text.substr(6);
}

template <class T>
using Limits = std::numeric_limits<T>;

} // namespace

TEST(KVBinaryXMLWriteStream, WritesNumbersInTheFewestBytes)
{
    constexpr int intMin = Limits<int>::min();
    constexpr long long longMin = Limits<long long>::min();
    constexpr double infinity = Limits<double>::infinity();
    struct Row {
        std::string written, expected;
    } const rows[] = {
        {bodyWith(0), "\x80"},
        {bodyWith(0ULL), "\x80"},
        {bodyWith(1), "\x81"},
        {bodyWith(1u), "\x81"},
        {bodyWith(1LL), "\x81"},
        {bodyWith(1ULL), "\x81"},
        {bodyWith(-1), "\x18\x01"}, // not 129, which would lose the sign
        {bodyWith(-1LL), "\x18\x01"},
        {bodyWith(-2L), "\x18\x02"},
        {bodyWith(255), "\x08\xFF"},
        {bodyWith(256), "\x09\x00\x01"s},
        {bodyWith(-256), "\x19\x00\x01"s},
        {bodyWith(0xFFFF), "\x09\xFF\xFF"},
        {bodyWith(0x10000), "\x0A\x00\x00\x01"s},
        {bodyWith(0x1000000), "\x0B\x00\x00\x00\x01"s},
        {bodyWith(0xFFFFFFFFu), "\x0B\xFF\xFF\xFF\xFF"},
        {bodyWith(0x100000000LL), "\x0C\x00\x00\x00\x00\x01"s},
        {bodyWith(1LL << 40), "\x0D\x00\x00\x00\x00\x00\x01"s},
        {bodyWith(1LL << 48), "\x0E\x00\x00\x00\x00\x00\x00\x01"s},
        // The lowest int has its sign extended; the lowest long long has not.
        {bodyWith(intMin), "\x1F\x00\x00\x00\x80\xFF\xFF\xFF\xFF"s},
        {bodyWith(intMin + 1), "\x1B\xFF\xFF\xFF\x7F"},
        {bodyWith(static_cast<long long>(intMin)), "\x1B\x00\x00\x00\x80"s},
        {bodyWith(longMin), "\x1F\x00\x00\x00\x00\x00\x00\x00\x80"s},
        {bodyWith(~0ULL), "\x0F\xFF\xFF\xFF\xFF\xFF\xFF\xFF\xFF"},
        // Whole floating values are integers.
        {bodyWith(-0.0), "\x80"}, // the sign of zero is lost
        {bodyWith(1.0f), "\x81"},
        {bodyWith(-1.0), "\x18\x01"},
        {bodyWith(0x1p40f), "\x0D\0\0\0\0\0\1"s},
        {bodyWith(-0x1p63), "\x1F\0\0\0\0\0\0\0\x80"s},
        {bodyWith(0x1p63f), "\x28\0\0\0\x5F"s}, // the first one beyond the integers
        {bodyWith(0x1p63), "\x29\0\0\0\0\0\0\xE0\x43"s},
        {bodyWith(0.5f), "\x28\0\0\0\x3F"s},
        {bodyWith(0.5), "\x29\0\0\0\0\0\0\xE0\x3F"s},
        {bodyWith(-infinity), "\x29\0\0\0\0\0\0\xF0\xFF"s},
        {bodyWith(Limits<float>::quiet_NaN()), "\x28\0\0\xC0\x7F"s},
    };
    for (Row const& row : rows)
        EXPECT_EQ(row.written, row.expected) << &row - rows;
}

TEST(KVBinaryXMLWriteStream, WritesTimesByTheSizesOfTheirFields)
{
    struct Row {
        CMTime time;
        std::string expected;
    } const rows[] = {
        {{1, 600, 1, 0}, "\x32\x04\x01\x58\x02\x01\x00"s},
        {{0, 0, 0, 0}, "\x32\x00\x00\x00\x00\x00"s},
        {{0x10000, 1, 1, 0}, "\x32\x02\0\0\1\0\1\1\0"s}, // three bytes become four
        {{1LL << 32, 1, 1, 0}, "\x32\x03\0\0\0\0\1\0\0\0\1\1\0"s},
        {{1, 0x10000, 0x123456, 256}, "\x32\x68\1\0\0\1\x56\x34\x12\0\1"s},
        {{-1, -1, 0xFFFFFFFFu, -2},
         "\x32\xFF\xFF\xFF\xFF\xFF\xFF\xFF\xFF\xFF\xFF\xFF\xFF\xFF\xFF\xFF\xFF\xFF"
         "\xFE\xFF\xFF\xFF\xFF\xFF\xFF\xFF"},
    };
    for (Row const& row : rows) {
        EXPECT_EQ(bodyWith(row.time), row.expected) << &row - rows;
        KVBufferWriteStream bytes(64, 64);
        KVBinaryXMLWriteStream::writeVexTime(bytes, row.time);
        EXPECT_EQ(textOf(bytes), row.expected);
    }
}

TEST(KVBinaryXMLWriteStream, WritesStringsAndUUIDs)
{
    std::string const longText(70000, 'x');
    struct Row {
        std::string written, expected;
    } const rows[] = {
        {bodyWith(KVUUID{{1, 0x12345678, 0, 0xFFFFFFFFu}}),
         "\x2A\1\0\0\0\x78\x56\x34\x12\0\0\0\0\xFF\xFF\xFF\xFF"s},
        {bodyWith(KVString()), "\x2B\0"s},
        {bodyWith(KVString("é1\U0001F600")), "\x2B\7\xC3\xA9\x31\xF0\x9F\x98\x80"},
        {bodyWith(KVString::fromUTF16(u"a\xD800")), "\x2B\4\x61\xEF\xBF\xBD"}, // half a pair
        {bodyWith(KVString(std::string(128, 'x'))), "\x2B\x80\1" + std::string(128, 'x')},
        {bodyWith(KVString(longText)), "\x2B\xF0\xA2\4" + longText},
    };
    for (Row const& row : rows)
        EXPECT_EQ(row.written, row.expected) << &row - rows;
}

TEST(KVBinaryXMLWriteStream, WritesVariableLengthNumbers)
{
    std::pair<unsigned, std::string> const rows[] = {
        {0, "\0"s},           {0x7F, "\x7F"},         {0x80, "\x80\1"},
        {0x3FFF, "\xFF\x7F"}, {0x4000, "\x80\x80\1"}, {0xFFFFFFFFu, "\xFF\xFF\xFF\xFF\x0F"},
    };
    for (auto const& [value, expected] : rows) {
        KVBufferWriteStream bytes(64, 64);
        KVBinaryXMLWriteStream::writeVarInt(bytes, value);
        EXPECT_EQ(textOf(bytes), expected) << value;
    }
    KVBufferWriteStream bytes(64, 64);
    KVBinaryXMLWriteStream::writeInt(bytes, 1ULL, true); // a magnitude of one has no sign
    EXPECT_EQ(textOf(bytes), "\x81");
}

TEST(KVBinaryXMLWriteStream, WritesElementsWithTheirSizes)
{
    auto const element = [](unsigned token, Write const& inside = nullptr) -> Write {
        return [=](auto& s) {
            s.startElement(token);
            if (inside)
                inside(s);
            s.endElement();
        };
    };
    struct Row {
        char const* what;
        Write write;
        std::string expected;
    } const rows[] = {
        {"nothing but the header", [](auto& s) { s.close(), s.writeBlankLine(); }, ""},
        {"empty", element(1), "\1\1\0\0\0\0"s},
        {"a long token", element(5000), "\x88\x27\1\0\0\0\0"s},
        {"a longer token", element(70000), "\xF0\xA2\4\1\0\0\0\0"s},
        {"attributes in front of children, children in front of a value",
         element(1,
                 [&](auto& s) {
                     s.writeAttribute(2, 7);
                     s.writeAttribute(300, KVString("b"));
                     element(2, [](auto& inner) { inner.writeAttribute(2, 0.5f); })(s);
                     element(2)(s);
                     s.writeValue(1);
                 }),
         "\1\x1E\0\0\0\2\2\x08\7\xAC\2\x2B\1b"
         "\0\2\7\0\0\0\1\2\x28\0\0\0\x3F"
         "\0\2\1\0\0\0\0"
         "\x81"s},
        {"attributes of every kind of number",
         element(1,
                 [](auto& s) {
                     s.writeAttribute(2, 2u);
                     s.writeAttribute(2, -2LL);
                     s.writeAttribute(2, 2ULL);
                     s.writeAttribute(2, 0.5);
                     s.writeAttribute(2, CMTimeMake(1, 600));
                     s.writeAttribute(2, KVUUID{{1, 2, 3, 4}});
                 }),
         "\1\x2E\0\0\0\6\2\x08\2\2\x18\2\2\x08\2\2\x29\0\0\0\0\0\0\xE0\x3F\2\x32\4\1\x58\2\1\0"
         "\2\x2A\1\0\0\0\2\0\0\0\3\0\0\0\4\0\0\0"s},
        {"what is left out",
         element(1,
                 [](auto& s) {
                     unsigned int ints[] = {1};
                     float floats[] = {1};
                     double doubles[] = {1};
                     s.writeOptionalAttribute(2, KVString("x"));
                     s.writeArray(ints, 1);
                     s.writeArray(floats, 1);
                     s.writeArray(doubles, 1);
                 }),
         "\1\1\0\0\0\0"s},
        // The three oddities of attributes, which documents rely on.
        {"an empty string alone leaves no trace",
         element(1, [](auto& s) { s.writeAttribute(2, KVString("")); }), "\1\1\0\0\0\0"s},
        {"an empty string behind another attribute is not counted",
         element(1,
                 [](auto& s) {
                     s.writeAttribute(2, 1);
                     s.writeAttribute(300, KVString());
                 }),
         "\1\7\0\0\0\1\2\x81\xAC\2\x2B\0"s},
        {"an attribute behind a value or a child is lost",
         element(1,
                 [&](auto& s) {
                     s.writeValue(1);
                     s.writeAttribute(2, 2);
                     element(2)(s);
                     s.writeAttribute(2, 3);
                 }),
         "\1\x09\0\0\0\0\x81\0\2\1\0\0\0\0"s},
    };
    for (Row const& row : rows)
        EXPECT_EQ(written(row.write), row.expected) << row.what;
}

TEST(KVBinaryXMLWriteStream, RefusesWhatHasNoName)
{
    KVBufferWriteStream bytes(64, 64);
    KVBinaryXMLWriteStream stream(bytes, 1, 0);
    auto const start = [&](unsigned token) { return refusal([&] { stream.startElement(token); }); };
    auto const attribute = [&](unsigned token, auto value) {
        return refusal([&] { stream.writeAttribute(token, value); });
    };
    EXPECT_EQ(start(1), "scope: scope not defined!\n");
    EXPECT_EQ(refusal([&] { stream.endElement(); }),
              "element: endElement() called without startElement()!\n");
    EXPECT_EQ(refusal([&] { stream.writeValue(1); }), "element: ");
    EXPECT_EQ(refusal([&] { stream.writeValue(KVString("a")); }), "element: ");
    EXPECT_EQ(attribute(2, 1), "element: ");
    EXPECT_EQ(attribute(2, KVString("a")), "element: ");
    stream.pushScope(scope);
    stream.startElement(1);
    EXPECT_EQ(start(9), "element: Token not defined in scope scene!\n");
    EXPECT_EQ(attribute(9, 1), "attribute: ");
    EXPECT_EQ(attribute(9, KVString("a")), "attribute: ");
    EXPECT_EQ(attribute(0, 1), "attribute: ");
    stream.pushScope(nullptr);
    EXPECT_EQ(attribute(2, 1), "scope: ");
    // The failed start has put out the count of the parent's attributes: none can be added.
    stream.popScope();
    stream.writeAttribute(2, 1);
    stream.endElement();
    EXPECT_EQ(textOf(bytes), "VZBML 1.0\0\1\1\0\0\0\0"s);
}

TEST(KVBinaryXMLWriteStream, PatchesSizesInAFile)
{
    TemporaryFolder const folder;
    std::string const path = folder.path("scene");
    // Longer than the file stream's buffer, so that the size lies in front of it.
    std::string const text(60000, 'x');
    {
        KVFileWriteStream file(urlOf(path));
        KVBinaryXMLWriteStream stream(file, 5, 10);
        EXPECT_TRUE(stream.getURL() == urlOf(path));
        stream.pushScope(scope);
        stream.startElement(1);
        stream.startElement(2);
        stream.writeValue(KVString(text));
        stream.endElement();
        stream.writeValue(-1);
        stream.endElement();
    }
    EXPECT_EQ(folder.read("scene"),
              header + "\1\x6E\xEA\0\0\0\0\2\x65\xEA\0\0\0\x2B\xE0\xD4\3"s + text + "\x18\1");
}

TEST(KVBinaryXMLWriteStream, WritesTheExampleOfItsPage)
{
    // The example's lines: indented pairs of digits up to two blanks, and what they mean.
    std::ifstream page(KORVANE_SOURCE_DIR "/docs/scene-binary.md");
    std::string line;
    while (std::getline(page, line) && !line.starts_with("    56 5A"))
        ;
    std::string expected;
    for (; line.starts_with("    "); std::getline(page, line)) {
        std::istringstream digits(line.substr(4, line.find("  ", 4) - 4));
        for (unsigned int byte; digits >> std::hex >> byte;)
            expected += static_cast<char>(byte);
    }
    KVScope table[] = {
        {"a", 1, 0}, {"b", 1, 2}, {"c", 1, 3}, {"d", 2, 0}, {nullptr, 0, 0},
    };
    std::string const bytes = written([&](auto& stream) {
        stream.pushScope(table);
        stream.startElement(1);
        stream.writeAttribute(2, 7);
        stream.writeAttribute(3, KVString("b"));
        stream.startElement(2);
        stream.endElement();
        stream.writeValue(0.5f);
        stream.endElement();
    });
    EXPECT_EQ(header + bytes, expected);
}

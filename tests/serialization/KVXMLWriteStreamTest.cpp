#include "SerializationSupport.h"

#include <cfloat>
#include <climits>
#include <clocale>
#include <cmath>
#include <limits>
#include <random>

namespace {

enum Token : unsigned { kOuter = 1, kInner, kLeaf };

KVScope scope[] = {
    {"outer", kOuter, 0}, {"name", kOuter, 1}, {"inner", kInner, 0},
    {"at", kInner, 1},    {"leaf", kLeaf, 0},  {nullptr, 0, 0},
};
KVScope otherScope[] = {{"other", 9, 0}, {"exterior", kOuter, 0}, {nullptr, 0, 0}};
KVScope emptyScope[] = {{nullptr, 0, 0}};

constexpr char header[] = "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n"
                          "<!DOCTYPE vzxmlscene>\n"
                          "<vzml version=\"5.10\">\n\n";

using Write = std::function<void(KVXMLWriteStream&)>;

/// What `write` writes behind the header, with `scope` pushed.
std::string body(Write const& write)
{
    KVBufferWriteStream bytes(16, 16);
    KVXMLWriteStream stream(bytes, 5, 10);
    stream.pushScope(scope);
    write(stream);
    std::string const text = textOf(bytes);
    EXPECT_EQ(text.substr(0, sizeof header - 1), header);
    return text.substr(sizeof header - 1);
}

/// Expects `text` for `value` both as the content and as an attribute.
template <class T>
void expectBoth(T const& value, std::string const& text)
{
    EXPECT_EQ(body([&](KVXMLWriteStream& stream) {
                  stream.startElement(kOuter);
                  stream.writeAttribute(1, value);
                  stream.writeValue(value);
              }),
              "<outer name=\"" + text + "\">" + text);
}

} // namespace

// Meant: arrays leave no trace in this form.
TEST(KVXMLWriteStream, WritesADocument)
{
    EXPECT_EQ(body([](KVXMLWriteStream& stream) {
                  stream.startElement(kOuter);
                  stream.writeAttribute(1, KVString("Opening"));
                  stream.writeOptionalAttribute(1, "<>");
                  stream.startElement(kInner);
                  stream.writeAttribute(1, 3);
                  unsigned int integers[] = {1, 2};
                  float floats[] = {1, 2};
                  double doubles[] = {1, 2};
                  stream.startElement(kLeaf);
                  stream.writeArray(integers, 2);
                  stream.writeArray(floats, 2);
                  stream.writeArray(doubles, 2);
                  stream.reset();
                  stream.endElement();
                  stream.startElement(kLeaf);
                  stream.writeValue(0.5);
                  stream.endElement();
                  stream.endElement();
                  stream.endElement();
                  stream.writeBlankLine();
                  stream.close();
              }),
              "<outer name=\"Opening\" name=\"&lt;&gt;\">\n"
              "\t<inner at=\"3\">\n"
              "\t\t<leaf/>\n"
              "\t\t<leaf>0.5</leaf>\n"
              "\t</inner>\n"
              "</outer>\n"
              "\n"
              "\n</vzml>\n");
}

TEST(KVXMLWriteStream, WritesItsVersionAsSignedNumbers)
{
    KVBufferWriteStream bytes(16, 16);
    KVXMLWriteStream(bytes, 0, 0xFFFFFFFF);
    EXPECT_NE(textOf(bytes).find("<vzml version=\"0.-1\">"), std::string::npos);
}

TEST(KVXMLWriteStream, WritesNumbers)
{
    expectBoth(INT_MIN, "-2147483648");
    expectBoth(UINT_MAX, "4294967295");
    expectBoth(LLONG_MIN, "-9223372036854775808");
    expectBoth(ULLONG_MAX, "18446744073709551615");
    expectBoth(KVUUID{{0x1, 0xABCDEF, 0x89abcdef, 0}}, "0000000100abcdef89abcdef00000000");
    expectBoth(CMTimeMake(1001, 30000), "1001 30000 1 0");
    expectBoth(CMTime{-1, -600, 0xABCDEF01, -1}, "-1 -600 abcdef01 -1");
    expectBoth(true, "1");
}

TEST(KVXMLWriteStream, WritesFloatingPointLikeTheCLocale)
{
    double const nan = std::numeric_limits<double>::quiet_NaN();
    double const values[] = {
        0.0,          -0.0,        1.0,           1.0 / 3,  1e15,      1e16,  1e17, 1e-4,   1e-5,
        123456.789,   2147483648,  99999999995.0, DBL_MAX,  DBL_MIN,   1e100, 1e23, 5e-324, -2.5,
        9999999999.5, 12345678901, 0.000123456,   INFINITY, -INFINITY, nan,   -nan};
    for (double const value : values) {
        char expected[64];
        std::snprintf(expected, sizeof expected, "%.17lg", value);
        expectBoth(value, expected);
        float const narrow = static_cast<float>(value);
        std::snprintf(expected, sizeof expected, "%.10g", static_cast<double>(narrow));
        expectBoth(narrow, expected);
    }
    expectBoth(0.1, "0.10000000000000001");
    expectBoth(0.1f, "0.1000000015");

    // Numbers with few binary places, and just beyond them.
    std::mt19937_64 random(5);
    KVBufferWriteStream bytes(1 << 20, 1 << 20);
    KVXMLWriteStream stream(bytes, 1, 0);
    stream.pushScope(scope);
    stream.startElement(kLeaf);
    for (int i = 0; i < 20000; ++i) {
        double const value =
            std::ldexp(static_cast<double>(static_cast<std::int64_t>(random()) >> (random() % 63)),
                       -static_cast<int>(random() % 13));
        char expected[64];
        bytes.reset();
        stream.writeValue(i % 2 ? value : 0);
        stream.writeValue(static_cast<float>(value));
        std::snprintf(expected, sizeof expected, "%.17lg%.10g", i % 2 ? value : 0.0,
                      static_cast<double>(static_cast<float>(value)));
        ASSERT_EQ(textOf(bytes).substr(i == 0), expected);
    }
}

TEST(KVXMLWriteStream, EscapesText)
{
    struct Row {
        KVString text;
        std::string written;
    } const rows[] = {
        {"<a & \"b\">", "&lt;a &amp; &quot;b&quot;&gt;"},
        {"it's\ttab\nline\r", "it's\ttab\nline\r"}, // meant, though readers change a "\r"
        {"Réel € 𝄞 & ü<", "Réel € 𝄞 &amp; ü&lt;"},
        {KVString(), ""},
        {KVString::fromUTF16({u"cut\0off", 7}), "cut"},
        {KVString::fromUTF16(u"\xD834!"), "\xEF\xBF\xBD!"},
        {KVString::repeat("\"é", 3000), KVString::repeat("&quot;é", 3000)},
    };
    for (Row const& row : rows)
        expectBoth(row.text, row.written);
}

// Meant: nothing keeps order between values, children and attributes.
TEST(KVXMLWriteStream, WritesInTheOrderOfTheCalls)
{
    EXPECT_EQ(body([](KVXMLWriteStream& stream) {
                  stream.startElement(kOuter);
                  stream.writeValue(1);
                  stream.writeValue(KVString(" "));
                  stream.writeAttribute(1, 3);
                  stream.startElement(kLeaf); // on the line of the value, and the tag stays closed
                  stream.endElement();
                  stream.writeValue(4.5f);
                  stream.endElement();
                  stream.startElement(kOuter);
                  stream.startElement(kLeaf);
                  stream.endElement();
                  stream.writeValue(CMTimeMake(1, 2));
                  stream.endElement();
                  stream.startElement(kInner);
                  stream.startElement(kInner);
                  stream.writeValue(7);
                  stream.startElement(kLeaf);
                  stream.endElement();
                  stream.endElement();
                  stream.endElement();
              }),
              "<outer>1  name=\"3\"\t<leaf/>\n4.5</outer>\n"
              "<outer>\n\t<leaf/>\n1 2 1 0</outer>\n"
              "<inner>\n\t<inner>7\t\t<leaf/>\n</inner>\n</inner>\n");
}

TEST(KVXMLWriteStream, RefusesWhatHasNoName)
{
    std::string const noScope = "scope: scope not defined!\n";
    std::string const nothingToEnd = "element: endElement() called without startElement()!\n";
    auto const start = [](KVXMLWriteStream& stream, unsigned token) {
        return refusal([&] { stream.startElement(token); });
    };
    auto const attribute = [](KVXMLWriteStream& stream, unsigned token, auto value) {
        return refusal([&] { stream.writeAttribute(token, value); });
    };
    struct Row {
        char const* what;
        Write write;
        char const* written;
    } const rows[] = {
        {"with no element open",
         [&](auto& stream) {
             EXPECT_EQ(refusal([&] { stream.endElement(); }), nothingToEnd);
             EXPECT_EQ(refusal([&] { stream.writeValue(1); }), nothingToEnd);
             EXPECT_EQ(refusal([&] { stream.terminateStartTag(); }), nothingToEnd);
             EXPECT_EQ(refusal([&] { stream.writeValue(KVString("x")); }),
                       "element: value not within an element body!\n");
             EXPECT_EQ(attribute(stream, 1, 1), "element: ");
             EXPECT_EQ(attribute(stream, 1, KVString("x")), "element: ");
         },
         ""},
        {"without a scope, and with a null one",
         [&](auto& stream) {
             stream.popScope();
             EXPECT_EQ(start(stream, kOuter), noScope);
             stream.pushScope(nullptr);
             EXPECT_EQ(start(stream, kOuter), noScope);
             stream.pushScope(scope);
             stream.startElement(kOuter);
             stream.popScope();
             EXPECT_EQ(attribute(stream, 1, 1), "scope: ");
             stream.popScope();
             EXPECT_EQ(attribute(stream, 1, 1), "scope: ");
         },
         "<outer"},
        {"names come from the top scope alone",
         [&](auto& stream) {
             stream.pushScope(otherScope);
             stream.startElement(kOuter);
             EXPECT_EQ(attribute(stream, 1, 1), "attribute: ");
             stream.popScope();
             EXPECT_EQ(attribute(stream, 2, KVString("x")), "attribute: ");
             EXPECT_EQ(attribute(stream, 0, KVString("x")), "attribute: ");
             stream.writeAttribute(1, 2);
             stream.endElement();
         },
         "<exterior name=\"2\"/>\n"},
        {"in an empty scope",
         [&](auto& stream) {
             stream.pushScope(emptyScope);
             EXPECT_EQ(start(stream, kOuter), "element: Token not defined in scope (null)!\n");
         },
         ""},
        // Meant: the parent's start tag counts as closed before the scope is looked at. Without a
        // scope its ">" is never written.
        {"the parent's tag is closed by an unknown token",
         [&](auto& stream) {
             stream.startElement(kOuter);
             EXPECT_EQ(start(stream, 77), "element: Token not defined in scope outer!\n");
             stream.endElement();
         },
         "<outer>\n</outer>\n"},
        {"the end of the parent's tag is lost without a scope",
         [&](auto& stream) {
             stream.startElement(kOuter);
             stream.popScope();
             EXPECT_EQ(start(stream, kLeaf), noScope);
             stream.writeValue(1);
             stream.endElement();
         },
         "<outer1</outer>\n"},
    };
    for (Row const& row : rows) {
        SCOPED_TRACE(row.what);
        EXPECT_EQ(body(row.write), row.written);
    }
}

TEST(KVXMLWriteStream, TakesLongNamesAndDeepNesting)
{
    std::string const longName(5000, 'n');
    KVScope longScope[] = {{longName.c_str(), 1, 0}, {longName.c_str(), 1, 1}, {nullptr, 0, 0}};
    EXPECT_EQ(body([&](KVXMLWriteStream& stream) {
                  stream.pushScope(longScope);
                  stream.startElement(1);
                  stream.writeAttribute(1, 1.5);
                  stream.writeValue(2);
                  stream.endElement();
              }),
              "<" + longName + " " + longName + "=\"1.5\">2</" + longName + ">\n");

    std::string const deep = body([&](KVXMLWriteStream& stream) {
        for (int i = 0; i < 3000; ++i)
            stream.startElement(kInner);
        for (int i = 0; i < 3000; ++i)
            stream.endElement();
    });
    EXPECT_NE(deep.find("\n" + std::string(2999, '\t') + "<inner/>\n" + std::string(2998, '\t') +
                        "</inner>\n"),
              std::string::npos);
}

TEST(KVXMLWriteStream, TellsOfAFullDisk)
{
    KVFileWriteStream file(urlOf("/dev/full"));
    KVXMLWriteStream stream(file, 1, 0);
    EXPECT_TRUE(stream.getURL() == urlOf("/dev/full"));
    stream.pushScope(scope);
    stream.startElement(kLeaf);
    EXPECT_THROW(stream.writeValue(KVString::repeat("x", 60000)), KVException_WriteError);
}

TEST(KVXMLWriteStream, SetsTheNumericLocale)
{
    // Any other locale that this machine has; numbers must keep their point whatever happens later.
    char const* other = nullptr;
    for (char const* const name : {"de_DE.UTF-8", "fr_FR.UTF-8", "C.UTF-8", "POSIX"})
        if (!other && std::setlocale(LC_NUMERIC, name))
            other = name;
    KVBufferWriteStream bytes(16, 16);
    KVXMLWriteStream stream(bytes, 1, 0);
    EXPECT_STREQ(std::setlocale(LC_NUMERIC, nullptr), "C");
    if (other)
        std::setlocale(LC_NUMERIC, other);
    KVXMLReadStream reader("<a/>", 4);
    EXPECT_STREQ(std::setlocale(LC_NUMERIC, nullptr), "C");
}

#include <korvane/media/KVXMPStringParser.h>

#include "media/Movie.h"

#include <korvane/foundation/KVNSRef.h>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

using ::testing::MatchesRegex;

namespace {

std::string parse(std::string const& text)
{
    KVXMPStringParser parser;
    EXPECT_TRUE(parser.parseXMPString(KVString(text))) << text << "\n"
                                                       << parser.parseErrorString().toUTF8();
    return show(parser.parsedData());
}

std::string repeat(std::string const& text, int count)
{
    std::string all;
    for (int i = 0; i < count; ++i)
        all += text;
    return all;
}

} // namespace

TEST(KVXMPStringParser, ElementsBecomeNestedDictionaries)
{
    struct Row {
        char const* name;
        char const* text;
        char const* result;
    } const rows[] = {
        {"text outside every level", "<a>1</a>", R"({a:"1"})"},
        {"the text of an outer element goes with the inner one's end", "<a>x<b>1</b>y</a>",
         R"({b:"1"})"},
        {"entities, references and CDATA", "<a>&lt;&#x41;&amp;<![CDATA[<&]]></a>",
         R"({a:"<A&<&"})"},
        {"attributes", "<a b='1' xmlns:c='u'/>", R"({a:{b:"1" xmlns:c:"u" a:""}})"},
        {"names keep their prefix, declared or not", "<n:a n:b='1'/>", R"({n:a:{n:b:"1" n:a:""}})"},
        {"repeated", "<r><a>1</a><a>2</a></r>", R"({a:{a-0:"1" a-1:"2"}})"},
        {"a third one adds its name", "<r><a>1</a><a>2</a><a>3</a></r>",
         R"({a:{a-0:"1" a-1:"2" a:"3"}})"},
        {"a fourth one replaces it", "<r><a>1</a><a>2</a><a>3</a><a>4</a></r>",
         R"({a:{a-0:"1" a-1:"2" a:"4"}})"},
        {"the attributes of a second one replace the first", "<r><a>1</a><a b='2'/></r>",
         R"({a:{b:"2" a:""}})"},
        {"levels",
         "<x:xmpmeta><rdf:RDF><rdf:Description><a>1</a></rdf:Description></rdf:RDF></x:xmpmeta>",
         R"({x:xmpmeta:{rdf:RDF:{rdf:Description:{a:"1"}}}})"},
        {"attributes of a level lie in it", "<x:xmpmeta><rdf:Description a='1'/></x:xmpmeta>",
         R"({x:xmpmeta:{rdf:Description:{rdf:Description:{a:"1"}}}})"},
        {"spherical", "<rdf:SphericalVideo xmlns:a='u'><a:b>1</a:b></rdf:SphericalVideo>",
         R"({rdf:SphericalVideo:{rdf:SphericalVideo:{xmlns:a:"u"} a:b:"1"}})"},
        {"of two descriptions the second stays", // meant
         "<rdf:RDF><rdf:Description><a>1</a></rdf:Description>"
         "<rdf:Description><b>2</b></rdf:Description></rdf:RDF>",
         R"({rdf:RDF:{rdf:Description:{b:"2"}}})"},
        {"a level inside itself starts anew",
         "<rdf:Description><a>1</a><rdf:Description><b>2</b></rdf:Description><c>3</c></"
         "rdf:Description>",
         R"({rdf:Description:{b:"2"} c:"3"})"},
        {"an outer level inside an inner one ends it",
         "<rdf:RDF><rdf:Description><a>1</a><x:xmpmeta><b>2</b></x:xmpmeta>"
         "</rdf:Description></rdf:RDF>",
         R"({x:xmpmeta:{b:"2"}})"},
        {"the end of an outer level closes the inner one with it",
         "<r><x:xmpmeta><rdf:Description><a>1</a></rdf:Description><b>2</b></x:xmpmeta></r>",
         R"({x:xmpmeta:{rdf:Description:{a:"1"} b:"2"}})"},
        {"a packet",
         "<?xpacket begin='\xEF\xBB\xBF' id='W5M0'?><x:xmpmeta a='1'/>\n<?xpacket end='w'?>\n  ",
         R"({x:xmpmeta:{x:xmpmeta:{a:"1"}}})"},
        {"another encoding is not believed",
         "<?xml version='1.0' encoding='UTF-16'?><a>\xC3\xA9</a>", "{a:\"\xC3\xA9\"}"},
    };
    for (Row const& row : rows)
        EXPECT_EQ(parse(row.text), row.result) << row.name;
}

TEST(KVXMPStringParser, ErrorsAreKeptAsText)
{
    struct Row {
        char const* name;
        std::string text;
        char const* error;
    } const rows[] = {
        {"empty", "", "XML Parse Error 4, Description: .+, Line: 1"},
        {"not closed", "<a>\n<b>1</b>\n", "XML Parse Error [0-9]+, Description: .+, Line: 3"},
        {"unknown entity", "<a>&b;</a>", "XML Parse Error 26, Description: .+, Line: 1"},
        {"no UTF-8", "<a>\xFF</a>", "XML Parse Error 9, Description: .+, Line: 1"},
        {"entities that grow",
         "<!DOCTYPE a [<!ENTITY b '" + std::string(100, 'b') + "'><!ENTITY c '&b;&b;'>]><a>&c;</a>",
         "XML Parse Error 26, .+"},
        {"external entity", "<!DOCTYPE a [<!ENTITY b SYSTEM 'file:///etc/passwd'>]><a>&b;</a>",
         "XML Parse Error 26, .+"},
        {"too deep", repeat("<a>", 100'000) + repeat("</a>", 100'000), "XML Parse Error 1, .+"},
        {"too many attributes", "<a" + repeat(" b=''", 1025) + "/>", "XML Parse Error 1, .+"},
    };
    for (Row const& row : rows) {
        KVXMPStringParser parser;
        EXPECT_FALSE(parser.parseXMPData(makeData(row.text))) << row.name;
        EXPECT_THAT(parser.parseErrorString().toUTF8(), MatchesRegex(row.error)) << row.name;
    }
    KVXMPStringParser parser;
    EXPECT_FALSE(parser.parseXMPData(nullptr));
    EXPECT_FALSE(parser.parseXMPString(KVString()));
    EXPECT_TRUE(parser.parseErrorString().isNull());
    EXPECT_EQ(show(parser.parsedData()), "{}");
}

TEST(KVXMPStringParser, EachParseStartsAfresh)
{
    auto const parser = KVMakeRef<KVXMPStringParser>();
    EXPECT_FALSE(parser->parseXMPString("<x:xmpmeta><a>1</a><b>"));
    EXPECT_FALSE(parser->parseErrorString().isNull());
    EXPECT_TRUE(parser->parseXMPString("<c>2</c>"));
    EXPECT_TRUE(parser->parseErrorString().isNull())
        << "the end of a document takes the error away";
    EXPECT_EQ(show(parser->parsedData()), R"({c:"2"})");
}

TEST(KVXMPStringParser, ManyNamesTakeNoQuadraticTime)
{
    std::string text = "<r>";
    for (int i = 0; i < 100'000; ++i)
        text += "<a" + std::to_string(i) + "/>";
    KVXMPStringParser parser;
    ASSERT_TRUE(parser.parseXMPString(KVString(text + "</r>")));
    EXPECT_EQ(parser.parsedData()->count(), 100'000u);
}

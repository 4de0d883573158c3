#include "SerializationSupport.h"

namespace {

enum Token : unsigned { kRoot = 1, kGroup, kLeaf, kValue };

KVScope scope[] = {
    {"vzml", kRoot, 0},  {"version", kRoot, 1}, {"group", kGroup, 0},
    {"name", kGroup, 1}, {"name", kLeaf, 2},    {"leaf", kLeaf, 0},
    {"at", kLeaf, 1},    {"value", kValue, 0},  {nullptr, 0, 0},
};

/// Becomes the handler of each `vzml` and `group`.
struct SceneRecorder : Recorder {
    SceneRecorder() : Recorder(scope, {kLeaf, kValue, 99}) {}
};

/// What `body` prints to standard error.
template <class Body>
std::string complaintsOf(Body body)
{
    testing::internal::CaptureStderr();
    body();
    return testing::internal::GetCapturedStderr();
}

/// What a recorder writes down of a document; " failed" behind it when parse() is false.
std::string eventsOf(std::string_view document, Recorder& recorder)
{
    KVXMLReadStream stream(document.data(), static_cast<int>(document.size()));
    stream.pushHandler(&recorder);
    bool parsed = false;
    std::string const complaints = complaintsOf([&] { parsed = stream.parse(); });
    EXPECT_EQ(complaints, parsed ? "" : " : parsing error\n");
    EXPECT_EQ(stream.currentHandler(), nullptr);
    EXPECT_EQ(parsed, stream.errorText().empty());
    return recorder.log + (parsed ? "" : "failed");
}

std::string eventsOf(std::string_view document)
{
    SceneRecorder recorder;
    return eventsOf(document, recorder);
}

bool parses(std::string_view document)
{
    return eventsOf(document).find("failed") == std::string::npos;
}

} // namespace

TEST(KVXMLReadStream, KeepsTheOrderOfEvents)
{
    struct Row {
        char const* document;
        char const* events;
    } const rows[] = {
        {"<vzml version='5.10'/>", "(vzml@1=5.10 ()vzml ) "},
        // A parent sees its attributes and the text in front of its first child only.
        {"<vzml>before<leaf at='1'>in</leaf>after</vzml>", "(vzml:before (leaf@1=1:in )vzml ) "},
        {"<vzml><group name='a'><leaf/></group><group/><leaf/></vzml>",
         "(vzml (group@1=a (leaf )group group ()group leaf )vzml ) "},
        // What nobody names is passed over whole, wherever it stands.
        {"<vzml><other><leaf/></other><leaf/></vzml>", "(vzml (leaf )vzml ) "},
        {"<vzml><leaf/><other><x/></other></vzml>", "(vzml (leaf )vzml ) "},
        {"<vzml><other/><other/><group><other><leaf/></other></group></vzml>",
         "(vzml (group ()group )vzml ) "},
        {"<vzml><leaf other='1' at='2' also='3'/></vzml>", "(vzml (leaf@1=2 )vzml ) "},
        // An attribute of another element does not answer; each element has its own.
        {"<vzml><leaf version='1' name='n'/><group at='1'/></vzml>",
         "(vzml (leaf@2=n group ()group )vzml ) "},
        // A child of an element whose handler has not changed goes to the same handler.
        {"<vzml><leaf>a<value>b</value>c</leaf></vzml>", "(vzml (leaf:a value:b )vzml ) "},
        {"<p:vzml xmlns:p='u'/>", "() "},
        // The parser overwrites the values of attributes with entities.
        {"<!DOCTYPE vzml [<!ENTITY a 'first'><!ENTITY b 'the second one'>]>"
         "<vzml><leaf at='&a;.' name='&b;.'><value/></leaf></vzml>",
         "(vzml (leaf@1=first.@2=the second one. value )vzml ) "},
    };
    for (Row const& row : rows)
        EXPECT_EQ(eventsOf(row.document), row.events) << row.document;
}

TEST(KVXMLReadStream, GathersText)
{
    constexpr char plain[] = "";
    constexpr char type[] = "<!DOCTYPE vzml [<!ENTITY space 'x'><!ENTITY other 'y'>"
                            "<!ENTITY apos '&#39;'><!ENTITY amp '&#38;#38;'>]>";
    struct Row {
        std::string before;
        char const* content;
        char const* text; // of the leaf
        bool blanks = false;
    } const rows[] = {
        {plain, " spaced\nlines ", ": spaced\nlines "},
        {plain, "a &amp; b &#233;", ":a & b é"},
        {plain, "a\r\nb\rc&#13;d", ":a\nb\nc\rd"}, // line ends of XML
        // What the parser leaves escaped is replaced once more, "&amp;" first.
        {plain, "&amp;lt;&amp;amp;gt;&amp;quot;&amp;apos;", ":<>\"&apos;"},
        {plain, "ab<?pi?>cd<!-- -->ef", ":ab\ncd\nef"},
        {plain, "ab<![CDATA[lost]]>cd", ":ab\ncd"},
        {plain, "<![CDATA[lost]]>", ""},
        {plain, "   ", ":   ", true},
        {plain, "\n<!-- -->\t", ":\n\n\t", true},
        // Entities are joined with their text.
        {type, "a&space;b", ":a b"},
        {type, "&other;", ""},
        {type, "a&space;b<!-- -->c", ":a b\nc"},
        {type, "a&apos;b&amp;c", ":a'b&c"},
    };
    for (Row const& row : rows) {
        SceneRecorder recorder;
        recorder.blanks = row.blanks;
        EXPECT_EQ(eventsOf(row.before + "<vzml><leaf>" + row.content + "</leaf></vzml>", recorder),
                  std::string("(vzml (leaf") + row.text + " )vzml ) ")
            << row.content;
    }
    EXPECT_EQ(eventsOf(std::string(type) + "<vzml><leaf at='a&other;b&space;c&#233;'/></vzml>"),
              "(vzml (leaf@1=aybxcé )vzml ) ");
}

TEST(KVXMLReadStream, IgnoresAnElement)
{
    Recorder recorder(scope, {kGroup, kLeaf});
    recorder.onElement = [](auto& stream, KVStreamElement& element) {
        if (element.token == kGroup)
            stream.ignoreElement();
    };
    EXPECT_EQ(
        eventsOf("<vzml><group><leaf/><group><leaf/></group></group><leaf/></vzml>", recorder),
        "(vzml (group leaf )vzml ) ");
}

TEST(KVXMLReadStream, FindsRowsByTheNamesOfTheTable)
{
    KVScope any[] = {{"leaf", kLeaf, 0}, {"*", 99, 0}, {"name", 99, 1}, {nullptr, 0, 0}};
    KVScope twice[] = {{"vzml", kRoot, 0}, {"n", kRoot, 1},    {"n", kLeaf, 7}, {"m", kRoot, 8},
                       {"n", kRoot, 2},    {"leaf", kLeaf, 0}, {nullptr, 0, 0}};
    KVScope prefixed[] = {
        {"p:vzml", kRoot, 0}, {"xmlns:p", kRoot, 1}, {"p:a", kRoot, 2}, {nullptr, 0, 0}};
    struct Row {
        char const* what;
        KVScope* table;
        char const* document;
        char const* events;
    } const rows[] = {
        {"a wildcard takes every element", any, "<vzml name='x'><leaf/><p:q xmlns:p='u'/></vzml>",
         "(*@1=x leaf * ) "},
        {"an attribute goes to all its rows", twice, "<vzml n='x' m='y'/>",
         "(vzml@1=x@2=x ()vzml ) "},
        {"a namespace is an attribute", prefixed, "<p:vzml xmlns:p='uri' p:a='b'/>",
         "(p:vzml@1=uri@2=b ()p:vzml ) "},
    };
    for (Row const& row : rows) {
        SceneRecorder recorder;
        recorder.table = row.table;
        EXPECT_EQ(eventsOf(row.document, recorder), row.events) << row.what;
    }
}

TEST(KVXMLReadStream, StopsAndAborts)
{
    constexpr char document[] = "<vzml><group><leaf/><leaf/></group><leaf/></vzml>";
    for (bool const abort : {false, true}) {
        SceneRecorder recorder;
        recorder.onElement = [abort](auto& stream, KVStreamElement& element) {
            if (element.token == kLeaf)
                abort ? stream.abortParse() : stream.stopParse();
        };
        KVXMLReadStream stream(document, sizeof document - 1);
        stream.pushHandler(&recorder);
        EXPECT_EQ(complaintsOf([&] { EXPECT_EQ(stream.parse(), !abort); }),
                  abort ? " : parsing error\n" : "");
        EXPECT_EQ(recorder.log, "(vzml (group (leaf )group )group )group ")
            << "parseEnd on all handlers, with the elements still open";
    }
}

TEST(KVXMLReadStream, ReadsFromAllItsSources)
{
    constexpr char document[] = "<vzml version='1.0'><leaf/></vzml>";
    constexpr char events[] = "(vzml@1=1.0 (leaf )vzml ) ";
    TemporaryFolder const folder;
    KVURL const url = urlOf(folder.write("my scene.vzml", document));
    auto data = KVCFRef<CFDataRef>::adopt(CFDataCreate(nullptr, document, sizeof document - 1));
    KVXMLReadStream fromFile(url), fromData(data.get());
    data = nullptr; // the stream keeps it
    for (KVXMLReadStream* const stream : {&fromFile, &fromData}) {
        SceneRecorder recorder;
        stream->pushHandler(&recorder);
        EXPECT_TRUE(stream->parse());
        EXPECT_EQ(recorder.log, events);
    }
    EXPECT_TRUE(fromFile.getURL() == url);
    EXPECT_TRUE(fromData.getURL().isNull());
}

TEST(KVXMLReadStream, SaysNothingWhenThereIsNothingToRead)
{
    TemporaryFolder const folder;
    std::function<std::unique_ptr<KVXMLReadStream>()> const sources[] = {
        [] { return std::make_unique<KVXMLReadStream>(KVURL()); },
        [&] { return std::make_unique<KVXMLReadStream>(urlOf(folder.path("missing"))); },
        [&] { return std::make_unique<KVXMLReadStream>(urlOf(folder.path(""))); },
        [] { return std::make_unique<KVXMLReadStream>(nullptr, 5); },
        [] { return std::make_unique<KVXMLReadStream>("<a/>", -1); },
        [] { return std::make_unique<KVXMLReadStream>(static_cast<CFDataRef>(nullptr)); },
    };
    for (auto const& source : sources) {
        auto const stream = source();
        SceneRecorder recorder;
        stream->pushHandler(&recorder);
        EXPECT_EQ(complaintsOf([&] { EXPECT_FALSE(stream->parse()); }), "");
        EXPECT_EQ(recorder.log, "() ") << "handlers are popped all the same";
        stream->processNode();
    }
}

TEST(KVXMLReadStream, NamesTheFileOfAParsingError)
{
    TemporaryFolder const folder;
    KVXMLReadStream stream(urlOf(folder.write("broken.vzml", "<vzml>\n\n<leaf></vzml>")));
    EXPECT_EQ(complaintsOf([&] { EXPECT_FALSE(stream.parse()); }), "broken.vzml : parsing error\n");
    EXPECT_EQ(stream.errorLine(), 3u);
    EXPECT_NE(stream.errorText().toUTF8().find("leaf"), std::string::npos);
}

TEST(KVXMLReadStream, RefusesWhatIsNotWellFormed)
{
    std::string const whole = "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<!DOCTYPE vzxmlscene>\n"
                              "<vzml version=\"5.10\">\n<leaf at=\"1\">a&amp;b</leaf><!-- c -->\n"
                              "</vzml>";
    ASSERT_TRUE(parses(whole));
    for (std::size_t length = 0; length < whole.size(); ++length)
        EXPECT_FALSE(parses(whole.substr(0, length))) << "cut at " << length;
    for (char const* const document : {
             "<vzml></group>",
             "<vzml version='1' version='2'/>",
             "<vzml>&unknown;</vzml>",
             "<vzml>caf\xE9</vzml>",                                            // Latin-1
             "<?xml version='1.0' encoding='UTF-8'?><vzml>\xED\xA0\x80</vzml>", // a surrogate
             "<?xml version='1.0' encoding='no-such'?><vzml/>",
             " <?xml version='1.0'?><vzml/>",
         })
        EXPECT_FALSE(parses(document)) << document;
}

TEST(KVXMLReadStream, ReadsOtherEncodings)
{
    constexpr char expected[] = "(vzml (leaf:café )vzml ) ";
    EXPECT_EQ(eventsOf("\xEF\xBB\xBF<vzml><leaf>café</leaf></vzml>"), expected);
    EXPECT_EQ(eventsOf("<?xml version='1.0' encoding='iso-8859-1'?>"
                       "<vzml><leaf>caf\xE9</leaf></vzml>"),
              expected);
    std::u16string const wide = u"\xFEFF<?xml version='1.0' encoding='UTF-16'?><!-- é> --><vzml>"
                                u"<leaf>café</leaf></vzml>";
    std::string little, big;
    for (char16_t const unit : wide) {
        char const low = static_cast<char>(unit), high = static_cast<char>(unit >> 8);
        (little += low) += high;
        (big += high) += low;
    }
    EXPECT_EQ(eventsOf(little), expected);
    EXPECT_EQ(eventsOf(big), expected);
    // Encodings in which markup could hide from the look at the document's start.
    EXPECT_FALSE(parses("<?xml version='1.0' encoding='UTF-7'?><vzml/>"));
    EXPECT_FALSE(parses(std::string_view("<\0\0\0a\0\0\0/\0\0\0>\0\0\0", 16)));
    EXPECT_FALSE(parses("\x4C\x6F\xA7\x94"));
}

TEST(KVXMLReadStream, RefusesEntityBombs)
{
    std::string nested = "<!DOCTYPE vzml [<!ENTITY e0 'lol'>";
    for (int level = 1; level < 10; ++level) {
        std::string const inner = "&e" + std::to_string(level - 1) + ";";
        nested += "<!ENTITY e" + std::to_string(level) + " '";
        for (int i = 0; i < 10; ++i)
            nested += inner;
        nested += "'>";
    }
    std::string const useInAttribute = "]><vzml version='&e9;'/>";
    std::string encoded = nested;
    for (std::size_t at; (at = encoded.find("'&e")) != std::string::npos;)
        encoded.replace(at + 1, 1, "&#x26;");
    for (std::string const& document : {
             nested + useInAttribute,
             nested + "]><vzml><leaf>&e9;</leaf></vzml>",
             encoded + useInAttribute,
             std::string("<!DOCTYPE v [<!ENTITY a 'x&#38;b;'><!ENTITY b 'y'>]><vzml>&a;</vzml>"),
             std::string("<!DOCTYPE v [<!ENTITY % a '<!ENTITY b \"c\">'> %a;]><vzml/>"),
             std::string("<!DOCTYPE v [<!-- '\" ]> --><!ENTITY % a ''>]><vzml/>"),
             std::string("<?p ?><!DOCTYPE v SYSTEM 'a>[' [<?p ]>?><!ENTITY % a ''>]><vzml/>"),
             std::string("<!DOCTYPE v [<!ATTLIST v a CDATA ']>'><!ENTITY % a ''>]><vzml/>"),
             "<!DOCTYPE v [<!ENTITY a '" + std::string(9000, 'x') + "'>]><vzml/>",
         })
        EXPECT_FALSE(parses(document)) << document.substr(0, 100);
    std::u16string const wide = u"<!DOCTYPE v [<?p é?><!ENTITY % a ''>]><vzml/>";
    EXPECT_FALSE(parses({reinterpret_cast<char const*>(wide.data()), 2 * wide.size()}));
    // What is declared and not dangerous is read.
    EXPECT_TRUE(parses("<!DOCTYPE v [<!-- % --><!ELEMENT v ANY><!ATTLIST v a CDATA '>'>"
                       "<!ENTITY copy '&#169;'><!ENTITY x SYSTEM 'file:///etc/passwd'>]>"
                       "<vzml>&copy;&x;</vzml>"));
}

TEST(KVXMLReadStream, BoundsWhatAttributesTakeFromEntities)
{
    std::string const head = "<!DOCTYPE v [<!ENTITY a '" + std::string(8000, 'x') + "'>]><vzml>";
    std::string many;
    for (int i = 0; i < 100; ++i)
        many += "<leaf at='&a;&a;&a;&a;&a;&a;&a;&a;&a;&a;'/>";
    EXPECT_TRUE(parses(head + many + "</vzml>"));
    EXPECT_FALSE(parses(head + many + many + "</vzml>"));
}

TEST(KVXMLReadStream, LooksForTheRootInAMegabyte)
{
    std::string const comment = "<!-- " + std::string(700000, 'x') + " -->";
    EXPECT_TRUE(parses(comment + "<vzml/>"));
    EXPECT_FALSE(parses(comment + comment + "<vzml/>"));
    TemporaryFolder const folder; // of a file it is looked for piece by piece
    SceneRecorder recorder;
    KVXMLReadStream stream(urlOf(folder.write("long.vzml", comment + "<vzml/>")));
    stream.pushHandler(&recorder);
    EXPECT_TRUE(stream.parse());
    EXPECT_EQ(recorder.log, "(vzml ()vzml ) ");
}

TEST(KVXMLReadStream, ReadsDeepAndLongDocuments)
{
    // A handler for each of 300000 levels, and nothing recurses.
    constexpr int depth = 300000;
    std::string document = "<vzml>";
    for (int i = 0; i < depth; ++i)
        document += "<group>";
    for (int i = 0; i < depth; ++i)
        document += "</group>";
    document += "</vzml>";
    std::string const events = eventsOf(document);
    EXPECT_EQ(std::count(events.begin(), events.end(), '('), depth + 2);
    EXPECT_EQ(events.find("failed"), std::string::npos);
    EXPECT_FALSE(parses(document.substr(0, document.size() / 2)));
}

TEST(KVXMLReadStream, BoundsMarkupAndNotText)
{
    std::string const much(8'000'000, 'v');
    SceneRecorder recorder;
    std::string const read =
        eventsOf("<vzml><leaf at='" + much + "'>" + much + much + "</leaf></vzml>", recorder);
    EXPECT_EQ(read.size(), 3 * much.size() + std::string("(vzml (leaf@1=: )vzml ) ").size());
    for (auto const& [before, behind] : std::initializer_list<std::pair<char const*, char const*>>{
             {"<leaf at='", "'/>"},
             {"<leaf at='>", ""},
             {"<!--", "-->"},
             {"<![CDATA[", "]]>"},
             {"<", "/>"},
         })
        EXPECT_FALSE(parses("<vzml>" + (before + much) + much + behind + "</vzml>")) << before;
}

// Each of these takes libxml2 by itself time by the square of the length.
TEST(KVXMLReadStream, RefusesWhatWouldTakeForEver)
{
    std::string const dashes = "<!-- " + std::string(5'000'000, '-') + " -->";
    EXPECT_FALSE(parses(dashes + "<vzml/>"));
    EXPECT_FALSE(parses("<vzml>" + dashes + "</vzml>"));
    std::string attributes;
    for (int i = 0; i < 500'000; ++i)
        attributes += " a" + std::to_string(i) + "=''";
    EXPECT_FALSE(parses("<vzml><leaf" + attributes + "/></vzml>"));
    std::string wide;
    for (char const c : "<vzml><leaf" + attributes + "/></vzml>")
        (wide += c) += '\0';
    EXPECT_FALSE(parses(wide));
    std::string names;
    for (int i = 0; i < 200'000; ++i)
        names += "<n" + std::to_string(i) + "/>";
    EXPECT_FALSE(parses("<vzml>" + names + "</vzml>"));
    // Long markup of the ordinary kind is read.
    std::string some = attributes.substr(0, attributes.find(" a1000="));
    EXPECT_TRUE(parses("<vzml><!-- " + std::string(20000, 'x') + "\n- -><leaf" + some + "/> -->" +
                       "<leaf" + some + " at='>" + std::string(20000, '=') + "'/></vzml>"));
}

TEST(KVXMLReadStream, TakesElementsFromAnArenaOf16)
{
    KVXMLReadStream stream("", 0);
    std::vector<KVStreamElement*> elements;
    for (unsigned i = 0; i < 20; ++i)
        elements.push_back(stream.createElement(i, scope, nullptr));
    for (std::size_t i = 1; i < 16; ++i)
        EXPECT_EQ(reinterpret_cast<char*>(elements[i]) - reinterpret_cast<char*>(elements[i - 1]),
                  reinterpret_cast<char*>(elements[1]) - reinterpret_cast<char*>(elements[0]))
            << "one behind the other";
    while (elements.size() > 15) {
        stream.destroyElement(elements.back());
        elements.pop_back();
    }
    // A place that is taken out of turn is not taken twice.
    stream.destroyElement(elements[3]);
    elements[3] = stream.createElement(99, scope, nullptr);
    EXPECT_EQ(elements[14]->token, 14u);
    EXPECT_EQ(elements[3]->token, 99u);
    for (KVStreamElement* const element : elements)
        stream.destroyElement(element);
    stream.destroyElement(nullptr);
}

TEST(KVXMLReadStream, TellsItsObserverWhatIsUnknown)
{
    struct Observer : KVXMLReadObserver {
        void unknownElement(char const* name, unsigned long line) override
        {
            log += std::to_string(line) + ":" + name + " ";
        }
        void unknownAttribute(KVStreamElement const& element, char const* name,
                              unsigned long line) override
        {
            log += std::to_string(line) + ":" + SceneRecorder().nameOf(element.token) + "." + name +
                   " ";
        }
        std::string log;
    };
    // Lines above 65535 do not fit what libxml2 keeps for a node.
    std::string document = "<vzml>\n<other/>\n<leaf bad='1'\n at='2' p:q='3' xmlns:p='u'/>";
    document += std::string(70000, '\n') + "<more><inside/></more><leaf worse=''/>\n";
    document += std::string(10, '\n') + "<last/></vzml>";
    KVXMLReadStream stream(document.data(), static_cast<int>(document.size()));
    Observer observer;
    stream.setObserver(&observer);
    SceneRecorder recorder;
    stream.pushHandler(&recorder);
    EXPECT_TRUE(stream.parse());
    EXPECT_EQ(observer.log, "2:other 4:leaf.xmlns:p 4:leaf.bad 4:leaf.p:q 70004:more "
                            "70004:leaf.worse 70015:last ");
    EXPECT_EQ(recorder.log, "(vzml (leaf@1=2 leaf )vzml ) ");
}

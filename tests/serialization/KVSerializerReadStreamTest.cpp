#include "SerializationSupport.h"

#include <support/Allocations.h>

namespace {

/// A stream with nothing to read: the frame alone.
class Frame : public KVSerializerReadStream {
public:
    bool parse() override { return false; }
    void abortParse() override {}
    void stopParse() override {}

    /// The row that is found for a name or token; null without one.
    template <class Key>
    KVScope* find(Key key)
    {
        KVScope* row = nullptr;
        return getElementInfo(key, &row, &scope, &handler) ? row : nullptr;
    }
    KVScope* scope = nullptr;        // of the last row found
    KVSerializer* handler = nullptr; // and its handler
};

using Element = KVXMLStreamElement;

std::string events;

/// Notes its calls in a text that handlers share.
class Handler : public KVIgnoreElement {
public:
    explicit Handler(std::string name) : name_(std::move(name)) { events.clear(); }
    bool parseBegin(KVSerializerReadStream& stream) override
    {
        events += "begin " + name_ + "; ";
        if (onBegin)
            onBegin(stream);
        return answer;
    }
    bool parseEnd(KVSerializerReadStream& stream) override
    {
        events += "end " + name_ + "; ";
        if (onEnd)
            onEnd(stream);
        return true;
    }
    bool parseElement(KVSerializerReadStream&, KVStreamElement&) override
    {
        events += "element " + name_ + "; ";
        return answer;
    }

    std::function<void(KVSerializerReadStream&)> onBegin, onEnd;
    bool answer = true;

private:
    std::string name_;
};

KVScope first[] = {{"clip", 1, 0}, {"name", 1, 7}, {"both", 2, 0}, {"note", 3, 5}, {nullptr, 0, 0}};
KVScope second[] = {{"both", 20, 0}, {"note", 30, 0}, {nullptr, 0, 0}};
KVScope wildcard[] = {{"any", 9, 6}, {"*", 99, 0}, {"note", 31, 0}, {nullptr, 0, 0}};
KVScope none[] = {{nullptr, 0, 0}};

} // namespace

TEST(KVSerializerReadStream, DoesNothingWithNothing)
{
    Frame frame;
    EXPECT_EQ(frame.currentElement(), nullptr);
    EXPECT_EQ(frame.currentHandler(), nullptr);
    EXPECT_EQ(frame.currentHandlerElement(), nullptr);
    frame.popElement();
    frame.popHandler();
    frame.pushScope(first);
    EXPECT_EQ(frame.timeScaleSeconds(), 1.0);
    frame.setTimeScale(CMTimeMake(1001, 30000));
    EXPECT_DOUBLE_EQ(frame.timeScaleSeconds(), 1001.0 / 30000);
    frame.setVersion(2, 5);
    EXPECT_TRUE(frame.isLessThanVersion(2, 6) && frame.isLessThanVersion(3, 0));
    EXPECT_FALSE(frame.isLessThanVersion(2, 5) || frame.isLessThanVersion(1, 9));
}

TEST(KVSerializerReadStream, FindsElementsInTheOrderOfPushing)
{
    struct Row {
        std::vector<KVScope*> scopes;
        char const* name;
        KVScope* row; // null: not found
        KVScope* scope;
    } const rows[] = {
        {{first, second}, "both", first + 2, first},
        {{second, first}, "both", second, second},
        {{first, second}, "note", second + 1, second}, // the first table has an attribute so named
        {{first}, "note", nullptr, nullptr},
        {{first}, "Clip", nullptr, nullptr},
        {{first}, "", nullptr, nullptr},
        {{}, "clip", nullptr, nullptr},
        {{none, nullptr, first}, "clip", first, first},
        {{first, wildcard, second}, "both", first + 2, first},
        {{wildcard, first}, "clip", wildcard + 1, wildcard}, // shadows later tables
        {{wildcard}, "note", wildcard + 1, wildcard},        // and later rows
    };
    Handler handler("h");
    for (Row const& row : rows) {
        Frame frame;
        frame.pushHandler(&handler);
        for (KVScope* const scope : row.scopes)
            frame.pushScope(scope);
        frame.scope = none;
        EXPECT_EQ(frame.find(row.name), row.row) << row.name;
        EXPECT_EQ(frame.scope, row.scope) << row.name;
        EXPECT_EQ(frame.handler, row.row ? &handler : nullptr) << row.name;
    }
}

TEST(KVSerializerReadStream, SearchesTheTopHandlersScopesOnly)
{
    Handler outer("outer"), inner("inner");
    inner.onBegin = [](KVSerializerReadStream& stream) { stream.pushScope(second); };
    Frame frame;
    frame.scope = none;
    EXPECT_FALSE(frame.find(1u));
    EXPECT_EQ(frame.scope, none) << "left as it was without a handler";
    frame.pushHandler(&outer);
    frame.pushScope(first);
    EXPECT_EQ(frame.find(1u), first);
    EXPECT_FALSE(frame.find(3u)) << "that is an attribute's row";
    EXPECT_FALSE(frame.scope);
    frame.pushHandler(&inner);
    EXPECT_FALSE(frame.find("clip"));
    EXPECT_EQ(frame.find("both"), second);
    frame.popHandler();
    EXPECT_TRUE(frame.find("clip"));
    EXPECT_EQ(frame.handler, &outer);
    frame.pushScope(wildcard);
    EXPECT_EQ(frame.find(12345u), wildcard + 1);
    frame.ignoreElement();
    EXPECT_EQ(frame.currentHandler(), &KVIgnoreElement::sharedInstance());
    EXPECT_FALSE(frame.find("clip")) << "what is ignored has no scope";
}

TEST(KVSerializerReadStream, PushesAndPopsHandlers)
{
    Handler a("a"), b("b");
    b.answer = false;
    Frame frame;
    EXPECT_TRUE(frame.pushHandler(&a));
    auto* const element = new Element(1, nullptr, nullptr);
    frame.pushElement(element);
    EXPECT_FALSE(frame.pushHandler(&b)) << "the answer of parseBegin";
    EXPECT_EQ(frame.currentHandler(), &b);
    EXPECT_EQ(frame.currentHandlerElement(), element);
    frame.popHandler();
    EXPECT_EQ(frame.currentHandlerElement(), nullptr);
    frame.pushHandler(&b);
    frame.popAllHandlers();
    EXPECT_EQ(events, "begin a; begin b; end b; begin b; end b; end a; ");

    a.onEnd = [&](KVSerializerReadStream& stream) { stream.pushHandler(&b); };
    frame.pushHandler(&a);
    frame.popHandler();
    EXPECT_EQ(frame.currentHandler(), &b) << "what parseEnd pushed stays";
}

TEST(KVSerializerReadStream, ForgetsAnElementThatIsGone)
{
    Handler a("a"), b("b");
    Frame frame;
    frame.pushElement(new Element(1, nullptr, nullptr));
    frame.pushHandler(&a);
    frame.pushHandler(&b);
    frame.popHandler();
    EXPECT_NE(frame.currentHandlerElement(), nullptr);
    frame.popElement();
    // The first of two handlers stays until all are popped, and no later element, which may have
    // the same address, ends it.
    EXPECT_EQ(frame.currentHandler(), &a);
    EXPECT_EQ(frame.currentHandlerElement(), nullptr);
}

TEST(KVSerializerReadStream, HandsElementsToTheirHandler)
{
    Handler handler("h");
    Frame frame;
    Element element(1, nullptr, &handler), orphan(1, nullptr, nullptr);
    EXPECT_TRUE(frame.processElement(element));
    EXPECT_TRUE(element.processed);
    handler.answer = false;
    EXPECT_FALSE(frame.processElement(element));
    EXPECT_EQ(events, "element h; element h; ");
    EXPECT_FALSE(frame.processElement(orphan));
    EXPECT_FALSE(orphan.processed);
}

TEST(KVSerializerReadStream, DestroysWhatIsLeftAndCallsNoHandler)
{
    Handler handler("h");
    allocations::startPeak();
    {
        Frame frame;
        frame.pushHandler(&handler);
        for (int i = 0; i < 1000; ++i)
            frame.pushElement(new Element(1, nullptr, nullptr));
        frame.pushElement(nullptr);
        frame.popElement();
        frame.popElement();
    }
    EXPECT_LT(allocations::held(), 1000); // bytes: all but what the shared text of events takes
    EXPECT_EQ(events, "begin h; ");
}

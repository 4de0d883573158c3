// Documents made by chance, with every kind of value at its edges: both forms hold the same.

#include "scene/SceneFile.h"

#include <korvane/korvane.h>

#include <gtest/gtest.h>

#include <cstring>
#include <random>

namespace {

using scene::Kind;

class Generator {
public:
    explicit Generator(unsigned int seed) : random_(seed) {}

    std::string document()
    {
        std::string text = "<?xml version=\"1.0\"?>\n<vzml version=\"1.0\">";
        elementsIn(scene::infoOf(scene::kDocument), text, 0);
        return text + "</vzml>";
    }

private:
    unsigned int below(std::size_t count) { return static_cast<unsigned int>(random_() % count); }

    template <std::size_t count>
    std::string oneOf(char const* const (&texts)[count])
    {
        return texts[below(count)];
    }

    void elementsIn(scene::ElementInfo const& info, std::string& text, unsigned int depth)
    {
        if (info.children.empty() || depth > 6)
            return;
        for (unsigned int i = below(5); i > 0; --i)
            element(scene::infoOf(info.children[below(info.children.size())]), text, depth);
    }

    void element(scene::ElementInfo const& info, std::string& text, unsigned int depth)
    {
        text += std::string("<") + info.name;
        for (scene::AttributeInfo const& attribute : info.attributes)
            if (below(4) != 0)
                text += std::string(" ") + attribute.name + "=\"" + value(attribute.kind) + "\"";
        text += ">";
        if (info.content != Kind::None && below(8) != 0)
            text += value(info.content);
        elementsIn(info, text, depth + 1);
        text += std::string("</") + info.name + ">";
    }

    /// The edges of a kind as a document may spell them, and what lies between.
    std::string value(Kind kind)
    {
        if (below(6) == 0) // also what is no value of the kind
            return oneOf({"", "12abc", "nan", "99999999999999999999", "-1e400", " 7 ", "+5", "x"});
        switch (kind) {
        case Kind::Int:
        case Kind::Int64:
            return below(3) == 0 ? integer(below(64), below(2)) : oneOf(signedEdges);
        case Kind::UInt:
        case Kind::UInt64:
            return below(3) == 0 ? integer(below(64), false) : oneOf(unsignedEdges);
        case Kind::Float:
        case Kind::Double:
            return below(3) == 0 ? number() : oneOf(floatEdges);
        case Kind::UUID:
            return oneOf({"00000000000000000000000000000000", "ffffffffffffffffffffffffffffffff",
                          "0123456789ABCDEFfedcba9876543210", "0123456789abcdef-123"});
        case Kind::Time:
            return oneOf(signedEdges) + " " + oneOf(signedEdges) + " " +
                   oneOf({"0", "1", "1d", "ffffffff", "0x3"}) + " " + oneOf(unsignedEdges);
        default:
            return text();
        }
    }

    std::string integer(unsigned int bits, bool negative)
    {
        return (negative ? "-" : "") + std::to_string(random_() >> (63 - bits));
    }

    std::string number()
    {
        double value;
        std::uint64_t const bits = random_();
        std::memcpy(&value, &bits, sizeof value);
        return KVString::ssprintf("%.17g", value).toUTF8();
    }

    std::string text()
    {
        std::string result;
        for (unsigned int i = below(12); i > 0; --i)
            result += oneOf({"a", " ", "&amp;", "&lt;", "&gt;", "&quot;", "'", "é", "\u4E16",
                             "\U0001F600", "\n", "\t", "&#13;", "&amp;lt;", "\u2028", "12"});
        return result;
    }

    static constexpr char const* signedEdges[] = {"0",
                                                  "1",
                                                  "-1",
                                                  "2",
                                                  "-2",
                                                  "127",
                                                  "128",
                                                  "255",
                                                  "256",
                                                  "-255",
                                                  "-256",
                                                  "65535",
                                                  "65536",
                                                  "16777215",
                                                  "16777216",
                                                  "2147483646",
                                                  "2147483647",
                                                  "2147483648",
                                                  "-2147483647",
                                                  "-2147483648",
                                                  "-2147483649",
                                                  "-4294967295",
                                                  "-4294967296",
                                                  "4294967295",
                                                  "4294967296",
                                                  "1099511627776",
                                                  "9223372036854775807",
                                                  "-9223372036854775807",
                                                  "-9223372036854775808"};
    static constexpr char const* unsignedEdges[] = {"0",
                                                    "1",
                                                    "2",
                                                    "255",
                                                    "256",
                                                    "65535",
                                                    "65536",
                                                    "2147483647",
                                                    "2147483648",
                                                    "4294967295",
                                                    "4294967296",
                                                    "9223372036854775807",
                                                    "9223372036854775808",
                                                    "18446744073709551615"};
    static constexpr char const* floatEdges[] = {"0",
                                                 "-0",
                                                 "1",
                                                 "-1",
                                                 "-2",
                                                 "0.5",
                                                 "0.1",
                                                 "-0.1",
                                                 "nan",
                                                 "-nan",
                                                 "inf",
                                                 "-inf",
                                                 "16777216",
                                                 "16777217",
                                                 "9007199254740992",
                                                 "9007199254740993",
                                                 "9223372036854775807",
                                                 "9223372036854775808",
                                                 "-9223372036854775808",
                                                 "1e19",
                                                 "3.4028235e38",
                                                 "1e39",
                                                 "1.17549435e-38",
                                                 "1e-45",
                                                 "4.9406564584124654e-324",
                                                 "2.2250738585072014e-308",
                                                 "1.7976931348623157e308",
                                                 "0x1p-3",
                                                 "1e400"};

    std::mt19937_64 random_;
};

std::string saved(scene::Node& root, scene::Form form)
{
    KVBufferWriteStream bytes(4096, 4096);
    scene::save(root, form, bytes);
    return {reinterpret_cast<char const*>(bytes.getBuffer()), bytes.getBufferSize()};
}

} // namespace

TEST(SceneForms, HoldTheSame)
{
    std::size_t compared = 0;
    for (unsigned int seed = 1; seed <= 1000; ++seed) {
        std::string const text = Generator(seed).document();
        scene::Document first;
        scene::loadBytes(text, "generated", first);
        std::string const normal = saved(first.root, scene::Form::Text);
        std::string const binary = saved(first.root, scene::Form::Binary);
        scene::Document second;
        scene::loadBytes(binary, "generated", second);
        ASSERT_EQ(second.form, scene::Form::Binary);
        ASSERT_EQ(saved(second.root, scene::Form::Text), normal) << "seed " << seed << "\n" << text;
        ASSERT_EQ(saved(second.root, scene::Form::Binary), binary) << "seed " << seed;
        ASSERT_EQ(hashOf(second.root).getString().toUTF8(), hashOf(first.root).getString().toUTF8())
            << "seed " << seed;
        compared += normal.size();
    }
    EXPECT_GT(compared, 500000u); // the documents were not empty
}

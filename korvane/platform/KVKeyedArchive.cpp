#include <korvane/platform/KVKeyedArchive_p.h>

#include <bit>

// The byte form. Objects come before what refers to them, so that no reference can lead in a
// circle; what they hold is sorted by key, so that an archive has one form.
//
//     archive = "KVKA" 01 count object*count keys
//     object  = 00                          NSNull
//             | 01 length byte*length       string, every byte below 0x80
//             | 02 length unit*length       string in UTF-16, one unit at least not below 0x80
//             | 03 int64  |  04 double      number
//             | 05 length byte*length       data
//             | 06 count index*count        array
//             | 07 name keys                object of the class `name`
//     keys    = count (name value)*count    the names ascending by byte, each once
//     value   = 10 length byte*length  |  11 int64  |  12 double  |  13 (00 or 01)  |  14 index
//     name    = length byte*length          ASCII; the name of a class is not empty
//
// Counts, lengths and indexes are LEB128 in its shortest form; an index is that of an earlier
// object. Units, integers and doubles (IEEE 754) are little-endian. Nothing follows the keys.

namespace kv::archive {

namespace {

constexpr std::string_view magic = "KVKA\x01";

enum ObjectTag : std::uint8_t {
    tagNull,
    tagASCII,
    tagUTF16,
    tagInteger,
    tagReal,
    tagData,
    tagArray,
    tagRecord
};
enum ValueTag : std::uint8_t { tagBlock = 0x10, tagInt64, tagDouble, tagBool, tagReference };

class Writer {
public:
    void byte(unsigned int value) { bytes_.push_back(static_cast<std::uint8_t>(value)); }
    void number(std::uint64_t value)
    {
        for (; value >= 0x80; value >>= 7)
            byte((value & 0x7F) | 0x80);
        byte(static_cast<unsigned int>(value));
    }
    void fixed(std::uint64_t value, unsigned int size)
    {
        for (unsigned int i = 0; i < size; ++i)
            byte(value >> (8 * i) & 0xFF);
    }
    void integer(std::int64_t value) { fixed(static_cast<std::uint64_t>(value), 8); }
    void real(double value) { fixed(std::bit_cast<std::uint64_t>(value), 8); }
    void block(std::span<std::uint8_t const> bytes)
    {
        number(bytes.size());
        bytes_.insert(bytes_.end(), bytes.begin(), bytes.end());
    }
    void name(std::string_view text)
    {
        number(text.size());
        bytes_.insert(bytes_.end(), text.begin(), text.end());
    }
    void string(__CFString const& string)
    {
        byte(string.isASCII() ? tagASCII : tagUTF16);
        number(string.length());
        for (char16_t const unit : string.view())
            fixed(unit, string.isASCII() ? 1 : 2);
    }
    void keys(Keys const& keys)
    {
        number(keys.size());
        for (auto const& [key, held] : keys) {
            name(key);
            std::visit(Overloaded{
                           [this](Bytes const& bytes) { byte(tagBlock), block(bytes); },
                           [this](std::int64_t value) { byte(tagInt64), integer(value); },
                           [this](double value) { byte(tagDouble), real(value); },
                           [this](bool flag) { byte(tagBool), byte(flag); },
                           [this](Reference to) { byte(tagReference), number(to.index); },
                       },
                       held);
        }
    }
    void node(Node const& node)
    {
        std::visit(Overloaded{
                       [this](std::monostate) { byte(tagNull); },
                       [this](KVCFRef<CFStringRef> const& text) { string(*text); },
                       [this](std::int64_t value) { byte(tagInteger), integer(value); },
                       [this](double value) { byte(tagReal), real(value); },
                       [this](Bytes const& bytes) { byte(tagData), block(bytes); },
                       [this](Elements const& elements) {
                           byte(tagArray), number(elements.size());
                           for (std::size_t const index : elements)
                               number(index);
                       },
                       [this](std::unique_ptr<Record> const& record) {
                           byte(tagRecord), name(record->className), keys(record->keys);
                       },
                   },
                   node.content);
    }

    Bytes take() { return std::move(bytes_); }

private:
    Bytes bytes_{magic.begin(), magic.end()};
};

/// Reads the byte form. After the first fault `ok` is false and everything reads as zero or empty.
class Reader {
public:
    explicit Reader(std::span<std::uint8_t const> bytes) : rest_(bytes) {}

    bool ok() const { return ok_; }
    bool atEnd() const { return rest_.empty(); }

    std::span<std::uint8_t const> take(std::size_t size)
    {
        if (size > rest_.size()) {
            fail();
            return {};
        }
        auto const taken = rest_.first(size);
        rest_ = rest_.subspan(size);
        return taken;
    }
    std::uint8_t byte()
    {
        auto const taken = take(1);
        return taken.empty() ? 0 : taken[0];
    }
    std::uint64_t fixed64()
    {
        std::uint64_t value = 0;
        for (unsigned int shift = 0; std::uint8_t const b : take(8)) {
            value |= std::uint64_t(b) << shift;
            shift += 8;
        }
        return value;
    }
    std::int64_t integer() { return static_cast<std::int64_t>(fixed64()); }
    double real() { return std::bit_cast<double>(fixed64()); }
    std::uint64_t number()
    {
        std::uint64_t value = 0;
        for (unsigned int shift = 0; shift < 63; shift += 7) {
            std::uint8_t const b = byte();
            value |= std::uint64_t(b & 0x7F) << shift;
            if (b < 0x80) {
                // The last byte adds something, or it should not be there.
                return b != 0 || shift == 0 ? value : fail();
            }
        }
        return fail();
    }
    /// How many items follow, of `size` bytes each or more: no more than there is room for.
    std::size_t count(std::size_t size)
    {
        std::uint64_t const value = number();
        return value <= rest_.size() / size ? static_cast<std::size_t>(value) : fail();
    }
    std::span<std::uint8_t const> block() { return take(count(1)); }
    std::string name()
    {
        auto const bytes = block();
        std::string text(bytes.begin(), bytes.end());
        if (!isASCII(text))
            fail();
        return text;
    }

    /// Reads one object that comes behind `earlier`.
    Node node(std::vector<Node> const& earlier)
    {
        Node node;
        switch (byte()) {
        case tagNull:
            break;
        case tagASCII:
            node.content = KVCFRef<CFStringRef>::adopt(__CFString::createASCII(name()));
            break;
        case tagUTF16:
            node.content = utf16();
            break;
        case tagInteger:
            node.content = integer();
            break;
        case tagReal:
            node.content = real();
            break;
        case tagData: {
            auto const bytes = block();
            node.content = Bytes(bytes.begin(), bytes.end());
            break;
        }
        case tagArray: {
            Elements elements(count(1));
            for (std::size_t& element : elements)
                element = index(earlier, node);
            node.content = std::move(elements);
            break;
        }
        case tagRecord: {
            auto record = std::make_unique<Record>();
            record->className = name();
            if (record->className.empty())
                fail();
            record->keys = keys(earlier, node);
            node.content = std::move(record);
            break;
        }
        default:
            fail();
        }
        return node;
    }
    Keys keys(std::vector<Node> const& earlier, Node& owner)
    {
        Keys keys;
        // A name's length, a tag and a flag or an index.
        for (std::size_t left = count(3); left != 0 && ok_; --left) {
            std::string key = name();
            if (!keys.empty() && key <= keys.rbegin()->first)
                fail();
            keys.emplace_hint(keys.end(), std::move(key), value(earlier, owner));
        }
        return keys;
    }

private:
    std::uint8_t fail()
    {
        ok_ = false;
        rest_ = {};
        return 0;
    }
    KVCFRef<CFStringRef> utf16()
    {
        auto const bytes = take(2 * count(2));
        std::u16string units(bytes.size() / 2, u'\0');
        for (std::size_t i = 0; i < units.size(); ++i)
            units[i] = static_cast<char16_t>(bytes[2 * i] | bytes[2 * i + 1] << 8);
        auto const string = KVCFRef<CFStringRef>::adopt(__CFString::create(units));
        if (string->isASCII())
            fail();
        return string;
    }
    /// An index into `earlier`, which makes `owner` as high as that asks.
    std::size_t index(std::vector<Node> const& earlier, Node& owner)
    {
        std::uint64_t const index = number();
        if (index >= earlier.size())
            return fail();
        owner.height = std::max(owner.height, earlier[index].height + 1);
        return static_cast<std::size_t>(index);
    }
    Value value(std::vector<Node> const& earlier, Node& owner)
    {
        switch (byte()) {
        case tagBlock: {
            auto const bytes = block();
            return Bytes(bytes.begin(), bytes.end());
        }
        case tagInt64:
            return integer();
        case tagDouble:
            return real();
        case tagBool: {
            std::uint8_t const flag = byte();
            if (flag > 1)
                fail();
            return flag == 1;
        }
        case tagReference:
            return Reference{index(earlier, owner)};
        default:
            fail();
            return false;
        }
    }

    std::span<std::uint8_t const> rest_;
    bool ok_ = true;
};

} // namespace

Bytes write(Graph const& graph)
{
    Writer writer;
    writer.number(graph.nodes.size());
    for (Node const& node : graph.nodes)
        writer.node(node);
    writer.keys(graph.keys);
    return writer.take();
}

std::optional<Graph> read(std::span<std::uint8_t const> bytes, unsigned int maximumHeight)
{
    Reader reader(bytes);
    if (!std::ranges::equal(reader.take(magic.size()), magic))
        return std::nullopt;
    Graph graph;
    for (std::size_t left = reader.count(1); left != 0 && reader.ok(); --left) {
        graph.nodes.push_back(reader.node(graph.nodes));
        if (graph.nodes.back().height > maximumHeight)
            return std::nullopt;
    }
    Node root;
    graph.keys = reader.keys(graph.nodes, root);
    if (!reader.ok() || !reader.atEnd())
        return std::nullopt;
    return graph;
}

} // namespace kv::archive

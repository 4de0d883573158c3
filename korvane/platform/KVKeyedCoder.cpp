#include <korvane/platform/KVKeyedCoder.h>

#include <korvane/foundation/KVException.h>
#include <korvane/platform/CFArray.h>
#include <korvane/platform/CFData.h>
#include <korvane/platform/CFNumber.h>

#include <algorithm>
#include <bit>
#include <map>
#include <string>
#include <unordered_map>
#include <variant>

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

namespace {

using Bytes = std::vector<std::uint8_t>;

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

struct Reference {
    std::size_t index;
};
using Value = std::variant<Bytes, std::int64_t, double, bool, Reference>;
using Keys = std::map<std::string, Value, std::less<>>;

/// An object of a class that archives itself.
struct Record {
    std::string className;
    Keys keys;
};

using Elements = std::vector<std::size_t>;
using Content = std::variant<std::monostate, KVCFRef<CFStringRef>, std::int64_t, double, Bytes,
                             Elements, std::unique_ptr<Record>>;

struct Node {
    Content content;
    /// What was made of it, once that has been asked for.
    KVNSRef<NSObject*> object;
    /// Its class was asked and made no object of it.
    bool failed = false;
    /// 1 more than the highest node that it refers to.
    unsigned int height = 1;
};

template <class... Functions>
struct Overloaded : Functions... {
    using Functions::operator()...;
};
template <class... Functions>
Overloaded(Functions...) -> Overloaded<Functions...>;

bool isASCII(std::string_view text)
{
    return std::ranges::all_of(text, [](char c) { return static_cast<unsigned char>(c) < 0x80; });
}

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

struct KVKeyedCoder::Archive {
    using Classes = std::vector<NSCodingClass const*>;

    /// An object that was met while writing, kept so that its address stays its own.
    struct Met {
        KVNSRef<NSObject const*> object;
        std::size_t index = beingWritten;
    };
    static constexpr std::size_t beingWritten = SIZE_MAX;

    /// Makes an object's keys the current ones for as long as it stands.
    class Within {
    public:
        Within(Archive& archive, Keys& keys)
            : archive_(archive), outer_(std::exchange(archive.keys, &keys))
        {}
        Within(Within const&) = delete;
        Within& operator=(Within const&) = delete;
        ~Within() { archive_.keys = outer_; }

    private:
        Archive& archive_;
        Keys* outer_;
    };

    // --- Writing ---

    void set(std::string_view key, Value value)
    {
        checkWritable(key);
        keys->insert_or_assign(std::string(key), std::move(value));
    }
    void checkWritable(std::string_view key) const
    {
        if (reading)
            throw KVIllegalArgumentException("an object is written while one is read", __FILE__,
                                             __LINE__);
        if (!isASCII(key))
            throw KVIllegalArgumentException("a key is not ASCII", __FILE__, __LINE__);
    }

    /// The index of the object's node, which is added unless the object was met before.
    std::size_t add(NSObject const& object)
    {
        auto const [entry, isNew] = met.try_emplace(&object);
        if (!isNew && entry->second.index == beingWritten)
            throw KVIllegalArgumentException("an archived object holds itself", __FILE__, __LINE__);
        if (!isNew)
            return entry->second.index;
        try {
            entry->second.object = &object;
            Node node = nodeOf(object);
            nodes.push_back(std::move(node));
        } catch (...) {
            met.erase(&object);
            throw;
        }
        // Objects that were met within this one may have moved the table's entries.
        std::size_t const index = nodes.size() - 1;
        met.at(&object).index = index;
        return index;
    }

    Node nodeOf(NSObject const& object)
    {
        Node node;
        if (auto const* string = dynamic_cast<__CFString const*>(&object))
            node.content = KVCFRef<CFStringRef>(string);
        else if (auto const* number = dynamic_cast<__CFNumber const*>(&object))
            node.content =
                number->isFloat() ? Content(number->doubleValue()) : Content(number->int64Value());
        else if (auto const* data = dynamic_cast<__CFData const*>(&object))
            node.content = Bytes(data->span().begin(), data->span().end());
        else if (dynamic_cast<NSNull const*>(&object))
            node.content = std::monostate();
        else if (auto const* array = dynamic_cast<__CFArray const*>(&object))
            fillArray(node, *array);
        else if (auto const* coding = dynamic_cast<NSCoding const*>(&object))
            fillRecord(node, *coding);
        else
            throw KVIllegalArgumentException("an object of this class cannot be archived", __FILE__,
                                             __LINE__);
        return node;
    }
    void fillArray(Node& node, __CFArray const& array)
    {
        Elements elements;
        elements.reserve(array.count());
        Deeper const deeper(*this);
        for (NSObject const* element : array.objects()) {
            elements.push_back(add(*element));
            raise(node, elements.back());
        }
        node.content = std::move(elements);
    }
    void fillRecord(Node& node, NSCoding const& coding)
    {
        auto record = std::make_unique<Record>();
        record->className = coding.codingClass().name;
        if (record->className.empty() || !isASCII(record->className))
            throw KVIllegalArgumentException("a class name is empty or not ASCII", __FILE__,
                                             __LINE__);
        Deeper const deeper(*this);
        Within const within(*this, record->keys);
        coding.encodeWithCoder(*coder);
        for (auto const& [key, value] : record->keys)
            if (auto const* to = std::get_if<Reference>(&value))
                raise(node, to->index);
        node.content = std::move(record);
    }

    /// Counts the objects that are being written within one another.
    class Deeper {
    public:
        explicit Deeper(Archive& archive) : archive_(archive)
        {
            if (archive.depth == maximumDepth)
                throwTooDeep();
            ++archive.depth;
        }
        Deeper(Deeper const&) = delete;
        Deeper& operator=(Deeper const&) = delete;
        ~Deeper() { --archive_.depth; }

    private:
        Archive& archive_;
    };
    /// Makes the node as high as a reference to another asks.
    void raise(Node& node, std::size_t index) const
    {
        node.height = std::max(node.height, nodes[index].height + 1);
        if (node.height > maximumDepth)
            throwTooDeep();
    }
    [[noreturn]] static void throwTooDeep()
    {
        throw KVIllegalArgumentException("archived objects nest too deep", __FILE__, __LINE__);
    }

    // --- Reading ---

    template <class T>
    T const* find(std::string_view key) const
    {
        auto const found = keys->find(key);
        return found == keys->end() ? nullptr : std::get_if<T>(&found->second);
    }
    template <class T>
    T valueOrNothing(std::string_view key) const
    {
        T const* value = find<T>(key);
        return value ? *value : T();
    }

    /// The number of this list among those that were asked for.
    std::size_t listOf(AllowedClasses allowed)
    {
        Classes classes(allowed);
        std::ranges::sort(classes);
        auto const found = std::ranges::find(lists, classes);
        if (found != lists.end())
            return static_cast<std::size_t>(found - lists.begin());
        lists.push_back(std::move(classes));
        return lists.size() - 1;
    }
    NSCodingClass const* classNamed(std::string_view name, std::size_t list) const
    {
        auto const found = std::ranges::find_if(lists[list], [name](NSCodingClass const* allowed) {
            return allowed && allowed->initWithCoder && allowed->name == name;
        });
        return found == lists[list].end() ? nullptr : *found;
    }
    bool isAllowed(std::size_t index, std::size_t list)
    {
        auto const listed = [&](NSCodingClass const& type) {
            return std::ranges::binary_search(lists[list], &type);
        };
        return std::visit(
            Overloaded{
                [&](std::monostate) { return listed(NSNullCodingClass); },
                [&](KVCFRef<CFStringRef> const&) { return listed(NSStringCodingClass); },
                [&](std::int64_t) { return listed(NSNumberCodingClass); },
                [&](double) { return listed(NSNumberCodingClass); },
                [&](Bytes const&) { return listed(NSDataCodingClass); },
                [&](Elements const& elements) {
                    return listed(NSArrayCodingClass) && areAllowed(index, elements, list);
                },
                [&](std::unique_ptr<Record> const& record) {
                    return classNamed(record->className, list) != nullptr;
                },
            },
            nodes[index].content);
    }
    bool areAllowed(std::size_t array, Elements const& elements, std::size_t list)
    {
        // An array may stand in many places: it is looked through once for each list.
        auto const known = arraysAllowed.find({array, list});
        if (known != arraysAllowed.end())
            return known->second;
        bool const all = std::ranges::all_of(
            elements, [&](std::size_t element) { return isAllowed(element, list); });
        arraysAllowed.emplace(std::pair(array, list), all);
        return all;
    }

    /// The node's object, made if that was not tried before; all that it holds is of allowed
    /// classes.
    KVNSRef<NSObject*> make(std::size_t index, std::size_t list)
    {
        Node& node = nodes[index];
        if (!node.object && !node.failed) {
            node.object = std::visit(
                Overloaded{
                    [](std::monostate) -> KVNSRef<NSObject*> { return NSNull::null(); },
                    [](KVCFRef<CFStringRef> const& string) -> KVNSRef<NSObject*> {
                        return const_cast<__CFString*>(string.get());
                    },
                    [](std::int64_t value) -> KVNSRef<NSObject*> {
                        return KVMakeRef<__CFNumber>(static_cast<long long>(value));
                    },
                    [](double value) -> KVNSRef<NSObject*> { return KVMakeRef<__CFNumber>(value); },
                    [](Bytes const& bytes) -> KVNSRef<NSObject*> {
                        return KVMakeRef<__CFData>(bytes);
                    },
                    [&](Elements const& elements) { return makeArray(elements, list); },
                    [&](std::unique_ptr<Record> const& record) {
                        return makeObject(*record, list);
                    },
                },
                node.content);
            node.failed = !node.object;
        }
        return node.object;
    }
    KVNSRef<NSObject*> makeArray(Elements const& elements, std::size_t list)
    {
        std::vector<NSObject const*> objects;
        objects.reserve(elements.size());
        for (std::size_t const element : elements) {
            // The node holds it.
            objects.push_back(make(element, list));
            if (!objects.back())
                return nullptr;
        }
        return KVMakeRef<__CFArray>(objects);
    }
    KVNSRef<NSObject*> makeObject(Record& record, std::size_t list)
    {
        struct Reading {
            explicit Reading(unsigned int& count) : count_(count) { ++count_; }
            ~Reading() { --count_; }
            unsigned int& count_;
        } const isReading(reading);
        Within const within(*this, record.keys);
        return classNamed(record.className, list)->initWithCoder(*coder);
    }

    KVKeyedCoder* coder;
    std::vector<Node> nodes;
    Keys rootKeys;
    /// Of the object that is being written or read.
    Keys* keys = &rootKeys;

    std::unordered_map<NSObject const*, Met> met;
    unsigned int depth = 0;

    unsigned int reading = 0;
    std::vector<Classes> lists;
    std::map<std::pair<std::size_t, std::size_t>, bool> arraysAllowed;
};

KVKeyedCoder::KVKeyedCoder() : archive_(std::make_unique<Archive>())
{
    archive_->coder = this;
}

KVKeyedCoder::~KVKeyedCoder() = default;

std::unique_ptr<KVKeyedCoder> KVKeyedCoder::fromBytes(std::span<std::uint8_t const> bytes)
{
    Reader reader(bytes);
    if (!std::ranges::equal(reader.take(magic.size()), magic))
        return nullptr;
    auto coder = std::make_unique<KVKeyedCoder>();
    std::vector<Node>& nodes = coder->archive_->nodes;
    for (std::size_t left = reader.count(1); left != 0 && reader.ok(); --left) {
        nodes.push_back(reader.node(nodes));
        if (nodes.back().height > maximumDepth)
            return nullptr;
    }
    Node root;
    coder->archive_->rootKeys = reader.keys(nodes, root);
    return reader.ok() && reader.atEnd() ? std::move(coder) : nullptr;
}

std::vector<std::uint8_t> KVKeyedCoder::archivedBytes() const
{
    Writer writer;
    writer.number(archive_->nodes.size());
    for (Node const& node : archive_->nodes)
        writer.node(node);
    writer.keys(archive_->rootKeys);
    return writer.take();
}

void KVKeyedCoder::encodeBytes(void const* bytes, std::size_t length, std::string_view key)
{
    auto const* first = static_cast<std::uint8_t const*>(bytes);
    archive_->set(key, length ? Bytes(first, first + length) : Bytes());
}

void KVKeyedCoder::encodeInt64(std::int64_t value, std::string_view key)
{
    archive_->set(key, value);
}

void KVKeyedCoder::encodeDouble(double value, std::string_view key)
{
    archive_->set(key, value);
}

void KVKeyedCoder::encodeBool(bool value, std::string_view key)
{
    archive_->set(key, value);
}

void KVKeyedCoder::encodeObject(NSObject const* object, std::string_view key)
{
    archive_->checkWritable(key);
    if (object)
        archive_->set(key, Reference{archive_->add(*object)});
}

bool KVKeyedCoder::containsValueForKey(std::string_view key) const
{
    return archive_->keys->contains(key);
}

std::optional<std::span<std::uint8_t const>> KVKeyedCoder::decodeBytes(std::string_view key) const
{
    auto const* bytes = archive_->find<Bytes>(key);
    return bytes ? std::optional<std::span<std::uint8_t const>>(*bytes) : std::nullopt;
}

std::int64_t KVKeyedCoder::decodeInt64(std::string_view key) const
{
    return archive_->valueOrNothing<std::int64_t>(key);
}

double KVKeyedCoder::decodeDouble(std::string_view key) const
{
    return archive_->valueOrNothing<double>(key);
}

bool KVKeyedCoder::decodeBool(std::string_view key) const
{
    return archive_->valueOrNothing<bool>(key);
}

KVNSRef<NSObject*> KVKeyedCoder::decodeObject(std::string_view key, AllowedClasses allowed)
{
    auto const* to = archive_->find<Reference>(key);
    if (!to)
        return nullptr;
    std::size_t const list = archive_->listOf(allowed);
    return archive_->isAllowed(to->index, list) ? archive_->make(to->index, list)
                                                : KVNSRef<NSObject*>();
}

#include <korvane/platform/KVKeyedCoder.h>

#include <korvane/foundation/KVException.h>
#include <korvane/platform/CFArray.h>
#include <korvane/platform/CFData.h>
#include <korvane/platform/CFNumber.h>
#include <korvane/platform/KVKeyedArchive_p.h>

#include <unordered_map>

using namespace kv::archive;

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
            graph.nodes.push_back(std::move(node));
        } catch (...) {
            met.erase(&object);
            throw;
        }
        // Objects that were met within this one may have moved the table's entries.
        std::size_t const index = graph.nodes.size() - 1;
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
        node.height = std::max(node.height, graph.nodes[index].height + 1);
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
            graph.nodes[index].content);
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
        Node& node = graph.nodes[index];
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
    Graph graph;
    /// Of the object that is being written or read.
    Keys* keys = &graph.keys;

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
    auto graph = kv::archive::read(bytes, maximumDepth);
    if (!graph)
        return nullptr;
    auto coder = std::make_unique<KVKeyedCoder>();
    coder->archive_->graph = std::move(*graph);
    return coder;
}

std::vector<std::uint8_t> KVKeyedCoder::archivedBytes() const
{
    return kv::archive::write(archive_->graph);
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

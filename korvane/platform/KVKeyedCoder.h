#pragma once

#include <korvane/platform/NSCoder.h>

#include <memory>
#include <vector>

/// An archive of objects in memory, which can be kept as bytes.
///
///     KVKeyedCoder archive;
///     archive.encodeObject(matrix, "camera");
///     std::vector<std::uint8_t> bytes = archive.archivedBytes();
///
///     if (auto reader = KVKeyedCoder::fromBytes(bytes))
///         auto camera = reader->decodeObjectOfClass<KVMatrix44Double>(
///             KVMatrix44Double::coding, "camera");
///
/// What is archived is a graph: an object that is met under several keys, in several arrays or
/// within several other objects is written once, as it was when it was first met, and one object
/// is made of it. An object that holds itself cannot be archived.
///
/// An archive may be read as soon as it is written, and written further after it was read. It keeps
/// a reference to each object that it has met: one that lives on the stack must outlive it.
/// Encoding throws KVIllegalArgumentException, and leaves the key as it was, for an object that
/// cannot be archived, that holds itself or nests deeper than `maximumDepth`, for a key or a class
/// name that is not ASCII, and for any writing while an object is being read. Not synchronised.
class KV_EXPORT KVKeyedCoder final : public NSCoder {
public:
    /// Objects within objects: the archive's own keys hold depth 1.
    static constexpr unsigned int maximumDepth = 200;

    /// An empty archive.
    KVKeyedCoder();
    KVKeyedCoder(KVKeyedCoder const&) = delete;
    KVKeyedCoder& operator=(KVKeyedCoder const&) = delete;
    ~KVKeyedCoder() override;

    /// Reads what `archivedBytes` wrote; null for anything else. The bytes may come from anywhere:
    /// they are checked as a whole, in time and memory in proportion to their number, before an
    /// object is made.
    static std::unique_ptr<KVKeyedCoder> fromBytes(std::span<std::uint8_t const> bytes);
    /// The archive as bytes, the same on every machine. Reading and writing again gives the same
    /// bytes.
    std::vector<std::uint8_t> archivedBytes() const;

    void encodeBytes(void const* bytes, std::size_t length, std::string_view key) override;
    void encodeInt64(std::int64_t value, std::string_view key) override;
    void encodeDouble(double value, std::string_view key) override;
    void encodeBool(bool value, std::string_view key) override;
    void encodeObject(NSObject const* object, std::string_view key) override;

    bool containsValueForKey(std::string_view key) const override;
    std::optional<std::span<std::uint8_t const>> decodeBytes(std::string_view key) const override;
    std::int64_t decodeInt64(std::string_view key) const override;
    double decodeDouble(std::string_view key) const override;
    bool decodeBool(std::string_view key) const override;
    KVNSRef<NSObject*> decodeObject(std::string_view key, AllowedClasses allowed) override;

private:
    struct Archive;
    std::unique_ptr<Archive> archive_;
};

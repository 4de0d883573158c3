// Archives from anywhere: what is accepted reads without fault and is written as the same bytes.

#include <korvane/foundation/KVString.h>
#include <korvane/platform/KVKeyedCoder.h>

#include <algorithm>
#include <cstdlib>

namespace {

KVNSRef<NSObject*> read(NSCoder& coder);

/// Stands for any class that reads plain values and other objects.
NSCodingClass const knot{"Knot", &read};

KVNSRef<NSObject*> read(NSCoder& coder)
{
    auto const left = coder.decodeObject("a", {&knot, &NSArrayCodingClass, &NSStringCodingClass});
    auto const right = coder.decodeObject("b", {&knot, &NSArrayCodingClass, &NSNullCodingClass,
                                                &NSNumberCodingClass, &NSDataCodingClass});
    auto const bytes = coder.decodeBytes("c");
    bool const plain = coder.decodeBool("d") || coder.decodeInt64("d") || coder.decodeDouble("d");
    if (!left && !right && !plain)
        return nullptr;
    if (bytes && !bytes->empty() && bytes->front() == bytes->back())
        return coder.decodeObject("e", {&knot});
    return KVNSRef<NSObject*>::adopt(new NSObject);
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    std::span<std::uint8_t const> const bytes(data, size);
    auto const coder = KVKeyedCoder::fromBytes(bytes);
    if (!coder)
        return 0;
    if (!std::ranges::equal(coder->archivedBytes(), bytes))
        std::abort();
    for (char const* key : {"a", "b"}) {
        read(*coder);
        coder->decodeString(key);
    }
    return 0;
}

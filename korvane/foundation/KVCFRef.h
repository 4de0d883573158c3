#pragma once

#include <korvane/platform/CFBase.h>

#include <type_traits>
#include <utility>

/// Owns one reference to a CF object, or none. `T` is the pointer type.
///
///     KVCFRef<CFDataRef> data = KVCFRef<CFDataRef>::adopt(CFDataCreate(nullptr, bytes, n));
///
/// It converts to `T` by itself, so it can be handed to whatever takes the plain reference, and to
/// the holder of a base class. Object kinds are held by KVNSRef, the same under another name. Not
/// synchronised: a holder belongs to one thread, the object need not.
template <class T>
class KVCFRef {
    static_assert(std::is_pointer_v<T>);

public:
    /// No reference, as from `nullptr`.
    constexpr KVCFRef() noexcept = default;
    constexpr KVCFRef(std::nullptr_t) noexcept {}
    /// Retains. Use `adopt` for a reference that the caller already owns.
    KVCFRef(T object) noexcept : object_(CFRetain(object)) {}
    KVCFRef(KVCFRef const& other) noexcept : object_(CFRetain(other.object_)) {}
    KVCFRef(KVCFRef&& other) noexcept : object_(std::exchange(other.object_, nullptr)) {}
    template <class U>
    requires(std::is_convertible_v<U, T> && !std::is_same_v<U, T>) KVCFRef(KVCFRef<U> const& other)
    noexcept : object_(CFRetain(other.get())) {}
    ~KVCFRef() { CFRelease(object_); }

    /// Takes over a reference that the caller owns.
    static KVCFRef adopt(T object) noexcept
    {
        KVCFRef result;
        result.object_ = object;
        return result;
    }

    /// Retains the new object before the old one is released, so that an object may be replaced by
    /// itself or by something that only the old one kept alive.
    KVCFRef& operator=(KVCFRef other) noexcept
    {
        std::swap(object_, other.object_);
        return *this;
    }

    /// Unowned; null when there is none.
    T get() const noexcept { return object_; }
    operator T() const noexcept { return object_; }
    T operator->() const noexcept { return object_; }

    /// Gives the reference to the caller and leaves none.
    [[nodiscard]] T leak() noexcept { return std::exchange(object_, nullptr); }

private:
    T object_ = nullptr;
};

#pragma once

#include <korvane/platform/CFBase.h>

#include <type_traits>
#include <utility>

/// Owns one reference to an object, or none. `T` is the pointer type.
///
///     KVNSRef<NSError*> error = exporter.exportCaptions(captions, url);
///     if (error)
///         report(error->description());
///
/// It converts to `T` by itself, and to the holder of a base class. A null holder is "nil". Not
/// synchronised: a holder belongs to one thread, the object need not.
template <class T>
class KVNSRef {
    static_assert(std::is_pointer_v<T>);

public:
    constexpr KVNSRef() noexcept = default;
    constexpr KVNSRef(std::nullptr_t) noexcept {}
    /// Retains. Use `adopt` for a reference that the caller already owns.
    KVNSRef(T object) noexcept : object_(objc_retain(object)) {}
    KVNSRef(KVNSRef const& other) noexcept : object_(objc_retain(other.object_)) {}
    KVNSRef(KVNSRef&& other) noexcept : object_(std::exchange(other.object_, nullptr)) {}
    template <class U>
    requires(std::is_convertible_v<U, T> && !std::is_same_v<U, T>) KVNSRef(KVNSRef<U> const& other)
    noexcept : object_(objc_retain(other.get())) {}
    ~KVNSRef() { objc_release(object_); }

    /// Takes over a reference that the caller owns.
    static KVNSRef adopt(T object) noexcept
    {
        KVNSRef result;
        result.object_ = object;
        return result;
    }

    /// Retains the new object before the old one is released.
    KVNSRef& operator=(KVNSRef other) noexcept
    {
        std::swap(object_, other.object_);
        return *this;
    }

    T get() const noexcept { return object_; }
    operator T() const noexcept { return object_; }
    T operator->() const noexcept { return object_; }

    /// Gives the reference to the caller and leaves none.
    [[nodiscard]] T leak() noexcept { return std::exchange(object_, nullptr); }

private:
    T object_ = nullptr;
};

/// Makes an object and the holder of its first reference in one step.
template <class T, class... Arguments>
KVNSRef<T*> KVMakeRef(Arguments&&... arguments)
{
    return KVNSRef<T*>::adopt(new T(std::forward<Arguments>(arguments)...));
}

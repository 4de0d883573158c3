#pragma once

#include <korvane/foundation/KVExport.h>

#include <atomic>
#include <mutex>

class KVShared_base;

/// Counts of a shared object: `useCount` strong references, and `weakCount` weak ones plus one for
/// all strong ones together. The block outlives the object for as long as a weak reference looks at
/// it.
///
/// The counts are sequentially consistent. `mutex` is held while a weak reference is turned into a
/// strong one, so that this sees either a live object or a count of zero.
class KV_EXPORT KV_Sp_counted_base {
public:
    KV_Sp_counted_base() = default;
    KV_Sp_counted_base(KV_Sp_counted_base const&) = delete;
    KV_Sp_counted_base& operator=(KV_Sp_counted_base const&) = delete;
    virtual ~KV_Sp_counted_base();
    /// Ends the object.
    virtual void dispose() noexcept = 0;
    /// Deletes this block.
    virtual void destroy() noexcept;

    void add_ref() noexcept { ++useCount; }
    void weak_add_ref() noexcept { ++weakCount; }
    /// Adds a strong reference unless the object is gone.
    bool add_ref_lock() noexcept;
    /// Drops a strong reference; the last one disposes of the object.
    void release() noexcept;
    /// Drops a weak reference; the last one destroys the block.
    void weak_release() noexcept;

    std::atomic<unsigned int> useCount{1};
    std::atomic<unsigned int> weakCount{1};
    std::mutex mutex;
};

class KV_EXPORT KV_Sp_counted_base_impl final : public KV_Sp_counted_base {
public:
    explicit KV_Sp_counted_base_impl(KVShared_base* object) noexcept : object_(object) {}
    void dispose() noexcept override;
    /// Tells a block whose object died by itself that there is nothing left to dispose of.
    void objectDied() noexcept;

private:
    KVShared_base* object_;
};

/// A pointer to an object's block, made when it is first needed.
class KV_EXPORT KVWeakCount {
public:
    /// Makes the block unless there is one. Two threads may call it at once.
    void alloc(KVShared_base* object);
    KV_Sp_counted_base_impl* block() const noexcept { return block_; }

private:
    std::atomic<KV_Sp_counted_base_impl*> block_{nullptr};
};

/// Base of objects that can be held weakly.
///
///     class Clip : public KVShared_base { ... };
///     auto clip = KVShared<Clip>::make();
///     KVWeak<Clip> observer(clip);
///     if (KVShared<Clip> alive = observer.lock()) ...
///
/// Such an object starts with one strong reference, which is dropped with `block()->release()`. It
/// may also live on the stack or be deleted by hand: weak references see it as gone from then on.
class KV_EXPORT KVShared_base {
public:
    KVShared_base() noexcept = default;
    /// A copy is an object of its own.
    KVShared_base(KVShared_base const&) noexcept {}
    KVShared_base& operator=(KVShared_base const&) noexcept { return *this; }
    virtual ~KVShared_base();
    /// Deletes the object.
    virtual void dispose() noexcept;

    /// The block, made if there is none yet.
    KV_Sp_counted_base* sharedBlock();

private:
    friend class KV_Sp_counted_base_impl;
    KVWeakCount weakCount_;
    /// Set while `dispose` comes from the block itself, which then drops its own weak count.
    bool disposedByBlock_ = false;
};

/// Holds a strong reference to a `T` derived from KVShared_base, or none. Not synchronised: a
/// holder belongs to one thread, the object need not. So does a KVWeak.
template <class T>
class KVShared {
public:
    KVShared() noexcept = default;
    /// Takes over the reference that a new object starts with.
    static KVShared adopt(T* object) noexcept
    {
        KVShared result;
        result.object_ = object;
        return result;
    }
    /// Makes an object and the holder of its first reference in one step.
    template <class... Arguments>
    static KVShared make(Arguments&&... arguments)
    {
        return adopt(new T(static_cast<Arguments&&>(arguments)...));
    }
    KVShared(KVShared const& other) : object_(other.object_)
    {
        if (object_)
            object_->sharedBlock()->add_ref();
    }
    KVShared(KVShared&& other) noexcept : object_(other.object_) { other.object_ = nullptr; }
    KVShared& operator=(KVShared other) noexcept
    {
        T* const old = object_;
        object_ = other.object_;
        other.object_ = old;
        return *this;
    }
    ~KVShared()
    {
        if (object_)
            object_->sharedBlock()->release();
    }

    /// Unowned; null when there is none.
    T* get() const noexcept { return object_; }
    T* operator->() const noexcept { return object_; }
    T& operator*() const noexcept { return *object_; }
    explicit operator bool() const noexcept { return object_ != nullptr; }

private:
    T* object_ = nullptr;
};

/// Looks at a `T` derived from KVShared_base without keeping it alive.
template <class T>
class KVWeak {
public:
    KVWeak() noexcept = default;
    explicit KVWeak(T* object) : object_(object), block_(object ? object->sharedBlock() : nullptr)
    {
        if (block_)
            block_->weak_add_ref();
    }
    explicit KVWeak(KVShared<T> const& object) : KVWeak(object.get()) {}
    KVWeak(KVWeak const& other) noexcept : object_(other.object_), block_(other.block_)
    {
        if (block_)
            block_->weak_add_ref();
    }
    KVWeak& operator=(KVWeak other) noexcept
    {
        T* const object = object_;
        KV_Sp_counted_base* const block = block_;
        object_ = other.object_;
        block_ = other.block_;
        other.object_ = object;
        other.block_ = block;
        return *this;
    }
    ~KVWeak()
    {
        if (block_)
            block_->weak_release();
    }

    /// A strong reference, or none if the object is gone.
    KVShared<T> lock() const
    {
        return block_ && block_->add_ref_lock() ? KVShared<T>::adopt(object_) : KVShared<T>();
    }

private:
    T* object_ = nullptr;
    KV_Sp_counted_base* block_ = nullptr;
};

#pragma once

#include <korvane/foundation/KVCFRef.h>

/// The KVCFRef of the object kinds (`NSError`, captions, boxed matrices): owns one reference, or
/// none. `T` is the pointer type.
///
///     KVNSRef<NSError*> error = exporter.exportCaptions(captions, url);
///     if (error)
///         report(error->description());
///
/// A null holder is "nil". All that KVCFRef tells of its members holds here too.
template <class T>
class KVNSRef : public KVCFRef<T> {
public:
    using KVCFRef<T>::KVCFRef;

    /// Takes over a reference that the caller owns.
    static KVNSRef adopt(T object) noexcept
    {
        KVNSRef result;
        result.KVCFRef<T>::operator=(KVCFRef<T>::adopt(object));
        return result;
    }
};

template <class T>
KVNSRef(T) -> KVNSRef<T>;

/// Makes an object and the holder of its first reference in one step.
template <class T, class... Arguments>
KVNSRef<T*> KVMakeRef(Arguments&&... arguments)
{
    return KVNSRef<T*>::adopt(new T(std::forward<Arguments>(arguments)...));
}

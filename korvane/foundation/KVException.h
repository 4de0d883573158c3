#pragma once

#include <korvane/foundation/KVString.h>
#include <korvane/platform/CFArray.h>

#include <exception>
#include <mutex>
#include <type_traits>

/// Root of the library's exceptions: faults of programming or of the system. Bad documents do not
/// throw. Thrown by value, caught by reference.
///
///     throw KVIllegalArgumentException("no such row", __FILE__, __LINE__);
///
/// `what()` is then "KVIllegalArgumentException: no such row (file.cpp:12)".
class KV_EXPORT KVException : public std::exception {
public:
    KVException() = default;
    KVException(KVString const& message) : message_(message) {}
    /// `line` 0 means that the place is not known.
    KVException(KVString const& message, KVString const& file, int line)
        : message_(message), file_(file), line_(line)
    {}
    KVException(KVException const& other);
    KVException& operator=(KVException const& other);
    ~KVException() override;

    /// `getInfo()` as UTF-8, made at the first call; valid as long as the exception.
    char const* what() const noexcept override;
    /// The name that `getInfo` begins with.
    virtual KVString className() const;
    /// The kept stack, innermost frame first; unowned, valid as long as the exception. Null unless
    /// `addCallStackSymbols` was called.
    virtual CFArrayRef callStackSymbols() const;
    /// Writes `getInfo()` and a newline to standard error.
    virtual void report() const;

    /// "Class: message (file:line)"; an empty message and a zero line leave out their piece.
    KVString getInfo() const;
    /// Keeps the symbols of the calling thread's stack, a string for each frame.
    void addCallStackSymbols();

    KVString const& message() const noexcept { return message_; }
    KVString const& file() const noexcept { return file_; }
    int line() const noexcept { return line_; }

private:
    KVCFRef<CFArrayRef> callStackSymbols_;
    KVString message_;
    KVString file_;
    int line_ = 0;
    mutable std::string whatText_;
    mutable std::once_flag whatOnce_;
};

/// Declares a class of the tree that has a name of its own.
#define KV_DECLARE_EXCEPTION(Class)                                                                \
    class KV_EXPORT Class : public KVException {                                                   \
    public:                                                                                        \
        using KVException::KVException;                                                            \
        ~Class() override;                                                                         \
        KVString className() const override;                                                       \
    }

/// A required pointer is null.
class KV_EXPORT KVNullPointerException : public KVException {
public:
    using KVException::KVException;
    /// True captures the call stack. Takes exactly `bool`, so that a text is taken as the message.
    template <class Bool>
    requires std::is_same_v<Bool, bool>
    explicit KVNullPointerException(Bool captureCallStack)
    {
        if (captureCallStack)
            addCallStackSymbols();
    }
    ~KVNullPointerException() override;
    KVString className() const override;
};

/// A bad argument.
KV_DECLARE_EXCEPTION(KVIllegalArgumentException);
/// An operation that a type does not offer.
KV_DECLARE_EXCEPTION(KVUnsupportedOperationException);
/// A failed internal check.
KV_DECLARE_EXCEPTION(KVAssertionException);
/// An index out of range.
KV_DECLARE_EXCEPTION(KVBadIndexException);
/// A zero divisor.
KV_DECLARE_EXCEPTION(KVDivideByZeroException);
/// A call to the operating system failed.
KV_DECLARE_EXCEPTION(KVSystemException);
/// A singular or unusable matrix.
KV_DECLARE_EXCEPTION(KVMatrixErrorException);

/// Declares a class of the tree that goes by its parent's name, "KVException".
#define KV_DECLARE_UNNAMED_EXCEPTION(Class)                                                        \
    class KV_EXPORT Class : public KVException {                                                   \
    public:                                                                                        \
        using KVException::KVException;                                                            \
        ~Class() override;                                                                         \
    }

/// A token was written with no scope pushed.
KV_DECLARE_UNNAMED_EXCEPTION(KVException_ScopeUndefined);
/// An element that the scope does not name, or none open where one is needed.
KV_DECLARE_UNNAMED_EXCEPTION(KVException_NoElementDefined);
/// An attribute that the scope does not name for the open element.
KV_DECLARE_UNNAMED_EXCEPTION(KVException_AttributeUndefined);
/// Bytes could not be written.
KV_DECLARE_UNNAMED_EXCEPTION(KVException_WriteError);

/// One process-wide switch, off at the start: whether hosts may abort a render by throwing. The
/// library itself does not ask it. May be used from any thread.
class KV_EXPORT KVRenderAbortedException {
public:
    static void setEnableAbortRender(bool enable) noexcept;
    static bool enableAbortRender() noexcept;
};

/// Throws KVIllegalArgumentException: the report of a modulus by zero or below.
[[noreturn]] KV_EXPORT void _KVMod_error(char const* message, char const* file, int line);

#include <korvane/foundation/KVException.h>

#include <korvane/foundation/KVStackSymbols_p.h>

#include <atomic>
#include <cstdio>

KVException::KVException(KVException const& other)
    : std::exception(other),
      callStackSymbols_(other.callStackSymbols_),
      message_(other.message_),
      file_(other.file_),
      line_(other.line_)
{}

KVException& KVException::operator=(KVException const& other)
{
    // The text of `what()` is made once, so an exception that has been asked keeps what it said.
    callStackSymbols_ = other.callStackSymbols_;
    message_ = other.message_;
    file_ = other.file_;
    line_ = other.line_;
    return *this;
}

KVException::~KVException() = default;

char const* KVException::what() const noexcept
{
    // One exception may be looked at from two threads (std::exception_ptr).
    try {
        std::call_once(whatOnce_, [this] { whatText_ = getInfo().toUTF8(); });
    } catch (...) {
        return "KVException";
    }
    return whatText_.c_str();
}

KVString KVException::className() const
{
    return "KVException";
}

CFArrayRef KVException::callStackSymbols() const
{
    return callStackSymbols_;
}

void KVException::report() const
{
    std::fprintf(stderr, "%s\n", getInfo().toUTF8().c_str());
    std::fflush(stderr);
}

KVString KVException::getInfo() const
{
    std::string info = className().toUTF8();
    if (!message_.empty())
        info += ": " + message_.toUTF8();
    if (line_ != 0)
        info += " (" + file_.toUTF8() + ":" + std::to_string(line_) + ")";
    return info;
}

void KVException::addCallStackSymbols()
{
    callStackSymbols_ = kv::copyCallStackSymbols();
}

#define KV_DEFINE_EXCEPTION(Class)                                                                 \
    Class::~Class() = default;                                                                     \
    KVString Class::className() const                                                              \
    {                                                                                              \
        return #Class;                                                                             \
    }

KV_DEFINE_EXCEPTION(KVNullPointerException)
KV_DEFINE_EXCEPTION(KVIllegalArgumentException)
KV_DEFINE_EXCEPTION(KVUnsupportedOperationException)
KV_DEFINE_EXCEPTION(KVAssertionException)
KV_DEFINE_EXCEPTION(KVBadIndexException)
KV_DEFINE_EXCEPTION(KVDivideByZeroException)
KV_DEFINE_EXCEPTION(KVSystemException)
KV_DEFINE_EXCEPTION(KVMatrixErrorException)

KVException_ScopeUndefined::~KVException_ScopeUndefined() = default;
KVException_NoElementDefined::~KVException_NoElementDefined() = default;
KVException_AttributeUndefined::~KVException_AttributeUndefined() = default;
KVException_WriteError::~KVException_WriteError() = default;

namespace {

std::atomic<bool> abortRenderEnabled{false};

} // namespace

void KVRenderAbortedException::setEnableAbortRender(bool enable) noexcept
{
    abortRenderEnabled = enable;
}

bool KVRenderAbortedException::enableAbortRender() noexcept
{
    return abortRenderEnabled;
}

void _KVMod_error(char const* message, char const* file, int line)
{
    throw KVIllegalArgumentException(message, file, line);
}

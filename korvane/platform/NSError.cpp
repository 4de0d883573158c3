#include <korvane/platform/NSError.h>

#include <functional>

NSError::NSError(KVString const& domain, long long code, CFDictionaryRef userInfo)
    : domain_(domain),
      code_(code),
      userInfo_(KVCFRef<CFDictionaryRef>::adopt(CFDictionaryCreateCopy(nullptr, userInfo)))
{}

NSObject const* NSError::userInfo(KVString const& key) const noexcept
{
    return CFDictionaryGetValue(userInfo_, key.cf_str());
}

bool NSError::isEqual(NSObject const* other) const
{
    auto const* error = dynamic_cast<NSError const*>(other);
    return error && error->code_ == code_ && CFEqual(error->domain_.cf_str(), domain_.cf_str()) &&
           CFEqual(error->userInfo_, userInfo_);
}

std::size_t NSError::hash() const
{
    return CFHash(domain_.cf_str()) ^ std::hash<long long>()(code_);
}

KVString NSError::description() const
{
    return KVString::ssprintf("Error Domain=%s Code=%lld", domain_.toUTF8().c_str(), code_);
}

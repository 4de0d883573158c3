#pragma once

#include <korvane/foundation/KVNSRef.h>
#include <korvane/foundation/KVString.h>
#include <korvane/platform/CFDictionary.h>

/// Names of details: what happened, and why, for a person to read.
inline constexpr char NSLocalizedDescriptionKey[] = "NSLocalizedDescription";
inline constexpr char NSLocalizedFailureReasonErrorKey[] = "NSLocalizedFailureReason";

/// Why an operation failed: a domain, a code within it, and details by name. An operation that may
/// fail returns a holder, null for success.
class KV_EXPORT NSError final : public NSObject {
public:
    NSError(KVString const& domain, long long code, CFDictionaryRef userInfo = nullptr);

    KVString domain() const { return domain_; }
    long long code() const noexcept { return code_; }
    /// A detail, unowned; null when there is none of that name.
    NSObject const* userInfo(KVString const& key) const noexcept;
    /// All details, unowned; may be null.
    CFDictionaryRef userInfo() const noexcept { return userInfo_; }

    /// Equal domain, code and details.
    bool isEqual(NSObject const* other) const override;
    std::size_t hash() const override;
    /// "Error Domain=... Code=..."
    KVString description() const override;

private:
    KVString domain_;
    long long code_;
    KVCFRef<CFDictionaryRef> userInfo_;
};

#pragma once

#include <korvane/foundation/KVExport.h>

/// Processors that this process may run on; at least 1.
KV_EXPORT int KVInfo_ProcessorCount() noexcept;
/// Whether the process runs under a unit-test host; false unless one says so.
KV_EXPORT bool KVInfo_IsUnitTesting() noexcept;
/// For unit-test hosts; from any thread. It decides where `_KVHandleLogAssertion` reports to.
KV_EXPORT void _KVInfo_SetUnitTesting(bool isUnitTesting) noexcept;

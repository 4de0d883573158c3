#pragma once

/// Marks what a host may call. Everything else in the library is hidden.
#if defined(KORVANE_STATIC)
#define KV_EXPORT
#else
#define KV_EXPORT __attribute__((visibility("default")))
#endif

/// Lets the compiler check the arguments of a printf-like function against its
/// format. Positions count from 1; those of a member function from 2.
#define KV_PRINTF(formatPosition, firstArgument)                                                   \
    __attribute__((format(printf, formatPosition, firstArgument)))

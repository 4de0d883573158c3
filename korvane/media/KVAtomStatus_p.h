#pragma once

#include <new>
#include <stdexcept>

/// What the function answers, or -1 where memory runs out. Sizes are compared with the file's
/// length before anything is allocated for them, but the file may be longer than memory is large.
template <class Function>
int orOutOfMemory(Function function)
{
    try {
        return function();
    } catch (std::bad_alloc const&) {
        return -1;
    } catch (std::length_error const&) {
        return -1;
    }
}

#pragma once

#include <boost/multiprecision/cpp_int.hpp>

namespace timetest {

/// An integer with room for every product in these tests, and without the library's arithmetic. It
/// divides toward zero.
using Exact = boost::multiprecision::int1024_t;

} // namespace timetest

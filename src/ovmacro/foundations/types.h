// Basic type names shared by the whole library.
//
// The library's text is `basic_xstring` (an owning std::string), its growable array `xvector` (std::vector),
// and every count, offset, line and column is a signed 64-bit `int64`.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace orvan {

using int64 = std::int64_t;
using uint64 = std::uint64_t;
using basic_xstring = std::string;
template <class T>
using xvector = std::vector<T>;

}  // namespace orvan

#include "ovmacro/vars/name_filter.h"

namespace orvan {

std::atomic<std::uint64_t> NameFilter::bits_[NameFilter::kBits / 64] = {};

}  // namespace orvan

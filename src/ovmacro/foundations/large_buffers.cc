#include "ovmacro/foundations/large_buffers.h"

#include <cstdint>

#include <sys/mman.h>

namespace orvan {

void AdviseLargeBuffer(const void* p, std::size_t n) {
#ifdef MADV_HUGEPAGE
    constexpr std::uintptr_t kHugePage = std::uintptr_t{1} << 21;
    constexpr std::size_t kWorthIt = std::size_t{4} << 20;
    if (n < kWorthIt) return;
    const std::uintptr_t begin = (reinterpret_cast<std::uintptr_t>(p) + kHugePage - 1) & ~(kHugePage - 1);
    const std::uintptr_t end = (reinterpret_cast<std::uintptr_t>(p) + n) & ~(kHugePage - 1);
    if (end > begin) ::madvise(reinterpret_cast<void*>(begin), end - begin, MADV_HUGEPAGE);  // advice only
#else
    (void)p;
    (void)n;
#endif
}

}  // namespace orvan

// A process-wide filter of the names that variables have ever been given.
//
// Every name added to a variable list sets a bit chosen by a hash of the name; bits are never cleared. A name
// whose bit is clear has never named a variable anywhere, so the expander can copy it as ordinary text without
// a lookup through the frames. A set bit only means "maybe": the lookup then decides.
#pragma once

#include <atomic>
#include <cstddef>
#include <cstdint>

#include "ovmacro/foundations/sub_string.h"

namespace orvan {

class NameFilter {
public:
    static void Add(BasicSubString name) {
        const std::uint32_t h = Hash(name);
        const std::uint64_t bit = std::uint64_t{1} << (h & 63);
        if ((bits_[h >> 6].fetch_or(bit, std::memory_order_relaxed) & bit) == 0)
            generation_.fetch_add(1, std::memory_order_release);
    }
    // Changes whenever a bit is set: what was learnt from the filter under one generation holds while the
    // generation stays the same.
    static std::uint64_t Generation() { return generation_.load(std::memory_order_acquire); }
    static bool MayContain(BasicSubString name) {
        const std::uint32_t h = Hash(name);
        return (bits_[h >> 6].load(std::memory_order_relaxed) >> (h & 63)) & 1;
    }

private:
    static constexpr std::uint32_t kBits = 1u << 16;
    // Constant time in the name's length: the expander hashes every word of the text it copies. The first and
    // last (up to) four bytes and the length decide the bit; names that share them share a bit, which only
    // costs a lookup.
    static std::uint32_t Hash(BasicSubString name) {
        const unsigned char* p = reinterpret_cast<const unsigned char*>(name.begin());
        const std::size_t n = name.view().size();
        std::uint64_t key = n;
        if (n >= 4) {
            key |= (std::uint64_t{Load4(p)} << 8) ^ (std::uint64_t{Load4(p + n - 4)} << 32);
        } else if (n > 0) {
            key |= std::uint64_t{p[0]} << 8 | std::uint64_t{p[n / 2]} << 16 | std::uint64_t{p[n - 1]} << 24;
        }
        return static_cast<std::uint32_t>((key * 0x9E3779B97F4A7C15u) >> (64 - 16)) & (kBits - 1);
    }
    static std::uint32_t Load4(const unsigned char* p) {
        return std::uint32_t{p[0]} | std::uint32_t{p[1]} << 8 | std::uint32_t{p[2]} << 16 |
               std::uint32_t{p[3]} << 24;
    }
    static std::atomic<std::uint64_t> bits_[kBits / 64];
    static inline std::atomic<std::uint64_t> generation_{0};
};

}  // namespace orvan

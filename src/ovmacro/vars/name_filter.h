// A process-wide filter of the names that variables have ever been given.
//
// Every name added to a variable list sets a bit chosen by a hash of the name; bits are never cleared. A name
// whose bit is clear has never named a variable anywhere, so the expander can copy it as ordinary text without
// a lookup through the frames. A set bit only means "maybe": the lookup then decides.
#pragma once

#include <atomic>
#include <cstdint>

#include "ovmacro/foundations/sub_string.h"

namespace orvan {

class NameFilter {
public:
    static void Add(BasicSubString name) {
        const std::uint32_t h = Hash(name);
        bits_[h >> 6].fetch_or(std::uint64_t{1} << (h & 63), std::memory_order_relaxed);
    }
    static bool MayContain(BasicSubString name) {
        const std::uint32_t h = Hash(name);
        return (bits_[h >> 6].load(std::memory_order_relaxed) >> (h & 63)) & 1;
    }

private:
    static constexpr std::uint32_t kBits = 1u << 16;
    static std::uint32_t Hash(BasicSubString name) {
        std::uint32_t h = 2166136261u;  // FNV-1a
        for (char c : name.view()) h = (h ^ static_cast<unsigned char>(c)) * 16777619u;
        return (h ^ (h >> 16)) & (kBits - 1);
    }
    static std::atomic<std::uint64_t> bits_[kBits / 64];
};

}  // namespace orvan

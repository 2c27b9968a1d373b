// Guards against expansions nested without end (a macro that invokes itself, two that invoke each other).
//
// Every MacroExpand call counts one level on the calling thread. Past kMaxMacroExpansionDepth levels, or when
// the thread's stack is close to its end (threads may have small stacks, and sanitizer builds use larger
// frames), the expansion stops with "Macro expansion nested too deeply" instead of overflowing the stack.
//
// The guard also keeps the work bounds of each outermost expansion: the characters it writes, nested string
// expansions included (kDefaultOutputLimit unless the host sets another), so that macros that multiply their
// output level by level end in an error instead of exhausting memory, and the number of expansions it runs
// (unbounded unless the host sets a bound), so that a host expanding untrusted texts can stop an endless loop.
#pragma once

#include <atomic>
#include <cstdint>

#include "ovmacro/foundations/types.h"

namespace orvan {

// Large enough for real recursive macros that end (a countdown of some hundreds of levels, each level an
// invocation and a conditional block), far below what an 8 MiB stack holds.
inline constexpr int64 kMaxMacroExpansionDepth = 2000;
// Stack kept free below the deepest expansion, for the handlers that run between two levels.
inline constexpr int64 kMinFreeStackBytes = 192 * 1024;
// The work bounds of an outermost expansion: 0 is no bound.
inline constexpr int64 kNoWorkLimit = 0;
// Far beyond the output of any real template, yet reached by a runaway doubling in seconds.
inline constexpr int64 kDefaultOutputLimit = int64{2} << 30;

class MacroNestingGuard {
public:
    // Raises "Macro expansion nested too deeply ..." at position when one more level is too many.
    explicit MacroNestingGuard(const char* position);
    ~MacroNestingGuard();
    MacroNestingGuard(const MacroNestingGuard&) = delete;
    MacroNestingGuard& operator=(const MacroNestingGuard&) = delete;
    // True when this guard is the outermost level of the thread.
    bool IsOutermost() const { return outermost_; }

    // For tests: lowers the depth limit of the calling thread (0 restores the default).
    static void SetDepthLimitForTesting(int64 limit);
    // Bounds every outermost expansion of the process to `chars` characters written into its outputs, nested
    // string expansions included; past it the expansion stops with "Expansion output limit reached ...".
    // kNoWorkLimit lifts the bound.
    static void SetOutputLimit(int64 chars);
    // Bounds every outermost expansion of the process to `expansions` calls of MacroExpand (every macro
    // invocation, block, loop iteration and condition is one); past it the expansion stops with "Expansion
    // work limit reached ...". kNoWorkLimit (the default) lifts the bound.
    static void SetExpansionLimit(int64 expansions);
    static int64 OutputLimit() { return s_outputLimit.load(std::memory_order_relaxed); }
    static int64 ExpansionLimit() { return s_expansionLimit.load(std::memory_order_relaxed); }
    // Counts characters written by the running expansion; raises at position past the output bound. Inline,
    // since every write of the library's expansions passes here.
    static void ChargeOutput(int64 chars, const char* position) {
        if ((t_outputLeft -= chars) < 0) ThrowOutputLimit(position);
    }

private:
    [[noreturn]] static void ThrowOutputLimit(const char* position);
    // What the thread's outermost expansion may still write (initial-exec: a plain offset from the thread
    // pointer, not a call into the dynamic loader).
    static inline thread_local int64 t_outputLeft __attribute__((tls_model("initial-exec"))) = INT64_MAX;
    static inline std::atomic<int64> s_outputLimit{kDefaultOutputLimit};
    static inline std::atomic<int64> s_expansionLimit{kNoWorkLimit};
    bool outermost_;
};

}  // namespace orvan

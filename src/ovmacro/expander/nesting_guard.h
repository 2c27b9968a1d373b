// Guards against expansions nested without end (a macro that invokes itself, two that invoke each other).
//
// Every MacroExpand call counts one level on the calling thread. Past kMaxMacroExpansionDepth levels, or when
// the thread's stack is close to its end (threads may have small stacks, and sanitizer builds use larger
// frames), the expansion stops with "Macro expansion nested too deeply" instead of overflowing the stack.
//
// The guard also keeps the work bounds of the thread's outermost expansion. By default there are none: a
// loop runs as long as its text says and macros may multiply their output level by level. Fuzzers and tests
// lower them (SetWorkLimitsForTesting) so that every run of a short text ends quickly.
#pragma once

#include <atomic>

#include "ovmacro/foundations/types.h"

namespace orvan {

// Large enough for real recursive macros that end (a countdown of some hundreds of levels, each level an
// invocation and a conditional block), far below what an 8 MiB stack holds.
inline constexpr int64 kMaxMacroExpansionDepth = 2000;
// Stack kept free below the deepest expansion, for the handlers that run between two levels.
inline constexpr int64 kMinFreeStackBytes = 192 * 1024;
// The work bounds of an outermost expansion: 0 is no bound.
inline constexpr int64 kNoWorkLimit = 0;

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
    // For fuzzers and tests: bounds each outermost expansion of the calling thread to `expansions` calls of
    // MacroExpand (every macro invocation, block, loop iteration and condition is one) and to `outputChars`
    // characters written into its outputs, nested string expansions included. Past either bound the
    // expansion stops with "Expansion work limit reached ...". kNoWorkLimit lifts a bound.
    static void SetWorkLimitsForTesting(int64 expansions, int64 outputChars);
    // Counts characters written by the running expansion; raises at position past the output bound.
    static void ChargeOutput(int64 chars, const char* position) {
        if (s_workLimitsSet.load(std::memory_order_relaxed)) ChargeBoundedOutput(chars, position);
    }

private:
    static void ChargeBoundedOutput(int64 chars, const char* position);
    // Whether any thread has ever set work limits: output is counted only then.
    static inline std::atomic<bool> s_workLimitsSet{false};
    bool outermost_;
};

}  // namespace orvan

#include "ovmacro/expander/nesting_guard.h"

#include <pthread.h>

#include "ovmacro/foundations/compose.h"
#include "ovmacro/lexer/exceptions.h"

namespace orvan {

namespace {

// The guard runs on every expansion: its per-thread state is reached with the initial-exec model, a plain
// offset from the thread pointer, instead of a call into the dynamic loader as a shared library otherwise does.
#define OVMACRO_INITIAL_EXEC_TLS __attribute__((tls_model("initial-exec")))

thread_local int64 t_depth OVMACRO_INITIAL_EXEC_TLS = 0;
thread_local int64 t_depthLimit OVMACRO_INITIAL_EXEC_TLS = 0;
thread_local const char* t_stackLow OVMACRO_INITIAL_EXEC_TLS = nullptr;  // the lowest usable address of this thread's stack
thread_local bool t_stackKnown OVMACRO_INITIAL_EXEC_TLS = false;
// The work bounds (kNoWorkLimit: none) and what the thread's outermost expansion has used of them.
thread_local int64 t_expansionLimit OVMACRO_INITIAL_EXEC_TLS = kNoWorkLimit;
thread_local int64 t_outputLimit OVMACRO_INITIAL_EXEC_TLS = kNoWorkLimit;
thread_local int64 t_expansions OVMACRO_INITIAL_EXEC_TLS = 0;
thread_local int64 t_outputChars OVMACRO_INITIAL_EXEC_TLS = 0;

// The low end of the calling thread's stack (stacks grow down on x86-64), or null when it cannot be told.
const char* StackLowEnd() {
    if (t_stackKnown) return t_stackLow;
    t_stackKnown = true;
    pthread_attr_t attr;
    if (pthread_getattr_np(pthread_self(), &attr) == 0) {
        void* addr = nullptr;
        size_t size = 0;
        if (pthread_attr_getstack(&attr, &addr, &size) == 0) t_stackLow = static_cast<const char*>(addr);
        pthread_attr_destroy(&attr);
    }
    return t_stackLow;
}

bool StackNearlyExhausted() {
    const char* low = StackLowEnd();
    if (!low) return false;
    char here = 0;
    const char* sp = &here;
    return sp - low < kMinFreeStackBytes;
}

}  // namespace

MacroNestingGuard::MacroNestingGuard(const char* position) : outermost_(t_depth == 0) {
    const int64 limit = t_depthLimit > 0 ? t_depthLimit : kMaxMacroExpansionDepth;
    if (t_depth >= limit)
        throw LexScannerException(
            Compose("Macro expansion nested too deeply (more than ", limit, " levels): is a macro invoking itself?"),
            position);
    if (StackNearlyExhausted())
        throw LexScannerException(
            Compose("Macro expansion nested too deeply (", t_depth, " levels exhaust the stack): is a macro invoking itself?"),
            position);
    if (outermost_) {
        t_expansions = 0;
        t_outputChars = 0;
    }
    // Counted before the check, so that once the bound is passed every later expansion fails too, also after
    // an @assertfails has swallowed the first failure.
    if (t_expansionLimit != kNoWorkLimit && ++t_expansions > t_expansionLimit)
        throw LexScannerException(
            Compose("Expansion work limit reached (more than ", t_expansionLimit, " expansions)"), position);
    ++t_depth;
}

MacroNestingGuard::~MacroNestingGuard() { --t_depth; }

void MacroNestingGuard::SetDepthLimitForTesting(int64 limit) { t_depthLimit = limit; }

void MacroNestingGuard::SetWorkLimitsForTesting(int64 expansions, int64 outputChars) {
    t_expansionLimit = expansions;
    t_outputLimit = outputChars;
    if (outputChars != kNoWorkLimit) s_workLimitsSet.store(true, std::memory_order_relaxed);
}

void MacroNestingGuard::ChargeBoundedOutput(int64 chars, const char* position) {
    if (t_outputLimit == kNoWorkLimit) return;
    t_outputChars += chars;
    if (t_outputChars > t_outputLimit)
        throw LexScannerException(
            Compose("Expansion work limit reached (more than ", t_outputLimit, " characters of output)"),
            position);
}

}  // namespace orvan

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
// What the thread's outermost expansion has used of the work bounds.
thread_local int64 t_expansions OVMACRO_INITIAL_EXEC_TLS = 0;

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
        const int64 limit = s_outputLimit.load(std::memory_order_relaxed);
        t_outputLeft = limit == kNoWorkLimit ? INT64_MAX : limit;
    }
    // Counted before the check, so that once the bound is passed every later expansion fails too, also after
    // an @assertfails has swallowed the first failure.
    const int64 expansionLimit = s_expansionLimit.load(std::memory_order_relaxed);
    if (expansionLimit != kNoWorkLimit && ++t_expansions > expansionLimit)
        throw LexScannerException(
            Compose("Expansion work limit reached (more than ", expansionLimit, " expansions)"), position);
    ++t_depth;
}

MacroNestingGuard::~MacroNestingGuard() { --t_depth; }

void MacroNestingGuard::SetDepthLimitForTesting(int64 limit) { t_depthLimit = limit; }

void MacroNestingGuard::SetOutputLimit(int64 chars) { s_outputLimit.store(chars, std::memory_order_relaxed); }

void MacroNestingGuard::SetExpansionLimit(int64 expansions) {
    s_expansionLimit.store(expansions, std::memory_order_relaxed);
}

void MacroNestingGuard::ThrowOutputLimit(const char* position) {
    throw LexScannerException(Compose("Expansion output limit reached (more than ",
                                      s_outputLimit.load(std::memory_order_relaxed), " characters written)"),
                              position);
}

}  // namespace orvan

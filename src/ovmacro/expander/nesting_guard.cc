#include "ovmacro/expander/nesting_guard.h"

#include <pthread.h>

#include "ovmacro/foundations/compose.h"
#include "ovmacro/lexer/exceptions.h"

namespace orvan {

namespace {

thread_local int64 t_depth = 0;
thread_local int64 t_depthLimit = 0;
thread_local const char* t_stackLow = nullptr;  // the lowest usable address of this thread's stack
thread_local bool t_stackKnown = false;

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
    ++t_depth;
}

MacroNestingGuard::~MacroNestingGuard() { --t_depth; }

void MacroNestingGuard::SetDepthLimitForTesting(int64 limit) { t_depthLimit = limit; }

}  // namespace orvan

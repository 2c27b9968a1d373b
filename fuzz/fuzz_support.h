// What the fuzz targets share: the input size cap, the check that reports a broken invariant, and the
// entry point that libFuzzer (or the replay program) calls.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <string>

#include "ovmacro/expander/nesting_guard.h"
#include "ovmacro/foundations/sub_string.h"
#include "ovmacro/python/python_bridge.h"
#include "ovmacro/vars/var_frame.h"

// Inputs longer than this are ignored. Every construct of the language fits in a few hundred bytes, and a
// short input keeps each run fast, so that the fuzzer spends its time on variety instead of bulk.
inline constexpr size_t kMaxFuzzInputSize = 4096;

// Bounds the work that the language leaves unbounded, once per process, for the targets that expand texts: no
// Python (no interpreter in fuzzing), expansions nested at most 64 deep, each outermost expansion at most 4000
// nested expansions (every @while iteration and its condition, every @for item and macro call counts) and
// 256 KiB written, dollar macro replacement stopped at 64 KiB. Past a bound the expansion fails like any other.
inline bool ConfigureFuzzBounds() {
    orvan::SetPythonAllowed(false);
    orvan::MacroNestingGuard::SetDepthLimitForTesting(64);
    orvan::MacroNestingGuard::SetExpansionLimit(4000);
    orvan::MacroNestingGuard::SetOutputLimit(1 << 18);
    orvan::FileScopeVarFrame::SetDollarMacroTextLimitForTesting(1 << 16);
    return true;
}

// Stops the run, as a crash that libFuzzer saves, when an invariant of the library does not hold.
#define FUZZ_CHECK(condition)                                                                      \
    do {                                                                                           \
        if (!(condition)) {                                                                        \
            std::fprintf(stderr, "%s:%d: invariant failed: %s\n", __FILE__, __LINE__, #condition); \
            std::abort();                                                                          \
        }                                                                                          \
    } while (false)

// Whether `inner` lies within `outer` (an empty view at either end included).
inline bool ViewWithin(orvan::BasicSubString inner, orvan::BasicSubString outer) {
    return inner.begin() >= outer.begin() && inner.end() <= outer.end() && inner.begin() <= inner.end();
}

// Whether p points into memory that AddressSanitizer knows to be freed (or otherwise unaddressable); always
// false in a build without it. A pointer kept after its text died is no fault until it is read, so the
// targets ask this of the positions and output pieces that the library hands back.
#if defined(__has_feature)
#if __has_feature(address_sanitizer)
#define OVMACRO_FUZZ_ASAN 1
#endif
#elif defined(__SANITIZE_ADDRESS__)
#define OVMACRO_FUZZ_ASAN 1
#endif
#ifdef OVMACRO_FUZZ_ASAN
#include <sanitizer/asan_interface.h>
inline bool PointsIntoFreedMemory(const void* p) {
    return p && __asan_address_is_poisoned(p);
}
#else
inline bool PointsIntoFreedMemory(const void*) {
    return false;
}
#endif

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size);

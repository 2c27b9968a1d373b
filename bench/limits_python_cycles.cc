// Starts and stops the embedded Python interpreter many times in one process, running a @runpython block in
// each cycle (every other block raises), and prints the resident memory after each cycle, so that growth
// across restarts can be told apart from what Python keeps for itself. bench/limits.sh builds and runs it.
//
//     limits_python_cycles [CYCLES]      (default 100)
#include <cstdio>
#include <cstdlib>
#include <string>

#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/python/python_bridge.h"

namespace {

// Resident set size in KiB, from /proc/self/statm (pages).
long ResidentKiB() {
    std::FILE* f = std::fopen("/proc/self/statm", "r");
    if (!f) return -1;
    long size = 0, resident = 0;
    const int n = std::fscanf(f, "%ld %ld", &size, &resident);
    std::fclose(f);
    return n == 2 ? resident * 4 : -1;
}

}  // namespace

int main(int argc, char** argv) {
    const int cycles = argc > 1 ? std::atoi(argv[1]) : 100;
    // A block that defines and uses some names, and in every other cycle a block that raises once it has run
    // part of its code; the error is caught as a host would catch it.
    const std::string good = "@runpython{\nxs = [i * i for i in range(2000)]\ntotal = sum(xs)\n}\n";
    const std::string bad =
        "@runpython{\nys = {str(i): i for i in range(2000)}\n"
        "raise ValueError('cycle failed %d' % len(ys))\n}\n";
    long first = -1, tenth = -1;
    int errors = 0;
    for (int i = 1; i <= cycles; ++i) {
        const std::string& text = i % 2 == 0 ? bad : good;
        orvan::FileScopeVarFrame frame;
        std::string out;
        try {
            orvan::MacroExpand(nullptr, &frame, orvan::BasicSubString(text), 0, 0, out);
        } catch (const orvan::LexScannerException& e) {
            ++errors;
            if (e.GetMessage().find("cycle failed 2000") == std::string::npos) {
                std::fprintf(stderr, "unexpected error: %s\n", e.GetMessage().c_str());
                return 1;
            }
        }
        orvan::UninitPython();
        const long rss = ResidentKiB();
        if (i == 1) first = rss;
        if (i == 10) tenth = rss;
        if (i == 1 || i == 2 || i % 10 == 0) std::printf("cycle %3d: resident %ld KiB\n", i, rss);
    }
    const long last = ResidentKiB();
    std::printf("%d cycles, %d with an error: resident %ld KiB after the first, %ld KiB after the last\n",
                cycles, errors, first, last);
    if (cycles > 10 && tenth > 0)
        std::printf("growth from cycle 10 on: %.1f KiB per cycle\n",
                    static_cast<double>(last - tenth) / static_cast<double>(cycles - 10));
    return 0;
}

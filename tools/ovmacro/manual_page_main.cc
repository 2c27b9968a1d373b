// Writes the manual page ovmacro(1) to the file named by its argument; the build runs it, so that the page
// comes from the same option table and sections as ovmacro --help.
#include <cstdio>
#include <fstream>
#include <string>

#include "manual.h"

int main(int argc, char** argv) {
    if (argc != 2) {
        std::fputs("usage: ovmacro_manual_page FILE\n", stderr);
        return 2;
    }
    std::ofstream out(argv[1], std::ios::binary);
    out << ovmacro_tool::ManualPage(OVMACRO_VERSION);
    out.close();
    if (!out) {
        std::fprintf(stderr, "ovmacro_manual_page: cannot write %s\n", argv[1]);
        return 1;
    }
    return 0;
}

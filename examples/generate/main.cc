// Prints the table that the build generated into colors.h.
#include <iostream>

#include "colors.h"

int main() {
    std::cout << kMode << ':';
    for (std::string_view color : kColors) std::cout << ' ' << color;
    std::cout << '\n';
}

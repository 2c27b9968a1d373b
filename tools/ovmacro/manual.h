// The documentation of ovmacro: --help and the manual page, both made from the option table (options.h) and
// one set of sections, so that the two cannot drift apart.
#pragma once

#include <string>

namespace ovmacro_tool {

// The manual page ovmacro(1), in the man macros of roff, for the version given.
std::string ManualPage(const std::string& version);

}  // namespace ovmacro_tool

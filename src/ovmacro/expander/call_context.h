// The context line that an error inside a macro's body gets for the call it happened in.
#pragma once

#include <cstddef>
#include <functional>

#include "ovmacro/vars/variable.h"

namespace orvan {

// "\n    invoking macro m(a,b) with a=x+1, b=y": the macro, then each of its `count` formal arguments with the
// value that `writeValue(os, i)` writes for argument i.
basic_xstring InvokingMacroLine(const LSMacroVariable& m, std::size_t count,
                                const std::function<void(xostream&, std::size_t)>& writeValue);

}  // namespace orvan

// Path helpers for import directives and project description files. Paths use '/' as separator.
#pragma once

#include "ovmacro/foundations/types.h"

namespace orvan {

// In place: backslashes become '/', runs of '/' collapse, "." segments go, "dir/.." pairs go, and a trailing
// '/' goes (a lone "/" stays). A path that normalises to nothing becomes ".".
void NormalisePath(basic_xstring& path);
// The path that leads from directory `first` to `second`, both normalised: "a/b" and "a/c/d.txt" give
// "../c/d.txt"; equal paths give ".". When one is absolute and the other is not, `second` is the result.
void CalcRelativePath(const basic_xstring& first, const basic_xstring& second, basic_xstring& result);

}  // namespace orvan

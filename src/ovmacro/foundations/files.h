// Reading whole files.
#pragma once

#include "ovmacro/foundations/types.h"

namespace orvan {

// Reads the whole regular file `path` into `out`. In text mode each CR LF becomes LF (a lone CR stays).
// False, with `out` unchanged, when the file cannot be opened or read or is not a regular file; `error` then
// says why (for example "No such file or directory" or "Is a directory").
bool ReadStringFromFile(const basic_xstring& path, basic_xstring& out, bool textMode, basic_xstring* error = nullptr);
// Reads all of a stream (standard input) the same way.
bool ReadStringFromStdin(basic_xstring& out, bool textMode, basic_xstring* error = nullptr);
// Drops the CR of every CR LF pair, in place.
void ConvertCrLfToLf(basic_xstring& text);

}  // namespace orvan

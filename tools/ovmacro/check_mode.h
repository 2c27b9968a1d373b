// --check: tells whether a generated file on disk is the current expansion, without writing it.
#pragma once

#include <string>

namespace ovmacro_tool {

// Compares the file at `path` with `expanded`, byte for byte. Returns the exit status of the tool: 0 when
// they are equal; 1 when they differ (a short unified diff goes to standard output, a one-line verdict to
// standard error) or when the file does not exist; 2 when it exists but cannot be read.
int CheckGeneratedFile(const std::string& path, const std::string& expanded);

}  // namespace ovmacro_tool

// Command-line options of the ovmacro tool.
#pragma once

#include <string>
#include <vector>

namespace ovmacro_tool {

struct Options {
    std::string inputPath = "-";  // "-" is standard input
    std::string outputPath;       // empty: standard output
    bool help = false;
    bool version = false;
};

// Parses argv; on a usage error returns false and sets `error`.
bool ParseOptions(int argc, char** argv, Options& options, std::string& error);
// The text of --help.
const char* UsageText();

}  // namespace ovmacro_tool

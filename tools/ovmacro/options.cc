#include "options.h"

#include <string_view>

namespace ovmacro_tool {

const char* UsageText() {
    return "Usage: ovmacro [OPTIONS] [FILE]\n"
           "Expands the macros of FILE (standard input when FILE is - or absent) and writes the expansion to\n"
           "standard output.\n"
           "\n"
           "Options:\n"
           "  -o OUT       write the expansion to OUT instead (only when the expansion succeeds)\n"
           "  --help       show this text and exit\n"
           "  --version    show the version and exit\n"
           "\n"
           "Exit status: 0 on success, 1 when the expansion fails (the error is reported on standard error as\n"
           "FILE(LINE) : MESSAGE), 2 on a usage error or an unreadable file.\n";
}

bool ParseOptions(int argc, char** argv, Options& options, std::string& error) {
    bool haveInput = false;
    for (int i = 1; i < argc; ++i) {
        const std::string_view arg = argv[i];
        auto value = [&](std::string& out) {
            if (i + 1 >= argc) {
                error = "option " + std::string(arg) + " needs a value";
                return false;
            }
            out = argv[++i];
            return true;
        };
        if (arg == "--help" || arg == "-h") {
            options.help = true;
        } else if (arg == "--version") {
            options.version = true;
        } else if (arg == "-o") {
            if (!value(options.outputPath)) return false;
        } else if (arg.size() > 2 && arg.substr(0, 2) == "-o") {
            options.outputPath = std::string(arg.substr(2));
        } else if (arg.size() > 1 && arg[0] == '-') {
            error = "unknown option " + std::string(arg);
            return false;
        } else {
            if (haveInput) {
                error = "more than one input file given";
                return false;
            }
            options.inputPath = std::string(arg);
            haveInput = true;
        }
    }
    return true;
}

}  // namespace ovmacro_tool

#include "options.h"

#include <string_view>

#include "ovmacro/foundations/scanning.h"

namespace ovmacro_tool {

namespace {

bool IsIdentifier(std::string_view name) {
    orvan::BasicSubString rest(name);
    return orvan::ScanIdentifier(rest) && rest.empty();
}

// NAME=TEXT, or NAME alone, which defines NAME as true.
bool ParseDefine(const std::string& arg, Options& options, std::string& error) {
    const size_t eq = arg.find('=');
    std::string name = arg.substr(0, eq);
    std::string text = eq == std::string::npos ? "true" : arg.substr(eq + 1);
    if (!IsIdentifier(name)) {
        error = "-D needs a macro name (an identifier) before '=': " + arg;
        return false;
    }
    // The definition is read as "@def NAME = TEXT", whose body is the rest of one line.
    if (text.find('\n') != std::string::npos) {
        error = "-D text must be a single line: " + name;
        return false;
    }
    options.defines.emplace_back(std::move(name), std::move(text));
    return true;
}

}  // namespace

const char* UsageText() {
    return "Usage: ovmacro [OPTIONS] [FILE]\n"
           "Expands the macros of FILE (standard input when FILE is - or absent) and writes the expansion "
           "to\n"
           "standard output. Files that FILE imports with @import \"NAME\" are expanded in the same scope, "
           "so that\n"
           "their definitions are visible after the @import, which stays in the output.\n"
           "\n"
           "Options:\n"
           "  -o OUT         write the expansion to OUT instead (only when the expansion succeeds)\n"
           "  -D NAME=TEXT   define macro NAME with body TEXT before FILE is expanded, as a line\n"
           "                 \"@def NAME = TEXT\" at the top of FILE would; -D NAME defines NAME as true\n"
           "  -I DIR         search imported files in DIR; an imported NAME is looked for beside the\n"
           "                 importing file, then in each -I DIR in order, then in each @importpath "
           "directory\n"
           "  --settings     after expanding, read the settings of FILE and its imports and print each\n"
           "                 dollar definition ($NAME = value) as NAME=VALUE; the expansion goes only to -o "
           "OUT\n"
           "  --no-python    refuse embedded Python code (@runpython, @defpython macros fail)\n"
           "  --deps DEPFILE also write a Make dependency file: \"TARGET: FILE IMPORTED...\" (TARGET is "
           "OUT,\n"
           "                 else FILE) and an empty rule for each imported file\n"
           "  --help         show this text and exit\n"
           "  --version      show the version and exit\n"
           "\n"
           "Exit status: 0 on success, 1 when the expansion or the settings fail (the error is reported on\n"
           "standard error as FILE(LINE) : MESSAGE), 2 on a usage error or an unreadable FILE.\n";
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
        // "-X VALUE" or "-XVALUE" for the short options that take a value.
        auto shortValue = [&](std::string& out) {
            if (arg.size() > 2) {
                out = std::string(arg.substr(2));
                return true;
            }
            return value(out);
        };
        std::string text;
        if (arg == "--help" || arg == "-h") {
            options.help = true;
        } else if (arg == "--version") {
            options.version = true;
        } else if (arg == "--settings") {
            options.settings = true;
        } else if (arg == "--no-python") {
            options.noPython = true;
        } else if (arg == "--deps") {
            if (!value(options.depsPath)) return false;
        } else if (arg.substr(0, 7) == "--deps=") {
            options.depsPath = std::string(arg.substr(7));
        } else if (arg.substr(0, 2) == "-o") {
            if (!shortValue(options.outputPath)) return false;
        } else if (arg.substr(0, 2) == "-D") {
            if (!shortValue(text) || !ParseDefine(text, options, error)) return false;
        } else if (arg.substr(0, 2) == "-I") {
            if (!shortValue(text)) return false;
            if (text.empty()) {
                error = "-I needs a directory";
                return false;
            }
            options.includeDirs.push_back(text);
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
    if (!options.depsPath.empty() && options.inputPath == "-" && options.outputPath.empty()) {
        error = "--deps needs -o OUT when the input is standard input";
        return false;
    }
    return true;
}

}  // namespace ovmacro_tool

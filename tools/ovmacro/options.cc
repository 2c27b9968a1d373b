#include "options.h"

#include <limits>
#include <string>
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

// A size in bytes, with an optional K, M or G (powers of 1024).
bool ParseSize(const std::string& text, long long& size) {
    size_t end = 0;
    long long value = 0;
    try {
        value = std::stoll(text, &end);
    } catch (const std::exception&) {
        return false;
    }
    const std::string suffix = text.substr(end);
    const int shift = suffix.empty() ? 0 : suffix == "K" ? 10 : suffix == "M" ? 20 : suffix == "G" ? 30 : -1;
    if (value <= 0 || shift < 0 || value > (std::numeric_limits<long long>::max() >> shift)) return false;
    size = value << shift;
    return true;
}

constexpr const char* kWarningNames[kWarningCount] = {"unknown-directive", "unused-macro", "unused-argument",
                                                      "shadow"};

// -Wall, -Werror, -WNAME or -Wno-NAME; false for a name that is no warning.
bool ParseWarningSwitch(std::string_view arg, WarningSwitches& switches) {
    std::string_view name = arg.substr(2);
    if (name == "all" || name == "error") {
        (name == "all" ? switches.all : switches.errors) = true;
        return true;
    }
    const bool on = name.substr(0, 3) != "no-";
    if (!on) name.remove_prefix(3);
    for (int w = 0; w < kWarningCount; ++w)
        if (name == kWarningNames[w]) {
            switches.named[w] = on ? 1 : 0;
            return true;
        }
    return false;
}

// --trace=NAME,...: the names, none of them empty.
bool ParseTraceNames(std::string_view list, std::vector<std::string>& names) {
    for (size_t from = 0;;) {
        const size_t comma = list.find(',', from);
        const std::string_view name =
            list.substr(from, comma == std::string_view::npos ? comma : comma - from);
        if (name.empty()) return false;
        names.emplace_back(name);
        if (comma == std::string_view::npos) return true;
        from = comma + 1;
    }
}

}  // namespace

const char* WarningName(Warning w) {
    return kWarningNames[static_cast<int>(w)];
}

bool WarningSwitches::On(Warning w) const {
    const signed char set = named[static_cast<int>(w)];
    return set >= 0 ? set == 1 : all || w == Warning::kUnknownDirective;
}

const char* UsageText() {
    return "Usage: ovmacro [OPTIONS] [FILE]\n"
           "Expands the macros of FILE (standard input when FILE is - or absent) and writes the\n"
           "expansion to standard output. Files that FILE imports with @import \"NAME\" are expanded\n"
           "in the same scope, so that their definitions are visible after the @import, which\n"
           "stays in the output.\n"
           "\n"
           "Options:\n"
           "  -o OUT         write the expansion to OUT instead, only when the expansion succeeds\n"
           "                 (- is standard output); see Output files below\n"
           "  -D NAME=TEXT   define macro NAME with body TEXT before FILE is expanded, as a line\n"
           "                 \"@def NAME = TEXT\" at the top of FILE would; -D NAME defines NAME as\n"
           "                 true\n"
           "  -I DIR         search imported files in DIR; an imported NAME is looked for beside\n"
           "                 the importing file, then in each -I DIR in order, then in each\n"
           "                 @importpath directory\n"
           "  --settings     after expanding, read the settings of FILE and its imports and print\n"
           "                 each dollar definition ($NAME = value) as NAME=VALUE; the expansion\n"
           "                 goes only to -o OUT\n"
           "  --no-python    refuse embedded Python code (@runpython, @defpython macros fail)\n"
           "  --restricted   for templates you did not write: no embedded Python; imports only\n"
           "                 from FILE's folder (the working directory for standard input) and\n"
           "                 the -I folders, by relative names that do not lead out of them, also\n"
           "                 through symlinks; --max-output defaults to 64M, and an expansion stops\n"
           "                 after 4 million steps (macro calls, blocks, loop iterations)\n"
           "  --max-output SIZE\n"
           "                 stop with an error when an expansion has written more than SIZE\n"
           "                 bytes, the text made inside directives included (a suffix K, M or G\n"
           "                 multiplies by 1024, 1024^2, 1024^3); 2G by default\n"
           "  --deps DEPFILE also write a Make dependency file: \"TARGET: FILE IMPORTED...\" (TARGET\n"
           "                 is OUT, else FILE) and an empty rule for each imported file\n"
           "  --source-map MAPFILE\n"
           "                 also write a JSON source map of the expansion: for each run of output\n"
           "                 (never more than one line), the file, line and column it was copied\n"
           "                 from or that produced it (see below)\n"
           "  --line-markers write a line #line N \"FILE\" before each output line whose template\n"
           "                 line is not the one a C or C++ compiler would count on, so that its\n"
           "                 errors in the generated code name the template line (see below)\n"
           "  --diagnostics=STYLE\n"
           "                 the form of error reports: default (FILE(LINE) : MESSAGE) or gnu\n"
           "                 (FILE:LINE:COLUMN: error: MESSAGE, the source line, a caret under the\n"
           "                 column, then the other lines of the message), which editors and CI\n"
           "                 annotators read\n"
           "  --check        with -o OUT: expand and compare with the existing OUT instead of\n"
           "                 writing it; exit 0 when equal, 1 with a short unified diff when\n"
           "                 different or when OUT is missing; writes no file, so --deps and\n"
           "                 --source-map cannot be used with it\n"
           "  -Wall          turn on every warning below\n"
           "  -WNAME, -Wno-NAME\n"
           "                 turn the warning NAME on or off, whatever the place of -Wall; each\n"
           "                 warning names its switch, as [-Wunused-macro]:\n"
           "                   unknown-directive  a word after @ that is no directive but close\n"
           "                                      to one, as @deff or @esle (on by default)\n"
           "                   unused-macro       a macro defined in the expanded files (not by\n"
           "                                      -D) that is never invoked\n"
           "                   unused-argument    an argument that its macro's body never names\n"
           "                                      (not reported for names that begin with _)\n"
           "                   shadow             a definition that hides one of the same name\n"
           "                                      in an enclosing scope\n"
           "  -Werror        warnings fail the run: exit 1, and nothing is written\n"
           "  --trace[=NAME,...]\n"
           "                 report each macro call (or only the calls of the macros named) on\n"
           "                 standard error as it happens: its place, its arguments (typed ones\n"
           "                 as values) and its result, indented by nesting; the blocks that\n"
           "                 @if, @elseif, @else, @for and @while expand appear under those names\n"
           "                 (--trace=@for; @if names a whole chain), Python macros as\n"
           "                 \"python NAME\"\n"
           "  --help         show this text and exit\n"
           "  --version      show the version and exit\n"
           "\n"
           "Lines and columns count from 1; a column counts bytes, so a tab counts 1.\n"
           "\n"
           "Source map: a JSON object {\"version\": 1, \"output\": OUT or \"-\", \"files\": [the loaded\n"
           "files, in load order], \"mappings\": [...]}, each mapping an object with \"offset\",\n"
           "\"length\", \"line\", \"column\", \"kind\" and, when the run has a source, \"file\",\n"
           "\"sourceLine\", \"sourceColumn\" (and \"sourceLength\" for calculated runs). The mappings\n"
           "tile the output in order; offset and length count bytes of the output, line and column\n"
           "are where the run starts in it. kind is \"copied\" (the run is the text at file (an\n"
           "index into files), sourceLine, sourceColumn), \"calculated\" (text that the sourceLength\n"
           "bytes there produced: a macro value, a @str result...), \"indent\" (blanks that indent a\n"
           "nested text) or \"marker\" (a #line line).\n"
           "\n"
           "Line markers: the template line of an output line is that of its first character,\n"
           "other than a blank or tab, that comes from a loaded file; lines without one (blank\n"
           "lines) never get a marker. A marker is written when the template file or line differs\n"
           "from the one the compiler presumes (that of the last marker plus the output lines\n"
           "since), but never after a line ending in a backslash, in a /* */ comment or in a raw\n"
           "string literal.\n"
           "\n"
           "Output files: OUT, DEPFILE and MAPFILE are written only when every one of them can\n"
           "be: each is written to a temporary file in its folder and renamed into place, so\n"
           "that a file is replaced whole or not at all, even by a killed run or by runs that\n"
           "write it at the same time. A replaced file keeps its mode; other hard links to it\n"
           "keep the old content. A symlink is followed and its target replaced. A device or a\n"
           "FIFO is written, never replaced, and a file whose folder is not writable is\n"
           "rewritten in place. None of them may be FILE, a file that FILE imports, or one of\n"
           "the others.\n"
           "\n"
           "Exit status: 0 on success, 1 when the expansion or the settings fail (the error is\n"
           "reported on standard error), --check finds OUT different or missing or -Werror meets a\n"
           "warning, 2 on a usage error, an unreadable FILE or an output that cannot be written.\n";
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
        } else if (arg == "--line-markers") {
            options.lineMarkers = true;
        } else if (arg == "--check") {
            options.check = true;
        } else if (arg == "--source-map" || arg.substr(0, 13) == "--source-map=") {
            if (arg.size() > 12)
                options.sourceMapPath = std::string(arg.substr(13));
            else if (!value(options.sourceMapPath))
                return false;
            // "-" would be a file of that name, not standard output, which holds the expansion.
            if (options.sourceMapPath.empty() || options.sourceMapPath == "-") {
                error = "--source-map needs a file name";
                return false;
            }
        } else if (arg == "--diagnostics" || arg.substr(0, 14) == "--diagnostics=") {
            if (arg.size() > 13)
                text = std::string(arg.substr(14));
            else if (!value(text))
                return false;
            if (!ParseDiagnosticStyle(text, options.diagnostics)) {
                error = "unknown diagnostics style '" + text + "' (expected default or gnu)";
                return false;
            }
        } else if (arg == "--deps" || arg.substr(0, 7) == "--deps=") {
            if (arg.size() > 6)
                options.depsPath = std::string(arg.substr(7));
            else if (!value(options.depsPath))
                return false;
            // "-" would be a file of that name, not standard output, which holds the expansion.
            if (options.depsPath.empty() || options.depsPath == "-") {
                error = "--deps needs a file name";
                return false;
            }
        } else if (arg == "--restricted") {
            options.restricted = true;
        } else if (arg == "--max-output" || arg.substr(0, 13) == "--max-output=") {
            if (arg.size() > 12)
                text = std::string(arg.substr(13));
            else if (!value(text))
                return false;
            if (!ParseSize(text, options.maxOutput)) {
                error = "--max-output needs a size in bytes, with an optional K, M or G: " + text;
                return false;
            }
        } else if (arg.substr(0, 2) == "-W") {
            // Warnings and the trace, which explain an expansion without changing it.
            if (!ParseWarningSwitch(arg, options.warnings)) {
                error = "unknown warning option " + std::string(arg);
                return false;
            }
        } else if (arg == "--trace" || arg.substr(0, 8) == "--trace=") {
            options.trace = true;
            if (arg.size() > 7 && !ParseTraceNames(arg.substr(8), options.traceNames)) {
                error = "--trace= needs macro names, separated by commas";
                return false;
            }
        } else if (arg.substr(0, 2) == "-o") {
            if (!shortValue(options.outputPath)) return false;
            if (options.outputPath.empty()) {
                error = "-o needs a file name (or - for standard output)";
                return false;
            }
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
    if (options.maxOutput == 0) options.maxOutput = options.restricted ? kRestrictedMaxOutput : kDefaultMaxOutput;
    if (options.settings && options.outputPath == "-") {
        error = "-o - with --settings: the settings go to standard output";
        return false;
    }
    if (options.check && (options.outputPath.empty() || options.outputPath == "-")) {
        error = "--check needs -o OUT, the file to compare with";
        return false;
    }
    if (options.check && (!options.depsPath.empty() || !options.sourceMapPath.empty())) {
        error = "--check writes no file: it cannot be used with --deps or --source-map";
        return false;
    }
    if (!options.sourceMapPath.empty() && options.settings && options.outputPath.empty()) {
        error = "--source-map with --settings needs -o OUT, where the expansion goes";
        return false;
    }
    return true;
}

}  // namespace ovmacro_tool

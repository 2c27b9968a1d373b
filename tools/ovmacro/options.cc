// The options of ovmacro: their table, and the parser of their GNU forms.
#include "options.h"

#include <limits>
#include <string>
#include <string_view>
#include <vector>

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

// A file name for an output that the expansion does not go to: "-" would be a file of that name, not
// standard output, which holds the expansion.
bool OtherOutputPath(const char* option, const std::string& value, std::string& path, std::string& error) {
    if (value.empty() || value == "-") {
        error = std::string(option) + " needs a file name";
        return false;
    }
    path = value;
    return true;
}

constexpr const char* kWarningNames[kWarningCount] = {"unknown-directive", "unused-macro", "unused-argument",
                                                      "shadow"};

// all, error, NAME or no-NAME (of -Wall, -Werror, -WNAME, -Wno-NAME); false for a name that is no warning.
bool ParseWarningSwitch(std::string_view name, WarningSwitches& switches) {
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
        const std::string_view name = list.substr(from, comma == std::string_view::npos ? comma : comma - from);
        if (name.empty()) return false;
        names.emplace_back(name);
        if (comma == std::string_view::npos) return true;
        from = comma + 1;
    }
}

// Rows in the order of --help; each names its option once, with its help text and what it records.
constexpr OptionSpec kOptions[] = {
    {"output", 'o', "OUT",
     "write the expansion to OUT instead, only when the expansion succeeds (- is standard output); see "
     "Output files below",
     [](Options& o, const std::string& v, std::string& error) {
         if (v.empty()) error = "-o needs a file name (or - for standard output)";
         o.outputPath = v;
         return !v.empty();
     }},
    {"define", 'D', "NAME=TEXT",
     "define macro NAME with body TEXT before FILE is expanded, as a line \"@def NAME = TEXT\" at the top of "
     "FILE would; -D NAME defines NAME as true",
     [](Options& o, const std::string& v, std::string& error) { return ParseDefine(v, o, error); }},
    {"include-dir", 'I', "DIR",
     "search imported files in DIR; an imported NAME is looked for beside the importing file, then in each "
     "-I DIR in order, then in each @importpath directory",
     [](Options& o, const std::string& v, std::string& error) {
         if (v.empty()) error = "-I needs a directory";
         o.includeDirs.push_back(v);
         return !v.empty();
     }},
    {"keep-imports", 0, nullptr,
     "keep the @import lines in the expansion; without it each @import and @importpath directive leaves the "
     "expansion with its line, as a @def line does, so that generated code does not carry them",
     [](Options& o, const std::string&, std::string&) { return o.keepImports = true; }},
    {"settings", 0, nullptr,
     "after expanding, read the settings of FILE and its imports and print each dollar definition ($NAME = "
     "value) as NAME=VALUE; the expansion, its @import lines kept, goes only to -o OUT",
     [](Options& o, const std::string&, std::string&) { return o.settings = true; }},
    {"no-python", 0, nullptr, "refuse embedded Python code (@runpython, @defpython macros fail)",
     [](Options& o, const std::string&, std::string&) { return o.noPython = true; }},
    {"restricted", 0, nullptr,
     "for templates you did not write: no embedded Python; imports only from FILE's folder (the working "
     "directory for standard input) and the -I folders, by relative names that do not lead out of them, also "
     "through symlinks; --max-output defaults to 64M, and an expansion stops after 4 million steps (macro "
     "calls, blocks, loop iterations)",
     [](Options& o, const std::string&, std::string&) { return o.restricted = true; }},
    {"max-output", 0, "SIZE",
     "stop with an error when an expansion has written more than SIZE bytes, the text made inside directives "
     "included (a suffix K, M or G multiplies by 1024, 1024^2, 1024^3); 2G by default",
     [](Options& o, const std::string& v, std::string& error) {
         if (ParseSize(v, o.maxOutput)) return true;
         error = "--max-output needs a size in bytes, with an optional K, M or G: " + v;
         return false;
     }},
    {"deps", 0, "DEPFILE",
     "also write a Make dependency file: \"TARGET: FILE IMPORTED...\" (TARGET is OUT, else FILE) and an "
     "empty rule for each imported file",
     [](Options& o, const std::string& v, std::string& error) {
         return OtherOutputPath("--deps", v, o.depsPath, error);
     }},
    {"source-map", 0, "MAPFILE",
     "also write a JSON source map of the expansion: for each run of output (never more than one line), the "
     "file, line and column it was copied from or that produced it (see Source maps below)",
     [](Options& o, const std::string& v, std::string& error) {
         return OtherOutputPath("--source-map", v, o.sourceMapPath, error);
     }},
    {"line-markers", 0, nullptr,
     "write a line #line N \"FILE\" before each output line whose template line is not the one a C or C++ "
     "compiler would count on, so that its errors in the generated code name the template line (see Line "
     "markers below)",
     [](Options& o, const std::string&, std::string&) { return o.lineMarkers = true; }},
    {"diagnostics", 0, "STYLE",
     "the form of error reports: default (FILE(LINE) : MESSAGE) or gnu (FILE:LINE:COLUMN: error: MESSAGE, "
     "the source line, a caret under the column, then the other lines of the message), which editors and CI "
     "annotators read",
     [](Options& o, const std::string& v, std::string& error) {
         if (ParseDiagnosticStyle(v, o.diagnostics)) return true;
         error = "unknown diagnostics style '" + v + "' (expected default or gnu)";
         return false;
     }},
    {"check", 0, nullptr,
     "with -o OUT: expand and compare with the existing OUT instead of writing it; exit 0 when equal, 1 with "
     "a short unified diff when different or when OUT is missing; writes no file, so --deps and --source-map "
     "cannot be used with it",
     [](Options& o, const std::string&, std::string&) { return o.check = true; }},
    {nullptr, 'W', "NAME",
     "turn on the warning NAME, or off with -Wno-NAME, whatever the place of -Wall; -Wall turns on every "
     "warning, -Werror makes warnings fail the run (exit 1, nothing written). Each warning names its switch, "
     "as [-Wunused-macro]: unknown-directive, a word after @ that is no directive but close to one, as @deff "
     "or @esle (on by default); unused-macro, a macro defined in the expanded files (not by -D) that is never "
     "invoked; unused-argument, an argument that its macro's body never names (not reported for names that "
     "begin with _); shadow, a definition that hides one of the same name in an enclosing scope",
     [](Options& o, const std::string& v, std::string& error) {
         if (ParseWarningSwitch(v, o.warnings)) return true;
         error = "unknown warning option -W" + v;
         return false;
     }},
    {"trace", 0, "NAME,...",
     "report each macro call (or only the calls of the macros named) on standard error as it happens: its "
     "place, its arguments (typed ones as values) and its result, indented by nesting; the blocks that @if, "
     "@elseif, @else, @for and @while expand appear under those names (--trace=@for; @if names a whole "
     "chain), Python macros as \"python NAME\"",
     [](Options& o, const std::string& v, std::string& error) {
         o.trace = true;
         if (v.empty() || ParseTraceNames(std::string_view(v).substr(1), o.traceNames)) return true;
         error = "--trace= needs macro names, separated by commas";
         return false;
     },
     true},
    {"help", 'h', nullptr, "show this text and exit",
     [](Options& o, const std::string&, std::string&) { return o.help = true; }},
    {"version", 0, nullptr, "show the version and exit",
     [](Options& o, const std::string&, std::string&) { return o.version = true; }},
};

// The option of a long name, or of the one long name that it begins (as GNU tools accept); null, with error
// set, when none or several match.
const OptionSpec* FindLongOption(std::string_view name, std::string& error) {
    std::vector<const OptionSpec*> found;
    for (const OptionSpec& spec : kOptions) {
        if (!spec.longName) continue;
        if (name == spec.longName) return &spec;
        if (!name.empty() && std::string_view(spec.longName).starts_with(name)) found.push_back(&spec);
    }
    if (found.size() == 1) return found.front();
    error = (found.empty() ? "unknown option --" : "ambiguous option --") + std::string(name);
    for (size_t i = 0; i < found.size(); ++i)
        error += (i ? ", --" : " (--") + std::string(found[i]->longName);
    if (!found.empty()) error += ")";
    return nullptr;
}

const OptionSpec* FindShortOption(char name) {
    for (const OptionSpec& spec : kOptions)
        if (spec.shortName == name) return &spec;
    return nullptr;
}

// The checks that concern several options together, once all are read.
bool CheckCombinations(Options& options, std::string& error) {
    if (!options.depsPath.empty() && options.inputPath == "-" && options.outputPath.empty()) {
        error = "--deps needs -o OUT when the input is standard input";
        return false;
    }
    if (options.maxOutput == 0)
        options.maxOutput = options.restricted ? kRestrictedMaxOutput : kDefaultMaxOutput;
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

}  // namespace

const char* WarningName(Warning w) { return kWarningNames[static_cast<int>(w)]; }

bool WarningSwitches::On(Warning w) const {
    const signed char set = named[static_cast<int>(w)];
    return set >= 0 ? set == 1 : all || w == Warning::kUnknownDirective;
}

std::span<const OptionSpec> OptionTable() { return kOptions; }

bool ParseOptions(int argc, char** argv, Options& options, std::string& error) {
    bool haveInput = false;
    bool optionsEnded = false;
    for (int i = 1; i < argc; ++i) {
        const std::string_view arg = argv[i];
        // The value of an option that ends its argument is the next argument, whatever it looks like.
        auto nextValue = [&](const std::string& option, std::string& value) {
            if (i + 1 >= argc) {
                error = "option " + option + " needs a value";
                return false;
            }
            value = argv[++i];
            return true;
        };
        if (optionsEnded || arg.size() < 2 || arg[0] != '-') {  // FILE ("-" is standard input)
            if (haveInput) {
                error = "more than one input file given";
                return false;
            }
            options.inputPath = std::string(arg);
            haveInput = true;
        } else if (arg == "--") {
            optionsEnded = true;
        } else if (arg.starts_with("--")) {
            const size_t eq = arg.find('=');
            const std::string_view name = arg.substr(2, eq == std::string_view::npos ? eq : eq - 2);
            const OptionSpec* spec = FindLongOption(name, error);
            if (!spec) return false;
            const std::string option = std::string("--") + spec->longName;
            std::string value;
            if (eq != std::string_view::npos) {
                if (!spec->valueName) {
                    error = "option " + option + " takes no value";
                    return false;
                }
                value = std::string(arg.substr(eq + (spec->optionalValue ? 0 : 1)));
            } else if (spec->valueName && !spec->optionalValue && !nextValue(option, value)) {
                return false;
            }
            if (!spec->apply(options, value, error)) return false;
        } else {
            // Short options, grouped: those without a value, then at most one with a value, which is the
            // rest of the argument or else the next argument.
            for (size_t k = 1; k < arg.size(); ++k) {
                const OptionSpec* spec = FindShortOption(arg[k]);
                const std::string option = "-" + std::string(1, arg[k]);
                if (!spec) {
                    error = "unknown option " + (k == 1 ? "" : option + " in ") + std::string(arg);
                    return false;
                }
                std::string value;
                const bool takesValue = spec->valueName != nullptr;
                if (takesValue && k + 1 < arg.size())
                    value = std::string(arg.substr(k + 1));
                else if (takesValue && !nextValue(option, value))
                    return false;
                if (!spec->apply(options, value, error)) return false;
                if (takesValue) break;
            }
        }
    }
    return CheckCombinations(options, error);
}

}  // namespace ovmacro_tool

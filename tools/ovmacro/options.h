// Command-line options of the ovmacro tool.
#pragma once

#include <span>
#include <string>
#include <utility>
#include <vector>

#include "diagnostics.h"

namespace ovmacro_tool {

// The warnings, each with its switch -WNAME (see WarningName).
enum class Warning { kUnknownDirective, kUnusedMacro, kUnusedArgument, kShadow };
inline constexpr int kWarningCount = 4;
const char* WarningName(Warning w);

// -Wall, -WNAME, -Wno-NAME and -Werror. A switch that names a warning wins over -Wall, whatever their order.
struct WarningSwitches {
    signed char named[kWarningCount] = {-1, -1, -1, -1};  // 1: -WNAME, 0: -Wno-NAME, -1: neither
    bool all = false;                                     // -Wall
    bool errors = false;                                  // -Werror: warnings fail the run
    bool On(Warning w) const;
};

struct Options {
    std::string inputPath = "-";  // "-" is standard input
    std::string outputPath;       // empty: standard output
    std::string depsPath;         // --deps: where the Make dependency file goes; empty: none
    std::string sourceMapPath;    // --source-map: where the JSON source map goes; empty: none
    std::vector<std::pair<std::string, std::string>> defines;  // -D NAME=TEXT, in order
    std::vector<std::string> includeDirs;                      // -I DIR, in order
    bool settings = false;     // --settings: print the settings instead of the expansion
    bool keepImports = false;  // --keep-imports: the @import lines stay in the expansion
    bool noPython = false;     // --no-python: refuse embedded Python code
    bool lineMarkers = false;  // --line-markers: write #line markers into the expansion
    bool check = false;        // --check: compare the expansion with OUT instead of writing it
    bool restricted = false;   // --restricted: for templates one did not write (see --help)
    long long maxOutput = 0;   // --max-output: the bound on what an expansion produces, in bytes
    DiagnosticStyle diagnostics = DiagnosticStyle::kDefault;  // --diagnostics: the form of error reports
    WarningSwitches warnings;                                 // -W...
    bool trace = false;                                       // --trace: report macro calls as they happen
    std::vector<std::string> traceNames;                      // --trace=NAME,...: only these; empty: all
    bool help = false;
    bool version = false;
};

// The default bounds of --max-output, without and with --restricted.
inline constexpr long long kDefaultMaxOutput = 2LL << 30;
inline constexpr long long kRestrictedMaxOutput = 64LL << 20;

// One option: its names, whether it takes a value, its help text and what it records. The table of them is
// the one place that lists the options: the parser, --help and the manual page all read it.
struct OptionSpec {
    const char* longName;   // "output" for --output; null for a short option alone (-WNAME)
    char shortName;         // 'o' for -o; 0 for none
    const char* valueName;  // the value as --help names it ("OUT"); null for an option without a value
    const char* help;       // one paragraph, which --help and the manual page wrap
    // Records the option and its value (empty for an option without one; for an optional value, "=VALUE"
    // when given, so that "--trace=" differs from "--trace"); false, with error set, on a bad value.
    bool (*apply)(Options& options, const std::string& value, std::string& error);
    bool optionalValue = false;  // a long option whose value only comes after '=' (--trace[=NAME,...])
};

// Every option, in the order --help lists them.
std::span<const OptionSpec> OptionTable();

// Parses argv in the GNU forms: "-o OUT" or "-oOUT"; "--output OUT" or "--output=OUT", or an unambiguous
// beginning of the long name; short options without a value grouped ("-hX..."); "--" ends the options, and
// options and FILE may come in any order. On a usage error returns false and sets `error`.
bool ParseOptions(int argc, char** argv, Options& options, std::string& error);
// The text of --help, made from the option table and the manual's sections (manual.cc).
const char* UsageText();

}  // namespace ovmacro_tool

// ovmacro: expands the macros of a file with the ovMacroExpander library.
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <string>
#include <utility>
#include <vector>

#include "check_mode.h"
#include "file_host.h"
#include "line_markers.h"
#include "options.h"
#include "output_runs.h"
#include "ovmacro/foundations/files.h"
#include "ovmacro/python/python_bridge.h"
#include "source_locator.h"
#include "source_map.h"

using namespace orvan;
using ovmacro_tool::FileHost;
using ovmacro_tool::Options;
using ovmacro_tool::OutputRun;
using ovmacro_tool::SourceLocator;

namespace {

constexpr int kExitExpansionError = 1;
constexpr int kExitUsage = 2;

// Writes the whole text to `path` through a temporary file beside it, so that OUT is replaced only whole.
bool WriteFileAtomically(const std::string& path, const std::string& text, std::string& error) {
    const std::string temp = path + ".ovmacro-tmp";
    std::FILE* f = std::fopen(temp.c_str(), "wb");
    if (!f) {
        error = std::strerror(errno);
        return false;
    }
    const bool written = std::fwrite(text.data(), 1, text.size(), f) == text.size();
    const bool closed = std::fclose(f) == 0;
    if (!written || !closed || std::rename(temp.c_str(), path.c_str()) != 0) {
        error = std::strerror(errno);
        std::remove(temp.c_str());
        return false;
    }
    return true;
}

// The -D definitions as the lines of a text that is expanded before FILE, one "@def" line each, so that an
// error in one is reported at its line of "<command line>".
std::string DefinitionsText(const Options& options) {
    std::string text;
    // An empty rest of line would make the definition look for its body in braces on the next line.
    for (const auto& [name, body] : options.defines)
        text += "@def " + name + " = " + (body.empty() ? "{}" : body) + "\n";
    return text;
}

// A file name as Make reads it: blanks, '#' and '$' would otherwise end or change the name.
std::string MakeEscaped(const std::string& name) {
    std::string out;
    for (char c : name) {
        if (c == ' ' || c == '\t' || c == '#') out += '\\';
        if (c == '$') out += '$';
        out += c;
    }
    return out;
}

// "TARGET: FILE IMPORTED...", then an empty rule for each imported file, so that Make does not fail when
// one of them is removed.
std::string DependencyText(const Options& options, const FileHost& host) {
    const std::string target = options.outputPath.empty() ? options.inputPath : options.outputPath;
    const std::vector<std::string> imported = host.ImportedFileNames();
    std::string text = MakeEscaped(target) + ":";
    if (options.inputPath != "-") text += " " + MakeEscaped(options.inputPath);
    for (const std::string& name : imported) text += " " + MakeEscaped(name);
    text += "\n";
    for (const std::string& name : imported) text += "\n" + MakeEscaped(name) + ":\n";
    return text;
}

}  // namespace

int main(int argc, char** argv) {
    Options options;
    std::string error;
    if (!ovmacro_tool::ParseOptions(argc, argv, options, error)) {
        std::fprintf(stderr, "ovmacro: %s\n%s", error.c_str(), "Try 'ovmacro --help'.\n");
        return kExitUsage;
    }
    if (options.help) {
        std::fputs(ovmacro_tool::UsageText(), stdout);
        return 0;
    }
    if (options.version) {
        std::printf("ovmacro %s\n", OVMACRO_VERSION);
        return 0;
    }
    if (options.noPython) SetPythonAllowed(false);

    // The list of loaded files outlives the frame, whose variables are named by views into their texts.
    MpfwSourceFileList files;
    MpfwFrame frame(files);
    FileHost host(frame, options.includeDirs);
    host.SetDiagnosticStyle(options.diagnostics);
    // The map from the expansion back to the sources serves the settings (their errors), line markers and
    // source maps; without them it is not kept.
    host.SetKeepOutputPieces(options.settings || options.lineMarkers || !options.sourceMapPath.empty());

    if (!options.defines.empty() &&
        host.LoadText("<command line>", DefinitionsText(options)) != FileHost::Load::kOk)
        return kExitExpansionError;

    FileHost::Load load;
    if (options.inputPath == "-") {
        std::string text;
        if (!ReadStringFromStdin(text, true, &error)) {
            std::fprintf(stderr, "ovmacro: cannot read <stdin>: %s\n", error.c_str());
            return kExitUsage;
        }
        load = host.LoadText("<stdin>", std::move(text));
    } else {
        load = host.LoadFile(options.inputPath, error);
    }
    if (load == FileHost::Load::kUnreadable) {
        std::fprintf(stderr, "ovmacro: cannot read %s: %s\n", options.inputPath.c_str(), error.c_str());
        return kExitUsage;
    }
    if (load == FileHost::Load::kFailed) return kExitExpansionError;
    std::fflush(stdout);  // text printed while expanding comes before what follows

    if (options.settings && !host.PrintSettings(xcout())) return kExitExpansionError;

    const MpfwSourceFile* root = host.LastLoaded();
    // The expansion is written as it stands; only line markers need a copy to write into.
    std::string marked;
    const std::string* result = &root->expandedText;
    std::string sourceMap;
    if (options.lineMarkers || !options.sourceMapPath.empty()) {
        const SourceLocator locator(files);
        std::vector<OutputRun> runs = ovmacro_tool::SplitIntoRuns(*result, root->pieces, locator);
        if (options.lineMarkers) {
            marked = *result;
            ovmacro_tool::AddLineMarkers(marked, runs, locator);
            result = &marked;
        }
        if (!options.sourceMapPath.empty())
            sourceMap = ovmacro_tool::SourceMapJson(options.outputPath.empty() ? "-" : options.outputPath,
                                                    runs, *result, locator);
    }
    if (options.check) return ovmacro_tool::CheckGeneratedFile(options.outputPath, *result);

    if (options.outputPath.empty()) {
        if (!options.settings && (std::fwrite(result->data(), 1, result->size(), stdout) != result->size() ||
                                  std::fflush(stdout) != 0)) {
            std::fprintf(stderr, "ovmacro: cannot write standard output\n");
            return kExitUsage;
        }
    } else if (!WriteFileAtomically(options.outputPath, *result, error)) {
        std::fprintf(stderr, "ovmacro: cannot write %s: %s\n", options.outputPath.c_str(), error.c_str());
        return kExitUsage;
    }
    if (!options.depsPath.empty() &&
        !WriteFileAtomically(options.depsPath, DependencyText(options, host), error)) {
        std::fprintf(stderr, "ovmacro: cannot write %s: %s\n", options.depsPath.c_str(), error.c_str());
        return kExitUsage;
    }
    if (!options.sourceMapPath.empty() && !WriteFileAtomically(options.sourceMapPath, sourceMap, error)) {
        std::fprintf(stderr, "ovmacro: cannot write %s: %s\n", options.sourceMapPath.c_str(), error.c_str());
        return kExitUsage;
    }
    return 0;
}

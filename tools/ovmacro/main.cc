// ovmacro: expands the macros of a file with the ovMacroExpander library.
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <new>
#include <string>
#include <utility>
#include <vector>

#include "check_mode.h"
#include "file_host.h"
#include "line_markers.h"
#include "options.h"
#include "output_files.h"
#include "output_runs.h"
#include "ovmacro/expander/expansion_observer.h"
#include "ovmacro/expander/nesting_guard.h"
#include "ovmacro/foundations/files.h"
#include "ovmacro/python/python_bridge.h"
#include "source_locator.h"
#include "source_map.h"
#include "watcher.h"

using namespace orvan;
using ovmacro_tool::FileHost;
using ovmacro_tool::FileIdentity;
using ovmacro_tool::IdentityOfExistingFile;
using ovmacro_tool::OutputFiles;
using ovmacro_tool::Options;
using ovmacro_tool::OutputRun;
using ovmacro_tool::SourceLocator;

namespace {

constexpr int kExitExpansionError = 1;
constexpr int kExitUsage = 2;

// The -D definitions as the lines of a text that is expanded before FILE, one "@def" line each, so that an
// error in one is reported at its line of "<command line>".
std::string DefinitionsText(const Options& options) {
    std::string text;
    // An empty rest of line would make the definition look for its body in braces on the next line.
    for (const auto& [name, body] : options.defines)
        text += "@def " + name + " = " + (body.empty() ? "{}" : body) + "\n";
    return text;
}

// A file name as Make reads it: blanks, '#', ':' and '$' would otherwise end or change the name.
std::string MakeEscaped(const std::string& name) {
    std::string out;
    for (char c : name) {
        if (c == ' ' || c == '\t' || c == '#' || c == ':') out += '\\';
        if (c == '$') out += '$';
        out += c;
    }
    return out;
}

// "TARGET: FILE IMPORTED...", then an empty rule for each imported file, so that Make does not fail when
// one of them is removed.
std::string DependencyText(const Options& options, const FileHost& host) {
    const bool toFile = !options.outputPath.empty() && options.outputPath != "-";
    const std::string target = toFile ? options.outputPath : options.inputPath;
    const std::vector<std::string> imported = host.ImportedFileNames();
    std::string text = MakeEscaped(target) + ":";
    if (options.inputPath != "-") text += " " + MakeEscaped(options.inputPath);
    for (const std::string& name : imported) text += " " + MakeEscaped(name);
    text += "\n";
    for (const std::string& name : imported) text += "\n" + MakeEscaped(name) + ":\n";
    return text;
}

// The outputs that this run writes, with the options that name them, in the order committed.
struct PlannedOutputs {
    OutputFiles files;
    std::vector<std::string> options;  // "-o", "--deps", "--source-map"
    int out = -1, deps = -1, sourceMap = -1;
};

// Registers the outputs and refuses, before anything is expanded or written, two options that name one
// file, or an output that is the input file.
bool PlanOutputs(const Options& options, PlannedOutputs& plan, std::string& error) {
    auto add = [&](const std::string& path, const char* option, int& index) {
        if (path.empty()) return true;
        std::string reason;
        if (!plan.files.Add(path, reason)) {
            error = "cannot write " + path + ": " + reason;
            return false;
        }
        index = static_cast<int>(plan.options.size());
        plan.options.push_back(option);
        return true;
    };
    if (!options.check && !add(options.outputPath, "-o", plan.out)) return false;
    if (!add(options.depsPath, "--deps", plan.deps) || !add(options.sourceMapPath, "--source-map", plan.sourceMap))
        return false;
    for (size_t i = 0; i < plan.files.size(); ++i)
        for (size_t j = i + 1; j < plan.files.size(); ++j)
            if (plan.files.Identity(i) == plan.files.Identity(j)) {
                error = plan.options[i] + " and " + plan.options[j] + " name the same file";
                return false;
            }
    FileIdentity input;
    if (options.inputPath != "-" && IdentityOfExistingFile(options.inputPath, input))
        for (size_t i = 0; i < plan.files.size(); ++i)
            if (plan.files.Identity(i) == input) {
                error = plan.options[i] + " names the input file " + options.inputPath;
                return false;
            }
    return true;
}

// Refuses an output that is a file the expansion has read (an imported file).
bool OutputsAreNotLoaded(const PlannedOutputs& plan, const FileHost& host, std::string& error) {
    for (const std::string& name : host.ImportedFileNames()) {
        FileIdentity loaded;
        if (!IdentityOfExistingFile(name, loaded)) continue;
        for (size_t i = 0; i < plan.files.size(); ++i)
            if (plan.files.Identity(i) == loaded) {
                error = plan.options[i] + " names " + name + ", which the expansion reads";
                return false;
            }
    }
    return true;
}

int Run(int argc, char** argv) {
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
    PlannedOutputs outputs;
    if (!PlanOutputs(options, outputs, error)) {
        std::fprintf(stderr, "ovmacro: %s\n", error.c_str());
        return kExitUsage;
    }
    if (options.noPython || options.restricted) SetPythonAllowed(false);
#ifdef OVMACRO_BUILD_PYTHON_MODULE
    SetPythonModuleFallback(OVMACRO_BUILD_PYTHON_MODULE);  // for a tool run from its build tree
#endif
    MacroNestingGuard::SetOutputLimit(options.maxOutput);

    // The list of loaded files outlives the frame, whose variables are named by views into their texts.
    MpfwSourceFileList files;
    MpfwFrame frame(files);
    FileHost host(frame, options.includeDirs);
    host.SetDiagnosticStyle(options.diagnostics);
    // Warnings, the notes after an error and the trace come from watching the expansion.
    ovmacro_tool::Watcher watcher(files, options);
    const ExpansionObserver::Installation watching(watcher, watcher.WatchesCalls());
    host.SetNotesWriter([&watcher](const LexScannerException& e) { watcher.WriteNotes(e); });
    if (options.restricted) host.Restrict(options.inputPath, options.maxOutput);
    // The map from the expansion back to the sources serves the settings (their errors), line markers and
    // source maps; without them it is not kept.
    host.SetKeepOutputPieces(options.settings || options.lineMarkers || !options.sourceMapPath.empty());
    host.SetMapLargeFiles(true);
    ovmacro_tool::EndRunWhenAMappedInputShrinks();
    // Generated code must not carry @import lines; the settings reader meets each import at its line.
    host.SetKeepImportDirectives(options.settings || options.keepImports);

    if (!options.defines.empty() &&
        host.LoadText("<command line>", DefinitionsText(options)) != FileHost::Load::kOk)
        return kExitExpansionError;

    // When nothing else reads the expansion, it goes into OUT's temporary file as it is made, through a bounded
    // buffer, and OUT is replaced only when it succeeds. (An OUT that cannot take it so is written as before.)
    const bool streamed = outputs.out >= 0 && !options.settings && !options.lineMarkers &&
                          options.sourceMapPath.empty() && [&] {
                              std::string ignored;  // an unwritable OUT is reported after the expansion
                              xostream* stream = outputs.files.StageStream(outputs.out, ignored);
                              host.StreamNextExpansion(stream);
                              return stream != nullptr;
                          }();
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
    watcher.ReportUnusedMacros();
    if (options.warnings.errors && watcher.WarningCount() > 0) {
        std::fputs("ovmacro: error: warnings are treated as errors (-Werror)\n", stderr);
        return kExitExpansionError;
    }

    if (options.settings && !host.PrintSettings(xcout())) return kExitExpansionError;
    if (!OutputsAreNotLoaded(outputs, host, error)) {
        std::fprintf(stderr, "ovmacro: %s\n", error.c_str());
        return kExitUsage;
    }

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

    if (options.outputPath.empty() && !options.settings &&
        (std::fwrite(result->data(), 1, result->size(), stdout) != result->size() || std::fflush(stdout) != 0)) {
        std::fprintf(stderr, "ovmacro: cannot write standard output\n");
        return kExitUsage;
    }
    const std::string dependencies = options.depsPath.empty() ? "" : DependencyText(options, host);
    const bool staged = (outputs.out < 0 || streamed || outputs.files.Stage(outputs.out, *result, error)) &&
                        (outputs.deps < 0 || outputs.files.Stage(outputs.deps, dependencies, error)) &&
                        (outputs.sourceMap < 0 || outputs.files.Stage(outputs.sourceMap, sourceMap, error));
    if (!staged || !outputs.files.Commit(error)) {
        std::fprintf(stderr, "ovmacro: %s\n", error.c_str());
        return kExitUsage;
    }
    return 0;
}

}  // namespace

int main(int argc, char** argv) {
    // The library reports its own allocation failures as located errors; one anywhere else ends the run
    // with a report too, never with an abort.
    try {
        return Run(argc, argv);
    } catch (const std::bad_alloc&) {
        std::fputs("ovmacro: error: out of memory\n", stderr);
    } catch (const std::exception& e) {
        std::fprintf(stderr, "ovmacro: error: %s\n", e.what());
    }
    return kExitExpansionError;
}

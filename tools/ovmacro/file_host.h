// FileHost: how ovmacro loads a file and the files it imports, and reads their settings.
//
// A project description parser whose imports are files on disk: @import "name" looks for name beside the
// importing file, then in each -I directory, then in each @importpath directory, all in the one file-scope
// frame, so that what an imported file defines is visible after its @import. Errors are reported on
// standard error, with the file and line they belong to, in the default or the gnu form.
//
//     orvan::MpfwSourceFileList files;
//     orvan::MpfwFrame frame(files);
//     FileHost host(frame, {"include"});
//     std::string error;
//     if (host.LoadFile("root.ovp", error) == FileHost::Load::kOk) host.PrintSettings(orvan::xcout());
#pragma once

#include <functional>
#include <map>
#include <set>
#include <string>
#include <vector>

#include "diagnostics.h"
#include "ovmacro/mpfw/mpfw_parser.h"

namespace ovmacro_tool {

class FileHost : public orvan::MpfwParser {
public:
    enum class Load {
        kOk,
        kFailed,      // the expansion failed; the report is on standard error
        kUnreadable,  // the file itself cannot be read
    };

    FileHost(orvan::MpfwFrame& frame, std::vector<std::string> includeDirs);

    // Loads and expands a file under the name given. kUnreadable sets error to the reason.
    Load LoadFile(const std::string& path, std::string& error);
    // Loads and expands a text held in memory (standard input, the -D definitions) under a name that is no
    // path: imports from it are looked for from the working directory on.
    Load LoadText(const std::string& name, std::string text);
    // --restricted: imports only from the folder of `inputPath` (the working directory for standard input)
    // and the -I folders, no Python, and `maxOutput` as the bound of each expansion.
    void Restrict(const std::string& inputPath, long long maxOutput);
    // The record of the last file or text given to LoadFile or LoadText (null before the first).
    orvan::MpfwSourceFile* LastLoaded() const { return lastLoaded_; }

    // Reads the expanded text of every loaded file and writes each dollar definition or setting as
    // NAME=VALUE, one per line, in the order read. An imported file is read where its @import stands, so
    // that what it defines is known to the rest of the importing file. False after reporting an error (a
    // text that is neither an import nor a definition, or a faulty definition) on standard error.
    bool PrintSettings(orvan::xostream& out);

    // The names of the files loaded through @import, each once, in load order.
    std::vector<std::string> ImportedFileNames() const;

    bool ResolveFile(const orvan::basic_xstring& name, orvan::basic_xstring& fullPath) override;
    void OnImport(orvan::MpfwSourceFile* file) override;
    // A relative @importpath directory is taken relative to the file that gives it.
    bool HandleImportPath(const orvan::basic_xstring& path, const char* position) override;
    // Writes the report of an error on standard error, in the form chosen with SetDiagnosticStyle.
    void ReportError(const orvan::LexScannerException& e) override;
    void SetDiagnosticStyle(DiagnosticStyle style) { diagnostics_ = style; }
    // What writes the notes after each error report (none: no notes).
    void SetNotesWriter(std::function<void(const orvan::LexScannerException&)> notes) {
        notes_ = std::move(notes);
    }

private:
    // The directory of the file whose import is being handled or read; empty for the working directory.
    std::string ImportingDirectory() const;
    // The name under which a file is recorded: the first name that reached it, so that a file reached by
    // two spellings of its path is recognised as the same one.
    std::string NameFor(const std::string& path);
    void ReadSettingsOf(orvan::MpfwSourceFile* file, orvan::xostream& out);

    std::vector<std::string> includeDirs_;
    std::map<std::string, std::string> names_;  // canonical path -> recorded name
    std::set<std::string> loadedByUser_;        // names given to LoadFile and LoadText, not imported
    std::set<std::string> inMemory_;            // names of texts that no file holds
    std::vector<std::string> reading_;          // files whose settings are being read, outermost first
    std::set<std::string> read_;
    orvan::MpfwSourceFile* pendingImport_ = nullptr;
    orvan::MpfwSourceFile* lastLoaded_ = nullptr;
    DiagnosticStyle diagnostics_ = DiagnosticStyle::kDefault;
    std::function<void(const orvan::LexScannerException&)> notes_;
};

}  // namespace ovmacro_tool

// Loading project description files: reading, recording, expanding, and following their imports.
#include <algorithm>
#include <cstdlib>
#include <memory>
#include <utility>

#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/foundations/files.h"
#include "ovmacro/foundations/paths.h"
#include "ovmacro/mpfw/mpfw_parser.h"
#include "ovmacro/python/python_bridge.h"

namespace orvan {

namespace {

// Keeps a file's name on the chain of files being expanded while its expansion runs.
class ExpansionChainEntry {
public:
    ExpansionChainEntry(xvector<basic_xstring>& chain, const basic_xstring& name) : chain_(chain) {
        chain_.push_back(name);
    }
    ~ExpansionChainEntry() { chain_.pop_back(); }
    ExpansionChainEntry(const ExpansionChainEntry&) = delete;
    ExpansionChainEntry& operator=(const ExpansionChainEntry&) = delete;

private:
    xvector<basic_xstring>& chain_;
};

// Sets Python and the bounds of a restricted load for its duration, and puts back what was set before.
class RestrictedLoad {
public:
    RestrictedLoad(bool active, const MpfwRestrictions& r) : active_(active), python_(IsPythonAllowed()) {
        if (!active_) return;
        SetPythonAllowed(false);
        MacroNestingGuard::SetOutputLimit(r.outputLimit);
        MacroNestingGuard::SetExpansionLimit(r.expansionLimit);
    }
    ~RestrictedLoad() {
        if (!active_) return;
        SetPythonAllowed(python_);
        MacroNestingGuard::SetOutputLimit(output_);
        MacroNestingGuard::SetExpansionLimit(expansions_);
    }
    RestrictedLoad(const RestrictedLoad&) = delete;
    RestrictedLoad& operator=(const RestrictedLoad&) = delete;

private:
    bool active_;
    bool python_;
    int64 output_ = MacroNestingGuard::OutputLimit();
    int64 expansions_ = MacroNestingGuard::ExpansionLimit();
};

// The path with every symlink resolved, or empty when it leads nowhere.
basic_xstring RealPath(const basic_xstring& path) {
    char* real = ::realpath(path.c_str(), nullptr);
    if (!real) return {};
    basic_xstring result(real);
    std::free(real);
    return result;
}

bool IsInside(const basic_xstring& path, const basic_xstring& folder) {
    if (folder == "/") return true;
    return path.size() > folder.size() && path.compare(0, folder.size(), folder) == 0 && path[folder.size()] == '/';
}

}  // namespace

void MpfwParser::Restrict(MpfwRestrictions restrictions) {
    restricted_ = true;
    restrictions_ = std::move(restrictions);
    // Compared with the real path of each import, so resolved the same way once here.
    for (basic_xstring& folder : restrictions_.importFolders) folder = RealPath(folder);
}

void MpfwParser::CheckImportAllowed(const basic_xstring& name, const basic_xstring& fullPath,
                                    const char* position) const {
    if (!restricted_) return;
    if (!name.empty() && name.front() == '/')
        throw LexScannerException("Import of " + name + " refused: an absolute path, in restricted mode", position);
    const basic_xstring real = RealPath(fullPath);
    for (const basic_xstring& folder : restrictions_.importFolders)
        if (!real.empty() && !folder.empty() && IsInside(real, folder)) return;
    throw LexScannerException("Import of " + name + " refused: it lies outside the folders allowed in restricted mode",
                              position);
}

MpfwSourceFile* MpfwParser::CreateMpfwSourceFile() {
    return new MpfwSourceFile;
}

MpfwSourceFile* MpfwParser::AddFile(const basic_xstring& path, BasicSubString extra) {
    // Large enough that mapping costs less than copying.
    constexpr int64 kMappedSize = 256 * 1024;
    MappedFile mapped;
    if (mapLargeFiles_ && extra.empty() && MappedFile::MapTextFile(path, kMappedSize, mapped)) {
        std::unique_ptr<MpfwSourceFile> file(CreateMpfwSourceFile());
        file->fileName = path;
        file->mapped = std::move(mapped);
        return AddFileRecord(std::move(file));
    }
    basic_xstring text;
    if (!ReadStringFromFile(path, text, true)) throw LexScannerException("Couldn't open file " + path, token);
    text.append(extra.view());
    return AddFileWithText(path, std::move(text));
}

MpfwSourceFile* MpfwParser::AddFileWithText(const basic_xstring& name, basic_xstring text) {
    std::unique_ptr<MpfwSourceFile> file(CreateMpfwSourceFile());
    file->fileName = name;
    file->text = std::move(text);
    return AddFileRecord(std::move(file));
}

MpfwSourceFile* MpfwParser::AddFileRecord(std::unique_ptr<MpfwSourceFile> owned) {
    MpfwSourceFile* file = owned.get();
    const basic_xstring& name = file->fileName;
    mpfwFrame->sourceFiles.AddSrcFile(owned.release());

    xostream* stream = expanding_.empty() ? std::exchange(stream_, nullptr) : nullptr;
    ExpansionChainEntry entry(expanding_, name);
    const RestrictedLoad restrictedLoad(restricted_, restrictions_);
    const ExpandingFiles expanding(mpfwFrame->sourceFiles);
    try {
        if (stream) {
            ExpandedOutput output(stream, false);
            output.GatherShortRuns();
            MacroExpand(this, &mpfwFrame->varFrame, file->Text(), 0, 0, output);
        } else if (keepOutputPieces_)
            MacroExpand(this, &mpfwFrame->varFrame, file->Text(), 0, 0, file->expandedText,
                        file->pieces);
        else
            MacroExpand(this, &mpfwFrame->varFrame, file->Text(), 0, 0, file->expandedText);
    } catch (LexScannerException& e) {
        // An imported file's expansion is not the outermost one, which would otherwise count the context
        // lines left out; the report is written here, so count them here.
        e.AppendOmittedContextCount();
        ReportError(e);
        return nullptr;
    }
    return file;
}

void MpfwParser::ReportError(const LexScannerException& e) {
    TracerX trace;
    mpfwFrame->sourceFiles.WriteLexScannerError(trace, e);
}

bool MpfwParser::HandleImportPath(const basic_xstring& path, const char* position) {
    basic_xstring dir = path;
    ApplyMacrosAt(dir, position);
    if (restricted_ && !dir.empty() && dir.front() == '/')
        throw LexScannerException("@importpath " + dir + " refused: an absolute path, in restricted mode", position);
    NormalisePath(dir);
    mpfwFrame->importPaths.push_back(std::move(dir));
    return true;
}

bool MpfwParser::HandleImport(VarFrame*, const basic_xstring& fileName, const char* position) {
    basic_xstring name = fileName;
    ApplyMacrosAt(name, position);
    basic_xstring fullPath;
    if (restricted_ && !name.empty() && name.front() == '/') CheckImportAllowed(name, name, position);
    if (!ResolveFile(name, fullPath)) throw LexScannerException("Couldn't open file " + name, position);
    CheckImportAllowed(name, fullPath, position);
    // A file that imports itself, directly or through others, would be expanded again and again.
    if (std::find(expanding_.begin(), expanding_.end(), fullPath) != expanding_.end())
        throw LexScannerException("Recursive import of file " + fullPath, position);
    try {
        return AddFile(fullPath, BasicSubString()) != nullptr;
    } catch (LexScannerException& e) {
        // A file that resolved but cannot be read (AddFile reports expansion errors itself): the place to
        // show is the import, not whatever token the parser last read.
        e.SetPosition(position);
        throw;
    }
}

bool MpfwParser::ApplyMacros(basic_xstring& text) {
    return ApplyMacrosAt(text, token.text.begin());
}

bool MpfwParser::ApplyMacrosAt(basic_xstring& text, const char* pos) {
    try {
        return mpfwFrame->varFrame.ApplyDollarMacros(text);
    } catch (LexScannerException& e) {
        if (!e.GetPosition()) e.SetPosition(pos);
        throw;
    }
}

}  // namespace orvan

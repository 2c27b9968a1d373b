// ovmacro's import host: resolving imported names to files, and reading the settings of the loaded files.
#include "file_host.h"

#include <filesystem>
#include <system_error>
#include <utility>

#include "ovmacro/expander/held_text.h"
#include "ovmacro/foundations/compose.h"
#include "ovmacro/foundations/files.h"
#include "ovmacro/foundations/paths.h"

using namespace orvan;

namespace ovmacro_tool {

namespace {

std::string Join(const std::string& dir, const std::string& name) {
    std::string path = dir.empty() ? name : dir + "/" + name;
    NormalisePath(path);
    return path;
}

std::string DirectoryOf(std::string path) {
    NormalisePath(path);
    const size_t slash = path.rfind('/');
    if (slash == std::string::npos) return "";
    return slash == 0 ? "/" : path.substr(0, slash);
}

bool IsRegularFile(const std::string& path) {
    std::error_code ec;
    return std::filesystem::is_regular_file(path, ec);
}

}  // namespace

FileHost::FileHost(MpfwFrame& frame, std::vector<std::string> includeDirs)
    : MpfwParser(frame), includeDirs_(std::move(includeDirs)) {}

void FileHost::Restrict(const std::string& inputPath, long long maxOutput) {
    MpfwRestrictions restrictions;
    const std::string inputFolder = inputPath == "-" ? "" : DirectoryOf(inputPath);
    restrictions.importFolders.push_back(inputFolder.empty() ? "." : inputFolder);
    for (const std::string& dir : includeDirs_) restrictions.importFolders.push_back(dir);
    restrictions.outputLimit = maxOutput;
    MpfwParser::Restrict(std::move(restrictions));
}

FileHost::Load FileHost::LoadFile(const std::string& path, std::string& error) {
    const std::string name = NameFor(path);
    loadedByUser_.insert(name);
    try {
        const int64 before = mpfwFrame->sourceFiles.size();
        const bool ok = AddFile(name, BasicSubString()) != nullptr;
        lastLoaded_ = mpfwFrame->sourceFiles[before];
        return ok ? Load::kOk : Load::kFailed;
    } catch (const LexScannerException&) {
        // AddFile says only that the file could not be opened; ask again for the reason.
        std::string ignored;
        if (ReadStringFromFile(name, ignored, true, &error)) error = "cannot be read";
        return Load::kUnreadable;
    }
}

FileHost::Load FileHost::LoadText(const std::string& name, std::string text) {
    loadedByUser_.insert(name);
    inMemory_.insert(name);
    const int64 before = mpfwFrame->sourceFiles.size();
    const bool ok = AddFileWithText(name, std::move(text)) != nullptr;
    lastLoaded_ = mpfwFrame->sourceFiles[before];
    return ok ? Load::kOk : Load::kFailed;
}

std::string FileHost::NameFor(const std::string& path) {
    std::error_code ec;
    std::string key = std::filesystem::weakly_canonical(path, ec).string();
    if (ec) key = path;
    return names_.emplace(key, path).first->second;
}

std::string FileHost::ImportingDirectory() const {
    const std::string* current = nullptr;
    if (!reading_.empty())
        current = &reading_.back();
    else if (!GetFilesBeingExpanded().empty())
        current = &GetFilesBeingExpanded().back();
    if (!current || inMemory_.count(*current)) return "";
    return DirectoryOf(*current);
}

bool FileHost::ResolveFile(const basic_xstring& name, basic_xstring& fullPath) {
    if (name.empty()) return false;
    std::vector<std::string> candidates;
    if (name.front() == '/') {
        candidates.push_back(Join("", name));
    } else {
        candidates.push_back(Join(ImportingDirectory(), name));
        for (const std::string& dir : includeDirs_) candidates.push_back(Join(dir, name));
        for (const std::string& dir : mpfwFrame->importPaths) candidates.push_back(Join(dir, name));
    }
    for (const std::string& candidate : candidates) {
        if (!IsRegularFile(candidate)) continue;
        fullPath = NameFor(candidate);
        return true;
    }
    return false;
}

bool FileHost::HandleImportPath(const basic_xstring& path, const char* position) {
    MpfwParser::HandleImportPath(path, position);
    std::string& dir = mpfwFrame->importPaths.back();
    if (dir.front() != '/') dir = Join(ImportingDirectory(), dir);
    return true;
}

void FileHost::ReportError(const LexScannerException& e) {
    WriteDiagnostic(xcerr(), mpfwFrame->sourceFiles, e, diagnostics_);
    xcerr().flush();
    if (notes_) notes_(e);
}

void FileHost::OnImport(MpfwSourceFile* file) {
    pendingImport_ = file;
}

bool FileHost::PrintSettings(xostream& out) {
    const MpfwSourceFileList& files = mpfwFrame->sourceFiles;
    try {
        for (int64 i = 0; i < files.size(); ++i) ReadSettingsOf(files[i], out);
    } catch (const LexScannerException& e) {
        out.flush();
        ReportError(e);
        return false;
    }
    out.flush();
    return true;
}

void FileHost::ReadSettingsOf(MpfwSourceFile* file, xostream& out) {
    if (!read_.insert(file->fileName).second) return;  // a file imported twice is read once
    reading_.push_back(file->fileName);
    try {
        Init(file->expandedText);
        while (GetTokenType() != TK_EOS) {
            pendingImport_ = nullptr;
            if (ParseImportDirective()) {
                if (pendingImport_) {
                    // Read the imported file here, then carry on where this one stopped.
                    const ParserBase here = *this;
                    ReadSettingsOf(pendingImport_, out);
                    static_cast<ParserBase&>(*this) = here;
                }
                continue;
            }
            basic_xstring name, value;
            if (ParseMacroDef(name, value)) {
                out << name << '=' << value << '\n';
                continue;
            }
            throw LexScannerException(Compose("Expected $NAME = value or @import when read ", token), token);
        }
    } catch (LexScannerException& e) {
        // The end of the expanded text stands for the end of the file.
        if (e.GetPosition() == file->expandedText.data() + file->expandedText.size())
            e.SetPosition(file->Text().end());
        file->AdjustErrorPosition(e);
        // Text made by a macro that a double expansion or a loop item defined maps into that made text.
        MovePositionOutOfHeldTexts(e);
        throw;
    }
    reading_.pop_back();
}

std::vector<std::string> FileHost::ImportedFileNames() const {
    std::vector<std::string> names;
    std::set<std::string> seen;
    const MpfwSourceFileList& files = mpfwFrame->sourceFiles;
    for (int64 i = 0; i < files.size(); ++i) {
        const std::string& name = files[i]->fileName;
        if (loadedByUser_.count(name) || !seen.insert(name).second) continue;
        names.push_back(name);
    }
    return names;
}

}  // namespace ovmacro_tool

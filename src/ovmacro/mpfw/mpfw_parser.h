// MpfwParser: loads project description files and offers the steps from which a host reads their settings.
//
// As an ImportHandler it loads a file, records it in the frame's source-file list and expands it in the one
// file-scope frame of the MpfwFrame, loading every file that the text imports at the point of its @import. As
// an ExpressionParser it then reads an expanded text: an import line, a dollar definition, a string or path
// setting. A host derives from it and says how an imported name becomes a path and what an import means to
// it:
//
//     class Host : public MpfwParser {
//         bool ResolveFile(const basic_xstring& name, basic_xstring& fullPath) override;
//         void OnImport(MpfwSourceFile* file) override;
//     };
//     MpfwSourceFileList files;
//     MpfwFrame frame(files);
//     Host host(frame);
//     if (MpfwSourceFile* f = host.AddFile("root.ovp", {})) {  // errors are reported on standard error
//         host.Init(f->expandedText);
//         while (host.ParseImportDirective() || host.ParseMacroDef()) {}
//     }
//
// The frame, its list and the recorded files must outlive the parser.
#pragma once

#include <memory>

#include "ovmacro/expander/import_handler.h"
#include "ovmacro/expander/nesting_guard.h"
#include "ovmacro/expr/expression_parser.h"
#include "ovmacro/mpfw/mpfw_frame.h"

namespace orvan {

// What a host that expands texts it did not write (a service rendering its users' templates) lets them do.
struct MpfwRestrictions {
    // Imports must name a relative path that leads, symlinks followed, to a file inside one of these folders.
    xvector<basic_xstring> importFolders;
    // The bounds of each expansion (see MacroNestingGuard); embedded Python is refused as well.
    int64 outputLimit = int64{64} << 20;
    int64 expansionLimit = 4'000'000;
};

class MpfwParser : public ExpressionParser, public ImportHandler {
public:
    explicit MpfwParser(MpfwFrame& frame) : mpfwFrame(&frame) {}
    MpfwParser(const MpfwParser&) = delete;
    MpfwParser& operator=(const MpfwParser&) = delete;
    ~MpfwParser() override = default;

    // Loading.

    // Reads the file (CR LF read as LF), appends `extra`, records it and expands it. A file that cannot be
    // read raises "Couldn't open file " + path at the current token. An expansion error is handed to
    // ReportError (by default a report with file and line on standard error); the file stays recorded and
    // the result is null.
    MpfwSourceFile* AddFile(const basic_xstring& path, BasicSubString extra);
    // The same for a text that the host already holds (standard input, text made by the host), recorded
    // under `name`.
    MpfwSourceFile* AddFileWithText(const basic_xstring& name, basic_xstring text);
    // Whether the files loaded from now on keep the output pieces of their expansions (they do by default).
    // A host that only writes the expanded texts, and neither reads settings from them nor maps their
    // positions back, saves the pieces' memory: a few pieces for every macro call.
    void SetKeepOutputPieces(bool keep) { keepOutputPieces_ = keep; }
    // Writes the expansion of the next file loaded at the top (not through an import) into `stream` as it is
    // made, instead of keeping it in the file's record (whose expandedText stays empty, without pieces): a host
    // that only writes the expansion out needs no memory for it. What reached the stream before an error stays
    // there; the host discards it.
    void StreamNextExpansion(xostream* stream) { stream_ = stream; }
    // Whether AddFile maps a large file into memory instead of reading it (the record's text then stays empty;
    // its Text() is the mapping): a host that reads the records' texts through Text() saves the copy.
    void SetMapLargeFiles(bool map) { mapLargeFiles_ = map; }
    // Whether the expansions of the files loaded from now on keep their @import lines (they do by default).
    // The reading steps meet an imported file's settings at its import, so a host that reads settings keeps
    // them; a host that writes the expanded texts as generated code drops them, each with its line, as a @def
    // line goes. The output pieces map what remains exactly.
    void SetKeepImportDirectives(bool keep) { keepImportDirectives_ = keep; }
    bool KeepsImportDirectives() const override { return keepImportDirectives_; }
    // From now on, the files loaded run under `restrictions`: an import or @importpath that would leave the
    // folders is refused with an error at the directive, before the file is read, and Python and the bounds
    // are set for the time of each load.
    void Restrict(MpfwRestrictions restrictions);

    // A directory in which later imports may be searched: dollar macros applied, normalised, appended to
    // the frame's import paths.
    bool HandleImportPath(const basic_xstring& path, const char* position) override;
    // Resolves the name (dollar macros applied) and loads the file, expanded at this point in the shared
    // frame. An import of a file that is still being expanded raises "Recursive import of file " + path.
    bool HandleImport(VarFrame* frame, const basic_xstring& fileName, const char* position) override;
    // A new, empty record; a host may make a type derived from MpfwSourceFile.
    virtual MpfwSourceFile* CreateMpfwSourceFile();
    // The path under which an imported name is read and recorded; false if there is no such file. A host
    // should give one path per file, since imports in progress are recognised by it.
    virtual bool ResolveFile(const basic_xstring& name, basic_xstring& fullPath) = 0;
    // Tells the host that the text being read imports `file` (the recorded file of that path, or null).
    virtual void OnImport(MpfwSourceFile* file) = 0;
    // Writes the report of an expansion error that AddFile does not pass on. By default the report
    // "\nFILE(LINE) : MESSAGE\n" of the source-file list goes to standard error; a host may write it
    // elsewhere or in another form.
    virtual void ReportError(const LexScannerException& e);

    // Replaces the references to defined dollar macros in text, repeatedly; true if anything was replaced.
    bool ApplyMacros(basic_xstring& text);

    // Reading an expanded text (after Init). Each step looks at the current token.

    // "@import" and a quoted name: resolves it and reports it through OnImport. False, consuming nothing,
    // unless the current token is "@".
    bool ParseImportDirective();
    // "$NAME = value" or "$NAME = path value" (normalised): defines the dollar macro NAME. False, consuming
    // nothing, unless the current token is "$".
    bool ParseMacroDef();
    bool ParseMacroDef(basic_xstring& name, basic_xstring& value);
    // "$NAME = "text"" with the name the host expects here; the double-quoted text is taken as it stands.
    void ParseStringSetting(const basic_xstring& name, basic_xstring& value);
    // The same for a path: forward slashes only and no trailing slash (an empty path is accepted).
    void ParsePathSetting(const basic_xstring& name, basic_xstring& value);
    // The common part of the two: leaves the quoted literal current.
    void ParseStringSettingHelper(const basic_xstring& name, basic_xstring& value);
    // The decoded text of the current quoted literal, dollar macros applied; the token is not consumed.
    basic_xstring ParseQuotedString();
    // ParseQuotedString, refusing backslashes.
    basic_xstring ParseFileOrDirName();
    // A quoted literal or a parenthesised string expression, dollar macros applied.
    void ReadString(basic_xstring& value);

    // The file and line of the current token, traced back from the expanded text being read to its source.
    bool GetFilenameAndLineNumberAtCurrentPosition(basic_xstring& file, int64& line) const override;

    MpfwFrame* GetMpfwFrame() const { return mpfwFrame; }

protected:
    // The names of the files being expanded, outermost first: the last one is the file whose expansion is
    // running now, which an import inside it comes from.
    const xvector<basic_xstring>& GetFilesBeingExpanded() const { return expanding_; }

    MpfwFrame* mpfwFrame;

private:
    // ApplyMacros, placing an error without a position (a dollar macro that leads back to itself) at pos.
    bool ApplyMacrosAt(basic_xstring& text, const char* pos);

    // Refuses, at position, an import that leaves the permitted folders (restricted mode only).
    void CheckImportAllowed(const basic_xstring& name, const basic_xstring& fullPath, const char* position) const;

    xvector<basic_xstring> expanding_;
    bool keepOutputPieces_ = true;
    xostream* stream_ = nullptr;
    bool mapLargeFiles_ = false;
    // Records the file (its text or its mapping set) and expands it.
    MpfwSourceFile* AddFileRecord(std::unique_ptr<MpfwSourceFile> file);
    bool keepImportDirectives_ = true;
    bool restricted_ = false;
    MpfwRestrictions restrictions_;
};

}  // namespace orvan

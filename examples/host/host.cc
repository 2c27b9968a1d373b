// An example host of the installed ovMacroExpander library: reads a project description and prints it.
//
//     host project.ovp
//
// The description is macro-expanded first (its @def macros, @str strings and @import files), then read
// setting by setting: the root file holds its imports, then the two settings every project needs,
//
//     $name = "greeter"         a string setting
//     $path = "apps/greeter"    a path setting: forward slashes, no trailing slash
//
// then any dollar definitions ($NAME = "text", $NAME = path "dir/..", $NAME = ("a" + "b")) and imports.
// An imported file holds only imports and dollar definitions. Each is printed as it is read ("import  FILE",
// "setting NAME = VALUE", "define  NAME = VALUE"); an imported file is read where its @import stands, so
// that its definitions are known to the rest of the importer.
// Errors are reported as FILE(LINE) : MESSAGE on standard error, and the exit status is then 1.
#include <ovmacro/ovMacroExpander.h>

#include <cstdio>
#include <filesystem>
#include <set>
#include <string>
#include <system_error>
#include <utility>
#include <vector>

using namespace orvan;

namespace {

std::string DirectoryOf(const std::string& path) {
    const size_t slash = path.rfind('/');
    if (slash == std::string::npos) return ".";
    return slash == 0 ? "/" : path.substr(0, slash);
}

class ProjectHost : public MpfwParser {
public:
    ProjectHost(MpfwFrame& frame, std::string rootDir) : MpfwParser(frame), rootDir_(std::move(rootDir)) {}

    // An imported name is looked for beside the root file, then in each @importpath directory.
    bool ResolveFile(const basic_xstring& name, basic_xstring& fullPath) override {
        if (name.empty()) return false;
        std::vector<std::string> candidates;
        if (name.front() == '/') {
            candidates.push_back(name);
        } else {
            candidates.push_back(rootDir_ + "/" + name);
            for (const basic_xstring& dir : mpfwFrame->importPaths) candidates.push_back(dir + "/" + name);
        }
        for (std::string& candidate : candidates) {
            NormalisePath(candidate);
            std::error_code ec;
            if (std::filesystem::is_regular_file(candidate, ec)) {
                fullPath = candidate;
                return true;
            }
        }
        return false;
    }

    void OnImport(MpfwSourceFile* file) override { imported_ = file; }

    // Reads the root file and, at their imports, the files it imports. False after reporting an error.
    bool Read(MpfwSourceFile* root) {
        try {
            ReadFile(root, true);
        } catch (const LexScannerException& e) {
            std::fflush(stdout);
            mpfwFrame->sourceFiles.WriteLexScannerError(xcerr(), e);
            xcerr().flush();
            return false;
        }
        return true;
    }

private:
    void ReadFile(MpfwSourceFile* file, bool isRoot) {
        if (!read_.insert(file->fileName).second) return;  // a file imported twice is read once
        try {
            Init(file->expandedText);
            ReadImportsAndDefinitions(false);
            if (isRoot) {
                basic_xstring value;
                ParseStringSetting("name", value);
                Print("setting", "name = " + value);
                ParsePathSetting("path", value);
                Print("setting", "path = " + value);
            }
            ReadImportsAndDefinitions(true);
            if (GetTokenType() != TK_EOS) {
                StringStream msg;
                msg << "Expected $NAME = value or @import when read " << token;
                throw LexScannerException(msg.GetString(), token);
            }
        } catch (LexScannerException& e) {
            // The error lies in the expanded text: move it back to the line the user wrote.
            if (e.GetPosition() == file->expandedText.data() + file->expandedText.size())
                e.SetPosition(file->text.data() + file->text.size());
            file->AdjustErrorPosition(e);
            throw;
        }
    }

    // Imports, and dollar definitions too when `definitions`, until neither comes.
    void ReadImportsAndDefinitions(bool definitions) {
        for (;;) {
            imported_ = nullptr;
            if (ParseImportDirective()) {
                if (!imported_) continue;
                basic_xstring shown;
                CalcRelativePath(rootDir_, imported_->fileName, shown);
                Print("import", shown);
                // Read the imported file here, then go on where this one stopped.
                const ParserBase here = *this;
                ReadFile(imported_, false);
                static_cast<ParserBase&>(*this) = here;
                continue;
            }
            basic_xstring name, value;
            if (definitions && ParseMacroDef(name, value)) {
                Print("define", name + " = " + value);
                continue;
            }
            return;
        }
    }

    static void Print(const char* kind, const std::string& text) {
        std::printf("%-7s %s\n", kind, text.c_str());
    }

    std::string rootDir_;
    std::set<std::string> read_;
    MpfwSourceFile* imported_ = nullptr;
};

}  // namespace

int main(int argc, char** argv) {
    if (argc != 2) {
        std::fprintf(stderr, "Usage: %s PROJECT_FILE\n", argv[0]);
        return 2;
    }
    basic_xstring path = argv[1];
    NormalisePath(path);

    // The list owns the loaded texts and the frame's names are views into them: both outlive the parser.
    MpfwSourceFileList files;
    MpfwFrame frame(files);
    ProjectHost host(frame, DirectoryOf(path));
    try {
        MpfwSourceFile* root = host.AddFile(path, BasicSubString());
        if (!root) return 1;  // the library has reported the expansion error
        return host.Read(root) ? 0 : 1;
    } catch (const IException& e) {  // the root file itself cannot be read
        e.Write(xcerr());
        xcerr() << "\n";
        xcerr().flush();
        return 1;
    }
}

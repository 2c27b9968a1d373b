// Imports for a host that keeps one file-scope frame per file and imports each into its importer's frame:
// the name rules between imported files and dollar macros across files.
#include <gtest/gtest.h>

#include <algorithm>
#include <map>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "ovmacro/expander/macro_expander.h"
#include "support/test_support.h"

namespace orvan {
namespace {

using testing::MessageOf;

// Files held in memory; each import expands the file once in a frame of its own and imports that frame.
class PerFileHost : public ImportHandler {
public:
    explicit PerFileHost(std::map<std::string, std::string> files) : files_(std::move(files)) {}

    bool HandleImport(VarFrame* frame, const basic_xstring& fileName, const char* position) override {
        auto it = files_.find(fileName);
        if (it == files_.end()) return false;
        FileScopeVarFrame* imported = Load(fileName, position);
        frame->GetFileScopeVarFrame()->AddImport(imported);
        return true;
    }

    // The frame of a file, expanded on first use.
    FileScopeVarFrame* Load(const std::string& name, const char* position = nullptr) {
        if (auto done = frames_.find(name); done != frames_.end()) return done->second.get();
        if (std::find(loading_.begin(), loading_.end(), name) != loading_.end())
            throw LexScannerException("Recursive import of file " + name, position);
        loading_.push_back(name);
        auto frame = std::make_unique<FileScopeVarFrame>();
        basic_xstring& out = outputs_[name];
        MacroExpand(this, frame.get(), BasicSubString(files_.at(name)), 0, 0, out);
        loading_.pop_back();
        return (frames_[name] = std::move(frame)).get();
    }
    const std::string& Output(const std::string& name) { return outputs_[name]; }

private:
    std::map<std::string, std::string> files_;  // the texts stay put: names are views into them
    std::map<std::string, std::unique_ptr<FileScopeVarFrame>> frames_;
    std::map<std::string, basic_xstring> outputs_;
    std::vector<std::string> loading_;
};

TEST(FileFrames, NamesFromImportedFiles) {
    struct Case {
        std::map<std::string, std::string> files;  // "P" is expanded
        const char* output;                        // null: the lookup fails with `message`
        const char* message;
    } cases[] = {
        // Only Q defines x; R had imported Q before: the same variable through two frames is no conflict.
        {{{"P", "@import \"Q\"\n@import \"R\"\nx"}, {"Q", "@def x = fromQ\n"}, {"R", "@import \"Q\"\n"}},
         "@import \"Q\"\n@import \"R\"\nfromQ",
         nullptr},
        // Q and R each define their own x.
        {{{"P", "@import \"Q\"\n@import \"R\"\nx"}, {"Q", "@def x = fromQ\n"}, {"R", "@def x = fromR\n"}},
         nullptr,
         "Ambiguous macro name : x"},
        // Q had imported R; both define x: Q answers with its own.
        {{{"P", "@import \"Q\"\nx"}, {"Q", "@import \"R\"\n@def x = fromQ\n"}, {"R", "@def x = fromR\n"}},
         "@import \"Q\"\nfromQ",
         nullptr},
        // The file's own definition hides every imported one.
        {{{"P", "@import \"Q\"\n@import \"R\"\n@def x = own\nx"},
          {"Q", "@def x = fromQ\n"},
          {"R", "@def x = fromR\n"}},
         "@import \"Q\"\n@import \"R\"\nown",
         nullptr},
    };
    for (const Case& c : cases) {
        PerFileHost host(c.files);
        if (c.output) {
            host.Load("P");
            EXPECT_EQ(host.Output("P"), c.output);
        } else {
            EXPECT_EQ(MessageOf([&] { host.Load("P"); }), c.message);
        }
    }
}

TEST(FileFrames, DollarMacrosComeFromImportedFilesDepthFirst) {
    PerFileHost host({
        {"P", "@import \"Q\"\n@import \"R\"\nhome = \"$(HOME)/x\" tool = \"$(TOOL)\" none = \"$(NONE)\""},
        {"Q", "@import \"S\"\n"},
        {"S", "@$HOME = \"/fromS\"\n"},
        {"R", "@$HOME = \"/fromR\"\n@$TOOL = \"$(HOME)/cc\"\n"},
    });
    host.Load("P");
    // HOME: Q comes before R, and Q has it from S. TOOL's value is replaced again where it is used.
    EXPECT_EQ(host.Output("P"),
              "@import \"Q\"\n@import \"R\"\nhome = \"/fromS/x\" tool = \"/fromS/cc\" none = \"$(NONE)\"");
}

TEST(FileFrames, AnImportCycleIsRefusedByTheHost) {
    PerFileHost host({{"P", "@import \"Q\"\n"}, {"Q", "\n@import \"P\"\n"}});
    EXPECT_EQ(MessageOf([&] { host.Load("P"); }), "Recursive import of file P");
}

}  // namespace
}  // namespace orvan

// Loading project description files: expansion in the shared frame, imports, reports and cycles.
#include <gtest/gtest.h>

#include <string>

#include "mpfw_test_host.h"
#include "ovmacro/foundations/text_format.h"

namespace orvan {
namespace {

using testing::DirHost;
using testing::MessageOf;
using testing::TempDir;

struct Loader {
    explicit Loader(const TempDir& dir) : frame(files), host(frame, dir) {}
    MpfwSourceFileList files;
    MpfwFrame frame;
    DirHost host;
};

// AddFile with what it reports on standard error.
MpfwSourceFile* AddFileCapturing(DirHost& host, const std::string& name, std::string& report) {
    ::testing::internal::CaptureStderr();
    MpfwSourceFile* f = host.AddFile(host.Path(name), BasicSubString());
    report = ::testing::internal::GetCapturedStderr();
    return f;
}

TEST(MpfwLoading, ThreeFileImportChainSharesOneFrame) {
    TempDir dir;
    dir.Write("root.ovp", "@def v = 1\n@import \"a.ovp\"\nuse(x)\n");
    dir.Write("a.ovp", "@import \"b.ovp\"\n@def use(p) = {[p] from_b}\n");
    dir.Write("b.ovp", "@def from_b = B v\n");  // v: defined by the root before its import
    Loader l(dir);
    std::string report;
    MpfwSourceFile* root = AddFileCapturing(l.host, "root.ovp", report);
    ASSERT_NE(root, nullptr) << report;
    EXPECT_EQ(report, "");
    EXPECT_EQ(root->expandedText, "@import \"a.ovp\"\n[x] B 1\n");
    ASSERT_EQ(l.files.size(), 3);  // load order: each file before the files it imports
    EXPECT_EQ(l.files[0], root);
    EXPECT_EQ(l.files[1]->fileName, l.host.Path("a.ovp"));
    EXPECT_EQ(l.files[1]->expandedText, "@import \"b.ovp\"\n");
    EXPECT_EQ(l.files[2]->fileName, l.host.Path("b.ovp"));
    EXPECT_TRUE(l.host.GetFilesBeingExpanded().empty());
    // The pieces of each file map its expansion back into the loaded texts.
    LexScannerException e("m", root->expandedText.data() + root->expandedText.find("B"));
    root->AdjustErrorPosition(e);
    basic_xstring name;
    int64 line = 0;
    ASSERT_TRUE(l.files.GetFilenameAndLineNumber(e.GetPosition(), name, line));
    EXPECT_EQ(name, l.host.Path("b.ovp"));
    EXPECT_EQ(line, 1);
}

TEST(MpfwLoading, ReportsNameTheFileAndLineOfEachError) {
    struct Case {
        const char* root;
        const char* other;   // the text of a.ovp, if any
        const char* report;  // with R for the root's path and A for a.ovp's
    } cases[] = {
        // An error in an imported file, then the importer's.
        {"line\n@import \"a.ovp\"\n", "ok\n@fail(\"bad\")\n",
         "\nA(2) : bad\n\nR(2) : Can't import file: a.ovp\n"},
        // A name that resolves to nothing, shown after dollar macro replacement.
        {"@$DIR = \"sub\"\n@import \"$(DIR)/x.ovp\"\n", nullptr, "\nR(2) : Couldn't open file sub/x.ovp\n"},
        // A name that resolves to something that cannot be read: reported at the import.
        {"x\n@import \"dir\"\n", nullptr, "\nR(2) : Couldn't open file D\n"},
        // A dollar macro that leads back to itself, in an import name.
        {"@$A = \"$(A)x\"\n\n@import \"$(A)\"\n", nullptr, "\nR(3) : Recursive dollar macro A\n"},
        // An error at the end of the text still gets a line.
        {"a\n@def m(x) = {x}\nm(", nullptr, "\nR(3) : Met EOS while reading argument \n"},
    };
    for (const Case& c : cases) {
        TempDir dir;
        dir.Write("root.ovp", c.root);
        if (c.other) dir.Write("a.ovp", c.other);
        dir.Write("dir/inside", "");
        Loader l(dir);
        std::string report;
        EXPECT_EQ(AddFileCapturing(l.host, "root.ovp", report), nullptr) << c.root;
        std::string expected = c.report;
        StringFindAndReplace(expected, "R(", l.host.Path("root.ovp") + "(");
        StringFindAndReplace(expected, "A(", l.host.Path("a.ovp") + "(");
        StringFindAndReplace(expected, "file D", "file " + l.host.Path("dir"));
        EXPECT_EQ(report, expected) << c.root;
        EXPECT_EQ(l.files[0]->fileName, l.host.Path("root.ovp"));  // a failed file stays recorded
        EXPECT_TRUE(l.host.GetFilesBeingExpanded().empty());
    }
}

TEST(MpfwLoading, ImportCyclesAreRefused) {
    struct Case {
        const char* a;
        const char* b;
        const char* report;
    } cases[] = {
        {"@import \"a.ovp\"\n", "", "\nA(1) : Recursive import of file A\n"},
        {"x\n@import \"b.ovp\"\n", "@import \"a.ovp\"\n",
         "\nB(1) : Recursive import of file A\n\nA(2) : Can't import file: b.ovp\n"},
    };
    for (const Case& c : cases) {
        TempDir dir;
        dir.Write("a.ovp", c.a);
        dir.Write("b.ovp", c.b);
        Loader l(dir);
        std::string report;
        EXPECT_EQ(AddFileCapturing(l.host, "a.ovp", report), nullptr);
        std::string expected = c.report;
        StringFindAndReplace(expected, "A(", l.host.Path("a.ovp") + "(");
        StringFindAndReplace(expected, "B(", l.host.Path("b.ovp") + "(");
        StringFindAndReplace(expected, "file A", "file " + l.host.Path("a.ovp"));
        EXPECT_EQ(report, expected);
    }
}

TEST(MpfwLoading, AFileImportedTwiceInARowIsNoCycle) {
    TempDir dir;
    dir.Write("root.ovp", "@import \"a.ovp\"\n@import \"a.ovp\"\nm\n");
    dir.Write("a.ovp", "@def m = M\n");
    Loader l(dir);
    std::string report;
    MpfwSourceFile* root = AddFileCapturing(l.host, "root.ovp", report);
    ASSERT_NE(root, nullptr) << report;
    EXPECT_EQ(root->expandedText, "@import \"a.ovp\"\n@import \"a.ovp\"\nM\n");
    EXPECT_EQ(l.files.size(), 3);
}

TEST(MpfwLoading, AddFileReadsTextModeAndAppendsExtra) {
    TempDir dir;
    dir.Write("crlf.ovp", "a\r\nb\rc");
    Loader l(dir);
    MpfwSourceFile* f = l.host.AddFile(l.host.Path("crlf.ovp"), BasicSubString("\n@def e = E\ne"));
    ASSERT_NE(f, nullptr);
    EXPECT_EQ(f->text, "a\nb\rc\n@def e = E\ne");
    EXPECT_EQ(f->expandedText, "a\nb\rc\nE");

    const std::string missing = l.host.Path("missing.ovp");
    EXPECT_EQ(MessageOf([&] { l.host.AddFile(missing, BasicSubString()); }), "Couldn't open file " + missing);
    EXPECT_EQ(MessageOf([&] { l.host.AddFile(dir.path().string(), BasicSubString()); }),
              "Couldn't open file " + dir.path().string());
}

TEST(MpfwLoading, AddFileWithTextRecordsTheTextUnderTheName) {
    TempDir dir;
    dir.Write("a.ovp", "@def m = from a\n");
    Loader l(dir);
    MpfwSourceFile* f = l.host.AddFileWithText("<memory>", "@import \"a.ovp\"\nm\n");
    ASSERT_NE(f, nullptr);
    EXPECT_EQ(f->fileName, "<memory>");
    EXPECT_EQ(f->expandedText, "@import \"a.ovp\"\nfrom a\n");
}

// Without pieces the texts are the same, imports included, and no file keeps a map.
TEST(MpfwLoading, FilesLoadedWithoutPiecesKeepTheSameTexts) {
    TempDir dir;
    dir.Write("a.ovp", "@def m(x) = {from x}\nm(a)\n");
    const std::string text = "@import \"a.ovp\"\n  m(b) m(`c, d`)\n";
    Loader with(dir), without(dir);
    without.host.SetKeepOutputPieces(false);
    MpfwSourceFile* kept = with.host.AddFileWithText("<memory>", text);
    MpfwSourceFile* bare = without.host.AddFileWithText("<memory>", text);
    ASSERT_NE(kept, nullptr);
    ASSERT_NE(bare, nullptr);
    EXPECT_EQ(bare->expandedText, kept->expandedText);
    EXPECT_EQ(kept->pieces.size(), static_cast<int64>(kept->expandedText.size()));
    for (int64 i = 0; i < without.files.size(); ++i) {
        EXPECT_EQ(without.files[i]->expandedText, with.files[i]->expandedText);
        EXPECT_TRUE(without.files[i]->pieces.GetPieces().empty());
    }
}

TEST(MpfwLoading, ImportPathsAreReplacedNormalisedAndKeptInOrder) {
    TempDir dir;
    dir.Write("root.ovp", "@$D = \"inc\"\n@importpath \"$(D)/x/../y/\"\n@importpath(\"other\")\n");
    Loader l(dir);
    ASSERT_NE(l.host.AddFile(l.host.Path("root.ovp"), BasicSubString()), nullptr);
    EXPECT_EQ(l.frame.importPaths, (xvector<basic_xstring>{"inc/y", "other"}));
}

TEST(MpfwLoading, DollarMacrosOfAnImportedFileApplyAfterItsImport) {
    TempDir dir;
    dir.Write("a.ovp", "@$HOME = \"/h\"\n@$SUB = \"$(HOME)/sub\"\n");
    dir.Write("root.ovp", "before = \"$(HOME)\"\n@import \"a.ovp\"\nx = \"$(SUB)/x\"\n");
    Loader l(dir);
    MpfwSourceFile* root = l.host.AddFile(l.host.Path("root.ovp"), BasicSubString());
    ASSERT_NE(root, nullptr);
    EXPECT_EQ(root->expandedText, "before = \"$(HOME)\"\n@import \"a.ovp\"\nx = \"/h/sub/x\"\n");

    basic_xstring text = "$(SUB)|$(NONE)";
    EXPECT_TRUE(l.host.ApplyMacros(text));
    EXPECT_EQ(text, "/h/sub|$(NONE)");
    text = "plain";
    EXPECT_FALSE(l.host.ApplyMacros(text));
}

}  // namespace
}  // namespace orvan

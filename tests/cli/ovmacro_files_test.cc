// ovmacro end to end with files: imports and their search order, error reports, -D, -I, --settings,
// --no-python, --deps, and bad input.
#include <gtest/gtest.h>

#include <string>
#include <utility>
#include <vector>

#include "support/test_support.h"

namespace orvan {
namespace {

using testing::ReadFile;
using testing::RunTool;
using testing::TempDir;
using testing::ToolResult;

// Runs the tool in dir, so that file names in reports are the relative names given.
ToolResult RunIn(const TempDir& dir, const std::vector<std::string>& args, const std::string& input = "") {
    return RunTool(args, input, dir.path().string());
}

TEST(OvmacroFiles, ImportChainDefinitionsAreVisibleAfterEachImport) {
    TempDir dir;
    dir.Write("root.ovm", "@import \"lib.ovm\"\ngreet(World)\n@import \"sub/deep.ovm\"\ndeeper\n");
    dir.Write("lib.ovm", "@def greet(who) = {Hello who!}\nignored output\n");
    dir.Write("sub/deep.ovm", "@import \"other.ovm\"\n@def deeper = {deep other}\n");
    dir.Write("sub/other.ovm", "@def other = beside\n");
    const ToolResult r = RunIn(dir, {"root.ovm"});
    EXPECT_EQ(r.exitCode, 0) << r.err;
    EXPECT_EQ(r.out, "@import \"lib.ovm\"\nHello World!\n@import \"sub/deep.ovm\"\ndeep beside\n");
    EXPECT_EQ(r.err, "");
}

TEST(OvmacroFiles, ImportSearchOrder) {
    // name is looked for beside the importing file, then in each -I DIR, then in each @importpath directory.
    struct Case {
        std::vector<std::string> files;  // files that define `where` as their own directory name
        std::vector<std::string> args;
        const char* where;
    } cases[] = {
        {{"sub/x.ovm", "inc1/x.ovm", "inc2/x.ovm", "paths/x.ovm"}, {"-I", "inc1", "-Iinc2"}, "sub"},
        {{"inc1/x.ovm", "inc2/x.ovm", "paths/x.ovm"}, {"-I", "inc1", "-I", "inc2"}, "inc1"},
        {{"inc2/x.ovm", "paths/x.ovm"}, {"-I", "inc1", "-I", "inc2"}, "inc2"},
        {{"paths/x.ovm"}, {"-I", "inc1"}, "paths"},
    };
    for (const Case& c : cases) {
        TempDir dir;
        dir.Write("root.ovm", "@import \"sub/main.ovm\"\nwhere\n");
        // A relative @importpath directory is taken from the file that gives it.
        dir.Write("sub/main.ovm", "@importpath \"../paths\"\n@import \"x.ovm\"\n");
        dir.Write("inc1/unrelated", "");
        for (const std::string& f : c.files) dir.Write(f, "@def where = " + f.substr(0, f.find('/')) + "\n");
        std::vector<std::string> args = c.args;
        args.push_back("root.ovm");
        const ToolResult r = RunIn(dir, args);
        EXPECT_EQ(r.exitCode, 0) << r.err;
        EXPECT_EQ(r.out, std::string("@import \"sub/main.ovm\"\n") + c.where + "\n");
    }
}

TEST(OvmacroFiles, ErrorsAreReportedWithTheirFileAndLine) {
    struct Case {
        std::vector<std::pair<std::string, std::string>> files;
        std::vector<std::string> args;
        int exitCode;
        const char* err;
    } cases[] = {
        // An error in an imported file, then the importer's report.
        {{{"root.ovm", "a\n@import \"lib.ovm\"\n"}, {"lib.ovm", "ok\n\n@fail(\"broken\")\n"}},
         {"root.ovm"},
         1,
         "\nlib.ovm(3) : broken\n\nroot.ovm(2) : Can't import file: lib.ovm\n"},
        // An error in a macro body defined in another file is reported where the body is written.
        {{{"root.ovm", "@import \"lib.ovm\"\nbad(1)\n"}, {"lib.ovm", "\n@def bad(x) = {@fail(\"no\")}\n"}},
         {"root.ovm"},
         1,
         "\nlib.ovm(2) : no\n    invoking macro bad(x) with x=1\n"},
        {{{"root.ovm", "\n@import \"nowhere.ovm\"\n"}},
         {"root.ovm"},
         1,
         "\nroot.ovm(2) : Couldn't open file nowhere.ovm\n"},
        // An import of a directory is no import of a file.
        {{{"root.ovm", "@import \"dir\"\n"}, {"dir/f", ""}},
         {"root.ovm"},
         1,
         "\nroot.ovm(1) : Couldn't open file dir\n"},
        // Cycles, also through another spelling of the same path.
        {{{"a.ovm", "@import \"a.ovm\"\n"}}, {"a.ovm"}, 1, "\na.ovm(1) : Recursive import of file a.ovm\n"},
        {{{"a.ovm", "x\n@import \"sub/b.ovm\"\n"}, {"sub/b.ovm", "@import \"../a.ovm\"\n"}},
         {"./a.ovm"},
         1,
         "\nsub/b.ovm(1) : Recursive import of file ./a.ovm\n\n./a.ovm(2) : Can't import file: sub/b.ovm\n"},
        // An error at the end of a file without a final line feed.
        {{{"end.ovm", "a\n@def m(x) = x\nm(1"}},
         {"end.ovm"},
         1,
         "\nend.ovm(3) : Met EOS while reading argument 1\n"},
    };
    for (const Case& c : cases) {
        TempDir dir;
        for (const auto& [name, text] : c.files) dir.Write(name, text);
        const ToolResult r = RunIn(dir, c.args);
        EXPECT_EQ(r.exitCode, c.exitCode) << c.files[0].second;
        EXPECT_EQ(r.err, c.err) << c.files[0].second;
        EXPECT_EQ(r.out, "");
    }
}

TEST(OvmacroFiles, DefinesFromTheCommandLine) {
    struct Case {
        std::vector<std::string> args;
        std::string input;
        int exitCode;
        const char* out;
        const char* err;
    } cases[] = {
        {{"-D", "X=a b", "-DY", "-D", "Z=", "-"}, "X Y [Z]\n", 0, "a b true []\n", ""},
        {{"-D", "f=(1 + 2)", "-D", "g=f f"}, "g\n", 0, "(1 + 2) (1 + 2)\n", ""},
        // The file's own definition comes later and hides the one from the command line.
        {{"-D", "X=cmd"}, "X\n@def X = file\nX\n", 0, "cmd\nfile\n", ""},
        {{"-D", "X=@fail(\"bad\")"}, "\nX", 1, nullptr, "\n<command line>(1) : bad\n    invoking macro X\n"},
        {{"-D", "1X=a"}, "", 2, nullptr, nullptr},
        {{"-D", "=a"}, "", 2, nullptr, nullptr},
        {{"-D", "X=a\nb"}, "", 2, nullptr, nullptr},
        {{"-D"}, "", 2, nullptr, nullptr},
    };
    for (const Case& c : cases) {
        TempDir dir;
        const ToolResult r = RunIn(dir, c.args, c.input);
        EXPECT_EQ(r.exitCode, c.exitCode) << c.args[0] << " " << c.args.back() << "\n" << r.err;
        if (c.out) {
            EXPECT_EQ(r.out, c.out);
        }
        if (c.err) {
            EXPECT_EQ(r.err, c.err);
        }
        if (c.exitCode == 2) {
            EXPECT_NE(r.err.find("-D"), std::string::npos) << r.err;
        }
    }
}

TEST(OvmacroFiles, StandardInputIsNamedAndImportsFromTheWorkingDirectory) {
    TempDir dir;
    dir.Write("lib.ovm", "@def m = from lib\n");
    ToolResult r = RunIn(dir, {}, "@import \"lib.ovm\"\nm\n");
    EXPECT_EQ(r.exitCode, 0) << r.err;
    EXPECT_EQ(r.out, "@import \"lib.ovm\"\nfrom lib\n");
    r = RunIn(dir, {"-"}, "ok\n@fail(\"bad\")\n");
    EXPECT_EQ(r.exitCode, 1);
    EXPECT_EQ(r.err, "\n<stdin>(2) : bad\n");
}

TEST(OvmacroFiles, Settings) {
    TempDir dir;
    dir.Write("common/shared.ovp", "$ROOT = path \"/opt/x/\"\n$BUILD = path \"$(ROOT)/build/./debug/..\"\n");
    dir.Write("root.ovp",
              "@def version = 1.4\n$FIRST = \"$(ROOT)\"\n@import \"common/shared.ovp\"\n"
              "$VERSION = @str(version)\n$OUT = (\"$(BUILD)\" + \"/demo\")\n@println(printed)\n");
    ToolResult r = RunIn(dir, {"--settings", "root.ovp"});
    EXPECT_EQ(r.exitCode, 0) << r.err;
    // An imported file's settings are read where its import stands; stdout has no expansion.
    EXPECT_EQ(
        r.out,
        "printed\nFIRST=$(ROOT)\nROOT=/opt/x\nBUILD=/opt/x/build\nVERSION=1.4\nOUT=/opt/x/build/demo\n");
    EXPECT_EQ(r.err, "");

    r = RunIn(dir, {"--settings", "-o", "out.txt", "root.ovp"});
    EXPECT_EQ(r.exitCode, 0) << r.err;
    EXPECT_EQ(ReadFile((dir.path() / "out.txt").string()),
              "$FIRST = \"$(ROOT)\"\n@import \"common/shared.ovp\"\n$VERSION = \"1.4\"\n"
              "$OUT = (\"$(BUILD)\" + \"/demo\")\n");
}

TEST(OvmacroFiles, SettingsErrorsAreReportedAtTheirFileAndLine) {
    struct Case {
        const char* root;
        const char* err;
    } cases[] = {
        {"$A = \"x\"\nplain text\n", "\nroot.ovp(2) : Expected $NAME = value or @import when read plain\n"},
        {"$A = \"x\"\n@def m = {oops}\n$B = \"y\"\nm\n",
         "\nroot.ovp(2) : Expected $NAME = value or @import when read oops\n"},
        {"$A = \"x\"\n$B =", "\nroot.ovp(2) : Expected quoted string when read EOS\n"},
        {"$A = 12\n", "\nroot.ovp(1) : Expected quoted string when read 12\n"},
        {"@import \"bad.ovp\"\n", "\nbad.ovp(2) : Expected = after X when read \"v\"\n"},
        {"$A = \"$(B)\"\n$B = \"$(A)\"\n$C = \"$(B)\"\n", "\nroot.ovp(3) : Recursive dollar macro B\n"},
    };
    for (const Case& c : cases) {
        TempDir dir;
        dir.Write("root.ovp", c.root);
        dir.Write("bad.ovp", "$W = \"w\"\n$X \"v\"\n");
        const ToolResult r = RunIn(dir, {"--settings", "root.ovp"});
        EXPECT_EQ(r.exitCode, 1) << c.root;
        EXPECT_EQ(r.err, c.err) << c.root;
    }
}

TEST(OvmacroFiles, NoPythonRefusesEmbeddedCode) {
    TempDir dir;
    const ToolResult r = RunIn(dir, {"--no-python"}, "a\n@runpython{x = 1}\n");
    EXPECT_EQ(r.exitCode, 1);
    EXPECT_EQ(r.err.rfind("\n<stdin>(2) : Python initialisation error", 0), 0u) << r.err;
}

TEST(OvmacroFiles, DependencyFile) {
    TempDir dir;
    dir.Write("my root.ovm", "@import \"lib one.ovm\"\n@import \"b.ovm\"\n@import \"b.ovm\"\n");
    dir.Write("lib one.ovm", "");
    dir.Write("b.ovm", "@import \"sub/c.ovm\"\n");
    dir.Write("sub/c.ovm", "");
    ToolResult r = RunIn(dir, {"--deps", "out.d", "-o", "out.txt", "my root.ovm"});
    EXPECT_EQ(r.exitCode, 0) << r.err;
    EXPECT_EQ(
        ReadFile((dir.path() / "out.d").string()),
        "out.txt: my\\ root.ovm lib\\ one.ovm b.ovm sub/c.ovm\n\nlib\\ one.ovm:\n\nb.ovm:\n\nsub/c.ovm:\n");

    r = RunIn(dir, {"--deps=file.d", "b.ovm"});
    EXPECT_EQ(r.exitCode, 0) << r.err;
    EXPECT_EQ(ReadFile((dir.path() / "file.d").string()), "b.ovm: b.ovm sub/c.ovm\n\nsub/c.ovm:\n");

    r = RunIn(dir, {"--deps", "stdin.d", "-o", "o.txt", "-"}, "@import \"b.ovm\"\n");
    EXPECT_EQ(r.exitCode, 0) << r.err;
    EXPECT_EQ(ReadFile((dir.path() / "stdin.d").string()),
              "o.txt: b.ovm sub/c.ovm\n\nb.ovm:\n\nsub/c.ovm:\n");

    r = RunIn(dir, {"--deps", "x.d"}, "text\n");  // standard input and no OUT: nothing to name the target
    EXPECT_EQ(r.exitCode, 2);
}

TEST(OvmacroFiles, BadInputLoadsOrFailsWithItsName) {
    TempDir dir;
    dir.Write("empty.ovm", "");
    dir.Write("nolf.ovm", "@def m = M\nm");
    dir.Write("crlf.ovm", "@def m = M\r\nm\r\nlone\rcr\r\n");
    dir.Write("dir/f", "");
    struct Case {
        std::vector<std::string> args;
        int exitCode;
        const char* out;
        const char* errStart;
    } cases[] = {
        {{"empty.ovm"}, 0, "", ""},
        {{"nolf.ovm"}, 0, "M", ""},
        {{"crlf.ovm"}, 0, "M\nlone\rcr\n", ""},
        {{"missing.ovm"}, 2, "", "ovmacro: cannot read missing.ovm: No such file or directory"},
        {{"dir"}, 2, "", "ovmacro: cannot read dir: Is a directory"},
        {{"--bogus"}, 2, "", "ovmacro: unknown option --bogus"},
        {{"-I"}, 2, "", "ovmacro: option -I needs a value"},
    };
    for (const Case& c : cases) {
        const ToolResult r = RunIn(dir, c.args);
        EXPECT_EQ(r.exitCode, c.exitCode) << c.args[0];
        EXPECT_EQ(r.out, c.out) << c.args[0];
        EXPECT_EQ(r.err.substr(0, std::string(c.errStart).size()), c.errStart) << c.args[0];
    }
}

}  // namespace
}  // namespace orvan

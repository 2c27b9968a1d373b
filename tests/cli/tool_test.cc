// The ovmacro runs that the case files cannot state: arguments with blanks or line feeds, outputs known only
// by their form, a tool without its Python module, and the shipped example.
#include <gtest/gtest.h>

#include <regex>
#include <string>
#include <vector>

#include "support/test_support.h"

namespace orvan {
namespace {

using testing::RunTool;
using testing::ToolResult;

TEST(OvmacroTool, ArgumentsThatCaseFilesCannotSpell) {
    const struct {
        std::vector<std::string> args;
        int exitCode;
        std::string out;  // a pattern, or the beginning of the output followed by "..."
        std::string err;
    } cases[] = {
        // --help and --version read no file, whatever follows them.
        {{"--help", "missing.txt"}, 0, "Usage: ovmacro [OPTIONS] [FILE]\n...", ""},
        {{"-h"}, 0, "Usage: ovmacro ...", ""},
        {{"--version", "missing.txt"}, 0, R"(ovmacro \d+\.\d+\.\d+\n)", ""},
        {{"-D", "X=a  b", "-D", "Y=(X, X)"}, 0, R"(a  b \(a  b, a  b\)\n)", ""},
        {{"-D", "X=a\nb"}, 2, "", "ovmacro: -D text must be a single line: X\nTry 'ovmacro --help'.\n"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.args[0] + " " + c.args.back());
        const ToolResult r = RunTool(c.args, "X Y\n");
        EXPECT_EQ(r.exitCode, c.exitCode);
        // (A pattern over the whole help would recurse deep enough to overflow a sanitizer's stack.)
        const bool begins = c.out.ends_with("...");
        EXPECT_TRUE(begins ? r.out.starts_with(c.out.substr(0, c.out.size() - 3))
                           : std::regex_match(r.out, std::regex(c.out)))
            << r.out;
        EXPECT_EQ(r.err, c.err);
    }
}

// Python is loaded with the first text that uses it: without its module, only that text fails, at its line.
TEST(OvmacroTool, WithoutItsPythonModuleOnlyTextsUsingPythonFail) {
    const std::vector<std::string> noModule = {"env", "OVMACRO_PYTHON_MODULE=/none/x.so"};
    ToolResult r = RunTool({"-"}, "a\n@def X = {1}\nX\n", "", noModule, nullptr);
    EXPECT_EQ(r.exitCode, 0) << r.err;
    EXPECT_EQ(r.out, "a\n1\n");
    r = RunTool({"-"}, "a\n@runpython{x = 1}\n", "", noModule, nullptr);
    EXPECT_EQ(r.exitCode, 1);
    EXPECT_EQ(r.err.rfind("\n<stdin>(2) : Python initialisation error: cannot load /none/x.so: /none/x.so: ", 0), 0u)
        << r.err;
}

TEST(OvmacroTool, CppTableExampleGivesItsExpectedHeader) {
    const std::string dir = std::string(OVMACRO_SOURCE_DIR) + "/examples/";
    const ToolResult r = RunTool({dir + "cpp_table.ovm"});
    EXPECT_EQ(r.exitCode, 0) << r.err;
    EXPECT_EQ(r.out, testing::ReadFile(dir + "cpp_table.expected.h"));
}

}  // namespace
}  // namespace orvan

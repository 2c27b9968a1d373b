// Every error case of tests/golden/errors run through ovmacro: the report must name the file and line of the
// source character that produced the fault, and read exactly as its reviewed expectation.
//
// A case is NAME.ovm (helpers that a case imports end in .inc). Its first line is "// expect: FILE(LINE)",
// the reviewed location; an optional "// args: ARG..." line gives options (split at blanks), and an optional
// "// stdin" line feeds the file on standard input instead of naming it. NAME.expected holds the whole
// standard error that ovmacro writes; tests/golden/refresh.sh rewrites those files after a reviewed change.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdlib>
#include <filesystem>
#include <regex>
#include <sstream>
#include <string>
#include <vector>

#include "support/test_support.h"

namespace orvan {
namespace {

namespace fs = std::filesystem;
using orvan::testing::ReadFile;
using orvan::testing::RunTool;
using orvan::testing::ToolResult;

const fs::path& CasesDir() {
    static const fs::path dir = fs::path(OVMACRO_SOURCE_DIR) / "tests" / "golden" / "errors";
    return dir;
}

std::vector<std::string> CaseNames() {
    std::vector<std::string> names;
    std::error_code ec;
    for (const fs::directory_entry& entry : fs::directory_iterator(CasesDir(), ec))
        if (entry.path().extension() == ".ovm") names.push_back(entry.path().stem().string());
    std::sort(names.begin(), names.end());
    return names;
}

struct GoldenCase {
    std::string text;
    std::string location;  // "FILE(LINE)"
    std::vector<std::string> args;
    bool fromStdin = false;
};

GoldenCase ReadCase(const std::string& name) {
    GoldenCase c;
    c.text = ReadFile((CasesDir() / (name + ".ovm")).string());
    std::istringstream lines(c.text);
    std::string line;
    for (int i = 0; i < 3 && std::getline(lines, line); ++i) {
        if (i == 0 && line.rfind("// expect: ", 0) == 0) c.location = line.substr(11);
        if (line.rfind("// args: ", 0) == 0) {
            std::istringstream words(line.substr(9));
            for (std::string w; words >> w;) c.args.push_back(w);
        }
        if (line == "// stdin") c.fromStdin = true;
    }
    return c;
}

// The nesting guard names the depth at which it stopped, which depends on the stack of the build (sanitizer
// builds stop earlier), and with it the number of context lines left out: both are read as one placeholder.
std::string Normalised(const std::string& report) {
    static const std::regex depth(R"(\((more than \d+ levels|\d+ levels exhaust the stack)\))");
    static const std::regex omitted(R"(\.\.\. \d+ more context lines left out)");
    static const std::regex chain(R"((\n    invoking macro [^\n]*)+)");
    std::string s = std::regex_replace(report, depth, "(N levels)");
    if (s != report)
        s = std::regex_replace(std::regex_replace(s, omitted, "... N more"), chain, "\n    CALLS");
    return s;
}

ToolResult RunCase(const std::string& name, const GoldenCase& c) {
    // An AddressSanitizer build of the tool would report the blocks that Python's own allocator keeps (it is
    // never shut down before exit) as leaks on standard error; with plain malloc they stay reachable.
    ::setenv("PYTHONMALLOC", "malloc", 1);
    std::vector<std::string> args = c.args;
    args.push_back(c.fromStdin ? "-" : name + ".ovm");
    return RunTool(args, c.fromStdin ? c.text : "", CasesDir().string());
}

class ErrorLocationTest : public ::testing::TestWithParam<std::string> {};

TEST_P(ErrorLocationTest, ReportNamesTheFileAndLineAndReadsAsExpected) {
    const std::string& name = GetParam();
    const GoldenCase c = ReadCase(name);
    ASSERT_FALSE(c.location.empty()) << name << ".ovm must begin with \"// expect: FILE(LINE)\"";
    const fs::path expectedPath = CasesDir() / (name + ".expected");
    ASSERT_TRUE(fs::exists(expectedPath))
        << "no " << expectedPath << ": run tests/golden/refresh.sh " << name;

    const ToolResult r = RunCase(name, c);
    EXPECT_EQ(r.exitCode, 1) << r.err;
    const std::string prefix = "\n" + c.location + " : ";
    EXPECT_EQ(r.err.substr(0, prefix.size()), prefix) << "the report must name the reviewed file and line";
    EXPECT_EQ(Normalised(r.err), Normalised(ReadFile(expectedPath.string())));
}

INSTANTIATE_TEST_SUITE_P(Golden, ErrorLocationTest, ::testing::ValuesIn(CaseNames()),
                         [](const ::testing::TestParamInfo<std::string>& info) { return info.param; });

TEST(ErrorLocationCases, AreFoundAndEachHasItsExpectation) {
    const std::vector<std::string> names = CaseNames();
    EXPECT_GE(names.size(), 100u) << "cases looked for in " << CasesDir();
    for (const fs::directory_entry& entry : fs::directory_iterator(CasesDir())) {
        if (entry.path().extension() != ".expected") continue;
        EXPECT_TRUE(fs::exists(fs::path(entry.path()).replace_extension(".ovm")))
            << entry.path() << " belongs to no case";
    }
}

TEST(ErrorLocationCases, NormalisingKeepsEverythingButTheNestingDepth) {
    EXPECT_EQ(Normalised("\na(3) : Read 2 in middle of expression\n    invoking macro m\n"),
              "\na(3) : Read 2 in middle of expression\n    invoking macro m\n");
    EXPECT_EQ(
        Normalised("\na(3) : Macro expansion nested too deeply (more than 2000 levels): x\n"
                   "    invoking macro f\n    invoking macro f\n    ... 1976 more context lines left out\n"),
        Normalised("\na(3) : Macro expansion nested too deeply (812 levels exhaust the stack): x\n"
                   "    invoking macro f\n    ... 788 more context lines left out\n"));
}

}  // namespace
}  // namespace orvan

// End-to-end tests of the ovmacro tool: where the expansion goes, standard input, the error report and exit
// status of a failed expansion, usage errors and unreadable files, and line ends.
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <filesystem>
#include <string>
#include <vector>

#include "support/test_support.h"

namespace orvan {
namespace {

using orvan::testing::ReadFile;
using orvan::testing::RunTool;
using orvan::testing::TempDir;
using orvan::testing::ToolResult;

constexpr const char* kInput = "a@@b // kept\n  @// gone\nc\n";
constexpr const char* kExpanded = "ab // kept\nc\n";

TEST(OvmacroToolTest, ExpansionGoesToStandardOutputOrToOut) {
    TempDir dir;
    dir.Write("in.txt", kInput);

    ToolResult r = RunTool({"in.txt"}, "", dir.path().string());
    EXPECT_EQ(r.exitCode, 0);
    EXPECT_EQ(r.out, kExpanded);
    EXPECT_EQ(r.err, "");

    for (const std::vector<std::string>& args : {std::vector<std::string>{"-o", "out.txt", "in.txt"},
                                                 std::vector<std::string>{"in.txt", "-oout.txt"}}) {
        std::filesystem::remove(dir.path() / "out.txt");
        r = RunTool(args, "", dir.path().string());
        EXPECT_EQ(r.exitCode, 0) << r.err;
        EXPECT_EQ(r.out, "") << "nothing on standard output with -o";
        EXPECT_EQ(r.err, "");
        EXPECT_EQ(ReadFile((dir.path() / "out.txt").string()), kExpanded);
    }
}

TEST(OvmacroToolTest, StandardInputWithoutFileOrWithDash) {
    for (const std::vector<std::string>& args : {std::vector<std::string>{}, std::vector<std::string>{"-"}}) {
        const ToolResult r = RunTool(args, kInput);
        EXPECT_EQ(r.exitCode, 0) << r.err;
        EXPECT_EQ(r.out, kExpanded);
    }
    const ToolResult empty = RunTool({}, "");
    EXPECT_EQ(empty.exitCode, 0);
    EXPECT_EQ(empty.out, "");
}

struct ErrorCase {
    const char* name;
    std::string text;
    std::string report;  // after the file name
};

const ErrorCase kErrors[] = {
    {"unclosed literal", "x\ny 'z\n", "(2) : Met line feed within single quoted string after reading 'z"},
    {"stray @else", "one\ntwo\n\n  @else\n", "(4) : @else with no matching @if directive"},
    {"unclosed comment", "/* open\n\n", "(3) : Met EOS in middle of /* ... */ comment"},
    {"error on the first line", "\x01", "(1) : Bad token \\x01"},
};

TEST(OvmacroToolTest, FailedExpansionReportsFileLineAndMessageAndExitsOne) {
    TempDir dir;
    for (const ErrorCase& c : kErrors) {
        SCOPED_TRACE(c.name);
        dir.Write("bad.txt", c.text);
        ToolResult r = RunTool({"bad.txt"}, "", dir.path().string());
        EXPECT_EQ(r.exitCode, 1);
        EXPECT_EQ(r.err, "\nbad.txt" + c.report + "\n");
        EXPECT_EQ(r.out, "") << "no partial output";

        r = RunTool({"-"}, c.text);
        EXPECT_EQ(r.exitCode, 1);
        EXPECT_EQ(r.err, "\n<stdin>" + c.report + "\n");
    }
}

TEST(OvmacroToolTest, OutIsWrittenOnlyWhenTheExpansionSucceeds) {
    TempDir dir;
    dir.Write("bad.txt", "'unclosed\n");
    dir.Write("out.txt", "previous content");
    const ToolResult r = RunTool({"-o", "out.txt", "bad.txt"}, "", dir.path().string());
    EXPECT_EQ(r.exitCode, 1);
    EXPECT_EQ(ReadFile((dir.path() / "out.txt").string()), "previous content");
    std::vector<std::string> names;
    for (const auto& entry : std::filesystem::directory_iterator(dir.path()))
        names.push_back(entry.path().filename().string());
    std::sort(names.begin(), names.end());
    EXPECT_EQ(names, (std::vector<std::string>{"bad.txt", "out.txt"})) << "no temporary file is left behind";

    const ToolResult missingOut = RunTool({"-o", "no/such/dir/out.txt", "bad.txt"}, "", dir.path().string());
    EXPECT_EQ(missingOut.exitCode, 1) << "the expansion error comes first";
    dir.Write("good.txt", "fine\n");
    const ToolResult unwritable = RunTool({"-o", "no/such/dir/out.txt", "good.txt"}, "", dir.path().string());
    EXPECT_EQ(unwritable.exitCode, 2);
    EXPECT_NE(unwritable.err.find("cannot write no/such/dir/out.txt"), std::string::npos) << unwritable.err;
}

TEST(OvmacroToolTest, UsageErrorsAndUnreadableInputExitTwo) {
    TempDir dir;
    dir.Write("in.txt", "x\n");
    std::filesystem::create_directory(dir.path() / "adir");
    const struct {
        const char* name;
        std::vector<std::string> args;
        const char* errContains;
    } cases[] = {
        {"missing file", {"missing.txt"}, "cannot read missing.txt"},
        {"directory", {"adir"}, "cannot read adir"},
        {"unknown option", {"--bogus", "in.txt"}, "unknown option --bogus"},
        {"-o without its value", {"in.txt", "-o"}, "needs a value"},
        {"two input files", {"in.txt", "in.txt"}, "more than one input file"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        const ToolResult r = RunTool(c.args, "", dir.path().string());
        EXPECT_EQ(r.exitCode, 2);
        EXPECT_EQ(r.out, "");
        EXPECT_NE(r.err.find(c.errContains), std::string::npos) << r.err;
    }
}

TEST(OvmacroToolTest, FileWithoutReadPermissionExitsTwo) {
    if (::geteuid() == 0) GTEST_SKIP() << "permissions do not stop root";
    TempDir dir;
    const std::string path = dir.Write("secret.txt", "x\n");
    ASSERT_EQ(::chmod(path.c_str(), 0), 0);
    const ToolResult r = RunTool({"secret.txt"}, "", dir.path().string());
    EXPECT_EQ(r.exitCode, 2);
    EXPECT_NE(r.err.find("cannot read secret.txt"), std::string::npos) << r.err;
}

TEST(OvmacroToolTest, HelpAndVersion) {
    const ToolResult help = RunTool({"--help"});
    EXPECT_EQ(help.exitCode, 0);
    EXPECT_EQ(help.out.rfind("Usage: ovmacro", 0), 0u) << help.out;
    EXPECT_EQ(help.err, "");
    const ToolResult helpFirst = RunTool({"--help", "missing.txt"});
    EXPECT_EQ(helpFirst.exitCode, 0) << "--help reads no file";

    const ToolResult version = RunTool({"--version"});
    EXPECT_EQ(version.exitCode, 0);
    // "ovmacro MAJOR.MINOR.PATCH" and a line end.
    const std::string prefix = "ovmacro ";
    ASSERT_EQ(version.out.rfind(prefix, 0), 0u) << version.out;
    ASSERT_EQ(version.out.back(), '\n');
    const std::string number = version.out.substr(prefix.size(), version.out.size() - prefix.size() - 1);
    EXPECT_EQ(std::count(number.begin(), number.end(), '.'), 2) << number;
    EXPECT_EQ(number.find_first_not_of("0123456789."), std::string::npos) << number;
    EXPECT_TRUE(number.front() != '.' && number.back() != '.' && number.find("..") == std::string::npos)
        << number;
}

TEST(OvmacroToolTest, CarriageReturnLineFeedsBecomeLineFeeds) {
    TempDir dir;
    const std::string text = "a\r\nb\rc\r\n\r\n";
    dir.Write("crlf.txt", text);
    ToolResult r = RunTool({"crlf.txt"}, "", dir.path().string());
    EXPECT_EQ(r.exitCode, 0);
    EXPECT_EQ(r.out, "a\nb\rc\n\n") << "a lone carriage return stays";
    r = RunTool({}, text);
    EXPECT_EQ(r.out, "a\nb\rc\n\n");

    // Line numbers count the converted lines, and the message holds no carriage return.
    dir.Write("bad.txt", "a\r\nb\r\n'x\r\n");
    r = RunTool({"bad.txt"}, "", dir.path().string());
    EXPECT_EQ(r.exitCode, 1);
    EXPECT_EQ(r.err, "\nbad.txt(3) : Met line feed within single quoted string after reading 'x\n");
}

}  // namespace
}  // namespace orvan

// Through the ovmacro tool: @print output, the lines named by reports of assertions and expression errors,
// and the C++ table example.
#include <gtest/gtest.h>

#include <string>

#include "support/test_support.h"

namespace orvan {
namespace {

using testing::RunTool;
using testing::ToolResult;

TEST(TextDirectivesTool, PrintGoesToStandardOutputBeforeTheExpansion) {
    const ToolResult r = RunTool({}, "a\n@print(x)\n@def N = 5\n@println(N done)\nb\n");
    EXPECT_EQ(r.exitCode, 0) << r.err;
    EXPECT_EQ(r.out, "x5 done\na\nb\n");
}

struct ReportCase {
    const char* name;
    const char* input;
    const char* report;
};

TEST(TextDirectivesTool, ReportsNameTheLineOfTheDirective) {
    const ReportCase cases[] = {
        {"assertion", "a\nb\n  @assert(1 > 2)\n",
         "\n<stdin>(3) : Assertion failure\n        @assert(1 > 2)\nie      @assert(1 > 2)\n"},
        {"expression of @(", "first\n  @(1 2)\n",
         "\n<stdin>(2) : Expected ) after 1 when read 2 in expression\n    in @(1 2)\n"},
        {"fail", "a\n\n@fail(\"stop \" + \"here\")\n", "\n<stdin>(3) : stop here\n"},
        {"assertfails", "a\n@assertfails{\nok\n}\n",
         "\n<stdin>(2) : Macro expansion of ok didn't generate an error\n"},
        {"second pass of @[", "a\n@[@quote(@)fail(\"late\")]\n",
         "\n<stdin>(2) : late\n    in @[@fail(\"late\")]\n"},
        {"assignment to a macro", "@def n = 1\n\n@let n = 2\n",
         "\n<stdin>(3) : @let directive failed : n is a macro declared using @def\n"},
    };
    for (const ReportCase& c : cases) {
        SCOPED_TRACE(c.name);
        const ToolResult r = RunTool({}, c.input);
        EXPECT_EQ(r.exitCode, 1);
        EXPECT_EQ(r.out, "");
        EXPECT_EQ(r.err, c.report);
    }
}

TEST(TextDirectivesTool, CppTableExampleMatchesItsExpectedHeader) {
    const std::string dir = std::string(OVMACRO_SOURCE_DIR) + "/examples";
    const ToolResult r = RunTool({dir + "/cpp_table.ovm"});
    EXPECT_EQ(r.exitCode, 0) << r.err;
    EXPECT_EQ(r.out, testing::ReadFile(dir + "/cpp_table.expected.h"));
}

TEST(TextDirectivesTool, CppTableExampleGuardsItsList) {
    const std::string dir = std::string(OVMACRO_SOURCE_DIR) + "/examples";
    std::string text = testing::ReadFile(dir + "/cpp_table.ovm");
    const std::string entry = "(Green, green)";
    const size_t at = text.find(entry);
    ASSERT_NE(at, std::string::npos);
    text.replace(at, entry.size(), "(Green, a display name far too long)");
    const ToolResult r = RunTool({}, text);
    EXPECT_EQ(r.exitCode, 1);
    EXPECT_NE(r.err.find("Assertion failure\n        @assert(len(@str(name)) <= MAX_NAME)\n"
                         "ie      @assert(len(\"a display name far too long\") <= 24)"),
              std::string::npos)
        << r.err;
}

}  // namespace
}  // namespace orvan

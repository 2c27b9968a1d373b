// @assert, @assertfails and @fail: what passes leaves no trace; what fails reports where and why.
#include <gtest/gtest.h>

#include <string>

#include "ovmacro/expander/macro_expander.h"
#include "support/test_support.h"

namespace orvan {
namespace {

using testing::ExpandText;
using testing::MessageOf;
using testing::NoImports;
using testing::OffsetIn;

struct PassCase {
    const char* name;
    const char* input;
    const char* expected;
};

TEST(AssertionDirectives, PassingAssertionsLeaveNoTrace) {
    const PassCase cases[] = {
        {"assert on its own line", "a\n  @assert(1 < 2)\nb", "a\nb"},
        {"assert after text", "a @assert(true)\nb", "ab"},
        {"assert expands its condition", "@def N = 5\n@assert(N == 5)\nok", "ok"},
        {"assertfails in braces", "@assertfails{@fail(\"x\")}\nb", "b"},
        {"assertfails in brackets", "@assertfails[@let int q = 1 2]\nb", "b"},
        {"assertfails in round brackets", "@assertfails(@assert(1 > 2))\nb", "b"},
        {"a definition inside assertfails vanishes", "@assertfails{@def d = 1\n@fail(\"x\")}d", "d"},
        {"an exported definition inside assertfails vanishes",
         "@assertfails{@exportdef d = {1}\n@fail(\"x\")}d", "d"},
        {"a file-wide definition inside assertfails vanishes", "@assertfails{@def +d = {1}\n@fail(\"x\")}d",
         "d"},
    };
    NoImports handler;
    for (const PassCase& c : cases) {
        SCOPED_TRACE(c.name);
        EXPECT_EQ(ExpandText(c.input, &handler), c.expected);
    }
}

TEST(AssertionDirectives, AssertFailsWithoutFileScopeSeesTheSameFailures) {
    // Without a file-scope frame "@def +" fails, so the text fails and the assertion holds.
    VarFrame root(nullptr);
    const std::string text = "@assertfails{@def +x = 1}ok";
    std::string out;
    MacroExpand(nullptr, &root, BasicSubString(text), 0, 0, out);
    EXPECT_EQ(out, "ok");
}

struct FailureCase {
    const char* name;
    const char* input;
    const char* message;
    long position;  // offset of the reported position in the input
};

TEST(AssertionDirectives, Failures) {
    NoImports handler;
    const FailureCase cases[] = {
        {"false assertion, after the word", "x\n@assert(1 > 2)",
         "Assertion failure\n        @assert(1 > 2)\nie      @assert(1 > 2)", 9},
        {"false assertion shows both texts", "@def N = 5\n@assert(N > 7)",
         "Assertion failure\n        @assert(N > 7)\nie      @assert(5 > 7)", 18},
        {"condition error: EOS reads as ), at the @", "x @assert(1 +)",
         "Unexpected ) after + in expression\n    in @assert(1 +)", 2},
        {"condition must be a bool", "@assert(1)",
         "No implicit conversion from int64 to bool\n    in @assert(1)", 0},
        {"text left after the condition", "@assert(true false)",
         "Expected ) after true when read false in expression\n    in @assert(true false)", 0},
        {"expansion errors pass unchanged", "@assert(@fail(\"inner\"))", "inner", 13},
        {"assert needs (", "@assert x", "( expected when read x", 8},
        {"assertfails over a text that works", "ab @assertfails(plain text)",
         "Macro expansion of plain text didn't generate an error", 15},
        {"the text sees its own file-wide definition", "@assertfails{@def +d = {1}\n@assert(d == 1)}",
         "Macro expansion of @def +d = {1}\n@assert(d == 1) didn't generate an error", 12},
        {"dollar macros resolve inside assertfails", "@$A = \"v\"\n@assertfails{@assert(\"$(A)\" == \"v\")}",
         "Macro expansion of @assert(\"$(A)\" == \"v\") didn't generate an error", 22},
        {"assertfails needs a bracket", "@assertfails<x>", "( expected after @assertfails when read <", 12},
        {"assertfails unclosed", "@assertfails{a", "Met EOS while reading bracketted section", 14},
        {"fail says exactly its message, after the word", "a\n@fail(\"stop here\")", "stop here", 7},
        {"fail evaluates a string expression", "@def W = \"here\"\n@fail(\"stop \" + W)", "stop here", 21},
        {"fail expression errors name @fail, at the @", "@fail(\"a\" + 1)",
         "Incompatible types (string and int64) for + operation\n    in @fail(\"a\" + 1)", 0},
        {"fail needs (", "@fail x", "( expected when read x", 6},
    };
    for (const FailureCase& c : cases) {
        SCOPED_TRACE(c.name);
        const std::string input = c.input;
        const char* position = nullptr;
        EXPECT_EQ(MessageOf([&] { ExpandText(input, &handler); }, position), c.message);
        EXPECT_EQ(OffsetIn(input, position), c.position);
    }
}

}  // namespace
}  // namespace orvan

// The @str family, @unstr, @quote, @( ), @[ ] and @print/@println: output layout and error reports.
#include <gtest/gtest.h>

#include <string>

#include "ovmacro/expander/macro_expander.h"
#include "support/test_support.h"

namespace orvan {
namespace {

using testing::ExpandText;
using testing::MessageOf;
using testing::OffsetIn;

struct LayoutCase {
    const char* name;
    const char* input;
    const char* expected;
};

TEST(StringDirectives, OutputLayout) {
    const LayoutCase cases[] = {
        {"str escapes quotes", "@str(say \"hi\")", "\"say \\\"hi\\\"\""},
        {"str of nothing", "@str()", "\"\""},
        {"strW", "@strW(abc)", "L\"abc\""},
        {"str keeps a line feed inside one literal", "@str(a\nb)", "\"a\\nb\""},
        {"str expands its argument", "@def N = 5\n@str(N items)", "\"5 items\""},
        {"strx: one literal per line, lined up", "x = @strx(a\nb);", "x = \"a\\n\"\n    \"b\";"},
        {"strx drops the empty literal after a final line feed", "x = @strx(a\nb\n);",
         "x = \"a\\n\"\n    \"b\\n\"\n;"},
        {"strxW keeps the empty wide literal", "x = @strxW(a\nb\n);",
         "x = L\"a\\n\"\n    L\"b\\n\"\n    L\"\";"},
        {"strx block form removes the block's indentation", "  t = @strx\n  (\n    one\n      two\n  );",
         "  t = \"one\\n\"\n      \"  two\";"},
        {"strx inline form keeps the indentation inside the brackets", "t = @strx(\n  one\n);",
         "t = \"  one\\n\"\n;"},
        {"strx inside an indented block lines up at the output column", "  @if(true){v = @strx(a\nb)}",
         "  v = \"a\\n\"\n      \"b\""},
        {"unstr resolves escapes", "[@unstr(\"a\\tb\\x41\")]", "[a\tbA]"},
        {"unstr undoes str", "[@unstr(@str(round trip \"q\"))]", "[round trip \"q\"]"},
        {"unstr lines up a multi-line result", "  v = @unstr(\"a\\nb\")", "  v = a\n      b"},
        {"quote copies without expanding", "@def N = 5\n@quote(@x N)", "@x N"},
        {"quote block form removes the block's indentation", "  q = @quote\n  (\n    @x\n      y\n  ) end",
         "  q = @x\n        y end"},
        {"@( adds", "@(1+2)", "3"},
        {"@( writes any type as text", "@(2.5 * 2) @(1 < 2) @(\"a\" + \"b\")", "5.0 true ab"},
        {"@[ composes a macro name", "@def who = World\n@def greet_World = Hello!\n@[greet_@@who]", "Hello!"},
        {"@[ composes a directive", "@[@quote(@)str(x)]", "\"x\""},
        {"@[ expands once more only", "@def a = b\n@def b = c\n@def c = d\n@[a]", "d"},
        {"print leaves no trace, not even its line", "a\n  @print(x)\nb", "a\nb"},
        {"println after text also removes the line end", "a @println(x)\nb", "ab"},
    };
    for (const LayoutCase& c : cases) {
        SCOPED_TRACE(c.name);
        EXPECT_EQ(ExpandText(c.input), c.expected);
    }
}

TEST(StringDirectives, DefinitionsExportedFromTheSecondPassOfSquareBracketsStayValid) {
    // The second pass of @[ expands a temporary text; what it exports must not point into freed memory.
    FileScopeVarFrame frame;
    const std::string define = "@[@quote(@)exportdef made = kept]@[@quote(@)def +filewide = {also kept}]";
    const std::string use = "made, filewide";
    std::string first;
    std::string second;
    MacroExpand(nullptr, &frame, BasicSubString(define), 0, 0, first);
    MacroExpand(nullptr, &frame, BasicSubString(use), 0, 0, second);
    EXPECT_EQ(first, "");
    EXPECT_EQ(second, "kept, also kept");
}

struct FailureCase {
    const char* name;
    const char* input;
    const char* message;
    long position;  // offset of the reported position in the input
};

TEST(StringDirectives, Failures) {
    const FailureCase cases[] = {
        {"@( with text left over, at the @", "x @(1 2)",
         "Expected ) after 1 when read 2 in expression\n    in @(1 2)", 2},
        {"@( reads the end of its text as )", "@(1 +)", "Unexpected ) after + in expression\n    in @(1 +)",
         0},
        {"@( names the expanded text", "@def E = 1 +\nz @(E)",
         "Unexpected ) after + in expression\n    in @(1 +)", 15},
        {"unstr of an unquoted text", "ab @unstr(abc)", "abc isn't a quoted string\n    in @unstr(abc)", 3},
        {"unstr of nothing", "@unstr()", "Expected quoted string\n    in @unstr()", 0},
        {"@[ second pass error: EOS reads as ]", "@[@quote(@)(1 +]",
         "Met ] while reading bracketted section\n    in @[@(1 +]", 0},
        {"@[ second pass error gets the first expansion", "a\n@[@quote(@)fail(\"boom\")]",
         "boom\n    in @[@fail(\"boom\")]", 2},
        {"first expansion errors pass unchanged", "@str(@fail(\"inner\"))", "inner", 10},
        {"@[ first expansion errors pass unchanged", "@[@fail(\"inner\")]", "inner", 7},
        {"str needs (", "@str x", "Expected ( when read x", 5},
        {"unstr needs (", "@unstr x", "( expected when read x", 7},
        {"print needs (", "@print", "( expected when read EOS", 6},
        {"str unclosed", "@str(abc", "Met EOS while reading bracketted string", 8},
    };
    for (const FailureCase& c : cases) {
        SCOPED_TRACE(c.name);
        const std::string input = c.input;
        const char* position = nullptr;
        EXPECT_EQ(MessageOf([&] { ExpandText(input); }, position), c.message);
        EXPECT_EQ(OffsetIn(input, position), c.position);
    }
}

}  // namespace
}  // namespace orvan

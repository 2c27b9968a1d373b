// @let, dollar definitions and @scope: stored values, visibility across frames, layout and error reports.
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

struct LayoutCase {
    const char* name;
    const char* input;
    const char* expected;
};

TEST(AssignmentDirectives, LetStoresCanonicalValues) {
    const LayoutCase cases[] = {
        {"int", "@let int n = 2 + 3\nn", "5"},
        {"assignment reads the old value", "@let int n = 2 + 3\n@let n = n * 2\nn", "10"},
        {"bool", "@let bool b = 1 < 2\nb", "true"},
        {"char", "@let char c = 'a'\nc", "'a'"},
        {"double", "@let double d = 1.5 * 2\nd", "3.0"},
        {"string by expression", "@let string s = \"a\" + \"b\"\ns", "ab"},
        {"string by expansion", "@def x = world\n@let string s := hello x\ns", "hello world"},
        {"string by expansion of a block", "@let string s := {a\nb}\n[s]", "[a\nb]"},
        {"string assignment by expansion", "@let string s := a\n@let s := [s]\ns", "[a]"},
    };
    for (const LayoutCase& c : cases) {
        SCOPED_TRACE(c.name);
        EXPECT_EQ(ExpandText(c.input), c.expected);
    }
}

TEST(AssignmentDirectives, LayoutAndFrames) {
    NoImports handler;
    const LayoutCase cases[] = {
        {"let on its own line leaves no line", "a\n  @let int n = 1\nb", "a\nb"},
        {"let after text takes the line end too", "a @let int n = 1\nb", "ab"},
        {"scope hides only inside its block", "@let int n = 1\n@scope{@let int n = 2\nin n}\nout n",
         "in 2\nout 1"},
        {"scope's definitions vanish", "@scope{@def k = 1}k", "k"},
        {"scope output stands in place", "<@scope{a}>", "<a>"},
        {"scope block lines up at its column", "  x @scope\n  {\n    a\n    b\n  }", "  x a\n    b"},
        {"assignment in a scope outlives it", "@let int n = 1\n@scope{@let n = 5}\nn", "\n5"},
        {"assignment in an @if block outlives it", "@let int n = 1\n@if(true){@let n = 7}\nn", "\n7"},
        {"let in a @while body drives its condition", "@let int i = 0\n@while(i < 3){@let i = i + 1\n[i]}",
         "[1][2][3]"},
        {"let collects over a @for loop",
         "@let string all := {}\n@for(x in [a, b, c]){@let all := all@@x}\n[all]", "\n[abc]"},
        {"dollar definition by literal", "@$N = \"v\\x41\"\n\"$(N)\"", "\n\"vA\""},
        {"dollar definition by expression", "@def P = \"pre\"\n@$N = (P + \"fix\")\n\"$(N)\"",
         "\n\"prefix\""},
        {"dollar definition in a nested block is text", "@if(true){@$N = \"v\"}", "@$N = \"v\""},
    };
    for (const LayoutCase& c : cases) {
        SCOPED_TRACE(c.name);
        EXPECT_EQ(ExpandText(c.input, &handler), c.expected);
    }
    EXPECT_EQ(ExpandText("@$N = \"v\""), "@$N = \"v\"") << "without an import handler @$ is no directive";
}

TEST(AssignmentDirectives, FailedLetChangesNothing) {
    FileScopeVarFrame frame;
    const std::string declare = "@let int n = 4\n@let string s := ok";
    const std::string badAssignment = "@let n = 5 6";
    const std::string badExpansion = "@let s := @fail(\"no\")";
    const std::string badDeclaration = "@let int m = 1 2";
    const std::string use = "n s";
    std::string out;
    MacroExpand(nullptr, &frame, BasicSubString(declare), 0, 0, out);
    for (const std::string* text : {&badAssignment, &badExpansion, &badDeclaration}) {
        SCOPED_TRACE(*text);
        MessageOf([&] { MacroExpand(nullptr, &frame, BasicSubString(*text), 0, 0, out); });
    }
    MacroExpand(nullptr, &frame, BasicSubString(use), 0, 0, out);
    EXPECT_EQ(out, "4 ok");
    EXPECT_EQ(frame.Find(BasicSubString("m"), nullptr), nullptr);
}

struct FailureCase {
    const char* name;
    const char* input;
    const char* message;
    long position;  // offset of the reported position in the input; -1: not checked
};

TEST(AssignmentDirectives, Failures) {
    NoImports handler;
    const FailureCase cases[] = {
        {":= needs a string", "@let int i := 3",
         "@let directive failed: i := may only be used for string type", 9},
        {":= assignment needs a string", "@let int n = 0\n@let n := x",
         "@let directive failed: n := may only be used for string type", 20},
        {"redefinition", "@let int n = 1\n@let int n = 1", "Redefinition of variable n in this scope", 24},
        {"no such variable", "@let n = 1", "@let directive failed : there is no variable named n", 5},
        {"macro", "@def n = 1\n@let n = 2", "@let directive failed : n is a macro declared using @def", 16},
        {"declaration value", "@let int n = 1 2", "Read 2 in middle of expression\n    expression: 1 2", -1},
        {"assignment value names the unexpanded text", "@def T = 2\n@let int n = 0\n@let n = 1 T",
         "Read 2 in middle of expression\n    expression: 1 2\n    when parsing expression '1 T' for @let "
         "directive",
         -1},
        {"assignment needs a name", "@let 5", "Identifier expected after @let when read 5", 5},
        {"declaration needs a name", "@let int 5 = 1", "Identifier expected for macro name when read 5", 9},
        {"missing =", "@let int n 1", "= expected in definition of macro n when read 1", 11},
        {":= expansion errors pass unchanged", "@let string s := @fail(\"x\")", "x", 22},
        {"dollar name", "@$5 = \"x\"", "Identifier expected after @$ when read 5", 2},
        {"dollar value", "@$N = x", "Quoted string expected after $N definition when read x", 6},
        {"dollar expression, at the @", "ab @$N = (1 +)",
         "Unexpected ) after + in expression\n    in @$(1 +)", 3},
        {"dollar expansion error", "@$N = (@fail(\"f\"))", "f\n    in @$(@fail(\"f\"))", 12},
        {"scope errors pass unchanged", "@scope{@fail(\"s\")}", "s", 12},
    };
    for (const FailureCase& c : cases) {
        SCOPED_TRACE(c.name);
        const std::string input = c.input;
        const char* position = nullptr;
        EXPECT_EQ(MessageOf([&] { ExpandText(input, &handler); }, position), c.message);
        if (c.position >= 0) {
            EXPECT_EQ(OffsetIn(input, position), c.position);
        }
    }
}

TEST(AssignmentDirectives, DollarDefinitionWithoutFileScopeIsRefused) {
    NoImports handler;
    VarFrame root(nullptr);
    const std::string text = "@$N = \"v\"";
    std::string out;
    EXPECT_EQ(MessageOf([&] { MacroExpand(&handler, &root, BasicSubString(text), 0, 0, out); }),
              "No filescope frame for $N");
}

}  // namespace
}  // namespace orvan

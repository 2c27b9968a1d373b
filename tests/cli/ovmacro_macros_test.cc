// Through the ovmacro tool: macro definitions, invocations, conditionals and loops, and the lines that error
// reports name for them (a definition's own line for an error in its body, the line of a call or directive
// otherwise, the line after `in` for a faulty @for list).
#include <gtest/gtest.h>

#include <string>

#include "support/test_support.h"

namespace orvan {
namespace {

using testing::RunTool;
using testing::ToolResult;

TEST(MacrosTool, Expansions) {
    const struct {
        const char* name;
        const char* input;
        const char* output;
    } cases[] = {
        {"definition lines vanish", "a\n@def greeting(who) = {Hello who!}\n\ngreeting(World)\nb\n",
         "a\nHello World!\nb\n"},
        {"block body lined up under the call", "@def list(a, b) =\n{\n  - a\n  - b\n}\nitems: list(x, y)\n",
         "items: - x\n       - y\n"},
        {"typed macro and typed argument", "@def int area(int w, int h) = {w * h}\narea(2 + 1, 4)\n", "12\n"},
        {"function argument", "@def wrap(x) = {<x>}\n@def each(f(), a, b) = {f(a)f(b)}\neach(wrap, 1, 2)\n",
         "<1><2>\n"},
        {"naked macro", "@nakeddef set(v) = {}\nset(kept)\nv\n", "\nkept\n"},
        {"conditional chain", "@def n = {7}\n@if(n < 5){small}@elseif(n < 10){medium}@else{large}\n",
         "medium\n"},
        {"conditional blocks on their own lines",
         "x\n@if(false)\n{\n  no\n}\n@else\n{\n  yes\n    indented\n}\ny\n", "x\nyes\n  indented\ny\n"},
        {"for over a list", "@for(x in [a, b, c]){[x]}\n", "[a][b][c]\n"},
        // A block on lines of its own loses its last line end.
        {"for over tuples", "@for((k, v) in [(1, one), (2, two)])\n{\nk=v\n}\n", "1=one2=two\n"},
        {"while with @let", "@let int i = 0\n@while(i < 3){i,@let i = i + 1\n}\n", "0,1,2,\n"},
        {"recursion that ends", "@def count(int n) = {@if(n > 0){n count(n - 1)}}\ncount(5)\n",
         "5 4 3 2 1 \n"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        const ToolResult r = RunTool({}, c.input);
        EXPECT_EQ(r.exitCode, 0) << r.err;
        EXPECT_EQ(r.out, c.output);
        EXPECT_EQ(r.err, "");
    }
}

TEST(MacrosTool, ErrorReportsNameTheLine) {
    const struct {
        const char* name;
        const char* input;
        const char* report;  // the whole of standard error
    } cases[] = {
        {"definition spread over lines", "a\n@def f(x,\n       x) = {}\n",
         "\n<stdin>(3) : Repeated argument x in definition of macro f\n"},
        {"two-line message", "a\n@def f(a a) = {}\n",
         "\n<stdin>(2) : Comma or right parenthesis expected when read a\n"
         "while reading argument list for definition of macro f\n"},
        {"no parent frame", "\n\n@exportdef m = {1}\n", "\n<stdin>(3) : No parent frame\n"},
        {"wrong argument count at the call", "@def m(a,b) = {}\n\nm(1)\n",
         "\n<stdin>(3) : Insufficient arguments provided for macro m(a,b)\n"},
        {"missing argument list", "@def m(a) = {}\nx\nm;\n",
         "\n<stdin>(3) : ( expected to begin argument list for macro m(a) when read ;\n"},
        // An error in a body is reported at the definition's line, with the chain of calls.
        {"error in a body, three calls deep",
         "@def max(a,b) = {@if(a > b +){a}@else{b}}\n@def mid(x) = {max(x+1, y)}\n@def top = "
         "{mid(1)}\n\ntop\n",
         "\n<stdin>(1) : Unexpected y after > in expression\n    in @if(1+1 > y +)\n"
         "    invoking macro max(a,b) with a=x+1, b=y\n    invoking macro mid(x) with x=1\n    invoking "
         "macro top\n"},
        {"typed argument at the call's line", "@def m(int n) = {n}\n\nm(true)\n",
         "\n<stdin>(3) : No implicit conversion from bool to int64\n    expression: true\n"
         "    passing formal argument n to macro m\n"},
        {"typed macro body at the definition's line", "@def int i = {1 +}\n\ni\n",
         "\n<stdin>(1) : Unexpected EOS after + in expression\n    expression: 1 +\n    invoking macro i\n"},
        {"condition at the '@'", "x\n  @if(1){a}\n",
         "\n<stdin>(2) : No implicit conversion from int64 to bool\n"
         "    in @if(1)\n"},
        {"unclosed condition reads )", "@def p = {(1 +}\nx\n@if(p){a}\n",
         "\n<stdin>(3) : Unexpected ) after + in expression\n    in @if((1 +)\n"},
        {"import in a block", "@if(true)\n{\n  @import \"x\"\n}\n",
         "\n<stdin>(3) : @import statement not allowed here\n"},
        {"for list after `in`", "@for((a, b) in\n  [(1, 2), (3)]){}\n",
         "\n<stdin>(1) : , expected when read )\n"},
        {"for list without ]", "@def L = {[a, b}\nx\n@for(v in L){v}\n",
         "\n<stdin>(3) : Met EOS while reading argument b\n    in @for directive for list [a, b\n"},
        {"for block", "@for(v in [1, 2])\n{\n  @if(v){}\n}\n",
         "\n<stdin>(3) : No implicit conversion from int64 to bool\n    in @if(1)\n    in @for directive "
         "when v = 1\n"},
        {"while condition", "\n@while(1 +){}\n",
         "\n<stdin>(2) : Unexpected ) after + in expression\n    in @while(1 +)\n"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        const ToolResult r = RunTool({}, c.input);
        EXPECT_EQ(r.exitCode, 1);
        EXPECT_EQ(r.out, "");
        EXPECT_EQ(r.err, c.report);
    }
}

TEST(MacrosTool, EndlessRecursionIsReportedNotACrash) {
    const ToolResult r = RunTool({}, "text\n@def f = {<f>}\nf\n");
    EXPECT_EQ(r.exitCode, 1);
    EXPECT_EQ(r.out, "");
    EXPECT_EQ(r.err.rfind("\n<stdin>(2) : Macro expansion nested too deeply", 0), 0u) << r.err.substr(0, 300);
    size_t lines = 0;
    for (char ch : r.err) lines += ch == '\n' ? 1 : 0;
    EXPECT_LE(lines, 27u) << "the report keeps a bounded number of context lines";
    EXPECT_NE(r.err.find(" more context lines left out\n"), std::string::npos);
}

}  // namespace
}  // namespace orvan

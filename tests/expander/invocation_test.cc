// Tests of macro invocation: value variables, untyped arguments bound lazily in the caller's frame, typed
// arguments evaluated at the call, function arguments, naked and typed macros, multi-line bodies lined up
// under their call, the "invoking macro" context lines, argument-list errors, and output kept up to an error.
#include <gtest/gtest.h>

#include <cstdint>
#include <string>

#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/lexer/exceptions.h"
#include "support/test_support.h"

namespace orvan {
namespace {

using orvan::testing::ExpandIn;
using orvan::testing::ExpandText;
using orvan::testing::ExpectErrorAt;
using orvan::testing::kAtEnd;
using orvan::testing::MessageOf;
using orvan::testing::OffsetIn;

// ---------------------------------------------------------------------------------------------------------
// Value variables.

TEST(InvocationTest, ValueVariableIsReplacedByItsValueMappedToTheName) {
    FileScopeVarFrame frame;
    frame.AddVariable(new LSValueVariable(LSV_Int, BasicSubString("n"), BasicSubString("5")));
    frame.AddVariable(new LSValueVariable(LSV_String, BasicSubString("s"), BasicSubString("a b")));
    const std::string text = "n+n s";
    std::string out;
    OutputPieces pieces;
    MacroExpand(nullptr, &frame, BasicSubString(text), 0, 0, out, pieces);
    EXPECT_EQ(out, "5+5 a b");
    ASSERT_EQ(pieces.size(), static_cast<int64>(out.size()));
    // Each value is one calculated piece mapped to its name; the text between is copied.
    EXPECT_EQ(OffsetIn(text, pieces.MapOutputPositionToAddress(0)), 0);
    EXPECT_EQ(OffsetIn(text, pieces.MapOutputPositionToAddress(1)), 1);
    EXPECT_EQ(OffsetIn(text, pieces.MapOutputPositionToAddress(2)), 2);
    for (int64 i = 4; i < 7; ++i) EXPECT_EQ(OffsetIn(text, pieces.MapOutputPositionToAddress(i)), 4) << i;
    int calculated = 0;
    for (const OutputPiece& p : pieces.GetPieces()) calculated += p.IsCopied() ? 0 : 1;
    EXPECT_EQ(calculated, 3);
}

// ---------------------------------------------------------------------------------------------------------
// Expansions.

TEST(InvocationTest, Expansions) {
    const struct {
        const char* input;
        const char* output;
    } cases[] = {
        {"@def greeting(who) = {Hello who!}\ngreeting(World)\n", "Hello World!\n"},
        // A macro without formals reads no argument list.
        {"@def m = {ab}\nm() m (x)", "ab() ab (x)"},
        // One untyped formal called with nothing binds the empty text.
        {"@def m(a) = {[a]}\nm() m( )", "[] []"},
        // Arguments: brackets nest, backquotes quote, comments and line ends are skipped.
        {"@def m(a,b) = {<a|b>}\nm(f(1,2), [3,4]) m(`1,2`, 3) m( 1 /* c */ ,\n 2 )",
         "<f(1,2)|[3,4]> <1,2|3> <1|2>"},
        {"@def m(a,b) = {<a|b>}\nm(\"x,y\", ')')", "<\"x,y\"|')'>"},
        // Untyped arguments are expanded where the body uses them, with the caller's names.
        {"@def x = {caller}\n@def m(a) = {@def x = {body}\na x}\nm(x)", "caller body"},
        {"@def m(a) = {a a}\n@def x = {X}\nm(x)", "X X"},
        {"@def m(a, b) = {b a}\nm(b, a)", "a b"},
        // Nested calls: an argument is itself a call.
        {"@def p(a) = {(a)}\np(p(p(1)))", "(((1)))"},
        // Typed arguments are evaluated once, at the call, in the caller's frame.
        {"@def m(int n) = {n n}\nm(1+2)", "3 3"},
        {"@def int sq(int n) = {n*n}\nsq(1+2)", "9"},
        {"@def k = {4}\n@def m(int n) = {@def k = {100}\nn k}\nm(k)", "4 100"},
        {"@def m(bool b, char c, double d, string s) = {b c d s}\nm(1 < 2, 'q', 0.5, \"t\")",
         "true 'q' 0.5 t"},
        // Typed macros: the body is an expression whose value replaces the call.
        {"@def bool b = {1 < 2}\nb", "true"},
        {"@def char c = {'a'}\nc", "'a'"},
        {"@def double d = {1.5}\nd", "1.5"},
        {"@def string s = {\"a\"}\ns", "a"},
        {"@def int i = {2 + 3 * 4}\ni", "14"},
        {"@def int twice(int n) = {n*2}\ntwice(3+4)", "14"},
        {"@def two = {2}\n@def int sq(x) = {x*x}\nsq(two+1)", "5"},
        // Function arguments: the formal names a macro that the body calls with arguments.
        {"@def g(y) = {<y>}\n@def apply(f(), x) = {f(x)}\napply(g, 5)", "<5>"},
        {"@def g(a,b) = {a-b}\n@def apply(f()) = {f(1,2)}\napply(g)", "1-2"},
        {"@def g(y) = {<y>}\n@def apply(f(), x) = {f(x x)}\napply(g, 7)", "<7 7>"},
        // The function argument is called in the caller's frame, its arguments expanded in the body's.
        {"@def g(y) = {<y>}\n@def apply(f(), x) = {@def g(y) = {BAD}\nf(x)}\napply(g,5)", "<5>"},
        // Naked macros bind their arguments, and keep their definitions, in the caller's frame.
        {"@nakeddef nm(a) = {@def inner = {I}\n}\nnm(v)\na inner", "\nv I"},
        {"@def om(a) = {@def inner = {I}\n}\nom(v)\na inner", "\na inner"},
        // A multi-line body is lined up under the column where the call stood.
        {"@def m =\n{\nline1\nline2\n}\n    xx m yy\nz", "    xx line1\n       line2 yy\nz"},
        {"@def m =\n  {\n    one\n      two\n  }\nab m", "ab one\n     two"},
        {"@def m = {a\nb}\n\tm", "\ta\n    b"},
        {"@def in = {p\nq}\n@def out = {[in]}\n  x out", "  x [p\n     q]"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.input);
        EXPECT_EQ(ExpandText(c.input), c.output);
    }
}

TEST(InvocationTest, NakedMacroLeavesBindingsInCallersFrame) {
    FileScopeVarFrame frame;
    const std::string text = "@nakeddef nm(a, int n) = {@def inner = {I}\n}\nnm(v, 2+3)";
    EXPECT_EQ(ExpandIn(frame, text), "");
    auto* a = dynamic_cast<LSMacroVariable*>(frame.vars.Find(BasicSubString("a")));
    ASSERT_NE(a, nullptr);
    EXPECT_EQ(a->GetSubstitutionString().view(), "v");
    auto* n = dynamic_cast<LSValueVariable*>(frame.vars.Find(BasicSubString("n")));
    ASSERT_NE(n, nullptr);
    EXPECT_EQ(n->value, "5");
    EXPECT_NE(frame.vars.Find(BasicSubString("inner")), nullptr);
}

// ---------------------------------------------------------------------------------------------------------
// Errors.

TEST(InvocationErrorsTest, MessagesAndPositions) {
    const struct {
        const char* input;
        const char* message;
        const char* at;  // the text at the error's position (its last occurrence), or kAtEnd
    } cases[] = {
        {"@def m(a,b) = {}\nm(1)", "Insufficient arguments provided for macro m(a,b)", ")"},
        {"@def m(a,b) = {}\nm(1,2,3)", "Too many arguments provided for macro m(a,b)", ",3"},
        {"@def m(a) = {}\nm(1, 2)", "Too many arguments provided for macro m(a)", ", 2"},
        {"@def m(a,b) = {}\nm 1", "( expected to begin argument list for macro m(a,b) when read 1", "1"},
        {"@def m(a,b) = {}\nm", "( expected to begin argument list for macro m(a,b) when read EOS", kAtEnd},
        {"@def m(a,b) = {}\nm(1, 2", "Met EOS while reading argument 2", kAtEnd},
        {"@def m(a,b) = {}\nm(1, (2)", "Met EOS while reading argument (2)", kAtEnd},
        // Errors in a body keep their place in the definition, and each invocation adds one context line,
        // innermost first, naming the macro and its bound arguments.
        {"@def max(a,b) = {@if(a > b +){a}@else{b}}\n@def mid(x) = {max(x+1, y)}\n@def top = {mid(z)}\ntop",
         "Unexpected z after ( in expression\n    in @if(z+1 > y +)\n"
         "    invoking macro max(a,b) with a=x+1, b=y\n"
         "    invoking macro mid(x) with x=z\n"
         "    invoking macro top",
         "@if"},
        {"@def int twice(int n) = {n * 2}\n@def m(a) = {twice(a)}\nm(true)",
         "No implicit conversion from bool to int64\n    expression: true\n"
         "    passing formal argument n to macro twice\n"
         "    invoking macro m(a) with a=true",
         ")}\nm(true)"},
        {"@def g(y) = {@if(y){}}\n@def apply(f(), x) = {f(x)}\napply(g, 5)",
         "No implicit conversion from int64 to bool\n    in @if(5)\n"
         "    invoking macro g(y) with y=5\n"
         "    invoking macro f\n"
         "    invoking macro apply(f,x) with f=g, x=5",
         "@if"},
        {"@def apply(f()) = {f}\napply(g)",
         "( expected to begin argument list for macro f when read EOS\n    invoking macro apply(f) with f=g",
         "}\napply"},
        {"@def m(a) = {@if(a){}}\n@def n(int i) = {m(i)}\nn(1)",
         "No implicit conversion from int64 to bool\n    in @if(1)\n    invoking macro m(a) with a=i\n"
         "    invoking macro n(i) with i=1",
         "@if"},
    };
    for (const auto& c : cases) ExpectErrorAt(c.input, c.message, c.at, /*last=*/true);
}

// Errors found while evaluating a typed argument or a typed macro's body: the expression that was evaluated
// exists only during the evaluation, so the error moves back to the source character that produced the faulty
// text (an error at the end of the expression: to the end of the text that was expanded).
TEST(InvocationErrorsTest, TypedEvaluationErrorsArePlacedInTheSource) {
    const struct {
        const char* input;
        const char* message;
        const char* at;
    } cases[] = {
        {"@def m(int n) = {n}\nm(1+) tail",
         "Unexpected EOS after + in expression\n    expression: 1+\n    passing formal argument n to macro m",
         ") tail"},
        {"@def m(a, int n) = {n}\nm(x, true) tail",
         "No implicit conversion from bool to int64\n    expression: true\n    passing formal argument n to "
         "macro m",
         ") tail"},
        {"@def int i = {1 +}\ni",
         "Unexpected EOS after + in expression\n    expression: 1 +\n    invoking macro i", "}\ni"},
        {"@def int i = {1 2}\ni", "Read 2 in middle of expression\n    expression: 1 2\n    invoking macro i",
         "2}"},
        {"@def one = {1}\n@def int i(a) = {a one}\ni(2)",
         "Read 1 in middle of expression\n    expression: 2 1\n    invoking macro i(a) with a=2", "1}\n@def"},
        // A function argument's call text is put together at the call: its errors are placed at the call.
        {"@def g(a,b) = {a-b}\n@def apply(f()) = {f(1)}\napply(g)",
         "Insufficient arguments provided for macro g(a,b)\n    invoking macro f\n    invoking macro "
         "apply(f) with f=g",
         "f(1)"},
    };
    for (const auto& c : cases) ExpectErrorAt(c.input, c.message, c.at, /*last=*/true);
}

// What a body wrote before its error stays in the output; the rest of the call is not written.
TEST(InvocationErrorsTest, OutputWrittenBeforeAnErrorStays) {
    const struct {
        const char* input;
        const char* written;
    } cases[] = {
        {"@def m(a) = {written a @if(bad +){}never}\nbefore m(arg) after", "before written arg "},
        {"@def inner = {deep @if(1){}}\n@def outer = {<inner>}\nx outer y", "x <deep "},
        {"@def m(a,b) = {}\nkept m(1)", "kept "},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.input);
        const std::string text = c.input;
        FileScopeVarFrame frame;
        StringStream stream;
        ExpandedOutput output(&stream);
        MessageOf([&] { MacroExpand(nullptr, &frame, BasicSubString(text), 0, 0, output); });
        EXPECT_EQ(stream.str(), c.written);
        EXPECT_EQ(output.GetCharCount(), static_cast<int64>(stream.str().size()));
    }
}

// The string form leaves its result untouched when the expansion fails.
TEST(InvocationErrorsTest, StringResultUntouchedOnError) {
    FileScopeVarFrame frame;
    const std::string text = "@def m(a,b) = {}\nkept m(1)";
    std::string out = "previous";
    MessageOf([&] { MacroExpand(nullptr, &frame, BasicSubString(text), 0, 0, out); });
    EXPECT_EQ(out, "previous");
}

}  // namespace
}  // namespace orvan

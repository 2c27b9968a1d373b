// Tests of @for and @while: lists and tuple lists, empty and trailing items, loop names as macros, frames per
// iteration, state that outlives an iteration, layout of multi-line blocks, and every error with its context
// line and position (list errors are placed just after `in`, since the expanded list is a temporary text).
#include <gtest/gtest.h>

#include <cstdint>
#include <string>

#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/lexer/exceptions.h"
#include "support/test_support.h"

namespace orvan {
namespace {

using orvan::testing::ExpandText;
using orvan::testing::ExpectErrorAt;
using orvan::testing::kAtEnd;
using orvan::testing::MessageOf;

TEST(ForLoopTest, Iterations) {
    const struct {
        const char* input;
        const char* output;
    } cases[] = {
        {"@for(x in [a, b, c]){[x]}", "[a][b][c]"},
        {"@for(x in []){x}@for(x in [ ]){x}z", "z"},
        // A trailing comma adds no item; an empty item before a comma is iterated.
        {"@for(x in [a,]){<x>}", "<a>"},
        {"@for(x in [,a]){<x>}", "<><a>"},
        {"@for(x in [a,,b]){<x>}", "<a><><b>"},
        {"@for((k, v) in [(1, one), (2, two)]){k=v;}", "1=one;2=two;"},
        {"@for((a) in [(1), (2)]){a}", "12"},
        // Text after a tuple's ')' and after the list's ']' is ignored.
        {"@for((a,b) in [(1,2) junk, (3,4)]){a+b;}", "1+2;3+4;"},
        {"@for(x in [a] b){<x>}", "<a>"},
        // Items end at a comma outside brackets; backquotes quote.
        {"@for(x in [f(1,2), g]){<x>}", "<f(1,2)><g>"},
        {"@for(x in [`a,b`, c]){<x>}", "<a,b><c>"},
        {"@for(x in [a b, \"c,d\"]){<x>}", "<a b><\"c,d\">"},
        {"@for(x in\n  [\n    a /* first */,\n    b // last\n  ]\n){<x>}", "<a><b>"},
        // The list text is macro-expanded first, so a macro can stand for the list.
        {"@def L = {[1,2,3]}\n@for(x in L){x;}", "1;2;3;"},
        {"@def item(n) = {i@@n}\n@for(x in [item(1), item(2)]){x }", "i1 i2 "},
        // A loop name is a macro without arguments: it hides outer names in the block only.
        {"@def x = {X}\n@for(x in [1]){x}x", "1X"},
        // Its text is expanded where it is used, in the loop's frame, not the iteration's.
        {"@for(x in [y]){@def y = {Y}\nx y}", "y Y"},
        // Definitions made in one iteration are gone in the next and after the loop.
        {"@def d = {outer}\n@for(x in [a, b]){d @def d = {inner}\nd;}d", "outerinner;outerinner;outer"},
        // Nested loops.
        {"@for(x in [1,2]){@for(y in [a,b]){x.y }}", "1.a 1.b 2.a 2.b "},
        // A multi-line block: every iteration is lined up under the column of the '@'.
        {"ab @for(x in [1, 2])\n{\n<x>\n-\n}\nz", "ab <1>\n   -<2>\n   -\nz"},
        {"@for(x in [1, 2])\n  {\n    x\n  }\nz", "12\nz"},
        {"@for(x in [1]){}z", "z"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.input);
        EXPECT_EQ(ExpandText(c.input), c.output);
    }
}

TEST(WhileLoopTest, Iterations) {
    const struct {
        const char* input;
        const char* output;
    } cases[] = {
        {"@while(false){never}z", "z"},
        {"@while(1 > 2){never}z", "z"},
        // The condition is evaluated afresh before each iteration and sees what the last one changed.
        {"@let int i = 0\n@while(i < 3){<i>@let i = i + 1\n}|", "<0><1><2>|"},
        {"@let int i = 3\n@while(i > 0)\n{\n  i\n  @let i = i - 1\n}\n|", "3\n2\n1\n\n|"},
        // Definitions of enclosing frames persist too (here the file-scope frame, through '+').
        {"@def more = {true}\n@def second = {@def +more = {false}}\n@def first = {@def +step = {second}}\n"
         "@def step = {first}\n@while(more){x step}|",
         "x x |"},
        // Definitions of the iteration's own frame do not.
        {"@let int i = 0\n@def seen = {no}\n@while(i < 2){seen @def seen = {yes}\n@let i = i + 1\n}", "nono"},
        {"@let int i = 0\n@while(i < 2){@let i = i + 1\n}i", "2"},
        {"@let int i = 0\nab @while(i < 2)\n{\nx\ny\n@let i = i + 1\n}\nz", "ab x\n   y\n   x\n   y\n\nz"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.input);
        EXPECT_EQ(ExpandText(c.input), c.output);
    }
}

TEST(LoopErrorsTest, MessagesContextsAndPositions) {
    const struct {
        const char* input;
        const char* message;
        const char* at;  // the text at the error's position (its first occurrence), or kAtEnd
    } cases[] = {
        {"@for x in [a]){}", "( expected after @for when read x", "x"},
        {"@for(5 in [a]){}", "Identifier expected after @for( when read 5", "5"},
        {"@for((a b) in [a]){}", ", or ) expected when read b", "b)"},
        {"@for((5) in [a]){}", "Identifier expected when read 5", "5"},
        {"@for((a,) in [a]){}", "Identifier expected when read )", ")"},
        {"@for(x on [a]){}", "'in' expected when read on", "on"},
        {"@for(x", "'in' expected when read EOS", kAtEnd},
        {"@for(x in [a]", "Met EOS while reading bracketted section", kAtEnd},
        // Errors in the expanded list are placed just after `in`.
        {"line\n@for(x in a, b){}", "[ expected when read a", " a, b"},
        {"@for(x in){}", "[ expected when read EOS", "){}"},
        {"@for((a,b) in [x]){}", "( expected when read x", " [x]"},
        {"@for((a,b) in [(1, one), (2)]){}", ", expected when read )", " [(1"},
        {"@for((a,b) in [(1,2,3)]){}", ") expected when read ,", " [(1"},
        {"@for(x in [`a` b]){}", ", or ] expected when read b", " [`a`"},
        {"@def L = {[`(1`]}\n@for((a,b) in L){}",
         "Met EOS while reading argument 1\n    in @for directive for list [`(1`]", " L)"},
        // Items are cut one at a time: the first iteration runs before the missing ']' is found.
        {"@def L = {[a, b}\n@for(x in L){<x>}",
         "Met EOS while reading argument b\n    in @for directive for list [a, b", " L)"},
        // Errors while expanding the list pass through unchanged.
        {"@def m(a) = {}\n@for(x in m(1,2)){}", "Too many arguments provided for macro m(a)", ",2"},
        // Cutting and expanding the block.
        {"@for(x in [a]) {x", "Met EOS while reading bracketted string\n    for @for directive", kAtEnd},
        {"@for(x in [1, 2]){@if(x){}}",
         "No implicit conversion from int64 to bool\n    in @if(1)\n"
         "    in @for directive when x = 1",
         "@if"},
        {"@for((k, v) in [(a, 1)]){@if(v){}}",
         "No implicit conversion from int64 to bool\n    in @if(1)\n"
         "    in @for directive when  = (a, 1)",
         "@if"},
        // @while.
        {"@while true {}", "( expected when read true", "true"},
        {"@while(false) {x", "Met EOS while reading bracketted string\n    for @while directive", kAtEnd},
        {"@while(1){}", "No implicit conversion from int64 to bool\n    in @while(1)", "@"},
        {"x @while(1 +){}", "Unexpected ) after + in expression\n    in @while(1 +)", "@"},
        {"@def c = {1 +}\n@while(c){}", "Unexpected ) after + in expression\n    in @while(1 +)", "@while"},
        {"@while(true false){}",
         "Expected ) after true when read false in expression\n    in @while(true false)", "@"},
        {"@def m(a) = {a}\n@while(m(1,2)){}",
         "Too many arguments provided for macro m(a)\n    in @while(m(1,2))", ",2"},
        // Errors in the block pass through unchanged.
        {"@while(true){@if(1){}}", "No implicit conversion from int64 to bool\n    in @if(1)", "@if"},
    };
    for (const auto& c : cases) ExpectErrorAt(c.input, c.message, c.at);
}

// Iterations that ran before an error keep their output.
TEST(LoopErrorsTest, OutputOfEarlierIterationsStays) {
    const struct {
        const char* input;
        const char* written;
    } cases[] = {
        {"@def L = {[a, b}\nx @for(y in L){<y>} never", "x <a>"},
        {"@for(y in [1, 2, three]){<y>@if(y > 1){}}", "<1><2><three>"},
        {"@for((a,b) in [(1,2), (3)]){<a b>}", "<1 2>"},
        {"@let int i = 0\n@while(i < 5){<i>@let i = i + 1\n@if(i == 2){@fail \"stop\"}}", "<0><1>"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.input);
        const std::string text = c.input;
        FileScopeVarFrame frame;
        StringStream stream;
        ExpandedOutput output(&stream);
        MessageOf([&] { MacroExpand(nullptr, &frame, BasicSubString(text), 0, 0, output); });
        EXPECT_EQ(stream.str(), c.written);
    }
}

}  // namespace
}  // namespace orvan

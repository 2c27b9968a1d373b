// Tests of @if, @elseif and @else: which block is chosen, how the three block forms are laid out, the chain's
// extent, the frame of a block, and the errors with their context lines and positions ("EOS" read as ")"
// and the position moved to the '@' when the expanded condition fails).
#include <gtest/gtest.h>

#include <cstdint>
#include <string>

#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/lexer/exceptions.h"
#include "support/test_support.h"

namespace orvan {
namespace {

using orvan::testing::MessageOf;
using orvan::testing::kAtEnd;
using orvan::testing::ExpandIn;
using orvan::testing::OffsetIn;

int64 OffsetOf(const std::string& text, const char* marker) { return testing::OffsetOf(text, marker); }

std::string Expand(const std::string& text) { return testing::ExpandText(text); }

TEST(ConditionalsTest, ChosenBlockAndLayout) {
    const struct {
        const char* input;
        const char* output;
    } cases[] = {
        {"@if(1 > 2){a}next", "next"},
        {"@if(2 > 1){a}next", "anext"},
        {"@if(true){a}@else{d}", "a"},
        {"@if(false){a}@else{d}", "d"},
        {"@if(false){a}@elseif(true){b}@elseif(true){c}@else{d}", "b"},
        {"@if(false){a}@elseif(false){b}@else{d}", "d"},
        {"@if(false){a}@elseif(false){b}", ""},
        {"@if((1 + 2) * 3 == 9){ok}", "ok"},
        {"@if(!false && (true || false)){ok}", "ok"},
        // The condition is macro-expanded before it is evaluated.
        {"@def big(x) = {x > 10}\n@if(big(11)){yes}@else{no} @if(big(9)){yes}@else{no}", "yes no"},
        {"@def flag = {true}\n@if (flag) text to end of line\nnext", "text to end of line\nnext"},
        // A block opened on the next line loses its first line's indentation on every line and its last
        // line end; its lines are lined up under the column of the '@'.
        {"x\n  @if(true)\n  {\n      one\n        two\n  }\nafter", "x\n  one\n    two\nafter"},
        {"ab @if(true)\n{\nx\ny\n}\nz", "ab x\n   y\nz"},
        // An inline block drops a line end right after its '{'.
        {"@if(true){\nx\n}z", "x\nz"},
        {"@if(true){}z", "z"},
        {"@if(false){a}@else{}z", "z"},
        // Blanks, comments and line ends may stand between a block and the next @elseif / @else, and
        // between the '@' and the word.
        {"@if(false){a} // c\n\n/* d */ @else{b}z", "bz"},
        {"@if(true){a} @ elseif (false) {b} @ else {c}|", "a|"},
        {"@if(false)\n{\n  a\n}\n@elseif(true)\n{\n  b\n}\n@else\n{\n  c\n}\nz", "b\nz"},
        // Nested conditionals.
        {"@if(true){@if(false){a}@else{b}}", "b"},
        // Names defined in a block vanish with it.
        {"@if(true){@def loc = {L}\nloc}loc", "Lloc"},
        // The chain ends at the first text that is no @elseif or @else.
        {"@if(false){a}x@if(true){b}", "xb"},
        {"@if(true){a} @elsewhere", "a @elsewhere"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.input);
        EXPECT_EQ(Expand(c.input), c.output);
    }
}

TEST(ConditionalsTest, ErrorsWithContextAndPosition) {
    const struct {
        const char* input;
        const char* message;
        const char* at;  // the text at the error's position (its first occurrence), or kAtEnd
    } cases[] = {
        // Conditions are bools: no implicit conversion from a number.
        {"@if(1){a}", "No implicit conversion from int64 to bool\n    in @if(1)", "@"},
        // Every @elseif condition is evaluated, also after a block was chosen.
        {"@if(false){a}@elseif(true){b}@elseif(1){c}",
         "No implicit conversion from int64 to bool\n    in @elseif(1)", "@"},
        {"x @if(true){a}@elseif(true +){b}", "Unexpected ) after + in expression\n    in @elseif(true +)",
         "@if"},
        // The expanded text is what the context line shows, and "EOS" reads ")".
        {"@def p = {(1 +}\n@if(p){a}", "Unexpected ) after + in expression\n    in @if((1 +)", "@if"},
        {"@if(true false){a}", "Expected ) after true when read false in expression\n    in @if(true false)",
         "@"},
        {"@if(){a}", "Unexpected ) after ( in expression\n    in @if()", "@"},
        // An error while expanding the condition keeps its position and shows the unexpanded condition.
        {"@def m(a) = {a}\n@if(m(1,2)){a}", "Too many arguments provided for macro m(a)\n    in @if(m(1,2))",
         ",2"},
        {"@def m(a) = {a}\n@if(false){}@elseif( m(1,2) ){a}",
         "Too many arguments provided for macro m(a)\n    in @elseif(m(1,2))", ",2"},
        // Cutting the condition or the block.
        {"@if true {a}", "( expected when read true", "true"},
        {"@if(true", "Met EOS while reading bracketted section", kAtEnd},
        {"@if(true)", "Expected { when read EOS", kAtEnd},
        {"@if(true)\nx", "Expected { when read x", "x"},
        {"@if(true){a}@elseif(false) {b", "Met EOS while reading bracketted string", kAtEnd},
        // Errors inside the chosen block pass through unchanged.
        {"@if(true){\n  @if(1){}}", "No implicit conversion from int64 to bool\n    in @if(1)", "@if(1)"},
        {"@if(true){@def f(a a) = {}}",
         "Comma or right parenthesis expected when read a\nwhile reading argument list for definition of "
         "macro f",
         "a)"},
        // Imports are refused in nested expansions.
        {"@if(true){@import \"x\"}", "@import statement not allowed here", "import"},
        {"@if(true){\n@importpath \"x\"\n}", "@importpath statement not allowed here", "importpath"},
        // @else outside a chain.
        {"@else {b}", "@else with no matching @if directive", "else"},
        {"@if(false){a}\ntext @else{b}", "@else with no matching @if directive", "else"},
    };
    for (const auto& c : cases) testing::ExpectErrorAt(c.input, c.message, c.at);
}

// A failing condition writes nothing of the construct; what came before it stays.
TEST(ConditionalsTest, OutputBeforeAFailingConditionStays) {
    FileScopeVarFrame frame;
    const std::string text = "kept @if(true){a}@elseif(1){b} lost";
    StringStream stream;
    ExpandedOutput output(&stream);
    MessageOf([&] { MacroExpand(nullptr, &frame, BasicSubString(text), 0, 0, output); });
    EXPECT_EQ(stream.str(), "kept ");
}

// The chosen block's output maps back to the block's place in the source.
TEST(ConditionalsTest, BlockOutputMapsToTheBlock) {
    FileScopeVarFrame frame;
    const std::string text = "@if(false){no}@else{yes}";
    std::string out;
    OutputPieces pieces;
    MacroExpand(nullptr, &frame, BasicSubString(text), 0, 0, out, pieces);
    ASSERT_EQ(out, "yes");
    for (int64 i = 0; i < 3; ++i)
        EXPECT_EQ(OffsetIn(text, pieces.MapOutputPositionToAddress(i)), OffsetOf(text, "yes") + i) << i;
}

}  // namespace
}  // namespace orvan

// Regression tests from fuzzing the expander: the work bounds that a fuzzer lowers so that every run of a
// short text ends (endless @while, output that doubles with each level of macros), and output pieces and
// error positions that pointed into texts that the expansion had made and freed (a @for list, the call text
// of a function argument).
#include <gtest/gtest.h>

#include <cstdint>
#include <string>

#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/expander/nesting_guard.h"
#include "ovmacro/lexer/exceptions.h"
#include "ovmacro/output/output_pieces.h"
#include "support/test_support.h"

namespace orvan {
namespace {

using orvan::testing::MessageOf;

std::string Expand(const std::string& text) {
    FileScopeVarFrame frame;
    std::string out;
    MacroExpand(nullptr, &frame, BasicSubString(text), 0, 0, out);
    return out;
}

// Bounds the work of the calling thread's expansions for the scope of one test.
class WorkLimits {
  public:
    WorkLimits(int64 expansions, int64 outputChars) {
        MacroNestingGuard::SetWorkLimitsForTesting(expansions, outputChars);
    }
    ~WorkLimits() { MacroNestingGuard::SetWorkLimitsForTesting(kNoWorkLimit, kNoWorkLimit); }
    WorkLimits(const WorkLimits&) = delete;
    WorkLimits& operator=(const WorkLimits&) = delete;
};

// Macros that each write the previous one twice: a9 writes 512 times "xxxxxxxx", 511 blanks between them,
// with 1023 invocations.
const std::string kDoubling =
    "@def a0 = xxxxxxxx\n@def a1 = a0 a0\n@def a2 = a1 a1\n@def a3 = a2 a2\n@def a4 = a3 a3\n@def a5 = a4 "
    "a4\n"
    "@def a6 = a5 a5\n@def a7 = a6 a6\n@def a8 = a7 a7\n@def a9 = a8 a8\n";

TEST(WorkLimitsTest, UnboundedWorkStopsAtTheBound) {
    struct Case {
        int64 expansions;
        int64 outputChars;
        std::string text;
        std::string message;
    };
    const std::string tooMany = "Expansion work limit reached (more than 200 expansions)";
    const std::string tooLong = "Expansion work limit reached (more than 1000 characters of output)";
    const Case cases[] = {
        // Each iteration expands the condition, so also a loop with an empty block ends.
        {200, kNoWorkLimit, "@while(true){}", tooMany},
        {200, kNoWorkLimit, "@while(true){x}", tooMany},
        {200, kNoWorkLimit, "@for(i in [1,2,3]){@while(true){}}", tooMany},
        {200, kNoWorkLimit, "@def f = {f f}\nf", tooMany},
        {kNoWorkLimit, 1000, kDoubling + "a9", tooLong},
        // Output into nested strings counts too: here the doubling builds the value of s.
        {kNoWorkLimit, 1000, kDoubling + "@let string s := a9", tooLong},
        // An @assertfails that swallows the first failure cannot restart the count.
        {200, kNoWorkLimit, "@while(true){@assertfails{@while(true){}}}", tooMany},
    };
    for (const Case& c : cases) {
        const WorkLimits limits(c.expansions, c.outputChars);
        EXPECT_EQ(MessageOf([&] { Expand(c.text); }).substr(0, c.message.size()), c.message) << c.text;
    }
}

TEST(WorkLimitsTest, EachOutermostExpansionHasItsOwnBudget) {
    // One run takes about 35 expansions: five runs pass only if each starts afresh.
    const WorkLimits limits(50, 1000);
    const std::string text = "@let int n = 0\n@while(n < 10){@let n = n + 1\n}n\n";
    for (int i = 0; i < 5; ++i) EXPECT_EQ(Expand(text), "10\n");
}

TEST(WorkLimitsTest, NoBoundByDefault) {
    EXPECT_EQ(Expand(kDoubling + "a9").size(), 8u * 512 + 511);
    const std::string count = "@let int n = 0\n@while(n < 3000){@let n = n + 1\n}n";
    EXPECT_EQ(Expand(count), "3000");
}

bool InText(const std::string& text, const char* p) {
    const auto begin = reinterpret_cast<std::uintptr_t>(text.data());
    const auto pos = reinterpret_cast<std::uintptr_t>(p);
    return p && pos >= begin && pos <= begin + text.size();
}

// Output pieces outlive the texts that an expansion makes and expands again; none of them may point into one.
TEST(HeldTextPiecesTest, CopiedPiecesPointIntoTheSource) {
    const struct {
        const char* text;
        const char* expanded;
    } cases[] = {
        {"@for(x in [abc,def]){x\n}", "abc\ndef\n"},
        {"@def apply(f()) = {f(1)}\n@def g(v) = {<v>}\napply(g)", "<1>"},
        {"@def L = [p, q]\n@for(x in L){@for(y in [x, `x!`]){y.}}", "p.p!.q.q!."},
        {"@def apply(f()) = {f(2)}\n@for(x in [@quote(a\n  b), c]){apply(x)}", "a\n   b(2)c(2)"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.text);
        const std::string text = c.text;
        FileScopeVarFrame frame;
        basic_xstring out;
        OutputPieces pieces;
        MacroExpand(nullptr, &frame, BasicSubString(text), 0, 0, out, pieces);
        EXPECT_EQ(out, c.expanded);
        int64 at = 0;
        for (const OutputPiece& p : pieces.GetPieces()) {
            if (p.IsCopied()) {
                EXPECT_TRUE(InText(text, p.source.begin()) && InText(text, p.source.end()));
                EXPECT_EQ(out.substr(static_cast<size_t>(at), static_cast<size_t>(p.source.size())),
                          p.source.GetString());
            } else if (p.source.begin()) {
                EXPECT_TRUE(InText(text, p.source.begin()));
            }
            at += p.size();
        }
    }
}

TEST(HeldTextPiecesTest, OutputOfAListItemMapsToTheItem) {
    const std::string text = "@for(x in [abc, def]){x}";
    FileScopeVarFrame frame;
    basic_xstring out;
    OutputPieces pieces;
    MacroExpand(nullptr, &frame, BasicSubString(text), 0, 0, out, pieces);
    ASSERT_EQ(out, "abcdef");
    EXPECT_EQ(pieces.MapOutputPositionToAddress(1), text.data() + text.find("abc") + 1);
    EXPECT_EQ(pieces.MapOutputPositionToAddress(3), text.data() + text.find("def"));
}

// The error arises after the call text of f has died: its position must not point into it.
TEST(HeldTextPiecesTest, ErrorInTheExpansionOfACallTextIsPlacedInTheSource) {
    for (const std::string text :
         {"@def int t(f())=f()\nt()", "@def int t(f())={f(1 2)}\n@def g(a) = a\nt(g)"}) {
        SCOPED_TRACE(text);
        const char* position = nullptr;
        MessageOf([&] { Expand(text); }, position);
        EXPECT_TRUE(InText(text, position));
    }
}

}  // namespace
}  // namespace orvan

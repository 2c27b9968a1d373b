// The expander's guards: endless recursion stops with a bounded report, also on a small thread stack, while
// recursion that ends works; the work bounds that fuzzers set end endless loops and doubling output; texts
// that an expansion makes and frees (a @for list, a call text) leave no piece or error position in them.
#include <gtest/gtest.h>

#include <algorithm>
#include <string>
#include <utility>

#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/expander/nesting_guard.h"
#include "support/test_support.h"

namespace orvan {
namespace {

using testing::ExpandText;
using testing::Finally;
using testing::MessageOf;
using testing::OffsetIn;

const std::string kTooDeep = "Macro expansion nested too deeply";
// count(k) writes k dots and needs 2k + 3 levels: the text, a body and a block per level, the last condition.
const std::string kCountdown = "@def count(int n) = {@if(n > 0){.count(n - 1)}}\ncount(";

// On this thread the depth limit stops the recursion, on a small stack the stack's end; the report is bounded.
TEST(NestingGuardTest, EndlessRecursionStopsWithABoundedReport) {
    for (const std::string text : {
             "@def f = {f}\nf", "@def a = {b}\n@def b = {a}\na", "@def f(x) = {<f(x)>}\nf(1)",
             "@def f(int n) = {f(n + 1)}\nf(0)", "@nakeddef f = {f}\nf", "@def f = {@if(true){f}}\nf",
             "@def f = {@if(f){}}\nf", "@def f = {@while(f){}}\nf", "@def f = {@for(x in [1]){f}}\nf",
             "@def f = {@for(x in [f]){}}\nf", "@def int f = {f + 1}\nf",
             "@def g(h()) = {h(1)}\n@def f(x) = {g(f)}\nf(0)"}) {
        for (const bool smallStack : {false, true}) {
            const char* position = nullptr;
            std::string message;
            const auto run = [&] { message = MessageOf([&] { ExpandText(text); }, position); };
            smallStack ? testing::RunOnStackOf(1 << 20, run) : run();
            // The first line, 24 lines of the chain and, last, "... N more context lines left out" (N > 0).
            const size_t omitted = message.find("\n    ... ");
            EXPECT_EQ(message.rfind(kTooDeep, 0), 0u);
            EXPECT_EQ(std::count(message.begin(), message.end(), '\n'), 25) << message.substr(0, 2000);
            ASSERT_EQ(omitted, message.rfind('\n')) << message.substr(0, 2000);
            EXPECT_TRUE(message[omitted + 9] != '0' && message.ends_with(" more context lines left out")) << message;
            EXPECT_GE(OffsetIn(text, position), 0) << text;
        }
    }
}

TEST(NestingGuardTest, LimitCountsLevelsAndRecovers) {
    {
        MacroNestingGuard::SetDepthLimitForTesting(10);
        const Finally restore([] { MacroNestingGuard::SetDepthLimitForTesting(0); });
        EXPECT_EQ(ExpandText(kCountdown + "3)"), "...");
        EXPECT_EQ(MessageOf([&] { ExpandText(kCountdown + "4)"); }).rfind(kTooDeep + " (more than 10 levels)", 0), 0u);
        EXPECT_EQ(ExpandText(kCountdown + "3)"), "...") << "a failed expansion leaves no level counted";
    }
    // The default limit, also after an endless recursion, lets 600 levels pass; a small stack 40.
    MessageOf([&] { ExpandText("@def f = {f}\nf"); });
    EXPECT_EQ(ExpandText(kCountdown + "300)"), std::string(300, '.'));
    std::string countdown;
    testing::RunOnStackOf(1 << 20, [&] { countdown = ExpandText(kCountdown + "20)"); });
    EXPECT_EQ(countdown, std::string(20, '.'));
}

TEST(WorkLimitsTest, UnboundedWorkStopsAtTheBound) {
    // Each macro writes the previous one twice: a9 writes "xxxxxxxx" 512 times, 511 blanks between them.
    std::string doubling = "@def a0 = xxxxxxxx\n";
    for (int i = 1; i < 10; ++i) {
        const std::string previous = "a" + std::to_string(i - 1);
        doubling += "@def a" + std::to_string(i) + " = " + previous + " " + previous + "\n";
    }
    // One run of this loop takes exactly 33 expansions and 120 characters of output, conditions included.
    const std::string loop = "@let int n = 0\n@while(n < 10){@let n = n + 1\n}n";
    const std::string tooMany = "Expansion work limit reached (more than 200 expansions)";
    const std::string tooLong = "Expansion output limit reached (more than 1000 characters written)";
    const struct {
        int64 expansions, outputChars;
        std::string text, message;
    } cases[] = {
        // Each iteration expands the condition, so also a loop with an empty block ends.
        {200, kNoWorkLimit, "@while(true){}", tooMany},
        {200, kNoWorkLimit, "@for(i in [1,2,3]){@while(true){x}}", tooMany},
        {200, kNoWorkLimit, "@def f = {f f}\nf", tooMany},
        {kNoWorkLimit, 1000, doubling + "a9", tooLong},
        {kNoWorkLimit, 1000, doubling + "@let string s := a9", tooLong},  // output into nested strings counts
        // An @assertfails that swallows the first failure cannot restart the count.
        {200, kNoWorkLimit, "@while(true){@assertfails{@while(true){}}}", tooMany},
        {32, kNoWorkLimit, loop, "Expansion work limit reached (more than 32 expansions)"},
        {kNoWorkLimit, 119, loop, "Expansion output limit reached (more than 119 characters written)"},
    };
    const auto setLimits = [](int64 expansions, int64 outputChars) {
        MacroNestingGuard::SetExpansionLimit(expansions);
        MacroNestingGuard::SetOutputLimit(outputChars);
    };
    const Finally restore([&] { setLimits(kNoWorkLimit, kDefaultOutputLimit); });
    for (const auto& c : cases) {
        setLimits(c.expansions, c.outputChars);
        EXPECT_EQ(MessageOf([&] { ExpandText(c.text); }).substr(0, c.message.size()), c.message) << c.text;
    }
    // Each outermost expansion has a budget of its own.
    setLimits(33, 120);
    for (int i = 0; i < 3; ++i) EXPECT_EQ(ExpandText(loop), "10");
    setLimits(kNoWorkLimit, kNoWorkLimit);  // no bound at all
    EXPECT_EQ(ExpandText(doubling + "a9").size(), 8u * 512 + 511);
    EXPECT_EQ(ExpandText("@let int n = 0\n@while(n < 3000){@let n = n + 1\n}n"), "3000");
}

TEST(HeldTextTest, PiecesAndErrorsPointIntoTheSource) {
    const std::pair<std::string, std::string> cases[] = {
        {"@for(x in [abc,def]){x\n}", "abc\ndef\n"},
        {"@def apply(f()) = {f(1)}\n@def g(v) = {<v>}\napply(g)", "<1>"},
        {"@def L = [p, q]\n@for(x in L){@for(y in [x, `x!`]){y.}}", "p.p!.q.q!."},
        {"@def apply(f()) = {f(2)}\n@for(x in [@quote(a\n  b), c]){apply(x)}", "a\n   b(2)c(2)"},
    };
    for (const auto& [text, expanded] : cases) {
        FileScopeVarFrame frame;
        std::string out;
        OutputPieces pieces;
        MacroExpand(nullptr, &frame, BasicSubString(text), 0, 0, out, pieces);
        EXPECT_EQ(out, expanded);
        size_t at = 0;
        for (const OutputPiece& p : pieces.GetPieces()) {
            if (p.source.begin()) {
                EXPECT_GE(OffsetIn(text, p.source.begin()), 0) << text << " at " << at;
            }
            if (p.IsCopied()) {
                EXPECT_GE(OffsetIn(text, p.source.end()), 0) << text << " at " << at;
                EXPECT_EQ(out.substr(at, static_cast<size_t>(p.size())), p.source.GetString());
            }
            at += static_cast<size_t>(p.size());
        }
    }
    // The errors arise after the call text of f has died.
    for (const std::string text : {"@def int t(f())=f()\nt()", "@def int t(f())={f(1 2)}\n@def g(a) = a\nt(g)"}) {
        const char* position = nullptr;
        MessageOf([&] { ExpandText(text); }, position);
        EXPECT_GE(OffsetIn(text, position), 0) << text;
    }
}

}  // namespace
}  // namespace orvan

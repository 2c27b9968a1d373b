// The expander's fast paths against its general way: the plain-text lane, which skips quiet bytes sixteen at a
// time while no variable has a name yet, macro bodies that are plain text apart from their arguments, loop
// blocks cut once into parts, and @str of a name.
#include <gtest/gtest.h>

#include <random>
#include <string>
#include <vector>

#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/expander/nesting_guard.h"
#include "ovmacro/expander/plain_text.h"
#include "ovmacro/vars/name_filter.h"
#include "support/test_support.h"

namespace orvan {
namespace {

using testing::OffsetIn;

// "stop/ordinaryEnd" of a skip over text, or "error@offset message".
template <class Skip>
std::string SkipOutcome(const std::string& text, Skip skip) {
    try {
        const PlainTextRun run = skip(text.data(), text.data() + text.size());
        return std::to_string(OffsetIn(text, run.stop)) + "/" + std::to_string(OffsetIn(text, run.ordinaryEnd));
    } catch (const LexScannerException& e) {
        return "error@" + std::to_string(OffsetIn(text, e.GetPosition())) + " " + e.GetMessage();
    }
}

// The lane without names stops where the byte-by-byte way stops once it goes on past every name it looks up
// (as it does when no name is defined), with the same pending blanks and the same scanning errors.
void ExpectSameStops(const std::string& text) {
    NameFilter::Add(BasicSubString("aNameThatNoTextUses"));  // makes SkipPlainText go byte by byte
    for (const bool lineFeedsNeedWork : {false, true}) {
        for (const bool dollars : {false, true}) {
            ASSERT_EQ(SkipOutcome(text, [&](const char* p, const char* end) {
                          return SkipPlainTextWithoutNames(p, end, lineFeedsNeedWork, dollars);
                      }),
                      SkipOutcome(text, [&](const char* p, const char* end) {
                          PlainTextRun run;
                          while ((run = SkipPlainText(p, end, lineFeedsNeedWork, dollars)).nameEnd) p = run.nameEnd;
                          return run;
                      }))
                << ::testing::PrintToString(text) << " line feeds need work " << lineFeedsNeedWork
                << ", dollar macros " << dollars;
        }
    }
}

TEST(PlainTextLaneTest, StopsLikeTheByteByByteWay) {
    for (const std::string text : {
             "a word1 with digits2x and 0x1F numbers 12 3.25 7e3 in the middle of some text",
             "words long enough to fill blocks then r\"raw\" and R'x' and xr'c' literals here",
             "utf-8 words: caf\xc3\xa9 na\xc3\xafve \xe2\x80\x94 dash, sixteen bytes at least"}) {
        ExpectSameStops(text);
    }
    // Random texts from the bytes that matter, after up to 47 quiet bytes that the lane skips in blocks.
    const std::string alphabet = "aaaarRxe_ \t\n\n019.,;-+/*\"'@\\()\x01\x7f\xc3\xa9";
    std::mt19937 random(12345);
    std::uniform_int_distribution<size_t> pick(0, alphabet.size() - 1);
    std::uniform_int_distribution<int> length(14, 80);
    for (int i = 0; i < 4000 && !HasFatalFailure(); ++i) {
        std::string text = std::string("words and 12 numbers, quiet enough to skip fast").substr(0, i % 48);
        for (int n = length(random); n > 0; --n) text += alphabet[pick(random)];
        ExpectSameStops(text);
    }
}

// Expands text with each "%%" replaced by mark, into the output and its pieces ("offset+size", "=" before a
// calculated one) or the error, offsets counted in the text without marks. With the mark "@@", which writes
// nothing, the bodies marked are no longer plain and take the general way.
std::string ExpandWithMarks(const std::string& marked, const std::string& mark) {
    std::string text;
    std::vector<int64> markEnds;
    size_t from = 0;
    for (size_t at; (at = marked.find("%%", from)) != std::string::npos; from = at + 2) {
        text += marked.substr(from, at - from) + mark;
        markEnds.push_back(static_cast<int64>(text.size()));
    }
    text += marked.substr(from);
    auto unmarked = [&](const char* p) {
        int64 offset = OffsetIn(text, p);
        for (const int64 end : markEnds) offset -= end <= OffsetIn(text, p) ? static_cast<int64>(mark.size()) : 0;
        return std::to_string(offset);
    };
    FileScopeVarFrame frame;
    std::string out;
    OutputPieces pieces;
    try {
        MacroExpand(nullptr, &frame, BasicSubString(text), 0, 0, out, pieces);
    } catch (const LexScannerException& e) {
        return "error@" + unmarked(e.GetPosition()) + " " + e.GetMessage();
    }
    for (const OutputPiece& p : pieces.GetPieces())
        out += std::string(p.IsCopied() ? " " : " =") + unmarked(p.source.begin()) + "+" + std::to_string(p.size());
    return out;
}

TEST(PlainBodyTest, ExpandsLikeTheGeneralWay) {
    const std::pair<std::string, std::string> cases[] = {  // text, the start of its outcome
        {"@def greet(a, b) = {Hello a and b!%%}\nx greet(one, two) y\n",
         "x Hello one and two! y\n 36+2 20+6 44+3 27+5 49+3 33+1 53+3"},
        {"x m(y)\n@def m(a) = {a-a-a%%}\nm(x)\n", "x m(y)\nx-x-x\n"},
        {"@def g = {G}\n@def m(a, b) = {[a b]%%}\nm(g g, a)\n", "[G G a]\n"},
        {"@def m(a) = {<a>%%}\nm(m(m(x)))\n", "<<<x>>>\n"},
        {"@def m(a) = {Hello a%%}\n@def Hello = {Hi}\nm(x)\n", "Hi x\n"},
        {"@def m(a) = {\n    line a\n    next a%%\n}\n  m(x)\n", "      line x\n      next x\n"},
        {"@def m(a, b) = {\"a\" a|b%%}\nm(`p, q`, r)\n", "\"a\" p, q|r\n"},
        {"@let int n = 7\n@def m(a) = {(a)%%}\nm(n)\n", "(7)\n"},
        {"@def g(x) = {x}\n@def m(a) = {[a]%%}\nm(g)\n", "error@37 ( expected to begin argument list for macro g(x)"},
        {"@def m(a, b) = {a+b%%}\nm(1, m(2, @fail(\"deep\")))\n", "error@36 deep"},
        // Parts of bodies and name arguments written without a look at their characters: the column after
        // them, a tab, a line start that still needs its indentation, parts too long for that.
        {"@def two = {1\n2}\n@def m(a, b) = {(a, b%%)}\nm(xx, two)\n", "(xx, 1\n     2)\n"},
        {"@def two = {1\n2}\n@def m(a, b) = {\ta, b%%}\nm(xx, two)\n", "\txx, 1\n        2\n"},
        {"@def m(a) = {a\na%%}\n  m(x)\n", "  x\n  x\n"},
        {"@def m(a) = {a and a text longer than thirty-two bytes%%}\n m(x)\n", " x and x text longer than"},
        // Argument lists of names, read in one pass (a mark after "(" makes the general way read them).
        {"@def m(a, b) = {[a|b]}\nm(%%x ,\n y\t) m(%%r, s)m(%%x, r'q')\n", "[x|y] [r|s][x|r'q']\n"},
        {"@def m(a, b) = {[a|b]}\nm(%%x)\n", "error@26 Insufficient arguments provided for macro m(a,b)"},
        {"@def m(a, b) = {[a|b]}\nm(%%x, y, z)\n", "error@29 Too many arguments provided for macro m(a,b)"},
    };
    for (const auto& [text, expected] : cases) {
        const std::string fast = ExpandWithMarks(text, "");
        EXPECT_EQ(fast.substr(0, expected.size()), expected) << text;
        EXPECT_EQ(fast, ExpandWithMarks(text, "@@")) << text;
    }
    // Each body is one level of nesting, as in the general way: the same depth gives the same error.
    MacroNestingGuard::SetDepthLimitForTesting(40);
    const testing::Finally restore([] { MacroNestingGuard::SetDepthLimitForTesting(0); });
    std::string calls = "x";
    for (int i = 0; i < 30; ++i) calls = "m(" + calls + ")";
    const std::string deep = "@def m(a) = {<a>%%}\n" + calls;
    EXPECT_NE(ExpandWithMarks(deep, "").find("nested too deeply"), std::string::npos);
    EXPECT_EQ(ExpandWithMarks(deep, ""), ExpandWithMarks(deep, "@@"));
    // Enough calls to fill the gathered output many times over.
    std::string many = "@def m(a, b) = {<a b>%%}\n";
    for (int i = 0; i < 100; ++i) many += "m(x" + std::to_string(i) + ", y)\t";
    EXPECT_EQ(ExpandWithMarks(many, ""), ExpandWithMarks(many, "@@"));
}

// Loop blocks cut once into parts, and @str of a name whose value is ordinary text, against the general way
// that "@@" forces on them: items that are not ordinary text, names of variables, errors in an iteration.
TEST(LoopBlockTest, ExpandsLikeTheGeneralWay) {
    const std::pair<std::string, std::string> cases[] = {  // text, the start of its outcome
        {"@for(x in [a, b c]){[x] @str(x),%%}\n", "[a] \"a\",[b c] \"b c\",\n"},
        {"enum {\n    @for(n in [RED, GREEN])\n    {\n        %%n = 1 << n,\n\n    }\n};\n", "enum {\n    RED = 1 << RED,\n    GREEN"},
        {"@for((k, v) in [(1, one), (2, `t,w`)]){k=v;%%}", "1=one;2=t,w;"},
        {"@def g = {G}\n@for(x in [g, h, 'q', \"s\\\\\"]){<x>@str(x)%%}", "<G>\"G\"<h>\"h\"<'q'>\"'q'\"<\"s\\\\\">"},
        {"@def y = {Y}\n@for(x in [1, y]){x y x%%}", "1 Y 1Y Y Y"},
        {"@for(x in [1,2]){@for(y in [a,b]){x.y %%}}", "1.a 1.b 2.a 2.b "},
        {"@for(x in [`a\nb`, c]){  x @str(x)%%}", "  a\n  b \"a\\nb\"  c \"c\""},
        {"@for(x in [1, @fail(\"deep\")]){x%%}", "error@19 deep"},
        {"@for(x in [1, 2]){x @if(x){}%%}", "error@20 No implicit conversion from int64 to bool"},
        // A list that expands to itself, or a macro whose body is one, is cut as it stands.
        {"@def L = {[a, (b, c)]}\n@for(x in L%%){<x>}@for(x in  L %%){<x>}@for(x in [p, q]%%){<x>}",
         "<a><(b, c)><a><(b, c)><p><q>"},
        {"@def L = {[1, 2]}\n@for(x in L%%){@if(x){}}", "error@31 No implicit conversion from int64 to bool"},
        {"@def L = {a, b}\n@for(x in L%%){x}", "error@25 [ expected when read a"},
        {"@def y = {Y}\n@def L = {[y, z]}\n@def M = {\n[m]}\n@for(x in L%%){x}@for(x in M%%){x}", "Yzm"},
        {"@def X = {hello}\n@let int n = 3\n@def q = {\"a\\\\\"}\n@str(X%%)@str(n%%)@str(q%%)@str(Z%%)@strx(X%%)",
         "\"hello\"\"3\"\"\\\"a\\\\\\\\\\\"\"\"Z\"\"hello\""},
    };
    for (const auto& [text, expected] : cases) {
        const std::string fast = ExpandWithMarks(text, "");
        EXPECT_EQ(fast.substr(0, expected.size()), expected) << text;
        EXPECT_EQ(fast, ExpandWithMarks(text, "@@")) << text;
    }
}

}  // namespace
}  // namespace orvan

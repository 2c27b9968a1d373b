// A macro whose body is ordinary text apart from the names of its untyped arguments is expanded without a
// frame of bindings. Each case here is expanded twice: as written, and with "@@" (which writes nothing) added
// at the marks "%%", which makes the bodies take the general way. Both must give the same text, the same
// output pieces, and the same error with the same position and context lines.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/expander/nesting_guard.h"
#include "ovmacro/lexer/exceptions.h"
#include "ovmacro/output/output_pieces.h"
#include "support/test_support.h"

namespace orvan {
namespace {

using orvan::testing::OffsetIn;

struct Outcome {
    std::string text;
    std::vector<std::string> pieces;  // "offset+size" for copied pieces, "=source offset:length" for calculated
    std::string error;
    int64 errorOffset = -1;

    bool operator==(const Outcome&) const = default;
};

void PrintTo(const Outcome& o, std::ostream* os) {
    *os << "text \"" << o.text << "\" pieces";
    for (const std::string& p : o.pieces) *os << ' ' << p;
    if (!o.error.empty()) *os << " error at " << o.errorOffset << ": " << o.error;
}

// Expands text with each "%%" replaced by `mark`; offsets are given in the text without the marks.
Outcome ExpandWithMarks(const std::string& original, const std::string& mark) {
    std::string text;
    std::vector<int64> markEnds;  // in `text`
    for (size_t from = 0;;) {
        const size_t at = original.find("%%", from);
        text += original.substr(from, at == std::string::npos ? std::string::npos : at - from);
        if (at == std::string::npos) break;
        text += mark;
        markEnds.push_back(static_cast<int64>(text.size()));
        from = at + 2;
    }
    auto unmarked = [&](const char* p) {
        int64 offset = OffsetIn(text, p);
        if (offset < 0) return offset;
        int64 shift = 0;
        for (int64 end : markEnds)
            if (end <= offset) shift += static_cast<int64>(mark.size());
        return offset - shift;
    };
    Outcome o;
    FileScopeVarFrame frame;
    OutputPieces pieces;
    try {
        MacroExpand(nullptr, &frame, BasicSubString(text), 0, 0, o.text, pieces);
    } catch (const LexScannerException& e) {
        o.error = e.GetMessage();
        o.errorOffset = unmarked(e.GetPosition());
        return o;
    }
    for (const OutputPiece& p : pieces.GetPieces()) {
        const int64 at = unmarked(p.source.begin());
        o.pieces.push_back(p.IsCopied() ? std::to_string(at) + "+" + std::to_string(p.size())
                                        : "=" + std::to_string(at) + ":" + std::to_string(p.length));
    }
    return o;
}

struct Case {
    const char* name;
    const char* text;
    const char* expected;  // the expansion, or the start of the error message
};

const Case kCases[] = {
    {"two arguments", "x greet(one, two) y\n@def greet(a, b) = {Hello a and b!%%}\nx greet(three, four) y\n",
     "x greet(one, two) y\nx Hello three and four! y\n"},
    {"an argument used three times", "@def m(a) = {a-a-a%%}\nm(x)\n", "x-x-x\n"},
    {"an argument invoking a macro", "@def g = {G}\n@def m(a) = {[a]%%}\nm(g g)\n", "[G G]\n"},
    {"argument names looked up with the invoker's names", "@def m(a, b) = {a b%%}\nm(b, a)\n", "b a\n"},
    {"nested calls", "@def m(a) = {<a>%%}\nm(m(m(x)))\n", "<<<x>>>\n"},
    {"a name defined after the macro", "@def m(a) = {Hello a%%}\n@def Hello = {Hi}\nm(x)\n", "Hi x\n"},
    {"indented lines of a body", "@def m(a) = {\n    line a\n    next a%%\n}\n  m(x)\n", nullptr},
    {"a call at a column", "    pre m(x\n) post\n@def m(a) = {[a]%%}\n    pre m(x y) post\n", nullptr},
    {"a quoted argument", "@def m(a, b) = {a|b%%}\nm(`p, q`, r)\n", "p, q|r\n"},
    {"a string in the body", "@def m(a) = {\"a\" a%%}\nm(x)\n", "\"a\" x\n"},
    {"a value variable in an argument", "@let int n = 7\n@def m(a) = {(a)%%}\nm(n)\n", "(7)\n"},
    {"an argument that fails", "@def g(x) = {x}\n@def m(a) = {[a]%%}\nm(g)\n",
     "( expected to begin argument list for macro g(x) when read "},
    {"an argument that fails in a nested call", "@def m(a, b) = {a+b%%}\nm(1, m(2, @fail(\"deep\")))\n", "deep"},
};

TEST(PlainBodyTest, ExpandsLikeTheGeneralWay) {
    for (const Case& c : kCases) {
        SCOPED_TRACE(c.name);
        const Outcome fast = ExpandWithMarks(c.text, "");
        const Outcome general = ExpandWithMarks(c.text, "@@");
        if (c.expected) {
            const std::string& got = fast.error.empty() ? fast.text : fast.error;
            EXPECT_EQ(got.substr(0, std::string(c.expected).size()), c.expected);
        }
        EXPECT_EQ(fast, general);
    }
}

// Output pieces of the fast way map every character back to where it came from.
TEST(PlainBodyTest, PiecesMapBodyAndArgumentsToTheirSource) {
    const std::string text = "@def greet(a, b) = {Hello a and b!}\nx greet(one, two) y\n";
    const Outcome o = ExpandWithMarks(text, "");
    EXPECT_EQ(o.text, "x Hello one and two! y\n");
    const int64 body = static_cast<int64>(text.find("Hello"));
    const int64 call = static_cast<int64>(text.find("x greet"));
    const int64 one = static_cast<int64>(text.find("one"));
    const int64 two = static_cast<int64>(text.find("two"));
    const int64 after = static_cast<int64>(text.find(") y")) + 1;
    const std::vector<std::string> expected = {
        std::to_string(call) + "+2",          std::to_string(body) + "+6",     std::to_string(one) + "+3",
        std::to_string(body + 7) + "+5",      std::to_string(two) + "+3",      std::to_string(body + 13) + "+1",
        std::to_string(after) + "+3",
    };
    EXPECT_EQ(o.pieces, expected);
}

// Each body is one level of nesting, as in the general way: the same depth gives the same error.
TEST(PlainBodyTest, CountsNestingLikeTheGeneralWay) {
    MacroNestingGuard::SetDepthLimitForTesting(40);
    std::string calls = "x";
    for (int i = 0; i < 30; ++i) calls = "m(" + calls + ")";
    const std::string text = "@def m(a) = {<a>%%}\n" + calls + "\n";
    const Outcome fast = ExpandWithMarks(text, "");
    const Outcome general = ExpandWithMarks(text, "@@");
    MacroNestingGuard::SetDepthLimitForTesting(0);
    EXPECT_NE(fast.error.find("Macro expansion nested too deeply"), std::string::npos) << fast.error;
    EXPECT_EQ(fast.error, general.error);
}

}  // namespace
}  // namespace orvan

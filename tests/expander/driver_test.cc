// Tests of the expansion driver: ordinary text and its layout, "@@", "@" before tokens that are no directive,
// "@" comments and vanishing statement lines, input and output indentation, value variables named "@word",
// dollar macros in string literals, scanning errors with their positions, and a fuzz loop over small texts.
// Every expansion is checked byte for byte and for the source address that each output position maps to.
#include <gtest/gtest.h>

#include <cstring>
#include <memory>
#include <random>
#include <string>
#include <vector>

#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/lexer/exceptions.h"
#include "support/test_support.h"

namespace orvan {
namespace {

using orvan::testing::ExactBuffer;
using orvan::testing::MessageOf;

struct Expansion {
    std::string out;
    OutputPieces pieces;
    // For every output position, the source offset it maps to (-1 for indentation).
    std::vector<int64> map;
};

Expansion ExpandText(VarFrame& frame, const ExactBuffer& text, int64 inputIndent = 0,
                     int64 outputIndent = 0) {
    Expansion e;
    MacroExpand(nullptr, &frame, text.view(), inputIndent, outputIndent, e.out, e.pieces);
    EXPECT_EQ(e.pieces.size(), static_cast<int64>(e.out.size())) << "the pieces must tile the output";
    if (e.pieces.size() == static_cast<int64>(e.out.size())) {
        OutputPiecesMonotonePosMapper mapper(e.pieces);
        for (int64 pos = 0; pos < e.pieces.size(); ++pos)
            e.map.push_back(text.Offset(mapper.MapOutputPositionToAddress(pos)));
    }
    return e;
}

// Every copied piece holds exactly the characters of its source range and every indentation piece blanks.
void ExpectPiecesMatchOutput(const Expansion& e) {
    int64 offset = 0;
    for (const OutputPiece& p : e.pieces.GetPieces()) {
        const std::string written = e.out.substr(static_cast<size_t>(offset), static_cast<size_t>(p.size()));
        if (p.IsCopied()) {
            EXPECT_EQ(written, p.source.GetString()) << "copied piece at output offset " << offset;
        } else if (!p.source.begin()) {
            EXPECT_EQ(written, std::string(written.size(), ' ')) << "indentation at output offset " << offset;
        }
        offset += p.size();
    }
}

std::vector<int64> Identity(size_t n) {
    std::vector<int64> v(n);
    for (size_t i = 0; i < n; ++i) v[i] = static_cast<int64>(i);
    return v;
}

// ---------------------------------------------------------------------------------------------------------
// Ordinary text, "@@", "@" comments, layout: everything here is copied text, so the expected map gives for
// each output character the source offset of the character it was copied from (-1: inserted indentation).
// An empty map means that the text is copied unchanged.

struct CopyCase {
    const char* name;
    std::string text;
    std::string expected;
    std::vector<int64> map;
    int64 inputIndent = 0;
    int64 outputIndent = 0;
};

const CopyCase kCopyCases[] = {
    {"plain text keeps its layout", "abc  def\n\n  ghi\t;(1+2)\n", "abc  def\n\n  ghi\t;(1+2)\n", {}},
    {"comments are copied with what is in them",
     "a // c @x @@\nb /* @@ y */ c",
     "a // c @x @@\nb /* @@ y */ c",
     {}},
    {"string literals are copied with what is in them", "\"@@ x\" '@@' r\"\\\"", "\"@@ x\" '@@' r\"\\\"", {}},
    {"@@ produces nothing", "a@@b", "ab", {0, 3}},
    {"@@ keeps the blanks around it", "x @@ y", "x  y", {0, 1, 4, 5}},
    {"@@ then @ before a word that names nothing", "a@@@b", "a@b", {0, 3, 4}},
    {"@@ at the start and the end", "@@x@@", "x", {2}},
    {"@ at the very end is copied", "abc @", "abc @", {}},
    {"@ alone", "@", "@", {}},
    {"@ before tokens that are no directive",
     "@5 @{ @} @'c' @\"s\" @$ @+ @. @) @]",
     "@5 @{ @} @'c' @\"s\" @$ @+ @. @) @]",
     {}},
    {"@ before words that name no directive",
     "@unknown @elseif (x) @If @ELSE @elsewhere",
     "@unknown @elseif (x) @If @ELSE @elsewhere",
     {}},
    {"@ then a blank and a comment then a word that names nothing", "a @ // c\nb", "a @ // c\nb", {}},
    {"@ comment after text takes the blank before it and the line feed",
     "abc @// note\ndef",
     "abcdef",
     {0, 1, 2, 13, 14, 15}},
    {"@ comment on a line of its own vanishes", "abc\n@// note\ndef", "abc\ndef", {0, 1, 2, 3, 13, 14, 15}},
    {"statement lines and the empty lines after them vanish, the next indentation stays",
     "abc\n  @// a\n\n  @/* b */\n  def",
     "abc\n  def",
     {0, 1, 2, 3, 24, 25, 26, 27, 28}},
    {"a block @ comment in the middle of a line takes the blanks after it", "a @/* x */ b", "ab", {0, 11}},
    {"an @ comment at the end of the text", "abc\n@// x", "abc\n", {0, 1, 2, 3}},
    {"an @ comment alone", "@// x\n", "", {}},
    {"a carriage return line end is kept", "a\r\nb\rc", "a\r\nb\rc", {}},
    {"a line feed removes the next line's input indentation",
     "x\n    y\n      z\n  w\n\tv",
     "x\ny\n  z\nw\nv",
     {0, 1, 6, 7, 12, 13, 14, 15, 18, 19, 21},
     4},
    {"a tab that does not fit the input indentation stays", "x\n\ty", "x\n\ty", {}, 2},
    {"the first line keeps its indentation", "  x\n  y", "  x\ny", {0, 1, 2, 3, 6}, 2},
    {"after a carriage return the indentation is not removed", "a\r\n  b", "a\r\n  b", {}, 2},
    {"nor after a vertical tab or a form feed", "a\v\n  b\f\n  c", "a\v\n  b\f\n  c", {}, 2},
    {"a statement line after a carriage return line end joins the lines", "a\r\n@// x\nb", "ab", {0, 9}},
    {"output indentation on every line, the first included",
     "x\ny",
     "  x\n  y",
     {-1, -1, 0, 1, -1, -1, 2},
     0,
     2},
    {"output indentation on an empty line",
     "x\n\ny",
     "  x\n  \n  y",
     {-1, -1, 0, 1, -1, -1, 2, -1, -1, 3},
     0,
     2},
    {"no output indentation after the final line feed", "x\n", " x\n", {-1, 0, 1}, 0, 1},
    {"input and output indentation together",
     "a\n  b\n    c",
     "   a\n   b\n     c",
     {-1, -1, -1, 0, 1, -1, -1, -1, 4, 5, -1, -1, -1, 8, 9, 10},
     2,
     3},
    {"a vanishing statement line removes the next line's input indentation",
     "a\n  @// s\n    b",
     "a\n  b",
     {0, 1, 12, 13, 14},
     2},
};

TEST(DriverTest, CopiesTextAndLayout) {
    for (const CopyCase& c : kCopyCases) {
        SCOPED_TRACE(c.name);
        FileScopeVarFrame frame;
        const ExactBuffer text(c.text);
        const Expansion e = ExpandText(frame, text, c.inputIndent, c.outputIndent);
        EXPECT_EQ(e.out, c.expected);
        EXPECT_EQ(e.map, c.map.empty() ? Identity(c.expected.size()) : c.map);
        ExpectPiecesMatchOutput(e);
    }
}

TEST(DriverTest, EmptyTextWritesNothingAndRecordsNoPiece) {
    FileScopeVarFrame frame;
    const ExactBuffer text("");
    std::string out = "old";
    OutputPieces pieces;
    pieces.push_back(OutputPiece(BasicSubString("x"), 3));
    MacroExpand(nullptr, &frame, text.view(), 0, 0, out, pieces);
    EXPECT_EQ(out, "");
    EXPECT_TRUE(pieces.GetPieces().empty()) << "the caller's former pieces are discarded";
    std::string plain = "old";
    MacroExpand(nullptr, &frame, text.view(), 0, 4, plain);
    EXPECT_EQ(plain, "");
}

TEST(DriverTest, ExpandsIntoAnOutputThatAlreadyHoldsText) {
    // The output is in the middle of a line: the first line of the expansion is not indented again.
    FileScopeVarFrame frame;
    const ExactBuffer text("x\ny");
    StringStream ss;
    ExpandedOutput out(&ss);
    out.WriteSubStringFromSourceFile(BasicSubString("ab"), 0);
    MacroExpand(nullptr, &frame, text.view(), 0, 4, out);
    EXPECT_EQ(ss.str(), "abx\n    y");
    EXPECT_EQ(out.size(), 9);
    EXPECT_EQ(out.GetColumnPos(), 5);
}

// ---------------------------------------------------------------------------------------------------------
// Value variables named "@word".

struct ValueCase {
    const char* name;
    std::string text;
    std::string expected;
    std::vector<int64> map;
    int64 outputIndent = 0;
};

TEST(DriverTest, AtWordWritesTheValueOfAValueVariable) {
    const ValueCase cases[] = {
        {"between blanks", "a @v b", "a 42 b", {0, 1, 2, 2, 4, 5}},
        {"next to other tokens", "a@v.b", "a42.b", {0, 1, 1, 3, 4}},
        {"with a blank after the @", "@ v", "42", {0, 0}},
        {"with a blank and a comment after the @", "@ /*c*/v!", "42!", {0, 0, 8}},
        {"@ and a comment with nothing between is an @ comment", "@/*c*/v!", "v!", {6, 7}},
        {"the name must match whole", "@vv @v1", "@vv @v1", {0, 1, 2, 3, 4, 5, 6}},
        {"the word alone is no name of it", "v", "v", {0}},
        {"a multi-line value is one calculated piece, indentation included",
         "@m",
         "  1\n  2",
         {0, 0, 0, 0, 0, 0, 0},
         2},
        {"an empty value", "<@e>", "<>", {0, 3}},
    };
    for (const ValueCase& c : cases) {
        SCOPED_TRACE(c.name);
        FileScopeVarFrame frame;
        frame.AddVariable(new LSValueVariable(LSV_Int, "@v", "42"));
        frame.AddVariable(new LSValueVariable(LSV_String, "@m", "1\n2"));
        frame.AddVariable(new LSValueVariable(LSV_String, "@e", ""));
        const ExactBuffer text(c.text);
        const Expansion e = ExpandText(frame, text, 0, c.outputIndent);
        EXPECT_EQ(e.out, c.expected);
        EXPECT_EQ(e.map, c.map);
    }
}

TEST(DriverTest, AtWordLooksInParentsButNotInImports) {
    FileScopeVarFrame file, imported;
    file.AddVariable(new LSValueVariable(LSV_Bool, "@p", "true"));
    imported.AddVariable(new LSValueVariable(LSV_Int, "@i", "1"));
    VarFrame child(&file);
    child.ImportFrame(&imported);
    const ExactBuffer text("@p @i");
    EXPECT_EQ(ExpandText(child, text).out, "true @i");
}

// ---------------------------------------------------------------------------------------------------------
// Dollar macros in double-quoted literals.

TEST(DriverTest, DollarMacrosReplaceTheLiteralAsOneCalculatedPiece) {
    FileScopeVarFrame frame;
    frame.InsertDollarMacro("HOME", "/h");
    const ExactBuffer text("x \"$(HOME)/a\" y");
    const Expansion e = ExpandText(frame, text);
    EXPECT_EQ(e.out, "x \"/h/a\" y");
    EXPECT_EQ(e.map, (std::vector<int64>{0, 1, 2, 2, 2, 2, 2, 2, 13, 14}));
    int calculated = 0;
    for (const OutputPiece& p : e.pieces.GetPieces()) {
        if (p.IsCopied()) continue;
        ++calculated;
        EXPECT_EQ(text.Offset(p.source.begin()), 2);
        EXPECT_EQ(text.Offset(p.source.end()), 13) << "the whole literal";
        EXPECT_EQ(p.length, 6);
    }
    EXPECT_EQ(calculated, 1);
}

TEST(DriverTest, DollarMacrosOnlyInDoubleQuotedLiteralsAndOnlyWhenDefined) {
    const struct {
        const char* name;
        std::string text;
        std::string expected;
    } cases[] = {
        {"several in one literal, to the fixed point", "\"$(HOME)$(A)\"", "\"/hb\""},
        {"a raw literal", "r\"$(HOME)\\\"", "r\"/h\\\""},
        {"undefined, malformed or no macro", "\"$(NOPE)\" \"$HOME\" \"$( HOME)\" \"plain\"",
         "\"$(NOPE)\" \"$HOME\" \"$( HOME)\" \"plain\""},
        {"single-quoted literals, comments and plain text", "'$(HOME)' // \"$(HOME)\"\n$(HOME)",
         "'$(HOME)' // \"$(HOME)\"\n$(HOME)"},
        {"after @ the literal is no dollar-macro literal", "@\"$(HOME)\"", "@\"$(HOME)\""},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        FileScopeVarFrame frame;
        frame.InsertDollarMacro("HOME", "/h");
        frame.InsertDollarMacro("A", "$(B)");
        frame.InsertDollarMacro("B", "b");
        const ExactBuffer text(c.text);
        EXPECT_EQ(ExpandText(frame, text).out, c.expected);
    }
}

TEST(DriverTest, DollarMacrosOfTheFileFrameReachNestedFramesAndImportedFiles) {
    FileScopeVarFrame file, other;
    other.InsertDollarMacro("OTHER", "o");
    file.AddImport(&other);
    VarFrame child(&file);
    const ExactBuffer text("\"$(OTHER)\"");
    EXPECT_EQ(ExpandText(child, text).out, "\"o\"");

    VarFrame noFile(nullptr);
    EXPECT_EQ(ExpandText(noFile, text).out, "\"$(OTHER)\"") << "a frame without a file frame has none";
}

// ---------------------------------------------------------------------------------------------------------
// Errors: the message and the position in the text.

struct ErrorCase {
    std::string text;
    std::string message;
    int64 position;
};

TEST(DriverTest, ErrorsSurfaceWithTheirPositions) {
    const ErrorCase cases[] = {
        {"it's", "Met EOS within single quoted string after reading 's", 4},
        {"a 'b\nc'", "Met line feed within single quoted string after reading 'b", 4},
        {"x \"abc", "Met EOS within double quoted string after reading \"abc", 6},
        {"x \"", "Met EOS within double quoted string", 3},
        {"x /* never", "Met EOS in middle of /* ... */ comment", 10},
        {"v = 1.", "Expected digit (not EOS) after decimal point (ie after reading '1.')", 6},
        {"1e+x", "Expected digit(s) (not x) for exponent after reading 1e+", 3},
        {"0xg", "Expected hex digit (not g) after 0x", 2},
        {"a ++= b", "Invalid token ++=", 5},
        {"a \x01", "Bad token \\x01", 2},
        {"\"\\q\"", "Invalid escape character q following backslash", 2},
        {"\"\\x4", "Expected hex character when reached EOS", 4},
        {"@ /* open", "Met EOS in middle of /* ... */ comment", 9},
        {"@/* open", "Met EOS in middle of /* ... */ comment", 8},
        {"ab\n  @else x", "@else with no matching @if directive", 6},
        {"@ else", "@else with no matching @if directive", 2},
        {"@ /**/else", "@else with no matching @if directive", 6},
        {"@import \"f\"", "@import statement not allowed here", 1},
        {"@importpath \"d\"", "@importpath statement not allowed here", 1},
    };
    for (const ErrorCase& c : cases) {
        SCOPED_TRACE(c.text);
        FileScopeVarFrame frame;
        const ExactBuffer text(c.text);
        std::string out = "untouched";
        OutputPieces pieces;
        pieces.push_back(OutputPiece(BasicSubString("kept"), 0));
        const char* position = nullptr;
        EXPECT_EQ(MessageOf([&] { MacroExpand(nullptr, &frame, text.view(), 0, 0, out, pieces); }, position),
                  c.message);
        EXPECT_EQ(text.Offset(position), c.position);
        EXPECT_EQ(out, "untouched") << "a failed expansion leaves the result alone";
        EXPECT_EQ(pieces.size(), 4);
    }
}

TEST(DriverTest, RecursiveDollarMacroIsReportedAtTheLiteral) {
    FileScopeVarFrame frame;
    frame.InsertDollarMacro("A", "<$(A)>");
    const ExactBuffer text("ok\n  \"$(A)\"");
    const char* position = nullptr;
    std::string out;
    EXPECT_EQ(MessageOf([&] { MacroExpand(nullptr, &frame, text.view(), 0, 0, out); }, position),
              "Recursive dollar macro A");
    EXPECT_EQ(text.Offset(position), 5);
}

// ---------------------------------------------------------------------------------------------------------
// Small random texts over the characters that matter to the driver, each expanded one byte longer at a time:
// no crash, no read outside the text, and on success pieces that tile the output and hold what they claim.
// Errors are allowed; their positions must lie in the text (or be null).

TEST(DriverFuzzTest, SmallRandomTextsGrownOneByteAtATime) {
    static constexpr char kAlphabet[] = "@(){}'\"/*\nab$ ";
    std::mt19937 rng(20240601);
    std::uniform_int_distribution<size_t> pick(0, sizeof kAlphabet - 2);
    std::uniform_int_distribution<int> length(1, 24);
    int succeeded = 0, failed = 0;
    for (int round = 0; round < 2500; ++round) {
        std::string full;
        const int n = length(rng);
        for (int i = 0; i < n; ++i) full += kAlphabet[pick(rng)];
        const int64 inputIndent = round % 3 == 0 ? 4 : 0;
        const int64 outputIndent = round % 5 == 0 ? 2 : 0;
        for (size_t size = 1; size <= full.size(); ++size) {
            const std::string prefix = full.substr(0, size);
            SCOPED_TRACE(::testing::PrintToString(prefix));
            FileScopeVarFrame frame;
            frame.AddVariable(new LSValueVariable(LSV_String, "@a", "A\nA"));
            frame.InsertDollarMacro("a", "$(b)");
            frame.InsertDollarMacro("b", "x");
            const ExactBuffer text(prefix);
            try {
                const Expansion e = ExpandText(frame, text, inputIndent, outputIndent);
                ExpectPiecesMatchOutput(e);
                for (int64 offset : e.map)
                    ASSERT_GE(offset, -1) << "an output position maps outside the text";
                ++succeeded;
            } catch (const LexScannerException& e) {
                ASSERT_GE(text.Offset(e.GetPosition()), -1)
                    << "error position outside the text: " << e.GetMessage();
                ++failed;
            } catch (const IException&) {
                ++failed;
            }
            if (::testing::Test::HasFatalFailure()) return;
        }
    }
    EXPECT_GT(succeeded, 1000);
    EXPECT_GT(failed, 1000);
}

}  // namespace
}  // namespace orvan

// Tests of the section scanners: arguments, bracketed sections, body blocks in their three forms, else
// detection, token equivalence, unquoting, trailing blanks, and every error with its position.
#include "ovmacro/lexer/section_scanners.h"

#include <gtest/gtest.h>

#include <cstring>
#include <functional>
#include <memory>
#include <string>

#include "ovmacro/lexer/exceptions.h"
#include "support/test_support.h"

namespace orvan {
namespace {

using orvan::testing::ExactBuffer;
using orvan::testing::MessageOf;

std::string Str(BasicSubString s) {
    return std::string(s.view());
}

// ScanArgument over an exact-size copy of input: the argument, the ending token's type and offset, the rest.
struct ScannedArgument {
    std::string arg;
    EToken ended;
    int64 endedAt;
    std::string rest;
};

ScannedArgument ScanArgumentOf(const char* input, EToken terminator) {
    const ExactBuffer buf(input);
    BasicSubString s = buf.view();
    BasicSubString arg;
    const LSToken ended = ScanArgument(s, arg, terminator);
    return {Str(arg), ended.GetType(), buf.Offset(ended.text.begin()), Str(s)};
}

// Runs a scanner on a fresh copy of the input and checks the message and offset of the error it raises.
void ExpectError(const char* input, const std::function<void(BasicSubString&)>& scan,
                 const std::string& message, int64 offset) {
    SCOPED_TRACE(::testing::PrintToString(std::string(input)));
    const ExactBuffer buf(input);
    const char* position = nullptr;
    EXPECT_EQ(MessageOf(
                  [&] {
                      BasicSubString s = buf.view();
                      scan(s);
                  },
                  position),
              message);
    EXPECT_EQ(buf.Offset(position), offset);
}

// ---------------------------------------------------------------------------------------------------------
// Arguments.

TEST(ScanArgumentTest, TokenAndBackquotedForms) {
    const struct {
        const char* input;
        EToken terminator;
        const char* arg;
        EToken ended;
        const char* rest;
    } cases[] = {
        {"f(x, y), z", TK_RPAREN, "f(x, y)", TK_COMMA, " z"},
        {"`a,b`)", TK_RPAREN, "a,b", TK_RPAREN, ""},
        {"\")\", x)", TK_RPAREN, "\")\"", TK_COMMA, " x)"},
        {"'(' )", TK_RPAREN, "'('", TK_RPAREN, ""},
        {" \n a + b  /* c */ ) tail", TK_RPAREN, "a + b", TK_RPAREN, " tail"},
        {"a // c, d\n, b", TK_RPAREN, "a", TK_COMMA, " b"},
        {", x", TK_RPAREN, "", TK_COMMA, " x"},
        {"  )", TK_RPAREN, "", TK_RPAREN, ""},
        // One bracket kind is tracked at a time; the others need no partner while it is open.
        {"(a[b), c", TK_RPAREN, "(a[b)", TK_COMMA, " c"},
        {"{a, (b}, c", TK_RPAREN, "{a, (b}", TK_COMMA, " c"},
        {"[a, (b]), c", TK_RPAREN, "[a, (b]", TK_RPAREN, ", c"},
        {"(x, (y)) )", TK_RPAREN, "(x, (y))", TK_RPAREN, ""},
        {"a ] b)", TK_RPAREN, "a ] b", TK_RPAREN, ""},
        {"x; y", TK_SEMICOLON, "x", TK_SEMICOLON, " y"},
        {"(a; b); c", TK_SEMICOLON, "(a; b)", TK_SEMICOLON, " c"},
        {"@/* c */ x, y", TK_RPAREN, "@/* c */ x", TK_COMMA, " y"},
        // The backquoted text is taken literally; whatever token follows it ends the argument.
        {"  `(a, \"` , b", TK_RPAREN, "(a, \"", TK_COMMA, " b"},
        {"``)", TK_RPAREN, "", TK_RPAREN, ""},
        {"`a(` b", TK_RPAREN, "a(", TK_IDENTIFIER, ""},
        {"`a`", TK_RPAREN, "a", TK_EOS, ""},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(::testing::PrintToString(std::string(c.input)));
        const ScannedArgument got = ScanArgumentOf(c.input, c.terminator);
        EXPECT_EQ(got.arg, c.arg);
        EXPECT_EQ(got.ended, c.ended);
        EXPECT_EQ(got.rest, c.rest);
    }
}

// An argument that is one name followed by white space and a comma or the terminator is read without tokens;
// everything else, including a name followed by anything else, is read token by token. Both ways must agree
// on the argument, the token that ended it and what is left.
TEST(ScanArgumentTest, SingleNamesReadLikeAnyOtherArgument) {
    const struct {
        const char* input;
        EToken terminator;
        const char* arg;
        EToken ended;
        int64 endedAt;  // offset of the one-character token that ended the argument
        const char* rest;
    } cases[] = {
        {"a, b)", TK_RPAREN, "a", TK_COMMA, 1, " b)"},
        {"abc  )", TK_RPAREN, "abc", TK_RPAREN, 5, ""},
        {"abc \t]", TK_RBRACKET, "abc", TK_RBRACKET, 5, ""},
        {"a\n,", TK_RPAREN, "a", TK_COMMA, 2, ""},
        {"a\r\n\v\f, x", TK_RBRACKET, "a", TK_COMMA, 5, " x"},
        {"_x9 ,", TK_RPAREN, "_x9", TK_COMMA, 4, ""},
        {"  \xC3\xA9t\xC3\xA9 ) z", TK_RPAREN, "\xC3\xA9t\xC3\xA9", TK_RPAREN, 8, " z"},
        {"r)", TK_RPAREN, "r", TK_RPAREN, 1, ""},
        {"a]", TK_RBRACKET, "a", TK_RBRACKET, 1, ""},
        // A raw literal's prefix is no name.
        {"r\"x\")", TK_RPAREN, "r\"x\"", TK_RPAREN, 4, ""},
        {"R'x', y]", TK_RBRACKET, "R'x'", TK_COMMA, 4, " y]"},
        // Whatever follows the name other than white space and the ending token makes it a longer argument.
        {"a b)", TK_RPAREN, "a b", TK_RPAREN, 3, ""},
        {"a(b), c)", TK_RPAREN, "a(b)", TK_COMMA, 4, " c)"},
        {"a.b, c", TK_RPAREN, "a.b", TK_COMMA, 3, " c"},
        {"a) ]", TK_RBRACKET, "a)", TK_RBRACKET, 3, ""},
        {"a) ;", TK_SEMICOLON, "a)", TK_SEMICOLON, 3, ""},
        // Comments between the name and the ending token are not part of the argument.
        {"a/*c*/,", TK_RPAREN, "a", TK_COMMA, 6, ""},
        {"a // c\n]", TK_RBRACKET, "a", TK_RBRACKET, 7, ""},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(::testing::PrintToString(std::string(c.input)));
        const ScannedArgument got = ScanArgumentOf(c.input, c.terminator);
        EXPECT_EQ(got.arg, c.arg);
        EXPECT_EQ(got.ended, c.ended);
        EXPECT_EQ(got.endedAt, c.endedAt);
        EXPECT_EQ(got.rest, c.rest);
    }

    // A name that is not followed by a comma or this terminator reads on to the end.
    const struct {
        const char* input;
        EToken terminator;
        const char* message;
        int64 offset;
    } errors[] = {
        {"a", TK_RPAREN, "Met EOS while reading argument a", 1},
        {" r", TK_RBRACKET, "Met EOS while reading argument r", 2},
        {"a  ", TK_RPAREN, "Met EOS while reading argument a  ", 3},
        {"a]", TK_RPAREN, "Met EOS while reading argument a]", 2},
        {"a)", TK_RBRACKET, "Met EOS while reading argument a)", 2},
        {"abc  )", TK_RBRACKET, "Met EOS while reading argument abc  )", 6},
        {"a b)", TK_RBRACKET, "Met EOS while reading argument a b)", 4},
        {"r\"x\")", TK_RBRACKET, "Met EOS while reading argument r\"x\")", 5},
        {"r\"x)", TK_RPAREN, "Met EOS within double quoted string after reading r\"x)", 4},
    };
    for (const auto& e : errors) {
        ExpectError(
            e.input,
            [&](BasicSubString& s) {
                BasicSubString arg;
                ScanArgument(s, arg, e.terminator);
            },
            e.message, e.offset);
    }
}

TEST(ScanArgumentTest, Errors) {
    const auto scan = [](BasicSubString& s) {
        BasicSubString arg;
        ScanArgument(s, arg, TK_RPAREN);
    };
    ExpectError("  (a, b", scan, "Met EOS while reading argument (a, b", 7);
    ExpectError("(a)", scan, "Met EOS while reading argument (a)", 3);
    ExpectError("  ", scan, "Met EOS while reading argument ", 2);
    ExpectError("", scan, "Met EOS while reading argument ", 0);
    ExpectError(" `abc, d)", scan, "Met EOS while reading argument `abc, d)", 9);
    ExpectError("`", scan, "Met EOS while reading argument `", 1);
    ExpectError("a 'x", scan, "Met EOS within single quoted string after reading 'x", 4);
    ExpectError(
        "a, \"b\nc\"",
        [](BasicSubString& s) {
            BasicSubString arg;
            ScanArgument(s, arg, TK_RPAREN);
            ScanArgument(s, arg, TK_RPAREN);
        },
        "Met line feed within double quoted string after reading \"b", 5);
}

// ---------------------------------------------------------------------------------------------------------
// Bracketed sections.

using SectionScanner = BasicSubString (*)(BasicSubString&, bool);

TEST(ScanBrackettedSectionTest, ReturnsTheInsideAndLeavesTheRest) {
    const struct {
        const char* input;
        SectionScanner scan;
        bool readOpen;
        const char* section;
        const char* rest;
    } cases[] = {
        {"( a + (b) ) rest", ScanRndBrackettedSection, true, "a + (b)", " rest"},
        {" \n ( x )", ScanRndBrackettedSection, true, "x", ""},
        {" a) b", ScanRndBrackettedSection, false, "a", " b"},
        {"()", ScanRndBrackettedSection, true, "", ""},
        {"(  \n )x", ScanRndBrackettedSection, true, "", "x"},
        {"(/* lead */ a /* trail */ ) x", ScanRndBrackettedSection, true, "/* lead */ a", " x"},
        {"(a, \")\", ')', `) z", ScanRndBrackettedSection, true, "a, \")\", ')', `", " z"},
        {"(a { b ) c", ScanRndBrackettedSection, true, "a { b", " c"},
        {"(a // )\n b) c", ScanRndBrackettedSection, true, "a // )\n b", " c"},
        {"[x[1]] y", ScanSquareBrackettedSection, true, "x[1]", " y"},
        {"{ {a} b } c", ScanCurlyBrackettedSection, true, "{a} b", " c"},
        {"a} b", ScanCurlyBrackettedSection, false, "a", " b"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(::testing::PrintToString(std::string(c.input)));
        const ExactBuffer buf(c.input);
        BasicSubString s = buf.view();
        EXPECT_EQ(Str(c.scan(s, c.readOpen)), c.section);
        EXPECT_EQ(Str(s), c.rest);
    }
}

TEST(ScanBrackettedSectionTest, Errors) {
    const auto round = [](BasicSubString& s) { ScanRndBrackettedSection(s, true); };
    const auto square = [](BasicSubString& s) { ScanSquareBrackettedSection(s, true); };
    const auto curly = [](BasicSubString& s) { ScanCurlyBrackettedSection(s, true); };
    ExpectError("x", round, "( expected when read x", 0);
    ExpectError("  ", round, "( expected when read EOS", 2);
    ExpectError(" /* c */ ;(", round, "( expected when read ;", 9);
    ExpectError("a", square, "[ expected when read a", 0);
    ExpectError(" [", curly, "{ expected when read [", 1);
    ExpectError("( a (b)", round, "Met EOS while reading bracketted section", 7);
    ExpectError("(", round, "Met EOS while reading bracketted section", 1);
    ExpectError("{ a ) ", curly, "Met EOS while reading bracketted section", 6);
    ExpectError(
        "a b", [](BasicSubString& s) { ScanRndBrackettedSection(s, false); },
        "Met EOS while reading bracketted section", 3);
    ExpectError("( \"a)", round, "Met EOS within double quoted string after reading \"a)", 5);
    ExpectError("( a /* )", round, "Met EOS in middle of /* ... */ comment", 8);
}

// ---------------------------------------------------------------------------------------------------------
// Blocks: block form (opening bracket on a later line), inline form, rest of line.

using BlockScanner = BasicSubString (*)(BasicSubString&, int64&);

TEST(ScanStringBlockTest, FormsAndIndentation) {
    const struct {
        const char* input;
        BlockScanner scan;
        const char* block;
        int64 indent;
        const char* rest;
    } cases[] = {
        // Inline form: only a line break directly after the bracket is dropped; the rest runs to the bracket.
        {" {abc}", ScanSubstString, "abc", 0, ""},
        {" {\n  abc\n}", ScanSubstString, "  abc\n", 0, ""},
        {" {\r\n  abc\r\n} x", ScanSubstString, "  abc\r\n", 0, " x"},
        {"{ a {b} c } tail", ScanSubstString, " a {b} c ", 0, " tail"},
        {"\t{}", ScanSubstString, "", 0, ""},
        {" {a /* } */ b}", ScanSubstString, "a /* } */ b", 0, ""},
        {" {'}' \"}\"}", ScanSubstString, "'}' \"}\"", 0, ""},
        {" (x) y", ScanRndBrackettedString, "x", 0, " y"},
        {"(\na)", ScanRndBrackettedString, "a", 0, ""},
        {"( a (b) )", ScanRndBrackettedString, " a (b) ", 0, ""},
        {"(a { b)", ScanRndBrackettedString, "a { b", 0, ""},
        // Block form: the first line's indentation is measured; the line break and indentation in front of
        // the closing bracket are dropped.
        {"\n{\n    line1\n    line2\n}", ScanSubstString, "line1\n    line2", 4, ""},
        {"\n{\n\tline1\n\tline2\n}", ScanSubstString, "line1\n\tline2", 4, ""},
        {"  \n{\n \tx\n  } after", ScanSubstString, "x", 5, " after"},
        {"\r\n{\r\n  a\r\n}", ScanSubstString, "a", 2, ""},
        {"\n{\n  a b c }", ScanSubstString, "a b c", 2, ""},
        {"\n{  x\n}", ScanSubstString, "x", 0, ""},
        {"\n{ \t\n  x \t}", ScanSubstString, "x", 2, ""},
        {"\n{\n}", ScanSubstString, "", 0, ""},
        {"\n{\n    }", ScanSubstString, "", 4, ""},
        {"\n{}", ScanSubstString, "", 0, ""},
        {"\n{\n\n}", ScanSubstString, "", 0, ""},
        {"\n{\n  a\n\n  }", ScanSubstString, "a\n", 2, ""},
        {"\n  // comment\n  {\n  x {y}\n  } z", ScanSubstString, "x {y}", 2, " z"},
        {"\n(\n  q\n)", ScanRndBrackettedString, "q", 2, ""},
        // Rest of the line when no opening brace stands there.
        {" rest of line\nnext", ScanSubstString, "rest of line", 0, "\nnext"},
        {" rest  \r\nnext", ScanSubstString, "rest  ", 0, "\r\nnext"},
        {"tail ", ScanSubstString, "tail ", 0, ""},
        {" a } b\n", ScanSubstString, "a } b", 0, "\n"},
        // Comments are skipped while looking for the opening bracket, even across a line break.
        {" // note\n{x}", ScanSubstString, "x", 0, ""},
        {" // note\nx", ScanSubstString, "// note", 0, "\nx"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(::testing::PrintToString(std::string(c.input)));
        const ExactBuffer buf(c.input);
        BasicSubString s = buf.view();
        int64 indent = -7;
        EXPECT_EQ(Str(c.scan(s, indent)), c.block);
        EXPECT_EQ(indent, c.indent);
        EXPECT_EQ(Str(s), c.rest);
    }
}

TEST(ScanStringBlockTest, OtherBracketKindsAndTexts) {
    const ExactBuffer buf("\n[\n  a [b]\n] c");
    BasicSubString s = buf.view();
    int64 indent = 0;
    EXPECT_EQ(Str(ScanStringBlock(s, indent, TK_LBRACKET, TK_RBRACKET, "[", "]", true)), "a [b]");
    EXPECT_EQ(indent, 2);
    EXPECT_EQ(Str(s), " c");
    ExpectError(
        "\n[\n a",
        [](BasicSubString& t) {
            int64 i = 0;
            ScanStringBlock(t, i, TK_LBRACKET, TK_RBRACKET, "[", "]", true);
        },
        "Met EOS before closing ]", 5);
}

TEST(ScanStringBlockTest, Errors) {
    const auto subst = [](BasicSubString& s) {
        int64 indent = 0;
        ScanSubstString(s, indent);
    };
    const auto rnd = [](BasicSubString& s) {
        int64 indent = 0;
        ScanRndBrackettedString(s, indent);
    };
    ExpectError("", subst, "Expected { when read EOS", 0);
    ExpectError("  \t\r", subst, "Expected { when read EOS", 4);
    ExpectError("", rnd, "Expected ( when read EOS", 0);
    ExpectError(" rest of line\nnext", rnd, "Expected ( when read rest", 1);
    ExpectError(" {x}", rnd, "Expected ( when read {", 1);
    ExpectError(" // c", rnd, "Expected ( when read EOS", 5);
    ExpectError("\nfoo {", subst, "Expected { when read foo", 1);
    ExpectError("\n", subst, "Expected { when read EOS", 1);
    ExpectError("\n  ", rnd, "Expected ( when read EOS", 3);
    ExpectError(" {", subst, "Met EOS before closing }", 2);
    ExpectError(" (", rnd, "Met EOS before closing )", 2);
    ExpectError(" {\r", subst, "Met EOS while reading bracketted string", 3);
    ExpectError(" {abc", subst, "Met EOS while reading bracketted string", 5);
    ExpectError(" (a (b)", rnd, "Met EOS while reading bracketted string", 7);
    ExpectError("\n{", subst, "Met EOS before closing }", 2);
    ExpectError("\n{\nabc", subst, "Met EOS before closing }", 6);
    ExpectError("\n{ {a}\n", subst, "Met EOS before closing }", 7);
    ExpectError(" {'abc\n}", subst, "Met line feed within single quoted string after reading 'abc", 6);
    ExpectError("\n{\n/* x }", subst, "Met EOS in middle of /* ... */ comment", 9);
    ExpectError(" \"abc", subst, "Met EOS within double quoted string after reading \"abc", 5);
}

// ---------------------------------------------------------------------------------------------------------
// Else and elseif.

TEST(ScanElseTest, RecognisesTheWordAfterAnAt) {
    const struct {
        const char* input;
        bool isElse;
        bool isElseIf;
    } cases[] = {
        {"@else", true, false},       {"@ else {x}", true, false},  {"@ /* c */ else", true, false},
        {" \n @else", true, false},   {"@\nelse", true, false},     {"@/* c */else", false, false},
        {"@elsewhere", false, false}, {"@elseif (x)", false, true}, {"@ elseif", false, true},
        {"else", false, false},       {"", false, false},           {"@", false, false},
        {"@ if", false, false},       {"@\"else\"", false, false},  {"@Else", false, false},
        {"x @else", false, false},    {"@// else\n", false, false},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(::testing::PrintToString(std::string(c.input)));
        const ExactBuffer buf(c.input);
        BasicSubString s = buf.view();
        EXPECT_EQ(ScanElseBlock(s), c.isElse);
        BasicSubString t = buf.view();
        EXPECT_EQ(ScanElseIfBlock(t), c.isElseIf);
    }
}

TEST(ScanElseTest, ConsumesTheTokens) {
    const ExactBuffer buf("@ else {x}");
    BasicSubString s = buf.view();
    ASSERT_TRUE(ScanElseBlock(s));
    EXPECT_EQ(Str(s), " {x}");
    BasicSubString t = buf.view();
    ASSERT_FALSE(ScanElseIfBlock(t));
    EXPECT_EQ(Str(t), " {x}");
}

// ---------------------------------------------------------------------------------------------------------
// Token equivalence.

TEST(TokenEquivalenceTest, ComparesTokenSequences) {
    const struct {
        const char* a;
        const char* b;
        bool equivalent;
    } cases[] = {
        {"a+b", "a /*x*/ + b", true},
        {"", "", true},
        {"", " // c\n /* d */", true},
        {"f(x,y)", "f ( x ,\n y )", true},
        {"\"a b\"", "\"a b\"", true},
        {"a", "a b", false},
        {"a b", "a", false},
        {"", "a", false},
        {"ab", "a b", false},
        {"0x1F", "0x1f", false},
        {"1.0", "1.00", false},
        {"\"x\"", "'x'", false},
        {"\"a b\"", "\"a  b\"", false},
        {"<<=", "<< =", false},
        {"@//x", "@ //x", false},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(::testing::PrintToString(std::string(c.a) + " | " + c.b));
        const ExactBuffer a(c.a);
        const ExactBuffer b(c.b);
        EXPECT_EQ(SubStringsAreTokenEquivalent(a.view(), b.view()), c.equivalent);
        EXPECT_EQ(SubStringsAreTokenEquivalent(b.view(), a.view()), c.equivalent);
    }
}

TEST(TokenEquivalenceTest, ScanningErrorsPropagate) {
    const ExactBuffer good("x");
    ExpectError(
        "\"abc", [&](BasicSubString& s) { SubStringsAreTokenEquivalent(s, good.view()); },
        "Met EOS within double quoted string after reading \"abc", 4);
    ExpectError(
        "x /*", [&](BasicSubString& s) { SubStringsAreTokenEquivalent(good.view(), s); },
        "Met EOS in middle of /* ... */ comment", 4);
}

// ---------------------------------------------------------------------------------------------------------
// Unquoting.

std::string Unquote(const char* input) {
    const ExactBuffer buf(input);
    StringStream ss;
    UnstringifyQuotedString(buf.view(), ss);
    return ss.GetString();
}

TEST(UnstringifyTest, DecodesTheQuotedString) {
    const struct {
        const char* input;
        std::string output;
    } cases[] = {
        {"\"a\\n\\x41\" trailing", "a\nA"},
        {"\"\"", ""},
        {"''", ""},
        {"'abc' 'def'", "abc"},
        {"'say \"hi\"'", "say \"hi\""},
        {"\"it's\"", "it's"},
        {"\"\\\\\\\"\"", "\\\""},
        {"'\\''", "'"},
        {"\"\\x4a\\x4A\\xff\"", "JJ\xff"},
        {"\"\\x00z\"", std::string("\0z", 2)},
        {"\"a\\tb\\0\\?\"", std::string("a\tb\0?", 5)},
        {"\"\r\"", "\r"},
        {"\"h\xC3\xA9\"", "h\xC3\xA9"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(::testing::PrintToString(std::string(c.input)));
        EXPECT_EQ(Unquote(c.input), c.output);
    }
}

TEST(UnstringifyTest, Errors) {
    const auto unquote = [](BasicSubString& s) {
        StringStream ss;
        UnstringifyQuotedString(s, ss);
    };
    ExpectError("", unquote, "Expected quoted string", 0);
    ExpectError("abc", unquote, "abc isn't a quoted string", 0);
    ExpectError("r\"abc\"", unquote, "r\"abc\" isn't a quoted string", 0);
    ExpectError(" \"a\"", unquote, " \"a\" isn't a quoted string", 0);
    ExpectError("\"", unquote, "Expected quoted string", 1);
    ExpectError("\"abc", unquote, "Met EOS in middle of string", 4);
    ExpectError("'abc\"", unquote, "Met EOS in middle of string", 5);
    ExpectError("\"ab\ncd\"", unquote, "Met end of line in middle of string", 3);
    ExpectError("\"ab\\", unquote, "Met EOS in middle of string", 4);
    ExpectError("\"\\x", unquote, "Expected hex character when reached EOS", 3);
    ExpectError("\"\\x4", unquote, "Expected hex character when reached EOS", 4);
    ExpectError("\"\\xg1\"", unquote, "Expected hex character when read g", 3);
    ExpectError("\"\\x4\"", unquote, "Expected hex character when read \"", 4);
    ExpectError("\"\\q\"", unquote, "qis not a valid escape character", 2);
    ExpectError("\"\\\n\"", unquote, "\\x0Ais not a valid escape character", 2);
}

TEST(UnstringifyTest, WritesNothingWhenTheStringIsBad) {
    for (const char* input : {"\"abc\\q\"", "\"abc", "\"abc\ndef\""}) {
        SCOPED_TRACE(input);
        const ExactBuffer buf(input);
        StringStream ss;
        EXPECT_THROW(UnstringifyQuotedString(buf.view(), ss), LexScannerException);
        EXPECT_EQ(ss.GetString(), "");
    }
}

// ---------------------------------------------------------------------------------------------------------
// Trailing blanks.

TEST(TrailingBlanksTest, RemovesSpacesAndTabsFromTheEnd) {
    const struct {
        const char* input;
        const char* remaining;
        int64 width;
    } cases[] = {
        {"ab \t ", "ab", 6}, {"", "", 0},        {"ab", "ab", 0},
        {" \t", "", 5},      {"a\n ", "a\n", 1}, {" a", " a", 0},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(::testing::PrintToString(std::string(c.input)));
        const ExactBuffer buf(c.input);
        BasicSubString s = buf.view();
        EXPECT_EQ(ScanBackwardsThroughSpacesAndTabs(s), c.width);
        EXPECT_EQ(Str(s), c.remaining);
        EXPECT_EQ(s.begin(), buf.view().begin());
    }
}

// ---------------------------------------------------------------------------------------------------------
// Input cut short anywhere: every scanner either returns views inside the buffer or raises a
// LexScannerException, and never reads past the end (AddressSanitizer checks the exact-size buffers).

TEST(TruncatedInputTest, EveryPrefixIsHandled) {
    const char* const texts[] = {
        "`a, (b` , f(x, [y]), {z}) rest",
        "( a + (b /* ) */) \")\" ) rest",
        "\n{\r\n\t line1 'x' \"y\\n\"\r\n  }\r\n@ else {a}",
        " {\r\n  abc {d} // }\n} @elseif",
        " (text (nested) `) tail",
        "\"a\\n\\x41\\\\\" trailing",
    };
    for (const char* text : texts) {
        const std::string full(text);
        for (size_t n = 0; n <= full.size(); ++n) {
            const std::string_view prefix(full.data(), n);
            SCOPED_TRACE(::testing::PrintToString(std::string(prefix)));
            const ExactBuffer buf(prefix);
            const BasicSubString all = buf.view();
            const auto inside = [&](BasicSubString v) {
                EXPECT_TRUE(v.empty() ||
                            (v.begin() >= all.begin() && v.end() <= all.end() && v.begin() <= v.end()));
            };
            const auto run = [&](const std::function<void(BasicSubString&)>& scan) {
                BasicSubString s = all;
                try {
                    scan(s);
                } catch (const LexScannerException& e) {
                    EXPECT_TRUE(e.GetPosition() >= all.begin() && e.GetPosition() <= all.end());
                }
                inside(s);
            };
            run([&](BasicSubString& s) {
                BasicSubString arg;
                for (LSToken t = ScanArgument(s, arg, TK_RPAREN); t.GetType() == TK_COMMA;
                     t = ScanArgument(s, arg, TK_RPAREN))
                    inside(arg);
                inside(arg);
            });
            run([&](BasicSubString& s) { inside(ScanRndBrackettedSection(s, true)); });
            run([&](BasicSubString& s) { inside(ScanCurlyBrackettedSection(s, false)); });
            run([&](BasicSubString& s) {
                int64 indent = 0;
                inside(ScanSubstString(s, indent));
                ScanElseBlock(s);
            });
            run([&](BasicSubString& s) {
                int64 indent = 0;
                inside(ScanRndBrackettedString(s, indent));
                ScanElseIfBlock(s);
            });
            run([&](BasicSubString& s) { SubStringsAreTokenEquivalent(s, all); });
            run([&](BasicSubString& s) {
                StringStream ss;
                UnstringifyQuotedString(s, ss);
            });
            run([&](BasicSubString& s) { ScanBackwardsThroughSpacesAndTabs(s); });
        }
    }
}

}  // namespace
}  // namespace orvan

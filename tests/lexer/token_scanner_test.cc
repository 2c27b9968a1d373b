// Tests of the token scanner: token kinds and texts, literal values, every error with its position, and the
// text of a written LexScannerException.
#include "ovmacro/lexer/token_scanner.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <climits>
#include <cmath>
#include <cstring>
#include <memory>
#include <string>
#include <vector>

#include "support/test_support.h"

namespace orvan {
namespace {

using orvan::testing::ExactBuffer;
using orvan::testing::MessageOf;

struct Tok {
    EToken type;
    std::string text;
    bool operator==(const Tok& o) const { return type == o.type && text == o.text; }
};

void PrintTo(const Tok& t, std::ostream* os) {
    *os << "{" << t.type << ", \"" << t.text << "\"}";
}

// Every token up to (not including) the end of the input.
std::vector<Tok> ScanAll(const ExactBuffer& buf, bool returnComments) {
    std::vector<Tok> out;
    BasicSubString s = buf.view();
    for (LSToken t = LsScanToken(s, returnComments); t; t = LsScanToken(s, returnComments))
        out.push_back({t.GetType(), t.GetTokenString()});
    return out;
}

std::vector<Tok> ScanAll(std::string_view text, bool returnComments = false) {
    return ScanAll(ExactBuffer(text), returnComments);
}

// ---------------------------------------------------------------------------------------------------------
// Operators: each one between two identifiers and at the very end of the input, so that the look-ahead is
// exercised both with and without a following character.

struct OperatorCase {
    const char* text;
    EToken kind;
};

// clang-format off
const OperatorCase kOperators[] = {
    {"+", TK_PLUS},       {"+=", TK_PLUS_EQ},        {"++", TK_PLUS_PLUS},
    {"<", TK_LT},         {"<=", TK_LE},             {"<<", TK_SHL},          {"<<=", TK_SHL_EQ},
    {">", TK_GT},         {">=", TK_GE},             {">>", TK_SHR},          {">>=", TK_SHR_EQ},
    {"&", TK_AMP},        {"&=", TK_AMP_EQ},         {"&&", TK_AND_AND},      {"&&=", TK_AND_AND_EQ},
    {"|", TK_BAR},        {"|=", TK_BAR_EQ},         {"||", TK_OR_OR},        {"||=", TK_OR_OR_EQ},
    {"^", TK_CARET},      {"^=", TK_CARET_EQ},       {"^^", TK_POWER},        {"^^=", TK_POWER_EQ},
    {"*", TK_STAR},       {"*=", TK_STAR_EQ},        {"/", TK_SLASH},         {"/=", TK_SLASH_EQ},
    {"%", TK_PERCENT},    {"%=", TK_PERCENT_EQ},     {"!", TK_BANG},          {"!=", TK_NE},
    {"=", TK_ASSIGN},     {"==", TK_EQ},             {"?", TK_QUESTION},      {"?=", TK_QUESTION_EQ},
    {"-", TK_MINUS},      {"--", TK_MINUS_MINUS},    {"-=", TK_MINUS_EQ},     {"->", TK_ARROW},
    {":", TK_COLON},      {"::", TK_COLON_COLON},    {"$", TK_DOLLAR},        {"$$", TK_DOLLAR_DOLLAR},
    {".", TK_DOT},        {",", TK_COMMA},           {";", TK_SEMICOLON},     {"(", TK_LPAREN},
    {")", TK_RPAREN},     {"{", TK_LBRACE},          {"}", TK_RBRACE},        {"[", TK_LBRACKET},
    {"]", TK_RBRACKET},   {"~", TK_TILDE},           {"@", TK_AT},            {"\\", TK_BACKSLASH},
    {"`", TK_BACKQUOTE},  {"#", TK_HASH},
};
// clang-format on

TEST(TokenScannerTest, EveryOperatorBetweenIdentifiersAndAtTheEnd) {
    for (const OperatorCase& c : kOperators) {
        SCOPED_TRACE(c.text);
        const std::string between = std::string("a") + c.text + "b";
        EXPECT_EQ(ScanAll(between),
                  (std::vector<Tok>{{TK_IDENTIFIER, "a"}, {c.kind, c.text}, {TK_IDENTIFIER, "b"}}));
        const std::string atEnd = std::string("a ") + c.text;
        EXPECT_EQ(ScanAll(atEnd), (std::vector<Tok>{{TK_IDENTIFIER, "a"}, {c.kind, c.text}}));
    }
}

struct SequenceCase {
    const char* input;
    std::vector<Tok> tokens;
};

class TokenSequenceTest : public ::testing::TestWithParam<SequenceCase> {};

TEST_P(TokenSequenceTest, ScansToTheExpectedTokens) {
    EXPECT_EQ(ScanAll(GetParam().input), GetParam().tokens);
}

INSTANTIATE_TEST_SUITE_P(
    Combinations, TokenSequenceTest,
    ::testing::Values(
        // Operators take at most three characters and single-character kinds never combine.
        SequenceCase{"a---b",
                     {{TK_IDENTIFIER, "a"}, {TK_MINUS_MINUS, "--"}, {TK_MINUS, "-"}, {TK_IDENTIFIER, "b"}}},
        SequenceCase{"**", {{TK_STAR, "*"}, {TK_STAR, "*"}}},
        SequenceCase{"!==", {{TK_NE, "!="}, {TK_ASSIGN, "="}}},
        SequenceCase{"===", {{TK_EQ, "=="}, {TK_ASSIGN, "="}}},
        SequenceCase{"<<<", {{TK_SHL, "<<"}, {TK_LT, "<"}}},
        SequenceCase{"&&&=", {{TK_AND_AND, "&&"}, {TK_AMP_EQ, "&="}}},
        SequenceCase{":::", {{TK_COLON_COLON, "::"}, {TK_COLON, ":"}}},
        SequenceCase{"$$$", {{TK_DOLLAR_DOLLAR, "$$"}, {TK_DOLLAR, "$"}}},
        SequenceCase{
            "((..@@",
            {{TK_LPAREN, "("}, {TK_LPAREN, "("}, {TK_DOT, "."}, {TK_DOT, "."}, {TK_AT, "@"}, {TK_AT, "@"}}},
        SequenceCase{"-->", {{TK_MINUS_MINUS, "--"}, {TK_GT, ">"}}},
        // Numbers end where their syntax ends.
        SequenceCase{"0", {{TK_INT, "0"}}}, SequenceCase{"017", {{TK_INT, "017"}}},
        SequenceCase{"00x1", {{TK_INT, "00"}, {TK_IDENTIFIER, "x1"}}},
        SequenceCase{"12abc", {{TK_INT, "12"}, {TK_IDENTIFIER, "abc"}}},
        SequenceCase{"0x1g", {{TK_HEX_INT, "0x1"}, {TK_IDENTIFIER, "g"}}},
        SequenceCase{"0XaF.5", {{TK_HEX_INT, "0XaF"}, {TK_DOT, "."}, {TK_INT, "5"}}},
        SequenceCase{".5", {{TK_DOT, "."}, {TK_INT, "5"}}}, SequenceCase{"0.5", {{TK_FLOAT, "0.5"}}},
        SequenceCase{"1.25.5", {{TK_FLOAT, "1.25"}, {TK_DOT, "."}, {TK_INT, "5"}}},
        SequenceCase{"1e5", {{TK_FLOAT, "1e5"}}},
        SequenceCase{"1E-3x", {{TK_FLOAT, "1E-3"}, {TK_IDENTIFIER, "x"}}},
        SequenceCase{"1.5e+10", {{TK_FLOAT, "1.5e+10"}}},
        SequenceCase{"-1", {{TK_MINUS, "-"}, {TK_INT, "1"}}},
        // Literals keep their quotes and prefix; r or R before a quote makes a raw literal.
        SequenceCase{"''", {{TK_SQ_STRING, "''"}}}, SequenceCase{"'abc'", {{TK_SQ_STRING, "'abc'"}}},
        SequenceCase{"\"\"", {{TK_DQ_STRING, "\"\""}}},
        SequenceCase{"\"a\\\"b\"c", {{TK_DQ_STRING, "\"a\\\"b\""}, {TK_IDENTIFIER, "c"}}},
        SequenceCase{"'\\''", {{TK_SQ_STRING, "'\\''"}}},
        SequenceCase{"\"a'b\"", {{TK_DQ_STRING, "\"a'b\""}}},
        SequenceCase{"\"a\rb\"", {{TK_DQ_STRING, "\"a\rb\""}}},
        SequenceCase{"r\"dir\\sub\\\"", {{TK_DQ_STRING, "r\"dir\\sub\\\""}}},
        SequenceCase{"R'a\\'", {{TK_SQ_STRING, "R'a\\'"}}},
        SequenceCase{"rx\"a\"", {{TK_IDENTIFIER, "rx"}, {TK_DQ_STRING, "\"a\""}}},
        SequenceCase{"r", {{TK_IDENTIFIER, "r"}}},
        SequenceCase{"r R", {{TK_IDENTIFIER, "r"}, {TK_IDENTIFIER, "R"}}},
        // Identifiers, including UTF-8 text.
        SequenceCase{"_a1 b_2", {{TK_IDENTIFIER, "_a1"}, {TK_IDENTIFIER, "b_2"}}},
        SequenceCase{"h\xC3\xA9llo w\xC3\xB6rld",
                     {{TK_IDENTIFIER, "h\xC3\xA9llo"}, {TK_IDENTIFIER, "w\xC3\xB6rld"}}},
        // White space of every kind separates tokens; comments are dropped.
        SequenceCase{" \t\v\f\r\na\r\n", {{TK_IDENTIFIER, "a"}}},
        SequenceCase{"a // c ) \nb", {{TK_IDENTIFIER, "a"}, {TK_IDENTIFIER, "b"}}},
        SequenceCase{"a/* x\n y */b", {{TK_IDENTIFIER, "a"}, {TK_IDENTIFIER, "b"}}},
        SequenceCase{"a/**/b", {{TK_IDENTIFIER, "a"}, {TK_IDENTIFIER, "b"}}},
        SequenceCase{"/* a /* b */ c */", {{TK_IDENTIFIER, "c"}, {TK_STAR, "*"}, {TK_SLASH, "/"}}},
        // "@" directly followed by a comment is one token, also at the end of the input.
        SequenceCase{"@// note\nx", {{TK_AT_COMMENT, "@// note"}, {TK_IDENTIFIER, "x"}}},
        SequenceCase{"@//", {{TK_AT_COMMENT, "@//"}}},
        SequenceCase{"@/* c */x", {{TK_AT_COMMENT, "@/* c */"}, {TK_IDENTIFIER, "x"}}},
        SequenceCase{"@ // c", {{TK_AT, "@"}}}, SequenceCase{"@/", {{TK_AT, "@"}, {TK_SLASH, "/"}}},
        SequenceCase{"@@//x", {{TK_AT, "@"}, {TK_AT_COMMENT, "@//x"}}}));

TEST(TokenScannerTest, CommentsAreReturnedOnRequest) {
    EXPECT_EQ(
        ScanAll("a // one\n/* two */ b", true),
        (std::vector<Tok>{
            {TK_IDENTIFIER, "a"}, {TK_COMMENT, "// one"}, {TK_COMMENT, "/* two */"}, {TK_IDENTIFIER, "b"}}));
    EXPECT_EQ(ScanAll("@// x", true), (std::vector<Tok>{{TK_AT_COMMENT, "@// x"}}));
}

TEST(TokenScannerTest, EndOfInputIsAnEmptyTokenAtTheEnd) {
    for (const char* text : {"", "   \n\t", "/* c */", "// c", " a "}) {
        SCOPED_TRACE(text);
        const ExactBuffer buf(text);
        BasicSubString s = buf.view();
        LSToken t = LsScanToken(s, false);
        if (t.GetType() == TK_IDENTIFIER) t = LsScanToken(s, false);
        EXPECT_EQ(t.GetType(), TK_EOS);
        EXPECT_FALSE(static_cast<bool>(t));
        EXPECT_TRUE(t.text.empty());
        EXPECT_EQ(buf.Offset(t.text.begin()), buf.size());
        EXPECT_EQ(buf.Offset(s.begin()), buf.size());
        // Asking again at the end keeps answering TK_EOS.
        EXPECT_EQ(LsScanToken(s, false).GetType(), TK_EOS);
    }
}

TEST(TokenScannerTest, HelpersThatFindNothingConsumeNothing) {
    const ExactBuffer buf("x'a'");
    BasicSubString s = buf.view();
    EXPECT_EQ(LsScanNumber(s), TK_NONE);
    EXPECT_FALSE(LsScanLiteralString(s, '\'', "single quoted string"));
    EXPECT_FALSE(LsScanLiteralCharacter(s));
    EXPECT_FALSE(LsScanEscapeCharacter(s));
    EXPECT_FALSE(LsScanComment(s));
    EXPECT_EQ(s.begin(), buf.view().begin());

    const ExactBuffer slash("/x");
    BasicSubString t = slash.view();
    EXPECT_FALSE(LsScanComment(t));
    EXPECT_EQ(t.begin(), slash.view().begin());
}

TEST(TokenScannerTest, AssignmentKindsAreExactlyTheFourteen) {
    const std::vector<EToken> assignments = {
        TK_AMP_EQ,   TK_BAR_EQ, TK_CARET_EQ, TK_SHL_EQ,   TK_SHR_EQ,  TK_AND_AND_EQ, TK_OR_OR_EQ,
        TK_POWER_EQ, TK_ASSIGN, TK_PLUS_EQ,  TK_MINUS_EQ, TK_STAR_EQ, TK_SLASH_EQ,   TK_PERCENT_EQ};
    for (int k = TK_NONE; k <= TK_HASH; k = (k == TK_NONE ? TK_EOS : k + 1)) {
        const EToken kind = static_cast<EToken>(k);
        const bool expected = std::find(assignments.begin(), assignments.end(), kind) != assignments.end();
        EXPECT_EQ(IsAssignmentToken(kind), expected) << k;
    }
}

TEST(TokenScannerTest, TokenComparisonAndOutput) {
    const char text[] = "abc abd";
    const LSToken a(TK_IDENTIFIER, text, text + 3);
    const LSToken b(TK_IDENTIFIER, text + 4, text + 7);
    const LSToken a2(TK_IDENTIFIER, BasicSubString("abc"));
    EXPECT_TRUE(a == a2);  // equal texts in different buffers
    EXPECT_TRUE(a != b);
    EXPECT_TRUE(LSToken(TK_INT, a.text) != a);
    EXPECT_TRUE(a == "abc");
    EXPECT_TRUE(a != "ab");
    EXPECT_TRUE(a == TK_IDENTIFIER);
    EXPECT_TRUE(a != TK_INT);
    EXPECT_EQ(LSToken().GetType(), TK_NONE);

    StringStream ss;
    ss << a << "|" << LSToken(TK_EOS) << "|" << LSToken(TK_EOS, text + 7, text + 7);
    EXPECT_EQ(ss.GetString(), "abc|EOS|EOS");
}

// ---------------------------------------------------------------------------------------------------------
// Literal values.

LSToken ScanOne(const std::string& text) {
    BasicSubString s(text);
    return LsScanToken(s, false);
}

struct IntCase {
    const char* text;
    int64 value64;
    int value32;
};

TEST(LiteralValueTest, DecimalIntegersWrapModuloTheirWidth) {
    const IntCase cases[] = {
        {"0", 0, 0},
        {"123", 123, 123},
        {"2147483647", 2147483647LL, INT_MAX},
        {"2147483648", 2147483648LL, INT_MIN},
        {"4294967296", 4294967296LL, 0},
        {"9223372036854775807", INT64_MAX, -1},
        {"9223372036854775808", INT64_MIN, 0},
        {"18446744073709551615", -1, -1},
        {"18446744073709551616", 0, 0},
        {"99999999999999999999999", 0x2c7e14af67fffffLL /* 10^23 - 1 mod 2^64 */, -159383553},
    };
    for (const IntCase& c : cases) {
        SCOPED_TRACE(c.text);
        const std::string text = c.text;
        const LSToken t = ScanOne(text);
        ASSERT_EQ(t.GetType(), TK_INT);
        EXPECT_EQ(t.GetLiteralInt64(), c.value64);
        EXPECT_EQ(t.GetLiteralInt32(), c.value32);
    }
}

TEST(LiteralValueTest, HexIntegersKeepTheirLowBits) {
    const IntCase cases[] = {
        {"0x0", 0, 0},
        {"0xff", 255, 255},
        {"0X1f", 31, 31},
        {"0x7fffffff", 0x7fffffff, INT_MAX},
        {"0x80000000", 0x80000000LL, INT_MIN},
        {"0x1FFFFFFFF", 0x1FFFFFFFFLL, -1},
        {"0x8000000000000000", INT64_MIN, 0},
        {"0xFFFFFFFFFFFFFFFF", -1, -1},
        {"0x10000000000000001", 1, 1},
        {"0x000000000000000000abc", 0xabc, 0xabc},
    };
    for (const IntCase& c : cases) {
        SCOPED_TRACE(c.text);
        const std::string text = c.text;
        const LSToken t = ScanOne(text);
        ASSERT_EQ(t.GetType(), TK_HEX_INT);
        EXPECT_EQ(t.GetLiteralHexInt64(), c.value64);
        EXPECT_EQ(t.GetLiteralHexInt32(), c.value32);
    }
}

TEST(LiteralValueTest, Doubles) {
    const struct {
        const char* text;
        double value;
    } cases[] = {{"1.5", 1.5}, {"1e3", 1000.0}, {"2.5E-1", 0.25}, {"0.0", 0.0}, {"1e400", HUGE_VAL}};
    for (const auto& c : cases) {
        SCOPED_TRACE(c.text);
        const std::string text = c.text;
        const LSToken t = ScanOne(text);
        ASSERT_EQ(t.GetType(), TK_FLOAT);
        EXPECT_EQ(t.GetLiteralDouble(), c.value);
    }
}

TEST(LiteralValueTest, StringsDecodeEscapesUnlessRaw) {
    const struct {
        const char* text;
        std::string value;
    } cases[] = {
        {"\"\"", ""},
        {"''", ""},
        {"'abc'", "abc"},
        {"\"\\x4A\"", "J"},
        {"\"\\x4a\\x4A\"", "JJ"},
        {"\"\\xff\"", "\xff"},
        {"\"a\\n\\t\\r\\0b\"", std::string("a\n\t\r\0b", 6)},
        {"\"\\\\ \\\" \\' \\?\"", "\\ \" ' ?"},
        {"'\\a\\b\\f\\v'", "\a\b\f\v"},
        {"r\"dir\\sub\\\"", "dir\\sub\\"},
        {"R'\\x41'", "\\x41"},
        {"r''", ""},
        {"\"it's\"", "it's"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.text);
        const std::string text = c.text;
        const LSToken t = ScanOne(text);
        ASSERT_TRUE(t.GetType() == TK_SQ_STRING || t.GetType() == TK_DQ_STRING);
        basic_xstring out = "previous content";
        t.GetLiteralString(out);
        EXPECT_EQ(out, c.value);
    }
}

TEST(LiteralValueTest, Characters) {
    const struct {
        const char* text;
        char value;
    } cases[] = {{"'a'", 'a'},    {"'\\n'", '\n'},  {"'\\x41'", 'A'},
                 {"'\\''", '\''}, {"'\\\\'", '\\'}, {"'\"'", '"'}};
    for (const auto& c : cases) {
        SCOPED_TRACE(c.text);
        const ExactBuffer buf(c.text);
        BasicSubString s = buf.view();
        ASSERT_TRUE(LsScanLiteralCharacter(s));
        EXPECT_TRUE(s.empty());
        EXPECT_EQ(LSToken(TK_SQ_STRING, buf.view()).GetLiteralCharacter(), c.value);
    }
}

// ---------------------------------------------------------------------------------------------------------
// Errors: the exact message and its offset into the input.

struct ErrorCase {
    const char* input;
    std::string message;
    int64 offset;
};

void PrintTo(const ErrorCase& c, std::ostream* os) {
    *os << ::testing::PrintToString(std::string(c.input));
}

// Scans the whole input and expects the error.
void ExpectScanError(const ErrorCase& c, bool returnComments) {
    const ExactBuffer buf(c.input);
    const char* position = nullptr;
    const std::string message = MessageOf(
        [&] {
            BasicSubString s = buf.view();
            while (LsScanToken(s, returnComments)) {
            }
        },
        position);
    EXPECT_EQ(message, c.message);
    EXPECT_EQ(buf.Offset(position), c.offset);
}

class ScanErrorTest : public ::testing::TestWithParam<ErrorCase> {};

TEST_P(ScanErrorTest, RaisesTheMessageAtItsPosition) {
    ExpectScanError(GetParam(), false);
    ExpectScanError(GetParam(), true);
}

INSTANTIATE_TEST_SUITE_P(
    Messages, ScanErrorTest,
    ::testing::Values(
        ErrorCase{"\x01", "Bad token \\x01", 0}, ErrorCase{"a \x7f b", "Bad token \\x7F", 2},
        ErrorCase{"x++=1", "Invalid token ++=", 4}, ErrorCase{"++=", "Invalid token ++=", 3},
        ErrorCase{"0x", "Expected hex digit (not EOS) after 0x", 2},
        ErrorCase{"a 0xg", "Expected hex digit (not g) after 0x", 4},
        ErrorCase{"0X.", "Expected hex digit (not .) after 0x", 2},
        ErrorCase{"1.", "Expected digit (not EOS) after decimal point (ie after reading '1.')", 2},
        ErrorCase{"x 12.y", "Expected digit (not y) after decimal point (ie after reading '12.')", 5},
        ErrorCase{"1.e5", "Expected digit (not e) after decimal point (ie after reading '1.')", 2},
        ErrorCase{"0.\n", "Expected digit (not \\x0A) after decimal point (ie after reading '0.')", 2},
        ErrorCase{"1e+", "Expected digit(s) (not EOS) for exponent after reading 1e+", 3},
        ErrorCase{"1ex", "Expected digit(s) (not x) for exponent after reading 1e", 2},
        ErrorCase{"2.5E-z", "Expected digit(s) (not z) for exponent after reading 2.5E-", 5},
        ErrorCase{"\"", "Met EOS within double quoted string", 1},
        ErrorCase{"a '", "Met EOS within single quoted string", 3},
        ErrorCase{"r\"", "Met EOS within double quoted string", 2},
        ErrorCase{"\"ab", "Met EOS within double quoted string after reading \"ab", 3},
        ErrorCase{"r'a\\", "Met EOS within single quoted string after reading r'a\\", 4},
        ErrorCase{"\"a\\\"", "Met EOS within double quoted string after reading \"a\\\"", 4},
        ErrorCase{"\"ab\ncd\"", "Met line feed within double quoted string after reading \"ab", 3},
        ErrorCase{"R'x\n'", "Met line feed within single quoted string after reading R'x", 3},
        ErrorCase{"'\n'", "Met line feed within single quoted string after reading '", 1},
        ErrorCase{"\"a\\", "Expected escape character following backslash when reached EOS", 3},
        ErrorCase{"\"\\x4", "Expected hex character when reached EOS", 4},
        ErrorCase{"'\\x", "Expected hex character when reached EOS", 3},
        ErrorCase{"\"\\x\"", "Expected hex character when read \"", 3},
        ErrorCase{"\"\\x4g\"", "Expected hex character when read g", 4},
        ErrorCase{"\"\\q\"", "Invalid escape character q following backslash", 2},
        ErrorCase{"'\\\n'", "Invalid escape character \\x0A following backslash", 2},
        ErrorCase{"/* never closed", "Met EOS in middle of /* ... */ comment", 15},
        ErrorCase{"a /*/", "Met EOS in middle of /* ... */ comment", 5},
        ErrorCase{"@/* x", "Met EOS in middle of /* ... */ comment", 5}));

// A NUL byte is a bad token too; it needs an explicit length, which the table's C strings cannot carry.
TEST(TokenScannerTest, BadTokenForAnEmbeddedNul) {
    const ExactBuffer buf(std::string_view("a\0", 2));
    const char* position = nullptr;
    EXPECT_EQ(MessageOf(
                  [&] {
                      BasicSubString s = buf.view();
                      while (LsScanToken(s, false)) {
                      }
                  },
                  position),
              "Bad token \\x00");
    EXPECT_EQ(buf.Offset(position), 1);
}

TEST(TokenScannerTest, InputIsLeftWhereTheErrorWasFound) {
    const ExactBuffer buf("a \"b\nc\"");
    BasicSubString s = buf.view();
    LsScanToken(s, false);
    EXPECT_THROW(LsScanToken(s, false), LexScannerException);
    EXPECT_EQ(buf.Offset(s.begin()), 4);
}

class LiteralCharacterErrorTest : public ::testing::TestWithParam<ErrorCase> {};

TEST_P(LiteralCharacterErrorTest, RaisesTheMessageAtItsPosition) {
    const ExactBuffer buf(GetParam().input);
    const char* position = nullptr;
    const std::string message = MessageOf(
        [&] {
            BasicSubString s = buf.view();
            LsScanLiteralCharacter(s);
        },
        position);
    EXPECT_EQ(message, GetParam().message);
    EXPECT_EQ(buf.Offset(position), GetParam().offset);
}

INSTANTIATE_TEST_SUITE_P(
    Messages, LiteralCharacterErrorTest,
    ::testing::Values(
        ErrorCase{"'", "Read EOS while trying to read literal character enclosed in single quotes", 1},
        ErrorCase{"''", "Read ' while trying to read literal character enclosed in single quotes", 1},
        ErrorCase{"'\t'", "Read \\x09 while trying to read literal character enclosed in single quotes", 1},
        ErrorCase{"'\n'", "Read \\x0A while trying to read literal character enclosed in single quotes", 1},
        ErrorCase{"'\r'", "Read \\x0D while trying to read literal character enclosed in single quotes", 1},
        ErrorCase{"'ab'", "Expected second single quote (not b) for literal character", 2},
        ErrorCase{"'a", "Expected second single quote (not EOS) for literal character", 2},
        ErrorCase{"'\\n", "Expected second single quote (not EOS) for literal character", 3},
        ErrorCase{"'\\q'", "Invalid escape character q following backslash", 2},
        ErrorCase{"'\\x4'", "Expected hex character when read '", 4}));

TEST(ReadGivenTokenTest, AcceptsTheKindOrRaisesTheCallersMessageAtTheToken) {
    const ExactBuffer ok(" /* c */ ( x");
    BasicSubString s = ok.view();
    ReadGivenToken(s, TK_LPAREN, "unused");
    EXPECT_EQ(ok.Offset(s.begin()), 10);

    const struct {
        const char* input;
        int64 offset;
    } cases[] = {{"  foo(", 2}, {"", 0}, {" // c", 5}};
    for (const auto& c : cases) {
        SCOPED_TRACE(c.input);
        const ExactBuffer buf(c.input);
        const char* position = nullptr;
        EXPECT_EQ(MessageOf(
                      [&] {
                          BasicSubString t = buf.view();
                          ReadGivenToken(t, TK_LPAREN, "Expected ( after the name");
                      },
                      position),
                  "Expected ( after the name");
        EXPECT_EQ(buf.Offset(position), c.offset);
    }
}

// ---------------------------------------------------------------------------------------------------------
// The written form of an exception.

TEST(LexScannerExceptionTest, WriteFormsByWhatIsKnown) {
    const struct {
        std::string file;
        int64 line;
        std::string expected;
    } cases[] = {
        {"macros", 12, "macros(12) : error : Met EOS"},
        {"macros", 0, "macros(0) : error : Met EOS"},
        {"dir/a b.txt", -1, "dir/a b.txt : error : Met EOS"},
        {"", 3, "Line 3: error : Met EOS"},
        {"", -1, "error : Met EOS"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.expected);
        LexScannerException e("Met EOS", static_cast<const char*>(nullptr));
        if (!c.file.empty() || c.line != -1) e.SetFileNameAndLine(c.file, c.line);
        StringStream ss;
        e.Write(ss);
        EXPECT_EQ(ss.GetString(), c.expected);
    }
}

TEST(LexScannerExceptionTest, ConstructorsTakeThePositionAndStartUnlocated) {
    const char text[] = "abc";
    const LexScannerException fromPointer("m", text + 1);
    const LexScannerException fromView("m", BasicSubString(text + 2, text + 3));
    const LexScannerException fromToken("m", LSToken(TK_IDENTIFIER, text, text + 3));
    EXPECT_EQ(fromPointer.GetPosition(), text + 1);
    EXPECT_EQ(fromView.GetPosition(), text + 2);
    EXPECT_EQ(fromToken.GetPosition(), text);
    EXPECT_EQ(fromToken.GetFileName(), "");
    EXPECT_EQ(fromToken.GetLine(), -1);
    EXPECT_STREQ(fromToken.what(), "m");

    LexScannerException copy = fromPointer;
    copy.AppendToMessage("\n    invoking macro x");
    EXPECT_EQ(copy.GetMessage(), "m\n    invoking macro x");
    EXPECT_EQ(copy.GetPosition(), text + 1);
    EXPECT_EQ(fromPointer.GetMessage(), "m");
    // Caught through the root type, it writes the same text.
    try {
        throw copy;
    } catch (const IException& e) {
        StringStream ss;
        e.Write(ss);
        EXPECT_EQ(ss.GetString(), "error : m\n    invoking macro x");
    }
}

}  // namespace
}  // namespace orvan

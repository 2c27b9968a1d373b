// Tests of numbers and characters as text: double formatting that reads back exactly, quoted literals that
// the token scanner reads back to the same characters, re-indenting and replacing.
#include "ovmacro/foundations/text_format.h"

#include <gtest/gtest.h>

#include <cfloat>
#include <cmath>
#include <cstdlib>
#include <limits>
#include <random>
#include <string>

#include "ovmacro/lexer/token_scanner.h"

namespace orvan {
namespace {

TEST(ToStringTest, DoublesAreShortestAndNeverReadAsIntegers) {
    const double inf = std::numeric_limits<double>::infinity();
    const struct {
        double value;
        const char* text;
    } cases[] = {
        {2.5, "2.5"},
        {3.0, "3.0"},
        {-3.0, "-3.0"},
        {0.0, "0.0"},
        {-0.0, "-0.0"},
        {100.0, "100.0"},
        {0.1, "0.1"},
        {1.0 / 3.0, "0.3333333333333333"},
        {1e20, "1e+20"},
        {1e-7, "1e-07"},
        {123456789.0, "123456789.0"},
        {DBL_MAX, "1.7976931348623157e+308"},
        {4.9406564584124654e-324, "5e-324"},
        {inf, "inf"},
        {-inf, "-inf"},
        {std::nan(""), "nan"},
        {-std::nan(""), "nan"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.text);
        EXPECT_EQ(ToString(c.value), c.text);
        char buf[40];
        const int64 n = FormatDouble(c.value, buf);
        EXPECT_EQ(std::string(buf, static_cast<size_t>(n)), c.text);
    }
}

TEST(ToStringTest, DoublesReadBackExactly) {
    std::mt19937_64 rng(12345);
    for (int i = 0; i < 20000; ++i) {
        const uint64 bits = rng();
        double v;
        std::memcpy(&v, &bits, sizeof v);
        if (!std::isfinite(v)) continue;
        const basic_xstring text = ToString(v);
        ASSERT_EQ(std::strtod(text.c_str(), nullptr), v) << text;
        // Always recognisable as a floating-point number, never as an integer.
        ASSERT_NE(text.find_first_of(".e"), basic_xstring::npos) << text;
    }
}

// The characters that the token scanner decodes from a quoted literal.
basic_xstring Decode(const basic_xstring& literal, EToken expectedKind) {
    BasicSubString s(literal);
    const LSToken t = LsScanToken(s, false);
    EXPECT_EQ(t.GetType(), expectedKind) << literal;
    EXPECT_TRUE(s.empty()) << "one token: " << literal;
    basic_xstring out;
    t.GetLiteralString(out);
    return out;
}

TEST(QuotedLiteralTest, EscapesOfEachKindOfCharacter) {
    const struct {
        char c;
        const char* single;    // MakeSingleQuotedLiteralChar
        const char* inDouble;  // WriteCharForCStyleLiteralConstants
    } cases[] = {
        {'a', "'a'", "a"},
        {' ', "' '", " "},
        {'~', "'~'", "~"},
        {'\'', "'\\''", "'"},  // the delimiting quote is escaped, the other one is not
        {'"', "'\"'", "\\\""},
        {'\\', "'\\\\'", "\\\\"},
        {'\n', "'\\n'", "\\n"},
        {'\r', "'\\r'", "\\r"},
        {'\t', "'\\t'", "\\t"},
        {'\xE9', "'\xE9'", "\xE9"},  // bytes >= 0x80 as they are
        {'\xFF', "'\xFF'", "\xFF"},
        // Other control bytes: three-digit octal in string literals, which C reads unambiguously whatever
        // follows; a hex escape in a character literal, which the token scanner reads back to the byte.
        {'\0', "'\\x00'", "\\000"},
        {'\x01', "'\\x01'", "\\001"},
        {'\x1B', "'\\x1B'", "\\033"},
        {'\x7F', "'\\x7F'", "\\177"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(static_cast<int>(static_cast<unsigned char>(c.c)));
        EXPECT_EQ(MakeSingleQuotedLiteralChar(c.c), c.single);
        StringStream ss;
        WriteCharForCStyleLiteralConstants(ss, c.c);
        EXPECT_EQ(ss.GetString(), c.inDouble);
        EXPECT_EQ(MakeDoubleQuotedString(BasicSubString(&c.c, &c.c + 1)),
                  std::string("\"") + c.inDouble + "\"");
    }
    EXPECT_EQ(MakeDoubleQuotedString(BasicSubString("")), "\"\"");
    EXPECT_EQ(MakeDoubleQuotedString(BasicSubString("say \"hi\"\n")), "\"say \\\"hi\\\"\\n\"");
}

TEST(QuotedLiteralTest, EveryCharacterLiteralReadsBackAsThatCharacter) {
    // Char values are stored as these literals and read again by the expression language.
    for (int i = 0; i < 256; ++i) {
        const char c = static_cast<char>(i);
        SCOPED_TRACE(i);
        EXPECT_EQ(Decode(MakeSingleQuotedLiteralChar(c), TK_SQ_STRING), std::string(1, c));
    }
}

TEST(QuotedLiteralTest, StringLiteralsOfPrintableTextReadBack) {
    const std::string texts[] = {"", "plain", "a\"b'c\\d", "tab\there\r\nnew line", "caf\xC3\xA9 \\x41 $(X)"};
    for (const std::string& text : texts) {
        SCOPED_TRACE(text);
        EXPECT_EQ(Decode(MakeDoubleQuotedString(BasicSubString(text)), TK_DQ_STRING), text);
    }
}

struct IndentCase {
    const char* text;
    int64 indent;
    const char* expected;
};

TEST(WriteSubStringWithAdjustedIndentTest, RemovesIndentationAfterEachLineFeed) {
    const IndentCase cases[] = {
        {"a\n    b\n  c", 2, "a\n  b\nc"},
        {"    a\n    b", 4, "    a\nb"},  // the first line is written as it is
        {"x\n\ty", 4, "x\ny"},            // a tab is 4 columns
        {"x\n\ty", 3, "x\n\ty"},          // and is not split
        {"x\n  \n\n  y", 2, "x\n\n\ny"},  // blank and empty lines
        {"x\n", 4, "x\n"},
        {"\n  x", 4, "\nx"},
        {"", 4, ""},
        {"a\n  b", 0, "a\n  b"},
        {"a\r\n  b", 2, "a\r\nb"},  // the line feed counts, the carriage return is text
    };
    for (const IndentCase& c : cases) {
        SCOPED_TRACE(c.text);
        StringStream ss;
        WriteSubStringWithAdjustedIndent(ss, BasicSubString(c.text), c.indent);
        EXPECT_EQ(ss.GetString(), c.expected);
    }
}

TEST(StringFindAndReplaceTest, ReplacesEveryOccurrenceWithoutRescanning) {
    const struct {
        const char* text;
        const char* what;
        const char* with;
        const char* expected;
        int64 count;
    } cases[] = {
        // clang-format off
        {"aaa", "a", "bb", "bbbbbb", 3},
        {"abcabc", "bc", "", "aa", 2},
        {"abc", "x", "y", "abc", 0},
        {"aaaa", "aa", "a", "aa", 2},        // non-overlapping, left to right
        {"aaa", "aa", "b", "ba", 1},
        {"a.b.c", ".", "..", "a..b..c", 2},  // the replacement is not searched again
        {"abc", "", "x", "abc", 0},          // an empty pattern replaces nothing
        {"", "a", "b", "", 0},
        {"xyz", "xyz", "", "", 1},
        // clang-format on
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(std::string(c.text) + " / " + c.what + " / " + c.with);
        basic_xstring text = c.text;
        EXPECT_EQ(StringFindAndReplace(text, c.what, c.with), c.count);
        EXPECT_EQ(text, c.expected);
    }
}

}  // namespace
}  // namespace orvan

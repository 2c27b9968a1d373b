// The expression parser: precedence and associativity of every level, evaluation of both operands, errors
// with their messages and positions, the typed Parse... family and the steps of ParserBase.
#include "ovmacro/expr/expression_parser.h"

#include <gtest/gtest.h>

#include <limits>
#include <string>

#include "expr_test_util.h"
#include "ovmacro/expr/parser_base.h"
#include "support/test_support.h"

namespace orvan::testing {
namespace {

struct EvalCase {
    const char* text;
    std::string expected;  // Show() of the value, or "!" + message + "@" + offset of the position
};

TEST(ExpressionParserTest, PrecedenceAndAssociativity) {
    const EvalCase cases[] = {
        // Every infix level is left-associative, the power level included.
        {"1 - 2 - 3", "int64 -4"},
        {"2 ^^ 3 ^^ 2", "int64 64"},
        {"8 >> 1 >> 1", "int64 2"},
        {"100 / 10 / 5", "int64 2"},
        {"1 < 2 < 3", "!Incompatible types (bool and int64) for comparison operation@9"},
        // Each level against the next: the tighter one is evaluated first.
        {"true || false && false", "bool true"},                                           // && over ||
        {"false && true | 1", "!Incompatible types (bool and int64) for | operation@17"},  // | over &&
        {"1 | 2 ^ 3 & 5", "int64 3"},                                                      // & over ^ over |
        {"6 & 3 == 3", "!Incompatible types (int64 and bool) for & operation@10"},         // == over &
        {"5 > 3 == 2 < 4", "bool true"},  // relational over equality
        {"1 < 2 == true", "bool true"},
        {"1 << 2 < 5", "bool true"},  // shift over relational
        {"1 << 2 + 1", "int64 8"},    // additive over shift
        {"1 + 2 << 1", "int64 6"},
        {"2 + 3 * 4", "int64 14"},  // multiplicative over additive
        {"7 - 2 + 1", "int64 6"},
        {"2 * 3 % 4", "int64 2"},
        {"10 / 3 * 3", "int64 9"},
        {"2 * 3 ^^ 2", "int64 18"},  // power over multiplicative
        {"-2 ^^ 2", "int64 4"},      // unary over power
        {"-2 ^^ 3", "int64 -8"},
        {"~1 + 1", "int64 -1"},
        {"!true == false", "bool true"},
        {"- - 3", "int64 3"},
        {"-+-+3", "int64 3"},
        {"!!true", "bool true"},
        {"-'abc'[1]", "!Incompatible type (char) for unary - operation@9"},  // postfix over unary
        {"(1 + 2) * 3", "int64 9"},
        {"2 ^^ -1", "int64 0"},
        // The conditional groups to the right, binds looser than ||, and its middle is a full expression.
        // The branch not taken is evaluated too, so its non-bool condition is an error.
        {"true ? 1 : 0 ? 2 : 3", "!No implicit conversion from int64 to bool@20"},
        {"true ? 1 : false ? 2 : 3", "int64 1"},
        {"false ? 1 : false ? 2 : 3", "int64 3"},
        {"false ? 1 : true ? 2 : 3", "int64 2"},
        {"true ? 1 : 2 + 3", "int64 1"},
        {"(true ? 1 : 2) + 3", "int64 4"},
        {"false || true ? 'y' : 'n'", "string y"},
        {"true ? false ? 1 : 2 : 3", "int64 2"},
        {"1 ? 2 : 3", "!No implicit conversion from int64 to bool@9"},
        // No short-circuit: both operands, and both branches, are evaluated.
        {"false && (1 / 0 == 0)", "!Division by zero error@16"},
        {"true || 1 / 0", "!Division by zero error@13"},
        {"true ? 1 : 1 / 0", "!Division by zero error@16"},
        {"false ? 1 / 0 : 1", "!Division by zero error@14"},
        // Assignment operators parse, evaluate their operation, and then fail: values are r-values.
        {"1 = 2", "!Can't assign to int64 r-value@5"},
        {"1 += 2", "!Can't assign to int64 r-value@6"},
        {"1.5 = 2", "!Can't assign to float64 r-value@7"},
        {"'a' += 1", "!Incompatible types (string and int64) for + operation@8"},
        {"1 /= 0", "!Division by zero error@6"},
        {"true &&= 1", "!No implicit conversion from int64 to bool@10"},
        {"false ||= true", "!Can't assign to bool r-value@14"},
        {"2 ^^= 3", "!Can't assign to int64 r-value@7"},
        {"0 ^^= -1", "!Calculation 0.0 ^^ -1.0 ill defined@8"},
        {"true ? 1 : 2 = 3", "!Can't assign to int64 r-value@16"},  // assignment below the conditional
        {"1 = (2 + 3) 4", "!Can't assign to int64 r-value@12"},
    };
    for (const EvalCase& c : cases) EXPECT_EQ(Eval(c.text), c.expected) << c.text;
}

TEST(ExpressionParserTest, SyntaxErrorsAndPositions) {
    const EvalCase cases[] = {
        {"", "!Unexpected EOS after EOS in expression@0"},
        {"   ", "!Unexpected EOS after EOS in expression@3"},
        {"++1", "!Unexpected ++ after EOS in expression@0"},
        {"--1", "!Unexpected -- after EOS in expression@0"},
        {"1 + ", "!Unexpected EOS after + in expression@4"},
        {"1 + )", "!Unexpected ) after + in expression@4"},
        {"(1", "!Expected ) after 1 when read EOS@2"},
        {"(1 2)", "!Expected ) after 1 when read 2@3"},
        {"1 ? 2 3", "!Expected : after 2 when read 3@6"},
        {"1 ? 2", "!Expected : after 2 when read EOS@5"},
        {"1 += += 2", "!Unexpected += after += in expression@5"},
        {"1 +/* comment */", "!Unexpected EOS after + in expression@16"},
        {"@", "!Unexpected @ after EOS in expression@0"},
        {"(1 / 0) + 2", "!Division by zero error@6"},  // at the token after the right operand
        {"1 / 0 + 2", "!Division by zero error@6"},
        {"1 +\n\"abc", "!Met EOS within double quoted string after reading \"abc@8"},
    };
    for (const EvalCase& c : cases) EXPECT_EQ(Eval(c.text), c.expected) << c.text;
}

TEST(ExpressionParserTest, StopsAtTheFirstTokenAfterTheExpression) {
    const std::string text = "1 + 2 3";
    ExpressionParser p;
    p.Init(text);
    LSLiteral r;
    p.ParseExpression(r);
    EXPECT_EQ(Show(r), "int64 3");
    EXPECT_EQ(p.GetTokenType(), TK_INT);
    EXPECT_EQ(p.GetTokenString(), "3");
    EXPECT_EQ(p.lastToken.GetTokenString(), "2");
}

TEST(ExpressionParserTest, UnsafeParseLetsValueErrorsThrough) {
    ExpressionParser p;
    p.Init("1 / 0");
    LSLiteral r;
    try {
        p.UnsafeParseExpression(r);
        ADD_FAILURE() << "no exception";
    } catch (const LiteralException& e) {
        EXPECT_EQ(e.GetMessage(), "Division by zero error");
    }
}

TEST(ExpressionParserTest, EachLevelCanBeParsedOnItsOwn) {
    // A level parses its own operators and the tighter ones, and stops at a looser one.
    const struct {
        void (ExpressionParser::*level)(LSLiteral&);
        const char* text;
        const char* stopsAt;
        std::string value;
    } cases[] = {
        {&ExpressionParser::ParseAssignmentExpression, "true ? 2 : 3", "EOS", "int64 2"},
        {&ExpressionParser::ParseConditionalExpression, "true ? 2 : 3 = 4", "=", "int64 2"},
        {&ExpressionParser::ParseLogicalOrExpression, "false || true ? 1 : 2", "?", "bool true"},
        {&ExpressionParser::ParseLogicalAndExpression, "true && true || false", "||", "bool true"},
        {&ExpressionParser::ParseBitwiseOrExpression, "1 | 2 && 3", "&&", "int64 3"},
        {&ExpressionParser::ParseBitwiseExOrExpression, "3 ^ 1 | 4", "|", "int64 2"},
        {&ExpressionParser::ParseBitwiseAndExpression, "3 & 1 ^ 4", "^", "int64 1"},
        {&ExpressionParser::ParseEqualityExpression, "1 == 1 & 1", "&", "bool true"},
        {&ExpressionParser::ParseRelationalExpression, "1 < 2 == 3", "==", "bool true"},
        {&ExpressionParser::ParseShiftExpression, "1 << 2 < 3", "<", "int64 4"},
        {&ExpressionParser::ParseAdditiveExpression, "1 + 2 << 3", "<<", "int64 3"},
        {&ExpressionParser::ParseMultiplicativeExpression, "2 * 3 + 1", "+", "int64 6"},
        {&ExpressionParser::ParsePowerExpression, "2 ^^ 3 * 2", "*", "int64 8"},
        {&ExpressionParser::ParseUnaryExpression, "-2 ^^ 2", "^^", "int64 -2"},
        {&ExpressionParser::ParsePostFixExpression, "'ab'[1] + 1", "+", "char 98"},
        {&ExpressionParser::ParsePrimaryExpression, "'ab'[1]", "[", "string ab"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.text);
        const std::string text = c.text;
        ExpressionParser p;
        p.Init(text);
        LSLiteral r;
        (p.*c.level)(r);
        EXPECT_EQ(Show(r), c.value);
        std::string stop;
        StringStream ss;
        ss << p.token;
        EXPECT_EQ(ss.GetString(), c.stopsAt);
    }
}

// Runs one typed parse: its value as text, or "!" + message + "@" + offset.
template <class T>
std::string Typed(const std::string& text, T (ExpressionParser::*parse)(bool), bool explicitConversion) {
    ExpressionParser p;
    p.Init(text);
    try {
        const T v = (p.*parse)(explicitConversion);
        if constexpr (std::is_same_v<T, bool>) return v ? "true" : "false";
        if constexpr (std::is_same_v<T, char>) return "char " + std::to_string(static_cast<unsigned char>(v));
        if constexpr (std::is_same_v<T, basic_xstring>) return "\"" + v + "\"";
        if constexpr (std::is_floating_point_v<T>) return ToString(static_cast<double>(v));
        if constexpr (std::is_integral_v<T> && !std::is_same_v<T, bool> && !std::is_same_v<T, char>)
            return std::to_string(v);
    } catch (const LexScannerException& e) {
        return "!" + e.GetMessage() + "@" + std::to_string(e.GetPosition() - text.data());
    }
    return "?";
}

TEST(ExpressionParserTest, TypedFamily) {
    using P = ExpressionParser;
    // Conditions are bools: an integer is not one.
    EXPECT_EQ(Typed("1", &P::ParseBool, false), "!No implicit conversion from int64 to bool@1");
    EXPECT_EQ(Typed("1", &P::ParseBool, true), "true");
    EXPECT_EQ(Typed("2 > 1 && 'a' == \"a\"", &P::ParseBool, false), "true");
    // A single-quoted literal is a string; one character of it gives a char.
    EXPECT_EQ(Typed("'x'", &P::ParseChar, false), "char 120");
    EXPECT_EQ(Typed("'xy'", &P::ParseChar, false), "!No implicit conversion from value xy to char@4");
    EXPECT_EQ(Typed("'xy'", &P::ParseChar, true), "!No implicit conversion from value xy to char@4");
    EXPECT_EQ(Typed("65", &P::ParseChar, false), "char 65");
    EXPECT_EQ(Typed("256", &P::ParseChar, false), "!No implicit conversion from value 256 to char@3");
    EXPECT_EQ(Typed("256", &P::ParseChar, true), "char 0");
    EXPECT_EQ(Typed("'ab'[1]", &P::ParseChar, false), "char 98");
    EXPECT_EQ(Typed("-129", &P::ParseInt8, false), "!No implicit conversion from value -129 to int8@4");
    EXPECT_EQ(Typed("-129", &P::ParseInt8, true), "127");
    EXPECT_EQ(Typed("255", &P::ParseUInt8, false), "255");
    EXPECT_EQ(Typed("-32768", &P::ParseInt16, false), "-32768");
    EXPECT_EQ(Typed("-1", &P::ParseUInt16, true), "65535");
    EXPECT_EQ(Typed("2147483648", &P::ParseInt32, false),
              "!No implicit conversion from value 2147483648 to int32@10");
    EXPECT_EQ(Typed("0xFFFFFFFF", &P::ParseUInt32, false), "4294967295");
    EXPECT_EQ(Typed("2.5", &P::ParseInt64, false), "!No implicit conversion from float64 to int64@3");
    EXPECT_EQ(Typed("2.5", &P::ParseInt64, true), "2");
    EXPECT_EQ(Typed("-1", &P::ParseUInt64, false), "18446744073709551615");
    EXPECT_EQ(Typed("1", &P::ParseFloat32, false), "1.0");
    EXPECT_EQ(Typed("1 / 4", &P::ParseFloat64, false), "0.0");
    EXPECT_EQ(Typed("1 / 4.0", &P::ParseFloat64, false), "0.25");
    EXPECT_EQ(Typed("42", &P::ParseString, false), "!No implicit conversion from int64 to string@2");
    EXPECT_EQ(Typed("42", &P::ParseString, true), "\"42\"");
    EXPECT_EQ(Typed("1.5 * 2", &P::ParseString, true), "\"3.0\"");
    EXPECT_EQ(Typed("'a' + 'b'", &P::ParseString, false), "\"ab\"");
    // Value errors inside, and syntax errors, keep their own message and position.
    EXPECT_EQ(Typed("1 % 0 + 1", &P::ParseInt32, false), "!Modulo zero error@6");
    EXPECT_EQ(Typed("(1", &P::ParseInt32, false), "!Expected ) after 1 when read EOS@2");
}

TEST(ParserBaseTest, TokensIdentifiersAndPaths) {
    const std::string text = "name a/b / c = 1";
    ParserBase p;
    EXPECT_EQ(p.GetTokenType(), TK_NONE);
    p.Init(text);
    EXPECT_EQ(p.GetTokenType(), TK_IDENTIFIER);
    EXPECT_EQ(p.ParseIdentifier(), "name");
    EXPECT_EQ(p.ParsePath(), "a/b/c");
    EXPECT_EQ(p.GetTokenType(), TK_ASSIGN);
    p.ParseGivenToken(TK_ASSIGN, "=");
    EXPECT_EQ(p.GetTokenString(), "1");
    EXPECT_EQ(MessageOf([&] { p.ParseGivenToken(TK_SEMICOLON, ";"); }), "Expected ; after = when read 1");
    p.ReadNextToken();
    EXPECT_EQ(p.GetTokenType(), TK_EOS);
    EXPECT_EQ(p.GetToken().text.begin(), text.data() + text.size());

    const struct {
        const char* text;
        bool path;
        const char* message;
        int position;
    } errors[] = {
        {"1", false, "Expected identifier after EOS when read 1", 0},
        {"", false, "Expected identifier after EOS when read EOS", 0},
        {"/a", true, "Expected identifier (for path) after EOS when read /", 0},
        {"  'a'", true, "Expected identifier (for path) after EOS when read 'a'", 2},
    };
    for (const auto& e : errors) {
        const std::string t = e.text;
        ParserBase q;
        q.Init(t);
        const char* position = nullptr;
        EXPECT_EQ(MessageOf([&] { e.path ? q.ParsePath() : q.ParseIdentifier(); }, position), e.message);
        EXPECT_EQ(position, t.data() + e.position) << e.text;
    }

    // A path stops at the first token that is neither an identifier nor "/", and keeps a trailing "/".
    const std::string trailing = "dir/sub/ .x";
    ParserBase q;
    q.Init(trailing);
    EXPECT_EQ(q.ParsePath(), "dir/sub/");
    EXPECT_EQ(q.GetTokenType(), TK_DOT);
}

TEST(ParserBaseTest, PresetTokenBecomesThePreviousOneAtInit) {
    static const char kParen[] = "(";
    const std::string text = ")";
    ExpressionParser p;
    p.token = LSToken(TK_LPAREN, kParen, kParen + 1);
    p.Init(text);
    EXPECT_EQ(p.lastToken.GetType(), TK_LPAREN);
    EXPECT_EQ(MessageOf([&] { p.ParseBool(false); }), "Unexpected ) after ( in expression");
}

}  // namespace
}  // namespace orvan::testing

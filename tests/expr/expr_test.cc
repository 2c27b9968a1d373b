// What the tool cannot show of the expression language (expressions_cases.txt has the rest): the errors of
// the operators on typed values, undef and void, the typed parses to narrow types, and the nesting limit.
#include <gtest/gtest.h>

#include <functional>
#include <string>
#include <vector>

#include "ovmacro/expr/expression_parser.h"
#include "ovmacro/expr/literal_operators.h"
#include "ovmacro/foundations/text_format.h"
#include "support/test_support.h"

namespace orvan::testing {
namespace {

LSLiteral I(long long v) { return LSLiteral(v); }
LSLiteral F(double v) { return LSLiteral(v); }
LSLiteral S(const std::string& s) { return LSLiteral(s); }
LSLiteral C(char c) { return LSLiteral::MakeChar(c); }
LSLiteral B(bool b) { return LSLiteral(b); }
// A parser at the start of text.
ExpressionParser Parse(const char* text) {
    ExpressionParser p;
    p.Init(text);
    return p;
}

struct Case {
    std::function<LSLiteral()> op;
    const char* expected;  // "TYPE TEXT" of the value that op computes, or "!" and the message of its error
};

void ExpectOutcomes(const std::vector<Case>& cases) {
    for (const Case& c : cases) {
        std::string outcome;
        try {
            const LSLiteral v = c.op();
            outcome = TypeToString(v.GetType()) + (" " + v.AsString(true));
        } catch (const IException& e) {
            outcome = std::string("!") + e.what();
        }
        EXPECT_EQ(outcome, c.expected);
    }
}

// A number against a non-number is an error for every operator: never taken for a number or for a text.
TEST(LiteralTest, OperatorErrors) {
    ExpectOutcomes({
        {[] { return B(true) - I(1); }, "!Incompatible types (bool and int64) for - operation"},
        {[] { return I(1) * S("2"); }, "!Incompatible types (int64 and string) for * operation"},
        {[] { return C('4') / I(2); }, "!Incompatible types (char and int64) for / operation"},
        {[] { return F(5.5) % I(2); }, "!Incompatible types (float64 and int64) for % operation"},
        {[] { return Power(S("2"), I(2)); }, "!Incompatible types (string and int64) for ^^ operation"},
        {[] { return B(IsEqual(B(true), I(1))); },
         "!Incompatible types (bool and int64) for comparison operation"},
        {[] { return B(IsEqual(S("1"), I(1))); },
         "!Incompatible types (string and int64) for comparison operation"},
        {[] { return B(IsEqual(I(256), C('\0'))); },
         "!Incompatible types (int64 and char) for comparison operation"},
        {[] { return B(IsEqual(I(-1), C('\xff'))); },
         "!Incompatible types (int64 and char) for comparison operation"},
        {[] { return B(IsLess(C('a'), I(98))); },
         "!Incompatible types (char and int64) for comparison operation"},
        {[] { return B(IsLessThanOrEqual(C('a'), I(98))); },
         "!Incompatible types (char and int64) for comparison operation"},
        {[] { return I(1) / F(-0.0); }, "!Division by zero"},
        {[] { return I(5) % I(0); }, "!Modulo zero error"},
        {[] { return Power(I(0), I(-1)); }, "!Calculation 0.0 ^^ -1.0 ill defined"},
        {[] { return B(true) && I(1); }, "!No implicit conversion from int64 to bool"},
        {[] { return I(1) && B(true); }, "!No implicit conversion from int64 to bool"},
        {[] { return B(false) || I(0); }, "!No implicit conversion from int64 to bool"},
        {[] { return I(0) || B(true); }, "!No implicit conversion from int64 to bool"},
        {[] { return B(!I(5)); }, "!No implicit conversion from int64 to bool"},
        {[] { return -S("a"); }, "!Incompatible type (string) for unary - operation"},
        {[] { return +C('a'); }, "!Incompatible type (char) for unary + operation"},
        {[] { return ~F(1.0); }, "!Incompatible type (float64) for unary ~ operation"},
        {[] { return S("abc")[I(3)]; }, "!Index 3 out of range [0,3) on string"},
        {[] { return S("abc")[I(-1)]; }, "!Index -1 out of range [0,3) on string"},
        {[] { return S("abc")[F(1.0)]; }, "!No implicit conversion from float64 to int64"},
        // A value is never a place to assign to; undef is a missing value, and void converts to nothing.
        {[]() -> LSLiteral { LSLiteral().Assign(I(2)); }, "!Can't assign to undef"},
        {[]() -> LSLiteral { LSLiteral::MakeVoid().Assign(I(2)); }, "!Can't assign to void"},
        {[]() -> LSLiteral { F(1.0).Assign(I(2)); }, "!Can't assign to float64 r-value"},
        {[] { return I(LSLiteral().AsInt8(true)); }, "!Expected int64"},
        {[] { return C(LSLiteral::MakeVoid().AsChar(true)); }, "!No conversion from void to char"},
    });
}

// Integers wrap to a narrow type only when cast; floats round to nearest (past the largest float by half a
// step, to infinity).
TEST(ExpressionParserTest, TypedParsesToNarrowTypes) {
    ExpectOutcomes({
        {[] { return I(Parse("-129").ParseInt8(false)); }, "!No implicit conversion from value -129 to int8"},
        {[] { return I(Parse("-129").ParseInt8(true)); }, "int64 127"},
        {[] { return I(Parse("256").ParseUInt8(false)); }, "!No implicit conversion from value 256 to uint8"},
        {[] { return I(Parse("32768").ParseInt16(false)); },
         "!No implicit conversion from value 32768 to int16"},
        {[] { return I(Parse("-1").ParseUInt16(false)); }, "!No implicit conversion from value -1 to uint16"},
        {[] { return I(Parse("-1").ParseUInt32(false)); }, "!No implicit conversion from value -1 to uint32"},
        {[] { return I(Parse("2.5").ParseInt64(false)); }, "!No implicit conversion from float64 to int64"},
        {[] { return I(Parse("2.5").ParseUInt64(false)); }, "!No implicit conversion from float64 to int64"},
        {[] { return F(Parse("true").ParseFloat32(false)); }, "!No implicit conversion from bool to float32"},
        {[] { return F(Parse("0.1").ParseFloat32(false)); }, "float64 0.10000000149011612"},
        {[] { return F(Parse("3.4028235e38").ParseFloat32(false)); }, "float64 3.4028234663852886e+38"},
        {[] { return F(Parse("3.4028235677973366e38").ParseFloat32(false)); }, "float64 inf"},
        {[] { return F(Parse("-1e300").ParseFloat32(false)); }, "float64 -inf"},
        {[] { return C(Parse("'xy'").ParseChar(true)); }, "!No implicit conversion from value xy to char"},
        {[] { return C(Parse("321").ParseChar(true)); }, "char A"},
    });
}

// The whole expression is one level and each parenthesis another; an abandoned parse gives its levels back.
TEST(ExpressionParserTest, NestingLimitIsExact) {
    ExpressionParser p;
    p.SetMaxExpressionDepth(3);
    const std::string tooDeep = "(((1)))";
    p.Init(tooDeep);
    EXPECT_EQ(ErrorIn(tooDeep, [&] { p.ParseInt64(false); }),
              "1:4 Expression nested too deeply (more than 3 levels)");
    p.Init("((2))");
    EXPECT_EQ(p.ParseInt64(false), 2);
}

// Every kind of nesting, far past the default limit, ends in the nesting error on a 1 MiB stack; the operator
// chains make each level as costly as a level can be.
TEST(ExpressionParserTest, DeepNestingFailsCleanlyOnASmallStack) {
    const char* const shapes[][3] = {
        {"(", "1", ")"}, {"- ", "1", ""}, {"!", "true", ""}, {"true?1:", "0", ""}, {"1+(", "1", ")"},
        {"true?(", "1", "):1"}, {"'abc'[", "0", "]"}, {"len(", "'a'", ")"}, {"sin(", "1", ")"},
        {"1||1&&1|1^1&1==1<1<<1+1*1^^len(", "'a'", ")"}, {"1=1||1&&1|1^1&1==1<1<<1+1*1^^'abc'[", "1", "]"},
    };
    RunOnStackOf(1 << 20, [&] {
        for (const auto& [open, core, close] : shapes) {
            std::string text;
            for (int i = 0; i < 100000; ++i) text += open;
            text += core;
            for (int i = 0; i < 100000; ++i) text += close;
            const std::string message = MessageOf([&] { Parse(text.c_str()).ParseString(true); });
            EXPECT_EQ(message.rfind("Expression nested too deeply", 0), 0u) << open << " " << message;
        }
    });
}

}  // namespace
}  // namespace orvan::testing

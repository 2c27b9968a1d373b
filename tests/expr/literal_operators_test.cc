// The operators on LSLiteral values: promotion, division and modulo, shifts, power, logical operators,
// indexing, equality and ordering across types, and the basic queries of a value.
#include "ovmacro/expr/literal_operators.h"

#include <gtest/gtest.h>

#include <functional>
#include <limits>
#include <map>
#include <string>

#include "expr_test_util.h"

namespace orvan::testing {
namespace {

constexpr long long kMax = std::numeric_limits<long long>::max();
constexpr long long kMin = std::numeric_limits<long long>::min();
const double kNaN = std::numeric_limits<double>::quiet_NaN();

using Binary = std::function<LSLiteral(const LSLiteral&, const LSLiteral&)>;

const std::map<std::string, Binary>& Operators() {
    static const std::map<std::string, Binary> ops = {
        {"+", [](const LSLiteral& a, const LSLiteral& b) { return a + b; }},
        {"-", [](const LSLiteral& a, const LSLiteral& b) { return a - b; }},
        {"*", [](const LSLiteral& a, const LSLiteral& b) { return a * b; }},
        {"/", [](const LSLiteral& a, const LSLiteral& b) { return a / b; }},
        {"%", [](const LSLiteral& a, const LSLiteral& b) { return a % b; }},
        {"&", [](const LSLiteral& a, const LSLiteral& b) { return a & b; }},
        {"|", [](const LSLiteral& a, const LSLiteral& b) { return a | b; }},
        {"^", [](const LSLiteral& a, const LSLiteral& b) { return a ^ b; }},
        {"<<", [](const LSLiteral& a, const LSLiteral& b) { return a << b; }},
        {">>", [](const LSLiteral& a, const LSLiteral& b) { return a >> b; }},
        {"&&", [](const LSLiteral& a, const LSLiteral& b) { return a && b; }},
        {"||", [](const LSLiteral& a, const LSLiteral& b) { return a || b; }},
        {"^^", [](const LSLiteral& a, const LSLiteral& b) { return Power(a, b); }},
        {"[]", [](const LSLiteral& a, const LSLiteral& b) { return a[b]; }},
        {"==", [](const LSLiteral& a, const LSLiteral& b) { return LSLiteral(IsEqual(a, b)); }},
        {"<", [](const LSLiteral& a, const LSLiteral& b) { return LSLiteral(IsLess(a, b)); }},
        {"<=", [](const LSLiteral& a, const LSLiteral& b) { return LSLiteral(IsLessThanOrEqual(a, b)); }},
    };
    return ops;
}

struct BinaryCase {
    LSLiteral a;
    const char* op;
    LSLiteral b;
    std::string expected;  // Show() of the result, or "!" + message
};

const BinaryCase kBinary[] = {
    // Promotion: two int64 stay int64 and wrap; any float64 makes a float64.
    {I(7), "+", I(2), "int64 9"},
    {I(7), "+", F(0.5), "float64 7.5"},
    {I(kMax), "+", I(1), "int64 " + std::to_string(kMin)},
    {I(kMin), "-", I(1), "int64 " + std::to_string(kMax)},
    {I(kMax), "*", I(2), "int64 -2"},
    {I(kMin), "*", I(-1), "int64 " + std::to_string(kMin)},
    {F(2.5), "*", I(2), "float64 5.0"},
    // Binary plus of string-like values concatenates; a string and a number are incompatible.
    {S("ab"), "+", S("c"), "string abc"},
    {C('a'), "+", C('b'), "string ab"},
    {C('a'), "+", S("bc"), "string abc"},
    {S("a"), "+", I(1), "!Incompatible types (string and int64) for + operation"},
    {C('a'), "+", I(1), "!Incompatible types (char and int64) for + operation"},
    {Undef(), "+", I(1), "!Incompatible types (undef and int64) for + operation"},
    {S("a"), "-", S("a"), "!Incompatible types (string and string) for - operation"},
    // Division.
    {I(7), "/", I(2), "int64 3"},
    {I(-7), "/", I(2), "int64 -3"},
    {I(7), "/", F(2.0), "float64 3.5"},
    {F(7.0), "/", I(2), "float64 3.5"},
    {I(1), "/", I(0), "!Division by zero error"},
    {F(1.0), "/", I(0), "!Division by zero"},
    {I(1), "/", F(-0.0), "!Division by zero"},
    {I(kMin), "/", I(-1), "int64 " + std::to_string(kMin)},
    {S("a"), "/", I(1), "!Incompatible types (string and int64) for / operation"},
    // Modulo: int64 only, the dividend's sign.
    {I(-7), "%", I(2), "int64 -1"},
    {I(7), "%", I(-2), "int64 1"},
    {I(5), "%", I(0), "!Modulo zero error"},
    {I(kMin), "%", I(-1), "int64 0"},
    {F(5.5), "%", I(2), "!Incompatible types (float64 and int64) for % operation"},
    // Bitwise operators and shifts: int64 only; shift counts modulo 64; >> is arithmetic.
    {I(12), "&", I(10), "int64 8"},
    {I(12), "|", I(10), "int64 14"},
    {I(12), "^", I(10), "int64 6"},
    {F(1.0), "&", I(1), "!Incompatible types (float64 and int64) for & operation"},
    {B(true), "|", B(false), "!Incompatible types (bool and bool) for | operation"},
    {I(1), "<<", I(64), "int64 1"},
    {I(1), "<<", I(63), "int64 " + std::to_string(kMin)},
    {I(1), "<<", I(-1), "int64 " + std::to_string(kMin)},
    {I(-1), "<<", I(1), "int64 -2"},
    {I(-8), ">>", I(1), "int64 -4"},
    {I(-1), ">>", I(63), "int64 -1"},
    {I(8), ">>", I(65), "int64 4"},
    {I(kMin), ">>", I(63), "int64 -1"},
    {F(8.0), ">>", I(1), "!Incompatible types (float64 and int64) for >> operation"},
    // Logical operators: bools only; the left operand can decide without the right one being looked at.
    {B(true), "&&", B(false), "bool false"},
    {B(false), "&&", Undef(), "bool false"},
    {B(true), "&&", Undef(), "!Expected bool"},
    {B(true), "&&", I(1), "!No implicit conversion from int64 to bool"},
    {I(1), "&&", B(true), "!No implicit conversion from int64 to bool"},
    {B(true), "||", Undef(), "bool true"},
    {B(false), "||", S("x"), "!No conversion from string to bool"},
    {Void(), "||", B(true), "!No conversion from void to bool"},
    // Power: int64 only when both are int64, truncated; out of range gives the most negative int64.
    {I(2), "^^", I(10), "int64 1024"},
    {I(2), "^^", F(0.5), "float64 1.4142135623730951"},
    {I(2), "^^", I(-1), "int64 0"},
    {I(0), "^^", I(0), "int64 1"},
    {I(2), "^^", I(62), "int64 4611686018427387904"},
    {I(2), "^^", I(63), "int64 " + std::to_string(kMin)},
    {I(-2), "^^", I(63), "int64 " + std::to_string(kMin)},
    {F(2.0), "^^", I(3), "float64 8.0"},
    {I(-8), "^^", F(0.5), "float64 nan"},
    {I(0), "^^", I(-1), "!Calculation 0.0 ^^ -1.0 ill defined"},
    {F(-0.0), "^^", F(-2.5), "!Calculation -0.0 ^^ -2.5 ill defined"},
    {S("2"), "^^", I(2), "!Incompatible types (string and int64) for ^^ operation"},
    // Indexing: strings only, by an index that converts implicitly to int32.
    {S("abc"), "[]", I(1), "char 98"},
    {S("abc"), "[]", I(3), "!Index 3 out of range [0,3) on string"},
    {S("abc"), "[]", I(-1), "!Index -1 out of range [0,3) on string"},
    {S(""), "[]", I(0), "!Index 0 out of range [0,0) on string"},
    {S("abc"), "[]", F(1.0), "!No implicit conversion from float64 to int64"},
    {S("abc"), "[]", I(5000000000LL), "!No implicit conversion from value 5000000000 to int32"},
    {I(5), "[]", I(0), "![] not available on int64"},
    {C('a'), "[]", I(0), "![] not available on char"},
    // Equality of the language: the first rule that both operands satisfy decides.
    {I(1), "==", F(1.0), "bool true"},
    {I(65), "==", C('A'), "bool true"},
    {I(321), "==", C('A'), "!Incompatible types (int64 and char) for comparison operation"},
    {C('a'), "==", S("a"), "bool true"},
    {S("ab"), "==", S("ab"), "bool true"},
    {I(kMax), "==", I(kMax - 1), "bool false"},  // compared as integers, not as doubles
    {F(kNaN), "==", F(kNaN), "bool false"},
    {B(true), "==", I(1), "!Incompatible types (bool and int64) for comparison operation"},
    {S("1"), "==", I(1), "!Incompatible types (string and int64) for comparison operation"},
    {Undef(), "==", Undef(), "!Incompatible types (undef and undef) for comparison operation"},
    // Ordering: strings byte-wise (unsigned), characters as one-character strings, numbers; no bools.
    {S("abc"), "<", S("abd"), "bool true"},
    {S("ab"), "<", S("abc"), "bool true"},
    {S("\xff"), "<", S("a"), "bool false"},
    {C('a'), "<", S("b"), "bool true"},
    {I(1), "<", F(2.5), "bool true"},
    {F(kNaN), "<", I(1), "bool false"},
    {B(false), "<", B(true), "!Incompatible types (bool and bool) for comparison operation"},
    {I(1), "<", S("a"), "!Incompatible types (int64 and string) for comparison operation"},
    {C('a'), "<", I(98), "!Incompatible types (char and int64) for comparison operation"},
    {S("abc"), "<=", S("abc"), "bool true"},
    {S("b"), "<=", S("abc"), "bool false"},
    {I(2), "<=", F(2.0), "bool true"},
    {F(kNaN), "<=", F(kNaN), "bool false"},
};

TEST(LiteralOperatorsTest, BinaryOperators) {
    for (const BinaryCase& c : kBinary) {
        SCOPED_TRACE(Show(c.a) + " " + c.op + " " + Show(c.b));
        const std::string a = Show(c.a), b = Show(c.b);
        EXPECT_EQ(ResultOrError([&] { return Show(Operators().at(c.op)(c.a, c.b)); }), c.expected);
        EXPECT_EQ(Show(c.a), a);
        EXPECT_EQ(Show(c.b), b);
    }
}

TEST(LiteralOperatorsTest, UnaryOperators) {
    const std::map<std::string, std::function<LSLiteral(const LSLiteral&)>> ops = {
        {"-", [](const LSLiteral& a) { return -a; }},
        {"+", [](const LSLiteral& a) { return +a; }},
        {"~", [](const LSLiteral& a) { return ~a; }},
        {"!", [](const LSLiteral& a) { return LSLiteral(!a); }},
    };
    const struct {
        const char* op;
        LSLiteral a;
        std::string expected;
    } cases[] = {
        {"-", I(5), "int64 -5"},          {"-", I(kMin), "int64 " + std::to_string(kMin)},
        {"-", F(2.5), "float64 -2.5"},    {"-", S("a"), "!Incompatible type (string) for unary - operation"},
        {"+", F(-0.5), "float64 -0.5"},   {"+", C('a'), "!Incompatible type (char) for unary + operation"},
        {"~", I(0), "int64 -1"},          {"~", F(1.0), "!Incompatible type (float64) for unary ~ operation"},
        {"!", B(true), "bool false"},     {"!", I(5), "!No implicit conversion from int64 to bool"},
        {"!", Undef(), "!Expected bool"}, {"!", Void(), "!No conversion from void to bool"},
    };
    for (const auto& c : cases)
        EXPECT_EQ(ResultOrError([&] { return Show(ops.at(c.op)(c.a)); }), c.expected) << c.op << Show(c.a);
}

TEST(LiteralOperatorsTest, StructuralEqualityComparesTypeAndValue) {
    EXPECT_FALSE(I(1) == F(1.0));
    EXPECT_TRUE(I(1) != F(1.0));
    EXPECT_TRUE(Undef() == Undef());
    EXPECT_FALSE(Undef() == Void());
    EXPECT_FALSE(S("ab") == S("ac"));
    EXPECT_FALSE(C('a') == S("a"));
    EXPECT_FALSE(F(kNaN) == F(kNaN));
}

TEST(LiteralTest, ConstructionLengthAndAssignment) {
    EXPECT_EQ(Show(LSLiteral(static_cast<signed char>(-3))), "int64 -3");  // a number, not a character
    EXPECT_EQ(Show(LSLiteral("text")), "string text");                     // not a bool made from the pointer
    EXPECT_EQ(ResultOrError([] { return std::to_string(S("").GetLength()); }), "0");
    EXPECT_EQ(ResultOrError([] { return std::to_string(I(5).GetLength()); }),
              "!len() not available on int64");
    // A value is never a place to assign to.
    EXPECT_EQ(ResultOrError([]() -> std::string { Undef().Assign(I(2)); }), "!Can't assign to undef");
    EXPECT_EQ(ResultOrError([]() -> std::string { Void().Assign(I(2)); }), "!Can't assign to void");
    EXPECT_EQ(ResultOrError([]() -> std::string { C('a').Assign(I(2)); }), "!Can't assign to char r-value");
}

}  // namespace
}  // namespace orvan::testing

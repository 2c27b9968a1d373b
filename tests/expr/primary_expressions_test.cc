// Primary and postfix expressions: literals, parentheses, indexing, and the built-in names.
#include <gtest/gtest.h>

#include <algorithm>
#include <limits>
#include <string>

#include "expr_test_util.h"
#include "ovmacro/expr/expression_parser.h"

namespace orvan::testing {
namespace {

struct EvalCase {
    const char* text;
    std::string expected;  // Show() of the value, or "!" + message + "@" + offset of the position
};

TEST(PrimaryExpressionsTest, LiteralsAndIndexing) {
    const EvalCase cases[] = {
        {"42", "int64 42"},
        {"0x10", "int64 16"},
        {"0xFFFFFFFFFFFFFFFF", "int64 -1"},
        {"9223372036854775808", "int64 " + std::to_string(std::numeric_limits<int64>::min())},
        {"1.5e2", "float64 150.0"},
        {"\"a\\x41\\n\"", "string aA\n"},
        {"r\"a\\n\"", "string a\\n"},
        {"'x'", "string x"},  // a single-quoted literal is a string
        {"''", "string "},
        {"'abc'[1]", "char 98"},
        {"'abc'[1 + 1]", "char 99"},
        {"'ab'[0] + 'ab'[1]", "string ab"},
        {"'abc'[1][0]", "![] not available on char@10"},
        {"'abc'[3]", "!Index 3 out of range [0,3) on string@7"},
        {"'abc'[1", "!Expected ] after 1 when read EOS@7"},
        {"'abc'['a']", "!No conversion from string to int64@9"},
        {"((7))", "int64 7"},
        {"(3).x", "!Dot operator currently not supported@4"},
        {"'a'.", "!Dot operator currently not supported@4"},
        {"(1)(2)", "!Function application currently not supported@4"},
        {"len('a')(2)", "!Function application currently not supported@9"},
        {"True", "!Unexpected True after EOS in expression@0"},
        {"1 + lenx('a')", "!Unexpected lenx after + in expression@4"},
        {"1 + ;", "!Unexpected ; after + in expression@4"},
    };
    for (const EvalCase& c : cases) EXPECT_EQ(Eval(c.text), c.expected) << c.text;
}

TEST(PrimaryExpressionsTest, BuiltinNames) {
    const EvalCase cases[] = {
        {"true", "bool true"},
        {"false", "bool false"},
        {"len('abc')", "int64 3"},
        {"len(\"\")", "int64 0"},
        {"len('ab' + 'c') * 2", "int64 6"},
        {"len(5)", "!len() not available on int64@6"},
        {"len 'a'", "!Expected ( after len when read 'a'@4"},
        {"len('a'", "!Expected ) after 'a' when read EOS@7"},
        // Type tests look at the type only.
        {"is_int(len('abc'))", "bool true"},
        {"is_int(2.0)", "bool false"},
        {"is_double(2.0)", "bool true"},
        {"is_double(2)", "bool false"},
        {"is_string('a')", "bool true"},
        {"is_char('a')", "bool false"},
        {"is_char('a'[0])", "bool true"},
        {"is_char(char(65))", "bool true"},
        {"is_bool(1 < 2)", "bool true"},
        {"is_bool(1)", "bool false"},
        // Casts convert explicitly.
        {"int(2.9)", "int64 2"},
        {"int(-2.9)", "int64 -2"},
        {"int(true)", "int64 1"},
        {"int('a'[0])", "int64 97"},
        {"int('a')", "!No conversion from string to int64@8"},
        {"double(2)", "float64 2.0"},
        {"double(true)", "float64 1.0"},
        {"bool(0)", "bool false"},
        {"bool(2.5)", "bool true"},
        {"bool('a')", "!No conversion from string to bool@9"},
        {"char(65)", "char 65"},
        {"char(300)", "char 44"},
        {"char('a')", "char 97"},
        {"char('ab')", "!No implicit conversion from value ab to char@10"},
        {"string(42)", "string 42"},
        {"string(2.5)", "string 2.5"},
        {"string(true)", "string true"},
        {"string('a'[0])", "string a"},
        // The floating-point functions convert their argument implicitly.
        {"sin(0)", "float64 0.0"},
        {"cos(0)", "float64 1.0"},
        {"tan(0.0)", "float64 0.0"},
        {"exp(0)", "float64 1.0"},
        {"log(1)", "float64 0.0"},
        {"log(0)", "!Can't take log of value 0.0@6"},
        {"log(-1) + 1", "!Can't take log of value -1.0@8"},
        {"sin(true)", "!No implicit conversion from bool to float64@8"},
        {"sin 1", "!Expected ( after sin when read 1@4"},
        {"sin(1 2)", "!Expected ) after 1 when read 2@6"},
        // Without a file, __FILE__ is empty and __LINE__ is -1.
        {"__FILE__", "string "},
        {"__LINE__", "int64 -1"},
    };
    for (const EvalCase& c : cases) EXPECT_EQ(Eval(c.text), c.expected) << c.text;
}

// A parser that knows where it reads, as a parser of files does.
class LocatedParser : public ExpressionParser {
  public:
    bool GetFilenameAndLineNumberAtCurrentPosition(basic_xstring& file, int64& line) const override {
        file = "macros.txt";
        line = 1 + static_cast<int64>(std::count(start, token.text.begin(), '\n'));
        return true;
    }
    const char* start = nullptr;
};

TEST(PrimaryExpressionsTest, FileAndLineComeFromTheParser) {
    const std::string text = "__FILE__ +\n string(__LINE__)";
    LocatedParser p;
    p.start = text.data();
    p.Init(text);
    EXPECT_EQ(p.ParseString(false), "macros.txt2");
}

}  // namespace
}  // namespace orvan::testing

// The Python bridge called directly: values as text, error messages, stream redirection, restarts.
#include "ovmacro/python/python_bridge.h"

#include <gtest/gtest.h>

#include <string>

#include "python/capture_stdout.h"
#include "support/test_support.h"

namespace orvan {
namespace {

using testing::CaptureStdout;
using testing::MessageOf;

const char kSource[] = "the caller's text";
const char* const kPos = kSource + 4;

class PythonBridgeTest : public ::testing::Test {
protected:
    void SetUp() override { SetPythonAllowed(true); }
    void TearDown() override {
        SetPythonAllowed(true);
        UninitPython();
    }
};

std::string Eval(const std::string& expression) {
    basic_xstring result = "stale";
    EvalPythonExpression(expression, result, kPos);
    return result;
}

bool StartsWith(const std::string& text, const std::string& prefix) {
    return text.rfind(prefix, 0) == 0;
}

TEST_F(PythonBridgeTest, ValuesAreWrittenAsText) {
    RunPython("",
              "I = type('I', (int,), {})\nF = type('F', (float,), {})\n"
              "S = type('S', (str,), {})\nL = type('L', (list,), {})\n",
              kPos);
    const struct {
        const char* expression;
        std::string text;
    } cases[] = {
        {"True", "1"},
        {"False", "0"},
        {"-7", "-7"},
        {"2**32", "4294967296"},
        {"2**63-1", "9223372036854775807"},
        {"-2**63", "-9223372036854775808"},
        {"2**64", "18446744073709551616"},
        {"-2**64-1", "-18446744073709551617"},
        {"10**27", "1000000000000000000000000000"},
        {"10**5000", "1" + std::string(5000, '0')},
        {"2.5", "2.5"},
        {"3.0", "3.0"},
        {"-1e20", "-1e+20"},
        {"'ab'", "ab"},
        {"''", ""},
        {"'a\\x00b'", "a"},
        {"'\\u00e9'", "\xc3\xa9"},
        {"[1, 'a', [2]]", "[1,a,[2]]"},
        {"[]", "[]"},
        {"[True, 2.5, [[]], 2**70]", "[1,2.5,[[]],1180591620717411303424]"},
        {"I(5)", "5"},
        {"F(0.5)", "0.5"},
        {"S('s')", "s"},
        {"L([1, 2])", "[1,2]"},
    };
    for (const auto& c : cases) EXPECT_EQ(Eval(c.expression), c.text) << c.expression;
}

TEST_F(PythonBridgeTest, BigIntsMatchPythonsOwnDecimalText) {
    for (const char* value : {"7**1000", "-(13**777)", "2**4096 - 1"})
        EXPECT_EQ(Eval(value), Eval(std::string("str(") + value + ")")) << value;
}

TEST_F(PythonBridgeTest, UnconvertibleValuesRaiseAtTheCallersPosition) {
    RunPython("", "selfish = []\nselfish.append(selfish)\ndeep = []\nfor i in range(2000): deep = [deep]\n",
              kPos);
    const struct {
        const char* expression;
        const char* message;
    } cases[] = {
        {"None", "Can't convert python result of type NoneType"},
        {"(1, 2)", "Can't convert python result of type tuple"},
        {"b'x'", "Can't convert python result of type bytes"},
        {"{}", "Can't convert python result of type dict"},
        {"1j", "Can't convert python result of type complex"},
        {"[1, None]", "Can't convert python result of type NoneType"},
        {"selfish", "Can't convert python result: a list that contains itself"},
        {"deep", "Can't convert python result: lists nested more than 1000 deep"},
    };
    for (const auto& c : cases) {
        const char* position = nullptr;
        basic_xstring result = "kept";
        EXPECT_EQ(MessageOf([&] { EvalPythonExpression(c.expression, result, kPos); }, position), c.message)
            << c.expression;
        EXPECT_EQ(position, kPos) << c.expression;
        EXPECT_EQ(result, "kept") << c.expression;
    }
    // A string that has no UTF-8 form carries Python's reason.
    const std::string message = MessageOf([] { Eval("'\\ud800'"); });
    EXPECT_TRUE(StartsWith(message, "Can't convert python result of type str : ")) << message;
    EXPECT_NE(message.find("UnicodeEncodeError"), std::string::npos) << message;
}

TEST_F(PythonBridgeTest, ErrorsCarryTheirPrefixAndPythonsTraceback) {
    const struct {
        bool run;  // RunPython, else EvalPythonExpression
        const char* code;
        const char* prefix;
        const char* detail;
    } cases[] = {
        {false, "undefined_name", "Eval python error: ", "NameError: name 'undefined_name' is not defined"},
        {false, "1/0", "Eval python error: ", "ZeroDivisionError"},
        {false, "1 +", "Eval python error: ", "SyntaxError"},
        {false, "x = 1", "Eval python error: ", "SyntaxError"},
        {true, "x = (\n", "Python compilation error: ", "SyntaxError"},
        {true, "  x = 1\n", "Python compilation error: ", "IndentationError"},
        {true, "raise ValueError('boom')\n", "RunPython error: ", "ValueError: boom"},
        // sys.exit() must not end the host process.
        {true, "import sys\nsys.exit(3)\n", "RunPython error: ", "SystemExit: 3"},
    };
    for (const auto& c : cases) {
        const char* position = nullptr;
        const std::string message = MessageOf(
            [&] {
                basic_xstring result;
                if (c.run)
                    RunPython("", c.code, kPos);
                else
                    EvalPythonExpression(c.code, result, kPos);
            },
            position);
        EXPECT_TRUE(StartsWith(message, c.prefix)) << c.code << "\n" << message;
        EXPECT_NE(message.find(c.detail), std::string::npos) << c.code << "\n" << message;
        EXPECT_EQ(position, kPos) << c.code;
        // The error indicator is cleared: the interpreter stays usable.
        RunPython("", "after = 5\n", kPos);
        EXPECT_EQ(Eval("after + 1"), "6") << c.code;
    }
}

TEST_F(PythonBridgeTest, CodeWithZeroByteIsRefusedNotCutShort) {
    const std::string code("ok = 1\0ok = 2\n", 14);
    EXPECT_EQ(MessageOf([&] { RunPython("", code, kPos); }),
              "Python compilation error: source code string cannot contain null bytes");
    EXPECT_EQ(MessageOf([&] { Eval(std::string("1\0+1", 4)); }),
              "Eval python error: source code string cannot contain null bytes");
}

TEST_F(PythonBridgeTest, NamesPersistInMainAcrossCalls) {
    RunPython("", "def twice(v):\n    return 2 * v\nx = 6*7\n", kPos);
    RunPython("first.py", "y = twice(x)\n", kPos);
    EXPECT_EQ(Eval("y"), "84");
    EXPECT_EQ(Eval("[x, twice('ab')]"), "[42,abab]");
}

TEST_F(PythonBridgeTest, PrintGoesToStandardOutput) {
    CaptureStdout capture;
    RunPython("",
              "print('hello', 42)\nimport sys\nsys.stdout.write('no newline')\nprint('|', flush=True)\n"
              "print('a\\0b')\n",
              kPos);
    EXPECT_EQ(capture.Finish(), std::string("hello 42\nno newline|\na\0b\n", 25));
}

TEST_F(PythonBridgeTest, StandardErrorIsCollectedUntilTheNextError) {
    RunPython("", "import sys\nsys.stderr.write('warn')\n", kPos);
    EXPECT_EQ(s_errorString.str(), "warn");
    basic_xstring text = "stale";
    EXPECT_FALSE(GetPythonError(text));  // nothing pending
    EXPECT_EQ(text, "");
    // The next error replaces the collected text by its own traceback.
    const std::string message = MessageOf([] { RunPython("", "raise KeyError('k')\n", kPos); });
    EXPECT_EQ(message.find("warn"), std::string::npos) << message;
    EXPECT_EQ(s_errorString.str(), "");
}

TEST_F(PythonBridgeTest, NothingRunsWithoutAnInterpreter) {
    basic_xstring text = "stale";
    EXPECT_FALSE(GetPythonError(text));
    EXPECT_EQ(text, "");
    basic_xstring error;
    EXPECT_EQ(ExecutePythonExpression("1", error), nullptr);
    EXPECT_EQ(error, "the Python interpreter is not running");
    UninitPython();  // without a previous start
    UninitPython();
}

TEST_F(PythonBridgeTest, ExecutePythonExpressionHandsOverANewReference) {
    basic_xstring error;
    ASSERT_TRUE(InitPython(error));
    ASSERT_TRUE(InitPython(error));  // a second start-up is a no-op
    PyObjectRef value(ExecutePythonExpression("[1, 'z']", error));
    ASSERT_TRUE(value);
    StringStream os;
    WritePythonObject(os, value.Get(), kPos);
    EXPECT_EQ(os.GetString(), "[1,z]");
    PyObjectRef failed(ExecutePythonExpression("nope", error));
    EXPECT_FALSE(failed);
    EXPECT_NE(error.find("NameError"), std::string::npos) << error;
}

TEST_F(PythonBridgeTest, RestartGivesAFreshInterpreterWithItsStreamsRedirected) {
    RunPython("", "gone = 1\n", kPos);
    UninitPython();
    UninitPython();
    EXPECT_NE(MessageOf([] { Eval("gone"); }).find("NameError"), std::string::npos);
    CaptureStdout capture;
    RunPython("", "print('again')\n", kPos);
    EXPECT_EQ(capture.Finish(), "again\n");
}

TEST_F(PythonBridgeTest, DisabledPythonRefusesEveryUse) {
    const std::string disabled = "Python initialisation error: Python is disabled";
    SetPythonAllowed(false);
    EXPECT_FALSE(IsPythonAllowed());
    basic_xstring error;
    EXPECT_FALSE(InitPython(error));
    EXPECT_EQ(error, "Python is disabled");
    const char* position = nullptr;
    EXPECT_EQ(MessageOf([] { RunPython("", "x = 1\n", kPos); }, position), disabled);
    EXPECT_EQ(position, kPos);
    EXPECT_EQ(MessageOf([] { Eval("1"); }), disabled);

    // Allowed again, it starts; switched off while running, it refuses without stopping the interpreter.
    SetPythonAllowed(true);
    RunPython("", "kept = 3\n", kPos);
    SetPythonAllowed(false);
    EXPECT_EQ(MessageOf([] { Eval("kept"); }), disabled);
    SetPythonAllowed(true);
    EXPECT_EQ(Eval("kept"), "3");
}

}  // namespace
}  // namespace orvan

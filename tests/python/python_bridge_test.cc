// The Python bridge called directly: values as text, errors, the error stream, start, stop and refusal.
#include "ovmacro/python/python_bridge.h"

#include <gtest/gtest.h>

#include <string>

#include "support/test_support.h"

namespace orvan {
namespace {

using namespace std::string_literals;

const char kSource[] = "the caller's text";
const char* const kPos = kSource + 4;

// Each test ends with Python allowed and no interpreter running.
void Reset() {
    SetPythonAllowed(true);
    UninitPython();
}

// Evaluates an expression, or runs the statements after "run:": the value as text, or "! " and the message
// of the error raised at kPos ("!elsewhere " when raised at another place).
std::string Python(const std::string& code) {
    try {
        if (code.rfind("run:", 0) == 0) {
            RunPython("", code.substr(4), kPos);
            return "";
        }
        basic_xstring result = "stale";  // the value replaces it
        EvalPythonExpression(code, result, kPos);
        return result;
    } catch (const LexScannerException& e) {
        return (e.GetPosition() == kPos ? "! " : "!elsewhere ") + std::string(e.GetMessage());
    }
}
// Whether text matches "BEGIN...PART": it begins with BEGIN, and PART follows; without "..." it is the text.
bool Matches(const std::string& text, const std::string& pattern) {
    const size_t dots = pattern.find("...");
    if (dots == std::string::npos) return text == pattern;
    return text.rfind(pattern.substr(0, dots), 0) == 0 &&
           text.find(pattern.substr(dots + 3), dots) != text.npos;
}

// In order, in one interpreter: each error leaves it usable for the rows after it.
TEST(PythonBridge, ValuesAsTextAndErrors) {
    const testing::Finally reset(Reset);
    const std::pair<std::string, std::string> cases[] = {
        {"run:selfish = []\nselfish.append(selfish)\ndeep = []\nfor i in range(999): deep = [deep]\n", ""},
        {"[-1, -2**63, 2.5, [[]] * 2, 2**64, '', 'a\\x00b']",
         "[-1,-9223372036854775808,2.5,[[],[]],18446744073709551616,,a]"},
        {"deep", std::string(1000, '[') + std::string(1000, ']')},
        {"[deep]", "! Can't convert python result: lists nested more than 1000 deep"},
        {"selfish", "! Can't convert python result: a list that contains itself"},
        {"[1, None]", "! Can't convert python result of type NoneType"},
        {"'\\ud800'", "! Can't convert python result of type str : ...UnicodeEncodeError"},
        {"undefined", "! Eval python error: Traceback...NameError: name 'undefined' is not defined"},
        {"1\0+1"s, "! Eval python error: source code string cannot contain null bytes"},
        {"run:x = (\n", "! Python compilation error: ...SyntaxError"},
        {"run:ok = 1\0ok = 2\n"s, "! Python compilation error: source code string cannot contain null bytes"},
        {"run:raise ValueError('boom')\n", "! RunPython error: Traceback...ValueError: boom"},
        {"run:import sys\nsys.exit(3)\n", "! RunPython error: ...SystemExit: 3"},  // the host goes on
    };
    for (const auto& [code, expected] : cases) EXPECT_TRUE(Matches(Python(code), expected)) << Python(code);
    for (const char* big : {"7**1000", "-(13**777)", "2**4096 - 1"})
        EXPECT_EQ(Python(big), Python("str("s + big + ")")) << "as Python writes it";
}

TEST(PythonBridge, StartStopRestartAndRefusal) {
    const testing::Finally reset(Reset);
    basic_xstring pending = "stale", error;
    EXPECT_FALSE(GetPythonError(pending)) << "no interpreter, nothing pending";
    EXPECT_EQ(ExecutePythonExpression("1", error), nullptr);
    EXPECT_EQ(error, "the Python interpreter is not running");
    UninitPython();  // without a start
    // Each start is a fresh interpreter, whose standard error goes to the process's, not into the text of the
    // next error; an error does not keep it from stopping and starting again.
    for (int i = 0; i < 4; ++i) {
        EXPECT_EQ(Python("'n' in globals()"), "0");
        EXPECT_EQ(Python("run:import sys\nsys.stderr.write('warn')\nn = 1\n"), "");
        EXPECT_EQ(s_errorString.str(), "");
        EXPECT_FALSE(GetPythonError(pending));
        EXPECT_EQ(pending, "");
        const std::string traceback = Python("run:1 / 0");
        EXPECT_TRUE(Matches(traceback, "! RunPython error: Traceback...ZeroDivisionError")) << traceback;
        EXPECT_EQ(traceback.find("warn"), std::string::npos) << traceback;
        UninitPython();
    }
    // Refused while disallowed, without stopping a running interpreter.
    EXPECT_EQ(Python("run:kept = 3\n"), "");
    SetPythonAllowed(false);
    EXPECT_FALSE(InitPython(error));
    EXPECT_EQ(error, "Python is disabled");
    for (const char* code : {"kept", "run:x = 1\n"})
        EXPECT_EQ(Python(code), "! Python initialisation error: Python is disabled");
    SetPythonAllowed(true);
    EXPECT_EQ(Python("kept"), "3");
}

}  // namespace
}  // namespace orvan

// @runpython and Python macros through the expander: the shared namespace, output, errors, indentation.
#include <gtest/gtest.h>

#include <deque>
#include <string>

#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/python/python_bridge.h"
#include "python/capture_stdout.h"
#include "support/test_support.h"

namespace orvan {
namespace {

using testing::CaptureStdout;
using testing::MessageOf;

class RunPythonDirectiveTest : public ::testing::Test {
protected:
    void SetUp() override { SetPythonAllowed(true); }
    void TearDown() override {
        SetPythonAllowed(true);
        UninitPython();
    }

    // Expands text in the test's file frame (shared by all expansions of a test). The frame keeps views into
    // the texts that defined its macros, so the texts live as long as the test.
    std::string Expand(const std::string& text) {
        const std::string& kept = texts.emplace_back(text);
        basic_xstring result;
        MacroExpand(nullptr, &frame, BasicSubString(kept), 0, 0, result);
        return result;
    }

    std::string Eval(const std::string& expression) {
        basic_xstring result;
        EvalPythonExpression(expression, result, nullptr);
        return result;
    }

    std::deque<std::string> texts;
    FileScopeVarFrame frame;
};

TEST_F(RunPythonDirectiveTest, BlocksShareMainAcrossBlocksAndExpansions) {
    EXPECT_EQ(Expand("@runpython{a = 1}\n@runpython{b = a + 1}\n"), "");
    EXPECT_EQ(Expand("@runpython{c = a + b}"), "");
    EXPECT_EQ(Eval("[a, b, c]"), "[1,2,3]");
}

TEST_F(RunPythonDirectiveTest, PythonMacroSeesNamesOfEarlierBlocks) {
    EXPECT_EQ(Expand("@runpython{x = 6*7}\n@defpython answer = {x}\n<answer>\n"), "<42>\n");
}

TEST_F(RunPythonDirectiveTest, MacrosInTheBlockAreExpandedBeforeItRuns) {
    EXPECT_EQ(Expand("@def seven = {7}\n@runpython{w = seven * 2}\n"), "");
    EXPECT_EQ(Eval("w"), "14");
}

TEST_F(RunPythonDirectiveTest, PrintingGoesToStandardOutputOnly) {
    CaptureStdout capture;
    const std::string out = Expand("before\n    @runpython{print('hi', 1 + 1)}\nafter\n");
    EXPECT_EQ(capture.Finish(), "hi 2\n");
    // The directive leaves nothing behind, not even its line.
    EXPECT_EQ(out, "before\nafter\n");
}

TEST_F(RunPythonDirectiveTest, IndentationOfABlockOnTheNextLineIsRemoved) {
    // Python refuses indented top-level code, so this runs only if the block's four columns are removed.
    const std::string text =
        "@runpython\n"
        "{\n"
        "    total = 0\n"
        "    for i in range(4):\n"
        "        total += i\n"
        "\tlast = i\n"
        "}\n"
        "done\n";
    EXPECT_EQ(Expand(text), "done\n");
    EXPECT_EQ(Eval("[total, last]"), "[6,3]");
}

TEST_F(RunPythonDirectiveTest, ErrorsCarryTheContextLineAndPointAtTheDirective) {
    const struct {
        const char* text;
        const char* prefix;
        const char* detail;
        const char* code;  // the expanded block, quoted after the context line
    } cases[] = {
        {"ok\n  @runpython{x = (}", "Python compilation error: ", "SyntaxError", "x = ("},
        {"ok\n  @runpython{raise ValueError('bad')}", "RunPython error: ", "ValueError: bad",
         "raise ValueError('bad')"},
        {"ok\n  @runpython{import sys; sys.exit(2)}", "RunPython error: ", "SystemExit: 2",
         "import sys; sys.exit(2)"},
    };
    for (const auto& c : cases) {
        const std::string text = c.text;
        const char* position = nullptr;
        const std::string message = MessageOf(
            [&] {
                basic_xstring result;
                MacroExpand(nullptr, &frame, BasicSubString(text), 0, 0, result);
            },
            position);
        EXPECT_EQ(message.rfind(c.prefix, 0), 0u) << message;
        EXPECT_NE(message.find(c.detail), std::string::npos) << message;
        const std::string context = std::string("\n    in @runpython()\n") + c.code;
        ASSERT_GE(message.size(), context.size()) << message;
        EXPECT_EQ(message.substr(message.size() - context.size()), context) << message;
        EXPECT_EQ(position, text.c_str() + text.find('@')) << message;
        // The interpreter stays usable after the error.
        EXPECT_EQ(Expand("@runpython{still = 'fine'}"), "");
        EXPECT_EQ(Eval("still"), "fine");
    }
}

TEST_F(RunPythonDirectiveTest, PythonMacroErrorsAndUnconvertibleValues) {
    EXPECT_EQ(Expand("@defpython none = {None}\n@defpython nope = {undefined_name}\n"), "");
    const std::string noneMessage = MessageOf([&] { Expand("none"); });
    EXPECT_EQ(noneMessage.rfind("Can't convert python result of type NoneType", 0), 0u) << noneMessage;
    const std::string evalMessage = MessageOf([&] { Expand("nope"); });
    EXPECT_EQ(evalMessage.rfind("Eval python error: ", 0), 0u) << evalMessage;
    EXPECT_NE(evalMessage.find("NameError"), std::string::npos) << evalMessage;
}

TEST_F(RunPythonDirectiveTest, EmptyBlockDoesNotStartTheInterpreter) {
    // With Python disabled any start-up fails, so an empty block must not attempt one.
    SetPythonAllowed(false);
    EXPECT_EQ(Expand("a\n@runpython{}\nb\n"), "a\nb\n");
    EXPECT_EQ(Expand("@def nothing = {}\n@runpython{nothing}\n"), "");
}

TEST_F(RunPythonDirectiveTest, DisabledPythonFailsTheDirective) {
    SetPythonAllowed(false);
    const std::string text = "@runpython{x = 1}";
    const char* position = nullptr;
    EXPECT_EQ(MessageOf([&] { Expand(text); }, position),
              "Python initialisation error: Python is disabled\n    in @runpython()\nx = 1");
    EXPECT_EQ(position, texts.back().c_str());
}

TEST_F(RunPythonDirectiveTest, RestartsWithAnErrorInEveryOtherBlock) {
    for (int i = 0; i < 100; ++i) {
        const std::string n = std::to_string(i);
        if (i % 2 == 1) {
            const std::string message = MessageOf([&] { Expand("@runpython{1 / 0}"); });
            EXPECT_EQ(message.rfind("RunPython error: ", 0), 0u) << message;
        } else {
            EXPECT_EQ(Expand("@runpython{n = " + n + "}"), "");
        }
        EXPECT_EQ(Eval("n if 'n' in globals() else -1"), i % 2 == 1 ? "-1" : n);
        UninitPython();
    }
}

}  // namespace
}  // namespace orvan

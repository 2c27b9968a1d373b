// A block opened with "{" on the directive's line, its code indented under the directive.
#include <gtest/gtest.h>

#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/python/python_bridge.h"

namespace orvan {
namespace {

TEST(RunPythonIndentation, CodeIndentedUnderAnInlineBraceRuns) {
    SetPythonAllowed(true);
    const std::string text =
        "  @runpython {\n"
        "      values = []\n"
        "      for i in range(3):\n"
        "          values.append(i)\n"
        "\n"
        "  }\n"
        "rest\n";
    FileScopeVarFrame frame;
    basic_xstring out;
    MacroExpand(nullptr, &frame, BasicSubString(text), 0, 0, out);
    EXPECT_EQ(out, "rest\n");
    basic_xstring value;
    EvalPythonExpression("values", value, nullptr);
    EXPECT_EQ(value, "[0,1,2]");
    UninitPython();
}

}  // namespace
}  // namespace orvan

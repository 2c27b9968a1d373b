// The @runpython directive: expands a block of Python statements and runs it in the shared interpreter.
#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/foundations/text_format.h"
#include "ovmacro/lexer/section_scanners.h"
#include "ovmacro/python/python_bridge.h"

namespace orvan {

void MacroExpander::ProcessRunPythonDirective() {
    // Just after the word; a Python error is finally placed at the '@' (below), since the code that failed is
    // an expanded copy, not the source.
    const char* position = cursor.begin();
    int64 indent = 0;
    const BasicSubString block = ScanSubstString(cursor, indent);

    // Macros in the block are expanded first, in a child frame so that definitions made there stay local; the
    // block's indentation is removed from the expanded code afterwards.
    basic_xstring code;
    {
        VarFrame child(frame);
        MacroExpand(nullptr, &child, block, 0, 0, code);
    }

    // An empty block does nothing and, in particular, does not start the interpreter.
    if (!code.empty()) {
        StringStream program(4096);
        WriteSubStringWithAdjustedIndent(program, BasicSubString(code), indent);
        program << '\n';
        try {
            RunPython("", program.GetString(), position);
        } catch (LexScannerException& e) {
            e.AppendToMessage("\n    in @runpython()\n");
            e.AppendToMessage(code);
            e.SetPosition(currentToken.begin());
            throw;
        }
    }

    // The directive leaves nothing in the output, not even its line: Python's output goes to xcout only.
    ScanOverWhiteSpaceAfterDirective();
}

}  // namespace orvan

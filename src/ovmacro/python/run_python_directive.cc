// The @runpython directive: expands a block of Python statements and runs it in the shared interpreter.
#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/foundations/text_format.h"
#include "ovmacro/lexer/section_scanners.h"
#include "ovmacro/output/source_files.h"
#include "ovmacro/python/python_bridge.h"

namespace orvan {

namespace {

// The blanks and tabs that begin every line holding code (blank lines aside), as Python's textwrap.dedent
// finds them. A block opened with "{" at the end of the directive's line reports no indentation, yet users
// indent its lines under the directive; Python refuses indented top-level code, so that common prefix goes.
std::string_view CommonIndentation(std::string_view code) {
    std::string_view common;
    bool first = true;
    for (size_t lineStart = 0; lineStart < code.size();) {
        size_t lineEnd = code.find('\n', lineStart);
        if (lineEnd == std::string_view::npos) lineEnd = code.size();
        const std::string_view line = code.substr(lineStart, lineEnd - lineStart);
        const size_t textStart = line.find_first_not_of(" \t\r");
        if (textStart != std::string_view::npos) {
            const std::string_view indent = line.substr(0, textStart);
            if (first) {
                common = indent;
                first = false;
            } else {
                size_t n = 0;
                while (n < common.size() && n < indent.size() && common[n] == indent[n]) ++n;
                common = common.substr(0, n);
            }
        }
        lineStart = lineEnd + 1;
    }
    return common;
}

basic_xstring RemoveCommonIndentation(const basic_xstring& code) {
    const std::string_view common = CommonIndentation(code);
    if (common.empty()) return code;
    basic_xstring out;
    out.reserve(code.size());
    for (size_t lineStart = 0; lineStart < code.size();) {
        size_t lineEnd = code.find('\n', lineStart);
        lineEnd = lineEnd == basic_xstring::npos ? code.size() : lineEnd + 1;
        std::string_view line(code.data() + lineStart, lineEnd - lineStart);
        if (line.substr(0, common.size()) == common) line.remove_prefix(common.size());
        out.append(line);
        lineStart = lineEnd;
    }
    return out;
}

}  // namespace

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
        // Compiled under the template's name, its lines numbered as the template's, so that a traceback
        // names the line the user wrote.
        basic_xstring fileName = "<runpython>";
        int64 firstLine = 1;
        if (!ExpandingFiles::Locate(block.begin(), fileName, firstLine)) fileName = "<runpython>";
        StringStream program(4096);
        program << basic_xstring(static_cast<size_t>(firstLine > 1 ? firstLine - 1 : 0), '\n');
        if (indent > 0)
            WriteSubStringWithAdjustedIndent(program, BasicSubString(code), indent);
        else
            program << RemoveCommonIndentation(code);
        program << '\n';
        try {
            RunPython(fileName, program.GetString(), position);
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

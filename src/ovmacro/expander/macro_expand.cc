// The library's entry points: expand a text into an output, or into a string with or without its pieces.
#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/expander/nesting_guard.h"

namespace orvan {

void MacroExpand(ImportHandler* importHandler, VarFrame* frame, BasicSubString text, int64 inputIndent,
                 int64 outputIndent, ExpandedOutput& output) {
    MacroNestingGuard guard(text.begin());
    try {
        MacroExpander expander(importHandler, frame, text, inputIndent, outputIndent, output);
        expander.Expand();
    } catch (LexScannerException& e) {
        if (guard.IsOutermost()) e.AppendOmittedContextCount();
        throw;
    }
}

void MacroExpand(ImportHandler* importHandler, VarFrame* frame, BasicSubString text, int64 inputIndent,
                 int64 outputIndent, basic_xstring& result) {
    StringStream stream;
    ExpandedOutput output(&stream);
    MacroExpand(importHandler, frame, text, inputIndent, outputIndent, output);
    stream.GetString(result, true);
}

void MacroExpand(ImportHandler* importHandler, VarFrame* frame, BasicSubString text, int64 inputIndent,
                 int64 outputIndent, basic_xstring& result, OutputPieces& pieces) {
    StringStream stream;
    ExpandedOutput output(&stream);
    MacroExpand(importHandler, frame, text, inputIndent, outputIndent, output);
    stream.GetString(result, true);
    output.GetPieces(pieces);
}

}  // namespace orvan

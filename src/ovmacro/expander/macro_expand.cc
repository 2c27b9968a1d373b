// The library's entry points: expand a text into an output, or into a string with or without its pieces.
#include <new>

#include "ovmacro/expander/expansion_observer.h"
#include "ovmacro/expander/held_text.h"
#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/expander/nesting_guard.h"
#include "ovmacro/lexer/bracket_index.h"

namespace orvan {

void MacroExpand(ImportHandler* importHandler, VarFrame* frame, BasicSubString text, int64 inputIndent,
                 int64 outputIndent, ExpandedOutput& output) {
    MacroNestingGuard guard(text.begin());
    const BracketScope brackets(text);
    try {
        MacroExpander expander(importHandler, frame, text, inputIndent, outputIndent, output);
        try {
            expander.Expand();
        } catch (const std::bad_alloc&) {
            // Reported like any other error of the text, at the place reached, once the memory taken by the
            // innermost expansion is given back; the outer levels add their context lines to it.
            throw LexScannerException("Out of memory", expander.Position());
        }
        output.Flush();  // the caller finds the whole expansion in its stream
    } catch (LexScannerException& e) {
        output.Flush();  // what was written before the failure stays written
        if (ExpansionObserver* observer = ExpansionObserver::Current()) observer->ExpansionFailed(frame, e);
        // A position in a text that an expansion made (and that still lives) means nothing to a host: it
        // moves to the source. At every level, since a host may report the errors of a nested expansion.
        MovePositionOutOfHeldTexts(e);
        if (guard.IsOutermost()) e.AppendOmittedContextCount();
        throw;
    }
}

void MacroExpand(ImportHandler* importHandler, VarFrame* frame, BasicSubString text, int64 inputIndent,
                 int64 outputIndent, basic_xstring& result) {
    // The expansion of a text is usually about as long as the text: reserve that much at once.
    StringStream stream(static_cast<size_t>(text.size()) + 16);
    ExpandedOutput output(&stream, false);  // nobody asks for the pieces
    output.GatherShortRuns();
    MacroExpand(importHandler, frame, text, inputIndent, outputIndent, output);
    stream.GetString(result, true);
}

void MacroExpand(ImportHandler* importHandler, VarFrame* frame, BasicSubString text, int64 inputIndent,
                 int64 outputIndent, basic_xstring& result, OutputPieces& pieces) {
    // The expansion of a text is usually about as long as the text: reserve that much at once.
    StringStream stream(static_cast<size_t>(text.size()) + 16);
    ExpandedOutput output(&stream);
    output.GatherShortRuns();
    MacroExpand(importHandler, frame, text, inputIndent, outputIndent, output);
    stream.GetString(result, true);
    output.GetPieces(pieces);
}

}  // namespace orvan

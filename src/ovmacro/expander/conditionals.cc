// @if, @elseif and @else: choose at most one block of a chain and expand it in place.
#include "ovmacro/expander/directive_text.h"
#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/lexer/section_scanners.h"

namespace orvan {

bool MacroExpander::ParseBoolExpressionInBrackets(BasicSubString directiveName) {
    const BasicSubString condition = ScanBrackettedSection(cursor, true, TK_LPAREN, TK_RPAREN);
    return EvaluateConditionText(frame, condition, directiveName, currentToken.begin());
}

void MacroExpander::ProcessIfDirective() {
    bool chosen = false;
    BasicSubString chosenBlock;
    int64 chosenIndent = 0;
    auto consider = [&](bool condition) {
        int64 indent = 0;
        const BasicSubString block = ScanSubstString(cursor, indent);
        if (!chosen && condition) {
            chosen = true;
            chosenBlock = block;
            chosenIndent = indent;
        }
    };

    consider(ParseBoolExpressionInBrackets("@if"));
    for (;;) {
        BasicSubString ahead = cursor;
        if (!ScanElseIfBlock(ahead)) break;
        cursor = ahead;
        // Every @elseif condition is evaluated, also after a block was chosen: its errors and side effects
        // happen in every case.
        consider(ParseBoolExpressionInBrackets("@elseif"));
    }
    BasicSubString ahead = cursor;
    if (ScanElseBlock(ahead)) {
        cursor = ahead;
        consider(true);
    }
    AdvanceWritePos(cursor.begin(), false);
    if (!chosen || chosenBlock.empty()) return;
    VarFrame blockFrame(frame);
    MacroExpand(nullptr, &blockFrame, chosenBlock, chosenIndent, GetOutputPos(), *output);
}

}  // namespace orvan

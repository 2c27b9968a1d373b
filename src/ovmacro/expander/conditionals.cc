// @if, @elseif and @else: choose at most one block of a chain and expand it in place.
#include "ovmacro/expander/condition.h"
#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/expr/expression_parser.h"
#include "ovmacro/foundations/compose.h"
#include "ovmacro/foundations/text_format.h"
#include "ovmacro/lexer/section_scanners.h"

namespace orvan {

bool ParseExpandedCondition(const basic_xstring& expanded) {
    ExpressionParser parser;
    parser.GetToken() = LSToken(TK_LPAREN, BasicSubString("("));
    parser.Init(BasicSubString(expanded));
    const bool value = parser.ParseBool(false);
    if (parser.GetTokenType() != TK_EOS)
        throw LexScannerException(
            Compose("Expected ) after ", parser.lastToken, " when read ", parser.GetToken(), " in expression"),
            parser.GetToken());
    return value;
}

bool EvaluateConditionText(VarFrame* frame, BasicSubString condition, BasicSubString directiveName,
                           BasicSubString directiveAt) {
    basic_xstring expanded;
    try {
        VarFrame child(frame);
        MacroExpand(nullptr, &child, condition, 0, 0, expanded);
    } catch (LexScannerException& e) {
        // A call-chain line: a condition that invokes itself would otherwise add one line per level.
        e.AppendCallContextLine(Compose("\n    in ", directiveName, "(", condition, ")"));
        throw;
    }
    try {
        return ParseExpandedCondition(expanded);
    } catch (LexScannerException& e) {
        // The expanded text has no place in the source: the error moves to the directive's '@'.
        StringFindAndReplace(e.GetMessage(), "EOS", ")");
        e.AppendToMessage(Compose("\n    in ", directiveName, "(", expanded, ")"));
        e.SetPosition(directiveAt.begin());
        throw;
    }
}

bool MacroExpander::ParseBoolExpressionInBrackets(BasicSubString directiveName) {
    const BasicSubString condition = ScanBrackettedSection(cursor, true, TK_LPAREN, TK_RPAREN);
    return EvaluateConditionText(frame, condition, directiveName, currentToken);
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

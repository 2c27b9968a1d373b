// @if, @elseif and @else: choose at most one block of a chain and expand it in place.
#include "ovmacro/expander/directive_text.h"
#include "ovmacro/expander/expansion_observer.h"
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
    // For an observer: the directive that chose the block, where it stands, and its condition as written.
    std::string_view chosenBy;
    const char* chosenAt = nullptr;
    BasicSubString chosenCondition;
    auto consider = [&](std::string_view directive, const char* at, const char* conditionBegin,
                        bool condition) {
        const BasicSubString conditionText(conditionBegin, cursor.begin());
        int64 indent = 0;
        const BasicSubString block = ScanSubstString(cursor, indent);
        if (!chosen && condition) {
            chosen = true;
            chosenBlock = block;
            chosenIndent = indent;
            chosenBy = directive;
            chosenAt = at;
            chosenCondition = conditionText;
        }
    };

    const char* conditionBegin = cursor.begin();
    consider("@if", currentToken.begin(), conditionBegin, ParseBoolExpressionInBrackets("@if"));
    for (;;) {
        BasicSubString ahead = cursor;
        if (!ScanElseIfBlock(ahead)) break;
        cursor = ahead;
        // Every @elseif condition is evaluated, also after a block was chosen: its errors and side effects
        // happen in every case.
        conditionBegin = cursor.begin();
        consider("@elseif", conditionBegin, conditionBegin, ParseBoolExpressionInBrackets("@elseif"));
    }
    BasicSubString ahead = cursor;
    if (ScanElseBlock(ahead)) {
        cursor = ahead;
        consider("@else", cursor.begin(), cursor.begin(), true);
    }
    AdvanceWritePos(cursor.begin(), false);
    if (!chosen || chosenBlock.empty()) return;
    VarFrame blockFrame(frame);
    const ObservedExpansion observed(chosenBy, BasicSubString(chosenAt, chosenAt), BasicSubString(),
                                     chosenCondition, *output);
    MacroExpand(nullptr, &blockFrame, chosenBlock, chosenIndent, GetOutputPos(), *output);
}

}  // namespace orvan

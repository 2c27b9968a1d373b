// @for over a list or a list of tuples, and @while: expand a block once per item or while a condition holds.
#include "ovmacro/expander/directive_text.h"
#include "ovmacro/expander/expansion_observer.h"
#include "ovmacro/expander/held_text.h"
#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/foundations/compose.h"
#include "ovmacro/lexer/section_scanners.h"
#include "ovmacro/lexer/token_scanner.h"

namespace orvan {

namespace {

// Binds a loop name to an item's text: a macro without arguments, expanded where it is used with the names
// of the frame that holds the loop.
void BindLoopName(VarFrame& iterationFrame, VarFrame* loopFrame, BasicSubString name, BasicSubString value) {
    auto* m = new LSMacroVariable(LSV_Macro, name, loopFrame, false, false, false);
    m->SetSubstitutionString(value, false, 0);
    iterationFrame.AddVariable(m);
}

}  // namespace

void MacroExpander::ProcessForDirective() {
    LSToken token = ReadToken();
    if (token.type != TK_LPAREN)
        throw LexScannerException(Compose("( expected after @for when read ", token), token);
    xvector<BasicSubString> names;  // the tuple form's names
    BasicSubString singleName;
    token = ReadToken();
    if (token.type == TK_LPAREN) {
        for (;;) {
            token = ReadToken();
            if (token.type != TK_IDENTIFIER)
                throw LexScannerException(Compose("Identifier expected when read ", token), token);
            names.push_back(token.text);
            token = ReadToken();
            if (token.type == TK_RPAREN) break;
            if (token.type != TK_COMMA)
                throw LexScannerException(Compose(", or ) expected when read ", token), token);
        }
    } else if (token.type == TK_IDENTIFIER) {
        singleName = token.text;
    } else {
        throw LexScannerException(Compose("Identifier expected after @for( when read ", token), token);
    }
    token = ReadToken();
    if (token != "in") throw LexScannerException(Compose("'in' expected when read ", token), token);
    const char* listPosition = cursor.begin();
    const BasicSubString listText = ScanBrackettedSection(cursor, false, TK_LPAREN, TK_RPAREN);

    // Items are views into the expanded list, and so are the bodies of the loop names: the list is a held
    // text, which outlives the loop if its items define anything, and from which errors move to the source.
    HeldTextKeeper keeper(frame);
    const HeldText& held = keeper.ExpandAndHold(" @for", listText);
    const BasicSubString list = held.GetText();
    int64 indent = 0;
    BasicSubString block;
    try {
        block = ScanSubstString(cursor, indent);
    } catch (LexScannerException& e) {
        e.AppendToMessage("\n    for @for directive");
        throw;
    }
    AdvanceWritePos(cursor.begin(), false);
    const int64 blockOutputIndent = GetOutputPos();

    // Errors in cutting the list refer to the expanded list, a temporary text: they are placed after `in`.
    auto listError = [&](const basic_xstring& message) {
        return LexScannerException(message, listPosition);
    };
    BasicSubString items(list);
    const LSToken open = LsScanToken(items, false);
    if (open.type != TK_LBRACKET) throw listError(Compose("[ expected when read ", open));
    for (;;) {
        BasicSubString item;
        LSToken end;
        try {
            end = ScanArgument(items, item, TK_RBRACKET);
        } catch (LexScannerException& e) {
            e.AppendContextLine(Compose("\n    in @for directive for list ", list));
            e.SetPosition(listPosition);
            throw;
        }
        if (end.type != TK_COMMA && item.empty()) break;

        VarFrame iterationFrame(frame);
        if (names.empty()) {
            BindLoopName(iterationFrame, frame, singleName, item);
        } else {
            BasicSubString values = item;
            const LSToken tupleOpen = LsScanToken(values, false);
            if (tupleOpen.type != TK_LPAREN) throw listError(Compose("( expected when read ", tupleOpen));
            for (size_t i = 0; i < names.size(); ++i) {
                BasicSubString value;
                LSToken valueEnd;
                try {
                    valueEnd = ScanArgument(values, value, TK_RPAREN);
                } catch (LexScannerException& e) {
                    e.AppendContextLine(Compose("\n    in @for directive for list ", list));
                    e.SetPosition(listPosition);
                    throw;
                }
                const bool last = i + 1 == names.size();
                if (!last && valueEnd.type != TK_COMMA) throw listError(Compose(", expected when read ", valueEnd));
                if (last && valueEnd.type != TK_RPAREN) throw listError(Compose(") expected when read ", valueEnd));
                BindLoopName(iterationFrame, frame, names[i], value);
            }
        }
        try {
            const ObservedExpansion observed("@for", currentToken, singleName, item, *output);
            MacroExpand(nullptr, &iterationFrame, block, indent, blockOutputIndent, *output);
        } catch (LexScannerException& e) {
            held.MovePositionOut(e);
            // A call-chain line: a block that invokes itself would otherwise add one line per level.
            e.AppendCallContextLine(Compose("\n    in @for directive when ", singleName, " = ", item));
            throw;
        }
        if (end.type == TK_RBRACKET) break;
        if (end.type != TK_COMMA) throw listError(Compose(", or ] expected when read ", end));
    }
}

void MacroExpander::ProcessWhileDirective() {
    const BasicSubString condition = ScanBrackettedSection(cursor, true, TK_LPAREN, TK_RPAREN);
    int64 indent = 0;
    BasicSubString block;
    try {
        block = ScanSubstString(cursor, indent);
    } catch (LexScannerException& e) {
        e.AppendToMessage("\n    for @while directive");
        throw;
    }
    AdvanceWritePos(cursor.begin(), false);
    const int64 blockOutputIndent = GetOutputPos();
    while (EvaluateConditionText(frame, condition, "@while", currentToken.begin())) {
        if (block.empty()) continue;
        VarFrame iterationFrame(frame);
        const ObservedExpansion observed("@while", currentToken, BasicSubString(), condition, *output);
        MacroExpand(nullptr, &iterationFrame, block, indent, blockOutputIndent, *output);
    }
}

}  // namespace orvan

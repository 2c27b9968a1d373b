// @for over a list or a list of tuples, and @while: expand a block once per item or while a condition holds.
#include <algorithm>

#include "ovmacro/expander/directive_text.h"
#include "ovmacro/expander/expansion_observer.h"
#include "ovmacro/expander/held_text.h"
#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/expander/nesting_guard.h"
#include "ovmacro/expander/plain_text.h"
#include "ovmacro/foundations/compose.h"
#include "ovmacro/foundations/scanning.h"
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

BasicSubString MacroExpander::OrdinaryListText(BasicSubString listText) {
    if (ExpansionObserver::CallWatcher()) return {};  // which sees the list's macro invoked
    if (std::find(listText.begin(), listText.end(), '\n') != listText.end()) return {};
    BasicSubString rest = listText;
    ScanWhiteSpace(rest);
    const char* wordBegin = rest.begin();
    if (ScanIdentifier(rest)) {
        const BasicSubString word(wordBegin, rest.begin());
        ScanWhiteSpace(rest);
        if (!rest.empty()) return {};
        text = OrdinaryValueOfName(FindVariable(word), frame);
        if (text.empty()) return {};
        // The list's expansion is a level, and the macro's body one inside it.
        const MacroNestingGuard listLevel(listText.begin()), bodyLevel(text.begin());
        MacroNestingGuard::ChargeOutput(listText.size() - word.size() + text.size(), listText.begin());
        return text;
    }
    if (!IsOrdinaryTextIn(listText, frame, DollarMacrosActive(frame))) return {};
    const MacroNestingGuard listLevel(listText.begin());
    MacroNestingGuard::ChargeOutput(listText.size(), listText.begin());
    return listText;
}

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
    // A list that expands to itself, or the name of a macro whose body is such a list (one list used by
    // several loops), is taken as it stands, where its items and their errors already lie in the source.
    HeldTextKeeper keeper(frame);
    const HeldText* held = nullptr;
    BasicSubString list = OrdinaryListText(listText);
    if (list.empty()) {
        held = &keeper.ExpandAndHold(" @for", listText);
        list = held->GetText();
    }
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
    if (names.empty()) names.push_back(singleName);
    // A block of ordinary text, loop names and @str of them is cut once and written item by item.
    LoopBlockPlan plan;
    // A tool that watches calls sees each loop name invoked: the general way, which invokes them.
    const bool planned =
        !ExpansionObserver::CallWatcher() && PlanLoopBlock(block, indent, names, frame, plan);
    const bool dollarMacrosActive = planned && DollarMacrosActive(frame);
    xvector<BasicSubString> values(names.size());
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

        if (singleName) {
            values[0] = item;
        } else {
            BasicSubString rest = item;
            const LSToken tupleOpen = LsScanToken(rest, false);
            if (tupleOpen.type != TK_LPAREN) throw listError(Compose("( expected when read ", tupleOpen));
            for (size_t i = 0; i < names.size(); ++i) {
                LSToken valueEnd;
                try {
                    valueEnd = ScanArgument(rest, values[i], TK_RPAREN);
                } catch (LexScannerException& e) {
                    e.AppendContextLine(Compose("\n    in @for directive for list ", list));
                    e.SetPosition(listPosition);
                    throw;
                }
                const bool last = i + 1 == names.size();
                if (!last && valueEnd.type != TK_COMMA) throw listError(Compose(", expected when read ", valueEnd));
                if (last && valueEnd.type != TK_RPAREN) throw listError(Compose(") expected when read ", valueEnd));
            }
        }
        const bool plain = planned && std::all_of(plan.begin(), plan.end(), [&](const LoopBlockPart& part) {
            return part.kind == LoopBlockPart::kText ||
                   (IsPlainLoopItem(values[part.name], frame, dollarMacrosActive) &&
                    (part.kind == LoopBlockPart::kName || !values[part.name].empty()));
        });
        try {
            const ObservedExpansion observed("@for", currentToken, singleName, item, *output);
            if (plain) {
                WritePlannedIteration(plan, values, block, blockOutputIndent);
            } else {
                VarFrame iterationFrame(frame);
                for (size_t i = 0; i < names.size(); ++i) BindLoopName(iterationFrame, frame, names[i], values[i]);
                MacroExpand(nullptr, &iterationFrame, block, indent, blockOutputIndent, *output);
            }
        } catch (LexScannerException& e) {
            if (held) held->MovePositionOut(e);
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

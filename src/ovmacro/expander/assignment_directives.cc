// The directives that change what names mean: @let (typed variables), @$NAME = ... (dollar macros of the
// file) and @scope (a block in a fresh frame).
#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/foundations/compose.h"
#include "ovmacro/lexer/section_scanners.h"

namespace orvan {

namespace {

// The value of `:=`: the text's macro expansion, taken as it is.
basic_xstring ExpandValueText(VarFrame* frame, BasicSubString text) {
    basic_xstring expanded;
    VarFrame child(frame);
    MacroExpand(nullptr, &child, text, 0, 0, expanded);
    return expanded;
}

[[noreturn]] void ThrowColonEqualsNotString(const LSToken& name) {
    throw LexScannerException(
        Compose("@let directive failed: ", name, " := may only be used for string type"), name);
}

}  // namespace

void MacroExpander::ProcessLetDirective() {
    const LSToken first = ReadToken();
    const ELSVariable type = CheckVariableType(first.text);
    // Every value is computed into a fresh string and stored only when it is complete, so that a @let that
    // fails leaves the variable (or the frame) as it was.
    basic_xstring value;
    if (type != LSV_Macro) {
        const LSToken name = ReadToken();
        if (name.type != TK_IDENTIFIER)
            throw LexScannerException(Compose("Identifier expected for macro name when read ", name), name);
        if (frame->FindLocal(name.text, cursor.begin()))
            throw LexScannerException(Compose("Redefinition of variable ", name, " in this scope"), name);
        const bool colon = ReadEqualsForVariableDefn2(name.text);
        int64 indent = 0;
        const BasicSubString valueText = ScanSubstString(cursor, indent);
        if (colon) {
            if (type != LSV_String) ThrowColonEqualsNotString(name);
            value = ExpandValueText(frame, valueText);
        } else {
            ReadVariableValueByParsingExpression(frame, valueText, type, value);
        }
        AddVariable(new LSValueVariable(type, name.text, BasicSubString(value)));
    } else {
        if (first.type != TK_IDENTIFIER)
            throw LexScannerException(Compose("Identifier expected after @let when read ", first), first);
        LSVariable* found = FindVariable(first.text);
        if (!found)
            throw LexScannerException(Compose("@let directive failed : there is no variable named ", first),
                                      first);
        if (found->GetType() == LSV_Macro)
            throw LexScannerException(
                Compose("@let directive failed : ", first, " is a macro declared using @def"), first);
        // Any variable that is not a macro holds a typed value.
        auto* variable = static_cast<LSValueVariable*>(found);
        const bool colon = ReadEqualsForVariableDefn2(first.text);
        int64 indent = 0;
        const BasicSubString valueText = ScanSubstString(cursor, indent);
        if (colon) {
            if (variable->GetType() != LSV_String) ThrowColonEqualsNotString(first);
            value = ExpandValueText(frame, valueText);
        } else {
            try {
                ReadVariableValueByParsingExpression(frame, valueText, variable->GetType(), value);
            } catch (LexScannerException& e) {
                e.AppendToMessage(
                    Compose("\n    when parsing expression '", valueText, "' for @let directive"));
                throw;
            }
        }
        // The variable may belong to an enclosing frame: the new value outlives the block that set it.
        variable->value.swap(value);
    }
    ScanOverWhiteSpaceAfterDirective();
}

void MacroExpander::ProcessDollarDefDirective() {
    const LSToken name = ReadToken();
    if (name.type != TK_IDENTIFIER)
        throw LexScannerException(Compose("Identifier expected after @$ when read ", name), name);
    ReadEqualsForVariableDefn(name.text);
    const LSToken open = ReadToken();
    basic_xstring value;
    if (open.type == TK_LPAREN) {
        value = ParseStringExpressionInBrackets("@$", false);
    } else if (open.type == TK_DQ_STRING) {
        open.GetLiteralString(value);
    } else {
        throw LexScannerException(
            Compose("Quoted string expected after $", name, " definition when read ", open), open);
    }
    // Dollar macros belong to the file; a frame tree without a file-scope root has nowhere to keep them.
    FileScopeVarFrame* fileScope = frame->GetFileScopeVarFrame();
    if (!fileScope) throw LexScannerException(Compose("No filescope frame for $", name), name);
    fileScope->InsertDollarMacro(name.GetTokenString(), value);
    AdvanceWritePos(cursor.begin(), false);
}

void MacroExpander::ProcessScopeDirective() {
    int64 indent = 0;
    const BasicSubString block = ScanSubstString(cursor, indent);
    AdvanceWritePos(cursor.begin(), false);
    if (block.empty()) return;
    VarFrame scope(frame);
    MacroExpand(nullptr, &scope, block, indent, GetOutputPos(), *output);
}

}  // namespace orvan

// Invocation of the variables that the driver finds by name: value variables are replaced by their value;
// macros read their arguments, bind them in a fresh frame and have their body expanded, evaluated as a typed
// expression, or evaluated by Python.
#include <memory>
#include <optional>
#include <span>

#include "ovmacro/expander/call_context.h"
#include "ovmacro/expander/held_text.h"
#include "ovmacro/expander/directive_text.h"
#include "ovmacro/expander/expansion_observer.h"
#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/expander/nesting_guard.h"
#include "ovmacro/expander/plain_text.h"
#include "ovmacro/expr/expression_parser.h"
#include "ovmacro/foundations/compose.h"
#include "ovmacro/foundations/scanning.h"
#include "ovmacro/foundations/small_buffer.h"
#include "ovmacro/foundations/text_format.h"
#include "ovmacro/lexer/section_scanners.h"
#include "ovmacro/python/python_bridge.h"

namespace orvan {

namespace {

// Whether a macro's body is all ordinary text (see SkipPlainText), so that its expansion is the body itself.
bool IsPlainText(const LSMacroVariable& m, const VarFrame* bodyParent) {
    const BasicSubString body = m.GetSubstitutionString();
    const FileScopeVarFrame* fileScope = bodyParent->GetFileScopeVarFrame();
    const bool dollarMacrosActive =
        fileScope && (!fileScope->dollarMacros.empty() || !fileScope->importedFiles.empty());
    return SkipPlainText(body.begin(), body.end(), m.GetIndent() > 0, dollarMacrosActive).stop == body.end();
}

// The commonest argument list: "(", then names separated by commas, then ")", blanks allowed around each
// name. Read in one pass, each name exactly as ScanArgument reads it; false, with the cursor where it was, for
// any other list (and for a wrong number of arguments), which the general way reads and reports.
bool ReadNameArguments(BasicSubString& cursor, std::span<BasicSubString> actual) {
    const char* p = cursor.begin();
    const char* const end = cursor.end();
    if (p == end || *p != '(') return false;
    ++p;
    for (size_t i = 0; i < actual.size(); ++i) {
        while (p < end && IsWhiteSpace(*p)) ++p;
        if (p == end || !IsIdentifierStart(*p) || BeginsRawLiteral(p, end)) return false;
        const char* const start = p++;
        while (p < end && IsIdentifierChar(*p)) ++p;
        actual[i] = BasicSubString(start, p);
        while (p < end && IsWhiteSpace(*p)) ++p;
        if (p == end || *p != (i + 1 < actual.size() ? ',' : ')')) return false;
        ++p;
    }
    cursor.SetBegin(p);
    return true;
}

}  // namespace

void MacroExpander::InvokeVariable(LSVariable* v) {
    if (v->GetType() != LSV_Macro) {
        // A value variable is replaced by its value, mapped back to the name.
        AdvanceWritePos(cursor.begin(), false);
        WriteCalculatedSubString(BasicSubString(static_cast<LSValueVariable*>(v)->value));
        return;
    }
    auto* m = static_cast<LSMacroVariable*>(v);
    if (m->IsFnArg()) {
        InvokeMacroFunction(m);
        return;
    }

    const int64 n = m->GetNumArgs();
    // Macros rarely take more than a few arguments: their texts and bindings then need no allocation.
    constexpr size_t kInlineArgs = 4;
    SmallBuffer<BasicSubString, kInlineArgs> actual(static_cast<size_t>(n));
    const ObservedExpansion observed(*m, currentToken, actual, output);
    const bool nameArguments = n > 0 && ReadNameArguments(cursor, {actual.data(), actual.size()});
    if (n > 0 && !nameArguments) {
        const LSToken open = ReadToken();
        if (open.type != TK_LPAREN)
            throw LexScannerException(
                Compose("( expected to begin argument list for macro ", *m, " when read ", open), open);
        for (int64 i = 0; i < n; ++i) {
            const LSToken end = ScanArgument(cursor, actual[static_cast<size_t>(i)], TK_RPAREN);
            if (i < n - 1 && end.type == TK_RPAREN)
                throw LexScannerException(Compose("Insufficient arguments provided for macro ", *m), end);
            if (i == n - 1 && end.type == TK_COMMA)
                throw LexScannerException(Compose("Too many arguments provided for macro ", *m), end);
        }
    }
    AdvanceWritePos(cursor.begin(), false);

    // A naked macro binds its arguments, and keeps what its body defines, in the invoker's own frame.
    VarFrame* const parentFrame = m->GetContext() ? m->GetContext() : frame;
    if (n == 0 && !m->IsPython() && m->GetReturnType() == LSV_Macro && IsPlainText(*m, parentFrame)) {
        // A body that holds nothing but ordinary text expands to itself: copy it as its expansion would.
        const BasicSubString body = m->GetSubstitutionString();
        const int64 before = output->GetCharCount();
        WriteCopiedText(*output, body, GetOutputPos());
        MacroNestingGuard::ChargeOutput(output->GetCharCount() - before, body.begin());
        return;
    }
    if (n > 0 && ExpandPlainBody(*m, parentFrame, actual.view(), nameArguments)) return;
    std::optional<VarFrame> ownFrame;
    VarFrame* bodyFrame = frame;
    if (!m->IsNaked()) bodyFrame = &ownFrame.emplace(parentFrame);

    SmallBuffer<LSVariable*, kInlineArgs> bound(static_cast<size_t>(n));
    for (int64 i = 0; i < n; ++i) {
        const LSFormalArg& formal = m->GetArg(i);
        const BasicSubString arg = actual[static_cast<size_t>(i)];
        LSVariable* binding = nullptr;
        if (formal.type == LSV_Macro) {
            // Bound lazily: the argument text is expanded where the body uses it, with the caller's names.
            auto* argMacro = new LSMacroVariable(LSV_Macro, formal.name, frame, false, false, formal.isFnArg);
            argMacro->SetSubstitutionString(arg, false, 0);
            binding = argMacro;
        } else {
            basic_xstring value;
            try {
                ReadVariableValueByParsingExpression(frame, arg, formal.type, value);
            } catch (LexScannerException& e) {
                e.AppendCallContextLine(Compose("\n    passing formal argument ", formal.name, " to macro ", m->GetName()));
                throw;
            }
            binding = new LSValueVariable(formal.type, formal.name, BasicSubString(value));
        }
        bodyFrame->AddVariable(binding);
        bound[static_cast<size_t>(i)] = binding;
    }
    observed.Bound(bound.view());

    const BasicSubString body = m->GetSubstitutionString();
    if (m->IsPython()) {
        const char* position = cursor.begin();
        try {
            basic_xstring expression;
            MacroExpand(nullptr, bodyFrame, body, m->GetIndent(), 0, expression);
            basic_xstring result;
            EvalPythonExpression(expression, result, position);
            WriteCalculatedSubString(BasicSubString(result));
        } catch (LexScannerException& e) {
            e.AppendCallContextLine(Compose("\n    invoking python macro ", m->GetName()));
            throw;
        }
        return;
    }
    try {
        if (m->GetReturnType() == LSV_Macro) {
            MacroExpand(nullptr, bodyFrame, body, m->GetIndent(), GetOutputPos(), *output);
        } else {
            basic_xstring value;
            ReadVariableValueByParsingExpression(bodyFrame, body, m->GetReturnType(), value);
            WriteCalculatedSubString(BasicSubString(value));
        }
    } catch (LexScannerException& e) {
        e.AppendCallContextLine(
            InvokingMacroLine(*m, bound.size(), [&](xostream& os, size_t i) { bound[i]->WriteValue(os); }));
        throw;
    }
}

void MacroExpander::InvokeMacroFunction(LSMacroVariable* m) {
    const LSToken open = ReadToken();
    if (open.type != TK_LPAREN)
        throw LexScannerException(Compose("( expected to begin argument list for macro ", *m, " when read ", open),
                                  open);
    const BasicSubString args = ScanBrackettedSection(cursor, false, TK_LPAREN, TK_RPAREN);
    AdvanceWritePos(cursor.begin(), false);

    basic_xstring expandedArgs;
    OutputPieces argPieces;
    MacroExpand(nullptr, frame, args, 0, 0, expandedArgs, argPieces);
    // The call text is a held text: what it defines in the call's frame keeps it alive, and a position in it
    // moves back to where its characters came from: the bound text, the expanded arguments, and for the
    // brackets the call itself.
    const BasicSubString bound = m->GetSubstitutionString();
    OutputPieces callPieces;
    callPieces.push_back(OutputPiece(bound, 0));
    callPieces.push_back(OutputPiece(currentToken, 1));
    for (const OutputPiece& p : argPieces.GetPieces()) callPieces.push_back(p);
    callPieces.push_back(OutputPiece(currentToken, 1));
    VarFrame* callFrame = m->GetContext() ? m->GetContext() : frame;
    HeldTextKeeper keeper(callFrame);
    const HeldText& held = keeper.Hold(std::make_unique<HeldText>(
        " call", Compose(bound, "(", expandedArgs, ")"), std::move(callPieces), currentToken));
    const BasicSubString callText = held.GetText();
    try {
        if (m->GetReturnType() == LSV_Macro) {
            MacroExpand(nullptr, callFrame, callText, m->GetIndent(), GetOutputPos(), *output);
        } else {
            basic_xstring value;
            ReadVariableValueByParsingExpression(callFrame, callText, m->GetReturnType(), value);
            WriteCalculatedSubString(BasicSubString(value));
        }
    } catch (LexScannerException& e) {
        held.MovePositionOut(e);
        e.AppendCallContextLine(Compose("\n    invoking macro ", *m));
        throw;
    }
}

void ReadVariableValueByParsingExpression(VarFrame* frame, BasicSubString text, ELSVariable type,
                                          basic_xstring& value) {
    basic_xstring expanded;
    OutputPieces pieces;
    {
        VarFrame child(frame);
        MacroExpand(nullptr, &child, text, 0, 0, expanded, pieces);
    }
    try {
        ExpressionParser parser;
        parser.Init(BasicSubString(expanded));
        basic_xstring result;
        switch (type) {
            case LSV_Bool: result = parser.ParseBool(false) ? "true" : "false"; break;
            case LSV_Int: result = ToString(parser.ParseInt32(false)); break;
            case LSV_Double: result = ToString(parser.ParseFloat64(false)); break;
            case LSV_Char: result = MakeSingleQuotedLiteralChar(parser.ParseChar(false)); break;
            case LSV_String: result = parser.ParseString(false); break;
            default: return;
        }
        if (parser.GetTokenType() != TK_EOS)
            throw LexScannerException(Compose("Read ", parser.GetToken(), " in middle of expression"), parser.GetToken());
        value.swap(result);
    } catch (LexScannerException& e) {
        if (ExpansionObserver* observer = ExpansionObserver::Current())
            observer->ExpressionFailed(frame, BasicSubString(expanded), e);
        e.AppendContextLine(Compose("\n    expression: ", expanded));
        // The error points into the expanded text, which dies here: it moves back to the source character
        // that produced the faulty text.
        MovePositionOutOfExpansion(e, BasicSubString(expanded), pieces, text);
        throw;
    }
}

basic_xstring MacroExpander::EvaluateString(BasicSubString sectionText, BasicSubString directiveName) {
    const basic_xstring expanded = ExpandDirectiveText(frame, sectionText, directiveName);
    basic_xstring result;
    ParseDirectiveText(frame, expanded, directiveName, currentToken.begin(),
                       [&](ExpressionParser& p) { result = p.ParseString(false); });
    return result;
}

}  // namespace orvan

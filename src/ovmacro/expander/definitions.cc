// @def, @exportdef, @nakeddef and @defpython: reading a macro definition and storing it in its frame.
#include <memory>

#include "ovmacro/expander/expansion_observer.h"
#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/foundations/compose.h"
#include "ovmacro/lexer/section_scanners.h"

namespace orvan {

void MacroExpander::ProcessDefDirective(bool exported, bool naked, bool python) {
    LSToken token = ReadToken();
    const bool toFileScope = token.type == TK_PLUS;
    if (toFileScope) token = ReadToken();
    ELSVariable returnType = CheckVariableType(token.text);
    if (returnType != LSV_Macro) {
        token = ReadToken();
    }
    if (token.type != TK_IDENTIFIER)
        throw LexScannerException(Compose("Identifier expected for macro name when read ", token), token);

    // Owned here until a frame takes it, so that a definition that fails leaves no trace.
    auto macro = std::make_unique<LSMacroVariable>(returnType, token.text, nullptr, python, naked, false);
    ReadMacroVariableDefn(token.text, macro.get());

    VarFrame* target = frame;
    if (toFileScope) {
        target = frame->GetFileScopeVarFrame();
        if (!target) throw LexScannerException("No filescope frame", token);
    } else if (exported) {
        target = frame->GetParent();
        if (!target) throw LexScannerException("No parent frame", token);
    }
    LSMacroVariable* const defined = macro.release();
    target->AddVariable(defined);
    if (ExpansionObserver* observer = ExpansionObserver::Current()) observer->MacroDefined(*defined, *target);
    ScanOverWhiteSpaceAfterDirective();
}

void MacroExpander::ReadMacroVariableDefn(BasicSubString name, LSMacroVariable* macro) {
    LSToken token = ReadToken();
    if (token.type == TK_LPAREN) {
        bool first = true;
        for (;;) {
            token = ReadToken();
            if (first && token.type == TK_RPAREN) break;
            first = false;
            const ELSVariable type = CheckVariableType(token.text);
            if (type != LSV_Macro) token = ReadToken();
            if (token.type != TK_IDENTIFIER)
                throw LexScannerException(
                    Compose("Read ", token, " while trying to read argument for definition of macro ", name), token);
            const BasicSubString argName = token.text;
            if (macro->FindArgName(argName) >= 0)
                throw LexScannerException(
                    Compose("Repeated argument ", argName, " in definition of macro ", name), token);
            if (argName == "false" || argName == "true")
                throw LexScannerException(
                    Compose("Invalid formal argument '", argName, "' in definition of macro ", name), token);
            token = ReadToken();
            bool isFnArg = false;
            if (token.type == TK_LPAREN) {
                token = ReadToken();
                if (token.type != TK_RPAREN) throw LexScannerException(Compose("Expected ) when read ", token), token);
                isFnArg = true;
                token = ReadToken();
            }
            macro->AddArgName(argName, type, isFnArg);
            if (token.type == TK_RPAREN) break;
            if (token.type != TK_COMMA)
                throw LexScannerException(Compose("Comma or right parenthesis expected when read ", token,
                                                  "\nwhile reading argument list for definition of macro ", name),
                                          token);
        }
        ReadEqualsForVariableDefn(name);
    } else if (token.type != TK_ASSIGN) {
        throw LexScannerException(
            Compose("= or ( expected for definition of macro ", name, " when read ", token), token);
    }
    int64 indent = 0;
    const BasicSubString body = ScanSubstString(cursor, indent);
    macro->SetSubstitutionString(body, false, indent);
}

void MacroExpander::ReadEqualsForVariableDefn(BasicSubString name) {
    const LSToken token = ReadToken();
    if (token.type != TK_ASSIGN)
        throw LexScannerException(Compose("= expected in definition of macro ", name, " when read ", token), token);
}

bool MacroExpander::ReadEqualsForVariableDefn2(BasicSubString name) {
    LSToken token = ReadToken();
    bool colon = false;
    if (token.type == TK_COLON) {
        colon = true;
        token = ReadToken();
    }
    if (token.type != TK_ASSIGN)
        throw LexScannerException(Compose("= expected in definition of macro ", name, " when read ", token), token);
    return colon;
}

}  // namespace orvan

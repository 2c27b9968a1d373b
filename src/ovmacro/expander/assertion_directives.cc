// Directives with which a text checks itself while it is expanded: @assert, @assertfails and @fail.
#include "ovmacro/expander/directive_text.h"
#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/expr/expression_parser.h"
#include "ovmacro/foundations/compose.h"
#include "ovmacro/foundations/text_format.h"
#include "ovmacro/lexer/section_scanners.h"

namespace orvan {

namespace {

// Expands text and reports whether that raised an expansion error. Nothing the text defines survives: the
// text runs under a scratch frame that takes the place of the file's scope too, so that @exportdef and
// "@def +" land there and vanish with it. Lookups still reach every outer frame through the scratch frame's
// parent, and dollar macros resolve as in the file because the scratch frame carries copies of them.
bool ExpansionFails(VarFrame* frame, BasicSubString text) {
    FileScopeVarFrame scratch;
    scratch.parent = frame;
    if (const FileScopeVarFrame* fileScope = frame->GetFileScopeVarFrame()) {
        scratch.dollarMacros = fileScope->dollarMacros;
        scratch.importedFiles = fileScope->importedFiles;
    } else {
        // Without a file scope, "@def +" must fail inside the text just as it would outside.
        scratch.fileScope = nullptr;
    }
    try {
        VarFrame child(&scratch);
        basic_xstring discarded;
        MacroExpand(nullptr, &child, text, 0, 0, discarded);
    } catch (const LexScannerException&) {
        return true;
    }
    return false;
}

}  // namespace

void MacroExpander::ProcessAssertDirective() {
    const char* assertionPosition = cursor.begin();
    const BasicSubString condition = ScanBrackettedSection(cursor, true, TK_LPAREN, TK_RPAREN);
    basic_xstring expanded;
    {
        VarFrame child(frame);
        MacroExpand(nullptr, &child, condition, 0, 0, expanded);
    }
    bool holds = false;
    ParseDirectiveText(frame, expanded, "@assert", currentToken.begin(),
                       [&](ExpressionParser& p) { holds = p.ParseBool(false); });
    if (!holds)
        throw LexScannerException(
            Compose("Assertion failure\n        @assert(", condition, ")\nie      @assert(", expanded, ")"),
            assertionPosition);
    ScanOverWhiteSpaceAfterDirective();
}

void MacroExpander::ProcessAssertFailsDirective() {
    const char* assertionPosition = cursor.begin();
    const LSToken open = ReadToken();
    EToken close = TK_NONE;
    switch (open.type) {
        case TK_LPAREN:
            close = TK_RPAREN;
            break;
        case TK_LBRACKET:
            close = TK_RBRACKET;
            break;
        case TK_LBRACE:
            close = TK_RBRACE;
            break;
        default:
            throw LexScannerException(Compose("( expected after @assertfails when read ", open), open);
    }
    const BasicSubString text = ScanBrackettedSection(cursor, false, open.type, close);
    if (!ExpansionFails(frame, text))
        throw LexScannerException(Compose("Macro expansion of ", text, " didn't generate an error"),
                                  assertionPosition);
    ScanOverWhiteSpaceAfterDirective();
}

void MacroExpander::ProcessFailDirective() {
    const char* failPosition = cursor.begin();
    const basic_xstring message = ParseStringExpressionInBrackets("@fail", true);
    throw LexScannerException(message, failPosition);
}

}  // namespace orvan

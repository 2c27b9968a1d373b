#include "ovmacro/expander/directive_text.h"

#include "ovmacro/expander/expansion_observer.h"
#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/foundations/compose.h"

namespace orvan {

void ParseDirectiveText(VarFrame* frame, const basic_xstring& expanded, BasicSubString name, const char* at,
                        const std::function<void(ExpressionParser&)>& parse) {
    try {
        ExpressionParser parser;
        parser.GetToken() = LSToken(TK_LPAREN, BasicSubString("("));
        parser.endName = ")";
        parser.Init(BasicSubString(expanded));
        parse(parser);
        if (parser.GetTokenType() != TK_EOS)
            throw LexScannerException(Compose("Expected ) after ", parser.Named(parser.lastToken), " when read ",
                                              parser.Named(parser.GetToken()), " in expression"),
                                      parser.GetToken());
    } catch (LexScannerException& e) {
        if (ExpansionObserver* observer = ExpansionObserver::Current())
            observer->ExpressionFailed(frame, BasicSubString(expanded), e);
        e.AppendContextLine(Compose("\n    in ", name, "(", expanded, ")"));
        e.SetPosition(at);
        throw;
    }
}

basic_xstring ExpandDirectiveText(VarFrame* frame, BasicSubString text, BasicSubString name) {
    basic_xstring expanded;
    try {
        VarFrame child(frame);
        MacroExpand(nullptr, &child, text, 0, 0, expanded);
    } catch (LexScannerException& e) {
        // A call-chain line: a text that invokes itself would otherwise add one line per level.
        e.AppendCallContextLine(Compose("\n    in ", name, "(", text, ")"));
        throw;
    }
    return expanded;
}

bool EvaluateConditionText(VarFrame* frame, BasicSubString condition, BasicSubString name, const char* at) {
    const basic_xstring expanded = ExpandDirectiveText(frame, condition, name);
    bool value = false;
    ParseDirectiveText(frame, expanded, name, at, [&](ExpressionParser& p) { value = p.ParseBool(false); });
    return value;
}

}  // namespace orvan

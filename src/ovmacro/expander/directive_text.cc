#include "ovmacro/expander/directive_text.h"

#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/foundations/compose.h"

namespace orvan {

void ParseDirectiveText(const basic_xstring& expanded, BasicSubString name, const char* at,
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
        e.AppendContextLine(Compose("\n    in ", name, "(", expanded, ")"));
        e.SetPosition(at);
        throw;
    }
}

bool EvaluateConditionText(VarFrame* frame, BasicSubString condition, BasicSubString name, const char* at) {
    basic_xstring expanded;
    try {
        VarFrame child(frame);
        MacroExpand(nullptr, &child, condition, 0, 0, expanded);
    } catch (LexScannerException& e) {
        // A call-chain line: a condition that invokes itself would otherwise add one line per level.
        e.AppendCallContextLine(Compose("\n    in ", name, "(", condition, ")"));
        throw;
    }
    bool value = false;
    ParseDirectiveText(expanded, name, at, [&](ExpressionParser& p) { value = p.ParseBool(false); });
    return value;
}

}  // namespace orvan

// The shared token-reading steps of the library's parsers.
#include "ovmacro/expr/parser_base.h"

#include "ovmacro/foundations/stream.h"
#include "ovmacro/lexer/exceptions.h"
#include "ovmacro/lexer/token_scanner.h"

namespace orvan {

void ParserBase::Init(BasicSubString text) {
    cursor = text;
    ReadNextToken();
}

void ParserBase::ReadNextToken() {
    lastToken = token;
    token = LsScanToken(cursor, false);
}

void ParserBase::ParseGivenToken(EToken type, const char* what) {
    if (token.GetType() != type) ThrowExpectedException(what);
    ReadNextToken();
}

basic_xstring ParserBase::ParseIdentifier() {
    if (token.GetType() != TK_IDENTIFIER) ThrowExpectedException("identifier");
    basic_xstring name = token.GetTokenString();
    ReadNextToken();
    return name;
}

basic_xstring ParserBase::ParsePath() {
    if (token.GetType() != TK_IDENTIFIER) ThrowExpectedException("identifier (for path)");
    basic_xstring path;
    for (;;) {
        if (token.GetType() == TK_IDENTIFIER)
            path.append(token.text.view());
        else if (token.GetType() == TK_SLASH)
            path += '/';
        else
            break;
        ReadNextToken();
    }
    return path;
}

void ParserBase::ThrowExpectedException(const char* what) const {
    StringStream ss(4096);
    ss << "Expected " << what << " after " << Named(lastToken) << " when read " << Named(token);
    throw LexScannerException(ss.GetString(), token);
}

}  // namespace orvan

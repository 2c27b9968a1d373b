// ParserBase: the token state and the small parsing steps that every parser of the library shares.
//
//     ParserBase p;
//     p.Init(text);                          // reads the first token
//     basic_xstring name = p.ParseIdentifier();
//     p.ParseGivenToken(TK_ASSIGN, "=");     // or "Expected = after <name> when read <token>"
//
// A caller may set `token` before Init: Init moves it into `lastToken`, so that a message about the first
// token names it as the one before (the directives preset "(" this way), and `endName` for the end.
#pragma once

#include "ovmacro/foundations/sub_string.h"
#include "ovmacro/foundations/types.h"
#include "ovmacro/lexer/token.h"

namespace orvan {

class ParserBase {
  public:
    // Sets the text to parse and reads its first token.
    void Init(BasicSubString text);
    // `lastToken` becomes `token`, and `token` the next token of `cursor` (comments skipped).
    void ReadNextToken();

    LSToken& GetToken() { return token; }
    const LSToken& GetToken() const { return token; }
    EToken GetTokenType() const { return token.GetType(); }
    basic_xstring GetTokenString() const { return token.GetTokenString(); }

    // Consumes `token` if it is of the given kind, else ThrowExpectedException(what).
    void ParseGivenToken(EToken type, const char* what);
    // The text of an identifier token, which it consumes.
    basic_xstring ParseIdentifier();
    // Identifiers separated by "/" (blanks between them are dropped): a/b and a / b both give "a/b". Stops at
    // the first token that is neither, which stays current.
    basic_xstring ParsePath();
    // "Expected <what> after <lastToken> when read <token>", positioned at `token`.
    [[noreturn]] void ThrowExpectedException(const char* what) const;
    // A token as this parser's messages name it (see endName).
    NamedToken Named(const LSToken& t) const { return {t, endName}; }

    LSToken token;          // the current token, the one the next rule looks at
    LSToken lastToken;      // the token read before `token`
    BasicSubString cursor;  // the text not yet scanned
    // How messages name the end of the text: "EOS", or the closing bracket of a directive whose expanded text
    // is parsed (see also the preset token above).
    const char* endName = "EOS";
};

}  // namespace orvan

// The token scanner: cuts the next token off the front of a view.
//
//     BasicSubString rest(text);
//     for (LSToken t = LsScanToken(rest, false); t; t = LsScanToken(rest, false)) ...
//
// Scanning allocates nothing on success: a token is a kind and a view into the input. Malformed input raises
// a LexScannerException positioned where the fault was found, with the input's begin left there.
#pragma once

#include "ovmacro/lexer/exceptions.h"
#include "ovmacro/lexer/token.h"

namespace orvan {

// The next token, white space skipped; comments are skipped too unless returnComments. At the end of the
// input: a TK_EOS token whose text is the empty range at the input's end.
LSToken LsScanToken(BasicSubString& s, bool returnComments);
// One token at a character that is not white space; s must not be empty.
EToken LsScanTokenHelper(BasicSubString& s);
// TK_INT, TK_HEX_INT, TK_FLOAT, or TK_NONE (nothing consumed) when no digit stands here.
EToken LsScanNumber(BasicSubString& s);
// The end of the decimal integer token that begins at the digit at p, when nothing after its digits could make
// it longer (a fraction, an exponent, a hex prefix); null when LsScanNumber must read it. Inline, for the
// scanners that skip text in bulk.
inline const char* EndOfPlainInteger(const char* p, const char* end) {
    const char* q = p + 1;
    while (q < end && *q >= '0' && *q <= '9') ++q;
    const bool longer = q < end && (*q == '.' || *q == 'e' || *q == 'E' || (q == p + 1 && (*q == 'x' || *q == 'X')));
    return longer ? nullptr : q;
}
bool LsScanLiteralString(BasicSubString& s, char quote, const char* description);
bool LsScanLiteralCharacter(BasicSubString& s);
bool LsScanEscapeCharacter(BasicSubString& s);
bool LsScanComment(BasicSubString& s);
// Scans the next token (comments skipped) and raises `message` at it unless it is of kind `expected`.
void ReadGivenToken(BasicSubString& s, EToken expected, const char* message);

}  // namespace orvan

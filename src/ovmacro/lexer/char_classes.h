// What each byte can begin: the one table from which the token scanner and the expander's fast lane both read
// the syntax of tokens, so that a change of syntax is made once.
#pragma once

#include <array>

#include "ovmacro/foundations/scanning.h"

namespace orvan {

enum class CharClass : unsigned char {
    kOther,        // begins no token: "Bad token"
    kWhiteSpace,   // skipped between tokens: blank, tab, carriage return, vertical tab, form feed
    kLineFeed,     // white space too, but the end of a line
    kIdentifier,   // a letter, '_' or a byte from 0x80 (r and R may begin a raw literal instead)
    kDigit,        // a number
    kSingleQuote,  // a single-quoted literal
    kDoubleQuote,  // a double-quoted literal
    kSlash,        // '/', '/=' or a comment
    kPlus,         // '+', '++' or '+=' ("++=" is an error)
    kAt,           // '@', or an '@' comment
    kOperator,     // begins an operator that a second character may extend: < > & | ^ * % ! = ? - : $
    kSingle,       // a token on its own: # . , ; ( ) { } [ ] ~ \ `
};

constexpr std::array<CharClass, 256> MakeCharClasses() {
    std::array<CharClass, 256> t{};
    for (int c = 0; c < 256; ++c) {
        const char ch = static_cast<char>(c);
        if (IsIdentifierStart(ch)) t[c] = CharClass::kIdentifier;
        else if (ch >= '0' && ch <= '9') t[c] = CharClass::kDigit;
        else if (IsWhiteSpace(ch)) t[c] = ch == '\n' ? CharClass::kLineFeed : CharClass::kWhiteSpace;
    }
    for (unsigned char c : std::string_view("<>&|^*%!=?-:$")) t[c] = CharClass::kOperator;
    for (unsigned char c : std::string_view("#.,;(){}[]~\\`")) t[c] = CharClass::kSingle;
    t['\''] = CharClass::kSingleQuote;
    t['"'] = CharClass::kDoubleQuote;
    t['/'] = CharClass::kSlash;
    t['+'] = CharClass::kPlus;
    t['@'] = CharClass::kAt;
    return t;
}

inline constexpr std::array<CharClass, 256> kCharClasses = MakeCharClasses();

inline CharClass ClassOf(char c) { return kCharClasses[static_cast<unsigned char>(c)]; }

// Whether p (before end) begins a raw literal: r or R directly followed by a quote.
inline bool BeginsRawLiteral(const char* p, const char* end) {
    return (*p == 'r' || *p == 'R') && end - p >= 2 && (p[1] == '"' || p[1] == '\'');
}

}  // namespace orvan

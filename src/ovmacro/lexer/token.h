// Tokens of the macro and expression language.
//
// A token is a kind and a view of its text in the scanned buffer (literals keep their quotes, prefix and
// escapes); it owns nothing and is passed by value.
#pragma once

#include <cstdint>

#include "ovmacro/foundations/stream.h"
#include "ovmacro/foundations/sub_string.h"

namespace orvan {

enum EToken : std::int32_t {
    TK_NONE = -1,
    TK_EOS = 10000,
    TK_COMMENT = 10001,
    TK_AT_COMMENT = 10002,
    TK_INT = 10003,
    TK_HEX_INT = 10004,
    TK_FLOAT = 10005,
    TK_SQ_STRING = 10006,
    TK_DQ_STRING = 10007,
    TK_IDENTIFIER = 10008,
    TK_LT = 10009,
    TK_GT = 10010,
    TK_AMP = 10011,
    TK_BAR = 10012,
    TK_CARET = 10013,
    TK_LE = 10014,
    TK_GE = 10015,
    TK_AMP_EQ = 10016,
    TK_BAR_EQ = 10017,
    TK_CARET_EQ = 10018,
    TK_SHL = 10019,
    TK_SHR = 10020,
    TK_AND_AND = 10021,
    TK_OR_OR = 10022,
    TK_POWER = 10023,
    TK_SHL_EQ = 10024,
    TK_SHR_EQ = 10025,
    TK_AND_AND_EQ = 10026,
    TK_OR_OR_EQ = 10027,
    TK_POWER_EQ = 10028,
    TK_PLUS = 10029,
    TK_MINUS = 10030,
    TK_STAR = 10031,
    TK_SLASH = 10032,
    TK_PERCENT = 10033,
    TK_BANG = 10034,
    TK_ASSIGN = 10035,
    TK_QUESTION = 10036,
    TK_PLUS_PLUS = 10037,
    TK_MINUS_MINUS = 10038,
    TK_PLUS_EQ = 10039,
    TK_MINUS_EQ = 10040,
    TK_STAR_EQ = 10041,
    TK_SLASH_EQ = 10042,
    TK_PERCENT_EQ = 10043,
    TK_NE = 10044,
    TK_EQ = 10045,
    TK_QUESTION_EQ = 10046,
    TK_ARROW = 10047,
    TK_COLON = 10048,
    TK_COLON_COLON = 10049,
    TK_DOLLAR = 10050,
    TK_DOLLAR_DOLLAR = 10051,
    TK_DOT = 10052,
    TK_COMMA = 10053,
    TK_SEMICOLON = 10054,
    TK_LPAREN = 10055,
    TK_RPAREN = 10056,
    TK_LBRACE = 10057,
    TK_RBRACE = 10058,
    TK_LBRACKET = 10059,
    TK_RBRACKET = 10060,
    TK_TILDE = 10061,
    TK_AT = 10062,
    TK_BACKSLASH = 10063,
    TK_BACKQUOTE = 10064,
    TK_HASH = 10065,
};

class LSToken {
public:
    LSToken() = default;
    explicit LSToken(EToken type) : type(type) {}
    LSToken(EToken type, const char* begin, const char* end) : type(type), text(begin, end) {}
    LSToken(EToken type, BasicSubString text) : type(type), text(text) {}

    EToken GetType() const { return type; }
    basic_xstring GetTokenString() const { return text.GetString(); }
    // True unless this is the end of the input.
    explicit operator bool() const { return type != TK_EOS; }

    bool operator==(const LSToken& o) const { return type == o.type && text == o.text; }
    bool operator!=(const LSToken& o) const { return !(*this == o); }
    bool operator==(const char* s) const { return text == s; }
    bool operator!=(const char* s) const { return !(*this == s); }
    bool operator==(EToken t) const { return type == t; }
    bool operator!=(EToken t) const { return type != t; }

    // Values of literal tokens; the token must be of the matching kind.
    int GetLiteralInt32() const;
    int64 GetLiteralInt64() const;
    int GetLiteralHexInt32() const;
    int64 GetLiteralHexInt64() const;
    double GetLiteralDouble() const;
    char GetLiteralCharacter() const;
    void GetLiteralString(basic_xstring& out) const;

    EToken type = TK_NONE;
    BasicSubString text;
};

// Writes "EOS" for an empty text, else the text.
xostream& operator<<(xostream& os, const LSToken& t);
// A token as a message names it: its text, or `endName` at the end of the text (a directive that parses the
// expansion of its bracketed text names the end by the closing bracket the user wrote).
struct NamedToken {
    const LSToken& token;
    const char* endName;
};
xostream& operator<<(xostream& os, const NamedToken& t);

// Decimal digits, wrapping in the arithmetic of T (no sign, no overflow check).
template <class T>
void SubStringToInt(BasicSubString s, T& value);
// Hex digits (after "0x" when skipPrefix); digits beyond the width of T shift out of the top.
template <class T>
void SubStringToHexInt(BasicSubString s, T& value, bool skipPrefix);

inline bool IsDigit(char c) { return c >= '0' && c <= '9'; }
inline int MapDecDigit(char c) { return IsDigit(c) ? c - '0' : -1; }
// Space, tab, vertical tab, form feed and carriage return; not line feed.
inline bool IsWhiteSpaceWithoutLinefeed(char c) { return c == ' ' || c == '\t' || c == '\v' || c == '\f' || c == '\r'; }
// The 14 assignment operators (not "?=").
bool IsAssignmentToken(EToken t);

}  // namespace orvan

#include "ovmacro/lexer/token.h"

#include <cstdlib>

#include "ovmacro/foundations/scanning.h"

namespace orvan {

template <class T>
void SubStringToInt(BasicSubString s, T& value) {
    // Unsigned arithmetic wraps without undefined behaviour; the result is read back as T.
    using U = std::make_unsigned_t<T>;
    U v = 0;
    for (char c : s.view()) v = static_cast<U>(v * 10u + static_cast<U>(MapDecDigit(c)));
    value = static_cast<T>(v);
}

template <class T>
void SubStringToHexInt(BasicSubString s, T& value, bool skipPrefix) {
    using U = std::make_unsigned_t<T>;
    U v = 0;
    std::string_view digits = s.view();
    if (skipPrefix) digits.remove_prefix(digits.size() < 2 ? digits.size() : 2);
    for (char c : digits) v = static_cast<U>((v << 4) | static_cast<U>(MapHexDigit(c)));
    value = static_cast<T>(v);
}

template void SubStringToInt<int>(BasicSubString, int&);
template void SubStringToInt<int64>(BasicSubString, int64&);
template void SubStringToHexInt<int>(BasicSubString, int&, bool);
template void SubStringToHexInt<int64>(BasicSubString, int64&, bool);

int LSToken::GetLiteralInt32() const {
    int v = 0;
    SubStringToInt(text, v);
    return v;
}

int64 LSToken::GetLiteralInt64() const {
    int64 v = 0;
    SubStringToInt(text, v);
    return v;
}

int LSToken::GetLiteralHexInt32() const {
    int v = 0;
    SubStringToHexInt(text, v, true);
    return v;
}

int64 LSToken::GetLiteralHexInt64() const {
    int64 v = 0;
    SubStringToHexInt(text, v, true);
    return v;
}

double LSToken::GetLiteralDouble() const { return std::atof(text.GetString().c_str()); }

namespace {

// Decodes the escape at p (just after the backslash) and returns the position after it.
const char* DecodeEscape(const char* p, const char* end, char& out) {
    if (p < end && *p == 'x' && end - p >= 3) {
        out = static_cast<char>((MapHexDigit(p[1]) << 4) | MapHexDigit(p[2]));
        return p + 3;
    }
    if (p < end && MapEscapeCharacter(*p, out)) return p + 1;
    out = p < end ? *p : '\\';
    return p < end ? p + 1 : p;
}

}  // namespace

char LSToken::GetLiteralCharacter() const {
    if (text.size() < 2) return '\0';
    const char* p = text.begin() + 1;
    if (*p != '\\') return *p;
    char out = 0;
    DecodeEscape(p + 1, text.end(), out);
    return out;
}

void LSToken::GetLiteralString(basic_xstring& out) const {
    out.clear();
    if (text.size() < 2) return;
    const char* p = text.begin();
    const bool raw = *p == 'r' || *p == 'R';
    if (raw) ++p;
    const char* end = text.end() - 1;  // the closing quote
    ++p;                               // the opening quote
    if (p > end) return;
    out.reserve(static_cast<size_t>(end - p));
    if (raw) {
        out.append(p, end);
        return;
    }
    while (p < end) {
        if (*p != '\\') {
            out += *p++;
            continue;
        }
        char c = 0;
        p = DecodeEscape(p + 1, end, c);
        out += c;
    }
}

xostream& operator<<(xostream& os, const LSToken& t) { return os << NamedToken{t, "EOS"}; }

xostream& operator<<(xostream& os, const NamedToken& t) {
    if (t.token.text.empty()) return os << t.endName;
    return os << t.token.text;
}

bool IsAssignmentToken(EToken t) {
    switch (t) {
        case TK_AMP_EQ:
        case TK_BAR_EQ:
        case TK_CARET_EQ:
        case TK_SHL_EQ:
        case TK_SHR_EQ:
        case TK_AND_AND_EQ:
        case TK_OR_OR_EQ:
        case TK_POWER_EQ:
        case TK_ASSIGN:
        case TK_PLUS_EQ:
        case TK_MINUS_EQ:
        case TK_STAR_EQ:
        case TK_SLASH_EQ:
        case TK_PERCENT_EQ: return true;
        default: return false;
    }
}

}  // namespace orvan

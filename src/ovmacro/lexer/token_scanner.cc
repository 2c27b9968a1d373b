#include "ovmacro/lexer/token_scanner.h"

#include "ovmacro/foundations/scanning.h"
#include "ovmacro/lexer/char_classes.h"

namespace orvan {

namespace {

using HR = HumanReadableCharInSubString;

[[noreturn]] void Fail(StringStream& ss, const char* position) { throw LexScannerException(ss.GetString(), position); }

// Kinds for an operator character alone, followed by '=', doubled, and doubled then followed by '='.
struct OperatorKinds {
    EToken alone, withEq, doubled, doubledWithEq;
};

bool LookUpOperator(char c, OperatorKinds& k) {
    switch (c) {
        case '+': k = {TK_PLUS, TK_PLUS_EQ, TK_PLUS_PLUS, TK_NONE}; return true;
        case '<': k = {TK_LT, TK_LE, TK_SHL, TK_SHL_EQ}; return true;
        case '>': k = {TK_GT, TK_GE, TK_SHR, TK_SHR_EQ}; return true;
        case '&': k = {TK_AMP, TK_AMP_EQ, TK_AND_AND, TK_AND_AND_EQ}; return true;
        case '|': k = {TK_BAR, TK_BAR_EQ, TK_OR_OR, TK_OR_OR_EQ}; return true;
        case '^': k = {TK_CARET, TK_CARET_EQ, TK_POWER, TK_POWER_EQ}; return true;
        case '*': k = {TK_STAR, TK_STAR_EQ, TK_NONE, TK_NONE}; return true;
        case '/': k = {TK_SLASH, TK_SLASH_EQ, TK_NONE, TK_NONE}; return true;
        case '%': k = {TK_PERCENT, TK_PERCENT_EQ, TK_NONE, TK_NONE}; return true;
        case '!': k = {TK_BANG, TK_NE, TK_NONE, TK_NONE}; return true;
        case '=': k = {TK_ASSIGN, TK_EQ, TK_NONE, TK_NONE}; return true;
        case '?': k = {TK_QUESTION, TK_QUESTION_EQ, TK_NONE, TK_NONE}; return true;
        default: return false;
    }
}

EToken SingleCharacterKind(char c) {
    switch (c) {
        case '#': return TK_HASH;
        case '.': return TK_DOT;
        case ',': return TK_COMMA;
        case ';': return TK_SEMICOLON;
        case '(': return TK_LPAREN;
        case ')': return TK_RPAREN;
        case '{': return TK_LBRACE;
        case '}': return TK_RBRACE;
        case '[': return TK_LBRACKET;
        case ']': return TK_RBRACKET;
        case '~': return TK_TILDE;
        case '@': return TK_AT;
        case '\\': return TK_BACKSLASH;
        case '`': return TK_BACKQUOTE;
        default: return TK_NONE;
    }
}

bool IsDoublingOperator(char c) {
    return c == '+' || c == '<' || c == '>' || c == '&' || c == '|' || c == '^';
}

}  // namespace

LSToken LsScanToken(BasicSubString& s, bool returnComments) {
    for (;;) {
        const char* start = s.begin();
        while (start < s.end() && IsWhiteSpace(*start)) ++start;
        s.SetBegin(start);
        if (start == s.end()) return LSToken(TK_EOS, start, start);
        // The commonest tokens, words and punctuation, are read here without the general helper.
        const CharClass k = ClassOf(*start);
        if (k == CharClass::kSingle) {
            s.SetBegin(start + 1);
            return LSToken(SingleCharacterKind(*start), start, start + 1);
        }
        if (k == CharClass::kIdentifier && !BeginsRawLiteral(start, s.end())) {
            const char* end = start + 1;
            while (end < s.end() && IsIdentifierChar(*end)) ++end;
            s.SetBegin(end);
            return LSToken(TK_IDENTIFIER, start, end);
        }
        const EToken kind = LsScanTokenHelper(s);
        if (kind == TK_COMMENT && !returnComments) continue;
        return LSToken(kind, start, s.begin());
    }
}

EToken LsScanTokenHelper(BasicSubString& s) {
    const char c = s.front();
    switch (ClassOf(c)) {
        case CharClass::kDigit: return LsScanNumber(s);
        case CharClass::kSingleQuote:
        case CharClass::kDoubleQuote:
        case CharClass::kIdentifier: {
            if (ClassOf(c) == CharClass::kIdentifier && !BeginsRawLiteral(s.begin(), s.end())) {
                ScanIdentifier(s);
                return TK_IDENTIFIER;
            }
            const char quote = ClassOf(c) == CharClass::kIdentifier ? s[1] : c;
            LsScanLiteralString(s, quote, quote == '\'' ? "single quoted string" : "double quoted string");
            return quote == '\'' ? TK_SQ_STRING : TK_DQ_STRING;
        }
        case CharClass::kSlash:
            if (LsScanComment(s)) return TK_COMMENT;
            break;
        case CharClass::kAt:
            if (s.size() >= 2) {
                BasicSubString afterAt(s.begin() + 1, s.end());
                if (LsScanComment(afterAt)) {
                    s = afterAt;
                    return TK_AT_COMMENT;
                }
            }
            break;
        case CharClass::kOther:
        case CharClass::kWhiteSpace:
        case CharClass::kLineFeed: {
            StringStream ss;
            ss << "Bad token " << HR(s);
            Fail(ss, s.begin());
        }
        case CharClass::kPlus:
        case CharClass::kOperator:
        case CharClass::kSingle: break;
    }
    const bool hasNext = s.size() >= 2;
    const char n = hasNext ? s[1] : '\0';
    if (c == '-') {
        if (hasNext && (n == '-' || n == '=' || n == '>')) {
            s.Advance(2);
            return n == '-' ? TK_MINUS_MINUS : (n == '=' ? TK_MINUS_EQ : TK_ARROW);
        }
        s.Advance(1);
        return TK_MINUS;
    }
    OperatorKinds k{};
    if (LookUpOperator(c, k)) {
        if (IsDoublingOperator(c) && hasNext && n == c) {
            if (s.size() >= 3 && s[2] == '=') {
                s.Advance(3);
                if (k.doubledWithEq == TK_NONE) {
                    StringStream ss;
                    ss << "Invalid token " << BasicSubString(s.begin() - 3, s.begin());
                    Fail(ss, s.begin());
                }
                return k.doubledWithEq;
            }
            s.Advance(2);
            return k.doubled;
        }
        if (hasNext && n == '=') {
            s.Advance(2);
            return k.withEq;
        }
        s.Advance(1);
        return k.alone;
    }
    if (c == ':' || c == '$') {
        if (hasNext && n == c) {
            s.Advance(2);
            return c == ':' ? TK_COLON_COLON : TK_DOLLAR_DOLLAR;
        }
        s.Advance(1);
        return c == ':' ? TK_COLON : TK_DOLLAR;
    }
    const EToken single = SingleCharacterKind(c);
    s.Advance(1);
    return single;
}

EToken LsScanNumber(BasicSubString& s) {
    if (s.empty() || !IsDigit(s.front())) return TK_NONE;
    if (const char* end = EndOfPlainInteger(s.begin(), s.end())) {
        s.SetBegin(end);
        return TK_INT;
    }
    const char* start = s.begin();
    if (s.front() == '0') {
        s.Advance(1);
        if (s.empty()) return TK_INT;
        if (s.front() == 'x' || s.front() == 'X') {
            s.Advance(1);
            if (s.empty() || !IsHexDigit(s.front())) {
                StringStream ss;
                ss << "Expected hex digit (not " << HR(s) << ") after 0x";
                Fail(ss, s.begin());
            }
            while (!s.empty() && IsHexDigit(s.front())) s.Advance(1);
            return TK_HEX_INT;
        }
    }
    ScanDigits(s);
    bool isFloat = false;
    if (!s.empty() && s.front() == '.') {
        s.Advance(1);
        if (s.empty() || !IsDigit(s.front())) {
            StringStream ss;
            ss << "Expected digit (not " << HR(s) << ") after decimal point (ie after reading '"
               << BasicSubString(start, s.begin()) << "')";
            Fail(ss, s.begin());
        }
        ScanDigits(s);
        isFloat = true;
    }
    if (!s.empty() && (s.front() == 'e' || s.front() == 'E')) {
        s.Advance(1);
        if (!s.empty() && (s.front() == '+' || s.front() == '-')) s.Advance(1);
        if (s.empty() || !IsDigit(s.front())) {
            StringStream ss;
            ss << "Expected digit(s) (not " << HR(s) << ") for exponent after reading "
               << BasicSubString(start, s.begin());
            Fail(ss, s.begin());
        }
        ScanDigits(s);
        return TK_FLOAT;
    }
    return isFloat ? TK_FLOAT : TK_INT;
}

bool LsScanLiteralString(BasicSubString& s, char quote, const char* description) {
    if (s.empty()) return false;
    const char* start = s.begin();
    bool raw = false;
    if ((s.front() == 'r' || s.front() == 'R') && s.size() >= 2 && s[1] == quote) {
        raw = true;
        s.Advance(1);
    } else if (s.front() != quote) {
        return false;
    }
    s.Advance(1);
    if (s.empty()) {
        StringStream ss;
        ss << "Met EOS within " << description;
        Fail(ss, s.begin());
    }
    for (;;) {
        const char c = s.front();
        if (c == quote) {
            s.Advance(1);
            return true;
        }
        if (c == '\n') {
            StringStream ss;
            ss << "Met line feed within " << description << " after reading " << BasicSubString(start, s.begin());
            Fail(ss, s.begin());
        }
        if (raw || !LsScanEscapeCharacter(s)) s.Advance(1);
        if (s.empty()) {
            StringStream ss;
            ss << "Met EOS within " << description << " after reading " << BasicSubString(start, s.end());
            Fail(ss, s.begin());
        }
    }
}

bool LsScanEscapeCharacter(BasicSubString& s) {
    if (s.empty() || s.front() != '\\') return false;
    s.Advance(1);
    if (s.empty()) {
        StringStream ss;
        ss << "Expected escape character following backslash when reached EOS";
        Fail(ss, s.begin());
    }
    if (s.front() == 'x') {
        s.Advance(1);
        for (int i = 0; i < 2; ++i) {
            if (s.empty()) {
                StringStream ss;
                ss << "Expected hex character when reached EOS";
                Fail(ss, s.begin());
            }
            if (!IsHexDigit(s.front())) {
                StringStream ss;
                ss << "Expected hex character when read " << HR(s);
                Fail(ss, s.begin());
            }
            s.Advance(1);
        }
        return true;
    }
    char mapped = 0;
    if (!MapEscapeCharacter(s.front(), mapped)) {
        StringStream ss;
        ss << "Invalid escape character " << HR(s) << " following backslash";
        Fail(ss, s.begin());
    }
    s.Advance(1);
    return true;
}

bool LsScanComment(BasicSubString& s) {
    if (s.size() < 2 || s.front() != '/') return false;
    if (s[1] == '/') {
        const void* lf = std::memchr(s.begin(), '\n', static_cast<size_t>(s.size()));
        s.SetBegin(lf ? static_cast<const char*>(lf) : s.end());
        return true;
    }
    if (s[1] != '*') return false;
    std::string_view rest(s.begin() + 2, static_cast<size_t>(s.size() - 2));
    const size_t close = rest.find("*/");
    if (close == std::string_view::npos) {
        s.SetBegin(s.end());
        StringStream ss;
        ss << "Met EOS in middle of /* ... */ comment";
        Fail(ss, s.end());
    }
    s.SetBegin(s.begin() + 2 + close + 2);
    return true;
}

bool LsScanLiteralCharacter(BasicSubString& s) {
    if (s.empty() || s.front() != '\'') return false;
    s.Advance(1);
    if (s.empty() || s.front() == '\t' || s.front() == '\n' || s.front() == '\r' || s.front() == '\'') {
        StringStream ss;
        ss << "Read " << HR(s) << " while trying to read literal character enclosed in single quotes";
        Fail(ss, s.begin());
    }
    if (!LsScanEscapeCharacter(s)) s.Advance(1);
    if (s.empty() || s.front() != '\'') {
        StringStream ss;
        ss << "Expected second single quote (not " << HR(s) << ") for literal character";
        Fail(ss, s.begin());
    }
    s.Advance(1);
    return true;
}

void ReadGivenToken(BasicSubString& s, EToken expected, const char* message) {
    const LSToken t = LsScanToken(s, false);
    if (t.type != expected) throw LexScannerException(message, t);
}

}  // namespace orvan

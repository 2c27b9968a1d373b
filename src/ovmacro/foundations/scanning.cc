#include "ovmacro/foundations/scanning.h"

#include <algorithm>
#include <functional>

namespace orvan {

bool ScanIdentifier(BasicSubString& s) {
    if (s.empty() || !IsIdentifierStart(s.front())) return false;
    const char* p = s.begin() + 1;
    while (p < s.end() && IsIdentifierChar(*p)) ++p;
    s.SetBegin(p);
    return true;
}

bool ScanDigits(BasicSubString& s) {
    const char* p = s.begin();
    while (p < s.end() && *p >= '0' && *p <= '9') ++p;
    if (p == s.begin()) return false;
    s.SetBegin(p);
    return true;
}

bool ScanWhiteSpace(BasicSubString& s) {
    const char* p = s.begin();
    while (p < s.end() && IsWhiteSpace(*p)) ++p;
    if (p == s.begin()) return false;
    s.SetBegin(p);
    return true;
}

bool ScanIndentation(BasicSubString& s, int64 indent, int64 tabWidth) {
    const char* p = s.begin();
    int64 column = 0;
    while (p < s.end()) {
        const int64 width = *p == ' ' ? 1 : (*p == '\t' ? tabWidth : 0);
        if (width == 0 || column + width > indent) break;
        column += width;
        ++p;
    }
    if (p == s.begin()) return false;
    s.SetBegin(p);
    return true;
}

bool IsHexDigit(char c) { return MapHexDigit(c) >= 0; }

int MapHexDigit(char c) {
    if (c >= '0' && c <= '9') return c - '0';
    if (c >= 'a' && c <= 'f') return c - 'a' + 10;
    if (c >= 'A' && c <= 'F') return c - 'A' + 10;
    return -1;
}

bool MapEscapeCharacter(char c, char& mapped) {
    switch (c) {
        case 'n': mapped = '\n'; return true;
        case 't': mapped = '\t'; return true;
        case 'r': mapped = '\r'; return true;
        case '0': mapped = '\0'; return true;
        case 'a': mapped = '\a'; return true;
        case 'b': mapped = '\b'; return true;
        case 'f': mapped = '\f'; return true;
        case 'v': mapped = '\v'; return true;
        case '\\': mapped = '\\'; return true;
        case '\'': mapped = '\''; return true;
        case '"': mapped = '"'; return true;
        case '?': mapped = '?'; return true;
        default: return false;
    }
}

int64 GetLineNumber(BasicSubString text, const char* pos) {
    // Compare addresses with std::less: pos may point into another buffer altogether.
    std::less<const char*> lt;
    if (pos == nullptr || lt(pos, text.begin()) || lt(text.end(), pos)) return -1;
    return 1 + std::count(text.begin(), pos, '\n');
}

}  // namespace orvan

// Character classes and the small scanners that every other scanner builds on.
//
// Each Scan... function takes the remaining input by reference, advances its begin past what it consumes,
// and returns whether it consumed anything.
#pragma once

#include "ovmacro/foundations/sub_string.h"
#include "ovmacro/foundations/types.h"

namespace orvan {

constexpr bool IsIdentifierStart(char c) {
    const unsigned char u = static_cast<unsigned char>(c);
    return (u >= 'a' && u <= 'z') || (u >= 'A' && u <= 'Z') || u == '_' || u >= 0x80;
}
constexpr bool IsIdentifierChar(char c) { return IsIdentifierStart(c) || (c >= '0' && c <= '9'); }
// Blank, tab, line feed, carriage return, vertical tab, form feed.
constexpr bool IsWhiteSpace(char c) { return c == ' ' || c == '\t' || c == '\n' || c == '\r' || c == '\v' || c == '\f'; }

// A letter, '_' or a byte >= 0x80 first, then letters, digits, '_' and bytes >= 0x80, so that UTF-8 text
// reads as identifiers.
bool ScanIdentifier(BasicSubString& s);
// At least one decimal digit.
bool ScanDigits(BasicSubString& s);
bool ScanWhiteSpace(BasicSubString& s);
// Skips blanks (1 column) and tabs (tabWidth columns) while they fit within `indent` columns.
bool ScanIndentation(BasicSubString& s, int64 indent, int64 tabWidth);

bool IsHexDigit(char c);
// 0 to 15 for a hex digit, -1 otherwise.
int MapHexDigit(char c);
// For the letter after a backslash: n t r 0 a b f v, backslash, both quotes and '?', as in C.
bool MapEscapeCharacter(char c, char& mapped);

// The line (from 1) of pos within text; the position just past the end belongs to the last line.
// -1 when pos lies outside text.
int64 GetLineNumber(BasicSubString text, const char* pos);

}  // namespace orvan

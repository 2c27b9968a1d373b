// Numbers and characters as text: decimal and double formatting, C-style quoted literals, re-indenting and
// replacing in strings.
#pragma once

#include "ovmacro/foundations/stream.h"
#include "ovmacro/foundations/sub_string.h"
#include "ovmacro/foundations/types.h"

namespace orvan {

basic_xstring ToString(int v);
basic_xstring ToString(long v);
basic_xstring ToString(long long v);
// The shortest text that reads back as the same double, with ".0" appended when it would read as an
// integer: 2.5 -> "2.5", 3.0 -> "3.0", 1e20 -> "1e+20"; infinities and NaN give "inf", "-inf", "nan".
basic_xstring ToString(double v);
// Writes ToString(v) into buf (at least 40 characters) and returns its length.
int64 FormatDouble(double v, char* buf);

// Escapes one character for a double-quoted C literal: printable ASCII and bytes >= 0x80 as they are; the
// double quote and backslash with a backslash; LF, CR and tab as \n, \r, \t; other control bytes as \ooo.
void WriteCharForCStyleLiteralConstants(xostream& os, char c);
// The same for each character of a text, as the body of one double-quoted literal.
void WriteTextForCStyleLiteralConstants(xostream& os, BasicSubString text);
// The text as a double-quoted C literal, escaped as above.
basic_xstring MakeDoubleQuotedString(BasicSubString text);
// The character as a single-quoted C literal (the single quote is escaped instead of the double quote, and
// other control bytes as \xHH, so that the token scanner reads the literal back to the same byte).
basic_xstring MakeSingleQuotedLiteralChar(char c);

// Writes text, removing up to `indent` columns of indentation (blank 1, tab 4) after each line feed.
void WriteSubStringWithAdjustedIndent(xostream& os, BasicSubString text, int64 indent);
// Replaces every occurrence of `what` in `text` by `with`, in place; returns the number of replacements.
int64 StringFindAndReplace(basic_xstring& text, std::string_view what, std::string_view with);

}  // namespace orvan

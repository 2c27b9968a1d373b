// Section scanners: cut a stretch of text out of the remaining input before anything inside it is evaluated.
//
// A macro argument up to its comma, a bracketed section, a body block with its indentation, an @else or
// @elseif that continues an @if. They read the text as tokens, so brackets, commas and braces inside literals
// and comments never end a section, and they return views into the caller's buffer, never copies.
//
//     BasicSubString rest(text);             // "(a, b) tail"
//     BasicSubString inside = ScanRndBrackettedSection(rest, true);   // "a, b"; rest is " tail"
//
// Each scanner advances the caller's view past what it consumed; on an error the view is left where the scan
// stopped and a LexScannerException is raised at the fault.
#pragma once

#include "ovmacro/foundations/stream.h"
#include "ovmacro/foundations/sub_string.h"
#include "ovmacro/foundations/types.h"
#include "ovmacro/lexer/token.h"

namespace orvan {

// One argument of a call, either `backquoted` (taken literally) or a run of tokens up to a comma or
// `terminator` outside brackets. Returns the token that ended it; `arg` excludes the white space and comments
// in front of that token.
LSToken ScanArgument(BasicSubString& s, BasicSubString& arg, EToken terminator);
// The same, each token read by the token scanner: the plain way that ScanArgument's skipping of quiet tokens
// mirrors (for tests).
LSToken ScanArgumentTokenByToken(BasicSubString& s, BasicSubString& arg, EToken terminator);

// The inside of a bracketed section, nested brackets of the same kind balanced. With readOpen the opening
// bracket is read first; otherwise the caller has consumed it. `s` is left after the closing bracket.
BasicSubString ScanBrackettedSection(BasicSubString& s, bool readOpen, EToken open, EToken close);
BasicSubString ScanRndBrackettedSection(BasicSubString& s, bool readOpen);
BasicSubString ScanSquareBrackettedSection(BasicSubString& s, bool readOpen);
BasicSubString ScanCurlyBrackettedSection(BasicSubString& s, bool readOpen);

// A body block. When the opening bracket is on a later line (block form) the block runs from the first line
// after it, whose indentation is measured into `indent`, to the line before the closing bracket. Otherwise
// (inline form, indent 0) it runs from just after the opening bracket to the closing one; without an opening
// bracket and with !openRequired it is the rest of the line.
BasicSubString ScanStringBlock(BasicSubString& s, int64& indent, EToken open, EToken close,
                               const char* openText, const char* closeText, bool openRequired);
// A body in braces, or the rest of the line.
BasicSubString ScanSubstString(BasicSubString& s, int64& indent);
// A text in round brackets (required).
BasicSubString ScanRndBrackettedString(BasicSubString& s, int64& indent);

// Whether "@ else" (or "@ elseif") comes next. The tokens are consumed whatever the answer, so callers pass a
// copy of their position and adopt it only on true.
bool ScanElseBlock(BasicSubString& s);
bool ScanElseIfBlock(BasicSubString& s);

// Whether two texts are the same sequence of tokens (white space and comments ignored, texts compared
// exactly).
bool SubStringsAreTokenEquivalent(BasicSubString a, BasicSubString b);

// Writes the characters that the quoted string at the start of `s` stands for; text after its closing quote
// is ignored. The whole string is checked before anything is written, so nothing reaches `os` on an error.
// Messages name the end of `s` `endName`.
void UnstringifyQuotedString(BasicSubString s, xostream& os, const char* endName = "EOS");

// Removes the spaces and tabs at the end of `s` and returns their width in columns (space 1, tab 4).
int64 ScanBackwardsThroughSpacesAndTabs(BasicSubString& s);

}  // namespace orvan

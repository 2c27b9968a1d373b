// The fast lane of the expander's main loop: skips ordinary text that needs nothing but copying.
#pragma once

#include <algorithm>

#include "ovmacro/foundations/scanning.h"
#include "ovmacro/foundations/sub_string.h"
#include "ovmacro/lexer/char_classes.h"
#include "ovmacro/vars/name_filter.h"

namespace orvan {

struct PlainTextRun {
    const char* stop;         // where something needs the main loop: a token start, or the end of the text
    const char* ordinaryEnd;  // the end of the last token or line feed skipped: the blanks after it stay pending
    const char* nameEnd;      // when the stop is an identifier that may name a variable, its end; else null
};

// Skips, from a token boundary, the tokens that the main loop would copy unchanged: blanks, line feeds (unless
// `lineFeedsNeedWork`, when indentation must be removed), punctuation and operators, numbers, comments,
// single-quoted literals, double-quoted literals (unless `dollarMacrosActive`), and identifiers that have never
// named a variable. It stops at the start of any other token; scanning errors are raised exactly as the token
// scanner raises them, at the same positions.
PlainTextRun SkipPlainText(const char* p, const char* end, bool lineFeedsNeedWork, bool dollarMacrosActive);
// SkipPlainText as it runs while no variable has ever been named in the process, when it skips words
// without looking them up (for tests: the filter of names is shared by the whole process).
PlainTextRun SkipPlainTextWithoutNames(const char* p, const char* end, bool lineFeedsNeedWork,
                                       bool dollarMacrosActive);

class LSVariable;
class VarFrame;

// Whether dollar macros can change a double-quoted literal in a text expanded in `frame`.
bool DollarMacrosActive(const VarFrame* frame);
// Whether `text` expands to itself in `frame`: ordinary text, and names that no variable there has. Whatever
// would raise an error (a lookup, the scanner) makes it false, and the expansion reports it.
bool IsOrdinaryTextIn(BasicSubString text, VarFrame* frame, bool dollarMacrosActive);
// Whether `text` is one identifier that begins no raw literal: the commonest argument, which holds neither
// line feeds nor tabs.
inline bool IsOneWord(BasicSubString text) {
    return !text.empty() && IsIdentifierStart(text.front()) && !BeginsRawLiteral(text.begin(), text.end()) &&
           std::all_of(text.begin() + 1, text.end(), IsIdentifierChar);
}
// Whether a variable in `frame` or its parents has that name.
bool NamesVariableIn(BasicSubString name, VarFrame* frame);
// IsOrdinaryTextIn for a text that IsOneWord: known from the filter of names, and a lookup when it may be one.
inline bool IsOrdinaryWordIn(BasicSubString word, VarFrame* frame) {
    return !NameFilter::MayContain(word) || !NamesVariableIn(word, frame);
}

// The body of `v` when it is a macro without arguments whose body is ordinary text on one line where it
// expands (in `frame` unless the macro has a frame of its own): what its expansion would be, found without
// expanding it. Empty when the expansion is needed.
BasicSubString OrdinaryValueOfName(LSVariable* v, VarFrame* frame);

}  // namespace orvan

// Evaluation of the bracketed conditions of @if, @elseif, @while (and @assert's expression reading).
#pragma once

#include "ovmacro/vars/var_frame.h"

namespace orvan {

// Parses an expanded condition as a bool; the text must hold exactly one expression, else "Expected ) after
// ... when read ... in expression". The token before the first one reads as "(" in messages.
bool ParseExpandedCondition(const basic_xstring& expanded);

// Expands `condition` in a child frame of `frame` and evaluates it as a bool; exactly one expression must fill
// it. An error of the expansion gets "\n    in NAME(condition)"; an error of the evaluation has "EOS" read as
// ")", gets "\n    in NAME(expanded)" and is moved to `directiveAt` (the expanded text has no place in the
// source).
bool EvaluateConditionText(VarFrame* frame, BasicSubString condition, BasicSubString directiveName,
                           BasicSubString directiveAt);

}  // namespace orvan

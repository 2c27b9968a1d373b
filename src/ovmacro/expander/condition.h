// Evaluation of the bracketed conditions of @if, @elseif, @while (and @assert's expression reading).
#pragma once

#include "ovmacro/vars/var_frame.h"

namespace orvan {

// Expands `condition` in a child frame of `frame` and evaluates it as a bool; exactly one expression must fill
// it. An error of the expansion gets "\n    in NAME(condition)"; an error of the evaluation has "EOS" read as
// ")", gets "\n    in NAME(expanded)" and is moved to `directiveAt` (the expanded text has no place in the
// source).
bool EvaluateConditionText(VarFrame* frame, BasicSubString condition, BasicSubString directiveName,
                           BasicSubString directiveAt);

}  // namespace orvan

// The texts that directives expand and then evaluate: the bracketed conditions of @if, @elseif, @while and
// @assert, and the string expressions of @( ), @fail, @print and the like.
#pragma once

#include <functional>

#include "ovmacro/expr/expression_parser.h"
#include "ovmacro/vars/var_frame.h"

namespace orvan {

// Parses `expanded`, the expansion in `frame` of the bracketed text of the directive `name` whose '@' is at
// `at`, with `parse`, which must read all of it: a token left over raises "Expected ) after ... when read
// ...". The messages name the token before the first "(" and the end of the text ")", the brackets the user
// wrote; an error gets "\n    in NAME(expanded)" and moves to the directive, since the expanded text has no
// place in the source.
void ParseDirectiveText(VarFrame* frame, const basic_xstring& expanded, BasicSubString name, const char* at,
                        const std::function<void(ExpressionParser&)>& parse);

// Expands the bracketed `text` of the directive `name` in a child frame of `frame`. An error of the expansion
// keeps its place and gets "\n    in NAME(text)".
basic_xstring ExpandDirectiveText(VarFrame* frame, BasicSubString text, BasicSubString name);

// Expands `condition` with ExpandDirectiveText and evaluates it as a bool with ParseDirectiveText.
bool EvaluateConditionText(VarFrame* frame, BasicSubString condition, BasicSubString name, const char* at);

}  // namespace orvan

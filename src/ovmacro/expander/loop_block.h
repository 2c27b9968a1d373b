// The plain way of a @for block: a block that is ordinary text apart from the loop names and @str of them
// (the enum and the table of names generated from one list) is cut once into the parts that each iteration
// writes, so that an iteration needs neither a frame of its own, nor bindings, nor a pass of the expander over
// the block. The output, its pieces, the nesting count, the output bound and every error are the same as the
// general way's, which takes every other block, and every iteration whose items are not ordinary text.
#pragma once

#include <span>

#include "ovmacro/foundations/sub_string.h"
#include "ovmacro/foundations/types.h"

namespace orvan {

class VarFrame;

struct LoopBlockPart {
    enum Kind { kText, kName, kStr };
    Kind kind = kText;
    BasicSubString text;       // kText: the characters written, the input indentation of each line left out
    size_t name = 0;           // kName, kStr: which loop name
    const char* at = nullptr;  // kStr: the '@' of the directive, which its literal maps back to
};
using LoopBlockPlan = xvector<LoopBlockPart>;

// Cuts `block` (whose lines lose `indent` columns) into parts; false when it holds anything else: a directive
// other than "@str(NAME)", a name of a variable of `frame`, a character that the general way treats apart.
bool PlanLoopBlock(BasicSubString block, int64 indent, std::span<const BasicSubString> names, VarFrame* frame,
                   LoopBlockPlan& plan);

// Whether a loop name's item can be written as it stands: ordinary text in `frame`, on one line.
bool IsPlainLoopItem(BasicSubString item, VarFrame* frame, bool dollarMacrosActive);

}  // namespace orvan

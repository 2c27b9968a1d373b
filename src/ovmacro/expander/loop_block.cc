#include "ovmacro/expander/loop_block.h"

#include <algorithm>
#include <cstring>
#include <optional>

#include "ovmacro/expander/held_text.h"
#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/expander/nesting_guard.h"
#include "ovmacro/expander/plain_text.h"
#include "ovmacro/foundations/scanning.h"
#include "ovmacro/foundations/text_format.h"
#include "ovmacro/lexer/exceptions.h"
#include "ovmacro/vars/name_filter.h"

namespace orvan {

namespace {

// The loop name that [begin, end) is, or names.size().
size_t LoopNameIndex(std::span<const BasicSubString> names, const char* begin, const char* end) {
    const BasicSubString word(begin, end);
    return static_cast<size_t>(std::find(names.begin(), names.end(), word) - names.begin());
}

}  // namespace

bool PlanLoopBlock(BasicSubString block, int64 indent, std::span<const BasicSubString> names, VarFrame* frame,
                   LoopBlockPlan& plan) {
    plan.clear();
    if (IsInHeldText(block.begin())) return false;
    // The general way binds the loop names in a frame, which puts them in the filter of names that the fast
    // lane stops at; without the binding they must reach the filter here.
    for (const BasicSubString& name : names)
        if (!NameFilter::MayContain(name)) NameFilter::Add(name);
    const bool dollarMacrosActive = DollarMacrosActive(frame);
    const char* runStart = block.begin();
    auto text = [&](const char* end) {
        if (end > runStart) plan.push_back({LoopBlockPart::kText, BasicSubString(runStart, end), 0, nullptr});
    };
    try {
        for (const char* p = block.begin();;) {
            const PlainTextRun run = SkipPlainText(p, block.end(), indent > 0, dollarMacrosActive);
            p = run.stop;
            if (p == block.end()) break;
            if (*p == '\n') {
                // What the general way does at a line feed when lines lose indentation.
                text(p + 1);
                BasicSubString rest(p + 1, block.end());
                ScanIndentation(rest, indent, 4);
                runStart = p = rest.begin();
            } else if (run.nameEnd) {
                const size_t i = LoopNameIndex(names, p, run.nameEnd);
                if (i == names.size()) {
                    if (frame->Find(BasicSubString(p, run.nameEnd), run.nameEnd)) return false;
                    p = run.nameEnd;
                    continue;
                }
                text(p);
                plan.push_back({LoopBlockPart::kName, {}, i, nullptr});
                runStart = p = run.nameEnd;
            } else if (block.end() - p > 5 && std::memcmp(p, "@str(", 5) == 0) {
                BasicSubString name(p + 5, block.end());
                if (!ScanIdentifier(name) || name.empty() || name.front() != ')') return false;
                const size_t i = LoopNameIndex(names, p + 5, name.begin());
                if (i == names.size()) return false;
                text(p);
                plan.push_back({LoopBlockPart::kStr, {}, i, p});
                runStart = p = name.begin() + 1;
            } else {
                return false;
            }
        }
    } catch (const LexScannerException&) {
        return false;  // the general way reports it
    }
    text(block.end());
    return true;
}

bool IsPlainLoopItem(BasicSubString item, VarFrame* frame, bool dollarMacrosActive) {
    return std::find(item.begin(), item.end(), '\n') == item.end() && IsOrdinaryTextIn(item, frame, dollarMacrosActive);
}

void MacroExpander::WritePlannedIteration(const LoopBlockPlan& plan, std::span<const BasicSubString> items,
                                          BasicSubString block, int64 blockOutputIndent) {
    const int64 savedIndent = outputIndent;
    outputIndent = blockOutputIndent;  // as the expansion of the block would have it
    try {
        const MacroNestingGuard iteration(block.begin());
        const bool dollarMacrosActive = DollarMacrosActive(frame);
        for (const LoopBlockPart& part : plan) {
            if (part.kind == LoopBlockPart::kText) {
                WriteSubStringFromSourceFile(part.text);
                continue;
            }
            const BasicSubString item = items[part.name];
            if (part.kind == LoopBlockPart::kName) {
                // As a loop name expands: its text copied where the column stands, one level deeper unless the
                // fast lane passes it whole.
                const bool plain = SkipPlainText(item.begin(), item.end(), false, dollarMacrosActive).stop == item.end();
                const std::optional<MacroNestingGuard> level =
                    plain ? std::nullopt : std::optional<MacroNestingGuard>(std::in_place, item.begin());
                const int64 before = output->GetCharCount();
                WriteCopiedText(*output, item, GetOutputPos());
                MacroNestingGuard::ChargeOutput(output->GetCharCount() - before, item.begin());
                continue;
            }
            // As @str of a name whose value is ordinary text (ProcessStrDirective).
            {
                const MacroNestingGuard argumentLevel(part.at + 5), bodyLevel(item.begin());
                MacroNestingGuard::ChargeOutput(item.size(), item.begin());
            }
            StringStream literal(static_cast<size_t>(item.size()) + 8);  // most fit in the string itself
            WritePrefix(literal, SLM_Narrow);
            WriteTextForCStyleLiteralConstants(literal, item);
            WriteSuffix(literal, SLM_Narrow);
            WriteCalculatedSubString(BasicSubString(literal.str()), BasicSubString(part.at, part.at + 1));
        }
    } catch (LexScannerException& e) {
        outputIndent = savedIndent;
        MovePositionOutOfHeldTexts(e);
        throw;
    }
    outputIndent = savedIndent;
}

}  // namespace orvan

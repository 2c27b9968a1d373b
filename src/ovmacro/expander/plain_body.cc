// Invocation of a macro whose body is ordinary text apart from the names of its untyped arguments: the body
// is written as it stands and each name is replaced by the expansion of its argument, without the frame,
// bindings and nested expander that the general way builds. The output, its pieces, the nesting count and
// every error report are the same as the general way's.
#include "ovmacro/expander/call_context.h"
#include "ovmacro/expander/held_text.h"
#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/expander/nesting_guard.h"
#include "ovmacro/expander/plain_text.h"
#include "ovmacro/foundations/compose.h"
#include "ovmacro/vars/name_filter.h"

namespace orvan {

namespace {

// Where the body names an argument, and which one.
struct ArgumentUse {
    const char* begin;
    const char* end;
    int64 arg;
};

// Bodies with more uses than this take the general way.
constexpr int64 kMaxPlainBodyUses = 16;

// The formal argument a name in the body refers to: the last of that name, which hides earlier ones.
int64 FindFormal(const LSMacroVariable& m, BasicSubString name) {
    for (int64 i = m.GetNumArgs() - 1; i >= 0; --i)
        if (m.GetArg(i).name == name) return i;
    return -1;
}

// Splits the body into ordinary text and argument names; false when anything else is in it (another name
// that may be a variable, a directive, a line feed whose indentation must go, a text the scanner rejects).
bool SplitPlainBody(const LSMacroVariable& m, bool dollarMacrosActive, ArgumentUse* uses, int64& count) {
    const BasicSubString body = m.GetSubstitutionString();
    count = 0;
    for (const char* p = body.begin();;) {
        PlainTextRun run;
        try {
            run = SkipPlainText(p, body.end(), m.GetIndent() > 0, dollarMacrosActive);
        } catch (const LexScannerException&) {
            return false;  // the general way reports it
        }
        if (run.stop == body.end()) return true;
        if (!run.nameEnd || count == kMaxPlainBodyUses) return false;
        const int64 arg = FindFormal(m, BasicSubString(run.stop, run.nameEnd));
        if (arg < 0) return false;
        uses[count++] = {run.stop, run.nameEnd, arg};
        p = run.nameEnd;
    }
}

// Whether an argument expands to itself in `frame`: ordinary text, and names that no variable there has.
// Whatever would raise an error (a lookup, the scanner) leaves it to the expansion, which reports it.
bool IsOrdinaryTextIn(BasicSubString text, VarFrame* frame, bool dollarMacrosActive) {
    try {
        for (const char* p = text.begin();;) {
            const PlainTextRun run = SkipPlainText(p, text.end(), false, dollarMacrosActive);
            if (run.stop == text.end()) return true;
            if (!run.nameEnd || frame->Find(BasicSubString(run.stop, run.nameEnd), run.nameEnd)) return false;
            p = run.nameEnd;
        }
    } catch (const LexScannerException&) {
        return false;
    }
}

}  // namespace

bool MacroExpander::ExpandPlainBody(const LSMacroVariable& m, VarFrame* parentFrame,
                                    std::span<const BasicSubString> actual) {
    // Naked macros leave their bindings behind, and typed arguments or results need evaluation.
    if (m.IsPython() || m.IsNaked() || m.GetReturnType() != LSV_Macro) return false;
    for (int64 i = 0; i < m.GetNumArgs(); ++i) {
        const LSFormalArg& formal = m.GetArg(i);
        if (formal.type != LSV_Macro || formal.isFnArg) return false;
        // The general way binds each argument in a list, which lets the fast lane stop at its name; without
        // the binding the name must reach the filter here.
        if (!NameFilter::MayContain(formal.name)) NameFilter::Add(formal.name);
    }
    const FileScopeVarFrame* bodyScope = parentFrame->GetFileScopeVarFrame();
    const FileScopeVarFrame* argScope = frame->GetFileScopeVarFrame();
    auto dollarMacrosActive = [](const FileScopeVarFrame* scope) {
        return scope && (!scope->dollarMacros.empty() || !scope->importedFiles.empty());
    };
    ArgumentUse uses[kMaxPlainBodyUses];
    int64 count = 0;
    if (!SplitPlainBody(m, dollarMacrosActive(bodyScope), uses, count)) return false;

    const BasicSubString body = m.GetSubstitutionString();
    const int64 bodyIndent = GetOutputPos();
    auto writeCopied = [&](BasicSubString s, int64 indent) {
        if (s.empty()) return;
        const int64 before = output->GetCharCount();
        WriteCopiedText(*output, s, indent);
        MacroNestingGuard::ChargeOutput(output->GetCharCount() - before, s.begin());
    };
    try {
        MacroNestingGuard bodyGuard(body.begin());  // the body is one expansion level, as the general way
        const char* p = body.begin();
        for (int64 u = 0; u < count; ++u) {
            writeCopied(BasicSubString(p, uses[u].begin), bodyIndent);
            p = uses[u].end;
            // The argument is expanded where it is used, with the invoker's names, at the column reached.
            const BasicSubString arg = actual[static_cast<size_t>(uses[u].arg)];
            const int64 column = output->GetColumnPos();
            const int64 argIndent = column >= 0 ? column : bodyIndent;
            if (IsOrdinaryTextIn(arg, frame, dollarMacrosActive(argScope))) {
                writeCopied(arg, argIndent);
                continue;
            }
            try {
                VarFrame argFrame(frame);
                MacroExpand(nullptr, &argFrame, arg, 0, argIndent, *output);
            } catch (LexScannerException& e) {
                e.AppendCallContextLine(Compose("\n    invoking macro ", m.GetArg(uses[u].arg).name));
                throw;
            }
        }
        writeCopied(BasicSubString(p, body.end()), bodyIndent);
    } catch (LexScannerException& e) {
        e.AppendCallContextLine(
            InvokingMacroLine(m, actual.size(), [&](xostream& os, size_t i) { os << actual[i]; }));
        throw;
    }
    return true;
}

}  // namespace orvan

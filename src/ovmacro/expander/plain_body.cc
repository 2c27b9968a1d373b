// Invocation of a macro whose body is ordinary text apart from the names of its untyped arguments: the body
// is written as it stands and each name is replaced by the expansion of its argument, without the frame,
// bindings and nested expander that the general way builds. The output, its pieces, the nesting count and
// every error report are the same as the general way's.
#include <algorithm>
#include <cstdint>

#include "ovmacro/expander/call_context.h"
#include "ovmacro/expander/held_text.h"
#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/expander/nesting_guard.h"
#include "ovmacro/expander/plain_text.h"
#include "ovmacro/foundations/compose.h"
#include "ovmacro/vars/name_filter.h"

namespace orvan {

namespace {

// Where the body names an argument, and which one; and whether the body's text before it holds no line feed
// and no tab and fits ExpandedOutput::TryGatherLineFreeRun.
struct ArgumentUse {
    const char* begin;
    const char* end;
    int64 arg;
    bool lineFreeBefore;
};

bool IsLineFreeRun(const char* p, const char* end) {
    return end > p && end - p <= ExpandedOutput::kMaxLineFreeRun && std::find(p, end, '\n') == end &&
           std::find(p, end, '\t') == end;
}

// Bodies with more uses than this take the general way.
constexpr int64 kMaxPlainBodyUses = 16;

// Splits the body into ordinary text and argument names; false when anything else is in it (another name
// that may be a variable, a directive, a line feed whose indentation must go, a text the scanner rejects).
bool ScanPlainBody(const LSMacroVariable& m, bool dollarMacrosActive, ArgumentUse* uses, int64& count) {
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
        const int64 arg = m.FindArgName(BasicSubString(run.stop, run.nameEnd));
        if (arg < 0) return false;
        uses[count++] = {run.stop, run.nameEnd, arg, IsLineFreeRun(p, run.stop)};
        p = run.nameEnd;
    }
}

// The splits of the bodies a thread invoked last. A split depends on the macro's body and formal arguments,
// the two flags that SkipPlainText takes, and the name filter. A macro is known by its identity and by where
// its body and argument names lie, so that a host that gives it another body or other arguments is noticed.
class PlainBodySplits {
public:
    // Also tells whether the text after the last use is a line-free run.
    bool Split(const LSMacroVariable& m, bool dollarMacrosActive, ArgumentUse* uses, int64& count,
               bool& lineFreeTail) {
        const BasicSubString body = m.GetSubstitutionString();
        const bool indented = m.GetIndent() > 0;
        for (Entry& e : entries_) {
            if (!e.Matches(m, body, indented, dollarMacrosActive, NameFilter::Generation())) continue;
            // The entry's body lies where the macro's lies now, so its pointers hold.
            count = e.count;
            std::copy_n(e.uses, count, uses);
            lineFreeTail = e.lineFreeTail;
            return e.plain;
        }
        // The general way binds each argument in a list, which lets the fast lane stop at its name; without
        // the binding the name must reach the filter here.
        for (int64 i = 0; i < m.GetNumArgs(); ++i)
            if (!NameFilter::MayContain(m.GetArg(i).name)) NameFilter::Add(m.GetArg(i).name);
        Entry& e = entries_[next_];
        next_ = (next_ + 1) % kEntries;
        e.generation = NameFilter::Generation();
        e.plain = ScanPlainBody(m, dollarMacrosActive, uses, count);
        e.identity = m.identity;
        e.body = body;
        e.formals.clear();
        for (int64 i = 0; i < m.GetNumArgs(); ++i) e.formals.push_back(m.GetArg(i).name);
        e.indented = indented;
        e.dollarMacrosActive = dollarMacrosActive;
        e.count = e.plain ? count : 0;
        std::copy_n(uses, e.count, e.uses);
        e.lineFreeTail = IsLineFreeRun(count > 0 ? uses[count - 1].end : body.begin(), body.end());
        lineFreeTail = e.lineFreeTail;
        return e.plain;
    }

private:
    static bool SameView(BasicSubString a, BasicSubString b) { return a.begin() == b.begin() && a.end() == b.end(); }
    struct Entry {
        bool Matches(const LSMacroVariable& m, BasicSubString text, bool indentedNow, bool dollarNow,
                     std::uint64_t generationNow) const {
            if (identity != m.identity || generation != generationNow || indented != indentedNow ||
                dollarMacrosActive != dollarNow || !SameView(body, text) ||
                formals.size() != static_cast<size_t>(m.GetNumArgs()))
                return false;
            for (size_t i = 0; i < formals.size(); ++i)
                if (!SameView(formals[i], m.GetArg(static_cast<int64>(i)).name)) return false;
            return true;
        }
        std::uint64_t identity = 0;  // no macro has identity 0
        std::uint64_t generation = 0;
        bool indented = false;
        bool dollarMacrosActive = false;
        bool plain = false;
        BasicSubString body;
        xvector<BasicSubString> formals;
        int64 count = 0;
        ArgumentUse uses[kMaxPlainBodyUses];
        bool lineFreeTail = false;
    };
    static constexpr size_t kEntries = 4;
    Entry entries_[kEntries];
    size_t next_ = 0;
};

// The default TLS model: a block this large in the static TLS area could keep a host from loading the
// library with dlopen.
thread_local PlainBodySplits t_splits;

// The ways off the common path, out of line so that the loop over the body keeps its values in registers.
[[gnu::noinline]] void WriteCopiedAndCharge(ExpandedOutput& output, BasicSubString s, int64 indent) {
    if (s.empty()) return;
    const int64 before = output.GetCharCount();
    WriteCopiedText(output, s, indent);
    MacroNestingGuard::ChargeOutput(output.GetCharCount() - before, s.begin());
}

[[gnu::noinline]] void ExpandArgument(VarFrame* frame, BasicSubString arg, int64 indent, ExpandedOutput& output,
                                      BasicSubString formalName) {
    try {
        VarFrame argFrame(frame);
        MacroExpand(nullptr, &argFrame, arg, 0, indent, output);
    } catch (LexScannerException& e) {
        e.AppendCallContextLine(Compose("\n    invoking macro ", formalName));
        throw;
    }
}

}  // namespace

bool MacroExpander::ExpandPlainBody(const LSMacroVariable& m, VarFrame* parentFrame,
                                    std::span<const BasicSubString> actual, bool namesOnly) {
    // Naked macros leave their bindings behind, and typed arguments or results need evaluation.
    if (m.IsPython() || m.IsNaked() || m.GetReturnType() != LSV_Macro) return false;
    for (int64 i = 0; i < m.GetNumArgs(); ++i)
        if (m.GetArg(i).type != LSV_Macro || m.GetArg(i).isFnArg) return false;
    ArgumentUse uses[kMaxPlainBodyUses];
    int64 count = 0;
    bool lineFreeTail = false;
    const bool bodyDollarMacrosActive = DollarMacrosActive(parentFrame);
    if (!t_splits.Split(m, bodyDollarMacrosActive, uses, count, lineFreeTail)) return false;

    const BasicSubString body = m.GetSubstitutionString();
    const int64 bodyIndent = GetOutputPos();
    const bool argDollarMacrosActive =
        count > 0 && (parentFrame == frame ? bodyDollarMacrosActive : DollarMacrosActive(frame));
    // Runs known to be line free skip the look at their characters, unless they may lie in a held text.
    auto writeCopied = [&](BasicSubString s, int64 indent, bool lineFree) __attribute__((always_inline)) {
        if (lineFree && g_liveHeldTexts.load(std::memory_order_relaxed) == 0 &&
            output->TryGatherLineFreeRun(s, indent))
            MacroNestingGuard::ChargeOutput(s.size(), s.begin());
        else
            WriteCopiedAndCharge(*output, s, indent);
    };
    try {
        MacroNestingGuard bodyGuard(body.begin());  // the body is one expansion level, as the general way
        const char* p = body.begin();
        for (int64 u = 0; u < count; ++u) {
            writeCopied(BasicSubString(p, uses[u].begin), bodyIndent, uses[u].lineFreeBefore);
            p = uses[u].end;
            // The argument is expanded where it is used, with the invoker's names, at the column reached.
            const BasicSubString arg = actual[static_cast<size_t>(uses[u].arg)];
            const int64 column = output->GetColumnPos();
            const int64 argIndent = column >= 0 ? column : bodyIndent;
            const bool word = namesOnly || IsOneWord(arg);
            if (word ? IsOrdinaryWordIn(arg, frame) : IsOrdinaryTextIn(arg, frame, argDollarMacrosActive)) {
                writeCopied(arg, argIndent, word);
                continue;
            }
            ExpandArgument(frame, arg, argIndent, *output, m.GetArg(uses[u].arg).name);
        }
        writeCopied(BasicSubString(p, body.end()), bodyIndent, lineFreeTail);
    } catch (LexScannerException& e) {
        e.AppendCallContextLine(
            InvokingMacroLine(m, actual.size(), [&](xostream& os, size_t i) { os << actual[i]; }));
        throw;
    }
    return true;
}

}  // namespace orvan

// ExpansionObserver: what a tool that explains an expansion to its user (warnings, notes after an error, a
// trace of the calls) may watch while texts expand, without the expander knowing what it does with it.
//
// Nothing is watched unless a tool installs an observer on its thread. Each place that reports to it costs a
// thread-local load and a branch not taken when none is installed. Calls of macros and blocks of directives,
// the only frequent events, reach only an observer installed to watch calls, so that one that wants the rare
// events alone (definitions, failures, words after '@' that are no directive) leaves the call path as fast
// as with no observer.
//
//     MyObserver observer;
//     const ExpansionObserver::Installation watching(observer, /*watchCalls=*/false);
//     MacroExpand(...);
#pragma once

#include <span>
#include <string_view>

#include "ovmacro/foundations/sub_string.h"

namespace orvan {

class ExpandedOutput;
class LexScannerException;
class LSMacroVariable;
class LSVariable;
class VarFrame;

class ExpansionObserver {
public:
    ExpansionObserver() = default;
    ExpansionObserver(const ExpansionObserver&) = delete;
    ExpansionObserver& operator=(const ExpansionObserver&) = delete;
    virtual ~ExpansionObserver();

    // A @def, @exportdef, @nakeddef or @defpython has just added `m` to `frame`.
    virtual void MacroDefined(const LSMacroVariable& m, VarFrame& frame);
    // The '@' at `at` and the word after it name neither a directive nor a value variable: both stay text.
    virtual void NotADirective(BasicSubString word, const char* at);
    // Parsing `expanded`, an expression whose names were looked up in `frame`, failed with e; e's position
    // still lies in `expanded` when the parser stopped there.
    virtual void ExpressionFailed(VarFrame* frame, BasicSubString expanded, const LexScannerException& e);
    // e leaves the expansion of a text in `frame`: reported at every level it passes, innermost first.
    virtual void ExpansionFailed(VarFrame* frame, const LexScannerException& e);

    // With watchCalls only. A call of `m`, whose name stands at `at`, begins; `arguments` are the texts of
    // its arguments as written, filled in once read. What the call writes goes to `output`.
    virtual void CallBegan(const LSMacroVariable& m, BasicSubString at,
                           std::span<const BasicSubString> arguments, ExpandedOutput& output);
    // The arguments of the innermost call are bound: typed ones to their values, the others to their texts.
    virtual void CallBound(std::span<LSVariable* const> bindings);
    // A directive expands one of its blocks: `directive` ("@if", "@elseif", "@else", "@for", "@while"), the
    // block's text at `at`, and what chose it: the condition as written, or a loop item (`name` = `value`).
    virtual void BlockBegan(std::string_view directive, BasicSubString at, BasicSubString name,
                            BasicSubString value, ExpandedOutput& output);
    // The innermost call or block has ended, by an error when `failed`.
    virtual void Ended(bool failed);

    static ExpansionObserver* Current() { return t_current; }
    static ExpansionObserver* CallWatcher() { return t_callWatcher; }

    // Installs an observer on the calling thread for its lifetime, and puts back the one installed before.
    class Installation {
    public:
        Installation(ExpansionObserver& observer, bool watchCalls);
        ~Installation();
        Installation(const Installation&) = delete;
        Installation& operator=(const Installation&) = delete;

    private:
        ExpansionObserver* current_;
        ExpansionObserver* callWatcher_;
    };

private:
    // Initial-exec: a plain offset from the thread pointer, as the nesting guard's counters.
    static inline thread_local ExpansionObserver* t_current __attribute__((tls_model("initial-exec"))) =
        nullptr;
    static inline thread_local ExpansionObserver* t_callWatcher __attribute__((tls_model("initial-exec"))) =
        nullptr;
};

// A call or a block while it runs, reported to the call watcher, if any, when it begins and when it ends.
class ObservedExpansion {
public:
    // `arguments` (a container of BasicSubString with view()) and the others are read only when watched.
    template <class Arguments>
    ObservedExpansion(const LSMacroVariable& m, const BasicSubString& at, const Arguments& arguments,
                      ExpandedOutput* const& output)
        : watcher_(ExpansionObserver::CallWatcher()) {
        if (watcher_) [[unlikely]] BeginCall(m, at, arguments.view(), *output);
    }
    ObservedExpansion(std::string_view directive, BasicSubString at, BasicSubString name,
                      BasicSubString value, ExpandedOutput& output)
        : watcher_(ExpansionObserver::CallWatcher()) {
        if (watcher_) [[unlikely]] BeginBlock(directive, at, name, value, output);
    }
    ~ObservedExpansion() {
        if (watcher_) [[unlikely]] End();
    }
    ObservedExpansion(const ObservedExpansion&) = delete;
    ObservedExpansion& operator=(const ObservedExpansion&) = delete;

    void Bound(std::span<LSVariable* const> bindings) const {
        if (watcher_) [[unlikely]] watcher_->CallBound(bindings);
    }

private:
    void BeginCall(const LSMacroVariable& m, BasicSubString at, std::span<const BasicSubString> arguments,
                   ExpandedOutput& output);
    void BeginBlock(std::string_view directive, BasicSubString at, BasicSubString name, BasicSubString value,
                    ExpandedOutput& output);
    void End();

    ExpansionObserver* watcher_;
    int exceptionsAtBegin_;  // set when watched: an end with more exceptions in flight is an end by an error
};

}  // namespace orvan

#include "ovmacro/expander/expansion_observer.h"

#include <exception>

namespace orvan {

ExpansionObserver::~ExpansionObserver() = default;

// An observer overrides what it watches; the rest is ignored.
void ExpansionObserver::MacroDefined(const LSMacroVariable&, VarFrame&) {}
void ExpansionObserver::NotADirective(BasicSubString, const char*) {}
void ExpansionObserver::ExpressionFailed(VarFrame*, BasicSubString, const LexScannerException&) {}
void ExpansionObserver::ExpansionFailed(VarFrame*, const LexScannerException&) {}
void ExpansionObserver::CallBegan(const LSMacroVariable&, BasicSubString, std::span<const BasicSubString>,
                                  ExpandedOutput&) {}
void ExpansionObserver::CallBound(std::span<LSVariable* const>) {}
void ExpansionObserver::BlockBegan(std::string_view, BasicSubString, BasicSubString, BasicSubString,
                                   ExpandedOutput&) {}
void ExpansionObserver::Ended(bool) {}

ExpansionObserver::Installation::Installation(ExpansionObserver& observer, bool watchCalls)
    : current_(t_current), callWatcher_(t_callWatcher) {
    t_current = &observer;
    t_callWatcher = watchCalls ? &observer : nullptr;
}

ExpansionObserver::Installation::~Installation() {
    t_current = current_;
    t_callWatcher = callWatcher_;
}

void ObservedExpansion::BeginCall(const LSMacroVariable& m, BasicSubString at,
                                  std::span<const BasicSubString> arguments, ExpandedOutput& output) {
    exceptionsAtBegin_ = std::uncaught_exceptions();
    watcher_->CallBegan(m, at, arguments, output);
}

void ObservedExpansion::BeginBlock(std::string_view directive, BasicSubString at, BasicSubString name,
                                   BasicSubString value, ExpandedOutput& output) {
    exceptionsAtBegin_ = std::uncaught_exceptions();
    watcher_->BlockBegan(directive, at, name, value, output);
}

void ObservedExpansion::End() {
    watcher_->Ended(std::uncaught_exceptions() > exceptionsAtBegin_);
}

}  // namespace orvan

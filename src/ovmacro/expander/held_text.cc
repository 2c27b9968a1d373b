#include "ovmacro/expander/held_text.h"

#include <functional>
#include <iterator>
#include <map>
#include <mutex>

#include "ovmacro/expander/macro_expander.h"

namespace orvan {

namespace {

// The held texts alive in the process, by the address of their first character. Frames, and with them held
// texts, may be destroyed on another thread than the one that made them, hence one map under a lock.
struct Registry {
    std::mutex lock;
    std::map<const char*, const HeldText*, std::less<const char*>> byBegin;
};

Registry& TheRegistry() {
    static Registry* registry = new Registry;  // never destroyed: frames may die during static destruction
    return *registry;
}

bool Contains(BasicSubString text, const char* pos) {
    const std::less<const char*> lt;
    return pos && !lt(pos, text.begin()) && !lt(text.end(), pos);
}

}  // namespace

HeldText::HeldText(BasicSubString name, basic_xstring text, OutputPieces pieces, BasicSubString source)
    : LSVar(name, BasicSubString()), pieces_(std::move(pieces)), source_(source) {
    value = std::move(text);
    if (value.empty()) return;  // nothing can point into it
    Registry& registry = TheRegistry();
    const std::lock_guard<std::mutex> hold(registry.lock);
    registry.byBegin[value.data()] = this;
}

HeldText::~HeldText() {
    if (value.empty()) return;
    Registry& registry = TheRegistry();
    const std::lock_guard<std::mutex> hold(registry.lock);
    registry.byBegin.erase(value.data());
}

void HeldText::MovePositionOut(LexScannerException& e) const {
    if (Contains(GetText(), e.GetPosition())) MovePositionOutOfExpansion(e, GetText(), pieces_, source_);
}

void MovePositionOutOfHeldTexts(LexScannerException& e) {
    Registry& registry = TheRegistry();
    const std::lock_guard<std::mutex> hold(registry.lock);
    if (registry.byBegin.empty()) return;
    // A held text maps only to texts that existed before it, so the moves end; the bound is a safeguard.
    for (int step = 0; step < 1000; ++step) {
        const char* pos = e.GetPosition();
        if (!pos) return;
        auto it = registry.byBegin.upper_bound(pos);
        if (it == registry.byBegin.begin()) return;
        const HeldText* held = std::prev(it)->second;
        if (!Contains(held->GetText(), pos)) return;
        held->MovePositionOut(e);
        if (e.GetPosition() == pos) return;
    }
}

HeldTextKeeper::HeldTextKeeper(VarFrame* frame) : frame_(frame) {
    for (VarFrame* f = frame; f; f = f->GetParent()) newest_.push_back(f->vars.First());
}

HeldTextKeeper::~HeldTextKeeper() {
    if (!held_) return;
    VarFrame* keeper = nullptr;
    size_t i = 0;
    for (VarFrame* f = frame_; f && i < newest_.size(); f = f->GetParent(), ++i)
        if (f->vars.First() != newest_[i]) keeper = f;
    if (!keeper) return;
    try {
        keeper->AddVariable(held_.get());
        (void)held_.release();
    } catch (...) {
        // Out of memory while an error may be passing: the text is left alive rather than freed under the
        // definitions that point into it.
        (void)held_.release();
    }
}

HeldText& HeldTextKeeper::ExpandAndHold(BasicSubString name, BasicSubString source) {
    basic_xstring expanded;
    OutputPieces pieces;
    {
        VarFrame child(frame_);
        MacroExpand(nullptr, &child, source, 0, 0, expanded, pieces);
    }
    return Hold(std::make_unique<HeldText>(name, std::move(expanded), std::move(pieces), source));
}

HeldText& HeldTextKeeper::Hold(std::unique_ptr<HeldText> held) {
    held_ = std::move(held);
    return *held_;
}

}  // namespace orvan

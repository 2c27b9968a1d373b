#include "ovmacro/expander/held_text.h"

#include <atomic>
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
    g_liveHeldTexts = registry.byBegin.size();
}

HeldText::~HeldText() {
    if (value.empty()) return;
    Registry& registry = TheRegistry();
    const std::lock_guard<std::mutex> hold(registry.lock);
    registry.byBegin.erase(value.data());
    g_liveHeldTexts = registry.byBegin.size();
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

namespace {

// The live held text in which a run starting at p lies (p before its end), or null.
const HeldText* HeldTextAt(const char* p) {
    if (g_liveHeldTexts.load(std::memory_order_relaxed) == 0 || !p) return nullptr;
    Registry& registry = TheRegistry();
    const std::lock_guard<std::mutex> hold(registry.lock);
    auto it = registry.byBegin.upper_bound(p);
    if (it == registry.byBegin.begin()) return nullptr;
    const HeldText* held = std::prev(it)->second;
    const std::less<const char*> lt;
    return lt(p, held->GetText().end()) ? held : nullptr;
}

// A calculated piece's source moved out of held texts: only its begin is used to place positions.
BasicSubString SourceOutsideHeldTexts(BasicSubString source) {
    if (g_liveHeldTexts.load(std::memory_order_relaxed) == 0 || !source.begin()) return source;
    LexScannerException probe("", source.begin());
    MovePositionOutOfHeldTexts(probe);
    if (probe.GetPosition() == source.begin()) return source;
    return BasicSubString(probe.GetPosition(), probe.GetPosition());
}

}  // namespace

bool IsInHeldText(const char* p) { return HeldTextAt(p) != nullptr; }

std::atomic<size_t> g_liveHeldTexts{0};

void WriteCopiedTextPieceByPiece(ExpandedOutput& output, BasicSubString s, int64 indent) {
    const HeldText* held = HeldTextAt(s.begin());
    if (!held) {
        output.WriteSubStringFromSourceFile(s, indent);
        return;
    }
    // The part of s in the held text goes piece by piece of the held text; a part beyond it (none in
    // practice: a run lies in the text being expanded) is written on its own.
    const BasicSubString text = held->GetText();
    const char* const end = s.end() < text.end() ? s.end() : text.end();
    const int64 from = s.begin() - text.begin(), to = end - text.begin();
    int64 pieceBegin = 0;
    for (const OutputPiece& piece : held->GetPieces().GetPieces()) {
        if (pieceBegin >= to) break;
        const int64 pieceEnd = pieceBegin + piece.size();
        const int64 lo = from > pieceBegin ? from : pieceBegin, hi = to < pieceEnd ? to : pieceEnd;
        if (lo < hi && piece.IsCopied()) {
            const char* src = piece.source.begin() + (lo - pieceBegin);
            WriteCopiedText(output, BasicSubString(src, src + (hi - lo)), indent);
        } else if (lo < hi) {
            const BasicSubString chars(text.begin() + lo, text.begin() + hi);
            output.WriteCalculatedSubString(chars, SourceOutsideHeldTexts(piece.source), indent);
        }
        pieceBegin = pieceEnd;
    }
    if (pieceBegin < to) {
        // Characters that no piece covers stand for what the held text as a whole was made from.
        const BasicSubString chars(text.begin() + (from > pieceBegin ? from : pieceBegin), end);
        output.WriteCalculatedSubString(chars, SourceOutsideHeldTexts(held->GetSource()), indent);
    }
    if (end < s.end()) WriteCopiedText(output, BasicSubString(end, s.end()), indent);
}

void WriteCalculatedText(ExpandedOutput& output, BasicSubString s, BasicSubString source, int64 indent) {
    output.WriteCalculatedSubString(s, SourceOutsideHeldTexts(source), indent);
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

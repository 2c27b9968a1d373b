#include "ovmacro/lexer/bracket_index.h"

namespace orvan {

namespace {

thread_local BracketScope* t_innermost = nullptr;

}  // namespace

BracketScope::BracketScope(BasicSubString text)
    : text_(text), parent_(t_innermost), depth_(t_innermost ? t_innermost->depth_ + 1 : 1) {
    t_innermost = this;
}

BracketScope::~BracketScope() { t_innermost = parent_; }

bool BracketScope::Recording() { return t_innermost && t_innermost->depth_ >= kRecordFromDepth; }

BracketScope* BracketScope::OutermostHolding(const char* p) {
    BracketScope* found = nullptr;
    for (BracketScope* s = t_innermost; s; s = s->parent_)
        if (p >= s->text_.begin() && p < s->text_.end()) found = s;
    return found;
}

bool BracketScope::FindClose(const char* afterOpen, LSToken& close, const char*& insideEnd) {
    const BracketScope* scope = OutermostHolding(afterOpen);
    if (!scope || !scope->closes_) return false;
    const auto it = scope->closes_->find(afterOpen);
    if (it == scope->closes_->end()) return false;
    close = it->second.token;
    insideEnd = it->second.insideEnd;
    return true;
}

void BracketScope::RecordClose(const char* afterOpen, const LSToken& close, const char* insideEnd) {
    BracketScope* scope = OutermostHolding(afterOpen);
    if (!scope || close.text.end() > scope->text_.end()) return;
    if (!scope->closes_) scope->closes_ = std::make_unique<std::unordered_map<const char*, Close>>();
    scope->closes_->emplace(afterOpen, Close{close, insideEnd});
}

}  // namespace orvan

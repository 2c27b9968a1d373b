#include "ovmacro/vars/variable_list.h"

#include "ovmacro/vars/name_filter.h"

namespace orvan {

LSVariableList::~LSVariableList() {
    for (LSVariable* v = first_; v;) {
        LSVariable* next = v->next;
        delete v;
        v = next;
    }
    byName_.clear();
}

void LSVariableList::Add(LSVariable* v) {
    v->next = first_;
    first_ = v;
    ++count_;
    if (count_ > kIndexThreshold) {
        if (byName_.empty()) {
            // Index the chain from oldest to newest, so that the newest of each name is the one kept.
            xvector<LSVariable*> chain;
            for (LSVariable* w = first_; w; w = w->next) chain.push_back(w);
            for (auto it = chain.rbegin(); it != chain.rend(); ++it) byName_.insert_or_assign((*it)->name, *it);
        } else {
            byName_.insert_or_assign(v->name, v);
        }
    }
    NameFilter::Add(v->name);
}

LSVariable* LSVariableList::Find(BasicSubString name) {
    // Counted in unsigned arithmetic: the diagnostic counter wraps instead of overflowing.
    if (s_started) s_count = static_cast<std::int32_t>(static_cast<std::uint32_t>(s_count) + 1u);
    if (count_ <= kIndexThreshold) {
        for (LSVariable* v = first_; v; v = v->next)
            if (v->name == name) return v;
        return nullptr;
    }
    auto it = byName_.find(name);
    return it == byName_.end() ? nullptr : it->second;
}

void LSVariableList::WriteToStream(xostream& os) const {
    os << "{\n";
    {
        Indenter indent(os, 4);
        for (const LSVariable* v = first_; v; v = v->next) {
            v->WriteToStream(os);
            os << "\n";
        }
    }
    os << "}\n";
}

}  // namespace orvan

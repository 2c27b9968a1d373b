// LSVariableList: the variables of one scope. It owns them (a chain from newest to oldest, hidden ones
// included) and finds the newest of each name by view, without building strings: along the chain while the
// list is small, through an ordered index once it has grown.
#pragma once

#include <map>

#include "ovmacro/vars/variable.h"

namespace orvan {

class LSVariableList {
public:
    LSVariableList() = default;
    LSVariableList(const LSVariableList&) = delete;
    LSVariableList& operator=(const LSVariableList&) = delete;
    ~LSVariableList();

    // Takes ownership; v hides any earlier variable of the same name.
    void Add(LSVariable* v);
    // The variable most recently added under that name, or null.
    LSVariable* Find(BasicSubString name);
    // "{\n", each variable (newest first) indented by 4, "}\n".
    void WriteToStream(xostream& os) const;
    LSVariable* First() const { return first_; }

private:
    // Small lists (the bindings of one invocation, one loop iteration) are searched along the chain, which
    // needs no allocation; the index is built once a list grows past this many variables.
    static constexpr int64 kIndexThreshold = 12;

    LSVariable* first_ = nullptr;
    int64 count_ = 0;
    std::map<BasicSubString, LSVariable*, SubStringLess> byName_;
};

}  // namespace orvan

// LSVariableList: the variables of one scope. It owns them (a chain from newest to oldest, hidden ones
// included) and indexes the newest of each name for lookup by view, without building strings.
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
    LSVariable* first_ = nullptr;
    std::map<BasicSubString, LSVariable*, SubStringLess> byName_;
};

}  // namespace orvan

#include "ovmacro/vars/variable.h"

#include <atomic>

namespace orvan {

bool s_started = false;
std::int32_t s_count = 0;

void SetStarted() { s_started = true; }

ELSVariable CheckVariableType(BasicSubString word) {
    if (word == "bool") return LSV_Bool;
    if (word == "int") return LSV_Int;
    if (word == "double") return LSV_Double;
    if (word == "char") return LSV_Char;
    if (word == "string") return LSV_String;
    return LSV_Macro;
}

int64 LSMacroVariable::FindArgName(BasicSubString argName) const {
    for (size_t i = 0; i < args.size(); ++i)
        if (args[i].name == argName) return static_cast<int64>(i);
    return -1;
}

void LSMacroVariable::WriteNameAndFormalParameterList(xostream& os) const {
    os << name;
    if (args.empty()) return;
    os << "(";
    for (size_t i = 0; i < args.size(); ++i) {
        if (i) os << ",";
        os << args[i].name;
    }
    os << ")";
}

void LSMacroVariable::WriteToStream(xostream& os) const {
    WriteNameAndFormalParameterList(os);
    os << " = " << GetSubstitutionString();
}

void LSMacroVariable::WriteValue(xostream& os) const { os << GetSubstitutionString(); }

std::uint64_t LSMacroVariable::NextIdentity() {
    static std::atomic<std::uint64_t> next{1};
    return next.fetch_add(1, std::memory_order_relaxed);
}

xostream& operator<<(xostream& os, const LSMacroVariable& m) {
    m.WriteNameAndFormalParameterList(os);
    return os;
}

void LSValueVariable::WriteToStream(xostream& os) const { os << name << " = " << value; }

void LSValueVariable::WriteValue(xostream& os) const { os << value; }

LSVar::LSVar(BasicSubString varName, BasicSubString varValue)
    : LSValueVariable(LSV_String, varName, varValue), nameStore(varName.GetString()) {
    name = BasicSubString(nameStore);
}

}  // namespace orvan

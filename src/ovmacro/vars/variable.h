// Variables of the macro language: macros (LSMacroVariable) and typed values held as text (LSValueVariable,
// and LSVar, which owns a copy of its name).
//
// A variable's name is a view into the text that defined it; that text must outlive the variable.
#pragma once

#include <cstdint>

#include "ovmacro/foundations/stream.h"
#include "ovmacro/foundations/string_x.h"
#include "ovmacro/foundations/sub_string.h"
#include "ovmacro/foundations/types.h"

namespace orvan {

class VarFrame;

enum ELSVariable : std::int32_t {
    LSV_None = 0,    // only a default-constructed LSFormalArg
    LSV_Macro = 1,   // untyped text, expanded where it is used
    LSV_Bool = 2,    // "bool"
    LSV_Int = 3,     // "int": 32-bit signed
    LSV_Double = 4,  // "double"
    LSV_Char = 5,    // "char"
    LSV_String = 6,  // "string"
};

// The type of a type word ("bool", "int", "double", "char", "string"); LSV_Macro for any other word.
ELSVariable CheckVariableType(BasicSubString word);

class LSVariable {
public:
    explicit LSVariable(BasicSubString name) : name(name) {}
    LSVariable(const LSVariable&) = delete;
    LSVariable& operator=(const LSVariable&) = delete;
    virtual ~LSVariable() = default;
    virtual ELSVariable GetType() const = 0;
    // The variable as a definition, for diagnostics.
    virtual void WriteToStream(xostream& os) const = 0;
    // The value alone.
    virtual void WriteValue(xostream& os) const = 0;
    BasicSubString GetName() const { return name; }

    BasicSubString name;
    LSVariable* next = nullptr;  // the next older variable of the owning list
};

struct LSFormalArg {
    LSFormalArg() = default;
    LSFormalArg(BasicSubString name, ELSVariable type, bool isFnArg) : name(name), type(type), isFnArg(isFnArg) {}
    BasicSubString name;
    ELSVariable type = LSV_None;
    bool isFnArg = false;  // declared with "()": the actual argument names a callable macro
};

class LSMacroVariable : public LSVariable {
public:
    LSMacroVariable(ELSVariable returnType, BasicSubString name, VarFrame* context, bool isPython, bool isNaked,
                    bool isFnArg)
        : LSVariable(name), isPython(isPython), isNaked(isNaked), isFnArg(isFnArg), returnType(returnType),
          context(context) {}

    ELSVariable GetType() const override { return LSV_Macro; }
    void WriteToStream(xostream& os) const override;
    void WriteValue(xostream& os) const override;

    bool IsPython() const { return isPython; }
    bool IsNaked() const { return isNaked; }
    bool IsFnArg() const { return isFnArg; }
    ELSVariable GetReturnType() const { return returnType; }
    VarFrame* GetContext() const { return context; }
    int64 GetIndent() const { return indent; }

    void AddArgName(BasicSubString argName, ELSVariable type, bool fnArg) { args.emplace_back(argName, type, fnArg); }
    // Index of the first formal argument of that name, or -1.
    int64 FindArgName(BasicSubString argName) const;
    int64 GetNumArgs() const { return static_cast<int64>(args.size()); }
    const LSFormalArg& GetArg(int64 i) const { return args[static_cast<size_t>(i)]; }
    void ClearArgs() { args.clear(); }

    void SetSubstitutionString(BasicSubString text, bool flag, int64 bodyIndent) {
        indent = bodyIndent;
        substitution.Set(text, flag);
    }
    BasicSubString GetSubstitutionString() const { return substitution.Get(); }
    // The name, and "(a,b)" when there are formal arguments.
    void WriteNameAndFormalParameterList(xostream& os) const;

    bool isPython;
    bool isNaked;
    bool isFnArg;
    ELSVariable returnType;
    xvector<LSFormalArg> args;
    VarFrame* context;  // the frame a body is expanded under; null: the invoker's frame
    int64 indent = -1;
    StringX substitution;
    // Distinct for every macro the process makes and never reused, unlike an address: what a cache learns
    // of one macro cannot be taken for a later one.
    const std::uint64_t identity = NextIdentity();

private:
    static std::uint64_t NextIdentity();
};

xostream& operator<<(xostream& os, const LSMacroVariable& m);

class LSValueVariable : public LSVariable {
public:
    LSValueVariable(ELSVariable type, BasicSubString name, BasicSubString value)
        : LSVariable(name), type(type), value(value.GetString()) {}
    ELSVariable GetType() const override { return type; }
    void WriteToStream(xostream& os) const override;
    void WriteValue(xostream& os) const override;

    ELSVariable type;
    // The value as text: "true"/"false", a decimal int, a double's text, a single-quoted char literal, or the
    // characters of a string.
    basic_xstring value;
};

// A string variable that owns its name, so that it can be made from a temporary name.
class LSVar : public LSValueVariable {
public:
    LSVar(BasicSubString name, BasicSubString value);
    ~LSVar() override = default;

    basic_xstring nameStore;
};

// Diagnostics: once SetStarted() has been called, every LSVariableList::Find adds one to s_count.
extern bool s_started;
extern std::int32_t s_count;
void SetStarted();

}  // namespace orvan

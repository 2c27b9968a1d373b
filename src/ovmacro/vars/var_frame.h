// Frames: the scopes of the macro language.
//
// A VarFrame holds the variables defined in it, knows its enclosing frame and may import other frames, whose
// variables then become visible in it. A FileScopeVarFrame is the root frame of a file: it also records the
// file frames it imports and the file's dollar macros, named texts that replace $(NAME) in string literals.
//
// Lookup order for Find: this frame (its own variables, then its imports), then each parent the same way.
#pragma once

#include <map>
#include <set>

#include "ovmacro/vars/variable_list.h"

namespace orvan {

class FileScopeVarFrame;

class VarFrame {
public:
    explicit VarFrame(VarFrame* parent);
    VarFrame(const VarFrame&) = delete;
    VarFrame& operator=(const VarFrame&) = delete;
    ~VarFrame();

    // The frame owns v from now on.
    void AddVariable(LSVariable* v) { vars.Add(v); }
    // The full lookup; pos places an ambiguity error. May be called on a null frame.
    LSVariable* Find(BasicSubString name, const char* pos);
    // This frame and its imports, not the parents.
    LSVariable* FindLocal(BasicSubString name, const char* pos);
    // This frame's own variables and those of its parents, no imports. May be called on a null frame.
    LSVariable* Find2(BasicSubString name);
    // Makes f's variables (and those f imports now) visible here.
    void ImportFrame(VarFrame* f);
    VarFrame* GetParent() const { return parent; }
    FileScopeVarFrame* GetFileScopeVarFrame() const { return fileScope; }
    // The frame's variables and its parents', for diagnostics.
    void WriteToStream(xostream& os) const;

    std::set<VarFrame*> allImports;
    std::set<VarFrame*> directImports;
    LSVariableList vars;
    VarFrame* parent;
    FileScopeVarFrame* fileScope;

protected:
    struct FileScopeTag {};
    explicit VarFrame(FileScopeTag);

private:
    LSVariable* FindInDirectImports(BasicSubString name, const char* pos);
    LSVariable* FindLocalGuarded(BasicSubString name, const char* pos, xvector<const VarFrame*>& visiting);
    LSVariable* FindInDirectImportsGuarded(BasicSubString name, const char* pos, xvector<const VarFrame*>& visiting);
};

// The longest text that dollar macro replacement builds. A replacement may name another macro twice, so a few
// definitions can describe a text that doubles with every level of nesting; past this size replacement stops
// with "Dollar macro replacement longer than N characters" instead of exhausting memory. Real replacements
// (file names, paths, settings) are far shorter.
inline constexpr int64 kMaxDollarMacroTextSize = int64{1} << 24;

class FileScopeVarFrame : public VarFrame {
public:
    FileScopeVarFrame();

    // For fuzzers and tests: lowers kMaxDollarMacroTextSize for the calling thread (0 restores it).
    static void SetDollarMacroTextLimitForTesting(int64 limit);

    // ImportFrame(f), and f is listed among the imported files.
    void AddImport(FileScopeVarFrame* f);
    // Defines (or redefines) a dollar macro; it is also the string variable named _NAME_ of this frame.
    void InsertDollarMacro(const basic_xstring& name, const basic_xstring& value);
    // The replacement of a dollar macro defined here or, depth first in import order, in an imported file.
    const basic_xstring* FindDollarMacro(const basic_xstring& name) const;
    // One pass of replacement of text into os; true if anything was replaced.
    bool ApplyDollarMacros(xostream& os, BasicSubString text) const;
    // Replacement in place until nothing is left to replace; true if the first pass replaced anything.
    // A macro whose replacement leads back to itself raises "Recursive dollar macro " + name, and a text that
    // grows past kMaxDollarMacroTextSize "Dollar macro replacement longer than ...", both with no position:
    // callers that know one set it.
    bool ApplyDollarMacros(basic_xstring& text) const;

    xvector<const FileScopeVarFrame*> importedFiles;
    std::map<basic_xstring, basic_xstring> dollarMacros;

private:
    const basic_xstring* FindDollarMacroGuarded(const basic_xstring& name,
                                                xvector<const FileScopeVarFrame*>& searched) const;
    bool ApplyDollarMacrosOnePass(xostream& os, BasicSubString text, basic_xstring* lastReplaced) const;
};

// The position just after a dollar macro $(NAME) at the start of text, with name set to NAME; null if none.
const char* ScanDollarMacro(BasicSubString text, BasicSubString& name);

}  // namespace orvan

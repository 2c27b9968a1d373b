#include "ovmacro/vars/var_frame.h"

#include <algorithm>
#include <string>

#include "ovmacro/foundations/scanning.h"
#include "ovmacro/lexer/exceptions.h"

namespace orvan {

namespace {

template <class T>
bool Contains(const xvector<T>& v, T x) {
    return std::find(v.begin(), v.end(), x) != v.end();
}

// Pops the frame pushed on the visiting stack when a guarded lookup returns, also by an exception.
template <class T>
struct VisitGuard {
    VisitGuard(xvector<T>& v, T x) : v(v) { v.push_back(x); }
    ~VisitGuard() { v.pop_back(); }
    xvector<T>& v;
};

}  // namespace

VarFrame::VarFrame(VarFrame* parent) : parent(parent), fileScope(parent ? parent->fileScope : nullptr) {}

VarFrame::VarFrame(FileScopeTag) : parent(nullptr), fileScope(nullptr) {}

VarFrame::~VarFrame() {
    allImports.clear();
    directImports.clear();
}

LSVariable* VarFrame::Find(BasicSubString name, const char* pos) {
    for (VarFrame* f = this; f; f = f->parent)
        if (LSVariable* v = f->FindLocal(name, pos)) return v;
    return nullptr;
}

LSVariable* VarFrame::FindLocal(BasicSubString name, const char* pos) {
    if (allImports.empty()) return vars.Find(name);  // nothing to break a tie between
    xvector<const VarFrame*> visiting;
    return FindLocalGuarded(name, pos, visiting);
}

// Frames that import one another in a cycle would make the tie-break recurse without end; a frame already
// being asked on the current path answers nothing the second time.
LSVariable* VarFrame::FindLocalGuarded(BasicSubString name, const char* pos, xvector<const VarFrame*>& visiting) {
    if (LSVariable* v = vars.Find(name)) return v;
    if (allImports.empty() || Contains(visiting, static_cast<const VarFrame*>(this))) return nullptr;
    LSVariable* kept = nullptr;
    for (VarFrame* f : allImports) {
        if (f == this) continue;
        LSVariable* v = f->Find2(name);
        if (!v) continue;
        if (!kept) {
            kept = v;
        } else if (v != kept) {
            VisitGuard<const VarFrame*> guard(visiting, this);
            return FindInDirectImportsGuarded(name, pos, visiting);
        }
    }
    return kept;
}

LSVariable* VarFrame::FindInDirectImports(BasicSubString name, const char* pos) {
    xvector<const VarFrame*> visiting;
    VisitGuard<const VarFrame*> guard(visiting, this);
    return FindInDirectImportsGuarded(name, pos, visiting);
}

LSVariable* VarFrame::FindInDirectImportsGuarded(BasicSubString name, const char* pos,
                                                 xvector<const VarFrame*>& visiting) {
    LSVariable* kept = nullptr;
    for (VarFrame* f : directImports) {
        LSVariable* v = f->FindLocalGuarded(name, pos, visiting);
        if (!v) continue;
        if (!kept) {
            kept = v;
        } else if (v != kept) {
            StringStream ss;
            ss << "Ambiguous macro name : " << name;
            throw LexScannerException(ss.GetString(), pos);
        }
    }
    return kept;
}

LSVariable* VarFrame::Find2(BasicSubString name) {
    for (VarFrame* f = this; f; f = f->parent)
        if (LSVariable* v = f->vars.Find(name)) return v;
    return nullptr;
}

void VarFrame::ImportFrame(VarFrame* f) {
    if (allImports.insert(f).second) {
        for (VarFrame* g : f->allImports) allImports.insert(g);
    }
    directImports.insert(f);
}

void VarFrame::WriteToStream(xostream& os) const {
    os << "{\n";
    {
        Indenter indent(os, 4);
        os << "Local vars\n";
        vars.WriteToStream(os);
        os << "Parent frame\n";
        if (parent) parent->WriteToStream(os);
    }
    os << "}\n";
}

FileScopeVarFrame::FileScopeVarFrame() : VarFrame(FileScopeTag{}) { fileScope = this; }

void FileScopeVarFrame::AddImport(FileScopeVarFrame* f) {
    ImportFrame(f);
    importedFiles.push_back(f);
}

void FileScopeVarFrame::InsertDollarMacro(const basic_xstring& name, const basic_xstring& value) {
    dollarMacros[name] = value;
    AddVariable(new LSVar(BasicSubString("_" + name + "_"), BasicSubString(value)));
}

const basic_xstring* FileScopeVarFrame::FindDollarMacro(const basic_xstring& name) const {
    xvector<const FileScopeVarFrame*> searched;
    return FindDollarMacroGuarded(name, searched);
}

// A frame is searched once per lookup: a file imported again, directly or through others, answers nothing
// new the second time (it found nothing the first time, or the lookup would have ended), and searching it again
// would make a chain of files that import the next one twice cost two to the power of its length. A frame met
// again on the current path, an import cycle, is skipped the same way.
const basic_xstring* FileScopeVarFrame::FindDollarMacroGuarded(const basic_xstring& name,
                                                               xvector<const FileScopeVarFrame*>& searched) const {
    auto it = dollarMacros.find(name);
    if (it != dollarMacros.end()) return &it->second;
    if (Contains(searched, static_cast<const FileScopeVarFrame*>(this))) return nullptr;
    searched.push_back(this);
    for (const FileScopeVarFrame* f : importedFiles)
        if (const basic_xstring* v = f->FindDollarMacroGuarded(name, searched)) return v;
    return nullptr;
}

const char* ScanDollarMacro(BasicSubString text, BasicSubString& name) {
    if (text.size() < 4 || text[0] != '$' || text[1] != '(') return nullptr;
    BasicSubString rest(text.begin() + 2, text.end());
    const char* nameBegin = rest.begin();
    if (!ScanIdentifier(rest)) return nullptr;
    if (rest.empty() || rest.front() != ')') return nullptr;
    name = BasicSubString(nameBegin, rest.begin());
    return rest.begin() + 1;
}

namespace {

thread_local int64 t_dollarMacroTextLimit = 0;  // 0: kMaxDollarMacroTextSize

}  // namespace

void FileScopeVarFrame::SetDollarMacroTextLimitForTesting(int64 limit) { t_dollarMacroTextLimit = limit; }

bool FileScopeVarFrame::ApplyDollarMacrosOnePass(xostream& os, BasicSubString text, basic_xstring* lastReplaced) const {
    const int64 limit = t_dollarMacroTextLimit > 0 ? t_dollarMacroTextLimit : kMaxDollarMacroTextSize;
    int64 written = 0;  // checked before each replacement is written, so that a pass never builds more
    bool replaced = false;
    const char* p = text.begin();
    const char* runStart = p;
    while (p < text.end()) {
        BasicSubString name;
        const char* after = *p == '$' ? ScanDollarMacro(BasicSubString(p, text.end()), name) : nullptr;
        if (after) {
            const basic_xstring key = name.GetString();
            if (const basic_xstring* value = FindDollarMacro(key)) {
                written += (p - runStart) + static_cast<int64>(value->size());
                if (written + (text.end() - after) > limit)
                    throw LexScannerException(
                        "Dollar macro replacement longer than " + std::to_string(limit) + " characters", nullptr);
                os.put(runStart, p - runStart);
                os << *value;
                if (lastReplaced) *lastReplaced = key;
                replaced = true;
                p = after;
                runStart = p;
                continue;
            }
        }
        ++p;
    }
    os.put(runStart, p - runStart);
    return replaced;
}

bool FileScopeVarFrame::ApplyDollarMacros(xostream& os, BasicSubString text) const {
    return ApplyDollarMacrosOnePass(os, text, nullptr);
}

bool FileScopeVarFrame::ApplyDollarMacros(basic_xstring& text) const {
    // Without a cycle every pass either resolves one more level of nesting (a chain of nested references is at
    // most as long as the number of distinct macros) or completes a name whose pieces earlier passes wrote,
    // which uses up at least three characters of the text ("$(D)" replaced by "$" shortens it by three). More
    // passes than that mean that a macro leads back to itself.
    size_t macroCount = 0;
    {
        xvector<const FileScopeVarFrame*> stack{this}, seen;
        while (!stack.empty()) {
            const FileScopeVarFrame* f = stack.back();
            stack.pop_back();
            if (Contains(seen, f)) continue;
            seen.push_back(f);
            macroCount += f->dollarMacros.size();
            for (const FileScopeVarFrame* g : f->importedFiles) stack.push_back(g);
        }
    }
    StringStream ss;
    basic_xstring lastName;
    if (!ApplyDollarMacrosOnePass(ss, text, &lastName)) return false;
    const size_t passLimit = macroCount + ss.str().size() / 3 + 1;
    for (size_t passes = 1;; ++passes) {
        basic_xstring next = ss.GetString();
        text.swap(next);
        if (!ApplyDollarMacrosOnePass(ss, text, &lastName)) break;
        if (passes > passLimit) throw LexScannerException("Recursive dollar macro " + lastName, nullptr);
    }
    return true;
}

}  // namespace orvan

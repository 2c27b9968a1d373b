// Warnings, notes after errors and the trace, from what the expansion reports while it runs.
#include "watcher.h"

#include <algorithm>
#include <cstring>
#include <tuple>
#include <vector>

#include "ovmacro/foundations/scanning.h"
#include "ovmacro/lexer/exceptions.h"
#include "ovmacro/lexer/token_scanner.h"
#include "ovmacro/vars/var_frame.h"
#include "suggestions.h"

using namespace orvan;

namespace ovmacro_tool {

namespace {

// The name of the text that holds the -D definitions, which no warning is about.
constexpr std::string_view kCommandLine = "<command line>";

std::string_view IdentifierAt(std::string_view s) {
    size_t n = 0;
    if (!s.empty() && IsIdentifierStart(s[0]))
        while (n < s.size() && IsIdentifierChar(s[n])) ++n;
    return s.substr(0, n);
}

bool StartsWith(std::string_view s, std::string_view prefix) {
    return s.substr(0, prefix.size()) == prefix;
}

std::vector<std::string_view> Lines(std::string_view text) {
    std::vector<std::string_view> lines;
    for (size_t from = 0;;) {
        const size_t lf = text.find('\n', from);
        lines.push_back(text.substr(from, lf == std::string_view::npos ? lf : lf - from));
        if (lf == std::string_view::npos) return lines;
        from = lf + 1;
    }
}

// The macro that line `i` of an error message names: the first line of an error about a call or about
// assigning to a macro, or a context line of a call, an argument passed or a Python call. Empty for others.
std::string_view MacroNamedBy(const std::vector<std::string_view>& lines, size_t i) {
    const std::string_view line = lines[i];
    if (i == 0) {
        for (std::string_view prefix :
             {"( expected to begin argument list for macro ", "Insufficient arguments provided for macro ",
              "Too many arguments provided for macro "})
            if (StartsWith(line, prefix)) return IdentifierAt(line.substr(prefix.size()));
        constexpr std::string_view kLet = "@let directive failed : ";
        const std::string_view name = StartsWith(line, kLet) ? IdentifierAt(line.substr(kLet.size())) : "";
        return StartsWith(line.substr(std::min(line.size(), kLet.size() + name.size())), " is a macro") ? name
                                                                                                        : "";
    }
    constexpr std::string_view kPassing = "    passing formal argument ";
    if (StartsWith(line, kPassing)) {
        const std::string_view rest =
            line.substr(kPassing.size() + IdentifierAt(line.substr(kPassing.size())).size());
        return StartsWith(rest, " to macro ") ? IdentifierAt(rest.substr(10)) : "";
    }
    if (StartsWith(line, "    invoking python macro ")) return IdentifierAt(line.substr(26));
    constexpr std::string_view kInvoking = "    invoking macro ";
    if (!StartsWith(line, kInvoking)) return "";
    const std::string_view name = IdentifierAt(line.substr(kInvoking.size()));
    // A macro's argument expanded where the body names it reads "invoking macro ARGUMENT", followed by the
    // line of the macro, whose formal list names it: it is no macro that a definition made.
    if (line.size() == kInvoking.size() + name.size() && i + 1 < lines.size() &&
        StartsWith(lines[i + 1], kInvoking)) {
        const std::string_view next = lines[i + 1].substr(kInvoking.size());
        const size_t open = next.find('('), close = next.find(')');
        if (open != std::string_view::npos && close != std::string_view::npos && open < close) {
            const std::string formals = "," + std::string(next.substr(open + 1, close - open - 1)) + ",";
            if (formals.find("," + std::string(name) + ",") != std::string::npos) return "";
        }
    }
    return name;
}

// The names the expression language knows by itself.
bool IsExpressionBuiltin(std::string_view word) {
    static constexpr std::string_view kNames[] = {"false",  "true",      "len",       "is_bool",  "is_char",
                                                  "is_int", "is_double", "is_string", "bool",     "char",
                                                  "int",    "double",    "string",    "sin",      "cos",
                                                  "tan",    "exp",       "log",       "__FILE__", "__LINE__"};
    return std::find(std::begin(kNames), std::end(kNames), word) != std::end(kNames);
}

// The variable of that name in frame's scope, or null (also when the name is ambiguous there).
LSVariable* Lookup(VarFrame* frame, BasicSubString name) {
    try {
        return frame ? frame->Find(name, name.begin()) : nullptr;
    } catch (const LexScannerException&) {
        return nullptr;
    }
}

}  // namespace

Watcher::Watcher(const MpfwSourceFileList& files, const Options& options)
    : writer_(files, options.diagnostics), switches_(options.warnings), trace_(options.trace) {
    if (trace_) callTrace_ = std::make_unique<CallTrace>(writer_, options.traceNames);
}

void Watcher::Warn(Warning w, const char* at, const std::string& text, const Definition* note) {
    if (!switches_.On(w)) return;
    // Only about places in the loaded files, not in the -D definitions, and once per place (a file imported
    // twice is one file).
    const std::optional<SourcePosition> place = writer_.Locator().Locate(at);
    if (!place || writer_.Locator().FileNames()[place->file] == kCommandLine ||
        !warned_.emplace(place->file, place->line, place->column, w).second)
        return;
    ++warnings_;
    writer_.Write(at, "warning", text + " [-W" + WarningName(w) + "]", true);
    if (note) WriteNoteAt(*note, note->name + " is defined here");
}

bool Watcher::WriteNoteAt(const Definition& d, const std::string& text) {
    if (!writer_.Locator().HoldsCopyOf(d.at, d.name)) return false;
    writer_.Write(d.at, "note", text, true);
    return true;
}

void Watcher::MacroDefined(const LSMacroVariable& m, VarFrame& frame) {
    // Nothing here may cost time in proportion to the text (as locating a place does) unless it warns.
    const BasicSubString name = m.GetName();
    if (switches_.On(Warning::kUnusedMacro)) defined_.emplace(name.begin(), name.GetString());
    if (switches_.On(Warning::kUnusedArgument)) CheckArgumentsUsed(m);
    if (!switches_.On(Warning::kShadow)) return;
    // A recursive macro that defines a name meets its own definition from the level before: no hiding.
    const LSVariable* hidden = Lookup(frame.GetParent(), name);
    if (hidden && hidden->GetName().begin() != name.begin()) {
        const Definition note{name.GetString(), hidden->GetName().begin()};
        Warn(Warning::kShadow, name.begin(),
             "definition of " + note.name + " hides the one of an enclosing scope", &note);
    }
}

void Watcher::CheckArgumentsUsed(const LSMacroVariable& m) {
    if (m.GetNumArgs() == 0 || !argumentsChecked_.insert(m.GetName().begin()).second) return;
    // The names the body's expansion looks up are its identifier tokens (not those in strings or comments).
    std::vector<bool> used(static_cast<size_t>(m.GetNumArgs()));
    try {
        BasicSubString rest = m.GetSubstitutionString();
        for (LSToken t = LsScanToken(rest, false); t.type != TK_EOS; t = LsScanToken(rest, false)) {
            if (t.type != TK_IDENTIFIER) continue;
            const int64 arg = m.FindArgName(t.text);
            if (arg >= 0) used[static_cast<size_t>(arg)] = true;
        }
    } catch (const LexScannerException&) {
        return;  // a body the scanner cannot read (Python, say) is not judged
    }
    for (int64 i = 0; i < m.GetNumArgs(); ++i) {
        const BasicSubString arg = m.GetArg(i).name;
        if (used[static_cast<size_t>(i)] || arg.view().front() == '_') continue;
        Warn(Warning::kUnusedArgument, arg.begin(),
             m.GetName().GetString() + " never uses its argument " + arg.GetString());
    }
}

void Watcher::NotADirective(BasicSubString word, const char* at) {
    if (!switches_.On(Warning::kUnknownDirective) || word.begin() != at + 1) return;
    ClosestWord closest(word.view());
    for (std::string_view directive : DirectiveWords()) closest.Consider(directive);
    const std::string best = closest.Best();
    const std::optional<SourcePosition> place = best.empty() ? std::nullopt : writer_.Locator().Locate(at);
    if (!place) return;
    // Mail addresses, handles and domains: "user@example.com", "@example.org" stay text without a word.
    const std::string_view line = place->lineText;
    const size_t column = static_cast<size_t>(place->column - 1);
    const size_t after = column + 1 + word.view().size();
    if (column > 0 && (IsIdentifierChar(line[column - 1]) || std::strchr(".-+%", line[column - 1]))) return;
    if (after + 1 < line.size() && line[after] == '.' && IsIdentifierChar(line[after + 1])) return;
    Warn(Warning::kUnknownDirective, at,
         "@" + word.GetString() + " is not a directive and stays text; did you mean @" + best + "?");
}

Watcher::Failure& Watcher::FailureOf(const LexScannerException& e) {
    const std::string_view message = e.GetMessage();
    const std::string_view firstLine = message.substr(0, message.find('\n'));
    // A message only grows on its way out: a shorter one at the same address is another error.
    if (failure_.exception != &e || failure_.firstLine != firstLine ||
        message.size() < failure_.messageSize) {
        failure_ = Failure();
        failure_.exception = &e;
        failure_.firstLine = firstLine;
    }
    failure_.messageSize = message.size();
    return failure_;
}

void Watcher::ExpressionFailed(VarFrame* frame, BasicSubString expanded, const LexScannerException& e) {
    Failure& failure = FailureOf(e);
    const char* p = e.GetPosition();
    if (failure.suggested || !p || p < expanded.begin() || p >= expanded.end() || !IsIdentifierStart(*p) ||
        (p > expanded.begin() && IsIdentifierChar(p[-1])))
        return;
    const BasicSubString word(p, p + IdentifierAt(std::string_view(p, expanded.end() - p)).size());
    if (IsExpressionBuiltin(word.view()) || Lookup(frame, word)) return;
    ClosestWord closest(word.view());
    const LSVariable* best = nullptr;
    auto consider = [&](const LSVariableList& vars) {
        for (const LSVariable* v = vars.First(); v; v = v->next)
            if (closest.Consider(v->GetName().view())) best = v;
    };
    for (VarFrame* f = frame; f; f = f->GetParent()) {
        consider(f->vars);
        for (const VarFrame* imported : f->allImports) consider(imported->vars);
    }
    if (best && !closest.Best().empty())
        failure.suggested = Definition{closest.Best(), best->GetName().begin()};
}

void Watcher::ExpansionFailed(VarFrame* frame, const LexScannerException& e) {
    Failure& failure = FailureOf(e);
    const std::vector<std::string_view> lines = Lines(e.GetMessage());
    // Lines appear innermost first: the first that names a macro found here is the one the notes are about.
    for (size_t i = failure.linesSeen; i < lines.size() && !failure.named; ++i) {
        const std::string_view name = MacroNamedBy(lines, i);
        if (name.empty()) continue;
        const auto* m = dynamic_cast<const LSMacroVariable*>(Lookup(frame, BasicSubString(name)));
        if (m && !m->GetContext()) failure.named = Definition{std::string(name), m->GetName().begin()};
    }
    failure.linesSeen = lines.size();
}

void Watcher::WriteNotes(const LexScannerException& e) {
    const Failure failure = FailureOf(e);
    failure_ = Failure();
    if (failure.suggested &&
        !WriteNoteAt(*failure.suggested, "did you mean " + failure.suggested->name + "? it is defined here"))
        writer_.Write(e.GetPosition(), "note", "did you mean " + failure.suggested->name + "?", true);
    if (failure.named) WriteNoteAt(*failure.named, failure.named->name + " is defined here");
}

void Watcher::CallBegan(const LSMacroVariable& m, BasicSubString at,
                        std::span<const BasicSubString> arguments, ExpandedOutput& output) {
    invoked_.insert(m.GetName().begin());
    if (callTrace_) callTrace_->CallBegan(m, at, arguments, output);
}

void Watcher::CallBound(std::span<LSVariable* const> bindings) {
    if (callTrace_) callTrace_->CallBound(bindings);
}

void Watcher::BlockBegan(std::string_view directive, BasicSubString at, BasicSubString name,
                         BasicSubString value, ExpandedOutput& output) {
    if (callTrace_) callTrace_->BlockBegan(directive, at, name, value, output);
}

void Watcher::Ended(bool failed) {
    // Called while an error unwinds the stack, where nothing may throw: a trace line that cannot be written
    // is lost.
    try {
        if (callTrace_) callTrace_->Ended(failed);
    } catch (...) {
    }
}

void Watcher::ReportUnusedMacros() {
    const SourceLocator& locator = writer_.Locator();
    // A definition is a place in a file, which a file imported twice holds in two texts.
    auto place = [&](const char* at) {
        const SourcePosition p = *locator.Locate(at);
        return std::make_tuple(p.file, p.line, p.column);
    };
    std::set<std::tuple<int, long long, long long>> used;
    for (const auto& [at, name] : defined_)
        if (invoked_.count(at) && locator.HoldsCopyOf(at, name)) used.insert(place(at));
    std::map<std::tuple<int, long long, long long>, std::pair<const char*, const std::string*>> unused;
    for (const auto& [at, name] : defined_)
        if (locator.HoldsCopyOf(at, name) && !used.count(place(at)))
            unused.emplace(place(at), std::pair(at, &name));
    // In the order of the files and of the places in them.
    for (const auto& [where, definition] : unused)
        Warn(Warning::kUnusedMacro, definition.first,
             "macro " + *definition.second + " is defined but never used");
}

}  // namespace ovmacro_tool

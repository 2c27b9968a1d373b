// Watcher: what ovmacro tells its user beyond the expansion and its errors, learnt by watching the expansion.
//
// - Warnings, each once per place, as they are found: a word after '@' close to a directive
//   (-Wunknown-directive), a definition that hides one of an enclosing scope (-Wshadow), an argument that the
//   body never names (-Wunused-argument); once the expansion is over, the macros never invoked
//   (-Wunused-macro).
// - The notes after an error report: where the macro named in the error is defined ("note: greet is defined
//   here"), and for an unknown word of an expression the name in scope clearly closest to it ("note: did you
//   mean MODE? it is defined here").
// - The trace of calls (--trace).
//
// The macro that an error names is looked up, at the level of the expansion where the error first names it,
// in that expansion's frame: the one in which the call was made, whatever was defined elsewhere since.
#pragma once

#include <map>
#include <memory>
#include <optional>
#include <set>
#include <string>
#include <tuple>
#include <unordered_set>
#include <utility>

#include "call_trace.h"
#include "diagnostics.h"
#include "options.h"
#include "ovmacro/expander/expansion_observer.h"

namespace ovmacro_tool {

class Watcher : public orvan::ExpansionObserver {
public:
    Watcher(const orvan::MpfwSourceFileList& files, const Options& options);

    // Whether the calls must be watched (the trace, -Wunused-macro), which costs time on every call.
    bool WatchesCalls() const { return trace_ || switches_.On(Warning::kUnusedMacro); }
    // After an expansion that succeeded: warns about the macros defined in loaded files and never invoked.
    void ReportUnusedMacros();
    // Writes the notes that belong after the report of e.
    void WriteNotes(const orvan::LexScannerException& e);
    int WarningCount() const { return warnings_; }

    void MacroDefined(const orvan::LSMacroVariable& m, orvan::VarFrame& frame) override;
    void NotADirective(orvan::BasicSubString word, const char* at) override;
    void ExpressionFailed(orvan::VarFrame* frame, orvan::BasicSubString expanded,
                          const orvan::LexScannerException& e) override;
    void ExpansionFailed(orvan::VarFrame* frame, const orvan::LexScannerException& e) override;
    void CallBegan(const orvan::LSMacroVariable& m, orvan::BasicSubString at,
                   std::span<const orvan::BasicSubString> arguments, orvan::ExpandedOutput& output) override;
    void CallBound(std::span<orvan::LSVariable* const> bindings) override;
    void BlockBegan(std::string_view directive, orvan::BasicSubString at, orvan::BasicSubString name,
                    orvan::BasicSubString value, orvan::ExpandedOutput& output) override;
    void Ended(bool failed) override;

private:
    // A name and where it is defined (a view into the defining text, which may be gone by now).
    struct Definition {
        std::string name;
        const char* at = nullptr;
    };
    // What is known of the error on its way out of the expansion.
    struct Failure {
        const orvan::LexScannerException* exception = nullptr;
        std::string firstLine;
        size_t messageSize = 0;
        size_t linesSeen = 0;                 // message lines already looked at for a macro name
        std::optional<Definition> named;      // the innermost macro the message names
        std::optional<Definition> suggested;  // the name close to an unknown word of an expression
    };
    Failure& FailureOf(const orvan::LexScannerException& e);
    void Warn(Warning w, const char* at, const std::string& text, const Definition* note = nullptr);
    // The note at a definition, or false when its text is gone or is not a loaded file.
    bool WriteNoteAt(const Definition& d, const std::string& text);
    void CheckArgumentsUsed(const orvan::LSMacroVariable& m);

    ReportWriter writer_;
    WarningSwitches switches_;
    bool trace_;
    std::unique_ptr<CallTrace> callTrace_;
    int warnings_ = 0;
    std::set<std::tuple<int, long long, long long, Warning>> warned_;  // file, line, column
    std::map<const char*, std::string> defined_;  // -Wunused-macro: definitions by place, with their names
    std::unordered_set<const char*> invoked_;     // the places of the definitions of the macros invoked
    std::set<const char*> argumentsChecked_;
    Failure failure_;
};

}  // namespace ovmacro_tool

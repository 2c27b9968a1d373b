// CallTrace (--trace): the macro calls and directive blocks of an expansion, reported on standard error as
// they happen, each at the place of its call, indented by nesting:
//
//     t.ovm(5) : trace: outer(a=1)
//     t.ovm(2) : trace:   inner(b=1) -> [1]
//     t.ovm(5) : trace: outer -> <[1]>
//
// A call in which no other reported call happens takes one line, "HEAD -> RESULT"; another opens with its
// head and closes with "NAME -> RESULT" ("... failed" when an error ends it); past kIndentedLevels levels the
// depth is written as "[DEPTH] " after the blanks instead of more of them. The head shows the arguments as
// written, typed ones as their values; Python macros read "python NAME(...)", blocks "@if(CONDITION)",
// "@elseif(...)", "@else", "@for NAME = ITEM", "@while(CONDITION)". Texts are shown on one line (a line feed
// as \n) and cut after kShownBytes bytes, with "...(N bytes)". The bindings of arguments and loop names are
// never reported themselves: the calls in their texts are.
#pragma once

#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "diagnostics.h"
#include "ovmacro/expander/expansion_observer.h"

namespace ovmacro_tool {

class CallTrace {
public:
    static constexpr size_t kShownBytes = 60;
    static constexpr size_t kIndentedLevels = 24;

    // `names`: the macros (and directives, "@if" for a whole chain) to report; empty: all.
    CallTrace(ReportWriter& writer, std::vector<std::string> names)
        : writer_(writer), names_(std::move(names)) {}

    void CallBegan(const orvan::LSMacroVariable& m, orvan::BasicSubString at,
                   std::span<const orvan::BasicSubString> arguments, orvan::ExpandedOutput& output);
    void CallBound(std::span<orvan::LSVariable* const> bindings);
    void BlockBegan(std::string_view directive, orvan::BasicSubString at, orvan::BasicSubString name,
                    orvan::BasicSubString value, orvan::ExpandedOutput& output);
    void Ended(bool failed);

private:
    struct Open {
        bool shown = false;
        bool printed = false;  // its head line is out
        size_t depth = 0;      // the reported calls open around it
        const char* at = nullptr;
        std::string name;                                  // the macro or directive
        std::string head;                                  // for a block: all of it
        std::vector<std::string> formals;                  // a call's formal argument names
        std::span<const orvan::BasicSubString> arguments;  // a call's argument texts, once read
        std::vector<std::string> bound;                    // or, once bound, what they are bound to
        orvan::ExpandedOutput* output = nullptr;
        size_t outputStart = 0;
    };
    bool Wanted(std::string_view name) const;
    void Begin(Open open);
    std::string Head(const Open& open) const;
    // Writes the heads of the open reported calls that are not out yet, outermost first.
    void WritePendingHeads();
    void WriteLine(const Open& open, const std::string& text);

    ReportWriter& writer_;
    std::vector<std::string> names_;
    std::vector<Open> open_;
};

// A text as the trace shows it: on one line, control bytes escaped, cut after CallTrace::kShownBytes.
std::string ShownText(std::string_view text);

}  // namespace ovmacro_tool

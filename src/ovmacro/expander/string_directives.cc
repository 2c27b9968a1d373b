// The directives that turn text into text: the @str family (C-style string literals), @unstr, @quote,
// @( expression ), @[ text ] (double expansion), @print and @println.
#include <algorithm>
#include <memory>

#include "ovmacro/expander/held_text.h"
#include "ovmacro/expander/directive_text.h"
#include "ovmacro/expander/expansion_observer.h"
#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/expander/nesting_guard.h"
#include "ovmacro/expander/plain_text.h"
#include "ovmacro/expr/expression_parser.h"
#include "ovmacro/foundations/compose.h"
#include "ovmacro/foundations/scanning.h"
#include "ovmacro/foundations/text_format.h"
#include "ovmacro/lexer/section_scanners.h"

namespace orvan {

namespace {

// Expands text in a child frame of `frame` into a string; definitions made by the text die with that frame.
basic_xstring ExpandInChildFrame(VarFrame* frame, BasicSubString text, int64 inputIndent) {
    basic_xstring expanded;
    VarFrame child(frame);
    MacroExpand(nullptr, &child, text, inputIndent, 0, expanded);
    return expanded;
}

// Lines of a multi-line result start at the column where the directive stood, not at the expander's own
// indentation; the old indentation comes back when the directive ends, also when an error passes.
class OutputIndentOverride {
public:
    OutputIndentOverride(int64& outputIndent, int64 column) : ref_(outputIndent), saved_(outputIndent) {
        ref_ = column;
    }
    ~OutputIndentOverride() { ref_ = saved_; }
    OutputIndentOverride(const OutputIndentOverride&) = delete;
    OutputIndentOverride& operator=(const OutputIndentOverride&) = delete;

private:
    int64& ref_;
    int64 saved_;
};

}  // namespace

void WritePrefix(xostream& os, EStrLiteralMode mode) {
    if (mode == SLM_Wide) os << 'L';
    os << '"';
}

void WriteSuffix(xostream& os, EStrLiteralMode /*mode*/) {
    os << '"';
}

void MacroExpander::ProcessStrDirective(bool isX, EStrLiteralMode mode) {
    int64 indent = 0;
    const BasicSubString argument = ScanRndBrackettedString(cursor, indent);
    AdvanceWritePos(cursor.begin(), false);
    // The commonest argument, one name whose value is ordinary text (a loop name over a list of display
    // names), is taken as it stands: the same text, nesting levels and output count as its expansion.
    BasicSubString expanded;
    basic_xstring storage;
    BasicSubString name = argument;
    if (ScanIdentifier(name) && name.empty() && !ExpansionObserver::CallWatcher()) {
        const BasicSubString word(argument.begin(), name.begin());
        expanded = OrdinaryValueOfName(FindVariable(word), frame);
        if (!expanded.empty()) {
            const MacroNestingGuard argumentLevel(argument.begin()), bodyLevel(expanded.begin());
            MacroNestingGuard::ChargeOutput(expanded.size(), expanded.begin());
        }
    }
    if (expanded.empty()) {
        storage = ExpandInChildFrame(frame, argument, indent);
        expanded = BasicSubString(storage);
    }

    const OutputIndentOverride lineUp(outputIndent, GetOutputPos());
    StringStream literal(static_cast<size_t>(expanded.size()) + 8);
    WritePrefix(literal, mode);
    bool wroteLine = false;
    if (!isX) WriteTextForCStyleLiteralConstants(literal, expanded);
    for (const char c : isX ? expanded.view() : std::string_view()) {
        if (c == '\n') {
            // One literal per line: the line feed stays inside the literal as \n, and the next literal
            // starts on a new output line, lined up under the first.
            literal << "\\n";
            WriteSuffix(literal, mode);
            literal << '\n';
            const basic_xstring line = literal.GetString();
            WriteCalculatedSubString(BasicSubString(line));
            wroteLine = true;
            WritePrefix(literal, mode);
        } else {
            WriteCharForCStyleLiteralConstants(literal, c);
        }
    }
    WriteSuffix(literal, mode);
    const basic_xstring last = literal.GetString();
    // After a final line feed the narrow form would end with an empty "" of its own: it adds nothing and is
    // dropped. The wide L"" is kept (it is 3 characters long).
    if (!wroteLine || last.size() >= 3) WriteCalculatedSubString(BasicSubString(last));
}

void MacroExpander::ProcessUnstrDirective() {
    const BasicSubString section = ScanBrackettedSection(cursor, true, TK_LPAREN, TK_RPAREN);
    AdvanceWritePos(cursor.begin(), false);
    const basic_xstring expanded = ExpandInChildFrame(frame, section, 0);
    StringStream decoded;
    try {
        UnstringifyQuotedString(BasicSubString(expanded), decoded, ")");
    } catch (LexScannerException& e) {
        // The decoded text is a temporary: the error is reported at the directive, where the user sees the
        // closing bracket rather than an end of text.
        e.AppendContextLine(Compose("\n    in @unstr(", expanded, ")"));
        e.SetPosition(currentToken.begin());
        throw;
    }
    const OutputIndentOverride lineUp(outputIndent, GetOutputPos());
    WriteCalculatedSubString(BasicSubString(decoded.str()));
}

void MacroExpander::ProcessQuoteDirective() {
    int64 indent = 0;
    BasicSubString rest = ScanRndBrackettedString(cursor, indent);
    AdvanceWritePos(cursor.begin(), false);
    const OutputIndentOverride lineUp(outputIndent, GetOutputPos());
    // Copied line by line so that every line keeps its mapping to the source; the argument's own indentation
    // is removed from each line after the first.
    for (;;) {
        const char* lf = std::find(rest.begin(), rest.end(), '\n');
        if (lf == rest.end()) {
            WriteSubStringFromSourceFile(rest);
            return;
        }
        WriteSubStringFromSourceFile(BasicSubString(rest.begin(), lf + 1));
        rest.SetBegin(lf + 1);
        ScanIndentation(rest, indent, 4);
    }
}

void MacroExpander::ProcessRndBracketDirective() {
    const BasicSubString section = ScanBrackettedSection(cursor, false, TK_LPAREN, TK_RPAREN);
    AdvanceWritePos(cursor.begin(), false);
    const basic_xstring expanded = ExpandInChildFrame(frame, section, 0);
    basic_xstring value;
    // Any type is accepted and written as its text.
    ParseDirectiveText(frame, expanded, "@", currentToken.begin(),
                       [&](ExpressionParser& p) { value = p.ParseString(true); });
    WriteCalculatedSubString(BasicSubString(value));
}

void MacroExpander::ProcessSqrBracketDirective() {
    const BasicSubString section = ScanBrackettedSection(cursor, false, TK_LBRACKET, TK_RBRACKET);
    AdvanceWritePos(cursor.begin(), false);
    // The text of the second pass is a held text: definitions that it exports to an outer frame (@exportdef,
    // @def +) keep views of it as their names and bodies, so it lives as long as the frame that received
    // them, and an error in such a body later is placed at the source that produced the text.
    HeldTextKeeper keeper(frame);
    const HeldText& held = keeper.ExpandAndHold(" @[", section);
    const BasicSubString first = held.GetText();
    basic_xstring second;
    try {
        VarFrame child(frame);
        MacroExpand(nullptr, &child, first, 0, 0, second);
    } catch (LexScannerException& e) {
        StringFindAndReplace(e.GetMessage(), "EOS", "]");
        e.AppendContextLine(Compose("\n    in @[", first, "]"));
        e.SetPosition(currentToken.begin());
        throw;
    }
    WriteCalculatedSubString(BasicSubString(second));
}

void MacroExpander::ProcessPrintDirective(bool newLine) {
    const BasicSubString section = ScanBrackettedSection(cursor, true, TK_LPAREN, TK_RPAREN);
    AdvanceWritePos(cursor.begin(), false);
    const basic_xstring expanded = ExpandInChildFrame(frame, section, 0);
    xostream& out = xcout();
    out << expanded;
    if (newLine) out << '\n';
    out.flush();
    ScanOverWhiteSpaceAfterDirective();
}

basic_xstring MacroExpander::ParseStringExpressionInBrackets(BasicSubString directiveName, bool readOpen) {
    const BasicSubString section = ScanBrackettedSection(cursor, readOpen, TK_LPAREN, TK_RPAREN);
    return EvaluateString(section, directiveName);
}

}  // namespace orvan

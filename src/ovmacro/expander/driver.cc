// The main loop of the expander: copies ordinary text, finds macro names and dispatches @-directives.
#include "ovmacro/expander/expansion_observer.h"
#include "ovmacro/expander/held_text.h"
#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/expander/nesting_guard.h"
#include "ovmacro/expander/plain_text.h"
#include "ovmacro/foundations/scanning.h"
#include "ovmacro/lexer/token_scanner.h"

namespace orvan {

MacroExpander::MacroExpander(ImportHandler* importHandler, VarFrame* frame, BasicSubString text, int64 inputIndent,
                             int64 outputIndent, ExpandedOutput& output)
    : importHandler(importHandler),
      frame(frame),
      output(&output),
      inputIndent(inputIndent),
      outputIndent(outputIndent),
      text(text),
      cursor(text),
      writePos(text.begin()),
      textIsHeld(IsInHeldText(text.begin())) {}

void MacroExpander::AdvanceWritePos(const char* p, bool write) {
    if (write && p > writePos) WriteSubStringFromSourceFile(BasicSubString(writePos, p));
    writePos = p;
}

// Every write is counted against the work bound of the outermost expansion (none unless a fuzzer or a test
// set one), inserted indentation included. Pieces that would point into a held text, which may die before
// the output, point to the texts that produced it instead (only a held text's expansion can write such).
void MacroExpander::WriteSubStringFromSourceFile(BasicSubString s) {
    const int64 before = output->GetCharCount();
    if (textIsHeld)
        WriteCopiedText(*output, s, outputIndent);
    else
        output->WriteSubStringFromSourceFile(s, outputIndent);
    MacroNestingGuard::ChargeOutput(output->GetCharCount() - before, s.begin());
}

void MacroExpander::WriteCalculatedSubString(BasicSubString s) { WriteCalculatedSubString(s, currentToken); }

void MacroExpander::WriteCalculatedSubString(BasicSubString s, BasicSubString source) {
    const int64 before = output->GetCharCount();
    if (textIsHeld)
        WriteCalculatedText(*output, s, source, outputIndent);
    else
        output->WriteCalculatedSubString(s, source, outputIndent);
    MacroNestingGuard::ChargeOutput(output->GetCharCount() - before, source.begin());
}

LSToken MacroExpander::ReadToken() { return LsScanToken(cursor, false); }

LSVariable* MacroExpander::FindVariable(BasicSubString name) { return frame->Find(name, cursor.begin()); }

int64 MacroExpander::GetOutputPos() const {
    const int64 column = output->GetColumnPos();
    return column >= 0 ? column : outputIndent;
}

void MacroExpander::AddVariable(LSVariable* v) { frame->AddVariable(v); }

void MacroExpander::ScanOverWhiteSpaceAfterDirective() {
    const char* p = cursor.begin();
    const char* afterLastLf = nullptr;
    while (p < cursor.end() && (*p == ' ' || *p == '\t' || *p == '\n')) {
        if (*p == '\n') afterLastLf = p + 1;
        ++p;
    }
    cursor.SetBegin(afterLastLf ? afterLastLf : p);
    ScanIndentation(cursor, inputIndent, 4);
    AdvanceWritePos(cursor.begin(), false);
}

void MacroExpander::Expand() {
    // Ordinary text is not written token by token: `ordinaryEnd` marks the end of the ordinary text read so
    // far, and the run from writePos to it is written in one piece as soon as anything else needs the
    // output. The characters and their mapping are the same as writing each token as it is read.
    const char* ordinaryEnd = writePos;
    auto flushOrdinary = [&] {
        if (ordinaryEnd > writePos) AdvanceWritePos(ordinaryEnd, true);
    };
    for (;;) {
        // Most text needs nothing but copying: skip it in one go, up to the next token that needs a look.
        const FileScopeVarFrame* fileScope = frame->GetFileScopeVarFrame();
        const bool dollarMacrosActive =
            fileScope && (!fileScope->dollarMacros.empty() || !fileScope->importedFiles.empty());
        const PlainTextRun run = SkipPlainText(cursor.begin(), cursor.end(), inputIndent > 0, dollarMacrosActive);
        cursor.SetBegin(run.stop);
        ordinaryEnd = run.ordinaryEnd;

        // Blanks stay pending; a line feed ends a line, and the next line's indentation is removed.
        while (!cursor.empty()) {
            const char c = cursor.front();
            if (c == ' ' || c == '\t') {
                cursor.Advance(1);
            } else if (c == '\n') {
                cursor.Advance(1);
                if (inputIndent > 0) {
                    AdvanceWritePos(cursor.begin(), true);
                    ScanIndentation(cursor, inputIndent, 4);
                    AdvanceWritePos(cursor.begin(), false);
                }
                ordinaryEnd = cursor.begin();
            } else {
                break;
            }
        }
        const char* start = cursor.begin();
        // A name the fast lane stopped at is already read.
        LSToken token;
        if (start == run.stop && run.nameEnd) {
            token = LSToken(TK_IDENTIFIER, start, run.nameEnd);
            cursor.SetBegin(run.nameEnd);
        } else {
            token = LsScanToken(cursor, true);
        }
        if (token.type == TK_EOS) {
            AdvanceWritePos(cursor.begin(), true);
            return;
        }
        switch (token.type) {
            case TK_IDENTIFIER: {
                LSVariable* v = FindVariable(token.text);
                if (!v) break;
                // The ordinary text and the blanks before the name go in one run.
                currentToken = token.text;
                AdvanceWritePos(start, true);
                InvokeVariable(v);
                break;
            }
            case TK_DQ_STRING: {
                FileScopeVarFrame* fileScope = frame->GetFileScopeVarFrame();
                if (!fileScope || (fileScope->dollarMacros.empty() && fileScope->importedFiles.empty())) break;
                basic_xstring copy = token.text.GetString();
                bool replaced = false;
                try {
                    replaced = fileScope->ApplyDollarMacros(copy);
                } catch (LexScannerException& e) {
                    if (!e.GetPosition()) e.SetPosition(token.text.begin());
                    throw;
                }
                if (!replaced) break;
                flushOrdinary();
                currentToken = token.text;
                AdvanceWritePos(start, true);
                WriteCalculatedSubString(copy);
                AdvanceWritePos(cursor.begin(), false);
                break;
            }
            case TK_AT_COMMENT:
                flushOrdinary();
                currentToken = token.text;
                ScanOverWhiteSpaceAfterDirective();
                break;
            case TK_AT:
                flushOrdinary();
                currentToken = token.text;
                DispatchDirective(LsScanToken(cursor, false), start);
                break;
            default:
                break;
        }
        ordinaryEnd = cursor.begin();
    }
}

void MacroExpander::DispatchDirective(const LSToken& directive, const char* start) {
    if (directive.type == TK_AT) {  // "@@" produces nothing
        AdvanceWritePos(start, true);
        AdvanceWritePos(cursor.begin(), false);
        return;
    }
    // "@[", "@(" and "@$" are directives whose token is not a word. A dollar definition is one only where
    // there is an import handler, that is at the top level of a file.
    if (directive.type == TK_LBRACKET || directive.type == TK_LPAREN ||
        (directive.type == TK_DOLLAR && importHandler)) {
        AdvanceWritePos(start, true);
        if (directive.type == TK_LBRACKET)
            ProcessSqrBracketDirective();
        else if (directive.type == TK_LPAREN)
            ProcessRndBracketDirective();
        else
            ProcessDollarDefDirective();
        return;
    }
    if (directive.type != TK_IDENTIFIER) return;  // no directive: the '@' and the token are ordinary text

    // The directive words in the order they are tested. A flushed directive first writes the blanks pending
    // before its '@', so that its output stands where the '@' stood; a statement-like one runs with them still
    // pending, so that it can drop them together with its line.
    struct Row {
        const char* word;
        bool flush;
        void (*handler)(MacroExpander&);
    };
    static constexpr Row kRows[] = {
        {"import", false, [](MacroExpander& e) { e.ProcessImportDirective(); }},
        {"importpath", false, [](MacroExpander& e) { e.ProcessImportPathDirective(); }},
        {"relativepath", true, [](MacroExpander& e) { e.ProcessRelativePathDirective(); }},
        {"if", true, [](MacroExpander& e) { e.ProcessIfDirective(); }},
        {"while", true, [](MacroExpander& e) { e.ProcessWhileDirective(); }},
        {"for", true, [](MacroExpander& e) { e.ProcessForDirective(); }},
        {"def", false, [](MacroExpander& e) { e.ProcessDefDirective(false, false, false); }},
        {"exportdef", false, [](MacroExpander& e) { e.ProcessDefDirective(true, false, false); }},
        {"nakeddef", false, [](MacroExpander& e) { e.ProcessDefDirective(false, true, false); }},
        {"defpython", false, [](MacroExpander& e) { e.ProcessDefDirective(false, false, true); }},
        {"runpython", false, [](MacroExpander& e) { e.ProcessRunPythonDirective(); }},
        {"str", true, [](MacroExpander& e) { e.ProcessStrDirective(false, SLM_Narrow); }},
        {"strx", true, [](MacroExpander& e) { e.ProcessStrDirective(true, SLM_Narrow); }},
        {"strW", true, [](MacroExpander& e) { e.ProcessStrDirective(false, SLM_Wide); }},
        {"strxW", true, [](MacroExpander& e) { e.ProcessStrDirective(true, SLM_Wide); }},
        {"unstr", true, [](MacroExpander& e) { e.ProcessUnstrDirective(); }},
        {"scope", true, [](MacroExpander& e) { e.ProcessScopeDirective(); }},
        {"quote", true, [](MacroExpander& e) { e.ProcessQuoteDirective(); }},
        {"print", false, [](MacroExpander& e) { e.ProcessPrintDirective(false); }},
        {"println", false, [](MacroExpander& e) { e.ProcessPrintDirective(true); }},
        {"assert", false, [](MacroExpander& e) { e.ProcessAssertDirective(); }},
        {"assertfails", false, [](MacroExpander& e) { e.ProcessAssertFailsDirective(); }},
        {"fail", false, [](MacroExpander& e) { e.ProcessFailDirective(); }},
        {"let", false, [](MacroExpander& e) { e.ProcessLetDirective(); }},
    };
    const BasicSubString word = directive.text;
    if (word == "else") throw LexScannerException("@else with no matching @if directive", directive);
    // Imports are the business of the host's handler, which only the top-level expansion of a file has.
    if (!importHandler && (word == "import" || word == "importpath"))
        throw LexScannerException("@" + word.GetString() + " statement not allowed here", directive);
    for (const Row& row : kRows) {
        if (word != row.word) continue;
        if (row.flush) AdvanceWritePos(start, true);
        row.handler(*this);
        return;
    }
    ProcessValueVariableDirective(directive, start);
}

void MacroExpander::ProcessValueVariableDirective(const LSToken& word, const char* start) {
    // "@word" names a value variable "@word" of this frame or its parents.
    const BasicSubString name(start, word.text.end());
    const bool adjacent = word.text.begin() == start + 1;
    LSVariable* v = nullptr;
    if (adjacent) {
        v = frame->Find2(name);
    } else {
        // Blanks or comments stand between '@' and the word: the name is still "@" + word.
        basic_xstring joined = "@" + word.text.GetString();
        v = frame->Find2(BasicSubString(joined));
    }
    auto* value = dynamic_cast<LSValueVariable*>(v);
    if (!value) {
        if (ExpansionObserver* observer = ExpansionObserver::Current())
            observer->NotADirective(word.text, start);
        return;
    }
    AdvanceWritePos(start, true);
    WriteCalculatedSubString(BasicSubString(value->value));
    AdvanceWritePos(cursor.begin(), false);
}

}  // namespace orvan

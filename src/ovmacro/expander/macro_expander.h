// The expansion engine: MacroExpand and the MacroExpander that walks one text.
//
// A host expands a whole file with
//
//     FileScopeVarFrame frame;
//     basic_xstring result;
//     OutputPieces pieces;
//     MacroExpand(nullptr, &frame, text, 0, 0, result, pieces);
//
// The expander copies ordinary text with its layout, hands names of macros to invocation and dispatches each
// @-directive to its handler. Handlers that need a nested text expanded (a body, a block, a condition) call
// MacroExpand again with a child frame. The source text is never copied: every position is a pointer into the
// caller's buffer, which must outlive the expansion (and the frames that keep definitions from it).
#pragma once

#include <cstdint>
#include <span>

#include "ovmacro/expander/import_handler.h"
#include "ovmacro/expander/loop_block.h"
#include "ovmacro/lexer/token.h"
#include "ovmacro/output/expanded_output.h"
#include "ovmacro/vars/var_frame.h"

namespace orvan {

enum EStrLiteralMode : std::int32_t {
    SLM_Narrow = 0,  // "..."
    SLM_Wide = 1,    // L"..."
};

// Expands text into output (appending, with output pieces).
void MacroExpand(ImportHandler* importHandler, VarFrame* frame, BasicSubString text, int64 inputIndent,
                 int64 outputIndent, ExpandedOutput& output);
// Expands text into result, replacing its content; result is untouched if the expansion fails.
void MacroExpand(ImportHandler* importHandler, VarFrame* frame, BasicSubString text, int64 inputIndent,
                 int64 outputIndent, basic_xstring& result);
// The same, and the output pieces that map result back to the source replace those of `pieces`.
void MacroExpand(ImportHandler* importHandler, VarFrame* frame, BasicSubString text, int64 inputIndent,
                 int64 outputIndent, basic_xstring& result, OutputPieces& pieces);

// Evaluates text (after expanding it in a child frame of frame) as an expression of `type` and stores the
// canonical text of the value.
void ReadVariableValueByParsingExpression(VarFrame* frame, BasicSubString text, ELSVariable type,
                                          basic_xstring& value);

void WritePrefix(xostream& os, EStrLiteralMode mode);
void WriteSuffix(xostream& os, EStrLiteralMode mode);

class MacroExpander {
public:
    MacroExpander(ImportHandler* importHandler, VarFrame* frame, BasicSubString text, int64 inputIndent,
                  int64 outputIndent, ExpandedOutput& output);
    MacroExpander(const MacroExpander&) = delete;
    MacroExpander& operator=(const MacroExpander&) = delete;

    // Runs the main loop until the text is used up.
    void Expand();
    // Where the main loop has come to: the start of the token being handled.
    const char* Position() const { return currentToken.begin() ? currentToken.begin() : cursor.begin(); }

private:
    // Writes (or, with write false, drops) the pending text from writePos up to p; writePos becomes p.
    void AdvanceWritePos(const char* p, bool write);
    void WriteSubStringFromSourceFile(BasicSubString s);
    void WriteCalculatedSubString(BasicSubString s);
    void WriteCalculatedSubString(BasicSubString s, BasicSubString source);
    // Ends a statement-like directive: drops it, the blanks before it, the rest of its line and any empty
    // lines after it, and the indentation of the next line.
    void ScanOverWhiteSpaceAfterDirective();
    LSToken ReadToken();
    LSVariable* FindVariable(BasicSubString name);
    int64 GetOutputPos() const;
    void AddVariable(LSVariable* v);
    // Dispatches the directive token read after an '@'; start is where the '@' stood.
    void DispatchDirective(const LSToken& directive, const char* start);
    void ProcessValueVariableDirective(const LSToken& word, const char* start);

    // Definitions.
    void ProcessDefDirective(bool exported, bool naked, bool python);
    void ReadMacroVariableDefn(BasicSubString name, LSMacroVariable* macro);
    void ReadEqualsForVariableDefn(BasicSubString name);
    bool ReadEqualsForVariableDefn2(BasicSubString name);
    // Invocation.
    void InvokeVariable(LSVariable* v);
    void InvokeMacroFunction(LSMacroVariable* m);
    // Expands a call whose body is ordinary text apart from the names of untyped arguments; false, having
    // written nothing, for any other macro. `namesOnly`: each argument is known to be one identifier.
    bool ExpandPlainBody(const LSMacroVariable& m, VarFrame* parentFrame, std::span<const BasicSubString> actual,
                         bool namesOnly);
    basic_xstring EvaluateString(BasicSubString text, BasicSubString directiveName);
    // Conditionals and loops.
    void ProcessIfDirective();
    bool ParseBoolExpressionInBrackets(BasicSubString directiveName);
    void ProcessWhileDirective();
    void ProcessForDirective();
    // One iteration of a @for block cut by PlanLoopBlock (loop_block.h), with the items of its loop names.
    // The text that a @for list expands to when that is known without expanding it (a view into the
    // source), or empty.
    BasicSubString OrdinaryListText(BasicSubString listText);
    void WritePlannedIteration(const LoopBlockPlan& plan, std::span<const BasicSubString> items, BasicSubString block,
                               int64 blockOutputIndent);
    // Assignment and scope.
    void ProcessLetDirective();
    void ProcessDollarDefDirective();
    void ProcessScopeDirective();
    // Strings and evaluation.
    void ProcessStrDirective(bool isX, EStrLiteralMode mode);
    void ProcessUnstrDirective();
    void ProcessQuoteDirective();
    void ProcessRndBracketDirective();
    void ProcessSqrBracketDirective();
    void ProcessPrintDirective(bool newLine);
    basic_xstring ParseStringExpressionInBrackets(BasicSubString directiveName, bool readOpen);
    // Assertions.
    void ProcessAssertDirective();
    void ProcessAssertFailsDirective();
    void ProcessFailDirective();
    // Imports.
    void ProcessImportDirective();
    void ProcessImportPathDirective();
    void ProcessRelativePathDirective();
    // Embedded Python.
    void ProcessRunPythonDirective();

    ImportHandler* importHandler;
    VarFrame* frame;
    ExpandedOutput* output;
    int64 inputIndent;
    int64 outputIndent;
    BasicSubString text;
    BasicSubString cursor;
    BasicSubString currentToken;
    const char* writePos;
    // Whether `text` lies in a held text (a @for list, a call text): its output pieces are then written
    // through that text's pieces, since it may die before them.
    bool textIsHeld;
};

}  // namespace orvan

// @import, @importpath and @relativepath: the directives that connect a text to other files.
//
// The expander reads no files: @import and @importpath hand a name or a directory to the host's
// ImportHandler. @relativepath is a pure text function.
#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/foundations/compose.h"
#include "ovmacro/foundations/paths.h"
#include "ovmacro/foundations/text_format.h"
#include "ovmacro/lexer/section_scanners.h"

namespace orvan {

void MacroExpander::ProcessImportDirective() {
    const LSToken token = ReadToken();
    const char* position = token.text.begin();
    const bool keep = importHandler->KeepsImportDirectives();
    basic_xstring fileName;
    if (token.type == TK_LPAREN) {
        fileName = ParseStringExpressionInBrackets("@import", false);
        // A kept directive stays in the output with the evaluated name as a literal, so that a reader of the
        // expanded text meets every import at its place. The name is escaped, so that a quote or a backslash
        // in it reads back unchanged.
        if (keep) {
            AdvanceWritePos(cursor.begin(), false);
            WriteCalculatedSubString("@import " + MakeDoubleQuotedString(fileName));
        }
    } else if (token.type == TK_DQ_STRING) {
        // The directive's own text stays pending and is copied to the output unchanged.
        token.GetLiteralString(fileName);
    } else {
        throw LexScannerException(Compose("Quoted string expected after 'import' when read ", token),
                                  position);
    }
    if (!importHandler->HandleImport(frame, fileName, position))
        throw LexScannerException("Can't import file: " + fileName, position);
    // The blanks before the directive are still pending (it is not flushed), so its whole line can go.
    if (!keep) ScanOverWhiteSpaceAfterDirective();
}

void MacroExpander::ProcessImportPathDirective() {
    const LSToken token = ReadToken();
    const char* position = token.text.begin();
    basic_xstring path;
    if (token.type == TK_LPAREN) {
        path = ParseStringExpressionInBrackets("@importpath", false);
    } else if (token.type == TK_DQ_STRING) {
        token.GetLiteralString(path);
    } else {
        throw LexScannerException(Compose("Quoted string expected after 'importpath' when read ", token),
                                  position);
    }
    if (importHandler->KeepsImportDirectives())
        AdvanceWritePos(cursor.begin(), false);
    else
        ScanOverWhiteSpaceAfterDirective();
    if (!importHandler->HandleImportPath(path, position))
        throw LexScannerException("@importpath directive not supported", position);
}

void MacroExpander::ProcessRelativePathDirective() {
    const LSToken open = ReadToken();
    if (open.type != TK_LPAREN)
        throw LexScannerException(Compose("( expected after @relativepath when read ", open), open);

    BasicSubString argument;
    const LSToken comma = ScanArgument(cursor, argument, TK_RPAREN);
    if (comma.type != TK_COMMA)
        throw LexScannerException(Compose("Comma expected in @relativepath directive when read ", comma),
                                  comma);
    basic_xstring first = EvaluateString(argument, "@relativepath");

    const LSToken close = ScanArgument(cursor, argument, TK_RPAREN);
    if (close.type != TK_RPAREN)
        throw LexScannerException(Compose(") expected  in @relativepath directive when read ", close), close);
    basic_xstring second = EvaluateString(argument, "@relativepath");

    AdvanceWritePos(cursor.begin(), false);
    NormalisePath(first);
    NormalisePath(second);
    basic_xstring relative;
    CalcRelativePath(first, second, relative);
    WriteCalculatedSubString(MakeDoubleQuotedString(relative));
}

}  // namespace orvan

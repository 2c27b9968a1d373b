// Reading the expanded text of a project description file: imports, dollar definitions and settings.
#include "ovmacro/foundations/compose.h"
#include "ovmacro/foundations/paths.h"
#include "ovmacro/mpfw/mpfw_parser.h"

namespace orvan {

namespace {

bool IsQuotedLiteral(const LSToken& t) {
    return t.type == TK_SQ_STRING || t.type == TK_DQ_STRING;
}

}  // namespace

bool MpfwParser::ParseImportDirective() {
    if (token.type != TK_AT) return false;
    ReadNextToken();
    if (token.type != TK_IDENTIFIER || token != "import")
        throw LexScannerException(Compose("Syntax error: @", token), token);
    ReadNextToken();
    const basic_xstring name = ParseQuotedString();
    basic_xstring fullPath;
    if (!ResolveFile(name, fullPath)) throw LexScannerException("Couldn't open file " + name, lastToken);
    OnImport(mpfwFrame->sourceFiles.FindSourceFile(fullPath));
    ReadNextToken();
    return true;
}

bool MpfwParser::ParseMacroDef() {
    basic_xstring name, value;
    return ParseMacroDef(name, value);
}

bool MpfwParser::ParseMacroDef(basic_xstring& name, basic_xstring& value) {
    if (token.type != TK_DOLLAR) return false;
    ReadNextToken();
    name = ParseIdentifier();
    ParseGivenToken(TK_ASSIGN, "=");
    if (token.type == TK_IDENTIFIER && token == "path") {
        ReadNextToken();
        ReadString(value);
        NormalisePath(value);
    } else {
        ReadString(value);
    }
    mpfwFrame->varFrame.InsertDollarMacro(name, value);
    return true;
}

void MpfwParser::ReadString(basic_xstring& value) {
    const char* valuePos = token.text.begin();
    if (token.type == TK_LPAREN) {
        ReadNextToken();
        value = ParseString(false);
        ParseGivenToken(TK_RPAREN, ")");
    } else if (IsQuotedLiteral(token)) {
        token.GetLiteralString(value);
        ReadNextToken();
    } else {
        throw LexScannerException(Compose("Expected quoted string when read ", token), token);
    }
    ApplyMacrosAt(value, valuePos);
}

basic_xstring MpfwParser::ParseQuotedString() {
    if (!IsQuotedLiteral(token))
        throw LexScannerException(Compose("Expected quoted string when read ", token), token);
    basic_xstring value;
    token.GetLiteralString(value);
    ApplyMacros(value);
    return value;
}

basic_xstring MpfwParser::ParseFileOrDirName() {
    basic_xstring name = ParseQuotedString();
    if (name.find('\\') != basic_xstring::npos)
        throw LexScannerException(Compose("Forward slashes must be used in ", token), token);
    return name;
}

void MpfwParser::ParseStringSettingHelper(const basic_xstring& name, basic_xstring& value) {
    if (token.type != TK_DOLLAR) throw LexScannerException(Compose("Expected '$' when read ", token), token);
    ReadNextToken();
    if (token.text != BasicSubString(name))
        throw LexScannerException(Compose("Expected '", name, "' when read ", token), token);
    ReadNextToken();
    ParseGivenToken(TK_ASSIGN, "=");
    if (token.type != TK_DQ_STRING)
        throw LexScannerException(Compose("Expected quoted string when read ", token), token);
    token.GetLiteralString(value);
}

void MpfwParser::ParseStringSetting(const basic_xstring& name, basic_xstring& value) {
    ParseStringSettingHelper(name, value);
    ReadNextToken();
}

void MpfwParser::ParsePathSetting(const basic_xstring& name, basic_xstring& value) {
    ParseStringSettingHelper(name, value);
    if (!value.empty()) {
        if (value.find('\\') != basic_xstring::npos)
            throw LexScannerException(Compose("Forward slashes must be used in ", token), token);
        if (value.back() == '/')
            throw LexScannerException(Compose("Path can't end with a trailing slash : ", token), token);
    }
    ReadNextToken();
}

bool MpfwParser::GetFilenameAndLineNumberAtCurrentPosition(basic_xstring& file, int64& line) const {
    const MpfwSourceFileList& files = mpfwFrame->sourceFiles;
    LexScannerException probe("", token.text.begin());
    for (int64 i = 0; i < files.size(); ++i) {
        if (StringContainsPos(files[i]->expandedText, probe.GetPosition())) {
            files[i]->AdjustErrorPosition(probe);
            break;
        }
    }
    return files.GetFilenameAndLineNumber(probe.GetPosition(), file, line);
}

}  // namespace orvan

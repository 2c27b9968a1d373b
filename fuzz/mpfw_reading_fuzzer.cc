// Fuzz target: the reading steps of the project description parser over a text, as a host's reader of
// settings uses them: at each point an import line, a dollar definition, a string or path setting, a quoted
// file name or a path, chosen by the current token, until the end of the text or the first error.
//
// The first byte chooses whether the rest is read as it stands or first loaded as a file (expanded with the
// parser as import handler, which records it and resolves no imports) and its expanded text read, so that
// the reader also meets the positions of an expansion (__LINE__, errors mapped back through the pieces).
//
// Work is bounded as in macro_expand_fuzzer.cc (ConfigureFuzzBounds, 4 KiB of input).
#include "fuzz_support.h"
#include "ovmacro/lexer/token_scanner.h"
#include "ovmacro/mpfw/mpfw_parser.h"

using namespace orvan;

namespace {

// A host that finds no file to import.
class FuzzHost : public MpfwParser {
  public:
    using MpfwParser::MpfwParser;
    bool ResolveFile(const basic_xstring&, basic_xstring&) override { return false; }
    void OnImport(MpfwSourceFile*) override {}
};

// The text of the token after the current one, without moving the parser.
BasicSubString PeekNextToken(const FuzzHost& host) {
    BasicSubString rest = host.cursor;
    return LsScanToken(rest, false).text;
}

// One reading step; false when nothing at the current token is a construct of the format.
bool ReadStep(FuzzHost& host) {
    if (host.ParseImportDirective()) return true;
    basic_xstring value;
    switch (host.GetTokenType()) {
        case TK_DOLLAR: {
            const BasicSubString name = PeekNextToken(host);
            if (name == "name") {
                host.ParseStringSetting("name", value);
            } else if (name == "dir") {
                host.ParsePathSetting("dir", value);
            } else {
                FUZZ_CHECK(host.ParseMacroDef());
            }
            return true;
        }
        case TK_DQ_STRING:
        case TK_SQ_STRING:
            (void)host.ParseFileOrDirName();
            host.ReadNextToken();
            return true;
        case TK_IDENTIFIER:
            (void)host.ParsePath();
            return true;
        default:
            return false;
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    static const bool configured = ConfigureFuzzBounds();
    (void)configured;
    if (size == 0 || size > kMaxFuzzInputSize) return 0;
    const bool expandFirst = data[0] & 1;
    const char* text = reinterpret_cast<const char*>(data) + 1;
    const BasicSubString input(text, text + size - 1);

    MpfwSourceFileList files;
    MpfwFrame frame(files);
    FuzzHost host(frame);
    try {
        BasicSubString toRead = input;
        if (expandFirst) {
            MpfwSourceFile* file = host.AddFileWithText("fuzz.ovp", input.GetString());
            if (!file) return 0;
            FUZZ_CHECK(file->pieces.size() == static_cast<int64>(file->expandedText.size()));
            toRead = BasicSubString(file->expandedText);
        }
        host.Init(toRead);
        while (host.GetTokenType() != TK_EOS && ReadStep(host)) {
        }
        FUZZ_CHECK(ViewWithin(host.GetToken().text, toRead));
    } catch (const IException&) {
    }
    return 0;
}

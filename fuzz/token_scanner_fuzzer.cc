// Fuzz target: the token scanner, over the whole input until its end or the first scanning error.
//
// Besides crashes and sanitizer reports it checks what every client of the scanner relies on: tokens are
// non-empty views that follow one another inside the input, the end token is the empty view at the input's
// end, the value readers accept every literal that the scanner accepted, and reading with comments skipped
// gives the same tokens as reading with comments returned and dropping them.
#include <vector>

#include "fuzz_support.h"
#include "ovmacro/lexer/token_scanner.h"

using namespace orvan;

namespace {

// Reads every token; returns false when a scanning error ended the input early.
bool ScanAll(BasicSubString input, bool returnComments, std::vector<LSToken>& tokens) {
    BasicSubString rest = input;
    const char* previousEnd = input.begin();
    try {
        for (;;) {
            const LSToken token = LsScanToken(rest, returnComments);
            FUZZ_CHECK(ViewWithin(token.text, input));
            FUZZ_CHECK(token.text.begin() >= previousEnd);
            FUZZ_CHECK(rest.begin() == token.text.end() && rest.end() == input.end());
            if (token.type == TK_EOS) {
                FUZZ_CHECK(token.text.empty() && token.text.begin() == input.end());
                return true;
            }
            FUZZ_CHECK(!token.text.empty());
            FUZZ_CHECK(returnComments || token.type != TK_COMMENT);
            previousEnd = token.text.end();
            tokens.push_back(token);
        }
    } catch (const IException&) {
        FUZZ_CHECK(ViewWithin(rest, input));
        return false;
    }
}

// Whether the text is exactly one literal character in single quotes, the only kind GetLiteralCharacter
// takes.
bool IsOneCharacterLiteral(BasicSubString text) {
    BasicSubString rest = text;
    try {
        return LsScanLiteralCharacter(rest) && rest.empty();
    } catch (const IException&) {
        return false;
    }
}

void ReadLiteralValues(const LSToken& token) {
    basic_xstring s;
    switch (token.type) {
        case TK_INT:
            (void)token.GetLiteralInt32();
            (void)token.GetLiteralInt64();
            break;
        case TK_HEX_INT:
            (void)token.GetLiteralHexInt32();
            (void)token.GetLiteralHexInt64();
            break;
        case TK_FLOAT:
            (void)token.GetLiteralDouble();
            break;
        case TK_SQ_STRING:
        case TK_DQ_STRING:
            token.GetLiteralString(s);
            FUZZ_CHECK(static_cast<int64>(s.size()) <= token.text.size());
            if (token.type == TK_SQ_STRING && IsOneCharacterLiteral(token.text))
                (void)token.GetLiteralCharacter();
            break;
        default:
            break;
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    if (size > kMaxFuzzInputSize) return 0;
    const char* text = reinterpret_cast<const char*>(data);
    const BasicSubString input(text, text + size);

    std::vector<LSToken> withComments, withoutComments;
    const bool completeWith = ScanAll(input, true, withComments);
    const bool completeWithout = ScanAll(input, false, withoutComments);
    FUZZ_CHECK(completeWith == completeWithout);
    std::vector<LSToken> filtered;
    for (const LSToken& t : withComments)
        if (t.type != TK_COMMENT) filtered.push_back(t);
    if (completeWith) FUZZ_CHECK(filtered == withoutComments);
    for (const LSToken& t : withoutComments) ReadLiteralValues(t);

    // The single-token scanners on their own, at the start of the input.
    if (size > 0) {
        BasicSubString rest = input;
        try {
            (void)LsScanLiteralCharacter(rest);
        } catch (const IException&) {
        }
        FUZZ_CHECK(ViewWithin(rest, input));
    }
    return 0;
}

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

// Reads every token but comments; returns false when a scanning error ended the input early.
bool ScanAll(BasicSubString input, bool returnComments, std::vector<LSToken>& tokens) {
    BasicSubString rest = input;
    const char* previousEnd = input.begin();
    try {
        for (LSToken t = LsScanToken(rest, returnComments);; t = LsScanToken(rest, returnComments)) {
            FUZZ_CHECK(ViewWithin(t.text, input) && t.text.begin() >= previousEnd);
            FUZZ_CHECK(rest.begin() == t.text.end() && rest.end() == input.end());
            if (t.type == TK_EOS) {
                FUZZ_CHECK(t.text.empty() && t.text.begin() == input.end());
                return true;
            }
            FUZZ_CHECK(!t.text.empty() && (returnComments || t.type != TK_COMMENT));
            previousEnd = t.text.end();
            if (t.type != TK_COMMENT) tokens.push_back(t);
        }
    } catch (const IException&) {
        FUZZ_CHECK(ViewWithin(rest, input));
        return false;
    }
}

void ReadLiteralValue(const LSToken& token) {
    basic_xstring s;
    BasicSubString rest = token.text;
    switch (token.type) {
        case TK_INT: (void)token.GetLiteralInt32(), (void)token.GetLiteralInt64(); break;
        case TK_HEX_INT: (void)token.GetLiteralHexInt32(), (void)token.GetLiteralHexInt64(); break;
        case TK_FLOAT: (void)token.GetLiteralDouble(); break;
        case TK_SQ_STRING:
        case TK_DQ_STRING:
            token.GetLiteralString(s);
            FUZZ_CHECK(static_cast<int64>(s.size()) <= token.text.size());
            // GetLiteralCharacter takes exactly one literal character in single quotes.
            try {
                if (token.type == TK_SQ_STRING && LsScanLiteralCharacter(rest) && rest.empty())
                    (void)token.GetLiteralCharacter();
            } catch (const IException&) {
            }
            break;
        default: break;
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    if (size > kMaxFuzzInputSize) return 0;
    const char* text = reinterpret_cast<const char*>(data);
    const BasicSubString input(text, text + size);
    std::vector<LSToken> withComments, withoutComments;
    const bool complete = ScanAll(input, true, withComments);
    FUZZ_CHECK(ScanAll(input, false, withoutComments) == complete);
    if (complete) FUZZ_CHECK(withComments == withoutComments);
    for (const LSToken& t : withoutComments) ReadLiteralValue(t);
    BasicSubString rest = input;
    try {
        (void)LsScanLiteralCharacter(rest);
    } catch (const IException&) {
    }
    FUZZ_CHECK(ViewWithin(rest, input));
    return 0;
}

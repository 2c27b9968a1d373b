// Fuzz target: the section scanners. The first byte chooses the scanner; the rest of the input is scanned
// with it again and again, as a directive reads one argument or block after another, until the input is used
// up, a scanner stops making progress or raises a scanning error.
//
// Checked besides crashes: every section and the remaining input are views inside the input, scanners only
// move forward, indentation is never negative, and a text is token-equivalent to itself.
#include "fuzz_support.h"
#include "ovmacro/foundations/stream.h"
#include "ovmacro/lexer/exceptions.h"
#include "ovmacro/lexer/section_scanners.h"

using namespace orvan;

namespace {

enum Scanner : uint8_t {
    kArgumentInRound, kArgumentInSquare, kRoundSection, kSquareSectionOpened, kCurlySection, kSubstString,
    kRndBrackettedString, kElse, kElseIf, kTokenEquivalence, kUnstringify, kTrailingBlanks, kScannerCount
};

// Runs one scan; the view `rest` is advanced past what it consumed.
void ScanOnce(Scanner scanner, BasicSubString input, BasicSubString& rest) {
    BasicSubString section(rest.begin(), rest.begin());  // the scanners that cut no section leave it empty
    int64 indent = 0;
    switch (scanner) {
        case kArgumentInRound:
        case kArgumentInSquare: {
            const LSToken end =
                ScanArgument(rest, section, scanner == kArgumentInRound ? TK_RPAREN : TK_RBRACKET);
            FUZZ_CHECK(ViewWithin(end.text, input));
            break;
        }
        case kRoundSection:
            section = ScanRndBrackettedSection(rest, true);
            break;
        case kSquareSectionOpened:
            section = ScanSquareBrackettedSection(rest, false);
            break;
        case kCurlySection:
            section = ScanCurlyBrackettedSection(rest, true);
            break;
        case kSubstString:
            section = ScanSubstString(rest, indent);
            break;
        case kRndBrackettedString:
            section = ScanRndBrackettedString(rest, indent);
            break;
        case kElse:
        case kElseIf: {
            BasicSubString copy = rest;
            if (scanner == kElse ? ScanElseBlock(copy) : ScanElseIfBlock(copy))
                rest = copy;
            else
                rest.Advance(1);  // nothing to adopt: move on to try the next position
            break;
        }
        case kTokenEquivalence: {
            // The first line against the rest, and each against itself.
            const char* lf = rest.begin();
            while (lf < rest.end() && *lf != '\n') ++lf;
            const BasicSubString first(rest.begin(), lf), second(lf, rest.end());
            (void)SubStringsAreTokenEquivalent(first, second);
            FUZZ_CHECK(SubStringsAreTokenEquivalent(first, first));
            FUZZ_CHECK(SubStringsAreTokenEquivalent(second, second));
            rest.SetBegin(lf < rest.end() ? lf + 1 : lf);
            break;
        }
        case kUnstringify: {
            StringStream out;
            try {
                UnstringifyQuotedString(rest, out);
            } catch (const IException&) {
                FUZZ_CHECK(out.GetString().empty());  // nothing is written before the whole string was checked
                throw;
            }
            FUZZ_CHECK(static_cast<int64>(out.GetString().size()) < rest.size());
            rest.Advance(1);
            break;
        }
        case kTrailingBlanks: {
            BasicSubString trimmed = rest;
            const int64 width = ScanBackwardsThroughSpacesAndTabs(trimmed);
            FUZZ_CHECK(trimmed.begin() == rest.begin() && trimmed.end() <= rest.end());
            const int64 removed = rest.end() - trimmed.end();
            FUZZ_CHECK(width >= removed && width <= 4 * removed);
            rest.Advance(1);
            break;
        }
        case kScannerCount:
            break;
    }
    FUZZ_CHECK(ViewWithin(section, input));
    FUZZ_CHECK(indent >= 0);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    if (size == 0 || size > kMaxFuzzInputSize) return 0;
    const auto scanner = static_cast<Scanner>(data[0] % kScannerCount);
    const char* text = reinterpret_cast<const char*>(data) + 1;
    const BasicSubString input(text, text + size - 1);
    BasicSubString rest = input;
    try {
        while (!rest.empty()) {
            const char* before = rest.begin();
            ScanOnce(scanner, input, rest);
            FUZZ_CHECK(ViewWithin(rest, input) && rest.end() == input.end());
            FUZZ_CHECK(rest.begin() >= before);
            if (rest.begin() == before) break;
        }
    } catch (const IException&) {
        FUZZ_CHECK(ViewWithin(rest, input) && rest.end() == input.end());
    }
    return 0;
}

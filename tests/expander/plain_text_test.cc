// The fast lane's way for a process where no variable has a name yet, which skips quiet bytes sixteen at a
// time, must stop where the byte-by-byte way stops once it goes on past the names it looks up, with the same
// pending blanks and the same scanning errors.
#include <gtest/gtest.h>

#include <random>
#include <string>

#include "ovmacro/expander/plain_text.h"
#include "ovmacro/lexer/exceptions.h"
#include "ovmacro/vars/name_filter.h"

namespace orvan {
namespace {

struct Skipped {
    int64 stop = -1;
    int64 ordinaryEnd = -1;
    std::string error;
    int64 errorAt = -1;

    bool operator==(const Skipped&) const = default;
};

void PrintTo(const Skipped& s, std::ostream* os) {
    *os << "stop " << s.stop << ", ordinary end " << s.ordinaryEnd;
    if (!s.error.empty()) *os << ", error at " << s.errorAt << ": " << s.error;
}

template <class Skip>
Skipped Run(const std::string& text, Skip skip) {
    Skipped r;
    const char* begin = text.data();
    try {
        const PlainTextRun run = skip(begin, begin + text.size());
        r.stop = run.stop - begin;
        r.ordinaryEnd = run.ordinaryEnd - begin;
    } catch (const LexScannerException& e) {
        r.error = e.GetMessage();
        r.errorAt = e.GetPosition() ? e.GetPosition() - begin : -1;
    }
    return r;
}

// The byte-by-byte way, going on past every name it stops at: what it does when no name is defined. A name
// in the filter makes sure that SkipPlainText takes that way here.
PlainTextRun SkipPastNames(const char* p, const char* end, bool lineFeedsNeedWork, bool dollarMacrosActive) {
    NameFilter::Add(BasicSubString("aNameThatNoTextUses"));
    for (;;) {
        const PlainTextRun run = SkipPlainText(p, end, lineFeedsNeedWork, dollarMacrosActive);
        if (!run.nameEnd) return run;
        p = run.nameEnd;
    }
}

void ExpectSameStops(const std::string& text) {
    for (const bool lineFeedsNeedWork : {false, true}) {
        for (const bool dollarMacrosActive : {false, true}) {
            SCOPED_TRACE(::testing::PrintToString(text) + (lineFeedsNeedWork ? " with indentation" : "") +
                         (dollarMacrosActive ? " with dollar macros" : ""));
            const Skipped fast = Run(text, [&](const char* b, const char* e) {
                return SkipPlainTextWithoutNames(b, e, lineFeedsNeedWork, dollarMacrosActive);
            });
            const Skipped reference = Run(text, [&](const char* b, const char* e) {
                return SkipPastNames(b, e, lineFeedsNeedWork, dollarMacrosActive);
            });
            ASSERT_EQ(fast, reference);
        }
    }
}

TEST(PlainTextWithoutNamesTest, StopsLikeTheByteByByteWay) {
    const std::string cases[] = {
        "plain words, with punctuation; and more words than sixteen bytes\n",
        "a word1 with digits2x and 0x1F numbers 12 3.25 7e3 in the middle of some text",
        "words long enough to fill blocks then r\"raw\" and R'x' and xr'c' literals here",
        "sixteen bytes...'unterminated single quote at the end of it all",
        "sixteen bytes... 1. is a number without its fraction digits",
        "sixteen bytes... 0x is a hex prefix without digits after it",
        "comments here // run to the end of the line\nand /* across */ more text",
        "an @directive after some plain words, then more words after it",
        "a line\n    indented after a line feed, and\ttabs\tbetween words here",
        "control \x01 byte and a DEL \x7f byte amid words, past the first block",
        "utf-8 words: caf\xc3\xa9 na\xc3\xafve \xe2\x80\x94 dash, sixteen bytes at least",
        "a ++= b is an invalid token after enough text to need a block",
        "trailing blanks stay pending when the text ends with them      ",
        "trailing blanks before an at sign in a long enough text     @x",
        "quotes \"in a double quoted string\" read whole, past sixteen bytes",
        "abcdefghijklmnopqrstuvwxyz_0123456789ABCDEFGHIJKLMNOPQRSTUVWXYZ",
    };
    for (const std::string& text : cases) ExpectSameStops(text);
}

// Random texts from the bytes that matter, long enough for several blocks.
TEST(PlainTextWithoutNamesTest, StopsLikeTheByteByByteWayOnRandomTexts) {
    const std::string alphabet = "aaaarRxe_ \t\n\n019.,;-+/*\"'@\\()\x01\x7f\xc3\xa9";
    std::mt19937 random(12345);
    std::uniform_int_distribution<size_t> pick(0, alphabet.size() - 1);
    std::uniform_int_distribution<int> length(14, 80);
    for (int i = 0; i < 4000; ++i) {
        std::string text;
        for (int n = length(random); n > 0; --n) text += alphabet[pick(random)];
        ExpectSameStops(text);
        if (::testing::Test::HasFatalFailure()) return;
    }
}

}  // namespace
}  // namespace orvan

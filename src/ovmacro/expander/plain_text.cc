#include "ovmacro/expander/plain_text.h"

#include <algorithm>
#include <array>
#include <cstring>

#if defined(__SSE2__)
#include <emmintrin.h>
#endif

#include "ovmacro/foundations/scanning.h"
#include "ovmacro/lexer/char_classes.h"
#include "ovmacro/lexer/token_scanner.h"
#include "ovmacro/vars/name_filter.h"
#include "ovmacro/vars/var_frame.h"
#include "ovmacro/vars/variable.h"

namespace orvan {

namespace {

// The fast lane's view of the token scanner's character classes (the one table both read).
enum LaneClass : unsigned char {
    kStop,         // '@', a byte that begins no token, or anything not handled here
    kBlank,        // white space other than a line feed
    kLineFeed,
    kPunctuation,  // a character that begins an operator or punctuation token that can never fail
    kPlus,         // "++=" is an error
    kSlash,        // may begin a comment
    kDigit,
    kSingleQuote,
    kDoubleQuote,
    kIdentifier,
};

constexpr std::array<LaneClass, 256> MakeLaneClasses() {
    std::array<LaneClass, 256> t{};
    for (int c = 0; c < 256; ++c) {
        switch (kCharClasses[c]) {
            // Only blanks and tabs: a carriage return, vertical tab or form feed goes to the main loop, where it
            // ends the blanks before a line feed, so that the token scanner, not the line handling, skips the
            // line end that follows it and the next line keeps its indentation.
            case CharClass::kWhiteSpace: t[c] = c == ' ' || c == '\t' ? kBlank : kStop; break;
            case CharClass::kLineFeed: t[c] = kLineFeed; break;
            case CharClass::kIdentifier: t[c] = kIdentifier; break;
            case CharClass::kDigit: t[c] = kDigit; break;
            case CharClass::kSingleQuote: t[c] = kSingleQuote; break;
            case CharClass::kDoubleQuote: t[c] = kDoubleQuote; break;
            case CharClass::kSlash: t[c] = kSlash; break;
            case CharClass::kPlus: t[c] = kPlus; break;
            // Every other operator, alone or extended, is a token that cannot fail: skipped a byte at a time.
            case CharClass::kOperator:
            case CharClass::kSingle: t[c] = kPunctuation; break;
            case CharClass::kAt:
            case CharClass::kOther: t[c] = kStop; break;
        }
    }
    return t;
}

constexpr std::array<LaneClass, 256> kClasses = MakeLaneClasses();

constexpr std::array<bool, 256> MakeIdentifierBytes() {
    std::array<bool, 256> t{};
    for (int c = 0; c < 256; ++c) t[c] = kClasses[c] == kIdentifier || kClasses[c] == kDigit;
    return t;
}

constexpr std::array<bool, 256> kIdentifierBytes = MakeIdentifierBytes();

// The end of the identifier bytes that begin at p. Words end at unpredictable lengths, so a byte-by-byte loop
// costs a mispredicted branch per word; sixteen bytes are classified at once where that many are left.
[[gnu::always_inline]] inline const char* EndOfIdentifier(const char* p, const char* end) {
#if defined(__SSE2__)
    while (end - p >= 16) {
        const __m128i x = _mm_loadu_si128(reinterpret_cast<const __m128i*>(p));
        const __m128i lower = _mm_or_si128(x, _mm_set1_epi8(0x20));
        const __m128i letter =
            _mm_and_si128(_mm_cmpgt_epi8(lower, _mm_set1_epi8('a' - 1)), _mm_cmplt_epi8(lower, _mm_set1_epi8('z' + 1)));
        const __m128i digit =
            _mm_and_si128(_mm_cmpgt_epi8(x, _mm_set1_epi8('0' - 1)), _mm_cmplt_epi8(x, _mm_set1_epi8('9' + 1)));
        const __m128i high = _mm_cmplt_epi8(x, _mm_setzero_si128());  // bytes from 0x80 up
        const __m128i underscore = _mm_cmpeq_epi8(x, _mm_set1_epi8('_'));
        const __m128i word = _mm_or_si128(_mm_or_si128(letter, digit), _mm_or_si128(high, underscore));
        const unsigned others = ~static_cast<unsigned>(_mm_movemask_epi8(word)) & 0xFFFFu;
        if (others != 0) return p + __builtin_ctz(others);
        p += 16;
    }
#endif
    while (p < end && kIdentifierBytes[static_cast<unsigned char>(*p)]) ++p;
    return p;
}

// Where no variable has a name yet, words need no look, and of all bytes only digits, quotes, '+', '/', '@',
// control characters (but tabs, and line feeds unless they need work) and DEL can begin a token that matters.
// Returns the first such byte from p, looking at blocks of sixteen only: a shorter rest is left to the caller.
const char* EndOfQuietBytes(const char* p, const char* end, bool lineFeedsNeedWork) {
#if defined(__SSE2__)
    const __m128i lineFeed = lineFeedsNeedWork ? _mm_setzero_si128() : _mm_set1_epi8('\n');
    while (end - p >= 16) {
        const __m128i x = _mm_loadu_si128(reinterpret_cast<const __m128i*>(p));
        const __m128i ascii = _mm_cmpgt_epi8(x, _mm_set1_epi8(-1));
        const __m128i control = _mm_and_si128(ascii, _mm_cmplt_epi8(x, _mm_set1_epi8(0x20)));
        const __m128i allowed = _mm_or_si128(_mm_cmpeq_epi8(x, _mm_set1_epi8('\t')), _mm_cmpeq_epi8(x, lineFeed));
        const __m128i digit =
            _mm_and_si128(_mm_cmpgt_epi8(x, _mm_set1_epi8('0' - 1)), _mm_cmplt_epi8(x, _mm_set1_epi8('9' + 1)));
        __m128i loud = _mm_or_si128(_mm_andnot_si128(allowed, control), digit);
        for (const char c : {'"', '\'', '+', '/', '@', '\x7f'})
            loud = _mm_or_si128(loud, _mm_cmpeq_epi8(x, _mm_set1_epi8(c)));
        const unsigned mask = static_cast<unsigned>(_mm_movemask_epi8(loud));
        if (mask != 0) return p + __builtin_ctz(mask);
        p += 16;
    }
#else
    (void)end;
    (void)lineFeedsNeedWork;
#endif
    return p;
}

// Inlined into its two callers, each of which fixes `noNames`.
[[gnu::always_inline]] inline PlainTextRun SkipPlainTextIn(const char* p, const char* end, bool lineFeedsNeedWork,
                                                           bool dollarMacrosActive, bool noNames) {
    const char* ordinaryEnd = p;
    while (p < end) {
        if (noNames) {
            // Skip the quiet bytes, then go on from the start of the word the first other byte lies in (a
            // digit or quote inside a word belongs to it), which is where a token begins.
            const char* q = EndOfQuietBytes(p, end, lineFeedsNeedWork);
            while (q > p && kIdentifierBytes[static_cast<unsigned char>(q[-1])]) --q;
            const char* lastToken = q;
            while (lastToken > p && (lastToken[-1] == ' ' || lastToken[-1] == '\t')) --lastToken;
            if (lastToken > p) ordinaryEnd = lastToken;
            p = q;
            if (p == end) break;
        }
        const unsigned char c = static_cast<unsigned char>(*p);
        const LaneClass k = kClasses[c];
        // Words and the blanks between them are most of any text: they take the shortest way.
        if (k == kIdentifier) {
            if (BeginsRawLiteral(p, end)) {
                if (p[1] == '"' && dollarMacrosActive) return {p, ordinaryEnd, nullptr};
                BasicSubString s(p, end);
                LsScanLiteralString(s, p[1], p[1] == '"' ? "double quoted string" : "single quoted string");
                ordinaryEnd = p = s.begin();
                continue;
            }
            const char* q = EndOfIdentifier(p + 1, end);
            if (!noNames && NameFilter::MayContain(BasicSubString(p, q))) return {p, ordinaryEnd, q};
            ordinaryEnd = p = q;
            continue;
        }
        if (k == kBlank) {
            ++p;
            continue;
        }
        switch (k) {
            case kIdentifier:
            case kBlank: continue;  // taken above
            case kLineFeed:
                if (lineFeedsNeedWork) return {p, ordinaryEnd, nullptr};
                ordinaryEnd = ++p;
                continue;
            case kPunctuation: ordinaryEnd = ++p; continue;
            case kDigit:
                if (const char* q = EndOfPlainInteger(p, end)) {
                    ordinaryEnd = p = q;
                    continue;
                }
                [[fallthrough]];
            case kPlus:
            case kSlash: {
                // Operators that may fail, comments and numbers are read by the token scanner itself.
                BasicSubString s(p, end);
                LsScanTokenHelper(s);
                ordinaryEnd = p = s.begin();
                continue;
            }
            case kSingleQuote: {
                BasicSubString s(p, end);
                LsScanLiteralString(s, '\'', "single quoted string");
                ordinaryEnd = p = s.begin();
                continue;
            }
            case kDoubleQuote: {
                if (dollarMacrosActive) return {p, ordinaryEnd, nullptr};
                BasicSubString s(p, end);
                LsScanLiteralString(s, '"', "double quoted string");
                ordinaryEnd = p = s.begin();
                continue;
            }
            case kStop: return {p, ordinaryEnd, nullptr};
        }
    }
    return {p, ordinaryEnd, nullptr};
}

}  // namespace

PlainTextRun SkipPlainText(const char* p, const char* end, bool lineFeedsNeedWork, bool dollarMacrosActive) {
    if (NameFilter::Generation() == 0) return SkipPlainTextIn(p, end, lineFeedsNeedWork, dollarMacrosActive, true);
    return SkipPlainTextIn(p, end, lineFeedsNeedWork, dollarMacrosActive, false);
}

PlainTextRun SkipPlainTextWithoutNames(const char* p, const char* end, bool lineFeedsNeedWork,
                                       bool dollarMacrosActive) {
    return SkipPlainTextIn(p, end, lineFeedsNeedWork, dollarMacrosActive, true);
}

bool DollarMacrosActive(const VarFrame* frame) {
    const FileScopeVarFrame* scope = frame ? frame->GetFileScopeVarFrame() : nullptr;
    return scope && (!scope->dollarMacros.empty() || !scope->importedFiles.empty());
}

bool NamesVariableIn(BasicSubString name, VarFrame* frame) { return frame->Find(name, name.end()) != nullptr; }

bool IsOrdinaryTextIn(BasicSubString text, VarFrame* frame, bool dollarMacrosActive) {
    // The commonest text, one word, is known from the filter of names (and a lookup when it may be one).
    if (IsOneWord(text)) return IsOrdinaryWordIn(text, frame);
    try {
        for (const char* p = text.begin();;) {
            const PlainTextRun run = SkipPlainText(p, text.end(), false, dollarMacrosActive);
            if (run.stop == text.end()) return true;
            if (!run.nameEnd || frame->Find(BasicSubString(run.stop, run.nameEnd), run.nameEnd)) return false;
            p = run.nameEnd;
        }
    } catch (const LexScannerException&) {
        return false;
    }
}

BasicSubString OrdinaryValueOfName(LSVariable* v, VarFrame* frame) {
    auto* m = dynamic_cast<LSMacroVariable*>(v);
    if (!m || m->GetNumArgs() != 0 || m->IsPython() || m->IsNaked() || m->GetReturnType() != LSV_Macro) return {};
    const BasicSubString body = m->GetSubstitutionString();
    VarFrame* context = m->GetContext() ? m->GetContext() : frame;
    if (body.empty() || std::find(body.begin(), body.end(), '\n') != body.end() ||
        !IsOrdinaryTextIn(body, context, DollarMacrosActive(context)))
        return {};
    return body;
}

}  // namespace orvan

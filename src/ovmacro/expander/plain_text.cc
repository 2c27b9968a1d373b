#include "ovmacro/expander/plain_text.h"

#include <array>
#include <cstring>

#include "ovmacro/foundations/scanning.h"
#include "ovmacro/lexer/token_scanner.h"
#include "ovmacro/vars/name_filter.h"

namespace orvan {

namespace {

enum CharClass : unsigned char {
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

constexpr std::array<CharClass, 256> MakeClasses() {
    std::array<CharClass, 256> t{};
    for (int c = 0; c < 256; ++c) {
        if (c >= 0x80 || (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || c == '_') t[c] = kIdentifier;
    }
    // Only blanks and tabs: a carriage return, vertical tab or form feed goes to the main loop, where it ends
    // the blanks before a line feed, so that the token scanner, not the line handling, skips the line end
    // that follows it and the next line keeps its indentation.
    for (char c : {' ', '\t'}) t[static_cast<unsigned char>(c)] = kBlank;
    t['\n'] = kLineFeed;
    for (char c : std::string_view("<>&|^*%!=?-:$#.,;(){}[]~\\`")) t[static_cast<unsigned char>(c)] = kPunctuation;
    t['+'] = kPlus;
    t['/'] = kSlash;
    for (int c = '0'; c <= '9'; ++c) t[c] = kDigit;
    t['\''] = kSingleQuote;
    t['"'] = kDoubleQuote;
    return t;
}

constexpr std::array<CharClass, 256> kClasses = MakeClasses();

}  // namespace

PlainTextRun SkipPlainText(const char* p, const char* end, bool lineFeedsNeedWork, bool dollarMacrosActive) {
    const char* ordinaryEnd = p;
    while (p < end) {
        const unsigned char c = static_cast<unsigned char>(*p);
        switch (kClasses[c]) {
            case kBlank: ++p; continue;
            case kLineFeed:
                if (lineFeedsNeedWork) return {p, ordinaryEnd};
                ordinaryEnd = ++p;
                continue;
            case kPunctuation: ordinaryEnd = ++p; continue;
            case kPlus:
                if (end - p >= 2 && p[1] == '+') {
                    if (end - p >= 3 && p[2] == '=') return {p, ordinaryEnd};  // the scanner reports it
                    p += 2;
                } else {
                    ++p;
                }
                ordinaryEnd = p;
                continue;
            case kSlash: {
                if (end - p >= 2 && p[1] == '/') {
                    const void* lf = std::memchr(p, '\n', static_cast<size_t>(end - p));
                    p = lf ? static_cast<const char*>(lf) : end;
                } else if (end - p >= 2 && p[1] == '*') {
                    const std::string_view rest(p + 2, static_cast<size_t>(end - p - 2));
                    const size_t close = rest.find("*/");
                    if (close == std::string_view::npos) return {p, ordinaryEnd};  // the scanner reports it
                    p += 2 + close + 2;
                } else {
                    ++p;
                }
                ordinaryEnd = p;
                continue;
            }
            case kDigit: {
                BasicSubString s(p, end);
                LsScanNumber(s);
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
                if (dollarMacrosActive) return {p, ordinaryEnd};
                BasicSubString s(p, end);
                LsScanLiteralString(s, '"', "double quoted string");
                ordinaryEnd = p = s.begin();
                continue;
            }
            case kIdentifier: {
                // r or R directly before a quote begins a raw literal, not an identifier.
                if ((c == 'r' || c == 'R') && end - p >= 2 && (p[1] == '"' || p[1] == '\'')) {
                    if (p[1] == '"' && dollarMacrosActive) return {p, ordinaryEnd};
                    BasicSubString s(p, end);
                    LsScanLiteralString(s, p[1], p[1] == '"' ? "double quoted string" : "single quoted string");
                    ordinaryEnd = p = s.begin();
                    continue;
                }
                const char* q = p + 1;
                while (q < end && IsIdentifierChar(*q)) ++q;
                if (NameFilter::MayContain(BasicSubString(p, q))) return {p, ordinaryEnd};
                ordinaryEnd = p = q;
                continue;
            }
            case kStop: return {p, ordinaryEnd};
        }
    }
    return {p, ordinaryEnd};
}

}  // namespace orvan

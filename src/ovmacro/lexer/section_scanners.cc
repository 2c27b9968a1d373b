// Section scanners: arguments, bracketed sections, body blocks, else detection, token equivalence and the
// decoding of quoted strings. Nothing here allocates except error messages and the decoded output.
#include "ovmacro/lexer/section_scanners.h"

#include <algorithm>

#include "ovmacro/foundations/compose.h"
#include "ovmacro/foundations/scanning.h"
#include "ovmacro/lexer/bracket_index.h"
#include "ovmacro/lexer/char_classes.h"
#include "ovmacro/lexer/exceptions.h"
#include "ovmacro/lexer/token_scanner.h"

namespace orvan {

namespace {

using HR = HumanReadableCharInSubString;

[[noreturn]] void Fail(StringStream& ss, const char* position) {
    throw LexScannerException(ss.GetString(), position);
}

[[noreturn]] void Fail(const basic_xstring& message, const char* position) {
    throw LexScannerException(message, position);
}

// The character of a bracket kind.
char BracketChar(EToken bracket) {
    switch (bracket) {
        case TK_LPAREN: return '(';
        case TK_RPAREN: return ')';
        case TK_LBRACE: return '{';
        case TK_RBRACE: return '}';
        case TK_LBRACKET: return '[';
        default: return ']';
    }
}

// The closing partner of an opening bracket kind, or TK_NONE for any other kind.
EToken ClosingPartner(EToken open) {
    switch (open) {
        case TK_LPAREN:
            return TK_RPAREN;
        case TK_LBRACE:
            return TK_RBRACE;
        case TK_LBRACKET:
            return TK_RBRACKET;
        default:
            return TK_NONE;
    }
}

const char* OpeningText(EToken open) {
    switch (open) {
        case TK_LPAREN:
            return "(";
        case TK_LBRACE:
            return "{";
        case TK_LBRACKET:
            return "[";
        case TK_LT:
            return "<";
        default:
            return "Opening bracket";
    }
}

[[noreturn]] void FailExpectedOpen(const char* openText, const LSToken& found) {
    StringStream ss;
    ss << "Expected " << openText << " when read " << found;
    throw LexScannerException(ss.GetString(), found);
}

void SkipBlanksWithoutLinefeed(BasicSubString& s) {
    const char* p = std::find_if_not(s.begin(), s.end(), IsWhiteSpaceWithoutLinefeed);
    s.SetBegin(p);
}

// Reads tokens after an opening bracket up to its matching closing bracket and returns that closing token;
// `s` is left after it. At the end of the input `eosMessage` (+ `eosSuffix`) is raised there. In deeply
// nested expansions the ends of the brackets passed are recorded, and a recorded end is taken as it is.
LSToken ScanToMatchingClose(BasicSubString& s, const char* afterOpen, EToken open, EToken close,
                            const char* eosMessage, const char* eosSuffix, const char** insideEnd = nullptr) {
    const bool recording = BracketScope::Recording();
    LSToken found;
    const char* lastEnd = afterOpen;  // the end of the last token read inside
    if (recording && BracketScope::FindClose(afterOpen, found, lastEnd) && found.type == close) {
        s.SetBegin(found.text.end());
        if (insideEnd) *insideEnd = lastEnd;
        return found;
    }
    xvector<const char*> opens;  // the ends of the opening brackets still open, outermost first
    if (recording) opens.push_back(afterOpen);
    int64 depth = 1;
    for (;;) {
        const LSToken t = LsScanToken(s, false);
        if (t.type == TK_EOS) {
            StringStream ss;
            ss << eosMessage << eosSuffix;
            Fail(ss, s.end());
        }
        if (t.type == open) {
            ++depth;
            if (recording) opens.push_back(t.text.end());
        } else if (t.type == close) {
            if (recording) {
                BracketScope::RecordClose(opens.back(), t, std::max(lastEnd, opens.back()));
                opens.pop_back();
            }
            if (--depth == 0) {
                if (insideEnd) *insideEnd = lastEnd;
                return t;
            }
        }
        lastEnd = t.text.end();
    }
}

BasicSubString ScanBlockForm(BasicSubString& s, int64& indent, EToken open, EToken close,
                             const char* openText, const char* closeText) {
    const LSToken t = LsScanToken(s, false);
    if (t.type != open) FailExpectedOpen(openText, t);
    SkipBlanksWithoutLinefeed(s);
    if (!s.empty() && s.front() == '\n') s.Advance(1);
    while (!s.empty() && (s.front() == ' ' || s.front() == '\t')) {
        indent += s.front() == ' ' ? 1 : 4;
        s.Advance(1);
    }
    const char* begin = s.begin();
    const LSToken closing = ScanToMatchingClose(s, t.text.end(), open, close, "Met EOS before closing ", closeText);

    // The line break and indentation in front of a closing bracket on a line of its own are layout, not
    // content. The look-back stops at the block's beginning: whatever lies before it is not part of the
    // block.
    const char* p = closing.text.begin();
    while (p > begin && (p[-1] == ' ' || p[-1] == '\t')) --p;
    if (p > begin && p[-1] == '\n') {
        --p;
        if (p > begin && p[-1] == '\r') --p;
    }
    return BasicSubString(begin, p);
}

BasicSubString ScanInlineForm(BasicSubString& s, EToken open, EToken close, const char* openText,
                              const char* closeText, bool openRequired) {
    const char* first = s.begin();
    const LSToken t = LsScanToken(s, false);
    if (t.type != open) {
        if (openRequired) FailExpectedOpen(openText, t);
        const char* lineEnd = std::find_if(first, s.end(), [](char c) { return c == '\r' || c == '\n'; });
        s.SetBegin(lineEnd);
        return BasicSubString(first, lineEnd);
    }
    if (s.empty()) {
        StringStream ss;
        ss << "Met EOS before closing " << closeText;
        Fail(ss, s.end());
    }
    // A line break right after the opening bracket, in either convention, only lays the block out.
    if (s.front() == '\r') s.Advance(1);
    if (!s.empty() && s.front() == '\n') s.Advance(1);
    const char* begin = s.begin();
    const LSToken closing =
        ScanToMatchingClose(s, t.text.end(), open, close, "Met EOS while reading bracketted string", "");
    return BasicSubString(begin, closing.text.begin());
}

// Reads "@" and a word; true when the word is `word`.
bool ScanAtWord(BasicSubString& s, const char* word) {
    if (LsScanToken(s, false).type != TK_AT) return false;
    const LSToken t = LsScanToken(s, false);
    return t.type == TK_IDENTIFIER && t.text == word;
}

// Decodes the quoted string at the start of s, writing to os when it is not null. Runs of plain characters
// go out in one write.
void DecodeQuotedString(BasicSubString s, xostream* os, const char* endName) {
    if (s.empty()) Fail("Expected quoted string", s.begin());
    const char quote = s.front();
    if (quote != '"' && quote != '\'') {
        StringStream ss;
        ss << s << " isn't a quoted string";
        Fail(ss, s.begin());
    }
    s.Advance(1);
    if (s.empty()) Fail("Expected quoted string", s.begin());
    const char* run = s.begin();
    for (;;) {
        if (s.empty()) Fail(Compose("Met ", endName, " in middle of string"), s.end());
        const char c = s.front();
        if (c == quote) break;
        if (c == '\n') Fail("Met end of line in middle of string", s.begin());
        if (c != '\\') {
            s.Advance(1);
            continue;
        }
        if (os) os->put(run, s.begin() - run);
        s.Advance(1);
        if (s.empty()) Fail(Compose("Met ", endName, " in middle of string"), s.end());
        char decoded = 0;
        if (s.front() == 'x') {
            s.Advance(1);
            int value = 0;
            for (int i = 0; i < 2; ++i) {
                if (s.empty()) Fail(Compose("Expected hex character when reached ", endName), s.end());
                if (!IsHexDigit(s.front())) {
                    StringStream ss;
                    ss << "Expected hex character when read " << HR(s);
                    Fail(ss, s.begin());
                }
                value = value * 16 + MapHexDigit(s.front());
                s.Advance(1);
            }
            decoded = static_cast<char>(static_cast<unsigned char>(value));
        } else {
            if (!MapEscapeCharacter(s.front(), decoded)) {
                StringStream ss;
                ss << HR(s) << "is not a valid escape character";
                Fail(ss, s.begin());
            }
            s.Advance(1);
        }
        if (os) os->put(decoded);
        run = s.begin();
    }
    if (os) os->put(run, s.begin() - run);
}

// Skips the tokens of an argument that can neither fail nor open, close or end anything (names, plain
// integers, quoted literals, operators, the punctuation "#.;~\\`", and inside a group of brackets any
// comma or bracket but the group's own `open` and `close`) and the white space between them, and stops
// before any other, which the token scanner reads. Returns the end of the last token skipped, or null.
const char* SkipQuietTokens(BasicSubString& s, char open, char close) {
    const char* p = s.begin();
    const char* const end = s.end();
    const char* last = nullptr;
    while (p < end) {
        if (*p == ' ') {  // the commonest byte between tokens
            ++p;
            continue;
        }
        switch (ClassOf(*p)) {
            case CharClass::kWhiteSpace:
            case CharClass::kLineFeed: ++p; continue;
            case CharClass::kIdentifier:
                if (BeginsRawLiteral(p, end)) break;
                for (++p; p < end && IsIdentifierChar(*p);) ++p;
                last = p;
                continue;
            case CharClass::kDigit:
                if (const char* q = EndOfPlainInteger(p, end)) {
                    last = p = q;
                    continue;
                }
                break;
            case CharClass::kOperator: last = ++p; continue;
            case CharClass::kSingle:
                if (open ? *p == open || *p == close
                         : *p == ',' || *p == '(' || *p == ')' || *p == '[' || *p == ']' || *p == '{' || *p == '}')
                    break;
                last = ++p;
                continue;
            case CharClass::kSingleQuote:
            case CharClass::kDoubleQuote: {
                BasicSubString literal(p, end);
                LsScanLiteralString(literal, *p, *p == '\'' ? "single quoted string" : "double quoted string");
                last = p = literal.begin();
                continue;
            }
            default: break;
        }
        break;
    }
    s.SetBegin(p);
    return last;
}

LSToken ScanArgumentIn(BasicSubString& s, BasicSubString& arg, EToken terminator, bool skipQuietTokens) {
    ScanWhiteSpace(s);
    const char* start = s.begin();

    if (!s.empty() && s.front() == '`') {
        const char* closeQuote = std::find(start + 1, s.end(), '`');
        if (closeQuote == s.end()) {
            s.SetBegin(s.end());
            StringStream ss;
            ss << "Met EOS while reading argument " << BasicSubString(start, s.end());
            Fail(ss, s.end());
        }
        arg = BasicSubString(start + 1, closeQuote);
        s.SetBegin(closeQuote + 1);
        return LsScanToken(s, false);
    }

    // Most arguments are one name followed by the comma or the terminator: read those without tokens. An
    // identifier absorbs every letter, digit and '_' that follows it, so the token scanner would read the
    // same name; anything else goes the general way below.
    if (!s.empty() && IsIdentifierStart(*start) &&
        !((*start == 'r' || *start == 'R') && s.size() >= 2 && (start[1] == '"' || start[1] == '\''))) {
        const char* p = start + 1;
        while (p < s.end() && IsIdentifierChar(*p)) ++p;
        const char* nameEnd = p;
        while (p < s.end() && IsWhiteSpace(*p)) ++p;
        const EToken kind = p == s.end() ? TK_NONE : (*p == ',' ? TK_COMMA : (*p == ')' ? TK_RPAREN : TK_NONE));
        if (kind != TK_NONE && (kind == TK_COMMA || kind == terminator)) {
            arg = BasicSubString(start, nameEnd);
            s.SetBegin(p + 1);
            return LSToken(kind, p, p + 1);
        }
    }

    arg = BasicSubString(start, start);
    // Only one bracket kind is counted at a time, so "(a[b)" is one balanced group. In deeply nested
    // expansions the ends of the groups are recorded and taken (see BracketScope).
    const bool recording = BracketScope::Recording();
    xvector<const char*> opens;
    EToken trackedOpen = TK_NONE;
    EToken trackedClose = TK_NONE;
    int64 depth = 0;
    for (;;) {
        arg.SetEnd(s.begin());
        if (skipQuietTokens) {
            // Inside a group only its own brackets count, unless their ends are being recorded.
            const bool grouped = depth > 0 && !recording;
            const char open = grouped ? BracketChar(trackedOpen) : '\0';
            if (const char* quietEnd = SkipQuietTokens(s, open, grouped ? BracketChar(trackedClose) : '\0'))
                arg.SetEnd(quietEnd);
        }
        const LSToken t = LsScanToken(s, false);
        if (t.type == TK_EOS) {
            StringStream ss;
            ss << "Met EOS while reading argument " << BasicSubString(start, s.end());
            Fail(ss, s.end());
        }
        if (depth == 0) {
            if (t.type == TK_COMMA || t.type == terminator) return t;
            const EToken partner = ClosingPartner(t.type);
            LSToken recorded;
            const char* insideEnd = nullptr;
            if (partner != TK_NONE && recording && BracketScope::FindClose(t.text.end(), recorded, insideEnd) &&
                recorded.type == partner) {
                s.SetBegin(recorded.text.end());
            } else if (partner != TK_NONE) {
                trackedOpen = t.type;
                trackedClose = partner;
                depth = 1;
                if (recording) opens.push_back(t.text.end());
            }
        } else if (t.type == trackedOpen) {
            ++depth;
            if (recording) opens.push_back(t.text.end());
        } else if (t.type == trackedClose) {
            --depth;
            if (recording) {
                BracketScope::RecordClose(opens.back(), t, std::max(arg.end(), opens.back()));
                opens.pop_back();
            }
        }
    }
}

}  // namespace

LSToken ScanArgument(BasicSubString& s, BasicSubString& arg, EToken terminator) {
    // Quiet tokens are those that cannot be the terminator either: a closing bracket, as for every caller.
    return ScanArgumentIn(s, arg, terminator, terminator == TK_RPAREN || terminator == TK_RBRACKET);
}

LSToken ScanArgumentTokenByToken(BasicSubString& s, BasicSubString& arg, EToken terminator) {
    return ScanArgumentIn(s, arg, terminator, false);
}

BasicSubString ScanBrackettedSection(BasicSubString& s, bool readOpen, EToken open, EToken close) {
    if (readOpen) {
        const LSToken t = LsScanToken(s, false);
        if (t.type != open) {
            StringStream ss;
            ss << OpeningText(open) << " expected when read " << t;
            throw LexScannerException(ss.GetString(), t);
        }
    }
    const char* afterOpen = s.begin();
    ScanWhiteSpace(s);
    // Leading comments belong to the section; trailing white space and comments do not: it ends with the end
    // of the last token inside.
    const char* begin = s.begin();
    const char* insideEnd = begin;
    ScanToMatchingClose(s, afterOpen, open, close, "Met EOS while reading bracketted section", "", &insideEnd);
    return BasicSubString(begin, std::max(begin, insideEnd));
}

BasicSubString ScanRndBrackettedSection(BasicSubString& s, bool readOpen) {
    return ScanBrackettedSection(s, readOpen, TK_LPAREN, TK_RPAREN);
}

BasicSubString ScanSquareBrackettedSection(BasicSubString& s, bool readOpen) {
    return ScanBrackettedSection(s, readOpen, TK_LBRACKET, TK_RBRACKET);
}

BasicSubString ScanCurlyBrackettedSection(BasicSubString& s, bool readOpen) {
    return ScanBrackettedSection(s, readOpen, TK_LBRACE, TK_RBRACE);
}

BasicSubString ScanStringBlock(BasicSubString& s, int64& indent, EToken open, EToken close,
                               const char* openText, const char* closeText, bool openRequired) {
    indent = 0;
    SkipBlanksWithoutLinefeed(s);
    if (s.empty()) {
        StringStream ss;
        ss << "Expected " << openText << " when read EOS";
        Fail(ss, s.end());
    }
    if (s.front() == '\n') return ScanBlockForm(s, indent, open, close, openText, closeText);
    return ScanInlineForm(s, open, close, openText, closeText, openRequired);
}

BasicSubString ScanSubstString(BasicSubString& s, int64& indent) {
    return ScanStringBlock(s, indent, TK_LBRACE, TK_RBRACE, "{", "}", false);
}

BasicSubString ScanRndBrackettedString(BasicSubString& s, int64& indent) {
    return ScanStringBlock(s, indent, TK_LPAREN, TK_RPAREN, "(", ")", true);
}

bool ScanElseBlock(BasicSubString& s) {
    return ScanAtWord(s, "else");
}

bool ScanElseIfBlock(BasicSubString& s) {
    return ScanAtWord(s, "elseif");
}

bool SubStringsAreTokenEquivalent(BasicSubString a, BasicSubString b) {
    for (;;) {
        const LSToken ta = LsScanToken(a, false);
        const LSToken tb = LsScanToken(b, false);
        if (ta.type == TK_EOS) return tb.type == TK_EOS;
        if (ta.type != tb.type || ta.text != tb.text) return false;
    }
}

void UnstringifyQuotedString(BasicSubString s, xostream& os, const char* endName) {
    DecodeQuotedString(s, nullptr, endName);
    DecodeQuotedString(s, &os, endName);
}

int64 ScanBackwardsThroughSpacesAndTabs(BasicSubString& s) {
    int64 width = 0;
    while (!s.empty() && (s.back() == ' ' || s.back() == '\t')) {
        width += s.back() == ' ' ? 1 : 4;
        s.SetEnd(s.end() - 1);
    }
    return width;
}

}  // namespace orvan

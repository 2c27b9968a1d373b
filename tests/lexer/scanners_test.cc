// The scanners case by case, each input in an exact-size buffer so that AddressSanitizer reports a read past
// its end. Scanning errors that a template reaches are golden cases; here are those that only a call shows.
#include <gtest/gtest.h>

#include <random>
#include <sstream>

#include "ovmacro/lexer/section_scanners.h"
#include "ovmacro/lexer/token_scanner.h"
#include "support/test_support.h"

namespace orvan {
namespace {

using namespace std::string_literals;
using std::to_string;
using Scanner = std::string (*)(BasicSubString&);
std::string Str(BasicSubString v) { return std::string(v.view()); }

// What scan found, "|" and what it left of text; or "LINE:COLUMN MESSAGE" of the error it raised.
std::string Outcome(Scanner scan, const std::string& text) {
    const testing::ExactBuffer buf(text);
    BasicSubString s = buf.view();
    try {
        const std::string found = scan(s);
        return found + "|" + Str(s);
    } catch (const LexScannerException& e) {
        const int64 at = buf.Offset(e.GetPosition());
        return (at < 0 ? "-" : testing::LineColumn(text, text.data() + at)) + " " + e.GetMessage();
    }
}

// The tokens, kinds marked: n: name, i: int, x: hex, f: float, s: d: quoted, c: comment, a: "@" comment.
template <bool comments>
std::string Toks(BasicSubString& s) {
    std::string out;
    for (LSToken t = LsScanToken(s, comments); t; t = LsScanToken(s, comments)) {
        if (!out.empty()) out += ' ';
        if (t.type < TK_LT) out += std::string(1, "caixfsdn"[t.type - TK_COMMENT]) + ":";
        out += t.GetTokenString();
    }
    return out;
}
// A literal's value: an integer in 64 and in 32 bits, or the characters of a string.
std::string Value(BasicSubString& s) {
    const LSToken t = LsScanToken(s, false);
    basic_xstring text = "old";
    if (t.type == TK_INT) return to_string(t.GetLiteralInt64()) + "," + to_string(t.GetLiteralInt32());
    if (t.type != TK_HEX_INT) return t.GetLiteralString(text), text;
    return to_string(t.GetLiteralHexInt64()) + "," + to_string(t.GetLiteralHexInt32());
}
std::string Char(BasicSubString& s) {
    const char* begin = s.begin();
    LsScanLiteralCharacter(s);
    return std::string(1, LSToken(TK_SQ_STRING, begin, s.begin()).GetLiteralCharacter());
}
std::string Given(BasicSubString& s) { return ReadGivenToken(s, TK_LPAREN, "( needed"), ""; }
template <EToken terminator>
std::string Arg(BasicSubString& s) {
    BasicSubString arg;
    const LSToken end = ScanArgument(s, arg, terminator);
    return Str(arg) + "|" + end.GetTokenString();
}
template <EToken terminator>
std::string ArgByTokens(BasicSubString& s) {
    BasicSubString arg;
    const LSToken end = ScanArgumentTokenByToken(s, arg, terminator);
    return Str(arg) + "|" + end.GetTokenString();
}
std::string Round(BasicSubString& s) { return Str(ScanRndBrackettedSection(s, true)); }
std::string RoundIn(BasicSubString& s) { return Str(ScanRndBrackettedSection(s, false)); }
template <BasicSubString (*scan)(BasicSubString&, int64&)>
std::string Block(BasicSubString& s) {
    int64 indent = -1;
    const std::string block = Str(scan(s, indent));
    return block + "|" + to_string(indent);
}
std::string Else(BasicSubString& s) { return ScanElseBlock(s) ? "else" : "no"; }
std::string ElseIf(BasicSubString& s) { return ScanElseIfBlock(s) ? "elseif" : "no"; }
// How many ways round the input and a fixed text are the same tokens.
std::string Same(BasicSubString& s) {
    const testing::ExactBuffer o("f(0x1F, \"x\")");
    const int n = SubStringsAreTokenEquivalent(s, o.view()) + SubStringsAreTokenEquivalent(o.view(), s);
    return s.SetBegin(s.end()), to_string(n);
}
std::string Unquote(BasicSubString& s) {
    StringStream ss;
    return UnstringifyQuotedString(s, ss), s.SetBegin(s.end()), ss.GetString();
}
std::string Trail(BasicSubString& s) { return to_string(ScanBackwardsThroughSpacesAndTabs(s)); }
const Scanner ArgP = Arg<TK_RPAREN>, ArgS = Arg<TK_RBRACKET>, ArgSemi = Arg<TK_SEMICOLON>,
              Subst = Block<ScanSubstString>, RndStr = Block<ScanRndBrackettedString>;

TEST(Scanners, EveryOperatorHasItsKindFollowedOrAtTheEnd) {  // listed in the order of their kinds
    std::istringstream ops("< > & | ^ <= >= &= |= ^= << >> && || ^^ <<= >>= &&= ||= ^^= + - * / % ! = ? ++ "
                           "-- += -= *= /= %= != == ?= -> : :: $ $$ . , ; ( ) { } [ ] ~ @ \\ ` #");
    int kind = TK_LT;
    for (std::string op; ops >> op; ++kind)
        for (const std::string& text : {op + "b", op}) {
            BasicSubString s(text);
            const LSToken t = LsScanToken(s, false);
            EXPECT_TRUE(t.type == kind && t.GetTokenString() == op) << text;
        }
    EXPECT_EQ(kind, TK_HASH + 1);
}

TEST(Scanners, FindWhatTheyScanAndLeaveTheRest) {
    const struct { Scanner scan; const char* text; std::string result; } cases[] = {
        // Tokens end where their syntax ends; r or R right before a quote makes a raw literal.
        {Toks<false>, "a---b <<< ::: r R", "n:a -- - n:b << < :: : n:r n:R|"},
        {Toks<false>, "017 00x1 0x1g 1ab 0XaF.5 0", "i:017 i:00 n:x1 x:0x1 n:g i:1 n:ab x:0XaF . i:5 i:0|"},
        {Toks<false>, "1.25.5 1e5 1E-3x 1.5e+10 -2", "f:1.25 . i:5 f:1e5 f:1E-3 n:x f:1.5e+10 - i:2|"},
        {Toks<false>, "'' \"a\\\"b\"c '\\'' \"a'b\" r\"a\\\" R'a\\' rx\"\"",
         "s:'' d:\"a\\\"b\" n:c s:'\\'' d:\"a'b\" d:r\"a\\\" s:R'a\\' n:rx d:\"\"|"},
        {Toks<false>, "_09azAZ \x80\xC3\xA9\t\v\f\r\nb // c )\nc/* x\n*/d/*/ */e /* f /* g */ h */",
         "n:_09azAZ n:\x80\xC3\xA9 n:b n:c n:d n:e n:h * /|"},
        {Toks<false>, "@// n\nx @/* c */y @ // c", "a:@// n n:x a:@/* c */ n:y @|"},
        {Toks<false>, "@/ @@//x", "@ / @ a:@//x|"}, {Toks<false>, "@//", "a:@//|"},
        {Toks<true>, "a // one\n/* two */ b", "n:a c:// one c:/* two */ n:b|"},
        // Decimal integers wrap modulo their width; hex ones keep their low bits.
        {Value, "2147483648", "2147483648,-2147483648|"}, {Value, "0x10000000000000002", "2,2|"},
        {Value, "9223372036854775808", "-9223372036854775808,0|"}, {Value, "0x1FFFFFFFF", "8589934591,-1|"},
        {Value, "0x09afAF", "634799,634799|"}, {Value, "R'a\\x41'", "a\\x41|"},
        {Value, "'\\n\\t\\r\\0\\a\\b\\f\\v'", "\n\t\r\0\a\b\f\v|"s},
        {Value, "\"a\\x4a\\\\\\\"\\'\\?\\x4A\\xff\"", "aJ\\\"'?J\xff|"}, {Given, "  f(", "1:3 ( needed"},
        {Char, "'a'", "a|"}, {Char, "'\\n' x", "\n| x"}, {Char, "'\\x41'", "A|"},
        {Given, " /* c */ ( x", "| x"}, {Given, " // c", "1:6 ( needed"},
        {Char, "'\t'", "1:2 Read \\x09 while trying to read literal character enclosed in single quotes"},
        {Char, "'ab'", "1:3 Expected second single quote (not b) for literal character"},
        // Arguments: to a comma or the terminator outside brackets of one kind; `quoted`, as they are.
        {ArgP, "(x, (y)) )", "(x, (y))|)|"}, {ArgP, "(a[b), c", "(a[b)|,| c"}, {ArgP, "`a(` b", "a(|b|"},
        {ArgSemi, "(a; b); c", "(a; b)|;| c"}, {ArgP, " \n a + b /* c */ ) d", "a + b|)| d"},
        {ArgP, " `(a, \"` , b", "(a, \"|,| b"}, {ArgP, "a, b)", "a|,| b)"}, {ArgS, "a) ]", "a)|]|"},
        {ArgS, "_x9\r\n\v\f, x", "_x9|,| x"}, {ArgP, "a]", "1:3 Met EOS while reading argument a]"},
        {Round, "( a + (b) ) rest", "a + (b)| rest"}, {RoundIn, " a) b", "a| b"}, {Round, "(  \n )x", "|x"},
        {Round, "(/* l */ a /* t */ ) x", "/* l */ a| x"},
        // Blocks inline: from the bracket and a line break after it to its partner, or the rest of the line.
        {Subst, " {abc}", "abc|0|"}, {Subst, " {\r\n a\r\n} x", " a\r\n|0| x"}, {RndStr, " (x) y", "x|0| y"},
        {Subst, " a\nb", "a|0|\nb"}, {Subst, " a  \r\nb", "a  |0|\r\nb"}, {Subst, " // c\nx", "// c|0|\nx"},
        // Block form: the first line's indentation measured (tab 4), the layout before the bracket dropped.
        {Subst, "\n{\n    a\n    b\n}", "a\n    b|4|"}, {Subst, "  \n{\n  \tx\n  } after", "x|6| after"},
        {Subst, "\r\n{\r\n  a\r\n}", "a|2|"}, {Subst, "\n{\n  a b }", "a b|2|"}, {Subst, "\n{  x\n}", "x|0|"},
        {Subst, "\n{\n    }", "|4|"}, {Subst, "\n{\n\n}", "|0|"}, {Subst, "\n // c\n {\n x\n } z", "x|1| z"},
        {Else, " \n @ /* c */ else {x}", "else| {x}"}, {Else, "@/* c */else", "no|else"},
        {Else, "@ if", "no|"}, {Else, "@elsewhere", "no|"}, {ElseIf, "@elseif (x)", "elseif| (x)"},
        {ElseIf, "@ else", "no|"}, {Same, "f ( 0x1F,\"x\"\n)// c", "2|"}, {Same, "f(0x1f, \"x\")", "0|"},
        {Same, "f(0x1F, 'x')", "0|"}, {Same, "f(0x1F,", "0|"}, {Trail, "ab \t ", "6|ab"},
        {Trail, "a\n ", "1|a\n"}, {Unquote, "\"a\\n\\x4A\\xff\" trailing", "a\nJ\xff|"},
        {Unquote, "\"\\x00z\\t\\0\\?\"", "\0z\t\0?|"s},
        {Unquote, "r\"a\"", "1:1 r\"a\" isn't a quoted string"},
        {Unquote, "'ab\"", "1:5 Met EOS in middle of string"},
        {Unquote, "\"ab\ncd\"", "1:4 Met end of line in middle of string"},
        {Unquote, "\"ab\\q\"", "1:5 qis not a valid escape character"},
        {Unquote, "\"\\xg1\"", "1:4 Expected hex character when read g"},
    };
    for (const auto& c : cases) EXPECT_EQ(Outcome(c.scan, c.text), c.result) << c.text;
}

// Every prefix of these texts, given to every scanner, gives a result or an error placed within it, and never
// a read outside it.
TEST(Scanners, EveryPrefixIsHandledWithinTheInput) {
    for (const std::string text : {"`a, (b` , f(x, [y]), {z}) rest", "( a + (b /* ) */) \")\" ) rest",
                                   "\n{\r\n\t'x' \"y\\n\"\r\n }\r\n@ else {a}", " {\r\n a {d} // }\n}@elseif",
                                   "\"a\\n\\x41\\\\\" '\\x4' r'x' 1.5e+3 0x1f @/*"})
        for (size_t n = 0; n <= text.size(); ++n)
            for (Scanner scan : {Toks<true>, Value, Char, Given, ArgP, ArgS, Round, RoundIn, Subst, RndStr,
                                 Else, ElseIf, Same, Unquote, Trail})
                EXPECT_NE(Outcome(scan, text.substr(0, n)).substr(0, 2), "- ") << text.substr(0, n);
}

// Arguments skip the tokens that cannot matter without reading them one by one: random texts from the bytes
// that do matter end where the token scanner ends them, with the same errors.
TEST(Scanners, ArgumentsEndWhereTheTokenScannerEndsThem) {
    const std::string alphabet = "aarR_x9 \t\n,,(()[]]{}.;#~`-<+/*\"\"''\\@\x01\xc3";
    std::mt19937 random(2468);
    std::uniform_int_distribution<size_t> pick(0, alphabet.size() - 1);
    std::uniform_int_distribution<int> length(0, 24);
    for (int i = 0; i < 20000 && !HasFailure(); ++i) {
        std::string text;
        for (int n = length(random); n > 0; --n) text += alphabet[pick(random)];
        EXPECT_EQ(Outcome(ArgP, text), Outcome(ArgByTokens<TK_RPAREN>, text)) << ::testing::PrintToString(text);
        EXPECT_EQ(Outcome(ArgS, text), Outcome(ArgByTokens<TK_RBRACKET>, text)) << ::testing::PrintToString(text);
    }
}

}  // namespace
}  // namespace orvan

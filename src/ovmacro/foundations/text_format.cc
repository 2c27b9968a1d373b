#include "ovmacro/foundations/text_format.h"

#include <charconv>
#include <cmath>

#include "ovmacro/foundations/scanning.h"

namespace orvan {

basic_xstring ToString(int v) { return std::to_string(v); }
basic_xstring ToString(long v) { return std::to_string(v); }
basic_xstring ToString(long long v) { return std::to_string(v); }

int64 FormatDouble(double v, char* buf) {
    if (std::isnan(v)) {
        std::memcpy(buf, "nan", 3);
        return 3;
    }
    if (std::isinf(v)) {
        if (v < 0) {
            std::memcpy(buf, "-inf", 4);
            return 4;
        }
        std::memcpy(buf, "inf", 3);
        return 3;
    }
    auto r = std::to_chars(buf, buf + 36, v);
    int64 n = r.ptr - buf;
    bool looksIntegral = true;
    for (int64 i = 0; i < n; ++i)
        if (buf[i] != '-' && (buf[i] < '0' || buf[i] > '9')) looksIntegral = false;
    if (looksIntegral) {
        buf[n++] = '.';
        buf[n++] = '0';
    }
    return n;
}

basic_xstring ToString(double v) {
    char buf[40];
    return basic_xstring(buf, static_cast<size_t>(FormatDouble(v, buf)));
}

namespace {

// In a character literal a control byte is written as a two-digit hex escape, which the token scanner reads
// back to the byte (it knows no octal escapes) and which C reads unambiguously before the closing quote. In
// a string literal it is three-digit octal, because a C hex escape would swallow the hex digits that follow.
void WriteEscapedChar(xostream& os, char c, char quote) {
    const unsigned char u = static_cast<unsigned char>(c);
    switch (c) {
        case '\n': os << "\\n"; return;
        case '\r': os << "\\r"; return;
        case '\t': os << "\\t"; return;
        case '\\': os << "\\\\"; return;
        default: break;
    }
    if (c == quote) {
        const char esc[2] = {'\\', c};
        os.put(esc, 2);
    } else if ((u < 0x20 || u == 0x7f) && quote == '\'') {
        static constexpr char kHex[] = "0123456789ABCDEF";
        const char esc[4] = {'\\', 'x', kHex[u >> 4], kHex[u & 15]};
        os.put(esc, 4);
    } else if (u < 0x20 || u == 0x7f) {
        const char esc[4] = {'\\', static_cast<char>('0' + (u >> 6)), static_cast<char>('0' + ((u >> 3) & 7)),
                             static_cast<char>('0' + (u & 7))};
        os.put(esc, 4);
    } else {
        os.put(c);
    }
}

}  // namespace

void WriteCharForCStyleLiteralConstants(xostream& os, char c) { WriteEscapedChar(os, c, '"'); }

void WriteTextForCStyleLiteralConstants(xostream& os, BasicSubString text) {
    const char* run = text.begin();
    for (const char* p = text.begin(); p < text.end(); ++p) {
        const unsigned char u = static_cast<unsigned char>(*p);
        if (u >= 0x20 && u != 0x7f && u != '"' && u != '\\') continue;
        os.put(run, p - run);  // the characters that stand for themselves go out in one run
        WriteEscapedChar(os, *p, '"');
        run = p + 1;
    }
    os.put(run, text.end() - run);
}

basic_xstring MakeDoubleQuotedString(BasicSubString text) {
    StringStream ss(static_cast<size_t>(text.size()) + 2);
    ss.put('"');
    for (char c : text.view()) WriteEscapedChar(ss, c, '"');
    ss.put('"');
    return ss.GetString();
}

basic_xstring MakeSingleQuotedLiteralChar(char c) {
    StringStream ss(8);
    ss.put('\'');
    WriteEscapedChar(ss, c, '\'');
    ss.put('\'');
    return ss.GetString();
}

void WriteSubStringWithAdjustedIndent(xostream& os, BasicSubString text, int64 indent) {
    BasicSubString rest = text;
    while (rest) {
        const char* lf = static_cast<const char*>(std::memchr(rest.begin(), '\n', static_cast<size_t>(rest.size())));
        const char* lineEnd = lf ? lf + 1 : rest.end();
        os.put(rest.begin(), lineEnd - rest.begin());
        rest.SetBegin(lineEnd);
        if (lf) ScanIndentation(rest, indent, 4);
    }
}

int64 StringFindAndReplace(basic_xstring& text, std::string_view what, std::string_view with) {
    if (what.empty()) return 0;
    int64 count = 0;
    size_t pos = text.find(what);
    if (pos == basic_xstring::npos) return 0;
    basic_xstring out;
    out.reserve(text.size());
    size_t from = 0;
    while (pos != basic_xstring::npos) {
        out.append(text, from, pos - from);
        out.append(with);
        from = pos + what.size();
        ++count;
        pos = text.find(what, from);
    }
    out.append(text, from, basic_xstring::npos);
    text.swap(out);
    return count;
}

}  // namespace orvan

#include "ovmacro/foundations/stream.h"

#include <charconv>

#include "ovmacro/foundations/text_format.h"

namespace orvan {

void xostream::WriteIndented(const char* p, int64 n) {
    static constexpr char kBlanks[] = "                                ";
    const char* end = p + n;
    while (p < end) {
        if (atLineStart_) {
            for (int64 left = indent_; left > 0;) {
                const int64 chunk = left < 32 ? left : 32;
                DoWrite(kBlanks, static_cast<size_t>(chunk));
                left -= chunk;
            }
            atLineStart_ = false;
        }
        const char* lf = static_cast<const char*>(std::memchr(p, '\n', static_cast<size_t>(end - p)));
        const char* runEnd = lf ? lf + 1 : end;
        DoWrite(p, static_cast<size_t>(runEnd - p));
        if (lf) atLineStart_ = true;
        p = runEnd;
    }
}

xostream& operator<<(xostream& os, std::string_view s) { return os.put(s.data(), static_cast<int64>(s.size())); }

xostream& operator<<(xostream& os, long long v) {
    char buf[24];
    auto r = std::to_chars(buf, buf + sizeof buf, v);
    return os.put(buf, r.ptr - buf);
}

xostream& operator<<(xostream& os, unsigned long long v) {
    char buf[24];
    auto r = std::to_chars(buf, buf + sizeof buf, v);
    return os.put(buf, r.ptr - buf);
}

xostream& operator<<(xostream& os, double v) {
    char buf[40];
    const int64 n = FormatDouble(v, buf);
    return os.put(buf, n);
}

xostream& xcout() {
    static FileStream s(stdout);
    return s;
}

xostream& xcerr() {
    static FileStream s(stderr);
    return s;
}

TracerX::~TracerX() {
    const basic_xstring& text = str();
    if (!text.empty()) {
        std::fwrite(text.data(), 1, text.size(), stderr);
        std::fflush(stderr);
    }
}

xostream& operator<<(xostream& os, const HumanReadableCharInSubString& c) {
    if (c.s.empty()) return os << "EOS";
    const unsigned char ch = static_cast<unsigned char>(c.s.front());
    if (ch >= 0x20 && ch < 0x7f) return os.put(static_cast<char>(ch));
    static constexpr char kHex[] = "0123456789ABCDEF";
    const char esc[4] = {'\\', 'x', kHex[ch >> 4], kHex[ch & 15]};
    return os.put(esc, 4);
}

}  // namespace orvan

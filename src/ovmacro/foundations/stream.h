// The library's output streams.
//
// `xostream` receives text in runs: each write is one virtual call however long the run, so copying ordinary
// text costs one call per run rather than one per character. `StringStream` collects into memory,
// `FileStream` writes to a C stdio file (`xcout` is standard output, `xcerr` standard error), and `TracerX`
// collects a trace that goes to standard error when it is destroyed.
//
//     StringStream ss;
//     ss << "line " << 12 << ": " << 2.5;   // "line 12: 2.5"
//     basic_xstring text = ss.GetString();  // the stream is empty again
#pragma once

#include <cstdio>
#include <string_view>

#include "ovmacro/foundations/large_buffers.h"
#include "ovmacro/foundations/sub_string.h"
#include "ovmacro/foundations/types.h"

namespace orvan {

class xostream {
public:
    xostream() = default;
    xostream(const xostream&) = delete;
    xostream& operator=(const xostream&) = delete;
    virtual ~xostream() = default;

    // Writes n characters. While an Indenter is active, each line that the run begins is indented first.
    xostream& put(const char* p, int64 n) {
        if (n <= 0) return *this;
        if (indent_ > 0) {
            WriteIndented(p, n);
        } else {
            DoWrite(p, static_cast<size_t>(n));
            // Kept up to date without an Indenter too, so that one made later knows whether it is mid-line.
            atLineStart_ = p[n - 1] == '\n';
        }
        return *this;
    }
    xostream& put(char c) { return put(&c, 1); }
    virtual void flush() {}

    // Used by Indenter: the number of blanks written before each line.
    void AddIndent(int64 n) { indent_ += n; }

protected:
    virtual void DoWrite(const char* p, size_t n) = 0;

private:
    void WriteIndented(const char* p, int64 n);
    int64 indent_ = 0;
    bool atLineStart_ = true;
};

xostream& operator<<(xostream& os, std::string_view s);
inline xostream& operator<<(xostream& os, const char* s) { return os << std::string_view(s ? s : ""); }
inline xostream& operator<<(xostream& os, const basic_xstring& s) { return os << std::string_view(s); }
inline xostream& operator<<(xostream& os, BasicSubString s) { return os << s.view(); }
inline xostream& operator<<(xostream& os, char c) { return os.put(c); }
xostream& operator<<(xostream& os, long long v);
xostream& operator<<(xostream& os, unsigned long long v);
inline xostream& operator<<(xostream& os, int v) { return os << static_cast<long long>(v); }
inline xostream& operator<<(xostream& os, long v) { return os << static_cast<long long>(v); }
inline xostream& operator<<(xostream& os, unsigned v) { return os << static_cast<unsigned long long>(v); }
inline xostream& operator<<(xostream& os, unsigned long v) { return os << static_cast<unsigned long long>(v); }
// The shortest text that reads back as the same double (see ToString(double)).
xostream& operator<<(xostream& os, double v);
xostream& operator<<(xostream& os, bool v) = delete;  // say "true"/"false" or 1/0 explicitly

// Collects text in memory.
class StringStream : public xostream {
public:
    explicit StringStream(size_t capacityHint = 4096) {
        text_.reserve(capacityHint);
        AdviseLargeBuffer(text_.data(), text_.capacity());
    }
    // Hands over the text collected so far and leaves the stream empty.
    basic_xstring GetString() {
        basic_xstring out;
        out.swap(text_);
        return out;
    }
    // Replaces (replace = true) or extends out with the collected text; the stream is left empty.
    void GetString(basic_xstring& out, bool replace) {
        if (replace)
            out.swap(text_);
        else
            out += text_;
        text_.clear();
    }
    // The text collected so far, without taking it.
    const basic_xstring& str() const { return text_; }
    void clear() { text_.clear(); }

protected:
    void DoWrite(const char* p, size_t n) override {
        if (text_.size() + n > text_.capacity()) ReserveLargeBuffer(text_, text_.size() + n);
        text_.append(p, n);
    }

private:
    basic_xstring text_;
};

// Writes to a stdio file, relying on its buffering.
class FileStream : public xostream {
public:
    explicit FileStream(std::FILE* f) : file_(f) {}
    void flush() override { std::fflush(file_); }

protected:
    void DoWrite(const char* p, size_t n) override { std::fwrite(p, 1, n, file_); }

private:
    std::FILE* file_;
};

xostream& xcout();  // standard output
xostream& xcerr();  // standard error

// A trace stream: what is written to it goes to standard error, at once, when it is destroyed.
class TracerX : public StringStream {
public:
    TracerX() = default;
    ~TracerX() override;
};

// Indents every line written to a stream by n more blanks while it lives.
class Indenter {
public:
    Indenter(xostream& os, int64 n) : os_(os), n_(n) { os_.AddIndent(n_); }
    ~Indenter() { os_.AddIndent(-n_); }
    Indenter(const Indenter&) = delete;
    Indenter& operator=(const Indenter&) = delete;

private:
    xostream& os_;
    int64 n_;
};

// Writes the first character of a view readably: "EOS" for an empty view, a printable character as itself,
// any other byte as \xHH. Error messages rely on the word "EOS".
struct HumanReadableCharInSubString {
    explicit HumanReadableCharInSubString(BasicSubString s) : s(s) {}
    BasicSubString s;
};
xostream& operator<<(xostream& os, const HumanReadableCharInSubString& c);

}  // namespace orvan

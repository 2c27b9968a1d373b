#include "ovmacro/output/expanded_output.h"

#include <cstring>

namespace orvan {

void ExpandedOutput::WriteIndentation(int64 indent) {
    static constexpr char kBlanks[] = "                                                                ";
    for (int64 left = indent; left > 0;) {
        const int64 chunk = left < 64 ? left : 64;
        stream_->put(kBlanks, chunk);
        left -= chunk;
    }
    charCount_ += indent;
}

void ExpandedOutput::WriteRun(const char* p, int64 n) {
    if (n <= 0) return;
    stream_->put(p, n);
    charCount_ += n;
    const char* end = p + n;
    const char* lastLf = static_cast<const char*>(memrchr(p, '\n', static_cast<size_t>(n)));
    const char* lineStart = lastLf ? lastLf + 1 : p;
    if (lastLf && lineStart == end) {
        column_ = -1;
        return;
    }
    int64 col = lastLf ? 0 : (column_ < 0 ? 0 : column_);
    for (const char* q = lineStart; q < end; ++q) col += *q == '\t' ? 4 : 1;
    column_ = col;
}

void ExpandedOutput::WriteSubStringFromSourceFile(BasicSubString s, int64 indent) {
    const char* p = s.begin();
    const char* end = s.end();
    while (p < end) {
        if (column_ < 0) {
            if (indent > 0) {
                WriteIndentation(indent);
                pieces_.push_back(OutputPiece(BasicSubString(), indent));
            }
            column_ = indent;
        }
        // Without indentation the rest goes in one run; with it, up to and including the next line feed.
        const char* runEnd = end;
        if (indent > 0) {
            const char* lf = static_cast<const char*>(std::memchr(p, '\n', static_cast<size_t>(end - p)));
            if (lf) runEnd = lf + 1;
        }
        WriteRun(p, runEnd - p);
        pieces_.push_back(OutputPiece(BasicSubString(p, runEnd), 0));
        p = runEnd;
    }
}

void ExpandedOutput::WriteCalculatedSubString(BasicSubString s, BasicSubString source, int64 indent) {
    if (s.empty()) return;
    int64 n = s.size();
    const char* p = s.begin();
    const char* end = s.end();
    while (p < end) {
        if (column_ < 0) {
            if (indent > 0) {
                WriteIndentation(indent);
                n += indent;
            }
            column_ = indent;
        }
        const char* lf = static_cast<const char*>(std::memchr(p, '\n', static_cast<size_t>(end - p)));
        const char* runEnd = lf ? lf + 1 : end;
        WriteRun(p, runEnd - p);
        p = runEnd;
    }
    pieces_.push_back(OutputPiece(source, n));
}

}  // namespace orvan

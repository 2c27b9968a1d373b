#include "ovmacro/output/expanded_output.h"

#include <cstring>

namespace orvan {

ExpandedOutput::~ExpandedOutput() {
    try {
        Flush();
    } catch (...) {
        // A stream that fails here (out of memory) loses only what an abandoned expansion wrote last.
    }
}

void ExpandedOutput::WriteIndentation(int64 indent) {
    static constexpr char kBlanks[] = "                                                                ";
    for (int64 left = indent; left > 0;) {
        const int64 chunk = left < 64 ? left : 64;
        Put(kBlanks, chunk);
        left -= chunk;
    }
    charCount_ += indent;
}

namespace {

// The first line feed in [p, end), or null. Runs are mostly short, where a loop costs less than a call.
const char* FindLineFeed(const char* p, const char* end) {
    if (end - p > 32) return static_cast<const char*>(std::memchr(p, '\n', static_cast<size_t>(end - p)));
    for (; p < end; ++p)
        if (*p == '\n') return p;
    return nullptr;
}

}  // namespace

void ExpandedOutput::WriteRun(const char* p, int64 n) {
    if (n <= 0) return;
    charCount_ += n;
    // The column after the run counts from its last line feed, or goes on from the current column.
    const char* const end = p + n;
    const char* lineStart = nullptr;
    int64 tabs = 0;
    if (n <= kShortRun) {
        if (gather_) {
            if (n > kBufferSize - buffered_) Flush();
            ScanShortRun<true>(p, end, buffer_ + buffered_, lineStart, tabs);
            buffered_ += n;
        } else {
            stream_->put(p, n);
            ScanShortRun<false>(p, end, nullptr, lineStart, tabs);
        }
    } else {
        Put(p, n);
        const char* lastLf = static_cast<const char*>(memrchr(p, '\n', static_cast<size_t>(n)));
        if (lastLf) lineStart = lastLf + 1;
        for (const char* q = lineStart ? lineStart : p; q < end; ++q) tabs += *q == '\t';
    }
    SetColumnAfter(p, end, lineStart, tabs);
}

bool ExpandedOutput::StartLine(int64 indent) {
    if (column_ >= 0) return false;
    if (indent <= 0) {
        column_ = 0;
        return false;
    }
    WriteIndentation(indent);
    column_ = indent;
    return true;
}

void ExpandedOutput::WriteCopiedRuns(BasicSubString s, int64 indent) {
    const char* p = s.begin();
    const char* end = s.end();
    if (indent <= 0) {
        // Without indentation to insert the whole run goes at once.
        if (p == end) return;
        if (column_ < 0) column_ = 0;
        WriteRun(p, end - p);
        AddPiece(OutputPiece(s, 0));
        return;
    }
    while (p < end) {
        if (StartLine(indent)) AddPiece(OutputPiece(BasicSubString(), indent));
        // Up to and including the next line feed: the line after it gets its indentation first.
        const char* lf = FindLineFeed(p, end);
        const char* runEnd = lf ? lf + 1 : end;
        WriteRun(p, runEnd - p);
        AddPiece(OutputPiece(BasicSubString(p, runEnd), 0));
        p = runEnd;
    }
}

void ExpandedOutput::WriteCalculatedSubString(BasicSubString s, BasicSubString source, int64 indent) {
    if (s.empty()) return;
    int64 n = s.size();
    const char* p = s.begin();
    const char* end = s.end();
    while (p < end) {
        if (StartLine(indent)) n += indent;
        const char* lf = indent > 0 ? FindLineFeed(p, end) : nullptr;
        const char* runEnd = lf ? lf + 1 : end;
        WriteRun(p, runEnd - p);
        p = runEnd;
    }
    AddPiece(OutputPiece(source, n));
}

}  // namespace orvan

// ExpandedOutput: where every character of an expansion goes.
//
// It writes to a stream, tracks the column of the current output line (a tab counts 4) so that nested
// expansions can indent their lines, and records an output piece for each run it writes. Indentation is
// written lazily, just before the first character of a line.
//
// Every write reaches the stream at once, unless the owner asks for short runs to be gathered: the string
// overloads of MacroExpand, whose many short writes then reach the stream in blocks, at Flush() (which
// MacroExpand calls before it returns) and when the output is destroyed.
#pragma once

#include <cstring>

#include "ovmacro/foundations/stream.h"
#include "ovmacro/output/output_pieces.h"

namespace orvan {

class ExpandedOutput {
public:
    // Without `recordPieces` no pieces are kept (Pieces() stays empty), for hosts that want only the text.
    explicit ExpandedOutput(xostream* stream, bool recordPieces = true)
        : stream_(stream), recordPieces_(recordPieces) {}
    ExpandedOutput(const ExpandedOutput&) = delete;
    ExpandedOutput& operator=(const ExpandedOutput&) = delete;
    ~ExpandedOutput();

    // Lets short runs gather in a buffer until Flush().
    void GatherShortRuns() { gather_ = true; }
    // Hands the gathered text to the stream.
    void Flush() {
        if (buffered_ == 0) return;
        const int64 n = buffered_;
        buffered_ = 0;
        stream_->put(buffer_, n);
    }

    // Copied text: each character maps back to itself in the source. Lines it begins get `indent` blanks.
    void WriteSubStringFromSourceFile(BasicSubString s, int64 indent) {
        if (!TryGatherShortRun(s, indent)) WriteCopiedRuns(s, indent);
    }
    // The longest run that TryGatherLineFreeRun takes.
    static constexpr int64 kMaxLineFreeRun = 32;
    // Copied text that the caller knows to hold no line feed and no tab (a word, a cached part of a body): the
    // same as WriteSubStringFromSourceFile without looking at its characters. False, having written nothing,
    // when it is empty or longer than kMaxLineFreeRun, when runs are not gathered, or when its line still waits
    // for its indentation.
    bool TryGatherLineFreeRun(BasicSubString s, int64 indent) {
        const int64 n = s.size();
        if (!gather_ || n <= 0 || n > kMaxLineFreeRun || (column_ < 0 && indent > 0)) return false;
        if (n > kBufferSize - buffered_) Flush();
        std::memcpy(buffer_ + buffered_, s.begin(), static_cast<size_t>(n));
        buffered_ += n;
        charCount_ += n;
        column_ = (column_ < 0 ? 0 : column_) + n;
        AddPiece(OutputPiece(s, 0));
        return true;
    }
    // Calculated text: all of it (its inserted indentation included) maps back to `source`.
    void WriteCalculatedSubString(BasicSubString s, BasicSubString source, int64 indent);
    // The column in the current line; -1 at the start of a line whose indentation is not yet written.
    int64 GetColumnPos() const { return column_; }
    // Swaps p with the recorded pieces.
    void GetPieces(OutputPieces& p) { pieces_.swap(p); }
    const OutputPieces& Pieces() const { return pieces_; }
    int64 size() const { return pieces_.size(); }
    int64 GetCharCount() const { return charCount_; }
    // The stream, with everything written so far.
    xostream* GetStream() {
        Flush();
        return stream_;
    }

private:
    static constexpr int64 kBufferSize = 256;
    static constexpr int64 kShortRun = 32;

    // One pass over a short run: its last line feed and the tabs after it, and with `kCopy` a copy of it at
    // out. Runs are mostly a few characters long, where this costs less than library calls.
    template <bool kCopy>
    static void ScanShortRun(const char* p, const char* end, char* out, const char*& lineStart, int64& tabs) {
        for (const char* q = p; q < end; ++q) {
            const char c = *q;
            if constexpr (kCopy) *out++ = c;
            if (c == '\n') {
                lineStart = q + 1;
                tabs = 0;
            } else {
                tabs += c == '\t';
            }
        }
    }
    // The column after a run that ends at `end`, from its last line feed (null: none) and the tabs after it.
    void SetColumnAfter(const char* p, const char* end, const char* lineStart, int64 tabs) {
        if (lineStart == end) {
            column_ = -1;  // the run ends its line: the next line's indentation is still to be written
            return;
        }
        const int64 before = lineStart ? 0 : (column_ < 0 ? 0 : column_);
        column_ = before + (end - (lineStart ? lineStart : p)) + 3 * tabs;
    }
    // Most copied text is short runs inside a line: gathered in one pass, with its piece. False, having
    // written nothing, for anything else (not gathering, long, or a line inside it to indent).
    bool TryGatherShortRun(BasicSubString s, int64 indent) {
        const int64 n = s.size();
        if (!gather_ || n <= 0 || n > kShortRun || n > kBufferSize - buffered_ || (column_ < 0 && indent > 0))
            return false;
        if (indent > 0) {
            // A line feed before the last character begins a line inside the run, which needs indentation.
            for (const char* q = s.begin(); q + 1 < s.end(); ++q)
                if (*q == '\n') return false;
        }
        const char* lineStart = nullptr;
        int64 tabs = 0;
        ScanShortRun<true>(s.begin(), s.end(), buffer_ + buffered_, lineStart, tabs);
        buffered_ += n;
        charCount_ += n;
        SetColumnAfter(s.begin(), s.end(), lineStart, tabs);
        AddPiece(OutputPiece(s, 0));
        return true;
    }
    void WriteCopiedRuns(BasicSubString s, int64 indent);

    void Put(const char* p, int64 n) {
        if (!gather_) {
            stream_->put(p, n);
            return;
        }
        if (n > kBufferSize - buffered_) {
            Flush();
            if (n > kBufferSize / 2) {
                stream_->put(p, n);
                return;
            }
        }
        std::memcpy(buffer_ + buffered_, p, static_cast<size_t>(n));
        buffered_ += n;
    }
    void WriteIndentation(int64 indent);
    // At a line start whose indentation is still to be written: writes it (when indent > 0, then true) and
    // sets the column.
    bool StartLine(int64 indent);
    // Writes a run that holds no line start needing indentation, and advances the column.
    void WriteRun(const char* p, int64 n);
    void AddPiece(const OutputPiece& p) {
        if (recordPieces_) pieces_.push_back(p);
    }

    xostream* stream_;
    bool recordPieces_;
    int64 column_ = -1;
    OutputPieces pieces_;
    int64 charCount_ = 0;
    bool gather_ = false;
    int64 buffered_ = 0;
    char buffer_[kBufferSize];
};

}  // namespace orvan

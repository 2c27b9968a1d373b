// ExpandedOutput: where every character of an expansion goes.
//
// It writes to a stream, tracks the column of the current output line (a tab counts 4) so that nested
// expansions can indent their lines, and records an output piece for each run it writes. Indentation is
// written lazily, just before the first character of a line.
#pragma once

#include "ovmacro/foundations/stream.h"
#include "ovmacro/output/output_pieces.h"

namespace orvan {

class ExpandedOutput {
public:
    // Without `recordPieces` no pieces are kept (Pieces() stays empty), for hosts that want only the text.
    explicit ExpandedOutput(xostream* stream, bool recordPieces = true)
        : stream_(stream), recordPieces_(recordPieces) {}

    // Copied text: each character maps back to itself in the source. Lines it begins get `indent` blanks.
    void WriteSubStringFromSourceFile(BasicSubString s, int64 indent);
    // Calculated text: all of it (its inserted indentation included) maps back to `source`.
    void WriteCalculatedSubString(BasicSubString s, BasicSubString source, int64 indent);
    // The column in the current line; -1 at the start of a line whose indentation is not yet written.
    int64 GetColumnPos() const { return column_; }
    // Swaps p with the recorded pieces.
    void GetPieces(OutputPieces& p) { pieces_.swap(p); }
    const OutputPieces& Pieces() const { return pieces_; }
    int64 size() const { return pieces_.size(); }
    int64 GetCharCount() const { return charCount_; }
    xostream* GetStream() const { return stream_; }

private:
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
};

}  // namespace orvan

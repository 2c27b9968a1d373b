// Output pieces: the map from every position of an expanded text back to the source that produced it.
//
// A piece is either copied (length 0: its output is exactly the characters of `source`) or calculated
// (length > 0: that many output characters stand for the range `source`; an inserted indentation is a
// calculated piece with a null source). The pieces tile the output in order, without gaps.
#pragma once

#include "ovmacro/foundations/large_buffers.h"
#include "ovmacro/foundations/sub_string.h"
#include "ovmacro/foundations/types.h"
#include "ovmacro/lexer/exceptions.h"

namespace orvan {

struct OutputPiece {
    OutputPiece() = default;
    OutputPiece(BasicSubString source, int64 length) : source(source), length(length) {}
    int64 size() const { return length != 0 ? length : source.size(); }
    bool IsCopied() const { return length == 0; }

    BasicSubString source;
    int64 length = 0;
};

class OutputPieces {
public:
    // Appends a piece. A copied piece that continues the previous copied piece in the source (its begin is
    // the previous one's end) extends it instead: the mapping of every position stays exactly the same.
    void push_back(const OutputPiece& p) {
        if (p.IsCopied() && !pieces_.empty()) {
            OutputPiece& last = pieces_.back();
            if (last.IsCopied() && last.source.end() == p.source.begin() && p.source.begin() != nullptr) {
                last.source.SetEnd(p.source.end());
                total_ += p.size();
                return;
            }
        }
        if (pieces_.size() == pieces_.capacity()) ReserveLargeBuffer(pieces_, pieces_.size() + 1);
        pieces_.push_back(p);
        total_ += p.size();
    }
    // The sum of the pieces' sizes: the number of characters they cover.
    int64 size() const { return total_; }
    void swap(OutputPieces& o) noexcept {
        pieces_.swap(o.pieces_);
        std::swap(total_, o.total_);
    }
    void clear() {
        pieces_.clear();
        total_ = 0;
    }
    const xvector<OutputPiece>& GetPieces() const { return pieces_; }

    // The source address of output offset pos: inside the range of a copied piece, the begin of a
    // calculated piece's range (null for indentation). pos must lie in [0, size()): a position outside is a
    // contract violation and aborts the process with a message.
    const char* MapOutputPositionToAddress(int64 pos) const;
    // Moves e's position from the expanded text (which these pieces describe) back into the source; a
    // position that is null or not inside `expanded` is left alone.
    void AdjustErrorPosition(LexScannerException& e, BasicSubString expanded) const;

private:
    xvector<OutputPiece> pieces_;
    int64 total_ = 0;
};

// For an error raised while reading `expanded`, a temporary expansion of `source` described by `pieces`:
// moves a position inside `expanded` back to the source character that produced it (the end of `expanded`
// becomes the end of `source`; inserted indentation, which maps nowhere, becomes the begin of `source`), so
// that the error can be reported at a line of a loaded text. Other positions are left alone.
void MovePositionOutOfExpansion(LexScannerException& e, BasicSubString expanded, const OutputPieces& pieces,
                                BasicSubString source);

// Maps a non-decreasing sequence of output positions in one pass over the pieces.
class OutputPiecesMonotonePosMapper {
public:
    explicit OutputPiecesMonotonePosMapper(const OutputPieces& pieces) : pieces_(&pieces) {}
    const char* MapOutputPositionToAddress(int64 pos);

private:
    const OutputPieces* pieces_;
    int64 index_ = 0;
    int64 offset_ = 0;
};

}  // namespace orvan

#include "ovmacro/output/output_pieces.h"

#include <cstdio>
#include <cstdlib>

namespace orvan {

namespace {

[[noreturn]] void PositionOutsideOutput(int64 pos, int64 total) {
    std::fprintf(stderr, "ovMacroExpander: fatal error: output position %lld outside the output [0,%lld)\n",
                 static_cast<long long>(pos), static_cast<long long>(total));
    std::abort();
}

const char* AddressInPiece(const OutputPiece& p, int64 offsetInPiece) {
    return p.IsCopied() ? p.source.begin() + offsetInPiece : p.source.begin();
}

}  // namespace

const char* OutputPieces::MapOutputPositionToAddress(int64 pos) const {
    if (pos < 0 || pos >= total_) PositionOutsideOutput(pos, total_);
    int64 start = 0;
    for (const OutputPiece& p : pieces_) {
        const int64 size = p.size();
        if (pos < start + size) return AddressInPiece(p, pos - start);
        start += size;
    }
    PositionOutsideOutput(pos, total_);
}

void OutputPieces::AdjustErrorPosition(LexScannerException& e, BasicSubString expanded) const {
    const char* pos = e.GetPosition();
    if (!pos || expanded.empty()) return;
    const std::less<const char*> lt;
    if (lt(pos, expanded.begin()) || !lt(pos, expanded.end())) return;
    const int64 offset = pos - expanded.begin();
    if (offset >= total_) return;  // pieces that do not describe this text: leave the position alone
    e.SetPosition(MapOutputPositionToAddress(offset));
}

void MovePositionOutOfExpansion(LexScannerException& e, BasicSubString expanded, const OutputPieces& pieces,
                                BasicSubString source) {
    const char* pos = e.GetPosition();
    const std::less<const char*> lt;
    if (!pos || lt(pos, expanded.begin()) || lt(expanded.end(), pos)) return;
    const int64 offset = pos - expanded.begin();
    const char* mapped = offset < pieces.size() ? pieces.MapOutputPositionToAddress(offset) : source.end();
    e.SetPosition(mapped ? mapped : source.begin());
}

const char* OutputPiecesMonotonePosMapper::MapOutputPositionToAddress(int64 pos) {
    const xvector<OutputPiece>& pieces = pieces_->GetPieces();
    if (pos < offset_ || pos >= pieces_->size()) PositionOutsideOutput(pos, pieces_->size());
    while (static_cast<size_t>(index_) < pieces.size()) {
        const OutputPiece& p = pieces[static_cast<size_t>(index_)];
        if (pos < offset_ + p.size()) return AddressInPiece(p, pos - offset_);
        offset_ += p.size();
        ++index_;
    }
    PositionOutsideOutput(pos, pieces_->size());
}

}  // namespace orvan

// Texts that an expansion makes and then expands again: the list of a @for, the first pass of @[ and the call
// text of a function argument.
//
// Such a text is no loaded file, which raises two problems. Definitions made while it is expanded keep views
// of it as their names and bodies, so it must live as long as the frames that received them. And a position
// inside it has no file and line, so an error found there is moved back, through the output pieces recorded
// when the text was made, to the source character that produced it. A HeldText solves both: it is a variable
// that a frame can own, and while it lives its text is known to MovePositionOutOfHeldTexts.
//
//     HeldTextKeeper keeper(frame);  // before anything defined by the text can reach the frames
//     const HeldText& list =
//         keeper.Hold(std::make_unique<HeldText>(" @for", std::move(text), std::move(pieces), at));
//     ... expand list.GetText(), catching errors to call list.MovePositionOut(e) ...
//     // when the keeper goes, a frame that received definitions takes the text over
#pragma once

#include <atomic>

#include <memory>

#include "ovmacro/lexer/exceptions.h"
#include "ovmacro/output/expanded_output.h"
#include "ovmacro/output/output_pieces.h"
#include "ovmacro/vars/var_frame.h"

namespace orvan {

class HeldText : public LSVar {
public:
    // `name` must hold a blank, so that no identifier can look the holder up. `pieces` map `text` back to the
    // texts that produced it; `source` is the range that a position maps to when the pieces cannot place it
    // (the end of the text, inserted indentation).
    HeldText(BasicSubString name, basic_xstring text, OutputPieces pieces, BasicSubString source);
    ~HeldText() override;
    HeldText(const HeldText&) = delete;
    HeldText& operator=(const HeldText&) = delete;

    BasicSubString GetText() const { return BasicSubString(value); }
    const OutputPieces& GetPieces() const { return pieces_; }
    BasicSubString GetSource() const { return source_; }
    // Moves e's position, if it lies in this text (its end included), back to the source.
    void MovePositionOut(LexScannerException& e) const;

private:
    OutputPieces pieces_;
    BasicSubString source_;
};

// Moves e's position out of every held text that is still alive, again and again while it lands in another
// one, so that it ends in a loaded text (or where no held text can place it further).
void MovePositionOutOfHeldTexts(LexScannerException& e);

// Output pieces outlive the held texts that were expanded into the output (a @for list dies with its loop, a
// call text with its call), so no piece may point into one. The two writers below write as ExpandedOutput
// does, but a piece that would point into a live held text points instead to the texts that produced that
// part of it: copied where the held text copied them, calculated and mapped to their source otherwise.
// Whether p lies in a live held text (its end excluded); cheap when none lives.
bool IsInHeldText(const char* p);
// The number of live held texts, read without a lock by the writers' fast path.
extern std::atomic<size_t> g_liveHeldTexts;
void WriteCopiedTextPieceByPiece(ExpandedOutput& output, BasicSubString s, int64 indent);
inline void WriteCopiedText(ExpandedOutput& output, BasicSubString s, int64 indent) {
    if (g_liveHeldTexts.load(std::memory_order_relaxed) == 0)
        output.WriteSubStringFromSourceFile(s, indent);
    else
        WriteCopiedTextPieceByPiece(output, s, indent);
}
void WriteCalculatedText(ExpandedOutput& output, BasicSubString s, BasicSubString source, int64 indent);

// Owns a held text while it is expanded. When the keeper goes (also when an error passes), the outermost of
// `frame` and its parents that received a definition since the keeper was made takes the text over; when
// none did, the text dies with the keeper.
class HeldTextKeeper {
public:
    explicit HeldTextKeeper(VarFrame* frame);
    ~HeldTextKeeper();
    HeldTextKeeper(const HeldTextKeeper&) = delete;
    HeldTextKeeper& operator=(const HeldTextKeeper&) = delete;

    HeldText& Hold(std::unique_ptr<HeldText> held);
    // Expands `source` in a child frame of the keeper's frame into a held text named `name` and holds it.
    HeldText& ExpandAndHold(BasicSubString name, BasicSubString source);

private:
    VarFrame* frame_;
    xvector<const LSVariable*> newest_;  // the newest variable of each frame from frame_ outward
    std::unique_ptr<HeldText> held_;
};

}  // namespace orvan

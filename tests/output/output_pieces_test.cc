// Tests of mapping output positions back to the source: boundaries between pieces, indentation pieces,
// merged copied pieces, moving error positions, the monotone mapper, and the fatal error for a position
// outside the output.
#include "ovmacro/output/output_pieces.h"

#include <gtest/gtest.h>

#include <array>
#include <string>
#include <vector>

#include "ovmacro/output/expanded_output.h"

namespace orvan {
namespace {

// Source offsets of every output position; -1 for a null address (indentation).
std::vector<int64> MapAll(const OutputPieces& pieces, const std::string& source) {
    std::vector<int64> out;
    for (int64 pos = 0; pos < pieces.size(); ++pos) {
        const char* a = pieces.MapOutputPositionToAddress(pos);
        out.push_back(a ? a - source.data() : -1);
    }
    return out;
}

// Pieces over `source` written as {begin, end, length} offsets; begin -1 for indentation.
OutputPieces Make(const std::string& source, const std::vector<std::array<int64, 3>>& spec) {
    OutputPieces pieces;
    for (const auto& [begin, end, length] : spec) {
        if (begin < 0)
            pieces.push_back(OutputPiece(BasicSubString(), length));
        else
            pieces.push_back(OutputPiece(BasicSubString(source.data() + begin, source.data() + end), length));
    }
    return pieces;
}

struct MappingCase {
    const char* name;
    std::vector<std::array<int64, 3>> pieces;
    std::vector<int64> map;
};

const std::string kSource = "0123456789";

const MappingCase kMappings[] = {
    {"copied piece then calculated piece",
     {{0, 2, 0}, {5, 8, 5}},
     {0, 1, 5, 5, 5, 5, 5}},  // position 2, the boundary, belongs to the later piece
    {"calculated piece then copied piece", {{7, 8, 2}, {3, 5, 0}}, {7, 7, 3, 4}},
    {"indentation maps to null", {{-1, -1, 2}, {0, 2, 0}, {-1, -1, 1}, {2, 3, 0}}, {-1, -1, 0, 1, -1, 2}},
    {"contiguous copied pieces", {{0, 2, 0}, {2, 5, 0}, {5, 6, 0}}, {0, 1, 2, 3, 4, 5}},
    {"copied pieces out of source order", {{4, 6, 0}, {0, 2, 0}, {2, 3, 0}}, {4, 5, 0, 1, 2}},
    {"a copied piece continuing a calculated one's range stays copied",
     {{0, 2, 3}, {2, 4, 0}},
     {0, 0, 0, 2, 3}},
    {"a calculated piece continuing a copied one stays calculated", {{0, 2, 0}, {2, 4, 1}}, {0, 1, 2}},
    {"copied pieces either side of indentation are not joined",
     {{0, 2, 0}, {-1, -1, 1}, {2, 3, 0}},
     {0, 1, -1, 2}},
    {"an empty calculated source", {{3, 3, 2}}, {3, 3}},
};

TEST(OutputPiecesTest, MapsEveryPositionAndTilesTheOutput) {
    for (const MappingCase& c : kMappings) {
        SCOPED_TRACE(c.name);
        const OutputPieces pieces = Make(kSource, c.pieces);
        EXPECT_EQ(pieces.size(), static_cast<int64>(c.map.size()));
        EXPECT_EQ(MapAll(pieces, kSource), c.map);

        // The monotone mapper gives the same answers, also when a position is asked twice.
        OutputPiecesMonotonePosMapper mapper(pieces);
        for (int64 pos = 0; pos < pieces.size(); ++pos) {
            for (int repeat = 0; repeat < 2; ++repeat) {
                const char* a = mapper.MapOutputPositionToAddress(pos);
                EXPECT_EQ(a ? a - kSource.data() : -1, c.map[static_cast<size_t>(pos)]) << pos;
            }
        }
        // And when it skips positions.
        OutputPiecesMonotonePosMapper skipping(pieces);
        const int64 last = pieces.size() - 1;
        const char* a = skipping.MapOutputPositionToAddress(last);
        EXPECT_EQ(a ? a - kSource.data() : -1, c.map.back());
    }
}

TEST(OutputPiecesTest, MergingContiguousCopiedPiecesKeepsTheMapping) {
    OutputPieces pieces = Make(kSource, {{0, 2, 0}, {2, 5, 0}, {5, 6, 0}});
    EXPECT_EQ(pieces.GetPieces().size(), 1u) << "one run of the source";
    pieces = Make(kSource, {{0, 2, 0}, {3, 5, 0}});
    EXPECT_EQ(pieces.GetPieces().size(), 2u) << "a gap in the source";
}

TEST(AdjustErrorPositionTest, MovesOnlyPositionsInsideTheExpandedText) {
    // The expanded text "  ab<x>" : indentation 2, "ab" copied from source offset 3, "<x>" calculated from
    // source offset 8.
    const std::string expanded = "  ab<x>";
    const OutputPieces pieces = Make(kSource, {{-1, -1, 2}, {3, 5, 0}, {8, 9, 3}});
    const std::string elsewhere = "unrelated";
    const char* e0 = expanded.data();
    const struct {
        const char* name;
        const char* position;
        const char* expected;
    } cases[] = {
        {"null", nullptr, nullptr},
        {"inside indentation", e0 + 1, nullptr},
        {"first copied character", e0 + 2, kSource.data() + 3},
        {"second copied character", e0 + 3, kSource.data() + 4},
        {"calculated", e0 + 5, kSource.data() + 8},
        {"last character", e0 + 6, kSource.data() + 8},
        {"the end of the expanded text stays", e0 + 7, e0 + 7},
        {"another buffer stays", elsewhere.data() + 2, elsewhere.data() + 2},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        LexScannerException e("message", c.position);
        pieces.AdjustErrorPosition(e, BasicSubString(expanded));
        EXPECT_EQ(e.GetPosition(), c.expected);
        EXPECT_EQ(e.GetMessage(), "message");
    }
}

TEST(AdjustErrorPositionTest, PiecesShorterThanTheTextLeaveTheRestAlone) {
    // Pieces that do not describe the whole text must not be walked past their end.
    const std::string expanded = "abcdef";
    const OutputPieces pieces = Make(kSource, {{0, 3, 0}});
    LexScannerException inside("m", expanded.data() + 1);
    pieces.AdjustErrorPosition(inside, BasicSubString(expanded));
    EXPECT_EQ(inside.GetPosition(), kSource.data() + 1);
    LexScannerException beyond("m", expanded.data() + 4);
    pieces.AdjustErrorPosition(beyond, BasicSubString(expanded));
    EXPECT_EQ(beyond.GetPosition(), expanded.data() + 4);

    const OutputPieces none;
    LexScannerException any("m", expanded.data());
    none.AdjustErrorPosition(any, BasicSubString(expanded));
    EXPECT_EQ(any.GetPosition(), expanded.data());
}

TEST(AdjustErrorPositionTest, RoundTripThroughAnExpandedOutput) {
    // Every character written through an output maps back to the character it was copied from.
    const std::string source = "first line\n\tsecond\nthird";
    StringStream ss;
    ExpandedOutput out(&ss);
    out.WriteSubStringFromSourceFile(BasicSubString(source), 4);
    OutputPieces pieces;
    out.GetPieces(pieces);
    const std::string expanded = ss.GetString();
    for (size_t i = 0; i < expanded.size(); ++i) {
        LexScannerException e("m", expanded.data() + i);
        pieces.AdjustErrorPosition(e, BasicSubString(expanded));
        if (e.GetPosition() == nullptr) {
            EXPECT_EQ(expanded[i], ' ') << i << ": only indentation maps to null";
        } else {
            ASSERT_GE(e.GetPosition(), source.data());
            ASSERT_LT(e.GetPosition(), source.data() + source.size());
            EXPECT_EQ(*e.GetPosition(), expanded[i]) << i;
        }
    }
}

using OutputPiecesDeathTest = ::testing::Test;

TEST_F(OutputPiecesDeathTest, PositionOutsideTheOutputAborts) {
    const OutputPieces pieces = Make(kSource, {{0, 3, 0}});
    EXPECT_DEATH(pieces.MapOutputPositionToAddress(3), "output position 3 outside the output \\[0,3\\)");
    EXPECT_DEATH(pieces.MapOutputPositionToAddress(-1), "output position -1 outside the output");
    EXPECT_DEATH(OutputPieces().MapOutputPositionToAddress(0),
                 "output position 0 outside the output \\[0,0\\)");
}

TEST_F(OutputPiecesDeathTest, MonotoneMapperPastTheEndOrBackwardsAborts) {
    const OutputPieces pieces = Make(kSource, {{0, 3, 0}, {5, 6, 4}});
    EXPECT_DEATH(
        {
            OutputPiecesMonotonePosMapper m(pieces);
            m.MapOutputPositionToAddress(7);
        },
        "output position 7 outside the output \\[0,7\\)");
    EXPECT_DEATH(
        {
            OutputPiecesMonotonePosMapper m(pieces);
            m.MapOutputPositionToAddress(5);
            m.MapOutputPositionToAddress(1);  // behind the piece already reached
        },
        "output position 1 outside the output");
}

}  // namespace
}  // namespace orvan

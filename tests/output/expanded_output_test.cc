// Tests of the expanded output: lazy indentation of output lines, copied and calculated pieces, column
// tracking with tabs, and handing the pieces over.
#include "ovmacro/output/expanded_output.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace orvan {
namespace {

// One piece as a test states it: the source as an offset range into the test's source text (-1, -1 for
// indentation) and the length (0 for copied).
struct Piece {
    int64 begin, end, length;
    bool operator==(const Piece& o) const { return begin == o.begin && end == o.end && length == o.length; }
};

void PrintTo(const Piece& p, std::ostream* os) {
    *os << "{" << p.begin << "," << p.end << "," << p.length << "}";
}

std::vector<Piece> Describe(const OutputPieces& pieces, const std::string& source) {
    std::vector<Piece> out;
    for (const OutputPiece& p : pieces.GetPieces()) {
        if (!p.source.begin())
            out.push_back({-1, -1, p.length});
        else
            out.push_back({p.source.begin() - source.data(), p.source.end() - source.data(), p.length});
    }
    return out;
}

TEST(ExpandedOutputTest, CopiedTextGetsIndentationPiecesPerLine) {
    const std::string source = "ab\ncd";
    StringStream ss;
    ExpandedOutput out(&ss);
    EXPECT_EQ(out.GetColumnPos(), -1) << "a fresh output starts at the start of a line";
    out.WriteSubStringFromSourceFile(source, 3);
    EXPECT_EQ(ss.str(), "   ab\n   cd");
    EXPECT_EQ(Describe(out.Pieces(), source),
              (std::vector<Piece>{{-1, -1, 3}, {0, 3, 0}, {-1, -1, 3}, {3, 5, 0}}));
    EXPECT_EQ(out.size(), 11);
    EXPECT_EQ(out.GetCharCount(), 11);
    EXPECT_EQ(out.GetColumnPos(), 5);
}

TEST(ExpandedOutputTest, CalculatedTextIsOnePieceIndentationIncluded) {
    const std::string source = "@name";
    StringStream ss;
    ExpandedOutput out(&ss);
    out.WriteCalculatedSubString(BasicSubString("x\ny"), source, 2);
    EXPECT_EQ(ss.str(), "  x\n  y");
    EXPECT_EQ(Describe(out.Pieces(), source), (std::vector<Piece>{{0, 5, 7}}));
    EXPECT_EQ(out.size(), 7);
    EXPECT_EQ(out.GetCharCount(), 7);
}

TEST(ExpandedOutputTest, EmptyWritesLeaveNoTrace) {
    const std::string source = "abc";
    StringStream ss;
    ExpandedOutput out(&ss);
    out.WriteSubStringFromSourceFile(BasicSubString(source.data(), source.data()), 4);
    out.WriteCalculatedSubString(BasicSubString(""), source, 4);
    EXPECT_EQ(ss.str(), "");
    EXPECT_TRUE(out.Pieces().GetPieces().empty());
    EXPECT_EQ(out.GetColumnPos(), -1) << "no line was begun, so no indentation was written";
}

// A sequence of writes into one fresh output, with the text and column expected after all of them.
struct Write {
    bool calculated;
    const char* text;
    int64 indent;
};

struct SequenceCase {
    const char* name;
    std::vector<Write> writes;
    const char* expected;
    int64 column;
};

const SequenceCase kSequences[] = {
    {"no indentation with indent 0", {{false, "a\nb", 0}}, "a\nb", 1},
    {"nor with a negative indent", {{false, "a\nb", -2}, {true, "\nc", -1}}, "a\nb\nc", 1},
    {"a text that ends with a line feed leaves the next line unbegun", {{false, "a\n", 2}}, "  a\n", -1},
    {"every character that begins a line gets the indentation, a line feed too",
     {{false, "a\n\n\nb", 2}},
     "  a\n  \n  \n  b",
     3},
    {"the write that begins a line chooses its indentation",
     {{false, "a\n", 2}, {true, "b", 5}, {false, "c\n", 1}, {false, "d", 3}},
     "  a\n     bc\n   d",
     4},
    {"an indentation is written once per line",
     {{false, "a", 2}, {false, "b", 6}, {true, "c", 9}},
     "  abc",
     5},
    {"a tab counts 4 columns, not aligned to tab stops", {{false, "a\tb", 0}}, "a\tb", 6},
    {"tabs after indentation", {{false, "\t\t", 3}}, "   \t\t", 11},
    {"the column restarts after a line feed", {{false, "abc\tdef\n\tx", 0}}, "abc\tdef\n\tx", 5},
    {"calculated text tracks the column too", {{true, "ab\ncde", 1}}, " ab\n cde", 4},
    {"carriage returns are ordinary characters", {{false, "a\r\rb", 2}}, "  a\r\rb", 6},
};

TEST(ExpandedOutputTest, IndentationAndColumnOverSequencesOfWrites) {
    const std::string source = "the source";
    for (const SequenceCase& c : kSequences) {
        SCOPED_TRACE(c.name);
        StringStream ss;
        ExpandedOutput out(&ss);
        for (const Write& w : c.writes) {
            if (w.calculated)
                out.WriteCalculatedSubString(BasicSubString(w.text), source, w.indent);
            else
                out.WriteSubStringFromSourceFile(BasicSubString(w.text), w.indent);
        }
        EXPECT_EQ(ss.str(), c.expected);
        EXPECT_EQ(out.GetColumnPos(), c.column);
        const int64 written = static_cast<int64>(ss.str().size());
        EXPECT_EQ(out.GetCharCount(), written);
        EXPECT_EQ(out.size(), written) << "the pieces tile the whole output";
    }
}

TEST(ExpandedOutputTest, CalculatedPieceLengthCountsItsIndentation) {
    const std::string source = "src";
    StringStream ss;
    ExpandedOutput out(&ss);
    out.WriteSubStringFromSourceFile(BasicSubString("a\n"), 2);
    out.WriteCalculatedSubString(BasicSubString("b\nc\n"), source, 3);
    EXPECT_EQ(ss.str(), "  a\n   b\n   c\n");
    ASSERT_EQ(out.Pieces().GetPieces().size(), 3u);
    EXPECT_EQ(out.Pieces().GetPieces()[2].length, 10);
    EXPECT_EQ(out.Pieces().GetPieces()[2].source.begin(), source.data());
    EXPECT_EQ(out.GetColumnPos(), -1);
}

TEST(ExpandedOutputTest, GetPiecesSwapsWithTheCaller) {
    const std::string source = "abcdef";
    StringStream ss;
    ExpandedOutput out(&ss);
    out.WriteSubStringFromSourceFile(BasicSubString(source.data(), source.data() + 4), 0);

    OutputPieces theirs;
    theirs.push_back(OutputPiece(BasicSubString(source.data(), source.data() + 1), 9));
    out.GetPieces(theirs);
    EXPECT_EQ(theirs.size(), 4);
    EXPECT_EQ(theirs.MapOutputPositionToAddress(3), source.data() + 3);
    EXPECT_EQ(out.size(), 9) << "the output now holds the caller's former pieces";

    OutputPieces empty;
    out.GetPieces(empty);
    EXPECT_EQ(out.size(), 0);
    EXPECT_EQ(empty.size(), 9);
}

}  // namespace
}  // namespace orvan

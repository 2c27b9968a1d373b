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

// A sequence of writes into one fresh output, with the text, column and pieces expected after all of them.
// The texts are laid end to end in one source buffer that the pieces point into; a calculated text maps to
// itself.
struct Write {
    bool calculated;
    std::string text;
    int64 indent;
};

struct SequenceCase {
    const char* name;
    std::vector<Write> writes;
    std::string expected;
    int64 column;
    std::vector<Piece> pieces;
};

std::string X(size_t n) {
    return std::string(n, 'x');
}

const SequenceCase kSequences[] = {
    {"no indentation with indent 0", {{false, "a\nb", 0}}, "a\nb", 1, {{0, 3, 0}}},
    {"nor with a negative indent",
     {{false, "a\nb", -2}, {true, "\nc", -1}},
     "a\nb\nc",
     1,
     {{0, 3, 0}, {3, 5, 2}}},
    {"a text that ends with a line feed leaves the next line unbegun",
     {{false, "a\n", 2}},
     "  a\n",
     -1,
     {{-1, -1, 2}, {0, 2, 0}}},
    {"every character that begins a line gets the indentation, a line feed too",
     {{false, "a\n\n\nb", 2}},
     "  a\n  \n  \n  b",
     3,
     {{-1, -1, 2}, {0, 2, 0}, {-1, -1, 2}, {2, 3, 0}, {-1, -1, 2}, {3, 4, 0}, {-1, -1, 2}, {4, 5, 0}}},
    {"the write that begins a line chooses its indentation",
     {{false, "a\n", 2}, {true, "b", 5}, {false, "c\n", 1}, {false, "d", 3}},
     "  a\n     bc\n   d",
     4,
     {{-1, -1, 2}, {0, 2, 0}, {2, 3, 6}, {3, 5, 0}, {-1, -1, 3}, {5, 6, 0}}},
    {"an indentation is written once per line",
     {{false, "a", 2}, {false, "b", 6}, {true, "c", 9}},
     "  abc",
     5,
     {{-1, -1, 2}, {0, 2, 0}, {2, 3, 1}}},
    {"a line inside a short run in the middle of a line is indented",
     {{false, "a", 2}, {false, "x\ny\n", 3}},
     "  ax\n   y\n",
     -1,
     {{-1, -1, 2}, {0, 3, 0}, {-1, -1, 3}, {3, 5, 0}}},
    {"a tab counts 4 columns, not aligned to tab stops", {{false, "a\tb", 0}}, "a\tb", 6, {{0, 3, 0}}},
    {"tabs after indentation", {{false, "\t\t", 3}}, "   \t\t", 11, {{-1, -1, 3}, {0, 2, 0}}},
    {"the column restarts after a line feed",
     {{false, "abc\tdef\n\tx", 0}},
     "abc\tdef\n\tx",
     5,
     {{0, 10, 0}}},
    {"calculated text is one piece, its indentation included",
     {{true, "ab\ncde", 1}},
     " ab\n cde",
     4,
     {{0, 6, 8}}},
    {"calculated text ending its line",
     {{false, "a\n", 2}, {true, "b\nc\n", 3}},
     "  a\n   b\n   c\n",
     -1,
     {{-1, -1, 2}, {0, 2, 0}, {2, 6, 10}}},
    {"carriage returns are ordinary characters",
     {{false, "a\r\rb", 2}},
     "  a\r\rb",
     6,
     {{-1, -1, 2}, {0, 4, 0}}},
    {"long copied lines with tabs",
     {{false, "\t" + X(31) + "\n\t" + X(32), 2}},
     "  \t" + X(31) + "\n  \t" + X(32),
     38,
     {{-1, -1, 2}, {0, 33, 0}, {-1, -1, 2}, {33, 66, 0}}},
    {"long calculated lines with tabs",
     {{true, X(40) + "\n" + X(10) + "\t", 3}},
     "   " + X(40) + "\n   " + X(10) + "\t",
     17,
     {{0, 52, 58}}},
};

// Each sequence is written three ways: with pieces; without (the same text and column, no pieces); and with
// short runs gathered before they reach the stream (the same text, column and pieces after Flush).
TEST(ExpandedOutputTest, IndentationColumnAndPiecesOverSequencesOfWrites) {
    for (const SequenceCase& c : kSequences) {
        for (const char* way : {"with pieces", "without pieces", "gathering short runs"}) {
            SCOPED_TRACE(std::string(c.name) + ", " + way);
            const bool recordPieces = std::string(way) != "without pieces";
            std::string source;
            for (const Write& w : c.writes) source += w.text;
            StringStream ss;
            ExpandedOutput out(&ss, recordPieces);
            if (std::string(way) == "gathering short runs") out.GatherShortRuns();
            const char* p = source.data();
            for (const Write& w : c.writes) {
                const BasicSubString text(p, p + w.text.size());
                p += w.text.size();
                if (w.calculated)
                    out.WriteCalculatedSubString(text, text, w.indent);
                else
                    out.WriteSubStringFromSourceFile(text, w.indent);
            }
            out.Flush();
            EXPECT_EQ(ss.str(), c.expected);
            EXPECT_EQ(out.GetColumnPos(), c.column);
            const int64 written = static_cast<int64>(ss.str().size());
            EXPECT_EQ(out.GetCharCount(), written);
            if (!recordPieces) {
                EXPECT_TRUE(out.Pieces().GetPieces().empty());
                continue;
            }
            EXPECT_EQ(Describe(out.Pieces(), source), c.pieces);
            EXPECT_EQ(out.Pieces().size(), written) << "the pieces tile the whole output";
        }
    }
}

// The column after a run written without indentation, for runs on both sides of the length where a different
// loop takes over: it goes on from the column before the run, or counts from the run's last line feed.
TEST(ExpandedOutputTest, ColumnAfterRunsOfAnyLength) {
    const struct {
        const char* name;
        std::string before;  // written first, the same way
        std::string run;
        int64 column;
    } cases[] = {
        {"1, no line feed", "ab", "\t", 6},
        {"31, no line feed", "ab", "\t" + X(30), 36},
        {"32, no line feed", "ab", X(31) + "\t", 37},
        {"33, no line feed", "ab", "\t" + X(31) + "\t", 41},
        {"100, no line feed", "a\tb", X(50) + "\t" + X(49), 109},
        {"31, tabs before and after a line feed", "ab", "\t\t" + X(10) + "\n\t" + X(17), 21},
        {"32, tabs before and after a line feed", "ab", "\t" + X(20) + "\n\t\t" + X(8), 16},
        {"33, tabs before and after a line feed", "ab", "\t" + X(20) + "\n\t\t" + X(9), 17},
        {"100, tabs before and after line feeds", "ab", X(40) + "\t\n" + X(20) + "\n\t" + X(36), 40},
        {"31, line feed first", "ab", "\n\t" + X(29), 33},
        {"33, line feed first", "ab", "\n\t" + X(31), 35},
        {"1, ending the line", "ab", "\n", -1},
        {"31, ending the line", "ab", "\t" + X(29) + "\n", -1},
        {"32, ending the line", "ab", "\n" + X(30) + "\n", -1},
        {"33, ending the line", "ab", X(32) + "\n", -1},
        {"100, ending the line", "ab", X(49) + "\n" + X(49) + "\n", -1},
        {"4, after an ended line", "ab\n", "\t" + X(3), 7},
        {"33, after an ended line", "ab\n", "\t" + X(32), 36},
    };
    for (const auto& c : cases) {
        for (const bool calculated : {false, true}) {
            SCOPED_TRACE(std::string(c.name) + (calculated ? ", calculated" : ", copied"));
            StringStream ss;
            ExpandedOutput out(&ss);
            for (const std::string* text : {&c.before, &c.run}) {
                if (calculated)
                    out.WriteCalculatedSubString(*text, *text, 0);
                else
                    out.WriteSubStringFromSourceFile(*text, 0);
            }
            EXPECT_EQ(ss.str(), c.before + c.run);
            EXPECT_EQ(out.GetColumnPos(), c.column);
            EXPECT_EQ(out.GetCharCount(), static_cast<int64>(ss.str().size()));
        }
    }
}

// Gathered short runs reach the stream in order: before a long run, at Flush() and when the output dies.
TEST(ExpandedOutputTest, GatheredRunsReachTheStreamInOrder) {
    const std::string source = "ab\tc" + std::string(300, 'x') + "d\n";
    const char* p = source.data();
    StringStream ss;
    {
        ExpandedOutput out(&ss);
        out.GatherShortRuns();
        out.WriteSubStringFromSourceFile(BasicSubString(p, p + 2), 2);
        out.WriteCalculatedSubString(BasicSubString(p + 2, p + 4), BasicSubString(p, p + 1), 0);
        EXPECT_EQ(ss.str(), "") << "short runs wait";
        EXPECT_EQ(out.GetColumnPos(), 9);
        out.WriteSubStringFromSourceFile(BasicSubString(p + 4, p + 304), 0);
        EXPECT_EQ(ss.str(), "  ab\tc" + std::string(300, 'x')) << "a long run goes at once, after them";
        out.WriteSubStringFromSourceFile(BasicSubString(p + 304, p + 306), 0);
        EXPECT_EQ(out.GetCharCount(), 308);
        out.Flush();
        EXPECT_EQ(ss.str(), "  " + source);
        out.WriteSubStringFromSourceFile(BasicSubString(p, p + 1), 0);
    }
    EXPECT_EQ(ss.str(), "  " + source + "a") << "destroying the output hands over the rest";
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
    EXPECT_EQ(out.Pieces().size(), 9) << "the output now holds the caller's former pieces";

    OutputPieces empty;
    out.GetPieces(empty);
    EXPECT_EQ(out.Pieces().size(), 0);
    EXPECT_EQ(empty.size(), 9);
}

}  // namespace
}  // namespace orvan

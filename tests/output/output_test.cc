// The expanded output and its pieces: indentation, columns, gathered short runs, positions mapped back; the
// source files that positions belong to.
#include <gtest/gtest.h>

#include <algorithm>
#include <functional>
#include <optional>
#include <sstream>
#include <string>
#include <tuple>
#include <vector>

#include "ovmacro/output/expanded_output.h"
#include "ovmacro/output/source_files.h"

namespace orvan {
namespace {

// "{Nc}" stands for N times the character c.
std::string Expand(std::string s) {
    for (size_t at, end; (at = s.find('{')) != std::string::npos;) {
        end = s.find('}', at);
        s.replace(at, end - at + 1, std::string(std::stoul(s.substr(at + 1)), s[end - 1]));
    }
    return s;
}

// Writes "KIND INDENT:TEXT" ('s' copied, 'c' calculated) laid end to end in one source; the text (null: the
// source), its last column, each position's source character ('_': indentation; null: the text), the pieces.
const std::tuple<const char*, const char*, int64, const char*, size_t> kSequences[] = {
    {"s0:|s4:|c4:", "", -1, "", 0},  // empty writes leave no trace, not even indentation
    {"s-2:a\nb|c0:\nc", nullptr, 1, "a\nb\n\n", 2},
    {"s2:a\n\n\nb", "  a\n  \n  \n  b", 3, "__a\n__\n__\n__b", 8},
    // The write that begins a line chooses its indentation.
    {"s2:a\n|c5:b|s1:c\n|s3:d", "  a\n     bc\n   d", 4, "__a\nbbbbbbc\n___d", 6},
    {"s2:a|s3:x\ny\n", "  ax\n   y\n", -1, "__ax\n___y\n", 4},
    {"s70:a", "{70 }a", 71, "{70_}a", 2},
    {"c1:ab\ncde", " ab\n cde", 4, "{8a}", 1},
    {"c0:ab|s0:cd", nullptr, 4, "aacd", 2},
    {"s2:\t{31x}\n\t{32x}", "  \t{31x}\n  \t{32x}", 38, "__\t{31x}\n__\t{32x}", 4},
    // Tabs count 4 columns, after the last line feed, in runs either side of the length scanned by hand.
    {"s0:ab|s0:\t{30x}", nullptr, 36, nullptr, 1},
    {"s0:ab|s0:\t{31x}\t", nullptr, 41, nullptr, 1},
    {"s0:ab|s0:\t\t{10x}\n\t{17x}", nullptr, 21, nullptr, 1},
    {"s0:ab|s0:\t{20x}\n\t\t{9x}", nullptr, 17, nullptr, 1},
    {"s0:ab\n|s0:\t{3x}", nullptr, 7, nullptr, 1},
    // Gathered runs that overflow the buffer, and long runs after gathered ones, keep their order.
    {"s0:{200x}|s0:{30x}|s0:{30x}", nullptr, 260, nullptr, 1},
    {"s0:{200x}|s0:ab|s0:{100x}", nullptr, 302, nullptr, 1},
    {"s0:ab|s0:{300x}|c2:d\n", nullptr, -1, "ab{300x}dd", 2},
};

// Errors at null, in another buffer, at each position of a text one longer than the pieces cover and at its
// end: AdjustErrorPosition moves the covered ones to their source and leaves the others ('='), while
// MovePositionOutOfExpansion moves the others to the source's end ('$') and indentation to its begin.
void CheckMap(const OutputPieces& pieces, const std::string& source, const std::string& map, size_t count) {
    const char *const b = source.data(), *const e = b + source.size();  // the source's begin and end
    const std::less<const char*> lt;  // a total order, also for pointers into other buffers
    const auto at = [&](const char* p) { return !p ? '_' : !lt(p, b) && lt(p, e) ? *p : p == e ? '$' : '='; };
    const std::string expanded = map + ".";
    std::vector<const char*> positions = {nullptr, "elsewhere"};
    for (size_t i = 0; i <= expanded.size(); ++i) positions.push_back(expanded.data() + i);
    std::string adjusted, moved, monotone;
    for (const char* p : positions) {
        LexScannerException a("m", p), m("m", p);
        pieces.AdjustErrorPosition(a, BasicSubString(expanded));
        MovePositionOutOfExpansion(m, BasicSubString(expanded), pieces, BasicSubString(source));
        adjusted += at(a.GetPosition());
        moved += at(m.GetPosition());
    }
    OutputPiecesMonotonePosMapper mapper(pieces);  // asked for every other position
    for (size_t i = 0; i < map.size(); ++i)
        monotone += i % 2 ? at(mapper.MapOutputPositionToAddress(static_cast<int64>(i))) : map[i];
    EXPECT_EQ(adjusted, "_=" + map + "==");
    std::string indentationAtBegin = map;
    std::replace(indentationAtBegin.begin(), indentationAtBegin.end(), '_', at(b));
    EXPECT_EQ(moved, "_=" + indentationAtBegin + "$$");
    EXPECT_EQ(monotone, map);
    EXPECT_EQ(pieces.GetPieces().size(), count);
}

// Each sequence written with pieces, without, gathering short runs, and all calculated.
TEST(ExpandedOutput, WaysOfWritingAgreeAndMapBackToTheSource) {
    for (const auto& [spec, textSpec, column, mapSpec, count] : kSequences) {
        std::vector<std::string> writes;
        std::string source;
        std::istringstream in(Expand(spec));
        for (std::string w; std::getline(in, w, '|'); source += w.substr(w.find(':') + 1))
            writes.push_back(w);
        const std::string text = textSpec ? Expand(textSpec) : source;
        for (const int way : {0, 1, 2, 3}) {
            SCOPED_TRACE(std::string(spec) + ", way " + std::to_string(way));
            StringStream ss;
            std::optional<ExpandedOutput> out(std::in_place, &ss, way != 1);
            if (way == 2) out->GatherShortRuns();
            const char* p = source.data();
            for (const std::string& w : writes) {
                const BasicSubString s(p, p + (w.size() - w.find(':') - 1));
                p = s.end();
                if (w[0] == 'c' || way == 3) out->WriteCalculatedSubString(s, s, std::stoll(w.substr(1)));
                if (w[0] == 's' && way != 3) out->WriteSubStringFromSourceFile(s, std::stoll(w.substr(1)));
            }
            EXPECT_EQ(ss.str(), way == 2 ? text.substr(0, ss.str().size()) : text);
            EXPECT_EQ(out->GetColumnPos(), column);
            EXPECT_EQ(out->GetCharCount(), static_cast<int64>(text.size()));
            EXPECT_EQ(out->Pieces().size(), way == 1 ? 0 : static_cast<int64>(text.size()));
            if (way % 2 == 0) CheckMap(out->Pieces(), source, mapSpec ? Expand(mapSpec) : text, count);
            out.reset();
            EXPECT_EQ(ss.str(), text);
        }
    }
}

TEST(OutputPiecesDeathTest, PositionsOutsideTheOutputAbort) {
    OutputPieces pieces;
    pieces.push_back(OutputPiece(BasicSubString("abc"), 0));
    EXPECT_DEATH(pieces.MapOutputPositionToAddress(-1), "output position -1 outside the output \\[0,3\\)");
}

// A position is looked up in the files in load order; null and another buffer belong to none.
TEST(SourceFileList, PositionsBelongToTheFileThatHoldsThem) {
    MpfwSourceFileList files;
    for (const char* text : {"a\nb", "x\ny\nz"}) {
        auto* f = new MpfwSourceFile;
        f->fileName = text[0] == 'a' ? "base.cfg" : "zone.cfg";
        f->text = text;
        files.AddSrcFile(f);
    }
    const basic_xstring& other = files[1]->text;
    const std::tuple<const char*, int64, const char*, int64> cases[] = {
        {other.data() + 4, 1, "zone.cfg", 3},
        {files[0]->text.data(), 0, "base.cfg", 1},
        {other.data() + other.size(), -1, "zone.cfg", 3},  // an error at the end is on the last line
        {"elsewhere", -1, nullptr, 0},
        {nullptr, -1, nullptr, 0},
    };
    for (const auto& [pos, index, name, line] : cases) {
        basic_xstring foundName = "none";
        int64 foundLine = 0;
        EXPECT_EQ(files.GetSrcFileIndexContainingPosition(pos), index);
        EXPECT_EQ(files.GetFilenameAndLineNumber(pos, foundName, foundLine), name != nullptr);
        EXPECT_EQ(foundName, name ? name : "none");
        EXPECT_EQ(foundLine, line);
    }
    // A file is found by its name, whatever the case of its letters.
    EXPECT_EQ(files.FindSourceFile("ZONE.cfg"), files[1]);
    EXPECT_EQ(files.FindSourceFile("Base.CFG"), files[0]);
    EXPECT_EQ(files.FindSourceFile("base"), nullptr);
}

}  // namespace
}  // namespace orvan

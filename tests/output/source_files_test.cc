// Source-file records: containment, file and line lookup, the error report, and moving a position out of an
// expanded text.
#include "ovmacro/output/source_files.h"

#include <gtest/gtest.h>

#include <memory>

namespace orvan {
namespace {

MpfwSourceFile* MakeFile(const char* name, const char* text) {
    auto* f = new MpfwSourceFile;
    f->fileName = name;
    f->text = text;
    return f;
}

TEST(StringContainsPos, HalfOpenRange) {
    const basic_xstring s = "abc";
    const basic_xstring other = "xyz";
    const basic_xstring empty;
    struct Case {
        const basic_xstring* str;
        const char* pos;
        bool inside;
    } cases[] = {
        {&s, s.data(), true}, {&s, s.data() + 2, true},  {&s, s.data() + 3, false},
        {&s, nullptr, false}, {&s, other.data(), false}, {&empty, empty.data(), false},
    };
    int index = 0;
    for (const Case& c : cases) EXPECT_EQ(StringContainsPos(*c.str, c.pos), c.inside) << "case " << index++;
}

TEST(SourceFile, LineNumbersCountFromOneAndTheEndBelongsToTheLastLine) {
    LSSourceFile plain("a.txt", "one\ntwo\nthree");
    std::unique_ptr<MpfwSourceFile> mpfw(MakeFile("a.txt", "one\ntwo\nthree"));
    struct Case {
        int64 offset;
        int64 line;
    } cases[] = {{0, 1}, {3, 1}, {4, 2}, {8, 3}, {13, 3}};
    for (const Case& c : cases) {
        basic_xstring name;
        int64 line = 0;
        ASSERT_TRUE(plain.GetFilenameAndLineNumber(plain.text.data() + c.offset, name, line)) << c.offset;
        EXPECT_EQ(name, "a.txt");
        EXPECT_EQ(line, c.line) << c.offset;
        line = 0;
        ASSERT_TRUE(mpfw->GetFilenameAndLineNumber(mpfw->text.data() + c.offset, name, line));
        EXPECT_EQ(line, c.line) << c.offset;
    }
}

TEST(SourceFile, APositionOutsideTheTextLeavesTheOutputsAlone) {
    LSSourceFile plain("a.txt", "abc");
    const basic_xstring elsewhere = "elsewhere";
    basic_xstring name = "unchanged";
    int64 line = 77;
    EXPECT_FALSE(plain.GetFilenameAndLineNumber(elsewhere.data(), name, line));
    EXPECT_FALSE(plain.GetFilenameAndLineNumber(nullptr, name, line));
    EXPECT_EQ(name, "unchanged");
    EXPECT_EQ(line, 77);
}

TEST(SourceFileList, LookupsGoThroughTheFilesInLoadOrder) {
    MpfwSourceFileList files;
    basic_xstring name;
    int64 line = 0;
    EXPECT_FALSE(files.GetFilenameAndLineNumber("x", name, line));  // empty list
    EXPECT_EQ(files.GetSrcFileIndexContainingPosition("x"), -1);

    files.AddSrcFile(MakeFile("base.cfg", "a\nb"));
    files.AddSrcFile(MakeFile("other.cfg", "x\ny\nz"));
    files.AddSrcFile(MakeFile("BASE.CFG", "second"));
    const MpfwSourceFile* other = files[1];

    EXPECT_FALSE(files.GetFilenameAndLineNumber(nullptr, name, line));
    ASSERT_TRUE(files.GetFilenameAndLineNumber(other->text.data() + 4, name, line));
    EXPECT_EQ(name, "other.cfg");
    EXPECT_EQ(line, 3);

    EXPECT_EQ(files.GetSrcFileIndexContainingPosition(other->text.data() + 4), 1);
    EXPECT_EQ(files.GetSrcFileIndexContainingPosition(other->text.data() + other->text.size()), -1);
    EXPECT_EQ(files.GetSrcFileIndexContainingPosition(nullptr), -1);

    EXPECT_EQ(files.FindSourceFile("Base.CFG"), files[0]);  // case ignored; the first loaded wins
    EXPECT_EQ(files.FindSourceFile("OTHER.cfg"), files[1]);
    EXPECT_EQ(files.FindSourceFile("base"), nullptr);
}

TEST(SourceFileList, ErrorReport) {
    MpfwSourceFileList files;
    files.AddSrcFile(MakeFile("a.txt", "1\n2\n3\n4\n5\n6\n7\n8\n9\n10\n11\nf(1,2,3)\n"));
    const basic_xstring& text = files[0]->text;
    const basic_xstring temporary = "f(1,2,3)";
    struct Case {
        const char* position;
        const char* message;
        const char* report;
    } cases[] = {
        {text.data() + text.find("f("), "Too many arguments provided for macro f",
         "\na.txt(12) : Too many arguments provided for macro f\n"},
        {text.data() + text.size(), "Expected ) when read EOS", "\na.txt(13) : Expected ) when read EOS\n"},
        {nullptr, "no position", "\nno position\n"},
        {temporary.data(), "in a temporary", "\nin a temporary\n"},
        {text.data(), "boom\n    invoking macro m", "\na.txt(1) : boom\n    invoking macro m\n"},
    };
    for (const Case& c : cases) {
        StringStream ss;
        files.WriteLexScannerError(ss, LexScannerException(c.message, c.position));
        EXPECT_EQ(ss.GetString(), c.report);
    }
}

TEST(MpfwSourceFile, AdjustErrorPositionMapsTheExpandedTextBackToTheSource) {
    std::unique_ptr<MpfwSourceFile> f(MakeFile("a", "ab\nNAME\n"));
    // Expanded text "ab\nvalue\n": "ab\n" copied, "value" calculated from NAME, "\n" copied.
    f->expandedText = "ab\nvalue\n";
    const char* src = f->text.data();
    f->pieces.push_back(OutputPiece(BasicSubString(src, src + 3), 0));
    f->pieces.push_back(OutputPiece(BasicSubString(src + 3, src + 7), 5));
    f->pieces.push_back(OutputPiece(BasicSubString(src + 7, src + 8), 0));
    const char* expanded = f->expandedText.data();
    const basic_xstring elsewhere = "x";
    struct Case {
        const char* before;
        const char* after;
    } cases[] = {
        {expanded + 1, src + 1},               // copied: the same character
        {expanded + 5, src + 3},               // calculated: the begin of its source
        {expanded + 8, src + 7},               // the last character
        {expanded + 9, expanded + 9},          // the end of the expanded text stays
        {elsewhere.data(), elsewhere.data()},  // not in the expanded text
        {nullptr, nullptr},
    };
    for (const Case& c : cases) {
        LexScannerException e("m", c.before);
        f->AdjustErrorPosition(e);
        EXPECT_EQ(e.GetPosition(), c.after);
    }
}

}  // namespace
}  // namespace orvan

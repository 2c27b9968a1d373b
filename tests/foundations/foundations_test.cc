// The foundations case by case: paths, whole-file reads, line numbers, numbers and characters as text.
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <cstdlib>

#include "ovmacro/foundations/files.h"
#include "ovmacro/foundations/paths.h"
#include "ovmacro/foundations/scanning.h"
#include "ovmacro/foundations/text_format.h"
#include "ovmacro/lexer/token_scanner.h"
#include "support/test_support.h"

namespace orvan {
namespace {

using namespace std::string_literals;

std::string Norm(std::string path) { return NormalisePath(path), path; }
std::string Rel(std::string in) {  // "FROM TO"
    basic_xstring result = "old";
    return CalcRelativePath(in.substr(0, in.find(' ')), in.substr(in.find(' ') + 1), result), result;
}
std::string Dbl(std::string in) { return ToString(std::strtod(in.c_str(), nullptr)); }
std::string Adj(std::string in) {  // the first character is the indentation to remove
    StringStream ss;
    WriteSubStringWithAdjustedIndent(ss, BasicSubString(in.data() + 1, in.data() + in.size()), in[0] - '0');
    return ss.GetString();
}
std::string Repl(std::string in) {  // "TEXT/WHAT/WITH": the text, and how many replacements
    const size_t a = in.find('/'), b = in.find('/', a + 1);
    basic_xstring text = in.substr(0, a);
    const int64 n = StringFindAndReplace(text, in.substr(a + 1, b - a - 1), in.substr(b + 1));
    return text + " " + std::to_string(n);
}

TEST(Foundations, PathsAndTexts) {
    const struct { std::string (*fn)(std::string); const char* in; const char* out; } cases[] = {
        // Paths normalised ("\\" read as "/", "." and ".." resolved), and relative between two directories.
        {Norm, "a\\b//c/", "a/b/c"}, {Norm, "./a/./b/.", "a/b"}, {Norm, "a/b/c/../../d", "a/d"},
        {Norm, "a/..", "."}, {Norm, "", "."}, {Norm, "a/../../b", "../b"}, {Norm, "../../a/../b", "../../b"},
        {Norm, "/", "/"}, {Norm, "/../a", "/a"}, {Norm, "C:\\d\\..\\x", "C:/x"},
        {Norm, "a/.b/..c", "a/.b/..c"}, {Rel, "a/b a/c/d", "../c/d"}, {Rel, "a a", "."},
        {Rel, "a/b a/b/c", "c"}, {Rel, " x", "x"}, {Rel, "a/b/c a", "../.."}, {Rel, ". x", "x"},
        {Rel, "x .", ".."}, {Rel, "ab abc", "../abc"}, {Rel, "/a/b /a/c", "../c"}, {Rel, "/a b", "b"},
        {Rel, "a /b", "/b"},
        // Shortest, and never read as an integer.
        {Dbl, "2.5", "2.5"}, {Dbl, "3", "3.0"}, {Dbl, "-3", "-3.0"}, {Dbl, "-0", "-0.0"},
        {Dbl, "1e20", "1e+20"}, {Dbl, "1e-7", "1e-07"}, {Dbl, "123456789", "123456789.0"},
        {Dbl, "0.33333333333333331", "0.3333333333333333"},
        {Dbl, "1.7976931348623157e308", "1.7976931348623157e+308"}, {Dbl, "4.9e-324", "5e-324"},
        {Dbl, "inf", "inf"}, {Dbl, "-inf", "-inf"}, {Dbl, "-nan", "nan"},
        // After each line feed, blanks (1 column) and tabs (4) are removed while they fit the indentation.
        {Adj, "2a\n    b\n c", "a\n  b\nc"}, {Adj, "4    a\n    b", "    a\nb"}, {Adj, "4x\n\ty", "x\ny"},
        {Adj, "3x\n\ty", "x\n\ty"}, {Adj, "4x\n \ty", "x\n\ty"}, {Adj, "5x\n\t y", "x\ny"},
        {Adj, "2x\n  \n\n\r y", "x\n\n\n\r y"}, {Adj, "0a\n b", "a\n b"}, {Adj, "2\n  x", "\nx"},
        {Repl, "aaa/a/bb", "bbbbbb 3"}, {Repl, "abcabc/bc/", "aa 2"}, {Repl, "abc/x/y", "abc 0"},
        {Repl, "aaa/aa/b", "ba 1"}, {Repl, "a.b/./..", "a..b 1"}, {Repl, "abc//x", "abc 0"},
    };
    for (const auto& c : cases) EXPECT_EQ(c.fn(c.in), c.out) << c.in;
}

TEST(Foundations, LineNumbersCountFromOneAndPlaceTheEndOnTheLastLine) {
    const std::string buffer = "#ab\ncd\n\nef#";  // the text lies between the marks
    const BasicSubString text(buffer.data() + 1, buffer.data() + buffer.size() - 1);
    const int64 lines[] = {-1, 1, 1, 1, 2, 2, 2, 3, 4, 4, 4, -1};  // of the offsets -1 to 10
    for (int i = -1; i <= 10; ++i) EXPECT_EQ(GetLineNumber(text, text.begin() + i), lines[i + 1]) << i;
}

TEST(Foundations, FilesAreReadWholeInTextOrBinaryModeOrRefusedWithTheReason) {
    const testing::TempDir dir;
    const struct { std::string bytes, text; } cases[] = {
        {"", ""}, {"a\r\nb\r\n", "a\nb\n"}, {"a\rb\r", "a\rb\r"}, {"\r\r\n", "\r\n"}, {"\0\r\n"s, "\0\n"s},
        {std::string(70000, 'a') + "\r\n", std::string(70000, 'a') + "\n"}};  // more than one read
    for (const auto& c : cases) {
        basic_xstring text = "old", bytes = "old";
        const std::string path = dir.Write("f", c.bytes);
        EXPECT_TRUE(ReadStringFromFile(path, text, true) && ReadStringFromFile(path, bytes, false));
        EXPECT_TRUE(text == c.text && bytes == c.bytes) << c.bytes.substr(0, 9);
    }
    dir.Write("sub/file", "x");
    ASSERT_EQ(::mkfifo((dir.path() / "fifo").c_str(), 0600), 0);  // refused at once, never waited on
    for (const std::string f : {"sub:Is a directory", "none:No such file or directory",
                                "sub/file/x:Not a directory", "fifo:Not a regular file"}) {
        basic_xstring out = "unchanged", why;
        const std::string path = (dir.path() / f.substr(0, f.find(':'))).string();
        EXPECT_FALSE(ReadStringFromFile(path, out, true, &why) || ReadStringFromFile(path, out, false));
        EXPECT_EQ(f.substr(0, f.find(':') + 1) + why + " " + out, f + " unchanged");
    }
}

TEST(Foundations, CharactersAreQuotedByKindAndEveryCharacterLiteralReadsBack) {
    const struct { char c; const char* quoted; } cases[] = {  // as a character and as a string literal
        {'a', "'a' \"a\""}, {' ', "' ' \" \""}, {'\'', "'\\'' \"'\""}, {'"', "'\"' \"\\\"\""},
        {'\\', "'\\\\' \"\\\\\""}, {'\n', "'\\n' \"\\n\""}, {'\r', "'\\r' \"\\r\""}, {'\t', "'\\t' \"\\t\""},
        {'\xE9', "'\xE9' \"\xE9\""}, {'\0', "'\\x00' \"\\000\""}, {'\x1B', "'\\x1B' \"\\033\""},
        {'\x1F', "'\\x1F' \"\\037\""}, {'\x7F', "'\\x7F' \"\\177\""}};
    for (const auto& c : cases)
        EXPECT_EQ(MakeSingleQuotedLiteralChar(c.c) + " " + MakeDoubleQuotedString({&c.c, &c.c + 1}), c.quoted)
            << static_cast<int>(c.c);
    for (int i = 0; i < 256; ++i) {  // values of type char are kept as such literals, read back when used
        const basic_xstring literal = MakeSingleQuotedLiteralChar(static_cast<char>(i));
        BasicSubString s(literal);
        const LSToken t = LsScanToken(s, false);
        EXPECT_TRUE(s.empty() && t.GetLiteralCharacter() == static_cast<char>(i)) << literal;
    }
}

}  // namespace
}  // namespace orvan

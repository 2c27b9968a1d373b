// Tests of the small scanners: identifiers (UTF-8 bytes included), indentation by columns, and the line
// numbers of positions.
#include "ovmacro/foundations/scanning.h"

#include <gtest/gtest.h>

#include <string>

namespace orvan {
namespace {

// How many characters a scanner consumed from the front of text, and whether it said it consumed any.
template <class Fn>
std::pair<bool, int64> Consumed(const std::string& text, Fn scan) {
    BasicSubString s(text);
    const bool result = scan(s);
    EXPECT_EQ(s.end(), text.data() + text.size()) << "the end of the view must not move";
    return {result, s.begin() - text.data()};
}

struct ScanCase {
    std::string text;
    int64 consumed;
};

TEST(ScanIdentifierTest, ConsumesLettersDigitsUnderscoresAndHighBytes) {
    const ScanCase cases[] = {
        {"abc def", 3},   {"_a1_b2(", 6}, {"A", 1},
        {"1abc", 0},                                                   // a digit cannot start one
        {"$x", 0},        {"", 0},        {"\xC3\xA9t\xC3\xA9 x", 5},  // UTF-8 text reads as an identifier
        {"a\u20ACb+", 5},                                              // a multi-byte character inside
        {"\x80", 1},                     // any byte >= 0x80 counts, valid UTF-8 or not
        {"a-b", 1},       {"a\x7F", 1},  // DEL is no identifier character
    };
    for (const ScanCase& c : cases) {
        SCOPED_TRACE(c.text);
        const auto [found, n] = Consumed(c.text, [](BasicSubString& s) { return ScanIdentifier(s); });
        EXPECT_EQ(n, c.consumed);
        EXPECT_EQ(found, c.consumed > 0);
    }
}

struct IndentationCase {
    std::string text;
    int64 indent;
    int64 consumed;
};

TEST(ScanIndentationTest, SkipsBlanksAndTabsThatFitTheIndentation) {
    // clang-format off
    const IndentationCase cases[] = {
        {"    x", 4, 4},    // exactly the indentation
        {"      x", 4, 4},  // deeper lines keep the rest
        {"  x", 4, 2},      // shallower lines lose what they have
        {"\tx", 4, 1},      // a tab is 4 columns
        {"\tx", 3, 0},      // a tab that does not fit stays whole
        {" \tx", 4, 1},     // blank then tab would make 5 columns
        {"\t x", 5, 2},
        {"\t\tx", 8, 2},
        {"  ", 2, 2},       // the end of the input stops it
        {"", 4, 0},
        {"x  ", 4, 0},
        {"\n  x", 4, 0},    // a line feed is no indentation
        {"\r  x", 4, 0},    // nor a carriage return
        {"   x", 0, 0},     // no indentation to remove
        {"   x", -3, 0},
    };
    // clang-format on
    for (const IndentationCase& c : cases) {
        SCOPED_TRACE("indent " + std::to_string(c.indent) + " text '" + c.text + "'");
        const auto [found, n] =
            Consumed(c.text, [&](BasicSubString& s) { return ScanIndentation(s, c.indent, 4); });
        EXPECT_EQ(n, c.consumed);
        EXPECT_EQ(found, c.consumed > 0);
    }
}

TEST(GetLineNumberTest, CountsFromOneAndPlacesTheEndOnTheLastLine) {
    // The text is a view in the middle of a larger buffer, so that positions just outside it are valid
    // pointers.
    const std::string buffer = "##ab\ncd\n\nef##";
    const BasicSubString text(buffer.data() + 2, buffer.data() + buffer.size() - 2);  // "ab\ncd\n\nef"
    const struct {
        int64 offset;  // from the begin of the text
        int64 line;
    } cases[] = {
        // clang-format off
        {0, 1},
        {2, 1},    // the line feed belongs to the line it ends
        {3, 2},
        {5, 2},
        {6, 3},    // an empty line
        {7, 4},
        {8, 4},
        {9, 4},    // one past the end: the last line
        {-1, -1},  // outside
        {10, -1},
        // clang-format on
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.offset);
        EXPECT_EQ(GetLineNumber(text, text.begin() + c.offset), c.line);
    }
    EXPECT_EQ(GetLineNumber(text, nullptr), -1);

    const std::string endsWithLf = "a\nb\n";
    EXPECT_EQ(GetLineNumber(BasicSubString(endsWithLf), endsWithLf.data() + 4), 3);

    const char empty[] = "";
    EXPECT_EQ(GetLineNumber(BasicSubString(empty, empty), empty), 1);
}

}  // namespace
}  // namespace orvan

// Tests of reading whole files: text mode turns CR LF into LF, binary mode keeps every byte, and a failure
// leaves the result alone and says why.
#include "ovmacro/foundations/files.h"

#include <gtest/gtest.h>

#include <string>

#include "support/test_support.h"

namespace orvan {
namespace {

using orvan::testing::TempDir;

TEST(ReadStringFromFileTest, TextAndBinaryModes) {
    TempDir dir;
    const struct {
        std::string content;
        std::string text;  // as read in text mode
    } cases[] = {
        {"", ""},
        {"a\r\nb\r\n", "a\nb\n"},
        {"lone\rcr\r", "lone\rcr\r"},
        {"\r\r\n\n", "\r\n\n"},  // only the CR right before an LF goes
        {"\r\n", "\n"},
        {std::string("nul\0byte\r\n", 10), std::string("nul\0byte\n", 9)},
        {"no line end", "no line end"},
    };
    int i = 0;
    for (const auto& c : cases) {
        SCOPED_TRACE(i);
        const std::string path = dir.Write("f" + std::to_string(i++), c.content);
        basic_xstring text = "old";
        ASSERT_TRUE(ReadStringFromFile(path, text, true));
        EXPECT_EQ(text, c.text);
        basic_xstring bytes = "old";
        ASSERT_TRUE(ReadStringFromFile(path, bytes, false));
        EXPECT_EQ(bytes, c.content);
    }
}

TEST(ReadStringFromFileTest, LargeFileReadWhole) {
    TempDir dir;
    std::string content, expected;
    for (int i = 0; i < 50000; ++i) {
        content += "line " + std::to_string(i) + "\r\n";
        expected += "line " + std::to_string(i) + "\n";
    }
    const std::string path = dir.Write("big", content);
    basic_xstring text;
    ASSERT_TRUE(ReadStringFromFile(path, text, true));
    EXPECT_EQ(text, expected);
}

TEST(ReadStringFromFileTest, FailuresLeaveTheResultAndSayWhy) {
    TempDir dir;
    dir.Write("sub/file", "x");
    const struct {
        std::string path;
        const char* error;
    } cases[] = {
        {(dir.path() / "sub").string(), "Is a directory"},
        {(dir.path() / "missing").string(), "No such file or directory"},
        {(dir.path() / "sub/file/below").string(), "Not a directory"},
        {"", "No such file or directory"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.path);
        basic_xstring out = "unchanged";
        basic_xstring error;
        EXPECT_FALSE(ReadStringFromFile(c.path, out, true, &error));
        EXPECT_EQ(out, "unchanged");
        EXPECT_EQ(error, c.error);
        EXPECT_FALSE(ReadStringFromFile(c.path, out, false)) << "without an error string";
    }
}

}  // namespace
}  // namespace orvan

// Tests of path normalisation and of relative paths between directories.
#include "ovmacro/foundations/paths.h"

#include <gtest/gtest.h>

#include <string>

namespace orvan {
namespace {

TEST(NormalisePathTest, CanonicalForms) {
    const struct {
        const char* path;
        const char* expected;
    } cases[] = {
        {"a/b/c", "a/b/c"},
        {"a\\b\\c", "a/b/c"},
        {"a//b///c", "a/b/c"},
        {"a\\/\\b", "a/b"},
        {"./a/./b/.", "a/b"},
        {"a/b/../c", "a/c"},
        {"a/b/c/../../d", "a/d"},
        {"a/..", "."},
        {"a/b/", "a/b"},
        {"./", "."},
        {"", "."},
        {"..", ".."},
        {"../a", "../a"},
        {"a/../../b", "../b"},  // a ".." that has nothing to cancel stays
        {"../../a/../b", "../../b"},
        {"/", "/"},
        {"//", "/"},
        {"/a/b/", "/a/b"},
        {"/..", "/"},  // nothing lies above the root
        {"/../a", "/a"},
        {"C:\\dir\\..\\x.txt", "C:/x.txt"},
        {"a/.b/..c", "a/.b/..c"},  // names that merely start with dots are names
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.path);
        basic_xstring path = c.path;
        NormalisePath(path);
        EXPECT_EQ(path, c.expected);
        // Normal forms are fixed points.
        NormalisePath(path);
        EXPECT_EQ(path, c.expected);
    }
}

TEST(CalcRelativePathTest, PathFromOneDirectoryToAnother) {
    const struct {
        const char* from;
        const char* to;
        const char* expected;
    } cases[] = {
        {"a/b", "a/c/d.txt", "../c/d.txt"},
        {"a", "a", "."},
        {"a/b", "a/b", "."},
        {"a/b", "a/b/c", "c"},
        {"a/b/c", "a", "../.."},
        {"x", "y/z", "../y/z"},
        {".", "x", "x"},
        {"", "x", "x"},
        {"x", ".", ".."},
        {"ab", "abc", "../abc"},  // segments are compared whole, not as prefixes
        {"/a/b", "/a/c", "../c"},
        {"/", "/a", "a"},
        {"/a", "b", "b"},  // absolute against relative: the second as it is
        {"a", "/b", "/b"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(std::string(c.from) + " -> " + c.to);
        basic_xstring result = "old";
        CalcRelativePath(c.from, c.to, result);
        EXPECT_EQ(result, c.expected);
    }
}

}  // namespace
}  // namespace orvan

// Reading files that are not regular files must fail at once, never block.
#include <gtest/gtest.h>
#include <sys/stat.h>

#include "ovmacro/foundations/files.h"
#include "support/test_support.h"

namespace orvan {
namespace {

TEST(ReadStringFromFileSpecial, FifoIsRefusedWithoutWaitingForAWriter) {
    testing::TempDir dir;
    const std::string fifo = (dir.path() / "pipe").string();
    ASSERT_EQ(::mkfifo(fifo.c_str(), 0600), 0);
    basic_xstring text = "unchanged", error;
    EXPECT_FALSE(ReadStringFromFile(fifo, text, true, &error));
    EXPECT_EQ(text, "unchanged");
    EXPECT_EQ(error, "Not a regular file");
}

}  // namespace
}  // namespace orvan

// Regression tests from fuzzing the frames: dollar macros whose replacements name others more than once
// describe texts that double with every level, and replacement stops at a bound instead of exhausting
// memory; a file imported more than once is searched once per lookup of a dollar macro.
#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include "ovmacro/lexer/exceptions.h"
#include "ovmacro/vars/var_frame.h"
#include "support/test_support.h"

namespace orvan {
namespace {

using orvan::testing::MessageOf;

// D0 = "xx", Dk = "$(Dk-1)$(Dk-1)": $(Dk) stands for 2^(k+1) characters.
void DefineDoubling(FileScopeVarFrame& f, int levels) {
    f.InsertDollarMacro("D0", "xx");
    for (int k = 1; k < levels; ++k) {
        const std::string prev = "$(D" + std::to_string(k - 1) + ")";
        f.InsertDollarMacro("D" + std::to_string(k), prev + prev);
    }
}

// Lowers the bound on replaced texts for the scope of one test.
class TextLimit {
  public:
    explicit TextLimit(int64 limit) { FileScopeVarFrame::SetDollarMacroTextLimitForTesting(limit); }
    ~TextLimit() { FileScopeVarFrame::SetDollarMacroTextLimitForTesting(0); }
    TextLimit(const TextLimit&) = delete;
    TextLimit& operator=(const TextLimit&) = delete;
};

TEST(DollarMacroTextLimitTest, DoublingReplacementStopsAtTheBound) {
    const struct {
        int64 limit;  // 0: the default bound
        int levels;
        const char* text;
        const char* message;
    } cases[] = {
        {1000, 20, "$(D19)", "Dollar macro replacement longer than 1000 characters"},
        {1000, 20, "<$(D3)$(D8)$(D9)>", "Dollar macro replacement longer than 1000 characters"},
        {2559, 20, "$(D9)", "Dollar macro replacement longer than 2559 characters"},
        // 2^40 characters by default: stopped at 16 MiB, after a few dozen MiB of work.
        {0, 40, "$(D39)", "Dollar macro replacement longer than 16777216 characters"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.text);
        const TextLimit limit(c.limit);
        FileScopeVarFrame f;
        DefineDoubling(f, c.levels);
        basic_xstring text = c.text;
        const char* position = "not null";
        EXPECT_EQ(MessageOf([&] { f.ApplyDollarMacros(text); }, position), c.message);
        EXPECT_EQ(position, nullptr) << "the caller knows the position";
    }
}

// The bound holds for every pass: the text of references before the last pass counts as well as the result.
TEST(DollarMacroTextLimitTest, TextsUpToTheBoundAreReplaced) {
    // $(D9) -> $(D8)$(D8) -> ... -> 512 times $(D0), 2560 characters -> 1024 times x.
    const TextLimit limit(2560);
    FileScopeVarFrame f;
    DefineDoubling(f, 20);
    basic_xstring text = "$(D9)";
    EXPECT_TRUE(f.ApplyDollarMacros(text));
    EXPECT_EQ(text, std::string(1024, 'x'));
}

// Files 0 to 39, each importing the next one twice: without searching each file once, a lookup that finds
// nothing would take 2^39 steps.
TEST(FindDollarMacroTest, FilesImportedAgainAreSearchedOnce) {
    std::vector<std::unique_ptr<FileScopeVarFrame>> files;
    for (int i = 0; i < 40; ++i) files.push_back(std::make_unique<FileScopeVarFrame>());
    for (int i = 0; i + 1 < 40; ++i) {
        files[i]->AddImport(files[i + 1].get());
        files[i]->AddImport(files[i + 1].get());
    }
    files[39]->InsertDollarMacro("END", "end");
    files[20]->InsertDollarMacro("MID", "mid");

    EXPECT_EQ(files[0]->FindDollarMacro("NONE"), nullptr);
    ASSERT_NE(files[0]->FindDollarMacro("END"), nullptr);
    EXPECT_EQ(*files[0]->FindDollarMacro("END"), "end");
    basic_xstring text = "\"$(MID)/$(END)/$(NONE)\"";
    EXPECT_TRUE(files[0]->ApplyDollarMacros(text));
    EXPECT_EQ(text, "\"mid/end/$(NONE)\"");
}

// Searching a file once keeps the order of the lookup: the first definition depth first in import order.
TEST(FindDollarMacroTest, FirstDefinitionDepthFirstInImportOrder) {
    FileScopeVarFrame p, q, r, s;
    q.AddImport(&s);
    r.AddImport(&s);
    p.AddImport(&q);
    p.AddImport(&r);
    s.InsertDollarMacro("X", "from s");
    r.InsertDollarMacro("X", "from r");
    r.InsertDollarMacro("Y", "from r");
    ASSERT_NE(p.FindDollarMacro("X"), nullptr);
    EXPECT_EQ(*p.FindDollarMacro("X"), "from s");  // through q, before r
    ASSERT_NE(p.FindDollarMacro("Y"), nullptr);
    EXPECT_EQ(*p.FindDollarMacro("Y"), "from r");  // s, searched through q, is not searched again
}

}  // namespace
}  // namespace orvan

// What only the library's callers reach of frames: imports, and the bounds of dollar macro replacement.
#include <gtest/gtest.h>

#include "ovmacro/vars/var_frame.h"
#include "support/test_support.h"

namespace orvan::testing {
namespace {

// Defines x in frame, its value naming the frame, so that a lookup shows where it found its answer.
void Define(VarFrame& frame, const char* where, const char* name = "x") {
    frame.AddVariable(new LSValueVariable(LSV_String, name, where));
}
void Import(VarFrame& frame, std::initializer_list<VarFrame*> frames) {
    for (VarFrame* f : frames) frame.ImportFrame(f);
}
std::string Where(LSVariable* v) { return v ? static_cast<LSValueVariable*>(v)->value : "-"; }

TEST(VarFrameTest, LookupThroughImports) {
    FileScopeVarFrame q, r, s, p, m, n, u, w, later;
    // q's own x wins over that of r, which q imports, also for p, which imports q through s; once p imports r
    // directly too, q and r answer differently.
    Define(q, "q");
    Define(r, "r");
    Import(q, {&r});
    Import(s, {&q});
    Import(p, {&s});
    EXPECT_EQ(Where(p.Find("x", nullptr)), "q");
    Import(p, {&r});
    EXPECT_EQ(MessageOf([&] { p.Find("x", nullptr); }), "Ambiguous macro name : x");

    // m and n import each other (and m itself), each with an x of its own import: an answer, not a hang.
    Define(u, "u");
    Define(w, "w");
    Import(n, {&w});
    Import(m, {&m, &u, &n});
    Import(n, {&m});
    EXPECT_EQ(MessageOf([&] { m.Find("x", nullptr); }), "Ambiguous macro name : x");

    // An import is a snapshot: what the imported frame imports later stays out, even when imported again.
    Define(later, "later", "z");
    Import(s, {&m});
    Import(m, {&later});
    Import(s, {&m});
    EXPECT_EQ(Where(s.Find("z", nullptr)), "-");
}

// Dk = "$(Dk-1)$(Dk-1)" stands for 2^(k+1) characters: replacement stops at its bound, which counts the
// references of the pass before the last (512 times $(D0) for $(D9)) as well as the result.
TEST(FileScopeVarFrameTest, DoublingReplacementStopsAtItsBound) {
    const Finally restore([] { FileScopeVarFrame::SetDollarMacroTextLimitForTesting(0); });
    FileScopeVarFrame f;
    f.InsertDollarMacro("D0", "xx");
    for (int k = 1; k < 10; ++k) {
        const std::string previous = "$(D" + std::to_string(k - 1) + ")";
        f.InsertDollarMacro("D" + std::to_string(k), previous + previous);
    }
    basic_xstring text = "$(D9)";
    FileScopeVarFrame::SetDollarMacroTextLimitForTesting(2560);
    EXPECT_TRUE(f.ApplyDollarMacros(text));
    EXPECT_EQ(text, std::string(1024, 'x'));
    FileScopeVarFrame::SetDollarMacroTextLimitForTesting(2559);
    EXPECT_EQ(MessageOf([&] { f.ApplyDollarMacros(text = "$(D9)"); }),
              "Dollar macro replacement longer than 2559 characters");
}

// Files 0 to 39 each import the next one twice: a lookup that searched a file again would take 2^39 steps.
TEST(FileScopeVarFrameTest, DollarMacrosOfImportedFilesAreSearchedOnce) {
    FileScopeVarFrame files[40];
    for (int i = 0; i + 1 < 40; ++i) {
        files[i].AddImport(&files[i + 1]);
        files[i].AddImport(&files[i + 1]);
    }
    files[39].InsertDollarMacro("END", "end");
    basic_xstring text = "$(NONE) $(END)";
    EXPECT_TRUE(files[0].ApplyDollarMacros(text));
    EXPECT_EQ(text, "$(NONE) end");
}

}  // namespace
}  // namespace orvan::testing

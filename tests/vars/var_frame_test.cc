// Tests of frames: lookup through parents and imports, the tie-break between imported definitions, the
// ambiguity error, import snapshots and cycles, and the diagnostic form of a frame.
#include "ovmacro/vars/var_frame.h"

#include <gtest/gtest.h>

#include <string>

#include "support/test_support.h"

namespace orvan {
namespace {

using orvan::testing::MessageOf;

// Defines a value variable whose value names the frame that holds it, so that a test sees where a lookup
// found its answer.
LSVariable* Define(VarFrame& frame, const char* name, const char* where) {
    auto* v = new LSValueVariable(LSV_String, name, where);
    frame.AddVariable(v);
    return v;
}

std::string Where(LSVariable* v) {
    return v ? static_cast<LSValueVariable*>(v)->value : "(none)";
}

TEST(VarFrameTest, OwnDefinitionHidesImportedOnes) {
    FileScopeVarFrame p, q;
    Define(q, "x", "q");
    p.ImportFrame(&q);
    EXPECT_EQ(Where(p.Find("x", nullptr)), "q");
    Define(p, "x", "p");
    EXPECT_EQ(Where(p.Find("x", nullptr)), "p");
    EXPECT_EQ(Where(p.FindLocal("x", nullptr)), "p");
}

TEST(VarFrameTest, EachFrameOfTheParentChainIsSearchedWithItsImports) {
    FileScopeVarFrame root, imported;
    Define(root, "x", "root");
    Define(root, "y", "root");
    Define(imported, "x", "imported");
    VarFrame child(&root);
    child.ImportFrame(&imported);
    EXPECT_EQ(Where(child.Find("x", nullptr)), "imported") << "the child's import before the parent";
    EXPECT_EQ(Where(child.Find("y", nullptr)), "root");
    EXPECT_EQ(child.FindLocal("y", nullptr), nullptr) << "FindLocal leaves out the parents";
    EXPECT_EQ(Where(child.Find2("x")), "root") << "Find2 leaves out the imports";
    EXPECT_EQ(Where(child.Find2("y")), "root");
    EXPECT_EQ(child.Find2("z"), nullptr);
}

TEST(VarFrameTest, ParentsAreSearchedNearestFirst) {
    FileScopeVarFrame root;
    VarFrame middle(&root), leaf(&middle);
    Define(root, "a", "root");
    Define(root, "b", "root");
    Define(middle, "b", "middle");
    EXPECT_EQ(Where(leaf.Find("a", nullptr)), "root");
    EXPECT_EQ(Where(leaf.Find("b", nullptr)), "middle");
    EXPECT_EQ(Where(leaf.Find2("b")), "middle");
    EXPECT_EQ(leaf.GetParent(), &middle);
    EXPECT_EQ(leaf.GetFileScopeVarFrame(), &root) << "inherited from the parent";
    EXPECT_EQ(root.GetFileScopeVarFrame(), &root);
    EXPECT_EQ(root.GetParent(), nullptr);
    VarFrame orphan(nullptr);
    EXPECT_EQ(orphan.GetFileScopeVarFrame(), nullptr);
}

TEST(VarFrameTest, ImportedFramesAreSearchedWithTheirParentsButNotTheirImports) {
    FileScopeVarFrame p, q, r;
    VarFrame qChild(&q);
    Define(q, "fromParent", "q");
    Define(r, "fromImport", "r");
    qChild.ImportFrame(&r);
    p.ImportFrame(&qChild);
    EXPECT_EQ(Where(p.Find("fromParent", nullptr)), "q");
    // r came with qChild's imports at the time of the import, so it is visible too.
    EXPECT_EQ(Where(p.Find("fromImport", nullptr)), "r");
}

TEST(VarFrameTest, ImportsAreASnapshot) {
    FileScopeVarFrame p, q, r;
    Define(r, "y", "r");
    p.ImportFrame(&q);
    q.ImportFrame(&r);  // after p imported q: does not reach p
    EXPECT_EQ(Where(q.Find("y", nullptr)), "r");
    EXPECT_EQ(p.Find("y", nullptr), nullptr);
    EXPECT_EQ(p.allImports.size(), 1u);
    EXPECT_EQ(p.directImports.size(), 1u);

    // Importing again adds the direct import but not what the frame has imported since.
    p.ImportFrame(&q);
    EXPECT_EQ(p.allImports.size(), 1u);
    EXPECT_EQ(p.Find("y", nullptr), nullptr);
}

TEST(VarFrameTest, NameReachedOnlyThroughOneFileIsNoConflict) {
    // P imports Q and R, and R had imported Q before: Q's x is reached twice.
    FileScopeVarFrame p, q, r;
    LSVariable* x = Define(q, "x", "q");
    r.ImportFrame(&q);
    p.ImportFrame(&q);
    p.ImportFrame(&r);
    EXPECT_EQ(p.Find("x", nullptr), x);
}

TEST(VarFrameTest, TwoImportedDefinitionsAreAmbiguous) {
    FileScopeVarFrame p, q, r;
    Define(q, "x", "q");
    Define(r, "x", "r");
    r.ImportFrame(&q);
    p.ImportFrame(&q);
    p.ImportFrame(&r);
    const std::string use = "call x here";
    const char* at = use.data() + 5;
    const char* position = nullptr;
    EXPECT_EQ(MessageOf([&] { p.Find("x", at); }, position), "Ambiguous macro name : x");
    EXPECT_EQ(position, at);
    EXPECT_EQ(MessageOf([&] { p.FindLocal("x", at); }), "Ambiguous macro name : x");
}

TEST(VarFrameTest, DirectImportWinsOverWhatItImports) {
    // P imports Q directly, and Q had imported R before; Q and R both define x.
    FileScopeVarFrame p, q, r;
    Define(q, "x", "q");
    Define(r, "x", "r");
    q.ImportFrame(&r);
    p.ImportFrame(&q);
    EXPECT_EQ(Where(p.Find("x", nullptr)), "q");

    // The same through a second level: S imports P, which answers with Q's x.
    FileScopeVarFrame s;
    s.ImportFrame(&p);
    EXPECT_EQ(Where(s.Find("x", nullptr)), "q");
}

TEST(VarFrameTest, DirectImportsThatAnswerDifferentlyAreAmbiguous) {
    // Q and R each settle x through their own imports, differently.
    FileScopeVarFrame p, q, r, q1, r1;
    Define(q1, "x", "q1");
    Define(r1, "x", "r1");
    q.ImportFrame(&q1);
    r.ImportFrame(&r1);
    p.ImportFrame(&q);
    p.ImportFrame(&r);
    EXPECT_EQ(MessageOf([&] { p.Find("x", nullptr); }), "Ambiguous macro name : x");
}

TEST(VarFrameTest, ImportCyclesAnswerLookups) {
    FileScopeVarFrame a, b;
    Define(b, "x", "b");
    a.ImportFrame(&b);
    b.ImportFrame(&a);
    EXPECT_EQ(Where(a.Find("x", nullptr)), "b");
    EXPECT_EQ(Where(b.Find("x", nullptr)), "b");
    EXPECT_EQ(a.Find("nothing", nullptr), nullptr);
    EXPECT_EQ(b.Find("nothing", nullptr), nullptr);
}

TEST(VarFrameTest, ImportCycleWhereEachFrameNeedsTheTieBreak) {
    // Q and R import each other, and each also imports a different definition of x. Without a guard, Q's
    // tie-break asks R, whose tie-break asks Q again, for ever.
    FileScopeVarFrame q, r, s, t;
    Define(s, "x", "s");
    Define(t, "x", "t");
    q.ImportFrame(&s);
    r.ImportFrame(&t);
    q.ImportFrame(&r);
    r.ImportFrame(&q);
    EXPECT_EQ(MessageOf([&] { q.Find("x", nullptr); }), "Ambiguous macro name : x");
    EXPECT_EQ(MessageOf([&] { r.Find("x", nullptr); }), "Ambiguous macro name : x");
    EXPECT_EQ(q.Find("y", nullptr), nullptr);

    // A frame that imports the cycle: still an answer, not a hang.
    FileScopeVarFrame p;
    p.ImportFrame(&q);
    EXPECT_EQ(MessageOf([&] { p.Find("x", nullptr); }), "Ambiguous macro name : x");
    Define(p, "x", "p");
    EXPECT_EQ(Where(p.Find("x", nullptr)), "p");
}

TEST(VarFrameTest, FrameImportingItself) {
    FileScopeVarFrame a;
    a.ImportFrame(&a);
    EXPECT_EQ(a.Find("x", nullptr), nullptr);
    Define(a, "x", "a");
    EXPECT_EQ(Where(a.Find("x", nullptr)), "a");
}

TEST(VarFrameTest, WriteToStreamShowsLocalVariablesAndParents) {
    FileScopeVarFrame root;
    StringStream ss;
    root.WriteToStream(ss);
    EXPECT_EQ(ss.GetString(),
              "{\n"
              "    Local vars\n"
              "    {\n"
              "    }\n"
              "    Parent frame\n"
              "}\n");

    Define(root, "b", "2");
    VarFrame child(&root);
    Define(child, "a", "1");
    FileScopeVarFrame imported;
    Define(imported, "hidden", "not written");
    child.ImportFrame(&imported);
    child.WriteToStream(ss);
    EXPECT_EQ(ss.GetString(),
              "{\n"
              "    Local vars\n"
              "    {\n"
              "        a = 1\n"
              "    }\n"
              "    Parent frame\n"
              "    {\n"
              "        Local vars\n"
              "        {\n"
              "            b = 2\n"
              "        }\n"
              "        Parent frame\n"
              "    }\n"
              "}\n");
}

}  // namespace
}  // namespace orvan

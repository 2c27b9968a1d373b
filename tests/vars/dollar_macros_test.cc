// Tests of dollar macros: the $(NAME) syntax, one pass and the fixed point of replacement, lookup through
// imported files, redefinition, and the error for a macro that leads back to itself.
#include <gtest/gtest.h>

#include <string>
#include <utility>
#include <vector>

#include "ovmacro/vars/var_frame.h"
#include "support/test_support.h"

namespace orvan {
namespace {

using orvan::testing::MessageOf;

TEST(ScanDollarMacroTest, RecognisesOnlyTheExactForm) {
    const struct {
        std::string text;
        const char* name;  // null: no dollar macro
        int64 end;
    } cases[] = {
        {"$(HOME)/x", "HOME", 7}, {"$(a)", "a", 4},
        {"$(_x1)", "_x1", 6},     {"$(caf\xC3\xA9)", "caf\xC3\xA9", 8},
        {"$(A)(B)", "A", 4},      {"$HOME", nullptr, 0},
        {"$( HOME)", nullptr, 0}, {"$(HOME )", nullptr, 0},
        {"$()", nullptr, 0},      {"$(1a)", nullptr, 0},
        {"$(a-b)", nullptr, 0},   {"$(HOME", nullptr, 0},
        {"$(a", nullptr, 0},      {"$", nullptr, 0},
        {"", nullptr, 0},         {"x$(A)", nullptr, 0},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.text);
        BasicSubString name("unchanged");
        const char* after = ScanDollarMacro(BasicSubString(c.text), name);
        if (c.name) {
            ASSERT_NE(after, nullptr);
            EXPECT_EQ(after - c.text.data(), c.end);
            EXPECT_EQ(name, c.name);
        } else {
            EXPECT_EQ(after, nullptr);
            EXPECT_EQ(name, "unchanged");
        }
    }
}

struct ApplyCase {
    const char* text;
    const char* onePass;
    const char* fixedPoint;
    bool replaced;
};

TEST(ApplyDollarMacrosTest, OnePassAndFixedPoint) {
    FileScopeVarFrame f;
    f.InsertDollarMacro("HOME", "/h");
    f.InsertDollarMacro("A", "$(B)");
    f.InsertDollarMacro("B", "b");
    f.InsertDollarMacro("EMPTY", "");
    f.InsertDollarMacro("OPEN", "$(");
    f.InsertDollarMacro("SELF", "$(SELF)x");  // replaced only when used
    const ApplyCase cases[] = {
        {"$(HOME)/x", "/h/x", "/h/x", true},
        {"\"$(HOME)\\a\" $(HOME)", "\"/h\\a\" /h", "\"/h\\a\" /h", true},
        {"$(NOTDEFINED)", "$(NOTDEFINED)", "$(NOTDEFINED)", false},
        {"$HOME", "$HOME", "$HOME", false},
        {"$( HOME)", "$( HOME)", "$( HOME)", false},
        {"$()", "$()", "$()", false},
        {"$", "$", "$", false},
        {"", "", "", false},
        {"$$(HOME)", "$/h", "$/h", true},
        {"$(A)", "$(B)", "b", true},  // a replacement is rescanned only by the next pass
        {"[$(EMPTY)]", "[]", "[]", true},
        {"$(OPEN)B)", "$(B)", "b", true},  // macros formed across a replacement count in the next pass
        {"$(NOTDEFINED)$(B)", "$(NOTDEFINED)b", "$(NOTDEFINED)b", true},
    };
    for (const ApplyCase& c : cases) {
        SCOPED_TRACE(c.text);
        StringStream ss;
        EXPECT_EQ(f.ApplyDollarMacros(ss, BasicSubString(c.text)), c.replaced);
        EXPECT_EQ(ss.GetString(), c.onePass);
        basic_xstring text = c.text;
        EXPECT_EQ(f.ApplyDollarMacros(text), c.replaced);
        EXPECT_EQ(text, c.fixedPoint);
    }
}

TEST(ApplyDollarMacrosTest, RedefinitionKeepsTheSecondValue) {
    FileScopeVarFrame f;
    f.InsertDollarMacro("X", "first");
    f.InsertDollarMacro("X", "second");
    ASSERT_NE(f.FindDollarMacro("X"), nullptr);
    EXPECT_EQ(*f.FindDollarMacro("X"), "second");
    basic_xstring text = "$(X)";
    EXPECT_TRUE(f.ApplyDollarMacros(text));
    EXPECT_EQ(text, "second");

    // A dollar macro X is also the string variable _X_ of the file frame.
    const std::string probe = "_X_";
    auto* v = dynamic_cast<LSValueVariable*>(f.Find(BasicSubString(probe), nullptr));
    ASSERT_NE(v, nullptr);
    EXPECT_EQ(v->GetType(), LSV_String);
    EXPECT_EQ(v->value, "second");
    EXPECT_EQ(f.Find("X", nullptr), nullptr);
}

TEST(ApplyDollarMacrosTest, MacrosLeadingBackToThemselvesAreAnError) {
    const struct {
        std::vector<std::pair<const char*, const char*>> macros;
        const char* text;
        const char* message;
    } cases[] = {
        {{{"A", "$(A)"}}, "$(A)", "Recursive dollar macro A"},
        {{{"A", "x$(A)"}}, "$(A)", "Recursive dollar macro A"},
        {{{"A", "$(B)"}, {"B", "$(A)"}}, "<$(A)>", nullptr},  // either name
        {{{"A", "$(B)$(B)"}, {"B", "$(A)"}}, "$(B)", nullptr},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.text);
        FileScopeVarFrame f;
        for (const auto& [name, value] : c.macros) f.InsertDollarMacro(name, value);
        basic_xstring text = c.text;
        const char* position = "not null";
        const std::string message = MessageOf([&] { f.ApplyDollarMacros(text); }, position);
        if (c.message)
            EXPECT_EQ(message, c.message);
        else
            EXPECT_EQ(message.rfind("Recursive dollar macro ", 0), 0u) << message;
        EXPECT_EQ(position, nullptr) << "the caller knows the position";
    }
}

TEST(ApplyDollarMacrosTest, LongChainsThatEndAreNoError) {
    FileScopeVarFrame f;
    // M0 -> M1 -> ... -> M49 -> "end": as many passes as macros.
    for (int i = 0; i < 50; ++i) {
        const std::string value = i == 49 ? "end" : "$(M" + std::to_string(i + 1) + ")";
        f.InsertDollarMacro("M" + std::to_string(i), value);
    }
    basic_xstring text = "<$(M0)|$(M25)>";
    EXPECT_TRUE(f.ApplyDollarMacros(text));
    EXPECT_EQ(text, "<end|end>");
}

// A name built from pieces takes one pass per piece, more passes than there are macros; such a text still
// ends and must not be taken for a recursive macro.
TEST(ApplyDollarMacrosTest, NamesBuiltAcrossPassesAreNoRecursion) {
    FileScopeVarFrame f;
    f.InsertDollarMacro("D", "$");
    f.InsertDollarMacro("X", "done");
    basic_xstring text = "$(D)(D)(D)(D)(X)";
    EXPECT_TRUE(f.ApplyDollarMacros(text));
    EXPECT_EQ(text, "done");
}

TEST(FindDollarMacroTest, OwnFirstThenImportedFilesDepthFirstInImportOrder) {
    FileScopeVarFrame main, first, second, deep;
    deep.InsertDollarMacro("X", "deep");
    deep.InsertDollarMacro("ONLYDEEP", "deep");
    first.AddImport(&deep);
    second.InsertDollarMacro("X", "second");
    second.InsertDollarMacro("Y", "second");
    main.AddImport(&first);
    main.AddImport(&second);
    ASSERT_EQ(main.importedFiles.size(), 2u);

    auto find = [&](const char* name) {
        const basic_xstring* v = main.FindDollarMacro(name);
        return v ? *v : std::string("(none)");
    };
    EXPECT_EQ(find("X"), "deep") << "the first import's own import comes before the second import";
    EXPECT_EQ(find("Y"), "second");
    EXPECT_EQ(find("ONLYDEEP"), "deep");
    EXPECT_EQ(find("Z"), "(none)");
    main.InsertDollarMacro("X", "main");
    EXPECT_EQ(find("X"), "main");

    basic_xstring text = "$(X)$(Y)$(ONLYDEEP)";
    EXPECT_TRUE(main.ApplyDollarMacros(text));
    EXPECT_EQ(text, "mainseconddeep");
}

TEST(FindDollarMacroTest, ImportCyclesAnswer) {
    FileScopeVarFrame a, b;
    b.InsertDollarMacro("B", "from b");
    a.AddImport(&b);
    b.AddImport(&a);
    ASSERT_NE(a.FindDollarMacro("B"), nullptr);
    EXPECT_EQ(*a.FindDollarMacro("B"), "from b");
    EXPECT_EQ(a.FindDollarMacro("NONE"), nullptr);
    EXPECT_EQ(b.FindDollarMacro("NONE"), nullptr);
    basic_xstring text = "$(NONE) $(B)";
    EXPECT_TRUE(a.ApplyDollarMacros(text));
    EXPECT_EQ(text, "$(NONE) from b");
}

}  // namespace
}  // namespace orvan

// Tests of variables and variable lists: hiding by name, ownership of every variable added, the filter of
// added names, the diagnostic forms of macros and values, type words, and the lookup counter.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdlib>
#include <memory>
#include <string>
#include <vector>

#include "ovmacro/vars/name_filter.h"
#include "ovmacro/vars/variable_list.h"

namespace orvan {
namespace {

// A value variable that counts its destructions, to check what a list deletes.
class CountedVariable : public LSValueVariable {
  public:
    CountedVariable(BasicSubString name, BasicSubString value, int* deleted)
        : LSValueVariable(LSV_String, name, value), deleted_(deleted) {}
    ~CountedVariable() override { ++*deleted_; }

  private:
    int* deleted_;
};

std::string Written(const LSVariable& v) {
    StringStream ss;
    v.WriteToStream(ss);
    return ss.GetString();
}

std::string Value(const LSVariable& v) {
    StringStream ss;
    v.WriteValue(ss);
    return ss.GetString();
}

TEST(LSVariableListTest, LaterDefinitionHidesEarlierAndBothAreOwned) {
    int deleted = 0;
    LSVariable* first = new CountedVariable("x", "1", &deleted);
    LSVariable* second = new CountedVariable("x", "2", &deleted);
    {
        LSVariableList list;
        EXPECT_EQ(list.Find("x"), nullptr);
        list.Add(first);
        EXPECT_EQ(list.Find("x"), first);
        list.Add(new CountedVariable("y", "3", &deleted));
        list.Add(second);
        EXPECT_EQ(list.Find("x"), second);
        EXPECT_EQ(list.Find("X"), nullptr) << "names are case-sensitive";
        EXPECT_EQ(list.Find("xx"), nullptr);
        EXPECT_EQ(list.Find(""), nullptr);

        StringStream ss;
        list.WriteToStream(ss);
        EXPECT_EQ(ss.GetString(), "{\n    x = 2\n    y = 3\n    x = 1\n}\n")
            << "newest first, hidden ones too";
        EXPECT_EQ(deleted, 0);
    }
    EXPECT_EQ(deleted, 3);
}

TEST(LSVariableListTest, NewestOfEachNameWinsAtEverySize) {
    // Names repeat as the list grows from a few variables to many, so that every way of finding a name
    // (short lists, long ones, and the step between them) must give the newest of each.
    static const char* const kNames[] = {"a", "b", "c", "d", "e", "f", "g"};
    LSVariableList list;
    std::vector<LSVariable*> newest(7, nullptr);
    for (int i = 0; i < 60; ++i) {
        auto* v = new LSValueVariable(LSV_Int, kNames[i % 7 == 6 ? 0 : i % 7], std::to_string(i));
        list.Add(v);
        newest[static_cast<size_t>(i % 7 == 6 ? 0 : i % 7)] = v;
        for (size_t n = 0; n < 7; ++n) {
            const std::string name = kNames[n];  // a view into another buffer than the variable's name
            ASSERT_EQ(list.Find(BasicSubString(name)), newest[n])
                << "after " << i + 1 << " variables, name " << name;
        }
    }
}

TEST(LSVariableListTest, LooksUpByTheCharactersOfTheName) {
    // Names are views into different buffers; equal text finds the variable.
    const std::string definition = "abc = 1";
    LSVariableList list;
    auto* v = new LSValueVariable(LSV_Int, BasicSubString(definition.data(), definition.data() + 3), "1");
    list.Add(v);
    const std::string use = "(abc)";
    EXPECT_EQ(list.Find(BasicSubString(use.data() + 1, use.data() + 4)), v);
    EXPECT_EQ(list.Find(BasicSubString(use.data() + 1, use.data() + 3)), nullptr);
}

// The expander copies a word whose name fails the filter as plain text, without a lookup: every name that was
// added must pass, whatever its length and bytes and wherever its text lies.
TEST(NameFilterTest, EveryAddedNameMayBeContained) {
    const std::string starts = "abcdefghijklmnopqrst";
    const std::string ends = "ABCDEFGHIJKLMNOPQRST";
    std::vector<std::string> names;
    for (size_t n = 0; n <= 20; ++n) {
        names.push_back(starts.substr(0, n));  // each shares its start with the shorter ones
        names.push_back(ends.substr(20 - n));  // each shares its end with the shorter ones
        std::string high;
        for (size_t i = 0; i < n; ++i) high += static_cast<char>(0xFF - 3 * i);
        names.push_back(high);
        // The same first and last four bytes, different middles.
        if (n >= 8) names.push_back("firs" + std::string(n - 8, static_cast<char>('0' + n % 10)) + "last");
    }
    for (const std::string& name : names) {
        SCOPED_TRACE(::testing::PrintToString(name));
        // Added from a buffer of exactly its size, so that AddressSanitizer reports a read past its end, and
        // looked up as a word inside another text.
        const std::unique_ptr<char[]> exact(new char[name.size()]);
        std::copy(name.begin(), name.end(), exact.get());
        NameFilter::Add(BasicSubString(exact.get(), exact.get() + name.size()));
        const std::string text = "\xFF(" + name + ")\xFF";
        EXPECT_TRUE(NameFilter::MayContain(BasicSubString(text.data() + 2, text.data() + 2 + name.size())));
    }
}

TEST(LSVariableListTest, EmptyListWritesBraces) {
    LSVariableList list;
    StringStream ss;
    list.WriteToStream(ss);
    EXPECT_EQ(ss.GetString(), "{\n}\n");
}

TEST(LSVariableListTest, MultiLineBodiesAreIndentedWithTheList) {
    LSVariableList list;
    auto* m = new LSMacroVariable(LSV_Macro, "m", nullptr, false, false, false);
    m->SetSubstitutionString("line1\nline2", false, 0);
    list.Add(m);
    StringStream ss;
    list.WriteToStream(ss);
    EXPECT_EQ(ss.GetString(), "{\n    m = line1\n    line2\n}\n");
}

TEST(LSMacroVariableTest, DiagnosticForms) {
    const struct {
        std::vector<const char*> formals;
        const char* body;
        const char* definition;   // WriteToStream
        const char* nameAndArgs;  // operator<<
    } cases[] = {
        {{}, "body text", "m = body text", "m"},
        {{"a", "b"}, "a+b", "m(a,b) = a+b", "m(a,b)"},
        {{"only"}, "", "m(only) = ", "m(only)"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.definition);
        LSMacroVariable m(LSV_Int, "m", nullptr, false, false, false);
        for (const char* f : c.formals) m.AddArgName(f, LSV_Double, true);
        m.SetSubstitutionString(c.body, false, 4);
        EXPECT_EQ(Written(m), c.definition);
        EXPECT_EQ(Value(m), c.body);
        StringStream ss;
        ss << m;
        EXPECT_EQ(ss.GetString(), c.nameAndArgs);
        EXPECT_EQ(m.GetType(), LSV_Macro) << "whatever the return type";
        EXPECT_EQ(m.GetReturnType(), LSV_Int);
        EXPECT_EQ(m.GetIndent(), 4);
    }
}

TEST(LSMacroVariableTest, FormalArguments) {
    LSMacroVariable m(LSV_Macro, "m", nullptr, true, true, false);
    EXPECT_EQ(m.GetIndent(), -1) << "no body yet";
    EXPECT_EQ(m.GetNumArgs(), 0);
    EXPECT_EQ(m.FindArgName("a"), -1);
    m.AddArgName("a", LSV_Macro, false);
    m.AddArgName("f", LSV_String, true);
    m.AddArgName("a", LSV_Int, false);  // repeats are the definition reader's business
    EXPECT_EQ(m.GetNumArgs(), 3);
    EXPECT_EQ(m.FindArgName("a"), 0) << "the first of equal names";
    EXPECT_EQ(m.FindArgName("f"), 1);
    EXPECT_EQ(m.FindArgName("g"), -1);
    EXPECT_EQ(m.GetArg(1).name, "f");
    EXPECT_EQ(m.GetArg(1).type, LSV_String);
    EXPECT_TRUE(m.GetArg(1).isFnArg);
    EXPECT_EQ(m.GetArg(2).type, LSV_Int);
    EXPECT_TRUE(m.IsPython());
    EXPECT_TRUE(m.IsNaked());
    EXPECT_FALSE(m.IsFnArg());
    m.ClearArgs();
    EXPECT_EQ(m.GetNumArgs(), 0);
    EXPECT_EQ(m.FindArgName("a"), -1);

    const LSFormalArg none;
    EXPECT_EQ(none.type, LSV_None);
    EXPECT_TRUE(none.name.empty());
}

TEST(LSValueVariableTest, DiagnosticFormsAndOwnedNames) {
    LSValueVariable n(LSV_Int, "n", "42");
    EXPECT_EQ(Written(n), "n = 42");
    EXPECT_EQ(Value(n), "42");
    EXPECT_EQ(n.GetType(), LSV_Int);

    // The value is copied: the text it came from may go.
    auto value = std::make_unique<std::string>("temporary value");
    LSValueVariable copied(LSV_String, "s", BasicSubString(*value));
    value.reset();
    EXPECT_EQ(copied.value, "temporary value");

    // An LSVar keeps its own copy of the name, so that it can be made from a temporary name.
    LSVariableList list;
    LSVar* var = nullptr;
    {
        auto name = std::make_unique<std::string>("_HOME_");
        var = new LSVar(BasicSubString(*name), "/h");
        list.Add(var);
    }
    const std::string probe = "_HOME_";
    EXPECT_EQ(var->GetName(), "_HOME_");
    EXPECT_EQ(list.Find(BasicSubString(probe)), var);
    EXPECT_EQ(var->GetType(), LSV_String);
    EXPECT_EQ(Written(*var), "_HOME_ = /h");
}

TEST(CheckVariableTypeTest, ExactTypeWordsOnly) {
    const std::pair<const char*, ELSVariable> cases[] = {
        {"bool", LSV_Bool},     {"int", LSV_Int},       {"double", LSV_Double}, {"char", LSV_Char},
        {"string", LSV_String}, {"Int", LSV_Macro},     {"integer", LSV_Macro}, {"in", LSV_Macro},
        {"", LSV_Macro},        {"string ", LSV_Macro}, {"float", LSV_Macro},   {"macro", LSV_Macro},
    };
    for (const auto& [word, type] : cases) EXPECT_EQ(CheckVariableType(word), type) << "'" << word << "'";
}

// Exits with 0 when Find counts nothing before SetStarted and every call, found or not, after it.
[[noreturn]] void CheckLookupCounter() {
    LSVariableList a, b;
    a.Add(new LSValueVariable(LSV_Int, "x", "1"));
    a.Find("x");
    b.Find("nothing");
    const bool quietBefore = s_count == 0 && !s_started;
    SetStarted();
    a.Find("x");
    a.Find("missing");
    b.Find("x");
    const bool countedAfter = s_count == 3 && s_started;
    std::exit(quietBefore && countedAfter ? 0 : 1);
}

// s_started is process-wide and is never cleared, so the counting is checked in a child process of its own.
TEST(LookupCounterDeathTest, CountsEveryFindOnlyAfterSetStarted) {
    EXPECT_EXIT(CheckLookupCounter(), ::testing::ExitedWithCode(0), "");
}

}  // namespace
}  // namespace orvan

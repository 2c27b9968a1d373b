// Tests of macro definitions: the three body forms, typed returns and formals, the frame a definition goes
// to, how a definition's line vanishes from the output, and every definition error with its position. A
// definition that fails must leave every frame as it was.
#include <gtest/gtest.h>

#include <cstdint>
#include <functional>
#include <string>

#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/lexer/exceptions.h"
#include "support/test_support.h"

namespace orvan {
namespace {

using orvan::testing::MessageOf;
using orvan::testing::kAtEnd;
using orvan::testing::ExpandIn;
using orvan::testing::OffsetIn;

// A marker for "the position just past the end of the text".
int64 OffsetOf(const std::string& text, const char* marker) { return testing::OffsetOf(text, marker); }


LSMacroVariable* FindMacro(VarFrame& frame, const char* name) {
    return dynamic_cast<LSMacroVariable*>(frame.vars.Find(BasicSubString(name)));
}

// The type words, indexed by ELSVariable.
const char* const kTypeWords[] = {"none", "macro", "bool", "int", "double", "char", "string"};

// The formal arguments as "type name" or "type name()", separated by ", ".
std::string DescribeArgs(const LSMacroVariable& m) {
    std::string s;
    for (int64 i = 0; i < m.GetNumArgs(); ++i) {
        const LSFormalArg& a = m.GetArg(i);
        if (i) s += ", ";
        s += std::string(kTypeWords[a.type]) + " " + std::string(a.name.view()) + (a.isFnArg ? "()" : "");
    }
    return s;
}

// ---------------------------------------------------------------------------------------------------------
// Output: a definition leaves no trace, not even its line.

TEST(DefinitionOutputTest, DefinitionLineVanishes) {
    const struct {
        const char* input;
        const char* output;
    } cases[] = {
        {"@def m = {x}", ""},
        {"a\n@def m = {x}\nb\n", "a\nb\n"},
        {"a\n   @def m = {x}   \n\n\nb", "a\nb"},
        // After text on the same line the line feed goes too, and so does the blank before the '@'.
        {"abc @def m = x\ndef", "abcdef"},
        {"a\n@def m =\n{\n    body\n}\nb\n", "a\nb\n"},
        // The next line keeps its own indentation.
        {"@def m = {x}\n\n  m", "  x"},
        // Blanks and comments may stand between '@' and the word, and between any two parts.
        {"x @ def m = {y}\nm", "xy"},
        {"@def /* c */ m\n  (a, // note\n   b)\n  = {a+b}\nm(1,2)", "1+2"},
        {"@def m = {x}@def n = {y}\nm n", "x y"},
        // A later definition hides the earlier one from then on.
        {"@def m = {one}\nm\n@def m = {two}\nm", "one\ntwo"},
        // "()" and no list at all give the same macro: a call reads no argument list.
        {"@def f() = {x}\n@def g = {y}\nf() g()", "x() y()"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.input);
        FileScopeVarFrame frame;
        const std::string text = c.input;
        EXPECT_EQ(ExpandIn(frame, text), c.output);
    }
}

// ---------------------------------------------------------------------------------------------------------
// The stored macro: return type, formal arguments, body and its indentation, flags.

TEST(DefinitionFormsTest, StoredMacro) {
    const struct {
        const char* input;
        const char* name;
        ELSVariable returnType;
        const char* args;
        const char* body;
        int64 indent;
        bool naked;
        bool python;
    } cases[] = {
        {"@def greeting = {hello}", "greeting", LSV_Macro, "", "hello", 0, false, false},
        // Without braces the body is the rest of the line.
        {"@def greeting = hello world\nnext", "greeting", LSV_Macro, "", "hello world", 0, false, false},
        {"@def empty = {}", "empty", LSV_Macro, "", "", 0, false, false},
        // An inline block keeps its line ends, except one directly after the '{'.
        {"@def m = {\n  a\n  b}", "m", LSV_Macro, "", "  a\n  b", 0, false, false},
        // A block opened on the next line starts after its first line's indentation, which is recorded (a tab
        // counts 4) and removed from every line when the body is expanded; its last line end is dropped.
        {"@def m =\n  {\n    line1\n      line2\n  }\n", "m", LSV_Macro, "", "line1\n      line2", 4, false,
         false},
        {"@def m =\n{\n\tx\n}", "m", LSV_Macro, "", "x", 4, false, false},
        {"@def int twice(int n) = {n*2}", "twice", LSV_Int, "int n", "n*2", 0, false, false},
        {"@def apply(f(), x) = {f(x)}", "apply", LSV_Macro, "macro f(), macro x", "f(x)", 0, false, false},
        {"@def string s(bool b, double d, char c, string t, u, int g ( )) = {}", "s", LSV_String,
         "bool b, double d, char c, string t, macro u, int g()", "", 0, false, false},
        {"@def bool b = {true}", "b", LSV_Bool, "", "true", 0, false, false},
        {"@def double d = {1.5}", "d", LSV_Double, "", "1.5", 0, false, false},
        {"@def char c = {'x'}", "c", LSV_Char, "", "'x'", 0, false, false},
        // "()" and no list at all give the same macro.
        {"@def f() = {x}", "f", LSV_Macro, "", "x", 0, false, false},
        // A type word as an argument's name is still a name once a type has been read.
        {"@def f(int int) = {}", "f", LSV_Macro, "int int", "", 0, false, false},
        // Words that merely look like types are names.
        {"@def integer(Int) = {}", "integer", LSV_Macro, "macro Int", "", 0, false, false},
        {"@nakeddef n(a) = {a}", "n", LSV_Macro, "macro a", "a", 0, true, false},
        {"@defpython p(a) = {a+1}", "p", LSV_Macro, "macro a", "a+1", 0, false, true},
        {"@def +int shared = {1}", "shared", LSV_Int, "", "1", 0, false, false},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.input);
        FileScopeVarFrame frame;
        const std::string text = c.input;
        ExpandIn(frame, text);
        LSMacroVariable* m = FindMacro(frame, c.name);
        ASSERT_NE(m, nullptr);
        EXPECT_EQ(m->GetReturnType(), c.returnType);
        EXPECT_EQ(DescribeArgs(*m), c.args);
        EXPECT_EQ(std::string(m->GetSubstitutionString().view()), c.body);
        EXPECT_EQ(m->GetIndent(), c.indent);
        EXPECT_EQ(m->IsNaked(), c.naked);
        EXPECT_EQ(m->IsPython(), c.python);
        EXPECT_FALSE(m->IsFnArg());
        EXPECT_EQ(m->GetContext(), nullptr);
        // The name and body are views of the definition's text, not copies.
        EXPECT_GE(OffsetIn(text, m->GetName().begin()), 0);
        if (!m->GetSubstitutionString().empty()) {
            EXPECT_GE(OffsetIn(text, m->GetSubstitutionString().begin()), 0);
        }
    }
}

// ---------------------------------------------------------------------------------------------------------
// Where a definition goes: the current frame, its parent (@exportdef) or the file-scope frame ('+').

TEST(DefinitionFramesTest, PlusExportAndLocalDefinitionsFromNestedFrames) {
    FileScopeVarFrame file;
    VarFrame mid(&file);
    VarFrame inner(&mid);
    const std::string text = "@def +a = {1}\n@exportdef b = {2}\n@def c = {3}\n@exportdef +d = {4}\n";
    EXPECT_EQ(ExpandIn(inner, text), "");
    EXPECT_NE(FindMacro(file, "a"), nullptr);
    EXPECT_EQ(FindMacro(mid, "a"), nullptr);
    EXPECT_EQ(FindMacro(inner, "a"), nullptr);
    EXPECT_NE(FindMacro(mid, "b"), nullptr);
    EXPECT_EQ(FindMacro(file, "b"), nullptr);
    EXPECT_NE(FindMacro(inner, "c"), nullptr);
    EXPECT_EQ(FindMacro(mid, "c"), nullptr);
    // '+' takes precedence over exporting.
    EXPECT_NE(FindMacro(file, "d"), nullptr);
    EXPECT_EQ(FindMacro(mid, "d"), nullptr);
}

TEST(DefinitionFramesTest, DefinitionsInsideBlocksAndBodies) {
    const struct {
        const char* input;
        const char* output;
    } cases[] = {
        // In a chosen block: '+' reaches the file, @exportdef the block's parent, @def dies with the block.
        {"@if(true){@def +sh = {S}\n@exportdef ex = {E}\n@def loc = {L}\nloc}\nsh ex loc", "L\nS E loc"},
        // In a macro body: the same, the body frame's parent being the caller's frame.
        {"@def m = {@def inner = {I}\ninner}\nm inner", "I inner"},
        {"@def m = {@exportdef out = {O}\n}\nm\nout", "\nO"},
        {"@def m2 = {@def +deep = {D}\n}\n@if(true){m2}\ndeep", "\nD"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.input);
        FileScopeVarFrame frame;
        const std::string text = c.input;
        EXPECT_EQ(ExpandIn(frame, text), c.output);
    }
}

TEST(DefinitionFramesTest, PlusAtTopLevelOfFileGoesToThatFile) {
    FileScopeVarFrame frame;
    const std::string text = "@def +m = {1}\n@exportdef +n = {2}\nm n";
    EXPECT_EQ(ExpandIn(frame, text), "1 2");
    EXPECT_NE(FindMacro(frame, "m"), nullptr);
}

// ---------------------------------------------------------------------------------------------------------
// Errors, their positions, and frames left untouched.

enum class FrameKind {
    kFileTop,  // a file-scope frame with no parent
    kChild,    // a frame whose parent is a file-scope frame
    kOrphan,   // a frame with neither parent nor file scope
};

TEST(DefinitionErrorsTest, MessagesPositionsAndNoFrameChanged) {
    const struct {
        const char* input;
        FrameKind kind;
        const char* message;
        const char* at;  // the text at the error's position (its first occurrence), or kAtEnd
    } cases[] = {
        {"@def 5 = {}", FrameKind::kChild, "Identifier expected for macro name when read 5", "5"},
        {"@def int = {}", FrameKind::kChild, "Identifier expected for macro name when read =", "="},
        {"@def + \"m\" = {}", FrameKind::kChild, "Identifier expected for macro name when read \"m\"",
         "\"m\""},
        {"@def", FrameKind::kChild, "Identifier expected for macro name when read EOS", kAtEnd},
        {"@def +", FrameKind::kChild, "Identifier expected for macro name when read EOS", kAtEnd},
        {"@def f : {}", FrameKind::kChild, "= or ( expected for definition of macro f when read :", ":"},
        {"@def f", FrameKind::kChild, "= or ( expected for definition of macro f when read EOS", kAtEnd},
        {"@def f(a,) = {}", FrameKind::kChild,
         "Read ) while trying to read argument for definition of macro f", ")"},
        {"@def f(,) = {}", FrameKind::kChild,
         "Read , while trying to read argument for definition of macro f", ","},
        {"@def f(int) = {}", FrameKind::kChild,
         "Read ) while trying to read argument for definition of macro f", ")"},
        {"@def f(a a) = {}", FrameKind::kChild,
         "Comma or right parenthesis expected when read a\nwhile reading argument list for definition of "
         "macro f",
         "a)"},
        {"@def f(int a b) = {}", FrameKind::kChild,
         "Comma or right parenthesis expected when read b\nwhile reading argument list for definition of "
         "macro f",
         "b)"},
        {"@def f(a", FrameKind::kChild,
         "Comma or right parenthesis expected when read EOS\nwhile reading argument list for definition of "
         "macro f",
         kAtEnd},
        {"@def f(true) = {}", FrameKind::kChild, "Invalid formal argument 'true' in definition of macro f",
         "true"},
        {"@def f(x, bool false) = {}", FrameKind::kChild,
         "Invalid formal argument 'false' in definition of macro f", "false"},
        {"@def f(x, x) = {}", FrameKind::kChild, "Repeated argument x in definition of macro f", "x)"},
        {"@def g(x, y, int x) = {}", FrameKind::kChild, "Repeated argument x in definition of macro g", "x)"},
        {"@def f(a(b) = {}", FrameKind::kChild, "Expected ) when read b", "b"},
        {"@def f(a)", FrameKind::kChild, "= expected in definition of macro f when read EOS", kAtEnd},
        {"@def f(a) {}", FrameKind::kChild, "= expected in definition of macro f when read {", "{"},
        {"@def f = {abc", FrameKind::kChild, "Met EOS while reading bracketted string", kAtEnd},
        {"@exportdef m = {1}", FrameKind::kFileTop, "No parent frame", "m ="},
        {"@exportdef\n  m(a,\n    b) = {1}", FrameKind::kFileTop, "No parent frame", "m("},
        // The whole definition is read before the frame is chosen: a body error comes first.
        {"@exportdef m = {1", FrameKind::kFileTop, "Met EOS while reading bracketted string", kAtEnd},
        {"@def +m = {1}", FrameKind::kOrphan, "No filescope frame", "m ="},
        {"@def +int m(a) = {1}", FrameKind::kOrphan, "No filescope frame", "m("},
        {"@exportdef +m = {1}", FrameKind::kOrphan, "No filescope frame", "m ="},
        // A failing definition after a good one: the good one stays, only the failing one is missing.
        {"@def ok = {1}\n@def f(x, x) = {}", FrameKind::kChild,
         "Repeated argument x in definition of macro f", "x)"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.input);
        const std::string text = c.input;
        FileScopeVarFrame file;
        VarFrame child(&file);
        VarFrame orphan(nullptr);
        VarFrame* frame = c.kind == FrameKind::kFileTop ? &file
                          : c.kind == FrameKind::kChild ? &child
                                                        : &orphan;
        const char* position = nullptr;
        EXPECT_EQ(MessageOf([&] { ExpandIn(*frame, text); }, position), c.message);
        EXPECT_EQ(OffsetIn(text, position), OffsetOf(text, c.at));
        const bool hadGoodDefinition = text.rfind("@def ok", 0) == 0;
        EXPECT_EQ(file.vars.First(), nullptr);
        EXPECT_EQ(orphan.vars.First(), nullptr);
        for (const char* name : {"f", "g", "m"}) {
            EXPECT_EQ(file.vars.Find(BasicSubString(name)), nullptr) << name;
            EXPECT_EQ(child.vars.Find(BasicSubString(name)), nullptr) << name;
            EXPECT_EQ(orphan.vars.Find(BasicSubString(name)), nullptr) << name;
        }
        if (hadGoodDefinition) {
            EXPECT_NE(child.vars.Find(BasicSubString("ok")), nullptr);
        }
    }
}

// What stood before a failing definition has been written; the definition itself has not.
TEST(DefinitionErrorsTest, OutputBeforeTheFailureStays) {
    FileScopeVarFrame frame;
    const std::string text = "kept\n@def f(a a) = {}\nlost";
    StringStream stream;
    ExpandedOutput output(&stream);
    EXPECT_EQ(MessageOf([&] { MacroExpand(nullptr, &frame, BasicSubString(text), 0, 0, output); }),
              "Comma or right parenthesis expected when read a\nwhile reading argument list for definition "
              "of macro f");
    EXPECT_EQ(stream.str(), "kept\n");
}

}  // namespace
}  // namespace orvan

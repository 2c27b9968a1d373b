// The reading steps of the project description parser over expanded texts: imports, dollar definitions,
// string and path settings.
#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "mpfw_test_host.h"

namespace orvan {
namespace {

using testing::DirHost;
using testing::MessageOf;
using testing::TempDir;

class MpfwReading : public ::testing::Test {
protected:
    MpfwReading() : frame(files), host(frame, dir) {}

    // Keeps the text alive for as long as the parser reads it.
    void Read(const std::string& text) {
        texts.push_back(std::make_unique<const std::string>(text));
        host.Init(*texts.back());
    }
    // The text read last, from p to its end.
    std::string From(const char* p) const {
        const std::string& text = *texts.back();
        return std::string(p, text.data() + text.size());
    }
    std::string Rest() const { return From(host.token.text.begin()); }

    TempDir dir;
    MpfwSourceFileList files;
    MpfwFrame frame;
    DirHost host;
    std::vector<std::unique_ptr<const std::string>> texts;
};

TEST_F(MpfwReading, MacroDefinitionsStoreTheirValuesInOrder) {
    Read(
        "$ROOT = path \"a/./b/\"\n"
        "$Y = \"$(ROOT)/c\"\n"
        "$Z = (\"x\" + 'y' + \"$(Y)\")\n"
        "$S = 'single'\n"
        "$P = path (\"p//q/..\")\n"
        "$ESC = \"tab\\there\"\n"
        "$UNKNOWN = \"$(NOPE)\"\n");
    const std::vector<std::pair<std::string, std::string>> expected = {
        {"ROOT", "a/b"}, {"Y", "a/b/c"},       {"Z", "xya/b/c"},       {"S", "single"},
        {"P", "p"},      {"ESC", "tab\there"}, {"UNKNOWN", "$(NOPE)"},
    };
    for (const auto& [name, value] : expected) {
        basic_xstring n, v;
        ASSERT_TRUE(host.ParseMacroDef(n, v)) << name;
        EXPECT_EQ(n, name);
        EXPECT_EQ(v, value);
    }
    EXPECT_EQ(host.GetTokenType(), TK_EOS);
    // Each definition is a dollar macro and the string variable _NAME_ of the shared frame.
    ASSERT_NE(frame.varFrame.FindDollarMacro("Y"), nullptr);
    EXPECT_EQ(*frame.varFrame.FindDollarMacro("Y"), "a/b/c");
    auto* var = dynamic_cast<LSValueVariable*>(frame.varFrame.Find2("_ROOT_"));
    ASSERT_NE(var, nullptr);
    EXPECT_EQ(var->value, "a/b");
}

TEST_F(MpfwReading, ARedefinitionReplacesTheValue) {
    Read("$X = \"1\" $X = \"$(X)2\" $Y = \"$(X)\"");
    basic_xstring n, v;
    while (host.ParseMacroDef(n, v)) {
    }
    EXPECT_EQ(v, "12");
    EXPECT_EQ(*frame.varFrame.FindDollarMacro("X"), "12");
}

TEST_F(MpfwReading, MacroDefinitionErrors) {
    struct Case {
        const char* text;
        const char* message;
        const char* at;
    } cases[] = {
        {"$X \"a\"", "Expected = after X when read \"a\"", "\"a\""},
        {"$ = \"a\"", "Expected identifier after $ when read =", "= \"a\""},
        {"$X = 12", "Expected quoted string when read 12", "12"},
        {"$X = ", "Expected quoted string when read EOS", ""},
        {"$X = path", "Expected quoted string when read EOS", ""},
        {"$X = (\"a\" \"b\")", "Expected ) after \"a\" when read \"b\"", "\"b\")"},
        {"$X = (1)", "No implicit conversion from int64 to string", ")"},
        // B holds "$(A)" and A holds "$(B)": a use of either never ends.
        {"$A = \"$(B)\" $B = \"$(A)\" $C = \"<$(A)>\"", "Recursive dollar macro", "\"<$(A)>\""},
    };
    for (const Case& c : cases) {
        MpfwSourceFileList localFiles;
        MpfwFrame localFrame(localFiles);
        DirHost local(localFrame, dir);
        const std::string text = c.text;
        local.Init(text);
        const char* position = nullptr;
        const std::string message = MessageOf(
            [&] {
                while (local.ParseMacroDef()) {
                }
            },
            position);
        EXPECT_EQ(message.substr(0, std::string(c.message).size()), c.message) << c.text;
        ASSERT_NE(position, nullptr) << c.text;
        EXPECT_EQ(std::string(position, text.data() + text.size()), c.at) << c.text;
    }
}

TEST_F(MpfwReading, StepsThatDoNotMatchConsumeNothing) {
    for (const char* text : {"x = 1", "\"s\"", "", "@import \"a\""}) {
        Read(text);
        const LSToken before = host.token;
        if (host.GetTokenType() != TK_AT) {
            EXPECT_FALSE(host.ParseImportDirective()) << text;
        }
        EXPECT_FALSE(host.ParseMacroDef()) << text;
        EXPECT_EQ(host.token, before) << text;
        EXPECT_EQ(host.token.text.begin(), before.text.begin());
    }
}

TEST_F(MpfwReading, ImportDirectivesReportTheRecordedFile) {
    dir.Write("known.ovp", "");
    dir.Write("sub/unloaded.ovp", "");
    MpfwSourceFile* known = host.AddFile(host.Path("known.ovp"), BasicSubString());
    ASSERT_NE(known, nullptr);
    Read("@import \"known.ovp\" @import \"x\"");
    ASSERT_TRUE(host.ParseImportDirective());
    EXPECT_EQ(host.token, TK_AT);  // just past the quoted name
    Read("$D = \"sub\" @import \"$(D)/unloaded.ovp\" $E = \"e\"");
    ASSERT_TRUE(host.ParseMacroDef());
    ASSERT_TRUE(host.ParseImportDirective());
    EXPECT_EQ(host.token, TK_DOLLAR);
    EXPECT_EQ(host.resolved, (std::vector<std::string>{"known.ovp", "sub/unloaded.ovp"}));
    EXPECT_EQ(host.onImport, (std::vector<MpfwSourceFile*>{known, nullptr}));
}

TEST_F(MpfwReading, ImportDirectiveErrors) {
    struct Case {
        const char* text;
        const char* message;
        const char* at;
    } cases[] = {
        {"@include \"x\"", "Syntax error: @include", "include \"x\""},
        {"@", "Syntax error: @EOS", ""},
        {"@import x", "Expected quoted string when read x", "x"},
        {"@import \"missing.ovp\" rest", "Couldn't open file missing.ovp", "import \"missing.ovp\" rest"},
    };
    for (const Case& c : cases) {
        const std::string text = c.text;
        host.Init(text);
        const char* position = nullptr;
        EXPECT_EQ(MessageOf([&] { host.ParseImportDirective(); }, position), c.message) << c.text;
        ASSERT_NE(position, nullptr);
        EXPECT_EQ(std::string(position, text.data() + text.size()), c.at) << c.text;
    }
}

TEST_F(MpfwReading, StringAndPathSettings) {
    struct Case {
        const char* text;
        bool path;
        const char* value;  // null: the setting is refused with `message`
        const char* message;
        const char* rest;  // after a good setting; where the error is after a bad one
    } cases[] = {
        {"$NAME = \"v $(X)\" next", false, "v $(X)", nullptr, "next"},  // no dollar macros here
        {"$NAME = \"a\\\\b/\"", false, "a\\b/", nullptr, ""},
        {"$NAME = \"src/lib\" next", true, "src/lib", nullptr, "next"},
        {"$NAME = \"\" next", true, "", nullptr, "next"},
        {"NAME = \"v\"", false, nullptr, "Expected '$' when read NAME", "NAME = \"v\""},
        {"$OTHER = \"v\"", false, nullptr, "Expected 'NAME' when read OTHER", "OTHER = \"v\""},
        {"$NAMES = \"v\"", false, nullptr, "Expected 'NAME' when read NAMES", "NAMES = \"v\""},
        {"$NAME \"v\"", false, nullptr, "Expected = after NAME when read \"v\"", "\"v\""},
        {"$NAME = 'v'", false, nullptr, "Expected quoted string when read 'v'", "'v'"},
        {"$NAME = (\"v\")", false, nullptr, "Expected quoted string when read (", "(\"v\")"},
        {"$NAME = \"a\\\\b\"", true, nullptr, "Forward slashes must be used in \"a\\\\b\"", "\"a\\\\b\""},
        {"$NAME = \"a/\"", true, nullptr, "Path can't end with a trailing slash : \"a/\"", "\"a/\""},
    };
    for (const Case& c : cases) {
        Read(c.text);
        basic_xstring value;
        const char* position = nullptr;
        if (c.value) {
            if (c.path)
                host.ParsePathSetting("NAME", value);
            else
                host.ParseStringSetting("NAME", value);
            EXPECT_EQ(value, c.value) << c.text;
            EXPECT_EQ(Rest(), c.rest) << c.text;
        } else {
            const std::string message = MessageOf(
                [&] {
                    if (c.path)
                        host.ParsePathSetting("NAME", value);
                    else
                        host.ParseStringSetting("NAME", value);
                },
                position);
            EXPECT_EQ(message, c.message) << c.text;
            ASSERT_NE(position, nullptr);
            EXPECT_EQ(From(position), c.rest) << c.text;
        }
    }
}

TEST_F(MpfwReading, QuotedNamesApplyDollarMacrosAndStayCurrent) {
    Read("$D = \"dir\"");
    ASSERT_TRUE(host.ParseMacroDef());
    Read("\"$(D)/f.txt\" 'single'");
    EXPECT_EQ(host.ParseQuotedString(), "dir/f.txt");
    EXPECT_EQ(host.ParseFileOrDirName(), "dir/f.txt");
    EXPECT_EQ(host.token, TK_DQ_STRING);
    host.ReadNextToken();
    EXPECT_EQ(host.ParseQuotedString(), "single");

    Read("\"a\\\\b\"");
    EXPECT_EQ(MessageOf([&] { host.ParseFileOrDirName(); }), "Forward slashes must be used in \"a\\\\b\"");
    Read("x");
    EXPECT_EQ(MessageOf([&] { host.ParseQuotedString(); }), "Expected quoted string when read x");
}

TEST_F(MpfwReading, FileAndLineOfTheCurrentTokenComeFromTheSource) {
    dir.Write("f.ovp", "@def line = (string(__LINE__))\n\n$L = line\n$F = (__FILE__)\n");
    MpfwSourceFile* f = host.AddFile(host.Path("f.ovp"), BasicSubString());
    ASSERT_NE(f, nullptr);
    host.Init(f->expandedText);
    basic_xstring name, value;
    ASSERT_TRUE(host.ParseMacroDef(name, value));
    EXPECT_EQ(value, "1");  // __LINE__ stands in the macro body, on line 1
    ASSERT_TRUE(host.ParseMacroDef(name, value));
    EXPECT_EQ(value, host.Path("f.ovp"));

    Read("(__FILE__)");  // a text that no loaded file produced
    basic_xstring file = "unchanged";
    int64 line = -5;
    EXPECT_FALSE(host.GetFilenameAndLineNumberAtCurrentPosition(file, line));
    EXPECT_EQ(file, "unchanged");
}

}  // namespace
}  // namespace orvan

// @import, @importpath and @relativepath, with a handler that records what the expander hands it.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "ovmacro/expander/macro_expander.h"
#include "support/test_support.h"

namespace orvan {
namespace {

using testing::MessageOf;

class RecordingHandler : public ImportHandler {
public:
    bool HandleImport(VarFrame* frame, const basic_xstring& fileName, const char* position) override {
        imports.push_back(fileName);
        frames.push_back(frame);
        positions.push_back(position);
        if (!failWith.empty()) throw LexScannerException(failWith, position);
        return accept;
    }
    bool HandleImportPath(const basic_xstring& path, const char* position) override {
        if (!supportsPaths) return ImportHandler::HandleImportPath(path, position);
        paths.push_back(path);
        return true;
    }

    bool accept = true;
    bool supportsPaths = false;
    std::string failWith;
    std::vector<std::string> imports, paths;
    std::vector<VarFrame*> frames;
    std::vector<const char*> positions;
};

std::string Expand(const std::string& text, ImportHandler* handler, FileScopeVarFrame& frame) {
    basic_xstring result;
    MacroExpand(handler, &frame, BasicSubString(text), 0, 0, result);
    return result;
}

TEST(ImportDirective, HandsTheNameToTheHandlerAndStaysInTheOutput) {
    struct Case {
        const char* text;
        const char* output;
        const char* imported;
    } cases[] = {
        {"@import \"a.mac\"\nrest", "@import \"a.mac\"\nrest", "a.mac"},
        {"  @import \"dir/b.mac\" // note", "  @import \"dir/b.mac\" // note", "dir/b.mac"},
        {"@import \"esc\\tname\"", "@import \"esc\\tname\"", "esc\tname"},
        // The bracketed form is evaluated and written back as a literal in place of the directive.
        {"@def f = \"a.mac\"\n@import(f)\nrest", "@import \"a.mac\"\nrest", "a.mac"},
        {"@import(\"a\" + \".mac\")", "@import \"a.mac\"", "a.mac"},
        // A quote or a backslash in the evaluated name is escaped, so that the literal reads back the same.
        {"@import(\"we\\\"ird\\\\name\")", "@import \"we\\\"ird\\\\name\"", "we\"ird\\name"},
    };
    for (const Case& c : cases) {
        RecordingHandler handler;
        FileScopeVarFrame frame;
        EXPECT_EQ(Expand(c.text, &handler, frame), c.output) << c.text;
        ASSERT_EQ(handler.imports.size(), 1u) << c.text;
        EXPECT_EQ(handler.imports[0], c.imported);
        EXPECT_EQ(handler.frames[0], &frame);
    }
}

TEST(ImportDirective, PositionIsTheTokenAfterTheWord) {
    RecordingHandler handler;
    FileScopeVarFrame frame;
    const std::string text = "@import   \"a\"";
    basic_xstring result;
    MacroExpand(&handler, &frame, BasicSubString(text), 0, 0, result);
    ASSERT_EQ(handler.positions.size(), 1u);
    EXPECT_EQ(handler.positions[0], text.data() + text.find('"'));
}

TEST(ImportDirective, Errors) {
    struct Case {
        const char* text;
        bool accept;
        const char* failWith;
        const char* message;
        const char* at;  // the text at the error's position
    } cases[] = {
        {"@import \"x\"", false, "", "Can't import file: x", "\"x\""},
        {"@import x", true, "", "Quoted string expected after 'import' when read x", "x"},
        {"@import", true, "", "Quoted string expected after 'import' when read EOS", ""},
        {"@import \"inner\"", true, "raised by the handler", "raised by the handler", "\"inner\""},
        {"@importpath \"inc\"", true, "", "@importpath directive not supported", "\"inc\""},
        {"@importpath 12", true, "", "Quoted string expected after 'importpath' when read 12", "12"},
        // Nested expansions have no import handler.
        {"@def m = {@import \"a\"}\nm", true, "", "@import statement not allowed here\n    invoking macro m",
         "import \"a\"}\nm"},
        {"@def m = {@importpath \"a\"}\nm", true, "",
         "@importpath statement not allowed here\n    invoking macro m", "importpath \"a\"}\nm"},
    };
    for (const Case& c : cases) {
        RecordingHandler handler;
        handler.accept = c.accept;
        handler.failWith = c.failWith;
        FileScopeVarFrame frame;
        const std::string text = c.text;
        const char* position = nullptr;
        EXPECT_EQ(MessageOf([&] { Expand(text, &handler, frame); }, position), c.message) << c.text;
        ASSERT_NE(position, nullptr) << c.text;
        EXPECT_EQ(std::string(position, text.data() + text.size()), c.at) << c.text;
    }
}

TEST(ImportDirective, WithoutAHandlerImportsAreRefusedAtTheDirectiveWord) {
    FileScopeVarFrame frame;
    const std::string text = "text\n@ import \"a\"";
    const char* position = nullptr;
    EXPECT_EQ(MessageOf([&] { Expand(text, nullptr, frame); }, position),
              "@import statement not allowed here");
    EXPECT_EQ(position, text.data() + text.find("import"));
}

TEST(ImportPathDirective, HandsTheDirectoryToTheHandlerAndLeavesNoText) {
    struct Case {
        const char* text;
        const char* output;
        const char* path;
    } cases[] = {
        {"a @importpath \"inc\" b", "a b", "inc"},
        {"@importpath(\"in\" + \"c/x\")\nrest", "\nrest", "inc/x"},
    };
    for (const Case& c : cases) {
        RecordingHandler handler;
        handler.supportsPaths = true;
        FileScopeVarFrame frame;
        EXPECT_EQ(Expand(c.text, &handler, frame), c.output) << c.text;
        ASSERT_EQ(handler.paths.size(), 1u);
        EXPECT_EQ(handler.paths[0], c.path);
    }
}

TEST(RelativePathDirective, WritesTheQuotedRelativePathWhereTheAtStood) {
    struct Case {
        const char* text;
        const char* output;
    } cases[] = {
        {"@relativepath(\"a/b\", \"a/c/d.txt\")", "\"../c/d.txt\""},
        {"x = @relativepath(\"a/./b/\", \"a\\\\c\") ;", "x = \"../c\" ;"},
        {"@relativepath(\"a\", \"a\")", "\".\""},
        {"@def dir = \"src\"\n  @relativepath(dir, dir + \"/x y\")", "  \"x y\""},
    };
    for (const Case& c : cases) {
        FileScopeVarFrame frame;
        EXPECT_EQ(Expand(c.text, nullptr, frame), c.output) << c.text;
    }
}

TEST(RelativePathDirective, Errors) {
    struct Case {
        const char* text;
        const char* message;
    } cases[] = {
        {"@relativepath \"x\"", "( expected after @relativepath when read \"x\""},
        {"@relativepath(\"x\")", "Comma expected in @relativepath directive when read )"},
        {"@relativepath(\"a\", \"b\", \"c\")", ") expected  in @relativepath directive when read ,"},
        {"@relativepath(1, \"b\")", "No implicit conversion from int64 to string\n    in @relativepath(1)"},
    };
    for (const Case& c : cases) {
        FileScopeVarFrame frame;
        EXPECT_EQ(MessageOf([&] { Expand(c.text, nullptr, frame); }), c.message) << c.text;
    }
}

}  // namespace
}  // namespace orvan

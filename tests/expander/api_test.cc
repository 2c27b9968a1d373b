// What only the library's entry points show: the source byte that each output byte maps back to (copied text,
// "@@", "@" comments, input and output indentation, values, dollar macros), value variables named "@word",
// frames built by hand, and what a failed expansion leaves written.
#include <gtest/gtest.h>

#include <string>
#include <utility>
#include <vector>

#include "ovmacro/expander/macro_expander.h"
#include "support/test_support.h"

namespace orvan {
namespace {

using testing::ExpandIn;

TEST(OutputMapTest, EachOutputByteMapsToItsSourceByte) {
    const struct {
        std::string text, expected;  // the expansion; empty: the text itself
        std::vector<int64> map;      // source offset of each output byte (-1: inserted blanks); empty: identity
        int64 inputIndent = 0, outputIndent = 0;
    } cases[] = {
        // Without an import handler "@$" is no directive.
        {"abc  def\n\n  ghi\t;(1+2)\n// c @x @@\n\"@@ x\" '@@' @$N = \"v\" @", "", {}},
        {"a@@b x @@ y a@@@b", "ab x  y a@b", {0, 3, 4, 5, 6, 9, 10, 11, 12, 15, 16}},
        {"@@x@@", "x", {2}},
        {"abc @// note\ndef", "abcdef", {0, 1, 2, 13, 14, 15}},
        {"abc\n  @// a\n\n  @/* b */\n  def", "abc\n  def", {0, 1, 2, 3, 24, 25, 26, 27, 28}},
        {"a @/* x */ b", "ab", {0, 11}},
        {"abc\n@// x", "abc\n", {0, 1, 2, 3}},
        {"a\r\nb\rc", "", {}},
        {"a\r\n@// x\nb", "ab", {0, 9}},
        {"x\n    y\n      z\n  w\n\tv", "x\ny\n  z\nw\nv", {0, 1, 6, 7, 12, 13, 14, 15, 18, 19, 21}, 4},
        {"x\n\ty", "", {}, 2},  // a tab wider than the indentation to remove stays
        {"  x\n  y", "  x\ny", {0, 1, 2, 3, 6}, 2},
        {"a\r\n  b", "", {}, 2},         // no indentation is removed after a carriage return,
        {"a\v\n  b\f\n  c", "", {}, 2},  // a vertical tab or a form feed
        {"a\n  @// s\n    b", "a\n  b", {0, 1, 12, 13, 14}, 2},
        {"x\n\ny", "  x\n  \n  y", {-1, -1, 0, 1, -1, -1, 2, -1, -1, 3}, 0, 2},
        {"x\n", " x\n", {-1, 0, 1}, 0, 1},
        {"a\n  b\n    c", "   a\n   b\n     c", {-1, -1, -1, 0, 1, -1, -1, -1, 4, 5, -1, -1, -1, 8, 9, 10}, 2, 3},
        // A value is one calculated piece mapped to the name (or the '@') that produced it.
        {"n+n sv", "5+5 a b", {0, 1, 2, 3, 4, 4, 4}},
        {"a @v b a@v.b", "a 42 b a42.b", {0, 1, 2, 2, 4, 5, 6, 7, 8, 8, 10, 11}},
        {"@ v @ /*c*/v!", "42 42!", {0, 0, 3, 4, 4, 12}},
        {"@/*c*/v! @vv @v1 v @i", "v! @vv @v1 v @i", {6, 7, 8, 9, 10, 11, 12, 13, 14, 15, 16, 17, 18, 19, 20}},
        {"@m", "  1\n  2", {0, 0, 0, 0, 0, 0, 0}, 0, 2},
        {"<@e>", "<>", {0, 3}},
        {"x \"$(HOME)/a\" y", "x \"/h/a\" y", {0, 1, 2, 2, 2, 2, 2, 2, 13, 14}},
        {"", "", {}},
    };
    const std::pair<const char*, const char*> values[] = {
        {"n", "5"}, {"sv", "a b"}, {"@v", "42"}, {"@m", "1\n2"}, {"@e", ""}};
    for (const auto& c : cases) {
        SCOPED_TRACE(c.text);
        // Values of a parent frame are seen, "@word" values of an imported frame are not, dollar macros of an
        // imported file are; dollar macros make the plain-text lane stop at literals: only where they are used.
        FileScopeVarFrame imported, file;
        for (const auto& [name, value] : values) file.AddVariable(new LSValueVariable(LSV_String, name, value));
        imported.AddVariable(new LSValueVariable(LSV_String, "@i", "1"));
        imported.InsertDollarMacro("HOME", "/h");
        if (c.text.find("$(") != std::string::npos) file.AddImport(&imported);
        VarFrame frame(&file);
        frame.ImportFrame(&imported);
        const testing::ExactBuffer text(c.text);
        std::string out;
        OutputPieces pieces;
        MacroExpand(nullptr, &frame, text.view(), c.inputIndent, c.outputIndent, out, pieces);
        const std::string& expected = c.expected.empty() ? c.text : c.expected;
        EXPECT_EQ(out, expected);
        ASSERT_EQ(pieces.size(), static_cast<int64>(out.size()));
        std::vector<int64> map, identity;
        OutputPiecesMonotonePosMapper mapper(pieces);
        for (int64 at = 0; at < pieces.size(); ++at) {
            map.push_back(text.Offset(mapper.MapOutputPositionToAddress(at)));
            identity.push_back(at);
        }
        EXPECT_EQ(map, c.map.empty() ? identity : c.map);
        // Copied pieces hold the bytes of their source; a piece without a source is inserted blanks.
        size_t at = 0;
        for (const OutputPiece& p : pieces.GetPieces()) {
            const std::string written = out.substr(at, static_cast<size_t>(p.size()));
            if (p.IsCopied()) {
                EXPECT_EQ(written, p.source.GetString());
            } else if (!p.source.begin()) {
                EXPECT_EQ(written, std::string(written.size(), ' '));
            }
            at += written.size();
        }
    }
}

TEST(FramesTest, WithoutAFileScope) {
    testing::NoImports handler;  // which also leaves @importpath to the default handling
    VarFrame root(nullptr);
    const std::pair<std::string, std::string> errors[] = {
        {"@def +m = {1}", "1:7 No filescope frame"},
        {"@exportdef +int m(a) = {1}", "1:17 No filescope frame"},
        {"@$N = \"v\"", "1:3 No filescope frame for $N"},
        {"@importpath \"inc\"", "1:13 @importpath directive not supported"},
    };
    for (const auto& [text, error] : errors) {
        const std::string& input = text;  // clang 14 cannot capture a structured binding in a lambda
        EXPECT_EQ(testing::ErrorIn(input, [&] { ExpandIn(root, input, &handler); }), error);
    }
    // "@def +" fails inside @assertfails just as outside it; there are no dollar macros.
    EXPECT_EQ(ExpandIn(root, "@assertfails{@def +x = 1}ok \"$(OTHER)\""), "ok \"$(OTHER)\"");
}

// What was written before an error stays in an ExpandedOutput; a string result is left as it was.
TEST(FailedExpansionTest, LeavesWhatWasWrittenBeforeTheError) {
    const std::pair<std::string, std::string> cases[] = {
        {"x\n@def f(a a) = {}\nlost", "abx\n"},
        {"@def m(a) = {written a @if(bad +){}never}\nbefore m(arg) after", "abbefore written arg "},
        {"@def L = {[a, b}\nx @for(y in L){<y>} never", "abx <a>"},
        {"x\ny", "abx\n    y"},  // expanded in the middle of a line: the first line is not indented
    };
    for (const auto& [text, written] : cases) {
        FileScopeVarFrame frame;
        StringStream stream;
        ExpandedOutput output(&stream);
        output.WriteSubStringFromSourceFile(BasicSubString("ab"), 0);
        try {
            MacroExpand(nullptr, &frame, BasicSubString(text), 0, 4, output);
        } catch (const LexScannerException&) {
        }
        EXPECT_EQ(stream.str(), written) << text;
    }
    FileScopeVarFrame frame;
    std::string out = "previous";
    testing::MessageOf([&] { MacroExpand(nullptr, &frame, BasicSubString("@def m(a,b) = {}\nm(1)"), 0, 0, out); });
    EXPECT_EQ(out, "previous");
}

}  // namespace
}  // namespace orvan

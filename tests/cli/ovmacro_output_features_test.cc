// ovmacro end to end: the source map, line markers, gnu diagnostics, --check, and reproducible outputs.
#include <gtest/gtest.h>

#include <cctype>
#include <filesystem>
#include <map>
#include <string>
#include <utility>
#include <vector>

#include "ovmacro/mpfw/mpfw_parser.h"
#include "support/test_support.h"

namespace orvan {
namespace {

using testing::ReadFile;
using testing::RunTool;
using testing::TempDir;
using testing::ToolResult;

using Files = std::vector<std::pair<std::string, std::string>>;

ToolResult RunIn(const TempDir& dir, const std::vector<std::string>& args, const std::string& input = "") {
    return RunTool(args, input, dir.path().string());
}

std::string Example(const std::string& name) {
    return ReadFile(std::string(OVMACRO_SOURCE_DIR) + "/examples/" + name);
}

// ---- A small JSON reader (objects, arrays, strings, integers), so that the source map is read back as any
// JSON consumer would read it: a fault in its escaping makes it unreadable.

struct Json {
    long long number = 0;
    std::string string;
    std::vector<Json> array;
    std::map<std::string, Json> object;

    bool Has(const std::string& key) const { return object.count(key) != 0; }
    const Json& operator[](const std::string& key) const {
        static const Json none;
        const auto it = object.find(key);
        return it == object.end() ? none : it->second;
    }
};

class JsonReader {
public:
    explicit JsonReader(const std::string& text) : text_(text) {}
    bool Read(Json& v) { return Value(v) && (Blanks(), pos_ == text_.size()); }

private:
    void Blanks() {
        while (pos_ < text_.size() && std::isspace(static_cast<unsigned char>(text_[pos_]))) ++pos_;
    }
    bool Eat(char c) {
        Blanks();
        return pos_ < text_.size() && text_[pos_] == c && ++pos_;
    }
    bool Value(Json& v) {
        if (Eat('"')) return String(v.string);
        bool ok = true;
        if (Eat('[')) {
            if (Eat(']')) return true;
            do {
                v.array.emplace_back();
                ok = Value(v.array.back());
            } while (ok && Eat(','));
            return ok && Eat(']');
        }
        if (Eat('{')) {
            if (Eat('}')) return true;
            do {
                std::string key;
                ok = Eat('"') && String(key) && Eat(':') && Value(v.object[key]);
            } while (ok && Eat(','));
            return ok && Eat('}');
        }
        if (pos_ == text_.size() ||
            (text_[pos_] != '-' && !std::isdigit(static_cast<unsigned char>(text_[pos_]))))
            return false;
        size_t used = 0;
        v.number = std::stoll(text_.substr(pos_), &used);
        pos_ += used;
        return true;
    }
    // After the opening quote. Of the \u escapes only those the writer uses are known: \u00XX and \ufffd.
    bool String(std::string& out) {
        while (pos_ < text_.size()) {
            const char c = text_[pos_++];
            if (c == '"') return true;
            if (static_cast<unsigned char>(c) < 0x20 || (c == '\\' && pos_ == text_.size())) return false;
            if (c != '\\') {
                out += c;
            } else if (const size_t k = std::string("\"\\/bfnrt").find(text_[pos_]); k != std::string::npos) {
                out += "\"\\/\b\f\n\r\t"[k];
                ++pos_;
            } else if (text_.compare(pos_, 3, "u00") == 0 && pos_ + 5 <= text_.size()) {
                out += static_cast<char>(std::stoi(text_.substr(pos_ + 3, 2), nullptr, 16));
                pos_ += 5;
            } else if (text_.compare(pos_, 5, "ufffd") == 0) {
                out += "\xef\xbf\xbd";
                pos_ += 5;
            } else {
                return false;
            }
        }
        return false;
    }

    const std::string& text_;
    size_t pos_ = 0;
};

Json ReadJson(const std::string& text) {
    Json json;
    EXPECT_TRUE(JsonReader(text).Read(json)) << "not well-formed JSON:\n" << text;
    return json;
}

// The offset of (line, column), both from 1, in text; npos if there is no such place (the end of a line,
// where its line feed stands, is a place).
size_t OffsetOf(const std::string& text, long long line, long long column) {
    size_t start = 0;
    for (long long l = 1; l < line; ++l) {
        start = text.find('\n', start);
        if (start == std::string::npos) return std::string::npos;
        ++start;
    }
    const size_t end = std::min(text.find('\n', start), text.size());
    if (column < 1 || start + static_cast<size_t>(column - 1) > end) return std::string::npos;
    return start + static_cast<size_t>(column - 1);
}

// Checks a source map against the output it describes and the files in dir that it names: the mappings
// tile the output line by line, copied runs are the source bytes, calculated runs point into their file,
// indentation is blanks and markers are #line lines. Counts the mappings of each kind in `kinds`.
void CheckSourceMap(const Json& map, const std::string& output, const TempDir& dir,
                    const std::string& outputName, std::map<std::string, int>& kinds) {
    EXPECT_EQ(map["version"].number, 1);
    EXPECT_EQ(map["output"].string, outputName);
    std::vector<std::string> sources;
    for (const Json& name : map["files"].array) {
        const std::filesystem::path path = dir.path() / name.string;
        sources.push_back(std::filesystem::exists(path) ? ReadFile(path.string()) : std::string());
    }
    long long offset = 0, line = 1, column = 1;
    for (const Json& m : map["mappings"].array) {
        const std::string kind = m["kind"].string;
        ++kinds[kind];
        SCOPED_TRACE("mapping at offset " + std::to_string(m["offset"].number) + " (" + kind + ")");
        ASSERT_EQ(m["offset"].number, offset) << "mappings tile the output";
        const long long length = m["length"].number;
        ASSERT_GT(length, 0);
        ASSERT_LE(offset + length, static_cast<long long>(output.size()));
        EXPECT_EQ(m["line"].number, line);
        EXPECT_EQ(m["column"].number, column);
        const std::string run = output.substr(static_cast<size_t>(offset), static_cast<size_t>(length));
        const size_t lf = run.find('\n');
        EXPECT_TRUE(lf == std::string::npos || lf + 1 == run.size()) << "a run stays within one line";
        if (kind == "indent" || kind == "marker") {
            EXPECT_FALSE(m.Has("file"));
            if (kind == "indent") {
                EXPECT_EQ(run.find_first_not_of(' '), std::string::npos);
            }
            if (kind == "marker") {
                EXPECT_EQ(run.rfind("#line ", 0), 0u) << run;
            }
        } else if (m.Has("file")) {
            EXPECT_TRUE(kind == "copied" || kind == "calculated") << kind;
            const long long file = m["file"].number;
            ASSERT_TRUE(file >= 0 && file < static_cast<long long>(sources.size()));
            // A text that no file holds ("<command line>") is not checked byte by byte.
            if (std::filesystem::exists(dir.path() / map["files"].array[static_cast<size_t>(file)].string)) {
                const std::string& source = sources[static_cast<size_t>(file)];
                const size_t at = OffsetOf(source, m["sourceLine"].number, m["sourceColumn"].number);
                ASSERT_NE(at, std::string::npos) << "the source position lies in file " << file;
                if (kind == "copied") {
                    EXPECT_EQ(source.substr(at, run.size()), run);
                }
                if (kind == "calculated") {
                    EXPECT_LE(at + static_cast<size_t>(m["sourceLength"].number), source.size());
                }
            }
        } else {
            EXPECT_TRUE(kind == "copied" || kind == "calculated") << kind;
        }
        offset += length;
        column += length;
        if (run.back() == '\n') ++line, column = 1;
    }
    EXPECT_EQ(offset, static_cast<long long>(output.size())) << "the mappings cover the whole output";
}

struct Project {
    const char* name;
    Files files;
    std::vector<std::string> args;  // before -o and the input
    std::string input;
    std::vector<std::string> loaded;  // the "files" of the map
};

std::vector<Project> RealisticProjects() {
    return {
        {"the C++ table example",
         {{"cpp_table.ovm", Example("cpp_table.ovm")}},
         {},
         "cpp_table.ovm",
         {"cpp_table.ovm"}},
        {"the project example, importing from a subdirectory",
         {{"root.ovp", Example("project/root.ovp")},
          {"common/shared.ovp", Example("project/common/shared.ovp")}},
         {},
         "root.ovp",
         {"root.ovp", "common/shared.ovp"}},
        {"macros from an imported library and -D, indented, with evaluations",
         {{"lib/shapes.ovm",
           "@def field(type, name) = {type m_@@name;}\n"
           "@def accessor(type, name) = {\n"
           "type name() const {\n"
           "    return m_@@name;\n"
           "}}\n"},
          {"main.ovm",
           "@import \"lib/shapes.ovm\"\n"
           "struct Shape {\n"
           "    accessor(int, width)\n"
           "    accessor(int, height)\n"
           "    int area() const { return @(6 * 7); }\n"
           "    const char* name = @str(KIND);\n"
           "private:\n"
           "    field(int, width)\n"
           "\tfield(int, height)\n"
           "};\n"}},
         {"-D", "KIND=box"},
         "main.ovm",
         {"<command line>", "main.ovm", "lib/shapes.ovm"}},
    };
}

TEST(OvmacroSourceMap, MappingsTileTheOutputAndPointAtTheirSources) {
    for (const Project& p : RealisticProjects()) {
        for (const bool markers : {false, true}) {
            SCOPED_TRACE(std::string(p.name) + (markers ? ", with line markers" : ""));
            TempDir dir;
            for (const auto& [name, text] : p.files) dir.Write(name, text);
            std::vector<std::string> args = p.args;
            if (markers) args.push_back("--line-markers");
            for (const char* a : {"-o", "out.txt", "--source-map", "out.map"}) args.push_back(a);
            args.push_back(p.input);
            const ToolResult r = RunIn(dir, args);
            ASSERT_EQ(r.exitCode, 0) << r.err;
            EXPECT_EQ(r.out, "");
            const std::string output = ReadFile((dir.path() / "out.txt").string());
            const Json map = ReadJson(ReadFile((dir.path() / "out.map").string()));
            std::map<std::string, int> kinds;
            CheckSourceMap(map, output, dir, "out.txt", kinds);
            EXPECT_GT(kinds["copied"], 0);
            EXPECT_EQ(kinds["marker"] > 0, markers);
            // Every loaded file is listed once, in load order, by the name it was found under.
            std::vector<std::string> names;
            for (const Json& name : map["files"].array) names.push_back(name.string);
            EXPECT_EQ(names, p.loaded);
        }
    }
}

// A host that loads the files of a directory, to compare the tool's map with the library's own pieces.
class DirectoryHost : public MpfwParser {
public:
    DirectoryHost(MpfwFrame& frame, std::string dir) : MpfwParser(frame), dir_(std::move(dir)) {}
    bool ResolveFile(const basic_xstring& name, basic_xstring& fullPath) override {
        fullPath = dir_ + "/" + name;
        return std::filesystem::exists(fullPath);
    }
    void OnImport(MpfwSourceFile*) override {}

private:
    std::string dir_;
};

TEST(OvmacroSourceMap, AgreesWithTheOutputPiecesOfEveryByte) {
    TempDir dir;
    dir.Write("lib.ovm", "@def twice(x) = {x x}\n@def block = {\n    first\n    second}\n");
    dir.Write("main.ovm",
              "@import \"lib.ovm\"\n@let int n = 3\nn items: twice(@str(ab))\n  block\n"
              "@for(i in [1, 2])\n{\n    - i\n\n}\nend\n");
    const ToolResult r = RunIn(dir, {"-o", "out.txt", "--source-map", "out.map", "main.ovm"});
    ASSERT_EQ(r.exitCode, 0) << r.err;
    const Json map = ReadJson(ReadFile((dir.path() / "out.map").string()));

    MpfwSourceFileList files;
    MpfwFrame frame(files);
    DirectoryHost host(frame, dir.path().string());
    const MpfwSourceFile* root = host.AddFile(dir.path().string() + "/main.ovm", BasicSubString());
    ASSERT_NE(root, nullptr);
    ASSERT_EQ(root->expandedText, ReadFile((dir.path() / "out.txt").string()));

    std::map<std::string, int> kinds;
    for (const Json& m : map["mappings"].array) {
        ++kinds[m["kind"].string];
        for (long long p = m["offset"].number; p < m["offset"].number + m["length"].number; ++p) {
            SCOPED_TRACE("output offset " + std::to_string(p));
            const char* address = root->pieces.MapOutputPositionToAddress(p);
            const int64 index = files.GetSrcFileIndexContainingPosition(address);
            ASSERT_EQ(index >= 0, m.Has("file"));
            if (index < 0) continue;
            const MpfwSourceFile* f = files[index];
            const std::string name = map["files"].array[static_cast<size_t>(m["file"].number)].string;
            EXPECT_EQ(f->fileName, dir.path().string() + "/" + name);
            const size_t expected = OffsetOf(f->text, m["sourceLine"].number, m["sourceColumn"].number);
            const long long step = m["kind"].string == "copied" ? p - m["offset"].number : 0;
            EXPECT_EQ(static_cast<size_t>(address - f->text.data()), expected + static_cast<size_t>(step));
        }
    }
    EXPECT_GT(kinds["copied"], 0);
    EXPECT_GT(kinds["calculated"], 0);
    EXPECT_GT(kinds["indent"], 0);
}

TEST(OvmacroSourceMap, CalculatedTextPointsAtTheTokenThatProducedIt) {
    TempDir dir;
    dir.Write("t.ovm", Example("cpp_table.ovm"));
    const ToolResult r = RunIn(dir, {"--source-map", "t.map", "t.ovm"});
    ASSERT_EQ(r.exitCode, 0) << r.err;
    const Json map = ReadJson(ReadFile((dir.path() / "t.map").string()));
    EXPECT_EQ(map["output"].string, "-");
    const struct {
        const char* output;  // the run's text
        long long line, column;
    } expected[] = {
        {"4", 33, 47},             // count, in the std::array's arguments
        {"kColorNames", 33, 54},   // TABLE
        {"\"dark blue\"", 37, 9},  // @str(name)
        {"\"off-white \\\"cream\\\", matt\"", 37, 9},
    };
    for (const auto& e : expected) {
        SCOPED_TRACE(e.output);
        // The first run that holds the text (a calculated run includes the indentation it inserted).
        const Json* found = nullptr;
        for (const Json& m : map["mappings"].array) {
            const std::string run = r.out.substr(static_cast<size_t>(m["offset"].number),
                                                 static_cast<size_t>(m["length"].number));
            if (run.find(e.output) == std::string::npos) continue;
            found = &m;
            break;
        }
        ASSERT_NE(found, nullptr);
        EXPECT_EQ((*found)["kind"].string, "calculated");
        EXPECT_EQ((*found)["sourceLine"].number, e.line);
        EXPECT_EQ((*found)["sourceColumn"].number, e.column);
    }
}

TEST(OvmacroSourceMap, FileNamesAreValidJsonStrings) {
    TempDir dir;
    const std::string name = "q\"b\\s\tt\xff\xc3\xa9.ovm";  // a quote, a backslash, a tab, a stray byte, é
    dir.Write(name, "hi\n");
    const ToolResult r = RunIn(dir, {"--source-map", "m.json", "-o", "o.txt", name});
    ASSERT_EQ(r.exitCode, 0) << r.err;
    const Json map = ReadJson(ReadFile((dir.path() / "m.json").string()));
    ASSERT_EQ(map["files"].array.size(), 1u);
    EXPECT_EQ(map["files"].array[0].string, "q\"b\\s\tt\xef\xbf\xbd\xc3\xa9.ovm");
}

// ---- Line markers.

struct MarkerCase {
    const char* name;
    Files files;
    std::string input;
    std::string expected;
};

const MarkerCase kMarkerCases[] = {
    {"a file copied in order needs one marker",
     {{"p.c", "int a;\n\nint b;\n"}},
     "p.c",
     "#line 1 \"p.c\"\nint a;\n\nint b;\n"},
    {"a multi-line macro body, then back to the caller",
     {{"a.ovm",
       "@def swap(a, b) = {\n    int tmp = a;\n    a = b;\n    b = tmp;\n}\nvoid f(int& x, int& y) {\n"
       "    swap(x, y)\n    done();\n}\n"}},
     "a.ovm",
     // A line takes the source of its first character: "x = y;" begins with the caller's argument.
     "#line 6 \"a.ovm\"\nvoid f(int& x, int& y) {\n#line 2 \"a.ovm\"\n        int tmp = x;\n#line 7 "
     "\"a.ovm\"\n"
     "        x = y;\n#line 7 \"a.ovm\"\n        y = tmp;\n\n#line 8 \"a.ovm\"\n    done();\n}\n"},
    {"a loop: every pass goes back to the body",
     {{"loop.ovm",
       "@def FIELDS = [count, size]\nstruct S {\n    @for(f in FIELDS)\n    {\n        int f;\n"
       "        long f@@_max;\n\n    }@//\n};\n"}},
     "loop.ovm",
     "#line 2 \"loop.ovm\"\nstruct S {\n#line 5 \"loop.ovm\"\n    int count;\n    long count_max;\n"
     "#line 5 \"loop.ovm\"\n    int size;\n    long size_max;\n#line 9 \"loop.ovm\"\n};\n"},
    {"a macro from an imported file",
     {{"lib.ovm", "@def getter(name) = {\nint get_@@name() const {\n    return name;\n}}\n"},
      {"main.ovm", "@import \"lib.ovm\"\nclass C {\ngetter(a)\ngetter(b)\n};\n"}},
     "main.ovm",
     "#line 1 \"main.ovm\"\n@import \"lib.ovm\"\nclass C {\n#line 2 \"lib.ovm\"\nint get_a() const {\n"
     "    return a;\n}\n#line 2 \"lib.ovm\"\nint get_b() const {\n    return b;\n}\n#line 5 "
     "\"main.ovm\"\n};\n"},
    {"a blank line from elsewhere still counts as a line",
     // The blank line comes from the body of GAP: "int c;" is line 6, not the 7th line after the marker.
     {{"gap.ovm", "@def GAP = {\n\n}\nint a;\nint b;GAP\nint c;\n"}},
     "gap.ovm",
     "#line 4 \"gap.ovm\"\nint a;\nint b;\n\n#line 6 \"gap.ovm\"\nint c;\n"},
    {"no marker after a backslash, in a comment or in a raw string",
     {{"held.ovm",
       "@def LONG = {first \\\n    second}\n#define F(x) LONG\nint y;\n@unstr(\"/* one\\ntwo */\")\nint z;\n"
       "const char* s = @unstr(\"R\\\"x(one\\ntwo)x\\\"\");\nint w;\n"}},
     "held.ovm",
     "#line 3 \"held.ovm\"\n#define F(x) first \\\n                 second\n#line 4 \"held.ovm\"\nint y;\n"
     "/* one\ntwo */\n#line 6 \"held.ovm\"\nint z;\nconst char* s = R\"x(one\n                two)x\";\n"
     "#line 8 \"held.ovm\"\nint w;\n"},
    {"a file name that needs escaping",
     {{"odd\"name.c", "@def X = 1\nint x = X;\n"}},
     "odd\"name.c",
     "#line 2 \"odd\\\"name.c\"\nint x = 1;\n"},
};

TEST(OvmacroLineMarkers, MarkersWhereTheSourceLineIsNotTheNextOne) {
    for (const MarkerCase& c : kMarkerCases) {
        SCOPED_TRACE(c.name);
        TempDir dir;
        for (const auto& [name, text] : c.files) dir.Write(name, text);
        const ToolResult r = RunIn(dir, {"--line-markers", c.input});
        EXPECT_EQ(r.exitCode, 0) << r.err;
        EXPECT_EQ(r.out, c.expected);
        // Without the option the output has no markers.
        const ToolResult plain = RunIn(dir, {c.input});
        EXPECT_EQ(plain.out.find("#line"), std::string::npos);
    }
    const ToolResult piped = RunTool({"--line-markers"}, "@def X = 1\nint x = X;\n");
    EXPECT_EQ(piped.out, "#line 2 \"<stdin>\"\nint x = 1;\n");
}

// ---- Diagnostics.

struct DiagnosticCase {
    const char* name;
    Files files;
    std::vector<std::string> args;
    std::string standard;  // the default report
    std::string gnu;
};

const DiagnosticCase kDiagnosticCases[] = {
    {"an error in a macro body, with the chain of calls",
     {{"bad.ovm", "@def f(a) = {a}\n@def g(b) = {\tf(b, 2)}\nline\n\tg(1)\n"}},
     {"bad.ovm"},
     "\nbad.ovm(2) : Too many arguments provided for macro f(a)\n    invoking macro g(b) with b=1\n",
     // The caret line keeps the tab of the source line, so that the caret stands under the column.
     "bad.ovm:2:18: error: Too many arguments provided for macro f(a)\n@def g(b) = {\tf(b, 2)}\n"
     "             \t   ^\n    invoking macro g(b) with b=1\n"},
    {"an error in an imported file, then the importer's report",
     {{"root.ovm", "a\n  @import \"lib.ovm\"\n"}, {"lib.ovm", "ok\n\n@fail(\"broken\")\n"}},
     {"root.ovm"},
     "\nlib.ovm(3) : broken\n\nroot.ovm(2) : Can't import file: lib.ovm\n",
     "lib.ovm:3:6: error: broken\n@fail(\"broken\")\n     ^\nroot.ovm:2:11: error: Can't import file: "
     "lib.ovm\n"
     "  @import \"lib.ovm\"\n          ^\n"},
    {"an error on standard input, with a control byte in the echoed line",
     {},
     {"-"},
     "\n<stdin>(2) : Bad token \\x01\n",
     "<stdin>:2:3: error: Bad token \\x01\nab?\n  ^\n"},
    {"an error in text that a @for item wrote is placed at the item",
     {{"t.ovp", "$A = \"a\"\n@for(x in [abc]) {x}\n"}},
     {"--settings", "t.ovp"},
     "\nt.ovp(2) : Expected $NAME = value or @import when read abc\n",
     "t.ovp:2:12: error: Expected $NAME = value or @import when read abc\n@for(x in [abc]) {x}\n           ^\n"},
    {"an error while reading the settings",
     {{"s.ovp", "$A = \"a\"\n$B = 1\n"}},
     {"--settings", "s.ovp"},
     "\ns.ovp(2) : Expected quoted string when read 1\n",
     "s.ovp:2:6: error: Expected quoted string when read 1\n$B = 1\n     ^\n"},
    {"an error at the end of a file",
     {{"c.ovm", "x\n/* open\n\n"}},
     {"c.ovm"},
     "\nc.ovm(4) : Met EOS in middle of /* ... */ comment\n",
     "c.ovm:4:1: error: Met EOS in middle of /* ... */ comment\n\n^\n"},
};

TEST(OvmacroDiagnostics, DefaultAndGnuForms) {
    for (const DiagnosticCase& c : kDiagnosticCases) {
        SCOPED_TRACE(c.name);
        TempDir dir;
        for (const auto& [name, text] : c.files) dir.Write(name, text);
        const std::string input = c.files.empty() ? "x\nab\x01\n" : "";
        for (const std::vector<std::string>& extra :
             {std::vector<std::string>{}, std::vector<std::string>{"--diagnostics=default"},
              std::vector<std::string>{"--diagnostics", "gnu"}}) {
            std::vector<std::string> args = extra;
            args.insert(args.end(), c.args.begin(), c.args.end());
            const ToolResult r = RunIn(dir, args, input);
            EXPECT_EQ(r.exitCode, 1);
            EXPECT_EQ(r.err, extra.size() == 2 ? c.gnu : c.standard);
        }
    }
}

// ---- --check.

TEST(OvmacroCheck, ComparesTheExpansionWithOutWithoutWritingIt) {
    TempDir dir;
    dir.Write("t.ovm", Example("cpp_table.ovm"));
    const std::string expected = Example("cpp_table.expected.h");
    const std::string out = (dir.path() / "colors.h").string();

    ToolResult r = RunIn(dir, {"--check", "-o", "colors.h", "t.ovm"});
    EXPECT_EQ(r.exitCode, 1);
    EXPECT_EQ(r.out, "");
    EXPECT_EQ(r.err, "ovmacro: colors.h does not exist (run without --check to generate it)\n");
    EXPECT_FALSE(std::filesystem::exists(out));

    dir.Write("colors.h", expected);
    r = RunIn(dir, {"--check", "-o", "colors.h", "t.ovm"});
    EXPECT_EQ(r.exitCode, 0) << r.out << r.err;
    EXPECT_EQ(r.out + r.err, "");

    // A stale file: the diff shows the differences with 3 lines of context; the file is left alone.
    std::string stale = expected;
    stale.replace(stale.find("    DarkBlue,\n"), 14, "");
    stale.replace(stale.find("}  // namespace\n"), 16, "}\n");
    dir.Write("colors.h", stale);
    r = RunIn(dir, {"--check", "-o", "colors.h", "t.ovm"});
    EXPECT_EQ(r.exitCode, 1);
    EXPECT_EQ(r.out,
              "--- colors.h (on disk)\n"
              "+++ colors.h (expanded)\n"
              "@@ -10,6 +10,7 @@\n"
              " enum class Color {\n"
              "     Red,\n"
              "     Green,\n"
              "+    DarkBlue,\n"
              "     Cream,\n"
              " };\n"
              " \n"
              "@@ -22,4 +23,4 @@\n"
              " \n"
              " constexpr std::string_view ColorName(Color value) { return "
              "kColorNames[static_cast<std::size_t>(value)]; }\n"
              " \n"
              "-}\n"
              "+}  // namespace\n");
    EXPECT_EQ(r.err, "ovmacro: colors.h is out of date (run without --check to regenerate it)\n");
    EXPECT_EQ(ReadFile(out), stale);

    // With line markers the comparison is with the marked expansion.
    ASSERT_EQ(RunIn(dir, {"--line-markers", "-o", "colors.h", "t.ovm"}).exitCode, 0);
    EXPECT_EQ(RunIn(dir, {"--line-markers", "--check", "-o", "colors.h", "t.ovm"}).exitCode, 0);
    EXPECT_EQ(RunIn(dir, {"--check", "-o", "colors.h", "t.ovm"}).exitCode, 1);
}

TEST(OvmacroCheck, LongDiffsAreCutShortAndEndsOfFileAreShown) {
    TempDir dir;
    std::string text, old;
    for (int i = 1; i <= 200; ++i) {
        text += "line " + std::to_string(i) + "\n";
        old += (i % 2 ? "line " : "old ") + std::to_string(i) + "\n";
    }
    dir.Write("t.ovm", text);
    dir.Write("out.txt", old);
    ToolResult r = RunIn(dir, {"--check", "-o", "out.txt", "t.ovm"});
    EXPECT_EQ(r.exitCode, 1);
    std::vector<std::string> lines;
    for (size_t b = 0, e; (e = r.out.find('\n', b)) != std::string::npos; b = e + 1)
        lines.push_back(r.out.substr(b, e - b));
    ASSERT_EQ(lines.size(), 2u + 40u + 1u);
    EXPECT_EQ(lines[2], "@@ -1,200 +1,200 @@");
    EXPECT_EQ(lines[3], " line 1");
    EXPECT_EQ(lines[4], "-old 2");
    EXPECT_EQ(lines[5], "+line 2");
    EXPECT_EQ(lines.back(), "... more differences not shown");

    // A missing last line feed is a difference, and is said.
    dir.Write("t.ovm", "a\nb");
    dir.Write("out.txt", "a\nb\n");
    r = RunIn(dir, {"--check", "-o", "out.txt", "t.ovm"});
    EXPECT_EQ(r.exitCode, 1);
    EXPECT_EQ(r.out,
              "--- out.txt (on disk)\n+++ out.txt (expanded)\n@@ -1,2 +1,2 @@\n a\n-b\n+b\n"
              "\\ No newline at end of file\n");
}

TEST(OvmacroCheck, FailuresAndMisuse) {
    TempDir dir;
    dir.Write("t.ovm", "text\n");
    dir.Write("bad.ovm", "@fail(\"no\")\n");
    std::filesystem::create_directory(dir.path() / "adir");
    const struct {
        std::vector<std::string> args;
        int exitCode;
        std::string err;
    } cases[] = {
        {{"--check", "t.ovm"},
         2,
         "ovmacro: --check needs -o OUT, the file to compare with\nTry 'ovmacro --help'.\n"},
        {{"--check", "-o", "o", "--deps", "o.d", "t.ovm"},
         2,
         "ovmacro: --check writes no file: it cannot be used with --deps or --source-map\nTry 'ovmacro "
         "--help'.\n"},
        {{"--check", "-o", "o", "--source-map=o.map", "t.ovm"},
         2,
         "ovmacro: --check writes no file: it cannot be used with --deps or --source-map\nTry 'ovmacro "
         "--help'.\n"},
        {{"--check", "-o", "adir", "t.ovm"}, 2, "ovmacro: cannot read adir: Is a directory\n"},
        {{"--check", "-o", "t.ovm", "bad.ovm"}, 1, "\nbad.ovm(1) : no\n"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.args[c.args.size() - 2]);
        const ToolResult r = RunIn(dir, c.args);
        EXPECT_EQ(r.exitCode, c.exitCode);
        EXPECT_EQ(r.err, c.err);
        EXPECT_EQ(r.out, "");
    }
    EXPECT_FALSE(std::filesystem::exists(dir.path() / "o"));
    EXPECT_FALSE(std::filesystem::exists(dir.path() / "o.d"));
}

// ---- Options and reproducibility.

TEST(OvmacroOutputOptions, UsageErrorsAndHelp) {
    const struct {
        std::vector<std::string> args;
        const char* error;
    } cases[] = {
        {{"--source-map"}, "option --source-map needs a value"},
        {{"--source-map="}, "--source-map needs a file name"},
        {{"--source-map", "-"}, "--source-map needs a file name"},
        {{"--diagnostics=clang"}, "unknown diagnostics style 'clang' (expected default or gnu)"},
        {{"--diagnostics"}, "option --diagnostics needs a value"},
        {{"--settings", "--source-map", "m", "x"},
         "--source-map with --settings needs -o OUT, where the expansion goes"},
    };
    for (const auto& c : cases) {
        const ToolResult r = RunTool(c.args);
        EXPECT_EQ(r.exitCode, 2);
        EXPECT_EQ(r.err, std::string("ovmacro: ") + c.error + "\nTry 'ovmacro --help'.\n");
    }
    const ToolResult help = RunTool({"--help"});
    for (const char* option : {"--source-map MAPFILE", "--line-markers", "--diagnostics=STYLE", "--check"})
        EXPECT_NE(help.out.find(option), std::string::npos) << option;
}

TEST(OvmacroReproducible, SameInputsGiveTheSameFilesInAnyDirectory) {
    // Two runs in two directories: the outputs may name files only as they were given, never by where the
    // directory happens to be.
    std::vector<std::vector<std::string>> results;
    std::vector<std::string> roots;
    for (int run = 0; run < 2; ++run) {
        TempDir dir;
        roots.push_back(dir.path().string());
        dir.Write("project/root.ovp", Example("project/root.ovp"));
        dir.Write("project/common/shared.ovp", Example("project/common/shared.ovp"));
        const ToolResult r = RunIn(dir, {"--line-markers", "-D", "EXTRA=1", "--deps", "out.d", "--source-map",
                                         "out.map", "-o", "out.txt", "project/root.ovp"});
        ASSERT_EQ(r.exitCode, 0) << r.err;
        std::vector<std::string> files;
        for (const char* name : {"out.txt", "out.map", "out.d"})
            files.push_back(ReadFile((dir.path() / name).string()));
        results.push_back(files);
    }
    EXPECT_EQ(results[0], results[1]);
    for (const std::string& text : results[0]) {
        EXPECT_FALSE(text.empty());
        for (const std::string& root : roots) EXPECT_EQ(text.find(root), std::string::npos) << text;
    }
}

}  // namespace
}  // namespace orvan

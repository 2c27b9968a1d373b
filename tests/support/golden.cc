// Reading, running and refreshing the golden cases (see golden.h).
#include "support/golden.h"

#include <algorithm>
#include <cstring>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <map>
#include <regex>
#include <set>
#include <sstream>

#include "support/test_support.h"

namespace orvan::testing {

namespace {

namespace fs = std::filesystem;

void ParseFile(const fs::path& path, std::vector<GoldenCase>& cases);

std::string Unescape(const std::string& s) {
    std::string out;
    for (size_t i = 0; i < s.size(); ++i) {
        const char next = i + 1 < s.size() ? s[i + 1] : '\0';
        const bool hex = next == 'x' && i + 3 < s.size() && std::isxdigit(static_cast<unsigned char>(s[i + 2])) &&
                         std::isxdigit(static_cast<unsigned char>(s[i + 3]));
        if (s[i] != '\\' || next == '\0' || (next == 'x' && !hex) || !std::strchr("ntr\\x", next)) {
            out += s[i];
        } else if (hex) {
            out += static_cast<char>(std::stoi(s.substr(i + 2, 2), nullptr, 16));
            i += 3;
        } else {
            out += next == 'n' ? '\n' : next == 't' ? '\t' : next == 'r' ? '\r' : '\\';
            ++i;
        }
    }
    return out;
}

std::string Escape(const std::string& s) {
    std::string out;
    for (size_t i = 0; i < s.size(); ++i) {
        const unsigned char c = static_cast<unsigned char>(s[i]);
        const char next = i + 1 < s.size() ? s[i + 1] : '\0';
        if (c == '\\' && (next == '\0' || std::strchr("ntr\\x", next))) {
            out += "\\\\";
        } else if (c == '\n') {
            out += "\\n";
        } else if (c == '\t') {
            out += "\\t";
        } else if (c == '\r') {
            out += "\\r";
        } else if (c < 0x20 || c == 0x7f || (c == ' ' && i + 1 == s.size())) {
            char hex[8];
            std::snprintf(hex, sizeof hex, "\\x%02x", c);
            out += hex;
        } else {
            out += static_cast<char>(c);
        }
    }
    return out;
}

// "a: b" -> {"a", "b"}.
std::pair<std::string, std::string> NamedText(const std::string& text) {
    const size_t colon = text.find(": ");
    if (colon == std::string::npos) return {text, ""};
    return {text.substr(0, colon), text.substr(colon + 2)};
}

bool IsExpectation(char kind) { return kind == '>' || kind == '!' || kind == '?' || kind == '='; }

// The nesting guard's depth, and with it the calls and context lines left out, depend on the build's stack.
std::string Normalised(const std::string& report) {
    static const std::regex depth(R"(\((more than \d+ levels|\d+ levels exhaust the stack)\))");
    static const std::regex omitted(R"(\.\.\. \d+ more context lines left out)");
    static const std::regex chain(R"((\n    invoking macro [^\n]*)+)");
    std::string s = std::regex_replace(report, depth, "(N levels)");
    if (s != report) s = std::regex_replace(std::regex_replace(s, omitted, "... N more"), chain, "\n    CALLS");
    return s;
}

// A gnu report without the echoed source line and caret that follow each located first line.
std::string WithoutEchoes(const std::string& err) {
    static const std::regex located(R"(^[^ ].*:\d+:\d+: error: .*)");
    std::istringstream in(err);
    std::string out, line;
    while (std::getline(in, line)) {
        out += line + "\n";
        if (std::regex_match(line, located)) {
            std::getline(in, line);
            std::getline(in, line);
        }
    }
    return out;
}

// The gnu report that a '!' line stands for: "LINE:COL MESSAGE" (in t.ovm), "FILE:LINE:COL MESSAGE" or
// "- MESSAGE".
std::string GnuReport(const std::string& expected) {
    static const std::regex located(R"(^((.*:)?\d+:\d+) ([\s\S]*))");
    std::smatch m;
    if (!std::regex_match(expected, m, located)) return "ovmacro: error: " + expected.substr(2) + "\n";
    return (m[2].matched ? "" : "t.ovm:") + m[1].str() + ": error: " + m[3].str() + "\n";
}

// The '!' lines that a gnu report reads as.
std::vector<std::string> ErrorLines(const std::string& withoutEchoes) {
    static const std::regex located(R"(^(?:t\.ovm:)?((?:.*:)?\d+:\d+): error: (.*))");
    std::vector<std::string> reports;
    std::istringstream in(withoutEchoes);
    std::smatch m;
    for (std::string line; std::getline(in, line);) {
        if (std::regex_match(line, m, located))
            reports.push_back(m[1].str() + " " + m[2].str());
        else if (line.rfind("ovmacro: error: ", 0) == 0)
            reports.push_back("- " + line.substr(16));
        else if (!reports.empty())
            reports.back() += "\n" + line;
    }
    return reports;
}

}  // namespace

void PrintTo(const GoldenCase& c, std::ostream* os) { *os << c.caseFile << ":" << c.line; }

namespace {

struct Run {
    ToolResult result;
    std::vector<std::pair<std::string, std::string>> leftFiles;
};

Run RunCase(const GoldenCase& c, bool gnu) {
    // An AddressSanitizer build of the tool would report the blocks that Python's own allocator keeps (the
    // interpreter is not shut down before exit) as leaks; with plain malloc they stay reachable.
    ::setenv("PYTHONMALLOC", "malloc", 1);
    TempDir dir;
    dir.Write("t.ovm", c.input);
    for (const auto& [name, text] : c.files) dir.Write(name, text);
    std::vector<std::string> args = c.args;
    if (gnu) args.insert(args.begin(), "--diagnostics=gnu");
    Run run{RunTool(args, c.input, dir.path().string()), {}};
    for (const auto& [name, text] : c.leftFiles) {
        const fs::path path = dir.path() / name;
        run.leftFiles.emplace_back(name, fs::exists(path) ? ReadFile(path.string()) : "<missing>");
    }
    return run;
}

// The expectation lines of a case, as the tool behaves now.
std::vector<std::string> RefreshedLines(const GoldenCase& c) {
    const Run plain = RunCase(c, false);
    const ToolResult& r = plain.result;
    auto text = [](char kind, const std::string& s) {
        std::vector<std::string> lines;
        std::string line(1, kind);
        size_t from = 0;
        for (;;) {
            const size_t lf = s.find('\n', from);
            const std::string part = Escape(s.substr(from, lf == std::string::npos ? lf : lf - from));
            lines.push_back(line + (part.empty() ? "" : " " + part));
            if (lf == std::string::npos) break;
            line = "|";
            from = lf + 1;
        }
        return lines;
    };
    std::vector<std::string> lines;
    if (!r.out.empty()) lines = r.out.size() <= 60 ? std::vector<std::string>{"> " + Escape(r.out)} : text('>', r.out);
    const std::vector<std::string> reports = r.exitCode == 1 ? ErrorLines(WithoutEchoes(RunCase(c, true).result.err))
                                                             : std::vector<std::string>{};
    if (!reports.empty()) {
        for (const std::string& report : reports)
            for (const std::string& line : text('!', Normalised(report))) lines.push_back(line);
    } else if (r.exitCode != 0 || !r.err.empty()) {
        std::string err = r.err;
        if (!err.empty() && err.back() == '\n') err.pop_back();
        for (const std::string& line : text('?', std::to_string(r.exitCode) + " " + err)) lines.push_back(line);
    }
    for (const auto& [name, content] : plain.leftFiles)
        for (const std::string& line : text('=', name + ": " + content)) lines.push_back(line);
    return lines;
}

// Rewrites the expectations of the cases run in this process when it ends (OVMACRO_GOLDEN_REFRESH=1).
class Refresher {
public:
    void Record(const GoldenCase& c) { pending_[c.caseFile][c.line] = RefreshedLines(c); }
    ~Refresher() {
        for (const auto& [file, cases] : pending_) Rewrite(file, cases);
    }

private:
    static void Rewrite(const std::string& file, const std::map<int, std::vector<std::string>>& cases) {
        std::ifstream in(file);
        std::vector<std::string> lines;
        for (std::string line; std::getline(in, line);) lines.push_back(line);
        std::vector<GoldenCase> all;
        ParseFile(file, all);
        std::set<int> starts;
        for (const GoldenCase& c : all) starts.insert(c.line);
        std::vector<std::string> out;
        char kind = ' ';
        const std::vector<std::string>* replacement = nullptr;
        auto flush = [&] {
            if (!replacement) return;
            // Comments and blank lines between cases stay after the new expectations.
            size_t keep = out.size();
            while (keep > 0 && (out[keep - 1].empty() || out[keep - 1][0] == '#')) --keep;
            out.insert(out.begin() + static_cast<long>(keep), replacement->begin(), replacement->end());
            replacement = nullptr;
        };
        for (size_t i = 0; i < lines.size(); ++i) {
            const std::string& line = lines[i];
            const char first = line.empty() ? ' ' : line[0];
            if (starts.count(static_cast<int>(i + 1))) {
                flush();
                const auto it = cases.find(static_cast<int>(i + 1));
                replacement = it == cases.end() ? nullptr : &it->second;
            }
            if (first != '|') kind = first;
            if (replacement && IsExpectation(kind)) continue;
            out.push_back(line);
        }
        flush();
        std::ofstream(file) << [&] {
            std::string s;
            for (const std::string& line : out) s += line + "\n";
            return s;
        }();
    }

    std::map<std::string, std::map<int, std::vector<std::string>>> pending_;
};

Refresher& TheRefresher() {
    static Refresher refresher;
    return refresher;
}

void ParseFile(const fs::path& path, std::vector<GoldenCase>& cases) {
    std::ifstream in(path);
    std::string* last = nullptr;
    int number = 0;
    bool expectationSeen = false;
    for (std::string line; std::getline(in, line);) {
        ++number;
        if (line.empty() || line[0] == '#') continue;
        char kind = line[0];
        const std::string text = Unescape(line.size() > 2 ? line.substr(2) : "");
        // A case begins at its template, or at its options or files when it has no template.
        if (kind == '<' || cases.empty() || (expectationSeen && (kind == '$' || kind == '+'))) {
            expectationSeen = false;
            cases.push_back({});
            cases.back().caseFile = path.string();
            cases.back().line = number;
            cases.back().args = {"t.ovm"};
        }
        GoldenCase& c = cases.back();
        if (line.size() > 1 && line[1] != ' ') kind = '\0';
        if (IsExpectation(kind)) expectationSeen = true;
        switch (kind) {
            case '<': last = &(c.input = text); break;
            case '+': c.files.push_back(NamedText(text)); last = &c.files.back().second; break;
            case '$': {
                c.args.clear();
                std::istringstream words(text);
                for (std::string w; words >> w;) c.args.push_back(w);
                last = nullptr;
                break;
            }
            case '>': last = &(c.out = text); break;
            case '!': c.errors.push_back(text); last = &c.errors.back(); break;
            case '?': {
                c.rawErr = true;
                const size_t blank = text.find(' ');
                c.exitCode = std::atoi(text.c_str());
                last = &(c.err = blank == std::string::npos ? "" : text.substr(blank + 1));
                break;
            }
            case '=': c.leftFiles.push_back(NamedText(text)); last = &c.leftFiles.back().second; break;
            case '|':
                if (last) *last += "\n" + text;
                break;
            default: c.errors.push_back("bad line: " + line); last = nullptr;
        }
    }
}

}  // namespace

std::vector<GoldenCase> LoadGoldenCases(const std::string& folder) {
    const fs::path dir = fs::path(OVMACRO_SOURCE_DIR) / "tests" / folder;
    std::vector<fs::path> files;
    for (const fs::directory_entry& entry : fs::directory_iterator(dir)) {
        const std::string name = entry.path().filename().string();
        if (name.size() > 10 && name.substr(name.size() - 10) == "_cases.txt") files.push_back(entry.path());
    }
    std::sort(files.begin(), files.end());
    std::vector<GoldenCase> cases;
    for (const fs::path& file : files) ParseFile(file, cases);
    return cases;
}

std::string GoldenCaseName(const ::testing::TestParamInfo<GoldenCase>& info) {
    std::string stem = fs::path(info.param.caseFile).stem().string();
    stem = stem.substr(0, stem.size() - 6);  // "_cases"
    return stem + "_" + std::to_string(info.param.line);
}

void RunGoldenCase(const GoldenCase& c) {
    SCOPED_TRACE(c.caseFile + ":" + std::to_string(c.line));
    if (std::getenv("OVMACRO_GOLDEN_REFRESH")) {
        TheRefresher().Record(c);
        return;
    }
    for (const std::string& e : c.errors) ASSERT_NE(e.rfind("bad line: ", 0), 0u) << e;
    const bool reports = !c.rawErr && !c.errors.empty();
    const Run run = RunCase(c, reports);
    const ToolResult& r = run.result;
    EXPECT_EQ(r.exitCode, c.rawErr ? c.exitCode : reports ? 1 : 0) << r.err;
    EXPECT_EQ(r.out, c.out);
    if (reports) {
        std::string expected;
        for (const std::string& e : c.errors) expected += GnuReport(e);
        EXPECT_EQ(Normalised(WithoutEchoes(r.err)), Normalised(expected));
    } else {
        EXPECT_EQ(r.err, c.err.empty() ? "" : c.err + "\n");
    }
    EXPECT_EQ(run.leftFiles, c.leftFiles);
}

}  // namespace orvan::testing

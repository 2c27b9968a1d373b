// Reading, running and refreshing the golden cases (see golden.h).
#include "support/golden.h"

#include <gtest/gtest-spi.h>

#include <algorithm>
#include <cstdlib>
#include <cstring>
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

std::string Unescape(const std::string& s) {
    std::string out;
    for (size_t i = 0; i < s.size(); ++i) {
        const char next = i + 1 < s.size() ? s[i + 1] : '\0';
        const bool hex = next == 'x' && i + 3 < s.size() && std::isxdigit(static_cast<unsigned char>(s[i + 2])) &&
                         std::isxdigit(static_cast<unsigned char>(s[i + 3]));
        if (s[i] != '\\' || next == '\0' || !std::strchr("ntr\\x", next) || (next == 'x' && !hex)) {
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

// The text as one line of a case file; a blank at its end is escaped, since editors drop it.
std::string Escape(const std::string& s) {
    std::string out;
    for (size_t i = 0; i < s.size(); ++i) {
        const unsigned char c = static_cast<unsigned char>(s[i]);
        const char next = i + 1 < s.size() ? s[i + 1] : '\0';
        char hex[8];
        std::snprintf(hex, sizeof hex, "\\x%02x", c);
        out += c == '\\' && next != '\0' && std::strchr("ntr\\x", next) ? "\\\\"
               : c == '\n'                                               ? "\\n"
               : c == '\t'                                               ? "\\t"
               : c == '\r'                                               ? "\\r"
               : c < 0x20 || c >= 0x7f || (c == ' ' && i + 1 == s.size()) ? hex
                                                                           : std::string(1, static_cast<char>(c));
    }
    return out;
}

std::vector<std::string> Lines(const std::string& text) {
    std::vector<std::string> lines;
    for (size_t from = 0, lf = 0; lf != std::string::npos; from = lf + 1)
        lines.push_back(text.substr(from, (lf = text.find('\n', from)) == std::string::npos ? lf : lf - from));
    return lines;
}

// The nesting guard's depth, and with it the calls and context lines left out, depend on the build's stack.
std::string Normalised(const std::string& report) {
    static const std::regex depth(R"(\((more than \d+ levels|\d+ levels exhaust the stack)\))");
    static const std::regex omitted(R"(\.\.\. \d+ more context lines left out)");
    static const std::regex chain(R"((\n    invoking macro [^\n]*)+)");
    std::string s = std::regex_replace(report, depth, "(N levels)");
    if (s != report) s = std::regex_replace(std::regex_replace(s, omitted, "... N more"), chain, "\n    CALLS");
    return s;
}

// The reports of a gnu-form standard error as '!' texts, normalised: "LINE:COL MESSAGE" in t.ovm,
// "FILE:LINE:COL MESSAGE" elsewhere, "- MESSAGE" without a place; the echoed source line and caret that
// follow a located first line are left out, and so are warnings and notes, which '?' cases check.
std::vector<std::string> Reports(const std::string& err) {
    static const std::regex located(R"(^(?:t\.ovm:)?((?:.*:)?\d+:\d+): error: (.*))");
    static const std::regex aside(R"(^(.*:\d+:\d+|ovmacro): (warning|note): .*)");
    std::vector<std::string> reports;
    std::istringstream in(err);
    std::smatch m;
    for (std::string line; std::getline(in, line);) {
        if (std::regex_match(line, m, aside)) {
            for (int echo = 0; m[1] != "ovmacro" && echo < 2 && std::getline(in, line);) ++echo;
        } else if (std::regex_match(line, m, located)) {
            reports.push_back(m[1].str() + " " + m[2].str());
            for (int echo = 0; echo < 2 && std::getline(in, line);) ++echo;
        } else if (line.rfind("ovmacro: error: ", 0) == 0) {
            reports.push_back("- " + line.substr(16));
        } else if (!reports.empty()) {
            reports.back() += "\n" + line;
        }
    }
    for (std::string& r : reports) r = Normalised(r);
    return reports;
}

// Whether the lines from a read as those from e, where a line "..." of e stands for any lines.
bool LinesMatch(const std::vector<std::string>& e, size_t i, const std::vector<std::string>& a, size_t j) {
    if (i == e.size()) return j == a.size();
    if (e[i] == "...") return LinesMatch(e, i + 1, a, j) || (j < a.size() && LinesMatch(e, i, a, j + 1));
    return j < a.size() && e[i] == a[j] && LinesMatch(e, i + 1, a, j + 1);
}

struct Run {
    ToolResult result;
    std::vector<std::string> reports;  // of a run in the gnu form
    std::vector<std::pair<std::string, std::string>> leftFiles;
};

Run RunCase(const GoldenCase& c, bool gnu) {
    // An AddressSanitizer build of the tool would report the blocks that Python's own allocator keeps (the
    // interpreter is not shut down before exit) as leaks; with plain malloc they stay reachable.
    ::setenv("PYTHONMALLOC", "malloc", 1);
    const TempDir dir;
    dir.Write("t.ovm", c.input);
    for (const auto& [name, text] : c.files) dir.Write(name, text);
    std::vector<std::string> args = c.args;
    if (gnu) args.insert(args.begin(), "--diagnostics=gnu");
    Run run{RunTool(args, c.input, dir.path().string()), {}, {}};
    if (gnu) run.reports = Reports(run.result.err);
    for (const auto& [name, text] : c.leftFiles) {
        const fs::path path = dir.path() / name;
        run.leftFiles.emplace_back(name, fs::exists(path) ? ReadFile(path.string()) : "<missing>");
    }
    return run;
}

// Checks that the case runs as written.
void Check(const GoldenCase& c) {
    const bool reports = !c.rawErr && !c.errors.empty();
    const Run run = RunCase(c, reports);
    const ToolResult& r = run.result;
    EXPECT_EQ(r.exitCode, c.rawErr ? c.exitCode : reports ? 1 : 0) << r.err;
    EXPECT_EQ(r.out, c.out);
    if (reports) {
        std::vector<std::string> expected;
        for (const std::string& e : c.errors) expected.push_back(Normalised(e));
        bool same = run.reports.size() == expected.size();
        for (size_t i = 0; same && i < expected.size(); ++i)
            same = LinesMatch(Lines(expected[i]), 0, Lines(run.reports[i]), 0);
        if (!same) {
            EXPECT_EQ(run.reports, expected);
        }
    } else {
        EXPECT_EQ(r.err, c.err.empty() ? "" : c.err + "\n");
    }
    EXPECT_EQ(run.leftFiles, c.leftFiles);
}

// The lines of a field: one line with escapes, unless the text has many lines.
std::vector<std::string> FieldLines(char kind, const std::string& text, bool oneLine) {
    if (oneLine || std::count(text.begin(), text.end(), '\n') <= 6)
        return {std::string(1, kind) + (text.empty() ? "" : " " + Escape(text))};
    std::vector<std::string> lines;
    for (const std::string& line : Lines(text))
        lines.push_back((lines.empty() ? std::string(1, kind) : "|") + (line.empty() ? "" : " " + Escape(line)));
    return lines;
}

// The expectation lines of a case, as the tool behaves now. A case keeps the form of its expectation: the exact
// standard error ('?') or the reports ('!').
std::vector<std::string> Expectations(const GoldenCase& c) {
    const Run run = RunCase(c, false);
    const ToolResult& r = run.result;
    std::vector<std::string> lines;
    auto add = [&](const std::vector<std::string>& more) { lines.insert(lines.end(), more.begin(), more.end()); };
    if (!r.out.empty()) add(FieldLines('>', r.out, false));
    const std::vector<std::string> reports = r.exitCode == 1 && !c.rawErr ? RunCase(c, true).reports
                                                                          : std::vector<std::string>{};
    for (const std::string& report : reports) {
        const std::vector<std::string> reportLines = Lines(report);
        for (size_t i = 0; i < reportLines.size(); ++i)
            lines.push_back((i == 0 ? "!" : "|") + (reportLines[i].empty() ? "" : " " + Escape(reportLines[i])));
    }
    if (reports.empty() && (r.exitCode != 0 || !r.err.empty())) {
        const bool lineFeed = !r.err.empty() && r.err.back() == '\n';
        add(FieldLines('?', std::to_string(r.exitCode) + " " + r.err.substr(0, r.err.size() - lineFeed), true));
    }
    for (const auto& [name, content] : run.leftFiles) add(FieldLines('=', name + ": " + content, false));
    return lines;
}

void ParseFile(const fs::path& path, std::vector<GoldenCase>& cases) {
    std::ifstream in(path);
    std::string* last = nullptr;
    bool expectations = false;
    int number = 0;
    for (std::string line; std::getline(in, line);) {
        ++number;
        if (line.empty() || line[0] == '#') continue;
        const char kind = line.size() > 1 && line[1] != ' ' ? '\0' : line[0];
        const std::string text = Unescape(line.size() > 2 ? line.substr(2) : "");
        if (kind == '<' || cases.empty() || (expectations && (kind == '$' || kind == '+'))) {
            cases.emplace_back();
            cases.back().caseFile = path.string();
            cases.back().line = number;
            expectations = false;
        }
        GoldenCase& c = cases.back();
        expectations = expectations || (kind != '\0' && std::strchr(">!?=", kind));
        const size_t colon = text.find(": ");
        const std::pair<std::string, std::string> named{text.substr(0, colon),
                                                        colon == std::string::npos ? "" : text.substr(colon + 2)};
        switch (kind) {
            case '<': last = &(c.input = text); break;
            case '+': c.files.push_back(named), last = &c.files.back().second; break;
            case '=': c.leftFiles.push_back(named), last = &c.leftFiles.back().second; break;
            case '>': last = &(c.out = text); break;
            case '!': c.errors.push_back(text), last = &c.errors.back(); break;
            case '|':
                if (last) *last += "\n" + text;
                break;
            case '$': {
                c.args.clear();
                std::istringstream words(text);
                for (std::string w; words >> w;) c.args.push_back(w);
                last = nullptr;
                break;
            }
            case '?':
                c.rawErr = true;
                c.exitCode = std::atoi(text.c_str());
                last = &(c.err = text.substr(std::min(text.size(), text.find(' ') + 1)));
                break;
            default: c.malformed = line;
        }
    }
}

// Rewrites the expectations of the cases that do not run as written when the process ends
// (OVMACRO_GOLDEN_REFRESH=1); the others, "..." lines included, stay as they are.
class Refresher {
public:
    void Record(const GoldenCase& c) {
        ::testing::TestPartResultArray failures;
        {
            const ::testing::ScopedFakeTestPartResultReporter quiet(&failures);
            Check(c);
        }
        if (failures.size() > 0) pending_[c.caseFile][c.line] = Expectations(c);
    }
    ~Refresher() {
        for (const auto& [file, cases] : pending_) Rewrite(file, cases);
    }

private:
    static void Rewrite(const std::string& file, const std::map<int, std::vector<std::string>>& cases) {
        std::vector<GoldenCase> all;
        ParseFile(file, all);
        std::set<int> starts;
        for (const GoldenCase& c : all) starts.insert(c.line);
        std::ifstream in(file);
        std::vector<std::string> out;
        const std::vector<std::string>* replacement = nullptr;
        char kind = ' ';
        auto flush = [&] {
            if (!replacement) return;
            // Comments and blank lines between cases stay after the new expectations.
            auto at = out.end();
            while (at != out.begin() && (at[-1].empty() || at[-1][0] == '#')) --at;
            out.insert(at, replacement->begin(), replacement->end());
        };
        int number = 0;
        for (std::string line; std::getline(in, line);) {
            if (starts.count(++number)) {
                flush();
                const auto it = cases.find(number);
                replacement = it == cases.end() ? nullptr : &it->second;
            }
            if (line.empty() || line[0] != '|') kind = line.empty() ? ' ' : line[0];
            if (!replacement || !std::strchr(">!?=", kind)) out.push_back(line);
        }
        flush();
        std::ofstream rewritten(file);
        for (const std::string& line : out) rewritten << line << '\n';
    }

    std::map<std::string, std::map<int, std::vector<std::string>>> pending_;
};

}  // namespace

void PrintTo(const GoldenCase& c, std::ostream* os) { *os << c.caseFile << ":" << c.line; }

std::vector<GoldenCase> LoadGoldenCases(const std::string& folder) {
    std::vector<fs::path> files;
    for (const fs::directory_entry& entry : fs::directory_iterator(fs::path(OVMACRO_SOURCE_DIR) / "tests" / folder)) {
        const std::string name = entry.path().filename().string();
        if (name.size() > 10 && name.substr(name.size() - 10) == "_cases.txt") files.push_back(entry.path());
    }
    std::sort(files.begin(), files.end());
    std::vector<GoldenCase> cases;
    for (const fs::path& file : files) ParseFile(file, cases);
    return cases;
}

std::string GoldenCaseName(const ::testing::TestParamInfo<GoldenCase>& info) {
    const std::string stem = fs::path(info.param.caseFile).stem().string();
    return stem.substr(0, stem.size() - 6) + "_" + std::to_string(info.param.line);  // without "_cases"
}

void RunGoldenCase(const GoldenCase& c) {
    SCOPED_TRACE(c.caseFile + ":" + std::to_string(c.line));
    ASSERT_EQ(c.malformed, "") << "a line this reader does not know";
    if (std::getenv("OVMACRO_GOLDEN_REFRESH")) {
        static Refresher refresher;
        refresher.Record(c);
        return;
    }
    Check(c);
}

}  // namespace orvan::testing

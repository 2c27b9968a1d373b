// Writing #line markers into generated C and C++ code.
#include "line_markers.h"

#include <algorithm>
#include <optional>
#include <string_view>

#include "ovmacro/foundations/text_format.h"

namespace ovmacro_tool {

namespace {

bool IsBlank(char c) {
    return c == ' ' || c == '\t' || c == '\r' || c == '\v' || c == '\f';
}
bool IsIdentifierChar(char c) {
    return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9') || c == '_';
}

// Follows the C lexical state from line to line, just enough to tell where a directive may begin: not in
// a block comment, not in a raw string literal, not on a line that a backslash joins to the one before.
class DirectivePlaces {
public:
    bool AllowedAtLineStart() const { return state_ == State::kCode && !spliced_; }

    // Reads one line, without its line feed.
    void ReadLine(std::string_view line) {
        size_t i = 0;
        while (i < line.size()) {
            if (state_ == State::kBlockComment) {
                const size_t close = line.find("*/", i);
                if (close == std::string_view::npos) break;
                state_ = State::kCode;
                i = close + 2;
            } else if (state_ == State::kRawString) {
                const std::string close = ")" + rawDelimiter_ + "\"";
                const size_t end = line.find(close, i);
                if (end == std::string_view::npos) break;
                state_ = State::kCode;
                i = end + close.size();
            } else {
                i = ReadCode(line, i);
            }
        }
        spliced_ = !line.empty() && line.back() == '\\';
    }

private:
    enum class State { kCode, kBlockComment, kRawString };

    // Reads code from i up to the end of the line or the start of a comment or raw string that goes on.
    size_t ReadCode(std::string_view line, size_t i) {
        const char c = line[i];
        const char next = i + 1 < line.size() ? line[i + 1] : '\0';
        if (c == '/' && next == '/') return line.size();
        if (c == '/' && next == '*') {
            state_ = State::kBlockComment;
            return i + 2;
        }
        if (c == '"') {
            if (IsRawStringPrefix(line, i)) {
                const size_t open = line.find('(', i + 1);
                if (open != std::string_view::npos && open - i - 1 <= 16) {
                    rawDelimiter_ = std::string(line.substr(i + 1, open - i - 1));
                    state_ = State::kRawString;
                    return open + 1;
                }
            }
            return SkipQuoted(line, i, '"');
        }
        // A quote after a digit or letter is a digit separator (1'000) or ends a prefix (u8'a', L'a').
        if (c == '\'' && (i == 0 || !IsIdentifierChar(line[i - 1]))) return SkipQuoted(line, i, '\'');
        return i + 1;
    }

    // R", u8R", uR", UR" or LR", not preceded by another identifier character.
    static bool IsRawStringPrefix(std::string_view line, size_t quote) {
        if (quote == 0 || line[quote - 1] != 'R') return false;
        size_t start = quote - 1;
        for (std::string_view prefix : {"u8", "u", "U", "L"}) {
            if (start >= prefix.size() && line.substr(start - prefix.size(), prefix.size()) == prefix) {
                start -= prefix.size();
                break;
            }
        }
        return start == 0 || !IsIdentifierChar(line[start - 1]);
    }

    // Past the closing quote, or to the end of the line for an unclosed literal.
    static size_t SkipQuoted(std::string_view line, size_t i, char quote) {
        for (++i; i < line.size(); ++i) {
            if (line[i] == '\\')
                ++i;
            else if (line[i] == quote)
                return i + 1;
        }
        return line.size();
    }

    State state_ = State::kCode;
    std::string rawDelimiter_;
    bool spliced_ = false;
};

// The source of the line [begin, end) of the output, whose runs start at runs[first]: that of its first
// non-blank byte that comes from a loaded file.
std::optional<SourcePosition> SourceOfLine(std::string_view output, size_t begin, size_t end,
                                           const std::vector<OutputRun>& runs, size_t first,
                                           const SourceLocator& locator) {
    for (size_t r = first; r < runs.size() && runs[r].offset < static_cast<long long>(end); ++r) {
        const OutputRun& run = runs[r];
        if (!run.source) continue;
        const size_t runEnd = static_cast<size_t>(run.offset + run.length);
        for (size_t i = std::max(begin, static_cast<size_t>(run.offset)); i < runEnd; ++i) {
            if (IsBlank(output[i]) || output[i] == '\n') continue;
            // The bytes of a run come from one text: if this one is in no loaded file, neither is the rest.
            if (const auto at = locator.Locate(SourceOfOffset(run, static_cast<long long>(i)))) return at;
            break;
        }
    }
    return std::nullopt;
}

}  // namespace

void AddLineMarkers(std::string& output, std::vector<OutputRun>& runs, const SourceLocator& locator) {
    std::string marked;
    std::vector<OutputRun> markedRuns;
    marked.reserve(output.size());
    markedRuns.reserve(runs.size());
    DirectivePlaces places;
    int presumedFile = -1;
    long long presumedLine = 0;
    size_t run = 0;
    for (size_t begin = 0; begin < output.size();) {
        const size_t lf = output.find('\n', begin);
        const size_t end = lf == std::string::npos ? output.size() : lf + 1;
        const std::optional<SourcePosition> source = SourceOfLine(output, begin, end, runs, run, locator);
        if (source && places.AllowedAtLineStart() &&
            (source->file != presumedFile || source->line != presumedLine)) {
            const std::string marker = "#line " + std::to_string(source->line) + " " +
                                       orvan::MakeDoubleQuotedString(locator.FileNames()[source->file]) +
                                       "\n";
            OutputRun markerRun;
            markerRun.offset = static_cast<long long>(marked.size());
            markerRun.length = static_cast<long long>(marker.size());
            markerRun.kind = RunKind::kMarker;
            markedRuns.push_back(markerRun);
            marked += marker;
            presumedFile = source->file;
            presumedLine = source->line;
        }
        const long long shift = static_cast<long long>(marked.size()) - static_cast<long long>(begin);
        for (; run < runs.size() && runs[run].offset < static_cast<long long>(end); ++run) {
            OutputRun moved = runs[run];
            moved.offset += shift;
            markedRuns.push_back(moved);
        }
        marked.append(output, begin, end - begin);
        places.ReadLine(
            std::string_view(output).substr(begin, lf == std::string::npos ? end - begin : lf - begin));
        ++presumedLine;
        begin = end;
    }
    output.swap(marked);
    runs.swap(markedRuns);
}

}  // namespace ovmacro_tool

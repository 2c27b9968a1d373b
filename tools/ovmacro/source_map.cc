// Writing the source map as JSON.
#include "source_map.h"

namespace ovmacro_tool {

namespace {

// The length of the valid UTF-8 sequence at text[i], or 0 if none starts there.
size_t Utf8SequenceLength(std::string_view text, size_t i) {
    const auto byte = [&](size_t k) { return static_cast<unsigned char>(text[k]); };
    const unsigned char lead = byte(i);
    size_t n;
    unsigned char low = 0x80, high = 0xBF;  // the range of the second byte
    if (lead >= 0xC2 && lead <= 0xDF) {
        n = 2;
    } else if (lead >= 0xE0 && lead <= 0xEF) {
        n = 3;
        if (lead == 0xE0) low = 0xA0;   // no overlong forms
        if (lead == 0xED) high = 0x9F;  // no surrogates
    } else if (lead >= 0xF0 && lead <= 0xF4) {
        n = 4;
        if (lead == 0xF0) low = 0x90;
        if (lead == 0xF4) high = 0x8F;  // nothing above U+10FFFF
    } else {
        return 0;
    }
    if (i + n > text.size() || byte(i + 1) < low || byte(i + 1) > high) return 0;
    for (size_t k = 2; k < n; ++k)
        if (byte(i + k) < 0x80 || byte(i + k) > 0xBF) return 0;
    return n;
}

void AppendField(std::string& out, const char* name, long long value) {
    out += ", \"";
    out += name;
    out += "\": ";
    out += std::to_string(value);
}

}  // namespace

std::string JsonString(std::string_view text) {
    static constexpr char kHex[] = "0123456789abcdef";
    std::string out = "\"";
    for (size_t i = 0; i < text.size();) {
        const unsigned char c = static_cast<unsigned char>(text[i]);
        if (c == '"' || c == '\\') {
            out += '\\';
            out += static_cast<char>(c);
        } else if (c == '\n') {
            out += "\\n";
        } else if (c == '\t') {
            out += "\\t";
        } else if (c < 0x20 || c == 0x7f) {
            out += "\\u00";
            out += kHex[c >> 4];
            out += kHex[c & 15];
        } else if (c >= 0x80) {
            const size_t n = Utf8SequenceLength(text, i);
            if (n == 0) {
                out += "\\ufffd";
                ++i;
            } else {
                out.append(text, i, n);
                i += n;
            }
            continue;
        } else {
            out += static_cast<char>(c);
        }
        ++i;
    }
    out += '"';
    return out;
}

std::string SourceMapJson(const std::string& outputName, const std::vector<OutputRun>& runs,
                          const std::string& output, const SourceLocator& locator) {
    std::string out = "{\n  \"version\": 1,\n  \"output\": " + JsonString(outputName) + ",\n  \"files\": [";
    const std::vector<std::string>& names = locator.FileNames();
    for (size_t i = 0; i < names.size(); ++i) out += (i ? ", " : "") + JsonString(names[i]);
    out += "],\n  \"mappings\": [";
    long long line = 1;
    long long lineStart = 0;
    for (size_t i = 0; i < runs.size(); ++i) {
        const OutputRun& run = runs[i];
        out += i ? ",\n    " : "\n    ";
        out += "{\"offset\": " + std::to_string(run.offset);
        AppendField(out, "length", run.length);
        AppendField(out, "line", line);
        AppendField(out, "column", run.offset - lineStart + 1);
        out += ", \"kind\": \"";
        out += RunKindName(run.kind);
        out += '"';
        if (const std::optional<SourcePosition> at = locator.Locate(run.source)) {
            AppendField(out, "file", at->file);
            AppendField(out, "sourceLine", at->line);
            AppendField(out, "sourceColumn", at->column);
            if (run.kind == RunKind::kCalculated) AppendField(out, "sourceLength", run.sourceLength);
        }
        out += '}';
        // A run ends at the latest with the line feed of its line.
        const long long end = run.offset + run.length;
        if (end > 0 && output[static_cast<size_t>(end - 1)] == '\n') {
            ++line;
            lineStart = end;
        }
    }
    out += runs.empty() ? "]\n}\n" : "\n  ]\n}\n";
    return out;
}

}  // namespace ovmacro_tool

// Line diff (Myers' O(ND) algorithm) and its unified-diff form.
#include "text_diff.h"

#include <algorithm>
#include <vector>

namespace ovmacro_tool {

namespace {

// Beyond this many differing lines the shortest edit is not searched for: the memory it takes grows with
// the square of that number.
constexpr long long kMaxEditDistance = 1000;
constexpr size_t kContext = 3;

std::vector<std::string_view> SplitLines(std::string_view text) {
    std::vector<std::string_view> lines;
    for (size_t begin = 0; begin < text.size();) {
        const size_t lf = text.find('\n', begin);
        const size_t end = lf == std::string_view::npos ? text.size() : lf + 1;
        lines.push_back(text.substr(begin, end - begin));
        begin = end;
    }
    return lines;
}

enum class Op : char { kKeep = ' ', kDelete = '-', kInsert = '+' };

// The shortest edit script turning a[0, n) into b[0, m); false when it is longer than kMaxEditDistance.
bool ShortestEdit(const std::string_view* a, long long n, const std::string_view* b, long long m,
                  std::vector<Op>& script) {
    const long long limit = std::min(n + m, kMaxEditDistance);
    // v[k + limit + 1]: the furthest x reached on diagonal k; trace[d] keeps v[-d..d] after round d.
    std::vector<long long> v(static_cast<size_t>(2 * limit + 3), 0);
    const auto V = [&](long long k) -> long long& { return v[static_cast<size_t>(k + limit + 1)]; };
    std::vector<std::vector<long long>> trace;
    long long found = -1;
    for (long long d = 0; d <= limit && found < 0; ++d) {
        for (long long k = -d; k <= d; k += 2) {
            long long x = (k == -d || (k != d && V(k - 1) < V(k + 1))) ? V(k + 1) : V(k - 1) + 1;
            long long y = x - k;
            while (x < n && y < m && a[x] == b[y]) ++x, ++y;
            V(k) = x;
            if (x >= n && y >= m) found = d;
        }
        trace.emplace_back(v.begin() + (limit + 1 - d), v.begin() + (limit + 1 + d + 1));
    }
    if (found < 0) return false;
    long long x = n, y = m;
    std::vector<Op> reversed;
    for (long long d = found; d > 0; --d) {
        const std::vector<long long>& prev = trace[static_cast<size_t>(d - 1)];
        const auto P = [&](long long k) { return prev[static_cast<size_t>(k + d - 1)]; };
        const long long k = x - y;
        const bool down = k == -d || (k != d && P(k - 1) < P(k + 1));
        const long long prevK = down ? k + 1 : k - 1;
        const long long prevX = P(prevK);
        const long long prevY = prevX - prevK;
        while (x > prevX && y > prevY) {
            reversed.push_back(Op::kKeep);
            --x, --y;
        }
        reversed.push_back(down ? Op::kInsert : Op::kDelete);
        x = prevX;
        y = prevY;
    }
    for (; x > 0; --x) reversed.push_back(Op::kKeep);
    script.assign(reversed.rbegin(), reversed.rend());
    return true;
}

std::vector<Op> EditScript(const std::vector<std::string_view>& a, const std::vector<std::string_view>& b) {
    size_t prefix = 0;
    while (prefix < a.size() && prefix < b.size() && a[prefix] == b[prefix]) ++prefix;
    size_t suffix = 0;
    while (suffix < a.size() - prefix && suffix < b.size() - prefix &&
           a[a.size() - 1 - suffix] == b[b.size() - 1 - suffix])
        ++suffix;
    const long long n = static_cast<long long>(a.size() - prefix - suffix);
    const long long m = static_cast<long long>(b.size() - prefix - suffix);
    std::vector<Op> middle;
    if (!ShortestEdit(a.data() + prefix, n, b.data() + prefix, m, middle)) {
        // Too many differences to align the texts: line i of one is compared with line i of the other, so
        // that the first lines shown are still the first that differ, each with its replacement.
        middle.clear();
        for (long long i = 0; i < std::max(n, m); ++i) {
            const size_t ia = prefix + static_cast<size_t>(i);
            if (i < n && i < m && a[ia] == b[ia]) {
                middle.push_back(Op::kKeep);
                continue;
            }
            if (i < n) middle.push_back(Op::kDelete);
            if (i < m) middle.push_back(Op::kInsert);
        }
    }
    std::vector<Op> script(prefix, Op::kKeep);
    script.insert(script.end(), middle.begin(), middle.end());
    script.insert(script.end(), suffix, Op::kKeep);
    return script;
}

// "START,COUNT" of a hunk side, as diff writes it: an empty side names the line before it, and a count of 1
// is left out.
std::string Range(size_t start, size_t count) {
    if (count == 1) return std::to_string(start + 1);
    return std::to_string(count == 0 ? start : start + 1) + "," + std::to_string(count);
}

}  // namespace

std::string UnifiedDiff(std::string_view before, std::string_view after, const std::string& beforeLabel,
                        const std::string& afterLabel, size_t maxLines) {
    const std::vector<std::string_view> a = SplitLines(before), b = SplitLines(after);
    const std::vector<Op> script = EditScript(a, b);
    std::string out = "--- " + beforeLabel + "\n+++ " + afterLabel + "\n";
    size_t written = 0;
    // Positions in the script, in a and in b of each step.
    std::vector<size_t> ai(script.size() + 1), bi(script.size() + 1);
    for (size_t s = 0; s < script.size(); ++s) {
        ai[s + 1] = ai[s] + (script[s] != Op::kInsert);
        bi[s + 1] = bi[s] + (script[s] != Op::kDelete);
    }
    size_t s = 0;
    while (s < script.size()) {
        while (s < script.size() && script[s] == Op::kKeep) ++s;
        if (s == script.size()) break;
        // A hunk: from kContext steps before this change to kContext after the last change that is closer
        // than 2 * kContext unchanged lines to the one before it.
        const size_t first = s >= kContext ? s - kContext : 0;
        size_t last = s;  // one past the last change
        for (size_t t = s; t < script.size(); ++t) {
            if (script[t] != Op::kKeep) {
                last = t + 1;
            } else if (t - last >= 2 * kContext) {
                break;
            }
        }
        const size_t end = std::min(script.size(), last + kContext);
        if (written++ == maxLines) return out + "... more differences not shown\n";
        out += "@@ -" + Range(ai[first], ai[end] - ai[first]) + " +" + Range(bi[first], bi[end] - bi[first]) +
               " @@\n";
        for (size_t t = first; t < end; ++t) {
            if (written++ == maxLines) return out + "... more differences not shown\n";
            const std::string_view line = script[t] == Op::kInsert ? b[bi[t]] : a[ai[t]];
            out += static_cast<char>(script[t]);
            out += line;
            if (line.empty() || line.back() != '\n') out += "\n\\ No newline at end of file\n";
        }
        s = end;
    }
    return out;
}

}  // namespace ovmacro_tool

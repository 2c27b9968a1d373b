// The closest-word rule behind "did you mean ...?".
#include "suggestions.h"

#include <algorithm>
#include <cstdlib>

namespace ovmacro_tool {

namespace {

// Past this the distance only says "far", which is all the rule needs, and long words cost no quadratic time.
constexpr int kFar = 3;
constexpr size_t kLongestWord = 64;

char Lower(char c) {
    return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
}

// Whether b is a with two neighbouring characters swapped, letter case ignored.
bool IsNeighbourSwap(std::string_view a, std::string_view b) {
    if (a.size() != b.size()) return false;
    size_t i = 0;
    while (i < a.size() && Lower(a[i]) == Lower(b[i])) ++i;
    return i + 1 < a.size() && Lower(a[i]) == Lower(b[i + 1]) && Lower(a[i + 1]) == Lower(b[i]) &&
           EditDistance(a.substr(i + 2), b.substr(i + 2)) == 0;
}

bool WithinReach(std::string_view word, std::string_view candidate, int distance) {
    if (distance == 0) return true;  // only the letter case differs
    if (word.size() == 3) return distance == 1 && IsNeighbourSwap(word, candidate);
    if (word.size() > 3 && distance == 1) return true;
    return distance == 2 && word.size() >= 6 && candidate.size() >= 6;
}

}  // namespace

int EditDistance(std::string_view a, std::string_view b) {
    const size_t n = a.size(), m = b.size();
    if (n > kLongestWord || m > kLongestWord || (n > m ? n - m : m - n) >= static_cast<size_t>(kFar))
        return kFar;
    // Three rows of the table: the two before the current one, for the swap of neighbours.
    std::vector<int> before(m + 1), previous(m + 1), current(m + 1);
    for (size_t j = 0; j <= m; ++j) previous[j] = static_cast<int>(j);
    for (size_t i = 1; i <= n; ++i) {
        current[0] = static_cast<int>(i);
        for (size_t j = 1; j <= m; ++j) {
            const int cost = Lower(a[i - 1]) == Lower(b[j - 1]) ? 0 : 1;
            current[j] = std::min({previous[j] + 1, current[j - 1] + 1, previous[j - 1] + cost});
            if (i > 1 && j > 1 && Lower(a[i - 1]) == Lower(b[j - 2]) && Lower(a[i - 2]) == Lower(b[j - 1]))
                current[j] = std::min(current[j], before[j - 2] + 1);
        }
        std::swap(before, previous);
        std::swap(previous, current);
    }
    return std::min(previous[m], kFar);
}

bool ClosestWord::Consider(std::string_view candidate) {
    if (candidate == word_ || candidate == best_) return false;
    const int distance = EditDistance(word_, candidate);
    if (distance > bestDistance_ || distance >= kFar) return false;
    if (distance == bestDistance_) {
        tied_ = true;
        return false;
    }
    bestDistance_ = distance;
    tied_ = false;
    if (!WithinReach(word_, candidate, distance)) {
        best_.clear();
        return false;
    }
    best_ = std::string(candidate);
    return true;
}

const std::vector<std::string_view>& DirectiveWords() {
    static const std::vector<std::string_view> words = {
        "import",  "importpath", "relativepath", "if",       "elseif",    "else",      "while",
        "for",     "def",        "exportdef",    "nakeddef", "defpython", "runpython", "str",
        "strx",    "strW",       "strxW",        "unstr",    "scope",     "quote",     "print",
        "println", "assert",     "assertfails",  "fail",     "let"};
    return words;
}

}  // namespace ovmacro_tool

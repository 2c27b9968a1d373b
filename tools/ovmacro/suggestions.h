// Suggestions for a misspelt word: the one candidate that is clearly the closest to it, or none.
//
// Closeness counts the edits (insert, delete or replace a character, swap two neighbours) between the words,
// letter case ignored. A candidate is offered when it is within reach and strictly closer than every other:
// - a word that differs from it only in letter case is always within reach (@If for @if);
// - a word of 3 characters only by a swap of neighbours (@fro): one other edit turns too many short words
//   of ordinary text into a directive (@ref, @GET, @set);
// - a longer word by 1 edit (@deff, @esle), or 2 when both have at least 6 characters (@improtpath).
// Words of 1 or 2 characters ("@in", "@me") get nothing but the case.
#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace ovmacro_tool {

// The edits between a and b, letter case ignored (optimal string alignment distance).
int EditDistance(std::string_view a, std::string_view b);

// Collects candidates and keeps the clearly closest one.
class ClosestWord {
public:
    explicit ClosestWord(std::string_view word) : word_(word) {}
    // Considers a candidate; returns true when it is now the best one. A candidate equal to the word is
    // never one.
    bool Consider(std::string_view candidate);
    // The best candidate when it is within reach and no other is as close; empty otherwise.
    std::string Best() const { return tied_ ? std::string() : best_; }

private:
    std::string word_;
    std::string best_;
    int bestDistance_ = 1 << 30;
    bool tied_ = false;
};

// The directive words of the language (without their '@').
const std::vector<std::string_view>& DirectiveWords();

}  // namespace ovmacro_tool

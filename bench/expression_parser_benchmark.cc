// Expressions evaluated per second by the expression parser, for arithmetic, comparison and string
// expressions, each parsed by a fresh parser as the directives do.
#include <benchmark/benchmark.h>

#include <string>
#include <vector>

#include "ovmacro/expr/expression_parser.h"

namespace {

using orvan::ExpressionParser;
using orvan::LSLiteral;

const std::vector<std::string> kArithmetic = {
    "1 + 2 * 3 - 4 / 2",          "(17 % 5) << 3 | 0x0F & ~1",          "2 ^^ 10 - (3 + 4) * (5 - 6)",
    "1.5 * 2 + 3.25 / (1 - 0.5)", "-(-7 / 2) + int(2.9) * len('abcd')",
};

const std::vector<std::string> kComparison = {
    "1 < 2 && 3 >= 3 || false", "(10 == 10.0) && !(2 > 3)",          "'abc' < 'abd' && 65 == 'A'[0]",
    "true ? 1 <= 2 : 3 != 4",   "is_int(len('xyz')) && 2 ^^ 3 == 8",
};

const std::vector<std::string> kString = {
    "'Hello' + ', ' + \"world\" + '!'",   "string(42) + '-' + string(2.5)",
    "'abcdef'[2] + 'xyz'[0] + 'tail'",    "len('some longer text here') == 21 ? 'yes' : 'no'",
    "r\"C:\\dir\\\" + 'file' + \".txt\"",
};

void Evaluate(benchmark::State& state, const std::vector<std::string>& texts) {
    for (auto _ : state) {
        for (const std::string& text : texts) {
            ExpressionParser parser;
            parser.Init(text);
            LSLiteral result;
            parser.ParseExpression(result);
            benchmark::DoNotOptimize(result);
        }
    }
    state.SetItemsProcessed(state.iterations() * static_cast<int64_t>(texts.size()));
}

void BM_Arithmetic(benchmark::State& state) {
    Evaluate(state, kArithmetic);
}
void BM_Comparison(benchmark::State& state) {
    Evaluate(state, kComparison);
}
void BM_String(benchmark::State& state) {
    Evaluate(state, kString);
}
void BM_Mix(benchmark::State& state) {
    std::vector<std::string> all = kArithmetic;
    all.insert(all.end(), kComparison.begin(), kComparison.end());
    all.insert(all.end(), kString.begin(), kString.end());
    Evaluate(state, all);
}

BENCHMARK(BM_Arithmetic);
BENCHMARK(BM_Comparison);
BENCHMARK(BM_String);
BENCHMARK(BM_Mix);

}  // namespace

BENCHMARK_MAIN();

// Output runs: the output of an expansion cut into runs, each with the source that it came from.
//
// The output pieces of an expansion tell, for every character of the expanded text, where it came from. The
// source map and the line markers want that per output line, so the pieces are cut at every line feed: a run
// never spans two lines (the line feed that ends a line belongs to the last run of that line).
#pragma once

#include <string_view>
#include <vector>

#include "ovmacro/output/output_pieces.h"
#include "source_locator.h"

namespace ovmacro_tool {

enum class RunKind {
    kCopied,      // the output is the source text itself, byte for byte
    kCalculated,  // text that the source range produced (a macro value, a @str result, an evaluation)
    kIndent,      // blanks inserted to indent a nested text; no source
    kMarker,      // a #line line written by --line-markers; no source
};

struct OutputRun {
    long long offset = 0;  // in the output
    long long length = 0;
    RunKind kind = RunKind::kIndent;
    // Copied: the address of the run's first byte in the source. Calculated: the begin of the source range
    // that produced it. Otherwise null.
    const char* source = nullptr;
    long long sourceLength = 0;  // calculated: the size of that range
};

// The runs of `output`, the text that `pieces` describe. Pieces beyond the text, if any, are ignored. A
// copied run whose source is not (or no longer) those very bytes in a loaded text gets no source.
std::vector<OutputRun> SplitIntoRuns(std::string_view output, const orvan::OutputPieces& pieces,
                                     const SourceLocator& locator);

// The source address of output offset `at`, which must lie inside `run`: the matching byte of a copied run,
// the producing range of a calculated one; null for the others and for runs without a source.
const char* SourceOfOffset(const OutputRun& run, long long at);

const char* RunKindName(RunKind kind);

}  // namespace ovmacro_tool

// Cutting output pieces into runs that each lie within one output line.
#include "output_runs.h"

#include <algorithm>

namespace ovmacro_tool {

std::vector<OutputRun> SplitIntoRuns(std::string_view output, const orvan::OutputPieces& pieces,
                                     const SourceLocator& locator) {
    std::vector<OutputRun> runs;
    const long long total = static_cast<long long>(output.size());
    long long offset = 0;
    for (const orvan::OutputPiece& piece : pieces.GetPieces()) {
        if (offset >= total) break;
        const long long size = std::min<long long>(piece.size(), total - offset);
        const char* source = piece.source.begin();
        const RunKind kind = piece.IsCopied() ? RunKind::kCopied
                             : source         ? RunKind::kCalculated
                                              : RunKind::kIndent;
        const long long start = offset, end = offset + size;
        // A copied piece keeps its source only when that still holds the bytes copied from it; only then is
        // the address used to compute others.
        const bool live =
            kind == RunKind::kCopied && source &&
            locator.HoldsCopyOf(source, output.substr(static_cast<size_t>(start), static_cast<size_t>(size)));
        while (offset < end) {
            const size_t lf = output.find('\n', static_cast<size_t>(offset));
            const long long stop =
                lf == std::string_view::npos ? end : std::min<long long>(end, static_cast<long long>(lf) + 1);
            OutputRun run;
            run.offset = offset;
            run.length = stop - offset;
            run.kind = kind;
            if (kind == RunKind::kCalculated) {
                run.source = source;
                run.sourceLength = piece.source.size();
            } else if (live) {
                run.source = source + (offset - start);
            }
            runs.push_back(run);
            offset = stop;
        }
    }
    return runs;
}

const char* SourceOfOffset(const OutputRun& run, long long at) {
    if (run.kind == RunKind::kCopied && run.source) return run.source + (at - run.offset);
    return run.source;
}

const char* RunKindName(RunKind kind) {
    switch (kind) {
        case RunKind::kCopied:
            return "copied";
        case RunKind::kCalculated:
            return "calculated";
        case RunKind::kIndent:
            return "indent";
        case RunKind::kMarker:
            return "marker";
    }
    return "";
}

}  // namespace ovmacro_tool

// Fuzz target: expands a whole text as a host does, in a file-scope frame with an import handler, so that
// every directive is live: definitions, invocations, conditionals, loops, string and evaluation directives,
// assertions, scopes, dollar definitions and imports.
//
// The input holds up to kMaxFiles texts separated by NUL bytes. The first is the file expanded; `@import "N"`
// loads the N-th text as another file: it is expanded once, in its own file-scope frame, which the importing
// frame then imports (again at every further import of it). An import of a file whose expansion is still
// running is refused, as a host refuses import cycles.
//
// Work that the language leaves unbounded is bounded here: the input is at most 4 KiB; Python is switched
// off (no interpreter in fuzzing); expansions nest at most kFuzzDepthLimit levels; an outermost expansion may
// run kFuzzExpansionLimit nested expansions (every @while iteration and its condition, every @for item and
// macro invocation counts) and write kFuzzOutputLimit characters in all; dollar macro replacement stops at
// kFuzzDollarTextLimit characters. Past a bound the expansion fails like any other, with an IException.
//
// Checked besides crashes: the output pieces tile the expanded text exactly, each copied piece holds the
// characters of a live source, both mappers of output positions agree, and an error that reaches the host
// carries a message and a position that is null or inside the input, never in a temporary text that has died.
#include <memory>
#include <vector>

#include "fuzz_support.h"
#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/expander/nesting_guard.h"
#include "ovmacro/output/output_pieces.h"
#include "ovmacro/python/python_bridge.h"

using namespace orvan;

namespace {

constexpr size_t kMaxFiles = 8;
constexpr int64 kFuzzDepthLimit = 64;
constexpr int64 kFuzzExpansionLimit = 4000;
constexpr int64 kFuzzOutputLimit = 1 << 18;
constexpr int64 kFuzzDollarTextLimit = 1 << 16;

void ConfigureBounds() {
    SetPythonAllowed(false);
    MacroNestingGuard::SetDepthLimitForTesting(kFuzzDepthLimit);
    MacroNestingGuard::SetWorkLimitsForTesting(kFuzzExpansionLimit, kFuzzOutputLimit);
    FileScopeVarFrame::SetDollarMacroTextLimitForTesting(kFuzzDollarTextLimit);
}

class FuzzImportHandler : public ImportHandler {
  public:
    explicit FuzzImportHandler(const std::vector<BasicSubString>& files)
        : files_(files), frames_(files.size()), state_(files.size(), kNotLoaded) {}

    bool HandleImportPath(const basic_xstring& path, const char*) override { return !path.empty(); }

    bool HandleImport(VarFrame* frame, const basic_xstring& fileName, const char*) override {
        size_t index = 0;
        if (fileName.empty() || fileName.size() > 2) return false;
        for (char c : fileName) {
            if (c < '0' || c > '9') return false;
            index = index * 10 + static_cast<size_t>(c - '0');
        }
        if (index == 0 || index >= files_.size() || !frame || !frame->GetFileScopeVarFrame()) return false;
        if (state_[index] == kNotLoaded) {
            state_[index] = kExpanding;
            frames_[index] = std::make_unique<FileScopeVarFrame>();
            basic_xstring expanded;
            try {
                MacroExpand(this, frames_[index].get(), files_[index], 0, 0, expanded);
            } catch (const LexScannerException&) {
                state_[index] = kFailed;
                return false;
            }
            state_[index] = kLoaded;
        }
        if (state_[index] != kLoaded) return false;  // failed, or a cycle
        frame->GetFileScopeVarFrame()->AddImport(frames_[index].get());
        return true;
    }

  private:
    enum State { kNotLoaded, kExpanding, kLoaded, kFailed };
    std::vector<BasicSubString> files_;
    std::vector<std::unique_ptr<FileScopeVarFrame>> frames_;
    std::vector<State> state_;
};

void CheckPieces(const basic_xstring& expanded, const OutputPieces& pieces) {
    const auto size = static_cast<int64>(expanded.size());
    FUZZ_CHECK(pieces.size() == size);
    int64 sum = 0;
    for (const OutputPiece& p : pieces.GetPieces()) {
        FUZZ_CHECK(p.source.begin() <= p.source.end() && p.length >= 0);
        sum += p.size();
    }
    FUZZ_CHECK(sum == size);
    // A copied piece stands for the very characters of its source, which must still be alive.
    int64 at = 0;
    for (const OutputPiece& p : pieces.GetPieces()) {
        if (p.IsCopied() && !p.source.empty()) {
            FUZZ_CHECK(!PointsIntoFreedMemory(p.source.begin()) &&
                       !PointsIntoFreedMemory(p.source.end() - 1));
            FUZZ_CHECK(expanded.compare(static_cast<size_t>(at), static_cast<size_t>(p.source.size()),
                                        p.source.begin(), static_cast<size_t>(p.source.size())) == 0);
        }
        at += p.size();
    }
    if (size == 0) return;
    // Positions in increasing order, up to 64 of them spread over the text, each mapped both ways.
    OutputPiecesMonotonePosMapper mapper(pieces);
    const int64 step = size / 64 + 1;
    for (int64 pos = 0; pos < size; pos += step)
        FUZZ_CHECK(mapper.MapOutputPositionToAddress(pos) == pieces.MapOutputPositionToAddress(pos));
    FUZZ_CHECK(mapper.MapOutputPositionToAddress(size - 1) == pieces.MapOutputPositionToAddress(size - 1));

    // An error found in the expanded text moves back into the source; one at its end stays.
    const BasicSubString view(expanded);
    LexScannerException inside("x", view.begin() + size / 2);
    pieces.AdjustErrorPosition(inside, view);
    FUZZ_CHECK(inside.GetPosition() == pieces.MapOutputPositionToAddress(size / 2));
    LexScannerException atEnd("x", view.end());
    pieces.AdjustErrorPosition(atEnd, view);
    FUZZ_CHECK(atEnd.GetPosition() == view.end());
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    static const bool configured = (ConfigureBounds(), true);
    (void)configured;
    if (size > kMaxFuzzInputSize) return 0;

    const char* begin = reinterpret_cast<const char*>(data);
    const char* end = begin + size;
    std::vector<BasicSubString> files;
    const char* fileBegin = begin;
    for (const char* p = begin; p < end && files.size() + 1 < kMaxFiles; ++p) {
        if (*p != '\0') continue;
        files.emplace_back(fileBegin, p);
        fileBegin = p + 1;
    }
    files.emplace_back(fileBegin, end);

    FuzzImportHandler handler(files);
    FileScopeVarFrame frame;
    basic_xstring expanded;
    OutputPieces pieces;
    try {
        MacroExpand(&handler, &frame, files[0], 0, 0, expanded, pieces);
    } catch (const LexScannerException& e) {
        FUZZ_CHECK(!e.GetMessage().empty());
        FUZZ_CHECK(!e.GetPosition() || (e.GetPosition() >= begin && e.GetPosition() <= end));
        StringStream report;
        e.Write(report);
        return 0;
    } catch (const IException&) {
        return 0;
    }
    CheckPieces(expanded, pieces);
    return 0;
}

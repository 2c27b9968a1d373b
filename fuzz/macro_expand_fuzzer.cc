// Fuzz target: expands a whole text as a host does, in a file-scope frame with an import handler, so that
// every directive is live: definitions, invocations, conditionals, loops, string and evaluation directives,
// assertions, scopes, dollar definitions and imports.
//
// The input holds up to kMaxFiles texts separated by NUL bytes. The first is the file expanded; `@import "N"`
// loads the N-th text as another file: it is expanded once, in its own file-scope frame, which the importing
// frame then imports (again at every further import of it). An import of a file whose expansion is still
// running is refused, as a host refuses import cycles.
//
// Work that the language leaves unbounded is bounded (ConfigureFuzzBounds), and the input is at most 4 KiB.
//
// Checked besides crashes: the output pieces tile the expanded text exactly, each copied piece holds the
// characters of a live source, both mappers of output positions agree, and an error that reaches the host
// carries a message and a position that is null or inside the input, never in a temporary text that has died.
#include <memory>
#include <string_view>
#include <vector>

#include "fuzz_support.h"
#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/output/output_pieces.h"

using namespace orvan;

namespace {

constexpr size_t kMaxFiles = 8;
class FuzzImportHandler : public ImportHandler {
  public:
    explicit FuzzImportHandler(const std::vector<BasicSubString>& files)
        : files_(files), frames_(files.size()), state_(files.size(), kNotLoaded) {}

    bool HandleImportPath(const basic_xstring& path, const char*) override { return !path.empty(); }

    bool HandleImport(VarFrame* frame, const basic_xstring& fileName, const char*) override {
        const bool digits = !fileName.empty() && fileName.size() <= 2 &&
                            fileName.find_first_not_of("0123456789") == basic_xstring::npos;
        const size_t index = digits ? std::stoul(fileName) : 0;
        if (index == 0 || index >= files_.size() || !frame || !frame->GetFileScopeVarFrame()) return false;
        if (state_[index] == kNotLoaded) {
            state_[index] = kFailed;  // also while it expands: an import of it then is a cycle
            frames_[index] = std::make_unique<FileScopeVarFrame>();
            basic_xstring expanded;
            try {
                MacroExpand(this, frames_[index].get(), files_[index], 0, 0, expanded);
                state_[index] = kLoaded;
            } catch (const LexScannerException&) {
            }
        }
        if (state_[index] != kLoaded) return false;
        frame->GetFileScopeVarFrame()->AddImport(frames_[index].get());
        return true;
    }

  private:
    enum State { kNotLoaded, kLoaded, kFailed };
    std::vector<BasicSubString> files_;
    std::vector<std::unique_ptr<FileScopeVarFrame>> frames_;
    std::vector<State> state_;
};

void CheckPieces(const basic_xstring& expanded, const OutputPieces& pieces) {
    const auto size = static_cast<int64>(expanded.size());
    FUZZ_CHECK(pieces.size() == size);
    // The pieces tile the text; a copied piece stands for the very characters of its source, still alive.
    int64 at = 0;
    for (const OutputPiece& p : pieces.GetPieces()) {
        FUZZ_CHECK(p.source.begin() <= p.source.end() && p.length >= 0);
        if (p.IsCopied() && !p.source.empty()) {
            FUZZ_CHECK(!PointsIntoFreedMemory(p.source.begin()) &&
                       !PointsIntoFreedMemory(p.source.end() - 1));
            FUZZ_CHECK(expanded.compare(static_cast<size_t>(at), static_cast<size_t>(p.source.size()),
                                        p.source.begin(), static_cast<size_t>(p.source.size())) == 0);
        }
        at += p.size();
    }
    FUZZ_CHECK(at == size);
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
    static const bool configured = ConfigureFuzzBounds();
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
        // Every error says something, but @fail, whose message is the template's own text, maybe empty.
        FUZZ_CHECK(!e.GetMessage().empty() ||
                   std::string_view(begin, size).find("@fail") != std::string_view::npos);
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

// ovmacro: expands the macros of a file with the ovMacroExpander library.
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <string>

#include <unistd.h>

#include "options.h"
#include "ovmacro/expander/macro_expander.h"
#include "ovmacro/foundations/files.h"
#include "ovmacro/foundations/scanning.h"

using namespace orvan;
using ovmacro_tool::Options;

namespace {

constexpr int kExitExpansionError = 1;
constexpr int kExitUsage = 2;

// Writes the whole text to `path` through a temporary file beside it, so that OUT is replaced only whole.
bool WriteFileAtomically(const std::string& path, const std::string& text, std::string& error) {
    const std::string temp = path + ".ovmacro-tmp";
    std::FILE* f = std::fopen(temp.c_str(), "wb");
    if (!f) {
        error = std::strerror(errno);
        return false;
    }
    const bool written = std::fwrite(text.data(), 1, text.size(), f) == text.size();
    const bool closed = std::fclose(f) == 0;
    if (!written || !closed || std::rename(temp.c_str(), path.c_str()) != 0) {
        error = std::strerror(errno);
        std::remove(temp.c_str());
        return false;
    }
    return true;
}

}  // namespace

int main(int argc, char** argv) {
    Options options;
    std::string error;
    if (!ovmacro_tool::ParseOptions(argc, argv, options, error)) {
        std::fprintf(stderr, "ovmacro: %s\n%s", error.c_str(), "Try 'ovmacro --help'.\n");
        return kExitUsage;
    }
    if (options.help) {
        std::fputs(ovmacro_tool::UsageText(), stdout);
        return 0;
    }
    if (options.version) {
        std::printf("ovmacro %s\n", OVMACRO_VERSION);
        return 0;
    }

    const bool fromStdin = options.inputPath == "-";
    const std::string displayName = fromStdin ? "<stdin>" : options.inputPath;
    std::string text;
    const bool read = fromStdin ? ReadStringFromStdin(text, true, &error)
                                : ReadStringFromFile(options.inputPath, text, true, &error);
    if (!read) {
        std::fprintf(stderr, "ovmacro: cannot read %s: %s\n", displayName.c_str(), error.c_str());
        return kExitUsage;
    }

    FileScopeVarFrame frame;
    std::string result;
    try {
        MacroExpand(nullptr, &frame, BasicSubString(text), 0, 0, result);
    } catch (const LexScannerException& e) {
        const int64 line = GetLineNumber(BasicSubString(text), e.GetPosition());
        if (line >= 0)
            std::fprintf(stderr, "\n%s(%lld) : %s\n", displayName.c_str(), static_cast<long long>(line),
                         e.GetMessage().c_str());
        else
            std::fprintf(stderr, "\n%s\n", e.GetMessage().c_str());
        return kExitExpansionError;
    }
    std::fflush(stdout);  // text printed while expanding comes before the expansion

    if (options.outputPath.empty()) {
        if (std::fwrite(result.data(), 1, result.size(), stdout) != result.size() || std::fflush(stdout) != 0) {
            std::fprintf(stderr, "ovmacro: cannot write standard output\n");
            return kExitUsage;
        }
        return 0;
    }
    if (!WriteFileAtomically(options.outputPath, result, error)) {
        std::fprintf(stderr, "ovmacro: cannot write %s: %s\n", options.outputPath.c_str(), error.c_str());
        return kExitUsage;
    }
    return 0;
}

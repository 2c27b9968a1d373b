// Comparing a generated file on disk with the expansion.
#include "check_mode.h"

#include <cstdio>
#include <filesystem>
#include <system_error>

#include "ovmacro/foundations/files.h"
#include "text_diff.h"

namespace ovmacro_tool {

namespace {

constexpr size_t kMaxDiffLines = 40;

}  // namespace

int CheckGeneratedFile(const std::string& path, const std::string& expanded) {
    std::error_code ec;
    if (!std::filesystem::exists(path, ec) && !ec) {
        std::fprintf(stderr, "ovmacro: %s does not exist (run without --check to generate it)\n",
                     path.c_str());
        return 1;
    }
    std::string onDisk, error;
    // Read as it is stored: a CR LF on disk where the expansion has LF is a difference.
    if (!orvan::ReadStringFromFile(path, onDisk, false, &error)) {
        std::fprintf(stderr, "ovmacro: cannot read %s: %s\n", path.c_str(), error.c_str());
        return 2;
    }
    if (onDisk == expanded) return 0;
    const std::string diff =
        UnifiedDiff(onDisk, expanded, path + " (on disk)", path + " (expanded)", kMaxDiffLines);
    std::fwrite(diff.data(), 1, diff.size(), stdout);
    std::fflush(stdout);
    std::fprintf(stderr, "ovmacro: %s is out of date (run without --check to regenerate it)\n", path.c_str());
    return 1;
}

}  // namespace ovmacro_tool

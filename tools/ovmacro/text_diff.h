// A short unified diff of two texts, to show how a generated file differs from what it should be.
//
//     --- out.h (on disk)
//     +++ out.h (expanded)
//     @@ -3,7 +3,7 @@
//      unchanged line
//     -old line
//     +new line
//
// Lines are compared whole, line feed included; a last line without one is followed by "\ No newline at end
// of file". Hunks carry 3 lines of context. The diff stops after `maxLines` lines (hunk headers counted, the
// two file headers not) with a line "... more differences not shown". Texts that differ in too many places
// to be aligned (over a thousand lines) are compared line by line, line i of one with line i of the other.
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

namespace ovmacro_tool {

std::string UnifiedDiff(std::string_view before, std::string_view after, const std::string& beforeLabel,
                        const std::string& afterLabel, size_t maxLines);

}  // namespace ovmacro_tool

// SourceLocator: turns an address in a loaded text into a file, a line and a column.
//
// The source map, the line markers and the error reports all name places by file, line and column. Files are
// identified by their recorded name: a file loaded twice (imported from two places) is one file, whichever of
// its two texts an address lies in. Lines and columns count from 1; a column counts bytes, so a tab is 1.
//
//     SourceLocator locator(files);
//     if (auto at = locator.Locate(e.GetPosition()))
//         os << locator.FileNames()[at->file] << ':' << at->line << ':' << at->column;
#pragma once

#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "ovmacro/output/source_files.h"

namespace ovmacro_tool {

struct SourcePosition {
    int file = -1;              // index into SourceLocator::FileNames()
    long long line = 0;         // from 1
    long long column = 0;       // from 1, in bytes
    std::string_view lineText;  // the whole line, without its line feed
};

class SourceLocator {
public:
    // The list must not change (no file added) while the locator is used.
    explicit SourceLocator(const orvan::MpfwSourceFileList& files);

    // The place of an address inside the source text of a loaded file, the position just past the end of a
    // text included (an error at the end of a file is reported on its last line). Nothing for null or for an
    // address in no loaded text (a temporary string, inserted indentation).
    std::optional<SourcePosition> Locate(const char* p) const;
    // True when the bytes [p, p + text size) lie in one loaded text and equal `text`. The pieces of an
    // expansion can name as the source of copied text a temporary text that is gone by now, whose memory a
    // later text may have taken: the bytes tell whether the address still holds what was copied.
    bool HoldsCopyOf(const char* p, std::string_view text) const;
    // The distinct names of the loaded files, in load order.
    const std::vector<std::string>& FileNames() const { return names_; }

private:
    struct Text {
        std::string_view text;
        int file;                        // index into names_
        std::vector<size_t> lineStarts;  // offsets at which each line begins, made on first use
    };
    const Text* TextHolding(const char* p) const;

    std::vector<std::string> names_;
    mutable std::vector<Text> texts_;
};

}  // namespace ovmacro_tool

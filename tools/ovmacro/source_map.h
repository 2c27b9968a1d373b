// The source map that --source-map writes: where each run of the output came from, as JSON.
//
//     {
//       "version": 1,
//       "output": "colors.h",
//       "files": ["<command line>", "cpp_table.ovm"],
//       "mappings": [
//         {"offset": 0, "length": 80, "line": 1, "column": 1, "kind": "copied", "file": 1, "sourceLine": 11,
//          "sourceColumn": 1},
//         {"offset": 200, "length": 4, "line": 9, "column": 1, "kind": "indent"},
//         {"offset": 204, "length": 3, "line": 9, "column": 5, "kind": "calculated", "file": 1,
//          "sourceLine": 24, "sourceColumn": 9, "sourceLength": 2},
//         ...
//       ]
//     }
//
// "output" is the output file as given with -o, or "-" for standard output. "files" are the loaded files
// (FILE, what it imports, "<stdin>" and "<command line>" for the -D definitions), each once, in load order,
// named as they were given or found. The mappings tile the output in order, without gaps or overlaps, and
// none spans two output lines. offset and length count bytes of the output; line and column (from 1, in
// bytes, a tab counting 1) are where the run begins in the output. kind is one of:
//   "copied": the run is the source text at file, sourceLine, sourceColumn, byte for byte;
//   "calculated": text produced by the source range at file, sourceLine, sourceColumn, of sourceLength
//     bytes (a macro's value, a @str result, an evaluation); the blanks that indent its lines included;
//   "indent": blanks that indent the lines of a nested text; no source;
//   "marker": a #line line written by --line-markers; no source.
// A copied or calculated run that comes from no loaded file (text made during the expansion) has no "file",
// "sourceLine", "sourceColumn" or "sourceLength" either. Strings are UTF-8; a byte of a file name that is
// not part of valid UTF-8 is written as U+FFFD.
#pragma once

#include <string>
#include <vector>

#include "output_runs.h"
#include "source_locator.h"

namespace ovmacro_tool {

std::string SourceMapJson(const std::string& outputName, const std::vector<OutputRun>& runs,
                          const std::string& output, const SourceLocator& locator);

// A JSON string literal of text.
std::string JsonString(std::string_view text);

}  // namespace ovmacro_tool

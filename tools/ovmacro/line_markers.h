// Line markers: "#line N "FILE"" lines that make a C or C++ compiler report errors in generated code at the
// template line that produced it.
//
// The source of an output line is the source of its first byte that is not a blank, tab, CR, VT or FF and
// that comes from a loaded file: the byte itself for copied text, the start of the producing range for
// calculated text. Bytes that come from text made during the expansion (the items of a @for list, for
// instance) are passed over. Lines with no such byte (blank lines among them) have no source.
//
// A compiler numbers the lines after "#line N "FILE"" N, N+1, ... of FILE. Before each output line with a
// source, a marker is written when that source's file and line differ from the ones the compiler presumes
// for the line (those of the previous marker, counting every output line since, blank lines included). So
// lines copied in order from one template need no marker, and a blank line from elsewhere does not shift the
// numbering of the lines after it.
//
// A marker is never written where it would change the meaning of the code: after a line that ends with a
// backslash (it would join the marker to that line), inside a /* */ comment or inside a raw string literal;
// it is written before the first line where it is allowed again, if still needed.
#pragma once

#include <string>
#include <vector>

#include "output_runs.h"
#include "source_locator.h"

namespace ovmacro_tool {

// Inserts the markers into `output` (described by `runs`) and adds a run of kind kMarker for each, shifting
// the offsets of the runs after it.
void AddLineMarkers(std::string& output, std::vector<OutputRun>& runs, const SourceLocator& locator);

}  // namespace ovmacro_tool

// Error reports in the form chosen with --diagnostics.
//
// The default form is the library's: a line feed, then "FILE(LINE) : MESSAGE" and a line feed, the message
// with all its lines. The gnu form is the one that compilers use and that editors and CI annotators parse:
//
//     FILE:LINE:COLUMN: error: FIRST LINE OF THE MESSAGE
//     the source line
//           ^
//         invoking macro m          <- the other lines of the message (context), as they are
//
// LINE and COLUMN count from 1; COLUMN counts bytes, so a tab counts 1. In the echoed source line control
// bytes other than tab are shown as '?', and the caret line keeps the tabs of the source line so that the
// caret stands under the column in a terminal. An error at a place in no loaded text is reported as
// "ovmacro: error: FIRST LINE OF THE MESSAGE", followed by the other lines.
#pragma once

#include <string_view>

#include "ovmacro/foundations/stream.h"
#include "ovmacro/lexer/exceptions.h"
#include "ovmacro/output/source_files.h"

namespace ovmacro_tool {

enum class DiagnosticStyle { kDefault, kGnu };

// "default" or "gnu"; false for any other name.
bool ParseDiagnosticStyle(std::string_view name, DiagnosticStyle& style);

void WriteDiagnostic(orvan::xostream& os, const orvan::MpfwSourceFileList& files,
                     const orvan::LexScannerException& e, DiagnosticStyle style);

}  // namespace ovmacro_tool

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
// "ovmacro: error: FIRST LINE OF THE MESSAGE", followed by the other lines. Warnings, notes and trace lines
// take the same forms, with their kind in place of "error" (and no line feed before them).
#pragma once

#include <memory>
#include <string_view>

#include "ovmacro/foundations/stream.h"
#include "ovmacro/lexer/exceptions.h"
#include "ovmacro/output/source_files.h"
#include "source_locator.h"

namespace ovmacro_tool {

enum class DiagnosticStyle { kDefault, kGnu };

// "default" or "gnu"; false for any other name.
bool ParseDiagnosticStyle(std::string_view name, DiagnosticStyle& style);

void WriteDiagnostic(orvan::xostream& os, const orvan::MpfwSourceFileList& files,
                     const orvan::LexScannerException& e, DiagnosticStyle style);

// A one-line report of another kind ("warning", "note", "trace") at an address in a loaded text:
// "FILE(LINE) : KIND: TEXT", or in the gnu form "FILE:LINE:COLUMN: KIND: TEXT" followed, with `echo`, by the
// source line and its caret; "ovmacro: KIND: TEXT" when the address lies in no loaded text.
void WriteLocated(orvan::xostream& os, const SourceLocator& locator, const char* place, std::string_view kind,
                  std::string_view text, DiagnosticStyle style, bool echo);

// Writes such reports on standard error while files are still being loaded: its locator is made again only
// when a file was added since the last report.
class ReportWriter {
public:
    ReportWriter(const orvan::MpfwSourceFileList& files, DiagnosticStyle style)
        : files_(files), style_(style) {}
    void Write(const char* place, std::string_view kind, std::string_view text, bool echo);
    const SourceLocator& Locator();

private:
    const orvan::MpfwSourceFileList& files_;
    DiagnosticStyle style_;
    std::unique_ptr<SourceLocator> locator_;
    orvan::int64 locatedFiles_ = 0;
};

}  // namespace ovmacro_tool

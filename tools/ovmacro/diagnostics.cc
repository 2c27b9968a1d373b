// Writing error reports in the default or the gnu form.
#include "diagnostics.h"

#include <optional>

#include "source_locator.h"

namespace ovmacro_tool {

namespace {

void WriteGnu(orvan::xostream& os, const orvan::MpfwSourceFileList& files,
              const orvan::LexScannerException& e) {
    const std::string_view message = e.GetMessage();
    const size_t lf = message.find('\n');
    const std::string_view first = message.substr(0, lf);
    const SourceLocator locator(files);
    if (const std::optional<SourcePosition> at = locator.Locate(e.GetPosition())) {
        os << locator.FileNames()[at->file] << ':' << at->line << ':' << at->column << ": error: " << first
           << '\n';
        std::string shown, caret;
        for (size_t i = 0; i < at->lineText.size(); ++i) {
            const char c = at->lineText[i];
            const unsigned char u = static_cast<unsigned char>(c);
            shown += c == '\t' || (u >= 0x20 && u != 0x7f) ? c : '?';
            if (static_cast<long long>(i) + 1 < at->column) caret += c == '\t' ? '\t' : ' ';
        }
        os << shown << '\n' << caret << "^\n";
    } else {
        os << "ovmacro: error: " << first << '\n';
    }
    if (lf != std::string_view::npos) os << message.substr(lf + 1) << '\n';
}

}  // namespace

bool ParseDiagnosticStyle(std::string_view name, DiagnosticStyle& style) {
    if (name == "default")
        style = DiagnosticStyle::kDefault;
    else if (name == "gnu")
        style = DiagnosticStyle::kGnu;
    else
        return false;
    return true;
}

void WriteDiagnostic(orvan::xostream& os, const orvan::MpfwSourceFileList& files,
                     const orvan::LexScannerException& e, DiagnosticStyle style) {
    if (style == DiagnosticStyle::kGnu)
        WriteGnu(os, files, e);
    else
        files.WriteLexScannerError(os, e);
}

}  // namespace ovmacro_tool

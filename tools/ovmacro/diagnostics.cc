// Writing error reports in the default or the gnu form.
#include "diagnostics.h"

#include <optional>

#include "source_locator.h"

namespace ovmacro_tool {

namespace {

// The source line of a place, control bytes shown as '?', and a caret under its column.
void WriteSourceLine(orvan::xostream& os, const SourcePosition& at) {
    std::string shown, caret;
    for (size_t i = 0; i < at.lineText.size(); ++i) {
        const char c = at.lineText[i];
        const unsigned char u = static_cast<unsigned char>(c);
        shown += c == '\t' || (u >= 0x20 && u != 0x7f) ? c : '?';
        if (static_cast<long long>(i) + 1 < at.column) caret += c == '\t' ? '\t' : ' ';
    }
    os << shown << '\n' << caret << "^\n";
}

void WriteGnu(orvan::xostream& os, const orvan::MpfwSourceFileList& files,
              const orvan::LexScannerException& e) {
    const std::string_view message = e.GetMessage();
    const size_t lf = message.find('\n');
    const std::string_view first = message.substr(0, lf);
    const SourceLocator locator(files);
    if (const std::optional<SourcePosition> at = locator.Locate(e.GetPosition())) {
        os << locator.FileNames()[at->file] << ':' << at->line << ':' << at->column << ": error: " << first
           << '\n';
        WriteSourceLine(os, *at);
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

void WriteLocated(orvan::xostream& os, const SourceLocator& locator, const char* place, std::string_view kind,
                  std::string_view text, DiagnosticStyle style, bool echo) {
    const std::optional<SourcePosition> at = locator.Locate(place);
    if (!at)
        os << "ovmacro: ";
    else if (style == DiagnosticStyle::kGnu)
        os << locator.FileNames()[at->file] << ':' << at->line << ':' << at->column << ": ";
    else
        os << locator.FileNames()[at->file] << '(' << at->line << ") : ";
    os << kind << ": " << text << '\n';
    if (at && echo && style == DiagnosticStyle::kGnu) WriteSourceLine(os, *at);
}

const SourceLocator& ReportWriter::Locator() {
    if (!locator_ || locatedFiles_ != files_.size()) {
        locator_ = std::make_unique<SourceLocator>(files_);
        locatedFiles_ = files_.size();
    }
    return *locator_;
}

void ReportWriter::Write(const char* place, std::string_view kind, std::string_view text, bool echo) {
    WriteLocated(orvan::xcerr(), Locator(), place, kind, text, style_, echo);
    orvan::xcerr().flush();
}

}  // namespace ovmacro_tool

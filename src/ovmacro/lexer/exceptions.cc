#include "ovmacro/lexer/exceptions.h"

#include "ovmacro/lexer/token.h"

namespace orvan {

LexScannerException::LexScannerException(const basic_xstring& message, const char* position)
    : message_(message), position_(position) {}

LexScannerException::LexScannerException(const basic_xstring& message, BasicSubString at)
    : message_(message), position_(at.begin()) {}

LexScannerException::LexScannerException(const basic_xstring& message, const LSToken& token)
    : message_(message), position_(token.text.begin()) {}

void LexScannerException::AppendContextLine(std::string_view line) {
    if (line.size() <= static_cast<size_t>(kMaxContextLineLength)) {
        message_.append(line);
        return;
    }
    // Cut before a byte that continues a UTF-8 sequence, never inside one.
    size_t cut = static_cast<size_t>(kMaxContextLineLength);
    while (cut > 0 && (static_cast<unsigned char>(line[cut]) & 0xC0) == 0x80) --cut;
    StringStream ss;
    ss << line.substr(0, cut) << " ... (" << static_cast<int64>(line.size() - cut) << " more bytes)";
    message_.append(ss.str());
}

void LexScannerException::AppendCallContextLine(std::string_view line) {
    if (callContextLines_ < kMaxCallContextLines) {
        AppendContextLine(line);
        ++callContextLines_;
    } else {
        ++omittedCallContextLines_;
    }
}

void LexScannerException::AppendOmittedContextCount() {
    if (omittedCallContextLines_ == 0) return;
    StringStream ss;
    ss << "\n    ... " << omittedCallContextLines_ << " more context lines left out";
    message_.append(ss.str());
    omittedCallContextLines_ = 0;
}

void LexScannerException::Write(xostream& os) const {
    if (!fileName_.empty()) {
        os << fileName_;
        if (line_ >= 0) os << "(" << line_ << ")";
        os << " : ";
    } else if (line_ >= 0) {
        os << "Line " << line_ << ": ";
    }
    os << "error : " << message_;
}

}  // namespace orvan

// The exceptions through which every library error is reported.
//
// `IException` is the root that hosts catch. `LexScannerException` carries every scanning, parsing and
// expansion error: a message, a position (a pointer into the scanned source, or null) and, once a host has
// located it, a file name and line. Handlers that an error passes through append context lines to the message
// (each begins with a line feed and four blanks).
#pragma once

#include <exception>

#include "ovmacro/foundations/stream.h"
#include "ovmacro/foundations/types.h"

namespace orvan {

class LSToken;

class IException : public std::exception {
public:
    virtual void Write(xostream& os) const = 0;
};

class LexScannerException : public IException {
public:
    LexScannerException(const basic_xstring& message, const char* position);
    LexScannerException(const basic_xstring& message, BasicSubString at);
    LexScannerException(const basic_xstring& message, const LSToken& token);

    // "FILE(LINE) : error : MESSAGE", or the shorter forms when the file or line is unknown.
    void Write(xostream& os) const override;
    const char* what() const noexcept override { return message_.c_str(); }

    const basic_xstring& GetMessage() const { return message_; }
    basic_xstring& GetMessage() { return message_; }
    void AppendToMessage(std::string_view text) { message_.append(text); }
    // Appends a context line (it begins with a line feed), shortened to kMaxContextLineLength bytes and a
    // note of how many were left out, so that an error in a huge generated text stays readable.
    void AppendContextLine(std::string_view line);
    // Appends a context line of a call chain (an invocation, an argument, a loop item). Past
    // kMaxCallContextLines of them the lines are only counted, so that an error deep in a recursion stays
    // readable; the outermost expansion then says how many were left out (AppendOmittedContextCount).
    void AppendCallContextLine(std::string_view line);
    void AppendOmittedContextCount();
    static constexpr int64 kMaxCallContextLines = 24;
    static constexpr int64 kMaxContextLineLength = 240;
    const char* GetPosition() const { return position_; }
    void SetPosition(const char* p) { position_ = p; }
    const basic_xstring& GetFileName() const { return fileName_; }
    int64 GetLine() const { return line_; }
    void SetFileNameAndLine(const basic_xstring& fileName, int64 line) {
        fileName_ = fileName;
        line_ = line;
    }

private:
    basic_xstring message_;
    basic_xstring fileName_;
    int64 line_ = -1;
    const char* position_ = nullptr;
    int64 callContextLines_ = 0;
    int64 omittedCallContextLines_ = 0;
};

}  // namespace orvan

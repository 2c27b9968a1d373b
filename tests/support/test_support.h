// Helpers shared by the test programs: running the ovmacro tool, temporary folders, expanding a text, and
// stating where an error was raised.
#pragma once

#include <cstring>
#include <filesystem>
#include <functional>
#include <memory>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "ovmacro/expander/import_handler.h"
#include "ovmacro/lexer/exceptions.h"
#include "ovmacro/vars/var_frame.h"

namespace orvan::testing {

struct ToolResult {
    int exitCode = -1;  // 128 + N when signal N ended it
    std::string out;    // standard output
    std::string err;    // standard error
};

// Runs the ovmacro tool built with the tests, with the given arguments and standard input, in workingDir.
ToolResult RunTool(const std::vector<std::string>& args, const std::string& input = "",
                   const std::string& workingDir = "");
// The same, with `prefix` run instead, the tool and its arguments after it (for example a command that drops
// privileges), and `whileRunning` called with the process id once it runs, before it is waited for.
ToolResult RunTool(const std::vector<std::string>& args, const std::string& input, const std::string& workingDir,
                   const std::vector<std::string>& prefix, const std::function<void(int pid)>& whileRunning);

// A fresh folder under the system's temporary folder, removed with everything in it when destroyed.
class TempDir {
public:
    TempDir();
    ~TempDir();
    TempDir(const TempDir&) = delete;
    TempDir& operator=(const TempDir&) = delete;
    const std::filesystem::path& path() const { return path_; }
    // Writes a file (relative to the folder, its folders made) and returns its full path.
    std::string Write(const std::string& relativePath, const std::string& content) const;

private:
    std::filesystem::path path_;
};

std::string ReadFile(const std::string& path);

// Runs fn and returns the message of the LexScannerException it raises (and its position); fails the test
// when it raises none.
std::string MessageOf(const std::function<void()>& fn);
std::string MessageOf(const std::function<void()>& fn, const char*& position);

// The offset of p in text, or -1 when p does not point into it (or just past its end).
int64 OffsetIn(std::string_view text, const char* p);
// "LINE:COLUMN" of p in text, both from 1 (a column counts bytes), as the golden cases write places; "-"
// when p lies outside the text.
std::string LineColumn(std::string_view text, const char* p);
// Runs fn and returns "LINE:COLUMN MESSAGE" of the LexScannerException it raises, its place taken in text.
std::string ErrorIn(std::string_view text, const std::function<void()>& fn);

// Expands text (which must outlive the frame's definitions) in frame into a string, with the given import
// handler (none by default).
std::string ExpandIn(VarFrame& frame, const std::string& text, ImportHandler* handler = nullptr);
// Expands text in a fresh file-scope frame.
std::string ExpandText(const std::string& text, ImportHandler* handler = nullptr);

// Runs fn on a new thread with a stack of `bytes` (1 MiB is the smallest that hosts commonly give).
void RunOnStackOf(size_t bytes, const std::function<void()>& fn);

// Runs `undo` when the scope ends, so that a limit lowered for one test is restored even when it fails.
class Finally {
public:
    explicit Finally(std::function<void()> undo) : undo_(std::move(undo)) {}
    ~Finally() { undo_(); }
    Finally(const Finally&) = delete;
    Finally& operator=(const Finally&) = delete;

private:
    std::function<void()> undo_;
};

// A copy of a text in a heap buffer of exactly its size, so that AddressSanitizer reports any read past its
// end, and so that positions can be checked to point into it.
class ExactBuffer {
public:
    explicit ExactBuffer(std::string_view text) : data_(new char[text.size()]), size_(text.size()) {
        if (!text.empty()) std::memcpy(data_.get(), text.data(), text.size());
    }
    BasicSubString view() const { return BasicSubString(data_.get(), data_.get() + size_); }
    std::string_view text() const { return {data_.get(), size_}; }
    int64 size() const { return static_cast<int64>(size_); }
    // The offset of p in the buffer (its end included); -1 for null, -2 for an address outside it.
    int64 Offset(const char* p) const {
        if (!p) return -1;
        const std::less<const char*> lt;
        if (lt(p, data_.get()) || lt(data_.get() + size_, p)) return -2;
        return p - data_.get();
    }

private:
    std::unique_ptr<char[]> data_;
    size_t size_;
};

// An import handler that refuses every import: with it, an expansion reads dollar definitions as directives.
class NoImports : public ImportHandler {
public:
    bool HandleImport(VarFrame*, const basic_xstring&, const char*) override { return false; }
};

}  // namespace orvan::testing

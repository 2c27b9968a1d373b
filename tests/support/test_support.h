// Helpers shared by the test programs: running the ovmacro tool, temporary directories, exception capture.
#pragma once

#include <filesystem>
#include <functional>
#include <string>
#include <vector>

#include "ovmacro/lexer/exceptions.h"

namespace orvan::testing {

struct ToolResult {
    int exitCode = -1;
    std::string out;  // standard output
    std::string err;  // standard error
};

// Runs the ovmacro tool built with the tests, with the given arguments and standard input.
ToolResult RunTool(const std::vector<std::string>& args, const std::string& input = "",
                   const std::string& workingDir = "");

// A fresh directory under the system's temporary directory, removed with everything in it when destroyed.
class TempDir {
public:
    TempDir();
    ~TempDir();
    TempDir(const TempDir&) = delete;
    TempDir& operator=(const TempDir&) = delete;
    const std::filesystem::path& path() const { return path_; }
    // Writes a file (relative to the directory) and returns its full path.
    std::string Write(const std::string& relativePath, const std::string& content) const;

private:
    std::filesystem::path path_;
};

std::string ReadFile(const std::string& path);

// Runs fn and returns the message of the LexScannerException it raises; fails the test when it raises none.
std::string MessageOf(const std::function<void()>& fn);
// The same, also giving the exception's position.
std::string MessageOf(const std::function<void()>& fn, const char*& position);

}  // namespace orvan::testing

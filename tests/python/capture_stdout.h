// Captures what is written to file descriptor 1 while it lives, so tests can see what Python printed.
#pragma once

#include <unistd.h>

#include <cstdio>
#include <string>

#include "ovmacro/foundations/stream.h"

namespace orvan::testing {

class CaptureStdout {
public:
    CaptureStdout() {
        Flush();
        file_ = std::tmpfile();
        saved_ = dup(1);
        dup2(fileno(file_), 1);
    }
    ~CaptureStdout() {
        Restore();
        if (file_) std::fclose(file_);
    }
    CaptureStdout(const CaptureStdout&) = delete;
    CaptureStdout& operator=(const CaptureStdout&) = delete;

    // Stops capturing and returns everything written since the capture began.
    std::string Finish() {
        Restore();
        std::string text;
        std::rewind(file_);
        char buf[4096];
        for (size_t n; (n = std::fread(buf, 1, sizeof buf, file_)) > 0;) text.append(buf, n);
        return text;
    }

private:
    static void Flush() {
        xcout().flush();
        std::fflush(stdout);
    }
    void Restore() {
        if (saved_ < 0) return;
        Flush();
        dup2(saved_, 1);
        close(saved_);
        saved_ = -1;
    }

    std::FILE* file_ = nullptr;
    int saved_ = -1;
};

}  // namespace orvan::testing

#include "support/test_support.h"

#include <gtest/gtest.h>
#include <pthread.h>
#include <sys/wait.h>
#include <unistd.h>

#include <csignal>
#include <algorithm>
#include <cstdio>
#include <fstream>
#include <random>
#include <sstream>
#include <thread>

#include "ovmacro/expander/macro_expander.h"

namespace orvan::testing {

namespace {

std::string ReadFd(int fd) {
    std::string s;
    char buf[65536];
    for (;;) {
        const ssize_t n = ::read(fd, buf, sizeof buf);
        if (n < 0 && errno == EINTR) continue;
        if (n <= 0) break;
        s.append(buf, static_cast<size_t>(n));
    }
    return s;
}

}  // namespace

ToolResult RunTool(const std::vector<std::string>& args, const std::string& input, const std::string& workingDir) {
    // A tool that does not read all of its standard input must not end the test with SIGPIPE.
    ::signal(SIGPIPE, SIG_IGN);
    int inPipe[2], outPipe[2], errPipe[2];
    if (::pipe(inPipe) || ::pipe(outPipe) || ::pipe(errPipe)) return {};
    const pid_t pid = ::fork();
    if (pid == 0) {
        ::signal(SIGPIPE, SIG_DFL);
        ::dup2(inPipe[0], 0);
        ::dup2(outPipe[1], 1);
        ::dup2(errPipe[1], 2);
        for (int fd : {inPipe[0], inPipe[1], outPipe[0], outPipe[1], errPipe[0], errPipe[1]}) ::close(fd);
        if (!workingDir.empty() && ::chdir(workingDir.c_str()) != 0) ::_exit(127);
        std::vector<char*> argv;
        std::string tool = OVMACRO_TOOL_PATH;
        argv.push_back(tool.data());
        std::vector<std::string> copy = args;
        for (auto& a : copy) argv.push_back(a.data());
        argv.push_back(nullptr);
        ::execv(tool.c_str(), argv.data());
        ::_exit(127);
    }
    ::close(inPipe[0]);
    ::close(outPipe[1]);
    ::close(errPipe[1]);
    // Feed standard input from a thread so that a large input cannot deadlock against full output pipes.
    std::thread feeder([&] {
        size_t done = 0;
        while (done < input.size()) {
            const ssize_t n = ::write(inPipe[1], input.data() + done, input.size() - done);
            if (n <= 0) break;
            done += static_cast<size_t>(n);
        }
        ::close(inPipe[1]);
    });
    ToolResult r;
    std::thread errReader([&] { r.err = ReadFd(errPipe[0]); });
    r.out = ReadFd(outPipe[0]);
    errReader.join();
    feeder.join();
    ::close(outPipe[0]);
    ::close(errPipe[0]);
    int status = 0;
    ::waitpid(pid, &status, 0);
    r.exitCode = WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
    return r;
}

TempDir::TempDir() {
    std::random_device rd;
    for (;;) {
        path_ = std::filesystem::temp_directory_path() / ("ovmacro-test-" + std::to_string(rd()));
        if (std::filesystem::create_directory(path_)) break;
    }
}

TempDir::~TempDir() {
    std::error_code ec;
    std::filesystem::remove_all(path_, ec);
}

std::string TempDir::Write(const std::string& relativePath, const std::string& content) const {
    const std::filesystem::path p = path_ / relativePath;
    std::filesystem::create_directories(p.parent_path());
    std::ofstream(p, std::ios::binary) << content;
    return p.string();
}

std::string ReadFile(const std::string& path) {
    std::ifstream in(path, std::ios::binary);
    std::stringstream ss;
    ss << in.rdbuf();
    return ss.str();
}

std::string MessageOf(const std::function<void()>& fn, const char*& position) {
    try {
        fn();
    } catch (const LexScannerException& e) {
        position = e.GetPosition();
        return e.GetMessage();
    }
    ADD_FAILURE() << "expected a LexScannerException";
    return "";
}

std::string MessageOf(const std::function<void()>& fn) {
    const char* ignored = nullptr;
    return MessageOf(fn, ignored);
}

int64 OffsetIn(const std::string& text, const char* p) {
    const auto begin = reinterpret_cast<std::uintptr_t>(text.data());
    const auto pos = reinterpret_cast<std::uintptr_t>(p);
    if (!p || pos < begin || pos > begin + text.size()) return -1;
    return static_cast<int64>(pos - begin);
}

std::string LineColumn(const std::string& text, const char* p) {
    const int64 offset = OffsetIn(text, p);
    if (offset < 0) return "-";
    const size_t lineStart = text.rfind('\n', offset == 0 ? 0 : static_cast<size_t>(offset) - 1);
    const size_t column = lineStart == std::string::npos || offset == 0 ? static_cast<size_t>(offset) + 1
                                                                          : static_cast<size_t>(offset) - lineStart;
    const auto line = std::count(text.begin(), text.begin() + offset, '\n') + 1;
    return std::to_string(line) + ":" + std::to_string(column);
}

std::string ErrorIn(const std::string& text, const std::function<void()>& fn) {
    const char* position = nullptr;
    const std::string message = MessageOf(fn, position);
    return LineColumn(text, position) + " " + message;
}

std::string ExpandIn(VarFrame& frame, const std::string& text, ImportHandler* handler) {
    std::string out;
    MacroExpand(handler, &frame, BasicSubString(text), 0, 0, out);
    return out;
}

std::string ExpandText(const std::string& text, ImportHandler* handler) {
    FileScopeVarFrame frame;
    return ExpandIn(frame, text, handler);
}

std::string ExpansionError(const std::string& text) {
    return ErrorIn(text, [&] { ExpandText(text); });
}

int64 OffsetOf(const std::string& text, const char* marker, bool last) {
    if (std::string(marker) == kAtEnd) return static_cast<int64>(text.size());
    const size_t at = last ? text.rfind(marker) : text.find(marker);
    return static_cast<int64>(at);
}

void ExpectErrorAt(const std::string& text, const std::string& message, const char* at, bool last) {
    const char* position = nullptr;
    EXPECT_EQ(MessageOf([&] { ExpandText(text); }, position), message);
    EXPECT_EQ(OffsetIn(text, position), OffsetOf(text, at, last));
}

void RunOnStackOf(size_t bytes, const std::function<void()>& fn) {
    pthread_attr_t attr;
    ASSERT_EQ(pthread_attr_init(&attr), 0);
    ASSERT_EQ(pthread_attr_setstacksize(&attr, bytes), 0);
    pthread_t thread;
    const auto body = [](void* arg) -> void* {
        (*static_cast<const std::function<void()>*>(arg))();
        return nullptr;
    };
    ASSERT_EQ(pthread_create(&thread, &attr, body, const_cast<std::function<void()>*>(&fn)), 0);
    pthread_attr_destroy(&attr);
    ASSERT_EQ(pthread_join(thread, nullptr), 0);
}

}  // namespace orvan::testing

#include "support/test_support.h"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <pthread.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <fstream>
#include <random>
#include <sstream>

#include "ovmacro/expander/macro_expander.h"

extern char** environ;

namespace orvan::testing {

ToolResult RunTool(const std::vector<std::string>& args, const std::string& input, const std::string& workingDir) {
    return RunTool(args, input, workingDir, {}, nullptr);
}

ToolResult RunTool(const std::vector<std::string>& args, const std::string& input, const std::string& workingDir,
                   const std::vector<std::string>& prefix, const std::function<void(int pid)>& whileRunning) {
    // Standard input and the two outputs are files, so that no pipe can fill up and block either side.
    const TempDir io;
    const std::string in = io.Write("in", input), out = (io.path() / "out").string(),
                      err = (io.path() / "err").string();
    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_addopen(&actions, 0, in.c_str(), O_RDONLY, 0);
    posix_spawn_file_actions_addopen(&actions, 1, out.c_str(), O_WRONLY | O_CREAT, 0600);
    posix_spawn_file_actions_addopen(&actions, 2, err.c_str(), O_WRONLY | O_CREAT, 0600);
    if (!workingDir.empty()) posix_spawn_file_actions_addchdir_np(&actions, workingDir.c_str());
    std::vector<std::string> words = prefix;
    words.push_back(OVMACRO_TOOL_PATH);
    words.insert(words.end(), args.begin(), args.end());
    std::vector<char*> argv;
    for (std::string& w : words) argv.push_back(w.data());
    argv.push_back(nullptr);
    pid_t pid = 0;
    ToolResult r;
    if (posix_spawnp(&pid, argv[0], &actions, nullptr, argv.data(), environ) == 0) {
        if (whileRunning) whileRunning(pid);
        int status = 0;
        ::waitpid(pid, &status, 0);
        r.exitCode = WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
        r.out = ReadFile(out);
        r.err = ReadFile(err);
    }
    posix_spawn_file_actions_destroy(&actions);
    return r;
}

TempDir::TempDir() {
    std::random_device random;
    do path_ = std::filesystem::temp_directory_path() / ("ovmacro-test-" + std::to_string(random()));
    while (!std::filesystem::create_directory(path_));
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

int64 OffsetIn(std::string_view text, const char* p) {
    const std::less_equal<const char*> le;
    if (!p || !le(text.data(), p) || !le(p, text.data() + text.size())) return -1;
    return p - text.data();
}

std::string LineColumn(std::string_view text, const char* p) {
    const int64 offset = OffsetIn(text, p);
    if (offset < 0) return "-";
    const std::string_view before = text.substr(0, static_cast<size_t>(offset));
    const size_t lineStart = before.rfind('\n') + 1;  // 0 on the first line
    return std::to_string(std::count(before.begin(), before.end(), '\n') + 1) + ":" +
           std::to_string(before.size() - lineStart + 1);
}

std::string ErrorIn(std::string_view text, const std::function<void()>& fn) {
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

// Staging and committing ovmacro's output files.
#include "output_files.h"

#include <fcntl.h>
#include <limits.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <csignal>
#include <cstring>
#include <random>

namespace ovmacro_tool {

namespace {

// Named temporary files that a signal ending the run must remove (async-signal-safe: fixed slots, unlink).
constexpr int kTempSlots = 8;
char g_tempNames[kTempSlots][PATH_MAX];
volatile sig_atomic_t g_tempInUse[kTempSlots];

extern "C" void RemoveTempFilesAndDie(int signal) {
    for (int i = 0; i < kTempSlots; ++i)
        if (g_tempInUse[i]) ::unlink(g_tempNames[i]);
    std::signal(signal, SIG_DFL);
    std::raise(signal);
}

void RegisterTempName(const std::string& name) {
    static const bool installed = [] {
        for (int s : {SIGINT, SIGTERM, SIGHUP, SIGQUIT}) std::signal(s, RemoveTempFilesAndDie);
        return true;
    }();
    (void)installed;
    for (int i = 0; i < kTempSlots; ++i) {
        if (g_tempInUse[i] || name.size() >= PATH_MAX) continue;
        std::memcpy(g_tempNames[i], name.c_str(), name.size() + 1);
        g_tempInUse[i] = 1;
        return;
    }
}

extern "C" void EndRunOnShrunkInput(int signal, siginfo_t* info, void*) {
    if (info->si_code != BUS_ADRERR) {  // not a page beyond a file's end: the fault it is
        std::signal(signal, SIG_DFL);
        return;
    }
    for (int i = 0; i < kTempSlots; ++i)
        if (g_tempInUse[i]) ::unlink(g_tempNames[i]);
    static const char kMessage[] = "ovmacro: an input file was shortened while it was read; nothing was written\n";
    (void)!::write(2, kMessage, sizeof kMessage - 1);
    ::_exit(1);
}

void ForgetTempName(const std::string& name) {
    for (int i = 0; i < kTempSlots; ++i)
        if (g_tempInUse[i] && name == g_tempNames[i]) g_tempInUse[i] = 0;
}

std::string FolderOf(const std::string& path) {
    const size_t slash = path.rfind('/');
    if (slash == std::string::npos) return ".";
    return slash == 0 ? "/" : path.substr(0, slash);
}

// A name in `folder` that no file has: short, so that it fits wherever the output's own name fits.
std::string TempNameIn(const std::string& folder) {
    static std::mt19937_64 random(std::random_device{}() ^ static_cast<unsigned>(::getpid()));
    char suffix[17];
    std::snprintf(suffix, sizeof suffix, "%016llx", static_cast<unsigned long long>(random()));
    return folder + "/.ovmacro-" + suffix;
}

// Follows symlinks to the path that writing `path` must change; a name not taken stays as it is.
bool ResolveSymlinks(const std::string& path, std::string& target, std::string& error) {
    target = path;
    for (int hops = 0; hops < 40; ++hops) {
        struct stat st {};
        if (::lstat(target.c_str(), &st) != 0 || !S_ISLNK(st.st_mode)) return true;
        char link[PATH_MAX];
        const ssize_t n = ::readlink(target.c_str(), link, sizeof link);
        if (n < 0 || n == static_cast<ssize_t>(sizeof link)) {
            error = n < 0 ? std::strerror(errno) : "symbolic link too long";
            return false;
        }
        const std::string to(link, static_cast<size_t>(n));
        target = to.front() == '/' ? to : FolderOf(target) + "/" + to;
    }
    error = std::strerror(ELOOP);
    return false;
}

}  // namespace

bool IdentityOfExistingFile(const std::string& path, FileIdentity& id) {
    struct stat st {};
    if (::stat(path.c_str(), &st) != 0) return false;
    id = {st.st_dev, st.st_ino, ""};
    return true;
}

// Writes into a temporary file through a buffer of bounded size; the first failure is kept for Commit.
class OutputFiles::TempStream : public orvan::xostream {
public:
    explicit TempStream(int fd) : fd_(fd) { buffer_.reserve(kBufferSize); }
    ~TempStream() override = default;
    void flush() override {
        if (error_ == 0 && !OutputFiles::WriteAll(fd_, buffer_)) error_ = errno;
        buffer_.clear();
    }
    int error() const { return error_; }

protected:
    void DoWrite(const char* p, size_t n) override {
        if (buffer_.size() + n > kBufferSize) flush();
        if (n >= kBufferSize) {
            if (error_ == 0 && !OutputFiles::WriteAll(fd_, std::string_view(p, n))) error_ = errno;
        } else {
            buffer_.append(p, n);
        }
    }

private:
    static constexpr size_t kBufferSize = 256 * 1024;
    int fd_;
    int error_ = 0;
    std::string buffer_;
};

OutputFiles::OutputFiles() = default;

OutputFiles::~OutputFiles() {
    for (Output& out : outputs_) {
        if (out.fd > 2) ::close(out.fd);
        if (!out.tempName.empty()) {
            ::unlink(out.tempName.c_str());
            ForgetTempName(out.tempName);
        }
    }
}

bool OutputFiles::Add(const std::string& path, std::string& error) {
    Output out;
    out.path = path;
    if (path == "-") {
        out.mode = Mode::kDirect;
        out.fd = 1;
        out.identity.newName = "-";
        outputs_.push_back(std::move(out));
        return true;
    }
    if (!ResolveSymlinks(path, out.target, error)) return false;
    struct stat st {};
    if (::stat(out.target.c_str(), &st) == 0) {
        if (S_ISDIR(st.st_mode)) {
            error = std::strerror(EISDIR);
            return false;
        }
        out.mode = S_ISREG(st.st_mode) ? Mode::kReplace : Mode::kDirect;
        out.identity = {st.st_dev, st.st_ino, ""};
    } else {
        const size_t slash = out.target.rfind('/');
        const std::string name = slash == std::string::npos ? out.target : out.target.substr(slash + 1);
        if (::stat(FolderOf(out.target).c_str(), &st) == 0)
            out.identity = {st.st_dev, st.st_ino, name};
        else
            out.identity.newName = out.target;
    }
    outputs_.push_back(std::move(out));
    return true;
}

bool OutputFiles::WriteAll(int fd, std::string_view text) {
    while (!text.empty()) {
        const ssize_t n = ::write(fd, text.data(), text.size());
        if (n < 0 && errno == EINTR) continue;
        if (n <= 0) return false;
        text.remove_prefix(static_cast<size_t>(n));
    }
    return true;
}

bool OutputFiles::StageReplacement(Output& out, std::string& error) {
    const std::string folder = FolderOf(out.target);
    out.fd = ::open(folder.c_str(), O_TMPFILE | O_WRONLY | O_CLOEXEC, 0666);
    if (out.fd < 0 && (errno == EOPNOTSUPP || errno == EISDIR || errno == EINVAL)) {
        // No unnamed files here: a named one, removed again if a signal ends the run.
        for (int attempt = 0; attempt < 100 && out.fd < 0; ++attempt) {
            out.tempName = TempNameIn(folder);
            out.fd = ::open(out.tempName.c_str(), O_CREAT | O_EXCL | O_WRONLY | O_CLOEXEC, 0666);
            if (out.fd < 0 && errno != EEXIST) break;
        }
        if (out.fd >= 0) RegisterTempName(out.tempName); else out.tempName.clear();
    }
    const int reason = errno;  // read before stat, which may set it again
    struct stat st {};
    const bool exists = ::stat(out.target.c_str(), &st) == 0;
    if (out.fd < 0) {
        // A folder that may not be written, holding a file that may: the file is rewritten where it is.
        if (exists && (reason == EACCES || reason == EPERM || reason == EROFS)) {
            out.fd = ::open(out.target.c_str(), O_WRONLY | O_CLOEXEC);
            if (out.fd >= 0) {
                out.mode = Mode::kInPlace;
                return true;
            }
        }
        error = std::strerror(reason);
        return false;
    }
    if (exists) {
        // The new file takes the old one's owner (where the user may give it) and mode, setuid bits included.
        const bool ownerKept = ::fchown(out.fd, st.st_uid, st.st_gid) == 0;
        (void)ownerKept;
        ::fchmod(out.fd, st.st_mode & 07777);
    }
    if (!WriteAll(out.fd, out.text)) {
        error = std::strerror(errno);
        return false;
    }
    return true;
}

orvan::xostream* OutputFiles::StageStream(size_t index, std::string& error) {
    Output& out = outputs_[index];
    if (out.mode != Mode::kReplace) return nullptr;
    if (!StageReplacement(out, error)) {
        error = "cannot write " + out.path + ": " + error;
        return nullptr;
    }
    if (out.mode != Mode::kReplace) return nullptr;  // rewritten in place: staged whole instead
    out.stream = std::make_unique<TempStream>(out.fd);
    return out.stream.get();
}

bool OutputFiles::Stage(size_t index, std::string_view text, std::string& error) {
    Output& out = outputs_[index];
    out.text = text;
    if (out.mode != Mode::kReplace) return true;
    if (StageReplacement(out, error)) return true;
    error = "cannot write " + out.path + ": " + error;
    return false;
}

bool OutputFiles::Commit(std::string& error) {
    auto fail = [&](const Output& out, int reason) {
        error = "cannot write " + out.path + ": " + std::strerror(reason);
        return false;  // the destructor removes every temporary name
    };
    for (Output& out : outputs_) {
        if (!out.stream) continue;
        out.stream->flush();
        if (out.stream->error() != 0) return fail(out, out.stream->error());
    }
    // Unnamed temporary files get a name of their own, beside their target, first: a failure here replaces
    // nothing.
    for (Output& out : outputs_) {
        if (out.mode != Mode::kReplace || !out.tempName.empty()) continue;
        const std::string proc = "/proc/self/fd/" + std::to_string(out.fd);
        for (int attempt = 0; attempt < 100 && out.tempName.empty(); ++attempt) {
            std::string name = TempNameIn(FolderOf(out.target));
            RegisterTempName(name);
            if (::linkat(AT_FDCWD, proc.c_str(), AT_FDCWD, name.c_str(), AT_SYMLINK_FOLLOW) == 0 ||
                ::linkat(out.fd, "", AT_FDCWD, name.c_str(), AT_EMPTY_PATH) == 0) {
                out.tempName = std::move(name);
                break;
            }
            ForgetTempName(name);
            if (errno != EEXIST) return fail(out, errno);
        }
        if (out.tempName.empty()) return fail(out, EEXIST);
    }
    for (Output& out : outputs_) {
        if (out.mode == Mode::kDirect && out.fd < 0) {
            out.fd = ::open(out.target.c_str(), O_WRONLY | O_CLOEXEC);
            if (out.fd < 0) return fail(out, errno);
        }
        if (out.mode == Mode::kInPlace && ::ftruncate(out.fd, 0) != 0) return fail(out, errno);
        if (out.mode != Mode::kReplace && !WriteAll(out.fd, out.text)) return fail(out, errno);
    }
    for (Output& out : outputs_) {
        if (out.mode != Mode::kReplace) continue;
        if (::rename(out.tempName.c_str(), out.target.c_str()) != 0) return fail(out, errno);
        ForgetTempName(out.tempName);
        out.tempName.clear();
    }
    return true;
}

void EndRunWhenAMappedInputShrinks() {
    struct sigaction action {};
    action.sa_sigaction = EndRunOnShrunkInput;
    action.sa_flags = SA_SIGINFO;
    sigemptyset(&action.sa_mask);
    ::sigaction(SIGBUS, &action, nullptr);
}

}  // namespace ovmacro_tool

#include "ovmacro/foundations/files.h"

#include "ovmacro/foundations/large_buffers.h"

#include <cerrno>
#include <cstring>
#include <utility>

#include <fcntl.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

namespace orvan {

namespace {

bool ReadAll(int fd, basic_xstring& text, basic_xstring* error) {
    char buf[1 << 16];
    for (;;) {
        const ssize_t n = ::read(fd, buf, sizeof buf);
        if (n == 0) return true;
        if (n < 0) {
            if (errno == EINTR) continue;
            if (error) *error = std::strerror(errno);
            return false;
        }
        text.append(buf, static_cast<size_t>(n));
    }
}

}  // namespace

void ConvertCrLfToLf(basic_xstring& text) {
    const size_t first = text.find("\r\n");
    if (first == basic_xstring::npos) return;
    size_t out = first;
    for (size_t in = first; in < text.size(); ++in) {
        if (text[in] == '\r' && in + 1 < text.size() && text[in + 1] == '\n') continue;
        text[out++] = text[in];
    }
    text.resize(out);
}

bool ReadStringFromFile(const basic_xstring& path, basic_xstring& out, bool textMode, basic_xstring* error) {
    // Opened without blocking, so that a FIFO or a device is refused below instead of waiting for a writer.
    const int fd = ::open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK);
    if (fd < 0) {
        if (error) *error = std::strerror(errno);
        return false;
    }
    struct stat st {};
    if (::fstat(fd, &st) != 0 || !S_ISREG(st.st_mode)) {
        if (error) *error = S_ISDIR(st.st_mode) ? "Is a directory" : "Not a regular file";
        ::close(fd);
        return false;
    }
    ::fcntl(fd, F_SETFL, ::fcntl(fd, F_GETFL) & ~O_NONBLOCK);
    basic_xstring text;
    text.reserve(static_cast<size_t>(st.st_size));
    AdviseLargeBuffer(text.data(), text.capacity());
    const bool ok = ReadAll(fd, text, error);
    ::close(fd);
    if (!ok) return false;
    if (textMode) ConvertCrLfToLf(text);
    out.swap(text);
    return true;
}

MappedFile& MappedFile::operator=(MappedFile&& other) noexcept {
    if (this != &other) {
        this->~MappedFile();
        data_ = std::exchange(other.data_, nullptr);
        size_ = other.size_;
    }
    return *this;
}

MappedFile::~MappedFile() {
    if (data_) ::munmap(const_cast<char*>(data_), size_);
}

bool MappedFile::MapTextFile(const basic_xstring& path, int64 minSize, MappedFile& out) {
    const int fd = ::open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK);
    if (fd < 0) return false;
    struct stat st {};
    void* p = MAP_FAILED;
    if (::fstat(fd, &st) == 0 && S_ISREG(st.st_mode) && st.st_size >= minSize && st.st_size > 0)
        p = ::mmap(nullptr, static_cast<size_t>(st.st_size), PROT_READ, MAP_PRIVATE | MAP_POPULATE, fd, 0);
    ::close(fd);
    if (p == MAP_FAILED) return false;
    MappedFile mapped;
    mapped.data_ = static_cast<const char*>(p);
    mapped.size_ = static_cast<size_t>(st.st_size);
    // A CR LF must become LF, which a mapping cannot do: such a file is read instead.
    for (const char* cr = mapped.data_; (cr = static_cast<const char*>(
                                             std::memchr(cr, '\r', mapped.size_ - static_cast<size_t>(cr - mapped.data_))));
         ++cr)
        if (cr + 1 < mapped.data_ + mapped.size_ && cr[1] == '\n') return false;
    out = std::move(mapped);
    return true;
}

bool ReadStringFromStdin(basic_xstring& out, bool textMode, basic_xstring* error) {
    basic_xstring text;
    if (!ReadAll(0, text, error)) return false;
    if (textMode) ConvertCrLfToLf(text);
    out.swap(text);
    return true;
}

}  // namespace orvan

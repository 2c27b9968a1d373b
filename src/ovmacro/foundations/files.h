// Reading whole files.
#pragma once

#include "ovmacro/foundations/sub_string.h"
#include "ovmacro/foundations/types.h"

namespace orvan {

// Reads the whole regular file `path` into `out`. In text mode each CR LF becomes LF (a lone CR stays).
// False, with `out` unchanged, when the file cannot be opened or read or is not a regular file; `error` then
// says why (for example "No such file or directory" or "Is a directory").
bool ReadStringFromFile(const basic_xstring& path, basic_xstring& out, bool textMode, basic_xstring* error = nullptr);
// Reads all of a stream (standard input) the same way.
bool ReadStringFromStdin(basic_xstring& out, bool textMode, basic_xstring* error = nullptr);
// Drops the CR of every CR LF pair, in place.
void ConvertCrLfToLf(basic_xstring& text);

// A file mapped into memory, read only, and unmapped when destroyed: a large text read without a copy.
// Moved, never copied.
class MappedFile {
public:
    MappedFile() = default;
    MappedFile(MappedFile&& other) noexcept : data_(other.data_), size_(other.size_) { other.data_ = nullptr; }
    MappedFile& operator=(MappedFile&& other) noexcept;
    MappedFile(const MappedFile&) = delete;
    MappedFile& operator=(const MappedFile&) = delete;
    ~MappedFile();

    // Maps the regular file `path` when it has at least minSize bytes and no CR LF, so that it reads as in
    // text mode; false, leaving `out` alone, otherwise (the caller then reads the file).
    static bool MapTextFile(const basic_xstring& path, int64 minSize, MappedFile& out);
    explicit operator bool() const { return data_ != nullptr; }
    BasicSubString view() const { return BasicSubString(data_, data_ + size_); }

private:
    const char* data_ = nullptr;
    size_t size_ = 0;
};

}  // namespace orvan

// Records of loaded source files, and the lookups that turn an error position into a file name and a line.
//
// Every error position is a pointer into some text held in memory. The lists below own the texts of the
// files a host loaded, answer which file's text contains a position and at which line, and write the
// one-line error report "\nFILE(LINE) : MESSAGE\n".
//
//     MpfwSourceFileList files;
//     files.AddSrcFile(file);                  // the list owns the record from now on
//     files.WriteLexScannerError(xcerr(), e);  // "\na.txt(12) : Too many arguments provided for macro f\n"
//
// Two families: LSSourceFile is a plain file name and text, for hosts that expand texts themselves;
// MpfwSourceFile also keeps the expanded text and the output pieces that map it back to the sources.
// Texts must not be changed or moved while any view of them (a variable name, a piece, a position) is alive.
#pragma once

#include <memory>
#include <utility>

#include "ovmacro/foundations/files.h"
#include "ovmacro/foundations/stream.h"
#include "ovmacro/foundations/sub_string.h"
#include "ovmacro/foundations/types.h"
#include "ovmacro/lexer/exceptions.h"
#include "ovmacro/output/output_pieces.h"

namespace orvan {

// True when pos lies in [first character of s, one past its last character): the end itself is not inside.
bool StringContainsPos(const basic_xstring& s, const char* pos);

class LSSourceFile {
public:
    LSSourceFile() = default;
    LSSourceFile(basic_xstring fileName, basic_xstring text)
        : fileName(std::move(fileName)), text(std::move(text)) {}

    // The file's name and the line (from 1) of pos when pos lies in text; the position one past the last
    // character counts as the last line, so that an error at the end of the text gets a line. False, with
    // both outputs untouched, otherwise.
    bool GetFilenameAndLineNumber(const char* pos, basic_xstring& fileName, int64& line) const;

    basic_xstring fileName;
    basic_xstring text;
};

// The only owner of its records: moved or swapped, never copied.
class LSSourceFileList {
public:
    LSSourceFileList() = default;
    LSSourceFileList(LSSourceFileList&&) noexcept = default;
    LSSourceFileList& operator=(LSSourceFileList&&) noexcept = default;
    LSSourceFileList(const LSSourceFileList&) = delete;
    LSSourceFileList& operator=(const LSSourceFileList&) = delete;

    // Appends; the list takes ownership.
    void Add(LSSourceFile* f) { files_.emplace_back(f); }
    int64 size() const { return static_cast<int64>(files_.size()); }
    LSSourceFile* operator[](int64 i) const { return files_[static_cast<size_t>(i)].get(); }
    void clear() { files_.clear(); }
    void swap(LSSourceFileList& o) noexcept { files_.swap(o.files_); }

    // The first file, in the order added, whose text holds pos.
    bool GetFilenameAndLineNumber(const char* pos, basic_xstring& fileName, int64& line) const;

private:
    xvector<std::unique_ptr<LSSourceFile>> files_;
};

// A file of the project description parser: its source text, the text that its expansion produced, and the
// pieces that map each character of the expansion back to an address in some loaded text.
class MpfwSourceFile {
public:
    MpfwSourceFile() = default;
    MpfwSourceFile(const MpfwSourceFile&) = delete;
    MpfwSourceFile& operator=(const MpfwSourceFile&) = delete;
    virtual ~MpfwSourceFile();

    // The source text: `text`, or the mapped file when the parser mapped a large file instead of reading it.
    BasicSubString Text() const { return mapped ? mapped.view() : BasicSubString(text); }
    // As LSSourceFile's, over the source text (not the expanded text).
    bool GetFilenameAndLineNumber(const char* pos, basic_xstring& fileName, int64& line) const;
    // Moves e's position from expandedText back to the source address that produced that character; a
    // position elsewhere (or null) is left alone.
    void AdjustErrorPosition(LexScannerException& e) const;

    basic_xstring fileName;
    basic_xstring text;          // as read, followed by any text the host appended; empty when mapped
    MappedFile mapped;           // a large file mapped rather than read (MpfwParser::SetMapLargeFiles)
    basic_xstring expandedText;  // the expansion of text
    OutputPieces pieces;         // recorded while expandedText was produced
};

// The files loaded by one project description parser, in load order. The only owner of its records: moved
// or swapped, never copied.
class MpfwSourceFileList {
public:
    MpfwSourceFileList() = default;
    MpfwSourceFileList(MpfwSourceFileList&&) noexcept = default;
    MpfwSourceFileList& operator=(MpfwSourceFileList&&) noexcept = default;
    MpfwSourceFileList(const MpfwSourceFileList&) = delete;
    MpfwSourceFileList& operator=(const MpfwSourceFileList&) = delete;

    // Appends; the list takes ownership.
    void AddSrcFile(MpfwSourceFile* f) { files_.emplace_back(f); }
    int64 size() const { return static_cast<int64>(files_.size()); }
    bool empty() const { return files_.empty(); }
    MpfwSourceFile* operator[](int64 i) const { return files_[static_cast<size_t>(i)].get(); }
    void clear() { files_.clear(); }
    void swap(MpfwSourceFileList& o) noexcept { files_.swap(o.files_); }

    // The first file, in load order, whose name equals name ignoring ASCII case; null if none.
    MpfwSourceFile* FindSourceFile(const basic_xstring& name) const;
    // False for a null pos or an empty list; otherwise the first file, in load order, whose source text
    // holds pos (its end counting as its last line).
    bool GetFilenameAndLineNumber(const char* pos, basic_xstring& fileName, int64& line) const;
    // The index of the first file whose source text contains pos (its end excluded); -1 if none.
    int64 GetSrcFileIndexContainingPosition(const char* pos) const;
    // "\nFILE(LINE) : MESSAGE\n", or "\nMESSAGE\n" when the position lies in no loaded source text.
    void WriteLexScannerError(xostream& os, const LexScannerException& e) const;

private:
    xvector<std::unique_ptr<MpfwSourceFile>> files_;
};

// The files whose expansion runs on this thread, for the directives that name the file and line of a
// position (a Python traceback names the template's line): a host's loader opens one for each expansion.
class ExpandingFiles {
public:
    explicit ExpandingFiles(const MpfwSourceFileList& files);
    ~ExpandingFiles();
    ExpandingFiles(const ExpandingFiles&) = delete;
    ExpandingFiles& operator=(const ExpandingFiles&) = delete;
    // The file and line of pos in the innermost list of files being expanded; false outside any.
    static bool Locate(const char* pos, basic_xstring& fileName, int64& line);

private:
    const MpfwSourceFileList& files_;
    ExpandingFiles* outer_;
};

}  // namespace orvan

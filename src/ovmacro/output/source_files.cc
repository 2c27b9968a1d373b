// Source-file records: which loaded text holds a position, at which line, and the error report.
#include "ovmacro/output/source_files.h"

#include <functional>

#include "ovmacro/foundations/scanning.h"

namespace orvan {

namespace {

bool LineInText(BasicSubString text, const basic_xstring& name, const char* pos, basic_xstring& fileName,
                int64& line) {
    if (!pos) return false;
    const int64 n = GetLineNumber(text, pos);
    if (n < 0) return false;
    fileName = name;
    line = n;
    return true;
}

thread_local ExpandingFiles* t_expandingFiles = nullptr;

}  // namespace

ExpandingFiles::ExpandingFiles(const MpfwSourceFileList& files) : files_(files), outer_(t_expandingFiles) {
    t_expandingFiles = this;
}

ExpandingFiles::~ExpandingFiles() { t_expandingFiles = outer_; }

bool ExpandingFiles::Locate(const char* pos, basic_xstring& fileName, int64& line) {
    return t_expandingFiles && t_expandingFiles->files_.GetFilenameAndLineNumber(pos, fileName, line);
}

bool StringContainsPos(const basic_xstring& s, const char* pos) {
    // std::less gives a total order even for pointers into unrelated buffers.
    const std::less<const char*> lt;
    return pos && !lt(pos, s.data()) && lt(pos, s.data() + s.size());
}

bool LSSourceFile::GetFilenameAndLineNumber(const char* pos, basic_xstring& name, int64& line) const {
    return LineInText(BasicSubString(text), fileName, pos, name, line);
}

bool LSSourceFileList::GetFilenameAndLineNumber(const char* pos, basic_xstring& fileName, int64& line) const {
    if (!pos) return false;
    for (const auto& f : files_)
        if (f->GetFilenameAndLineNumber(pos, fileName, line)) return true;
    return false;
}

MpfwSourceFile::~MpfwSourceFile() = default;

bool MpfwSourceFile::GetFilenameAndLineNumber(const char* pos, basic_xstring& name, int64& line) const {
    return LineInText(Text(), fileName, pos, name, line);
}

void MpfwSourceFile::AdjustErrorPosition(LexScannerException& e) const {
    pieces.AdjustErrorPosition(e, BasicSubString(expandedText));
}

MpfwSourceFile* MpfwSourceFileList::FindSourceFile(const basic_xstring& name) const {
    for (const auto& f : files_)
        if (CaseInsensitiveCompare(f->fileName, name)) return f.get();
    return nullptr;
}

bool MpfwSourceFileList::GetFilenameAndLineNumber(const char* pos, basic_xstring& fileName,
                                                  int64& line) const {
    if (!pos) return false;
    for (const auto& f : files_)
        if (f->GetFilenameAndLineNumber(pos, fileName, line)) return true;
    return false;
}

int64 MpfwSourceFileList::GetSrcFileIndexContainingPosition(const char* pos) const {
    for (size_t i = 0; i < files_.size(); ++i)
        if (const BasicSubString t = files_[i]->Text(); pos && std::less_equal<const char*>()(t.begin(), pos) &&
                                                         std::less<const char*>()(pos, t.end()))
            return static_cast<int64>(i);
    return -1;
}

void MpfwSourceFileList::WriteLexScannerError(xostream& os, const LexScannerException& e) const {
    basic_xstring fileName;
    int64 line = 0;
    os << '\n';
    if (GetFilenameAndLineNumber(e.GetPosition(), fileName, line)) os << fileName << '(' << line << ") : ";
    os << e.GetMessage() << '\n';
}

}  // namespace orvan

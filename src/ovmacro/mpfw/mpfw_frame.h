// MpfwFrame: what all files loaded through one project description parser share.
//
// One list of loaded files (not owned), one file-scope frame in which every file is expanded and into which
// every dollar macro goes, and the import search directories given by @importpath.
#pragma once

#include "ovmacro/foundations/types.h"
#include "ovmacro/output/source_files.h"
#include "ovmacro/vars/var_frame.h"

namespace orvan {

class MpfwFrame {
public:
    // The list must outlive the frame: the names of the frame's variables are views into its texts.
    explicit MpfwFrame(MpfwSourceFileList& sourceFiles) : sourceFiles(sourceFiles) {}
    MpfwFrame(const MpfwFrame&) = delete;
    MpfwFrame& operator=(const MpfwFrame&) = delete;

    MpfwSourceFileList& sourceFiles;
    FileScopeVarFrame varFrame;
    xvector<basic_xstring> importPaths;  // normalised, in the order given
};

}  // namespace orvan

// A project description parser over the files of a test directory, recording what it is asked.
#pragma once

#include <filesystem>
#include <string>
#include <vector>

#include "ovmacro/mpfw/mpfw_parser.h"
#include "support/test_support.h"

namespace orvan::testing {

class DirHost : public MpfwParser {
public:
    DirHost(MpfwFrame& frame, const TempDir& dir) : MpfwParser(frame), dir_(dir.path().string()) {}

    // name is looked up in the directory; "missing..." names are never found.
    bool ResolveFile(const basic_xstring& name, basic_xstring& fullPath) override {
        resolved.push_back(name);
        const std::string path = Path(name);
        if (!std::filesystem::exists(path)) return false;
        fullPath = path;
        return true;
    }
    void OnImport(MpfwSourceFile* file) override { onImport.push_back(file); }

    std::string Path(const std::string& name) const { return dir_ + "/" + name; }
    using MpfwParser::GetFilesBeingExpanded;

    std::vector<std::string> resolved;
    std::vector<MpfwSourceFile*> onImport;

private:
    std::string dir_;
};

}  // namespace orvan::testing

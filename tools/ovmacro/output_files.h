// OutputFiles: how ovmacro writes OUT, the dependency file and the source map without ever destroying a file.
//
// Every output is staged before any is committed, and committed only when all were staged:
// - A regular file, or a name not yet taken, is written into an unnamed temporary file in its folder
//   (O_TMPFILE; where the file system lacks it, a uniquely named one that a caught signal removes). Commit
//   links each under a unique name and then renames all into place: a killed run leaves nothing behind,
//   concurrent runs each leave one whole file, and a failure before the renames replaces nothing. A replaced
//   file keeps its mode (and, when the user may, its owner); other hard links to it keep the old content.
// - A symlink is followed: the file it points to is the one replaced.
// - A file whose folder is not writable, but which is, is rewritten in place at commit.
// - A device, a FIFO, a socket or "-" (standard output) is written directly at commit, never replaced.
//
//     OutputFiles outputs;
//     if (!outputs.Add("out.h", error) || !outputs.Stage(0, text, error) || !outputs.Commit(error)) ...
#pragma once

#include <sys/types.h>

#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "ovmacro/foundations/stream.h"

namespace ovmacro_tool {

// What a path names on disk, so that two spellings of one file compare equal: the file's device and inode,
// or, for a name not yet taken, its folder's and its last component.
struct FileIdentity {
    dev_t device = 0;
    ino_t inode = 0;
    std::string newName;  // empty when the file exists
    bool operator==(const FileIdentity&) const = default;
};

// The identity of an existing file (symlinks followed); false when there is none.
bool IdentityOfExistingFile(const std::string& path, FileIdentity& id);

class OutputFiles {
public:
    OutputFiles();
    ~OutputFiles();
    OutputFiles(const OutputFiles&) = delete;
    OutputFiles& operator=(const OutputFiles&) = delete;

    // Registers an output; false with `error` when the path cannot name one (a directory, a missing folder,
    // a loop of symlinks). Outputs are numbered in the order added.
    bool Add(const std::string& path, std::string& error);
    const FileIdentity& Identity(size_t index) const { return outputs_[index].identity; }
    size_t size() const { return outputs_.size(); }

    // Writes the text of output `index` where it waits for the commit (a temporary file), or keeps it for a
    // direct or in-place write; false with `error` when that fails. `text` must outlive Commit.
    bool Stage(size_t index, std::string_view text, std::string& error);
    // A stream into the temporary file of output `index`, for a text written as it is made, through a bounded
    // buffer; null when the output is not replaced through a temporary file (a device, a file rewritten in
    // place), which must then be staged whole. A write that fails is reported by Commit.
    orvan::xostream* StageStream(size_t index, std::string& error);
    // Puts every staged output in place; false with `error` (naming the output) when one fails, in which case
    // no renamed output has been replaced.
    bool Commit(std::string& error);

private:
    enum class Mode { kReplace, kInPlace, kDirect };
    class TempStream;
    struct Output {
        std::string path;    // as given, for messages
        std::string target;  // symlinks resolved
        FileIdentity identity;
        Mode mode = Mode::kReplace;
        int fd = -1;
        std::string tempName;  // the temporary file's name once it has one
        std::string_view text;
        std::unique_ptr<TempStream> stream;
    };
    bool StageReplacement(Output& out, std::string& error);
    static bool WriteAll(int fd, std::string_view text);

    std::vector<Output> outputs_;
};

// A mapped input faults when another process shortens the file during the run. From this call on, such a
// fault ends the run with a message and exit status 1 instead of a crash: the temporary files are removed and
// nothing has been committed, since every output is committed after the inputs were read.
void EndRunWhenAMappedInputShrinks();

}  // namespace ovmacro_tool

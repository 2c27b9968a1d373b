// ImportHandler: how a host loads the files that a text imports.
//
// The expander never reads files itself: @import and @importpath hand a name or a directory to the handler
// that the host passed to MacroExpand. Only the top-level expansion of a file has one.
#pragma once

#include "ovmacro/foundations/types.h"

namespace orvan {

class VarFrame;

class ImportHandler {
public:
    ImportHandler() = default;
    ImportHandler(const ImportHandler&) = default;
    ImportHandler(ImportHandler&&) = default;
    ImportHandler& operator=(const ImportHandler&) = default;
    ImportHandler& operator=(ImportHandler&&) = default;

    // Adds a directory in which later imports are searched. The default refuses ("@importpath directive not
    // supported").
    virtual bool HandleImportPath(const basic_xstring& path, const char* position);
    // Loads the named file and makes its definitions visible in frame; false if it cannot be imported.
    virtual bool HandleImport(VarFrame* frame, const basic_xstring& fileName, const char* position) = 0;
    // Whether @import directives stay in the expansion (the default: a reader of the expanded text then meets
    // each import at its place), or vanish as a @def line does, with the blanks before them, the rest of
    // their line and the empty lines after it (for generated code, which must not carry them). @importpath
    // leaves no text either way; it then goes with its line too.
    virtual bool KeepsImportDirectives() const { return true; }

protected:
    // Not deleted through this interface: the expander only calls it.
    ~ImportHandler() = default;
};

}  // namespace orvan

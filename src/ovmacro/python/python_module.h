// The Python bridge module: the only code that links the Python runtime. The library loads it (dlopen) on the
// first use of Python, so that a process that never runs Python code never maps libpython; python_bridge.cc
// reaches it through this table.
#pragma once

#include "ovmacro/foundations/stream.h"
#include "ovmacro/foundations/types.h"

struct _object;

namespace orvan {

struct PythonModule {
    // Starts the interpreter unless it runs already; false with the reason in error if it is not usable.
    bool (*start)(basic_xstring& error);
    // Stops it; the next start is a fresh interpreter.
    void (*stop)();
    // As GetPythonError, ExecutePythonExpression and WritePythonObject.
    bool (*takeError)(basic_xstring& text);
    _object* (*evaluate)(const basic_xstring& expression, basic_xstring& error);
    void (*write)(xostream& os, _object* object, const char* position);
    // Compiles and runs code in __main__ (the interpreter runs); raises the errors at position.
    void (*run)(const basic_xstring& fileName, const basic_xstring& code, const char* position);
    void (*release)(_object* object);
};

// The module's only exported symbol: its table.
extern "C" const PythonModule* ovmacro_python_module();
inline constexpr const char* kPythonModuleFile = "libovMacroExpander-python.so";

}  // namespace orvan

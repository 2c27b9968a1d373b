// The embedded Python interpreter: start-up on first use, running statements and evaluating expressions in
// the shared `__main__` namespace, reading Python's error text, writing Python values as text, shut-down.
//
// One interpreter serves the whole process. It starts with the first @runpython block or Python macro and
// lives until UninitPython; the bridge module that links the Python runtime (libovMacroExpander-python.so,
// beside the library, or the file OVMACRO_PYTHON_MODULE names) is loaded then, so that a process that runs no
// Python never loads it, and a machine without Python fails only the Python directives; names defined in `__main__` persist for that whole time. Python's sys.stdout goes
// to xcout() and sys.stderr to xcerr(); the text of an error goes into s_errorString. The calls that would end
// the process (os._exit, os.abort, the os.exec family, signals to the process itself) raise an error instead.
// All calls must come from one thread at a time.
//
//     basic_xstring value;
//     RunPython("", "x = 6*7\n", position);
//     EvalPythonExpression("x", value, position);  // value == "42"
//
// This header deliberately does not include Python.h: `_object` is Python's PyObject.
#pragma once

#include "ovmacro/foundations/stream.h"
#include "ovmacro/foundations/types.h"

struct _object;

namespace orvan {

// The text of the Python error being read; GetPythonError empties it.
extern StringStream s_errorString;

// Owns one reference to a Python object and releases it when destroyed, which must happen before
// UninitPython.
class PyObjectRef {
public:
    explicit PyObjectRef(_object* object) : object_(object) {}
    PyObjectRef(PyObjectRef&& other) noexcept : object_(other.object_) { other.object_ = nullptr; }
    PyObjectRef(const PyObjectRef&) = delete;
    PyObjectRef& operator=(const PyObjectRef&) = delete;
    PyObjectRef& operator=(PyObjectRef&&) = delete;
    ~PyObjectRef();

    explicit operator bool() const { return object_ != nullptr; }
    _object* Get() const { return object_; }

private:
    _object* object_;
};

// A host may refuse embedded Python code for the whole process (allowed by default). While it is off, no
// interpreter is started and every Python directive or Python macro fails.
void SetPythonAllowed(bool allowed);
bool IsPythonAllowed();
// Where to look for the bridge module when it is neither beside the library nor in ../lib beside a program
// that links the library in (a program run from its build tree).
void SetPythonModuleFallback(const basic_xstring& path);

// Starts the interpreter unless it runs already; false with the reason in error if it is not usable.
bool InitPython(basic_xstring& error);
// InitPython for a directive: raises "Python initialisation error: ..." at position on failure.
void InitPythonFromParser(const char* position);
// Stops the interpreter; the next use starts a fresh one. Does nothing when none runs.
void UninitPython();

// If a Python error is pending: its printed traceback into text, the error cleared, true. Otherwise text is
// cleared and the result is false.
bool GetPythonError(basic_xstring& text);
// Evaluates an expression in `__main__`: a new reference the caller owns, or null with Python's error text.
_object* ExecutePythonExpression(const basic_xstring& expression, basic_xstring& error);
// Evaluates an expression (starting the interpreter if needed) and gives its value as text.
void EvalPythonExpression(const basic_xstring& expression, basic_xstring& result, const char* position);
// Compiles and runs statements in `__main__` (starting the interpreter if needed).
void RunPython(const basic_xstring& fileName, const basic_xstring& code, const char* position);
// Writes an int, float, str or list (of such values) as text; other types raise at position.
void WritePythonObject(xostream& os, _object* object, const char* position);

}  // namespace orvan

// The Python bridge module (see python_module.h): start-up, stream redirection, running code, value
// conversion, shut-down of the embedded interpreter.
//
// This is the only file that includes Python.h; the rest of the library sees Python objects as `_object*`.

// Python.h must come before any standard header (it sets feature macros); the sized "s#" format needs
// Py_ssize_t lengths.
// clang-format off
#define PY_SSIZE_T_CLEAN
#include <Python.h>
// clang-format on

#include "ovmacro/python/python_bridge.h"
#include "ovmacro/python/python_module.h"

#include <cstdint>
#include <cstring>

#include "ovmacro/lexer/exceptions.h"

namespace orvan {

namespace {

// Owns one reference (the bridge module's own; Owned belongs to the library).
class Owned {
public:
    explicit Owned(PyObject* object) : object_(object) {}
    ~Owned() { Py_XDECREF(object_); }
    Owned(const Owned&) = delete;
    Owned& operator=(const Owned&) = delete;
    explicit operator bool() const { return object_ != nullptr; }
    PyObject* Get() const { return object_; }

private:
    PyObject* object_;
};

bool TakeError(basic_xstring& text);
PyObject* WriteToStdOut(PyObject* self, PyObject* args);
PyObject* WriteToStdErr(PyObject* self, PyObject* args);
PyObject* WriteToErrorText(PyObject* self, PyObject* args);
PyObject* PyInit_stream_hooks();

// An initialisation has been attempted and not undone by a stop.
bool s_pythonInitialised = false;
// The `__main__` module and its dictionary (borrowed); both null unless the interpreter is usable.
PyObject* s_mainModule = nullptr;
PyObject* s_mainDict = nullptr;
// Why the last start-up failed. A failed start is not retried until a stop, so later calls report it.
basic_xstring s_initError;

constexpr const char* kModuleName = "stream_hooks";

// Python 3's print() calls flush() when asked to, and shut-down flushes sys.stdout and sys.stderr, so the
// replacement streams need one. What a block writes to sys.stdout and sys.stderr reaches the host's standard
// output and standard error; the text of an error goes into s_errorString through a stream of its own (see
// TakeError). The calls that would end the host process from a block raise an error instead.
constexpr const char* kBootstrap =
    "import sys, os, posix, signal\n"
    "import stream_hooks\n"
    "class myStdOut:\n"
    "  def write(self,string):\n"
    "    stream_hooks.WriteToStdOut(string);\n"
    "  def flush(self): pass\n"
    "class myStdErr:\n"
    "  def write(self,string):\n"
    "    stream_hooks.WriteToStdErr(string);\n"
    "  def flush(self): pass\n"
    "class myErrorText:\n"
    "  def write(self,string):\n"
    "    stream_hooks.WriteToErrorText(string);\n"
    "  def flush(self): pass\n"
    "sys.stdout = myStdOut()\n"
    "sys.stderr = myStdErr()\n"
    "stream_hooks.error_text = myErrorText()\n"
    "def _orvan_refuse(name):\n"
    "  def refused(*args, **kwargs):\n"
    "    raise RuntimeError(name + '() would end the process that expands this text')\n"
    "  return refused\n"
    "for _m in (os, posix):\n"
    "  for _n in ('_exit', 'abort', 'execv', 'execve', 'execl', 'execle', 'execlp', 'execlpe', 'execvp',\n"
    "             'execvpe', 'fexecve'):\n"
    "    if hasattr(_m, _n): setattr(_m, _n, _orvan_refuse(_m.__name__ + '.' + _n))\n"
    "def _orvan_signals(kill, killpg):\n"
    "  def own(pid): return pid in (0, -1, os.getpid()) or -pid == os.getpgrp()\n"
    "  def safe_kill(pid, sig):\n"
    "    if own(pid) and sig != 0: raise RuntimeError('os.kill() would end the process that expands this text')\n"
    "    return kill(pid, sig)\n"
    "  def safe_killpg(pgid, sig):\n"
    "    if pgid in (0, os.getpgrp()) and sig != 0:\n"
    "      raise RuntimeError('os.killpg() would end the process that expands this text')\n"
    "    return killpg(pgid, sig)\n"
    "  return safe_kill, safe_killpg\n"
    "os.kill, os.killpg = _orvan_signals(os.kill, os.killpg)\n"
    "posix.kill, posix.killpg = os.kill, os.killpg\n"
    "for _n in ('raise_signal', 'pthread_kill'):\n"
    "  if hasattr(signal, _n): setattr(signal, _n, _orvan_refuse('signal.' + _n))\n"
    "del _m, _n, _orvan_refuse, _orvan_signals\n"
    // A traceback shows the code that ran, at the template lines it was compiled for, whatever the file on
    // disk holds; the lines of every block compiled under one name are kept.
    "import linecache\n"
    "def _orvan_register_lines(name, text):\n"
    "  entry = linecache.cache.get(name)\n"
    "  lines = list(entry[2]) if entry and len(entry) == 4 else []\n"
    "  new = text.splitlines(True)\n"
    "  lines += ['\\n'] * (len(new) - len(lines))\n"
    "  for i, line in enumerate(new):\n"
    "    if line.strip(): lines[i] = line\n"
    "  linecache.cache[name] = (sum(map(len, lines)), None, lines, name)\n"
    "stream_hooks.register_lines = _orvan_register_lines\n"
    "import traceback\n"
    "def _orvan_print_error(etype, value, tb):\n"
    "  traceback.print_exception(etype, value, tb, file=stream_hooks.error_text)\n"
    "stream_hooks.print_error = _orvan_print_error\n"
    "del _orvan_register_lines, _orvan_print_error\n";

// The C API takes zero-terminated code, so a zero byte would silently cut the code short.
constexpr const char* kZeroByteInCode = "source code string cannot contain null bytes";
constexpr const char* kNotRunning = "the Python interpreter is not running";

// Guards against lists that contain themselves and against nesting that would exhaust the C++ stack.
constexpr size_t kMaxListDepth = 1000;

PyMethodDef s_streamHooksMethods[] = {
    {"WriteToStdOut", WriteToStdOut, METH_VARARGS, "Write to stdout"},
    {"WriteToStdErr", WriteToStdErr, METH_VARARGS, "Write to stderr"},
    {"WriteToErrorText", WriteToErrorText, METH_VARARGS, "Write to the text of the error being reported"},
    {nullptr, nullptr, 0, nullptr},
};

PyModuleDef s_streamHooksModule = {
    PyModuleDef_HEAD_INIT, kModuleName, nullptr, -1, s_streamHooksMethods, nullptr, nullptr, nullptr, nullptr,
};

[[noreturn]] void Raise(const char* prefix, std::string_view detail, const char* position) {
    StringStream message(4096);
    message << prefix << detail;
    throw LexScannerException(message.GetString(), position);
}

bool ContainsZeroByte(const basic_xstring& code) {
    return code.find('\0') != basic_xstring::npos;
}

// The inittab persists across restarts in some Python versions and is reset in others; adding the module
// only when it is missing keeps a restart from failing or listing it twice.
bool IsStreamHooksRegistered() {
    for (const _inittab* entry = PyImport_Inittab; entry != nullptr && entry->name != nullptr; ++entry)
        if (std::strcmp(entry->name, kModuleName) == 0) return true;
    return false;
}

// Starts the interpreter and runs the bootstrap; an empty result on success, else the reason.
basic_xstring StartInterpreter() {
    if (!IsStreamHooksRegistered() && PyImport_AppendInittab(kModuleName, PyInit_stream_hooks) == -1)
        return "PyImport_AppendInittab failed";
    // Without signal handlers: the host keeps its own handling of SIGINT and friends.
    Py_InitializeEx(0);
    PyObject* mainModule = PyImport_AddModule("__main__");
    if (mainModule == nullptr) return "PyImport_AddModule failed for the __main__ module";
    PyObject* mainDict = PyModule_GetDict(mainModule);
    if (PyDict_GetItemString(mainDict, "__builtins__") == nullptr)
        return "__main__ module is missing __builtins__";
    // Compiled under a name of its own, which a traceback through a refused call shows.
    Owned bootstrap(Py_CompileString(kBootstrap, "<ovmacro>", Py_file_input));
    Owned ran(bootstrap ? PyEval_EvalCode(bootstrap.Get(), mainDict, mainDict) : nullptr);
    if (!ran) {
        PyErr_Clear();
        return "the bridge's bootstrap code failed";
    }
    s_mainModule = mainModule;
    s_mainDict = mainDict;
    return {};
}

// Python's error for a failed conversion, as the detail of a conversion error.
[[noreturn]] void RaiseConversionFailure(PyObject* object, const char* position) {
    basic_xstring pythonError;
    TakeError(pythonError);
    PyErr_Clear();
    StringStream message(4096);
    message << "Can't convert python result of type " << Py_TYPE(object)->tp_name << " : " << pythonError;
    throw LexScannerException(message.GetString(), position);
}

// Writes an int too large for 64 bits in decimal. The digits are derived from its hexadecimal form, which
// Python produces for any size, whereas str() refuses very long ints.
void WriteBigInt(xostream& os, PyObject* object, const char* position) {
    Owned hex(PyNumber_ToBase(object, 16));
    Py_ssize_t size = 0;
    const char* text = hex ? PyUnicode_AsUTF8AndSize(hex.Get(), &size) : nullptr;
    if (text == nullptr) RaiseConversionFailure(object, position);
    std::string_view digits(text, static_cast<size_t>(size));
    const bool negative = !digits.empty() && digits.front() == '-';
    if (negative) digits.remove_prefix(1);
    if (digits.size() >= 2 && digits[0] == '0' && (digits[1] == 'x' || digits[1] == 'X'))
        digits.remove_prefix(2);

    // Base 2^32 limbs, least significant first, eight hex digits each.
    xvector<std::uint32_t> limbs;
    for (size_t end = digits.size(); end > 0;) {
        const size_t begin = end >= 8 ? end - 8 : 0;
        std::uint32_t limb = 0;
        for (size_t i = begin; i < end; ++i) {
            const char c = digits[i];
            const std::uint32_t d = c <= '9' ? static_cast<std::uint32_t>(c - '0')
                                             : static_cast<std::uint32_t>((c | 0x20) - 'a' + 10);
            limb = (limb << 4) | d;
        }
        limbs.push_back(limb);
        end = begin;
    }
    while (!limbs.empty() && limbs.back() == 0) limbs.pop_back();

    // Repeated division by 10^9 gives base 10^9 chunks, least significant first.
    constexpr std::uint64_t kChunk = 1000000000u;
    xvector<std::uint32_t> chunks;
    while (!limbs.empty()) {
        std::uint64_t remainder = 0;
        for (size_t i = limbs.size(); i-- > 0;) {
            const std::uint64_t current = (remainder << 32) | limbs[i];
            limbs[i] = static_cast<std::uint32_t>(current / kChunk);
            remainder = current % kChunk;
        }
        chunks.push_back(static_cast<std::uint32_t>(remainder));
        while (!limbs.empty() && limbs.back() == 0) limbs.pop_back();
    }
    if (chunks.empty()) {
        os << '0';
        return;
    }
    if (negative) os << '-';
    os << static_cast<unsigned long long>(chunks.back());
    for (size_t i = chunks.size() - 1; i-- > 0;) {
        char buf[9];
        std::uint32_t v = chunks[i];
        for (int k = 8; k >= 0; --k) {
            buf[k] = static_cast<char>('0' + v % 10);
            v /= 10;
        }
        os.put(buf, 9);
    }
}

void WriteObject(xostream& os, PyObject* object, const char* position, xvector<PyObject*>& openLists) {
    if (PyLong_Check(object)) {
        int overflow = 0;
        const long long value = PyLong_AsLongLongAndOverflow(object, &overflow);
        if (overflow != 0) {
            WriteBigInt(os, object, position);
            return;
        }
        if (value == -1 && PyErr_Occurred()) RaiseConversionFailure(object, position);
        os << value;
    } else if (PyFloat_Check(object)) {
        os << PyFloat_AsDouble(object);
    } else if (PyUnicode_Check(object)) {
        Py_ssize_t size = 0;
        const char* text = PyUnicode_AsUTF8AndSize(object, &size);
        if (text == nullptr) RaiseConversionFailure(object, position);
        const void* zero = std::memchr(text, 0, static_cast<size_t>(size));
        os.put(text, zero != nullptr ? static_cast<const char*>(zero) - text : size);
    } else if (PyList_Check(object)) {
        for (PyObject* open : openLists)
            if (open == object)
                Raise("Can't convert python result: ", "a list that contains itself", position);
        if (openLists.size() >= kMaxListDepth)
            Raise("Can't convert python result: ", "lists nested more than 1000 deep", position);
        openLists.push_back(object);
        os << '[';
        // No Python code runs while the elements are written, so the list cannot change meanwhile.
        for (Py_ssize_t i = 0; i < PyList_GET_SIZE(object); ++i) {
            if (i > 0) os << ',';
            WriteObject(os, PyList_GET_ITEM(object, i), position, openLists);
        }
        os << ']';
        openLists.pop_back();
    } else {
        Raise("Can't convert python result of type ", Py_TYPE(object)->tp_name, position);
    }
}


bool Start(basic_xstring& error) {
    if (s_pythonInitialised) {
        if (s_mainDict != nullptr) return true;
        error = s_initError;
        return false;
    }
    s_pythonInitialised = true;
    s_initError = StartInterpreter();
    if (s_initError.empty()) return true;
    error = s_initError;
    return false;
}

void Stop() {
    s_mainModule = nullptr;
    s_mainDict = nullptr;
    if (!s_pythonInitialised) return;
    s_pythonInitialised = false;
    s_initError.clear();
    if (Py_IsInitialized()) Py_Finalize();
}

bool TakeError(basic_xstring& text) {
    // Without an interpreter there is no thread state, and PyErr_Occurred would dereference null.
    if (!Py_IsInitialized() || PyErr_Occurred() == nullptr) {
        text.clear();
        return false;
    }
    s_errorString.clear();
    // Printed by Python's traceback module into s_errorString, whatever the code did to sys.stderr, and
    // without PyErr_Print's ending of the process for SystemExit. A traceback shows the lines registered for
    // the code that ran (Run).
    PyObject* type = nullptr;
    PyObject* value = nullptr;
    PyObject* traceback = nullptr;
    PyErr_Fetch(&type, &value, &traceback);
    PyErr_NormalizeException(&type, &value, &traceback);
    if (value != nullptr && traceback != nullptr) PyException_SetTraceback(value, traceback);
    PyObject* hooks = PyImport_AddModule(kModuleName);
    Owned printed(hooks ? PyObject_CallMethod(hooks, "print_error", "OOO", type, value ? value : Py_None,
                                              traceback ? traceback : Py_None)
                        : nullptr);
    if (!printed) {
        PyErr_Clear();
        s_errorString << (type ? reinterpret_cast<PyTypeObject*>(type)->tp_name : "error")
                      << " (its traceback could not be printed)\n";
    }
    Py_XDECREF(type);
    Py_XDECREF(value);
    Py_XDECREF(traceback);
    s_errorString.GetString(text, true);
    return true;
}

PyObject* Evaluate(const basic_xstring& expression, basic_xstring& error) {
    if (s_mainDict == nullptr) {
        error = kNotRunning;
        return nullptr;
    }
    if (ContainsZeroByte(expression)) {
        error = kZeroByteInCode;
        return nullptr;
    }
    PyObject* result = PyRun_StringFlags(expression.c_str(), Py_eval_input, s_mainDict, s_mainDict, nullptr);
    if (result == nullptr) {
        TakeError(error);
        PyErr_Clear();
    }
    return result;
}

void Run(const basic_xstring& fileName, const basic_xstring& code, const char* position) {
    if (ContainsZeroByte(code)) Raise("Python compilation error: ", kZeroByteInCode, position);
    basic_xstring error;
    if (PyObject* hooks = PyImport_AddModule(kModuleName)) {
        Owned registered(PyObject_CallMethod(hooks, "register_lines", "s#s#", fileName.data(),
                                             static_cast<Py_ssize_t>(fileName.size()), code.data(),
                                             static_cast<Py_ssize_t>(code.size())));
        if (!registered) PyErr_Clear();
    }
    Owned compiled(Py_CompileStringFlags(code.c_str(), fileName.c_str(), Py_file_input, nullptr));
    if (!compiled) {
        TakeError(error);
        PyErr_Clear();
        Raise("Python compilation error: ", error, position);
    }
    Owned result(PyEval_EvalCode(compiled.Get(), s_mainDict, s_mainDict));
    if (!result) {
        TakeError(error);
        PyErr_Clear();
        Raise("RunPython error: ", error, position);
    }
}

void Write(xostream& os, PyObject* object, const char* position) {
    xvector<PyObject*> openLists;
    WriteObject(os, object, position, openLists);
}

void Release(PyObject* object) { Py_XDECREF(object); }

PyObject* PyInit_stream_hooks() { return PyModule_Create(&s_streamHooksModule); }

// Writes the one text argument of a hook into `out`, flushed when `flush`. The sized form writes text with
// embedded zero characters whole instead of refusing it.
PyObject* WriteArgumentTo(PyObject* args, xostream& out, bool flush) {
    const char* text = nullptr;
    Py_ssize_t size = 0;
    if (!PyArg_ParseTuple(args, "s#", &text, &size)) return nullptr;
    out.put(text, size);
    if (flush) out.flush();
    Py_RETURN_NONE;
}

PyObject* WriteToStdOut(PyObject* /*self*/, PyObject* args) { return WriteArgumentTo(args, xcout(), true); }
PyObject* WriteToStdErr(PyObject* /*self*/, PyObject* args) { return WriteArgumentTo(args, xcerr(), true); }
PyObject* WriteToErrorText(PyObject* /*self*/, PyObject* args) {
    return WriteArgumentTo(args, s_errorString, false);
}

constexpr PythonModule kModule = {Start, Stop, TakeError, Evaluate, Write, Run, Release};

}  // namespace

extern "C" __attribute__((visibility("default"))) const PythonModule* ovmacro_python_module() { return &kModule; }

}  // namespace orvan

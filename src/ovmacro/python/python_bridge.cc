// The library's side of embedded Python: whether it is allowed, and the loading of the bridge module
// (python_module.h), which links the Python runtime, on first use.
#include "ovmacro/python/python_bridge.h"

#include <dlfcn.h>
#include <unistd.h>

#include <cstdlib>

#include "ovmacro/lexer/exceptions.h"
#include "ovmacro/python/python_module.h"

namespace orvan {

StringStream s_errorString(4096);

namespace {

bool s_pythonAllowed = true;
const PythonModule* s_module = nullptr;
basic_xstring s_loadError;  // why the module could not be loaded; it is not tried again
basic_xstring s_fallback;   // where else to look (SetPythonModuleFallback)

// The folder of the file that holds this code: the library, or a program linked with it.
basic_xstring OwnFolder() {
    Dl_info info{};
    if (!dladdr(reinterpret_cast<const void*>(&OwnFolder), &info) || !info.dli_fname) return ".";
    const basic_xstring self = info.dli_fname;
    const size_t slash = self.rfind('/');
    return slash == basic_xstring::npos ? "." : self.substr(0, slash);
}

// Loads the bridge module: OVMACRO_PYTHON_MODULE if set, else the module beside this library (or in ../lib
// beside a program that links the library in), else the fallback. Null, with the reason in s_loadError, when
// it cannot be loaded.
const PythonModule* LoadModule() {
    if (s_module || !s_loadError.empty()) return s_module;
    const char* chosen = std::getenv("OVMACRO_PYTHON_MODULE");
    const basic_xstring folder = OwnFolder();
    xvector<basic_xstring> paths{folder + "/" + kPythonModuleFile, folder + "/../lib/" + kPythonModuleFile};
    if (!s_fallback.empty()) paths.push_back(s_fallback);
    if (chosen) paths = {chosen};
    for (size_t i = 0; i < paths.size(); ++i) {
        const basic_xstring& path = paths[i];
        // Only the first place is tried when nothing is there, so that an error names where it belongs.
        if (i > 0 && access(path.c_str(), F_OK) != 0) continue;
        // Global, so that the extension modules that Python itself loads find the runtime's symbols.
        void* handle = dlopen(path.c_str(), RTLD_NOW | RTLD_GLOBAL);
        const char* failure = handle ? nullptr : dlerror();
        auto* table = handle ? reinterpret_cast<const PythonModule* (*)()>(dlsym(handle, "ovmacro_python_module")) : nullptr;
        if (table) return s_module = table();
        if (s_loadError.empty()) s_loadError = "cannot load " + path + ": " + (failure ? failure : "no module table");
    }
    return nullptr;
}

[[noreturn]] void Raise(const char* prefix, std::string_view detail, const char* position) {
    StringStream message(4096);
    message << prefix << detail;
    throw LexScannerException(message.GetString(), position);
}

}  // namespace

PyObjectRef::~PyObjectRef() {
    if (object_ && s_module) s_module->release(object_);
}

void SetPythonAllowed(bool allowed) { s_pythonAllowed = allowed; }
void SetPythonModuleFallback(const basic_xstring& path) { s_fallback = path; }
bool IsPythonAllowed() { return s_pythonAllowed; }

bool InitPython(basic_xstring& error) {
    if (!s_pythonAllowed) {
        error = "Python is disabled";
        return false;
    }
    if (!LoadModule()) {
        error = s_loadError;
        return false;
    }
    return s_module->start(error);
}

void InitPythonFromParser(const char* position) {
    basic_xstring error;
    if (InitPython(error)) return;
    StringStream message(4096);
    message << "Python initialisation error: " << error;
    basic_xstring pythonError;
    if (GetPythonError(pythonError)) message << " : " << pythonError;
    throw LexScannerException(message.GetString(), position);
}

void UninitPython() {
    if (s_module) s_module->stop();
}

bool GetPythonError(basic_xstring& text) {
    if (s_module) return s_module->takeError(text);
    text.clear();
    return false;
}

_object* ExecutePythonExpression(const basic_xstring& expression, basic_xstring& error) {
    if (s_module) return s_module->evaluate(expression, error);
    error = "the Python interpreter is not running";
    return nullptr;
}

void EvalPythonExpression(const basic_xstring& expression, basic_xstring& result, const char* position) {
    InitPythonFromParser(position);
    basic_xstring error;
    PyObjectRef value(ExecutePythonExpression(expression, error));
    if (!value) Raise("Eval python error: ", error, position);
    StringStream stream(4096);
    WritePythonObject(stream, value.Get(), position);
    stream.GetString(result, true);
}

void RunPython(const basic_xstring& fileName, const basic_xstring& code, const char* position) {
    InitPythonFromParser(position);
    s_module->run(fileName, code, position);
}

void WritePythonObject(xostream& os, _object* object, const char* position) {
    if (s_module) s_module->write(os, object, position);
}

}  // namespace orvan

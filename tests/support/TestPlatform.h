// What tests need from the operating system beyond the C++ library: environment variables,
// symbolic links, the permission test, loading a library by hand, and the texts of paths as
// the layer writes them. Header only, so that the programs that load the library themselves
// can use it too.
#ifndef TESU_TEST_PLATFORM_H
#define TESU_TEST_PLATFORM_H

#include <cstdlib>
#include <string>

#if defined(_WIN32)
#include <windows.h>
#else
#include <dlfcn.h>
#include <unistd.h>
#endif

namespace tesutest {

#if defined(_WIN32)
// UTF-8 to UTF-16, as the layer reads texts on Windows.
inline std::wstring Wide(const std::string& text) {
    if (text.empty()) {
        return std::wstring();
    }
    const int length = static_cast<int>(text.size());
    std::wstring wide(static_cast<std::size_t>(
                          ::MultiByteToWideChar(CP_UTF8, 0, text.data(), length, nullptr, 0)),
                      L'\0');
    ::MultiByteToWideChar(CP_UTF8, 0, text.data(), length, &wide[0], static_cast<int>(wide.size()));
    return wide;
}
#endif

// Sets an environment variable of this process (the empty text is a value, not an unset).
// Texts are UTF-8.
inline void SetVariable(const char* name, const char* value) {
#if defined(_WIN32)
    // The C runtime's copy first (it removes a variable set to the empty text, from the
    // process environment too), then the process environment, which the layer reads.
    ::_wputenv_s(Wide(name).c_str(), Wide(value).c_str());
    ::SetEnvironmentVariableW(Wide(name).c_str(), Wide(value).c_str());
#else
    ::setenv(name, value, 1);
#endif
}

inline void UnsetVariable(const char* name) {
#if defined(_WIN32)
    ::SetEnvironmentVariableW(Wide(name).c_str(), nullptr);
    // "NAME=" removes the C runtime's copy.
    ::_wputenv((Wide(name) + L"=").c_str());
#else
    ::unsetenv(name);
#endif
}

// Why permission bits cannot keep this process from reading a file, or null when they can.
inline const char* WhyPermissionsDoNotLockOut() {
#if defined(_WIN32)
    return "Windows decides by access lists; permission bits only make a file read-only";
#else
    return ::geteuid() == 0 ? "permissions do not stop the superuser" : nullptr;
#endif
}

// Why this test cannot make symbolic links, or null when it can.
inline const char* WhyNoSymbolicLinks() {
#if defined(_WIN32)
    return "symbolic links need a privilege on Windows that tests do not assume";
#else
    return nullptr;
#endif
}

// Makes `link` a symbolic link to `target`; true on success. Call only where
// WhyNoSymbolicLinks() is null.
inline bool MakeSymbolicLink(const std::string& target, const std::string& link) {
#if defined(_WIN32)
    (void)target;
    (void)link;
    return false;
#else
    return ::symlink(target.c_str(), link.c_str()) == 0;
#endif
}

// `path` as the layer writes absolute and native forms: on Windows every "/" becomes "\\";
// elsewhere the text is returned as it is.
inline std::string Native(std::string path) {
#if defined(_WIN32)
    for (char& c : path) {
        if (c == '/') {
            c = '\\';
        }
    }
#endif
    return path;
}

// A library loaded by hand: LoadLibrary/GetProcAddress/FreeLibrary on Windows,
// dlopen/dlsym/dlclose elsewhere.
namespace library {

#if defined(_WIN32)
using Handle = HMODULE;
inline Handle Open(const char* file) {
    return ::LoadLibraryA(file);
}
inline void* Symbol(Handle library, const char* name) {
    return reinterpret_cast<void*>(::GetProcAddress(library, name));
}
inline bool Close(Handle library) {
    return ::FreeLibrary(library) != 0;
}
// True while `file` is loaded in this process.
inline bool IsLoaded(const char* file) {
    HMODULE module = nullptr;
    const std::string name(file);
    const std::size_t slash = name.find_last_of("/\\");
    const std::string base = slash == std::string::npos ? name : name.substr(slash + 1);
    return ::GetModuleHandleExA(GET_MODULE_HANDLE_EX_FLAG_UNCHANGED_REFCOUNT, base.c_str(),
                                &module) != 0;
}
// The system's text for the last failure.
inline std::string LastError() {
    return "Windows error " + std::to_string(::GetLastError());
}
#else
using Handle = void*;
inline Handle Open(const char* file) {
    return ::dlopen(file, RTLD_NOW | RTLD_LOCAL);
}
inline void* Symbol(Handle library, const char* name) {
    return ::dlsym(library, name);
}
inline bool Close(Handle library) {
    return ::dlclose(library) == 0;
}
inline bool IsLoaded(const char* file) {
    void* library = ::dlopen(file, RTLD_NOW | RTLD_NOLOAD);
    if (library == nullptr) {
        return false;
    }
    ::dlclose(library);
    return true;
}
inline std::string LastError() {
    const char* text = ::dlerror();
    return text == nullptr ? std::string() : std::string(text);
}
#endif

}  // namespace library

}  // namespace tesutest

#endif

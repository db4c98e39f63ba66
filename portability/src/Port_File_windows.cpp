// Windows implementation of the layer's operating-system interface (Port_OS.h).
//
// Texts are UTF-8 and become UTF-16 only here, at the system boundary; a name that is not
// valid UTF-8 is refused rather than turned into a different name. Open files are C runtime
// descriptors, so that the runtime's text mode (line ends translated) serves `binary` false
// when writing; reading is always binary.
#include <direct.h>
#include <fcntl.h>
#include <io.h>
#include <share.h>
#include <sys/stat.h>
#include <windows.h>

#include <cerrno>
#include <climits>
#include <cstdlib>
#include <cstring>
#include <cwchar>
#include <string>

#include "Port_OS.h"

namespace Port {
namespace os {

namespace {

// The most UTF-16 units the system takes in a name or an environment text; a longer one
// names nothing, and is refused before path code whose time grows with the square of its
// length (".." after "..") gets to it.
constexpr int kLongestText = 32767;

// UTF-8 to UTF-16; false for bytes that are not UTF-8, and for a text longer than the system
// takes.
bool widen(const std::string& text, std::wstring& wide) {
    wide.clear();
    if (text.empty()) {
        return true;
    }
    if (text.size() > static_cast<std::size_t>(INT_MAX)) {
        return false;
    }
    const int length = static_cast<int>(text.size());
    const int count =
        ::MultiByteToWideChar(CP_UTF8, MB_ERR_INVALID_CHARS, text.data(), length, nullptr, 0);
    if (count <= 0 || count > kLongestText) {
        return false;
    }
    wide.resize(static_cast<std::size_t>(count));
    return ::MultiByteToWideChar(CP_UTF8, MB_ERR_INVALID_CHARS, text.data(), length, &wide[0],
                                 count) == count;
}

// UTF-16 to UTF-8. Unpaired surrogates, which file names may hold, become U+FFFD.
std::string narrow(const wchar_t* text, std::size_t length) {
    std::string result;
    if (length == 0 || length > static_cast<std::size_t>(INT_MAX)) {
        return result;
    }
    const int size = static_cast<int>(length);
    const int count = ::WideCharToMultiByte(CP_UTF8, 0, text, size, nullptr, 0, nullptr, nullptr);
    if (count > 0) {
        result.resize(static_cast<std::size_t>(count));
        ::WideCharToMultiByte(CP_UTF8, 0, text, size, &result[0], count, nullptr, nullptr);
    }
    return result;
}

std::string narrow(const std::wstring& text) {
    return narrow(text.data(), text.size());
}

int fd(Handle handle) {
    return static_cast<int>(handle);
}

// A handle on what `name` denotes, links followed, for questions about it (no access to its
// content is asked, so a file this process may not read still answers). Directories need
// backup semantics to be opened at all.
HANDLE openForQuery(const std::wstring& name, DWORD access) {
    return ::CreateFileW(name.c_str(), access,
                         FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE, nullptr,
                         OPEN_EXISTING, FILE_FLAG_BACKUP_SEMANTICS, nullptr);
}

Kind kindOfHandle(HANDLE handle) {
    if (::GetFileType(handle) != FILE_TYPE_DISK) {
        return Kind::OTHER;
    }
    BY_HANDLE_FILE_INFORMATION info;
    if (!::GetFileInformationByHandle(handle, &info)) {
        return Kind::NONE;
    }
    return (info.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) != 0 ? Kind::DIRECTORY : Kind::FILE;
}

// The pattern that lists every entry of `directory`.
std::wstring listingPattern(const std::wstring& directory) {
    std::wstring pattern = directory;
    if (!pattern.empty() && pattern.back() != L'\\' && pattern.back() != L'/' &&
        pattern.back() != L':') {
        pattern += L'\\';
    }
    pattern += L'*';
    return pattern;
}

bool isDotOrDotDot(const wchar_t* name) {
    return std::wcscmp(name, L".") == 0 || std::wcscmp(name, L"..") == 0;
}

// An address inside libPortability, to find the module that holds it.
const char anchor = 0;

}  // namespace

Handle openFile(const std::string& name, OpenMode mode, bool binary) {
    std::wstring wide;
    if (!widen(name, wide) || wide.empty()) {
        errno = EINVAL;
        return INVALID_HANDLE;
    }
    // Reading is always binary: the runtime's text mode ends a file at its first Ctrl-Z byte
    // (0x1A), which would silently drop every line after it. readline drops the "\r" of "\r\n"
    // itself, so lines read are the same as in text mode. Writing keeps the mode asked for.
    const bool binaryBytes = binary || mode == OpenMode::READ;
    int flags = _O_NOINHERIT | (binaryBytes ? _O_BINARY : _O_TEXT);
    switch (mode) {
        case OpenMode::READ:
            flags |= _O_RDONLY;
            break;
        case OpenMode::WRITE:
            flags |= _O_WRONLY | _O_CREAT | _O_TRUNC;
            break;
        case OpenMode::APPEND:
            flags |= _O_WRONLY | _O_CREAT | _O_APPEND;
            break;
    }
    // Others may read, write and delete the file meanwhile, as on POSIX.
    int result = -1;
    if (::_wsopen_s(&result, wide.c_str(), flags, _SH_DENYNO, _S_IREAD | _S_IWRITE) != 0) {
        return INVALID_HANDLE;
    }
    return static_cast<Handle>(result);
}

std::int64_t readFile(Handle handle, void* buffer, std::size_t size) {
    // The runtime counts in unsigned int, and in text mode may give fewer bytes than it
    // consumed: any positive count is progress.
    const unsigned int piece = size > static_cast<std::size_t>(INT_MAX)
                                   ? static_cast<unsigned int>(INT_MAX)
                                   : static_cast<unsigned int>(size);
    const int count = ::_read(fd(handle), buffer, piece);
    return count < 0 ? -1 : static_cast<std::int64_t>(count);
}

bool writeFile(Handle handle, const void* data, std::size_t size) {
    const char* bytes = static_cast<const char*>(data);
    while (size > 0) {
        const unsigned int piece = size > static_cast<std::size_t>(INT_MAX)
                                       ? static_cast<unsigned int>(INT_MAX)
                                       : static_cast<unsigned int>(size);
        // In text mode the count is of the caller's bytes, before "\n" became "\r\n".
        const int count = ::_write(fd(handle), bytes, piece);
        if (count <= 0) {
            return false;
        }
        bytes += count;
        size -= static_cast<std::size_t>(count);
    }
    return true;
}

bool closeFile(Handle handle) {
    return ::_close(fd(handle)) == 0;
}

Handle duplicateStandardInput() {
    const int result = ::_dup(0);
    if (result < 0) {
        return INVALID_HANDLE;
    }
    // Bytes as stored, as for every file read.
    ::_setmode(result, _O_BINARY);
    return static_cast<Handle>(result);
}

Kind handleKind(Handle handle) {
    const intptr_t os = ::_get_osfhandle(fd(handle));
    if (os == -1) {
        return Kind::NONE;
    }
    return kindOfHandle(reinterpret_cast<HANDLE>(os));
}

std::int64_t handleSize(Handle handle) {
    if (handleKind(handle) != Kind::FILE) {
        return -1;
    }
    const __int64 size = ::_filelengthi64(fd(handle));
    return size < 0 ? -1 : static_cast<std::int64_t>(size);
}

Kind nameKind(const std::string& name) {
    std::wstring wide;
    if (!widen(name, wide) || wide.empty()) {
        return Kind::NONE;
    }
    const HANDLE handle = openForQuery(wide, 0);
    if (handle == INVALID_HANDLE_VALUE) {
        return Kind::NONE;
    }
    const Kind kind = kindOfHandle(handle);
    ::CloseHandle(handle);
    return kind;
}

bool canRead(const std::string& name) {
    std::wstring wide;
    if (!widen(name, wide) || wide.empty()) {
        return false;
    }
    // Windows decides by its access lists: the test is to open the file for reading, or to
    // start listing the directory.
    const Kind kind = nameKind(name);
    if (kind == Kind::NONE) {
        return false;
    }
    if (kind == Kind::DIRECTORY) {
        WIN32_FIND_DATAW entry;
        const HANDLE find = ::FindFirstFileW(listingPattern(wide).c_str(), &entry);
        if (find == INVALID_HANDLE_VALUE) {
            // An empty drive root has not even "." to give.
            return ::GetLastError() == ERROR_FILE_NOT_FOUND;
        }
        ::FindClose(find);
        return true;
    }
    const HANDLE handle = openForQuery(wide, GENERIC_READ);
    if (handle == INVALID_HANDLE_VALUE) {
        return false;
    }
    ::CloseHandle(handle);
    return true;
}

bool realPath(const std::string& name, std::string& resolved) {
    std::wstring wide;
    if (!widen(name, wide) || wide.empty()) {
        return false;
    }
    const HANDLE handle = openForQuery(wide, 0);
    if (handle == INVALID_HANDLE_VALUE) {
        return false;
    }
    std::wstring path(MAX_PATH, L'\0');
    DWORD length = 0;
    for (;;) {
        length = ::GetFinalPathNameByHandleW(handle, &path[0], static_cast<DWORD>(path.size()),
                                             FILE_NAME_NORMALIZED | VOLUME_NAME_DOS);
        if (length < path.size()) {
            break;
        }
        path.resize(length + 1);
    }
    ::CloseHandle(handle);
    if (length == 0) {
        return false;
    }
    path.resize(length);
    // The system answers in its long form: "\\?\C:\..." or "\\?\UNC\server\share\...".
    if (path.compare(0, 8, L"\\\\?\\UNC\\") == 0) {
        path.erase(2, 6);
    } else if (path.compare(0, 4, L"\\\\?\\") == 0) {
        path.erase(0, 4);
    }
    resolved = narrow(path);
    return true;
}

// Takes a directory that the C runtime allocated (null when it failed, with errno set),
// frees it and gives it as UTF-8. The system keeps the drive root's separator and no other
// trailing one.
bool takeDirectory(wchar_t* buffer, const char* unknown, std::string& directory,
                   std::string& reason) {
    if (buffer == nullptr) {
        reason = std::strerror(errno);
        return false;
    }
    std::string result = narrow(buffer, std::wcslen(buffer));
    std::free(buffer);
    if (result.empty()) {
        reason = unknown;
        return false;
    }
    directory.swap(result);
    return true;
}

bool currentDirectory(std::string& directory, std::string& reason) {
    return takeDirectory(::_wgetcwd(nullptr, 0), "the working directory is not known", directory,
                         reason);
}

bool changeDirectory(const std::string& directory) {
    std::wstring wide;
    return widen(directory, wide) && !wide.empty() && ::_wchdir(wide.c_str()) == 0;
}

bool driveDirectory(char drive, std::string& directory, std::string& reason) {
    const char letter = static_cast<char>(drive >= 'a' && drive <= 'z' ? drive - 'a' + 'A' : drive);
    if (letter < 'A' || letter > 'Z') {
        reason = "no such drive";
        return false;
    }
    return takeDirectory(::_wgetdcwd(letter - 'A' + 1, nullptr, 0),
                         "the drive's working directory is not known", directory, reason);
}

bool readDirectory(const std::string& directory, std::vector<DirEntry>& entries) {
    std::wstring wide;
    if (!widen(directory, wide) || wide.empty() || nameKind(directory) != Kind::DIRECTORY) {
        return false;
    }
    WIN32_FIND_DATAW entry;
    const HANDLE find = ::FindFirstFileExW(listingPattern(wide).c_str(), FindExInfoBasic, &entry,
                                           FindExSearchNameMatch, nullptr, 0);
    if (find == INVALID_HANDLE_VALUE) {
        // An empty drive root has not even "." to give; anything else is a failure.
        return ::GetLastError() == ERROR_FILE_NOT_FOUND;
    }
    std::string prefix = directory;
    if (prefix.back() != '\\' && prefix.back() != '/' && prefix.back() != ':') {
        prefix += '\\';
    }
    for (bool more = true; more; more = ::FindNextFileW(find, &entry) != 0) {
        if (isDotOrDotDot(entry.cFileName)) {
            continue;
        }
        std::string name = narrow(entry.cFileName, std::wcslen(entry.cFileName));
        Kind kind =
            (entry.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) != 0 ? Kind::DIRECTORY : Kind::FILE;
        if ((entry.dwFileAttributes & FILE_ATTRIBUTE_REPARSE_POINT) != 0) {
            // A link counts as what it points to.
            kind = nameKind(prefix + name);
        }
        entries.push_back(DirEntry{std::move(name), kind});
    }
    const bool complete = ::GetLastError() == ERROR_NO_MORE_FILES;
    ::FindClose(find);
    if (!complete) {
        // A read error leaves the listing incomplete: report it as unreadable rather than
        // hand out a partial listing.
        entries.clear();
        return false;
    }
    return true;
}

bool environmentVariable(const char* name, std::string& value) {
    std::wstring wideName;
    if (name == nullptr || !widen(name, wideName) || wideName.empty()) {
        return false;
    }
    std::wstring buffer(256, L'\0');
    for (;;) {
        ::SetLastError(ERROR_SUCCESS);
        const DWORD length = ::GetEnvironmentVariableW(wideName.c_str(), &buffer[0],
                                                       static_cast<DWORD>(buffer.size()));
        if (length == 0) {
            // Zero is both "not set" and "set to the empty text".
            if (::GetLastError() == ERROR_ENVVAR_NOT_FOUND) {
                return false;
            }
            value.clear();
            return true;
        }
        if (length < buffer.size()) {
            value = narrow(buffer.data(), length);
            return true;
        }
        buffer.resize(length);  // the size needed, terminator included
    }
}

bool libraryFile(std::string& path) {
    HMODULE module = nullptr;
    if (!::GetModuleHandleExW(
            GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS | GET_MODULE_HANDLE_EX_FLAG_UNCHANGED_REFCOUNT,
            reinterpret_cast<LPCWSTR>(&anchor), &module)) {
        return false;
    }
    std::wstring buffer(MAX_PATH, L'\0');
    for (;;) {
        const DWORD length =
            ::GetModuleFileNameW(module, &buffer[0], static_cast<DWORD>(buffer.size()));
        if (length == 0) {
            return false;
        }
        if (length < buffer.size()) {
            buffer.resize(length);
            break;
        }
        // Cut short: try again with more room.
        buffer.resize(buffer.size() * 2);
    }
    path = narrow(buffer);
    if (path.compare(0, 8, "\\\\?\\UNC\\") == 0) {
        path.erase(2, 6);
    } else if (path.compare(0, 4, "\\\\?\\") == 0) {
        path.erase(0, 4);
    }
    return !path.empty();
}

}  // namespace os
}  // namespace Port

// The operating-system calls behind the layer's file services.
//
// Internal to libPortability: Port_FileName.cpp, Port_File.cpp and Port_PathList.cpp are
// written against this interface only, and one implementation file per operating system
// (Port_File_posix.cpp, later Port_File_windows.cpp) provides it. Names are passed in the
// platform's form (see nativeName): on POSIX the bytes go to the kernel unchanged; a Windows
// implementation will turn them into wide characters there.
//
// No function here throws; each reports failure through its result, and the file functions
// leave the system's error code in errno when they fail.
#ifndef PORT_OS_H
#define PORT_OS_H

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace Port {
namespace os {

// The platform's path separator, and the separator of path lists in environment variables.
#if defined(_WIN32)
constexpr char kPathSeparator = '\\';
constexpr char kListSeparator = ';';
#else
constexpr char kPathSeparator = '/';
constexpr char kListSeparator = ':';
#endif

// What a name denotes, symbolic links followed.
enum class Kind { NONE, FILE, DIRECTORY, OTHER };

// How a file is opened.
enum class OpenMode { READ, WRITE, APPEND };

// A handle of an open file; INVALID_HANDLE when there is none.
using Handle = std::intptr_t;
constexpr Handle INVALID_HANDLE = -1;

// Opens `name`. READ: an existing file, from the start. WRITE: created (mode 0666 less the
// umask) or truncated. APPEND: created if needed, every write at the end. `binary` false asks
// for the platform's text mode (nothing on POSIX). The handle is not inherited by child
// processes. Returns INVALID_HANDLE on failure.
Handle openFile(const std::string& name, OpenMode mode, bool binary);
// Reads up to `size` bytes; the count read, 0 at the end of the file, -1 on error.
// Interrupted calls are retried.
std::int64_t readFile(Handle handle, void* buffer, std::size_t size);
// Writes all `size` bytes; false on error.
bool writeFile(Handle handle, const void* data, std::size_t size);
// Closes the handle; false when the system reports an error (the handle is released anyway).
bool closeFile(Handle handle);
// A new handle on the process's standard input, not inherited by child processes (binary on
// Windows); INVALID_HANDLE when standard input is closed.
Handle duplicateStandardInput();
// What an open handle denotes.
Kind handleKind(Handle handle);
// The size of an open regular file, or -1 when it is not known.
std::int64_t handleSize(Handle handle);

// What `name` denotes (symbolic links followed); NONE when it does not exist or cannot be
// examined.
Kind nameKind(const std::string& name);
// True when this process may read `name`: the permission test, and for a directory also an
// attempt to open it for listing.
bool canRead(const std::string& name);
// The name with every symbolic link and "."/".." resolved by the system; false when the name
// (or one of its parents) does not exist.
bool realPath(const std::string& name, std::string& resolved);

// The working directory, absolute; false when it cannot be read (for example when it was
// removed). `reason` then says why.
bool currentDirectory(std::string& directory, std::string& reason);
bool changeDirectory(const std::string& directory);
#if defined(_WIN32)
// The working directory of drive `drive` (a letter), which completes a drive-relative name
// such as "D:x"; false when it cannot be read. `reason` then says why.
bool driveDirectory(char drive, std::string& directory, std::string& reason);
#endif

// One entry of a directory: its final name and what it denotes (links followed).
struct DirEntry {
    std::string name;
    Kind kind;
};
// The entries of `directory` in the order the system gives them, "." and ".." left out;
// false when it cannot be opened as a directory.
bool readDirectory(const std::string& directory, std::vector<DirEntry>& entries);

// The value of an environment variable; false when it is not set.
bool environmentVariable(const char* name, std::string& value);

// The file from which libPortability was loaded, as the loader names it (it may be
// relative); false when it cannot be found.
bool libraryFile(std::string& path);

}  // namespace os
}  // namespace Port

#endif

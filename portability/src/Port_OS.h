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

// Creates `name` as a new file for writing, only when nothing of that name exists (never
// through a link), readable and writable by its owner alone (0600 on POSIX), binary, not
// inherited. INVALID_HANDLE on failure; errno EEXIST when the name is taken.
Handle createNewFile(const std::string& name);
// Writes the file's data out to the device (fsync, FlushFileBuffers).
bool syncFile(Handle handle);
// Sets the permission bits of an open file (07777 on POSIX; on Windows a value without any
// write bit makes the file read-only, any other clears that attribute).
bool setHandlePermissions(Handle handle, std::uint32_t permissions);
// Gives an open file the owner and group ids (fchown); true without a change for -1, and
// always on Windows, where files have no such ids.
bool setHandleOwner(Handle handle, std::int64_t owner, std::int64_t group);

// What `name` denotes and how (symbolic links followed).
struct NameInfo {
    Kind kind = Kind::NONE;
    std::uint64_t links = 0;
    std::uint32_t permissions = 0;
    std::int64_t owner = -1;
    std::int64_t group = -1;
};
// False (errno set) when `name` does not exist or cannot be examined.
bool nameInfo(const std::string& name, NameInfo& info);
// True when this process may write `name` (access W_OK; on Windows the file opens for
// writing). errno says why not.
bool canWrite(const std::string& name);
// Renames `from` to `to`, replacing a file `to` in one step (rename, MoveFileExW with
// MOVEFILE_REPLACE_EXISTING and MOVEFILE_WRITE_THROUGH).
bool renameFile(const std::string& from, const std::string& to);
// Removes the file `name`.
bool removeFile(const std::string& name);
// Writes the directory's entries out to the device (fsync of the directory on POSIX; true on
// Windows, where renameFile's write-through makes the new entry lasting).
bool syncDirectory(const std::string& directory);
// The process's id, for names of temporary files.
std::uint64_t processId();

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

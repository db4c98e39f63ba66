// POSIX implementation of the layer's operating-system interface (Port_OS.h).
#include <dirent.h>
#include <dlfcn.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <sys/types.h>
#include <unistd.h>

#include <cerrno>
#include <climits>
#include <cstdlib>
#include <cstring>
#include <memory>

#include "Port_OS.h"

namespace Port {
namespace os {

namespace {

int fd(Handle handle) {
    return static_cast<int>(handle);
}

Kind kindOf(const struct stat& info) {
    if (S_ISREG(info.st_mode)) {
        return Kind::FILE;
    }
    if (S_ISDIR(info.st_mode)) {
        return Kind::DIRECTORY;
    }
    return Kind::OTHER;
}

// An address inside libPortability, for dladdr.
const char anchor = 0;

}  // namespace

Handle openFile(const std::string& name, OpenMode mode, bool /*binary*/) {
    int flags = O_CLOEXEC;
    switch (mode) {
        case OpenMode::READ:
            // Non-blocking only for the open itself: a FIFO without a writer would otherwise
            // block here for good. File::open then refuses whatever is not a regular file.
            flags |= O_RDONLY | O_NONBLOCK;
            break;
        case OpenMode::WRITE:
            flags |= O_WRONLY | O_CREAT | O_TRUNC;
            break;
        case OpenMode::APPEND:
            flags |= O_WRONLY | O_CREAT | O_APPEND;
            break;
    }
    int result;
    do {
        result = ::open(name.c_str(), flags, 0666);
    } while (result < 0 && errno == EINTR);
    if (result < 0) {
        return INVALID_HANDLE;
    }
    if ((flags & O_NONBLOCK) != 0) {
        const int status = ::fcntl(result, F_GETFL);
        if (status != -1) {
            ::fcntl(result, F_SETFL, status & ~O_NONBLOCK);
        }
    }
    return static_cast<Handle>(result);
}

std::int64_t readFile(Handle handle, void* buffer, std::size_t size) {
    for (;;) {
        const ssize_t count = ::read(fd(handle), buffer, size);
        if (count >= 0) {
            return static_cast<std::int64_t>(count);
        }
        if (errno != EINTR) {
            return -1;
        }
    }
}

bool writeFile(Handle handle, const void* data, std::size_t size) {
    const char* bytes = static_cast<const char*>(data);
    while (size > 0) {
        const ssize_t count = ::write(fd(handle), bytes, size);
        if (count < 0) {
            if (errno == EINTR) {
                continue;
            }
            return false;
        }
        bytes += count;
        size -= static_cast<std::size_t>(count);
    }
    return true;
}

bool closeFile(Handle handle) {
    // Linux releases the descriptor even when close reports an error (EINTR included), so a
    // retry could close a descriptor another thread has just opened.
    return ::close(fd(handle)) == 0;
}

Handle duplicateStandardInput() {
    const int result = ::fcntl(STDIN_FILENO, F_DUPFD_CLOEXEC, 0);
    return result < 0 ? INVALID_HANDLE : static_cast<Handle>(result);
}

Kind handleKind(Handle handle) {
    struct stat info;
    if (::fstat(fd(handle), &info) != 0) {
        return Kind::NONE;
    }
    return kindOf(info);
}

std::int64_t handleSize(Handle handle) {
    struct stat info;
    if (::fstat(fd(handle), &info) != 0 || !S_ISREG(info.st_mode)) {
        return -1;
    }
    return static_cast<std::int64_t>(info.st_size);
}

Kind nameKind(const std::string& name) {
    struct stat info;
    if (::stat(name.c_str(), &info) != 0) {
        return Kind::NONE;
    }
    return kindOf(info);
}

bool canRead(const std::string& name) {
    const Kind kind = nameKind(name);
    if (kind == Kind::NONE || ::access(name.c_str(), R_OK) != 0) {
        return false;
    }
    if (kind == Kind::DIRECTORY) {
        DIR* dir = ::opendir(name.c_str());
        if (dir == nullptr) {
            return false;
        }
        ::closedir(dir);
    }
    return true;
}

bool realPath(const std::string& name, std::string& resolved) {
    std::unique_ptr<char, decltype(&std::free)> path(::realpath(name.c_str(), nullptr), &std::free);
    if (!path) {
        return false;
    }
    resolved.assign(path.get());
    return true;
}

bool currentDirectory(std::string& directory, std::string& reason) {
    std::string buffer(PATH_MAX, '\0');
    for (;;) {
        if (::getcwd(&buffer[0], buffer.size()) != nullptr) {
            buffer.resize(std::strlen(buffer.c_str()));
            // Older C libraries mark a directory outside the process's root this way instead
            // of failing; it is not a usable name.
            if (buffer.empty() || buffer[0] != '/') {
                reason = "the working directory is not reachable";
                return false;
            }
            directory.swap(buffer);
            return true;
        }
        if (errno != ERANGE) {
            reason = std::strerror(errno);
            return false;
        }
        buffer.resize(buffer.size() * 2);
    }
}

bool changeDirectory(const std::string& directory) {
    return ::chdir(directory.c_str()) == 0;
}

bool readDirectory(const std::string& directory, std::vector<DirEntry>& entries) {
    DIR* dir = ::opendir(directory.c_str());
    if (dir == nullptr) {
        return false;
    }
    const std::string prefix =
        (!directory.empty() && directory.back() == '/') ? directory : directory + '/';
    for (;;) {
        errno = 0;
        const struct dirent* entry = ::readdir(dir);
        if (entry == nullptr) {
            // A read error leaves the listing incomplete: report it as unreadable rather than
            // hand out a partial listing.
            if (errno != 0) {
                ::closedir(dir);
                entries.clear();
                return false;
            }
            break;
        }
        const char* name = entry->d_name;
        if (std::strcmp(name, ".") == 0 || std::strcmp(name, "..") == 0) {
            continue;
        }
        Kind kind = Kind::OTHER;
        switch (entry->d_type) {
            case DT_REG:
                kind = Kind::FILE;
                break;
            case DT_DIR:
                kind = Kind::DIRECTORY;
                break;
            case DT_LNK:
            case DT_UNKNOWN:
                // A link counts as what it points to; some file systems give no type at all.
                kind = nameKind(prefix + name);
                break;
            default:
                break;
        }
        entries.push_back(DirEntry{name, kind});
    }
    ::closedir(dir);
    return true;
}

bool environmentVariable(const char* name, std::string& value) {
    const char* text = std::getenv(name);
    if (text == nullptr) {
        return false;
    }
    value.assign(text);
    return true;
}

bool libraryFile(std::string& path) {
    Dl_info info;
    if (::dladdr(&anchor, &info) == 0 || info.dli_fname == nullptr || info.dli_fname[0] == '\0') {
        return false;
    }
    path.assign(info.dli_fname);
    return true;
}

}  // namespace os
}  // namespace Port

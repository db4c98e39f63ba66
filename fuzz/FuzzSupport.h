// Helpers shared by the libFuzzer harnesses: a property check that stops the run, a private
// temporary directory, files written and removed there, a capture of the dispatched messages,
// and the line splitting of the layer's line reader, written out plainly as the reference the
// harnesses compare with.
#ifndef TESU_FUZZ_SUPPORT_H
#define TESU_FUZZ_SUPPORT_H

#include <fcntl.h>
#include <ftw.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <sstream>
#include <string>
#include <vector>

#include "Port_Msg.h"

// Stops the run when a property does not hold; libFuzzer then keeps the input as a crash.
#define FUZZ_CHECK(condition)                                                                      \
    do {                                                                                           \
        if (!(condition)) {                                                                        \
            std::fprintf(stderr, "property failed: %s (%s:%d)\n", #condition, __FILE__, __LINE__); \
            __builtin_trap();                                                                      \
        }                                                                                          \
    } while (false)

namespace fuzzsupport {

// A directory of this process under the system's temporary directory, made on first use and
// removed when the process ends normally.
inline const std::string& TempDirectory() {
    static const std::string path = [] {
        const char* base = std::getenv("TMPDIR");
        std::string pattern =
            std::string(base != nullptr && *base != '\0' ? base : "/tmp") + "/tesu-fuzz-XXXXXX";
        if (::mkdtemp(&pattern[0]) == nullptr) {
            std::perror("mkdtemp");
            std::abort();
        }
        return pattern;
    }();
    return path;
}

inline int RemoveEntry(const char* path, const struct stat*, int, struct FTW*) {
    return ::remove(path);
}

// Removes `path` and everything under it; symbolic links are removed, never followed.
inline void RemoveTree(const std::string& path) {
    ::nftw(path.c_str(), RemoveEntry, 16, FTW_DEPTH | FTW_PHYS);
}

// Removes the temporary directory at exit.
struct TempDirectoryRemover {
    ~TempDirectoryRemover() { RemoveTree(TempDirectory()); }
};

// Writes `content` to `path` (created or truncated).
inline void WriteFile(const std::string& path, const std::string& content) {
    const int fd = ::open(path.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0644);
    if (fd < 0) {
        std::perror("open");
        std::abort();
    }
    std::size_t done = 0;
    while (done < content.size()) {
        const ssize_t n = ::write(fd, content.data() + done, content.size() - done);
        if (n <= 0) {
            std::perror("write");
            std::abort();
        }
        done += static_cast<std::size_t>(n);
    }
    ::close(fd);
}

// True when `path` names an existing file or directory, links followed; a name holding a NUL
// byte names nothing.
inline bool Exists(const std::string& path) {
    struct stat info;
    return path.find('\0') == std::string::npos && ::stat(path.c_str(), &info) == 0;
}

// Every message dispatched while it lives, as a message stream writes them.
class MessageCapture {
  public:
    MessageCapture() : manager_("fuzz capture") {
        manager_.addMsgStream(out_);
        Port_MsgDispatcher::addMsgMan(&manager_);
    }
    ~MessageCapture() {
        Port_MsgDispatcher::removeMsgMan(&manager_);
        manager_.removeMsgStream(out_);
    }
    MessageCapture(const MessageCapture&) = delete;
    MessageCapture& operator=(const MessageCapture&) = delete;
    std::string Text() const { return out_.str(); }

  private:
    std::ostringstream out_;
    Port_MsgStream manager_;
};

// The lines of a file's content as the layer's line reader gives them: split at "\n", the
// "\r" before a "\n" dropped, and no line after a final line break.
inline std::vector<std::string> ReaderLines(const std::string& content) {
    std::vector<std::string> lines;
    std::size_t start = 0;
    while (start < content.size()) {
        const std::size_t end = content.find('\n', start);
        if (end == std::string::npos) {
            lines.push_back(content.substr(start));
            break;
        }
        std::string line = content.substr(start, end - start);
        if (!line.empty() && line.back() == '\r') {
            line.pop_back();
        }
        lines.push_back(line);
        start = end + 1;
    }
    return lines;
}

}  // namespace fuzzsupport

#endif

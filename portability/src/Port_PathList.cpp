// Port::PathList and the installation roots.
#include "Port_PathList.h"

#include <atomic>
#include <mutex>
#include <stdexcept>
#include <string>

#include "Port_FileName.h"
#include "Port_OS.h"

namespace Port {

PathList::PathList(const StringBase<char>& text, char separator) {
    const std::string& bytes = text.str();
    std::size_t start = 0;
    while (start <= bytes.size()) {
        std::size_t end = bytes.find(separator, start);
        if (end == std::string::npos) {
            end = bytes.size();
        }
        if (end > start) {
            paths_.emplace_back(bytes.substr(start, end - start));
        }
        start = end + 1;
    }
}

namespace {

// The roots live for the whole process: other libraries' static destructors may still walk
// them after this library's statics are gone, so they are made with new and never deleted.
struct Roots {
    std::mutex mutex;
    PathList list;
    std::atomic<bool> loaded{false};
};

Roots& roots() {
    static Roots* instance = new Roots;
    return *instance;
}

// The directory part of `path` without its final separator (the root keeps it: "/", and on
// Windows "C:\", whose separator makes it the root rather than drive C's working directory).
std::string parentOf(const std::string& path) {
    std::string head = FileName(StringBase<char>(path)).GetHead().str();
    const bool driveRoot = os::kPathSeparator == '\\' && head.size() == 3 && head[1] == ':';
    if (head.size() > 1 && FileName::IsSeparator(head.back()) && !driveRoot) {
        head.pop_back();
    }
    return head;
}

// The roots as the environment gives them. Runs under the mutex.
void load(PathList& list) {
    list.Clear();
    std::string value;
    if (os::environmentVariable("TESSEL_ROOTS", value)) {
        list = PathList(StringBase<char>(value), QuarnelPath::GetListSeparator());
        return;
    }
    const StringBase<char> prefix = QuarnelPath::GetInstallationPrefix();
    if (!prefix.IsEmpty()) {
        list.Append(prefix);
    }
}

}  // namespace

const PathList& QuarnelPath::GetInstance() {
    Roots& r = roots();
    if (!r.loaded.load(std::memory_order_acquire)) {
        std::lock_guard<std::mutex> lock(r.mutex);
        if (!r.loaded.load(std::memory_order_relaxed)) {
            load(r.list);
            r.loaded.store(true, std::memory_order_release);
        }
    }
    return r.list;
}

void QuarnelPath::SetRoots(const PathList& list) {
    Roots& r = roots();
    std::lock_guard<std::mutex> lock(r.mutex);
    r.list = list;
    r.loaded.store(true, std::memory_order_release);
}

void QuarnelPath::Reset() {
    Roots& r = roots();
    std::lock_guard<std::mutex> lock(r.mutex);
    r.list.Clear();
    r.loaded.store(false, std::memory_order_release);
}

char QuarnelPath::GetListSeparator() {
    return os::kListSeparator;
}

StringBase<char> QuarnelPath::GetInstallationPrefix() {
    std::string file;
    if (!os::libraryFile(file)) {
        return StringBase<char>();
    }
    // The loader may name the library relative to the working directory (when it was loaded
    // by such a name); the lexical absolute form keeps the installation's own names, so a
    // linked lib folder is not replaced by its target.
    try {
        const std::string absolute = FileName(StringBase<char>(file)).GetAbsolutePath(false).str();
        return StringBase<char>(parentOf(parentOf(absolute)));
    } catch (const std::runtime_error&) {
        // A relative name and an unreadable working directory: no prefix can be made.
        return StringBase<char>();
    }
}

}  // namespace Port

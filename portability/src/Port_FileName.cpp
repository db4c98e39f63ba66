// Port::FileName: the text logic of file names.
//
// Everything here works on bytes and is the same on every platform except the root of an
// absolute name (drive letters and UNC shares on Windows), the completion of the names that
// Windows roots on a drive without naming its directory, and the separator the results use.
// The working directory and the resolution of symbolic links come from the operating-system
// interface (Port_OS.h).
#include "Port_FileName.h"

#include <cstring>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

#include "Port_File.h"
#include "Port_OS.h"

namespace Port {

namespace {

bool isSeparator(char c) {
    return FileName::IsSeparator(c);
}

// The text with both separators turned into the platform's.
std::string toNative(std::string text) {
    for (char& c : text) {
        if (isSeparator(c)) {
            c = os::kPathSeparator;
        }
    }
    return text;
}

#if defined(_WIN32)
bool hasDrive(const std::string& text) {
    const char c = text.size() >= 2 ? text[0] : '\0';
    return ((c >= 'A' && c <= 'Z') || (c >= 'a' && c <= 'z')) && text[1] == ':';
}

// "\\server\share...": two separators, then a name.
bool isUnc(const std::string& text) {
    return text.size() >= 3 && isSeparator(text[0]) && isSeparator(text[1]) &&
           !isSeparator(text[2]);
}

// Index of the first separator at or after `from`, or the length.
std::size_t nextSeparator(const std::string& text, std::size_t from) {
    while (from < text.size() && !isSeparator(text[from])) {
        ++from;
    }
    return from;
}
#endif

// True when `text` names a location without help from the working directory: on POSIX a
// name beginning with a separator; on Windows a drive with its root ("C:\...") or a UNC name
// ("\\server\share\..."). There "\..." is rooted on the working directory's drive and "C:..."
// is relative to the working directory of drive C, and both need completing.
bool isAbsolute(const std::string& text) {
#if defined(_WIN32)
    return (hasDrive(text) && text.size() >= 3 && isSeparator(text[2])) || isUnc(text);
#else
    return !text.empty() && isSeparator(text[0]);
#endif
}

// Number of leading characters of an absolute `text` that make up its root, and the root as
// the result writes it. On POSIX the root is "/" and every leading separator belongs to it
// ("//x" is "/x"). On Windows the root is the drive ("C:\") or the share ("\\server\share\"),
// with the separators that follow it; ".." cannot climb out of it.
std::size_t rootLength(const std::string& text, std::string& root) {
    std::size_t length = 0;
#if defined(_WIN32)
    if (isUnc(text)) {
        const std::size_t serverEnd = nextSeparator(text, 2);
        std::size_t shareStart = serverEnd;
        while (shareStart < text.size() && isSeparator(text[shareStart])) {
            ++shareStart;
        }
        const std::size_t shareEnd = nextSeparator(text, shareStart);
        root = "\\\\";
        root.append(text, 2, serverEnd - 2);
        root += os::kPathSeparator;
        if (shareEnd > shareStart) {
            root.append(text, shareStart, shareEnd - shareStart);
            root += os::kPathSeparator;
        }
        length = shareEnd;
    } else {
        root.assign(text, 0, 2);
        root += os::kPathSeparator;
        length = 2;
    }
#else
    root.assign(1, os::kPathSeparator);
#endif
    while (length < text.size() && isSeparator(text[length])) {
        ++length;
    }
    return length;
}

// The absolute `text` with "." and ".." components resolved and repeated separators
// collapsed, lexically: ".." at the root stays at the root. The result uses the platform's
// separator and ends in one only when it is the root.
std::string normalise(const std::string& text) {
    std::string result;
    const std::size_t start = rootLength(text, result);
    const std::size_t rootSize = result.size();

    // Offsets of the components kept so far, as (start, length) pairs into `text`.
    std::vector<std::pair<std::size_t, std::size_t>> kept;
    std::size_t position = start;
    while (position < text.size()) {
        std::size_t end = position;
        while (end < text.size() && !isSeparator(text[end])) {
            ++end;
        }
        const std::size_t length = end - position;
        const char* component = text.data() + position;
        if (length == 0 || (length == 1 && component[0] == '.')) {
            // An empty component (repeated separator) or "." adds nothing.
        } else if (length == 2 && component[0] == '.' && component[1] == '.') {
            if (!kept.empty()) {
                kept.pop_back();
            }
        } else {
            kept.emplace_back(position, length);
        }
        position = end + 1;
    }

    for (const auto& part : kept) {
        if (result.size() > rootSize) {
            result += os::kPathSeparator;
        }
        result.append(text, part.first, part.second);
    }
    return result;
}

// `text` completed with the working directory when it is relative (not yet normalised).
std::string completed(const std::string& text) {
    if (isAbsolute(text)) {
        return text;
    }
#if defined(_WIN32)
    if (hasDrive(text)) {
        // "D:x": relative to the working directory of drive D.
        std::string directory;
        std::string reason;
        if (!os::driveDirectory(text[0], directory, reason)) {
            throw std::runtime_error("cannot read the working directory of drive " +
                                     text.substr(0, 1) + ": " + reason);
        }
        return directory + os::kPathSeparator + text.substr(2);
    }
    if (!text.empty() && isSeparator(text[0])) {
        // "\x": rooted on the working directory's drive (or share).
        const std::string directory = File::getcwd().str();
        std::string root;
        rootLength(directory, root);
        return root + text;
    }
#endif
    std::string full = File::getcwd().str();
    full += os::kPathSeparator;
    full += text;
    return full;
}

}  // namespace

FileName::FileName(const StringBase<char>& text) {
    const std::size_t last = text.GetIndexOfLastChar('/', '\\');
    if (last == NPOS) {
        tail_ = text;
        return;
    }
    const std::string& bytes = text.str();
    head_ = StringBase<char>(bytes.data(), last + 1);
    tail_ = StringBase<char>(bytes.data() + last + 1, bytes.size() - last - 1);
}

FileName::FileName(const char* text) : FileName(StringBase<char>(text)) {}

StringBase<char> FileName::GetHead(bool native, bool absolute) const {
    if (absolute) {
        // The absolute form is native already.
        return FileName(GetAbsolutePath(false)).head_;
    }
    if (native) {
        return StringBase<char>(toNative(head_.str()));
    }
    return head_;
}

void FileName::SetHead(const StringBase<char>& head) {
    head_ = head;
    if (!head_.IsEmpty() && !isSeparator(head_.GetLastChar())) {
        head_ += os::kPathSeparator;
    }
}

void FileName::PushPathEnd(const StringBase<char>& components) {
    const std::string& text = components.str();
    std::size_t first = 0;
    std::size_t last = text.size();
    while (last > 0 && isSeparator(text[last - 1])) {
        --last;
    }
    if (last == 0) {
        // Nothing but separators (or nothing at all): only an empty head can take them, as
        // the root.
        if (head_.IsEmpty() && !text.empty()) {
            head_ = StringBase<char>(std::string(1, text[0]));
        }
        return;
    }
    if (!head_.IsEmpty()) {
        // The head ends in a separator already; a leading one of the components would double
        // it. With no head, a leading separator is kept: it makes the name absolute.
        while (first < last && isSeparator(text[first])) {
            ++first;
        }
    }
    head_.Append(text.data() + first, last - first);
    head_ += os::kPathSeparator;
}

void FileName::SetTail(const StringBase<char>& tail) {
    tail_ = tail;
}

StringBase<char> FileName::GetText() const {
    if (head_.IsEmpty()) {
        return tail_;
    }
    // The head ends in a separator: leading separators of the tail would double it.
    const std::string& tail = tail_.str();
    std::size_t first = 0;
    while (first < tail.size() && isSeparator(tail[first])) {
        ++first;
    }
    StringBase<char> text(head_);
    text.Append(tail.data() + first, tail.size() - first);
    return text;
}

StringBase<char> FileName::MakeNative() const {
    return StringBase<char>(toNative(GetText().str()));
}

StringBase<char> FileName::GetAbsolutePath(bool resolveLinks) const {
    const std::string full = completed(GetText().str());
    if (resolveLinks && std::memchr(full.data(), '\0', full.size()) == nullptr) {
        // The system resolves links and ".." in the order they appear (a ".." after a link
        // leaves the link's target), which the lexical form cannot know.
        std::string resolved;
        if (os::realPath(toNative(full), resolved)) {
            return StringBase<char>(std::move(resolved));
        }
    }
    return StringBase<char>(normalise(full));
}

char FileName::GetPathSeparator() {
    return os::kPathSeparator;
}

}  // namespace Port

// Port::File, Port::Stream and UT_DIR over the operating-system interface (Port_OS.h).
#include "Port_File.h"

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <stdexcept>
#include <string>
#include <utility>

#include "Port_OS.h"

namespace Port {

namespace {

// Reading uses one large buffer so that a line costs one memchr and one copy; files smaller
// than that get a buffer of their own size (plus room to see the end).
constexpr std::size_t kReadBufferSize = 256 * 1024;
constexpr std::size_t kSmallestReadBuffer = 4 * 1024;
constexpr std::size_t kWriteBufferSize = 64 * 1024;

// The name as the system is to see it: both separators made the platform's. False for a
// name that holds a NUL byte, since the system would see only its beginning and could act on
// a different file.
bool systemName(const StringBase<char>& name, std::string& result) {
    const std::string& text = name.str();
    if (text.find('\0') != std::string::npos) {
        return false;
    }
    result = text;
    for (char& c : result) {
        if (FileName::IsSeparator(c)) {
            c = os::kPathSeparator;
        }
    }
    return true;
}

// The reason of the last failed open or close of this thread.
thread_local StringBase<char> lastFailure;

// The system's text for an error code.
StringBase<char> systemReason(int code) {
    return StringBase<char>(std::strerror(code));
}

// Records why an operation failed and answers what it is to return.
template <typename Result>
Result failWith(StringBase<char> reason, Result result) {
    lastFailure = std::move(reason);
    return result;
}

// True when `text` can go to the system as it stands: no NUL byte, and only the platform's
// separator.
bool alreadyNative(const std::string& text) {
    constexpr char kOtherSeparator = os::kPathSeparator == '/' ? '\\' : '/';
    return text.find('\0') == std::string::npos && text.find(kOtherSeparator) == std::string::npos;
}

os::Kind kindOf(const StringBase<char>& name) {
    // Most names are native already: they are then passed without a copy.
    if (alreadyNative(name.str())) {
        return os::nameKind(name.str());
    }
    std::string native;
    return systemName(name, native) ? os::nameKind(native) : os::Kind::NONE;
}

}  // namespace

struct Stream::Impl {
    Impl(os::Handle h, StringBase<char> n, bool w, std::size_t size)
        : handle(h), name(std::move(n)), writable(w), buffer(new char[size]), capacity(size) {}
    Impl(const Impl&) = delete;
    Impl& operator=(const Impl&) = delete;
    ~Impl() {
        if (handle != os::INVALID_HANDLE) {
            os::closeFile(handle);
        }
    }

    // Moves the unread bytes to the front of the buffer and reads more behind them. True when
    // new bytes came; false at the end of the file or on a read error (both end reading).
    bool fill() {
        if (atEnd) {
            return false;
        }
        if (begin > 0) {
            std::memmove(buffer.get(), buffer.get() + begin, end - begin);
            end -= begin;
            begin = 0;
        }
        const std::int64_t count = os::readFile(handle, buffer.get() + end, capacity - end);
        if (count > 0) {
            end += static_cast<std::size_t>(count);
            return true;
        }
        atEnd = true;
        if (count < 0) {
            fail(errno);
        }
        return false;
    }

    // Writes the buffered bytes out. After a failure the stream refuses further writes: what
    // reached the file is unknown.
    bool writeOut() {
        if (failed) {
            return false;
        }
        if (end > 0) {
            const bool ok = os::writeFile(handle, buffer.get(), end);
            end = 0;
            if (!ok) {
                fail(errno);
                return false;
            }
        }
        return true;
    }

    // Marks the stream failed; the first failure's reason is kept.
    void fail(int code) {
        if (!failed) {
            failed = true;
            reason = systemReason(code);
        }
    }

    os::Handle handle;
    StringBase<char> name;
    StringBase<char> reason;  // why the first read or write failed
    bool writable;
    std::unique_ptr<char[]> buffer;
    std::size_t capacity;
    std::size_t begin = 0;  // reading: first unread byte
    std::size_t end = 0;    // reading: end of the bytes read; writing: bytes buffered
    bool atEnd = false;     // reading: the system has nothing more to give
    bool failed = false;    // a read or write failed
};

Stream::Stream(std::unique_ptr<Impl> impl) : impl_(std::move(impl)) {}
Stream::~Stream() = default;

std::int64_t Stream::readline(StringBase<char>& line) {
    line.Empty();
    if (impl_->writable) {
        return -1;
    }
    Impl& s = *impl_;
    bool gathered = false;
    for (;;) {
        if (s.begin == s.end && !s.fill()) {
            break;
        }
        const char* start = s.buffer.get() + s.begin;
        const std::size_t available = s.end - s.begin;
        const void* found = std::memchr(start, '\n', available);
        if (found != nullptr) {
            std::size_t length = static_cast<std::size_t>(static_cast<const char*>(found) - start);
            s.begin += length + 1;
            if (length > 0 && start[length - 1] == '\r') {
                --length;
            }
            line.Append(start, length);
            return static_cast<std::int64_t>(line.GetLength());
        }
        gathered = true;
        if (start[available - 1] == '\r') {
            // Whether this "\r" ends the line depends on the next byte: keep it unread so that
            // it meets that byte at the front of the buffer.
            line.Append(start, available - 1);
            s.begin = s.end - 1;
            if (!s.fill()) {
                // A lone "\r" at the end of the file is part of the last line.
                line.Append(1, '\r');
                s.begin = s.end;
                break;
            }
        } else {
            line.Append(start, available);
            s.begin = s.end;
        }
    }
    // The end of the file (or a read error) came before a line break: what was gathered is
    // the last line.
    return gathered ? static_cast<std::int64_t>(line.GetLength()) : -1;
}

std::size_t Stream::readblock(const char*& data) {
    data = nullptr;
    Impl& s = *impl_;
    if (s.writable || (s.begin == s.end && !s.fill())) {
        return 0;
    }
    data = s.buffer.get() + s.begin;
    const std::size_t size = s.end - s.begin;
    s.begin = s.end;
    return size;
}

bool Stream::geteof() {
    if (impl_->writable) {
        return true;
    }
    return impl_->begin == impl_->end && !impl_->fill();
}

bool Stream::write(const char* data, std::size_t length) {
    Impl& s = *impl_;
    if (!s.writable || s.failed) {
        return false;
    }
    if (length == 0) {
        return true;
    }
    if (length > s.capacity - s.end && !s.writeOut()) {
        return false;
    }
    if (length >= s.capacity) {
        // Larger than the buffer: straight to the file, after what was buffered before it.
        if (!os::writeFile(s.handle, data, length)) {
            s.fail(errno);
            return false;
        }
        return true;
    }
    std::memcpy(s.buffer.get() + s.end, data, length);
    s.end += length;
    return true;
}

bool Stream::flush() {
    // A stream opened for reading has nothing to write out.
    return !impl_->writable || impl_->writeOut();
}

bool Stream::writable() const {
    return impl_->writable;
}

const StringBase<char>& Stream::name() const {
    return impl_->name;
}

StringBase<char> Stream::error() const {
    return impl_->reason;
}

bool Stream::sync() {
    Impl& s = *impl_;
    if (!s.writable) {
        return failWith(systemReason(EBADF), false);
    }
    if (!s.writeOut()) {
        return failWith(s.reason, false);
    }
    if (!os::syncFile(s.handle)) {
        const int code = errno;
        s.fail(code);
        return failWith(systemReason(code), false);
    }
    return true;
}

bool Stream::setPermissions(std::uint32_t permissions) {
    return os::setHandlePermissions(impl_->handle, permissions) ||
           failWith(systemReason(errno), false);
}

bool Stream::setOwner(std::int64_t owner, std::int64_t group) {
    return os::setHandleOwner(impl_->handle, owner, group) || failWith(systemReason(errno), false);
}

Stream* File::open(const StringBase<char>& name, int access, bool binary) {
    os::OpenMode mode;
    switch (access) {
        case READ:
            mode = os::OpenMode::READ;
            break;
        case WRITE:
            mode = os::OpenMode::WRITE;
            break;
        case APPEND:
            mode = os::OpenMode::APPEND;
            break;
        default:
            return failWith<Stream*>(systemReason(EINVAL), nullptr);
    }
    std::string native;
    if (!systemName(name, native)) {
        return failWith<Stream*>(systemReason(EINVAL), nullptr);
    }
    const os::Handle handle = os::openFile(native, mode, binary);
    if (handle == os::INVALID_HANDLE) {
        // Windows refuses to open a directory with "Permission denied"; say what it is.
        const int code = errno;
        const bool directory = code == EACCES && os::nameKind(native) == os::Kind::DIRECTORY;
        return failWith<Stream*>(systemReason(directory ? EISDIR : code), nullptr);
    }
    // Some systems open a directory for reading; it has no bytes to give as lines. Nor is
    // anything else but a regular file read: a FIFO or a device may never end (/dev/zero is
    // one endless line) or wait for a writer for good.
    const os::Kind kind = os::handleKind(handle);
    if (kind == os::Kind::DIRECTORY || (mode == os::OpenMode::READ && kind != os::Kind::FILE)) {
        os::closeFile(handle);
        return failWith<Stream*>(kind == os::Kind::DIRECTORY
                                     ? systemReason(EISDIR)
                                     : StringBase<char>("Not a regular file"),
                                 nullptr);
    }
    std::size_t size = kWriteBufferSize;
    if (mode == os::OpenMode::READ) {
        size = kReadBufferSize;
        const std::int64_t fileSize = os::handleSize(handle);
        if (fileSize >= 0 && static_cast<std::uint64_t>(fileSize) < kReadBufferSize) {
            size = std::max(kSmallestReadBuffer, static_cast<std::size_t>(fileSize) + 1);
        }
    }
    // The Impl owns the handle from here, so that a failed allocation closes it.
    std::unique_ptr<Stream::Impl> impl(
        new Stream::Impl(handle, name, mode != os::OpenMode::READ, size));
    return new Stream(std::move(impl));
}

Stream* File::openStandardInput() {
    const os::Handle handle = os::duplicateStandardInput();
    if (handle == os::INVALID_HANDLE) {
        return failWith<Stream*>(systemReason(errno), nullptr);
    }
    // A pipe or a terminal is what standard input usually is; only a directory has no bytes.
    if (os::handleKind(handle) == os::Kind::DIRECTORY) {
        os::closeFile(handle);
        return failWith<Stream*>(systemReason(EISDIR), nullptr);
    }
    std::unique_ptr<Stream::Impl> impl(
        new Stream::Impl(handle, StringBase<char>("-"), false, kReadBufferSize));
    return new Stream(std::move(impl));
}

Stream* File::createTemporary(const StringBase<char>& target, StringBase<char>& name) {
    std::string native;
    if (!systemName(target, native) || native.empty()) {
        return failWith<Stream*>(systemReason(EINVAL), nullptr);
    }
    const std::size_t cut = native.find_last_of(os::kPathSeparator);
    const std::string directory =
        cut == std::string::npos ? std::string() : native.substr(0, cut + 1);
    const std::string base = cut == std::string::npos ? native : native.substr(cut + 1);
    const std::string stem = directory + "." + base + "." + std::to_string(os::processId()) + "-";
    for (int counter = 0; counter < 1000; ++counter) {
        const std::string candidate = stem + std::to_string(counter) + ".tmp";
        const os::Handle handle = os::createNewFile(candidate);
        if (handle != os::INVALID_HANDLE) {
            name.Assign(candidate.data(), candidate.size());
            std::unique_ptr<Stream::Impl> impl(
                new Stream::Impl(handle, name, true, kWriteBufferSize));
            return new Stream(std::move(impl));
        }
        if (errno != EEXIST) {
            break;
        }
    }
    return failWith<Stream*>(systemReason(errno), nullptr);
}

bool File::status(const StringBase<char>& name, FileStatus& status) {
    std::string native;
    if (!systemName(name, native) || native.empty()) {
        return failWith(systemReason(native.empty() ? ENOENT : EINVAL), false);
    }
    os::NameInfo info;
    if (!os::nameInfo(native, info)) {
        return failWith(systemReason(errno), false);
    }
    status.regular = info.kind == os::Kind::FILE;
    status.directory = info.kind == os::Kind::DIRECTORY;
    status.links = info.links;
    status.permissions = info.permissions;
    status.owner = info.owner;
    status.group = info.group;
    return true;
}

bool File::canwrite(const StringBase<char>& name) {
    std::string native;
    if (!systemName(name, native) || native.empty()) {
        return failWith(systemReason(EINVAL), false);
    }
    return os::canWrite(native) || failWith(systemReason(errno), false);
}

bool File::rename(const StringBase<char>& from, const StringBase<char>& to) {
    std::string nativeFrom;
    std::string nativeTo;
    if (!systemName(from, nativeFrom) || !systemName(to, nativeTo) || nativeFrom.empty() ||
        nativeTo.empty()) {
        return failWith(systemReason(EINVAL), false);
    }
    return os::renameFile(nativeFrom, nativeTo) || failWith(systemReason(errno), false);
}

bool File::remove(const StringBase<char>& name) {
    std::string native;
    if (!systemName(name, native) || native.empty()) {
        return failWith(systemReason(EINVAL), false);
    }
    return os::removeFile(native) || failWith(systemReason(errno), false);
}

bool File::syncDirectory(const StringBase<char>& directory) {
    std::string native;
    if (!systemName(directory, native)) {
        return failWith(systemReason(EINVAL), false);
    }
    return os::syncDirectory(native) || failWith(systemReason(errno), false);
}

StringBase<char> File::lastError() {
    return lastFailure;
}

bool File::close(Stream* stream) {
    if (stream == nullptr) {
        return failWith(systemReason(EINVAL), false);
    }
    Stream::Impl& s = *stream->impl_;
    bool ok = !s.writable || s.writeOut();
    const os::Handle handle = s.handle;
    s.handle = os::INVALID_HANDLE;
    if (!os::closeFile(handle) && ok) {
        s.fail(errno);
        ok = false;
    }
    if (!ok) {
        lastFailure = s.reason;
    }
    delete stream;
    return ok;
}

bool File::exist(const StringBase<char>& name) {
    return kindOf(name) != os::Kind::NONE;
}

bool File::exist(const FileName& name) {
    return exist(name.GetText());
}

bool File::isfile(const StringBase<char>& name) {
    return kindOf(name) == os::Kind::FILE;
}

bool File::isfile(const FileName& name) {
    return isfile(name.GetText());
}

bool File::isdir(const StringBase<char>& name) {
    return kindOf(name) == os::Kind::DIRECTORY;
}

bool File::isdir(const FileName& name) {
    return isdir(name.GetText());
}

bool File::canread(const StringBase<char>& name) {
    std::string native;
    return systemName(name, native) && os::canRead(native);
}

bool File::canread(const FileName& name) {
    return canread(name.GetText());
}

StringBase<char> File::getcwd() {
    std::string directory;
    std::string reason;
    if (!os::currentDirectory(directory, reason)) {
        throw std::runtime_error("cannot read the working directory: " + reason);
    }
    return StringBase<char>(std::move(directory));
}

bool File::chdir(const StringBase<char>& directory) {
    std::string native;
    return systemName(directory, native) && !native.empty() && os::changeDirectory(native);
}

}  // namespace Port

UT_DIR::UT_DIR(const Port::StringBase<char>& path, int filter) {
    if (filter != ALL && filter != DIRECTORIES && filter != FILES) {
        return;
    }
    std::string native;
    std::vector<Port::os::DirEntry> entries;
    if (!Port::systemName(path, native) || native.empty() ||
        !Port::os::readDirectory(native, entries)) {
        return;
    }
    open_ = true;
    names_.reserve(entries.size());
    for (auto& entry : entries) {
        const bool wanted = filter == ALL ||
                            (filter == DIRECTORIES && entry.kind == Port::os::Kind::DIRECTORY) ||
                            (filter == FILES && entry.kind == Port::os::Kind::FILE);
        if (wanted) {
            names_.emplace_back(std::move(entry.name));
        }
    }
    // Byte order: std::string compares as unsigned characters.
    std::sort(names_.begin(), names_.end());
}

UT_DIR::~UT_DIR() = default;

void UT_DIR::close() {
    names_.clear();
    open_ = false;
}

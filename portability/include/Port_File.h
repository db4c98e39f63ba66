// Files, streams and directory listings: Port::File, Port::Stream, UT_DIR.
//
// Every operation takes names as texts (or FileNames) and never throws for a name that does
// not exist or cannot be used: it answers false, or a null stream. Names are passed to the
// operating system unchanged except that "\" is read as a separator on every platform.
#ifndef PORT_FILE_H
#define PORT_FILE_H

#include <cstddef>
#include <cstdint>
#include <memory>
#include <vector>

#include "Port_Export.h"
#include "Port_FileName.h"
#include "Port_String.h"

namespace Port {

// A buffered byte stream on an open file, made by File::open and released by File::close.
class PORT_API Stream {
  public:
    Stream(const Stream&) = delete;
    Stream& operator=(const Stream&) = delete;

    // Reads the next line into `line` (replacing its content), without its terminator: a
    // line ends at "\n", and the "\r" of a "\r\n" end is dropped too. Lines may be of any
    // length and hold any byte, NUL included. Returns the number of characters stored, 0 for
    // an empty line, or -1 when nothing could be read (end of file or read error; `line` is
    // then empty).
    std::int64_t readline(StringBase<char>& line);
    std::int64_t readline(StringBase<char>* line) { return readline(*line); }
    // Lends the next bytes of the file without copying them: sets `data` to the bytes the
    // stream holds (reading more first when it holds none) and returns how many there are;
    // they count as read. Returns 0 (and sets `data` to null) at the end of the file, after a
    // read error, or on a stream opened for writing. The bytes stay valid until the next read
    // of any kind on the stream. Mixing it with readline is allowed: each sees the bytes the
    // other has not taken.
    std::size_t readblock(const char*& data);
    // True when nothing more can be read: at the end of the file, after a read error, or on
    // a stream opened for writing. A file that ends in a line break has no extra empty line.
    bool geteof();
    // Writes bytes (buffered). Returns false when the stream is not writable or the write
    // fails.
    bool write(const char* data, std::size_t length);
    bool write(const StringBase<char>& text) { return write(text.GetText(), text.GetLength()); }
    // Writes buffered bytes out. Returns false on failure.
    bool flush();
    // True when the stream was opened for writing or appending.
    bool writable() const;
    // The name the stream was opened with ("-" for standard input).
    const StringBase<char>& name() const;
    // Why the first failed read or write of this stream failed, in the system's words ("Input/
    // output error", "No space left on device"); empty while none has failed. A read error ends
    // reading just as the end of the file does; this tells the two apart.
    StringBase<char> error() const;

  private:
    friend class File;
    struct Impl;
    explicit Stream(std::unique_ptr<Impl> impl);
    ~Stream();
    std::unique_ptr<Impl> impl_;
};

// Static file services.
class PORT_API File {
  public:
    // Access values of open.
    enum Access : int {
        READ = 1,    // an existing file, read from the start
        WRITE = 2,   // created or truncated, written from the start
        APPEND = 3,  // created if needed, written at the end
    };

    // Opens `name` and returns a stream that the caller releases with close, or null when the
    // file cannot be opened (missing, a directory, no permission, or an unknown access value);
    // for reading, anything but a regular file (a FIFO, a device) is refused too, since it may
    // never end or wait for a writer for good.
    // `binary` true keeps the bytes as stored; false asks for the platform's text mode when
    // writing, which on Windows writes "\n" as "\r\n" and on POSIX changes nothing. Reading
    // always gives the bytes as stored (a Ctrl-Z byte does not end a file), so lines read either
    // way are the same, since readline drops the "\r" of "\r\n".
    static Stream* open(const StringBase<char>& name, int access, bool binary);
    // A stream for reading the process's standard input, over a duplicate of its descriptor
    // (so close leaves standard input itself open), whatever it is: a file, a pipe, a terminal.
    // Bytes come as sent (binary on Windows). Its name is "-". Null when standard input is
    // closed or is a directory. The caller releases it with close.
    static Stream* openStandardInput();
    // Writes out and closes the stream, and frees it in every case. Returns false when
    // writing out or closing failed, or when `stream` is null.
    static bool close(Stream* stream);
    // Why the last failed open, openStandardInput or close of the calling thread failed, in the
    // system's words: "No such file or directory", "Permission denied", "Is a directory",
    // "Not a regular file" (a FIFO or a device opened for reading), "Invalid argument" (an
    // unknown access value, a name holding a NUL byte or, on Windows, invalid UTF-8). The text
    // stays until the next failure of the thread; successful calls leave it as it is.
    static StringBase<char> lastError();

    // True for an existing file or directory (symbolic links followed).
    static bool exist(const StringBase<char>& name);
    static bool exist(const FileName& name);
    static bool exist(const char* name) { return exist(StringBase<char>(name)); }
    // True for an existing regular file.
    static bool isfile(const StringBase<char>& name);
    static bool isfile(const FileName& name);
    static bool isfile(const char* name) { return isfile(StringBase<char>(name)); }
    // True for an existing directory.
    static bool isdir(const StringBase<char>& name);
    static bool isdir(const FileName& name);
    static bool isdir(const char* name) { return isdir(StringBase<char>(name)); }
    // True when `name` exists and this process may read it.
    static bool canread(const StringBase<char>& name);
    static bool canread(const FileName& name);
    static bool canread(const char* name) { return canread(StringBase<char>(name)); }

    // The current working directory, absolute, without a trailing separator (except for the
    // root). Throws std::runtime_error when it cannot be read (for example when it has been
    // removed).
    static StringBase<char> getcwd();
    // Changes the working directory; true on success. A trailing separator is accepted.
    static bool chdir(const StringBase<char>& directory);
};

}  // namespace Port

class UT_DIR;

// Iterator over the entry names of a UT_DIR listing.
class PORT_API UT_DIR_ITERATOR {
  public:
    UT_DIR_ITERATOR(const UT_DIR* dir, std::size_t index) : dir_(dir), index_(index) {}
    // The entry's name (the final part only), valid while the listing lives.
    const char* operator*() const;
    UT_DIR_ITERATOR& operator++() {
        ++index_;
        return *this;
    }
    UT_DIR_ITERATOR operator++(int) {
        UT_DIR_ITERATOR old = *this;
        ++index_;
        return old;
    }
    bool operator!=(const UT_DIR_ITERATOR& other) const {
        return index_ != other.index_ || dir_ != other.dir_;
    }
    bool operator==(const UT_DIR_ITERATOR& other) const { return !(*this != other); }

  private:
    const UT_DIR* dir_;
    std::size_t index_;
};

// A snapshot listing of one directory, read at construction, sorted by name (byte order),
// without "." and "..". A path that is not a readable directory gives an empty listing.
class PORT_API UT_DIR {
  public:
    // What the listing holds.
    enum Filter : int {
        ALL = 0,          // every entry
        DIRECTORIES = 1,  // subdirectories only (symbolic links to directories included)
        FILES = 2,        // regular files only
    };
    UT_DIR(const Port::StringBase<char>& path, int filter);
    UT_DIR(const UT_DIR&) = delete;
    UT_DIR& operator=(const UT_DIR&) = delete;
    ~UT_DIR();

    UT_DIR_ITERATOR begin() const { return UT_DIR_ITERATOR(this, 0); }
    UT_DIR_ITERATOR end() const { return UT_DIR_ITERATOR(this, names_.size()); }
    std::size_t size() const { return names_.size(); }
    // True when the path could be read as a directory.
    bool isOpen() const { return open_; }
    // Drops the entries; the listing is then empty. Safe to call more than once.
    void close();

  private:
    friend class UT_DIR_ITERATOR;
    std::vector<Port::StringBase<char>> names_;
    bool open_ = false;
};

inline const char* UT_DIR_ITERATOR::operator*() const {
    return dir_->names_[index_].GetText();
}

#endif

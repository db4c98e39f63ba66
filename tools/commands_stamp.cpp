// tesutil stamp: writes or refreshes the "# CRC:" line of files.
//
// The library reads checksummed files but writes none; stamp is the writer. One silent scan of
// the file gives its checksum and where its checksum line is; the file is then copied, one
// block at a time, into a new temporary file beside it with only the checksum field changed
// (or a checksum line put first). The temporary file is made with an exclusive create, gets the
// file's owner, group and permissions, is synced, checked with the scan, and renamed over the
// file; the directory is synced after. So a crash, a power loss included, leaves the old file
// or the new one, and memory stays bounded whatever the file's size.
//
// Refused: anything but a regular file, a file the caller may not write, a file whose
// permissions let nobody write it (unless --force), and, unless --force, a file with more than
// one hard link or whose owner and group the new file cannot be given. With --force those last
// two are rewritten in place (their other names and their owner stay): the complete new text is
// written to the temporary file first and checked, then copied over the file.
#include <algorithm>
#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include <CLI/CLI.hpp>

#include "Port_File.h"
#include "Port_FileName.h"
#include "Port_String.h"
#include "Tesu_Utilities.h"
#include "tesutil_cli.h"

namespace tesutil {

namespace {

const char kMarker[] = "# CRC:";
constexpr std::size_t kMarkerLength = sizeof kMarker - 1;

struct StreamCloser {
    void operator()(Port::Stream* stream) const { Port::File::close(stream); }
};
using OpenStream = std::unique_ptr<Port::Stream, StreamCloser>;

struct StampOptions {
    NameSource names;
    bool force = false;
};

// A stamp that went wrong: what to say after the file's name.
struct StampFailure {
    std::string reason;
};

// The temporary file: removed when the stamp does not get as far as using it.
class Temporary {
  public:
    Temporary() = default;
    Temporary(const Temporary&) = delete;
    Temporary& operator=(const Temporary&) = delete;
    ~Temporary() {
        stream_.reset();
        if (!name_.IsEmpty() && !keep_) {
            Port::File::remove(name_);
        }
    }

    void Create(const Port::StringBase<char>& target) {
        stream_.reset(Port::File::createTemporary(target, name_));
        if (!stream_) {
            name_.Empty();
            throw StampFailure{"cannot create a temporary file beside it: " +
                               Port::File::lastError().str()};
        }
    }
    Port::Stream& stream() { return *stream_; }
    // Writes out, syncs and closes the file.
    void Finish() {
        const bool synced = stream_->sync();
        const std::string reason = synced ? std::string() : Port::File::lastError().str();
        const bool closed = Port::File::close(stream_.release());
        if (!synced || !closed) {
            throw StampFailure{"cannot write the temporary file " + name_.str() + ": " +
                               (synced ? Port::File::lastError().str() : reason)};
        }
    }
    const Port::StringBase<char>& name() const { return name_; }
    // The file is gone (renamed over the target) or is to stay where it is.
    void Release() { keep_ = true; }

  private:
    OpenStream stream_;
    Port::StringBase<char> name_;
    bool keep_ = false;
};

void Write(Port::Stream& out, const char* data, std::size_t size) {
    if (!out.write(data, size)) {
        throw StampFailure{"cannot write the temporary file " + out.name().str() + ": " +
                           out.error().str()};
    }
}

// Copies `target` to `out` with the checksum field set: the characters after the marker that
// the scan found (at most nine, up to the line's end) become " " and the checksum; without a
// marker, the line "# CRC: <checksum>" goes first, ended like the file's first line. Every
// other byte stays as it was.
void CopyStamped(const Port::StringBase<char>& target, const Tesu::ChecksumScan& scan,
                 Port::Stream& out) {
    const std::string field = " " + scan.checksum.str();
    std::uint64_t skipFrom = UINT64_MAX;
    std::uint64_t skipTo = UINT64_MAX;
    if (scan.marked) {
        skipFrom = scan.markerOffset + kMarkerLength;
        skipTo = skipFrom + scan.markerField.GetLength();
    } else {
        const std::string line =
            kMarker + field + (scan.firstLineBreak.str() == "\r\n" ? "\r\n" : "\n");
        Write(out, line.data(), line.size());
    }
    const OpenStream in(Port::File::open(target, Port::File::READ, true));
    if (!in) {
        throw StampFailure{Port::File::lastError().str()};
    }
    std::uint64_t offset = 0;  // of the block's first byte in the file
    bool fieldWritten = false;
    const char* data = nullptr;
    while (const std::size_t size = in->readblock(data)) {
        std::size_t index = 0;
        while (index < size) {
            const std::uint64_t position = offset + index;
            if (!fieldWritten && position == skipFrom) {
                Write(out, field.data(), field.size());
                fieldWritten = true;
            }
            std::size_t next = size;  // where the run of bytes that are copied or left ends
            if (position >= skipFrom && position < skipTo) {
                next = static_cast<std::size_t>(std::min<std::uint64_t>(size, skipTo - offset));
                index = next;  // the old field: left out
                continue;
            }
            if (position < skipFrom) {
                next = static_cast<std::size_t>(std::min<std::uint64_t>(size, skipFrom - offset));
            }
            Write(out, data + index, next - index);
            index = next;
        }
        offset += size;
    }
    if (!in->error().IsEmpty()) {
        throw StampFailure{"read error: " + in->error().str()};
    }
    if (scan.marked && !fieldWritten && offset == skipFrom) {
        // The marker ends the file.
        Write(out, field.data(), field.size());
        fieldWritten = true;
    }
    if (scan.marked && (!fieldWritten || offset < skipTo)) {
        throw StampFailure{"the file changed while it was being stamped; it is left as it was"};
    }
}

// Copies the checked temporary file over `target` in place, so that the file keeps its
// other names, its owner and its permissions.
void CopyBack(const Temporary& temporary, const Port::StringBase<char>& target) {
    const OpenStream in(Port::File::open(temporary.name(), Port::File::READ, true));
    if (!in) {
        throw StampFailure{"cannot read the temporary file " + temporary.name().str() + ": " +
                           Port::File::lastError().str()};
    }
    Port::Stream* opened = Port::File::open(target, Port::File::WRITE, true);
    if (opened == nullptr) {
        throw StampFailure{Port::File::lastError().str()};
    }
    OpenStream out(opened);
    const char* data = nullptr;
    while (const std::size_t size = in->readblock(data)) {
        if (!out->write(data, size)) {
            break;
        }
    }
    std::string reason = out->error().str();
    if (reason.empty() && !out->sync()) {
        reason = Port::File::lastError().str();
    }
    if (reason.empty() && !in->error().IsEmpty()) {
        reason = "read error in " + temporary.name().str() + ": " + in->error().str();
    }
    const bool closed = Port::File::close(out.release());
    if (reason.empty() && !closed) {
        reason = Port::File::lastError().str();
    }
    if (!reason.empty()) {
        throw StampFailure{"rewriting it in place failed (" + reason +
                           "); the stamped text is kept in " + temporary.name().str()};
    }
}

// Stamps one file; returns the checksum line's text when it was already right ("already") or
// has been written ("stamped").
std::string StampOne(const std::string& name, bool force, std::string& checksum) {
    // A symbolic link stays a link: the file it leads to is the one rewritten, in its own
    // directory.
    const Port::StringBase<char> target = Port::FileName(name).GetAbsolutePath(true);
    Port::FileStatus status;
    if (!Port::File::status(target, status)) {
        throw StampFailure{Port::File::lastError().str()};
    }
    if (status.directory) {
        throw StampFailure{"Is a directory"};
    }
    if (!status.regular) {
        throw StampFailure{"Not a regular file"};
    }
    // Whether the file may be written matters only once there is something to write.
    Tesu::ChecksumScan scan;
    if (Tesu::Utilities::ScanChecksummedFile(target, scan) != 0) {
        throw StampFailure{scan.reason.str()};
    }
    checksum = scan.checksum.str();
    if (scan.marked && scan.markerField.str() == " " + checksum) {
        return "already stamped";
    }
    if (!Port::File::canwrite(target)) {
        throw StampFailure{Port::File::lastError().str()};
    }
    if ((status.permissions & 0222) == 0 && !force) {
        throw StampFailure{"the file is read-only; --force stamps it all the same"};
    }
    bool inPlace = false;
    if (status.links > 1) {
        if (!force) {
            throw StampFailure{"it has " + std::to_string(status.links) +
                               " hard links, which replacing it would part from the new text; "
                               "--force rewrites it in place"};
        }
        inPlace = true;
    }

    Temporary temporary;
    temporary.Create(target);
    if (!inPlace && !temporary.stream().setOwner(status.owner, status.group)) {
        if (!force) {
            throw StampFailure{"the new file cannot be given the file's owner and group (" +
                               Port::File::lastError().str() + "); --force rewrites it in place"};
        }
        inPlace = true;
    }
    if (!inPlace && !temporary.stream().setPermissions(status.permissions)) {
        throw StampFailure{"the new file cannot be given the file's permissions: " +
                           Port::File::lastError().str()};
    }
    CopyStamped(target, scan, temporary.stream());
    temporary.Finish();

    Tesu::ChecksumScan check;
    if (Tesu::Utilities::ScanChecksummedFile(temporary.name(), check) != 0 || !check.valid ||
        !check.marked || check.checksum.str() != checksum) {
        throw StampFailure{"the stamped text does not pass the check; the file is left as it was"};
    }
    if (inPlace) {
        try {
            CopyBack(temporary, target);
        } catch (const StampFailure&) {
            temporary.Release();
            throw;
        }
        return "stamped";
    }
    if (!Port::File::rename(temporary.name(), target)) {
        throw StampFailure{"cannot replace it: " + Port::File::lastError().str()};
    }
    temporary.Release();
    const Port::StringBase<char> directory = Port::FileName(target).GetHead(true);
    if (!Port::File::syncDirectory(directory)) {
        throw StampFailure{"stamped, but its directory could not be synced: " +
                           Port::File::lastError().str()};
    }
    return "stamped";
}

}  // namespace

void AddStampCommand(CLI::App& tool, Commands& commands, const char* group) {
    auto options = std::make_shared<StampOptions>();
    Command& stamp = AddCommand(
        tool, commands, group, "stamp", "write or refresh the \"# CRC:\" line of files",
        "Sets the checksum line of each file to the checksum of its content: the line that "
        "holds the first \"# CRC:\" is refreshed in place; a file without one gets "
        "\"# CRC: <checksum>\" as its first line. Line ends are kept (CR-LF stays CR-LF). "
        "Prints \"<file>: stamped (# CRC: <checksum>)\" or \"<file>: already stamped (...)\". "
        "The new text goes to a temporary file beside the file (same owner, group and "
        "permissions), which is synced, checked and renamed over it; a symbolic link stays "
        "a link to the stamped file. Refused: a file you may not write, a read-only file, "
        "a file with several hard links, a file whose owner cannot be kept; with --force "
        "the last three are stamped (the last two rewritten in place, from a checked "
        "temporary copy). Exit status 1 when any file cannot be stamped.");
    AddNameOptions(stamp, options->names, "the files");
    stamp.app->add_flag("-f,--force", options->force,
                        "stamp read-only and hard-linked files too (see below)");
    stamp.run = [options] {
        CheckNames(options->names);
        return ForEachName("stamp", options->names, [options](const std::string& name) {
            std::string checksum;
            std::string done;
            try {
                if (name == "-") {
                    throw StampFailure{"standard input cannot be stamped"};
                }
                done = StampOne(name, options->force, checksum);
            } catch (const StampFailure& failure) {
                FailFile("stamp", name, failure.reason);
                return false;
            }
            PrintLine(NameLine(name, ": " + done + " (" + kMarker + ' ' + checksum + ")"));
            return true;
        });
    };
}

}  // namespace tesutil

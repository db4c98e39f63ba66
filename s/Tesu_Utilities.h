// Tesu::Utilities: path texts, installation search, identity and versions, checksummed
// files and file lists. Every operation is static, runs on the caller's thread and keeps no
// state; every text, vector and file name returned belongs to the caller.
#ifndef TESU_UTILITIES_H
#define TESU_UTILITIES_H

#include <cstdint>
#include <vector>

#include "Port_FileName.h"
#include "Port_String.h"
#include "Tesu_Export.h"

namespace Port {
class Stream;
}

namespace Tesu {

// What one pass over a checksummed file found: everything ValidateFileChecksum decides on,
// and where the checksum line stands, for a writer that is to set it. Filled by
// Utilities::ScanChecksummedFile and ScanChecksummedStream; owned by the caller.
struct ChecksumScan {
    // CRC-32 of the lines that hold no "#", joined, and its eight-character text (what
    // CalculateChecksum gives for the same lines).
    std::uint32_t crc = 0;
    Port::StringBase<char> checksum;
    // True when the file holds "# CRC:"; then `markerOffset` is the byte offset of the first
    // marker's "#" in the file, and `markerField` holds the characters that follow the marker
    // on its line, at most nine (the skipped character and the eight of the checksum), without
    // the line break or the "\r" of a CR-LF end.
    bool marked = false;
    std::uint64_t markerOffset = 0;
    Port::StringBase<char> markerField;
    // The stored checksum text as ValidateFileChecksum reads it (run on across line breaks,
    // shorter when the file ends first), and ValidateFileChecksum's verdict on the content.
    Port::StringBase<char> stored;
    bool valid = true;
    // How the file's first line ends: "\n", "\r\n", or empty when the file holds no "\n".
    Port::StringBase<char> firstLineBreak;
    // The system's reason when the scan did not succeed ("No such file or directory").
    Port::StringBase<char> reason;
};

class TESU_API Utilities {
  public:
    Utilities() = delete;

    // ---- Path texts ----------------------------------------------------------------------
    // "/" and "\" both count as trailing separators on every platform; a separator added is
    // the platform's. These ask the file system only whether a name is an existing regular
    // file or directory (symbolic links followed, never resolved in the text), and issue
    // nothing. Absolute forms are lexical ("." and ".." resolved, repeated separators
    // collapsed); a relative text is taken from the working directory, and when that cannot
    // be read the layer's std::runtime_error passes to the caller.

    // True when `path` ends in "/" or "\"; false for the empty text.
    static bool IsTerminatedWithPathSeparator(const Port::StringBase<char>& path);
    // `path` with one platform separator appended, unless it is empty, already ends in a
    // separator, or names an existing regular file.
    static Port::StringBase<char> TerminateWithPathSeparator(const Port::StringBase<char>& path);
    // The absolute, normalised form of `path`, ending in a separator when it is an existing
    // directory; empty for the empty text.
    static Port::StringBase<char> GetAbsolutePath(const Port::StringBase<char>& path);
    // The absolute directory that `path` denotes, ending in a separator: the directory itself,
    // or for a file or a name that does not exist, its parent.
    static Port::StringBase<char> GetAbsoluteDirectory(const Port::StringBase<char>& path);
    // `path` relative to GetAbsoluteDirectory(base): when the absolute text of `path` begins
    // with that directory's text (byte for byte), that leading part alone is replaced by "."
    // and a platform separator ("./src/top.v"; "./" for the base itself); otherwise, and for
    // an empty `base`, the absolute text of `path`. Since the directory ends in a separator,
    // a sibling whose name merely begins with the base's name is not under it. Empty for an
    // empty `path`. Never produces "..".
    static Port::StringBase<char> MakeRelativePath(const Port::StringBase<char>& base,
                                                   const Port::StringBase<char>& path);

    // ---- Installation search -------------------------------------------------------------
    // Each returns true and sets the output to the absolute path of the first match, in the
    // order of the installation roots (Port::QuarnelPath); false leaves the output untouched.
    // A match may be a file or a directory. Traces at verbose level on the logger "utilities".

    // Looks for `relativeName` directly under each root. An empty name finds the first root
    // that exists as a directory.
    static bool GetFullQuarnelPathOf(const Port::StringBase<char>& relativeName,
                                     Port::StringBase<char>& fullPath);
    // Looks for `relativeName` inside each subdirectory (in name order) of the IP container
    // "tessel/ip/quarnel" under each root; never in the container itself or under a root.
    static bool GetFullQuarnelPathWithContainer(const Port::StringBase<char>& relativeName,
                                                Port::StringBase<char>& fullPath);
    // Finds the shipped Java runtime: <sep>java<sep><platform><sep>jre<sep>bin<sep>java (with
    // ".exe" on Windows) under the roots.
    static bool GetJavaExecutablePath(Port::StringBase<char>& javaPath);

    // ---- Identity and versions -----------------------------------------------------------
    // "Quarnel Tessel".
    static Port::StringBase<char> ApplicationName();
    // The layer's version value "version", unchanged.
    static Port::StringBase<char> RevisionVersion();
    // This library's build date, "Mmm dd yyyy" (day padded with a blank), and build time,
    // "hh:mm:ss". Static texts; never freed by the caller.
    static const char* GetBuildDate();
    static const char* GetBuildTime();
    // The major part of the version value plus one, followed by ".1" ("9.2.0" gives "10.1"; an
    // empty major gives "1.1"; "2147483647.0" gives "2147483648.1"; a major that is not a
    // 32-bit number is kept: "x.2" gives "x.1"). Empty when the version cannot be split
    // (traced "Failed to split extract major version from <version>" and a full stop) or when
    // the computing fails (traced "Unable to calculate the next major release after
    // <version>" and a full stop); traces are at verbose level on "utilities". Exceptions of
    // the version table itself pass to the caller.
    static Port::StringBase<char> NextMajorRelease();

    // ---- Checksummed files ---------------------------------------------------------------
    // A checksummed file carries "# CRC:", one skipped character and eight characters: the
    // "%8x" text (lower-case hexadecimal, padded with blanks) of the CRC-32 of its lines that
    // hold no "#", joined without separators. Every byte of those lines counts, NUL bytes
    // included; the line reader drops the "\r" of a CR-LF end, so CR-LF and LF files agree.

    // Sets `checksum` to the eight-character checksum text of `text` (lines separated by
    // "\n"). Returns 0.
    static unsigned int CalculateChecksum(const Port::StringBase<char>& text,
                                          Port::StringBase<char>& checksum);
    // Checks the file `fileName` against its own checksum line: the first "# CRC:" anywhere
    // counts, and its eight characters are read on across line breaks (each line followed by
    // "\n") when the line ends first. Returns 0 when the file was read and closed, with
    // `verdict` true when it holds no "# CRC:" or the stored text matches (letter case
    // ignored), false otherwise; returns 1 with `verdict` false when it cannot be opened
    // (error "Could not open <name>") or closed (error "Could not close <name>"), naming the
    // file as passed. The file is read in one pass with a fixed amount of memory (well under
    // 1 MiB), whatever its size and the length of its lines.
    static unsigned int ValidateFileChecksum(const Port::StringBase<char>& fileName, bool& verdict);
    // Reads the file `fileName` as ValidateFileChecksum does and fills `scan` (every field set
    // anew), issuing no message; memory use is bounded as there. Returns 0 when the file was
    // read and closed; 1 when it could not be opened; 2 when a read or the close failed (the
    // fields then describe the bytes read before the failure). `scan.reason` says why for 1
    // and 2 and is empty for 0.
    static unsigned int ScanChecksummedFile(const Port::StringBase<char>& fileName,
                                            ChecksumScan& scan);
    // The same over the rest of an open stream (standard input, say), which stays open and
    // stays the caller's. Returns 0, or 2 when a read failed (`scan.reason` says why).
    static unsigned int ScanChecksummedStream(Port::Stream& stream, ChecksumScan& scan);

    // ---- File lists ----------------------------------------------------------------------
    // A file list names one member per line, relative to the list's directory; "#" starts a
    // comment, tabs count as blanks, blanks around a member are dropped, "/" and "\" are both
    // separators (normalised to the platform's, runs collapsed). Missing members are left
    // out with the warning "Missing file list member <absolute path>". An unreadable list gives
    // the error "Cannot read <absolute path>", one that does not open "Cannot open <...>", and
    // an empty result; a list that does not close gives "Cannot close <...>" and the members
    // all the same. Traces "Reading file list <absolute path>" at normal level on
    // "utilities". Every member is joined to the list's directory part (GetHead(true, false)),
    // also one that is itself absolute; a directory counts as an existing member. A member
    // holding a NUL byte names no file (the layer refuses such names rather than cut them at
    // the NUL): it is left out with the warning, which shows its text up to the NUL.

    // The cleaned member texts of every existing member, in list order (repeats kept).
    static std::vector<Port::StringBase<char>> GetFileListFileStrings(const Port::FileName& list);
    // The same members as file names: the list's directory part followed by the member text
    // (not made absolute; existence is not tested again).
    static std::vector<Port::FileName> GetFileListFileNames(const Port::FileName& list);
};

}  // namespace Tesu

#endif

#include "Tesu_Utilities.h"

#include <cstdint>
#include <cstring>
#include <exception>
#include <string>
#include <vector>

#include "Port_Env.h"
#include "Port_File.h"
#include "Port_FileName.h"
#include "Port_Init.h"
#include "Port_Msg.h"
#include "Port_PathList.h"
#include "Port_String.h"
#include "Port_Version.h"
#include "Tesu_ChecksumScanner.h"
#include "Tesu_DebugMessenger.h"
#include "Tesu_FileListMember.h"

TESU_MODULE_PORTABILITY_INIT("Tesu_Utilities")

namespace Tesu {

namespace {

// Identity of this module's user-visible messages.
constexpr const char* kApplication = "tesutil";
constexpr const char* kSourcePath = "../s/Tesu_Utilities";
constexpr const char* kRevision = "$Revision: 1.37.14.1 $";

// A message source for a message issued at `line` of this module.
Port_MsgManData messageSource(int line) {
    return Port_MsgManData::createObject(kApplication, kSourcePath, line, kRevision);
}

}  // namespace

// ==== Path texts =============================================================================
namespace {

// The native text of `path`: its separators turned into the platform's.
Port::StringBase<char> nativeText(const Port::StringBase<char>& path) {
    return Port::FileName(path).MakeNative();
}

// The absolute, lexically normalised text of `path`; symbolic links are kept.
Port::StringBase<char> absoluteText(const Port::StringBase<char>& path) {
    return Port::FileName(path).GetAbsolutePath(false);
}

}  // namespace

bool Utilities::IsTerminatedWithPathSeparator(const Port::StringBase<char>& path) {
    if (path.IsEmpty()) {
        return false;
    }
    const std::size_t last = path.GetLength() - 1;
    return path.GetIndexOfLastChar('\\') == last || path.GetIndexOfLastChar('/') == last;
}

Port::StringBase<char> Utilities::TerminateWithPathSeparator(const Port::StringBase<char>& path) {
    Port::StringBase<char> result(path);
    if (path.IsEmpty() || IsTerminatedWithPathSeparator(path)) {
        return result;
    }
    if (Port::File::isfile(nativeText(path))) {
        return result;
    }
    // An existing directory, or a name that does not exist (or cannot be examined): the
    // caller's own text gets the separator, not its native form.
    result.Append(1, Port::FileName::GetPathSeparator());
    return result;
}

namespace {

// Where both absolute operations start, for a non-empty `path`: its native text, with a
// separator added when it names an existing directory, made absolute. `directory` tells
// whether it named one.
Port::StringBase<char> absoluteForm(const Port::StringBase<char>& path, bool& directory) {
    Port::StringBase<char> native = nativeText(path);
    directory = Port::File::isdir(native);
    if (directory) {
        native = Utilities::TerminateWithPathSeparator(native);
    }
    return absoluteText(native);
}

}  // namespace

Port::StringBase<char> Utilities::GetAbsolutePath(const Port::StringBase<char>& path) {
    if (path.IsEmpty()) {
        return Port::StringBase<char>();
    }
    bool directory = false;
    // The absolute form drops a trailing separator; a directory gets it back.
    const Port::StringBase<char> absolute = absoluteText(absoluteForm(path, directory));
    return directory ? TerminateWithPathSeparator(absolute) : absolute;
}

Port::StringBase<char> Utilities::GetAbsoluteDirectory(const Port::StringBase<char>& path) {
    if (path.IsEmpty()) {
        return Port::StringBase<char>();
    }
    bool directory = false;
    const Port::StringBase<char> absolute = absoluteForm(path, directory);
    if (directory) {
        return TerminateWithPathSeparator(absoluteText(absolute));
    }
    // A file, or a name that does not exist: its parent. The head ends in a separator, so a
    // sibling whose name merely begins with this directory's name never counts as inside it.
    return Port::FileName(absolute).GetHead(false, false);
}

Port::StringBase<char> Utilities::MakeRelativePath(const Port::StringBase<char>& base,
                                                   const Port::StringBase<char>& path) {
    const Port::StringBase<char> baseDirectory = GetAbsoluteDirectory(base);
    if (path.IsEmpty()) {
        return Port::StringBase<char>();
    }
    const Port::StringBase<char> absolute = GetAbsolutePath(path);
    const std::size_t baseLength = baseDirectory.GetLength();
    if (baseLength == 0 || absolute.str().compare(0, baseLength, baseDirectory.str()) != 0) {
        return absolute;
    }
    // Only the leading copy of the base is replaced; the same text further on stays as it is.
    Port::StringBase<char> relative(".");
    relative.Append(1, Port::FileName::GetPathSeparator());
    relative.Append(absolute.Extract(Port_Range{baseLength, Port::NPOS}));
    return relative;
}

// ==== Installation search ====================================================================
namespace {

// The IP container under an installation root; one text, with slashes on every platform.
constexpr const char* kIpContainer = "tessel/ip/quarnel";

// A candidate counts as present when it is a directory or a regular file.
bool isPresent(const Port::FileName& candidate) {
    return Port::File::isdir(candidate) || Port::File::isfile(candidate);
}

void traceFound(DebugMessenger* logger, const Port::StringBase<char>& relativeName,
                const Port::StringBase<char>& fullPath) {
    Port::StringBase<char> text;
    text.Format("Looking for %s\nFound %s\n", relativeName.GetText(), fullPath.GetText());
    logger->Verbose(text);
}

void traceMissing(DebugMessenger* logger, const Port::StringBase<char>& relativeName) {
    Port::StringBase<char> text;
    text.Format("Could not find %s\n", relativeName.GetText());
    logger->Verbose(text);
}

}  // namespace

bool Utilities::GetFullQuarnelPathOf(const Port::StringBase<char>& relativeName,
                                     Port::StringBase<char>& fullPath) {
    DebugMessenger* logger = DebugMessengerFactory::GetLogger("utilities");
    const Port::PathList& roots = Port::QuarnelPath::GetInstance();
    for (Port::PathListIterator root = roots.begin(); root != roots.end(); ++root) {
        Port::FileName candidate;
        candidate.SetHead(*root);
        candidate.SetTail(relativeName);
        if (isPresent(candidate)) {
            fullPath = candidate.GetAbsolutePath(false);
            traceFound(logger, relativeName, fullPath);
            return true;
        }
    }
    traceMissing(logger, relativeName);
    return false;
}

bool Utilities::GetFullQuarnelPathWithContainer(const Port::StringBase<char>& relativeName,
                                                Port::StringBase<char>& fullPath) {
    DebugMessenger* logger = DebugMessengerFactory::GetLogger("utilities");
    const Port::PathList& roots = Port::QuarnelPath::GetInstance();
    for (Port::PathListIterator root = roots.begin(); root != roots.end(); ++root) {
        Port::FileName container;
        container.SetHead(*root);
        container.PushPathEnd(kIpContainer);
        if (!isPresent(container)) {
            continue;
        }
        // Only the container's subdirectories are searched, never the container itself.
        UT_DIR entries(container.GetAbsolutePath(false), UT_DIR::DIRECTORIES);
        for (UT_DIR_ITERATOR entry = entries.begin(); entry != entries.end(); ++entry) {
            Port::FileName candidate(container);
            candidate.PushPathEnd(*entry);
            candidate.SetTail(relativeName);
            if (isPresent(candidate)) {
                fullPath = candidate.GetAbsolutePath(false);
                traceFound(logger, relativeName, fullPath);
                entries.close();
                return true;
            }
        }
        entries.close();
    }
    traceMissing(logger, relativeName);
    return false;
}

bool Utilities::GetJavaExecutablePath(Port::StringBase<char>& javaPath) {
    const char separator = Port::FileName::GetPathSeparator();
    Port::StringBase<char> relativeName;
    relativeName.Append(1, separator).Append("java").Append(1, separator);
    relativeName.Append(Port_Env::GetPlatformPath());
    relativeName.Append(1, separator).Append("jre").Append(1, separator).Append("bin");
    relativeName.Append(1, separator).Append("java");
    if (Port_Env::IsNt()) {
        relativeName.Append(".exe");
    }
    return GetFullQuarnelPathOf(relativeName, javaPath);
}

// ==== Identity and versions ==================================================================
namespace {

// The compiler's stamps of this module's build: "Mmm dd yyyy" and "hh:mm:ss".
constexpr char kBuildDate[] = __DATE__;
constexpr char kBuildTime[] = __TIME__;

}  // namespace

Port::StringBase<char> Utilities::ApplicationName() {
    return Port::StringBase<char>("Quarnel Tessel");
}

Port::StringBase<char> Utilities::RevisionVersion() {
    return Port::Version::getValue("version");
}

const char* Utilities::GetBuildDate() {
    return kBuildDate;
}

const char* Utilities::GetBuildTime() {
    return kBuildTime;
}

Port::StringBase<char> Utilities::NextMajorRelease() {
    DebugMessenger* logger = DebugMessengerFactory::GetLogger("utilities");
    Port::StringBase<char> result;
    const Port::StringBase<char> version = Port::Version::getValue("version");
    Port::StringBase<char> major;
    Port::StringBase<char> minor;
    Port::StringBase<char> rest;
    if (!Port::Version::splitVersion(version, major, minor, rest)) {
        Port::StringBase<char> text;
        text.Format("Failed to split extract major version from %s\n.", version.GetText());
        logger->Verbose(text);
        return result;
    }
    try {
        Port::StringBase<char> next;
        std::int32_t number = 0;
        if (major.IsEmpty()) {
            next = "1";
        } else if (major.GetINT32(Port_Range{0, major.GetLength()}, number)) {
            // Widened first, so that the largest major still has a successor.
            next.Format("%lld", static_cast<long long>(number) + 1);
        } else {
            next = major;  // not a number: kept as it stands
        }
        next.Append(".1");
        result = next;
    } catch (...) {
        result.Empty();
        Port::StringBase<char> text;
        text.Format("Unable to calculate the next major release after %s\n.", version.GetText());
        logger->Verbose(text);
    }
    return result;
}

// ==== Checksummed files ======================================================================
namespace {

// Closes a stream on the way out when an exception leaves the reading code, so that a
// failure in the layer never leaks the open file. The normal path closes explicitly (its
// result is reported) and then releases the guard.
class StreamCloser {
  public:
    explicit StreamCloser(Port::Stream* stream) : stream_(stream) {}
    ~StreamCloser() {
        if (stream_ != nullptr) {
            Port::File::close(stream_);
        }
    }
    StreamCloser(const StreamCloser&) = delete;
    StreamCloser& operator=(const StreamCloser&) = delete;
    // Closes the stream now; true when the close succeeded.
    bool close() {
        Port::Stream* stream = stream_;
        stream_ = nullptr;
        return Port::File::close(stream);
    }

  private:
    Port::Stream* stream_;
};

// The eight-character text of a checksum: lower-case hexadecimal, padded with blanks.
Port::StringBase<char> ChecksumText(std::uint32_t crc) {
    Port::StringBase<char> text;
    text.Format("%8x", static_cast<unsigned int>(crc));
    return text;
}

// Reads the rest of `stream` into `result`, a block at a time, in one pass with fixed memory
// (checksumscan::Scanner). The CRC and the stored text say nothing yet of the file's verdict
// when a read failed; the caller decides what that means.
void ScanStream(Port::Stream& stream, ChecksumScan& result) {
    checksumscan::Scanner scanner;
    const char* block = nullptr;
    for (std::size_t size = stream.readblock(block); size > 0; size = stream.readblock(block)) {
        scanner.Block(block, size);
    }
    scanner.Finish();
    result.crc = scanner.Crc();
    result.checksum = ChecksumText(result.crc);
    result.marked = scanner.Marked();
    result.markerOffset = scanner.MarkerOffset();
    result.markerField = scanner.MarkerField();
    result.stored = scanner.Stored();
    result.valid =
        !result.marked || result.stored.Compare(result.checksum, Port::COMPARE_NOCASE) == 0;
    result.firstLineBreak = scanner.FirstLineBreak();
    result.reason = stream.error();
}

// How a scan of a named file ended.
enum class ScanEnd { READ, NOT_OPENED, READ_FAILED, CLOSE_FAILED };

// Opens, scans and closes `fileName`, with `result.reason` set unless it was READ.
ScanEnd ScanFile(const Port::StringBase<char>& fileName, ChecksumScan& result) {
    result = ChecksumScan();
    Port::Stream* stream = Port::File::open(fileName, Port::File::READ, true);
    if (stream == nullptr) {
        result.reason = Port::File::lastError();
        return ScanEnd::NOT_OPENED;
    }
    StreamCloser closer(stream);
    // One pass over the lines; only a bounded batch of them is held at any time.
    ScanStream(*stream, result);
    const bool readFailed = !result.reason.IsEmpty();
    if (!closer.close()) {
        if (!readFailed) {
            result.reason = Port::File::lastError();
        }
        return ScanEnd::CLOSE_FAILED;
    }
    return readFailed ? ScanEnd::READ_FAILED : ScanEnd::READ;
}

}  // namespace

unsigned int Utilities::CalculateChecksum(const Port::StringBase<char>& text,
                                          Port::StringBase<char>& checksum) {
    // The CRC is continued line by line, which equals the CRC of the data lines joined.
    std::uint32_t crc = 0;
    for (const Port::StringBase<char>& line : text.Split("\n", true, "", "")) {
        if (line.GetIndexOfFirstChar('#', '\0') == Port::NPOS) {
            crc = Port::StringBase<char>::CRC32(crc, line.GetText(), line.GetLength());
        }
    }
    checksum = ChecksumText(crc);
    return 0;
}

unsigned int Utilities::ValidateFileChecksum(const Port::StringBase<char>& fileName,
                                             bool& verdict) {
    ChecksumScan scan;
    switch (ScanFile(fileName, scan)) {
        case ScanEnd::NOT_OPENED:
            messageSource(__LINE__).issueError("Could not open %s\n", fileName.GetText());
            verdict = false;
            return 1;
        case ScanEnd::CLOSE_FAILED:
            messageSource(__LINE__).issueError("Could not close %s\n", fileName.GetText());
            verdict = false;
            return 1;
        case ScanEnd::READ:
        case ScanEnd::READ_FAILED:
            // A read error ends the lines as the end of the file does.
            break;
    }
    verdict = scan.valid;
    return 0;
}

unsigned int Utilities::ScanChecksummedFile(const Port::StringBase<char>& fileName,
                                            ChecksumScan& scan) {
    switch (ScanFile(fileName, scan)) {
        case ScanEnd::READ:
            return 0;
        case ScanEnd::NOT_OPENED:
            return 1;
        case ScanEnd::READ_FAILED:
        case ScanEnd::CLOSE_FAILED:
            break;
    }
    return 2;
}

unsigned int Utilities::ScanChecksummedStream(Port::Stream& stream, ChecksumScan& scan) {
    scan = ChecksumScan();
    ScanStream(stream, scan);
    return scan.reason.IsEmpty() ? 0 : 2;
}

// ==== File lists =============================================================================
std::vector<Port::StringBase<char>> Utilities::GetFileListFileStrings(const Port::FileName& list) {
    std::vector<Port::StringBase<char>> members;
    const Port::StringBase<char> directory = list.GetHead(true, false);
    DebugMessenger* logger = DebugMessengerFactory::GetLogger("utilities");

    if (!Port::File::canread(list)) {
        messageSource(__LINE__).issueError("Cannot read %s\n",
                                           list.GetAbsolutePath(false).GetText());
        return members;
    }
    Port::Stream* stream = Port::File::open(list.GetText(), Port::File::READ, false);
    if (stream == nullptr) {
        messageSource(__LINE__).issueError("Cannot open %s\n",
                                           list.GetAbsolutePath(false).GetText());
        return members;
    }
    StreamCloser closer(stream);
    if (logger->IsNormal()) {
        Port::StringBase<char> trace;
        trace.Format("Reading file list %s\n", list.GetAbsolutePath(false).GetText());
        logger->Normal(trace);
    }

    const bool windowsNt = Port_Env::IsNt();
    Port::StringBase<char> line;
    Port::StringBase<char> joined;  // the directory part and the member, reused from line to line
    while (!stream->geteof()) {
        if (stream->readline(line) > 0) {
            const std::size_t comment = line.GetIndexOfFirstChar('#', '\0');
            if (comment == 0) {
                line.Empty();
            } else if (comment != Port::NPOS) {
                line.Assign(line.Extract(Port_Range{0, comment - 1}));
            }
            line.ReplaceChars('\t', ' ');
            line.Trim(" \t", Port::TRIM_BOTH);
        }
        if (line.IsEmpty()) {
            continue;
        }
        FileListMember::NormaliseSeparators(line, windowsNt);
        // The joined text is the file name's text (a FileName made of it gives it back
        // unchanged), so it is tested as it stands; a FileName is made only for the warning.
        joined.Assign(directory);
        joined.Append(line);
        if (Port::File::exist(joined)) {
            members.push_back(line);
        } else {
            messageSource(__LINE__).issueWarning(
                "Missing file list member %s\n",
                Port::FileName(joined).GetAbsolutePath(false).GetText());
        }
    }

    if (!closer.close()) {
        messageSource(__LINE__).issueError("Cannot close %s\n",
                                           list.GetAbsolutePath(false).GetText());
    }
    return members;
}

std::vector<Port::FileName> Utilities::GetFileListFileNames(const Port::FileName& list) {
    const Port::StringBase<char> directory = list.GetHead(true, false);
    std::vector<Port::FileName> names;
    for (const Port::StringBase<char>& member : GetFileListFileStrings(list)) {
        names.emplace_back(directory + member);
    }
    return names;
}

}  // namespace Tesu

#if defined(_WIN32)
// The library's entry: thread attach and detach notifications are not wanted. The layer makes
// the system call, so that no operating-system header is needed here.
extern "C" int __stdcall DllMain(void* instance, unsigned long reason, void* /*reserved*/) {
    constexpr unsigned long kProcessAttach = 1;  // DLL_PROCESS_ATTACH
    if (reason == kProcessAttach) {
        Port::DisableThreadNotifications(instance);
    }
    return 1;
}
#endif

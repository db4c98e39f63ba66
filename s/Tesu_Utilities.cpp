#include "Tesu_Utilities.h"

#include <cstdint>
#include <cstring>
#include <exception>
#include <vector>

#include "Port_Env.h"
#include "Port_File.h"
#include "Port_FileName.h"
#include "Port_Init.h"
#include "Port_Msg.h"
#include "Port_PathList.h"
#include "Port_String.h"
#include "Port_Version.h"
#include "Tesu_DebugMessenger.h"
#include "Tesu_FileListMember.h"

#if defined(_WIN32)
#include <windows.h>
#endif

TESU_MODULE_PORTABILITY_INIT("Tesu_Utilities")

namespace Tesu {

namespace {

// Identity of this module's user-visible messages.
constexpr const char* kApplication = "tesutil";
constexpr const char* kSourcePath = "../s/Tesu_Utilities";
constexpr const char* kRevision = "$Revision: 1.37.14.1 $";

// A message source for a message issued at `line` of this module.
[[maybe_unused]] Port_MsgManData messageSource(int line) {
    return Port_MsgManData::createObject(kApplication, kSourcePath, line, kRevision);
}

}  // namespace

// ==== Path texts =============================================================================
// PATHS-BEGIN
// PATHS-END

// ==== Installation search ====================================================================
// SEARCH-BEGIN
// SEARCH-END

// ==== Identity and versions ==================================================================
// IDENTITY-BEGIN
// IDENTITY-END

// ==== Checksummed files ======================================================================
// CHECKSUM-BEGIN
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

// True when the line contributes to the checksum, that is, holds no "#".
bool IsDataLine(const Port::StringBase<char>& line) {
    return std::memchr(line.GetText(), '#', line.GetLength()) == nullptr;
}

// Collects the stored checksum text of a file while its lines go by. The stored text is the
// eight characters that follow the marker "# CRC:" and one skipped character, read from the
// file's lines each followed by "\n", so it may run over into the next lines and is shorter
// when the file ends first.
class StoredChecksum {
  public:
    // True once the marker has been seen.
    bool Found() const { return found_; }
    // Looks for the first marker in `line`; when it is there, starts collecting from it.
    void Search(const Port::StringBase<char>& line) {
        const std::size_t marker = line.GetIndexOfString(kMarker, Port::COMPARE_EXACT);
        if (marker != Port::NPOS) {
            found_ = true;
            skip_ = marker + kSkipAfterMarker;
            Collect(line);
        }
    }
    // Takes what is still needed from the next line after the marker's one.
    void Collect(const Port::StringBase<char>& line) {
        if (wanted_ == 0) {
            return;
        }
        Take(line.GetText(), line.GetLength());
        Take("\n", 1);
    }
    const Port::StringBase<char>& Text() const { return text_; }

  private:
    static constexpr const char* kMarker = "# CRC:";
    // The marker's six characters and the separator after it.
    static constexpr std::size_t kSkipAfterMarker = 7;

    void Take(const char* data, std::size_t length) {
        const std::size_t skipped = skip_ < length ? skip_ : length;
        skip_ -= skipped;
        data += skipped;
        length -= skipped;
        const std::size_t taken = wanted_ < length ? wanted_ : length;
        text_.Append(data, taken);
        wanted_ -= taken;
    }

    bool found_ = false;
    std::size_t skip_ = 0;
    std::size_t wanted_ = 8;
    Port::StringBase<char> text_;
};

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
    verdict = true;
    Port::Stream* stream = Port::File::open(fileName, Port::File::READ, true);
    if (stream == nullptr) {
        messageSource(__LINE__).issueError("Could not open %s\n", fileName.GetText());
        verdict = false;
        return 1;
    }
    StreamCloser closer(stream);

    // One pass over the lines: data lines feed the CRC, the first marker starts the stored
    // text. Only the current line is held, so memory does not grow with the file.
    std::uint32_t crc = 0;
    StoredChecksum stored;
    Port::StringBase<char> line;
    while (!stream->geteof()) {
        stream->readline(line);
        const bool dataLine = IsDataLine(line);
        if (dataLine) {
            crc = Port::StringBase<char>::CRC32(crc, line.GetText(), line.GetLength());
        }
        if (stored.Found()) {
            stored.Collect(line);
        } else if (!dataLine) {
            // The marker holds "#", so only comment lines can carry it.
            stored.Search(line);
        }
    }

    if (!closer.close()) {
        messageSource(__LINE__).issueError("Could not close %s\n", fileName.GetText());
        verdict = false;
        return 1;
    }
    if (stored.Found() && stored.Text().Compare(ChecksumText(crc), Port::COMPARE_NOCASE) != 0) {
        verdict = false;
    }
    return 0;
}
// CHECKSUM-END

// ==== File lists =============================================================================
// FILELIST-BEGIN
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
        const Port::FileName member(directory + line);
        if (Port::File::exist(member)) {
            members.push_back(line);
        } else {
            messageSource(__LINE__).issueWarning("Missing file list member %s\n",
                                                 member.GetAbsolutePath(false).GetText());
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
// FILELIST-END

}  // namespace Tesu

#if defined(_WIN32)
// The library's entry: thread attach and detach notifications are not wanted.
BOOL WINAPI DllMain(HINSTANCE instance, DWORD reason, LPVOID /*reserved*/) {
    if (reason == DLL_PROCESS_ATTACH) {
        DisableThreadLibraryCalls(instance);
    }
    return TRUE;
}
#endif

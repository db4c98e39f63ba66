// Checksummed files: the input is a file's content. Properties:
// - the file is read and closed (result 0, no message), and its verdict is the one that follows
//   from its lines: the eight characters after the first "# CRC:" and one skipped character,
//   read across line ends, against the checksum of its lines without "#";
// - the input stamped with CalculateChecksum validates (unless it holds a "# CRC:" of its
//   own before the stamp), also when its bytes straddle the reader's block boundary, and
//   still does with its data lines broken up differently and its comments moved first.
#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "FuzzSupport.h"
#include "Port_String.h"
#include "Tesu_Utilities.h"

namespace {

using fuzzsupport::ReaderLines;

fuzzsupport::TempDirectoryRemover remover;

// The reader's block size: a file bigger than this is handed over in blocks of this size.
constexpr std::size_t kBlock = 256 * 1024;

std::string Checksum(const std::string& text) {
    Port::StringBase<char> checksum;
    Tesu::Utilities::CalculateChecksum(Port::StringBase<char>(text), checksum);
    return checksum.str();
}

bool HasHash(const std::string& line) {
    return line.find('#') != std::string::npos;
}

// The verdict the file with these lines must get.
bool ExpectedVerdict(const std::vector<std::string>& lines) {
    std::string content;
    for (const std::string& line : lines) {
        content += line;
        content += '\n';
    }
    const std::size_t marker = content.find("# CRC:");
    if (marker == std::string::npos) {
        return true;
    }
    const std::string stored = marker + 7 < content.size() ? content.substr(marker + 7, 8) : "";
    return Port::StringBase<char>(stored).Compare(Port::StringBase<char>(Checksum(content)),
                                                  Port::COMPARE_NOCASE) == 0;
}

bool Validate(const std::string& content) {
    static const std::string path = fuzzsupport::TempDirectory() + "/file.v";
    fuzzsupport::WriteFile(path, content);
    fuzzsupport::MessageCapture capture;
    bool verdict = false;
    const unsigned int result =
        Tesu::Utilities::ValidateFileChecksum(Port::StringBase<char>(path), verdict);
    FUZZ_CHECK(result == 0);
    FUZZ_CHECK(capture.Text().empty());
    return verdict;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    const std::string input(reinterpret_cast<const char*>(data), size);
    const std::vector<std::string> lines = ReaderLines(input);

    const bool verdict = Validate(input);
    FUZZ_CHECK(verdict == ExpectedVerdict(lines));

    // Stamped at the end, and in one run out of four behind a comment line that puts the
    // reader's block boundary inside the input: right after its first "\r" (where a line end
    // may be split between two blocks) or at an offset the input chooses. The verdict follows
    // from the lines; with no "# CRC:" in the input it is true, so a line joined or split
    // wrongly at the boundary shows.
    std::string body;
    if (size > 0 && (data[0] & 3) == 1) {
        const std::size_t carriageReturn = input.find('\r');
        const std::size_t inside = carriageReturn != std::string::npos && (data[0] & 4) != 0
                                       ? carriageReturn + 1
                                       : 1 + data[size - 1] % 64;
        body = "#" + std::string(kBlock - inside - 2, 'p') + "\n";
    }
    body += input + "\n";
    std::string bodyText;
    for (const std::string& line : ReaderLines(body)) {
        bodyText += line + "\n";
    }
    const std::string stampedLast = body + "# CRC: " + Checksum(bodyText) + "\n";
    FUZZ_CHECK(Validate(stampedLast) == ExpectedVerdict(ReaderLines(stampedLast)));

    // Stamped: the checksum is that of the lines as the reader sees them.
    std::string canonical;
    std::string data_lines;
    std::vector<std::string> comments;
    for (const std::string& line : lines) {
        canonical += line + "\n";
        if (HasHash(line)) {
            comments.push_back(line);
        } else {
            data_lines += line;
        }
    }
    const std::string stamp = "# CRC: " + Checksum(canonical) + "\n";
    FUZZ_CHECK(Validate(stamp + input));

    // The data lines joined and broken again at other places. A piece followed by a line
    // break never ends in "\r", which the reader would take for part of the line end; the
    // last piece ends the file without one.
    std::string rebroken = stamp;
    for (const std::string& comment : comments) {
        rebroken += comment + "\n";
    }
    std::size_t at = 0;
    std::size_t step = 0;
    while (at < data_lines.size()) {
        std::size_t length = 1 + (size > 0 ? data[step++ % size] % 17 : 16);
        while (at + length < data_lines.size() && data_lines[at + length - 1] == '\r') {
            ++length;
        }
        rebroken += data_lines.substr(at, length);
        at += length;
        if (at < data_lines.size()) {
            rebroken += '\n';
        }
    }
    FUZZ_CHECK(Checksum(rebroken) == Checksum(canonical));
    FUZZ_CHECK(Validate(rebroken));
    return 0;
}

// tesutil commands on data files: verify, stamp, checksum, filelist.
//
// The library reads checksummed files but writes none; `stamp` is the writer. It computes the
// checksum of the file's content as the library reads it, rewrites only the checksum line (or
// puts a new one first), and replaces the file atomically: the new text goes to a temporary
// file beside the original, is checked with the library, and is then renamed over it, so that
// a crash leaves either the old file or the new one, never a half-written one.
#include <cstdint>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <iterator>
#include <random>
#include <sstream>
#include <string>
#include <system_error>
#include <vector>

#include "Port_File.h"
#include "Port_FileName.h"
#include "Port_String.h"
#include "Tesu_Utilities.h"
#include "tesutil_cli.h"

namespace tesutil {

namespace {

namespace fs = std::filesystem;

const char kMarker[] = "# CRC:";
constexpr std::size_t kMarkerLength = sizeof kMarker - 1;

// Why `name` cannot be used as a file: "no such file", "is a directory", or the empty text
// when it is a readable file as far as can be told.
std::string ProblemWithFile(const std::string& name) {
    if (!Port::File::exist(name)) {
        return "no such file";
    }
    if (Port::File::isdir(name)) {
        return "is a directory";
    }
    if (!Port::File::canread(name)) {
        return "cannot be read";
    }
    return std::string();
}

// The file's content as the library's checksum check reads it: each line as the layer's
// line reader delivers it (CR-LF and LF ends alike), followed by "\n". False when the file
// does not open or does not close.
bool ReadAsChecked(const std::string& name, Port::StringBase<char>& content) {
    Port::Stream* stream = Port::File::open(name, Port::File::READ, true);
    if (stream == nullptr) {
        return false;
    }
    content.Empty();
    Port::StringBase<char> line;
    while (!stream->geteof()) {
        stream->readline(line);
        content.Append(line);
        content.Append("\n");
    }
    return Port::File::close(stream);
}

// `bytes` with the checksum line set to `checksum`. The checksum line is the one holding the
// first "# CRC:" (the one the check reads): the character after the colon and the eight after
// it become a blank and the checksum, and what follows them on the line stays; a line with
// fewer characters after the marker gets them in place of its rest. Without a marker, the line
// "# CRC: <checksum>" goes first, ended like the file's first line. Every other byte, line
// ends included, stays as it was.
std::string WithChecksumLine(const std::string& bytes, const std::string& checksum) {
    const std::string field = " " + checksum;
    const std::size_t marker = bytes.find(kMarker);
    if (marker == std::string::npos) {
        const std::size_t firstEnd = bytes.find('\n');
        const bool crlf =
            firstEnd != std::string::npos && firstEnd > 0 && bytes[firstEnd - 1] == '\r';
        return kMarker + field + (crlf ? "\r\n" : "\n") + bytes;
    }
    std::size_t lineEnd = bytes.find('\n', marker);
    if (lineEnd == std::string::npos) {
        lineEnd = bytes.size();
    } else if (bytes[lineEnd - 1] == '\r') {
        --lineEnd;  // the "\r" of a CR-LF end belongs to the end, not to the line
    }
    const std::size_t start = marker + kMarkerLength;
    const std::size_t replaced = lineEnd - start >= field.size() ? field.size() : lineEnd - start;
    std::string result = bytes;
    result.replace(start, replaced, field);
    return result;
}

bool ReadBytes(const fs::path& path, std::string& bytes) {
    std::ifstream in(path, std::ios::binary);
    if (!in) {
        return false;
    }
    std::ostringstream buffer;
    buffer << in.rdbuf();
    if (in.bad()) {
        return false;
    }
    bytes = buffer.str();
    return true;
}

// A name for a temporary file beside `target` that does not exist yet; empty when none is
// found (the tool never writes over a file that is there).
fs::path TemporaryBeside(const fs::path& target) {
    std::random_device random;
    std::error_code error;
    for (int attempt = 0; attempt < 100; ++attempt) {
        std::ostringstream name;
        name << '.' << target.filename().string() << ".tesutil-" << std::hex << random() << random()
             << ".tmp";
        fs::path candidate = target.parent_path() / name.str();
        if (!fs::exists(fs::symlink_status(candidate, error))) {
            return candidate;
        }
    }
    return fs::path();
}

// Replaces `target` by `bytes` through a temporary file beside it, which gets the target's
// permissions and must pass the library's check before the rename. Returns what went wrong,
// or the empty text.
std::string ReplaceAtomically(const fs::path& target, const std::string& bytes) {
    const fs::path temporary = TemporaryBeside(target);
    if (temporary.empty()) {
        return "cannot find a free name for a temporary file beside it";
    }
    std::error_code error;
    auto failed = [&](const std::string& what) {
        fs::remove(temporary, error);
        return what;
    };
    {
        std::ofstream out(temporary, std::ios::binary | std::ios::trunc);
        if (!out) {
            return failed("cannot make the temporary file " + temporary.string());
        }
        out.write(bytes.data(), static_cast<std::streamsize>(bytes.size()));
        out.close();
        if (!out) {
            return failed("cannot write the temporary file " + temporary.string());
        }
    }
    const fs::file_status status = fs::status(target, error);
    if (!error) {
        fs::permissions(temporary, status.permissions(), error);
    }
    if (error) {
        return failed("cannot give the temporary file the file's permissions: " + error.message());
    }
    bool verdict = false;
    if (Tesu::Utilities::ValidateFileChecksum(temporary.string(), verdict) != 0 || !verdict) {
        return failed("the stamped text does not pass the check; the file is left as it was");
    }
    fs::rename(temporary, target, error);
    if (error) {
        return failed("cannot replace the file: " + error.message());
    }
    return std::string();
}

int RunVerify(const Arguments& arguments) {
    const ParsedArguments parsed = ParseArguments(arguments, {}, {});
    ExpectOperands(parsed, 1, SIZE_MAX, "FILE...");
    int status = kExitOk;
    for (const std::string& name : parsed.operands) {
        bool verdict = false;
        if (Tesu::Utilities::ValidateFileChecksum(name, verdict) == 0) {
            std::cout << name << (verdict ? ": OK" : ": FAILED") << '\n';
        } else {
            const std::string problem = ProblemWithFile(name);
            std::cout << name << ": " << (problem.empty() ? "cannot be read" : problem) << '\n';
        }
        if (!verdict) {
            status = kExitFailed;
        }
    }
    return status;
}

int RunStamp(const Arguments& arguments) {
    const ParsedArguments parsed = ParseArguments(arguments, {}, {});
    ExpectOperands(parsed, 1, SIZE_MAX, "FILE...");
    int status = kExitOk;
    for (const std::string& name : parsed.operands) {
        std::string problem = ProblemWithFile(name);
        std::error_code error;
        // A symbolic link stays a link: the file it leads to is the one rewritten.
        fs::path target = fs::path(name);
        if (problem.empty() && fs::is_symlink(fs::symlink_status(target, error))) {
            target = fs::canonical(target, error);
        }
        if (problem.empty() && !fs::is_regular_file(target, error)) {
            problem = "is not a regular file";
        }
        Port::StringBase<char> content;
        Port::StringBase<char> checksum;
        std::string bytes;
        if (problem.empty() &&
            (!ReadAsChecked(target.string(), content) || !ReadBytes(target, bytes))) {
            problem = "cannot be read";
        }
        if (!problem.empty()) {
            status = Fail("stamp", name + ": " + problem);
            continue;
        }
        Tesu::Utilities::CalculateChecksum(content, checksum);
        const std::string stamped = WithChecksumLine(bytes, checksum.str());
        if (stamped == bytes) {
            std::cout << name << ": already stamped (" << kMarker << ' ' << checksum.str() << ")\n";
            continue;
        }
        problem = ReplaceAtomically(target, stamped);
        if (!problem.empty()) {
            status = Fail("stamp", name + ": " + problem);
            continue;
        }
        std::cout << name << ": stamped (" << kMarker << ' ' << checksum.str() << ")\n";
    }
    return status;
}

int RunChecksum(const Arguments& arguments) {
    const ParsedArguments parsed = ParseArguments(arguments, {}, {});
    ExpectOperands(parsed, 1, 1, "FILE");
    const std::string& name = parsed.operands[0];
    std::string problem = ProblemWithFile(name);
    Port::StringBase<char> content;
    if (problem.empty() && !ReadAsChecked(name, content)) {
        problem = "cannot be read";
    }
    if (!problem.empty()) {
        return Fail("checksum", name + ": " + problem);
    }
    Port::StringBase<char> checksum;
    Tesu::Utilities::CalculateChecksum(content, checksum);
    std::cout << checksum.str() << '\n';
    return kExitOk;
}

int RunFileList(const Arguments& arguments) {
    const ParsedArguments parsed = ParseArguments(arguments, {"--paths"}, {});
    ExpectOperands(parsed, 1, 1, "LIST");
    const std::string& name = parsed.operands[0];
    const Port::FileName list(name);
    if (parsed.Has("--paths")) {
        for (const Port::FileName& member : Tesu::Utilities::GetFileListFileNames(list)) {
            std::cout << member.GetText().str() << '\n';
        }
    } else {
        for (const Port::StringBase<char>& member : Tesu::Utilities::GetFileListFileStrings(list)) {
            std::cout << member.str() << '\n';
        }
    }
    // The library has said what went wrong with the list itself; the tool adds its verdict.
    const std::string problem = ProblemWithFile(name);
    if (!problem.empty()) {
        return Fail("filelist", name + ": " + problem);
    }
    return kExitOk;
}

}  // namespace

const std::vector<Command>& FileCommands() {
    static const std::vector<Command> commands = {
        {"verify", "check checksummed files against their \"# CRC:\" line",
         "FILE...\n"
         "  Prints \"<file>: OK\", \"<file>: FAILED\" or what is wrong with the file, one line\n"
         "  per file. A file without a \"# CRC:\" line is OK. Exit status 1 when any file is\n"
         "  not OK.\n",
         RunVerify},
        {"stamp", "write or refresh the \"# CRC:\" line of files",
         "FILE...\n"
         "  Sets the checksum line of each file to the checksum of its content: the line that\n"
         "  holds the first \"# CRC:\" is refreshed in place; a file without one gets\n"
         "  \"# CRC: <checksum>\" as its first line. Line ends are kept (CR-LF stays CR-LF).\n"
         "  The file is replaced atomically through a temporary file beside it.\n"
         "  Exit status 1 when any file cannot be stamped.\n",
         RunStamp},
        {"checksum", "print the checksum text of a file's content",
         "FILE\n"
         "  Prints the eight-character checksum text (\"%8x\" of the CRC-32, padded with\n"
         "  blanks) of the file's lines that hold no \"#\", read the way verify reads them.\n",
         RunChecksum},
        {"filelist", "list the members of a file list",
         "LIST [--paths]\n"
         "  Prints the existing members of the file list LIST, one per line, cleaned (comments,\n"
         "  blanks and doubled separators dropped, separators made the platform's). Missing\n"
         "  members are left out with a warning.\n"
         "  --paths  print each member joined to the list's directory instead.\n"
         "  Exit status 1 when LIST cannot be read.\n",
         RunFileList},
    };
    return commands;
}

}  // namespace tesutil

// File lists: the input is a list's content. Before reading, some of the members it names are
// made (as files, or as directories) in a fresh directory beside the list, chosen by the input.
// Properties: the members returned are exactly the cleaned texts of the lines whose member
// exists, in order; every other member gives one warning and nothing else is issued; the file
// names are the list's directory followed by those texts.
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "FuzzSupport.h"
#include "Port_FileName.h"
#include "Port_String.h"
#include "Tesu_Utilities.h"

namespace {

fuzzsupport::TempDirectoryRemover remover;

// The member a list line names, cleaned as a reader of the format expects: the comment cut
// off, tabs made blanks, blanks and tabs trimmed, "\" made "/" and runs of "/" collapsed.
// Empty when the line names nothing.
std::string CleanMember(std::string line) {
    line = line.substr(0, line.find('#'));
    for (char& c : line) {
        if (c == '\t') {
            c = ' ';
        }
    }
    const std::size_t first = line.find_first_not_of(' ');
    if (first == std::string::npos) {
        return std::string();
    }
    line = line.substr(first, line.find_last_not_of(' ') - first + 1);
    std::string member;
    for (char c : line) {
        if (c == '\\') {
            c = '/';
        }
        if (c == '/' && !member.empty() && member.back() == '/') {
            continue;
        }
        member += c;
    }
    return member;
}

// Makes `member` under `directory` when it stays inside it: its parents as directories, itself
// as a file or a directory. Failures are fine: the member then counts as missing.
void Make(const std::string& directory, const std::string& member, bool asDirectory) {
    if (member.empty() || member.size() > 200 || member.front() == '/' ||
        member.find('\0') != std::string::npos) {
        return;
    }
    std::string path = directory;
    std::size_t start = 0;
    for (;;) {
        const std::size_t slash = member.find('/', start);
        const std::string component = member.substr(start, slash - start);
        if (component == "..") {
            return;
        }
        path += "/" + component;
        if (slash == std::string::npos || slash + 1 == member.size()) {
            break;
        }
        ::mkdir(path.c_str(), 0755);
        start = slash + 1;
    }
    if (asDirectory || member.back() == '/') {
        ::mkdir(path.c_str(), 0755);
    } else {
        const int fd = ::open(path.c_str(), O_WRONLY | O_CREAT | O_CLOEXEC, 0644);
        if (fd >= 0) {
            ::close(fd);
        }
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    const std::string input(reinterpret_cast<const char*>(data), size);
    const std::string directory = fuzzsupport::TempDirectory() + "/run";
    fuzzsupport::RemoveTree(directory);
    ::mkdir(directory.c_str(), 0755);
    const std::string list = directory + "/files.lst";
    fuzzsupport::WriteFile(list, input);

    // Which members to make: two bits of the input per member line, in turn.
    std::vector<std::string> members;
    std::size_t bit = 0;
    for (const std::string& line : fuzzsupport::ReaderLines(input)) {
        const std::string member = CleanMember(line);
        if (member.empty()) {
            continue;
        }
        members.push_back(member);
        const unsigned choice = size > 0 ? (data[(bit / 4) % size] >> (2 * (bit % 4))) & 3u : 0u;
        ++bit;
        if (choice != 0) {
            Make(directory, member, choice == 3);
        }
    }

    std::vector<std::string> expected;
    std::size_t missing = 0;
    for (const std::string& member : members) {
        if (fuzzsupport::Exists(directory + "/" + member)) {
            expected.push_back(member);
        } else {
            ++missing;
        }
    }

    fuzzsupport::MessageCapture capture;
    const Port::FileName listName{Port::StringBase<char>(list)};
    const std::vector<Port::StringBase<char>> strings =
        Tesu::Utilities::GetFileListFileStrings(listName);
    FUZZ_CHECK(strings.size() == expected.size());
    for (std::size_t i = 0; i < strings.size(); ++i) {
        FUZZ_CHECK(strings[i].str() == expected[i]);
    }
    const std::string messages = capture.Text();
    // Each warning names the member's absolute path, which may lie outside the directory.
    const std::string warning = "WARNING:tesutil - Missing file list member /";
    std::size_t warnings = 0;
    for (std::size_t at = 0; at < messages.size();) {
        FUZZ_CHECK(messages.compare(at, warning.size(), warning) == 0);
        ++warnings;
        // A member's text may hold line breaks only as "\r" (lines end at "\n").
        const std::size_t end = messages.find('\n', at);
        FUZZ_CHECK(end != std::string::npos);
        at = end + 1;
    }
    FUZZ_CHECK(warnings == missing);

    const std::vector<Port::FileName> names = Tesu::Utilities::GetFileListFileNames(listName);
    FUZZ_CHECK(names.size() == expected.size());
    for (std::size_t i = 0; i < names.size(); ++i) {
        FUZZ_CHECK(names[i].GetText().str() == directory + "/" + expected[i]);
    }
    return 0;
}

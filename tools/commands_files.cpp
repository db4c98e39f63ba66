// tesutil commands on data files: verify, stamp (commands_stamp.cpp), checksum, filelist, and
// the names they work on (operands, --files-from, "-" for standard input).
//
// verify and checksum read each file once through the library's silent scan, which holds one
// block of the file at a time, and report every failure themselves, once, on the standard
// error stream, with the system's reason.
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

struct StreamCloser {
    void operator()(Port::Stream* stream) const { Port::File::close(stream); }
};
using OpenStream = std::unique_ptr<Port::Stream, StreamCloser>;

struct VerifyOptions {
    NameSource names;
    bool quiet = false;
    bool status = false;
    bool strict = false;
};

bool VerifyOne(const std::string& name, const VerifyOptions& options) {
    Tesu::ChecksumScan scan;
    if (ScanNamed(name, scan) != 0) {
        if (!options.status) {
            FailFile("verify", name, scan.reason.str());
        }
        return false;
    }
    bool ok = scan.valid;
    std::string verdict = ok ? ": OK" : ": FAILED";
    if (ok && options.strict && !scan.marked) {
        ok = false;
        verdict = ": FAILED (no checksum line)";
    }
    if (!options.status && !(ok && options.quiet)) {
        PrintLine(NameLine(name, verdict));
    }
    return ok;
}

// One checksum line: the bare checksum, or "<checksum>  <name>" (a line whose name had to be
// escaped begins with a backslash).
bool ChecksumOne(const std::string& name, bool bare) {
    Tesu::ChecksumScan scan;
    if (ScanNamed(name, scan) != 0) {
        FailFile("checksum", name, scan.reason.str());
        return false;
    }
    if (bare) {
        PrintLine(scan.checksum.str());
        return true;
    }
    bool escaped = false;
    const std::string shown = EscapedName(name, escaped);
    PrintLine((escaped ? "\\" : "") + scan.checksum.str() + "  " + shown);
    return true;
}

int RunFileList(const std::string& name, bool paths) {
    // The list is opened here first, so that a list that cannot be read is reported once, by
    // the tool, with the system's reason; the library then reads it and warns of each missing
    // member.
    {
        const OpenStream probe(Port::File::open(name, Port::File::READ, true));
        if (!probe) {
            return FailFile("filelist", name, Port::File::lastError().str());
        }
    }
    const Port::FileName list(name);
    if (paths) {
        for (const Port::FileName& member : Tesu::Utilities::GetFileListFileNames(list)) {
            PrintLine(member.GetText().str());
        }
    } else {
        for (const Port::StringBase<char>& member : Tesu::Utilities::GetFileListFileStrings(list)) {
            PrintLine(member.str());
        }
    }
    return kExitOk;
}

}  // namespace

unsigned int ScanNamed(const std::string& name, Tesu::ChecksumScan& scan) {
    if (name != "-") {
        return Tesu::Utilities::ScanChecksummedFile(name, scan);
    }
    const OpenStream input(Port::File::openStandardInput());
    if (!input) {
        scan.reason = Port::File::lastError();
        return 1;
    }
    return Tesu::Utilities::ScanChecksummedStream(*input, scan);
}

void AddNameOptions(Command& command, NameSource& source, const char* operandHelp) {
    AddOperand(command, "FILE", operandHelp, true);
    source.operands = command.operands;
    source.list = command.app
                      ->add_option("--files-from", source.filesFrom,
                                   "read the names from LIST, one a line (\"-\": stdin)")
                      ->type_name("LIST");
    command.least = 0;
    command.most = SIZE_MAX;
    command.names = "FILE...";
}

void CheckNames(const NameSource& source) {
    const bool listGiven = source.list != nullptr && source.list->count() > 0;
    if (listGiven && !source.operands->empty()) {
        throw UsageError{"extra operand '" + source.operands->front() +
                         "' (file operands cannot be combined with --files-from)"};
    }
    if (!listGiven && source.operands->empty()) {
        throw UsageError{"missing operand (expects FILE...)"};
    }
}

int ForEachName(const char* command, const NameSource& source,
                const std::function<bool(const std::string& name)>& each) {
    bool allOk = true;
    if (source.list == nullptr || source.list->count() == 0) {
        for (const std::string& name : *source.operands) {
            allOk = each(name) && allOk;
        }
        return allOk ? kExitOk : kExitFailed;
    }
    const bool fromInput = source.filesFrom == "-";
    const OpenStream list(fromInput ? Port::File::openStandardInput()
                                    : Port::File::open(source.filesFrom, Port::File::READ, true));
    if (!list) {
        return FailFile(command, source.filesFrom, Port::File::lastError().str());
    }
    Port::StringBase<char> line;
    while (!list->geteof()) {
        list->readline(line);
        if (line.IsEmpty()) {
            continue;
        }
        if (fromInput && line.str() == "-") {
            allOk = false;
            Fail(command,
                 "when reading file names from standard input, no file name of '-' "
                 "allowed");
            continue;
        }
        allOk = each(line.str()) && allOk;
    }
    const Port::StringBase<char> error = list->error();
    if (!error.IsEmpty()) {
        return FailFile(command, source.filesFrom, error.str());
    }
    return allOk ? kExitOk : kExitFailed;
}

void AddFileCommands(CLI::App& tool, Commands& commands) {
    const char* group = "Checksummed files and file lists";

    auto verify = std::make_shared<VerifyOptions>();
    Command& verifyCommand = AddCommand(
        tool, commands, group, "verify", "check checksummed files against their \"# CRC:\" line",
        "Prints \"<file>: OK\" or \"<file>: FAILED\", one line per file; a file that cannot be "
        "read is reported on standard error (\"tesutil verify: <file>: <reason>\"). A file "
        "without a \"# CRC:\" line is OK; with --strict it fails, as \"<file>: FAILED (no "
        "checksum line)\". --quiet leaves out the OK lines, --status prints nothing at all "
        "(not even for a file that cannot be read). A name holding a line "
        "break or a backslash is written with \"\\n\" and \"\\\\\" and its line begins with "
        "\"\\\". "
        "\"-\" is standard input. Exit status 0 when every file is OK, 1 when any FAILED or "
        "cannot be read.");
    AddNameOptions(verifyCommand, verify->names, "the files (\"-\": standard input)");
    verifyCommand.app->add_flag("-q,--quiet", verify->quiet, "print no OK lines");
    verifyCommand.app->add_flag("--status", verify->status,
                                "print nothing at all: the exit status tells");
    verifyCommand.app->add_flag("--strict", verify->strict,
                                "fail a file that has no \"# CRC:\" line");
    verifyCommand.run = [verify] {
        CheckNames(verify->names);
        return ForEachName("verify", verify->names,
                           [verify](const std::string& name) { return VerifyOne(name, *verify); });
    };

    AddStampCommand(tool, commands, group);

    auto checksum = std::make_shared<NameSource>();
    Command& checksumCommand = AddCommand(
        tool, commands, group, "checksum", "print the checksum text of files' content",
        "Prints the eight-character checksum text (\"%8x\" of the CRC-32, padded with "
        "blanks) of each file's lines that hold no \"#\", read the way verify reads them. "
        "With exactly one FILE operand the line holds the checksum alone; with several, or "
        "with --files-from, each line is \"<checksum>  <file>\" (a name holding a line break "
        "or a backslash is escaped as verify does, the line then beginning with \"\\\"). "
        "\"-\" is standard input. Exit status 1 when any file cannot be read.");
    AddNameOptions(checksumCommand, *checksum, "the files (\"-\": standard input)");
    checksumCommand.run = [checksum] {
        CheckNames(*checksum);
        const bool bare = checksum->list->count() == 0 && checksum->operands->size() == 1;
        return ForEachName("checksum", *checksum,
                           [bare](const std::string& name) { return ChecksumOne(name, bare); });
    };

    auto paths = std::make_shared<bool>(false);
    Command& fileList = AddCommand(
        tool, commands, group, "filelist", "list the members of a file list",
        "Prints the existing members of the file list LIST, one per line, cleaned (comments, "
        "blanks and doubled separators dropped, separators made the platform's). Missing "
        "members are left out with a warning. Exit status 1 when LIST cannot be read.");
    AddOperand(fileList, "LIST", "the file list", false);
    fileList.app->add_flag("--paths", *paths, "print each member joined to the list's directory");
    fileList.least = fileList.most = 1;
    fileList.names = "LIST";
    fileList.run = [paths, operands = fileList.operands] {
        return RunFileList((*operands)[0], *paths);
    };
}

}  // namespace tesutil

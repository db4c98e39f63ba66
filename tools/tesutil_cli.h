// What the commands of tesutil share: exit statuses, the command table, operand checks, the
// checked writes to standard output and the tool's own error lines.
#ifndef TESUTIL_CLI_H
#define TESUTIL_CLI_H

#include <cstddef>
#include <deque>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include <CLI/CLI.hpp>

#include "Tesu_DebugMessenger.h"
#include "Tesu_Utilities.h"

namespace tesutil {

constexpr int kExitOk = 0;
constexpr int kExitFailed = 1;  // a check failed, a thing was not found, or output failed
constexpr int kExitUsage = 2;   // bad usage

// Thrown for bad usage; main writes "tesutil <command>: <message>; tesutil <command> --help
// shows the usage" on the standard error stream and exits with kExitUsage.
struct UsageError {
    std::string message;
};

// Thrown when standard output cannot be written; main writes "tesutil: write error: <reason>"
// and exits with kExitFailed.
struct WriteError {
    std::string reason;
};

// One command: its CLI11 subcommand (options bound to the command's own variables), the
// vector that receives its operands (made by AddOperand; null for a command without operands;
// the operands after "--" are appended there too), how many it takes and what they are called in
// messages
// ("FILE...", "BASE PATH"), and the function that runs it once the line is parsed.
struct Command {
    CLI::App* app = nullptr;
    std::shared_ptr<std::vector<std::string>> operands;
    std::size_t least = 0;
    std::size_t most = 0;
    const char* names = "no operands";
    std::function<int()> run;
};

// The commands; a deque, so that an entry stays where it is while others are added.
using Commands = std::deque<Command>;

// Adds the commands of each group to `tool`, in the order the help lists them.
void AddFileCommands(CLI::App& tool, Commands& commands);
void AddInstallationCommands(CLI::App& tool, Commands& commands);
void AddDebugCommands(CLI::App& tool, Commands& commands);

// Adds a subcommand `name` of `tool` in the help's group `group`, with a line of summary and a
// description shown below its options, and its entry in `commands` (no operands, no run yet).
Command& AddCommand(CLI::App& tool, Commands& commands, const char* group, const char* name,
                    const char* summary, const char* description);
// Adds the operand `name` (several when `many`) to `command`; each value given is appended to
// the command's operands, in the order given.
void AddOperand(Command& command, const char* name, const char* help, bool many);

// The debug level "off", "normal", "detailed" or "verbose" stands for; any other name is a
// UsageError.
Tesu::DebugMessenger::DebugLevel DebugLevelOf(const std::string& name);
// True when the global option --debug was given.
bool GlobalDebugLevelGiven();

// Where the installation roots in effect came from: "--roots", "TESSEL_ROOTS", "sample
// installation" or "installation prefix".
const std::string& RootsOrigin();
// The roots in effect joined with the platform's list separator, for a message that says
// where a search looked; "no installation roots" when there are none.
std::string RootsLookedIn();

// Writes `text` to standard output and flushes it, so that results keep their place among the
// messages on the standard error stream. Throws WriteError when the write or the flush fails.
void Print(const std::string& text);
// Print of `line` and a line break.
void PrintLine(const std::string& line);
// Flushes standard output at the end of a command; throws WriteError when that fails.
void FinishOutput();

// `name` as a result line shows it: a name holding a line break or a backslash has them written
// "\n" and "\\", and `escaped` says so (the line then begins with a backslash, as the
// checksum tools of coreutils mark such lines).
std::string EscapedName(const std::string& name, bool& escaped);
// A result line "<name><suffix>", the name escaped as above (with the leading backslash).
std::string NameLine(const std::string& name, const std::string& suffix);

// Writes the tool's own one-line error "tesutil <command>: <message>" on the standard error
// stream and returns kExitFailed. Outside texts in `message` are written as they stand.
int Fail(const char* command, const std::string& message);
// Fail with "<name>: <reason>", the name escaped as EscapedName does (without a leading
// backslash), so that one failure stays one line.
int FailFile(const char* command, const std::string& name, const std::string& reason);

// The names a file command works on: the operands, or the lines of the file --files-from
// names ("-": standard input; empty lines are skipped, a CR-LF end is taken as a line end).
struct NameSource {
    std::shared_ptr<std::vector<std::string>> operands;
    std::string filesFrom;
    CLI::Option* list = nullptr;  // the option --files-from, to tell whether it was given
};
// Adds the operand FILE... and the option --files-from to `command`, bound to `source`.
void AddNameOptions(Command& command, NameSource& source, const char* operandHelp);
// A UsageError when neither or both operands and --files-from are given.
void CheckNames(const NameSource& source);
// Calls `each` with every name in order and returns the exit status: kExitFailed when `each`
// returned false for any name, or when the list could not be read (reported as a failure of
// `command`). A "-" in a list read from standard input is refused, since that input is the list.
int ForEachName(const char* command, const NameSource& source,
                const std::function<bool(const std::string& name)>& each);

// The library's silent scan of the file `name`, or of standard input for "-": 0 scanned, 1 not
// opened, 2 a read failed; `scan.reason` then holds the system's reason.
unsigned int ScanNamed(const std::string& name, Tesu::ChecksumScan& scan);

// Adds the command stamp (commands_stamp.cpp) in the help's group `group`.
void AddStampCommand(CLI::App& tool, Commands& commands, const char* group);

}  // namespace tesutil

#endif

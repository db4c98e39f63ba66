// What the commands of tesutil share: exit statuses, the command table's entries, argument
// parsing and the tool's own error lines.
#ifndef TESUTIL_CLI_H
#define TESUTIL_CLI_H

#include <initializer_list>
#include <map>
#include <set>
#include <string>
#include <vector>

#include "Tesu_DebugMessenger.h"

namespace tesutil {

constexpr int kExitOk = 0;
constexpr int kExitFailed = 1;  // a check failed, or a thing was not found
constexpr int kExitUsage = 2;   // bad usage

using Arguments = std::vector<std::string>;

// Thrown for bad usage; main writes "tesutil <command>: <message>" and exits with kExitUsage.
struct UsageError {
    std::string message;
};

// One command: its name, a line of summary, its usage (the text after "usage: tesutil
// <name> ": the operands and options on the first line, a description below) and the
// function that runs it with the arguments after the command name.
struct Command {
    const char* name;
    const char* summary;
    const char* usage;
    int (*run)(const Arguments& arguments);
};

// The commands of each group, in the order the help lists them.
const std::vector<Command>& FileCommands();
const std::vector<Command>& InstallationCommands();
const std::vector<Command>& DebugCommands();

// A command's arguments sorted into operands and options. Options come as "--name",
// "--name value" or "--name=value"; "--" ends the options, and a lone "-" is an operand.
struct ParsedArguments {
    std::vector<std::string> operands;
    std::set<std::string> flags;                // the flags given
    std::map<std::string, std::string> values;  // the valued options given (the last wins)

    bool Has(const std::string& flag) const { return flags.count(flag) != 0; }
};

// Sorts `arguments`, knowing the flags and valued options of the command. An unknown option,
// or a valued option without its value, is a UsageError.
ParsedArguments ParseArguments(const Arguments& arguments, std::initializer_list<const char*> flags,
                               std::initializer_list<const char*> valueOptions);

// A UsageError unless there are between `least` and `most` operands; `names` says what they
// are ("FILE...", "BASE PATH") for the message.
void ExpectOperands(const ParsedArguments& parsed, std::size_t least, std::size_t most,
                    const char* names);

// "off", "normal", "detailed", "verbose"; anything else is a UsageError.
Tesu::DebugMessenger::DebugLevel ParseDebugLevel(const std::string& text);
// True when the global option --debug was given.
bool GlobalDebugLevelGiven();

// Writes the tool's own one-line error "tesutil <command>: <message>" on the standard error
// stream and returns kExitFailed. Outside texts in `message` are written as they stand.
int Fail(const char* command, const std::string& message);

}  // namespace tesutil

#endif

// tesutil: the command-line tool over libTesu_Utilities.
//
//   tesutil <command> [options]
//   tesutil --help | tesutil <command> --help
//
// Exit status: 0 on success, 1 when a check fails, 2 on bad usage.
//
// Each command is one entry of kCommands: its name, a line of summary, its usage text and the
// function that runs it with the arguments after the command name.
#include <chrono>
#include <cstring>
#include <iostream>
#include <string>
#include <thread>
#include <vector>

#include "Port_String.h"
#include "Tesu_DebugMessenger.h"
#include "Tesu_MsgMan.h"

namespace {

constexpr int kExitOk = 0;
constexpr int kExitUsage = 2;

using Arguments = std::vector<std::string>;

struct Command {
    const char* name;
    const char* summary;
    const char* usage;  // the lines after "usage: tesutil <name>"
    int (*run)(const Arguments& arguments);
};

// Thrown by a command for bad usage; main reports it with the command's usage.
struct UsageError {
    std::string message;
};

// Reads the value of an option given as "--name value" or "--name=value" at arguments[index],
// advancing index past what it used. False when arguments[index] is not that option.
bool OptionValue(const Arguments& arguments, std::size_t& index, const std::string& option,
                 std::string& value) {
    const std::string& argument = arguments[index];
    if (argument == option) {
        if (index + 1 >= arguments.size()) {
            throw UsageError{"option " + option + " needs a value"};
        }
        value = arguments[index + 1];
        index += 2;
        return true;
    }
    if (argument.compare(0, option.size() + 1, option + "=") == 0) {
        value = argument.substr(option.size() + 1);
        index += 1;
        return true;
    }
    return false;
}

Tesu::DebugMessenger::DebugLevel ParseDebugLevel(const std::string& text) {
    if (text == "off") {
        return Tesu::DebugMessenger::DEBUG_OFF;
    }
    if (text == "normal") {
        return Tesu::DebugMessenger::DEBUG_NORMAL;
    }
    if (text == "detailed") {
        return Tesu::DebugMessenger::DEBUG_DETAILED;
    }
    if (text == "verbose") {
        return Tesu::DebugMessenger::DEBUG_VERBOSE;
    }
    throw UsageError{"unknown debug level '" + text + "' (off, normal, detailed, verbose)"};
}

// --- debug-demo ----------------------------------------------------------------------------

int RunDebugDemo(const Arguments& arguments) {
    std::string levelName = "normal";
    auto rootLevel = Tesu::DebugMessenger::DEBUG_NORMAL;
    for (std::size_t index = 0; index < arguments.size();) {
        std::string value;
        if (OptionValue(arguments, index, "--debug", value)) {
            rootLevel = ParseDebugLevel(value);
            levelName = value;
        } else {
            throw UsageError{"unknown option '" + arguments[index] + "'"};
        }
    }

    // Debug lines are status messages: the manager writes them to the standard error stream.
    Tesu::MsgMan messages;

    Tesu::DebugMessenger* root = Tesu::DebugMessengerFactory::GetLogger();
    Tesu::DebugMessenger* demo = Tesu::DebugMessengerFactory::GetLogger("demo");
    root->SetLevel(rootLevel);
    demo->SetLevel(Tesu::DebugMessenger::DEBUG_INHERIT);

    root->Normal("root logger: a normal line");
    root->Detailed("root logger: a detailed line");
    root->Verbose("root logger: a verbose line");
    demo->Normal("inherits the root's level: a normal line");
    demo->Detailed("inherits the root's level: a detailed line");
    demo->Verbose("inherits the root's level: a verbose line");

    {
        // A logger of the demo's own, below "demo", always at verbose; it writes its total
        // time when it goes out of scope.
        Tesu::DebugMessenger step(demo, "demo.step");
        step.SetLevel(Tesu::DebugMessenger::DEBUG_VERBOSE);
        step.SetTimer("pause");
        std::this_thread::sleep_for(std::chrono::milliseconds(25));
        Port::StringBase<char> line("after a pause of 25 ms, timer 'pause' reads ");
        line.Append(step.GetTimer("pause"));
        step.Verbose(line);
        step.StopTimer("pause");
        line.Assign("time since this logger was made: ");
        line.Append(step.GetTimer());
        step.Normal(line);
    }

    std::cerr << "tesutil: root debug level " << levelName << "; named loggers in the registry:";
    std::vector<Port::StringBase<char>>* names = Tesu::DebugMessengerFactory::GetActiveLoggers();
    for (const auto& name : *names) {
        std::cerr << ' ' << name.str();
    }
    delete names;
    std::cerr << '\n';
    return kExitOk;
}

// --- dispatch ------------------------------------------------------------------------------

const Command kCommands[] = {
    {"debug-demo", "write debug lines at each level and show the debug timers",
     "[--debug off|normal|detailed|verbose]\n"
     "  Sets the root logger to the level given (default normal), writes lines at each level\n"
     "  through the root, a named logger and a logger of its own, and shows a timer.\n",
     RunDebugDemo},
};

const Command* FindCommand(const std::string& name) {
    for (const Command& command : kCommands) {
        if (name == command.name) {
            return &command;
        }
    }
    return nullptr;
}

void PrintUsage(std::ostream& out) {
    out << "usage: tesutil <command> [options]\n"
           "       tesutil <command> --help\n"
           "commands:\n";
    for (const Command& command : kCommands) {
        out << "  " << command.name << std::string(14 - std::strlen(command.name), ' ')
            << command.summary << '\n';
    }
}

void PrintCommandUsage(std::ostream& out, const Command& command) {
    out << "usage: tesutil " << command.name << ' ' << command.usage;
}

bool IsHelp(const std::string& argument) {
    return argument == "--help" || argument == "-h";
}

}  // namespace

int main(int argc, char** argv) {
    const Arguments all(argv + 1, argv + argc);
    if (all.empty()) {
        std::cerr << "tesutil: no command given\n";
        PrintUsage(std::cerr);
        return kExitUsage;
    }
    if (IsHelp(all[0])) {
        PrintUsage(std::cout);
        return kExitOk;
    }
    const Command* command = FindCommand(all[0]);
    if (command == nullptr) {
        std::cerr << "tesutil: unknown command '" << all[0] << "'\n";
        PrintUsage(std::cerr);
        return kExitUsage;
    }
    const Arguments arguments(all.begin() + 1, all.end());
    for (const std::string& argument : arguments) {
        if (IsHelp(argument)) {
            PrintCommandUsage(std::cout, *command);
            return kExitOk;
        }
    }
    try {
        return command->run(arguments);
    } catch (const UsageError& error) {
        std::cerr << "tesutil " << command->name << ": " << error.message << '\n';
        PrintCommandUsage(std::cerr, *command);
        return kExitUsage;
    }
}

// tesutil: the command-line tool over libTesu_Utilities.
//
//   tesutil [--roots DIR[:DIR...]] [--debug LEVEL] [--diag LEVEL] <command> [arguments]
//   tesutil --help | tesutil <command> --help
//
// Exit status: 0 on success, 1 when a check fails or a thing is not found, 2 on bad usage.
//
// This file holds the dispatch, the global options and the argument parsing; the commands
// live in commands_*.cpp. The tool makes one Tesu::MsgMan for its lifetime, so that the
// library's messages reach the standard error stream ("ERROR:tesutil - ...").
#include <cstdint>
#include <cstdlib>
#include <exception>
#include <filesystem>
#include <iostream>
#include <string>
#include <system_error>
#include <vector>

#include "Port_Env.h"
#include "Port_PathList.h"
#include "Port_String.h"
#include "Tesu_DebugMessenger.h"
#include "Tesu_MsgMan.h"
#include "tesutil_cli.h"

#ifndef TESUTIL_SAMPLE_FROM_EXE
#define TESUTIL_SAMPLE_FROM_EXE "../share/tesu/examples/installation"
#endif

namespace tesutil {

namespace {

namespace fs = std::filesystem;

struct GlobalOptions {
    bool help = false;
    bool rootsGiven = false;
    std::string roots;
    bool debugGiven = false;
    Tesu::DebugMessenger::DebugLevel debug = Tesu::DebugMessenger::DEBUG_OFF;
    Tesu::MsgMan::DiagnosticLevel diag = Tesu::MsgMan::DIAG_STANDARD;
};

bool gDebugLevelGiven = false;

Tesu::MsgMan::DiagnosticLevel ParseDiagLevel(const std::string& text) {
    if (text == "silent") {
        return Tesu::MsgMan::DIAG_SILENT;
    }
    if (text == "reduced") {
        return Tesu::MsgMan::DIAG_REDUCED;
    }
    if (text == "standard") {
        return Tesu::MsgMan::DIAG_STANDARD;
    }
    if (text == "full") {
        return Tesu::MsgMan::DIAG_FULL;
    }
    throw UsageError{"unknown diagnostic level '" + text + "' (silent, reduced, standard, full)"};
}

// Reads the global options in front of the command; returns the index of the command name
// (arguments.size() when there is none).
std::size_t ParseGlobalOptions(const Arguments& arguments, GlobalOptions& options) {
    std::size_t index = 0;
    while (index < arguments.size()) {
        const std::string& argument = arguments[index];
        if (argument == "--help" || argument == "-h") {
            options.help = true;
            ++index;
            continue;
        }
        if (argument.size() < 2 || argument[0] != '-') {
            break;  // the command
        }
        std::string name = argument;
        std::string value;
        bool hasValue = false;
        const std::size_t equals = argument.find('=');
        if (equals != std::string::npos) {
            name = argument.substr(0, equals);
            value = argument.substr(equals + 1);
            hasValue = true;
        }
        if (name != "--roots" && name != "--debug" && name != "--diag") {
            throw UsageError{"unknown option '" + argument + "'"};
        }
        if (!hasValue) {
            if (index + 1 >= arguments.size()) {
                throw UsageError{"option " + name + " needs a value"};
            }
            value = arguments[++index];
        }
        ++index;
        if (name == "--roots") {
            options.rootsGiven = true;
            options.roots = value;
        } else if (name == "--debug") {
            options.debugGiven = true;
            options.debug = ParseDebugLevel(value);
        } else {
            options.diag = ParseDiagLevel(value);
        }
    }
    return index;
}

std::vector<Command> AllCommands() {
    std::vector<Command> all;
    for (const auto* group : {&FileCommands(), &InstallationCommands(), &DebugCommands()}) {
        all.insert(all.end(), group->begin(), group->end());
    }
    return all;
}

const Command* FindCommand(const std::vector<Command>& commands, const std::string& name) {
    for (const Command& command : commands) {
        if (name == command.name) {
            return &command;
        }
    }
    return nullptr;
}

void PrintUsage(std::ostream& out, const std::vector<Command>& commands) {
    out << "usage: tesutil [global options] <command> [arguments]\n"
           "       tesutil <command> --help\n"
           "global options (before the command):\n"
           "  --roots DIR[:DIR...]  installation roots, in search order (\";\" between them on\n"
           "                        Windows); default: TESSEL_ROOTS when it is set, else the\n"
           "                        sample installation "
        << TESUTIL_SAMPLE_FROM_EXE
        << "\n"
           "                        (relative to the directory of the tesutil executable)\n"
           "  --debug LEVEL         root logger level: off (default), normal, detailed, verbose\n"
           "  --diag LEVEL          messages on standard error: silent, reduced, standard\n"
           "                        (default), full\n"
           "commands:\n";
    for (const Command& command : commands) {
        std::string name = command.name;
        name.resize(14, ' ');
        out << "  " << name << command.summary << '\n';
    }
    out << "exit status: 0 success, 1 a check failed or a thing was not found, 2 bad usage\n";
}

void PrintCommandUsage(std::ostream& out, const Command& command) {
    out << "usage: tesutil " << command.name << ' ' << command.usage;
}

bool AsksForHelp(const Arguments& arguments) {
    for (const std::string& argument : arguments) {
        if (argument == "--") {
            return false;
        }
        if (argument == "--help" || argument == "-h") {
            return true;
        }
    }
    return false;
}

// The tool's own executable, absolute; empty when it cannot be found.
fs::path ExecutablePath(const char* argv0) {
    std::error_code error;
    fs::path self = fs::read_symlink("/proc/self/exe", error);
    if (!error && !self.empty()) {
        return self;
    }
    const fs::path given = argv0 != nullptr ? fs::path(argv0) : fs::path();
    if (given.empty()) {
        return {};
    }
    if (given.has_parent_path()) {
        return fs::absolute(given, error);
    }
    // Started through the search path.
    Port::StringBase<char> searchPath;
    if (!Port_Env::GetVariable("PATH", searchPath)) {
        return {};
    }
    const Port::PathList directories(searchPath, Port::QuarnelPath::GetListSeparator());
    for (const auto& directory : directories) {
        const fs::path candidate = fs::path(directory.str()) / given;
        if (fs::is_regular_file(candidate, error)) {
            return fs::absolute(candidate, error);
        }
    }
    return {};
}

// The installation roots: --roots when given, else TESSEL_ROOTS (the layer reads it), else
// the sample installation beside the executable. When the sample is not there either, the
// layer's own default stays (the installation prefix of the libraries).
void SetInstallationRoots(const GlobalOptions& options, const char* argv0) {
    const char separator = Port::QuarnelPath::GetListSeparator();
    if (options.rootsGiven) {
        Port::QuarnelPath::SetRoots(Port::PathList(options.roots, separator));
        return;
    }
    Port::StringBase<char> fromEnvironment;
    if (Port_Env::GetVariable("TESSEL_ROOTS", fromEnvironment)) {
        return;
    }
    const fs::path executable = ExecutablePath(argv0);
    if (executable.empty()) {
        return;
    }
    std::error_code error;
    const fs::path sample = (executable.parent_path() / TESUTIL_SAMPLE_FROM_EXE).lexically_normal();
    if (fs::is_directory(sample, error)) {
        // In the build tree the sample is a link to the source tree's copy: show the real
        // place in the paths the commands print.
        const fs::path real = fs::canonical(sample, error);
        Port::PathList roots;
        roots.Append(error ? sample.string() : real.string());
        Port::QuarnelPath::SetRoots(roots);
    }
}

}  // namespace

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

bool GlobalDebugLevelGiven() {
    return gDebugLevelGiven;
}

ParsedArguments ParseArguments(const Arguments& arguments, std::initializer_list<const char*> flags,
                               std::initializer_list<const char*> valueOptions) {
    auto known = [](std::initializer_list<const char*> names, const std::string& name) {
        for (const char* candidate : names) {
            if (name == candidate) {
                return true;
            }
        }
        return false;
    };
    ParsedArguments parsed;
    bool optionsEnded = false;
    for (std::size_t index = 0; index < arguments.size(); ++index) {
        const std::string& argument = arguments[index];
        if (optionsEnded || argument.size() < 2 || argument[0] != '-') {
            parsed.operands.push_back(argument);
            continue;
        }
        if (argument == "--") {
            optionsEnded = true;
            continue;
        }
        std::string name = argument;
        std::string value;
        bool hasValue = false;
        const std::size_t equals = argument.find('=');
        if (argument.compare(0, 2, "--") == 0 && equals != std::string::npos) {
            name = argument.substr(0, equals);
            value = argument.substr(equals + 1);
            hasValue = true;
        }
        if (known(flags, name)) {
            if (hasValue) {
                throw UsageError{"option " + name + " takes no value"};
            }
            parsed.flags.insert(name);
        } else if (known(valueOptions, name)) {
            if (!hasValue) {
                if (index + 1 >= arguments.size()) {
                    throw UsageError{"option " + name + " needs a value"};
                }
                value = arguments[++index];
            }
            parsed.values[name] = value;
        } else {
            throw UsageError{"unknown option '" + argument + "'"};
        }
    }
    return parsed;
}

void ExpectOperands(const ParsedArguments& parsed, std::size_t least, std::size_t most,
                    const char* names) {
    const std::size_t count = parsed.operands.size();
    if (count < least) {
        throw UsageError{std::string("missing operand (expects ") + names + ")"};
    }
    if (count > most) {
        throw UsageError{"extra operand '" + parsed.operands[most] + "' (expects " + names + ")"};
    }
}

int Fail(const char* command, const std::string& message) {
    std::cerr << "tesutil " << command << ": " << message << std::endl;
    return kExitFailed;
}

}  // namespace tesutil

int main(int argc, char** argv) {
    using namespace tesutil;
    // Results go out line by line, so that they keep their place among the messages on the
    // standard error stream when both go to one terminal or file.
    std::cout.setf(std::ios::unitbuf);

    const std::vector<Command> commands = AllCommands();
    const Arguments all(argv + 1, argv + argc);
    GlobalOptions options;
    std::size_t commandIndex = 0;
    try {
        commandIndex = ParseGlobalOptions(all, options);
    } catch (const UsageError& error) {
        std::cerr << "tesutil: " << error.message << "; tesutil --help shows the usage\n";
        return kExitUsage;
    }
    if (options.help) {
        PrintUsage(std::cout, commands);
        return kExitOk;
    }
    if (commandIndex >= all.size()) {
        std::cerr << "tesutil: no command given; tesutil --help lists the commands\n";
        return kExitUsage;
    }
    const Command* command = FindCommand(commands, all[commandIndex]);
    if (command == nullptr) {
        std::cerr << "tesutil: unknown command '" << all[commandIndex]
                  << "'; tesutil --help lists the commands\n";
        return kExitUsage;
    }
    const Arguments arguments(all.begin() + static_cast<std::ptrdiff_t>(commandIndex) + 1,
                              all.end());
    if (AsksForHelp(arguments)) {
        PrintCommandUsage(std::cout, *command);
        return kExitOk;
    }

    try {
        SetInstallationRoots(options, argc > 0 ? argv[0] : nullptr);
        if (options.debugGiven) {
            Tesu::DebugMessengerFactory::GetLogger()->SetLevel(options.debug);
        }
        gDebugLevelGiven = options.debugGiven;
        // Every message of the library reaches the standard error stream through this manager,
        // filtered by the diagnostic level, until the tool ends.
        Tesu::MsgMan messages(options.diag);
        return command->run(arguments);
    } catch (const UsageError& error) {
        std::cerr << "tesutil " << command->name << ": " << error.message << "; tesutil "
                  << command->name << " --help shows the usage\n";
        return kExitUsage;
    } catch (const std::exception& error) {
        return Fail(command->name, error.what());
    }
}

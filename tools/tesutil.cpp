// tesutil: the command-line tool over libTesu_Utilities.
//
//   tesutil [--roots DIR[:DIR...]] [--debug LEVEL] [--diag LEVEL] <command> [arguments]
//   tesutil --help | tesutil --version | tesutil <command> --help
//
// Exit status: 0 on success, 1 when a check fails, a thing is not found or output fails, 2 on
// bad usage.
//
// This file holds the command line (parsed with CLI11), the global options, the installation
// roots and the checked output; the commands live in commands_*.cpp. The tool makes one
// Tesu::MsgMan for its lifetime, so that the library's messages reach the standard error
// stream ("ERROR:tesutil - ...").
#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <exception>
#include <filesystem>
#include <iostream>
#include <string>
#include <system_error>
#include <vector>

#include <CLI/CLI.hpp>

#include "Port_Env.h"
#include "Port_PathList.h"
#include "Port_String.h"
#include "Tesu_DebugMessenger.h"
#include "Tesu_MsgMan.h"
#include "tesutil_cli.h"

#ifndef TESUTIL_SAMPLE_FROM_EXE
#define TESUTIL_SAMPLE_FROM_EXE "../share/tesu/examples/installation"
#endif
#ifndef TESUTIL_VERSION
#define TESUTIL_VERSION "unknown"
#endif

namespace tesutil {

namespace {

namespace fs = std::filesystem;

const char kVersionText[] =
    "tesutil " TESUTIL_VERSION
    "\n"
    "Copyright (c) 2026 The libTesu_Utilities developers.\n"
    "MIT License: free to use, copy, change and pass on; there is NO WARRANTY.";

struct GlobalOptions {
    std::string roots;
    std::string debug;
    std::string diag = "standard";
};

bool gDebugLevelGiven = false;
std::string gRootsOrigin;

const std::vector<std::string> kDebugLevels = {"off", "normal", "detailed", "verbose"};
const std::vector<std::string> kDiagLevels = {"silent", "reduced", "standard", "full"};

// A UsageError unless `value` is one of `names`; `what` names the kind in the message.
void CheckOneOf(const std::string& what, const std::vector<std::string>& names,
                const std::string& value) {
    if (std::find(names.begin(), names.end(), value) != names.end()) {
        return;
    }
    std::string list;
    for (const std::string& name : names) {
        list += (list.empty() ? "" : ", ") + name;
    }
    throw UsageError{"unknown " + what + " '" + value + "' (" + list + ")"};
}

// CLI11's message for a bad command line, in the words the tool uses for its own checks.
std::string UsageText(const CLI::ParseError& error) {
    const std::string text = error.what();
    const std::string override = " was given a disallowed flag override";
    if (text.size() > override.size() &&
        text.compare(text.size() - override.size(), override.size(), override) == 0) {
        const std::string name = text.substr(0, text.size() - override.size());
        return "option " + (name.compare(0, 1, "-") == 0 ? name : "--" + name) + " takes no value";
    }
    const std::size_t colon = text.find(": ");
    if (dynamic_cast<const CLI::ArgumentMismatch*>(&error) != nullptr &&
        colon != std::string::npos && text.find(" required ", colon) != std::string::npos) {
        return "option " + text.substr(0, colon) + " needs a value";
    }
    return text;
}

Tesu::MsgMan::DiagnosticLevel DiagLevelOf(const std::string& name) {
    CheckOneOf("diagnostic level", kDiagLevels, name);
    const auto at = std::find(kDiagLevels.begin(), kDiagLevels.end(), name);
    return static_cast<Tesu::MsgMan::DiagnosticLevel>(at - kDiagLevels.begin());
}

// CLI11's help, with no line ending in a blank and no blank lines at the end.
class HelpFormatter : public CLI::Formatter {
  public:
    std::string make_help(const CLI::App* app, std::string name,
                          CLI::AppFormatMode mode) const override {
        const std::string text = CLI::Formatter::make_help(app, std::move(name), mode);
        std::string result;
        std::size_t start = 0;
        while (start < text.size()) {
            std::size_t end = text.find('\n', start);
            if (end == std::string::npos) {
                end = text.size();
            }
            std::size_t last = end;
            while (last > start && (text[last - 1] == ' ' || text[last - 1] == '\t')) {
                --last;
            }
            result.append(text, start, last - start);
            result += '\n';
            start = end + 1;
        }
        while (result.size() > 1 && result[result.size() - 1] == '\n' &&
               result[result.size() - 2] == '\n') {
            result.pop_back();
        }
        return result;
    }
};

// The option of `app` whose long name is `name` ("--name"), or the only one it begins, as
// getopt_long accepts; null when there is none. An ambiguous beginning is a UsageError.
const CLI::Option* FindLongOption(const CLI::App& app, std::string& name) {
    const std::string wanted = name.substr(2);
    std::vector<std::pair<std::string, const CLI::Option*>> matches;
    for (const CLI::Option* option : app.get_options()) {
        for (const std::string& longName : option->get_lnames()) {
            if (longName == wanted) {
                return option;
            }
            if (longName.compare(0, wanted.size(), wanted) == 0) {
                matches.emplace_back(longName, option);
            }
        }
    }
    if (matches.size() == 1) {
        name = "--" + matches.front().first;
        return matches.front().second;
    }
    if (matches.size() > 1) {
        std::string possibilities;
        for (const auto& match : matches) {
            possibilities += " '--" + match.first + "'";
        }
        throw UsageError{"option '" + name + "' is ambiguous; possibilities:" + possibilities};
    }
    return nullptr;
}

// The command line made ready for CLI11: unique beginnings of long options completed, and
// the arguments after the command's "--" taken out into `tail` (they are operands whatever
// they look like). `command` is set to the command named, or null. Unknown options and
// commands are left for CLI11 and the checks after it.
std::vector<std::string> Prepare(const CLI::App& tool, const std::vector<std::string>& all,
                                 const CLI::App*& command, std::vector<std::string>& tail) {
    std::vector<std::string> prepared;
    const CLI::App* current = &tool;
    command = nullptr;
    for (std::size_t index = 0; index < all.size(); ++index) {
        std::string argument = all[index];
        if (argument == "--" && command != nullptr) {
            tail.assign(all.begin() + static_cast<std::ptrdiff_t>(index) + 1, all.end());
            break;
        }
        if (argument.size() > 2 && argument.compare(0, 2, "--") == 0) {
            const std::size_t equals = argument.find('=');
            std::string name = argument.substr(0, equals);
            const CLI::Option* option = FindLongOption(*current, name);
            const bool takesValue = option != nullptr && option->get_items_expected_min() > 0;
            prepared.push_back(equals == std::string::npos ? name : name + argument.substr(equals));
            if (takesValue && equals == std::string::npos && index + 1 < all.size()) {
                prepared.push_back(all[++index]);
            }
            continue;
        }
        if (argument.size() > 1 && argument[0] == '-') {
            prepared.push_back(argument);
            continue;
        }
        if (command == nullptr) {
            try {
                command = tool.get_subcommand(argument);
                current = command;
            } catch (const CLI::OptionNotFound&) {
                // An unknown command: reported after parsing.
            }
        }
        prepared.push_back(argument);
    }
    return prepared;
}

// The first argument CLI11 left over, as a usage message.
std::string Leftover(const std::vector<std::string>& remaining, const std::string& expects) {
    const std::string& first = remaining.front();
    if (first.size() > 1 && first[0] == '-') {
        return "unknown option '" + first + "'";
    }
    return "extra operand '" + first + "'" + expects;
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
void SetInstallationRoots(const CLI::App& tool, const GlobalOptions& options, const char* argv0) {
    const char separator = Port::QuarnelPath::GetListSeparator();
    if (tool.count("--roots") > 0) {
        gRootsOrigin = "--roots";
        Port::QuarnelPath::SetRoots(Port::PathList(options.roots, separator));
        return;
    }
    Port::StringBase<char> fromEnvironment;
    if (Port_Env::GetVariable("TESSEL_ROOTS", fromEnvironment)) {
        gRootsOrigin = "TESSEL_ROOTS";
        return;
    }
    gRootsOrigin = "installation prefix";
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
        gRootsOrigin = "sample installation";
    }
}

// `text` broken into lines of at most 79 characters at blanks; its own line breaks stay.
std::string Wrapped(const std::string& text) {
    constexpr std::size_t kWidth = 79;
    std::string result;
    std::size_t lineStart = 0;
    std::size_t start = 0;
    while (start <= text.size()) {
        std::size_t end = text.find_first_of(" \n", start);
        if (end == std::string::npos) {
            end = text.size();
        }
        const std::string word = text.substr(start, end - start);
        if (result.size() > lineStart && result.size() - lineStart + 1 + word.size() > kWidth) {
            result += '\n';
            lineStart = result.size();
        } else if (result.size() > lineStart) {
            result += ' ';
        }
        result += word;
        if (end < text.size() && text[end] == '\n') {
            result += '\n';
            lineStart = result.size();
        }
        start = end + 1;
    }
    return result;
}

void PrintUsageError(const std::string& command, const std::string& message) {
    const std::string who = command.empty() ? "tesutil" : "tesutil " + command;
    std::cerr << who << ": " << message << "; " << who << " --help shows the usage" << std::endl;
}

}  // namespace

Tesu::DebugMessenger::DebugLevel DebugLevelOf(const std::string& name) {
    CheckOneOf("debug level", kDebugLevels, name);
    const auto at = std::find(kDebugLevels.begin(), kDebugLevels.end(), name);
    return static_cast<Tesu::DebugMessenger::DebugLevel>(Tesu::DebugMessenger::DEBUG_OFF +
                                                         (at - kDebugLevels.begin()));
}

bool GlobalDebugLevelGiven() {
    return gDebugLevelGiven;
}

const std::string& RootsOrigin() {
    return gRootsOrigin;
}

std::string RootsLookedIn() {
    std::string list;
    for (const auto& root : Port::QuarnelPath::GetInstance()) {
        list += (list.empty() ? "" : std::string(1, Port::QuarnelPath::GetListSeparator())) +
                root.str();
    }
    return list.empty() ? "no installation roots" : list;
}

Command& AddCommand(CLI::App& tool, Commands& commands, const char* group, const char* name,
                    const char* summary, const char* description) {
    CLI::App* app = tool.add_subcommand(name, summary);
    app->group(group);
    app->footer(Wrapped(description));
    commands.emplace_back();
    commands.back().app = app;
    return commands.back();
}

void AddOperand(Command& command, const char* name, const char* help, bool many) {
    if (!command.operands) {
        command.operands = std::make_shared<std::vector<std::string>>();
    }
    std::shared_ptr<std::vector<std::string>> operands = command.operands;
    if (many) {
        command.app
            ->add_option_function<std::vector<std::string>>(
                name,
                [operands](const std::vector<std::string>& values) {
                    operands->insert(operands->end(), values.begin(), values.end());
                },
                help)
            ->type_name("");
    } else {
        command.app
            ->add_option_function<std::string>(
                name, [operands](const std::string& value) { operands->push_back(value); }, help)
            ->type_name("");
    }
}

void Print(const std::string& text) {
    errno = 0;
    const bool written = std::fwrite(text.data(), 1, text.size(), stdout) == text.size();
    if (!written || std::fflush(stdout) != 0 || std::ferror(stdout) != 0) {
        const int error = errno;
        throw WriteError{error != 0 ? std::strerror(error) : "cannot write to standard output"};
    }
}

void PrintLine(const std::string& line) {
    Print(line + '\n');
}

void FinishOutput() {
    Print(std::string());
}

std::string EscapedName(const std::string& name, bool& escaped) {
    escaped = name.find_first_of("\n\\") != std::string::npos;
    if (!escaped) {
        return name;
    }
    std::string result;
    for (const char c : name) {
        if (c == '\n') {
            result += "\\n";
        } else if (c == '\\') {
            result += "\\\\";
        } else {
            result += c;
        }
    }
    return result;
}

std::string NameLine(const std::string& name, const std::string& suffix) {
    bool escaped = false;
    const std::string shown = EscapedName(name, escaped);
    return (escaped ? "\\" : "") + shown + suffix;
}

int Fail(const char* command, const std::string& message) {
    std::cerr << "tesutil " << command << ": " << message << std::endl;
    return kExitFailed;
}

int FailFile(const char* command, const std::string& name, const std::string& reason) {
    bool escaped = false;
    return Fail(command, EscapedName(name, escaped) + ": " + reason);
}

}  // namespace tesutil

int main(int argc, char** argv) {
    using namespace tesutil;

    CLI::App tool("tesutil: the command-line tool over libTesu_Utilities", "tesutil");
    tool.formatter(std::make_shared<HelpFormatter>());
    tool.get_formatter()->column_width(24);
    // A flag takes no value ("--quiet=yes" is bad usage).
    tool.option_defaults()->disable_flag_override();
    tool.get_formatter()->label("REQUIRED", "");
    tool.allow_extras();
    tool.require_subcommand(0, 1);
    tool.set_version_flag("--version", kVersionText, "print the tool's version and exit");
    tool.set_help_flag("-h,--help", "print this help and exit");
    tool.footer(Wrapped(
        "Global options come before the command; tesutil <command> --help shows one command. "
        "Long options may be shortened to any unique beginning.\n"
        "Installation roots: --roots when given, else TESSEL_ROOTS when it is set (even to "
        "nothing), else the sample installation " TESUTIL_SAMPLE_FROM_EXE
        " (relative to the directory of the tesutil executable) when it is there, else the "
        "installation prefix; tesutil roots shows them.\n"
        "Exit status: 0 success, 1 a check failed, a thing was not found or output failed, "
        "2 bad usage."));
    GlobalOptions options;
    tool.add_option("--roots", options.roots,
                    "installation roots in search order (\";\" on Windows)")
        ->type_name("DIR[:DIR...]");
    tool.add_option("--debug", options.debug,
                    "root logger: off (default), normal, detailed, verbose")
        ->type_name("LEVEL");
    tool.add_option("--diag", options.diag, "messages shown: silent, reduced, standard, full")
        ->type_name("LEVEL");

    Commands commands;
    AddFileCommands(tool, commands);
    AddInstallationCommands(tool, commands);
    AddDebugCommands(tool, commands);
    for (Command& command : commands) {
        command.app->allow_extras();
        command.app->formatter(tool.get_formatter());
        command.app->set_help_flag("-h,--help", "print this help and exit");
    }

    const std::vector<std::string> all(argv + 1, argv + argc);
    const CLI::App* named = nullptr;
    const Command* command = nullptr;
    try {
        std::vector<std::string> tail;
        std::vector<std::string> prepared = Prepare(tool, all, named, tail);
        std::reverse(prepared.begin(), prepared.end());
        tool.parse(prepared);
        const std::vector<std::string> leftover = tool.remaining();
        const std::vector<CLI::App*> selected = tool.get_subcommands();
        if (selected.empty()) {
            named = nullptr;
            if (leftover.empty() || (leftover.front().size() > 1 && leftover.front()[0] == '-')) {
                if (!leftover.empty()) {
                    throw UsageError{Leftover(leftover, "")};
                }
                std::cerr << "tesutil: no command given; tesutil --help lists the commands\n";
            } else {
                std::cerr << "tesutil: unknown command '" << leftover.front()
                          << "'; tesutil --help lists the commands\n";
            }
            return kExitUsage;
        }
        if (!leftover.empty()) {
            named = nullptr;  // a global option the tool does not know
            throw UsageError{Leftover(leftover, "")};
        }
        for (const Command& candidate : commands) {
            if (candidate.app == selected.front()) {
                command = &candidate;
            }
        }
        named = command->app;
        const std::string expects = std::string(" (expects ") + command->names + ")";
        const std::vector<std::string> extras = command->app->remaining();
        if (!extras.empty()) {
            throw UsageError{Leftover(extras, expects)};
        }
        std::vector<std::string> none;
        std::vector<std::string>& operands = command->operands ? *command->operands : none;
        operands.insert(operands.end(), tail.begin(), tail.end());
        if (operands.size() < command->least) {
            throw UsageError{"missing operand" + expects};
        }
        if (operands.size() > command->most) {
            throw UsageError{"extra operand '" + operands[command->most] + "'" + expects};
        }
    } catch (const CLI::CallForHelp&) {
        try {
            Print(tool.help());
        } catch (const WriteError& error) {
            std::cerr << "tesutil: write error: " << error.reason << std::endl;
            return kExitFailed;
        }
        return kExitOk;
    } catch (const CLI::CallForVersion& version) {
        try {
            PrintLine(version.what());
        } catch (const WriteError& error) {
            std::cerr << "tesutil: write error: " << error.reason << std::endl;
            return kExitFailed;
        }
        return kExitOk;
    } catch (const UsageError& error) {
        PrintUsageError(named != nullptr ? named->get_name() : "", error.message);
        return kExitUsage;
    } catch (const CLI::ParseError& error) {
        PrintUsageError(named != nullptr ? named->get_name() : "", UsageText(error));
        return kExitUsage;
    }
    try {
        // The levels are checked here, after the parse, so that a bad one is reported as a fault
        // of the global option rather than of the command that follows it.
        if (tool.count("--debug") > 0) {
            DebugLevelOf(options.debug);
        }
        DiagLevelOf(options.diag);
    } catch (const UsageError& error) {
        PrintUsageError("", error.message);
        return kExitUsage;
    }

    try {
        SetInstallationRoots(tool, options, argc > 0 ? argv[0] : nullptr);
        gDebugLevelGiven = tool.count("--debug") > 0;
        if (gDebugLevelGiven) {
            Tesu::DebugMessengerFactory::GetLogger()->SetLevel(DebugLevelOf(options.debug));
        }
        // Every message of the library reaches the standard error stream through this manager,
        // filtered by the diagnostic level, until the tool ends.
        Tesu::MsgMan messages(DiagLevelOf(options.diag));
        const int status = command->run();
        FinishOutput();
        return status;
    } catch (const UsageError& error) {
        PrintUsageError(command->app->get_name(), error.message);
        return kExitUsage;
    } catch (const WriteError& error) {
        std::cerr << "tesutil: write error: " << error.reason << std::endl;
        return kExitFailed;
    } catch (const std::exception& error) {
        return Fail(command->app->get_name().c_str(), error.what());
    }
}

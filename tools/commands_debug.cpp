// tesutil debug-demo: debug lines at each level, and the debug timers.
#include <chrono>
#include <iostream>
#include <thread>
#include <vector>

#include "Port_String.h"
#include "Tesu_DebugMessenger.h"
#include "tesutil_cli.h"

namespace tesutil {

namespace {

int RunDebugDemo(const Arguments& arguments) {
    const ParsedArguments parsed = ParseArguments(arguments, {}, {"--debug"});
    ExpectOperands(parsed, 0, 0, "no operands");

    // The command's own --debug wins; then the global one; a demonstration with every line
    // switched off would show nothing, so the default here is normal.
    Tesu::DebugMessenger* root = Tesu::DebugMessengerFactory::GetLogger();
    const auto given = parsed.values.find("--debug");
    if (given != parsed.values.end()) {
        root->SetLevel(ParseDebugLevel(given->second));
    } else if (!GlobalDebugLevelGiven()) {
        root->SetLevel(Tesu::DebugMessenger::DEBUG_NORMAL);
    }
    Tesu::DebugMessenger* demo = Tesu::DebugMessengerFactory::GetLogger("demo");
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

    std::cout << "named loggers in the registry:";
    std::vector<Port::StringBase<char>>* names = Tesu::DebugMessengerFactory::GetActiveLoggers();
    for (const auto& name : *names) {
        std::cout << ' ' << name.str();
    }
    delete names;
    std::cout << '\n';
    return kExitOk;
}

}  // namespace

const std::vector<Command>& DebugCommands() {
    static const std::vector<Command> commands = {
        {"debug-demo", "write debug lines at each level and show the debug timers",
         "[--debug off|normal|detailed|verbose]\n"
         "  Sets the root logger to the level given (default: the global --debug, else normal),\n"
         "  writes lines at each level through the root, a named logger and a logger of its\n"
         "  own, shows a timer, and lists the named loggers.\n",
         RunDebugDemo},
    };
    return commands;
}

}  // namespace tesutil

// tesutil debug-demo: debug lines at each level, and the debug timers.
#include <chrono>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include <CLI/CLI.hpp>

#include "Port_String.h"
#include "Tesu_DebugMessenger.h"
#include "tesutil_cli.h"

namespace tesutil {

namespace {

// `level` is the command's own --debug, empty when it was not given.
int RunDebugDemo(const std::string& level) {
    // The command's own --debug wins; then the global one; a demonstration with every line
    // switched off would show nothing, so the default here is normal.
    Tesu::DebugMessenger* root = Tesu::DebugMessengerFactory::GetLogger();
    if (!level.empty()) {
        root->SetLevel(DebugLevelOf(level));
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

    std::string line = "named loggers in the registry:";
    const std::unique_ptr<std::vector<Port::StringBase<char>>> names(
        Tesu::DebugMessengerFactory::GetActiveLoggers());
    for (const auto& name : *names) {
        line += ' ' + name.str();
    }
    PrintLine(line);
    return kExitOk;
}

}  // namespace

void AddDebugCommands(CLI::App& tool, Commands& commands) {
    auto level = std::make_shared<std::string>();
    Command& demo = AddCommand(
        tool, commands, "Debugging", "debug-demo",
        "write debug lines at each level and show timers",
        "Sets the root logger to the level given (default: the global --debug, else normal), "
        "writes lines at each level through the root, a named logger and a logger of its "
        "own, shows a timer, and lists the named loggers.");
    demo.app->add_option("--debug", *level, "root logger level: off, normal, detailed, verbose")
        ->type_name("LEVEL");
    demo.run = [level] { return RunDebugDemo(*level); };
}

}  // namespace tesutil

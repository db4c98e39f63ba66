// tesutil run as a process: standard output, standard error and exit status of every command,
// on the sample installation and on temporary files.
#include <fcntl.h>
#include <grp.h>
#include <pwd.h>
#include <spawn.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <csignal>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <regex>
#include <sstream>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "Port_Env.h"
#include "Port_String.h"
#include "TestSupport.h"
#include "Tesu_Utilities.h"

extern char** environ;

namespace {

namespace fs = std::filesystem;

const std::string kSample = std::string(TESU_SOURCE_DIR) + "/examples/installation";
const std::string kDemo = kSample + "/designs/demo";

struct ToolRun {
    int status = -1;
    std::string out;
    std::string err;
};

std::string ReadFile(const std::string& path) {
    std::ifstream in(path, std::ios::binary);
    std::ostringstream buffer;
    buffer << in.rdbuf();
    return buffer.str();
}

// How a run is set up beyond its arguments: variables added to an environment without
// TESSEL_ROOTS, the bytes on standard input, and where standard output goes (a file of the
// run's own when empty).
struct RunSetup {
    std::vector<std::string> environment;
    std::string input;
    std::string outputTo;
};

// Runs tesutil with `arguments`.
ToolRun Tool(const std::vector<std::string>& arguments, const RunSetup& setup = {}) {
    tesutest::TempDir capture;
    const std::string outFile = setup.outputTo.empty() ? capture.join("out") : setup.outputTo;
    const std::string errFile = capture.join("err");
    const std::string inFile = capture.write("in", setup.input);

    std::vector<std::string> argStrings = {TESUTIL_EXECUTABLE};
    argStrings.insert(argStrings.end(), arguments.begin(), arguments.end());
    std::vector<char*> argv;
    for (std::string& argument : argStrings) {
        argv.push_back(argument.data());
    }
    argv.push_back(nullptr);

    std::vector<std::string> envStrings;
    for (char** entry = environ; *entry != nullptr; ++entry) {
        if (std::string(*entry).rfind("TESSEL_ROOTS=", 0) != 0) {
            envStrings.emplace_back(*entry);
        }
    }
    envStrings.insert(envStrings.end(), setup.environment.begin(), setup.environment.end());
    std::vector<char*> envp;
    for (std::string& entry : envStrings) {
        envp.push_back(entry.data());
    }
    envp.push_back(nullptr);

    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_addopen(&actions, 0, inFile.c_str(), O_RDONLY, 0);
    posix_spawn_file_actions_addopen(&actions, 1, outFile.c_str(), O_WRONLY | O_CREAT | O_TRUNC,
                                     0600);
    posix_spawn_file_actions_addopen(&actions, 2, errFile.c_str(), O_WRONLY | O_CREAT | O_TRUNC,
                                     0600);
    pid_t pid = 0;
    const int spawned = posix_spawn(&pid, argv[0], &actions, nullptr, argv.data(), envp.data());
    posix_spawn_file_actions_destroy(&actions);
    ToolRun run;
    if (spawned != 0) {
        ADD_FAILURE() << "cannot start " << argv[0];
        return run;
    }
    int status = 0;
    waitpid(pid, &status, 0);
    run.status = WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
    run.out = setup.outputTo.empty() ? ReadFile(outFile) : std::string();
    run.err = ReadFile(errFile);
    return run;
}

ToolRun Tool(const std::vector<std::string>& arguments,
             const std::vector<std::string>& environment) {
    return Tool(arguments, RunSetup{environment, "", ""});
}

// tesutil with the sample installation as its only root.
ToolRun OnSample(std::vector<std::string> arguments) {
    arguments.insert(arguments.begin(), {"--roots", kSample});
    return Tool(arguments);
}

std::string ChecksumOf(const std::string& text) {
    Port::StringBase<char> checksum;
    Tesu::Utilities::CalculateChecksum(text, checksum);
    return checksum.str();
}

// The stored checksum text of a file: the eight characters after "# CRC:" and one more.
std::string StoredChecksum(const std::string& bytes) {
    const std::size_t marker = bytes.find("# CRC:");
    return marker == std::string::npos ? std::string() : bytes.substr(marker + 7, 8);
}

const char* const kCommands[] = {"verify",      "stamp",   "checksum",  "filelist", "roots",
                                 "cores-level", "find",    "java",      "version",  "abspath",
                                 "absdir",      "relpath", "debug-demo"};

// True when a line of `text` ends in a blank.
bool SomeLineEndsInABlank(const std::string& text) {
    return text.find(" \n") != std::string::npos || text.find("\t\n") != std::string::npos;
}

TEST(ToolHelp, EveryCommandHasHelpAndTheOverviewListsThemAll) {
    const ToolRun overview = Tool({"--help"});
    EXPECT_EQ(overview.status, 0);
    EXPECT_EQ(overview.err, "");
    EXPECT_NE(overview.out.find("\nUsage: tesutil [OPTIONS] [SUBCOMMAND]\n"), std::string::npos);
    EXPECT_FALSE(SomeLineEndsInABlank(overview.out)) << overview.out;
    for (const char* option :
         {"--roots DIR[:DIR...]", "--debug LEVEL", "--diag LEVEL", "--version"}) {
        EXPECT_NE(overview.out.find(option), std::string::npos) << option;
    }
    // A unique beginning of a long option is the option.
    EXPECT_EQ(Tool({"--he"}).out, overview.out);
    for (const char* command : kCommands) {
        EXPECT_NE(overview.out.find(std::string("\n  ") + command + " "), std::string::npos)
            << command;
        const ToolRun help = Tool({command, "--help"});
        EXPECT_EQ(help.status, 0) << command;
        EXPECT_EQ(help.err, "") << command;
        EXPECT_NE(help.out.find(std::string("\nUsage: tesutil ") + command + " [OPTIONS]"),
                  std::string::npos)
            << help.out;
        EXPECT_FALSE(SomeLineEndsInABlank(help.out)) << help.out;
        // -h is the same, and help wins over whatever else was given.
        EXPECT_EQ(Tool({command, "x", "-h"}).out, help.out) << command;
    }
    // After "--" a "--help" is an operand: a file of that name, which does not exist.
    const ToolRun operand = Tool({"checksum", "--", "--help"});
    EXPECT_EQ(operand.status, 1);
    EXPECT_EQ(operand.err, "tesutil checksum: --help: No such file or directory\n");
}

TEST(ToolHelp, VersionOptionNamesTheToolAndItsVersion) {
    const ToolRun run = Tool({"--version"});
    EXPECT_EQ(run.status, 0);
    EXPECT_EQ(run.err, "");
    EXPECT_EQ(run.out, std::string("tesutil ") + TESU_PROJECT_VERSION +
                           "\nCopyright (c) 2026 The libTesu_Utilities developers.\nMIT "
                           "License: free to use, copy, change and pass on; there is NO "
                           "WARRANTY.\n");
}

TEST(ToolOutput, AFailedWriteToStandardOutputEndsWithStatusOne) {
    if (!fs::exists("/dev/full")) {
        GTEST_SKIP() << "no /dev/full here";
    }
    tesutest::TempDir dir;
    const std::string file = dir.write("data.txt", "x\n");
    const std::vector<std::vector<std::string>> runs = {
        {"version"},
        {"--version"},
        {"--help"},
        {"verify", "--help"},
        {"checksum", file},
        {"verify", file},
        {"--roots", kSample, "roots"},
    };
    for (const auto& arguments : runs) {
        const ToolRun run = Tool(arguments, RunSetup{{}, "", "/dev/full"});
        SCOPED_TRACE(arguments.front());
        EXPECT_EQ(run.status, 1);
        EXPECT_EQ(run.err, "tesutil: write error: No space left on device\n");
    }
}

TEST(ToolUsage, BadUsageGivesStatusTwoAndOneLineNamingTheFault) {
    struct Case {
        std::vector<std::string> arguments;
        std::string line;  // the line on standard error, up to the hint that follows it
    };
    const Case cases[] = {
        {{}, "tesutil: no command given"},
        {{"frob"}, "tesutil: unknown command 'frob'"},
        {{"--bogus", "version"}, "tesutil: unknown option '--bogus'"},
        {{"--debug"}, "tesutil: option --debug needs a value"},
        {{"--debug", "loud", "version"},
         "tesutil: unknown debug level 'loud' (off, normal, detailed, verbose)"},
        {{"--diag=loud", "version"},
         "tesutil: unknown diagnostic level 'loud' (silent, reduced, standard, full)"},
        {{"verify"}, "tesutil verify: missing operand (expects FILE...)"},
        {{"verify", "--s", "a"},
         "tesutil verify: option '--s' is ambiguous; possibilities: '--status' '--strict'"},
        {{"verify", "--files-from"}, "tesutil verify: option --files-from needs a value"},
        {{"verify", "--files-from", "list", "a"},
         "tesutil verify: extra operand 'a' (file operands cannot be combined with "
         "--files-from)"},
        {{"stamp"}, "tesutil stamp: missing operand (expects FILE...)"},
        {{"filelist", "--paths=yes", "a"}, "tesutil filelist: option --paths takes no value"},
        {{"filelist", "a", "b"}, "tesutil filelist: extra operand 'b' (expects LIST)"},
        {{"find", "--bogus", "a"}, "tesutil find: unknown option '--bogus'"},
        {{"find"}, "tesutil find: missing operand (expects NAME)"},
        {{"cores-level", "now"}, "tesutil cores-level: extra operand 'now' (expects no operands)"},
        {{"java", "--", "x"}, "tesutil java: extra operand 'x' (expects no operands)"},
        {{"version", "-v"}, "tesutil version: unknown option '-v'"},
        {{"abspath", ""}, "tesutil abspath: PATH is empty"},
        {{"relpath", "base"}, "tesutil relpath: missing operand (expects BASE PATH)"},
        {{"debug-demo", "--debug", "loud"},
         "tesutil debug-demo: unknown debug level 'loud' (off, normal, detailed, verbose)"},
    };
    for (const Case& c : cases) {
        const ToolRun run = OnSample(c.arguments);
        SCOPED_TRACE(c.line);
        EXPECT_EQ(run.status, 2);
        EXPECT_EQ(run.out, "");
        EXPECT_EQ(run.err.rfind(c.line + "; tesutil ", 0), 0u) << run.err;
        EXPECT_EQ(std::count(run.err.begin(), run.err.end(), '\n'), 1) << run.err;
    }
}

TEST(ToolSample, CoresLevelFindAndJava) {
    const ToolRun level = OnSample({"cores-level"});
    EXPECT_EQ(level.status, 0);
    EXPECT_EQ(level.out, "Cores Update # 7\n");
    EXPECT_EQ(level.err, "");

    EXPECT_EQ(OnSample({"find", "IPupdate.log"}).out, kSample + "/IPupdate.log\n");
    EXPECT_EQ(OnSample({"find", "designs/demo"}).out, kSample + "/designs/demo\n");
    // Both container entries hold component.xml: the first in name order wins.
    const std::string container = kSample + "/tessel/ip/quarnel";
    EXPECT_EQ(OnSample({"find", "--container", "component.xml"}).out,
              container + "/fifo_sync/component.xml\n");
    EXPECT_EQ(OnSample({"find", "doc/uart_lite.txt", "--container"}).out,
              container + "/uart_lite/doc/uart_lite.txt\n");

    const ToolRun missing = OnSample({"find", "nothing.txt"});
    EXPECT_EQ(missing.status, 1);
    EXPECT_EQ(missing.out, "");
    EXPECT_EQ(missing.err,
              "tesutil find: 'nothing.txt' not found under the installation roots "
              "(looked in " +
                  kSample + ")\n");
    // The container search looks only inside the container's entries.
    const ToolRun notInEntry = OnSample({"find", "--container", "IPupdate.log"});
    EXPECT_EQ(notInEntry.status, 1);
    EXPECT_EQ(notInEntry.err,
              "tesutil find: 'IPupdate.log' not found in the IP container of any installation "
              "root (looked in " +
                  kSample + ")\n");

    const std::string platform = Port_Env::GetPlatformPath().str();
    const ToolRun java = OnSample({"java"});
    if (platform == "linux-x86_64") {
        EXPECT_EQ(java.status, 0);
        EXPECT_EQ(java.out, kSample + "/java/linux-x86_64/jre/bin/java\n");
    } else {
        EXPECT_EQ(java.status, 1);
        EXPECT_EQ(java.err, "tesutil java: no Java runtime java/" + platform +
                                "/jre/bin/java under the installation roots (looked in " + kSample +
                                ")\n");
    }
    tesutest::TempDir empty;
    const ToolRun noJava = Tool({"--roots", empty.path(), "java"});
    EXPECT_EQ(noJava.status, 1);
    EXPECT_EQ(noJava.out, "");
    EXPECT_NE(noJava.err.find("(looked in " + empty.path() + ")\n"), std::string::npos);
}

TEST(ToolSample, VersionShowsNameValueBuildStampAndNextMajor) {
    const ToolRun run = OnSample({"version"});
    EXPECT_EQ(run.status, 0);
    EXPECT_EQ(run.err, "");
    const std::string version = TESU_PROJECT_VERSION;
    const std::string nextMajor = std::to_string(std::stoi(version) + 1) + ".1";
    const std::regex expected(
        "name: Quarnel Tessel\nversion: " + std::regex_replace(version, std::regex("\\."), "\\.") +
        "\nbuilt: [A-Z][a-z]{2} [ 1-3][0-9] [0-9]{4} [0-2][0-9]:[0-5][0-9]:[0-5][0-9]\n"
        "next major release: " +
        std::regex_replace(nextMajor, std::regex("\\."), "\\.") + "\n");
    EXPECT_TRUE(std::regex_match(run.out, expected)) << run.out;
}

TEST(ToolSample, FileListGivesExistingMembersAndWarnsOfTheMissingOne) {
    const std::string list = kDemo + "/sources.lst";
    const std::string warning =
        "WARNING:tesutil - Missing file list member " + kDemo + "/rtl/fifo.v\n";
    const ToolRun members = OnSample({"filelist", list});
    EXPECT_EQ(members.status, 0);
    EXPECT_EQ(members.out, "rtl/top.v\nrtl/alu.v\nrtl/regs.v\nsim/tb_top.v\n");
    EXPECT_EQ(members.err, warning);

    const ToolRun paths = OnSample({"filelist", "--paths", list});
    EXPECT_EQ(paths.status, 0);
    EXPECT_EQ(paths.out, kDemo + "/rtl/top.v\n" + kDemo + "/rtl/alu.v\n" + kDemo + "/rtl/regs.v\n" +
                             kDemo + "/sim/tb_top.v\n");
    EXPECT_EQ(paths.err, warning);

    // At the reduced level warnings still show; silent shows nothing, the result stays.
    EXPECT_EQ(OnSample({"--diag", "reduced", "filelist", list}).err, warning);
    const ToolRun silent = OnSample({"--diag", "silent", "filelist", list});
    EXPECT_EQ(silent.err, "");
    EXPECT_EQ(silent.out, members.out);

    // A list that cannot be read is reported once, by the tool, with the system's reason.
    const ToolRun missing = OnSample({"filelist", kDemo + "/none.lst"});
    EXPECT_EQ(missing.status, 1);
    EXPECT_EQ(missing.out, "");
    EXPECT_EQ(missing.err, "tesutil filelist: " + kDemo + "/none.lst: No such file or directory\n");
    EXPECT_EQ(OnSample({"filelist", kDemo}).err,
              "tesutil filelist: " + kDemo + ": Is a directory\n");
}

TEST(ToolSample, VerifyAndChecksumOnTheStampedSampleFiles) {
    const ToolRun run =
        OnSample({"verify", kDemo + "/settings.cfg", kDemo + "/pins.cfg", kDemo + "/timing.cfg"});
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.out, kDemo + "/settings.cfg: OK\n" + kDemo + "/pins.cfg: OK\n" + kDemo +
                           "/timing.cfg: FAILED\n");
    EXPECT_EQ(run.err, "");
    EXPECT_EQ(OnSample({"verify", kDemo + "/pins.cfg"}).status, 0);

    // The checksum printed is the one the OK files carry.
    for (const char* name : {"settings.cfg", "pins.cfg"}) {
        const ToolRun checksum = OnSample({"checksum", kDemo + "/" + name});
        EXPECT_EQ(checksum.status, 0);
        EXPECT_EQ(checksum.out, StoredChecksum(ReadFile(kDemo + "/" + name)) + "\n") << name;
    }
    const ToolRun edited = OnSample({"checksum", kDemo + "/timing.cfg"});
    EXPECT_NE(edited.out, StoredChecksum(ReadFile(kDemo + "/timing.cfg")) + "\n");
}

TEST(ToolRoots, DefaultIsTheSampleThenTesselRootsThenTheOption) {
    tesutest::TempDir other;
    other.write("IPupdate.log", "cores_level=99\n");
    // Without either, the sample beside the executable.
    const ToolRun fallback = Tool({"cores-level"});
    EXPECT_EQ(fallback.out, "Cores Update # 7\n");
    EXPECT_EQ(Tool({"find", "IPupdate.log"}).out, kSample + "/IPupdate.log\n");
    // TESSEL_ROOTS when it is set, even to nothing.
    EXPECT_EQ(Tool({"cores-level"}, {"TESSEL_ROOTS=" + other.path()}).out, "Cores Update # 99\n");
    EXPECT_EQ(Tool({"cores-level"}, {"TESSEL_ROOTS="}).status, 1);
    // --roots before both, in the order given.
    EXPECT_EQ(Tool({"--roots", kSample + ":" + other.path(), "cores-level"},
                   {"TESSEL_ROOTS=" + other.path()})
                  .out,
              "Cores Update # 7\n");
    EXPECT_EQ(Tool({"--roots=" + other.path() + ":" + kSample, "cores-level"}).out,
              "Cores Update # 99\n");
}

TEST(ToolRoots, RootsCommandShowsEachRootWithItsOriginAndMarksTheMissing) {
    tesutest::TempDir other;
    const std::string gone = other.join("gone");
    struct Case {
        std::vector<std::string> arguments;
        std::vector<std::string> environment;
        std::string out;
    };
    const Case cases[] = {
        {{"roots"}, {}, kSample + "  (sample installation)\n"},
        {{"roots"},
         {"TESSEL_ROOTS=" + other.path() + ":" + gone},
         other.path() + "  (TESSEL_ROOTS)\n" + gone + "  (TESSEL_ROOTS, missing)\n"},
        {{"--roots", gone + ":" + kSample, "roots"},
         {"TESSEL_ROOTS=" + other.path()},
         gone + "  (--roots, missing)\n" + kSample + "  (--roots)\n"},
    };
    for (const Case& c : cases) {
        const ToolRun run = Tool(c.arguments, c.environment);
        EXPECT_EQ(run.status, 0);
        EXPECT_EQ(run.out, c.out);
        EXPECT_EQ(run.err, "");
    }
    const ToolRun none = Tool({"roots"}, {"TESSEL_ROOTS="});
    EXPECT_EQ(none.status, 1);
    EXPECT_EQ(none.out, "");
    EXPECT_EQ(none.err, "tesutil roots: no installation roots (TESSEL_ROOTS gives none)\n");
}

TEST(ToolRoots, CoresLevelFailuresSayWhatIsMissing) {
    tesutest::TempDir root;
    const ToolRun none = Tool({"--roots", root.path(), "cores-level"});
    EXPECT_EQ(none.status, 1);
    EXPECT_EQ(none.out, "");
    EXPECT_EQ(none.err,
              "tesutil cores-level: no installation root holds a readable IPupdate.log "
              "(looked in " +
                  root.path() + ")\n");
    const ToolRun noRoots = Tool({"cores-level"}, {"TESSEL_ROOTS="});
    EXPECT_EQ(noRoots.err,
              "tesutil cores-level: no installation root holds a readable "
              "IPupdate.log (looked in no installation roots)\n");

    root.write("IPupdate.log", "update started\nupdate finished\n");
    const ToolRun untagged = Tool({"--roots", root.path(), "cores-level"});
    EXPECT_EQ(untagged.status, 1);
    EXPECT_EQ(untagged.err,
              "tesutil cores-level: the update log IPupdate.log holds no cores_level= line\n");
}

TEST(ToolDiagnostics, DiagAndDebugLevelsGovernWhatReachesStandardError) {
    // The tool's own failure lines do not depend on the level: they are not library messages.
    tesutest::TempDir dir;
    const std::string missing = dir.join("missing.txt");
    for (const char* level : {"silent", "standard"}) {
        const ToolRun run = Tool({"--diag", level, "verify", missing});
        EXPECT_EQ(run.status, 1);
        EXPECT_EQ(run.out, "");
        EXPECT_EQ(run.err, "tesutil verify: " + missing + ": No such file or directory\n");
    }

    // Debug lines are status messages: shown from the standard level up, at the logger's level.
    const std::string trace =
        "DEBUG[utilities] - Looking for IPupdate.log\nFound " + kSample + "/IPupdate.log\n";
    EXPECT_EQ(OnSample({"--debug", "verbose", "find", "IPupdate.log"}).err, trace);
    EXPECT_EQ(OnSample({"--debug", "verbose", "--diag", "full", "find", "IPupdate.log"}).err,
              trace);
    EXPECT_EQ(OnSample({"--debug", "verbose", "--diag", "reduced", "find", "IPupdate.log"}).err,
              "");
    EXPECT_EQ(OnSample({"--debug", "normal", "find", "IPupdate.log"}).err, "");
    EXPECT_EQ(OnSample({"find", "IPupdate.log"}).err, "");

    // debug-demo: the global level reaches the root and the logger inheriting from it; the
    // demo's own logger is always verbose.
    const ToolRun demo = OnSample({"--debug", "off", "debug-demo"});
    EXPECT_EQ(demo.status, 0);
    EXPECT_EQ(demo.out, "named loggers in the registry: demo\n");
    EXPECT_EQ(demo.err.find("a normal line"), std::string::npos) << demo.err;
    EXPECT_NE(demo.err.find("DEBUG[demo.step] - Total debug time: "), std::string::npos);
    const ToolRun normal = OnSample({"debug-demo"});
    EXPECT_NE(normal.err.find("DEBUG - root logger: a normal line\n"), std::string::npos);
    EXPECT_NE(normal.err.find("DEBUG[demo] - inherits the root's level: a normal line\n"),
              std::string::npos);
    EXPECT_EQ(normal.err.find("a detailed line"), std::string::npos);
}

TEST(ToolFiles, VerifyOptionsDecideWhatIsPrintedAndTheStatus) {
    tesutest::TempDir dir;
    const std::string plain = dir.write("plain.txt", "no checksum line here\n");
    const std::string good =
        dir.write("good.txt", "# CRC: " + ChecksumOf("alpha\nbeta\n") + "\nalpha\nbeta\n");
    const std::string bad = dir.write("bad.txt", "# CRC: " + ChecksumOf("alpha\n") + "\nomega\n");
    const std::string subdir = dir.mkdir("sub");
    const std::string missing = dir.join("%s%n.txt");  // shown as given, "%" and all
    const std::string unreadable = "tesutil verify: " + missing +
                                   ": No such file or directory\ntesutil verify: " + subdir +
                                   ": Is a directory\n";
    struct Case {
        std::vector<std::string> arguments;
        int status;
        std::string out;
        std::string err;
    };
    const Case cases[] = {
        {{plain, good}, 0, plain + ": OK\n" + good + ": OK\n", ""},
        {{bad, missing, good, subdir}, 1, bad + ": FAILED\n" + good + ": OK\n", unreadable},
        {{"--quiet", bad, missing, good, subdir}, 1, bad + ": FAILED\n", unreadable},
        {{"-q", good}, 0, "", ""},
        {{"--status", bad, missing, good, subdir}, 1, "", ""},
        {{"--status", good, plain}, 0, "", ""},
        {{"--strict", plain, good},
         1,
         plain + ": FAILED (no checksum line)\n" + good + ": OK\n",
         ""},
        {{"--str", "--qu", plain, good}, 1, plain + ": FAILED (no checksum line)\n", ""},
    };
    for (const Case& c : cases) {
        std::vector<std::string> arguments = {"verify"};
        arguments.insert(arguments.end(), c.arguments.begin(), c.arguments.end());
        const ToolRun run = Tool(arguments);
        SCOPED_TRACE(c.arguments.front());
        EXPECT_EQ(run.status, c.status);
        EXPECT_EQ(run.out, c.out);
        EXPECT_EQ(run.err, c.err);
    }
    // A name that begins with "-" after "--".
    const std::string odd = dir.write("-100%s.txt", "data\n");
    EXPECT_EQ(Tool({"verify", "--", odd}).out, odd + ": OK\n");
    if (geteuid() != 0) {
        fs::permissions(good, fs::perms::none);
        EXPECT_EQ(Tool({"verify", good}).err, "tesutil verify: " + good + ": Permission denied\n");
    }
}

TEST(ToolFiles, ChecksumOfSeveralFilesOfStandardInputAndOfAList) {
    tesutest::TempDir dir;
    const std::string one = dir.write("one.txt", "ab\r\n# note\ncd\n");  // lines without "#"
    const std::string two = dir.write("two.txt", "x\n");
    const std::string missing = dir.join("none.txt");
    const std::string list = dir.write("names.lst", one + "\n\n" + missing + "\r\n" + two + "\n");
    const std::string c1 = ChecksumOf("abcd");
    const std::string c2 = ChecksumOf("x");
    const std::string gone = "tesutil checksum: " + missing + ": No such file or directory\n";
    struct Case {
        std::vector<std::string> arguments;
        std::string input;
        int status;
        std::string out;
        std::string err;
    };
    const Case cases[] = {
        // One operand: the bare checksum, as before; several: "<checksum>  <name>" lines.
        {{one}, "", 0, c1 + "\n", ""},
        {{one, missing, two}, "", 1, c1 + "  " + one + "\n" + c2 + "  " + two + "\n", gone},
        {{"-"}, "x\n", 0, c2 + "\n", ""},
        {{two, "-"}, "ab\ncd", 0, c2 + "  " + two + "\n" + c1 + "  -\n", ""},
        // A list: one name a line, empty lines skipped, CR-LF ends taken as ends.
        {{"--files-from", list}, "", 1, c1 + "  " + one + "\n" + c2 + "  " + two + "\n", gone},
        {{"--files-from", "-"}, two + "\n", 0, c2 + "  " + two + "\n", ""},
        {{"--files-from=-"},
         "-\n",
         1,
         "",
         "tesutil checksum: when reading file names from standard input, no file name of '-' "
         "allowed\n"},
        {{"--files-from", missing}, "", 1, "", gone},
        {{dir.path()}, "", 1, "", "tesutil checksum: " + dir.path() + ": Is a directory\n"},
    };
    for (const Case& c : cases) {
        std::vector<std::string> arguments = {"checksum"};
        arguments.insert(arguments.end(), c.arguments.begin(), c.arguments.end());
        const ToolRun run = Tool(arguments, RunSetup{{}, c.input, ""});
        SCOPED_TRACE(c.arguments.back());
        EXPECT_EQ(run.status, c.status);
        EXPECT_EQ(run.out, c.out);
        EXPECT_EQ(run.err, c.err);
    }
    // verify reads standard input and lists the same way.
    const std::string stamped = "# CRC: " + c2 + "\nx\n";
    EXPECT_EQ(Tool({"verify", "-"}, RunSetup{{}, stamped, ""}).out, "-: OK\n");
    EXPECT_EQ(Tool({"verify", "--files-from", "-"}, RunSetup{{}, two + "\n", ""}).out,
              two + ": OK\n");
}

TEST(ToolFiles, NamesWithALineBreakOrABackslashAreEscaped) {
    tesutest::TempDir dir;
    const std::string name = dir.write("two\nlines.txt", "x\n");
    const std::string shown = dir.path() + "/two\\nlines.txt";
    const std::string checksum = ChecksumOf("x");
    EXPECT_EQ(Tool({"checksum", name, name}).out,
              "\\" + checksum + "  " + shown + "\n\\" + checksum + "  " + shown + "\n");
    EXPECT_EQ(Tool({"verify", name}).out, "\\" + shown + ": OK\n");
    EXPECT_EQ(Tool({"stamp", name}).out, "\\" + shown + ": stamped (# CRC: " + checksum + ")\n");
    // One failure stays one line on the standard error stream.
    const ToolRun missing = Tool({"verify", "a\\b\nc"});
    EXPECT_EQ(missing.err, "tesutil verify: a\\\\b\\nc: No such file or directory\n");
}

TEST(ToolFiles, StampThenVerifyKeepsCrLfEndsAndCommentLines) {
    tesutest::TempDir dir;
    const std::string body =
        "# header comment\r\nwidth = 8 # inline comment\r\ndepth = 16\r\n"
        "\r\nname = fifo\r\n";
    const std::string file = dir.write("crlf.cfg", body);
    const std::string checksum = ChecksumOf("depth = 16\nname = fifo\n");

    const ToolRun stamp = Tool({"stamp", file});
    EXPECT_EQ(stamp.status, 0);
    EXPECT_EQ(stamp.out, file + ": stamped (# CRC: " + checksum + ")\n");
    EXPECT_EQ(stamp.err, "");
    // A new checksum line goes first, ended like the file's lines; nothing else changes.
    EXPECT_EQ(ReadFile(file), "# CRC: " + checksum + "\r\n" + body);
    EXPECT_EQ(Tool({"verify", file}).out, file + ": OK\n");
    EXPECT_EQ(Tool({"checksum", file}).out, checksum + "\n");

    // Stamping again changes nothing.
    const ToolRun again = Tool({"stamp", file});
    EXPECT_EQ(again.status, 0);
    EXPECT_EQ(again.out, file + ": already stamped (# CRC: " + checksum + ")\n");
    EXPECT_EQ(ReadFile(file), "# CRC: " + checksum + "\r\n" + body);

    // After an edit verify fails; stamping refreshes the line in place.
    dir.write("crlf.cfg", "# CRC: " + checksum + "\r\n" + body + "extra = 1\r\n");
    EXPECT_EQ(Tool({"verify", file}).out, file + ": FAILED\n");
    const std::string refreshed = ChecksumOf("depth = 16\nname = fifo\nextra = 1\n");
    ASSERT_NE(refreshed, checksum);
    EXPECT_EQ(Tool({"stamp", file}).status, 0);
    EXPECT_EQ(ReadFile(file), "# CRC: " + refreshed + "\r\n" + body + "extra = 1\r\n");
    EXPECT_EQ(Tool({"verify", file}).out, file + ": OK\n");

    // No temporary file is left beside it.
    EXPECT_EQ(std::distance(fs::directory_iterator(dir.path()), fs::directory_iterator()), 1);
}

TEST(ToolFiles, StampRefreshesTheLineTheCheckReads) {
    tesutest::TempDir dir;
    struct Case {
        std::string before;
        std::string after;  // with @ for the checksum text
    };
    const Case cases[] = {
        // The first "# CRC:" is the checksum line, even inside a comment; text after the
        // eight characters stays.
        {"a\n// see # CRC: 12345678 (kept)\nb\n# CRC: 00000000\n",
         "a\n// see # CRC: @ (kept)\nb\n# CRC: 00000000\n"},
        // A short or empty field is completed; the rest of the line was the field.
        {"a\n# CRC:\nb\n", "a\n# CRC: @\nb\n"},
        {"a\r\n# CRC: 12\r\nb", "a\r\n# CRC: @\r\nb"},
        {"# CRC: 0", "# CRC: @"},
        // No line end anywhere: the new first line ends in "\n".
        {"only", "# CRC: @\nonly"},
        {"", "# CRC: @\n"},
    };
    // The file is copied in blocks of 256 KiB: the field may begin just before a block's end,
    // at it, or the marker may straddle it.
    std::vector<Case> all(std::begin(cases), std::end(cases));
    const std::size_t block = 256 * 1024;
    for (const std::size_t before : {block - 10, block - 6, block - 3, block}) {
        const std::string data = std::string(before - 1, 'd') + "\n";
        all.push_back({data + "# CRC: 12345678 tail\nz\n", data + "# CRC: @ tail\nz\n"});
    }
    for (const Case& c : all) {
        SCOPED_TRACE(c.before.substr(0, 40));
        const std::string file = dir.write("case.txt", c.before);
        const ToolRun stamp = Tool({"stamp", file});
        EXPECT_EQ(stamp.status, 0) << stamp.err;
        const std::string checksum = Tool({"checksum", file}).out;
        ASSERT_EQ(checksum.size(), 9u);
        std::string after = c.after;
        after.replace(after.find('@'), 1, checksum.substr(0, 8));
        EXPECT_EQ(ReadFile(file), after);
        EXPECT_EQ(Tool({"verify", file}).out, file + ": OK\n");
    }
}

TEST(ToolFiles, StampKeepsPermissionsAndLinksAndGoesOnPastBadFiles) {
    tesutest::TempDir dir;
    const std::string target = dir.write("real.cfg", "value = 1\n");
    fs::permissions(target, fs::perms::owner_read | fs::perms::owner_write | fs::perms::group_read);
    const std::string link = dir.join("link.cfg");
    fs::create_symlink(target, link);
    const std::string missing = dir.join("missing.cfg");
    const std::string subdir = dir.mkdir("sub");

    const ToolRun run = Tool({"stamp", missing, link, subdir});
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.out, link + ": stamped (# CRC: " + ChecksumOf("value = 1\n") + ")\n");
    EXPECT_EQ(run.err, "tesutil stamp: " + missing +
                           ": No such file or directory\ntesutil stamp: " + subdir +
                           ": Is a directory\n");
    EXPECT_TRUE(fs::is_symlink(link));
    EXPECT_EQ(fs::status(target).permissions(),
              fs::perms::owner_read | fs::perms::owner_write | fs::perms::group_read);
    EXPECT_EQ(Tool({"verify", target}).out, target + ": OK\n");
    EXPECT_FALSE(fs::exists(missing));
}

// The entries of a directory, by name.
std::vector<std::string> Entries(const std::string& directory) {
    std::vector<std::string> names;
    for (const auto& entry : fs::directory_iterator(directory)) {
        names.push_back(entry.path().filename().string());
    }
    std::sort(names.begin(), names.end());
    return names;
}

TEST(ToolStamp, KeepsTheOwnerGroupAndModeOfAnotherUsersFile) {
    if (geteuid() != 0) {
        GTEST_SKIP() << "only root can give a file to another user";
    }
    const struct passwd* nobody = getpwnam("nobody");
    const struct group* nogroup = getgrnam("nogroup");
    if (nobody == nullptr || nogroup == nullptr) {
        GTEST_SKIP() << "no user nobody or group nogroup here";
    }
    tesutest::TempDir dir;
    const std::string file = dir.write("theirs.cfg", "value = 1\n");
    ASSERT_EQ(chown(file.c_str(), nobody->pw_uid, nogroup->gr_gid), 0);
    ASSERT_EQ(chmod(file.c_str(), 0640), 0);
    const ToolRun run = Tool({"stamp", file});
    EXPECT_EQ(run.status, 0) << run.err;
    struct stat info;
    ASSERT_EQ(stat(file.c_str(), &info), 0);
    EXPECT_EQ(info.st_uid, nobody->pw_uid);
    EXPECT_EQ(info.st_gid, nogroup->gr_gid);
    EXPECT_EQ(info.st_mode & 07777, 0640u);
    EXPECT_EQ(ReadFile(file), "# CRC: " + ChecksumOf("value = 1\n") + "\nvalue = 1\n");
}

TEST(ToolStamp, RefusesHardLinkedAndReadOnlyFilesUnlessForced) {
    tesutest::TempDir dir;
    const std::string text = "value = 2\n";
    const std::string stamped = "# CRC: " + ChecksumOf(text) + "\n" + text;
    const std::string linked = dir.write("linked.cfg", text);
    const std::string other = dir.join("other-name.cfg");
    fs::create_hard_link(linked, other);
    const ToolRun refused = Tool({"stamp", linked});
    EXPECT_EQ(refused.status, 1);
    EXPECT_EQ(refused.out, "");
    EXPECT_EQ(refused.err, "tesutil stamp: " + linked +
                               ": it has 2 hard links, which replacing it would part from the "
                               "new text; --force rewrites it in place\n");
    EXPECT_EQ(ReadFile(linked), text);
    // Forced, it is rewritten in place: both names see the new text.
    const ToolRun forced = Tool({"stamp", "--force", linked});
    EXPECT_EQ(forced.status, 0) << forced.err;
    EXPECT_EQ(ReadFile(linked), stamped);
    EXPECT_EQ(ReadFile(other), stamped);
    EXPECT_EQ(fs::hard_link_count(linked), 2u);

    const std::string readOnly = dir.write("read-only.cfg", text);
    fs::permissions(readOnly, fs::perms::owner_read | fs::perms::group_read);
    const ToolRun kept = Tool({"stamp", readOnly});
    EXPECT_EQ(kept.status, 1);
    EXPECT_EQ(kept.err,
              "tesutil stamp: " + readOnly +
                  (geteuid() == 0 ? ": the file is read-only; --force stamps it all the same\n"
                                  : ": Permission denied\n"));
    EXPECT_EQ(ReadFile(readOnly), text);
    if (geteuid() == 0) {
        EXPECT_EQ(Tool({"stamp", "-f", readOnly}).status, 0);
        EXPECT_EQ(ReadFile(readOnly), stamped);
        EXPECT_EQ(fs::status(readOnly).permissions(),
                  fs::perms::owner_read | fs::perms::group_read);
    }
    EXPECT_EQ(Entries(dir.path()),
              (std::vector<std::string>{"linked.cfg", "other-name.cfg", "read-only.cfg"}));
}

TEST(ToolStamp, AFailedWriteLeavesTheFileAndNoTemporaryFile) {
    // A file size limit below the new text's size makes the writes to the temporary file fail
    // (the limit and the ignored SIGXFSZ are inherited by the tool).
    tesutest::TempDir dir;
    const std::string text(200 * 1024, 'x');
    const std::string file = dir.write("big.cfg", text);
    struct rlimit saved;
    ASSERT_EQ(getrlimit(RLIMIT_FSIZE, &saved), 0);
    struct rlimit limited = saved;
    limited.rlim_cur = 64 * 1024;
    void (*savedHandler)(int) = signal(SIGXFSZ, SIG_IGN);
    ASSERT_EQ(setrlimit(RLIMIT_FSIZE, &limited), 0);
    const ToolRun run = Tool({"stamp", file});
    setrlimit(RLIMIT_FSIZE, &saved);
    signal(SIGXFSZ, savedHandler);
    EXPECT_EQ(run.status, 1);
    EXPECT_EQ(run.out, "");
    EXPECT_EQ(run.err.rfind("tesutil stamp: " + file + ": cannot write the temporary file " +
                                dir.path() + "/.big.cfg.",
                            0),
              0u)
        << run.err;
    EXPECT_NE(run.err.find(".tmp: File too large\n"), std::string::npos) << run.err;
    EXPECT_EQ(ReadFile(file), text);
    EXPECT_EQ(Entries(dir.path()), std::vector<std::string>{"big.cfg"});
}

TEST(ToolPaths, AbsPathAbsDirAndRelPath) {
    tesutest::TempDir dir;
    const std::string sub = dir.mkdir("sub");
    const std::string file = dir.write("sub/file.v", "x\n");
    const std::string root = dir.path();

    EXPECT_EQ(Tool({"abspath", root + "/sub/../sub//file.v"}).out, file + "\n");
    EXPECT_EQ(Tool({"abspath", root + "/./sub"}).out, sub + "/\n");
    EXPECT_EQ(Tool({"abspath", root + "/new/thing"}).out, root + "/new/thing\n");

    EXPECT_EQ(Tool({"absdir", file}).out, sub + "/\n");
    EXPECT_EQ(Tool({"absdir", sub}).out, sub + "/\n");
    EXPECT_EQ(Tool({"absdir", root + "/new/thing"}).out, root + "/new/\n");

    const ToolRun relative = Tool({"relpath", root, file});
    EXPECT_EQ(relative.status, 0);
    EXPECT_EQ(relative.out, "./sub/file.v\n");
    EXPECT_EQ(Tool({"relpath", file, sub + "/other.v"}).out, "./other.v\n");
    EXPECT_EQ(Tool({"relpath", sub, root}).out, root + "/\n");
    EXPECT_EQ(Tool({"relpath", "", file}).out, file + "\n");
}

}  // namespace

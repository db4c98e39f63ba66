// tesutil run as a process: standard output, standard error and exit status of every command,
// on the sample installation and on temporary files.
#include <fcntl.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

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

// Runs tesutil with `arguments`, in an environment without TESSEL_ROOTS plus `environment`.
ToolRun Tool(const std::vector<std::string>& arguments,
             const std::vector<std::string>& environment = {}) {
    tesutest::TempDir capture;
    const std::string outFile = capture.join("out");
    const std::string errFile = capture.join("err");

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
    envStrings.insert(envStrings.end(), environment.begin(), environment.end());
    std::vector<char*> envp;
    for (std::string& entry : envStrings) {
        envp.push_back(entry.data());
    }
    envp.push_back(nullptr);

    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
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
    run.out = ReadFile(outFile);
    run.err = ReadFile(errFile);
    return run;
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

const char* const kCommands[] = {"verify",      "stamp",  "checksum", "filelist",
                                 "cores-level", "find",   "java",     "version",
                                 "abspath",     "absdir", "relpath",  "debug-demo"};

TEST(ToolHelp, EveryCommandHasHelpAndTheOverviewListsThemAll) {
    const ToolRun overview = Tool({"--help"});
    EXPECT_EQ(overview.status, 0);
    EXPECT_EQ(overview.err, "");
    EXPECT_EQ(overview.out.rfind("usage: tesutil [global options] <command>", 0), 0u);
    for (const char* option : {"--roots DIR[:DIR...]", "--debug LEVEL", "--diag LEVEL"}) {
        EXPECT_NE(overview.out.find(option), std::string::npos) << option;
    }
    for (const char* command : kCommands) {
        EXPECT_NE(overview.out.find(std::string("\n  ") + command + " "), std::string::npos)
            << command;
        const ToolRun help = Tool({command, "--help"});
        EXPECT_EQ(help.status, 0) << command;
        EXPECT_EQ(help.err, "") << command;
        EXPECT_EQ(help.out.rfind(std::string("usage: tesutil ") + command + " ", 0), 0u)
            << help.out;
        // -h is the same, and help wins over whatever else was given.
        EXPECT_EQ(Tool({command, "x", "-h"}).out, help.out) << command;
    }
    // After "--" a "--help" is an operand: a file of that name, which does not exist.
    const ToolRun operand = Tool({"checksum", "--", "--help"});
    EXPECT_EQ(operand.status, 1);
    EXPECT_EQ(operand.err, "tesutil checksum: --help: no such file\n");
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
        {{"stamp"}, "tesutil stamp: missing operand (expects FILE...)"},
        {{"checksum", "a", "b"}, "tesutil checksum: extra operand 'b' (expects FILE)"},
        {{"filelist", "--paths=yes", "a"}, "tesutil filelist: option --paths takes no value"},
        {{"find", "--bogus", "a"}, "tesutil find: unknown option '--bogus'"},
        {{"find"}, "tesutil find: missing operand (expects NAME)"},
        {{"cores-level", "now"}, "tesutil cores-level: extra operand 'now' (expects no operands)"},
        {{"java", "x"}, "tesutil java: extra operand 'x' (expects no operands)"},
        {{"version", "-v"}, "tesutil version: unknown option '-v'"},
        {{"abspath", ""}, "tesutil abspath: PATH is empty"},
        {{"absdir"}, "tesutil absdir: missing operand (expects PATH)"},
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
    EXPECT_EQ(missing.err, "tesutil find: 'nothing.txt' not found under the installation roots\n");
    // The container search looks only inside the container's entries.
    const ToolRun notInEntry = OnSample({"find", "--container", "IPupdate.log"});
    EXPECT_EQ(notInEntry.status, 1);
    EXPECT_EQ(notInEntry.err,
              "tesutil find: 'IPupdate.log' not found in the IP container of any installation "
              "root\n");

    const std::string platform = Port_Env::GetPlatformPath().str();
    const ToolRun java = OnSample({"java"});
    if (platform == "linux-x86_64") {
        EXPECT_EQ(java.status, 0);
        EXPECT_EQ(java.out, kSample + "/java/linux-x86_64/jre/bin/java\n");
    } else {
        EXPECT_EQ(java.status, 1);
        EXPECT_EQ(java.err, "tesutil java: no Java runtime java/" + platform +
                                "/jre/bin/java under the installation roots\n");
    }
    tesutest::TempDir empty;
    const ToolRun noJava = Tool({"--roots", empty.path(), "java"});
    EXPECT_EQ(noJava.status, 1);
    EXPECT_EQ(noJava.out, "");
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

TEST(ToolRoots, CoresLevelFailuresSayWhatIsMissing) {
    tesutest::TempDir root;
    const ToolRun none = Tool({"--roots", root.path(), "cores-level"});
    EXPECT_EQ(none.status, 1);
    EXPECT_EQ(none.out, "");
    EXPECT_EQ(none.err,
              "tesutil cores-level: no installation root holds a readable IPupdate.log\n");

    root.write("IPupdate.log", "update started\nupdate finished\n");
    const ToolRun untagged = Tool({"--roots", root.path(), "cores-level"});
    EXPECT_EQ(untagged.status, 1);
    EXPECT_EQ(untagged.err,
              "tesutil cores-level: the update log IPupdate.log holds no cores_level= line\n");
}

TEST(ToolDiagnostics, DiagAndDebugLevelsGovernWhatReachesStandardError) {
    tesutest::TempDir dir;
    const std::string missing = dir.join("missing.txt");
    const ToolRun standard = Tool({"verify", missing});
    EXPECT_EQ(standard.status, 1);
    EXPECT_EQ(standard.out, missing + ": no such file\n");
    EXPECT_EQ(standard.err, "ERROR:tesutil - Could not open " + missing + "\n");
    const ToolRun silent = Tool({"--diag", "silent", "verify", missing});
    EXPECT_EQ(silent.status, 1);
    EXPECT_EQ(silent.out, standard.out);
    EXPECT_EQ(silent.err, "");

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

TEST(ToolFiles, VerifyReportsEachFileAndFailsWhenAnyIsNotOk) {
    tesutest::TempDir dir;
    const std::string plain = dir.write("plain.txt", "no checksum line here\n");
    const std::string good =
        dir.write("good.txt", "# CRC: " + ChecksumOf("alpha\nbeta\n") + "\nalpha\nbeta\n");
    const std::string bad = dir.write("bad.txt", "# CRC: " + ChecksumOf("alpha\n") + "\nomega\n");
    const std::string subdir = dir.mkdir("sub");

    const ToolRun ok = Tool({"verify", plain, good});
    EXPECT_EQ(ok.status, 0);
    EXPECT_EQ(ok.out, plain + ": OK\n" + good + ": OK\n");

    const ToolRun mixed = Tool({"verify", bad, subdir, good});
    EXPECT_EQ(mixed.status, 1);
    EXPECT_EQ(mixed.out, bad + ": FAILED\n" + subdir + ": is a directory\n" + good + ": OK\n");
    EXPECT_EQ(mixed.err, "ERROR:tesutil - Could not open " + subdir + "\n");

    // A name that begins with "-" after "--"; the message shows the name as given, "%" and all.
    const std::string odd = dir.write("-100%s.txt", "data\n");
    const ToolRun dashed = Tool({"verify", "--", odd});
    EXPECT_EQ(dashed.status, 0);
    EXPECT_EQ(dashed.out, odd + ": OK\n");
    const ToolRun oddMissing = Tool({"verify", dir.join("%s%n.txt")});
    EXPECT_EQ(oddMissing.err, "ERROR:tesutil - Could not open " + dir.join("%s%n.txt") + "\n");
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
    for (const Case& c : cases) {
        SCOPED_TRACE(c.before);
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
    EXPECT_EQ(run.err, "tesutil stamp: " + missing + ": no such file\ntesutil stamp: " + subdir +
                           ": is a directory\n");
    EXPECT_TRUE(fs::is_symlink(link));
    EXPECT_EQ(fs::status(target).permissions(),
              fs::perms::owner_read | fs::perms::owner_write | fs::perms::group_read);
    EXPECT_EQ(Tool({"verify", target}).out, target + ": OK\n");
    EXPECT_FALSE(fs::exists(missing));
}

TEST(ToolFiles, ChecksumAndFileListFailuresNameTheFile) {
    tesutest::TempDir dir;
    const std::string missing = dir.join("none.txt");
    const ToolRun checksum = Tool({"checksum", missing});
    EXPECT_EQ(checksum.status, 1);
    EXPECT_EQ(checksum.out, "");
    EXPECT_EQ(checksum.err, "tesutil checksum: " + missing + ": no such file\n");
    EXPECT_EQ(Tool({"checksum", dir.path()}).err,
              "tesutil checksum: " + dir.path() + ": is a directory\n");
    // Only lines without "#" count, CR-LF or not.
    const std::string mixed = dir.write("mixed.txt", "ab\r\n# note\ncd\n");
    EXPECT_EQ(Tool({"checksum", mixed}).out, ChecksumOf("abcd") + "\n");

    const ToolRun list = Tool({"filelist", missing});
    EXPECT_EQ(list.status, 1);
    EXPECT_EQ(list.out, "");
    EXPECT_EQ(list.err, "ERROR:tesutil - Cannot read " + missing +
                            "\ntesutil filelist: " + missing + ": no such file\n");
    const ToolRun listDir = Tool({"filelist", dir.path()});
    EXPECT_EQ(listDir.status, 1);
    EXPECT_EQ(listDir.err, "ERROR:tesutil - Cannot open " + dir.path() +
                               "\ntesutil filelist: " + dir.path() + ": is a directory\n");
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

// Every public operation that takes a file or a path, given names and files that a careless or
// hostile caller might pass: a missing name, a directory, an empty file, binary bytes, a line
// of 10 MB, a name of 4,000 characters, a name holding "%n%s", and a file this process may not
// read. Each gives its documented result and message, whole and exact, and returns.
#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <string>
#include <vector>

#include "Port_FileName.h"
#include "Port_PathList.h"
#include "Port_String.h"
#include "TestPlatform.h"
#include "TestSupport.h"
#include "Tesu_DebugMessenger.h"
#include "Tesu_IPUpdateInfo.h"
#include "Tesu_SetWorkingDirectory.h"
#include "Tesu_Utilities.h"

namespace {

namespace fs = std::filesystem;
using Tesu::Utilities;
using Text = Port::StringBase<char>;

constexpr std::size_t kLongLine = 10 * 1024 * 1024;
constexpr std::size_t kLongName = 4000;
// Format directives that would read and write through missing arguments if a name were ever
// used as a format.
const std::string kFormatName = "%n%s%n%s";

// Bytes of every value but the line break, NUL included, four times over.
std::string BinaryBytes() {
    std::string bytes;
    for (int round = 0; round < 4; ++round) {
        for (int c = 0; c < 256; ++c) {
            if (c != '\n') {
                bytes += static_cast<char>(c);
            }
        }
    }
    return bytes;
}

// Makes the directories of an absolute path of exactly `length` characters under `dir`, in
// components of at most 100 characters, and returns it.
std::string LongDirectory(const tesutest::TempDir& dir, std::size_t length) {
    std::string path = dir.path();
    char letter = 'a';
    while (length - path.size() > 102) {
        path += "/" + std::string(100, letter++);
    }
    path += "/" + std::string(length - path.size() - 1, 'z');
    fs::create_directories(path);
    return path;
}

// Why names of 4,000 characters cannot be made here, or null when they can.
const char* WhyNoLongNames() {
#if defined(_WIN32)
    return "names beyond 260 characters need the \\\\?\\ prefix, which the layer does not add";
#else
    return nullptr;
#endif
}

#define SKIP_UNLESS_LONG_NAMES()              \
    if (const char* why = WhyNoLongNames()) { \
        GTEST_SKIP() << why;                  \
    }

// Takes every permission from `path` for the lifetime of the object.
struct Unreadable {
    explicit Unreadable(std::string p) : path(std::move(p)) {
        fs::permissions(path, fs::perms::none);
    }
    ~Unreadable() {
        std::error_code ec;
        fs::permissions(path, fs::perms::owner_all, ec);
    }
    std::string path;
};

#define SKIP_UNLESS_PERMISSIONS_LOCK_OUT()                          \
    if (const char* why = tesutest::WhyPermissionsDoNotLockOut()) { \
        GTEST_SKIP() << why;                                        \
    }

// ---- Checksummed files -----------------------------------------------------------------

struct Validation {
    unsigned int result;
    bool verdict;
    std::string messages;
};

// `initial` is the verdict's value before the call, the opposite of the one expected, so
// that a verdict left unwritten shows.
Validation Validate(const std::string& name, bool initial) {
    tesutest::MessageCapture capture;
    bool verdict = initial;
    const unsigned int result = Utilities::ValidateFileChecksum(Text(name), verdict);
    return Validation{result, verdict, capture.text()};
}

std::string Stamp(const std::string& body) {
    Text checksum;
    Utilities::CalculateChecksum(Text(body), checksum);
    return "# CRC: " + checksum.str() + "\n";
}

// `shown` is the name as the message gives it: made with "%s", it ends at a NUL byte.
void ExpectNotOpened(const std::string& name, const std::string& shown) {
    const Validation v = Validate(name, true);
    EXPECT_EQ(v.result, 1u);
    EXPECT_FALSE(v.verdict);
    EXPECT_EQ(v.messages, "ERROR:tesutil - Could not open " + shown + "\n");
}
void ExpectNotOpened(const std::string& name) {
    ExpectNotOpened(name, name);
}

void ExpectChecked(const std::string& name, bool verdict) {
    const Validation v = Validate(name, !verdict);
    EXPECT_EQ(v.result, 0u) << name;
    EXPECT_EQ(v.verdict, verdict) << name;
    EXPECT_EQ(v.messages, "") << name;
}

TEST(BadInputChecksum, NamesThatAreNoReadableFileAreReportedAsNotOpened) {
    tesutest::TempDir dir;
    ExpectNotOpened(dir.join("missing.v"));
    ExpectNotOpened(dir.path());
    ExpectNotOpened(dir.path() + "/");
    ExpectNotOpened("");
    ExpectNotOpened(dir.join(kFormatName));
    ExpectNotOpened(dir.join(std::string(kLongName, 'n')));
    // A NUL byte would make the system see only the name before it, which here exists.
    const std::string real = dir.write("real.v", "");
    ExpectNotOpened(real + std::string(1, '\0') + "junk", real);
}

TEST(BadInputChecksum, UnusualContentIsCheckedLikeAnyOther) {
    tesutest::TempDir dir;
    ExpectChecked(dir.write("empty.v", ""), true);

    ExpectChecked(dir.write("binary-unstamped.v", BinaryBytes()), true);
    // Binary data lines (without "#", which would make them comments) count byte for byte.
    std::string binary = BinaryBytes();
    binary.erase(std::remove(binary.begin(), binary.end(), '#'), binary.end());
    const std::string stamp = Stamp(binary);
    ExpectChecked(dir.write("binary.v", stamp + binary), true);
    ExpectChecked(dir.write("binary-edited.v", stamp + binary + "x"), false);
    std::string flipped = binary;
    flipped[100] = static_cast<char>(flipped[100] ^ 0x80);
    ExpectChecked(dir.write("binary-flipped.v", stamp + flipped), false);
    // A stamp cut short at the end of the file: fewer than eight characters to compare.
    ExpectChecked(dir.write("short-stamp.v", "data\n# CRC: 12"), false);

    const std::string line(kLongLine, 'L');
    ExpectChecked(dir.write("long-line.v", line + "\n" + Stamp(line)), true);
    ExpectChecked(dir.write("long-line-edited.v", line + "L\n" + Stamp(line)), false);
    // A comment of 10 MB before the stamp counts for nothing.
    ExpectChecked(dir.write("long-comment.v", "#" + line + "\n" + Stamp("x") + "x"), true);

    ExpectChecked(dir.write(kFormatName + ".v", Stamp("abc") + "abc"), true);
}

TEST(BadInputChecksum, FileAtAPathOf4000CharactersIsChecked) {
    SKIP_UNLESS_LONG_NAMES();
    tesutest::TempDir dir;
    const std::string longPath = LongDirectory(dir, kLongName - 4) + "/f.v";
    ASSERT_EQ(longPath.size(), kLongName);
    std::ofstream(longPath) << Stamp("abc") << "abc\n";
    ExpectChecked(longPath, true);
}

TEST(BadInputChecksum, FileWithoutReadPermissionIsNotOpened) {
    SKIP_UNLESS_PERMISSIONS_LOCK_OUT();
    tesutest::TempDir dir;
    Unreadable file(dir.write("locked.v", Stamp("abc") + "abc"));
    ExpectNotOpened(file.path);
}

// ---- File lists -------------------------------------------------------------------------

struct ListOutcome {
    std::vector<std::string> strings;
    std::vector<std::string> names;
    std::string messages;
};

ListOutcome ReadList(const std::string& list) {
    ListOutcome outcome;
    tesutest::MessageCapture capture;
    for (const Text& member : Utilities::GetFileListFileStrings(Port::FileName(Text(list)))) {
        outcome.strings.push_back(member.str());
    }
    outcome.messages = capture.text();
    capture.clear();
    for (const Port::FileName& name : Utilities::GetFileListFileNames(Port::FileName(Text(list)))) {
        outcome.names.push_back(name.GetText().str());
    }
    // The same messages again, once.
    EXPECT_EQ(capture.text(), outcome.messages) << list;
    return outcome;
}

class BadInputFileList : public ::testing::Test {
  protected:
    BadInputFileList() { dir.write("a.v", ""); }
    std::string Absolute(const std::string& path) const { return tesutest::Native(path); }
    std::string Missing(const std::string& path) const {
        return "WARNING:tesutil - Missing file list member " + Absolute(path) + "\n";
    }

    tesutest::LoggerLevelsReset levels;
    tesutest::TempDir dir;
};

TEST_F(BadInputFileList, ListsThatCannotBeReadGiveNothingAndOneError) {
    for (const std::string& list : {dir.join("missing.lst"), dir.join(kFormatName + ".lst"),
                                    dir.join(std::string(kLongName, 'n'))}) {
        const ListOutcome outcome = ReadList(list);
        EXPECT_TRUE(outcome.strings.empty());
        EXPECT_TRUE(outcome.names.empty());
        EXPECT_EQ(outcome.messages, "ERROR:tesutil - Cannot read " + Absolute(list) + "\n");
    }
    // A directory may be read as a listing, but it does not open as a list.
    const ListOutcome outcome = ReadList(dir.mkdir("folder.lst"));
    EXPECT_TRUE(outcome.strings.empty());
    EXPECT_EQ(outcome.messages,
              "ERROR:tesutil - Cannot open " + Absolute(dir.join("folder.lst")) + "\n");
}

TEST_F(BadInputFileList, UnusualListsAreReadLineByLine) {
    EXPECT_EQ(ReadList(dir.write("empty.lst", "")).messages, "");
    EXPECT_TRUE(ReadList(dir.join("empty.lst")).strings.empty());

    // One line of bytes that are neither blanks, separators nor comments: one missing member.
    // The member after it is still read (a Ctrl-Z byte, 0x1A, among them ends nothing).
    std::string bytes;
    for (int c = 1; c < 256; ++c) {
        if (c != '\n' && c != '\r' && c != '\t' && c != ' ' && c != '#' && c != '/' && c != '\\') {
            bytes += static_cast<char>(c);
        }
    }
    ListOutcome outcome = ReadList(dir.write("binary.lst", bytes + "\na.v\n"));
    EXPECT_EQ(outcome.strings, std::vector<std::string>{"a.v"});
    EXPECT_EQ(outcome.names, std::vector<std::string>{tesutest::Native(dir.path() + "/") + "a.v"});
    EXPECT_EQ(outcome.messages, Missing(dir.join(bytes)));

    // A member holding a NUL byte is not the file named by its first part; the message, made
    // with "%s", names the path up to the NUL.
    outcome = ReadList(dir.write("zero-byte.lst", std::string("a.v\0.bak\n", 9)));
    EXPECT_TRUE(outcome.strings.empty());
    EXPECT_EQ(outcome.messages, Missing(dir.join("a.v")));

    // 10 MB of blanks around a member, a comment of 10 MB, and a member name of 10 MB.
    const std::string blanks(kLongLine, ' ');
    const std::string longName(kLongLine, 'm');
    outcome = ReadList(
        dir.write("long.lst", blanks + "a.v" + blanks + "\n#" + blanks + "\n" + longName + "\n"));
    EXPECT_EQ(outcome.strings, std::vector<std::string>{"a.v"});
    EXPECT_EQ(outcome.messages, Missing(dir.join(longName)));

    // Names with format directives, as the list and as its members.
    dir.write(kFormatName + ".v", "");
    outcome = ReadList(dir.write(kFormatName + ".lst", kFormatName + ".v\n%s%s.v\n"));
    EXPECT_EQ(outcome.strings, std::vector<std::string>{kFormatName + ".v"});
    EXPECT_EQ(outcome.messages, Missing(dir.join("%s%s.v")));
}

TEST_F(BadInputFileList, ListAtAPathOf4000CharactersFindsItsMembers) {
    SKIP_UNLESS_LONG_NAMES();
    const std::string folder = LongDirectory(dir, kLongName - 6);
    const std::string list = folder + "/f.lst";
    ASSERT_EQ(list.size(), kLongName);
    std::ofstream(folder + "/m.v") << "";
    std::ofstream(list) << "m.v\nnot-there.v\n";
    const ListOutcome outcome = ReadList(list);
    EXPECT_EQ(outcome.strings, std::vector<std::string>{"m.v"});
    EXPECT_EQ(outcome.names, std::vector<std::string>{tesutest::Native(folder + "/m.v")});
    EXPECT_EQ(outcome.messages, Missing(folder + "/not-there.v"));
}

TEST_F(BadInputFileList, ListWithoutReadPermissionCannotBeRead) {
    SKIP_UNLESS_PERMISSIONS_LOCK_OUT();
    Unreadable list(dir.write("locked.lst", "a.v\n"));
    const ListOutcome outcome = ReadList(list.path);
    EXPECT_TRUE(outcome.strings.empty());
    EXPECT_EQ(outcome.messages, "ERROR:tesutil - Cannot read " + Absolute(list.path) + "\n");
}

// ---- Cores update level -----------------------------------------------------------------

struct Level {
    unsigned int result;
    std::string report;
    std::string messages;
};

Level CoresLevel(const std::string& root) {
    Port::PathList roots;
    roots.Append(Text(root));
    tesutest::RootsGuard guard(roots);
    tesutest::MessageCapture capture;
    Text report("untouched");
    const unsigned int result = Tesu::IPUpdateInfo::GetCoresLevel(report);
    return Level{result, report.str(), capture.text()};
}

void ExpectLevel(const Level& level, unsigned int result, const std::string& report,
                 const std::string& messages = "") {
    EXPECT_EQ(level.result, result);
    EXPECT_EQ(level.report, report);
    EXPECT_EQ(level.messages, messages);
}

TEST(BadInputCoresLevel, RootsWithoutAReadableLogAreNoInstallation) {
    tesutest::TempDir dir;
    ExpectLevel(CoresLevel(dir.join("missing")), 1, "untouched");
    ExpectLevel(CoresLevel(dir.write("file-root", "cores_level=1\n")), 1, "untouched");
    ExpectLevel(CoresLevel(dir.join(std::string(kLongName, 'r'))), 1, "untouched");
    ExpectLevel(CoresLevel(""), 1, "untouched");
}

TEST(BadInputCoresLevel, ALogThatIsADirectoryDoesNotOpen) {
    tesutest::TempDir dir;
    const std::string root = dir.mkdir(kFormatName);
    dir.mkdir(kFormatName + "/IPupdate.log");
    const std::string log = tesutest::Native(root + "/IPupdate.log");
    ExpectLevel(CoresLevel(root), 2, "untouched",
                "ERROR:tesutil - Couldn't open " + log + " for reading.\n");
}

TEST(BadInputCoresLevel, UnusualLogsAreReadToTheirLevelLine) {
    tesutest::TempDir dir;
    dir.write("IPupdate.log", "");
    ExpectLevel(CoresLevel(dir.path()), 4, "untouched");

    const std::string binary = BinaryBytes();
    dir.write("IPupdate.log", binary);
    ExpectLevel(CoresLevel(dir.path()), 4, "untouched");
    // The level text is every byte after the tag, NUL bytes included; the reader drops only the
    // "\r" of the line's end.
    const std::string level("\x01\x00\xff%n%s", 7);
    dir.write("IPupdate.log", binary + "\n" + binary + "cores_level=" + level + "\r\nx\n");
    ExpectLevel(CoresLevel(dir.path()), 3, "Cores Update # " + level);

    const std::string line(kLongLine, 'L');
    dir.write("IPupdate.log", line + "\ncores_level=" + line + "\ncores_level=2\n");
    ExpectLevel(CoresLevel(dir.path()), 3, "Cores Update # " + line);
}

TEST(BadInputCoresLevel, LogInARootOf4000CharactersIsRead) {
    SKIP_UNLESS_LONG_NAMES();
    tesutest::TempDir dir;
    const std::string longRoot = LongDirectory(dir, kLongName - 13);
    std::ofstream(longRoot + "/IPupdate.log") << "cores_level=5\n";
    ASSERT_EQ((longRoot + "/IPupdate.log").size(), kLongName);
    ExpectLevel(CoresLevel(longRoot), 3, "Cores Update # 5");
}

TEST(BadInputCoresLevel, LogWithoutReadPermissionIsPassedOver) {
    SKIP_UNLESS_PERMISSIONS_LOCK_OUT();
    tesutest::TempDir dir;
    Unreadable log(dir.write("IPupdate.log", "cores_level=1\n"));
    ExpectLevel(CoresLevel(dir.path()), 1, "untouched");
}

// ---- Path texts -------------------------------------------------------------------------

// The five path operations on one text; none issues anything.
struct PathForms {
    bool terminated;
    std::string withSeparator, absolute, directory, relative;
};

PathForms Forms(const std::string& base, const std::string& path) {
    tesutest::MessageCapture capture;
    const Text text(path);
    PathForms forms{Utilities::IsTerminatedWithPathSeparator(text),
                    Utilities::TerminateWithPathSeparator(text).str(),
                    Utilities::GetAbsolutePath(text).str(),
                    Utilities::GetAbsoluteDirectory(text).str(),
                    Utilities::MakeRelativePath(Text(base), text).str()};
    EXPECT_EQ(capture.text(), "") << path;
    return forms;
}

class BadInputPaths : public ::testing::Test {
  protected:
    BadInputPaths()
        : base(tesutest::Native(dir.path() + "/")),
          root(base.substr(0, base.find(separator) + 1)) {}
    tesutest::TempDir dir;
    const std::string separator = tesutest::Native("/");
    const std::string base;  // the directory's absolute form
    const std::string root;  // the root it lies under
};

TEST_F(BadInputPaths, MissingNamesDirectoriesAndFiles) {
    PathForms f = Forms(dir.path(), dir.join("missing"));
    EXPECT_EQ(f.withSeparator, dir.join("missing") + separator);
    EXPECT_EQ(f.absolute, base + "missing");
    EXPECT_EQ(f.directory, base);
    EXPECT_EQ(f.relative, tesutest::Native("./missing"));

    f = Forms(dir.path(), dir.mkdir("sub"));
    EXPECT_EQ(f.withSeparator, dir.mkdir("sub") + separator);
    EXPECT_EQ(f.absolute, base + "sub" + tesutest::Native("/"));
    EXPECT_EQ(f.directory, f.absolute);
    EXPECT_EQ(f.relative, tesutest::Native("./sub/"));

    f = Forms(dir.path(), dir.write("empty.v", ""));
    EXPECT_FALSE(f.terminated);
    EXPECT_EQ(f.withSeparator, dir.write("empty.v", ""));
    EXPECT_EQ(f.absolute, base + "empty.v");
    EXPECT_EQ(f.directory, base);
}

TEST_F(BadInputPaths, BinaryLongAndFormatLikeTexts) {
    // NUL and every other byte pass through as text; no name with a NUL byte exists.
    const std::string binary = BinaryBytes();
    PathForms f = Forms(dir.path(), dir.path() + "/" + binary);
    ASSERT_FALSE(f.terminated);
    EXPECT_EQ(f.absolute.substr(0, base.size()), base);
    EXPECT_NE(f.absolute.find(std::string(1, '\0')), std::string::npos);
    EXPECT_EQ(f.withSeparator, dir.path() + "/" + binary + separator);

    // 10 MB in one component, and 10 MB of "../" that climbs no higher than the root.
    const std::string longName(kLongLine, 'x');
    f = Forms(dir.path(), dir.path() + "/" + longName);
    EXPECT_EQ(f.absolute, base + longName);
    EXPECT_EQ(f.directory, base);
    EXPECT_EQ(f.relative, tesutest::Native("./") + longName);
    std::string climb;
    while (climb.size() < kLongLine) {
        climb += "../";
    }
    // The text is too long for the system to examine, so it counts as no directory.
    f = Forms(dir.path(), dir.path() + "/" + climb + "etc");
    EXPECT_EQ(f.absolute, root + "etc");
    EXPECT_EQ(f.directory, root);
    EXPECT_EQ(f.relative, root + "etc");

    f = Forms(kFormatName, dir.path() + "/" + kFormatName);
    EXPECT_EQ(f.absolute, base + kFormatName);
}

TEST_F(BadInputPaths, DirectoryOf4000Characters) {
    SKIP_UNLESS_LONG_NAMES();
    const std::string longDir = LongDirectory(dir, kLongName);
    const PathForms f = Forms(dir.path(), longDir);
    EXPECT_EQ(f.absolute, tesutest::Native(longDir + "/"));
    EXPECT_EQ(f.directory, f.absolute);
    EXPECT_EQ(f.relative, tesutest::Native("./" + longDir.substr(dir.path().size() + 1) + "/"));
}

// ---- Installation search ----------------------------------------------------------------

class BadInputSearch : public ::testing::Test {
  protected:
    BadInputSearch() {
        Tesu::DebugMessengerFactory::GetLogger("utilities")
            ->SetLevel(Tesu::DebugMessenger::DEBUG_VERBOSE);
        dir.mkdir("tessel/ip/quarnel/entry");
        Port::PathList roots;
        roots.Append(Text(dir.path()));
        Port::QuarnelPath::SetRoots(roots);
    }
    ~BadInputSearch() override { Port::QuarnelPath::Reset(); }

    // Both searches for `name`: expects neither to find it, and the trace of each.
    void ExpectNotFound(const std::string& name) {
        for (bool container : {false, true}) {
            tesutest::MessageCapture capture;
            Text out("untouched");
            const bool found = container
                                   ? Utilities::GetFullQuarnelPathWithContainer(Text(name), out)
                                   : Utilities::GetFullQuarnelPathOf(Text(name), out);
            EXPECT_FALSE(found);
            EXPECT_EQ(out.str(), "untouched");
            EXPECT_EQ(capture.text(), "DEBUG[utilities] - Could not find " + name + "\n");
        }
    }

    // One search for `name`: expects it found at `path`, and the trace of it.
    void ExpectFound(bool container, const std::string& name, const std::string& path) {
        tesutest::MessageCapture capture;
        Text out;
        EXPECT_TRUE(container ? Utilities::GetFullQuarnelPathWithContainer(Text(name), out)
                              : Utilities::GetFullQuarnelPathOf(Text(name), out));
        EXPECT_EQ(out.str(), tesutest::Native(path));
        EXPECT_EQ(capture.text(), "DEBUG[utilities] - Looking for " + name + "\nFound " +
                                      tesutest::Native(path) + "\n");
    }

    tesutest::LoggerLevelsReset levels;
    tesutest::TempDir dir;
};

TEST_F(BadInputSearch, NamesThatAreNotThereAreTracedVerbatim) {
    ExpectNotFound("missing.v");
    ExpectNotFound(kFormatName);
    ExpectNotFound(std::string(kLongName, 'n'));
    ExpectNotFound(std::string(kLongLine, 'n'));
    // The trace is built with "%s", so a name with a NUL byte is named up to it.
    tesutest::MessageCapture capture;
    Text out("untouched");
    EXPECT_FALSE(Utilities::GetFullQuarnelPathOf(Text(std::string("tessel\0x", 8)), out));
    EXPECT_EQ(capture.text(), "DEBUG[utilities] - Could not find tessel\n");
}

TEST_F(BadInputSearch, DirectoriesAndFormatLikeNamesThatAreThereAreFound) {
    dir.write("tessel/ip/quarnel/entry/" + kFormatName, "");
    ExpectFound(false, "tessel", dir.join("tessel"));
    ExpectFound(true, kFormatName, dir.join("tessel/ip/quarnel/entry/" + kFormatName));
}

TEST_F(BadInputSearch, NameOf4000CharactersThatIsThereIsFound) {
    SKIP_UNLESS_LONG_NAMES();
    const std::string folder = LongDirectory(dir, kLongName);
    ExpectFound(false, folder.substr(dir.path().size() + 1), folder);
}

// ---- Working directory guard ------------------------------------------------------------

class BadInputWorkingDirectory : public ::testing::Test {
  protected:
    std::string Cwd() const { return fs::current_path().string(); }
    tesutest::WorkingDirectoryRestorer restorer;
    tesutest::LoggerLevelsReset levels;
    tesutest::TempDir dir;
};

TEST_F(BadInputWorkingDirectory, TargetsThatAreNoDirectoryMeanTheirParent) {
    const std::string start = Cwd();
    const std::string file = dir.write("empty.v", "");
    for (const std::string& target : {dir.join("missing"), file, dir.join(kFormatName),
                                      dir.join(std::string(kLongLine, 'm'))}) {
        tesutest::MessageCapture capture;
        {
            Tesu::SetWorkingDirectory guard{Text(target)};
            EXPECT_EQ(Cwd(), dir.path());
            guard.Reconfirm();
            EXPECT_EQ(Cwd(), dir.path());
        }
        EXPECT_EQ(Cwd(), start);
        EXPECT_EQ(capture.text(), "");
    }
}

TEST_F(BadInputWorkingDirectory, TargetsThatCannotBeEnteredAreReported) {
    const std::string start = Cwd();
    // Neither the name nor its parent exists; the parent is what the guard tries.
    for (const std::string& parent :
         {dir.join("no/such"), dir.join(kFormatName), dir.join(std::string(kLongName, 'p'))}) {
        tesutest::MessageCapture capture;
        {
            Tesu::SetWorkingDirectory guard{Text(parent + "/leaf")};
            EXPECT_EQ(Cwd(), start);
            guard.Reconfirm();
        }
        EXPECT_EQ(Cwd(), start);
        const std::string target = tesutest::Native(parent + "/");
        EXPECT_EQ(capture.text(), "ERROR:tesutil - Unable to set working directory to " + target +
                                      "\nERROR:tesutil - Unable to reset working directory to " +
                                      target + "\n");
    }
}

TEST_F(BadInputWorkingDirectory, DirectoryOf4000CharactersIsEnteredAndLeft) {
    SKIP_UNLESS_LONG_NAMES();
    const std::string start = Cwd();
    const std::string folder = LongDirectory(dir, kLongName);
    {
        Tesu::SetWorkingDirectory outer{Text(folder)};
        EXPECT_EQ(Cwd(), folder);
        {
            Tesu::SetWorkingDirectory inner{Text(kFormatName)};  // missing: its parent, "."
            EXPECT_EQ(Cwd(), folder);
        }
        EXPECT_EQ(Cwd(), folder);
    }
    EXPECT_EQ(Cwd(), start);
}

TEST_F(BadInputWorkingDirectory, DirectoryWithoutPermissionIsNotEntered) {
    SKIP_UNLESS_PERMISSIONS_LOCK_OUT();
    const std::string start = Cwd();
    Unreadable locked(dir.mkdir("locked"));
    tesutest::MessageCapture capture;
    { Tesu::SetWorkingDirectory guard{Text(locked.path)}; }
    EXPECT_EQ(Cwd(), start);
    EXPECT_EQ(capture.text(), "ERROR:tesutil - Unable to set working directory to " +
                                  tesutest::Native(locked.path + "/") + "\n");
}

}  // namespace

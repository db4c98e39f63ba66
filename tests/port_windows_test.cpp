// The layer and the library on Windows: drive letters, UNC shares and names rooted on the
// working directory's drive, backslashes in what comes back, the file system's answers
// (devices, letter case), the text mode, UTF-8 names, the environment, the installation
// prefix, and the Windows branches of file lists and the Java runtime's name.
//
// Built on every platform; its tests exist only where _WIN32 is defined.
#include <gtest/gtest.h>

#if defined(_WIN32)

#include <direct.h>
#include <stdio.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <stdexcept>
#include <string>
#include <vector>

#include "Port_Env.h"
#include "Port_File.h"
#include "Port_FileName.h"
#include "Port_PathList.h"
#include "TestPlatform.h"
#include "TestSupport.h"
#include "Tesu_Utilities.h"

namespace fs = std::filesystem;
using Port::File;
using Port::FileName;
using Text = Port::StringBase<char>;
using Lines = std::vector<std::string>;

namespace {

std::string absolute(const char* name) {
    return FileName(name).GetAbsolutePath(false).str();
}

// The working directory as the C runtime gives it ("C:\\...").
std::string runtimeCwd() {
    char* text = ::_getcwd(nullptr, 0);
    std::string result(text == nullptr ? "" : text);
    std::free(text);
    return result;
}

// The file's bytes as stored.
std::string bytesOf(const std::string& path) {
    std::ifstream in(fs::u8path(path), std::ios::binary);
    return std::string(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
}

bool writeText(const std::string& path, int access, bool binary, const std::string& content) {
    Port::Stream* stream = File::open(path.c_str(), access, binary);
    if (stream == nullptr) {
        return false;
    }
    const bool written = stream->write(content.data(), content.size());
    return File::close(stream) && written;
}

Lines readLines(const std::string& path, bool binary) {
    Lines lines;
    Port::Stream* stream = File::open(path.c_str(), File::READ, binary);
    if (stream == nullptr) {
        return lines;
    }
    Text line;
    while (!stream->geteof()) {
        stream->readline(line);
        lines.push_back(line.str());
    }
    File::close(stream);
    return lines;
}

TEST(WindowsFileName, DrivesAndSharesAreRootsThatDotDotCannotLeave) {
    EXPECT_EQ(FileName::GetPathSeparator(), '\\');
    EXPECT_EQ(absolute("C:\\a\\..\\b"), "C:\\b");
    EXPECT_EQ(absolute("c:/x//y/./z/"), "c:\\x\\y\\z");
    EXPECT_EQ(absolute("C:\\..\\..\\x"), "C:\\x");
    EXPECT_EQ(absolute("C:/"), "C:\\");
    EXPECT_EQ(absolute("D:\\a\\.."), "D:\\");

    EXPECT_EQ(absolute("\\\\server\\share\\a\\..\\..\\b"), "\\\\server\\share\\b");
    EXPECT_EQ(absolute("//server/share/dir/"), "\\\\server\\share\\dir");
    EXPECT_EQ(absolute("\\\\server\\share"), "\\\\server\\share\\");
    EXPECT_EQ(absolute("\\\\server\\share\\.."), "\\\\server\\share\\");

    // The directory part of an absolute name directly under a root is the root.
    EXPECT_EQ(FileName("C:\\top").GetHead(false, true).str(), "C:\\");
    EXPECT_EQ(FileName("\\\\server\\share\\f").GetHead(false, true).str(), "\\\\server\\share\\");
}

TEST(WindowsFileName, RootedAndDriveRelativeNamesAreCompletedFromTheWorkingDirectory) {
    tesutest::WorkingDirectoryRestorer restore;
    tesutest::TempDir tmp;
    ASSERT_TRUE(File::chdir(tmp.mkdir("w").c_str()));
    const std::string cwd = runtimeCwd();
    ASSERT_GE(cwd.size(), 3u);
    ASSERT_EQ(cwd[1], ':') << cwd;
    const std::string drive = cwd.substr(0, 2);

    EXPECT_EQ(File::getcwd().str(), cwd);
    EXPECT_EQ(absolute("x/../y"), cwd + "\\y");
    EXPECT_EQ(absolute(""), cwd);
    // "\\x" is rooted on the working directory's drive.
    EXPECT_EQ(absolute("\\x\\y"), drive + "\\x\\y");
    EXPECT_EQ(absolute("/"), drive + "\\");
    // "C:x" is relative to the working directory of drive C.
    EXPECT_EQ(absolute((drive + "x").c_str()), cwd + "\\x");
    EXPECT_EQ(absolute(drive.c_str()), cwd);
    EXPECT_EQ(absolute((drive + "..\\w\\.").c_str()), cwd);

    // The head is absolute, native and ends in a separator.
    EXPECT_EQ(FileName("a/b.v").GetHead(true, true).str(), cwd + "\\a\\");
}

TEST(WindowsFileName, NameOnADriveThatIsNotThereCannotBeCompleted) {
    // A drive letter the system does not know: its working directory cannot be read. The
    // layer's exception crosses from its DLL into this program.
    const DWORD drives = ::GetLogicalDrives();
    char missing = 0;
    for (char letter = 'Q'; letter >= 'D' && missing == 0; --letter) {
        if ((drives & (1u << (letter - 'A'))) == 0) {
            missing = letter;
        }
    }
    ASSERT_NE(missing, 0) << "every drive letter from D to Q is in use";
    const std::string relative = std::string(1, missing) + ":x";
    EXPECT_THROW(FileName(relative.c_str()).GetAbsolutePath(false), std::runtime_error);
    // With its root the name needs no working directory.
    EXPECT_EQ(absolute((std::string(1, missing) + ":\\x\\..\\y").c_str()),
              std::string(1, missing) + ":\\y");
}

TEST(WindowsFileName, PartsAreJoinedWithTheBackslash) {
    FileName java;
    java.SetHead("/opt/inst");
    java.SetTail("\\java\\windows-x86\\jre\\bin\\java.exe");
    // The head keeps the separators it was given and gets the platform's at its end.
    EXPECT_EQ(java.GetHead().str(), "/opt/inst\\");
    EXPECT_EQ(java.GetText().str(), "/opt/inst\\java\\windows-x86\\jre\\bin\\java.exe");
    EXPECT_EQ(java.MakeNative().str(), "\\opt\\inst\\java\\windows-x86\\jre\\bin\\java.exe");

    FileName candidate;
    candidate.SetHead("C:/root");
    candidate.PushPathEnd("tessel/ip/quarnel");
    candidate.PushPathEnd("entry");
    candidate.SetTail("lib/x.v");
    EXPECT_EQ(candidate.GetAbsolutePath(false).str(),
              "C:\\root\\tessel\\ip\\quarnel\\entry\\lib\\x.v");
}

TEST(WindowsFile, KindsOfNamesAsTheFileSystemGivesThem) {
    tesutest::TempDir tmp;
    const std::string file = tmp.write("Mixed Case.txt", "x");
    const std::string dir = tmp.mkdir("d");
    struct Case {
        std::string name;
        bool exist, isfile, isdir, canread;
    };
    const Case cases[] = {
        {file, true, true, false, true},
        // Letter case does not matter to the file system.
        {tmp.join("MIXED CASE.TXT"), true, true, false, true},
        {dir, true, false, true, true},
        {dir + "\\", true, false, true, true},
        {dir + "/", true, false, true, true},
        {tmp.join("missing"), false, false, false, false},
        {file + "\\x", false, false, false, false},
        {"", false, false, false, false},
        // A device: it exists and reads, but is neither file nor directory.
        {"NUL", true, false, false, true},
        {runtimeCwd().substr(0, 3), true, false, true, true},
    };
    for (const Case& c : cases) {
        const Text name(c.name.c_str());
        EXPECT_EQ(File::exist(name), c.exist) << c.name;
        EXPECT_EQ(File::isfile(name), c.isfile) << c.name;
        EXPECT_EQ(File::isdir(FileName(name)), c.isdir) << c.name;
        EXPECT_EQ(File::canread(name), c.canread) << c.name;
    }
    // A directory does not open as a stream.
    EXPECT_EQ(File::open(dir.c_str(), File::READ, true), nullptr);
}

TEST(WindowsFile, TextModeWritesCrLfAndReadingKeepsEveryByte) {
    tesutest::TempDir tmp;
    const std::string text = tmp.join("text.txt");
    ASSERT_TRUE(writeText(text, File::WRITE, false, "a\nb\n"));
    ASSERT_TRUE(writeText(text, File::APPEND, false, "c\n"));
    EXPECT_EQ(bytesOf(text), "a\r\nb\r\nc\r\n");
    EXPECT_EQ(readLines(text, false), (Lines{"a", "b", "c"}));
    EXPECT_EQ(readLines(text, true), (Lines{"a", "b", "c"}));
    // Reading in text mode does not stop at a Ctrl-Z byte, as the runtime's text mode would.
    const std::string ctrlZ = tmp.write("ctrl-z.txt", "a\x1a b\r\nc\n");
    EXPECT_EQ(readLines(ctrlZ, false), (Lines{"a\x1a b", "c"}));

    const std::string binary = tmp.join("binary.dat");
    ASSERT_TRUE(writeText(binary, File::WRITE, true, std::string("x\ny\r\n\0z", 7)));
    EXPECT_EQ(bytesOf(binary), std::string("x\ny\r\n\0z", 7));
    EXPECT_EQ(readLines(binary, true), (Lines{"x", "y", std::string("\0z", 2)}));
}

TEST(WindowsFile, NamesAreUtf8) {
    tesutest::TempDir tmp;
    const std::string name = tmp.join("d\xc3\xa9j\xc3\xa0 \xe2\x82\xac.txt");
    ASSERT_TRUE(writeText(name, File::WRITE, true, "x\n"));
    // The system holds the name in UTF-16.
    EXPECT_TRUE(fs::exists(fs::path(tmp.path()) / L"d\u00e9j\u00e0 \u20ac.txt"));
    EXPECT_TRUE(File::isfile(name.c_str()));

    UT_DIR listing(tmp.path().c_str(), UT_DIR::FILES);
    ASSERT_EQ(listing.size(), 1u);
    EXPECT_STREQ(*listing.begin(), "d\xc3\xa9j\xc3\xa0 \xe2\x82\xac.txt");

    // Bytes that are not UTF-8 name nothing; they are not guessed at.
    const std::string invalid = tmp.join("\xff.txt");
    EXPECT_EQ(File::open(invalid.c_str(), File::WRITE, true), nullptr);
    EXPECT_FALSE(File::exist(invalid.c_str()));
    EXPECT_FALSE(File::chdir(invalid.c_str()));
}

TEST(WindowsFile, WorkingDirectoryOnADrive) {
    tesutest::WorkingDirectoryRestorer restore;
    tesutest::TempDir tmp;
    const std::string target = tmp.mkdir("a b");
    EXPECT_TRUE(File::chdir((target + "\\").c_str()));
    EXPECT_TRUE(fs::equivalent(File::getcwd().str(), target));
    EXPECT_EQ(File::getcwd().str(), runtimeCwd());
    EXPECT_TRUE(File::chdir(".."));
    EXPECT_TRUE(fs::equivalent(File::getcwd().str(), tmp.path()));
    EXPECT_FALSE(File::chdir(tmp.join("missing").c_str()));
    EXPECT_FALSE(File::chdir(""));

    const std::string root = runtimeCwd().substr(0, 3);
    EXPECT_TRUE(File::chdir(root.c_str()));
    // Only the root ends in a separator.
    EXPECT_EQ(File::getcwd().str(), root);
}

TEST(WindowsEnvironment, VariablesRootsAndTheInstallationPrefix) {
    Text value("kept");
    tesutest::UnsetVariable("TESU_WINDOWS_TEST_VARIABLE");
    EXPECT_FALSE(Port_Env::GetVariable("TESU_WINDOWS_TEST_VARIABLE", value));
    EXPECT_EQ(value.str(), "kept");
    tesutest::SetVariable("TESU_WINDOWS_TEST_VARIABLE", "C:\\a b;\xc3\xa9");
    EXPECT_TRUE(Port_Env::GetVariable("TESU_WINDOWS_TEST_VARIABLE", value));
    EXPECT_EQ(value.str(), "C:\\a b;\xc3\xa9");
    tesutest::SetVariable("TESU_WINDOWS_TEST_VARIABLE", "");
    EXPECT_TRUE(Port_Env::GetVariable("TESU_WINDOWS_TEST_VARIABLE", value));
    EXPECT_TRUE(value.IsEmpty());
    tesutest::UnsetVariable("TESU_WINDOWS_TEST_VARIABLE");

    EXPECT_TRUE(Port_Env::IsNt());
    EXPECT_EQ(Port::QuarnelPath::GetListSeparator(), ';');

    // The prefix is the folder above the one that holds libPortability.dll, with its drive.
    const std::string prefix = Port::QuarnelPath::GetInstallationPrefix().str();
    ASSERT_GE(prefix.size(), 3u);
    EXPECT_EQ(prefix[1], ':') << prefix;
    EXPECT_NE(prefix.back(), '\\') << prefix;
    EXPECT_TRUE(fs::equivalent(prefix, TESU_BINARY_DIR)) << prefix;
}

// The Windows NT branches of the library.
class WindowsUtilities : public ::testing::Test {
  protected:
    tesutest::LoggerLevelsReset levels;
    tesutest::TempDir dir;
};

TEST_F(WindowsUtilities, FileListMembersAreNormalisedToBackslashes) {
    dir.write("lists/sub/dir/file.v", "");
    dir.write("lists/a/b.v", "");
    const std::string list = dir.write(
        "lists/files.lst", "  sub/dir\\file.v  # the top\r\na//b.v\n\ta\\\\\\b.v\nmissing/x.v\n");
    tesutest::MessageCapture capture;
    std::vector<std::string> strings;
    for (const Text& member : Tesu::Utilities::GetFileListFileStrings(FileName(list.c_str()))) {
        strings.push_back(member.str());
    }
    EXPECT_EQ(strings, (std::vector<std::string>{"sub\\dir\\file.v", "a\\b.v", "a\\b.v"}));
    EXPECT_EQ(capture.text(), "WARNING:tesutil - Missing file list member " +
                                  tesutest::Native(dir.join("lists/missing/x.v")) + "\n");

    // The names join the list's directory part as given with the member text.
    const std::string relativeList = "lists\\files.lst";
    tesutest::WorkingDirectoryRestorer restore;
    ASSERT_TRUE(File::chdir(dir.path().c_str()));
    std::vector<std::string> names;
    for (const FileName& name :
         Tesu::Utilities::GetFileListFileNames(FileName(relativeList.c_str()))) {
        names.push_back(name.GetText().str());
    }
    EXPECT_EQ(names, (std::vector<std::string>{"lists\\sub\\dir\\file.v", "lists\\a\\b.v",
                                               "lists\\a\\b.v"}));
}

TEST_F(WindowsUtilities, JavaRuntimeIsJavaExe) {
    const std::string platform = Port_Env::GetPlatformPath().str();
    const std::string bin = "java/" + platform + "/jre/bin/";
    dir.write("r1/" + bin + "java", "");
    dir.write("r2/" + bin + "java.exe", "");
    Text out("untouched");
    {
        Port::PathList roots;
        roots.Append(dir.join("r1").c_str());
        tesutest::RootsGuard guard(roots);
        EXPECT_FALSE(Tesu::Utilities::GetJavaExecutablePath(out));
        EXPECT_EQ(out.str(), "untouched");
    }
    Port::PathList roots;
    roots.Append(dir.join("r1").c_str());
    roots.Append(dir.join("r2").c_str());
    tesutest::RootsGuard guard(roots);
    EXPECT_TRUE(Tesu::Utilities::GetJavaExecutablePath(out));
    EXPECT_EQ(out.str(), tesutest::Native(dir.join("r2/" + bin + "java.exe")));
}

}  // namespace

#endif  // _WIN32

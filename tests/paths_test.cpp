// Path texts: trailing separators, absolute forms, the directory a path denotes, and paths
// made relative to a base directory, on a real tree in a temporary directory.
#include <gtest/gtest.h>

#include <filesystem>
#include <string>

#include "TestPlatform.h"
#include "TestSupport.h"
#include "Tesu_Utilities.h"

namespace {

namespace fs = std::filesystem;
using Tesu::Utilities;
using Text = Port::StringBase<char>;

std::string str(const Text& text) {
    return text.str();
}

// A tree: dir/, dir/file.txt, a link to dir, a link to the file, a dangling link, and a
// directory whose name holds blanks, non-ASCII bytes and percent signs.
class PathsTest : public ::testing::Test {
  protected:
    PathsTest() : t(temp.path()) {
        temp.mkdir("dir/sub");
        temp.write("dir/file.txt", "x");
        if (tesutest::WhyNoSymbolicLinks() == nullptr) {
            fs::create_directory_symlink(temp.join("dir"), temp.join("dirlink"));
            fs::create_symlink(temp.join("dir/file.txt"), temp.join("filelink"));
            fs::create_symlink(temp.join("nowhere"), temp.join("dangling"));
        }
        temp.mkdir(odd);
    }
    tesutest::TempDir temp;
    const std::string t;
#if defined(_WIN32)
    // Windows names are UTF-16: the bytes must be UTF-8 to name a file there.
    const std::string odd = "a b \xc3\xa9 %s%n";
#else
    const std::string odd = "a b \xc3\xa9\xff %s%n";
#endif
};

TEST_F(PathsTest, TrailingSeparatorIsEitherSlashOrBackslash) {
    for (const char* yes : {"a/", "a\\", "/", "\\", "a\\b/", "C:\\"}) {
        EXPECT_TRUE(Utilities::IsTerminatedWithPathSeparator(yes)) << yes;
    }
    for (const char* no : {"", "a", "a/b", "a\\b", "a/ ", "/."}) {
        EXPECT_FALSE(Utilities::IsTerminatedWithPathSeparator(no)) << no;
    }
}

TEST_F(PathsTest, TerminateAddsOneSeparatorExceptToFilesAndTerminatedTexts) {
    if (const char* reason = tesutest::WhyNoSymbolicLinks()) {
        GTEST_SKIP() << reason << "; the other cases expect POSIX texts";
    }
    EXPECT_EQ(str(Utilities::TerminateWithPathSeparator("")), "");
    EXPECT_EQ(str(Utilities::TerminateWithPathSeparator(t + "/dir")), t + "/dir/");
    EXPECT_EQ(str(Utilities::TerminateWithPathSeparator(t + "/missing")), t + "/missing/");
    EXPECT_EQ(str(Utilities::TerminateWithPathSeparator(t + "/dir/file.txt")), t + "/dir/file.txt");
    EXPECT_EQ(str(Utilities::TerminateWithPathSeparator(t + "/filelink")), t + "/filelink");
    // Already terminated: unchanged, and a backslash is not exchanged for a slash.
    EXPECT_EQ(str(Utilities::TerminateWithPathSeparator(t + "/dir/")), t + "/dir/");
    EXPECT_EQ(str(Utilities::TerminateWithPathSeparator(t + "/dir\\")), t + "/dir\\");
    // The file test sees the native form; the caller's text is what gets the separator.
    EXPECT_EQ(str(Utilities::TerminateWithPathSeparator(t + "\\dir\\file.txt")),
              t + "\\dir\\file.txt");
    EXPECT_EQ(str(Utilities::TerminateWithPathSeparator(t + "\\dir")), t + "\\dir/");
}

TEST_F(PathsTest, AbsolutePathEndsInSeparatorOnlyForExistingDirectories) {
    if (const char* reason = tesutest::WhyNoSymbolicLinks()) {
        GTEST_SKIP() << reason << "; the other cases expect POSIX texts";
    }
    EXPECT_EQ(str(Utilities::GetAbsolutePath("")), "");
    EXPECT_EQ(str(Utilities::GetAbsolutePath("/")), "/");
    for (const std::string& dir : {t + "/dir", t + "/dir/", t + "/dir\\", t + "\\dir",
                                   t + "//dir/./sub/..", t + "/dir/sub/../../dir"}) {
        EXPECT_EQ(str(Utilities::GetAbsolutePath(dir)), t + "/dir/") << dir;
    }
    EXPECT_EQ(str(Utilities::GetAbsolutePath(t + "/dir/file.txt")), t + "/dir/file.txt");
    EXPECT_EQ(str(Utilities::GetAbsolutePath(t + "/missing")), t + "/missing");
    EXPECT_EQ(str(Utilities::GetAbsolutePath(t + "/missing/")), t + "/missing");
    // Links are kept as named: a link to a directory is a directory, a dangling one is not.
    EXPECT_EQ(str(Utilities::GetAbsolutePath(t + "/dirlink")), t + "/dirlink/");
    EXPECT_EQ(str(Utilities::GetAbsolutePath(t + "/filelink")), t + "/filelink");
    EXPECT_EQ(str(Utilities::GetAbsolutePath(t + "/dangling")), t + "/dangling");
    EXPECT_EQ(str(Utilities::GetAbsolutePath(t + "/" + odd)), t + "/" + odd + "/");
}

TEST_F(PathsTest, RelativeArgumentsAreTakenFromTheWorkingDirectory) {
    tesutest::WorkingDirectoryRestorer restorer;
    fs::current_path(t + "/dir");
    const std::string cwd = fs::current_path().string();
    EXPECT_EQ(str(Utilities::GetAbsolutePath(".")), tesutest::Native(cwd + "/"));
    EXPECT_EQ(str(Utilities::GetAbsolutePath("sub")), tesutest::Native(cwd + "/sub/"));
    EXPECT_EQ(str(Utilities::GetAbsolutePath("./sub/../file.txt")),
              tesutest::Native(cwd + "/file.txt"));
    EXPECT_EQ(str(Utilities::GetAbsoluteDirectory("file.txt")), tesutest::Native(cwd + "/"));
    EXPECT_EQ(str(Utilities::GetAbsoluteDirectory("..")),
              tesutest::Native(fs::path(cwd).parent_path().string() + "/"));
}

TEST_F(PathsTest, AbsoluteDirectoryIsTheDirectoryOrTheParentWithSeparator) {
    if (const char* reason = tesutest::WhyNoSymbolicLinks()) {
        GTEST_SKIP() << reason << "; the other cases expect POSIX texts";
    }
    EXPECT_EQ(str(Utilities::GetAbsoluteDirectory("")), "");
    EXPECT_EQ(str(Utilities::GetAbsoluteDirectory("/")), "/");
    EXPECT_EQ(str(Utilities::GetAbsoluteDirectory(t + "/dir")), t + "/dir/");
    EXPECT_EQ(str(Utilities::GetAbsoluteDirectory(t + "/dir\\")), t + "/dir/");
    EXPECT_EQ(str(Utilities::GetAbsoluteDirectory(t + "/dirlink")), t + "/dirlink/");
    EXPECT_EQ(str(Utilities::GetAbsoluteDirectory(t + "/dir/file.txt")), t + "/dir/");
    EXPECT_EQ(str(Utilities::GetAbsoluteDirectory(t + "/filelink")), t + "/");
    EXPECT_EQ(str(Utilities::GetAbsoluteDirectory(t + "/missing")), t + "/");
    EXPECT_EQ(str(Utilities::GetAbsoluteDirectory(t + "/missing/")), t + "/");
    EXPECT_EQ(str(Utilities::GetAbsoluteDirectory(t + "/missing/deeper")), t + "/missing/");
    EXPECT_EQ(str(Utilities::GetAbsoluteDirectory(t + "/" + odd + "/none")), t + "/" + odd + "/");
}

TEST_F(PathsTest, RelativePathUnderTheBaseStartsWithDot) {
    if (const char* reason = tesutest::WhyNoSymbolicLinks()) {
        GTEST_SKIP() << reason << "; the other cases expect POSIX texts";
    }
    const std::string base = t + "/dir";
    EXPECT_EQ(str(Utilities::MakeRelativePath(base, "")), "");
    EXPECT_EQ(str(Utilities::MakeRelativePath(base, base)), "./");
    EXPECT_EQ(str(Utilities::MakeRelativePath(base + "/", base + "\\")), "./");
    EXPECT_EQ(str(Utilities::MakeRelativePath(base, base + "/file.txt")), "./file.txt");
    EXPECT_EQ(str(Utilities::MakeRelativePath(base, base + "/sub")), "./sub/");
    EXPECT_EQ(str(Utilities::MakeRelativePath(base, base + "/missing")), "./missing");
    // A file as base stands for its directory.
    EXPECT_EQ(str(Utilities::MakeRelativePath(base + "/file.txt", base + "/sub")), "./sub/");
    // Outside the base, or with an empty base: the absolute text.
    EXPECT_EQ(str(Utilities::MakeRelativePath(base + "/sub", base + "/file.txt")),
              t + "/dir/file.txt");
    EXPECT_EQ(str(Utilities::MakeRelativePath("", base + "/./sub")), t + "/dir/sub/");
    // Textual: a link to the base is not under it.
    EXPECT_EQ(str(Utilities::MakeRelativePath(base, t + "/dirlink/file.txt")),
              t + "/dirlink/file.txt");

    tesutest::WorkingDirectoryRestorer restorer;
    fs::current_path(base);
    EXPECT_EQ(str(Utilities::MakeRelativePath(".", "sub/../file.txt")), "./file.txt");
}

TEST_F(PathsTest, OnlyTheLeadingCopyOfTheBaseIsReplaced) {
#if defined(_WIN32)
    GTEST_SKIP() << "the base's text holds a drive's colon, which no Windows name may hold";
#endif
    // The base's own absolute text recurs further down the path.
    const std::string base = t + "/work";
    const std::string rest = "src" + base + "/x";
    temp.mkdir("work/" + rest);
    EXPECT_EQ(str(Utilities::MakeRelativePath(base, base + "/" + rest)), "./" + rest + "/");
}

TEST_F(PathsTest, SiblingWithTheBaseNameAsPrefixIsNotUnderTheBase) {
    temp.mkdir("work");
    temp.write("work/file", "");
    temp.write("work2/x", "");
    EXPECT_EQ(str(Utilities::MakeRelativePath(t + "/work", t + "/work2/x")),
              tesutest::Native(t + "/work2/x"));
    EXPECT_EQ(str(Utilities::MakeRelativePath(t + "/work/file", t + "/work2/x")),
              tesutest::Native(t + "/work2/x"));
    EXPECT_EQ(str(Utilities::MakeRelativePath(t + "/work/none", t + "/work2/x")),
              tesutest::Native(t + "/work2/x"));
    // A missing base stands for its parent, under which the sibling does lie.
    EXPECT_EQ(str(Utilities::MakeRelativePath(t + "/gone", t + "/work2/x")),
              tesutest::Native("./work2/x"));
}

}  // namespace

// Port::FileName: splitting, joining, native and absolute forms, on real directories.
#include <gtest/gtest.h>

#include <filesystem>
#include <string>

#include "Port_File.h"
#include "Port_FileName.h"
#include "TestPlatform.h"
#include "TestSupport.h"

namespace fs = std::filesystem;
using Port::FileName;

namespace {

// Why the cases that spell out POSIX texts do not run on Windows.
[[maybe_unused]] constexpr const char* kPosixTextsOnly =
    "expects POSIX texts (\"/\" joins, \"/\" is the root); the WindowsFileName tests check the "
    "Windows forms";

std::string text(const Port::StringBase<char>& s) {
    return s.str();
}

// The working directory as the layer reports it, after moving into `directory`.
std::string enter(const std::string& directory) {
    EXPECT_TRUE(Port::File::chdir(directory.c_str()));
    return text(Port::File::getcwd());
}

}  // namespace

TEST(PortFileName, SplitsAfterTheLastSeparatorOfEitherKind) {
    FileName mixed("a/b\\c.txt");
    EXPECT_EQ(text(mixed.GetHead()), "a/b\\");
    EXPECT_EQ(text(mixed.GetTail()), "c.txt");
    EXPECT_EQ(text(mixed.GetHead(true)), tesutest::Native("a/b/"));

    FileName bare("file.v");
    EXPECT_EQ(text(bare.GetHead()), "");
    EXPECT_EQ(text(bare.GetTail()), "file.v");

    FileName root("/");
    EXPECT_EQ(text(root.GetHead()), "/");
    EXPECT_EQ(text(root.GetTail()), "");

    FileName directory("dir/");
    EXPECT_EQ(text(directory.GetHead()), "dir/");
    EXPECT_EQ(text(directory.GetTail()), "");

    // The name as given comes back unchanged, repeated separators included.
    EXPECT_EQ(text(FileName("x//y\\z").GetText()), "x//y\\z");
    EXPECT_EQ(text(FileName("").GetText()), "");
}

TEST(PortFileName, JoinsPartsWithExactlyOneSeparator) {
#if defined(_WIN32)
    GTEST_SKIP() << kPosixTextsOnly;
#endif
    FileName java;
    java.SetHead("/opt/inst");
    java.SetTail("/java/linux-x86_64/jre/bin/java");
    EXPECT_EQ(text(java.GetHead()), "/opt/inst/");
    EXPECT_EQ(text(java.GetText()), "/opt/inst/java/linux-x86_64/jre/bin/java");

    FileName candidate;
    candidate.SetHead("/root/");
    candidate.PushPathEnd("tessel/ip/quarnel");
    candidate.PushPathEnd("/entry/");
    candidate.SetTail("lib/x.v");
    EXPECT_EQ(text(candidate.GetHead()), "/root/tessel/ip/quarnel/entry/");
    EXPECT_EQ(text(candidate.GetText()), "/root/tessel/ip/quarnel/entry/lib/x.v");
    EXPECT_EQ(text(candidate.MakeNative()), "/root/tessel/ip/quarnel/entry/lib/x.v");

    // A head given with a backslash keeps it; no second separator is added.
    FileName windowsStyle;
    windowsStyle.SetHead("C:\\inst\\");
    windowsStyle.SetTail("\\bin");
    EXPECT_EQ(text(windowsStyle.GetText()), "C:\\inst\\bin");

    // Pushing onto an empty head keeps a leading separator: the name stays absolute.
    FileName absolute;
    absolute.PushPathEnd("/usr/lib//");
    EXPECT_EQ(text(absolute.GetHead()), "/usr/lib/");
    absolute.PushPathEnd("");
    absolute.PushPathEnd("///");
    EXPECT_EQ(text(absolute.GetHead()), "/usr/lib/");

    FileName rootOnly;
    rootOnly.PushPathEnd("/");
    rootOnly.SetTail("etc");
    EXPECT_EQ(text(rootOnly.GetText()), "/etc");

    // An empty head leaves the tail alone, leading separator included.
    FileName noHead("a/b");
    noHead.SetHead("");
    EXPECT_EQ(text(noHead.GetHead()), "");
    noHead.SetTail("/x");
    EXPECT_EQ(text(noHead.GetText()), "/x");
}

TEST(PortFileName, NativeFormTurnsBothSeparatorsIntoThePlatforms) {
#if defined(_WIN32)
    GTEST_SKIP() << kPosixTextsOnly;
#endif
    const char separator = FileName::GetPathSeparator();
    EXPECT_EQ(separator, '/');
    EXPECT_EQ(text(FileName("a\\b/c\\").MakeNative()), "a/b/c/");
    EXPECT_EQ(text(FileName("\\\\server\\share").MakeNative()), "//server/share");
}

TEST(PortFileName, AbsoluteFormResolvesDotsAndSeparatorsLexically) {
#if defined(_WIN32)
    GTEST_SKIP() << kPosixTextsOnly;
#endif
    tesutest::WorkingDirectoryRestorer restore;
    tesutest::TempDir tmp;
    tmp.mkdir("w/sub");
    const std::string cwd = enter(tmp.join("w/sub"));
    const std::string parent = cwd.substr(0, cwd.rfind('/'));

    EXPECT_EQ(text(FileName("a/./b/../c").GetAbsolutePath()), cwd + "/a/c");
    EXPECT_EQ(text(FileName("missing.txt").GetAbsolutePath()), cwd + "/missing.txt");
    EXPECT_EQ(text(FileName(".").GetAbsolutePath()), cwd);
    EXPECT_EQ(text(FileName("").GetAbsolutePath()), cwd);
    EXPECT_EQ(text(FileName("..").GetAbsolutePath()), parent);
    EXPECT_EQ(text(FileName("../sub/").GetAbsolutePath()), cwd);
    EXPECT_EQ(text(FileName("a\\..\\b\\c").GetAbsolutePath()), cwd + "/b/c");

    EXPECT_EQ(text(FileName("/x//y///z/").GetAbsolutePath()), "/x/y/z");
    EXPECT_EQ(text(FileName("\\x\\y").GetAbsolutePath()), "/x/y");
    EXPECT_EQ(text(FileName("/").GetAbsolutePath()), "/");
    EXPECT_EQ(text(FileName("//").GetAbsolutePath()), "/");
    EXPECT_EQ(text(FileName("/..").GetAbsolutePath()), "/");
    EXPECT_EQ(text(FileName("/../../a/..").GetAbsolutePath()), "/");
    EXPECT_EQ(text(FileName("/../../a/.").GetAbsolutePath()), "/a");
    EXPECT_EQ(text(FileName("/a/b/../../..").GetAbsolutePath()), "/");
    // A component that merely starts with dots is a name.
    EXPECT_EQ(text(FileName("/a/...b/.c/..d").GetAbsolutePath()), "/a/...b/.c/..d");

    // Going up from the working directory far enough stops at the root.
    std::string up;
    for (int i = 0; i < 64; ++i) {
        up += "../";
    }
    EXPECT_EQ(text(FileName(up.c_str()).GetAbsolutePath()), "/");

    // The joined name is what is made absolute.
    FileName joined;
    joined.SetHead("/opt//inst/");
    joined.SetTail("/./java/../jre");
    EXPECT_EQ(text(joined.GetAbsolutePath()), "/opt/inst/jre");
}

TEST(PortFileName, HeadOfTheAbsoluteForm) {
#if defined(_WIN32)
    GTEST_SKIP() << kPosixTextsOnly;
#endif
    tesutest::WorkingDirectoryRestorer restore;
    tesutest::TempDir tmp;
    const std::string cwd = enter(tmp.path());

    EXPECT_EQ(text(FileName("x/../y/z.v").GetHead(false, true)), cwd + "/y/");
    EXPECT_EQ(text(FileName("z.v").GetHead(true, true)), cwd + "/");
    EXPECT_EQ(text(FileName("a\\b").GetHead(true, true)), cwd + "/a/");
    EXPECT_EQ(text(FileName("/top").GetHead(false, true)), "/");
    EXPECT_EQ(text(FileName("/").GetHead(false, true)), "/");
}

TEST(PortFileName, SymbolicLinksAreLeftAloneUnlessResolvingIsAsked) {
    if (const char* reason = tesutest::WhyNoSymbolicLinks()) {
        GTEST_SKIP() << reason;
    }
    tesutest::TempDir tmp;
    tmp.write("deep/real/f.txt", "x");
    const std::string link = tmp.join("link");
    ASSERT_TRUE(tesutest::MakeSymbolicLink(tmp.join("deep/real"), link));
    const std::string real = fs::canonical(tmp.join("deep/real")).string();
    const std::string deep = fs::canonical(tmp.join("deep")).string();

    const FileName throughLink((link + "/f.txt").c_str());
    EXPECT_EQ(text(throughLink.GetAbsolutePath(false)), link + "/f.txt");
    EXPECT_EQ(text(throughLink.GetAbsolutePath(true)), real + "/f.txt");

    // Lexically "link/.." is the directory holding the link; the system goes up from the
    // link's target.
    const FileName upFromLink((link + "/..").c_str());
    EXPECT_EQ(text(upFromLink.GetAbsolutePath(false)), tmp.path());
    EXPECT_EQ(text(upFromLink.GetAbsolutePath(true)), deep);

    // A name that does not exist falls back to the lexical form.
    const FileName missing((link + "/none/../gone").c_str());
    EXPECT_EQ(text(missing.GetAbsolutePath(true)), link + "/gone");
}

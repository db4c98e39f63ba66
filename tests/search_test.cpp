// The search for files under the installation roots, inside the IP container of each root,
// and for the shipped Java runtime, with the traces on the logger "utilities".
#include <gtest/gtest.h>

#include <filesystem>
#include <initializer_list>
#include <string>

#include "Port_Env.h"
#include "TestPlatform.h"
#include "TestSupport.h"
#include "Tesu_DebugMessenger.h"
#include "Tesu_Utilities.h"

namespace {

namespace fs = std::filesystem;
using Tesu::Utilities;
using Text = Port::StringBase<char>;

Port::PathList rootList(std::initializer_list<std::string> roots) {
    Port::PathList list;
    for (const std::string& root : roots) {
        list.Append(root);
    }
    return list;
}

std::string found(const std::string& name, const std::string& path) {
    return "DEBUG[utilities] - Looking for " + name + "\nFound " + path + "\n";
}

std::string missing(const std::string& name) {
    return "DEBUG[utilities] - Could not find " + name + "\n";
}

class SearchTest : public ::testing::Test {
  protected:
    SearchTest() : t(temp.path()) {
        Tesu::DebugMessengerFactory::GetLogger("utilities")
            ->SetLevel(Tesu::DebugMessenger::DEBUG_VERBOSE);
    }

    // Runs one search of either kind with the output preset, so that an untouched output
    // can be told from a written one.
    bool search(bool container, const std::string& name, std::string& out) {
        Text path("untouched");
        const bool ok = container ? Utilities::GetFullQuarnelPathWithContainer(name, path)
                                  : Utilities::GetFullQuarnelPathOf(name, path);
        out = path.str();
        return ok;
    }

    tesutest::LoggerLevelsReset levels;
    tesutest::TempDir temp;
    const std::string t;
    tesutest::MessageCapture capture;
};

TEST_F(SearchTest, FirstRootInListOrderWins) {
    temp.write("r1/lib/a.txt", "1");
    temp.write("r2/lib/a.txt", "2");
    temp.write("r2/lib/only2.txt", "2");
    temp.mkdir("r2/lib/somedir");
    std::string out;
    {
        tesutest::RootsGuard roots(rootList({t + "/none", t + "/r1", t + "/r2"}));
        EXPECT_TRUE(search(false, "lib/a.txt", out));
        EXPECT_EQ(out, tesutest::Native(t + "/r1/lib/a.txt"));
        EXPECT_EQ(capture.text(), found("lib/a.txt", out));
        EXPECT_TRUE(search(false, "lib/only2.txt", out));
        EXPECT_EQ(out, tesutest::Native(t + "/r2/lib/only2.txt"));
        // A directory is found like a file; a leading separator is not doubled.
        EXPECT_TRUE(search(false, "\\lib/somedir/", out));
        EXPECT_EQ(out, tesutest::Native(t + "/r2/lib/somedir"));
    }
    tesutest::RootsGuard roots(rootList({t + "/r2/", t + "/r1"}));
    EXPECT_TRUE(search(false, "lib/a.txt", out));
    EXPECT_EQ(out, tesutest::Native(t + "/r2/lib/a.txt"));
}

TEST_F(SearchTest, FailureLeavesOutputUntouchedAndTracesOneLine) {
    temp.write("r1/x", "");
    std::string out;
    for (const Port::PathList& list : {rootList({}), rootList({t + "/r1", t + "/none"})}) {
        tesutest::RootsGuard roots(list);
        capture.clear();
        EXPECT_FALSE(search(false, "lib/a b.txt", out));
        EXPECT_EQ(out, "untouched");
        EXPECT_EQ(capture.text(), missing("lib/a b.txt"));
        capture.clear();
        EXPECT_FALSE(search(true, "x", out));
        EXPECT_EQ(out, "untouched");
        EXPECT_EQ(capture.text(), missing("x"));
    }
}

TEST_F(SearchTest, EmptyNameGivesFirstExistingRootAndRelativeRootsBecomeAbsolute) {
    temp.mkdir("r2");
    tesutest::WorkingDirectoryRestorer restorer;
    fs::current_path(t);
    tesutest::RootsGuard roots(rootList({"none", "./r2/"}));
    std::string out;
    EXPECT_TRUE(search(false, "", out));
    EXPECT_EQ(out, tesutest::Native(fs::current_path().string() + "/r2"));
}

TEST_F(SearchTest, TracesOnlyAtVerboseLevelAndNamesAreNeverFormats) {
#if defined(_WIN32)
    // Windows names are UTF-16: the bytes must be UTF-8 to name a file there.
    const std::string name = "d\xc3\xa9j\xc3\xa0 %s%n.txt";
#else
    const std::string name = "d\xc3\xa9j\xe0 %s%n.txt";
#endif
    temp.write("r1/" + name, "");
    tesutest::RootsGuard roots(rootList({t + "/r1"}));
    std::string out;
    Tesu::DebugMessengerFactory::GetLogger("utilities")
        ->SetLevel(Tesu::DebugMessenger::DEBUG_DETAILED);
    EXPECT_TRUE(search(false, name, out));
    EXPECT_FALSE(search(false, "none", out));
    EXPECT_EQ(capture.text(), "");
    Tesu::DebugMessengerFactory::GetLogger("utilities")
        ->SetLevel(Tesu::DebugMessenger::DEBUG_INHERIT);
    Tesu::DebugMessengerFactory::GetLogger()->SetLevel(Tesu::DebugMessenger::DEBUG_VERBOSE);
    EXPECT_TRUE(search(false, name, out));
    EXPECT_EQ(capture.text(), found(name, tesutest::Native(t + "/r1/") + name));
}

TEST_F(SearchTest, ContainerEntriesAreSearchedInNameOrder) {
    const std::string c1 = "r1/tessel/ip/quarnel/";
    temp.write(c1 + "B/only_b.v", "");
    temp.write(c1 + "B/both.v", "");
    temp.write(c1 + "A/both.v", "");
    temp.write(c1 + "direct.v", "");
    temp.mkdir(c1 + "A/sub");
    tesutest::RootsGuard roots(rootList({t + "/r1"}));
    std::string out;
    EXPECT_TRUE(search(true, "only_b.v", out));
    EXPECT_EQ(out, tesutest::Native(t + "/" + c1 + "B/only_b.v"));
    EXPECT_EQ(capture.text(), found("only_b.v", out));
    EXPECT_TRUE(search(true, "both.v", out));
    EXPECT_EQ(out, tesutest::Native(t + "/" + c1 + "A/both.v"));
    EXPECT_TRUE(search(true, "sub", out));
    EXPECT_EQ(out, tesutest::Native(t + "/" + c1 + "A/sub"));
    // Neither the container itself nor the root is searched.
    capture.clear();
    EXPECT_FALSE(search(true, "direct.v", out));
    EXPECT_FALSE(search(true, "tessel", out));
    EXPECT_EQ(capture.text(), missing("direct.v") + missing("tessel"));
}

TEST_F(SearchTest, ContainerRootsAreWalkedInOrder) {
    temp.write("r1/tessel/ip/quarnel", "a file, not a container");
    temp.mkdir("r2/tessel/ip/quarnel");  // empty container
    temp.write("r3/tessel/ip/quarnel/Z/core.v", "");
    temp.write("r4/tessel/ip/quarnel/A/core.v", "");
    tesutest::RootsGuard roots(rootList({t + "/r0", t + "/r1", t + "/r2", t + "/r3", t + "/r4"}));
    std::string out;
    EXPECT_TRUE(search(true, "core.v", out));
    EXPECT_EQ(out, tesutest::Native(t + "/r3/tessel/ip/quarnel/Z/core.v"));
}

TEST_F(SearchTest, JavaRuntimeIsFoundUnderTheRootsByPlatformName) {
    // On Windows NT the runtime is "java.exe"; elsewhere "java", and a "java.exe" is not it.
    const std::string platform = Port_Env::GetPlatformPath().str();
    const std::string exe = Port_Env::IsNt() ? ".exe" : "";
    const std::string other = Port_Env::IsNt() ? "" : ".exe";
    const std::string name = tesutest::Native("/java/" + platform + "/jre/bin/java") + exe;
    temp.write("r1/java/" + platform + "/jre/bin/java" + other, "");
    temp.write("r2/java/" + platform + "/jre/bin/java" + exe, "");
    temp.write("r3/java/" + platform + "/jre/bin/java" + exe, "");
    Text out("untouched");
    {
        tesutest::RootsGuard roots(rootList({t + "/r1"}));
        EXPECT_FALSE(Utilities::GetJavaExecutablePath(out));
        EXPECT_EQ(out.str(), "untouched");
        EXPECT_EQ(capture.text(), missing(name));
    }
    capture.clear();
    tesutest::RootsGuard roots(rootList({t + "/r1", t + "/r2", t + "/r3"}));
    EXPECT_TRUE(Utilities::GetJavaExecutablePath(out));
    EXPECT_EQ(out.str(), tesutest::Native(t + "/r2") + name);
    EXPECT_EQ(capture.text(), found(name, out.str()));
}

}  // namespace

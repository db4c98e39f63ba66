// The cores update level: the update log found among the installation roots and its first
// "cores_level=" line.
#include <gtest/gtest.h>

#include <filesystem>
#include <string>
#include <vector>

#include "Port_PathList.h"
#include "Port_String.h"
#include "TestPlatform.h"
#include "TestSupport.h"
#include "Tesu_IPUpdateInfo.h"

namespace {

constexpr const char* kUntouched = "caller's text";

struct Outcome {
    unsigned int result;
    std::string report;
    std::string messages;
};

Outcome CoresLevel(const std::vector<std::string>& roots) {
    Port::PathList list;
    for (const std::string& root : roots) {
        list.Append(Port::StringBase<char>(root));
    }
    tesutest::RootsGuard guard(list);
    tesutest::MessageCapture capture;
    Port::StringBase<char> report(kUntouched);
    const unsigned int result = Tesu::IPUpdateInfo::GetCoresLevel(report);
    return Outcome{result, report.str(), capture.text()};
}

// The level found in a single root holding a log with `content`.
Outcome LevelOfLog(const std::string& content) {
    tesutest::TempDir root;
    root.write("IPupdate.log", content);
    return CoresLevel({root.path()});
}

TEST(GetCoresLevel, ReportsTheTextAfterTheFirstTag) {
    std::string log;
    for (int i = 0; i < 10; ++i) {
        log += "2024-0" + std::to_string(i) + " installed something\n";
    }
    Outcome outcome = LevelOfLog(log + "cores_level=7\nmore\ncores_level=8\n");
    EXPECT_EQ(3u, outcome.result);
    EXPECT_EQ("Cores Update # 7", outcome.report);
    EXPECT_EQ("", outcome.messages);

    // The tag may stand mid-line; what follows it is kept as it stands, blanks included.
    EXPECT_EQ("Cores Update # 3 (patch)", LevelOfLog("update: cores_level=3 (patch)\n").report);
    EXPECT_EQ("Cores Update # 12 ", LevelOfLog("cores_level=12 \n").report);
    EXPECT_EQ("Cores Update # a=b cores_level=9",
              LevelOfLog("cores_level=a=b cores_level=9\n").report);
    // Nothing after the tag is still a level line.
    outcome = LevelOfLog("first\ncores_level=\nlast\n");
    EXPECT_EQ(3u, outcome.result);
    EXPECT_EQ("Cores Update # ", outcome.report);
}

TEST(GetCoresLevel, LastLineIsFoundWithOrWithoutLineBreak) {
    EXPECT_EQ("Cores Update # 5", LevelOfLog("start\ncores_level=5\n").report);
    EXPECT_EQ("Cores Update # 5", LevelOfLog("start\ncores_level=5").report);
    EXPECT_EQ("Cores Update # 5", LevelOfLog("cores_level=5").report);
    // The reader drops the carriage return of a CR-LF end.
    EXPECT_EQ("Cores Update # 6", LevelOfLog("start\r\ncores_level=6\r\n").report);
}

TEST(GetCoresLevel, LogWithoutALevelLineLeavesTheReport) {
    for (const char* content :
         {"", "\n", "nothing here\n", "cores_level\n", "CORES_LEVEL=4\n", "cores level=4"}) {
        const Outcome outcome = LevelOfLog(content);
        EXPECT_EQ(4u, outcome.result) << content;
        EXPECT_EQ(kUntouched, outcome.report) << content;
        EXPECT_EQ("", outcome.messages) << content;
    }
}

TEST(GetCoresLevel, FirstRootWithAReadableLogIsTheOnlyOneRead) {
    tesutest::TempDir top;
    const std::string empty = top.mkdir("empty");
    const std::string first = top.mkdir("first");
    const std::string second = top.mkdir("second");
    top.write("first/IPupdate.log", "no level here\n");
    top.write("second/IPupdate.log", "cores_level=2\n");

    // The first log wins even without a level line.
    Outcome outcome = CoresLevel({empty, first, second});
    EXPECT_EQ(4u, outcome.result);
    EXPECT_EQ(kUntouched, outcome.report);

    outcome = CoresLevel({empty, top.join("missing"), second, first});
    EXPECT_EQ(3u, outcome.result);
    EXPECT_EQ("Cores Update # 2", outcome.report);
    // A root given with a trailing separator still finds its log.
    EXPECT_EQ("Cores Update # 2", CoresLevel({second + "/"}).report);

    for (const auto& roots : {std::vector<std::string>{}, std::vector<std::string>{empty},
                              std::vector<std::string>{empty, top.join("missing")}}) {
        outcome = CoresLevel(roots);
        EXPECT_EQ(1u, outcome.result);
        EXPECT_EQ(kUntouched, outcome.report);
        EXPECT_EQ("", outcome.messages);
    }
}

TEST(GetCoresLevel, LogThatDoesNotOpenIsReportedWithItsPathAsBuilt) {
    tesutest::TempDir top;
    // A directory of the log's name can be read but does not open as a file.
    top.mkdir("root/IPupdate.log");
    top.write("later/IPupdate.log", "cores_level=1\n");
    const std::string root = top.join("root/../root/");
    const Outcome outcome = CoresLevel({root, top.join("later")});
    EXPECT_EQ(2u, outcome.result);
    EXPECT_EQ(kUntouched, outcome.report);
    // Root, one separator (even after the root's own) and the name; not made absolute.
    EXPECT_EQ("ERROR:tesutil - Couldn't open " + root + tesutest::Native("/") +
                  "IPupdate.log for reading.\n",
              outcome.messages);
}

TEST(GetCoresLevel, UnreadableLogIsPassedOver) {
    if (const char* reason = tesutest::WhyPermissionsDoNotLockOut()) {
        GTEST_SKIP() << reason;
    }
    tesutest::TempDir top;
    const std::string locked = top.write("locked/IPupdate.log", "cores_level=1\n");
    top.write("open/IPupdate.log", "cores_level=2\n");
    std::filesystem::permissions(locked, std::filesystem::perms::none);

    Outcome outcome = CoresLevel({top.join("locked"), top.join("open")});
    EXPECT_EQ(3u, outcome.result);
    EXPECT_EQ("Cores Update # 2", outcome.report);

    outcome = CoresLevel({top.join("locked")});
    EXPECT_EQ(1u, outcome.result);
    EXPECT_EQ(kUntouched, outcome.report);
    EXPECT_EQ("", outcome.messages);
}

}  // namespace

// The application's name, its version value, the build stamps and the next major release.
#include <gtest/gtest.h>

#include <cctype>
#include <cstdio>
#include <cstring>
#include <string>

#include "TestSupport.h"
#include "Tesu_DebugMessenger.h"
#include "Tesu_Utilities.h"

namespace {

using Tesu::Utilities;

class IdentityTest : public ::testing::Test {
  protected:
    IdentityTest() {
        Tesu::DebugMessengerFactory::GetLogger("utilities")
            ->SetLevel(Tesu::DebugMessenger::DEBUG_VERBOSE);
    }
    tesutest::LoggerLevelsReset levels;
    tesutest::MessageCapture capture;
};

TEST_F(IdentityTest, NameIsFixedAndVersionIsTheTablesValue) {
    for (const char* version : {"", "3.4.5-rc1"}) {
        tesutest::VersionGuard guard("version", version);
        EXPECT_EQ(Utilities::ApplicationName().str(), "Quarnel Tessel");
        EXPECT_EQ(Utilities::RevisionVersion().str(), version);
    }
}

TEST_F(IdentityTest, NextMajorIsTheIncrementedMajorFollowedByDotOne) {
    const struct {
        const char* version;
        const char* next;
    } cases[] = {
        {"9.2.0", "10.1"},
        {"11.0", "12.1"},
        {"7.", "8.1"},
        {".5.1", "1.1"},
        {"x.2", "x.1"},
        {"-3.0", "-2.1"},
        {"2147483647.0", "2147483648.1"},
        {"-2147483648.9", "-2147483647.1"},
        {"2147483648.0", "2147483648.1"},  // too large to read: kept as text
    };
    for (const auto& c : cases) {
        tesutest::VersionGuard guard("version", c.version);
        EXPECT_EQ(Utilities::NextMajorRelease().str(), c.next) << c.version;
    }
    EXPECT_EQ(capture.text(), "");
}

TEST_F(IdentityTest, UnsplittableVersionGivesEmptyTextAndOneTrace) {
    for (const char* version : {"7", "", "%s%n"}) {
        capture.clear();
        tesutest::VersionGuard guard("version", version);
        EXPECT_EQ(Utilities::NextMajorRelease().str(), "") << version;
        EXPECT_EQ(capture.text(), std::string("DEBUG[utilities] - Failed to split extract major "
                                              "version from ") +
                                      version + "\n.\n");
    }
    Tesu::DebugMessengerFactory::GetLogger("utilities")
        ->SetLevel(Tesu::DebugMessenger::DEBUG_DETAILED);
    capture.clear();
    tesutest::VersionGuard guard("version", "7");
    EXPECT_EQ(Utilities::NextMajorRelease().str(), "");
    EXPECT_EQ(capture.text(), "");
}

TEST_F(IdentityTest, BuildStampsHaveTheCompilersShapes) {
    const char* date = Utilities::GetBuildDate();
    ASSERT_EQ(std::strlen(date), 11u);
    const std::string months = "JanFebMarAprMayJunJulAugSepOctNovDec";
    const std::size_t month = months.find(std::string(date, 3));
    EXPECT_TRUE(month != std::string::npos && month % 3 == 0) << date;
    // The day is padded with a blank, never a zero.
    const bool dayDigits = (date[4] == ' ' || std::isdigit(static_cast<unsigned char>(date[4]))) &&
                           std::isdigit(static_cast<unsigned char>(date[5]));
    ASSERT_TRUE(dayDigits) << date;
    const int day = (date[4] == ' ' ? 0 : date[4] - '0') * 10 + (date[5] - '0');
    EXPECT_TRUE(day >= 1 && day <= 31 && date[4] != '0') << date;
    EXPECT_EQ(date[3], ' ');
    EXPECT_EQ(date[6], ' ');
    for (int i = 7; i < 11; ++i) {
        EXPECT_TRUE(std::isdigit(static_cast<unsigned char>(date[i]))) << date;
    }
    const char* time = Utilities::GetBuildTime();
    ASSERT_EQ(std::strlen(time), 8u);
    int hours = 0;
    int minutes = 0;
    int seconds = 0;
    char tail = 0;
    EXPECT_EQ(std::sscanf(time, "%2d:%2d:%2d%c", &hours, &minutes, &seconds, &tail), 3) << time;
    EXPECT_TRUE(hours < 24 && minutes < 60 && seconds <= 60) << time;
    EXPECT_EQ(time[2], ':');
    EXPECT_EQ(time[5], ':');
    // Static texts: the same storage on every call.
    EXPECT_EQ(Utilities::GetBuildDate(), date);
    EXPECT_EQ(Utilities::GetBuildTime(), time);
}

}  // namespace

// Port::Version (table and splitting) and Port_Env (platform and environment).
#include <gtest/gtest.h>

#include <stdlib.h>

#include <fstream>
#include <sstream>
#include <string>

#include "Port_Env.h"
#include "Port_Version.h"
#include "TestSupport.h"

using Port::String;
using Port::Version;

namespace {

// The version the top-level CMakeLists.txt declares for the project.
std::string declaredProjectVersion() {
    std::ifstream in(TESU_SOURCE_DIR "/CMakeLists.txt");
    std::ostringstream content;
    content << in.rdbuf();
    const std::string text = content.str();
    const std::size_t project = text.find("project(");
    const std::size_t version = text.find(" VERSION ", project);
    if (project == std::string::npos || version == std::string::npos) {
        return "?";
    }
    const std::size_t first = version + 9;
    return text.substr(first, text.find_first_not_of("0123456789.", first) - first);
}

TEST(PortVersion, SetAndResetTheTable) {
    Version::resetValues();
    const String compiledIn = Version::getValue("version");
    EXPECT_EQ(compiledIn.str(), declaredProjectVersion());
    EXPECT_TRUE(Version::getValue("no such key").IsEmpty());
    EXPECT_TRUE(Version::getValue(nullptr).IsEmpty());
    {
        tesutest::VersionGuard guard("version", "9.8.7");
        Version::setValue("extra", "x");
        EXPECT_EQ(Version::getValue("version").str(), "9.8.7");
        EXPECT_EQ(Version::getValue("extra").str(), "x");
        Version::setValue("version", "");
        EXPECT_TRUE(Version::getValue("version").IsEmpty());
    }
    EXPECT_EQ(Version::getValue("version"), compiledIn);
    EXPECT_TRUE(Version::getValue("extra").IsEmpty());
}

TEST(PortVersion, SplitAtTheFirstTwoDots) {
    struct Case {
        const char* text;
        const char* major;
        const char* minor;
        const char* rest;
    };
    const Case cases[] = {
        {"12.3.4-beta", "12", "3", "4-beta"},
        {"7.", "7", "", ""},
        {"1.2", "1", "2", ""},
        {".5", "", "5", ""},
        {"1..2", "1", "", "2"},
        {"1.2.3.4", "1", "2", "3.4"},
    };
    for (const Case& c : cases) {
        String major("m"), minor("n"), rest("r");
        ASSERT_TRUE(Version::splitVersion(c.text, major, minor, rest)) << c.text;
        EXPECT_EQ(major.str(), c.major) << c.text;
        EXPECT_EQ(minor.str(), c.minor) << c.text;
        EXPECT_EQ(rest.str(), c.rest) << c.text;
    }
    for (const char* text : {"", "7", "1-2"}) {
        String major("m"), minor("n"), rest("r");
        EXPECT_FALSE(Version::splitVersion(text, major, minor, rest)) << text;
        EXPECT_EQ(major.str() + minor.str() + rest.str(), "mnr") << text;
    }
    String same("4.5.6");
    String minor, rest;
    ASSERT_TRUE(Version::splitVersion(same, same, minor, rest));
    EXPECT_EQ(same.str() + "|" + minor.str() + "|" + rest.str(), "4|5|6");
}

TEST(PortEnv, PlatformOfThisBuild) {
#if defined(_WIN32)
    EXPECT_TRUE(Port_Env::IsNt());
    const char* system = "windows-";
#else
    EXPECT_FALSE(Port_Env::IsNt());
    const char* system = "linux-";
#endif
#if defined(__x86_64__) || defined(_M_X64)
    EXPECT_EQ(Port_Env::GetPlatformPath().str(), std::string(system) + "x86_64");
#elif defined(__aarch64__)
    EXPECT_EQ(Port_Env::GetPlatformPath().str(), std::string(system) + "aarch64");
#elif defined(__i386__) || defined(_M_IX86)
    EXPECT_EQ(Port_Env::GetPlatformPath().str(), std::string(system) + "x86");
#else
    EXPECT_EQ(Port_Env::GetPlatformPath().GetIndexOfString(system), 0u);
#endif
}

#if !defined(_WIN32)
TEST(PortEnv, GetVariableReportsSetAndUnset) {
    String value("kept");
    ::unsetenv("TESU_ENV_TEST_VARIABLE");
    EXPECT_FALSE(Port_Env::GetVariable("TESU_ENV_TEST_VARIABLE", value));
    EXPECT_EQ(value.str(), "kept");
    ::setenv("TESU_ENV_TEST_VARIABLE", "a b=c", 1);
    EXPECT_TRUE(Port_Env::GetVariable("TESU_ENV_TEST_VARIABLE", value));
    EXPECT_EQ(value.str(), "a b=c");
    ::setenv("TESU_ENV_TEST_VARIABLE", "", 1);
    EXPECT_TRUE(Port_Env::GetVariable("TESU_ENV_TEST_VARIABLE", value));
    EXPECT_TRUE(value.IsEmpty());
    ::unsetenv("TESU_ENV_TEST_VARIABLE");
    EXPECT_FALSE(Port_Env::GetVariable(nullptr, value));
}
#endif

}  // namespace

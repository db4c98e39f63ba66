// Debug loggers as a caller sees them: levels and their inheritance, the lines that reach the
// message managers, the timers and the closing total-time line.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <chrono>
#include <cstdint>
#include <memory>
#include <regex>
#include <string>
#include <thread>

#include "TestSupport.h"
#include "Tesu_DebugMessenger.h"

namespace {

using Tesu::DebugMessenger;

// Milliseconds of a duration text "H:MM:SS.mmm"; fails the test on any other form.
std::int64_t Millis(const Port::StringBase<char>& text) {
    static const std::regex form(R"((\d+):([0-5]\d):([0-5]\d)\.(\d{3}))");
    std::smatch parts;
    const std::string s = text.str();
    if (!std::regex_match(s, parts, form)) {
        ADD_FAILURE() << "not a duration: '" << s << "'";
        return -1;
    }
    return ((std::stoll(parts[1]) * 60 + std::stoll(parts[2])) * 60 + std::stoll(parts[3])) * 1000 +
           std::stoll(parts[4]);
}

void Pause(int milliseconds) {
    std::this_thread::sleep_for(std::chrono::milliseconds(milliseconds));
}

// Every test starts from the library's levels (root off, named loggers inheriting).
class DebugMessengerTest : public ::testing::Test {
  protected:
    tesutest::LoggerLevelsReset levels;
    tesutest::MessageCapture capture;
};

TEST_F(DebugMessengerTest, InheritsThroughGenerationsAndFollowsEachChange) {
    DebugMessenger root;
    DebugMessenger child(&root, "child");
    DebugMessenger grandchild(&child, "grandchild");
    DebugMessenger greatGrandchild(&grandchild, "great");

    // A fresh root is off, and so is everything below it.
    EXPECT_TRUE(greatGrandchild.IsOff());
    EXPECT_FALSE(greatGrandchild.IsNormal());
    greatGrandchild.Normal("dropped");
    EXPECT_EQ(capture.text(), "");

    root.SetLevel(DebugMessenger::DEBUG_NORMAL);
    EXPECT_FALSE(greatGrandchild.IsOff());
    EXPECT_TRUE(greatGrandchild.IsNormal());
    EXPECT_FALSE(greatGrandchild.IsDetailed());
    greatGrandchild.Normal("n");
    greatGrandchild.Detailed("d");
    greatGrandchild.Verbose("v");
    EXPECT_EQ(capture.text(), "DEBUG[great] - n\n");
    capture.clear();

    // A level in the middle of the chain governs what lies below it, not above.
    child.SetLevel(DebugMessenger::DEBUG_VERBOSE);
    root.SetLevel(DebugMessenger::DEBUG_OFF);
    EXPECT_TRUE(greatGrandchild.IsVerbose());
    EXPECT_TRUE(grandchild.IsDetailed());
    EXPECT_TRUE(root.IsOff());
    root.Normal("root silent");
    grandchild.Normal("n");
    grandchild.Detailed("d");
    grandchild.Verbose("v");
    EXPECT_EQ(capture.text(),
              "DEBUG[grandchild] - n\nDEBUG[grandchild] - d\nDEBUG[grandchild] - v\n");
    capture.clear();

    // Back to inheriting: the whole branch follows the root again, at once.
    child.SetLevel(DebugMessenger::DEBUG_INHERIT);
    EXPECT_TRUE(greatGrandchild.IsOff());
    root.SetLevel(DebugMessenger::DEBUG_DETAILED);
    EXPECT_TRUE(greatGrandchild.IsDetailed());
    EXPECT_FALSE(greatGrandchild.IsVerbose());

    // IsOff tests equality: a detailed logger is not off.
    EXPECT_FALSE(root.IsOff());

    // A chain that ends without a level (a root set to inherit, a logger without parent)
    // counts as off instead of following a null parent: only off-level lines are written.
    root.SetLevel(DebugMessenger::DEBUG_INHERIT);
    DebugMessenger orphan(nullptr, "orphan");
    EXPECT_TRUE(greatGrandchild.IsOff());
    EXPECT_TRUE(orphan.IsOff());
    greatGrandchild.Normal("n");
    orphan.Normal("n");
    orphan.Message(DebugMessenger::DEBUG_OFF, "off");
    EXPECT_EQ(capture.text(), "DEBUG[orphan] - off\n");
    root.SetLevel(DebugMessenger::DEBUG_OFF);
}

TEST_F(DebugMessengerTest, PrefixDependsOnTheNameOnly) {
    DebugMessenger root;
    root.SetLevel(DebugMessenger::DEBUG_NORMAL);
    DebugMessenger childNamedRoot(&root, "root");
    DebugMessenger childNamedRootUpper(&root, "ROOT");
    DebugMessenger child(&root, "utilities");
    DebugMessenger unnamed(&root, "");
    DebugMessenger nearlyRoot(&root, "roots");
    DebugMessenger parentless(nullptr, "solo");
    parentless.SetLevel(DebugMessenger::DEBUG_NORMAL);

    root.Normal("a");
    childNamedRoot.Normal("b");
    childNamedRootUpper.Normal("c");
    child.Normal("d");
    unnamed.Normal("e");
    nearlyRoot.Normal("f");
    parentless.Normal("g");
    EXPECT_EQ(capture.text(),
              "DEBUG - a\n"
              "DEBUG - b\n"
              "DEBUG - c\n"
              "DEBUG[utilities] - d\n"
              "DEBUG[] - e\n"
              "DEBUG[roots] - f\n"
              "DEBUG[solo] - g\n");
    capture.clear();
    parentless.SetLevel(DebugMessenger::DEBUG_OFF);
    root.SetLevel(DebugMessenger::DEBUG_OFF);
}

TEST_F(DebugMessengerTest, TextIsWrittenVerbatimWithExactlyOneFinalLineFeed) {
    DebugMessenger root;
    root.SetLevel(DebugMessenger::DEBUG_NORMAL);
    DebugMessenger percent(&root, "%s%n");

    root.Normal("%s%d%n %% %x");
    root.Normal("one\n");
    root.Normal("two\n\n");
    root.Normal("");
    root.Normal("inner\nbreak");
    percent.Normal("x");
    root.Normal(Port::StringBase<char>("nul\0byte", 8));
    static const char expected[] =
        "DEBUG - %s%d%n %% %x\n"
        "DEBUG - one\n"
        "DEBUG - two\n\n"
        "DEBUG - \n"
        "DEBUG - inner\nbreak\n"
        "DEBUG[%s%n] - x\n"
        "DEBUG - nul\0byte\n";
    EXPECT_EQ(capture.text(), std::string(expected, sizeof(expected) - 1));
    capture.clear();
    root.SetLevel(DebugMessenger::DEBUG_OFF);
}

TEST_F(DebugMessengerTest, MessageLevelsOffAndInheritPassAtEveryLevel) {
    DebugMessenger root;
    DebugMessenger child(&root, "c");
    for (auto level :
         {DebugMessenger::DEBUG_OFF, DebugMessenger::DEBUG_NORMAL, DebugMessenger::DEBUG_VERBOSE}) {
        root.SetLevel(level);
        child.Message(DebugMessenger::DEBUG_OFF, "off");
        child.Message(DebugMessenger::DEBUG_INHERIT, "inherit");
    }
    EXPECT_EQ(capture.text(),
              "DEBUG[c] - off\nDEBUG[c] - inherit\n"
              "DEBUG[c] - off\nDEBUG[c] - inherit\n"
              "DEBUG[c] - off\nDEBUG[c] - inherit\n");
    capture.clear();

    // Message with an ordinary level is the same test as the named writers.
    root.SetLevel(DebugMessenger::DEBUG_DETAILED);
    child.Message(DebugMessenger::DEBUG_DETAILED, "detailed");
    child.Message(DebugMessenger::DEBUG_VERBOSE, "verbose");
    EXPECT_EQ(capture.text(), "DEBUG[c] - detailed\n");
    capture.clear();
    root.SetLevel(DebugMessenger::DEBUG_OFF);
}

TEST_F(DebugMessengerTest, TimerNeverSetCountsFromConstructionAndStaysSet) {
    DebugMessenger logger;
    Pause(30);
    const auto before = Millis(logger.GetTimer());
    const auto named = Millis(logger.GetTimer("never set"));
    const auto after = Millis(logger.GetTimer());
    EXPECT_GE(before, 30);
    EXPECT_LE(before, named);
    EXPECT_LE(named, after);

    // The first reading set the name to the construction, not to "now".
    EXPECT_GE(Millis(logger.GetTimer("never set")), 30);
}

TEST_F(DebugMessengerTest, SetTimerRestartsAndStopTimerForgets) {
    DebugMessenger logger;
    logger.SetTimer("step");
    Pause(40);
    EXPECT_GE(Millis(logger.GetTimer("step")), 40);

    // A second SetTimer restarts the timer: it now reads no more than the time since.
    const auto beforeRestart = Millis(logger.GetTimer());
    logger.SetTimer("step");
    const auto sinceRestart = Millis(logger.GetTimer("step"));
    const auto afterRestart = Millis(logger.GetTimer());
    EXPECT_LE(sinceRestart, afterRestart - beforeRestart + 1);

    // Timers are independent of each other.
    logger.SetTimer("other");
    logger.StopTimer("never set");
    logger.StopTimer("step");
    EXPECT_LT(Millis(logger.GetTimer("other")), 40);

    // A stopped timer counts from the construction again.
    const auto total = Millis(logger.GetTimer());
    EXPECT_GE(Millis(logger.GetTimer("step")), total);

    // Names are exact: another case is another timer.
    logger.SetTimer("Case");
    EXPECT_GE(Millis(logger.GetTimer("case")), total);
    EXPECT_EQ(capture.text(), "");
}

TEST_F(DebugMessengerTest, DestructionWritesOneTotalTimeLineUnlessOff) {
    DebugMessenger root;
    { DebugMessenger silent(&root, "silent"); }
    { DebugMessenger ownRoot; }
    EXPECT_EQ(capture.text(), "");

    root.SetLevel(DebugMessenger::DEBUG_NORMAL);
    {
        DebugMessenger child(&root, "child");
        Pause(20);
    }
    {
        DebugMessenger ownRoot;
        ownRoot.SetLevel(DebugMessenger::DEBUG_VERBOSE);
    }
    const std::string text = capture.text();
    std::smatch parts;
    ASSERT_TRUE(std::regex_match(text, parts,
                                 std::regex("DEBUG\\[child\\] - Total debug time: (\\S+)\n"
                                            "DEBUG - Total debug time: \\S+\n")))
        << text;
    EXPECT_GE(Millis(parts[1].str()), 20);
    capture.clear();

    // A child that has its own level off stays silent under a root that writes.
    {
        DebugMessenger child(&root, "child");
        child.SetLevel(DebugMessenger::DEBUG_OFF);
    }
    EXPECT_EQ(capture.text(), "");
    root.SetLevel(DebugMessenger::DEBUG_OFF);
}

}  // namespace

// The process-wide registry of shared loggers: identity of what it hands out, the root's
// names, the list of named loggers and growth. Registry state outlives each test, so each one
// uses names of its own and resets the levels.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include "TestSupport.h"
#include "Tesu_DebugMessenger.h"

namespace {

using Tesu::DebugMessenger;
using Tesu::DebugMessengerFactory;
using Names = std::vector<Port::StringBase<char>>;

std::unique_ptr<Names> ActiveLoggers() {
    return std::unique_ptr<Names>(DebugMessengerFactory::GetActiveLoggers());
}

bool Contains(const Names& names, const std::string& name) {
    return std::find(names.begin(), names.end(), Port::StringBase<char>(name)) != names.end();
}

// A name no earlier test (or repetition of one) has requested.
std::string FreshName(const std::string& base) {
    static int serial = 0;
    return base + "#" + std::to_string(++serial);
}

class RegistryTest : public ::testing::Test {
  protected:
    tesutest::LoggerLevelsReset levels;
    tesutest::MessageCapture capture;
};

TEST_F(RegistryTest, RootIsOneLoggerUnderAnyCaseOfItsName) {
    DebugMessenger* root = DebugMessengerFactory::GetLogger();
    ASSERT_NE(root, nullptr);
    EXPECT_EQ(DebugMessengerFactory::GetLogger("root"), root);
    EXPECT_EQ(DebugMessengerFactory::GetLogger("Root"), root);
    EXPECT_EQ(DebugMessengerFactory::GetLogger("ROOT"), root);
    EXPECT_TRUE(root->IsOff());

    const auto names = ActiveLoggers();
    for (const char* variant : {"root", "Root", "ROOT"}) {
        EXPECT_FALSE(Contains(*names, variant)) << variant;
    }

    // Near misses are ordinary names.
    DebugMessenger* roots = DebugMessengerFactory::GetLogger("roots");
    DebugMessenger* spaced = DebugMessengerFactory::GetLogger("root ");
    EXPECT_NE(roots, root);
    EXPECT_NE(spaced, root);
    EXPECT_NE(roots, spaced);

    root->SetLevel(DebugMessenger::DEBUG_NORMAL);
    root->Normal("r");
    roots->Normal("s");
    EXPECT_EQ(capture.text(), "DEBUG - r\nDEBUG[roots] - s\n");
}

TEST_F(RegistryTest, NamedLoggersAreSharedChildrenOfTheRoot) {
    DebugMessenger* first = DebugMessengerFactory::GetLogger("utilities");
    DebugMessenger* again = DebugMessengerFactory::GetLogger(Port::StringBase<char>("utilities"));
    ASSERT_NE(first, nullptr);
    EXPECT_EQ(first, again);
    EXPECT_NE(first, DebugMessengerFactory::GetLogger());

    // Inheriting from the root, off until the host sets a level.
    EXPECT_TRUE(first->IsOff());
    DebugMessengerFactory::GetLogger()->SetLevel(DebugMessenger::DEBUG_VERBOSE);
    EXPECT_TRUE(first->IsVerbose());
    DebugMessengerFactory::GetLogger()->SetLevel(DebugMessenger::DEBUG_OFF);

    // A level of its own affects that name alone.
    DebugMessenger* javavm = DebugMessengerFactory::GetLogger("javavm");
    javavm->SetLevel(DebugMessenger::DEBUG_NORMAL);
    DebugMessengerFactory::GetLogger()->Normal("root");
    first->Normal("utilities");
    javavm->Normal("java text");
    javavm->Detailed("too detailed");
    EXPECT_EQ(capture.text(), "DEBUG[javavm] - java text\n");
}

TEST_F(RegistryTest, NamesAreExactKeys) {
    DebugMessenger* lower = DebugMessengerFactory::GetLogger("registry.case");
    DebugMessenger* upper = DebugMessengerFactory::GetLogger("Registry.Case");
    DebugMessenger* padded = DebugMessengerFactory::GetLogger("registry.case ");
    DebugMessenger* nul =
        DebugMessengerFactory::GetLogger(Port::StringBase<char>("registry\0case", 13));
    DebugMessenger* empty = DebugMessengerFactory::GetLogger("");
    const std::vector<DebugMessenger*> all{lower, upper, padded, nul, empty};
    for (size_t i = 0; i < all.size(); ++i) {
        for (size_t j = i + 1; j < all.size(); ++j) {
            EXPECT_NE(all[i], all[j]) << i << " " << j;
        }
    }
    EXPECT_EQ(DebugMessengerFactory::GetLogger("Registry.Case"), upper);
    EXPECT_EQ(DebugMessengerFactory::GetLogger(""), empty);

    // Each writes under the name it was first requested with; dots, brackets and percent
    // signs are just characters of a name.
    DebugMessenger* odd = DebugMessengerFactory::GetLogger("a.b/[c]%d");
    DebugMessengerFactory::GetLogger()->SetLevel(DebugMessenger::DEBUG_NORMAL);
    upper->Normal("u");
    empty->Normal("e");
    odd->Normal("o");
    EXPECT_EQ(capture.text(), "DEBUG[Registry.Case] - u\nDEBUG[] - e\nDEBUG[a.b/[c]%d] - o\n");
}

TEST_F(RegistryTest, ActiveLoggersListsEachNameOnceInANewVector) {
    const std::string one = FreshName("list.one");
    const std::string two = FreshName("list.two");
    const std::string three = FreshName("list.three");
    DebugMessengerFactory::GetLogger(one);
    DebugMessengerFactory::GetLogger(two);
    DebugMessengerFactory::GetLogger(one);

    const auto first = ActiveLoggers();
    EXPECT_TRUE(Contains(*first, one));
    EXPECT_TRUE(Contains(*first, two));
    EXPECT_FALSE(Contains(*first, "root"));
    auto sorted = *first;
    std::sort(sorted.begin(), sorted.end());
    EXPECT_EQ(std::adjacent_find(sorted.begin(), sorted.end()), sorted.end());

    // A second call is a separate vector; a vector already returned does not change.
    const auto second = ActiveLoggers();
    EXPECT_NE(first.get(), second.get());
    EXPECT_EQ(*first, *second);
    DebugMessengerFactory::GetLogger(three);
    const auto third = ActiveLoggers();
    EXPECT_FALSE(Contains(*first, three));
    EXPECT_TRUE(Contains(*third, three));
    EXPECT_EQ(third->size(), first->size() + 1);
}

TEST_F(RegistryTest, PointersSurviveTheTableGrowing) {
    const size_t before = ActiveLoggers()->size();
    std::vector<std::string> names;
    std::vector<DebugMessenger*> loggers;
    for (int i = 0; i < 600; ++i) {
        names.push_back(FreshName("grow"));
        loggers.push_back(DebugMessengerFactory::GetLogger(names.back()));
    }
    EXPECT_EQ(ActiveLoggers()->size(), before + names.size());
    auto distinct = loggers;
    std::sort(distinct.begin(), distinct.end());
    EXPECT_EQ(std::adjacent_find(distinct.begin(), distinct.end()), distinct.end());

    // Every earlier pointer is still the logger of its name, and still a working logger.
    DebugMessengerFactory::GetLogger()->SetLevel(DebugMessenger::DEBUG_NORMAL);
    std::string expected;
    for (size_t i = 0; i < names.size(); ++i) {
        ASSERT_EQ(DebugMessengerFactory::GetLogger(names[i]), loggers[i]) << names[i];
        loggers[i]->Normal("x");
        expected += "DEBUG[" + names[i] + "] - x\n";
    }
    EXPECT_EQ(capture.text(), expected);
}

}  // namespace

namespace {

// The Java bridge asks for "javavm" on whatever thread calls it: first requests of the same
// names on several threads at once must agree on one logger per name, and lose none.
TEST_F(RegistryTest, FirstRequestsOnSeveralThreadsAgree) {
    constexpr int kThreads = 4;
    constexpr int kNames = 2000;
    std::vector<std::string> names;
    for (int i = 0; i < kNames; ++i) {
        names.push_back(FreshName("threaded"));
    }
    std::vector<std::vector<DebugMessenger*>> seen(kThreads);
    std::vector<std::thread> threads;
    std::atomic<int> ready{0};
    for (int t = 0; t < kThreads; ++t) {
        threads.emplace_back([&, t] {
            // Start together, so that first requests of a name really overlap.
            ready.fetch_add(1);
            while (ready.load() < kThreads) {
            }
            for (const std::string& name : names) {
                seen[t].push_back(DebugMessengerFactory::GetLogger(Port::StringBase<char>(name)));
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    const std::unique_ptr<Names> active = ActiveLoggers();
    for (int i = 0; i < kNames; ++i) {
        for (int t = 1; t < kThreads; ++t) {
            EXPECT_EQ(seen[0][i], seen[t][i]) << names[i];
        }
        EXPECT_EQ(seen[0][i], DebugMessengerFactory::GetLogger(Port::StringBase<char>(names[i])));
        EXPECT_EQ(1, std::count(active->begin(), active->end(), Port::StringBase<char>(names[i])));
    }
}

}  // namespace

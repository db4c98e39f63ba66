// Init objects: their counts and the recorder.
#include <gtest/gtest.h>

#include <optional>
#include <string>
#include <thread>
#include <vector>

#include "Port_Init.h"
#include "Port_Msg.h"

namespace {

// The record as "owner|what|+" / "owner|what|-" lines.
std::vector<std::string> recorded() {
    std::vector<std::string> lines;
    for (const Port::InitEvent& event : Port::InitRecorder::Events()) {
        lines.push_back(event.owner.str() + "|" + event.what.str() + "|" +
                        (event.constructed ? "+" : "-"));
    }
    return lines;
}

class NullMan : public Port_MsgMan {
  protected:
    void write(const Port_Msg&) override {}
};

bool isRegistered(Port_MsgMan* manager) {
    Port_MsgManList list = Port_MsgDispatcher::getAllMsgMans();
    for (Port_MsgManListIterator it = list.begin(); it != list.end(); it++) {
        if (*it == manager) {
            return true;
        }
    }
    return false;
}

TEST(InitObjects, CountUpAndDownPerKind) {
    const int files = Port::FileInit::liveCount();
    const int paths = Port::PathListInit::liveCount();
    const int messages = Port_MsgManInit::liveCount();
    {
        Port::FileInit first("a");
        Port::FileInit second;
        Port_MsgManInit third("a");
        EXPECT_EQ(Port::FileInit::liveCount(), files + 2);
        EXPECT_EQ(Port::PathListInit::liveCount(), paths);
        EXPECT_EQ(Port_MsgManInit::liveCount(), messages + 1);
    }
    EXPECT_EQ(Port::FileInit::liveCount(), files);
    EXPECT_EQ(Port_MsgManInit::liveCount(), messages);
}

TEST(InitObjects, LastMessageSystemInitForgetsTheManagers) {
    NullMan manager;
    std::optional<Port_MsgManInit> outer(std::in_place, "test");
    ASSERT_TRUE(Port_MsgDispatcher::addMsgMan(&manager));
    { Port_MsgManInit inner("test"); }
    EXPECT_TRUE(isRegistered(&manager)) << "an init object that is not the last releases nothing";

    if (Port_MsgManInit::liveCount() == 1) {
        // No library in this process holds one: `outer` is the last.
        outer.reset();
        EXPECT_FALSE(isRegistered(&manager));
        // The dispatcher still works after a release.
        EXPECT_TRUE(Port_MsgDispatcher::addMsgMan(&manager));
    }
    EXPECT_TRUE(Port_MsgDispatcher::removeMsgMan(&manager));
}

TEST(InitRecorder, RecordsInitObjectsAndNotesInOrder) {
    Port::InitRecorder::Start();
    EXPECT_TRUE(Port::InitRecorder::IsRecording());
    {
        Port::FileInit file("modA");
        Port::PathListInit paths("modA");
        CitP::InstanceTableInit table("modA");
        CitP::FactoryInit factory("modA");
        Port_MsgManInit messages("modA");
        Port::InitRecorder::Note("modA", "rootLogger", true);
    }
    Port::InitRecorder::Note(nullptr, "unowned", false);
    Port::InitRecorder::Stop();
    EXPECT_FALSE(Port::InitRecorder::IsRecording());
    { Port::FileInit ignored("modB"); }
    Port::InitRecorder::Note("modB", "ignored", true);

    const std::vector<std::string> expected = {
        "modA|Port::FileInit|+",     "modA|Port::PathListInit|+", "modA|CitP::InstanceTableInit|+",
        "modA|CitP::FactoryInit|+",  "modA|Port_MsgManInit|+",    "modA|rootLogger|+",
        "modA|Port_MsgManInit|-",    "modA|CitP::FactoryInit|-",  "modA|CitP::InstanceTableInit|-",
        "modA|Port::PathListInit|-", "modA|Port::FileInit|-",     "|unowned|-",
    };
    EXPECT_EQ(recorded(), expected);
    EXPECT_EQ(recorded(), expected) << "reading the record leaves it as it was";

    Port::InitRecorder::Start();
    EXPECT_TRUE(recorded().empty()) << "Start clears the record";
    Port::InitRecorder::Stop();
}

TEST(InitRecorder, TakesEventsFromSeveralThreads) {
    Port::InitRecorder::Start();
    constexpr int kThreads = 4;
    constexpr int kEach = 200;
    std::vector<std::thread> threads;
    for (int t = 0; t < kThreads; ++t) {
        threads.emplace_back([] {
            for (int i = 0; i < kEach; ++i) {
                Port::FileInit file("thread");
                Port::InitRecorder::Note("thread", "note", true);
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    Port::InitRecorder::Stop();
    const std::vector<std::string> lines = recorded();
    ASSERT_EQ(lines.size(), static_cast<std::size_t>(kThreads * kEach * 3));
    int built = 0, destroyed = 0, notes = 0;
    for (const std::string& line : lines) {
        built += line == "thread|Port::FileInit|+";
        destroyed += line == "thread|Port::FileInit|-";
        notes += line == "thread|note|+";
    }
    EXPECT_EQ(built, kThreads * kEach);
    EXPECT_EQ(destroyed, kThreads * kEach);
    EXPECT_EQ(notes, kThreads * kEach);
}

}  // namespace

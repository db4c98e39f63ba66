#include "Tesu_MsgMan.h"

#include <gtest/gtest.h>

#include <iostream>
#include <memory>
#include <sstream>
#include <stdexcept>
#include <string>
#include <type_traits>
#include <vector>

#include "Port_File.h"
#include "Port_Msg.h"
#include "TestPlatform.h"
#include "TestSupport.h"

static_assert(!std::is_copy_constructible<Tesu::MsgMan>::value &&
                  !std::is_copy_assignable<Tesu::MsgMan>::value,
              "a MsgMan owns a registered message stream and must not be copied");
static_assert(std::is_convertible<Tesu::MsgMan::DiagnosticLevel, Tesu::MsgMan>::value,
              "a level makes a manager: Tesu::MsgMan manager = Tesu::MsgMan::DIAG_FULL;");

namespace {

// Sends std::cerr into a string for the guard's lifetime.
class CerrCapture {
  public:
    CerrCapture() : saved_(std::cerr.rdbuf(buffer_.rdbuf())) {}
    ~CerrCapture() { std::cerr.rdbuf(saved_); }
    std::string text() const { return buffer_.str(); }

  private:
    std::ostringstream buffer_;
    std::streambuf* saved_;
};

const int kTypes[] = {0, 1, 2, 4, 7, 8, 3};

void issue(int type, const std::string& text) {
    Port_MsgManData::createObject("tesutil", "msgman_test", __LINE__, "rev")
        .issue(type, text.data(), text.size());
}

// What a message stream writes for the message "type <n>".
std::string written(int type) {
    const std::string text = "type " + std::to_string(type) + "\n";
    switch (type) {
        case 0:
            return "ERROR:tesutil - " + text;
        case 1:
            return "WARNING:tesutil - " + text;
        case 4:
            return "FATAL:tesutil - " + text;
        default:
            return text;
    }
}

std::string issueEveryType() {
    std::string all;
    for (int type : kTypes) {
        issue(type, "type " + std::to_string(type));
        all += written(type);
    }
    return all;
}

enum Failing { NEVER, ON_DEACTIVATE, ON_ACTIVATE };

// A manager of our own that logs its activate/deactivate calls (with the number of managers
// registered at that moment) and the messages it writes into a shared event list. It may be
// made to throw from one of the two calls, as a host's own manager might.
class RecordingManager : public Port_MsgMan {
  public:
    RecordingManager(std::string name, std::vector<std::string>& events, Failing failing = NEVER)
        : name_(std::move(name)), events_(events), failing_(failing) {
        Port_MsgDispatcher::addMsgMan(this);
    }
    ~RecordingManager() override { Port_MsgDispatcher::removeMsgMan(this); }
    bool activate() override {
        note("activate");
        if (failing_ == ON_ACTIVATE) {
            throw std::runtime_error("activate failed");
        }
        return Port_MsgMan::activate();
    }
    bool deactivate() override {
        note("deactivate");
        if (failing_ == ON_DEACTIVATE) {
            throw std::runtime_error("deactivate failed");
        }
        return Port_MsgMan::deactivate();
    }
    std::string received;

  protected:
    void write(const Port_Msg& message) override { received.append(message.text, message.length); }

  private:
    void note(const char* what) {
        events_.push_back(name_ + "." + what + "@" +
                          std::to_string(Port_MsgDispatcher::getAllMsgMans().size()));
    }
    std::string name_;
    std::vector<std::string>& events_;
    Failing failing_;
};

}  // namespace

TEST(MsgMan, LevelsSetTheSwitchesOfStandardErrorOnly) {
    const std::string standard =
        written(0) + written(1) + written(4) + written(7) + written(8) + written(3);
    struct Case {
        int level;
        std::string toCerr;
    } cases[] = {
        {0, written(8) + written(3)},
        {1, written(0) + written(1) + written(4) + written(8) + written(3)},
        {2, standard},
        {3,
         written(0) + written(1) + written(2) + written(4) + written(7) + written(8) + written(3)},
        {5, standard},
        {-1, standard},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE("level " + std::to_string(c.level));
        CerrCapture cerr;
        std::ostringstream added;
        Tesu::MsgMan manager(static_cast<Tesu::MsgMan::DiagnosticLevel>(c.level));
        manager.addMsgStream(added);
        const std::string all = issueEveryType();
        EXPECT_EQ(cerr.text(), c.toCerr);
        EXPECT_EQ(added.str(), all);  // an added stream gets everything whatever the level
        manager.removeMsgStream(added);
    }
    CerrCapture cerr;
    Tesu::MsgMan byDefault;
    issueEveryType();
    EXPECT_EQ(cerr.text(), standard);
}

TEST(MsgMan, RemovedStreamsGetNothingMore) {
    CerrCapture cerr;
    std::ostringstream added;
    Tesu::MsgMan manager;
    manager.addMsgStream(added);
    issue(7, "both");
    manager.removeMsgStream(std::cerr);
    issue(7, "added only");
    manager.removeMsgStream(added);
    issue(7, "nobody");
    EXPECT_EQ(cerr.text(), "both\n");
    EXPECT_EQ(added.str(), "both\nadded only\n");
}

TEST(MsgMan, PortStreamsAreForwarded) {
    tesutest::TempDir dir;
    const std::string path = dir.join("messages.txt");
    Port::Stream* file = Port::File::open(path.c_str(), Port::File::WRITE, true);
    ASSERT_NE(file, nullptr);
    {
        CerrCapture cerr;
        Tesu::MsgMan manager(Tesu::MsgMan::DIAG_SILENT);
        manager.addMsgStream(*file);
        issue(1, "to the file");
        manager.removeMsgStream(*file);
        issue(1, "not to the file");
    }
    ASSERT_TRUE(Port::File::close(file));
    Port::Stream* in = Port::File::open(path.c_str(), Port::File::READ, true);
    ASSERT_NE(in, nullptr);
    Port::StringBase<char> line;
    EXPECT_EQ(in->readline(line), 29);
    EXPECT_EQ(line.str(), "WARNING:tesutil - to the file");
    EXPECT_EQ(in->readline(line), -1);
    Port::File::close(in);
}

TEST(MsgMan, NewManagerDeactivatesOthersAndIsRegisteredLast) {
    std::vector<std::string> events;
    CerrCapture cerr;
    RecordingManager a("A", events);
    std::ostringstream first, second;
    auto m1 = std::make_unique<Tesu::MsgMan>(Tesu::MsgMan::DIAG_SILENT);
    m1->addMsgStream(first);
    RecordingManager b("B", events);  // registered after m1; m1 never deactivates it
    EXPECT_EQ(events, (std::vector<std::string>{"A.deactivate@1"}));

    events.clear();
    auto m2 = std::make_unique<Tesu::MsgMan>(Tesu::MsgMan::DIAG_SILENT);
    m2->addMsgStream(second);
    // A, m1's stream and B were deactivated before m2's stream joined the list.
    EXPECT_EQ(events, (std::vector<std::string>{"A.deactivate@3", "B.deactivate@3"}));
    EXPECT_EQ(Port_MsgDispatcher::getAllMsgMans().size(), 4u);
    issue(7, "while m2");
    EXPECT_EQ(first.str(), "");
    EXPECT_EQ(second.str(), "while m2\n");
    EXPECT_EQ(a.received + b.received, "");

    events.clear();
    m2->removeMsgStream(second);
    m2.reset();
    // Unregistered first, then everyone left is activated, in the dispatcher's order.
    EXPECT_EQ(events, (std::vector<std::string>{"A.activate@3", "B.activate@3"}));
    issue(7, "after m2");
    EXPECT_EQ(first.str(), "after m2\n");
    EXPECT_EQ(a.received, "after m2");

    events.clear();
    m1->removeMsgStream(first);
    m1.reset();
    EXPECT_EQ(events, (std::vector<std::string>{"A.activate@2", "B.activate@2"}));
}

TEST(MsgMan, ThreeManagersAtOnceAndActivationOfAllOnDestruction) {
    CerrCapture cerr;
    std::ostringstream s1, s2, s3;
    Tesu::MsgMan m1(Tesu::MsgMan::DIAG_SILENT);
    m1.addMsgStream(s1);
    Tesu::MsgMan m2(Tesu::MsgMan::DIAG_SILENT);
    m2.addMsgStream(s2);
    {
        Tesu::MsgMan m3(Tesu::MsgMan::DIAG_SILENT);
        m3.addMsgStream(s3);
        issue(0, "newest only");
        m3.removeMsgStream(s3);
    }
    // Destroying the newest activates both older ones, not only the one made just before it.
    issue(0, "both older");
    EXPECT_EQ(s1.str(), "ERROR:tesutil - both older\n");
    EXPECT_EQ(s2.str(), "ERROR:tesutil - both older\n");
    EXPECT_EQ(s3.str(), "ERROR:tesutil - newest only\n");
    m1.removeMsgStream(s1);
    m2.removeMsgStream(s2);
}

// G is already silenced by an older MsgMan; a failed construction must give back only what it
// took: the older MsgMan's stream and X are active again, G stays silent while m1 lives.
TEST(MsgMan, FailedConstructionRestoresOnlyWhatItDeactivatedAndRegistersNothing) {
    std::vector<std::string> events;
    CerrCapture cerr;
    RecordingManager good("G", events);
    std::ostringstream older;
    Tesu::MsgMan m1(Tesu::MsgMan::DIAG_SILENT);
    m1.addMsgStream(older);
    RecordingManager bad("X", events, ON_DEACTIVATE);
    events.clear();
    EXPECT_THROW(Tesu::MsgMan{}, std::runtime_error);
    EXPECT_EQ(events,
              (std::vector<std::string>{"G.deactivate@3", "X.deactivate@3", "X.activate@3"}));
    EXPECT_EQ(Port_MsgDispatcher::getAllMsgMans().size(), 3u);
    issue(7, "still heard");
    EXPECT_EQ(older.str(), "still heard\n");
    EXPECT_EQ(bad.received, "still heard");
    EXPECT_EQ(good.received, "");
    m1.removeMsgStream(older);
}

// A manager whose activate throws must neither end the process nor keep the managers after it
// silent; the departing MsgMan is unregistered all the same.
TEST(MsgMan, DestructionActivatesTheRestWhenOneActivateThrows) {
    std::vector<std::string> events;
    CerrCapture cerr;
    RecordingManager failing("F", events, ON_ACTIVATE);
    RecordingManager good("G", events);
    {
        Tesu::MsgMan manager(Tesu::MsgMan::DIAG_SILENT);
        events.clear();
    }
    EXPECT_EQ(events, (std::vector<std::string>{"F.activate@2", "G.activate@2"}));
    EXPECT_EQ(Port_MsgDispatcher::getAllMsgMans().size(), 2u);
    issue(7, "heard again");
    EXPECT_EQ(good.received, "heard again");
}

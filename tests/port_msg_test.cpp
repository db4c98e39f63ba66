// The message system as its users see it: texts written per type, switches, registration,
// activation, printf-style and verbatim issuing, and delivery from several threads.
#include <gtest/gtest.h>

#include <cstdio>
#include <fstream>
#include <iterator>
#include <map>
#include <sstream>
#include <streambuf>
#include <string>
#include <thread>
#include <vector>

#include "Port_File.h"
#include "Port_Msg.h"
#include "TestSupport.h"

namespace {

Port_MsgManData source() {
    return Port_MsgManData::createObject("tesutil", "../tests/port_msg_test", 1, "$Revision$");
}

// A Port_MsgStream registered with the dispatcher for the lifetime of the object, writing to
// its own string stream.
struct CapturedStream {
    Port_MsgStream manager{"capture"};
    std::ostringstream out;
    CapturedStream() {
        manager.addMsgStream(out);
        Port_MsgDispatcher::addMsgMan(&manager);
    }
    ~CapturedStream() {
        Port_MsgDispatcher::removeMsgMan(&manager);
        manager.removeMsgStream(out);
    }
};

// Keeps every chunk handed to it in one call, so that split writes show.
class ChunkBuffer : public std::streambuf {
  public:
    std::vector<std::string> chunks;
    int syncs = 0;

  protected:
    std::streamsize xsputn(const char* s, std::streamsize n) override {
        chunks.emplace_back(s, static_cast<std::size_t>(n));
        return n;
    }
    int overflow(int c) override {
        chunks.emplace_back(1, static_cast<char>(c));
        return c;
    }
    int sync() override {
        ++syncs;
        return 0;
    }
};

// A manager that logs what it receives, tagged with its name, into a shared list.
class RecordingMan : public Port_MsgMan {
  public:
    RecordingMan(std::string name, std::vector<std::string>& log)
        : name_(std::move(name)), log_(log) {}
    ~RecordingMan() override { Port_MsgDispatcher::removeMsgMan(this); }

  protected:
    void write(const Port_Msg& message) override {
        log_.push_back(name_ + ":" + std::string(message.text, message.length));
    }

  private:
    std::string name_;
    std::vector<std::string>& log_;
};

TEST(PortMsgStream, WritesEachTypeWithItsText) {
    CapturedStream capture;
    const Port_MsgManData src = source();
    src.issueError("Cannot open %s\n", "a.txt");
    src.issueWarning("%d left", 3);
    src.issueFatal("stop");
    src.issueStatus("DEBUG - line\n");
    src.issueInfo("info");
    src.issueDetail("detail\n\n");
    src.issue(1000, "other code", 10);
    src.issueStatus(Port::StringBase<char>(""));
    EXPECT_EQ(capture.out.str(),
              "ERROR:tesutil - Cannot open a.txt\n"
              "WARNING:tesutil - 3 left\n"
              "FATAL:tesutil - stop\n"
              "DEBUG - line\n"
              "info\n"
              "detail\n\n"
              "other code\n"
              "\n");

    // A source without an application still gives a well-formed line.
    capture.out.str("");
    Port_MsgManData::createObject(nullptr, nullptr, 0, nullptr).issueError("x");
    EXPECT_EQ(capture.out.str(), "ERROR: - x\n");
}

TEST(PortMsgStream, WritesEachMessageInOneWriteThenFlushes) {
    ChunkBuffer buffer;
    std::ostream out(&buffer);
    Port_MsgStream manager(nullptr);
    EXPECT_EQ(manager.name(), Port::StringBase<char>(""));
    manager.addMsgStream(out);
    Port_MsgDispatcher::addMsgMan(&manager);
    source().issueError("Cannot open %s", "b.txt");
    source().issueStatus(Port::StringBase<char>("done\n"));
    Port_MsgDispatcher::removeMsgMan(&manager);
    EXPECT_EQ(buffer.chunks,
              (std::vector<std::string>{"ERROR:tesutil - Cannot open b.txt\n", "done\n"}));
    EXPECT_EQ(buffer.syncs, 2);
}

TEST(PortMsgStream, SwitchesArePerStreamAndType) {
    CapturedStream capture;
    std::ostringstream second;
    capture.manager.addMsgStream(second);
    capture.manager.disableMsgType(capture.out, PORT_MSG_STATUS);
    capture.manager.disableMsgType(second, 1000);
    capture.manager.disableMsgType(second, -7);
    EXPECT_FALSE(capture.manager.isMsgTypeEnabled(capture.out, PORT_MSG_STATUS));
    EXPECT_TRUE(capture.manager.isMsgTypeEnabled(second, PORT_MSG_STATUS));
    EXPECT_TRUE(capture.manager.isMsgTypeEnabled(second, 63));
    EXPECT_TRUE(capture.manager.isMsgTypeEnabled(second, 64));

    source().issueStatus("s");
    source().issue(1000, "t", 1);
    source().issue(-7, "u", 1);
    source().issue(64, "v", 1);
    EXPECT_EQ(capture.out.str(), "t\nu\nv\n");
    EXPECT_EQ(second.str(), "s\nv\n");

    capture.manager.enableMsgType(capture.out, PORT_MSG_STATUS);
    capture.manager.enableMsgType(second, 1000);
    source().issueStatus("s2");
    source().issue(1000, "t2", 2);
    EXPECT_EQ(capture.out.str(), "t\nu\nv\ns2\nt2\n");
    EXPECT_EQ(second.str(), "s\nv\ns2\nt2\n");

    // Adding a stream again keeps its switches and does not double its output; switches of a
    // stream outside the set are ignored, and it reads as switched off.
    capture.manager.disableMsgType(second, PORT_MSG_ERROR);
    capture.manager.addMsgStream(second);
    std::ostringstream stranger;
    capture.manager.enableMsgType(stranger, PORT_MSG_ERROR);
    EXPECT_FALSE(capture.manager.isMsgTypeEnabled(stranger, PORT_MSG_ERROR));
    source().issueError("e");
    source().issueWarning("w");
    EXPECT_EQ(second.str(), "s\nv\ns2\nt2\nWARNING:tesutil - w\n");

    capture.manager.removeMsgStream(second);
    capture.manager.removeMsgStream(stranger);
    source().issueStatus("after");
    EXPECT_EQ(second.str(), "s\nv\ns2\nt2\nWARNING:tesutil - w\n");
    EXPECT_FALSE(capture.manager.isMsgTypeEnabled(second, PORT_MSG_STATUS));
    EXPECT_EQ(capture.out.str(),
              "t\nu\nv\ns2\nt2\nERROR:tesutil - e\nWARNING:tesutil - w\nafter\n");
}

TEST(PortMsgDispatcher, RegistrationOrderAndSnapshots) {
    std::vector<std::string> log;
    RecordingMan a("a", log), b("b", log), c("c", log);
    EXPECT_FALSE(Port_MsgDispatcher::addMsgMan(nullptr));
    EXPECT_TRUE(Port_MsgDispatcher::addMsgMan(&a));
    EXPECT_TRUE(Port_MsgDispatcher::addMsgMan(&b));
    EXPECT_TRUE(Port_MsgDispatcher::addMsgMan(&c));
    EXPECT_FALSE(Port_MsgDispatcher::addMsgMan(&b));

    Port_MsgManList snapshot = Port_MsgDispatcher::getAllMsgMans();
    std::vector<Port_MsgMan*> seen;
    for (Port_MsgManListIterator it = snapshot.begin(); it != snapshot.end(); it++) {
        seen.push_back(*it);
    }
    EXPECT_EQ(seen, (std::vector<Port_MsgMan*>{&a, &b, &c}));

    source().issueStatus("one");
    EXPECT_TRUE(Port_MsgDispatcher::removeMsgMan(&b));
    EXPECT_FALSE(Port_MsgDispatcher::removeMsgMan(&b));
    EXPECT_TRUE(Port_MsgDispatcher::addMsgMan(&b));
    source().issueStatus("two");
    EXPECT_EQ(log,
              (std::vector<std::string>{"a:one", "b:one", "c:one", "a:two", "c:two", "b:two"}));
    // A snapshot is not affected by later changes.
    EXPECT_EQ(snapshot.size(), 3u);
    EXPECT_EQ(snapshot[1], &b);

    // A manager whose owner forgot to unregister it is let go when it is destroyed.
    {
        RecordingMan forgotten("f", log);
        Port_MsgDispatcher::addMsgMan(&forgotten);
    }
    Port_MsgManList after = Port_MsgDispatcher::getAllMsgMans();
    EXPECT_EQ(after.size(), 3u);
    source().issueStatus("three");
    EXPECT_EQ(log.back(), "b:three");
}

TEST(PortMsgMan, DeactivatedDropsAndActivatedResumes) {
    CapturedStream capture;
    EXPECT_TRUE(capture.manager.isActive());
    EXPECT_FALSE(capture.manager.activate());
    EXPECT_TRUE(capture.manager.deactivate());
    EXPECT_FALSE(capture.manager.deactivate());
    source().issueError("dropped");
    EXPECT_TRUE(capture.manager.activate());
    source().issueError("kept");
    EXPECT_EQ(capture.out.str(), "ERROR:tesutil - kept\n");
}

TEST(PortMsgManData, PrintfStyleAndVerbatimForms) {
    CapturedStream capture;
    const Port_MsgManData src = source();
    src.issueStatus("%s=%d%%", "width", 42);
    src.issueStatus(Port::StringBase<char>("%s%d%n"));
    src.issueError(Port::StringBase<char>("100% sure"));
    src.issueWarning(Port::StringBase<char>("a\0b\n", 4));
    EXPECT_EQ(capture.out.str(),
              "width=42%\n%s%d%n\nERROR:tesutil - 100% sure\n"
              "WARNING:tesutil - " +
                  std::string("a\0b\n", 4));

    // Long texts, on both sides of the formatting buffer's size and far beyond it.
    for (std::size_t length : {1022u, 1023u, 1024u, 1025u, 100u * 1024u}) {
        capture.out.str("");
        const std::string text(length, 'x');
        src.issueStatus("%s", text.c_str());
        src.issueWarning(Port::StringBase<char>(text));
        EXPECT_EQ(capture.out.str(), text + "\nWARNING:tesutil - " + text + "\n") << length;
    }
}

// A manager that answers a "ping" with a message of its own while being written to.
class EchoMan : public Port_MsgMan {
  protected:
    void write(const Port_Msg& message) override {
        if (std::string(message.text, message.length) == "ping") {
            source().issueStatus("pong");
        }
    }
};

// A stream buffer that issues one message while the first chunk is being written to it.
class IssuingBuffer : public ChunkBuffer {
  protected:
    std::streamsize xsputn(const char* s, std::streamsize n) override {
        if (!issued_) {
            issued_ = true;
            source().issueError("inner");
        }
        return ChunkBuffer::xsputn(s, n);
    }

  private:
    bool issued_ = false;
};

TEST(PortMsgDispatcher, MessagesIssuedDuringAWriteArriveWhole) {
    CapturedStream capture;
    EchoMan echo;
    Port_MsgDispatcher::addMsgMan(&echo);
    source().issueStatus("ping");
    Port_MsgDispatcher::removeMsgMan(&echo);
    EXPECT_EQ(capture.out.str(), "ping\npong\n");

    IssuingBuffer buffer;
    std::ostream out(&buffer);
    capture.manager.addMsgStream(out);
    source().issueWarning("outer");
    capture.manager.removeMsgStream(out);
    EXPECT_EQ(buffer.chunks,
              (std::vector<std::string>{"ERROR:tesutil - inner\n", "WARNING:tesutil - outer\n"}));
}

// A stream buffer that takes a text one character at a time, yielding in between, so that
// writes from threads that are not kept apart would mix.
class SlowBuffer : public std::stringbuf {
  protected:
    std::streamsize xsputn(const char* s, std::streamsize n) override {
        for (std::streamsize i = 0; i < n; ++i) {
            sputc(s[i]);
            if (i % 16 == 0) {
                std::this_thread::yield();
            }
        }
        return n;
    }
};

TEST(PortMsgDispatcher, ThreadsIssuingAtOnceNeverMixTheirMessages) {
    SlowBuffer slowBuffer;
    std::ostream slow(&slowBuffer);
    CapturedStream first;
    first.manager.addMsgStream(slow);
    CapturedStream second;

    constexpr int kThreads = 6;
    constexpr int kMessages = 300;
    std::vector<std::thread> threads;
    for (int t = 0; t < kThreads; ++t) {
        threads.emplace_back([t] {
            const std::string padding(40 + t * 7, static_cast<char>('a' + t));
            for (int m = 0; m < kMessages; ++m) {
                source().issueWarning("thread %d message %d %s", t, m, padding.c_str());
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    first.manager.removeMsgStream(slow);

    for (const std::string& text : {first.out.str(), slowBuffer.str(), second.out.str()}) {
        std::istringstream lines(text);
        std::string line;
        std::vector<int> next(kThreads, 0);
        int count = 0;
        while (std::getline(lines, line)) {
            int t = -1, m = -1;
            char pad[512] = {};
            ASSERT_EQ(std::sscanf(line.c_str(), "WARNING:tesutil - thread %d message %d %511s", &t,
                                  &m, pad),
                      3)
                << line;
            ASSERT_TRUE(t >= 0 && t < kThreads) << line;
            EXPECT_EQ(line, "WARNING:tesutil - thread " + std::to_string(t) + " message " +
                                std::to_string(m) + " " +
                                std::string(40 + t * 7, static_cast<char>('a' + t)));
            EXPECT_EQ(m, next[t]++) << "messages of one thread arrive in order";
            ++count;
        }
        EXPECT_EQ(count, kThreads * kMessages);
    }
}

TEST(PortMsgStream, WritesToAPortStream) {
    tesutest::TempDir dir;
    const std::string path = dir.join("messages.log");
    Port::Stream* file = Port::File::open(path.c_str(), Port::File::WRITE, true);
    ASSERT_NE(file, nullptr);
    {
        Port_MsgStream manager("file");
        manager.addMsgStream(*file);
        manager.disableMsgType(*file, PORT_MSG_DETAIL);
        EXPECT_FALSE(manager.isMsgTypeEnabled(*file, PORT_MSG_DETAIL));
        Port_MsgDispatcher::addMsgMan(&manager);
        source().issueError("Cannot open %s\n", "c.txt");
        source().issueDetail("hidden");
        source().issueStatus(Port::StringBase<char>("50%\n"));
        manager.removeMsgStream(*file);
        source().issueStatus("after removal");
    }
    ASSERT_TRUE(Port::File::close(file));
    std::ifstream in(path, std::ios::binary);
    const std::string content((std::istreambuf_iterator<char>(in)),
                              std::istreambuf_iterator<char>());
    EXPECT_EQ(content, "ERROR:tesutil - Cannot open c.txt\n50%\n");
}

}  // namespace

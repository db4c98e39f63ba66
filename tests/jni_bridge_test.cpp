#include "Tesu_Tessel2MessageCatcher.h"

#include "Tesu_Jni.h"

#include <gtest/gtest.h>
#if defined(_WIN32)
#include <windows.h>
#endif

#include <stdexcept>
#include <string>
#include <vector>

#include "Port_Msg.h"
#include "TestSupport.h"
#include "Tesu_DebugMessenger.h"

namespace {

using Method = void(JNICALL*)(JNIEnv*, jobject, jstring);

#if defined(_WIN32) && defined(__i386__)
// The 32-bit DLL exports the methods under the names a 32-bit JVM looks up ("_name@12", and the
// plain name), which no import library links to: they are found the way the JVM finds them.
Method Exported(const char* name) {
    const HMODULE library = ::GetModuleHandleA("libTesu_Utilities.dll");
    return reinterpret_cast<Method>(reinterpret_cast<void*>(::GetProcAddress(library, name)));
}
const Method kInfo =
    Exported("_Java_com_quarnel_tesutil_tessel2_Tessel2MessageCatcher_outputInfoMessageN@12");
const Method kWarning =
    Exported("_Java_com_quarnel_tesutil_tessel2_Tessel2MessageCatcher_outputWarningMessageN@12");
const Method kError =
    Exported("_Java_com_quarnel_tesutil_tessel2_Tessel2MessageCatcher_outputErrorMessageN@12");
const Method kDebug =
    Exported("_Java_com_quarnel_tesutil_tessel2_Tessel2MessageCatcher_outputDebugMessageN@12");
#else
const Method kInfo = Java_com_quarnel_tesutil_tessel2_Tessel2MessageCatcher_outputInfoMessageN;
const Method kWarning =
    Java_com_quarnel_tesutil_tessel2_Tessel2MessageCatcher_outputWarningMessageN;
const Method kError = Java_com_quarnel_tesutil_tessel2_Tessel2MessageCatcher_outputErrorMessageN;
const Method kDebug = Java_com_quarnel_tesutil_tessel2_Tessel2MessageCatcher_outputDebugMessageN;
#endif

// A JNIEnv whose function table has only the two string calls, which lend `bytes` and log
// what they are given into `events`. Every other entry is null, so any other call crashes.
struct FakeEnv {
    JNIEnv env;  // first member: the JNIEnv* handed out points at the whole FakeEnv
    JNINativeInterface_ table{};
    std::vector<std::string>* events = nullptr;
    std::string bytes;
    bool failBorrow = false;
    bool copyFlagWasNull = false;
    const char* lent = nullptr;
    const char* released = nullptr;

    explicit FakeEnv(std::vector<std::string>& log) : events(&log) {
        table.GetStringUTFChars = &borrow;
        table.ReleaseStringUTFChars = &release;
        env.functions = &table;
    }
    static FakeEnv& of(JNIEnv* env) { return *reinterpret_cast<FakeEnv*>(env); }
    static const char* JNICALL borrow(JNIEnv* env, jstring, jboolean* isCopy) {
        FakeEnv& self = of(env);
        self.events->push_back("borrow");
        self.copyFlagWasNull = isCopy == nullptr;
        self.lent = self.failBorrow ? nullptr : self.bytes.c_str();
        return self.lent;
    }
    static void JNICALL release(JNIEnv* env, jstring, const char* chars) {
        of(env).events->push_back("release");
        of(env).released = chars;
    }
};

// Logs each message dispatched into the same event list, and keeps the last one.
class RecordingManager : public Port_MsgMan {
  public:
    explicit RecordingManager(std::vector<std::string>& log) : events_(log) {
        Port_MsgDispatcher::addMsgMan(this);
    }
    ~RecordingManager() override { Port_MsgDispatcher::removeMsgMan(this); }
    int type = -1;
    std::string application, source, revision, text;
    int line = 0;
    bool fail = false;

  protected:
    void write(const Port_Msg& m) override {
        events_.push_back("issue");
        if (fail) {
            throw std::runtime_error("write failed");
        }
        type = m.type;
        application = m.application;
        source = m.source;
        revision = m.revision;
        line = m.line;
        text.assign(m.text, m.length);
    }

  private:
    std::vector<std::string>& events_;
};

class JniBridge : public ::testing::Test {
  protected:
    std::vector<std::string> events;
    FakeEnv fake{events};
    _jstring javaString;
    tesutest::LoggerLevelsReset levels;
    tesutest::MessageCapture capture;
    RecordingManager recorder{events};

    void call(Method method, const std::string& text) {
        events.clear();
        capture.clear();
        fake.bytes = text;
        method(&fake.env, nullptr, &javaString);
    }
};

const std::vector<std::string> kBorrowIssueRelease = {"borrow", "issue", "release"};

}  // namespace

TEST_F(JniBridge, TextMethodsIssueTheBytesVerbatimBetweenBorrowAndRelease) {
    struct Case {
        Method method;
        int type;
        std::string prefix;
    } cases[] = {{kInfo, PORT_MSG_STATUS, ""},
                 {kWarning, PORT_MSG_WARNING, "WARNING:tesutil - "},
                 {kError, PORT_MSG_ERROR, "ERROR:tesutil - "}};
    // Plain, format-like, empty, and modified UTF-8 (an encoded NUL and a surrogate pair).
    const std::string texts[] = {"plain text", "%s%d%n %x%%", "",
                                 "Gr\xC3\xBC\xC3\x9F"
                                 "e \xC0\x80 \xED\xA0\xBD\xED\xB8\x80"};
    for (const Case& c : cases) {
        for (const std::string& text : texts) {
            SCOPED_TRACE(c.prefix + "|" + text);
            call(c.method, text);
            EXPECT_EQ(events, kBorrowIssueRelease);
            EXPECT_TRUE(fake.copyFlagWasNull);
            EXPECT_EQ(fake.released, fake.lent);
            EXPECT_EQ(recorder.type, c.type);
            EXPECT_EQ(recorder.text, text);
            EXPECT_EQ(recorder.application, "tesutil");
            EXPECT_EQ(recorder.source, "../s/Tesu_Tessel2MessageCatcher");
            EXPECT_EQ(recorder.revision, "$Revision: 1.10 $");
            EXPECT_GT(recorder.line, 0);
            EXPECT_EQ(capture.text(), c.prefix + text + "\n");
        }
    }
}

TEST_F(JniBridge, DebugTextsGoToTheJavavmLoggerAtNormalLevel) {
    Tesu::DebugMessenger* javavm = Tesu::DebugMessengerFactory::GetLogger("javavm");
    javavm->SetLevel(Tesu::DebugMessenger::DEBUG_NORMAL);
    for (const std::string& text : {std::string("hello %s%d%n"), std::string("")}) {
        call(kDebug, text);
        EXPECT_EQ(events, kBorrowIssueRelease);
        EXPECT_TRUE(fake.copyFlagWasNull);
        EXPECT_EQ(fake.released, fake.lent);
        EXPECT_EQ(recorder.type, PORT_MSG_STATUS);
        EXPECT_EQ(capture.text(), "DEBUG[javavm] - " + text + "\n");
    }

    // Off on "javavm" itself, or inherited from a root that is off: nothing is written.
    Tesu::DebugMessengerFactory::GetLogger()->SetLevel(Tesu::DebugMessenger::DEBUG_VERBOSE);
    javavm->SetLevel(Tesu::DebugMessenger::DEBUG_OFF);
    call(kDebug, "dropped");
    EXPECT_EQ(events, (std::vector<std::string>{"borrow", "release"}));
    tesutest::LoggerLevelsReset::resetAll();
    call(kDebug, "dropped");
    EXPECT_EQ(events, (std::vector<std::string>{"borrow", "release"}));
    EXPECT_EQ(capture.text(), "");

    // Inherited from the root at normal level.
    Tesu::DebugMessengerFactory::GetLogger()->SetLevel(Tesu::DebugMessenger::DEBUG_NORMAL);
    call(kDebug, "inherited");
    EXPECT_EQ(capture.text(), "DEBUG[javavm] - inherited\n");
}

TEST_F(JniBridge, NullStringsAndFailedBorrowsTouchNothing) {
    Tesu::DebugMessengerFactory::GetLogger()->SetLevel(Tesu::DebugMessenger::DEBUG_VERBOSE);
    for (Method method : {kInfo, kWarning, kError, kDebug}) {
        events.clear();
        method(&fake.env, nullptr, nullptr);
        EXPECT_TRUE(events.empty());

        fake.failBorrow = true;
        call(method, "unused");
        fake.failBorrow = false;
        EXPECT_EQ(events, std::vector<std::string>{"borrow"});
    }
    EXPECT_EQ(capture.text(), "");
}

TEST_F(JniBridge, ExceptionsFromTheMessageSystemStopAtTheBridge) {
    Tesu::DebugMessengerFactory::GetLogger()->SetLevel(Tesu::DebugMessenger::DEBUG_VERBOSE);
    recorder.fail = true;
    for (Method method : {kInfo, kWarning, kError, kDebug}) {
        // The methods are noexcept: an escaping exception would end the process here.
        call(method, "text");
        ASSERT_FALSE(events.empty());
        EXPECT_EQ(events.front(), "borrow");
        EXPECT_EQ(events.back(), "release");
        EXPECT_EQ(fake.released, fake.lent);
    }
}

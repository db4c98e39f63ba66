// Several threads at once: messages issued through every channel of the library reach each
// registered manager whole, once and in each thread's order; the registry's first lookups and
// the data-file readers give every thread the same answers. Built with ThreadSanitizer in CI,
// where any unguarded access fails the run.
#include <gtest/gtest.h>

#include <atomic>
#include <cstddef>
#include <map>
#include <memory>
#include <sstream>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "Port_FileName.h"
#include "Port_Msg.h"
#include "Port_PathList.h"
#include "Port_String.h"
#include "TestPlatform.h"
#include "TestSupport.h"
#include "Tesu_DebugMessenger.h"
#include "Tesu_IPUpdateInfo.h"
#include "Tesu_Jni.h"
#include "Tesu_Tessel2MessageCatcher.h"
#include "Tesu_Utilities.h"

namespace {

constexpr int kThreads = 6;

// Runs `body(t)` on kThreads threads that start together, and waits for them all.
template <typename Body>
void RunTogether(Body body) {
    std::atomic<int> ready{0};
    std::vector<std::thread> threads;
    for (int t = 0; t < kThreads; ++t) {
        threads.emplace_back([&ready, &body, t] {
            ready.fetch_add(1);
            while (ready.load() < kThreads) {
                std::this_thread::yield();
            }
            body(t);
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
}

// A JNIEnv of one Java thread with only the two string calls, lending `text`.
struct JavaThreadEnv {
    JNIEnv env;  // first member: the JNIEnv* handed out points at the whole object
    JNINativeInterface_ table{};
    std::string text;

    JavaThreadEnv() {
        table.GetStringUTFChars = &borrow;
        table.ReleaseStringUTFChars = &release;
        env.functions = &table;
    }
    static const char* JNICALL borrow(JNIEnv* e, jstring, jboolean*) {
        return reinterpret_cast<JavaThreadEnv*>(e)->text.c_str();
    }
    static void JNICALL release(JNIEnv*, jstring, const char*) {}
};

// A stream buffer that takes a text a few characters at a time, yielding in between, so that
// two writes that are not kept apart would mix.
class YieldingBuffer : public std::stringbuf {
  protected:
    std::streamsize xsputn(const char* s, std::streamsize n) override {
        for (std::streamsize i = 0; i < n; ++i) {
            sputc(s[i]);
            if (i % 32 == 0) {
                std::this_thread::yield();
            }
        }
        return n;
    }
};

// A Port_MsgStream registered after the capture's Tesu::MsgMan, so that both are active.
struct SecondManager {
    YieldingBuffer buffer;
    std::ostream out{&buffer};
    Port_MsgStream manager{"second"};
    SecondManager() {
        manager.addMsgStream(out);
        Port_MsgDispatcher::addMsgMan(&manager);
    }
    ~SecondManager() {
        Port_MsgDispatcher::removeMsgMan(&manager);
        manager.removeMsgStream(out);
    }
};

// Checks that `text` is exactly the expected lines of every thread, each once, each thread's
// in the order issued (lines of different threads may come in any order between them).
void ExpectWholeOrderedLines(const std::string& text,
                             const std::vector<std::vector<std::string>>& expected,
                             const std::string& manager) {
    std::map<std::string, std::pair<std::size_t, std::size_t>> where;
    for (std::size_t t = 0; t < expected.size(); ++t) {
        for (std::size_t m = 0; m < expected[t].size(); ++m) {
            where.emplace(expected[t][m], std::make_pair(t, m));
        }
    }
    ASSERT_EQ(where.size(), kThreads * expected[0].size()) << "expected lines are distinct";
    std::vector<std::size_t> next(expected.size(), 0);
    std::istringstream lines(text);
    std::string line;
    std::size_t count = 0;
    while (std::getline(lines, line)) {
        const auto found = where.find(line);
        ASSERT_NE(found, where.end())
            << manager << ": mixed or foreign line: " << line.substr(0, 120);
        const std::size_t t = found->second.first;
        ASSERT_EQ(found->second.second, next[t])
            << manager << ": lost or repeated: " << line.substr(0, 120);
        ++next[t];
        ++count;
    }
    EXPECT_EQ(count, where.size()) << manager;
}

TEST(Threads, MessagesFromEveryChannelReachBothManagersWhole) {
    tesutest::LoggerLevelsReset levels;
    constexpr int kMessages = 150;
    constexpr int kKinds = 6;

    // Levels are set before the threads start; while they run, loggers are only read.
    Tesu::DebugMessengerFactory::GetLogger("javavm")->SetLevel(Tesu::DebugMessenger::DEBUG_NORMAL);
    std::vector<Tesu::DebugMessenger*> loggers;
    for (int t = 0; t < kThreads; ++t) {
        loggers.push_back(
            Tesu::DebugMessengerFactory::GetLogger(("threads_test." + std::to_string(t)).c_str()));
        loggers.back()->SetLevel(Tesu::DebugMessenger::DEBUG_NORMAL);
    }

    // What each thread issues (message m is of kind m % kKinds) and the line it gives.
    auto token = [](int t, int m) { return "t" + std::to_string(t) + "m" + std::to_string(m); };
    // Longer than the message system's stack buffer, with format characters that must stay.
    auto longText = [&token](int t, int m) {
        return token(t, m) + " %n%s%d " + std::string(1500 + 97 * t, static_cast<char>('a' + t));
    };
    auto missingFile = [&token](int t, int m) {
        return "/nonexistent-threads-test/" + token(t, m) + ".txt";
    };
    std::vector<std::vector<std::string>> expected(kThreads);
    for (int t = 0; t < kThreads; ++t) {
        for (int m = 0; m < kMessages; ++m) {
            const std::string id = token(t, m);
            switch (m % kKinds) {
                case 0:
                    expected[t].push_back("WARNING:tesutil - " + longText(t, m));
                    break;
                case 1:
                    expected[t].push_back("java info " + id);
                    break;
                case 2:
                    expected[t].push_back("ERROR:tesutil - java error " + id);
                    break;
                case 3:
                    expected[t].push_back("DEBUG[javavm] - java debug " + id);
                    break;
                case 4:
                    expected[t].push_back("ERROR:tesutil - Could not open " + missingFile(t, m));
                    break;
                default:
                    expected[t].push_back("DEBUG[threads_test." + std::to_string(t) +
                                          "] - logger line " + id);
                    break;
            }
        }
    }

    tesutest::MessageCapture capture;
    SecondManager second;
    _jstring javaString;
    RunTogether([&](int t) {
        JavaThreadEnv java;
        const Port_MsgManData source =
            Port_MsgManData::createObject("tesutil", "../tests/threads_test", __LINE__, "$Rev$");
        for (int m = 0; m < kMessages; ++m) {
            const std::string id = token(t, m);
            switch (m % kKinds) {
                case 0:
                    source.issueWarning(Port::StringBase<char>(longText(t, m)));
                    break;
                case 1:
                    java.text = "java info " + id;
                    Java_com_quarnel_tesutil_tessel2_Tessel2MessageCatcher_outputInfoMessageN(
                        &java.env, nullptr, &javaString);
                    break;
                case 2:
                    java.text = "java error " + id;
                    Java_com_quarnel_tesutil_tessel2_Tessel2MessageCatcher_outputErrorMessageN(
                        &java.env, nullptr, &javaString);
                    break;
                case 3:
                    java.text = "java debug " + id;
                    Java_com_quarnel_tesutil_tessel2_Tessel2MessageCatcher_outputDebugMessageN(
                        &java.env, nullptr, &javaString);
                    break;
                case 4: {
                    bool verdict = true;
                    Tesu::Utilities::ValidateFileChecksum(missingFile(t, m).c_str(), verdict);
                    break;
                }
                default:
                    loggers[t]->Normal(("logger line " + id).c_str());
                    break;
            }
        }
    });

    ExpectWholeOrderedLines(capture.text(), expected, "Tesu::MsgMan");
    ExpectWholeOrderedLines(second.buffer.str(), expected, "Port_MsgStream");
}

TEST(Threads, FirstLookupsOfTheSameNamesGiveOneLoggerPerName) {
    // The Java bridge looks its logger up on whatever Java thread calls it, so first lookups
    // of one name may happen on several threads at once.
    static std::atomic<int> run{0};
    const std::string prefix = "threads_test.first." + std::to_string(run++) + ".";
    constexpr int kNames = 64;
    std::vector<std::vector<Tesu::DebugMessenger*>> seen(
        kThreads, std::vector<Tesu::DebugMessenger*>(kNames, nullptr));
    RunTogether([&](int t) {
        for (int i = 0; i < kNames; ++i) {
            // Every thread asks for every name, starting at a different one.
            const int n = (i + t * 11) % kNames;
            seen[t][n] =
                Tesu::DebugMessengerFactory::GetLogger((prefix + std::to_string(n)).c_str());
        }
    });
    for (int n = 0; n < kNames; ++n) {
        ASSERT_NE(seen[0][n], nullptr);
        for (int t = 1; t < kThreads; ++t) {
            EXPECT_EQ(seen[t][n], seen[0][n]) << "name " << n << ", thread " << t;
        }
    }
    std::unique_ptr<std::vector<Port::StringBase<char>>> names(
        Tesu::DebugMessengerFactory::GetActiveLoggers());
    std::map<std::string, int> listed;
    for (const Port::StringBase<char>& name : *names) {
        ++listed[name.str()];
    }
    for (int n = 0; n < kNames; ++n) {
        EXPECT_EQ(listed[prefix + std::to_string(n)], 1) << "name " << n;
    }
}

TEST(Threads, DataFileReadersAgreeOnEveryThread) {
    tesutest::LoggerLevelsReset levels;
    tesutest::TempDir dir;
    Port::StringBase<char> checksum;
    const std::string body = "module top;\nendmodule\n";
    Tesu::Utilities::CalculateChecksum(body.c_str(), checksum);
    const std::string valid = dir.write("valid.v", "# CRC: " + checksum.str() + "\n" + body);
    const std::string invalid = dir.write("invalid.v", "# CRC: " + checksum.str() + "\nmodule\n");
    dir.write("IPupdate.log", "installed\ncores_level=12 (patch)\n");
    dir.write("a.v", "");
    const std::string list = dir.write("files.lst", "a.v\nmissing.v\n");
    Port::PathList roots;
    roots.Append(dir.path().c_str());
    tesutest::RootsGuard rootsGuard(roots);

    constexpr int kRounds = 40;
    std::vector<int> wrong(kThreads, 0);
    tesutest::MessageCapture capture;
    RunTogether([&](int t) {
        for (int r = 0; r < kRounds; ++r) {
            bool verdictValid = false;
            bool verdictInvalid = true;
            Port::StringBase<char> report;
            const bool ok =
                Tesu::Utilities::ValidateFileChecksum(valid.c_str(), verdictValid) == 0 &&
                verdictValid &&
                Tesu::Utilities::ValidateFileChecksum(invalid.c_str(), verdictInvalid) == 0 &&
                !verdictInvalid && Tesu::IPUpdateInfo::GetCoresLevel(report) == 3 &&
                report.str() == "Cores Update # 12 (patch)" &&
                Tesu::Utilities::GetFileListFileStrings(Port::FileName(list.c_str())) ==
                    std::vector<Port::StringBase<char>>{"a.v"};
            wrong[t] += ok ? 0 : 1;
        }
    });
    EXPECT_EQ(wrong, std::vector<int>(kThreads, 0));
    // One warning per reading of the list, each whole.
    std::string expected;
    for (int i = 0; i < kThreads * kRounds; ++i) {
        expected += "WARNING:tesutil - Missing file list member " +
                    tesutest::Native(dir.join("missing.v")) + "\n";
    }
    EXPECT_EQ(capture.text(), expected);
}

}  // namespace

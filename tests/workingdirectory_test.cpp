// The working directory guard: change, revert, nesting, Reconfirm, and every trace and error
// it writes, on a real tree in a temporary directory.
#include <gtest/gtest.h>

#include <filesystem>
#include <ostream>
#include <sstream>
#include <stdexcept>
#include <streambuf>
#include <string>

#include "TestPlatform.h"
#include "TestSupport.h"
#include "Tesu_DebugMessenger.h"
#include "Tesu_MsgMan.h"
#include "Tesu_SetWorkingDirectory.h"

namespace {

namespace fs = std::filesystem;
using Guard = Tesu::SetWorkingDirectory;

std::string setTrace(const std::string& dir) {
    return "DEBUG[utilities] - Current working directory set to " + tesutest::Native(dir + "/") +
           "\n";
}
std::string revertTrace(const std::string& dir) {
    return "DEBUG[utilities] - Current working directory reverted to " +
           tesutest::Native(dir + "/") + "\n";
}
std::string reconfirmTrace(const std::string& dir) {
    return "DEBUG[utilities] - Reconfirming current working directory from " +
           tesutest::Native(dir + "/") + "\n";
}
std::string error(const std::string& what, const std::string& dir) {
    return "ERROR:tesutil - Unable to " + what + " working directory to " +
           tesutest::Native(dir + "/") + "\n";
}

// A stream buffer that fails every write once armed.
class FailingBuffer : public std::streambuf {
  public:
    bool armed = false;

  protected:
    int_type overflow(int_type c) override {
        fail();
        return c;
    }
    std::streamsize xsputn(const char*, std::streamsize count) override {
        fail();
        return count;
    }

  private:
    void fail() const {
        if (armed) {
            throw std::runtime_error("device full");
        }
    }
};

// Starts every test in <temp>/start with the logger "utilities" at verbose level.
class WorkingDirectoryTest : public ::testing::Test {
  protected:
    WorkingDirectoryTest()
        : t(fs::canonical(temp.path()).string()), start(tesutest::Native(t + "/start")) {
        fs::create_directory(start);
        fs::create_directory(t + "/d");
        fs::current_path(start);
        Tesu::DebugMessengerFactory::GetLogger("utilities")
            ->SetLevel(Tesu::DebugMessenger::DEBUG_VERBOSE);
    }
    static std::string cwd() { return fs::current_path().string(); }

    tesutest::WorkingDirectoryRestorer restorer;
    tesutest::LoggerLevelsReset levels;
    tesutest::TempDir temp;
    const std::string t;
    const std::string start;
    tesutest::MessageCapture capture;
};

TEST_F(WorkingDirectoryTest, ChangesForItsLifetimeAndBack) {
    // Separators of either kind, relative or absolute, name the same directory.
    for (const std::string& arg : {t + "/d", t + "/d/", t + "\\d\\", std::string("../d")}) {
        capture.clear();
        {
            Guard guard(arg);
            EXPECT_EQ(cwd(), tesutest::Native(t + "/d")) << arg;
        }
        EXPECT_EQ(cwd(), start);
        EXPECT_EQ(capture.text(), setTrace(t + "/d") + revertTrace(start)) << arg;
    }
}

TEST_F(WorkingDirectoryTest, FileOrMissingNameStandsForItsDirectory) {
    temp.write("d/file.txt", "");
    for (const std::string& arg : {t + "/d/file.txt", t + "/d/missing", t + "/d/missing/"}) {
        capture.clear();
        {
            Guard guard(arg);
            EXPECT_EQ(cwd(), tesutest::Native(t + "/d")) << arg;
        }
        EXPECT_EQ(capture.text(), setTrace(t + "/d") + revertTrace(start)) << arg;
    }
}

TEST_F(WorkingDirectoryTest, MissingTargetIsReportedAndTheGuardStillReverts) {
    {
        Guard guard(t + "/none/missing");
        EXPECT_EQ(cwd(), start);
    }
    EXPECT_EQ(capture.text(), error("set", t + "/none") + revertTrace(start));
}

TEST_F(WorkingDirectoryTest, TargetThatCannotBeEnteredIsReported) {
    const std::string locked = temp.mkdir("locked");
    fs::permissions(locked, fs::perms::none);
    std::error_code ec;
    fs::directory_iterator probe(locked, ec);
    if (!ec) {
        GTEST_SKIP() << "permissions are not enforced for this user";
    }
    capture.clear();
    {
        Guard guard(locked);
        EXPECT_EQ(cwd(), start);
    }
    EXPECT_EQ(capture.text(), error("set", locked) + revertTrace(start));
}

TEST_F(WorkingDirectoryTest, NestedGuardsRestoreEachLevel) {
    const std::string inner = temp.mkdir("d/a b \xc3\xa9 %s%n");
    {
        Guard outer(t + "/d");
        {
            Guard guard(inner);
            EXPECT_EQ(cwd(), tesutest::Native(inner));
        }
        EXPECT_EQ(cwd(), tesutest::Native(t + "/d"));
    }
    EXPECT_EQ(cwd(), start);
    EXPECT_EQ(capture.text(),
              setTrace(t + "/d") + setTrace(inner) + revertTrace(t + "/d") + revertTrace(start));
}

TEST_F(WorkingDirectoryTest, VanishedPreviousDirectoryIsReportedAtRevert) {
    {
        Guard guard(t + "/d");
        fs::remove(start);
    }
    EXPECT_EQ(cwd(), tesutest::Native(t + "/d"));
    EXPECT_EQ(capture.text(), setTrace(t + "/d") + error("revert", start));
}

TEST_F(WorkingDirectoryTest, ReconfirmReturnsToTheTargetOnlyWhenMovedAway) {
    temp.mkdir("Case");
    temp.mkdir("case");
    {
        Guard guard(t + "/Case");
        capture.clear();
        guard.Reconfirm();
        EXPECT_EQ(capture.text(), "");
        // A directory that differs only in letter case is another directory.
        fs::current_path(t + "/case");
        guard.Reconfirm();
        EXPECT_EQ(cwd(), tesutest::Native(t + "/Case"));
        EXPECT_EQ(capture.text(), reconfirmTrace(t + "/case"));
        guard.Reconfirm();
        EXPECT_EQ(capture.text(), reconfirmTrace(t + "/case"));
        capture.clear();
    }
    EXPECT_EQ(capture.text(), revertTrace(start));
}

TEST_F(WorkingDirectoryTest, ReconfirmReportsAVanishedTarget) {
    Guard guard(t + "/d");
    fs::current_path(start);
    fs::remove(t + "/d");
    capture.clear();
    guard.Reconfirm();
    EXPECT_EQ(cwd(), start);
    EXPECT_EQ(capture.text(), reconfirmTrace(start) + error("reset", t + "/d"));
    // The guard is unchanged: once the target is back, a further Reconfirm enters it.
    fs::create_directory(t + "/d");
    guard.Reconfirm();
    EXPECT_EQ(cwd(), tesutest::Native(t + "/d"));
}

TEST_F(WorkingDirectoryTest, UnreadableWorkingDirectoryPassesTheLayersException) {
#if defined(_WIN32)
    GTEST_SKIP() << "Windows does not let a process remove its working directory";
#endif
    const std::string doomed = temp.mkdir("doomed");
    Guard guard(doomed);
    fs::remove(doomed);
    EXPECT_THROW(guard.Reconfirm(), std::runtime_error);
    EXPECT_THROW(Guard(t + "/d"), std::runtime_error);
}

TEST_F(WorkingDirectoryTest, FailureWhileRevertingIsReportedAndNeverEscapes) {
    // The revert's trace fails in an output stream; so does the error that reports it.
    FailingBuffer buffer;
    std::ostream failing(&buffer);
    failing.exceptions(std::ios::badbit);
    std::ostringstream record;
    Tesu::MsgMan manager(Tesu::MsgMan::DIAG_SILENT);
    manager.addMsgStream(record);
    manager.addMsgStream(failing);
    {
        Guard guard(t + "/d");
        buffer.armed = true;
    }
    manager.removeMsgStream(failing);
    manager.removeMsgStream(record);
    EXPECT_EQ(cwd(), start);
    EXPECT_EQ(record.str(), setTrace(t + "/d") + revertTrace(start) +
                                "ERROR:tesutil - Exception while reverting working directory to " +
                                tesutest::Native(start + "/") + "\n");
}

}  // namespace

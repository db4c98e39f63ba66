// File lists: members read from real list files, cleaned, checked for existence and joined to
// the list's directory; the messages and the trace line that reading issues.
#include <gtest/gtest.h>

#include <filesystem>
#include <string>
#include <vector>

#include "Port_FileName.h"
#include "Port_String.h"
#include "TestPlatform.h"
#include "TestSupport.h"
#include "Tesu_DebugMessenger.h"
#include "Tesu_FileListMember.h"
#include "Tesu_Utilities.h"

namespace {

using Tesu::Utilities;

// The list's name is passed as a bare text here and as a Port::String below: either converts
// to the FileName the operations take.
std::vector<std::string> Strings(const std::string& list) {
    std::vector<std::string> texts;
    for (const auto& member : Utilities::GetFileListFileStrings(list.c_str())) {
        texts.push_back(member.str());
    }
    return texts;
}

std::vector<std::string> Names(const std::string& list) {
    std::vector<std::string> texts;
    for (const auto& name : Utilities::GetFileListFileNames(Port::String(list))) {
        texts.push_back(name.GetText().str());
    }
    return texts;
}

// The texts with the separators the layer writes (backslashes on Windows NT).
std::vector<std::string> Natives(std::vector<std::string> texts) {
    for (std::string& text : texts) {
        text = tesutest::Native(text);
    }
    return texts;
}

class FileListTest : public ::testing::Test {
  protected:
    FileListTest() {
        for (const char* member : {"lists/a.v", "lists/b.v", "lists/c.v", "lists/sub/dir/file.v",
                                   "lists/with blank.v", "lists/crlf.v"}) {
            dir.write(member, "");
        }
        dir.mkdir("lists/ip");
    }
    std::string Missing(const std::string& relative) const {
        return "WARNING:tesutil - Missing file list member " +
               tesutest::Native(dir.join(relative)) + "\n";
    }

    tesutest::LoggerLevelsReset levels;
    tesutest::TempDir dir;
};

TEST_F(FileListTest, EveryKindOfLineIsCleanedOrSkipped) {
    const std::string list = dir.write("lists/files.lst",
                                       "# a list of sources\n"
                                       "a.v\n"
                                       "  sub/dir\\file.v  # the top\n"
                                       "\n"
                                       "    \n"
                                       "\t \t\n"
                                       "#\n"
                                       "   # indented comment\n"
                                       "\tb.v\t\n"
                                       "c.v#no blank before the comment\n"
                                       "sub//dir///file.v\n"
                                       "sub\\\\dir\\/\\file.v\n"
                                       "with blank.v\n"
                                       "with\tblank.v\n"
                                       "ip\n"
                                       "a.v\n"
                                       "crlf.v\r\n"
                                       "c.v");
    tesutest::MessageCapture capture;
    EXPECT_EQ(Natives({"a.v", "sub/dir/file.v", "b.v", "c.v", "sub/dir/file.v", "sub/dir/file.v",
                       "with blank.v", "with blank.v", "ip", "a.v", "crlf.v", "c.v"}),
              Strings(list));
    // The logger is off: nothing at all is issued.
    EXPECT_EQ("", capture.text());
}

TEST_F(FileListTest, MissingMembersAreWarnedAboutAndLeftOut) {
    const std::string list = dir.write("lists/files.lst",
                                       "a.v\n"
                                       "gone.v\n"
                                       "sub/dir/../dir\\file.v\n"
                                       "../outside.v # not there\n"
                                       "b.v\n"
                                       "gone.v\n" +
                                           dir.join("lists/a.v") + "\n");
    tesutest::MessageCapture capture;
    EXPECT_EQ(Natives({"a.v", "sub/dir/../dir/file.v", "b.v"}), Strings(list));
    // The member text is kept as written; the warnings name the absolute, normalised path.
    // An absolute member is joined to the list's directory like any other.
    EXPECT_EQ(Missing("lists/gone.v") + Missing("outside.v") + Missing("lists/gone.v") +
                  Missing((dir.path()[0] == '/' ? "lists" : "lists/") + dir.join("lists/a.v")),
              capture.text());
}

TEST_F(FileListTest, TraceLineNamesTheListAbsolutelyAtNormalLevel) {
    dir.write("lists/files.lst", "a.v\nmissing.v\n");
    tesutest::WorkingDirectoryRestorer restorer;
    std::filesystem::current_path(dir.path());
    Tesu::DebugMessengerFactory::GetLogger()->SetLevel(Tesu::DebugMessenger::DEBUG_NORMAL);
    tesutest::MessageCapture capture;
    EXPECT_EQ(Natives({"a.v"}), Strings("lists/../lists//files.lst"));
    EXPECT_EQ("DEBUG[utilities] - Reading file list " +
                  tesutest::Native(dir.join("lists/files.lst")) + "\n" + Missing("lists/missing.v"),
              capture.text());

    // Switched off for "utilities" alone, the trace goes while the warning stays.
    capture.clear();
    Tesu::DebugMessengerFactory::GetLogger("utilities")->SetLevel(Tesu::DebugMessenger::DEBUG_OFF);
    EXPECT_EQ(Natives({"a.v"}), Strings("lists/files.lst"));
    EXPECT_EQ(Missing("lists/missing.v"), capture.text());
}

TEST_F(FileListTest, ListsThatCannotBeReadGiveNoMembers) {
    Tesu::DebugMessengerFactory::GetLogger()->SetLevel(Tesu::DebugMessenger::DEBUG_VERBOSE);
    tesutest::MessageCapture capture;
    EXPECT_TRUE(Strings(dir.join("lists/none.lst")).empty());
    EXPECT_EQ("ERROR:tesutil - Cannot read " + tesutest::Native(dir.join("lists/none.lst")) + "\n",
              capture.text());

    // A directory can be read but does not open as a file.
    capture.clear();
    EXPECT_TRUE(Names(dir.join("lists/ip/")).empty());
    EXPECT_TRUE(Strings(dir.join("lists/sub/../ip")).empty());
    const std::string cannotOpen =
        "ERROR:tesutil - Cannot open " + tesutest::Native(dir.join("lists/ip")) + "\n";
    EXPECT_EQ(cannotOpen + cannotOpen, capture.text());

    // An empty list, or one of comments only, gives nothing and says nothing but the trace.
    const std::string empty = dir.write("lists/empty.lst", "");
    const std::string comments = dir.write("lists/comments.lst", "# a\n\n  # b\n");
    capture.clear();
    EXPECT_TRUE(Strings(empty).empty());
    EXPECT_TRUE(Strings(comments).empty());
    EXPECT_EQ("DEBUG[utilities] - Reading file list " + tesutest::Native(empty) + "\n" +
                  "DEBUG[utilities] - Reading file list " + tesutest::Native(comments) + "\n",
              capture.text());
}

TEST_F(FileListTest, UnreadableListIsReportedAsSuch) {
    if (const char* reason = tesutest::WhyPermissionsDoNotLockOut()) {
        GTEST_SKIP() << reason;
    }
    const std::string list = dir.write("lists/locked.lst", "a.v\n");
    std::filesystem::permissions(list, std::filesystem::perms::none);
    tesutest::MessageCapture capture;
    EXPECT_TRUE(Strings(list).empty());
    EXPECT_EQ("ERROR:tesutil - Cannot read " + list + "\n", capture.text());
}

TEST_F(FileListTest, NamesJoinTheListsDirectoryPartAsGiven) {
    dir.write("lists/files.lst", "a.v\n  sub\\dir/file.v\nmissing.v\nb.v\n");
    tesutest::WorkingDirectoryRestorer restorer;
    std::filesystem::current_path(dir.path());
    tesutest::MessageCapture capture;
    // A relative list gives relative names: its directory part, then the member text.
    EXPECT_EQ(Natives({"lists/a.v", "lists/sub/dir/file.v", "lists/b.v"}),
              Names("lists/files.lst"));
    EXPECT_EQ(
        Natives({"lists/../lists/a.v", "lists/../lists/sub/dir/file.v", "lists/../lists/b.v"}),
        Names("lists/../lists/files.lst"));
    EXPECT_EQ(
        Natives({dir.join("lists/a.v"), dir.join("lists/sub/dir/file.v"), dir.join("lists/b.v")}),
        Names(dir.join("lists/files.lst")));
    // The messages of the strings' reading, once per call.
    EXPECT_EQ(Missing("lists/missing.v") + Missing("lists/missing.v") + Missing("lists/missing.v"),
              capture.text());

    // A list without a directory part lies in the working directory.
    std::filesystem::current_path(dir.join("lists"));
    dir.write("lists/here.lst", "a.v\nsub/dir/file.v\n");
    EXPECT_EQ(Natives({"a.v", "sub/dir/file.v"}), Names("here.lst"));
}

TEST(FileListMemberSeparators, BecomeThePlatformsAndRunsCollapse) {
    struct Case {
        const char* member;
        const char* posix;
        const char* windows;
    };
    const Case cases[] = {
        {"sub/dir\\file.v", "sub/dir/file.v", "sub\\dir\\file.v"},
        {"a//b", "a/b", "a\\b"},
        {"a\\\\\\b", "a/b", "a\\b"},
        {"a/\\/\\b//", "a/b/", "a\\b\\"},
        {"//server\\share", "/server/share", "\\server\\share"},
        {"plain.v", "plain.v", "plain.v"},
        {"/", "/", "\\"},
    };
    for (const Case& c : cases) {
        Port::StringBase<char> posix(c.member);
        Tesu::FileListMember::NormaliseSeparators(posix, false);
        EXPECT_EQ(c.posix, posix.str()) << c.member;
        Port::StringBase<char> windows(c.member);
        Tesu::FileListMember::NormaliseSeparators(windows, true);
        EXPECT_EQ(c.windows, windows.str()) << c.member;
    }
    // A long run collapses (in one pass, not one separator at a time).
    Port::StringBase<char> run(std::string(1 << 20, '/') + "x" + std::string(1 << 20, '\\'));
    Tesu::FileListMember::NormaliseSeparators(run, false);
    EXPECT_EQ("/x/", run.str());
}

}  // namespace

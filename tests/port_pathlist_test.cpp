// Port::PathList and the installation roots (Port::QuarnelPath).
#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>
#include <string>
#include <vector>

#include "Port_FileName.h"
#include "Port_PathList.h"
#include "TestPlatform.h"
#include "TestSupport.h"

namespace fs = std::filesystem;
using Port::PathList;
using Port::QuarnelPath;

namespace {

using Texts = std::vector<std::string>;

Texts texts(const PathList& list) {
    Texts result;
    for (Port::PathListIterator it = list.begin(); it != list.end(); ++it) {
        result.push_back((*it).str());
    }
    EXPECT_EQ(result.size(), list.size());
    return result;
}

// Saves TESSEL_ROOTS, and puts it back (and lets the roots be read afresh) at the end.
class RootsVariable {
  public:
    RootsVariable() {
        const char* value = std::getenv("TESSEL_ROOTS");
        wasSet_ = value != nullptr;
        if (wasSet_) {
            saved_ = value;
        }
        QuarnelPath::Reset();
    }
    ~RootsVariable() {
        if (wasSet_) {
            tesutest::SetVariable("TESSEL_ROOTS", saved_.c_str());
        } else {
            tesutest::UnsetVariable("TESSEL_ROOTS");
        }
        QuarnelPath::Reset();
    }
    // Sets the variable and makes the layer read it again. ":" in `value` stands for the
    // platform's list separator.
    void set(const char* value) {
        tesutest::SetVariable("TESSEL_ROOTS", Listed(value).c_str());
        QuarnelPath::Reset();
    }
    void unset() {
        tesutest::UnsetVariable("TESSEL_ROOTS");
        QuarnelPath::Reset();
    }

    static std::string Listed(std::string text) {
        for (char& c : text) {
            if (c == ':') {
                c = QuarnelPath::GetListSeparator();
            }
        }
        return text;
    }

  private:
    bool wasSet_ = false;
    std::string saved_;
};

}  // namespace

TEST(PortPathList, SplitsAndLeavesOutEmptyEntries) {
    EXPECT_EQ(texts(PathList("/a::/b c:", ':')), (Texts{"/a", "/b c"}));
    EXPECT_EQ(texts(PathList(":/only", ':')), (Texts{"/only"}));
    EXPECT_EQ(texts(PathList("C:\\x;;D:\\y", ';')), (Texts{"C:\\x", "D:\\y"}));
    EXPECT_TRUE(PathList("", ':').empty());
    EXPECT_TRUE(PathList(":::", ':').empty());

    PathList built;
    built.Append("/first");
    built.Append("");
    EXPECT_EQ(texts(built), (Texts{"/first", ""}));
    EXPECT_EQ(built[0].str(), "/first");
    built.Clear();
    EXPECT_TRUE(built.empty());
}

TEST(PortInstallationRoots, ReadFromTheEnvironmentOnFirstUse) {
    RootsVariable variable;
#if defined(_WIN32)
    EXPECT_EQ(QuarnelPath::GetListSeparator(), ';');
#else
    EXPECT_EQ(QuarnelPath::GetListSeparator(), ':');
#endif

    variable.set("/r1::/r2:");
    EXPECT_EQ(texts(QuarnelPath::GetInstance()), (Texts{"/r1", "/r2"}));
    // Read once: a later change of the variable counts only after Reset.
    tesutest::SetVariable("TESSEL_ROOTS", "/changed");
    EXPECT_EQ(texts(QuarnelPath::GetInstance()), (Texts{"/r1", "/r2"}));
    QuarnelPath::Reset();
    EXPECT_EQ(texts(QuarnelPath::GetInstance()), (Texts{"/changed"}));

    // Set but empty (or only separators): no roots at all, not the installation prefix.
    variable.set("");
    EXPECT_TRUE(QuarnelPath::GetInstance().empty());
    variable.set(":");
    EXPECT_TRUE(QuarnelPath::GetInstance().empty());

    // The variable's text is taken as it stands, blanks included.
    variable.set(" /with blank ");
    EXPECT_EQ(texts(QuarnelPath::GetInstance()), (Texts{" /with blank "}));
}

TEST(PortInstallationRoots, SetRootsReplacesTheListUntilReset) {
    RootsVariable variable;
    variable.set("/from-env");
    PathList mine;
    mine.Append("/set/one");
    mine.Append("/set/two");
    {
        tesutest::RootsGuard guard(mine);
        EXPECT_EQ(texts(QuarnelPath::GetInstance()), (Texts{"/set/one", "/set/two"}));
        // The list was copied: changing the caller's list changes nothing.
        mine.Clear();
        EXPECT_EQ(QuarnelPath::GetInstance().size(), 2u);
        QuarnelPath::SetRoots(PathList());
        EXPECT_TRUE(QuarnelPath::GetInstance().empty());
    }
    EXPECT_EQ(texts(QuarnelPath::GetInstance()), (Texts{"/from-env"}));
}

TEST(PortInstallationRoots, WithoutTheVariableTheInstallationPrefix) {
    RootsVariable variable;
    variable.unset();

    // The library is built in <build>/portability (<build>/bin on Windows), so the prefix is
    // the build directory.
    const std::string prefix = QuarnelPath::GetInstallationPrefix().str();
    ASSERT_FALSE(prefix.empty());
    EXPECT_TRUE(fs::path(prefix).is_absolute()) << prefix;
    EXPECT_NE(prefix.back(), Port::FileName::GetPathSeparator());
    EXPECT_TRUE(fs::equivalent(prefix, TESU_BINARY_DIR)) << prefix;
    EXPECT_EQ(texts(QuarnelPath::GetInstance()), (Texts{prefix}));

    // The prefix does not depend on the working directory.
    tesutest::WorkingDirectoryRestorer restore;
    fs::current_path("/");
    EXPECT_EQ(QuarnelPath::GetInstallationPrefix().str(), prefix);
}

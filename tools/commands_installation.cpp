// tesutil commands on the installation and the environment: roots, cores-level, find, java,
// version, abspath, absdir, relpath.
#include <memory>
#include <string>
#include <vector>

#include <CLI/CLI.hpp>

#include "Port_Env.h"
#include "Port_File.h"
#include "Port_PathList.h"
#include "Port_String.h"
#include "Tesu_IPUpdateInfo.h"
#include "Tesu_Utilities.h"
#include "tesutil_cli.h"

namespace tesutil {

namespace {

// The roots in effect, one a line, each with where it came from, marked when it is not an
// existing directory.
int RunRoots() {
    const Port::PathList& roots = Port::QuarnelPath::GetInstance();
    bool any = false;
    for (const auto& root : roots) {
        any = true;
        const bool there = Port::File::isdir(root);
        PrintLine(NameLine(root.str(), "  (" + RootsOrigin() + (there ? ")" : ", missing)")));
    }
    if (!any) {
        return Fail("roots", "no installation roots (" + RootsOrigin() + " gives none)");
    }
    return kExitOk;
}

int RunCoresLevel() {
    Port::StringBase<char> report;
    const unsigned int result = Tesu::IPUpdateInfo::GetCoresLevel(report);
    switch (result) {
        case 3:
            PrintLine(report.str());
            return kExitOk;
        case 1:
            return Fail("cores-level",
                        "no installation root holds a readable IPupdate.log (looked in " +
                            RootsLookedIn() + ")");
        case 2:
            // The library has named the log and said that it does not open.
            return kExitFailed;
        case 4:
            return Fail("cores-level", "the update log IPupdate.log holds no cores_level= line");
        default:
            return Fail("cores-level", "unexpected result " + std::to_string(result));
    }
}

int RunFind(const std::string& name, bool container) {
    Port::StringBase<char> path;
    if (container) {
        if (Tesu::Utilities::GetFullQuarnelPathWithContainer(name, path)) {
            PrintLine(path.str());
            return kExitOk;
        }
        return Fail("find", "'" + name +
                                "' not found in the IP container of any installation root "
                                "(looked in " +
                                RootsLookedIn() + ")");
    }
    if (Tesu::Utilities::GetFullQuarnelPathOf(name, path)) {
        PrintLine(path.str());
        return kExitOk;
    }
    return Fail("find", "'" + name + "' not found under the installation roots (looked in " +
                            RootsLookedIn() + ")");
}

int RunJava() {
    Port::StringBase<char> path;
    if (Tesu::Utilities::GetJavaExecutablePath(path)) {
        PrintLine(path.str());
        return kExitOk;
    }
    return Fail("java", "no Java runtime java/" + Port_Env::GetPlatformPath().str() +
                            "/jre/bin/java under the installation roots (looked in " +
                            RootsLookedIn() + ")");
}

int RunVersion() {
    PrintLine("name: " + Tesu::Utilities::ApplicationName().str());
    PrintLine("version: " + Tesu::Utilities::RevisionVersion().str());
    PrintLine(std::string("built: ") + Tesu::Utilities::GetBuildDate() + ' ' +
              Tesu::Utilities::GetBuildTime());
    PrintLine("next major release: " + Tesu::Utilities::NextMajorRelease().str());
    return kExitOk;
}

// The one operand PATH, which must not be empty.
const std::string& PathOperand(const std::vector<std::string>& operands, std::size_t index) {
    if (operands[index].empty()) {
        throw UsageError{"PATH is empty"};
    }
    return operands[index];
}

}  // namespace

void AddInstallationCommands(CLI::App& tool, Commands& commands) {
    const char* group = "Installation and paths";
    auto add = [&](const char* name, const char* summary, const char* description) -> Command& {
        return AddCommand(tool, commands, group, name, summary, description);
    };

    add("roots", "show the installation roots in effect",
        "Prints each installation root, in search order, followed by two blanks and where "
        "it came from in parentheses: --roots, TESSEL_ROOTS, sample installation or "
        "installation prefix; \", missing\" is added for a root that is not an existing "
        "directory. Exit status 1 when there are no roots.")
        .run = RunRoots;

    add("cores-level", "show the level of the last IP core update",
        "Prints \"Cores Update # <level>\" from the first line holding \"cores_level=\" in "
        "the first readable IPupdate.log among the installation roots. Exit status 1 when "
        "there is no such log or line.")
        .run = RunCoresLevel;

    auto container = std::make_shared<bool>(false);
    Command& find =
        add("find", "find a file or directory under the installation roots",
            "Prints the absolute path of NAME under the first installation root that holds it. "
            "With --container it looks inside each entry of the IP container tessel/ip/quarnel "
            "of each root instead (entries in name order; the first match wins). Exit status 1 "
            "when NAME is not found; the message names the roots looked in.");
    AddOperand(find, "NAME", "the name, relative to a root", false);
    find.app->add_flag("--container", *container,
                       "look in each entry of each root's IP container instead");
    find.least = find.most = 1;
    find.names = "NAME";
    find.run = [container, operands = find.operands] {
        return RunFind((*operands)[0], *container);
    };

    add("java", "show the Java runtime shipped with the installation",
        "Prints the absolute path of java/<platform>/jre/bin/java under the first "
        "installation root that holds it. Exit status 1 when there is none.")
        .run = RunJava;

    add("version", "show name, version, build stamp, next major release",
        "Prints the application name, the version value, the library's build date and "
        "time, and the next major release (tesutil --version prints the tool's own "
        "version).")
        .run = RunVersion;

    Command& abspath = add("abspath", "make a path absolute",
                           "Prints PATH absolute and normalised, ending in a separator when it is "
                           "an existing\ndirectory. Symbolic links are not resolved.");
    AddOperand(abspath, "PATH", "the path", false);
    abspath.least = abspath.most = 1;
    abspath.names = "PATH";
    abspath.run = [operands = abspath.operands] {
        PrintLine(Tesu::Utilities::GetAbsolutePath(PathOperand(*operands, 0)).str());
        return kExitOk;
    };

    Command& absdir =
        add("absdir", "show the absolute directory a path denotes",
            "Prints the absolute directory PATH denotes, ending in a separator: PATH itself "
            "when it is a directory, else (a file, or a name that does not exist) its parent.");
    AddOperand(absdir, "PATH", "the path", false);
    absdir.least = absdir.most = 1;
    absdir.names = "PATH";
    absdir.run = [operands = absdir.operands] {
        PrintLine(Tesu::Utilities::GetAbsoluteDirectory(PathOperand(*operands, 0)).str());
        return kExitOk;
    };

    Command& relpath = add("relpath", "express a path relative to a base directory",
                           "Prints PATH as \"./\" and the rest when it lies under the directory "
                           "BASE denotes\n(see absdir), else its absolute form. Never produces "
                           "\"..\".");
    AddOperand(relpath, "BASE", "the base directory", false);
    AddOperand(relpath, "PATH", "the path", false);
    relpath.least = relpath.most = 2;
    relpath.names = "BASE PATH";
    relpath.run = [operands = relpath.operands] {
        PrintLine(
            Tesu::Utilities::MakeRelativePath((*operands)[0], PathOperand(*operands, 1)).str());
        return kExitOk;
    };
}

}  // namespace tesutil

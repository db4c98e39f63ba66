// tesutil commands on the installation and the environment: cores-level, find, java,
// version, abspath, absdir, relpath.
#include <iostream>
#include <string>

#include "Port_Env.h"
#include "Port_String.h"
#include "Tesu_IPUpdateInfo.h"
#include "Tesu_Utilities.h"
#include "tesutil_cli.h"

namespace tesutil {

namespace {

int RunCoresLevel(const Arguments& arguments) {
    ExpectOperands(ParseArguments(arguments, {}, {}), 0, 0, "no operands");
    Port::StringBase<char> report;
    const unsigned int result = Tesu::IPUpdateInfo::GetCoresLevel(report);
    switch (result) {
        case 3:
            std::cout << report.str() << '\n';
            return kExitOk;
        case 1:
            return Fail("cores-level", "no installation root holds a readable IPupdate.log");
        case 2:
            return Fail("cores-level", "the update log IPupdate.log cannot be opened");
        case 4:
            return Fail("cores-level", "the update log IPupdate.log holds no cores_level= line");
        default:
            return Fail("cores-level", "unexpected result " + std::to_string(result));
    }
}

int RunFind(const Arguments& arguments) {
    const ParsedArguments parsed = ParseArguments(arguments, {"--container"}, {});
    ExpectOperands(parsed, 1, 1, "NAME");
    const std::string& name = parsed.operands[0];
    Port::StringBase<char> path;
    if (parsed.Has("--container")) {
        if (Tesu::Utilities::GetFullQuarnelPathWithContainer(name, path)) {
            std::cout << path.str() << '\n';
            return kExitOk;
        }
        return Fail("find",
                    "'" + name + "' not found in the IP container of any installation root");
    }
    if (Tesu::Utilities::GetFullQuarnelPathOf(name, path)) {
        std::cout << path.str() << '\n';
        return kExitOk;
    }
    return Fail("find", "'" + name + "' not found under the installation roots");
}

int RunJava(const Arguments& arguments) {
    ExpectOperands(ParseArguments(arguments, {}, {}), 0, 0, "no operands");
    Port::StringBase<char> path;
    if (Tesu::Utilities::GetJavaExecutablePath(path)) {
        std::cout << path.str() << '\n';
        return kExitOk;
    }
    return Fail("java", "no Java runtime java/" + Port_Env::GetPlatformPath().str() +
                            "/jre/bin/java under the installation roots");
}

int RunVersion(const Arguments& arguments) {
    ExpectOperands(ParseArguments(arguments, {}, {}), 0, 0, "no operands");
    std::cout << "name: " << Tesu::Utilities::ApplicationName().str() << '\n'
              << "version: " << Tesu::Utilities::RevisionVersion().str() << '\n'
              << "built: " << Tesu::Utilities::GetBuildDate() << ' '
              << Tesu::Utilities::GetBuildTime() << '\n'
              << "next major release: " << Tesu::Utilities::NextMajorRelease().str() << '\n';
    return kExitOk;
}

// The one operand PATH, which must not be empty.
std::string PathOperand(const Arguments& arguments) {
    const ParsedArguments parsed = ParseArguments(arguments, {}, {});
    ExpectOperands(parsed, 1, 1, "PATH");
    if (parsed.operands[0].empty()) {
        throw UsageError{"PATH is empty"};
    }
    return parsed.operands[0];
}

int RunAbsPath(const Arguments& arguments) {
    std::cout << Tesu::Utilities::GetAbsolutePath(PathOperand(arguments)).str() << '\n';
    return kExitOk;
}

int RunAbsDir(const Arguments& arguments) {
    std::cout << Tesu::Utilities::GetAbsoluteDirectory(PathOperand(arguments)).str() << '\n';
    return kExitOk;
}

int RunRelPath(const Arguments& arguments) {
    const ParsedArguments parsed = ParseArguments(arguments, {}, {});
    ExpectOperands(parsed, 2, 2, "BASE PATH");
    if (parsed.operands[1].empty()) {
        throw UsageError{"PATH is empty"};
    }
    std::cout << Tesu::Utilities::MakeRelativePath(parsed.operands[0], parsed.operands[1]).str()
              << '\n';
    return kExitOk;
}

}  // namespace

const std::vector<Command>& InstallationCommands() {
    static const std::vector<Command> commands = {
        {"cores-level", "show the level of the last IP core update",
         "\n"
         "  Prints \"Cores Update # <level>\" from the first line holding \"cores_level=\" in\n"
         "  the first readable IPupdate.log among the installation roots. Exit status 1 when\n"
         "  there is no such log or line.\n",
         RunCoresLevel},
        {"find", "find a file or directory under the installation roots",
         "NAME [--container]\n"
         "  Prints the absolute path of NAME under the first installation root that holds it.\n"
         "  --container  look inside each entry of the IP container tessel/ip/quarnel of each\n"
         "               root instead (entries in name order; the first match wins).\n"
         "  Exit status 1 when NAME is not found.\n",
         RunFind},
        {"java", "show the Java runtime shipped with the installation",
         "\n"
         "  Prints the absolute path of java/<platform>/jre/bin/java under the first\n"
         "  installation root that holds it. Exit status 1 when there is none.\n",
         RunJava},
        {"version", "show the application's name, version, build stamp and next major release",
         "\n"
         "  Prints the application name, the version value, the library's build date and\n"
         "  time, and the next major release.\n",
         RunVersion},
        {"abspath", "make a path absolute",
         "PATH\n"
         "  Prints PATH absolute and normalised, ending in a separator when it is an existing\n"
         "  directory. Symbolic links are not resolved.\n",
         RunAbsPath},
        {"absdir", "show the absolute directory a path denotes",
         "PATH\n"
         "  Prints the absolute directory PATH denotes, ending in a separator: PATH itself\n"
         "  when it is a directory, else (a file, or a name that does not exist) its parent.\n",
         RunAbsDir},
        {"relpath", "express a path relative to a base directory",
         "BASE PATH\n"
         "  Prints PATH as \"./\" and the rest when it lies under the directory BASE denotes\n"
         "  (see absdir), else its absolute form. Never produces \"..\".\n",
         RunRelPath},
    };
    return commands;
}

}  // namespace tesutil

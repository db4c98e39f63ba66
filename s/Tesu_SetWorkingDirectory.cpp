#include "Tesu_SetWorkingDirectory.h"

#include "Port_File.h"
#include "Port_Init.h"
#include "Port_Msg.h"
#include "Tesu_DebugMessenger.h"
#include "Tesu_Utilities.h"

TESU_MODULE_PORTABILITY_INIT("Tesu_SetWorkingDirectory")

namespace Tesu {

namespace {

// Identity of this module's user-visible messages.
constexpr const char* kApplication = "tesutil";
constexpr const char* kSourcePath = "../s/Tesu_SetWorkingDirectory";
constexpr const char* kRevision = "$Revision: 1.3 $";

// A message source for a message issued at `line` of this module.
Port_MsgManData messageSource(int line) {
    return Port_MsgManData::createObject(kApplication, kSourcePath, line, kRevision);
}

// Writes `text` at verbose level on the logger "utilities".
void trace(const Port::StringBase<char>& text) {
    DebugMessengerFactory::GetLogger("utilities")->Verbose(text);
}

// Makes `directory` the working directory; chdir is tried only on a name that exists.
bool changeTo(const Port::StringBase<char>& directory) {
    return Port::File::exist(directory) && Port::File::chdir(directory);
}

// The working directory in the form the guard keeps its directories: absolute, with a
// trailing separator.
Port::StringBase<char> currentDirectory() {
    return Utilities::GetAbsoluteDirectory(Port::File::getcwd());
}

}  // namespace

SetWorkingDirectory::SetWorkingDirectory(const Port::StringBase<char>& directory)
    : previousDirectory(currentDirectory()),
      targetDirectory(Utilities::GetAbsoluteDirectory(directory)) {
    if (changeTo(targetDirectory)) {
        trace(Port::StringBase<char>::doFormat("Current working directory set to %s\n",
                                               targetDirectory.GetText()));
    } else {
        messageSource(__LINE__).issueError("Unable to set working directory to %s\n",
                                           targetDirectory.GetText());
    }
}

SetWorkingDirectory::~SetWorkingDirectory() {
    // The revert is attempted whether or not the construction's change succeeded.
    try {
        if (changeTo(previousDirectory)) {
            trace(Port::StringBase<char>::doFormat("Current working directory reverted to %s\n",
                                                   previousDirectory.GetText()));
        } else {
            messageSource(__LINE__).issueError("Unable to revert working directory to %s\n",
                                               previousDirectory.GetText());
        }
    } catch (...) {
        try {
            messageSource(__LINE__).issueError(
                "Exception while reverting working directory to %s\n", previousDirectory.GetText());
        } catch (...) {
            // Nothing more can be reported; a destructor must not throw.
        }
    }
}

void SetWorkingDirectory::Reconfirm() const {
    const Port::StringBase<char> current = currentDirectory();
    if (current == targetDirectory) {
        return;
    }
    trace(Port::StringBase<char>::doFormat("Reconfirming current working directory from %s\n",
                                           current.GetText()));
    if (!changeTo(targetDirectory)) {
        messageSource(__LINE__).issueError("Unable to reset working directory to %s\n",
                                           targetDirectory.GetText());
    }
}

}  // namespace Tesu

// Tesu::SetWorkingDirectory: a scoped change of the process's working directory.
#ifndef TESU_SETWORKINGDIRECTORY_H
#define TESU_SETWORKINGDIRECTORY_H

#include "Port_String.h"
#include "Tesu_Export.h"

namespace Tesu {

// Changes the working directory for the lifetime of the object and changes it back at
// destruction. Both directories are kept in the form Utilities::GetAbsoluteDirectory gives
// (absolute, ending in a separator); a file or a missing name as target means its directory.
// Successful changes are traced at verbose level on the logger "utilities"; failures are
// issued as errors. The working directory is the whole process's: a guard changes it for
// every thread, and is made, reconfirmed and destroyed on one thread. Guards nest when
// destroyed in reverse order of construction. Neither copied nor moved.
class TESU_API SetWorkingDirectory {
  public:
    // Records the current and the target directory and changes to the target. On failure
    // (a target that does not exist or cannot be entered) issues the error
    // "Unable to set working directory to <target>" and leaves the directory as it was; the
    // object is complete either way. Exceptions of the layer (an unreadable working directory)
    // pass to the caller.
    explicit SetWorkingDirectory(const Port::StringBase<char>& directory);
    // Changes back to the recorded previous directory, or issues the error
    // "Unable to revert working directory to <previous>". Never throws.
    ~SetWorkingDirectory();
    SetWorkingDirectory(const SetWorkingDirectory&) = delete;
    SetWorkingDirectory& operator=(const SetWorkingDirectory&) = delete;

    // When the working directory is no longer the target (compared byte for byte), changes to
    // the target again, or issues the error "Unable to reset working directory to <target>".
    void Reconfirm() const;

  private:
    Port::StringBase<char> previousDirectory;
    Port::StringBase<char> targetDirectory;
};

}  // namespace Tesu

#endif

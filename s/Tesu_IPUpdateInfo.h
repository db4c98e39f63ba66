// Tesu::IPUpdateInfo: the level of the last IP core update, read from the first readable
// "IPupdate.log" among the installation roots.
#ifndef TESU_IPUPDATEINFO_H
#define TESU_IPUPDATEINFO_H

#include "Port_String.h"
#include "Tesu_Export.h"

namespace Tesu {

class TESU_API IPUpdateInfo {
  public:
    IPUpdateInfo() = delete;

    // Reads the level line (the first line holding "cores_level=") of the first readable
    // "IPupdate.log" directly in an installation root. Results:
    //   1  no root holds a readable log; `report` untouched
    //   2  the log does not open; error "Couldn't open <path> for reading."; `report` untouched
    //   3  a level line was found; `report` becomes "Cores Update # " and the rest of that line
    //      after the tag, unchanged (possibly empty)
    //   4  the log has no level line (or is empty); `report` untouched
    static unsigned int GetCoresLevel(Port::StringBase<char>& report);

  private:
    // Sets `location` to root + separator + "IPupdate.log" for each root in turn; 0 at the
    // first readable one, 1 when none is (`location` then holds the last path tried, or is
    // untouched for an empty root list).
    static unsigned int GetIPUpdateLogLocation(Port::StringBase<char>& location);
    // 3 and `level` set to the text after the first tag when `line` holds the tag; else 4 and
    // `level` untouched.
    static unsigned int ReadCoreLevelFromLine(Port::StringBase<char>& line,
                                              Port::StringBase<char>& level);

    static const Port::StringBase<char> CORES_LEVEL_TAG;  // "cores_level="
};

}  // namespace Tesu

#endif

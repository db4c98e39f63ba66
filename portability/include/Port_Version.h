// Port::Version: the table of version values, and the splitting of a version text.
#ifndef PORT_VERSION_H
#define PORT_VERSION_H

#include "Port_Export.h"
#include "Port_String.h"

namespace Port {

class PORT_API Version {
  public:
    // The value under `key`; "version" holds the project's own version, compiled in. An
    // unknown key (or a null one) gives the empty text. Safe from any thread.
    static StringBase<char> getValue(const char* key);
    // Sets the value under `key` for the rest of the process (tools and tests).
    static void setValue(const char* key, const StringBase<char>& value);
    // Restores the table as compiled in.
    static void resetValues();
    // Splits `version` at its first two "." into major, minor and the rest (the rest may hold
    // further dots; missing parts are empty): "12.3.4-beta" gives "12", "3", "4-beta"; "7."
    // gives "7", "", "". Returns false, leaving the outputs unchanged, when the text holds no
    // "." at all (this includes the empty text).
    static bool splitVersion(const StringBase<char>& version, StringBase<char>& major,
                             StringBase<char>& minor, StringBase<char>& rest);
};

}  // namespace Port

#endif

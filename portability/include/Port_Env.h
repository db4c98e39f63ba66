// Port_Env: questions about the platform the layer was built for.
#ifndef PORT_ENV_H
#define PORT_ENV_H

#include "Port_Export.h"
#include "Port_String.h"

class PORT_API Port_Env {
  public:
    // True when built for Windows (every supported Windows is of the NT family).
    static bool IsNt();
    // The platform's directory name: "linux-x86_64", "linux-aarch64", "windows-x86" or
    // "windows-x86_64" (other processors: "linux-" or "windows-" and the compiler's name
    // for the processor).
    static Port::StringBase<char> GetPlatformPath();
    // The value of an environment variable; false when it is not set.
    static bool GetVariable(const char* name, Port::StringBase<char>& value);
};

#endif

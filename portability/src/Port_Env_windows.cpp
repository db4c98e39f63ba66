// Port_Env on Windows: the environment, and the entry helper of the DLLs built on the layer.
#include <windows.h>

#include <string>

#include "Port_Env.h"
#include "Port_Init.h"
#include "Port_OS.h"

bool Port_Env::GetVariable(const char* name, Port::StringBase<char>& value) {
    if (name == nullptr || *name == '\0') {
        return false;
    }
    // The process's own environment (what SetEnvironmentVariable changes), read as UTF-8.
    std::string found;
    if (!Port::os::environmentVariable(name, found)) {
        return false;
    }
    value.Assign(found.data(), found.size());
    return true;
}

void Port::DisableThreadNotifications(void* module) {
    if (module != nullptr) {
        ::DisableThreadLibraryCalls(static_cast<HMODULE>(module));
    }
}

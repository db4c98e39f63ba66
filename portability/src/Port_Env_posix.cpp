// Port_Env on POSIX systems: the environment.
#include <cstdlib>

#include "Port_Env.h"

bool Port_Env::GetVariable(const char* name, Port::StringBase<char>& value) {
    if (name == nullptr || *name == '\0') {
        return false;
    }
    const char* found = std::getenv(name);
    if (found == nullptr) {
        return false;
    }
    value.Assign(found);
    return true;
}

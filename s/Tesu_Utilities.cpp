#include "Tesu_Utilities.h"

#include <cstdint>
#include <cstring>
#include <exception>
#include <vector>

#include "Port_Env.h"
#include "Port_File.h"
#include "Port_FileName.h"
#include "Port_Init.h"
#include "Port_Msg.h"
#include "Port_PathList.h"
#include "Port_String.h"
#include "Port_Version.h"
#include "Tesu_DebugMessenger.h"

#if defined(_WIN32)
#include <windows.h>
#endif

TESU_MODULE_PORTABILITY_INIT("Tesu_Utilities")

namespace Tesu {

namespace {

// Identity of this module's user-visible messages.
constexpr const char* kApplication = "tesutil";
constexpr const char* kSourcePath = "../s/Tesu_Utilities";
constexpr const char* kRevision = "$Revision: 1.37.14.1 $";

// A message source for a message issued at `line` of this module.
[[maybe_unused]] Port_MsgManData messageSource(int line) {
    return Port_MsgManData::createObject(kApplication, kSourcePath, line, kRevision);
}

}  // namespace

// ==== Path texts =============================================================================
// PATHS-BEGIN
// PATHS-END

// ==== Installation search ====================================================================
// SEARCH-BEGIN
// SEARCH-END

// ==== Identity and versions ==================================================================
// IDENTITY-BEGIN
// IDENTITY-END

// ==== Checksummed files ======================================================================
// CHECKSUM-BEGIN
// CHECKSUM-END

// ==== File lists =============================================================================
// FILELIST-BEGIN
// FILELIST-END

}  // namespace Tesu

#if defined(_WIN32)
// The library's entry: thread attach and detach notifications are not wanted.
BOOL WINAPI DllMain(HINSTANCE instance, DWORD reason, LPVOID /*reserved*/) {
    if (reason == DLL_PROCESS_ATTACH) {
        DisableThreadLibraryCalls(instance);
    }
    return TRUE;
}
#endif

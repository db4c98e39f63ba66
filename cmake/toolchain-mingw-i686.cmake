# Cross-build for Windows (i686) with Debian's MinGW-w64 compilers. Only the "-posix"
# compilers have std::thread and std::mutex. Tests run under Wine.
set(CMAKE_SYSTEM_NAME Windows)
set(CMAKE_SYSTEM_PROCESSOR x86)
set(TESU_MINGW_TRIPLE i686-w64-mingw32)

# Floating point in SSE2 registers, as on x86_64: x87 code keeps 80-bit intermediates, so a
# double returned in a register could compare unequal to the same value once stored (a timer
# reading less than the one before it). Every x86 processor since 2001 has SSE2.
set(CMAKE_C_FLAGS_INIT "-msse2 -mfpmath=sse")
set(CMAKE_CXX_FLAGS_INIT "-msse2 -mfpmath=sse")
set(TESU_WINE_NAMES wine)

include(${CMAKE_CURRENT_LIST_DIR}/toolchain-mingw-common.cmake)

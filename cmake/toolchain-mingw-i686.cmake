# Cross-build for Windows (i686) with Debian's MinGW-w64 compilers. Only the "-posix"
# compilers have std::thread and std::mutex. Tests run under Wine.
set(CMAKE_SYSTEM_NAME Windows)
set(CMAKE_SYSTEM_PROCESSOR x86)
set(TESU_MINGW_TRIPLE i686-w64-mingw32)

include(${CMAKE_CURRENT_LIST_DIR}/toolchain-mingw-common.cmake)

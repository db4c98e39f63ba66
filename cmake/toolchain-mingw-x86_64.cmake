# Cross-build for Windows (x86_64) with Debian's MinGW-w64 compilers. Only the "-posix"
# compilers have std::thread and std::mutex. Tests run under Wine.
set(CMAKE_SYSTEM_NAME Windows)
set(CMAKE_SYSTEM_PROCESSOR AMD64)
set(TESU_MINGW_TRIPLE x86_64-w64-mingw32)
set(TESU_WINE_NAMES wine64 wine)

include(${CMAKE_CURRENT_LIST_DIR}/toolchain-mingw-common.cmake)

# The part of the MinGW-w64 toolchain files that both processors share. The including file
# sets CMAKE_SYSTEM_NAME, CMAKE_SYSTEM_PROCESSOR, TESU_MINGW_TRIPLE and TESU_WINE_NAMES (the
# names of the Wine loader of its width, first choice first).
set(CMAKE_C_COMPILER ${TESU_MINGW_TRIPLE}-gcc-posix)
set(CMAKE_CXX_COMPILER ${TESU_MINGW_TRIPLE}-g++-posix)
set(CMAKE_RC_COMPILER ${TESU_MINGW_TRIPLE}-windres)

# Headers and libraries of the target (zlib from libz-mingw-w64-dev lives there); programs
# of the build machine.
set(CMAKE_FIND_ROOT_PATH /usr/${TESU_MINGW_TRIPLE})
set(CMAKE_FIND_ROOT_PATH_MODE_PROGRAM NEVER)
set(CMAKE_FIND_ROOT_PATH_MODE_LIBRARY ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_INCLUDE ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_PACKAGE ONLY)
# Static zlib: one DLL fewer to ship beside the libraries.
set(ZLIB_USE_STATIC_LIBS ON)

# The C and C++ runtimes (libgcc, libstdc++, winpthread) are MinGW's DLLs, shared by every
# module: the project's CMakeLists copies them beside the programs (cmake/TesuMingwRuntime.cmake).

# Programs and DLLs side by side in <build>/bin: the Windows loader finds DLLs beside the
# program, and the installation prefix (the folder above libPortability's) is <build>, as on
# Linux.
set(CMAKE_RUNTIME_OUTPUT_DIRECTORY ${CMAKE_BINARY_DIR}/bin)

# Test programs (and test discovery at build time) run under Wine, through the loader of the
# target's width: Debian's /usr/bin/wine runs the 32-bit loader whenever wine32 is installed,
# which cannot start a 64-bit program (nor anything, on a kernel without 32-bit support). The
# loader is TESU_WINE_EXECUTABLE (-D, else the environment variable of that name, else found);
# a CMAKE_CROSSCOMPILING_EMULATOR given with -D wins over it.
if(DEFINED ENV{TESU_WINE_EXECUTABLE} AND NOT "$ENV{TESU_WINE_EXECUTABLE}" STREQUAL "")
  set(TESU_WINE_EXECUTABLE "$ENV{TESU_WINE_EXECUTABLE}" CACHE FILEPATH "Wine loader of the tests")
endif()
find_program(TESU_WINE_EXECUTABLE NAMES ${TESU_WINE_NAMES} HINTS /usr/lib/wine)
if(TESU_WINE_EXECUTABLE AND NOT CMAKE_CROSSCOMPILING_EMULATOR)
  set(CMAKE_CROSSCOMPILING_EMULATOR ${TESU_WINE_EXECUTABLE})
endif()

# Neither Google Benchmark nor a Windows JVM is there for the cross-build.
set(TESU_BUILD_BENCHMARKS OFF CACHE BOOL "Build the benchmarks")
set(TESU_BUILD_JAVA OFF CACHE BOOL "Build the Java class and demo (needs a JDK)")

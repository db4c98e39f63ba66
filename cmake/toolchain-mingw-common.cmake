# The part of the MinGW-w64 toolchain files that both processors share. The including file
# sets CMAKE_SYSTEM_NAME, CMAKE_SYSTEM_PROCESSOR and TESU_MINGW_TRIPLE.
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

# Test programs (and test discovery at build time) run under Wine.
find_program(TESU_WINE_EXECUTABLE NAMES wine wine64)
if(TESU_WINE_EXECUTABLE)
  set(CMAKE_CROSSCOMPILING_EMULATOR ${TESU_WINE_EXECUTABLE})
endif()

# Neither Google Benchmark nor a Windows JVM is there for the cross-build.
set(TESU_BUILD_BENCHMARKS OFF CACHE BOOL "Build the benchmarks")
set(TESU_BUILD_JAVA OFF CACHE BOOL "Build the Java class and demo (needs a JDK)")

# The MinGW-w64 C and C++ runtimes as DLLs, shared by every module of the process.
#
# One runtime for all modules gives one std::cerr, one operator new and, on i686, one
# DWARF-2 unwinder that knows every module's frames: with a runtime linked into each DLL, an
# exception thrown in one DLL and caught in another ends the process there. The DLLs are
# copied beside the programs of the build tree (CMAKE_RUNTIME_OUTPUT_DIRECTORY), where the
# Windows loader, and Wine, look first, and are installed beside the libraries.

set(_tesu_runtime_names libstdc++-6.dll libwinpthread-1.dll)
if(CMAKE_SIZEOF_VOID_P EQUAL 4)
  list(APPEND _tesu_runtime_names libgcc_s_dw2-1.dll)
else()
  list(APPEND _tesu_runtime_names libgcc_s_seh-1.dll)
endif()

set(TESU_MINGW_RUNTIME_DLLS "")
foreach(_name IN LISTS _tesu_runtime_names)
  execute_process(COMMAND ${CMAKE_CXX_COMPILER} -print-file-name=${_name}
                  OUTPUT_VARIABLE _path OUTPUT_STRIP_TRAILING_WHITESPACE)
  if(NOT IS_ABSOLUTE "${_path}" OR NOT EXISTS "${_path}")
    message(FATAL_ERROR "The MinGW runtime DLL ${_name} was not found by ${CMAKE_CXX_COMPILER}")
  endif()
  get_filename_component(_path "${_path}" REALPATH)
  list(APPEND TESU_MINGW_RUNTIME_DLLS "${_path}")
endforeach()

if(CMAKE_RUNTIME_OUTPUT_DIRECTORY)
  file(COPY ${TESU_MINGW_RUNTIME_DLLS} DESTINATION ${CMAKE_RUNTIME_OUTPUT_DIRECTORY})
endif()
if(TESU_INSTALL)
  install(FILES ${TESU_MINGW_RUNTIME_DLLS} DESTINATION ${CMAKE_INSTALL_BINDIR})
endif()

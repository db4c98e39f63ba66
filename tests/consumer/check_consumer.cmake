# Installs BUILD_DIR into WORK_DIR/prefix, builds the consumer project PROJECT_DIR against it
# and runs it, then runs the installed tesutil on its installed sample installation.
cmake_minimum_required(VERSION 3.20)

function(run_step what)
  execute_process(COMMAND ${ARGN} RESULT_VARIABLE result OUTPUT_VARIABLE output
                  ERROR_VARIABLE output)
  if(NOT result EQUAL 0)
    message(FATAL_ERROR "${what} failed (${result}):\n${output}")
  endif()
  set(step_output "${output}" PARENT_SCOPE)
endfunction()

set(prefix ${WORK_DIR}/prefix)
file(REMOVE_RECURSE ${WORK_DIR})

set(config_args)
if(CONFIG)
  set(config_args --config ${CONFIG})
endif()
run_step("installing the build" ${CMAKE_COMMAND} --install ${BUILD_DIR} --prefix ${prefix}
         ${config_args})

foreach(installed lib/cmake/TesuUtilities/TesuUtilitiesConfig.cmake
                  lib/cmake/TesuUtilities/TesuUtilitiesConfigVersion.cmake
                  include/tesu/Tesu_Utilities.h include/tesu/Port_String.h)
  if(NOT EXISTS ${prefix}/${installed})
    message(FATAL_ERROR "not installed: ${installed}")
  endif()
endforeach()
foreach(internal Tesu_FileListMember.h Tesu_ChecksumKernel.h Tesu_ChecksumScanner.h)
  if(EXISTS ${prefix}/include/tesu/${internal})
    message(FATAL_ERROR "an internal header was installed: ${internal}")
  endif()
endforeach()

run_step("configuring the consumer" ${CMAKE_COMMAND} -S ${PROJECT_DIR} -B ${WORK_DIR}/build
         -G ${GENERATOR} -DCMAKE_PREFIX_PATH=${prefix} -DCMAKE_CXX_COMPILER=${CXX_COMPILER}
         "-DCMAKE_CXX_FLAGS=${CXX_FLAGS}" "-DCMAKE_EXE_LINKER_FLAGS=${EXE_LINKER_FLAGS}"
         -DCMAKE_BUILD_TYPE=${CONFIG})
run_step("building the consumer" ${CMAKE_COMMAND} --build ${WORK_DIR}/build ${config_args})

set(consumer)
foreach(candidate consumer consumer.exe ${CONFIG}/consumer ${CONFIG}/consumer.exe)
  if(NOT consumer AND EXISTS ${WORK_DIR}/build/${candidate})
    set(consumer ${WORK_DIR}/build/${candidate})
  endif()
endforeach()
if(NOT consumer)
  message(FATAL_ERROR "the consumer program was not built")
endif()
run_step("running the consumer" ${consumer})
if(NOT step_output STREQUAL "consumer: OK\n")
  message(FATAL_ERROR "unexpected consumer output:\n${step_output}")
endif()

# The installed tool, left to find its roots by itself, runs on the installed sample.
run_step("running the installed tesutil" ${CMAKE_COMMAND} -E env --unset=TESSEL_ROOTS
         ${prefix}/bin/${TOOL_NAME} cores-level)
if(NOT step_output STREQUAL "Cores Update # 7\n")
  message(FATAL_ERROR "unexpected output of the installed tesutil:\n${step_output}")
endif()
message(STATUS "the installed package builds a consumer, and the installed tool runs")

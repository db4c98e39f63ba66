# Installs BUILD_DIR into WORK_DIR/prefix and checks the installation as a user of it would:
# each installed header compiles alone (the bridge's also with the JDK's jni.h before and
# after it, when the build found one); the consumer project PROJECT_DIR builds against it with
# find_package and runs; its main.cpp builds with the compiler alone and pkg-config's flags
# (when PKG_CONFIG is set) and runs; the installed tesutil runs on its installed sample
# installation; the installed jar (JAR, when set) holds the product class and a versioned
# manifest only.
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
foreach(installed ${LIBDIR}/pkgconfig/tesu-utilities.pc share/doc/TesuUtilities/LICENSE
                  share/doc/TesuUtilities/CHANGELOG.md)
  if(NOT EXISTS ${prefix}/${installed})
    message(FATAL_ERROR "not installed: ${installed}")
  endif()
endforeach()
foreach(internal Tesu_FileListMember.h Tesu_Jni.h Tesu_ChecksumKernel.h Tesu_ChecksumScanner.h)
  if(EXISTS ${prefix}/include/tesu/${internal})
    message(FATAL_ERROR "an internal header was installed: ${internal}")
  endif()
endforeach()
file(GLOB_RECURSE demo_host ${prefix}/*TesuJavaHost*)
if(demo_host)
  message(FATAL_ERROR "the Java demo's host library was installed: ${demo_host}")
endif()

# Each installed header alone, in a source of its own, warnings as errors.
set(strict -Wall -Wextra -Wpedantic -Werror -fsyntax-only)
file(GLOB headers RELATIVE ${prefix}/include/tesu ${prefix}/include/tesu/*.h)
foreach(header IN LISTS headers)
  set(source ${WORK_DIR}/headers/${header}.cpp)
  file(WRITE ${source} "#include \"${header}\"\n")
  run_step("compiling the installed ${header} alone" ${CXX_COMPILER} -std=c++17 ${strict}
           -I${prefix}/include/tesu ${source})
endforeach()

# The bridge's header declares the JNI types as the JDK's jni.h does: in C and C++, alone and
# with jni.h on either side of it, its functions have the type of a JNI native method.
set(bridge Tesu_Tessel2MessageCatcher.h)
string(CONCAT use "void (TESU_JNI_CALL *const method)(JNIEnv*, jobject, jstring) =\n"
       "    &Java_com_quarnel_tesutil_tessel2_Tessel2MessageCatcher_outputInfoMessageN;\n")
set(orders "${bridge}")
set(jni_flags)
if(JNI_INCLUDE_DIRS)
  list(APPEND orders "jni.h|${bridge}" "${bridge}|jni.h")
  string(REPLACE "|" ";" jni_flags "${JNI_INCLUDE_DIRS}")
  list(TRANSFORM jni_flags PREPEND -I)
endif()
set(case 0)
foreach(order IN LISTS orders)
  string(REPLACE "|" ";" order "${order}")
  set(text "")
  foreach(header IN LISTS order)
    string(APPEND text "#include \"${header}\"\n")
  endforeach()
  string(APPEND text "${use}")
  math(EXPR case "${case} + 1")
  foreach(language c cpp)
    set(source ${WORK_DIR}/headers/bridge_${case}.${language})
    file(WRITE ${source} "${text}")
    if(language STREQUAL c)
      set(compile ${C_COMPILER} -std=c11)
    else()
      set(compile ${CXX_COMPILER} -std=c++17)
    endif()
    run_step("compiling ${order} (${language})" ${compile} ${strict} -I${prefix}/include/tesu
             ${jni_flags} ${source})
  endforeach()
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

# A plain compiler call with pkg-config's flags; the program finds the libraries through
# LD_LIBRARY_PATH.
if(PKG_CONFIG)
  set(ENV{PKG_CONFIG_PATH} ${prefix}/${LIBDIR}/pkgconfig)
  run_step("pkg-config --modversion" ${PKG_CONFIG} --modversion tesu-utilities)
  if(NOT step_output STREQUAL "${VERSION}\n")
    message(FATAL_ERROR "pkg-config gives version ${step_output}, expected ${VERSION}")
  endif()
  run_step("pkg-config --cflags --libs" ${PKG_CONFIG} --cflags --libs tesu-utilities)
  separate_arguments(pc_flags UNIX_COMMAND "${step_output}")
  separate_arguments(own_flags UNIX_COMMAND "${CXX_FLAGS} ${EXE_LINKER_FLAGS}")
  set(plain ${WORK_DIR}/plain_consumer)
  run_step("building the consumer with pkg-config's flags" ${CXX_COMPILER} ${own_flags}
           ${PROJECT_DIR}/main.cpp ${pc_flags} -o ${plain})
  run_step("running the pkg-config consumer" ${CMAKE_COMMAND} -E env
           "LD_LIBRARY_PATH=${prefix}/${LIBDIR}" ${plain})
  if(NOT step_output STREQUAL "consumer: OK\n")
    message(FATAL_ERROR "unexpected output of the pkg-config consumer:\n${step_output}")
  endif()
else()
  message(STATUS "no pkg-config program: the pkg-config build was not tried")
endif()

# The jar: the product class and the manifest, which names the version.
if(JAR)
  if(NOT EXISTS ${prefix}/${JAR})
    message(FATAL_ERROR "not installed: ${JAR}")
  endif()
  run_step("listing the jar" ${CMAKE_COMMAND} -E tar tf ${prefix}/${JAR})
  string(REGEX REPLACE "\n$" "" entries "${step_output}")
  string(REPLACE "\n" ";" entries "${entries}")
  list(FILTER entries EXCLUDE REGEX "/$")
  list(SORT entries)
  if(NOT entries STREQUAL "META-INF/MANIFEST.MF;com/quarnel/tesutil/tessel2/Tessel2MessageCatcher.class")
    message(FATAL_ERROR "the jar holds other files than the product class:\n${entries}")
  endif()
  file(ARCHIVE_EXTRACT INPUT ${prefix}/${JAR} DESTINATION ${WORK_DIR}/jar)
  file(STRINGS ${WORK_DIR}/jar/META-INF/MANIFEST.MF manifest)
  if(NOT "Implementation-Version: ${VERSION}" IN_LIST manifest)
    message(FATAL_ERROR "the jar's manifest names no version ${VERSION}:\n${manifest}")
  endif()
endif()

# The installed tool, left to find its roots by itself, runs on the installed sample.
run_step("running the installed tesutil" ${CMAKE_COMMAND} -E env --unset=TESSEL_ROOTS
         ${prefix}/bin/${TOOL_NAME} cores-level)
if(NOT step_output STREQUAL "Cores Update # 7\n")
  message(FATAL_ERROR "unexpected output of the installed tesutil:\n${step_output}")
endif()
message(STATUS "the installed headers compile alone, the package builds consumers with CMake "
               "and pkg-config, and the installed tool runs")

# JNI headers for the bridge: the JDK's jni.h when one is found, else the library's own
# declarations (s/Tesu_Jni.h). Either way the library needs no JVM library at link time (the
# JVM loads it). Sets TESU_HAVE_JNI_H and TESU_JNI_INCLUDE_DIRS, and makes the interface
# target tesu_jni, which the bridge's sources, its tests and the Java host link to.
set(TESU_HAVE_JNI_H OFF)
set(TESU_JNI_INCLUDE_DIRS "")
if(WIN32 AND CMAKE_CROSSCOMPILING)
  include(${CMAKE_CURRENT_LIST_DIR}/jni-windows/TesuJniWindows.cmake)
else()
  find_package(JNI QUIET COMPONENTS JVM)
  if(JNI_FOUND)
    set(TESU_HAVE_JNI_H ON)
    set(TESU_JNI_INCLUDE_DIRS ${JNI_INCLUDE_DIRS})
  endif()
endif()

add_library(tesu_jni INTERFACE)
if(TESU_HAVE_JNI_H)
  list(GET TESU_JNI_INCLUDE_DIRS 0 _tesu_jni_shown)
  message(STATUS "JNI: the JDK's jni.h (${_tesu_jni_shown})")
  target_include_directories(tesu_jni INTERFACE ${TESU_JNI_INCLUDE_DIRS})
  target_compile_definitions(tesu_jni INTERFACE TESU_HAVE_JNI_H)
else()
  message(STATUS "JNI: no JDK's jni.h found; the bridge uses the library's own JNI declarations")
endif()

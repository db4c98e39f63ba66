# JNI headers for a Windows cross-build: the JDK's jni.h with this folder's jni_md.h, which
# comes first on the include path. Sets JNI_INCLUDE_DIRS as FindJNI would; no JVM library is
# needed (the JVM loads the library).
find_path(TESU_JNI_H_DIR jni.h
  HINTS "${JAVA_HOME}/include" "$ENV{JAVA_HOME}/include"
  PATHS /usr/lib/jvm/default-java/include
  NO_CMAKE_FIND_ROOT_PATH)
if(NOT TESU_JNI_H_DIR)
  message(FATAL_ERROR "jni.h not found: set JAVA_HOME to a JDK")
endif()
set(JNI_INCLUDE_DIRS "${CMAKE_CURRENT_LIST_DIR}" "${TESU_JNI_H_DIR}")
message(STATUS "JNI for Windows: ${TESU_JNI_H_DIR}/jni.h with ${CMAKE_CURRENT_LIST_DIR}/jni_md.h")

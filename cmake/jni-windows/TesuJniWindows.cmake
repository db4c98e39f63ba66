# JNI headers for a Windows cross-build: the JDK's jni.h with this folder's jni_md.h, which
# comes first on the include path. Sets TESU_HAVE_JNI_H and TESU_JNI_INCLUDE_DIRS when a
# JDK's jni.h is found; without one the library's own declarations serve (cmake/TesuJni.cmake).
find_path(TESU_JNI_H_DIR jni.h
  HINTS "${JAVA_HOME}/include" "$ENV{JAVA_HOME}/include"
  PATHS /usr/lib/jvm/default-java/include
  NO_CMAKE_FIND_ROOT_PATH)
if(TESU_JNI_H_DIR AND NOT CMAKE_DISABLE_FIND_PACKAGE_JNI)
  set(TESU_HAVE_JNI_H ON)
  set(TESU_JNI_INCLUDE_DIRS "${CMAKE_CURRENT_LIST_DIR}" "${TESU_JNI_H_DIR}")
endif()

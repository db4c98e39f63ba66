# Points FindJNI and FindJava at the JDK of the `javac` on the PATH when JAVA_HOME is not set,
# so that the JDK that the machine's tools use is the one the build uses.
if(NOT DEFINED ENV{JAVA_HOME} AND NOT JAVA_HOME)
  find_program(TESU_JAVAC_EXECUTABLE javac)
  if(TESU_JAVAC_EXECUTABLE)
    get_filename_component(_tesu_javac_real "${TESU_JAVAC_EXECUTABLE}" REALPATH)
    get_filename_component(_tesu_jdk_bin "${_tesu_javac_real}" DIRECTORY)
    get_filename_component(_tesu_jdk "${_tesu_jdk_bin}" DIRECTORY)
    set(JAVA_HOME "${_tesu_jdk}" CACHE PATH "JDK used by the build")
  endif()
endif()
if(JAVA_HOME)
  set(ENV{JAVA_HOME} "${JAVA_HOME}")
endif()

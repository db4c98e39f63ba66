# Runs the Java bridge check program and compares its standard error stream, byte for byte,
# with the lines the bridge must produce. Arguments (-D): JAVA, JARS (separated by "|"),
# LIBRARY, HOST_LIBRARY, STDERR_FILE, and PRELOAD (a sanitizer runtime to preload, or empty).
foreach(var JAVA JARS LIBRARY HOST_LIBRARY STDERR_FILE)
  if(NOT DEFINED ${var})
    message(FATAL_ERROR "${var} is not set")
  endif()
endforeach()

if(CMAKE_HOST_WIN32)
  string(REPLACE "|" ";" classpath "${JARS}")
else()
  string(REPLACE "|" ":" classpath "${JARS}")
endif()

if(PRELOAD)
  set(ENV{LD_PRELOAD} "${PRELOAD}")
  set(ENV{ASAN_OPTIONS} "$ENV{ASAN_OPTIONS}:handle_segv=0:allow_user_segv_handler=1:detect_leaks=0")
endif()

execute_process(
  COMMAND "${JAVA}" -cp "${classpath}" "-Dtesu.library=${LIBRARY}"
          "-Dtesu.host.library=${HOST_LIBRARY}" com.quarnel.tesutil.tessel2.check.BridgeCheck
  RESULT_VARIABLE result
  OUTPUT_VARIABLE out
  ERROR_FILE "${STDERR_FILE}")
file(READ "${STDERR_FILE}" stderr_hex HEX)

# The expected standard error, as hex, one line at a time.
set(expected "")
function(expect_hex hex)
  set(expected "${expected}${hex}0a" PARENT_SCOPE)
endfunction()
function(expect_line text)
  string(HEX "${text}" hex)
  set(expected "${expected}${hex}0a" PARENT_SCOPE)
endfunction()
function(expect_all_four text_hex)
  string(HEX "WARNING:tesutil - " warning)
  string(HEX "ERROR:tesutil - " error)
  string(HEX "DEBUG[javavm] - " debug)
  set(expected "${expected}${text_hex}0a${warning}${text_hex}0a${error}${text_hex}0a${debug}${text_hex}0a"
      PARENT_SCOPE)
endfunction()

string(HEX "plain text" plain)
expect_all_four("${plain}")
expect_all_four("")
string(HEX "%s%d%n %x %%" formats)
expect_all_four("${formats}")
# "Grüße 漢字 a<NUL>b <U+1F600>" in the JVM's modified UTF-8: the NUL as c0 80 and the
# character outside the BMP as two encoded surrogates.
expect_all_four("4772c3bcc39f6520e6bca2e5ad972061c0806220eda0bdedb880")
expect_line("-- null texts and debug off --")
expect_line("-- end --")

set(failed FALSE)
if(NOT result EQUAL 0)
  message(SEND_ERROR "the JVM exited with '${result}', expected 0\nstdout:\n${out}")
  set(failed TRUE)
endif()

# The expected block must appear whole and contiguous (the JVM may add its own lines around
# it), starting on a byte boundary.
string(FIND "${stderr_hex}" "${expected}" at)
math(EXPR odd "${at} % 2")
if(at EQUAL -1 OR NOT odd EQUAL 0)
  message(SEND_ERROR "standard error does not hold the expected lines in order "
                     "(see ${STDERR_FILE})\nexpected (hex): ${expected}\ngot (hex):      ${stderr_hex}")
  set(failed TRUE)
endif()

if(NOT failed)
  message(STATUS "Java bridge: all expected lines on standard error, JVM exit status 0")
endif()

# Included by the top-level CMakeLists.txt before any target is made when TESU_BUILD_FUZZERS is
# on: every target of the build folder (the two libraries above all) is compiled with
# AddressSanitizer, UndefinedBehaviorSanitizer and libFuzzer's coverage instrumentation, so that
# the harnesses see into the libraries and every report stops the run.
if(NOT CMAKE_CXX_COMPILER_ID MATCHES "Clang")
  message(FATAL_ERROR "TESU_BUILD_FUZZERS needs clang (libFuzzer); configure with "
                      "-DCMAKE_CXX_COMPILER=clang++ -DCMAKE_C_COMPILER=clang")
endif()
add_compile_options(-fsanitize=address,undefined,fuzzer-no-link -fno-sanitize-recover=all
                    -fno-omit-frame-pointer)
add_link_options(-fsanitize=address,undefined)

#!/usr/bin/env bash
# The tests that issue messages, look loggers up and build init objects on several threads at
# once, built with ThreadSanitizer (clang). Any data race or lock-order report fails CI. The
# whole tree is built here, so clang's warnings (as errors) are checked on every file too.
#   scripts/ci-tsan.sh       build folder build/tsan (TESU_TSAN_BUILD_DIR overrides)
set -euo pipefail
cd "$(dirname "$0")/.."

jobs=$(nproc 2>/dev/null || echo 2)
build=${TESU_TSAN_BUILD_DIR:-build/tsan}
tests=(threads_test registry_test port_msg_test port_init_test)

echo "== ThreadSanitizer build ($build)"
flags="-fsanitize=thread -fno-omit-frame-pointer"
cmake -S . -B "$build" -G Ninja -DCMAKE_BUILD_TYPE=RelWithDebInfo -DTESU_WERROR=ON \
  -DCMAKE_C_COMPILER=clang -DCMAKE_CXX_COMPILER=clang++ \
  -DCMAKE_C_FLAGS="$flags" -DCMAKE_CXX_FLAGS="$flags" \
  -DCMAKE_EXE_LINKER_FLAGS=-fsanitize=thread -DCMAKE_SHARED_LINKER_FLAGS=-fsanitize=thread \
  -DTESU_BUILD_BENCHMARKS=OFF -DTESU_BUILD_JAVA=OFF -DTESU_INSTALL=OFF
cmake --build "$build" -j "$jobs"

echo "== Threads under ThreadSanitizer"
export TSAN_OPTIONS=halt_on_error=1:second_deadlock_stack=1
for test in "${tests[@]}"; do
  "$build/tests/$test" --gtest_brief=1
done

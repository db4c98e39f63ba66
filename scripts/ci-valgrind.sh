#!/usr/bin/env bash
# Runs every unit test program of a build under valgrind's memcheck: any invalid read or
# write, use of uninitialised memory, bad free, or definite leak fails CI.
#   scripts/ci-valgrind.sh [BUILD_DIR]    default build/ci (the build of scripts/test.sh),
#                                          configured and built here if it is missing
# Not run under valgrind: the Java bridge test (a JVM, not one of the library's programs) and
# the benchmarks (timing only); both run elsewhere in CI.
set -euo pipefail
cd "$(dirname "$0")/.."

if ! command -v valgrind >/dev/null; then
  sudo_cmd=""
  [ "$(id -u)" -ne 0 ] && sudo_cmd="sudo"
  $sudo_cmd apt-get update -qq
  DEBIAN_FRONTEND=noninteractive $sudo_cmd apt-get install -y -qq valgrind
fi

jobs=$(nproc 2>/dev/null || echo 2)
build=${1:-${TESU_BUILD_DIR:-build/ci}}
if ! ls "$build"/tests/*_test >/dev/null 2>&1; then
  cmake -S . -B "$build" -G Ninja -DCMAKE_BUILD_TYPE=RelWithDebInfo -DTESU_WERROR=ON
  cmake --build "$build" -j "$jobs"
fi
build=$(cd "$build" && pwd)
logs="$build/valgrind"
rm -rf "$logs"
mkdir -p "$logs"

# --keep-debuginfo names the code of a library after it was unloaded (the suppression needs
# it); nouserintercepts leaves a test program's own operator new and delete to it.
run_one() {
  local program=$1 log=$2
  valgrind --tool=memcheck --error-exitcode=1 --leak-check=full \
    --errors-for-leak-kinds=definite --show-leak-kinds=definite --track-origins=yes \
    --keep-debuginfo=yes --soname-synonyms=somalloc=nouserintercepts \
    --suppressions=scripts/ci-valgrind.supp -q \
    "$program" --gtest_brief=1 >"$log" 2>&1
}
export -f run_one

echo "== Unit tests under valgrind (memcheck)"
programs=("$build"/tests/*_test)
printf '%s\n' "${programs[@]}" |
  xargs -P "$jobs" -I{} bash -c 'run_one "$1" "$2/$(basename "$1").log" || touch "$2/$(basename "$1").failed"' _ {} "$logs"

failed=0
for program in "${programs[@]}"; do
  name=$(basename "$program")
  if [ -e "$logs/$name.failed" ]; then
    echo "FAILED under valgrind: $name"
    cat "$logs/$name.log"
    failed=$((failed + 1))
  fi
done
echo "valgrind: ${#programs[@]} test programs, $failed failed."
[ "$failed" -eq 0 ]

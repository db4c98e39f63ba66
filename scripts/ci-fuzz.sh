#!/usr/bin/env bash
# Builds the libFuzzer harnesses of fuzz/ with clang (AddressSanitizer, UndefinedBehaviorSanitizer
# and the fuzzer's coverage, on the two libraries too) and runs each for TESU_FUZZ_SECONDS
# (default 60) from its seed corpus in fuzz/corpus/<name>/. A crash, a sanitizer report, a
# failed property, a leak or an input that runs longer than 25 seconds fails CI; the input is
# kept in <build>/work/<name>/.
#   scripts/ci-fuzz.sh       build folder build/fuzz (TESU_FUZZ_BUILD_DIR overrides)
set -euo pipefail
cd "$(dirname "$0")/.."

jobs=$(nproc 2>/dev/null || echo 2)
build=${TESU_FUZZ_BUILD_DIR:-build/fuzz}
seconds=${TESU_FUZZ_SECONDS:-60}

echo "== Fuzzer build ($build)"
cmake -S . -B "$build" -G Ninja -DCMAKE_BUILD_TYPE=RelWithDebInfo -DTESU_WERROR=ON \
  -DCMAKE_C_COMPILER=clang -DCMAKE_CXX_COMPILER=clang++ -DTESU_BUILD_FUZZERS=ON \
  -DTESU_BUILD_TESTS=OFF -DTESU_BUILD_BENCHMARKS=OFF -DTESU_BUILD_JAVA=OFF -DTESU_INSTALL=OFF
cmake --build "$build" -j "$jobs" --target fuzzers
build=$(cd "$build" && pwd)

run_one() {
  local name=$1 build=$2 seconds=$3
  local work="$build/work/$name"
  mkdir -p "$work/corpus"
  UBSAN_OPTIONS=halt_on_error=1:print_stacktrace=1 \
    "$build/fuzz/${name}_fuzz" -max_total_time="$seconds" -timeout=25 -print_final_stats=1 \
    -artifact_prefix="$work/" "$work/corpus" "fuzz/corpus/$name" >"$work/log" 2>&1
}
export -f run_one

names=()
for source in fuzz/*_fuzz.cpp; do
  name=$(basename "$source" _fuzz.cpp)
  names+=("$name")
  rm -f "$build/work/$name/failed"
done

echo "== Fuzzing ${#names[@]} harnesses for $seconds s each, $jobs at a time"
printf '%s\n' "${names[@]}" |
  xargs -P "$jobs" -I{} bash -c 'run_one "$1" "$2" "$3" || touch "$2/work/$1/failed"' _ {} "$build" "$seconds"

failed=0
for name in "${names[@]}"; do
  log="$build/work/$name/log"
  if [ -e "$build/work/$name/failed" ]; then
    echo "FAILED: fuzzing $name"
    tail -n 80 "$log"
    failed=$((failed + 1))
  else
    runs=$(sed -n 's/^stat::number_of_executed_units: *//p' "$log")
    last=$(grep -E '^#[0-9]+[[:space:]]+DONE' "$log" | tail -n 1 | grep -oE 'cov: [0-9]+ ft: [0-9]+')
    echo "$name: $runs runs, $last"
  fi
done
[ "$failed" -eq 0 ]

#!/usr/bin/env bash
# Builds everything with warnings as errors and runs every test: the RelWithDebInfo build and
# its CTest suite, the unit tests again as an unprivileged user, the Windows cross-builds with
# their tests under Wine, AddressSanitizer + UBSan, valgrind, the fuzzers and ThreadSanitizer.
# Any failure stops it with a non-zero status.
# Build folder of the main build: build/ci (override with TESU_BUILD_DIR).
set -euo pipefail
cd "$(dirname "$0")/.."

bash scripts/install-deps.sh

jobs=$(nproc 2>/dev/null || echo 2)
build=${TESU_BUILD_DIR:-build/ci}

echo "== Formatting"
bash scripts/check-format.sh

echo "== Build ($build): RelWithDebInfo, warnings as errors"
cmake -S . -B "$build" -G Ninja -DCMAKE_BUILD_TYPE=RelWithDebInfo -DTESU_WERROR=ON
cmake --build "$build" -j "$jobs"

echo "== Tests"
ctest --test-dir "$build" --output-on-failure -j "$jobs" | tee "$build/ctest-summary.log"
summary=$(grep -E "tests passed, [0-9]+ tests failed out of [0-9]+" "$build/ctest-summary.log")

echo "== Unit tests as an unprivileged user (the file-permission cases)"
bash scripts/test-unprivileged.sh "$(cd "$build" && pwd)"
bash scripts/ci-windows.sh
bash scripts/ci-sanitizers.sh
bash scripts/ci-valgrind.sh "$build"
bash scripts/ci-fuzz.sh
bash scripts/ci-tsan.sh

# The main suite's count, as the last line.
total=$(sed -E 's/.* out of ([0-9]+)$/\1/' <<<"$summary")
failed=$(sed -E 's/.*, ([0-9]+) tests failed.*/\1/' <<<"$summary")
echo "All CI jobs passed; the main suite's count:"
echo "ctest: $((total - failed)) passed, $failed failed"

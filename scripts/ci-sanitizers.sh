#!/usr/bin/env bash
# The whole test suite built with AddressSanitizer and UndefinedBehaviorSanitizer (the flags of
# the `asan` preset: -fsanitize=address,undefined -fno-sanitize-recover=all) and run with leak
# detection. The first report of either sanitizer ends the test program, so CI fails on any.
#   scripts/ci-sanitizers.sh      build folder build/asan (TESU_ASAN_BUILD_DIR overrides)
set -euo pipefail
cd "$(dirname "$0")/.."

jobs=$(nproc 2>/dev/null || echo 2)
build=${TESU_ASAN_BUILD_DIR:-build/asan}

echo "== AddressSanitizer + UndefinedBehaviorSanitizer build ($build)"
cmake --preset asan -B "$build" -DTESU_WERROR=ON
cmake --build "$build" -j "$jobs"

echo "== Tests under AddressSanitizer + UndefinedBehaviorSanitizer"
export ASAN_OPTIONS=halt_on_error=1:detect_leaks=1:check_initialization_order=1:detect_stack_use_after_return=1
export UBSAN_OPTIONS=halt_on_error=1:print_stacktrace=1
ctest --test-dir "$build" --output-on-failure -j "$jobs"

echo "== The same unit tests as an unprivileged user (the file-permission cases)"
bash scripts/test-unprivileged.sh "$(cd "$build" && pwd)"

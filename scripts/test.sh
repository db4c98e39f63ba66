#!/usr/bin/env bash
# Builds everything with warnings as errors and runs every test.
#   scripts/test.sh            the RelWithDebInfo build and its tests
# Build folder: build/ci (override with TESU_BUILD_DIR).
set -euo pipefail
cd "$(dirname "$0")/.."

bash scripts/install-deps.sh

jobs=$(nproc 2>/dev/null || echo 2)
build=${TESU_BUILD_DIR:-build/ci}

echo "== Build ($build): RelWithDebInfo, warnings as errors"
cmake -S . -B "$build" -G Ninja -DCMAKE_BUILD_TYPE=RelWithDebInfo -DTESU_WERROR=ON
cmake --build "$build" -j "$jobs"

echo "== Tests"
ctest --test-dir "$build" --output-on-failure -j "$jobs"

echo "== Unit tests as an unprivileged user (the file-permission cases)"
bash scripts/test-unprivileged.sh "$(cd "$build" && pwd)"
bash scripts/ci-windows.sh
bash scripts/ci-sanitizers.sh
bash scripts/ci-valgrind.sh "$build"
bash scripts/ci-fuzz.sh
bash scripts/ci-tsan.sh

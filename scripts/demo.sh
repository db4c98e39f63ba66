#!/usr/bin/env bash
# Builds the library and the tool and runs the demonstration.
set -euo pipefail
cd "$(dirname "$0")/.."

bash scripts/install-deps.sh

jobs=$(nproc 2>/dev/null || echo 2)
build=${TESU_BUILD_DIR:-build/default}

cmake -S . -B "$build" -G Ninja -DCMAKE_BUILD_TYPE=RelWithDebInfo >/dev/null
cmake --build "$build" -j "$jobs"

echo "== tesutil debug-demo --debug verbose"
"$build/tools/tesutil" debug-demo --debug verbose

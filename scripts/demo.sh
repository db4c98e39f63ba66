#!/usr/bin/env bash
# Builds the library, the tool and the Java demo (not the tests and benchmarks), says which
# CRC-32 backend CMake found, and runs the demonstration: a short tour of tesutil on the sample
# installation (examples/installation), then the Java message demo.
set -euo pipefail
cd "$(dirname "$0")/.."

bash scripts/install-deps.sh

jobs=$(nproc 2>/dev/null || echo 2)
build=${TESU_BUILD_DIR:-build/default}

echo "== Configuring ($build)"
config_log=$(mktemp)
cmake -S . -B "$build" -G Ninja -DCMAKE_BUILD_TYPE=RelWithDebInfo 2>&1 | tee "$config_log"
echo
echo "== The CRC-32 backend CMake found:"
grep -iE '^-- .*CRC' "$config_log" || echo "(CMake did not say)"
rm -f "$config_log"

# Only what the demonstration runs: the library, the tool, and the Java demo when there is a
# JDK (the tests and benchmarks are scripts/test.sh's business).
targets=$(cmake --build "$build" --target help 2>/dev/null || true)
demo_targets=(Tesu_Utilities tesutil)
java_demo=no
# (grep -q stopping early would break the pipe: the list of targets is taken whole first.)
if grep -q '^java-demo:' <<<"$targets"; then
  java_demo=yes
  demo_targets+=(tesu_java tesu_java_demo TesuJavaHost)
fi
echo
echo "== Building: ${demo_targets[*]}"
cmake --build "$build" -j "$jobs" --target "${demo_targets[@]}"

tesutil="$build/tools/tesutil"
demo=examples/installation/designs/demo
scratch=$(mktemp -d)
trap 'rm -rf "$scratch"' EXIT
# Without TESSEL_ROOTS and --roots the tool runs on the sample installation.
unset TESSEL_ROOTS

# Shows a command and everything it writes (standard error too), and its exit status when it
# is not 0.
run() {
  echo
  echo "\$ tesutil $*"
  local status=0
  "$tesutil" "$@" 2>&1 || status=$?
  if [ "$status" -ne 0 ]; then
    echo "(exit status $status)"
  fi
}

echo "== A tour of tesutil on the sample installation"
run --help
run version
run cores-level
run find IPupdate.log
run find --container component.xml
run java
echo; echo "\$ \$(tesutil java)    # the stub runtime says what it is"
"$("$tesutil" java)"
run filelist "$demo/sources.lst"
run filelist --paths "$demo/sources.lst"
run verify "$demo/settings.cfg" "$demo/pins.cfg" "$demo/timing.cfg"
run checksum "$demo/settings.cfg"
cp "$demo/timing.cfg" "$scratch/timing.cfg"
run stamp "$scratch/timing.cfg"
run verify "$scratch/timing.cfg"
run abspath "examples/../examples/installation//designs"
run absdir "$demo/settings.cfg"
run relpath examples/installation "$demo/pins.cfg"
run --debug verbose find --container doc/uart_lite.txt
run debug-demo --debug verbose
run relpath examples/installation

echo
echo "== The Java message demo"
if [ "$java_demo" = yes ]; then
  cmake --build "$build" --target java-demo
else
  echo "(not built: CMake found no JDK)"
fi

#!/usr/bin/env bash
# Builds the library and the tool and runs the demonstration: a short tour of tesutil on the
# sample installation (examples/installation), then the Java message demo.
set -euo pipefail
cd "$(dirname "$0")/.."

bash scripts/install-deps.sh

jobs=$(nproc 2>/dev/null || echo 2)
build=${TESU_BUILD_DIR:-build/default}

cmake -S . -B "$build" -G Ninja -DCMAKE_BUILD_TYPE=RelWithDebInfo >/dev/null
cmake --build "$build" -j "$jobs"

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
# (The list of targets is taken whole first: grep -q stopping early would break the pipe.)
targets=$(cmake --build "$build" --target help 2>/dev/null || true)
if grep -q '^java-demo:' <<<"$targets"; then
  cmake --build "$build" --target java-demo
else
  echo "(not built: CMake found no JDK)"
fi

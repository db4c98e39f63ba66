#!/usr/bin/env bash
# Runs the unit test programs of a build once more as an unprivileged user, so that the
# cases that depend on file permissions (skipped when running as root) run too.
#   scripts/test-unprivileged.sh BUILD_DIR
set -euo pipefail
build=${1:?usage: test-unprivileged.sh BUILD_DIR}

if [ "$(id -u)" -ne 0 ]; then
  echo "Not root: the permission cases ran with the rest."
  exit 0
fi
if ! command -v setpriv >/dev/null; then
  echo "setpriv is missing: the permission cases were skipped."
  exit 0
fi

as_nobody() { setpriv --reuid=65534 --regid=65534 --clear-groups env HOME=/tmp "$@"; }

first=$(ls "$build"/tests/*_test 2>/dev/null | head -n 1)
if [ -z "$first" ] || ! as_nobody test -x "$first"; then
  echo "The build folder is not reachable for an unprivileged user: the permission cases were skipped."
  exit 0
fi

failed=0
count=0
cd /tmp
for program in "$build"/tests/*_test; do
  [ -x "$program" ] || continue
  count=$((count + 1))
  if ! as_nobody "$program" --gtest_brief=1 >"/tmp/unprivileged-$$.log" 2>&1; then
    echo "FAILED as an unprivileged user: $program"
    cat "/tmp/unprivileged-$$.log"
    failed=$((failed + 1))
  fi
done
rm -f "/tmp/unprivileged-$$.log"
echo "Unprivileged run: $count test programs, $failed failed."
[ "$failed" -eq 0 ]

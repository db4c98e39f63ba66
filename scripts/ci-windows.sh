#!/usr/bin/env bash
# The Windows job: cross-builds with MinGW-w64, runs the unit tests under Wine, and checks the
# export table of libTesu_Utilities.dll.
#   scripts/ci-windows.sh
# Build folders: build/windows-x86_64 and build/windows-i686 (override the parent with
# TESU_WINDOWS_BUILD_ROOT). Each holds its own Wine prefix.
#
# What the machine can run is decided by running it: for each width, a small Windows program is
# built and started under that width's Wine loader (x86_64: /usr/lib/wine/wine64, i686:
# /usr/lib/wine/wine; override with TESU_WINE64 and TESU_WINE32). When it runs, the build's
# unit tests run under that loader, which the build also uses for test discovery. When it
# does not (no wine32, or a kernel that cannot run 32-bit programs), the library and the tool
# are still built and the exports checked, and one line says that the tests did not run and
# why. The job fails only for a failed build, export check or test.
set -euo pipefail
cd "$(dirname "$0")/.."

job_start=$(date +%s)
root=${TESU_WINDOWS_BUILD_ROOT:-build}
jobs=$(nproc 2>/dev/null || echo 2)
sudo_cmd=""
[ "$(id -u)" -ne 0 ] && sudo_cmd="sudo"

installed() {
  dpkg-query -W -f='${Status}' "$1" 2>/dev/null | grep -q "install ok installed"
}

elapsed() {
  echo "$(($(date +%s) - $1)) s"
}

# --- Tools -------------------------------------------------------------------------------
packages=(g++-mingw-w64-i686-posix g++-mingw-w64-x86-64-posix libz-mingw-w64-dev wine wine64
          cmake ninja-build)
missing=()
for p in "${packages[@]}"; do
  installed "$p" || missing+=("$p")
done
if [ ${#missing[@]} -gt 0 ]; then
  echo "== Installing: ${missing[*]}"
  $sudo_cmd apt-get update -qq || true
  DEBIAN_FRONTEND=noninteractive $sudo_cmd apt-get install -y -qq --no-install-recommends \
    "${missing[@]}" >/dev/null
fi

# wine32 through multiarch, which the i686 tests need. Having it proves nothing (the kernel
# may not run 32-bit programs): the probe below decides. When it cannot be had, the foreign
# architecture is taken away again (if nothing of it got installed), so that later apt-get
# runs do not fail on its lists.
if ! installed wine32:i386; then
  echo "== Trying wine32 (i386 multiarch)"
  added_i386=no
  if ! dpkg --print-foreign-architectures | grep -qx i386; then
    $sudo_cmd dpkg --add-architecture i386
    added_i386=yes
  fi
  $sudo_cmd apt-get update -qq >/dev/null 2>&1 || true
  if DEBIAN_FRONTEND=noninteractive $sudo_cmd apt-get install -y -qq --no-install-recommends \
       wine32:i386 >/tmp/tesu-wine32-install.log 2>&1; then
    echo "wine32 installed"
  else
    echo "wine32 could not be installed (last lines of apt-get):"
    tail -n 3 /tmp/tesu-wine32-install.log | sed 's/^/  /'
    if [ "$added_i386" = yes ] && [ -z "$(dpkg-query -W -f='${Package}:${Architecture}\n' 2>/dev/null | grep ':i386$' || true)" ]; then
      $sudo_cmd dpkg --remove-architecture i386
      $sudo_cmd apt-get update -qq >/dev/null 2>&1 || true
    fi
  fi
fi

# --- What runs here ----------------------------------------------------------------------
loader_of() {
  case $1 in
    x86_64) echo "${TESU_WINE64:-/usr/lib/wine/wine64}" ;;
    i686) echo "${TESU_WINE32:-/usr/lib/wine/wine}" ;;
  esac
}

# probe ARCH: builds a Windows program of that width and runs it under the width's loader in
# the build's Wine prefix (which the first run sets up). Sets probe_reason when it does not
# run; returns 0 when it runs and prints what it should.
probe_reason=""
probe() {
  local arch=$1
  local build="$root/windows-$arch" loader
  loader=$(loader_of "$arch")
  mkdir -p "$build/probe"
  local exe="$build/probe/probe.exe" log="$build/probe/run.log"
  printf '#include <stdio.h>\nint main(void) { puts("probe runs"); return 0; }\n' \
    >"$build/probe/probe.c"
  "$arch-w64-mingw32-gcc-posix" -o "$exe" "$build/probe/probe.c"
  export WINEDEBUG=-all
  export WINEPREFIX
  WINEPREFIX="$(cd "$build" && pwd)/wineprefix"
  local status=0
  # Through bash's exec, so that a loader the kernel cannot run says so ("Exec format error").
  timeout 300 bash -c 'exec "$@"' probe "$loader" "$exe" >"$log" 2>&1 || status=$?
  if [ $status -eq 0 ] && grep -q '^probe runs' "$log"; then
    return 0
  fi
  local said
  # What the loader said: its first line that names an error, else its last line.
  said=$(grep -m 1 -iE 'error|cannot|not found' "$log" || grep -v '^[[:space:]]*$' "$log" |
         tail -n 1 || true)
  said=${said#probe: line 1: }
  probe_reason="$loader exited with status $status${said:+: $said}"
  [ $status -eq 124 ] && probe_reason="$loader did not finish within 300 s"
  return 1
}

declare -A runs reason
declare -A width=([x86_64]=64-bit [i686]=32-bit)
for arch in x86_64 i686; do
  if probe "$arch"; then
    runs[$arch]=yes
    echo "== Probe: a ${width[$arch]} Windows program runs under $(loader_of "$arch")"
  else
    runs[$arch]=no
    reason[$arch]=$probe_reason
    echo "== Probe: a ${width[$arch]} Windows program does not run ($probe_reason)"
  fi
  wineserver -k >/dev/null 2>&1 || true
done

# --- Export table ------------------------------------------------------------------------
# The exported names of a DLL, one a line.
exported_names() {
  "$1" -p "$2" | sed -n '/\[Ordinal\/Name Pointer\] Table/,/^$/p' |
    sed -n 's/^[[:space:]]*\[[[:space:]]*[0-9]*\][[:space:]]*//p'
}

jni_methods=(outputInfoMessageN outputWarningMessageN outputErrorMessageN outputDebugMessageN)
jni_prefix=Java_com_quarnel_tesutil_tessel2_Tessel2MessageCatcher_

# check_exports OBJDUMP DLL BITS: the JNI names a JVM of that width looks up must all be
# there, and nothing but them and the library's own classes (Tesu::...) may be exported.
check_exports() {
  local objdump=$1 dll=$2 bits=$3
  local required=()
  for m in "${jni_methods[@]}"; do
    [ "$bits" = 32 ] && required+=("_${jni_prefix}${m}@12")
    required+=("${jni_prefix}${m}")
  done
  local names
  names=$(exported_names "$objdump" "$dll")
  echo "== Export table of $dll ($(echo "$names" | grep -c .) names)"
  echo "$names" | c++filt | sed 's/^/  /'
  local failed=0
  for name in "${required[@]}"; do
    if ! grep -qxF "$name" <<<"$names"; then
      echo "MISSING export: $name"
      failed=1
    fi
  done
  # Own classes: functions and data of namespace Tesu, their vtables, type information.
  local strays
  strays=$(grep -vxF -f <(printf '%s\n' "${required[@]}") <<<"$names" |
           grep -Ev '^_Z(T[VIS])?NK?4Tesu' || true)
  if [ -n "$strays" ]; then
    echo "UNEXPECTED exports:"
    echo "$strays" | sed 's/^/  /'
    failed=1
  fi
  if [ $failed -eq 0 ]; then
    echo "export check passed: ${#required[@]} JNI names, the rest Tesu::"
  fi
  return $failed
}

# --- Builds ------------------------------------------------------------------------------
# configure_and_build ARCH TESTS(ON|OFF) [targets...]: test discovery and CTest use the
# width's loader, the one the probe ran.
configure_and_build() {
  local arch=$1 tests=$2
  shift 2
  local build="$root/windows-$arch" loader
  loader=$(loader_of "$arch")
  mkdir -p "$build"
  export WINEDEBUG=-all
  export WINEPREFIX
  WINEPREFIX="$(cd "$build" && pwd)/wineprefix"
  cmake -S . -B "$build" -G Ninja -DCMAKE_TOOLCHAIN_FILE="cmake/toolchain-mingw-$arch.cmake" \
    -DCMAKE_BUILD_TYPE=RelWithDebInfo -DTESU_WERROR=ON -DTESU_BUILD_TESTS="$tests" \
    -DTESU_WINE_EXECUTABLE="$loader" -DCMAKE_CROSSCOMPILING_EMULATOR="$loader" >/dev/null
  if [ $# -gt 0 ]; then
    cmake --build "$build" -j "$jobs" --target "$@"
  else
    cmake --build "$build" -j "$jobs"
  fi
}

# run_tests ARCH: the unit tests under Wine, and a closing count.
#
# A test program's own fault (an access violation, an abort) ends it with a Windows exit code,
# which CTest reports as Failed. Wine 8's 32-bit loader itself now and then dies of SIGSEGV
# in its Unix side (libc called from ntdll.so, in a thread of its own) as a test program
# exits; CTest reports that as SEGFAULT. It was seen about once in 300 runs of a program of
# GoogleTest alone. Tests that ended so are run once more, and count as they end then.
run_tests() {
  local arch=$1
  local build="$root/windows-$arch"
  export WINEDEBUG=-all
  export WINEPREFIX
  WINEPREFIX="$(cd "$build" && pwd)/wineprefix"
  local log="$build/ctest-wine.log"
  local status=0
  ctest --test-dir "$build" --output-on-failure -j "$jobs" 2>&1 | tee "$log" || status=$?
  local total failed skipped
  total=$(sed -n 's/.* tests failed out of \([0-9]*\).*/\1/p' "$log" | tail -n 1)
  failed=$(sed -n 's/.*, \([0-9]*\) tests failed out of.*/\1/p' "$log" | tail -n 1)
  skipped=$(grep -c '(Skipped)$' "$log" || true)
  total=${total:-0}
  failed=${failed:-0}

  local crashed
  crashed=$(sed -n 's/^[[:space:]]*[0-9]* - \(.*\) (SEGFAULT)$/\1/p' "$log")
  if [ -n "$crashed" ]; then
    local count pattern relog="$build/ctest-wine-rerun.log"
    count=$(echo "$crashed" | grep -c .)
    echo "== Wine died of SIGSEGV under $count test(s); running them once more:"
    echo "$crashed" | sed 's/^/  /'
    pattern="^($(echo "$crashed" | sed 's/[.[\*^$()+?{|]/\\&/g' | paste -sd '|'))\$"
    local rerun_status=0
    ctest --test-dir "$build" --output-on-failure -R "$pattern" 2>&1 | tee "$relog" ||
      rerun_status=$?
    skipped=$((skipped + $(grep -c '(Skipped)$' "$relog" || true)))
    if [ $rerun_status -eq 0 ]; then
      failed=$((failed - count))
      [ "$failed" -eq 0 ] && status=0
    else
      failed=$((failed - count + $(sed -n 's/.*, \([0-9]*\) tests failed out of.*/\1/p' "$relog" | tail -n 1)))
    fi
  fi
  wineserver -k >/dev/null 2>&1 || true
  echo "windows-$arch: $((total - failed - skipped)) passed, $failed failed, $skipped skipped"
  return $status
}

status=0
for arch in x86_64 i686; do
  echo "== Windows $arch: build"
  step=$(date +%s)
  if [ "${runs[$arch]}" = yes ]; then
    configure_and_build "$arch" ON
  else
    # The test programs cannot run here, not even for discovery at build time.
    configure_and_build "$arch" OFF Tesu_Utilities tesutil
  fi
  echo "$arch build: $(elapsed "$step")"
  bits=64
  [ "$arch" = i686 ] && bits=32
  check_exports "$arch-w64-mingw32-objdump" "$root/windows-$arch/bin/libTesu_Utilities.dll" \
    "$bits" || status=1
done

not_run=()
for arch in x86_64 i686; do
  if [ "${runs[$arch]}" = yes ]; then
    echo "== Windows $arch: unit tests under $(loader_of "$arch")"
    step=$(date +%s)
    run_tests "$arch" || status=1
    echo "$arch tests: $(elapsed "$step")"
  else
    not_run+=("$arch")
  fi
done
for arch in "${not_run[@]}"; do
  echo "windows-$arch: unit tests NOT run: a ${width[$arch]} Windows program does not run on this" \
    "machine (${reason[$arch]}); library and tool built, exports checked"
done

echo "Windows job: $(elapsed "$job_start"), status $status"
exit $status

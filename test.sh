#!/usr/bin/env bash
# Installs what is missing, builds, and runs every test; the runner's summary closes the output.
#   --sanitize address|thread   build and run under that sanitizer
#   --filter REGEX              only the test programs whose names match
set -eu
cd "$(dirname "$0")"
preset=release
filter=.
while [ $# -gt 0 ]; do
  case $1 in
    --sanitize)
      case ${2:-} in
        address) preset=asan ;;
        thread) preset=tsan ;;
        *) echo "test.sh: --sanitize takes address or thread" >&2; exit 2 ;;
      esac
      shift 2 ;;
    --filter) filter=${2:?test.sh: --filter takes a regular expression}; shift 2 ;;
    *) echo "usage: ./test.sh [--sanitize address|thread] [--filter REGEX]" >&2; exit 2 ;;
  esac
done
tools/install-packages.sh build run test
log=$(mktemp)
cmake --preset $preset >"$log" 2>&1 || { cat "$log"; rm -f "$log"; exit 1; }
rm -f "$log"
cmake --build build/$preset
# Pictures are compared with those of the software driver, on any machine.
export LIBGL_ALWAYS_SOFTWARE=1 QT_QPA_PLATFORM=xcb QT_QUICK_CONTROLS_STYLE=Basic LC_ALL=C.UTF-8
export MESA_SHADER_CACHE_DISABLE=true
export ASAN_OPTIONS=detect_leaks=1:new_delete_type_mismatch=1 UBSAN_OPTIONS=halt_on_error=1:print_stacktrace=1
export LSAN_OPTIONS=suppressions=$PWD/tools/lsan.supp:print_suppressions=0
export TSAN_OPTIONS=suppressions=$PWD/tools/tsan.supp:halt_on_error=0:exitcode=66
# The thread sanitizer wants its shadow memory at fixed places, which a randomised layout can take.
fixed=()
[ "$preset" = tsan ] && fixed=(setarch "$(uname -m)" -R)
exec "${fixed[@]}" xvfb-run -a -s "-screen 0 1920x1080x24 -noreset" ctest --test-dir build/$preset -R "$filter" --output-on-failure --no-tests=error

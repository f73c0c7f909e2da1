#!/usr/bin/env bash
# Builds the fuzzers and runs each for a while, from the kept corpus on; the first fault ends the script with an error.
#   --seconds N      for each fuzzer, 60 without it
#   --only NAME      one of c3d trc bvh motion cameras settings schema value version
# What a fuzzer finds new stays in build/fuzz/corpus, what breaks it in build/fuzz/found.
set -eu
cd "$(dirname "$0")/.."
seconds=60
fuzzers="c3d trc bvh motion cameras settings schema value version"
while [ $# -gt 0 ]; do
  case $1 in
    --seconds) seconds=${2:?fuzz.sh: --seconds takes a number}; shift 2 ;;
    --only) fuzzers=${2:?fuzz.sh: --only takes a name}; shift 2 ;;
    *) echo "usage: tools/fuzz.sh [--seconds N] [--only NAME]" >&2; exit 2 ;;
  esac
done
tools/install-packages.sh build test fuzz
log=$(mktemp)
cmake --preset fuzz >"$log" 2>&1 || { cat "$log"; rm -f "$log"; exit 1; }
rm -f "$log"
targets=()
for name in $fuzzers; do targets+=("fuzz_$name"); done
cmake --build build/fuzz --target "${targets[@]}"
export UBSAN_OPTIONS=halt_on_error=1:print_stacktrace=1
for name in $fuzzers; do
  mkdir -p "build/fuzz/corpus/$name" build/fuzz/found
  echo "fuzz_$name: $seconds s"
  "build/fuzz/bin/fuzz_$name" -max_total_time="$seconds" -timeout=20 -rss_limit_mb=4096 -print_final_stats=1 -verbosity=0 \
    -artifact_prefix="build/fuzz/found/$name-" "build/fuzz/corpus/$name" "tests/fuzz/corpus/$name"
done

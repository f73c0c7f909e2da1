#!/usr/bin/env bash
# Builds and runs the benchmarks. Each prints its floor beside it; ratios inside a run are what counts.
#   --filter REGEX   only the benchmarks whose names match
#   --json FILE      also writes all results as one Google Benchmark JSON document
set -eu
cd "$(dirname "$0")"
filter=.
json=
while [ $# -gt 0 ]; do
  case $1 in
    --filter) filter=${2:?bench.sh: --filter takes a regular expression}; shift 2 ;;
    --json) json=${2:?bench.sh: --json takes a file}; shift 2 ;;
    *) echo "usage: ./bench.sh [--filter REGEX] [--json FILE]" >&2; exit 2 ;;
  esac
done
tools/install-packages.sh build run bench
log=$(mktemp)
cmake --preset bench >"$log" 2>&1 || { cat "$log"; rm -f "$log"; exit 1; }
rm -f "$log"
cmake --build build/bench >&2
export LIBGL_ALWAYS_SOFTWARE=1 QT_QPA_PLATFORM=xcb LC_ALL=C.UTF-8
parts=$(mktemp -d)
trap 'rm -rf "$parts"' EXIT
# Submission is timed with the driver that draws nothing; its programs read HARROW_BENCH_EMPTY_DRIVER themselves.
for program in build/bench/bin/bench_*; do
  name=$(basename "$program")
  list=$(xvfb-run -a -s "-screen 0 1920x1080x24 -noreset" "$program" --benchmark_list_tests --benchmark_filter="$filter" 2>/dev/null || true)
  empty=$(printf '%s\n' "$list" | grep -E '/(submit|still|unchanged|floor_submit|floor_still)(/|$)' || true)
  drawn=$(printf '%s\n' "$list" | grep -v -E '/(submit|still|unchanged|floor_submit|floor_still)(/|$)' | grep '/' || true)
  as_filter() { printf '%s\n' "$1" | sed 's/^/^/;s/$/$/' | paste -sd'|'; }
  if [ -n "$drawn" ]; then
    xvfb-run -a -s "-screen 0 1920x1080x24 -noreset" "$program" --benchmark_filter="$(as_filter "$drawn")" \
      --benchmark_out="$parts/$name.json" --benchmark_out_format=json
  fi
  if [ -n "$empty" ]; then
    GALLIUM_NOOP=1 xvfb-run -a -s "-screen 0 1920x1080x24 -noreset" "$program" --benchmark_filter="$(as_filter "$empty")" \
      --benchmark_out="$parts/$name-empty.json" --benchmark_out_format=json
  fi
done
if [ -n "$json" ]; then
  python3 - "$json" "$parts"/*.json <<'PY'
import json, sys
documents = [json.load(open(name)) for name in sys.argv[2:]]
merged = {"context": documents[0]["context"] if documents else {}, "benchmarks": []}
for document in documents:
    merged["benchmarks"] += document["benchmarks"]
json.dump(merged, open(sys.argv[1], "w"), indent=1)
PY
fi

#!/usr/bin/env bash
# Checks the model of the generation lock with spin and a C compiler.
#   Check.sh quick     small numbers of threads, and that every seeded mistake is found: within a minute
#   Check.sh full      besides, more threads and rounds, and that who waits gets in: long, and several GiB
# Ends with 77 where spin or the compiler is missing.
set -eu
model=$(cd "$(dirname "$0")" && pwd)/GenerationLock.pml
command -v spin >/dev/null && command -v "${CC:-cc}" >/dev/null || { echo "spin or a C compiler is missing"; exit 77; }
folder=$(mktemp -d)
trap 'rm -rf "$folder"' EXIT
cd "$folder"
failures=0

# run EXPECTED NAME MODEL-OPTIONS COMPILER-OPTIONS RUN-OPTIONS
run()
{
  spin -a $3 "$model" >spin.log || { cat spin.log; exit 1; }
  "${CC:-cc}" -O2 -w -DMEMLIM=8000 $4 -o pan pan.c
  ./pan -n -m3000000 $5 >pan.log
  if grep -q 'errors: 0' pan.log; then found=holds; else found=fails; fi
  if grep -q -E 'max search depth too small|out of memory|reached -DMEMLIM' pan.log; then found="was not searched to its end"; fi
  states=$(sed -n 's/^ *\([0-9.e+]*\) states, stored.*/\1/p' pan.log)
  echo "$2: $found ($states states)"
  if [ "$found" != "$1" ]; then
    echo "  expected: $1" >&2
    failures=$((failures + 1))
  fi
}
safe() { run holds "$1 readers, $2 writers, $3 rounds" "-DREADERS=$1 -DWRITERS=$2 -DROUNDS=$3" "-DSAFETY ${4:-}" ""; }
mutant() { run fails "mistake $1" "-DREADERS=$2 -DWRITERS=$3 -DROUNDS=$4 -DMUTANT=$1" "-DSAFETY" ""; }
live() { run holds "$1 readers, $2 writers, $3" "-DREADERS=$1 -DWRITERS=$2 -DLIVE" "-DNFAIR=3 -DCOLLAPSE" "-a -f -N $3"; }

safe 2 1 2
safe 1 2 2
for mistake in 1 2 3 4 5 7 9 10; do mutant $mistake 1 2 2; done
mutant 6 2 2 1
mutant 8 1 2 1
if [ "${1:-quick}" = full ]; then
  safe 2 2 1
  safe 1 3 1
  safe 3 1 1
  for threads in "2 2" "1 3" "3 1"; do safe $threads 2 -DHC4; done
  for claim in ReaderGetsIn WriterGetsIn; do
    for threads in "1 1" "2 1" "1 2" "2 2"; do live $threads $claim; done
  done
fi
exit $((failures != 0))

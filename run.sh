#!/usr/bin/env bash
# Installs what is missing, builds, and starts the program on the simulated capture. Arguments go to the program.
# With no display, every window is rendered to PNG files instead, and the program says where.
set -eu
cd "$(dirname "$0")"
tools/install-packages.sh build run
cmake --preset release -DHARROW_BUILD_TESTS=OFF -B build/run >build-run.log 2>&1 || { cat build-run.log; exit 1; }
rm -f build-run.log
cmake --build build/run
exec build/run/bin/harrow "$@"

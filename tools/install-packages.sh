#!/usr/bin/env bash
# Installs those Debian packages of tools/packages.txt that are missing. Arguments: the purposes (build run test bench).
set -eu
here=$(cd "$(dirname "$0")" && pwd)
wanted=()
for purpose in "$@"; do
  while IFS='; ' read -r package for_what; do
    [ "$for_what" = "$purpose" ] && wanted+=("$package")
  done < <(grep -v '^#' "$here/packages.txt")
done
missing=()
for package in "${wanted[@]}"; do
  dpkg-query -W -f='${Status}' "$package" 2>/dev/null | grep -q 'ok installed' || missing+=("$package")
done
[ ${#missing[@]} -eq 0 ] && exit 0
echo "installing: ${missing[*]}"
run=()
if [ "$(id -u)" -ne 0 ]; then
  if ! command -v sudo >/dev/null; then
    echo "these packages are missing and cannot be installed without root: ${missing[*]}" >&2
    exit 1
  fi
  run=(sudo)
fi
export DEBIAN_FRONTEND=noninteractive
"${run[@]}" apt-get update -qq
"${run[@]}" apt-get install -y -qq --no-install-recommends "${missing[@]}" >/dev/null

#!/usr/bin/env bash
# build_parent.sh TESSALINE_SOURCE PARENT_SOURCE SCRATCH
set -euo pipefail
source=$1 parent=$2 scratch=$3
rm -rf "$scratch"
cmake -S "$parent" -B "$scratch" -G Ninja -DTESSALINE_SOURCE="$source" >/dev/null
cmake --build "$scratch" >/dev/null
"$scratch/parent_host"

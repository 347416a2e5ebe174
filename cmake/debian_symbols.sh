#!/usr/bin/env bash
# debian_symbols.sh LIBRARY VERSION OUT LIST...
# Writes the Debian symbols file: every export of LIBRARY whose demangled
# name stands in the ABI lists, under its raw name. Raw names, because C++
# names written demangled hold blanks, which lintian cannot parse; plain C
# names are their own raw names.
set -euo pipefail
library=$1 version=$2 out=$3
shift 3
symbols=$(nm -D --defined-only "$library")
raw=$(echo "$symbols" | awk '$2 != "A" { print $3 }' | sed -E 's/@@?TESSALINE_[0-9]+$//')
{
  echo "libtessaline.so.0 libtessaline0 #MINVER#"
  # The version nodes of the version script are symbols of their own.
  echo "$symbols" | awk -v version="$version" '$2 == "A" { sub(/@.*/, "", $3); printf " %s@%s %s\n", $3, $3, version }'
  # A size_t in a list is the platform's, as in tests/abi/check_abi.sh.
  sizet="unsigned long"
  [ "$(od -An -j4 -N1 -tu1 "$library" | tr -d ' ')" = 1 ] && sizet="unsigned int"
  grep -h -v -E '^\s*(#|$)' "$@" | sed -E "s/\bsize_t\b/$sizet/g" |
    awk -F '\t' -v version="$version" \
      'NR == FNR { listed[$0] = 1; next } $2 in listed { printf " %s@TESSALINE_0 %s\n", $1, version }' \
      - <(paste <(echo "$raw") <(echo "$raw" | c++filt)) |
    LC_ALL=C sort
} >"$out"

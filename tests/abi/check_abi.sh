#!/usr/bin/env bash
# Compares the library's exported symbols (demangled) with the expected lists.
#   check_abi.sh LIB LIST...   fails on any missing or unexpected name
#   check_abi.sh --print LIB   prints the current export list
set -euo pipefail

exports() {
  nm -D --defined-only -C "$1" |
    awk '$2 != "A" { $1 = ""; $2 = ""; sub(/^  /, ""); print }' |
    sed -E 's/@@?TESSALINE_[0-9]+$//' | LC_ALL=C sort -u
}

if [ "${1:-}" = "--print" ]; then
  exports "$2"
  exit 0
fi

lib=$1
shift
# A size_t in a list is the platform's: unsigned int on 32-bit x86.
sizet="unsigned long"
[ "$(od -An -j4 -N1 -tu1 "$lib" | tr -d ' ')" = 1 ] && sizet="unsigned int"
expected=$(cat "$@" | grep -v -E '^\s*(#|$)' | sed -E "s/\bsize_t\b/$sizet/g" | LC_ALL=C sort -u)
actual=$(exports "$lib")
missing=$(LC_ALL=C comm -23 <(echo "$expected") <(echo "$actual"))
unexpected=$(LC_ALL=C comm -13 <(echo "$expected") <(echo "$actual"))
status=0
if [ -n "$missing" ]; then
  echo "Missing exports:"; echo "$missing"; status=1
fi
if [ -n "$unexpected" ]; then
  echo "Unexpected exports:"; echo "$unexpected"; status=1
fi
[ $status -eq 0 ] && echo "$(echo "$actual" | wc -l) exports as listed"
exit $status

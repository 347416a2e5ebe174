#!/usr/bin/env bash
# package_policy.sh PACKAGES
# Holds the packages that package_tour built to Debian policy: the library's
# symbols file matches the packaged library exactly (dpkg-gensymbols -c4),
# and lintian finds no error. Without lintian (scripts/setup all installs
# it) only the symbols are checked and the test reports itself skipped.
set -euo pipefail
packages=$1
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
runtime=$(echo "$packages"/libtessaline0_*.deb)
dpkg -x "$runtime" "$work/root"
dpkg-deb -e "$runtime" "$work/control"
library=$(find "$work/root" -name 'libtessaline.so.0.*' | head -n 1)
version=$(dpkg-deb -f "$runtime" Version)
(cd "$work" && dpkg-gensymbols -plibtessaline0 -v"$version" -c4 -e"$library" \
  -I"$work/control/symbols" -O"$work/generated.symbols")
if ! command -v lintian >/dev/null; then
  echo "lintian is not installed: policy checks skipped"
  exit 77
fi
lintian --fail-on error "$packages"/*.deb
echo "symbols match and lintian reports no error"

#!/usr/bin/env bash
# install_host.sh BUILD_DIR HOST_SOURCE SCRATCH
set -euo pipefail
build=$1 host=$2 scratch=$3
rm -rf "$scratch"
prefix=$scratch/prefix
cmake --install "$build" --prefix "$prefix" >/dev/null

# find_package(Tessaline)
cmake -S "$host" -B "$scratch/cmake-host" -G Ninja -DCMAKE_PREFIX_PATH="$prefix" >/dev/null
cmake --build "$scratch/cmake-host" >/dev/null
LD_LIBRARY_PATH=$(ls -d "$prefix"/lib* | head -n 1) "$scratch/cmake-host/host"

# pkg-config
libdir=$(ls -d "$prefix"/lib*/pkgconfig | head -n 1)
export PKG_CONFIG_PATH=$libdir
c++ -std=c++17 -o "$scratch/pc-host" "$host/host.cpp" $(pkg-config --cflags --libs tessaline)
LD_LIBRARY_PATH=$(dirname "$libdir") "$scratch/pc-host"

# The installed tool finds the installed library by itself.
if [ -x "$prefix/bin/tessaline-config" ]; then
  "$prefix/bin/tessaline-config" encrypt secret >/dev/null
fi

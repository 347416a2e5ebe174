#!/usr/bin/env bash
# package_tour.sh BUILD_DIR TOUR_SOURCE SCRATCH
# Builds the Debian packages into SCRATCH/packages, unpacks them into a
# throwaway root, builds the tour against them (through find_package and
# through pkg-config) and runs the packaged tool.
set -euo pipefail
build=$1 tour=$2 scratch=$3
rm -rf "$scratch"
mkdir -p "$scratch/root"
cpack --config "$build/CPackConfig.cmake" -B "$scratch/packages" >/dev/null
for deb in "$scratch"/packages/*.deb; do
  dpkg-deb --info "$deb" >/dev/null
  dpkg -x "$deb" "$scratch/root"
done
usr=$scratch/root/usr
libdir=$(dirname "$(find "$usr" -name 'libtessaline.so.0' | head -n 1)")

cmake -S "$tour" -B "$scratch/cmake-tour" -G Ninja -DCMAKE_PREFIX_PATH="$usr" >/dev/null
cmake --build "$scratch/cmake-tour" >/dev/null
LD_LIBRARY_PATH=$libdir "$scratch/cmake-tour/tessaline-tour" >/dev/null

export PKG_CONFIG_PATH=$libdir/pkgconfig
c++ -std=c++17 -DTOUR_DATA_DIR="\"$tour/data\"" -o "$scratch/pc-tour" "$tour"/*.cpp \
  $(pkg-config --cflags --libs tessaline)
LD_LIBRARY_PATH=$libdir "$scratch/pc-tour" >/dev/null

if [ -x "$usr/bin/tessaline-config" ]; then
  LD_LIBRARY_PATH=$libdir "$usr/bin/tessaline-config" encrypt secret >/dev/null
fi
echo "packages install and the tour builds against them"

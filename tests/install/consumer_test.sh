#!/usr/bin/env bash
# consumer_test.sh BUILD_DIR SCRATCH_DIR SOURCE_DIR
set -euo pipefail
build=$1 scratch=$2 source=$3
rm -rf "$scratch"
mkdir -p "$scratch"
prefix=$scratch/prefix

cmake --install "$build" --prefix "$prefix" >/dev/null

# pkg-config and a plain compiler call, as the README shows.
libdir=$(dirname "$(find "$prefix" -name krCoreLib.pc -print -quit)")/..
export PKG_CONFIG_PATH=$libdir/pkgconfig
"${KR_CXX:-g++}" ${KR_CXXFLAGS:-} "$source/consumer.cpp" $(pkg-config --cflags --libs krCoreLib) -o "$scratch/consumer_pc"
LD_LIBRARY_PATH=$libdir "$scratch/consumer_pc"

# find_package(krCoreLib) and the imported target.
cmake -S "$source/cmake_consumer" -B "$scratch/cmake_build" -G "${KR_GENERATOR:-Ninja}" \
  -DCMAKE_PREFIX_PATH="$prefix" -DCMAKE_CXX_FLAGS="${KR_CXXFLAGS:-}" -DKR_CONSUMER_SOURCE="$source/consumer.cpp" >/dev/null
cmake --build "$scratch/cmake_build" >/dev/null
"$scratch/cmake_build/consumer"

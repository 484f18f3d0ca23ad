#!/usr/bin/env bash
# plugin_test.sh SOURCE_DIR BUILD_DIR SCRATCH_DIR
#
# A third-party plug-in and a host, each built with nothing but the
# installed package and pkg-config, against a scratch installation: the
# host loads the plug-in from a folder, uses it and unloads it.
#
# A sanitized library needs sanitized programs: KR_CXXFLAGS then reaches the
# compiler.
set -euo pipefail
source_dir=$1 build=$2 scratch=$3
rm -rf "$scratch"
mkdir -p "$scratch/plugins"
prefix=$scratch/prefix
cmake --install "$build" --prefix "$prefix" >/dev/null
export PKG_CONFIG_PATH="$prefix/lib/pkgconfig"
here=$source_dir/tests/install/thirdparty
# shellcheck disable=SC2086 # the flags are words
g++ ${KR_CXXFLAGS:-} -std=c++20 -shared -fPIC "$here/KRThirdPartyPlugin.cpp" $(pkg-config --cflags --libs krCoreLib) \
  -o "$scratch/plugins/thirdparty.plg"
# shellcheck disable=SC2086
g++ ${KR_CXXFLAGS:-} -std=c++20 "$here/KRPluginHost.cpp" $(pkg-config --cflags --libs krCoreLib) -o "$scratch/plugin_host"
"$scratch/plugin_host" "$scratch/plugins"

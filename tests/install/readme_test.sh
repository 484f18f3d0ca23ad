#!/usr/bin/env bash
# readme_test.sh README BUILD_DIR SCRATCH_DIR
#
# Runs the commands of the README's "Using it" section exactly as written,
# against a scratch installation: the shell blocks in order in one shell,
# with the section's C++ block as app.cpp and its CMake block as
# CMakeLists.txt. HOME is the scratch folder and ./build the build folder, as
# a reader who built the project would have them.
#
# A sanitized library needs sanitized programs: KR_CXXFLAGS then reaches the
# compiler through a g++ wrapper first on PATH and through CXXFLAGS.
set -euo pipefail
readme=$1 build=$2 scratch=$3
rm -rf "$scratch"
mkdir -p "$scratch/work"
cd "$scratch/work"
ln -s "$build" build

# The fenced blocks of the section, by language, in order.
awk -v out="$scratch" '
  /^## / { inside = ($0 == "## Using it") }
  inside && /^```/ {
    if (lang == "") { lang = substr($0, 4); n[lang]++; file = out "/block-" lang "-" n[lang]; next }
    lang = ""; next
  }
  inside && lang != "" { print > file }
' "$readme"
for block in block-sh-1 block-cpp-1 block-cmake-1 block-sh-2; do
  [[ -s $scratch/$block ]] || { echo "README: the Using it section has no $block" >&2; exit 1; }
done
cp "$scratch/block-cpp-1" app.cpp
cp "$scratch/block-cmake-1" CMakeLists.txt

if [[ -n ${KR_CXXFLAGS:-} ]]; then
  mkdir -p "$scratch/bin"
  printf '#!/bin/sh\nexec %q %s "$@"\n' "$(command -v g++)" "$KR_CXXFLAGS" >"$scratch/bin/g++"
  chmod +x "$scratch/bin/g++"
  export PATH="$scratch/bin:$PATH" CXXFLAGS="$KR_CXXFLAGS"
fi

HOME=$scratch bash -euo pipefail -c "$(cat "$scratch/block-sh-1" "$scratch/block-sh-2")"

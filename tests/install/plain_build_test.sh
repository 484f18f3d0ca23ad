#!/usr/bin/env bash
# plain_build_test.sh SOURCE_DIR SCRATCH_DIR
#
# The README's plain `cmake -S . -B build && cmake --build build` on a machine
# that has the library's own dependencies only: every package that the set-up
# script installs for the tests and the benchmarks alone is hidden, and the
# project must still configure (saying what it leaves out), build, and run
# its demo.
#
# The packages are hidden in a private mount namespace, under an overlay of
# /usr in which their files are deleted; the machine itself is not touched.
# That needs root and overlay mounts: without them the test is skipped
# (exit 77).
set -euo pipefail
source=$1 scratch=$2

if [[ $(id -u) != 0 ]] || ! command -v unshare >/dev/null || ! command -v dpkg-query >/dev/null; then
  echo "skipped: hiding packages needs root, unshare and dpkg"
  exit 77
fi

# The packages the set-up script adds beyond the library's own: the line
# `packages+=(...)` of scripts/krbuild.sh, so that the two lists cannot part.
peers=$(sed -n 's/^ *packages+=(\(.*\))$/\1/p' "$source/scripts/krbuild.sh")
[[ -n $peers ]] || { echo "scripts/krbuild.sh has no packages+=(...) line" >&2; exit 1; }

rm -rf "$scratch"
mkdir -p "$scratch/upper" "$scratch/work" "$scratch/build"
hidden=$scratch/hidden
: >"$hidden"
for package in $peers; do
  # Only installed packages have files to hide; their own dependencies (the
  # Boost headers of Boost.Serialization, for example) stay.
  dpkg-query -W -f='${Status}' "$package" 2>/dev/null | grep -q 'install ok installed' || continue
  dpkg-query -L "$package" | while read -r file; do
    [[ $file == /usr/* && ! -d $file ]] && echo "$file"
  done >>"$hidden" || true
done

inner=$(cat <<'EOF'
set -euo pipefail
source=$1 scratch=$2
if ! mount -t overlay overlay -o "lowerdir=/usr,upperdir=$scratch/upper,workdir=$scratch/work" /usr 2>/dev/null; then
  echo "skipped: overlay mounts are not available here"
  exit 77
fi
xargs -r -d '\n' rm -f <"$scratch/hidden"
# The test command itself no longer finds GoogleTest; nor must the project.
[[ ! -e /usr/include/gtest/gtest.h && ! -e /usr/include/benchmark/benchmark.h ]]
# The README's words: default generator (make, or Ninja where make is
# missing), parallel as the machine allows.
command -v make >/dev/null || export CMAKE_GENERATOR=Ninja
export CMAKE_BUILD_PARALLEL_LEVEL=${CMAKE_BUILD_PARALLEL_LEVEL:-$(nproc)}
cmake -S "$source" -B "$scratch/build" >"$scratch/configure.log"
cat "$scratch/configure.log"
grep -q "GoogleTest not found" "$scratch/configure.log"
grep -q "Google Benchmark not found" "$scratch/configure.log"
cmake --build "$scratch/build"
"$scratch/build/examples/krdemo" >"$scratch/demo.log"
echo "plain build without the peers: configured, built, and the demo ran"
EOF
)
status=0
unshare --mount --propagation private bash -c "$inner" inner "$source" "$scratch" || status=$?
if [[ $status == 0 ]]; then
  rm -rf "$scratch"
fi
exit $status

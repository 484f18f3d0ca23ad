#!/usr/bin/env bash
# Set-up, build and run for krCoreLib on Debian 12.
#
#   scripts/krbuild.sh demo       install what is missing, build, run the demo
#   scripts/krbuild.sh test       install what is missing, build, run all tests
#   scripts/krbuild.sh sanitize   the same test run with -fsanitize=address,undefined
#
# Idempotent: packages are installed only when missing (apt-get needs root),
# and the build directories are reused, so a second run only rebuilds what
# changed. BUILD_DIR overrides the build directory.
set -euo pipefail

mode=${1:-test}
root=$(cd "$(dirname "${BASH_SOURCE[0]}")/.." && pwd)

# What the library and the demo need; the tests and the benchmarks (built
# with the tests, run by hand) need the rest.
packages=(g++ cmake ninja-build pkg-config libxerces-c-dev libsqlite3-dev)
if [[ $mode != demo ]]; then
  packages+=(libgtest-dev libgmock-dev locales libbenchmark-dev uuid-dev libeigen3-dev libudunits2-dev libcgal-dev libcereal-dev libboost-serialization-dev)
fi

missing=()
for package in "${packages[@]}"; do
  dpkg-query -W -f='${Status}' "$package" 2>/dev/null | grep -q 'install ok installed' || missing+=("$package")
done
if ((${#missing[@]})); then
  echo "krbuild: installing ${missing[*]}"
  export DEBIAN_FRONTEND=noninteractive
  apt-get update -qq
  apt-get install -y -qq --no-install-recommends "${missing[@]}"
fi

# A German locale (decimal comma) lets the tests show that text forms do not
# depend on the process locale.
if [[ $mode != demo ]] && ! locale -a 2>/dev/null | grep -qix 'de_DE.utf8'; then
  echo "krbuild: generating the de_DE.UTF-8 locale for the tests"
  localedef -i de_DE -f UTF-8 de_DE.UTF-8
fi

configure() {
  local dir=$1
  shift
  cmake -S "$root" -B "$dir" -G Ninja -DCMAKE_BUILD_TYPE=RelWithDebInfo "$@" >/dev/null
}

configure_and_build() {
  configure "$@"
  cmake --build "$1"
}

case "$mode" in
demo)
  # Only the library and the demo are built.
  dir=${BUILD_DIR:-$root/build}
  configure "$dir"
  cmake --build "$dir" --target krdemo
  "$dir/examples/krdemo"
  ;;
test)
  dir=${BUILD_DIR:-$root/build}
  configure_and_build "$dir"
  ctest --test-dir "$dir" --output-on-failure -j2
  ;;
sanitize)
  dir=${BUILD_DIR:-$root/build-sanitize}
  configure_and_build "$dir" -DKRCORELIB_SANITIZE=ON -DKRCORELIB_BUILD_BENCHMARKS=OFF
  ASAN_OPTIONS=detect_leaks=1:strict_string_checks=1 UBSAN_OPTIONS=print_stacktrace=1 \
    ctest --test-dir "$dir" --output-on-failure -j2
  ;;
*)
  echo "usage: $0 demo|test|sanitize" >&2
  exit 2
  ;;
esac

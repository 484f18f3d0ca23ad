#!/usr/bin/env bash
# krfuzz.sh [SECONDS] — builds the fuzz targets with clang (Debian's clang
# package; libFuzzer with the address and undefined-behaviour sanitizers)
# in build-fuzz/ and runs the XML archive target for SECONDS (default 600)
# as one job. The corpus grows in build-fuzz/corpus-xml (seeded with valid
# archives); crashing inputs land in build-fuzz/findings/. Not part of
# the test run: keep each finding as a regression input in
# tests/storage/fuzz_inputs/ once it is fixed.
set -euo pipefail
seconds=${1:-600}
root=$(cd "$(dirname "$0")/.." && pwd)
build=$root/build-fuzz
CC=clang CXX=clang++ cmake -S "$root" -B "$build" -G Ninja -DCMAKE_BUILD_TYPE=RelWithDebInfo \
  -DKRCORELIB_FUZZ=ON -DKRCORELIB_BUILD_TESTS=OFF -DKRCORELIB_BUILD_BENCHMARKS=OFF -DKRCORELIB_BUILD_EXAMPLES=OFF >/dev/null
cmake --build "$build" -j2 --target kr_fuzz_xml_archive
mkdir -p "$build/corpus-xml" "$build/findings"
KR_FUZZ_WRITE_SEEDS=$build/corpus-xml "$build/fuzz/kr_fuzz_xml_archive" -runs=0 "$build/corpus-xml" >/dev/null 2>&1 || true
cp "$root"/tests/storage/fuzz_inputs/* "$build/corpus-xml/" 2>/dev/null || true
# Each input is bounded too: a hang is a finding after 10 s.
exec "$build/fuzz/kr_fuzz_xml_archive" -max_total_time="$seconds" -timeout=10 -rss_limit_mb=2048 \
  -max_len=65536 -dict="$root/fuzz/krxml.dict" -artifact_prefix="$build/findings/" "$build/corpus-xml"

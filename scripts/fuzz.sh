#!/usr/bin/env bash
# Builds the libFuzzer targets with clang and runs the item-URL fuzzer.
# Usage: scripts/fuzz.sh [seconds]   (default 60; findings go to build-fuzz/findings)
set -euo pipefail
root="$(cd "$(dirname "$0")/.." && pwd)"
cd "$root"
seconds="${1:-60}"

scripts/setup-deps.sh clang libclang-rt-14-dev
CC=clang CXX=clang++ scripts/build.sh build-fuzz -DVAROSCOPE_FUZZ=ON -DVAROSCOPE_BENCH=OFF

mkdir -p build-fuzz/findings build-fuzz/corpus
cp -n tests/fuzz/corpus/orvek-url/* build-fuzz/corpus/
exec build-fuzz/tests/fuzz/orvek_url_fuzzer -max_total_time="$seconds" \
  -artifact_prefix=build-fuzz/findings/ build-fuzz/corpus

#!/usr/bin/env bash
# Installs what is missing, builds, and runs every test: the normal build,
# then the base library's tests again under AddressSanitizer and
# UndefinedBehaviorSanitizer.
set -euo pipefail
root="$(cd "$(dirname "$0")/.." && pwd)"
cd "$root"

scripts/setup-deps.sh

scripts/build.sh build -DVAROSCOPE_BENCH=ON
ctest --test-dir build --output-on-failure -j"$(nproc)"

scripts/build.sh build-asan -DVAROSCOPE_BENCH=OFF -DVAROSCOPE_SANITIZE=address,undefined
ctest --test-dir build-asan --output-on-failure -j"$(nproc)"

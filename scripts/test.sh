#!/usr/bin/env bash
# Installs what is missing, builds, and runs every test: the normal build,
# then every test again under AddressSanitizer and UndefinedBehaviorSanitizer,
# then the concurrency tests (label "concurrency") under ThreadSanitizer.
set -euo pipefail
root="$(cd "$(dirname "$0")/.." && pwd)"
cd "$root"

scripts/setup-deps.sh

scripts/build.sh build -DVAROSCOPE_BENCH=ON
ctest --test-dir build --output-on-failure -j"$(nproc)"

scripts/build.sh build-asan -DVAROSCOPE_BENCH=OFF -DVAROSCOPE_SANITIZE=address,undefined
ctest --test-dir build-asan --output-on-failure -j"$(nproc)"

# Only the programs that hold concurrency tests are built with ThreadSanitizer.
cmake -S . -B build-tsan -DCMAKE_BUILD_TYPE=RelWithDebInfo -DVAROSCOPE_BENCH=OFF -DVAROSCOPE_SANITIZE=thread >/dev/null
cmake --build build-tsan -j"$(nproc)" --target client_tests document_tests watchlist_tests
ctest --test-dir build-tsan -L concurrency --output-on-failure -j"$(nproc)"

#!/usr/bin/env bash
# Installs what is missing, builds, and runs the demo network: this host's
# services (the data server among them), the orvek-sim demo plant, and
# orvek-sub watching a few of its variables live until Ctrl+C. Until the
# monitor window exists, this is the way to see the network at work.
# With arguments, orvek-sub watches those item URLs instead.
set -euo pipefail
root="$(cd "$(dirname "$0")/.." && pwd)"
cd "$root"

scripts/setup-deps.sh
scripts/build.sh build >/dev/null

build/bin/wfsc ensure
build/bin/orvek-sim &
sim=$!
trap 'kill -TERM $sim 2>/dev/null; wait $sim 2>/dev/null || true' EXIT

if [ $# -eq 0 ]; then
  set -- '\\localhost\boiler\drum.level' '\\localhost\boiler\drum.pressure' \
         '\\localhost\boiler\status' '\\localhost\tanks\levels' \
         '\\localhost\tanks\product.name' '\\localhost\packaging\count.total' \
         '\\localhost\packaging\line.running'
fi
build/bin/orvek-sub "$@"

#!/usr/bin/env bash
# Installs what is missing, builds, and runs the demo network: this host's
# services (the data server among them), the orvek-sim demo plant, and
# varoscope-watch showing the shipped demo watch list live until Ctrl+C.
# Until the monitor window exists, this is the way to see the network at
# work. Arguments go to varoscope-watch instead of the demo list (a .vsd
# file, item URLs, options; see varoscope-watch --help).
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
  set -- --digits 6 resources/demo/plant.vsd
fi
build/bin/varoscope-watch "$@"

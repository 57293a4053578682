#!/usr/bin/env bash
# Installs what is missing, builds, and runs the program. Until the monitor
# window exists this is urlcheck on a few item URLs, or on the URLs given.
set -euo pipefail
root="$(cd "$(dirname "$0")/.." && pwd)"
cd "$root"

scripts/setup-deps.sh
scripts/build.sh build >/dev/null

if [ $# -eq 0 ]; then
  set -- '\\plant1\boiler\drum.level' '\\.\tanks\tank3.temperature' \
         "\\\\plant1\\packaging\\'line 2.speed'" '\\h\p.x'
fi
exec build/tools/urlcheck/urlcheck "$@"

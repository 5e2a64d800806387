#!/usr/bin/env bash
# Installs what the build needs, builds, and runs the library's main job: owutil demo.
set -euo pipefail
cd "$(dirname "$0")/.."

scripts/install-deps.sh
scripts/build.sh release owutil >/dev/null
exec build/release/bin/owutil demo "$@"

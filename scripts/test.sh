#!/usr/bin/env bash
# Installs what the build needs, builds, and runs every test.
#   scripts/test.sh            release build
#   scripts/test.sh asan       AddressSanitizer + UndefinedBehaviorSanitizer build
set -euo pipefail
cd "$(dirname "$0")/.."

kind=${1:-release}
scripts/install-deps.sh
scripts/build.sh "$kind"
export ASAN_OPTIONS=${ASAN_OPTIONS:-detect_leaks=1:abort_on_error=1}
export UBSAN_OPTIONS=${UBSAN_OPTIONS:-print_stacktrace=1:halt_on_error=1}
ctest --test-dir "build/$kind" --output-on-failure --parallel "$(nproc 2>/dev/null || echo 2)" --timeout 300

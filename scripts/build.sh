#!/usr/bin/env bash
# Configures and builds OWUtils into build/<name>.
#   scripts/build.sh [release|asan|tsan|debug] [ninja targets...]
set -euo pipefail
cd "$(dirname "$0")/.."

kind=${1:-release}
shift || true
case "$kind" in
  release) args=(-DCMAKE_BUILD_TYPE=RelWithDebInfo) ;;
  debug)   args=(-DCMAKE_BUILD_TYPE=Debug) ;;
  asan)    args=(-DCMAKE_BUILD_TYPE=Debug -DOWUTILS_SANITIZE=address,undefined -DOWUTILS_BUILD_BENCHMARKS=OFF) ;;
  tsan)    args=(-DCMAKE_BUILD_TYPE=RelWithDebInfo -DOWUTILS_SANITIZE=thread -DOWUTILS_BUILD_BENCHMARKS=OFF) ;;
  *) echo "unknown build kind: $kind" >&2; exit 2 ;;
esac

jobs=$(nproc 2>/dev/null || echo 2)
cmake -S . -B "build/$kind" -G Ninja "${args[@]}" >/dev/null
cmake --build "build/$kind" --parallel "$jobs" -- "$@"

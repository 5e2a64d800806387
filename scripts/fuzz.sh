#!/usr/bin/env bash
# Builds the libFuzzer targets with clang, AddressSanitizer and UndefinedBehaviorSanitizer, and
# runs each one for a bounded time, starting from its committed seeds.
#
#   scripts/fuzz.sh                  every target, 60 s each
#   scripts/fuzz.sh 20               every target, 20 s each
#   scripts/fuzz.sh 20 format utf8   only these targets
#
# Environment:
#   FUZZ_SECONDS   seconds per target when no argument gives it (default 60)
#   FUZZ_JOBS      targets run side by side (default: the number of cores)
#   FUZZ_BUILD     build folder (default build/fuzz)
#
# Prints the executions of every target. Exits non-zero when the build fails or any target
# finds a crash, a leak, a hang or undefined behaviour; the input that did it is kept under
# $FUZZ_BUILD/artifacts/<target>/ and should become a regression test under tests/Reliability/.
set -euo pipefail
cd "$(dirname "$0")/.."

seconds=${FUZZ_SECONDS:-60}
if [[ $# -gt 0 && $1 =~ ^[0-9]+$ ]]; then
  seconds=$1
  shift
fi
build=${FUZZ_BUILD:-build/fuzz}
jobs=${FUZZ_JOBS:-$(nproc 2>/dev/null || echo 2)}

cmake -S . -B "$build" -G Ninja \
  -DCMAKE_C_COMPILER=clang -DCMAKE_CXX_COMPILER=clang++ \
  -DCMAKE_BUILD_TYPE=RelWithDebInfo \
  -DOWUTILS_SANITIZE=address,undefined \
  -DOWUTILS_BUILD_FUZZERS=ON -DOWUTILS_BUILD_TESTS=OFF -DOWUTILS_BUILD_BENCHMARKS=OFF >/dev/null

if [[ $# -gt 0 ]]; then
  targets=("$@")
else
  mapfile -t targets < <(find fuzz -maxdepth 1 -name '*_fuzz.cpp' -printf '%f\n' | sed 's/_fuzz\.cpp$//' | sort)
fi
if [[ ${#targets[@]} -eq 0 ]]; then
  echo "fuzz: no targets" >&2
  exit 1
fi
ninja -C "$build" -j "$jobs" "${targets[@]/%/_fuzz}"

export ASAN_OPTIONS=${ASAN_OPTIONS:-detect_leaks=1:abort_on_error=1:allocator_may_return_null=1}
export UBSAN_OPTIONS=${UBSAN_OPTIONS:-print_stacktrace=1:halt_on_error=1}

# Runs one target; its log goes to $build/logs/<target>.log and its exit status to <target>.rc.
run_target() {
  local target=$1
  local corpus="$build/corpus/$target" artifacts="$build/artifacts/$target/" log="$build/logs/$target.log"
  mkdir -p "$corpus" "$artifacts" "$(dirname "$log")"
  local seeds=()
  [[ -d fuzz/corpus/$target ]] && seeds=("fuzz/corpus/$target")
  local rc=0
  "$build/fuzz/${target}_fuzz" -max_total_time="$seconds" -timeout=10 -rss_limit_mb=2048 -max_len=4096 \
    -print_final_stats=1 -artifact_prefix="$artifacts" "$corpus" "${seeds[@]}" >"$log" 2>&1 || rc=$?
  echo "$rc" >"$build/logs/$target.rc"
}

status=0
mkdir -p "$build/logs"
for target in "${targets[@]}"; do
  rm -f "$build/logs/$target.rc"
  while [[ $(jobs -rp | wc -l) -ge $jobs ]]; do
    wait -n || true
  done
  run_target "$target" &
done
wait

printf '%-14s %12s  %s\n' target executions result
for target in "${targets[@]}"; do
  result=ok
  log="$build/logs/$target.log"
  if [[ $(cat "$build/logs/$target.rc" 2>/dev/null || echo missing) != 0 ]]; then
    result=FAILED
    status=1
  fi
  execs=$(grep -o 'stat::number_of_executed_units: [0-9]*' "$log" 2>/dev/null | tail -1 | awk '{print $2}' || true)
  printf '%-14s %12s  %s\n' "$target" "${execs:-?}" "$result"
  if [[ $result != ok ]]; then
    echo "---- $target: end of $log"
    tail -n 60 "$log"
    ls -1 "$build/artifacts/$target/" 2>/dev/null | sed "s|^|  artifact: $build/artifacts/$target/|"
  fi
done
exit $status

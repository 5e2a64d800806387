#!/usr/bin/env bash
# Prints the performance table: the benchmarks of the library against the tools a user would
# pick instead (the peers), all measured in one run on this machine, as ratios.
#
#   bench/compare.sh [build-dir] [--quick]
#
# build-dir defaults to build/release (made with scripts/build.sh release when missing; it needs
# the benchmarks, -DOWUTILS_BUILD_BENCHMARKS=ON, the default). --quick uses small inputs (a
# 64 MiB file, a tree of 10,000 files) to check the script itself; figures for the README come
# from a full run.
#
# The comparisons themselves are the scripts of the benchmark folders:
#   bench/secure/compare.sh           ciphers and digests against openssl, sha1sum, md5sum, zlib
#                                     (throughput ratio: 1.0 or more is at least as fast)
#   bench/FileSystem/compare_tree.sh  tree operations against du, find, cp, rm
#                                     (time ratio: 1.0 or less is at least as fast)
# The benchmark programs of the other folders have no peer; their figures are printed as they are.
set -euo pipefail
cd "$(dirname "$0")/.."

BUILD=build/release
QUICK=0
for arg in "$@"; do
  case "$arg" in
    --quick) QUICK=1 ;;
    -h|--help) sed -n '2,17p' "$0" | sed 's/^# \{0,1\}//'; exit 0 ;;
    *) BUILD=$arg ;;
  esac
done

if [[ $BUILD == build/release && ! -d $BUILD ]]; then
  scripts/build.sh release >/dev/null
else
  cmake --build "$BUILD" --parallel "$(nproc 2>/dev/null || echo 2)" >/dev/null
fi
[[ -d $BUILD/bench ]] || { echo "compare.sh: $BUILD has no benchmarks (configure with -DOWUTILS_BUILD_BENCHMARKS=ON)" >&2; exit 2; }

ROWS=$(mktemp /tmp/owutils-compare.XXXXXX)
trap 'rm -f "$ROWS"' EXIT
failed=0

echo "# OWUtils benchmarks against their peers"
echo "machine: $(nproc 2>/dev/null || echo '?') cores, $(uname -srm), $(date -u '+%Y-%m-%d %H:%M UTC')$([[ $QUICK == 1 ]] && echo ', quick inputs')"

# Runs one comparison script and prints its output; on failure notes it and prints nothing more.
run_script() {  # name, command...
  local name=$1 output
  shift
  echo
  echo "## $name: $*"
  if ! output=$("$@" 2>&1); then
    echo "$output"
    echo "compare.sh: $name FAILED" >&2
    failed=1
    return 1
  fi
  echo "$output"
  OUTPUT=$output
}

# --- secure: the lines of its "== ratios" section, "<label> <wall ratio> <CPU ratio>" -----------
if [[ -f bench/secure/compare.sh ]]; then
  if run_script secure bash bench/secure/compare.sh "$BUILD" "$([[ $QUICK == 1 ]] && echo 64 || echo 1024)"; then
    awk '
      /^==/ { inratios = (tolower($0) ~ /ratio/); next }
      inratios && NF >= 3 && $NF ~ /^[0-9.]+$/ && $(NF - 1) ~ /^[0-9.]+$/ {
        label = $1
        for (i = 2; i <= NF - 2; ++i) label = label " " $i
        printf "| secure | %s | %s (CPU %s) | throughput, >= 1.0 |\n", label, $(NF - 1), $NF
      }' <<<"$OUTPUT" >> "$ROWS"
  fi
fi

# --- FileSystem: rows "<operation> <t> s <peer> <t> s ratio <r>" --------------------------------
if [[ -f bench/FileSystem/compare_tree.sh && -x $BUILD/bench/bench_tree_bench ]]; then
  tree_args=()
  [[ $QUICK == 1 ]] && tree_args=(100 100)
  if run_script FileSystem bash bench/FileSystem/compare_tree.sh "$BUILD/bench/bench_tree_bench" "${tree_args[@]}"; then
    awk '
      $(NF - 1) == "ratio" {
        split($0, parts, / +[0-9.]+ s +/)
        peer = parts[2]
        gsub(/\|/, "\\|", peer)   # a pipe of the peer command would split the Markdown cell
        ratio = $NF
        if (ratio ~ /^\./) ratio = "0" ratio
        printf "| FileSystem | %s / %s | %s | time, <= 1.0 |\n", $1, peer, ratio
      }' <<<"$OUTPUT" >> "$ROWS"
  fi
fi

# --- The other benchmark programs: figures only ----------------------------------------------------
for program in "$BUILD"/bench/bench_*; do
  name=$(basename "$program")
  case "$name" in
    bench_file_bench|bench_verify_bench|bench_cipher_bench|bench_tree_bench) continue ;;  # run above
  esac
  [[ -x $program ]] || continue
  echo
  echo "## $name (no peer)"
  "$program" --benchmark_min_time="$([[ $QUICK == 1 ]] && echo 0.05 || echo 0.5)" 2>/dev/null | grep -E '^(BM_|Benchmark|-)' || true
done

echo
echo "## Performance table (OWUtils against its peer, same machine, same run)"
echo
echo "| part | comparison | ratio | kind |"
echo "| --- | --- | --- | --- |"
if [[ -s $ROWS ]]; then
  cat "$ROWS"
else
  echo "| - | no comparison ran | - | - |"
fi
exit $failed

#!/usr/bin/env bash
# Prints the performance table: every benchmark of the library against the tool or library a
# user would pick instead (its peer), measured in one run on this machine, as ratios.
#
#   bench/compare.sh [build-dir]        default build/release (built first with scripts/build.sh)
#
# Each folder of bench/ that has peers keeps its own comparison script, bench/<Folder>/compare.sh,
# which takes the build folder as its first argument and prints its figures, then a section whose
# "== ..." heading mentions "ratio" with one line per comparison: a label, then one or more
# ratios (OWUtils / peer; 1.0 or more is at least as fast). This script runs them all, runs the
# benchmark programs of the folders without one, and gathers every ratio into one Markdown table.
set -euo pipefail
cd "$(dirname "$0")/.."

BUILD=${1:-build/release}
if [[ $BUILD == build/release && ! -d $BUILD ]]; then
  scripts/build.sh release >/dev/null
else
  cmake --build "$BUILD" --parallel "$(nproc 2>/dev/null || echo 2)" >/dev/null
fi
[[ -d $BUILD/bench ]] || { echo "compare.sh: $BUILD has no benchmarks (configure with -DOWUTILS_BUILD_BENCHMARKS=ON)" >&2; exit 2; }

ROWS=$(mktemp /tmp/owutils-compare.XXXXXX)
trap 'rm -f "$ROWS"' EXIT

echo "# OWUtils benchmarks against their peers"
echo "machine: $(nproc 2>/dev/null || echo '?') cores, $(uname -srm), $(date -u '+%Y-%m-%d %H:%M UTC')"

failed=0
for folder in bench/*/; do
  name=$(basename "$folder")
  if [[ -x $folder/compare.sh || -f $folder/compare.sh ]]; then
    echo
    echo "## $name ($folder""compare.sh)"
    if ! output=$(bash "$folder/compare.sh" "$BUILD" 2>&1); then
      echo "$output"
      echo "compare.sh of $name FAILED" >&2
      failed=1
      continue
    fi
    echo "$output"
    # The lines of the ratio sections: "<label> <ratio> [<ratio>...]".
    awk -v part="$name" '
      /^==/ { inratios = (tolower($0) ~ /ratio/); next }
      inratios && NF >= 2 {
        label = ""; ratios = ""
        n = NF
        while (n > 1 && $n ~ /^[0-9]+(\.[0-9]+)?x?$/) { ratios = $n (ratios == "" ? "" : " / " ratios); --n }
        if (ratios == "") next
        for (i = 1; i <= n; ++i) label = label (i > 1 ? " " : "") $i
        printf "| %s | %s | %s |\n", part, label, ratios
      }' <<<"$output" >> "$ROWS"
  else
    # No peers of its own: print the figures of the folder's programs.
    shopt -s nullglob
    for source in "$folder"*.cpp; do
      program=$BUILD/bench/bench_$(basename "$source" .cpp)
      [[ -x $program ]] || continue
      echo
      echo "## $name: $(basename "$program") (no peer comparison)"
      "$program" --benchmark_min_time=0.2 2>/dev/null | grep -E '^(BM_|-|Benchmark)' || true
    done
    shopt -u nullglob
  fi
done

echo
echo "## Performance table (ratio = OWUtils / peer; 1.0 or more is at least as fast)"
echo
echo "| part | comparison | ratio |"
echo "| --- | --- | --- |"
if [[ -s $ROWS ]]; then
  cat "$ROWS"
else
  echo "| - | no comparison scripts found under bench/*/compare.sh | - |"
fi
exit $failed

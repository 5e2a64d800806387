#!/usr/bin/env bash
# Times the tree operations of Directories against the tools a user would pick instead, on one
# generated tree, in the same run:
#   GetTreeSize vs du -sb, CountEntries vs find | wc -l, CopyDirectory vs cp -r,
#   RemoveDirectoryTree vs rm -rf.
# Usage: bench/FileSystem/compare_tree.sh <bench_tree_bench binary> [folders] [files per folder]
# Default tree: 100,000 files in 1,000 folders of 100 bytes each, under /tmp.
set -euo pipefail
bench=${1:?path to bench_tree_bench}
folders=${2:-1000}
files=${3:-100}
root=$(mktemp -d /tmp/owutils-tree-XXXXXX)
trap 'rm -rf "$root"' EXIT

echo "building $((folders * files)) files in $folders folders under $root"
python3 - "$root/src" "$folders" "$files" <<'PY'
import os, sys
root, folders, files = sys.argv[1], int(sys.argv[2]), int(sys.argv[3])
data = b"x" * 100
for f in range(folders):
    d = os.path.join(root, "d%d" % f)
    os.makedirs(d)
    for i in range(files):
        with open(os.path.join(d, "f%d" % i), "wb") as out:
            out.write(data)
PY
sync

# Seconds taken by a command (output discarded), best of three runs with a warm cache.
timeit() {
  local best=""
  for _ in 1 2 3; do
    local start end
    start=$(date +%s.%N)
    "$@" > /dev/null
    end=$(date +%s.%N)
    local t
    t=$(echo "$end - $start" | bc)
    if [ -z "$best" ] || [ "$(echo "$t < $best" | bc)" = 1 ]; then best=$t; fi
  done
  echo "$best"
}
# A command that consumes its input tree: time it once per fresh copy.
timeonce() {
  local start end
  start=$(date +%s.%N)
  "$@" > /dev/null
  end=$(date +%s.%N)
  echo "$end - $start" | bc
}
ratio() { echo "scale=2; $1 / $2" | bc; }
row() { printf '%-22s %9.3f s   %-16s %9.3f s   ratio %s\n' "$1" "$2" "$3" "$4" "$(ratio "$2" "$4")"; }

echo "checks: GetTreeSize=$("$bench" --op size "$root/src") du -sb=$(du -sb --apparent-size "$root/src" | cut -f1)" \
     "CountEntries=$("$bench" --op count "$root/src") find=$(($(find "$root/src" | wc -l) - 1))"

ours=$(timeit "$bench" --op size "$root/src")
peer=$(timeit du -sb "$root/src")
row GetTreeSize "$ours" "du -sb" "$peer"

ours=$(timeit "$bench" --op count "$root/src")
peer=$(timeit sh -c "find '$root/src' | wc -l")
row CountEntries "$ours" "find | wc -l" "$peer"

rm -rf "$root/a" "$root/b"
ours=$(timeonce "$bench" --op copy "$root/src" "$root/a")
peer=$(timeonce cp -r "$root/src" "$root/b")
row CopyDirectory "$ours" "cp -r" "$peer"
sync

ours=$(timeonce "$bench" --op remove "$root/a")
peer=$(timeonce rm -rf "$root/b")
row RemoveDirectoryTree "$ours" "rm -rf" "$peer"

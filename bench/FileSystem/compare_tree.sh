#!/usr/bin/env bash
# Times the tree operations of Directories against the tools a user would pick instead, on one
# generated tree, in the same run:
#   GetTreeSize vs du -sb, CountEntries vs find | wc -l, CopyDirectory vs cp -r,
#   RemoveDirectoryTree vs rm -rf.
# Usage: bench/FileSystem/compare_tree.sh <bench_tree_bench binary> [folders] [files per folder]
# Default tree: 100,000 files of 100 bytes in 1,000 folders, under $TREE_BASE (default /tmp;
# TREE_BASE=/dev/shm takes the disk's write-back out of the figures).
# Each row gives wall-clock seconds and CPU seconds (user + system) of both, and the wall ratio.
set -euo pipefail
bench=${1:?path to bench_tree_bench}
folders=${2:-1000}
files=${3:-100}
root=$(mktemp -d "${TREE_BASE:-/tmp}/owutils-tree-XXXXXX")
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

# "wall cpu" seconds of one run of a command (output discarded).
measure() {
  local out
  out=$( { /usr/bin/time -f "%e %U %S" "$@" > /dev/null; } 2>&1 | tail -1)
  echo "$out" | awk '{ printf "%.3f %.3f\n", $1, $2 + $3 }'
}
# Best of three runs (by wall time), for commands that leave the tree as it is.
best() {
  local best="" line
  for _ in 1 2 3; do
    line=$(measure "$@")
    if [ -z "$best" ] || [ "$(echo "${line%% *} < ${best%% *}" | bc)" = 1 ]; then best=$line; fi
  done
  echo "$best"
}
row() {
  local name=$1 ours=$2 peerName=$3 peer=$4
  local ratio
  ratio=$(echo "scale=2; ${ours%% *} / ${peer%% *}" | bc)
  printf '%-20s %8.3f s (cpu %6.3f)   %-13s %8.3f s (cpu %6.3f)   ratio %s\n' \
    "$name" "${ours%% *}" "${ours##* }" "$peerName" "${peer%% *}" "${peer##* }" "$ratio"
}

echo "checks: GetTreeSize=$("$bench" --op size "$root/src") bytes in files" \
     "(du -sb with folders: $(du -sb "$root/src" | cut -f1))," \
     "CountEntries=$("$bench" --op count "$root/src") find=$(($(find "$root/src" | wc -l) - 1))"

row GetTreeSize "$(best "$bench" --op size "$root/src")" "du -sb" "$(best du -sb "$root/src")"
row CountEntries "$(best "$bench" --op count "$root/src")" "find | wc -l" "$(best sh -c "find '$root/src' | wc -l")"

# Copies and removals write: each starts after the device has settled (sync), the peer first.
rm -rf "$root/a" "$root/b"
sync; sleep 2
peer=$(measure cp -r "$root/src" "$root/b")
sync; sleep 2
ours=$(measure "$bench" --op copy "$root/src" "$root/a")
row CopyDirectory "$ours" "cp -r" "$peer"
if ! diff -r "$root/src" "$root/a" > /dev/null; then echo "copy differs from its source"; fi

sync; sleep 2
peer=$(measure rm -rf "$root/b")
sync; sleep 2
ours=$(measure "$bench" --op remove "$root/a")
row RemoveDirectoryTree "$ours" "rm -rf" "$peer"

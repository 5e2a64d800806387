#!/usr/bin/env bash
# Runs the security benchmarks beside the tools a user would pick instead, on the same file in
# the page cache, in one run:
#   EncryptFile / DecryptFile   vs  openssl enc -<cipher>-ecb -nopad
#   DigestFile SHA-1/MD5/RIPEMD-160 vs openssl dgst, sha1sum, md5sum
#   DigestFile CRC-32           vs  zlib crc32 (in bench_file_bench)
#   peak memory of EncryptFile on the file, and VerifySecretKey verifications per second.
#
#   bench/secure/compare.sh [build-dir] [size-MiB]     (defaults: build/rel, 1024)
set -euo pipefail

BUILD=${1:-build/rel}
SIZE_MB=${2:-1024}
FILE=${OWUTILS_BENCH_FILE:-/tmp/owutils-bench-${SIZE_MB}m.bin}
OUT=$(mktemp /tmp/owutils-bench-out.XXXXXX)
export OWUTILS_BENCH_FILE=$FILE

FILE_BENCH=$BUILD/bench/bench_file_bench
VERIFY_BENCH=$BUILD/bench/bench_verify_bench
for b in "$FILE_BENCH" "$VERIFY_BENCH"; do
  [[ -x $b ]] || { echo "missing $b (build with -DCMAKE_BUILD_TYPE=Release)" >&2; exit 1; }
done

if [[ ! -f $FILE || $(stat -c %s "$FILE") -ne $((SIZE_MB * 1048576)) ]]; then
  echo "making $FILE ($SIZE_MB MiB)"
  head -c $((SIZE_MB * 1048576)) /dev/urandom > "$FILE"
fi
cat "$FILE" > /dev/null   # into the page cache
BYTES=$(stat -c %s "$FILE")

# "<wall seconds> <cpu seconds> <peak KiB>" of one command
TIMES=$(mktemp /tmp/owutils-bench-time.XXXXXX)
trap 'rm -f "$OUT" "$OUT.csv" "$TIMES"' EXIT
measure() {
  /usr/bin/time -f "%e %U %S %M" -o "$TIMES" "$@" > /dev/null 2>&1 || true
  awk '{ printf "%s %.2f %s\n", $1, $2 + $3, $4 }' "$TIMES"
}
rate() { awk -v b="$BYTES" -v s="$1" 'BEGIN { if (s <= 0) s = 0.001; printf "%.0f", b / 1048576 / s }'; }

echo "== file: $FILE, $BYTES bytes"
echo
echo "== OWUtils (bench_file_bench)"
# CSV: name,iterations,real_time,cpu_time,time_unit,bytes_per_second,items_per_second,label,...
"$FILE_BENCH" --benchmark_format=csv 2>/dev/null | grep '^"' > "$OUT.csv"
echo "                                          wall MiB/s   CPU MiB/s"
awk -F, -v b="$BYTES" '{ gsub(/"/, ""); printf "%-42s %8.0f %11.0f  %s\n", $1, $6 / 1048576, b / 1048576 / ($4 / 1000), $8 }' "$OUT.csv"

# our throughput for one benchmark: wall (bytes_per_second) or CPU (file size / cpu_time)
ours() { grep "^\"$1" "$OUT.csv" | awk -F, '{ printf "%.0f", $6 / 1048576 }'; }
ours_cpu() { grep "^\"$1" "$OUT.csv" | awk -F, -v b="$BYTES" '{ printf "%.0f", b / 1048576 / ($4 / 1000) }'; }

echo
echo "== peers (same file, same run)"
KEY16=000102030405060708090a0b0c0d0e0f
KEY24=000102030405060708090a0b0c0d0e0f1011121314151617
KEY32=000102030405060708090a0b0c0d0e0f101112131415161718191a1b1c1d1e1f
declare -A PEER PEERCPU
echo "                                          wall MiB/s   CPU MiB/s"
record() {  # name, label, wall, cpu
  PEER[$1]=$(rate "$3"); PEERCPU[$1]=$(rate "$4")
  printf "%-42s %8s %11s\n" "$2" "${PEER[$1]}" "${PEERCPU[$1]}"
}
peer_enc() {  # name, openssl cipher, key
  local t c
  read -r t c _ < <(measure openssl enc "-$2" -nopad -K "$3" -in "$FILE" -out "$OUT")
  record "$1" "openssl enc -$2" "$t" "$c"
}
peer_enc aes128 aes-128-ecb $KEY16
peer_enc aes256 aes-256-ecb $KEY32
peer_enc 3des des-ede3-ecb $KEY24
if openssl enc -bf-ecb -provider legacy -provider default -nopad -K $KEY16 -in /dev/null -out /dev/null 2>/dev/null; then
  read -r t c _ < <(measure openssl enc -bf-ecb -provider legacy -provider default -nopad -K $KEY16 -in "$FILE" -out "$OUT")
  record bf "openssl enc -bf-ecb" "$t" "$c"
fi
peer_dgst() {  # name, command...
  local name=$1 t c; shift
  read -r t c _ < <(measure "$@" "$FILE")
  record "$name" "$*" "$t" "$c"
}
peer_dgst dgst-sha1 openssl dgst -sha1
peer_dgst sha1sum sha1sum
peer_dgst dgst-md5 openssl dgst -md5
peer_dgst md5sum md5sum
peer_dgst dgst-rmd openssl dgst -ripemd160

echo
echo "== ratios (OWUtils / peer; >= 1.0 is at least as fast)        wall     CPU"
ratio() {  # label, our benchmark, peer name (or "zlib")
  local a ac b bc
  a=$(ours "$2"); ac=$(ours_cpu "$2")
  if [[ $3 == zlib ]]; then b=$(ours BM_ZlibCrc32File); bc=$(ours_cpu BM_ZlibCrc32File); else b=${PEER[$3]:-0}; bc=${PEERCPU[$3]:-0}; fi
  awk -v a="$a" -v b="$b" -v ac="$ac" -v bc="$bc" -v n="$1" \
    'BEGIN { if (b > 0 && bc > 0) printf "%-56s %6.2f  %6.2f\n", n, a / b, ac / bc }'
}
ratio "EncryptFile AES-128 / openssl aes-128-ecb" BM_EncryptFile/11/ aes128
ratio "DecryptFile AES-128 / openssl aes-128-ecb" BM_DecryptFile/11/ aes128
ratio "EncryptFile AES-256 / openssl aes-256-ecb" BM_EncryptFile/13/ aes256
ratio "DecryptFile AES-256 / openssl aes-256-ecb" BM_DecryptFile/13/ aes256
ratio "EncryptFile 3DES / openssl des-ede3-ecb" BM_EncryptFile/2/ 3des
ratio "DecryptFile 3DES / openssl des-ede3-ecb" BM_DecryptFile/2/ 3des
ratio "EncryptFile Blowfish / openssl bf-ecb" BM_EncryptFile/1/ bf
ratio "DecryptFile Blowfish / openssl bf-ecb" BM_DecryptFile/1/ bf
ratio "DigestFile SHA-1 / openssl dgst -sha1" BM_DigestFile/20/ dgst-sha1
ratio "DigestFile SHA-1 / sha1sum" BM_DigestFile/20/ sha1sum
ratio "DigestFile MD5 / openssl dgst -md5" BM_DigestFile/22/ dgst-md5
ratio "DigestFile MD5 / md5sum" BM_DigestFile/22/ md5sum
ratio "DigestFile RIPEMD-160 / openssl dgst -ripemd160" BM_DigestFile/21/ dgst-rmd
ratio "DigestFile CRC-32 / zlib crc32" BM_DigestFile/30/ zlib
echo
echo "== peak memory (maximum resident set, KiB)"
read -r _ _ kib < <(measure "$FILE_BENCH" --benchmark_filter='^NONE$')
echo "bench_file_bench running nothing (program baseline):         $kib KiB"
read -r _ _ kib < <(measure "$FILE_BENCH" --benchmark_filter='BM_EncryptFile/11/')
echo "bench_file_bench EncryptFile+DecryptFile AES-128 on the file: $kib KiB"
read -r _ _ kib < <(measure "$FILE_BENCH" --benchmark_filter='BM_DigestFile/20/')
echo "bench_file_bench DigestFile SHA-1 on the file:               $kib KiB"
read -r _ _ kib < <(measure openssl enc -aes-128-ecb -nopad -K $KEY16 -in "$FILE" -out "$OUT")
echo "openssl enc -aes-128-ecb:                                    $kib KiB"

echo
echo "== VerifySecretKey (one core)"
"$VERIFY_BENCH" --benchmark_min_time=0.3 2>/dev/null | grep BM_ | \
  awk '{ for (i = 1; i <= NF; ++i) if ($i ~ /^items_per_second=/) { sub("items_per_second=", "", $i); r = $i }
         printf "encType %-3s %-9s %s verifications/s\n", substr($1, 20), $NF, r }'

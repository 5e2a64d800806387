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
trap 'rm -f "$OUT"' EXIT

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

# seconds and peak KiB of one command
measure() {
  /usr/bin/time -f "%e %M" -o /tmp/owutils-bench-time.$$ "$@" > /dev/null 2>&1
  cat /tmp/owutils-bench-time.$$
  rm -f /tmp/owutils-bench-time.$$
}
rate() { awk -v b="$BYTES" -v s="$1" 'BEGIN { if (s <= 0) s = 0.001; printf "%.0f", b / 1048576 / s }'; }

echo "== file: $FILE, $BYTES bytes"
echo
echo "== OWUtils (bench_file_bench)"
"$FILE_BENCH" --benchmark_format=csv 2>/dev/null | tee "$OUT.csv" | grep -v '^name' | \
  awk -F, '{ printf "%-28s %8.0f MiB/s  %s\n", $1, $7 / 1048576, $11 }' | tr -d '"'

ours() { grep "^\"$1\"" "$OUT.csv" | awk -F, '{ printf "%.0f", $7 / 1048576 }'; }

echo
echo "== peers (same file, same run)"
KEY16=000102030405060708090a0b0c0d0e0f
KEY24=000102030405060708090a0b0c0d0e0f1011121314151617
KEY32=000102030405060708090a0b0c0d0e0f101112131415161718191a1b1c1d1e1f
declare -A PEER
peer_enc() {  # name, openssl cipher, key
  local t
  read -r t _ < <(measure openssl enc "-$2" -nopad -K "$3" -in "$FILE" -out "$OUT")
  PEER[$1]=$(rate "$t")
  printf "%-28s %8s MiB/s\n" "openssl enc -$2" "${PEER[$1]}"
}
peer_enc aes128 aes-128-ecb $KEY16
peer_enc aes256 aes-256-ecb $KEY32
peer_enc 3des des-ede3-ecb $KEY24
if openssl enc -bf-ecb -provider legacy -provider default -nopad -K $KEY16 -in /dev/null -out /dev/null 2>/dev/null; then
  read -r t _ < <(measure openssl enc -bf-ecb -provider legacy -provider default -nopad -K $KEY16 -in "$FILE" -out "$OUT")
  PEER[bf]=$(rate "$t"); printf "%-28s %8s MiB/s\n" "openssl enc -bf-ecb" "${PEER[bf]}"
fi
peer_dgst() {  # name, command...
  local name=$1 t; shift
  read -r t _ < <(measure "$@" "$FILE")
  PEER[$name]=$(rate "$t")
  printf "%-28s %8s MiB/s\n" "$*" "${PEER[$name]}"
}
peer_dgst dgst-sha1 openssl dgst -sha1
peer_dgst sha1sum sha1sum
peer_dgst dgst-md5 openssl dgst -md5
peer_dgst md5sum md5sum
peer_dgst dgst-rmd openssl dgst -ripemd160

echo
echo "== ratios (OWUtils / peer; >= 1.0 is at least as fast)"
ratio() { awk -v a="$2" -v b="$3" -v n="$1" 'BEGIN { if (b > 0 && a > 0) printf "%-44s %6.2f  (%s vs %s MiB/s)\n", n, a / b, a, b }'; }
ratio "EncryptFile AES-128 / openssl aes-128-ecb" "$(ours BM_EncryptFile/11/iterations:1/real_time)" "${PEER[aes128]}"
ratio "DecryptFile AES-128 / openssl aes-128-ecb" "$(ours BM_DecryptFile/11/iterations:1/real_time)" "${PEER[aes128]}"
ratio "EncryptFile AES-256 / openssl aes-256-ecb" "$(ours BM_EncryptFile/13/iterations:1/real_time)" "${PEER[aes256]}"
ratio "DecryptFile AES-256 / openssl aes-256-ecb" "$(ours BM_DecryptFile/13/iterations:1/real_time)" "${PEER[aes256]}"
ratio "EncryptFile 3DES / openssl des-ede3-ecb" "$(ours BM_EncryptFile/2/iterations:1/real_time)" "${PEER[3des]}"
ratio "EncryptFile Blowfish / openssl bf-ecb" "$(ours BM_EncryptFile/1/iterations:1/real_time)" "${PEER[bf]:-0}"
ratio "DigestFile SHA-1 / openssl dgst -sha1" "$(ours BM_DigestFile/20/iterations:1/real_time)" "${PEER[dgst-sha1]}"
ratio "DigestFile SHA-1 / sha1sum" "$(ours BM_DigestFile/20/iterations:1/real_time)" "${PEER[sha1sum]}"
ratio "DigestFile MD5 / openssl dgst -md5" "$(ours BM_DigestFile/22/iterations:1/real_time)" "${PEER[dgst-md5]}"
ratio "DigestFile MD5 / md5sum" "$(ours BM_DigestFile/22/iterations:1/real_time)" "${PEER[md5sum]}"
ratio "DigestFile RIPEMD-160 / openssl dgst -ripemd160" "$(ours BM_DigestFile/21/iterations:1/real_time)" "${PEER[dgst-rmd]}"
ratio "DigestFile CRC-32 / zlib crc32" "$(ours BM_DigestFile/30/iterations:1/real_time)" "$(ours BM_ZlibCrc32File/iterations:1/real_time)"

echo
echo "== peak memory (maximum resident set, KiB)"
read -r _ kib < <(measure "$FILE_BENCH" --benchmark_filter='BM_EncryptFile/11/')
echo "bench_file_bench EncryptFile+DecryptFile AES-128 on the file: $kib KiB"
read -r _ kib < <(measure "$FILE_BENCH" --benchmark_filter='BM_DigestFile/20/')
echo "bench_file_bench DigestFile SHA-1 on the file:               $kib KiB"
read -r _ kib < <(measure openssl enc -aes-128-ecb -nopad -K $KEY16 -in "$FILE" -out "$OUT")
echo "openssl enc -aes-128-ecb:                                    $kib KiB"

echo
echo "== VerifySecretKey (one core)"
"$VERIFY_BENCH" --benchmark_min_time=0.3 2>/dev/null | grep BM_ | \
  awk '{ for (i = 1; i <= NF; ++i) if ($i ~ /^items_per_second=/) { sub("items_per_second=", "", $i); r = $i }
         printf "encType %-3s %-9s %s verifications/s\n", substr($1, 20), $NF, r }'
rm -f "$OUT.csv"

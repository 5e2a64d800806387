// File encryption and file digests on one large file (bench/secure/compare.sh makes it and runs
// the peer tools on the same file in the same run).
//
//   OWUTILS_BENCH_FILE=/tmp/owutils-bench.bin bench_file_bench
//
// EncryptFile and DecryptFile of one cipher run back to back, so the file ends as it began.
#include <benchmark/benchmark.h>

#include <zlib.h>

#include <cstdio>
#include <cstdlib>
#include <string>
#include <vector>

#include "owutils/CEncrypt.h"
#include "owutils/tstring.h"

namespace {

std::string NativeFile() {
  const char* path = std::getenv("OWUTILS_BENCH_FILE");
  return path != nullptr ? path : "/tmp/owutils-bench.bin";
}

int64_t FileSize(const std::string& path) {
  FILE* f = std::fopen(path.c_str(), "rb");
  if (f == nullptr) return -1;
  std::fseek(f, 0, SEEK_END);
  const int64_t size = std::ftell(f);
  std::fclose(f);
  return size;
}

// The library's view of the native path: the default drive map puts C: at the root.
CString LibraryPath(const std::string& native) {
  Lumo::String wide;
  wide.AssignUtf8(native.c_str());
  for (auto& c : wide) {
    if (c == u'/') c = u'\\';
  }
  return CString(u"C:" + static_cast<std::u16string&>(wide));
}

void BM_EncryptFile(benchmark::State& state) {
  const std::string native = NativeFile();
  const int64_t size = FileSize(native);
  if (size < 0) return state.SkipWithError("no benchmark file");
  CEncrypt encryptor(static_cast<int>(state.range(0)), TRUE, CString(u"benchmark key"));
  const CString path = LibraryPath(native);
  for (auto _ : state) {
    if (!encryptor.EncryptFile(path)) state.SkipWithError("EncryptFile failed");
    state.PauseTiming();
    if (!encryptor.DecryptFile(path)) state.SkipWithError("DecryptFile failed");
    state.ResumeTiming();
  }
  state.SetBytesProcessed(state.iterations() * size);
  state.SetLabel(Lumo::String(CEncrypt::GetEncryptionTypeString(static_cast<int>(state.range(0)))).ToUtf8().Get());
}

void BM_DecryptFile(benchmark::State& state) {
  const std::string native = NativeFile();
  const int64_t size = FileSize(native);
  if (size < 0) return state.SkipWithError("no benchmark file");
  CEncrypt encryptor(static_cast<int>(state.range(0)), TRUE, CString(u"benchmark key"));
  const CString path = LibraryPath(native);
  for (auto _ : state) {
    state.PauseTiming();
    if (!encryptor.EncryptFile(path)) state.SkipWithError("EncryptFile failed");
    state.ResumeTiming();
    if (!encryptor.DecryptFile(path)) state.SkipWithError("DecryptFile failed");
  }
  state.SetBytesProcessed(state.iterations() * size);
  state.SetLabel(Lumo::String(CEncrypt::GetEncryptionTypeString(static_cast<int>(state.range(0)))).ToUtf8().Get());
}

void BM_DigestFile(benchmark::State& state) {
  const std::string native = NativeFile();
  const int64_t size = FileSize(native);
  if (size < 0) return state.SkipWithError("no benchmark file");
  CEncrypt digest(static_cast<int>(state.range(0)), TRUE);
  const CString path = LibraryPath(native);
  for (auto _ : state) {
    if (!digest.DigestFile(path)) state.SkipWithError("DigestFile failed");
    benchmark::DoNotOptimize(digest.GetDigestResultString());
  }
  state.SetBytesProcessed(state.iterations() * size);
}

// The peer for CRC-32: zlib's crc32 over the same file, read in the same 20480-byte chunks.
void BM_ZlibCrc32File(benchmark::State& state) {
  const std::string native = NativeFile();
  const int64_t size = FileSize(native);
  if (size < 0) return state.SkipWithError("no benchmark file");
  std::vector<unsigned char> buffer(20480);
  for (auto _ : state) {
    FILE* f = std::fopen(native.c_str(), "rb");
    if (f == nullptr) return state.SkipWithError("cannot open");
    std::setvbuf(f, nullptr, _IONBF, 0);
    uLong crc = crc32(0, nullptr, 0);
    size_t n;
    while ((n = std::fread(buffer.data(), 1, buffer.size(), f)) > 0) crc = crc32(crc, buffer.data(), static_cast<uInt>(n));
    std::fclose(f);
    benchmark::DoNotOptimize(crc);
  }
  state.SetBytesProcessed(state.iterations() * size);
}

BENCHMARK(BM_EncryptFile)->Arg(ENC_AES_128)->Arg(ENC_AES_256)->Arg(ENC_TRIPLE_DES)->Arg(ENC_BLOWFISH)
    ->Iterations(1)->UseRealTime()->Unit(benchmark::kMillisecond);
BENCHMARK(BM_DecryptFile)->Arg(ENC_AES_128)->Arg(ENC_AES_256)->Arg(ENC_TRIPLE_DES)->Arg(ENC_BLOWFISH)
    ->Iterations(1)->UseRealTime()->Unit(benchmark::kMillisecond);
BENCHMARK(BM_DigestFile)->Arg(DIGEST_SHA1)->Arg(DIGEST_MD5)->Arg(DIGEST_RIPEMD160)->Arg(DIGEST_CRC32)
    ->Iterations(1)->UseRealTime()->Unit(benchmark::kMillisecond);
BENCHMARK(BM_ZlibCrc32File)->Iterations(1)->UseRealTime()->Unit(benchmark::kMillisecond);

}  // namespace

BENCHMARK_MAIN();

// In-memory throughput of CEncrypt: Encrypt per cipher code over a 1 MiB buffer, and Digest per
// digest code, and the CRC-32 of Crypto++ beside zlib's.
#include <benchmark/benchmark.h>

#include <vector>

#include <crypto++/crc.h>

#include "owutils/CEncrypt.h"
#include "owutils/tstring.h"

namespace {

constexpr int kBytes = 1 << 20;

void BM_Encrypt(benchmark::State& state) {
  const int type = static_cast<int>(state.range(0));
  CEncrypt encryptor(type, TRUE, CString(u"benchmark key"));
  std::vector<BYTE> buffer(kBytes, 0x5A);
  for (auto _ : state) {
    encryptor.Encrypt(buffer.data(), kBytes);
    benchmark::ClobberMemory();
  }
  state.SetBytesProcessed(state.iterations() * static_cast<int64_t>(kBytes));
  state.SetLabel(Lumo::String(CEncrypt::GetEncryptionTypeString(type)).ToUtf8().Get());
}
BENCHMARK(BM_Encrypt)->DenseRange(1, 13);

void BM_Digest(benchmark::State& state) {
  const int type = static_cast<int>(state.range(0));
  CEncrypt digest(type, TRUE);
  std::vector<BYTE> buffer(kBytes, 0x5A);
  for (auto _ : state) {
    digest.Digest(buffer.data(), kBytes);
    benchmark::ClobberMemory();
  }
  state.SetBytesProcessed(state.iterations() * static_cast<int64_t>(kBytes));
}
BENCHMARK(BM_Digest)->Arg(20)->Arg(21)->Arg(22)->Arg(30);

// The road not taken for CRC-32: Crypto++'s table-driven CRC32, against zlib's in BM_Digest/30.
void BM_CryptoppCrc32(benchmark::State& state) {
  CryptoPP::CRC32 crc;
  std::vector<BYTE> buffer(kBytes, 0x5A);
  for (auto _ : state) {
    crc.Update(buffer.data(), kBytes);
    benchmark::ClobberMemory();
  }
  state.SetBytesProcessed(state.iterations() * static_cast<int64_t>(kBytes));
}
BENCHMARK(BM_CryptoppCrc32);

}  // namespace

BENCHMARK_MAIN();

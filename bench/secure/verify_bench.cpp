// VerifySecretKey: verifications per second for each external encryption type.
#include <benchmark/benchmark.h>

#include "owutils/CEncrypt.h"
#include "owutils/SecretKey.h"

namespace {

const int kTypeCodes[] = {0, 1, 2, 3, 4, 5, 6, 9, 10, 11, 12, 13};
const char16_t* const kNames[] = {u"", u"Blowfish", u"3DES", u"2DES", u"SAFER", u"IDEA", u"RC5",
                                  u"Twofish", u"MARS", u"AES128", u"AES192", u"AES256"};

void BM_VerifySecretKey(benchmark::State& state) {
  const int encType = static_cast<int>(state.range(0));
  CEncrypt maker(kTypeCodes[encType], TRUE, CString(u"benchmark key"));
  const Lumo::String code(maker.EncryptString(CString(u"harborlanternmeadowquietstoneelm")).GetString());
  const Lumo::String key(u"benchmark key");
  for (auto _ : state) {
    bool ok = VerifySecretKey(key, code, encType);
    benchmark::DoNotOptimize(ok);
    if (!ok) state.SkipWithError("verification failed");
  }
  state.SetItemsProcessed(state.iterations());
  state.SetLabel(Lumo::String(kNames[encType]).ToUtf8().Get());
}
BENCHMARK(BM_VerifySecretKey)->DenseRange(1, 11);

}  // namespace

BENCHMARK_MAIN();

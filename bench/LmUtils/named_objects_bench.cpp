// Named-object lookups per second, from one and from two threads at once.
#include <benchmark/benchmark.h>

#include "owutils/NamedObjects.h"

namespace {

void BM_LmObjectGet(benchmark::State& state) {
  static int objects[64];
  if (state.thread_index() == 0) {
    // A table of some size, as a client program would have.
    for (int i = 0; i < 64; ++i) {
      std::u16string name = u"Bench.Object." + std::u16string(1, static_cast<char16_t>(u'A' + i % 26)) +
                            std::u16string(1, static_cast<char16_t>(u'a' + i / 26));
      LmObjectAdd(name.c_str(), &objects[i]);
    }
  }
  for (auto _ : state) benchmark::DoNotOptimize(LmObjectGet(u"LM_EVENT_HANDLER"));
  state.SetItemsProcessed(state.iterations());
}
BENCHMARK(BM_LmObjectGet)->Threads(1)->Threads(2)->UseRealTime();

}  // namespace

BENCHMARK_MAIN();

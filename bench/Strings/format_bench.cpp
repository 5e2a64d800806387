// Lumo::String::Format against the C library's swprintf-equivalent path (snprintf + widening is
// what a caller would otherwise write), for a typical exception message.
#include <benchmark/benchmark.h>

#include <cstdio>
#include <string>

#include "owutils/tstring.h"

static void BM_LumoFormat(benchmark::State& state) {
  for (auto _ : state) {
    Lumo::String s;
    s.Format(u"Function '%s' failed for file '%s', error %d: %s", u"CreateFile", u"C:\\data\\file.bin", 5,
             u"Access is denied.");
    benchmark::DoNotOptimize(s);
  }
}
BENCHMARK(BM_LumoFormat);

static void BM_SnprintfNarrow(benchmark::State& state) {
  for (auto _ : state) {
    char buffer[1024];
    int n = std::snprintf(buffer, sizeof buffer, "Function '%s' failed for file '%s', error %d: %s", "CreateFile",
                          "C:\\data\\file.bin", 5, "Access is denied.");
    std::string s(buffer, static_cast<size_t>(n));
    benchmark::DoNotOptimize(s);
  }
}
BENCHMARK(BM_SnprintfNarrow);

static void BM_Utf8RoundTrip(benchmark::State& state) {
  const std::string text(static_cast<size_t>(state.range(0)), 'x');
  for (auto _ : state) {
    Lumo::String s(text.c_str());
    Lumo::CharArrayHolder back = s.ToUtf8();
    benchmark::DoNotOptimize(back.Get());
  }
  state.SetBytesProcessed(static_cast<int64_t>(state.iterations()) * state.range(0));
}
BENCHMARK(BM_Utf8RoundTrip)->Arg(64)->Arg(4096);

BENCHMARK_MAIN();

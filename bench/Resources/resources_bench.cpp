// Engine strings and presentation texts: a string lookup in a loaded resource module against a
// hash map of the same strings (what a program keeping its texts in memory would do), and the
// size and time texts against the C library's strftime.
#include <benchmark/benchmark.h>

#include <ctime>
#include <string>
#include <unordered_map>

#include "LmUtils/ResourceState.h"
#include "owutils/LmFormat.h"
#include "owutils/LmResources.h"
#include "owutils/Paths.h"
#include "platform/Modules.h"
#include "platform/Process.h"

namespace {

// The shipped modules, built in <build>/lib beside this program's <build>/bench.
CString ShippedModules() {
  char16_t path[4096];
  DWORD n = Platform::GetModuleFileNameW(nullptr, path, 4096);
  CString program(path, static_cast<int>(n));
  CString bench = program.Left(program.ReverseFind(u'\\'));
  return Paths::Combine(bench.Left(bench.ReverseFind(u'\\')), u"lib");
}

HMODULE Engine() {
  static HMODULE engine = [] {
    LmUtils::detail::SetResourceDirectoryForTesting(ShippedModules());
    return LoadEngineResources() ? GetEngineResourceHandle() : nullptr;
  }();
  return engine;
}

void BM_LoadStringW(benchmark::State& state) {
  HMODULE engine = Engine();
  if (engine == nullptr) return state.SkipWithError("no engine module");
  UINT id = 1000;
  for (auto _ : state) {
    const char16_t* text = nullptr;
    int length = Platform::LoadStringW(engine, id, reinterpret_cast<char16_t*>(&text), 0);
    benchmark::DoNotOptimize(length);
    id = id == 1309 ? 1000 : id + 1;
  }
}
BENCHMARK(BM_LoadStringW);

void BM_UnorderedMapLookup(benchmark::State& state) {
  std::unordered_map<UINT, std::u16string> table;
  for (UINT id = 1000; id <= 1309; ++id) table[id] = u"Completed with warnings";
  UINT id = 1000;
  for (auto _ : state) {
    auto it = table.find(id);
    benchmark::DoNotOptimize(it);
    id = id == 1309 ? 1000 : id + 1;
  }
}
BENCHMARK(BM_UnorderedMapLookup);

void BM_LVXSS_get(benchmark::State& state) {
  if (Engine() == nullptr) return state.SkipWithError("no engine module");
  for (auto _ : state) {
    CString text = LVXSS_get(1005);
    benchmark::DoNotOptimize(text);
  }
}
BENCHMARK(BM_LVXSS_get);

void BM_FormatSize(benchmark::State& state) {
  std::int64_t bytes = 1;
  for (auto _ : state) {
    CString text = FormatSize(bytes);
    benchmark::DoNotOptimize(text);
    bytes = bytes * 3 % 6000000000LL;
  }
}
BENCHMARK(BM_FormatSize);

void BM_FormatTime(benchmark::State& state) {
  std::int64_t time = 1700000000;
  for (auto _ : state) {
    CString text = FormatTime(time++);
    benchmark::DoNotOptimize(text);
  }
}
BENCHMARK(BM_FormatTime);

void BM_StrftimeBaseline(benchmark::State& state) {
  std::time_t time = 1700000000;
  for (auto _ : state) {
    char buffer[128];
    std::size_t n = std::strftime(buffer, sizeof buffer, "%m/%d/%Y %I:%M:%S %p", std::localtime(&time));
    std::string text(buffer, n);
    benchmark::DoNotOptimize(text);
    ++time;
  }
}
BENCHMARK(BM_StrftimeBaseline);

}  // namespace

BENCHMARK_MAIN();

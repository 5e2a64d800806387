// Event-log throughput: records written per second through EventLogger::ReportStrings (each one
// committed durably to the store before the call returns), and records read per second through
// EventLogger::ReadEventLog.
#include <benchmark/benchmark.h>

#include <cstdlib>
#include <filesystem>
#include <random>
#include <string>

#include "owutils/EventLogger.h"

namespace {

// A logger that writes to the event log through its own source, as a service would set it up.
class BenchLogger : public LumoException::EventLogger {
 public:
  explicit BenchLogger(const char16_t* source) : EventLogger(source, nullptr) {
    m_nMessageTargets = LumoException::ToEventLog;
    m_strMessageFile = u"/nonexistent/BenchMessages.so";
    m_hEventSource = RegisterSource(source, m_strMessageFile);
  }
};

// A fresh state folder per benchmark.
std::string FreshStateDirectory() {
  std::random_device random;
  auto dir = std::filesystem::temp_directory_path() / ("owutils-bench-" + std::to_string(random()));
  std::filesystem::create_directories(dir);
  setenv("OWUTILS_STATE_DIR", dir.c_str(), 1);
  return dir.string();
}

const Lumo::StringList& Inserts() {
  static const Lumo::StringList inserts{u"Backup job 'Nightly' finished", u"C:\\Data\\Projects", u"1523 files",
                                        u"2.41 GB"};
  return inserts;
}

void BM_ReportStrings(benchmark::State& state) {
  const std::string dir = FreshStateDirectory();
  {
    BenchLogger logger(u"OWBench");
    for (auto _ : state) {
      if (!logger.ReportStrings(4, 0x40000001, Inserts(), 0, nullptr)) state.SkipWithError("ReportStrings failed");
    }
    state.SetItemsProcessed(state.iterations());
  }
  std::filesystem::remove_all(dir);
}
BENCHMARK(BM_ReportStrings)->Unit(benchmark::kMicrosecond);

void BM_ReadEventLog(benchmark::State& state) {
  const std::string dir = FreshStateDirectory();
  const unsigned count = static_cast<unsigned>(state.range(0));
  {
    BenchLogger logger(u"OWBench");
    for (unsigned i = 0; i < count; ++i) logger.ReportStrings(4, 0x40000001, Inserts(), 0, nullptr);
    Lumo::StringList records;
    for (auto _ : state) {
      DWORD next = 0;
      logger.ReadEventLog(1, count, true, records, next);
      if (records.size() != count) state.SkipWithError("records missing");
      benchmark::DoNotOptimize(records.data());
    }
    state.SetItemsProcessed(state.iterations() * count);
  }
  std::filesystem::remove_all(dir);
}
BENCHMARK(BM_ReadEventLog)->Arg(10000)->Unit(benchmark::kMillisecond);

}  // namespace

BENCHMARK_MAIN();

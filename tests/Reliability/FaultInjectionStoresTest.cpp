// Faults of the registry and event-log stores: a writer process killed at any moment, and a
// writer whose disk fills up (file size limit). Afterwards the store must open and read, hold
// every record the writer saw committed, and take new records.
#include <gtest/gtest.h>

#include <chrono>
#include <thread>

#include "StoreSupport.h"

namespace {

// Reads the child's lines; after `killAfter` confirmations (or at once when 0) waits `delay`
// and kills it, then drains what it had written. Returns the confirmed numbers.
std::vector<long> RunAndKill(const std::string& role, const std::map<std::string, std::string>& env, int killAfter,
                             std::chrono::microseconds delay, int& status) {
  OwTest::Child child = OwTest::StartChild(role, env);
  std::vector<long> confirmed;
  std::string line;
  bool killed = false;
  auto kill = [&] {
    std::this_thread::sleep_for(delay);
    ::kill(child.pid, SIGKILL);
    killed = true;
  };
  if (killAfter == 0) kill();
  while (OwTest::ReadLine(child.output, line)) {
    if (line.rfind("fail", 0) == 0) {
      ADD_FAILURE() << role << ": " << line;
      continue;
    }
    confirmed.push_back(std::atol(line.c_str()));
    if (!killed && static_cast<int>(confirmed.size()) >= killAfter) kill();
  }
  status = OwTest::Wait(child);
  return confirmed;
}

struct KillPoint {
  int after;
  int delayUs;
};
constexpr KillPoint kKillPoints[] = {{0, 2000}, {0, 20000}, {1, 0}, {5, 300}, {40, 0}, {120, 1000}};

TEST(FaultInjectionStores, RegistryWriterKilledAnywhereLosesNoCommittedValue) {
  int round = 0;
  for (const KillPoint& point : kKillPoints) {
    const std::string name = "Crash" + std::to_string(round++);
    int status = 0;
    const std::vector<long> confirmed = RunAndKill("registry-writer", {{"OWREL_KEY", name}}, point.after,
                                                   std::chrono::microseconds(point.delayUs), status);
    EXPECT_EQ(status, 128 + SIGKILL) << name;
    EXPECT_GE(static_cast<int>(confirmed.size()), point.after) << name;
    const std::u16string key = u"Software\\OwReliability\\" + OwTest::Widen(name);
    for (long i : confirmed) {
      EXPECT_EQ(OwTest::ReadDword(key, u"V" + OwTest::Widen(std::to_string(i))), i) << name << " value " << i;
    }
    EXPECT_EQ(OwTest::WriteDword(key, u"after", 1), ERROR_SUCCESS) << name;
    EXPECT_EQ(OwTest::ReadDword(key, u"after"), 1) << name;
  }
}

TEST(FaultInjectionStores, EventWriterKilledAnywhereLosesNoCommittedRecord) {
  int round = 0;
  for (const KillPoint& point : kKillPoints) {
    const std::string tag = "crash" + std::to_string(round++);
    int status = 0;
    const std::vector<long> confirmed = RunAndKill("event-writer", {{"OWREL_TAG", tag}}, point.after,
                                                   std::chrono::microseconds(point.delayUs), status);
    EXPECT_EQ(status, 128 + SIGKILL) << tag;
    EXPECT_GE(static_cast<int>(confirmed.size()), point.after) << tag;
    bool ok = false;
    const std::vector<OwTest::EventRecord> records = OwTest::ReadApplicationLog(ok);
    ASSERT_TRUE(ok) << tag << ": the log cannot be read after the writer was killed";
    std::map<std::u16string, int> seen;
    DWORD previous = 0;
    for (const auto& record : records) {
      EXPECT_GT(record.number, previous);
      previous = record.number;
      ++seen[record.firstString];
    }
    for (long i : confirmed) {
      EXPECT_EQ(seen[OwTest::Widen(tag + "-" + std::to_string(i))], 1) << tag << " record " << i;
    }
    // The log takes new records, numbered after the others.
    HANDLE source = Platform::RegisterEventSourceW(nullptr, u"OwReliability");
    ASSERT_NE(source, nullptr);
    const std::u16string text = OwTest::Widen(tag + "-after");
    const char16_t* strings[] = {text.c_str()};
    EXPECT_TRUE(Platform::ReportEventW(source, EVENTLOG_INFORMATION_TYPE, 0, 7, nullptr, 1, 0, strings, nullptr));
    Platform::DeregisterEventSource(source);
    const std::vector<OwTest::EventRecord> after = OwTest::ReadApplicationLog(ok);
    ASSERT_TRUE(ok && !after.empty());
    EXPECT_EQ(after.back().firstString, text);
    EXPECT_GT(after.back().number, previous);
  }
}

// The writer's disk fills up: the failing write is reported as an error (not a crash, not
// success), the store still answers the writer, and afterwards holds every committed record.
TEST(FaultInjectionStores, FullDiskFailsTheWriteAndKeepsTheStore) {
  for (const std::string role : {"registry-writer", "event-writer"}) {
    OwTest::Child child = OwTest::StartChild(role, {{"OWREL_FULL", "1"}, {"OWREL_KEY", "Full"}, {"OWREL_TAG", "full"}});
    std::vector<long> confirmed;
    std::vector<std::string> other;
    std::string line;
    while (OwTest::ReadLine(child.output, line)) {
      if (!line.empty() && std::isdigit(static_cast<unsigned char>(line[0]))) {
        confirmed.push_back(std::atol(line.c_str()));
      } else {
        other.push_back(line);
      }
    }
    EXPECT_EQ(OwTest::Wait(child), 0) << role;
    ASSERT_FALSE(other.empty()) << role << ": the writes never failed";
    EXPECT_EQ(other[0].rfind("fail ", 0), 0u) << role << ": " << other[0];
    EXPECT_NE(other[0], "fail 0") << role;
    if (std::getenv("OWREL_VERBOSE") != nullptr) std::printf("%s: %zu written, then %s\n", role.c_str(), confirmed.size(), other[0].c_str());
    if (role == "registry-writer") {
      ASSERT_EQ(other.size(), 2u);
      EXPECT_EQ(other[1], "readable");
      for (long i : confirmed) {
        EXPECT_EQ(OwTest::ReadDword(u"Software\\OwReliability\\Full", u"V" + OwTest::Widen(std::to_string(i))), i);
      }
      EXPECT_EQ(OwTest::WriteDword(u"Software\\OwReliability\\Full", u"after", 1), ERROR_SUCCESS);
    } else {
      bool ok = false;
      const std::vector<OwTest::EventRecord> records = OwTest::ReadApplicationLog(ok);
      ASSERT_TRUE(ok);
      std::map<std::u16string, int> seen;
      for (const auto& record : records) ++seen[record.firstString];
      for (long i : confirmed) EXPECT_EQ(seen[OwTest::Widen("full-" + std::to_string(i))], 1) << i;
    }
    EXPECT_GT(confirmed.size(), 0u) << role;
  }
}

}  // namespace

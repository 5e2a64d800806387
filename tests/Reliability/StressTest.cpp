// Stress: threads, then processes, using the library at once for a bounded time: writing events,
// registering names, writing and reading the registry, encrypting their own files, throwing and
// reporting exceptions. Afterwards every record is present exactly once and the counts add up.
//
// The run lasts OWUTILS_STRESS_SECONDS seconds (default 2). The thread test has "Concurrency" in
// its name so that it also runs under ThreadSanitizer.
#include <gtest/gtest.h>

#include <atomic>
#include <cstdio>
#include <mutex>
#include <chrono>
#include <thread>

#include "ReliabilitySupport.h"
#include "StoreSupport.h"
#include "owutils/CEncrypt.h"
#include "owutils/EventLogger.h"
#include "owutils/Exceptions.h"
#include "owutils/NamedObjects.h"

namespace {

using Clock = std::chrono::steady_clock;

// Encrypts and decrypts the thread's own file in place; false when it does not come back.
bool EncryptRoundTrip(CEncrypt& cipher, const std::string& file, const OwTest::Bytes& plain) {
  const CString path = OwTest::LibraryPath(file);
  if (!cipher.EncryptFile(path)) return false;
  if (OwTest::ReadNative(file) == plain) return false;
  if (!cipher.DecryptFile(path)) return false;
  return OwTest::ReadNative(file) == plain;
}

struct ThreadResult {
  std::vector<std::u16string> events;  // texts of the events reported
  long registryWrites = 0;
  long encryptions = 0;
  std::vector<std::string> problems;
};

TEST(StressConcurrency, ThreadsShareEventsNamesRegistryAndFiles) {
  const double seconds = OwTest::StressSeconds(2);
  constexpr int kThreads = 4;
  const std::string dir = OwTest::MakeTempDirectory("stress");
  const auto end = Clock::now() + std::chrono::duration<double>(seconds);
  std::vector<ThreadResult> results(kThreads);
  std::atomic<int> shared{0};

  std::vector<std::thread> threads;
  for (int t = 0; t < kThreads; ++t) {
    threads.emplace_back([&, t] {
      ThreadResult& result = results[t];
      const std::string me = "c-t" + std::to_string(t);
      const std::u16string key = u"Software\\OwReliability\\Threads\\" + OwTest::Widen(me);
      const std::u16string otherKey = u"Software\\OwReliability\\Threads\\c-t" + OwTest::Widen(std::to_string((t + 1) % kThreads));
      const std::string file = dir + "/" + me + ".bin";
      const OwTest::Bytes plain = OwTest::Pattern(3 * CEncrypt::FILE_BUFFER_SIZE + 5, static_cast<unsigned>(t));
      OwTest::WriteNative(file, plain);
      CEncrypt cipher(t % 2 == 0 ? ENC_AES_128 : ENC_BLOWFISH, TRUE, CString(u"stress key"));
      HANDLE source = Platform::RegisterEventSourceW(nullptr, u"OwStress");
      if (source == nullptr) result.problems.push_back("RegisterEventSource failed");
      int local = t;

      for (long n = 0; Clock::now() < end; ++n) {
        // An event.
        const std::u16string text = OwTest::Widen(me + "-" + std::to_string(n));
        const char16_t* strings[] = {text.c_str()};
        if (source != nullptr) {
          if (Platform::ReportEventW(source, EVENTLOG_INFORMATION_TYPE, 0, 9, nullptr, 1, 0, strings, nullptr)) {
            result.events.push_back(text);
          } else {
            result.problems.push_back("ReportEvent failed: " + std::to_string(Platform::GetLastError()));
          }
        }
        // Names: this thread's own, and one every thread fights over.
        const std::u16string name = OwTest::Widen(me + "-name-" + std::to_string(n % 16));
        if (!LmObjectAdd(name.c_str(), &local)) result.problems.push_back("LmObjectAdd failed");
        if (LmObjectGet(name.c_str()) != &local) result.problems.push_back("a name lost its object");
        LmObjectAdd(u"stress-shared", &shared);
        if (LmObjectGet(u"stress-shared") != &shared) result.problems.push_back("the shared name lost its object");
        if (!LmObjectDel(name.c_str())) result.problems.push_back("LmObjectDel failed");
        // The registry: write our value, read another thread's.
        if (OwTest::WriteDword(key, u"V" + OwTest::Widen(std::to_string(n)), static_cast<DWORD>(n)) == ERROR_SUCCESS) {
          ++result.registryWrites;
        } else {
          result.problems.push_back("RegSetValueEx failed");
        }
        (void)OwTest::ReadDword(otherKey, u"V0");
        // An exception thrown, caught, reported to the default logger.
        try {
          THROW_AT(LumoException::BufferTooSmall(static_cast<LONG>(n)));
        } catch (const LumoException::Exception& e) {
          if (e.ToString().empty()) result.problems.push_back("empty exception text");
          auto* logger = static_cast<LumoException::EventLogger*>(LmObjectGet(u"LM_EVENT_HANDLER"));
          if (logger != nullptr && n % 16 == 0) logger->ReportException(e, u"stress");
        }
        // Our own file, now and then.
        if (n % 16 == 0) {
          if (EncryptRoundTrip(cipher, file, plain)) {
            ++result.encryptions;
          } else {
            result.problems.push_back("file did not survive encryption");
          }
        }
      }
      if (source != nullptr) Platform::DeregisterEventSource(source);
    });
  }
  for (auto& thread : threads) thread.join();

  bool ok = false;
  const std::vector<OwTest::EventRecord> records = OwTest::ReadApplicationLog(ok);
  ASSERT_TRUE(ok);
  std::map<std::u16string, int> seen;
  for (const auto& record : records) ++seen[record.firstString];
  long total = 0;
  for (int t = 0; t < kThreads; ++t) {
    const ThreadResult& result = results[t];
    EXPECT_TRUE(result.problems.empty()) << "thread " << t << ": " << result.problems.front();
    EXPECT_GT(result.events.size(), 0u) << t;
    EXPECT_GT(result.encryptions, 0) << t;
    for (const auto& text : result.events) EXPECT_EQ(seen[text], 1) << OwTest::Narrow(text);
    total += static_cast<long>(result.events.size());
    const std::u16string key = u"Software\\OwReliability\\Threads\\c-t" + OwTest::Widen(std::to_string(t));
    for (long n = 0; n < result.registryWrites; ++n) {
      ASSERT_EQ(OwTest::ReadDword(key, u"V" + OwTest::Widen(std::to_string(n))), n) << "thread " << t;
    }
    for (int k = 0; k < 16; ++k) {
      const std::u16string name = OwTest::Widen("c-t" + std::to_string(t) + "-name-" + std::to_string(k));
      EXPECT_EQ(LmObjectGet(name.c_str()), nullptr);
    }
  }
  long counted = 0;
  for (const auto& [text, count] : seen) {
    if (text.rfind(u"c-t", 0) == 0) counted += count;
  }
  EXPECT_EQ(counted, total);
  long writes = 0, encrypted = 0;
  for (const auto& result : results) writes += result.registryWrites, encrypted += result.encryptions;
  std::printf("%d threads, %.0f s: %ld events, %ld registry values, %ld file round trips\n", kThreads, seconds, total,
              writes, encrypted);
  EXPECT_EQ(LmObjectGet(u"stress-shared"), &shared);
  LmObjectDel(u"stress-shared");
}

// Three processes of two threads each write events and registry values while this process
// reads the registry and encrypts files; every record a process saw committed is there once.
TEST(StressProcesses, SeveralProcessesShareTheStores) {
  const double seconds = OwTest::StressSeconds(2);
  constexpr int kProcesses = 3;
  std::vector<OwTest::Child> children;
  for (int p = 0; p < kProcesses; ++p) {
    children.push_back(OwTest::StartChild(
        "stress", {{"OWREL_TAG", "p" + std::to_string(p)}, {"OWREL_THREADS", "2"}, {"OWREL_SECONDS", std::to_string(seconds)}}));
  }

  // Meanwhile, here: registry reads and file encryption.
  std::atomic<bool> done{false};
  std::atomic<long> reads{0}, encryptions{0}, failures{0};
  const std::string dir = OwTest::MakeTempDirectory("stressp");
  std::vector<std::thread> locals;
  for (int t = 0; t < 2; ++t) {
    locals.emplace_back([&, t] {
      const std::string file = dir + "/local" + std::to_string(t) + ".bin";
      const OwTest::Bytes plain = OwTest::Pattern(2 * CEncrypt::FILE_BUFFER_SIZE + 3, 9 + static_cast<unsigned>(t));
      OwTest::WriteNative(file, plain);
      CEncrypt cipher(ENC_TWOFISH, TRUE, CString(u"process key"));
      while (!done) {
        (void)OwTest::ReadDword(u"Software\\OwReliability\\Stress\\p0-t0", u"V0");
        ++reads;
        if (EncryptRoundTrip(cipher, file, plain)) {
          ++encryptions;
        } else {
          ++failures;
        }
      }
    });
  }

  std::vector<std::string> events, values, problems;
  std::vector<std::thread> readers;
  std::mutex linesMutex;
  for (auto& child : children) {
    readers.emplace_back([&, fd = child.output] {
      std::string line;
      while (OwTest::ReadLine(fd, line)) {
        std::lock_guard<std::mutex> lock(linesMutex);
        if (line.rfind("E ", 0) == 0) {
          events.push_back(line.substr(2));
        } else if (line.rfind("R ", 0) == 0) {
          values.push_back(line.substr(2));
        } else {
          problems.push_back(line);
        }
      }
    });
  }
  for (auto& reader : readers) reader.join();
  for (auto& child : children) EXPECT_EQ(OwTest::Wait(child), 0);
  done = true;
  for (auto& local : locals) local.join();

  EXPECT_TRUE(problems.empty()) << problems.front();
  EXPECT_EQ(failures, 0);
  EXPECT_GT(encryptions, 0);
  EXPECT_GT(events.size(), 0u);
  bool ok = false;
  const std::vector<OwTest::EventRecord> records = OwTest::ReadApplicationLog(ok);
  ASSERT_TRUE(ok);
  std::map<std::u16string, int> seen;
  for (const auto& record : records) ++seen[record.firstString];
  for (const auto& text : events) EXPECT_EQ(seen[OwTest::Widen(text)], 1) << text;
  long fromChildren = 0;
  for (const auto& [text, count] : seen) {
    if (text.size() > 1 && text[0] == u'p' && text.find(u"-t") != std::u16string::npos) fromChildren += count;
  }
  EXPECT_EQ(fromChildren, static_cast<long>(events.size()));
  std::printf("%d processes, %.0f s: %zu events, %zu registry values; here %ld registry reads, %ld file round trips\n",
              kProcesses, seconds, events.size(), values.size(), reads.load(), encryptions.load());
  for (const auto& value : values) {
    const size_t blank = value.find(' ');
    const std::u16string key = u"Software\\OwReliability\\Stress\\" + OwTest::Widen(value.substr(0, blank));
    const long n = std::atol(value.c_str() + blank + 1);
    EXPECT_EQ(OwTest::ReadDword(key, u"V" + OwTest::Widen(std::to_string(n))), n) << value;
  }
}

}  // namespace

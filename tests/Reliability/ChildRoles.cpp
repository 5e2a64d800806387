// The work of the child processes the reliability tests start (see StoreSupport.h). Selected by
// OWREL_ROLE; never runs in a normal test run (the test is disabled).
#include <gtest/gtest.h>

#include <sys/resource.h>

#include <atomic>
#include <chrono>
#include <filesystem>
#include <mutex>
#include <thread>

#include "StoreSupport.h"
#include "owutils/NamedObjects.h"
#include "support/TestEnvironment.h"

namespace {

int g_fd = -1;
std::mutex g_outputMutex;

void Emit(const std::string& line) {
  std::lock_guard<std::mutex> lock(g_outputMutex);
  const std::string text = line + "\n";
  ssize_t ignored = ::write(g_fd, text.data(), text.size());
  (void)ignored;
}

std::string Env(const char* name, const char* fallback = "") {
  const char* value = std::getenv(name);
  return value != nullptr ? value : fallback;
}

// Makes writes beyond `extra` bytes more than the store's files fail with EFBIG (a full disk as
// the store sees it) instead of killing the process.
void LimitFileSize(const std::string& stateDir, long long extra) {
  std::signal(SIGXFSZ, SIG_IGN);
  long long largest = 0;
  std::error_code ignored;
  for (const auto& entry : std::filesystem::directory_iterator(stateDir, ignored)) {
    if (entry.is_regular_file(ignored)) largest = std::max<long long>(largest, entry.file_size(ignored));
  }
  rlimit limit{};
  limit.rlim_cur = limit.rlim_max = static_cast<rlim_t>(largest + extra);
  ::setrlimit(RLIMIT_FSIZE, &limit);
}

// Writes DWORD values V0, V1... under OWREL_KEY until OWREL_COUNT are written or a write fails
// (then "fail <code>"). With OWREL_FULL, pads each value with 4 KB so the store grows fast, and
// limits file sizes first.
void RegistryWriter() {
  const std::u16string key = u"Software\\OwReliability\\" + OwTest::Widen(Env("OWREL_KEY", "Crash"));
  const long count = std::atol(Env("OWREL_COUNT", "1000000").c_str());
  const bool full = !Env("OWREL_FULL").empty();
  if (full) {
    OwTest::WriteDword(key, u"start", 1);
    LimitFileSize(Env("OWREL_STATE_DIR"), 256 * 1024);
  }
  std::vector<BYTE> pad(4096, 0x5A);
  for (long i = 0; i < count; ++i) {
    const std::u16string name = u"V" + OwTest::Widen(std::to_string(i));
    if (full) {
      HKEY handle = nullptr;
      LONG rc = Platform::RegCreateKeyExW(HKEY_CURRENT_USER, key.c_str(), 0, nullptr, 0, KEY_ALL_ACCESS, nullptr,
                                          &handle, nullptr);
      if (rc == ERROR_SUCCESS) {
        rc = Platform::RegSetValueExW(handle, (name + u"pad").c_str(), 0, REG_BINARY, pad.data(),
                                      static_cast<DWORD>(pad.size()));
        Platform::RegCloseKey(handle);
      }
      if (rc != ERROR_SUCCESS) {
        Emit("fail " + std::to_string(rc));
        // The store must still answer after the failure.
        Emit(OwTest::ReadDword(key, u"start") == 1 ? "readable" : "unreadable");
        return;
      }
    }
    const LONG rc = OwTest::WriteDword(key, name, static_cast<DWORD>(i));
    if (rc != ERROR_SUCCESS) {
      Emit("fail " + std::to_string(rc));
      Emit(OwTest::ReadDword(key, u"start") == 1 || !full ? "readable" : "unreadable");
      return;
    }
    Emit(std::to_string(i));
  }
}

// Reports events with the strings OWREL_TAG-0, OWREL_TAG-1... (see RegistryWriter).
void EventWriter() {
  const std::u16string tag = OwTest::Widen(Env("OWREL_TAG", "crash"));
  const long count = std::atol(Env("OWREL_COUNT", "1000000").c_str());
  const bool full = !Env("OWREL_FULL").empty();
  HANDLE source = Platform::RegisterEventSourceW(nullptr, u"OwReliability");
  if (source == nullptr) {
    Emit("fail register " + std::to_string(Platform::GetLastError()));
    return;
  }
  if (full) LimitFileSize(Env("OWREL_STATE_DIR"), 256 * 1024);
  std::vector<BYTE> data(full ? 4096 : 16, 0xA5);
  for (long i = 0; i < count; ++i) {
    const std::u16string text = tag + u"-" + OwTest::Widen(std::to_string(i));
    const char16_t* strings[] = {text.c_str()};
    if (!Platform::ReportEventW(source, EVENTLOG_INFORMATION_TYPE, 0, 7, nullptr, 1, static_cast<DWORD>(data.size()),
                                strings, data.data())) {
      Emit("fail " + std::to_string(Platform::GetLastError()));
      return;
    }
    Emit(std::to_string(i));
  }
  Platform::DeregisterEventSource(source);
}

// Several threads for OWREL_SECONDS: events tagged OWREL_TAG-t<thread>-<n>, registry values
// Software\OwReliability\Stress\<tag>-t<thread> V<n>, names registered and dropped, and reads of
// the other writers' values. Each committed record is emitted as "E <text>" or "R <key> <n>".
void StressWorker() {
  const std::string tag = Env("OWREL_TAG", "p");
  const double seconds = std::atof(Env("OWREL_SECONDS", "2").c_str());
  const int threads = std::atoi(Env("OWREL_THREADS", "2").c_str());
  const auto end = std::chrono::steady_clock::now() + std::chrono::duration<double>(seconds);
  std::vector<std::thread> workers;
  for (int t = 0; t < threads; ++t) {
    workers.emplace_back([&, t] {
      const std::string me = tag + "-t" + std::to_string(t);
      const std::u16string key = u"Software\\OwReliability\\Stress\\" + OwTest::Widen(me);
      HANDLE source = Platform::RegisterEventSourceW(nullptr, u"OwStress");
      int local = 0;
      for (long n = 0; std::chrono::steady_clock::now() < end; ++n) {
        const std::u16string text = OwTest::Widen(me + "-" + std::to_string(n));
        const char16_t* strings[] = {text.c_str()};
        if (source != nullptr &&
            Platform::ReportEventW(source, EVENTLOG_INFORMATION_TYPE, 0, 8, nullptr, 1, 0, strings, nullptr)) {
          Emit("E " + OwTest::Narrow(text));
        }
        if (OwTest::WriteDword(key, u"V" + OwTest::Widen(std::to_string(n)), static_cast<DWORD>(n)) == ERROR_SUCCESS) {
          Emit("R " + me + " " + std::to_string(n));
        }
        const std::u16string name = OwTest::Widen(me + "-name-" + std::to_string(n % 8));
        LmObjectAdd(name.c_str(), &local);
        if (LmObjectGet(name.c_str()) != &local) Emit("X name lost");
        LmObjectDel(name.c_str());
        (void)OwTest::ReadDword(u"Software\\OwReliability\\Stress\\" + OwTest::Widen(tag + "-t0"), u"V0");
      }
      if (source != nullptr) Platform::DeregisterEventSource(source);
    });
  }
  for (auto& w : workers) w.join();
}

}  // namespace

TEST(ReliabilityChild, DISABLED_Run) {
  g_fd = std::atoi(Env("OWREL_FD", "-1").c_str());
  ASSERT_GE(g_fd, 0);
  // Work in the parent's sandbox, not this program's own.
  ::setenv("OWUTILS_STATE_DIR", Env("OWREL_STATE_DIR").c_str(), 1);
  ::setenv("OWUTILS_DRIVES", Env("OWREL_DRIVES").c_str(), 1);
  const std::string role = Env("OWREL_ROLE");
  if (role == "registry-writer") {
    RegistryWriter();
  } else if (role == "event-writer") {
    EventWriter();
  } else if (role == "stress") {
    StressWorker();
  } else {
    Emit("unknown role " + role);
  }
  ::close(g_fd);
}

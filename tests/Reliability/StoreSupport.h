// Helpers of the reliability tests for the registry and event-log stores, and for running
// parts of a test in other processes.
//
// A child process is this test program again, started with a filter that selects one disabled
// test of the ReliabilityChild suite; what it does is chosen by OWREL_ROLE. It works in the
// parent's state folder and drive map (OWREL_STATE_DIR, OWREL_DRIVES), and writes one line per
// committed record to the file descriptor OWREL_FD, so that the parent knows what was committed
// even when it kills the child.
#pragma once

#include <fcntl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <csignal>
#include <cstdlib>
#include <cstring>
#include <map>
#include <set>
#include <string>
#include <vector>

#include "platform/Errors.h"
#include "platform/EventLog.h"
#include "owutils/Registry.h"
#include "support/TestEnvironment.h"

namespace OwTest {

// --- Registry --------------------------------------------------------------------------------

inline LONG WriteDword(const std::u16string& keyPath, const std::u16string& name, DWORD value) {
  HKEY key = nullptr;
  LONG rc = Platform::RegCreateKeyExW(HKEY_CURRENT_USER, keyPath.c_str(), 0, nullptr, REG_OPTION_NON_VOLATILE,
                                      KEY_ALL_ACCESS, nullptr, &key, nullptr);
  if (rc != ERROR_SUCCESS) return rc;
  rc = Platform::RegSetValueExW(key, name.c_str(), 0, REG_DWORD, reinterpret_cast<const BYTE*>(&value), sizeof value);
  Platform::RegCloseKey(key);
  return rc;
}

// The value, or -1 when it cannot be read.
inline long long ReadDword(const std::u16string& keyPath, const std::u16string& name) {
  HKEY key = nullptr;
  if (Platform::RegOpenKeyExW(HKEY_CURRENT_USER, keyPath.c_str(), 0, KEY_READ, &key) != ERROR_SUCCESS) return -1;
  DWORD type = 0, value = 0, size = sizeof value;
  const LONG rc =
      Platform::RegQueryValueExW(key, name.c_str(), nullptr, &type, reinterpret_cast<BYTE*>(&value), &size);
  Platform::RegCloseKey(key);
  if (rc != ERROR_SUCCESS || type != REG_DWORD || size != sizeof value) return -1;
  return value;
}

// --- Event log -------------------------------------------------------------------------------

struct EventRecord {
  DWORD number;
  DWORD eventId;
  std::u16string firstString;
};

// Every record of the Application log, oldest first; `ok` false when the log cannot be read
// or a record is malformed.
inline std::vector<EventRecord> ReadApplicationLog(bool& ok) {
  ok = true;
  std::vector<EventRecord> records;
  HANDLE log = Platform::OpenEventLogW(nullptr, u"Application");
  if (log == nullptr) {
    ok = false;
    return records;
  }
  std::vector<unsigned char> buffer(1 << 16);
  for (;;) {
    DWORD read = 0, needed = 0;
    if (!Platform::ReadEventLogW(log, EVENTLOG_SEQUENTIAL_READ | EVENTLOG_FORWARDS_READ, 0, buffer.data(),
                                 static_cast<DWORD>(buffer.size()), &read, &needed)) {
      const DWORD error = Platform::GetLastError();
      if (error == ERROR_INSUFFICIENT_BUFFER && needed > buffer.size()) {
        buffer.resize(needed);
        continue;
      }
      if (error != ERROR_HANDLE_EOF) ok = false;
      break;
    }
    for (DWORD at = 0; at < read;) {
      EVENTLOGRECORD head;
      std::memcpy(&head, buffer.data() + at, sizeof head);
      if (head.Length < sizeof head || at + head.Length > read || head.Reserved != 0x654C664C) {
        ok = false;
        break;
      }
      DWORD trailer = 0;
      std::memcpy(&trailer, buffer.data() + at + head.Length - sizeof trailer, sizeof trailer);
      if (trailer != head.Length) ok = false;
      EventRecord record{head.RecordNumber, head.EventID, {}};
      if (head.NumStrings > 0 && head.StringOffset < head.Length) {
        const auto* s = reinterpret_cast<const char16_t*>(buffer.data() + at + head.StringOffset);
        const size_t room = (head.Length - head.StringOffset) / sizeof(char16_t);
        size_t n = 0;
        while (n < room && s[n] != 0) ++n;
        record.firstString.assign(s, n);
      }
      records.push_back(std::move(record));
      at += head.Length;
    }
    if (!ok) break;
  }
  Platform::CloseEventLog(log);
  return records;
}

// --- Child processes -------------------------------------------------------------------------

struct Child {
  pid_t pid = -1;
  int output = -1;  // read end of the child's OWREL_FD
};

// Starts this program as a child in role `role`, with `extra` environment variables.
inline Child StartChild(const std::string& role, const std::map<std::string, std::string>& extra = {}) {
  int fds[2];
  if (::pipe(fds) != 0) std::abort();
  Child child;
  child.output = fds[0];
  child.pid = ::fork();
  if (child.pid == 0) {
    ::close(fds[0]);
    ::setenv("OWREL_ROLE", role.c_str(), 1);
    ::setenv("OWREL_FD", std::to_string(fds[1]).c_str(), 1);
    ::setenv("OWREL_STATE_DIR", std::getenv("OWUTILS_STATE_DIR"), 1);
    ::setenv("OWREL_DRIVES", std::getenv("OWUTILS_DRIVES"), 1);
    for (const auto& [name, value] : extra) ::setenv(name.c_str(), value.c_str(), 1);
    const int devnull = ::open("/dev/null", O_WRONLY);
    if (devnull >= 0) {
      ::dup2(devnull, 1);
      if (std::getenv("OWREL_CHILD_STDERR") == nullptr) ::dup2(devnull, 2);
    }
    char self[4096];
    const ssize_t n = ::readlink("/proc/self/exe", self, sizeof self - 1);
    if (n <= 0) ::_exit(120);
    self[n] = 0;
    ::execl(self, self, "--gtest_filter=ReliabilityChild.DISABLED_Run", "--gtest_also_run_disabled_tests",
            static_cast<char*>(nullptr));
    ::_exit(121);
  }
  ::close(fds[1]);
  return child;
}

// Reads one line of the child's output; false at its end.
inline bool ReadLine(int fd, std::string& line) {
  line.clear();
  char c;
  for (;;) {
    const ssize_t n = ::read(fd, &c, 1);
    if (n == 1) {
      if (c == '\n') return true;
      line.push_back(c);
    } else if (n < 0 && errno == EINTR) {
      continue;
    } else {
      return !line.empty();
    }
  }
}

// Waits for the child; its exit status (128 + signal when killed).
inline int Wait(Child& child) {
  int status = 0;
  while (::waitpid(child.pid, &status, 0) < 0 && errno == EINTR) {
  }
  if (child.output >= 0) ::close(child.output);
  child.output = -1;
  return WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
}

// The duration of the stress tests: OWUTILS_STRESS_SECONDS, else `fallback`.
inline double StressSeconds(double fallback) {
  const char* text = std::getenv("OWUTILS_STRESS_SECONDS");
  if (text == nullptr || *text == 0) return fallback;
  const double value = std::atof(text);
  return value > 0 ? value : fallback;
}

}  // namespace OwTest

// The event-log store: numbering, reading protocol, several processes, damaged stores.
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <string>
#include <thread>
#include <vector>

#include <sqlite3.h>

#include "platform/Errors.h"
#include "platform/EventLog.h"
#include "owutils/Registry.h"
#include "support/TestEnvironment.h"

using namespace Platform;

namespace {

// Each test gets a store of its own, so that numbering starts afresh.
class EventLogTest : public ::testing::Test {
 protected:
  void SetUp() override {
    const char* old = std::getenv("OWUTILS_STATE_DIR");
    m_old = old == nullptr ? "" : old;
    m_dir = OwTest::MakeTempDirectory("eventlog");
    setenv("OWUTILS_STATE_DIR", m_dir.c_str(), 1);
  }
  void TearDown() override { setenv("OWUTILS_STATE_DIR", m_old.c_str(), 1); }

  std::string m_dir;
  std::string m_old;
};

struct Record {
  DWORD number, eventId, generated, written;
  WORD type, category;
  std::u16string source, computer;
  std::vector<std::u16string> strings;
  std::vector<BYTE> data;
};

Record Parse(const BYTE* at) {
  EVENTLOGRECORD head;
  std::memcpy(&head, at, sizeof head);
  Record r{head.RecordNumber, head.EventID, head.TimeGenerated, head.TimeWritten, head.EventType, head.EventCategory,
           {}, {}, {}, {}};
  const char16_t* text = reinterpret_cast<const char16_t*>(at + sizeof head);
  r.source = text;
  r.computer = text + r.source.size() + 1;
  const char16_t* s = reinterpret_cast<const char16_t*>(at + head.StringOffset);
  for (WORD i = 0; i < head.NumStrings; ++i) {
    r.strings.emplace_back(s);
    s += r.strings.back().size() + 1;
  }
  r.data.assign(at + head.DataOffset, at + head.DataOffset + head.DataLength);
  DWORD trailing = 0;
  std::memcpy(&trailing, at + head.Length - sizeof(DWORD), sizeof trailing);
  EXPECT_EQ(trailing, head.Length);
  EXPECT_EQ(head.Reserved, 0x654C664Cu);
  return r;
}

// Everything in the log, read sequentially with a small buffer that grows on demand.
std::vector<Record> ReadAll(const char16_t* log, bool forwards) {
  std::vector<Record> records;
  HANDLE h = OpenEventLogW(nullptr, log);
  EXPECT_NE(h, nullptr);
  if (h == nullptr) return records;
  std::vector<BYTE> buffer(64);
  const DWORD flags = EVENTLOG_SEQUENTIAL_READ | (forwards ? EVENTLOG_FORWARDS_READ : EVENTLOG_BACKWARDS_READ);
  while (true) {
    DWORD read = 0, needed = 0;
    if (!ReadEventLogW(h, flags, 0, buffer.data(), static_cast<DWORD>(buffer.size()), &read, &needed)) {
      DWORD error = GetLastError();
      if (error == ERROR_INSUFFICIENT_BUFFER) {
        EXPECT_GT(needed, buffer.size());
        buffer.resize(needed);
        continue;
      }
      EXPECT_EQ(error, static_cast<DWORD>(ERROR_HANDLE_EOF));
      break;
    }
    for (DWORD at = 0; at < read;) {
      records.push_back(Parse(buffer.data() + at));
      EVENTLOGRECORD head;
      std::memcpy(&head, buffer.data() + at, sizeof head);
      at += head.Length;
    }
  }
  CloseEventLog(h);
  return records;
}

BOOL Write(HANDLE source, DWORD eventId, std::vector<std::u16string> strings, std::vector<BYTE> data = {}) {
  std::vector<const char16_t*> pointers;
  for (auto& s : strings) pointers.push_back(s.c_str());
  return ReportEventW(source, EVENTLOG_WARNING_TYPE, 3, eventId, nullptr, static_cast<WORD>(pointers.size()),
                      static_cast<DWORD>(data.size()), pointers.data(), data.empty() ? nullptr : data.data());
}

}  // namespace

TEST_F(EventLogTest, RecordsKeepTheirFieldsAndNumbersStartAtOne) {
  HANDLE source = RegisterEventSourceW(nullptr, u"OWTest");
  ASSERT_NE(source, nullptr);
  const std::int64_t before = static_cast<std::int64_t>(std::time(nullptr));
  ASSERT_TRUE(Write(source, 0xC0000001, {u"first", u"", u"th\u00efrd \U0001F600"}, {1, 2, 0, 3}));
  ASSERT_TRUE(Write(source, 7, {}));
  ASSERT_TRUE(DeregisterEventSource(source));

  std::vector<Record> records = ReadAll(u"Application", true);
  ASSERT_EQ(records.size(), 2u);
  const Record& r = records[0];
  EXPECT_EQ(r.number, 1u);
  EXPECT_EQ(r.eventId, 0xC0000001u);
  EXPECT_EQ(r.type, EVENTLOG_WARNING_TYPE);
  EXPECT_EQ(r.category, 3);
  EXPECT_EQ(r.source, u"OWTest");
  EXPECT_FALSE(r.computer.empty());
  EXPECT_EQ(r.strings, (std::vector<std::u16string>{u"first", u"", u"th\u00efrd \U0001F600"}));
  EXPECT_EQ(r.data, (std::vector<BYTE>{1, 2, 0, 3}));
  EXPECT_GE(static_cast<std::int64_t>(r.generated), before);
  EXPECT_EQ(r.generated, r.written);
  EXPECT_EQ(records[1].number, 2u);
  EXPECT_TRUE(records[1].strings.empty());

  // Other logs are separate.
  EXPECT_TRUE(ReadAll(u"System", true).empty());
}

TEST_F(EventLogTest, SequentialAndSeekReadsInBothDirections) {
  HANDLE source = RegisterEventSourceW(nullptr, u"OWTest");
  for (int i = 1; i <= 5; ++i) ASSERT_TRUE(Write(source, static_cast<DWORD>(i), {u"r" + OwTest::Widen(std::to_string(i))}));
  DeregisterEventSource(source);

  std::vector<Record> backwards = ReadAll(u"application", false);
  ASSERT_EQ(backwards.size(), 5u);
  for (int i = 0; i < 5; ++i) EXPECT_EQ(backwards[i].number, static_cast<DWORD>(5 - i));

  HANDLE log = OpenEventLogW(nullptr, u"Application");
  ASSERT_NE(log, nullptr);
  std::vector<BYTE> buffer(4096);
  DWORD read = 0, needed = 0;
  // Seek to 3 forwards gives 3, 4, 5; a following sequential read is at the end.
  ASSERT_TRUE(ReadEventLogW(log, EVENTLOG_SEEK_READ | EVENTLOG_FORWARDS_READ, 3, buffer.data(), 4096, &read, &needed));
  EXPECT_EQ(Parse(buffer.data()).number, 3u);
  EXPECT_FALSE(ReadEventLogW(log, EVENTLOG_SEQUENTIAL_READ | EVENTLOG_FORWARDS_READ, 0, buffer.data(), 4096, &read, &needed));
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_HANDLE_EOF));
  // Seek to 2 backwards, then sequential backwards continues below.
  ASSERT_TRUE(ReadEventLogW(log, EVENTLOG_SEEK_READ | EVENTLOG_BACKWARDS_READ, 2, buffer.data(), 4096, &read, &needed));
  Record two = Parse(buffer.data());
  EXPECT_EQ(two.number, 2u);
  EXPECT_EQ(two.strings[0], u"r2");
  EXPECT_FALSE(ReadEventLogW(log, EVENTLOG_SEQUENTIAL_READ | EVENTLOG_BACKWARDS_READ, 0, buffer.data(), 4096, &read, &needed));
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_HANDLE_EOF));
  // A record number that does not exist.
  EXPECT_FALSE(ReadEventLogW(log, EVENTLOG_SEEK_READ | EVENTLOG_FORWARDS_READ, 99, buffer.data(), 4096, &read, &needed));
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_INVALID_PARAMETER));
  EXPECT_FALSE(ReadEventLogW(log, EVENTLOG_SEEK_READ | EVENTLOG_FORWARDS_READ, 0, buffer.data(), 4096, &read, &needed));
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_INVALID_PARAMETER));
  // Too small for one record: 122 and the size needed; nothing consumed.
  EXPECT_FALSE(ReadEventLogW(log, EVENTLOG_SEEK_READ | EVENTLOG_FORWARDS_READ, 1, buffer.data(), 20, &read, &needed));
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_INSUFFICIENT_BUFFER));
  EVENTLOGRECORD head;
  ASSERT_TRUE(ReadEventLogW(log, EVENTLOG_SEEK_READ | EVENTLOG_FORWARDS_READ, 1, buffer.data(), needed, &read, &needed));
  std::memcpy(&head, buffer.data(), sizeof head);
  EXPECT_EQ(head.RecordNumber, 1u);
  EXPECT_EQ(read, head.Length);
  // Bad flags.
  EXPECT_FALSE(ReadEventLogW(log, EVENTLOG_SEQUENTIAL_READ, 0, buffer.data(), 4096, &read, &needed));
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_INVALID_PARAMETER));

  DWORD count = 0, oldest = 0;
  EXPECT_TRUE(GetNumberOfEventLogRecords(log, &count));
  EXPECT_EQ(count, 5u);
  // Numbering continues after clearing.
  ASSERT_TRUE(ClearEventLogW(log, nullptr));
  EXPECT_TRUE(GetOldestEventLogRecord(log, &oldest));
  EXPECT_EQ(oldest, 0u);
  CloseEventLog(log);
  source = RegisterEventSourceW(nullptr, u"OWTest");
  ASSERT_TRUE(Write(source, 1, {}));
  DeregisterEventSource(source);
  std::vector<Record> after = ReadAll(u"Application", true);
  ASSERT_EQ(after.size(), 1u);
  EXPECT_EQ(after[0].number, 6u);

  EXPECT_FALSE(CloseEventLog(log));
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_INVALID_HANDLE));
  EXPECT_FALSE(Write(reinterpret_cast<HANDLE>(&count), 1, {}));
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_INVALID_HANDLE));
}

TEST_F(EventLogTest, SourceWritesToTheLogItIsRegisteredUnder) {
  HKEY key = nullptr;
  ASSERT_EQ(RegCreateKeyExW(HKEY_LOCAL_MACHINE, u"SYSTEM\\CurrentControlSet\\Services\\EventLog\\System\\OWSys", 0,
                            nullptr, 0, KEY_ALL_ACCESS, nullptr, &key, nullptr),
            ERROR_SUCCESS);
  RegCloseKey(key);
  HANDLE source = RegisterEventSourceW(nullptr, u"owsys");
  ASSERT_TRUE(Write(source, 1, {u"to system"}));
  DeregisterEventSource(source);
  EXPECT_EQ(ReadAll(u"System", true).size(), 1u);
  EXPECT_TRUE(ReadAll(u"Application", true).empty());
}

TEST_F(EventLogTest, ProcessesWritingAtOnceGetUniqueIncreasingNumbers) {
  constexpr int kChildren = 4;
  constexpr int kRecords = 50;
  std::vector<pid_t> children;
  for (int c = 0; c < kChildren; ++c) {
    pid_t pid = fork();
    ASSERT_NE(pid, -1);
    if (pid == 0) {
      HANDLE source = RegisterEventSourceW(nullptr, u"OWChild");
      int failures = 0;
      for (int i = 0; i < kRecords; ++i) {
        if (!Write(source, static_cast<DWORD>(c), {OwTest::Widen(std::to_string(i))})) ++failures;
      }
      _exit(failures == 0 ? 0 : 1);
    }
    children.push_back(pid);
  }
  for (pid_t pid : children) {
    int status = 0;
    ASSERT_EQ(waitpid(pid, &status, 0), pid);
    EXPECT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0);
  }
  std::vector<Record> records = ReadAll(u"Application", true);
  ASSERT_EQ(records.size(), static_cast<size_t>(kChildren * kRecords));
  std::vector<int> nextOfChild(kChildren, 0);
  for (size_t i = 0; i < records.size(); ++i) {
    EXPECT_EQ(records[i].number, static_cast<DWORD>(i + 1));
    const DWORD child = records[i].eventId;
    ASSERT_LT(child, static_cast<DWORD>(kChildren));
    // Each writer's records appear in the order it wrote them.
    EXPECT_EQ(records[i].strings.at(0), OwTest::Widen(std::to_string(nextOfChild[child]++)));
  }
}

TEST_F(EventLogTest, KilledWriterLeavesEveryCommittedRecord) {
  pid_t pid = fork();
  ASSERT_NE(pid, -1);
  if (pid == 0) {
    HANDLE source = RegisterEventSourceW(nullptr, u"OWVictim");
    std::u16string payload(2000, u'x');
    for (int i = 0;; ++i) Write(source, static_cast<DWORD>(i), {OwTest::Widen(std::to_string(i)), payload});
  }
  // Let it write for a while, then kill it in the middle of whatever it does.
  HANDLE log = nullptr;
  DWORD count = 0;
  for (int tries = 0; tries < 500 && count < 50; ++tries) {
    std::this_thread::sleep_for(std::chrono::milliseconds(5));
    if (log == nullptr) log = OpenEventLogW(nullptr, u"Application");
    if (log != nullptr) GetNumberOfEventLogRecords(log, &count);
  }
  kill(pid, SIGKILL);
  int status = 0;
  waitpid(pid, &status, 0);
  if (log != nullptr) CloseEventLog(log);
  ASSERT_GE(count, 50u);

  std::vector<Record> records = ReadAll(u"Application", true);
  ASSERT_GE(records.size(), count);
  for (size_t i = 0; i < records.size(); ++i) {
    EXPECT_EQ(records[i].number, static_cast<DWORD>(i + 1));
    ASSERT_EQ(records[i].strings.size(), 2u);
    EXPECT_EQ(records[i].strings[0], OwTest::Widen(std::to_string(i)));
    EXPECT_EQ(records[i].strings[1].size(), 2000u);
  }
  // The store takes new records after the crash.
  HANDLE source = RegisterEventSourceW(nullptr, u"OWAfter");
  EXPECT_TRUE(Write(source, 1, {u"after"}));
  DeregisterEventSource(source);
}

TEST_F(EventLogTest, DamagedOrUnreadableStoreFailsWithCode) {
  {
    std::ofstream garbage(m_dir + "/eventlog.db", std::ios::binary);
    garbage << "SQLite format 3" << std::string(5000, '\x5A');
  }
  EXPECT_EQ(OpenEventLogW(nullptr, u"Application"), nullptr);
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_EVENTLOG_FILE_CORRUPT));
  HANDLE source = RegisterEventSourceW(nullptr, u"OWTest");
  ASSERT_NE(source, nullptr);
  EXPECT_FALSE(Write(source, 1, {u"lost"}));
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_EVENTLOG_FILE_CORRUPT));
  DeregisterEventSource(source);

  // A store the user may not read.
  if (geteuid() != 0) {
    std::remove((m_dir + "/eventlog.db").c_str());
    const std::string locked = OwTest::MakeTempDirectory("locked");
    setenv("OWUTILS_STATE_DIR", locked.c_str(), 1);
    { std::ofstream touch(locked + "/eventlog.db"); }
    chmod((locked + "/eventlog.db").c_str(), 0);
    EXPECT_EQ(OpenEventLogW(nullptr, u"Application"), nullptr);
    EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_ACCESS_DENIED));
  }
}

TEST_F(EventLogTest, TamperedRecordIsReportedNotWalkedPast) {
  HANDLE source = RegisterEventSourceW(nullptr, u"OWTest");
  ASSERT_TRUE(Write(source, 1, {u"good"}));
  ASSERT_TRUE(Write(source, 2, {u"to be damaged", u"second"}));
  DeregisterEventSource(source);
  // Another program rewrites the second record's strings without their terminators.
  sqlite3* db = nullptr;
  ASSERT_EQ(sqlite3_open((m_dir + "/eventlog.db").c_str(), &db), SQLITE_OK);
  sqlite3_busy_timeout(db, 5000);
  EXPECT_EQ(sqlite3_exec(db, "UPDATE event_records SET strings = x'41004200' WHERE number = 2", nullptr, nullptr, nullptr),
            SQLITE_OK);
  sqlite3_close(db);

  HANDLE log = OpenEventLogW(nullptr, u"Application");
  ASSERT_NE(log, nullptr);
  std::vector<BYTE> buffer(4096);
  DWORD read = 0, needed = 0;
  // The sound record before the damaged one is delivered; the damaged one is an error.
  ASSERT_TRUE(ReadEventLogW(log, EVENTLOG_SEQUENTIAL_READ | EVENTLOG_FORWARDS_READ, 0, buffer.data(), 4096, &read, &needed));
  EXPECT_EQ(Parse(buffer.data()).strings, std::vector<std::u16string>{u"good"});
  EXPECT_EQ(read, Parse(buffer.data()).number == 1 ? reinterpret_cast<EVENTLOGRECORD*>(buffer.data())->Length : 0u);
  EXPECT_FALSE(ReadEventLogW(log, EVENTLOG_SEQUENTIAL_READ | EVENTLOG_FORWARDS_READ, 0, buffer.data(), 4096, &read, &needed));
  EXPECT_EQ(GetLastError(), static_cast<DWORD>(ERROR_EVENTLOG_FILE_CORRUPT));
  CloseEventLog(log);
}

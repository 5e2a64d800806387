// POSIX backend: the event log as the SQLite store "eventlog.db" in the state folder.
//
// Schema: one row per log with the number its next record gets (so numbers only grow, also after
// the log was cleared), and one row per record holding its fields; the insertion strings are one
// blob of UTF-16 strings, each followed by a NUL unit.
#include "platform/posix/NativeText.h"
#include "platform/EventLog.h"

#include <syslog.h>
#include <unistd.h>

#include <cstdlib>
#include <cstring>
#include <ctime>
#include <mutex>
#include <string>
#include <unordered_set>
#include <vector>

#include "platform/Errors.h"
#include "owutils/Registry.h"
#include "platform/Text.h"
#include "platform/posix/StateStore.h"

namespace Platform {
namespace {

using posix::StateStore;
using posix::Statement;

constexpr const char* kSchema = R"sql(
CREATE TABLE IF NOT EXISTS event_logs(
  id          INTEGER PRIMARY KEY,
  name        TEXT NOT NULL UNIQUE COLLATE NOCASE,
  next_record INTEGER NOT NULL);
INSERT OR IGNORE INTO event_logs(id, name, next_record) VALUES
  (1, 'Application', 1), (2, 'Security', 1), (3, 'System', 1);
CREATE TABLE IF NOT EXISTS event_records(
  log            INTEGER NOT NULL REFERENCES event_logs(id),
  number         INTEGER NOT NULL,
  time_generated INTEGER NOT NULL,
  time_written   INTEGER NOT NULL,
  event_id       INTEGER NOT NULL,
  event_type     INTEGER NOT NULL,
  category       INTEGER NOT NULL,
  source         BLOB NOT NULL,
  computer       BLOB NOT NULL,
  string_count   INTEGER NOT NULL,
  strings        BLOB NOT NULL,
  data           BLOB NOT NULL,
  PRIMARY KEY(log, number)) WITHOUT ROWID;
)sql";

constexpr DWORD kRecordSignature = 0x654C664C;  // "LfLe"
constexpr size_t kMaxRecordSize = 0x7FFFF;
constexpr std::uint32_t kSourceMagic = 0x4F57534F;  // "OWSO"
constexpr std::uint32_t kLogMagic = 0x4F574C47;     // "OWLG"

StateStore& Store() {
  // A record is in the write-ahead log when ReportEventW returns: a crash of the writing process
  // loses nothing committed. The log reaches the disk at checkpoints (a sync per record would
  // cap a service at the disk's few hundred syncs per second).
  static StateStore* store =
      new StateStore("eventlog.db", kSchema, ERROR_EVENTLOG_FILE_CORRUPT, StateStore::Sync::Normal);
  return *store;
}

struct SourceHandle {
  std::uint32_t magic = kSourceMagic;
  std::int64_t log = 1;
  std::u16string name;
};

struct LogHandle {
  std::uint32_t magic = kLogMagic;
  std::int64_t log = 1;
  std::mutex lock;            // a handle may be read from several threads
  std::int64_t last = 0;      // number of the last record delivered; 0 before the first read
};

std::mutex g_handleLock;
std::unordered_set<void*>& Handles() {
  static auto* handles = new std::unordered_set<void*>();
  return *handles;
}

void AddHandle(void* handle) {
  std::lock_guard<std::mutex> guard(g_handleLock);
  Handles().insert(handle);
}

template <typename T>
T* FindHandle(HANDLE handle, std::uint32_t magic) {
  std::lock_guard<std::mutex> guard(g_handleLock);
  if (handle == nullptr || Handles().count(handle) == 0) return nullptr;
  T* found = static_cast<T*>(handle);
  return found->magic == magic ? found : nullptr;
}

template <typename T>
bool RemoveHandle(HANDLE handle, std::uint32_t magic) {
  {
    std::lock_guard<std::mutex> guard(g_handleLock);
    if (handle == nullptr || Handles().count(handle) == 0 || static_cast<T*>(handle)->magic != magic) return false;
    Handles().erase(handle);
  }
  delete static_cast<T*>(handle);
  return true;
}

BOOL Fail(DWORD error) {
  SetLastError(error);
  return FALSE;
}

bool IsLocal(const char16_t* server) { return server == nullptr || *server == 0; }

const std::u16string& ComputerName() {
  static const std::u16string name = [] {
    char host[256] = {};
    if (gethostname(host, sizeof host - 1) != 0) return std::u16string(u"localhost");
    std::u16string wide = Posix::ToUtf16(host);
    for (char16_t& c : wide) {
      if (c >= u'a' && c <= u'z') c = static_cast<char16_t>(c - 0x20);
    }
    return wide;
  }();
  return name;
}

// The log a source writes to: the one it is registered under, else "Application".
std::int64_t LogOfSource(const std::u16string& source) {
  static const char16_t* const kLogs[] = {u"Application", u"Security", u"System"};
  for (std::int64_t i = 0; i < 3; ++i) {
    std::u16string path = u"SYSTEM\\CurrentControlSet\\Services\\EventLog\\";
    path += kLogs[i];
    path += u"\\";
    path += source;
    HKEY key = nullptr;
    if (RegOpenKeyExW(HKEY_LOCAL_MACHINE, path.c_str(), 0, KEY_QUERY_VALUE, &key) == ERROR_SUCCESS) {
      RegCloseKey(key);
      return i + 1;
    }
  }
  return 1;
}

void MirrorToSyslog(const std::u16string& source, WORD type, DWORD eventId, WORD count, const char16_t** strings) {
  const char* enabled = std::getenv("OWUTILS_EVENTLOG_SYSLOG");
  if (enabled == nullptr || std::strcmp(enabled, "1") != 0) return;
  int priority = type == EVENTLOG_ERROR_TYPE || type == EVENTLOG_AUDIT_FAILURE ? LOG_ERR
                 : type == EVENTLOG_WARNING_TYPE                               ? LOG_WARNING
                                                                               : LOG_INFO;
  std::u16string text;
  for (WORD i = 0; i < count; ++i) {
    if (i != 0) text += u" | ";
    text += strings[i];
  }
  syslog(LOG_USER | priority, "%s[%u]: %s", Posix::ToUtf8(source).c_str(), static_cast<unsigned>(eventId & 0xFFFF),
         Posix::ToUtf8(text).c_str());
}

// One record read from the store.
struct Row {
  std::int64_t number;
  DWORD generated, written, eventId;
  WORD type, category, count;
  std::u16string source, computer, strings;
  std::vector<BYTE> data;
};

size_t Align4(size_t n) { return (n + 3) & ~static_cast<size_t>(3); }

size_t RecordSize(const Row& row) {
  size_t size = sizeof(EVENTLOGRECORD);
  size += (row.source.size() + 1 + row.computer.size() + 1) * sizeof(char16_t);
  size = Align4(size);
  size += row.strings.size() * sizeof(char16_t);
  size += row.data.size();
  size = Align4(size);
  return size + sizeof(DWORD);
}

void WriteRecord(const Row& row, BYTE* out, size_t size) {
  std::memset(out, 0, size);
  EVENTLOGRECORD head{};
  head.Length = static_cast<DWORD>(size);
  head.Reserved = kRecordSignature;
  head.RecordNumber = static_cast<DWORD>(row.number);
  head.TimeGenerated = row.generated;
  head.TimeWritten = row.written;
  head.EventID = row.eventId;
  head.EventType = row.type;
  head.NumStrings = row.count;
  head.EventCategory = row.category;
  size_t at = sizeof(EVENTLOGRECORD);
  std::memcpy(out + at, row.source.c_str(), (row.source.size() + 1) * sizeof(char16_t));
  at += (row.source.size() + 1) * sizeof(char16_t);
  std::memcpy(out + at, row.computer.c_str(), (row.computer.size() + 1) * sizeof(char16_t));
  at += (row.computer.size() + 1) * sizeof(char16_t);
  at = Align4(at);
  head.UserSidLength = 0;
  head.UserSidOffset = static_cast<DWORD>(at);
  head.StringOffset = static_cast<DWORD>(at);
  if (!row.strings.empty()) std::memcpy(out + at, row.strings.data(), row.strings.size() * sizeof(char16_t));
  at += row.strings.size() * sizeof(char16_t);
  head.DataLength = static_cast<DWORD>(row.data.size());
  head.DataOffset = static_cast<DWORD>(at);
  if (!row.data.empty()) std::memcpy(out + at, row.data.data(), row.data.size());
  std::memcpy(out, &head, sizeof head);
  const DWORD length = static_cast<DWORD>(size);
  std::memcpy(out + size - sizeof(DWORD), &length, sizeof length);
}

// A stored record must be one the writer could have made: its insertion strings exactly
// `count` NUL-terminated strings. Anything else is damage, which a reader must not walk past.
bool RowIsSound(const Row& row) {
  size_t terminators = 0;
  for (char16_t c : row.strings) terminators += c == 0 ? 1 : 0;
  if (terminators != row.count) return false;
  if (!row.strings.empty() && row.strings.back() != 0) return false;
  return RecordSize(row) <= kMaxRecordSize && row.number > 0 && row.number <= 0xFFFFFFFFll;
}

bool ReadRow(const Statement& q, Row& row) {
  row.number = q.Int(0);
  row.generated = static_cast<DWORD>(q.Int(1));
  row.written = static_cast<DWORD>(q.Int(2));
  row.eventId = static_cast<DWORD>(q.Int(3));
  row.type = static_cast<WORD>(q.Int(4));
  row.category = static_cast<WORD>(q.Int(5));
  row.source = q.Text(6);
  row.computer = q.Text(7);
  row.count = static_cast<WORD>(q.Int(8));
  row.strings = q.Text(9);
  size_t size = 0;
  const void* data = q.Blob(10, size);
  row.data.assign(static_cast<const BYTE*>(data), static_cast<const BYTE*>(data) + size);
  return RowIsSound(row);
}

constexpr const char* kSelectForwards =
    "SELECT number, time_generated, time_written, event_id, event_type, category, source, computer, "
    "string_count, strings, data FROM event_records WHERE log = ?1 AND number >= ?2 ORDER BY number ASC";
constexpr const char* kSelectBackwards =
    "SELECT number, time_generated, time_written, event_id, event_type, category, source, computer, "
    "string_count, strings, data FROM event_records WHERE log = ?1 AND number <= ?2 ORDER BY number DESC";

}  // namespace

HANDLE RegisterEventSourceW(const char16_t* server, const char16_t* source) {
  if (!IsLocal(server)) {
    SetLastError(ERROR_BAD_NETPATH);
    return nullptr;
  }
  if (source == nullptr || *source == 0) {
    SetLastError(ERROR_INVALID_PARAMETER);
    return nullptr;
  }
  auto* handle = new SourceHandle;
  handle->name = source;
  handle->log = LogOfSource(handle->name);
  AddHandle(handle);
  return handle;
}

BOOL DeregisterEventSource(HANDLE source) {
  return RemoveHandle<SourceHandle>(source, kSourceMagic) ? TRUE : Fail(ERROR_INVALID_HANDLE);
}

BOOL ReportEventW(HANDLE source, WORD type, WORD category, DWORD eventId, void*, WORD numStrings, DWORD dataSize,
                  const char16_t** strings, void* data) {
  SourceHandle* handle = FindHandle<SourceHandle>(source, kSourceMagic);
  if (handle == nullptr) return Fail(ERROR_INVALID_HANDLE);
  if ((numStrings != 0 && strings == nullptr) || (dataSize != 0 && data == nullptr)) return Fail(ERROR_INVALID_PARAMETER);
  Row row{};
  try {
    for (WORD i = 0; i < numStrings; ++i) {
      if (strings[i] == nullptr) return Fail(ERROR_INVALID_PARAMETER);
      row.strings += strings[i];
      row.strings.push_back(u'\0');
    }
    row.source = handle->name;
    row.computer = ComputerName();
    if (dataSize != 0) row.data.assign(static_cast<const BYTE*>(data), static_cast<const BYTE*>(data) + dataSize);
  } catch (const std::bad_alloc&) {
    return Fail(ERROR_NOT_ENOUGH_MEMORY);
  }
  row.count = numStrings;
  if (RecordSize(row) > kMaxRecordSize) return Fail(ERROR_INVALID_PARAMETER);
  const std::int64_t now = static_cast<std::int64_t>(std::time(nullptr));
  const std::int64_t log = handle->log;
  DWORD error = Store().Write([&](StateStore& store) {
    Statement next(store, "UPDATE event_logs SET next_record = next_record + 1 WHERE id = ?1 RETURNING next_record - 1");
    if (next.Prepared() != SQLITE_OK) return store.Error(next.Prepared());
    next.Bind(1, log);
    int rc = next.Step();
    if (rc != SQLITE_ROW) return rc == SQLITE_DONE ? static_cast<DWORD>(ERROR_EVENTLOG_FILE_CORRUPT) : store.Error(rc);
    const std::int64_t number = next.Int(0);
    rc = next.Step();
    if (rc != SQLITE_DONE) return store.Error(rc);
    Statement insert(store,
                     "INSERT INTO event_records(log, number, time_generated, time_written, event_id, event_type, "
                     "category, source, computer, string_count, strings, data) "
                     "VALUES(?1, ?2, ?3, ?3, ?4, ?5, ?6, ?7, ?8, ?9, ?10, ?11)");
    if (insert.Prepared() != SQLITE_OK) return store.Error(insert.Prepared());
    insert.Bind(1, log);
    insert.Bind(2, number);
    insert.Bind(3, now);
    insert.Bind(4, static_cast<std::int64_t>(eventId));
    insert.Bind(5, static_cast<std::int64_t>(type));
    insert.Bind(6, static_cast<std::int64_t>(category));
    insert.Bind(7, row.source);
    insert.Bind(8, row.computer);
    insert.Bind(9, static_cast<std::int64_t>(numStrings));
    insert.Bind(10, row.strings);
    insert.BindBlob(11, row.data.data(), row.data.size());
    rc = insert.Step();
    return rc == SQLITE_DONE ? static_cast<DWORD>(ERROR_SUCCESS) : store.Error(rc);
  });
  if (error != ERROR_SUCCESS) return Fail(error);
  MirrorToSyslog(row.source, type, eventId, numStrings, strings);
  return TRUE;
}

HANDLE OpenEventLogW(const char16_t* server, const char16_t* logName) {
  if (!IsLocal(server)) {
    SetLastError(ERROR_BAD_NETPATH);
    return nullptr;
  }
  if (logName == nullptr || *logName == 0) {
    SetLastError(ERROR_INVALID_PARAMETER);
    return nullptr;
  }
  const std::string name = Posix::ToUtf8(logName);
  std::int64_t log = 1;
  // Opening reads the store, so that a damaged or unreadable one fails here already.
  DWORD error = Store().Read([&](StateStore& store) {
    Statement q(store, "SELECT id FROM event_logs WHERE name = ?1");
    if (q.Prepared() != SQLITE_OK) return store.Error(q.Prepared());
    q.BindUtf8(1, name);
    int rc = q.Step();
    if (rc == SQLITE_ROW) log = q.Int(0);
    return rc == SQLITE_ROW || rc == SQLITE_DONE ? static_cast<DWORD>(ERROR_SUCCESS) : store.Error(rc);
  });
  if (error != ERROR_SUCCESS) {
    SetLastError(error);
    return nullptr;
  }
  auto* handle = new LogHandle;
  handle->log = log;
  AddHandle(handle);
  return handle;
}

BOOL CloseEventLog(HANDLE log) { return RemoveHandle<LogHandle>(log, kLogMagic) ? TRUE : Fail(ERROR_INVALID_HANDLE); }

BOOL ReadEventLogW(HANDLE log, DWORD flags, DWORD recordOffset, void* buffer, DWORD bytesToRead, DWORD* bytesRead,
                   DWORD* minBytesNeeded) {
  LogHandle* handle = FindHandle<LogHandle>(log, kLogMagic);
  if (handle == nullptr) return Fail(ERROR_INVALID_HANDLE);
  const bool sequential = (flags & EVENTLOG_SEQUENTIAL_READ) != 0;
  const bool seek = (flags & EVENTLOG_SEEK_READ) != 0;
  const bool forwards = (flags & EVENTLOG_FORWARDS_READ) != 0;
  const bool backwards = (flags & EVENTLOG_BACKWARDS_READ) != 0;
  if (sequential == seek || forwards == backwards || bytesRead == nullptr || minBytesNeeded == nullptr ||
      (buffer == nullptr && bytesToRead != 0) || bytesToRead > kMaxRecordSize) {
    return Fail(ERROR_INVALID_PARAMETER);
  }
  *bytesRead = 0;
  *minBytesNeeded = 0;
  std::lock_guard<std::mutex> guard(handle->lock);

  std::int64_t start;
  if (seek) {
    start = recordOffset;
  } else if (handle->last == 0) {
    start = forwards ? 0 : INT64_MAX;
  } else {
    start = forwards ? handle->last + 1 : handle->last - 1;
  }
  std::int64_t last = handle->last;
  DWORD needed = 0;
  DWORD written = 0;
  DWORD error = Store().Read([&](StateStore& store) {
    Statement q(store, forwards ? kSelectForwards : kSelectBackwards);
    if (q.Prepared() != SQLITE_OK) return store.Error(q.Prepared());
    q.Bind(1, handle->log);
    q.Bind(2, start);
    BYTE* out = static_cast<BYTE*>(buffer);
    Row row;
    bool first = true;
    while (true) {
      int rc = q.Step();
      if (rc == SQLITE_DONE) break;
      if (rc != SQLITE_ROW) return store.Error(rc);
      if (!ReadRow(q, row)) {
        // The records before a damaged one are delivered; the damage is the next read's answer.
        if (first) return static_cast<DWORD>(ERROR_EVENTLOG_FILE_CORRUPT);
        break;
      }
      if (first && seek && row.number != start) return static_cast<DWORD>(ERROR_INVALID_PARAMETER);
      const size_t size = RecordSize(row);
      if (written + size > bytesToRead) {
        if (first) needed = static_cast<DWORD>(size);
        break;
      }
      WriteRecord(row, out + written, size);
      written += static_cast<DWORD>(size);
      last = row.number;
      first = false;
    }
    if (first && needed == 0) return seek ? static_cast<DWORD>(ERROR_INVALID_PARAMETER) : static_cast<DWORD>(ERROR_HANDLE_EOF);
    if (first) return static_cast<DWORD>(ERROR_INSUFFICIENT_BUFFER);
    return static_cast<DWORD>(ERROR_SUCCESS);
  });
  if (error == ERROR_INSUFFICIENT_BUFFER) *minBytesNeeded = needed;
  if (error != ERROR_SUCCESS) return Fail(error);
  handle->last = last;
  *bytesRead = written;
  return TRUE;
}

namespace {

// One number about log `log` from the store, by `sql` (the log bound as ?1).
BOOL QueryLogNumber(HANDLE log, const char* sql, DWORD* value) {
  LogHandle* handle = FindHandle<LogHandle>(log, kLogMagic);
  if (handle == nullptr) return Fail(ERROR_INVALID_HANDLE);
  if (value == nullptr) return Fail(ERROR_INVALID_PARAMETER);
  DWORD error = Store().Read([&](StateStore& store) {
    Statement q(store, sql);
    if (q.Prepared() != SQLITE_OK) return store.Error(q.Prepared());
    q.Bind(1, handle->log);
    int rc = q.Step();
    if (rc != SQLITE_ROW) return store.Error(rc);
    *value = static_cast<DWORD>(q.Int(0));
    return static_cast<DWORD>(ERROR_SUCCESS);
  });
  return error == ERROR_SUCCESS ? TRUE : Fail(error);
}

}  // namespace

BOOL GetNumberOfEventLogRecords(HANDLE log, DWORD* count) {
  return QueryLogNumber(log, "SELECT count(*) FROM event_records WHERE log = ?1", count);
}

BOOL GetOldestEventLogRecord(HANDLE log, DWORD* oldest) {
  return QueryLogNumber(log, "SELECT coalesce(min(number), 0) FROM event_records WHERE log = ?1", oldest);
}

BOOL ClearEventLogW(HANDLE log, const char16_t* backupFile) {
  LogHandle* handle = FindHandle<LogHandle>(log, kLogMagic);
  if (handle == nullptr) return Fail(ERROR_INVALID_HANDLE);
  if (backupFile != nullptr) return Fail(ERROR_NOT_SUPPORTED);
  DWORD error = Store().Write([&](StateStore& store) {
    Statement q(store, "DELETE FROM event_records WHERE log = ?1");
    if (q.Prepared() != SQLITE_OK) return store.Error(q.Prepared());
    q.Bind(1, handle->log);
    int rc = q.Step();
    return rc == SQLITE_DONE ? static_cast<DWORD>(ERROR_SUCCESS) : store.Error(rc);
  });
  return error == ERROR_SUCCESS ? TRUE : Fail(error);
}

}  // namespace Platform

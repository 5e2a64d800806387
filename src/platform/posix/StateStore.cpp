// POSIX backend: SQLite databases in the state directory.
#include "platform/posix/StateStore.h"

#include <locale.h>
#include <unistd.h>
#include <wctype.h>

#include <cerrno>
#include <chrono>
#include <cstring>
#include <new>
#include <thread>

#include "platform/Errors.h"

namespace Platform::posix {
namespace {

constexpr int kBusyTimeoutMs = 30000;

locale_t UnicodeLocale() {
  static locale_t locale = [] {
    locale_t l = newlocale(LC_CTYPE_MASK, "C.UTF-8", static_cast<locale_t>(0));
    if (l == static_cast<locale_t>(0)) l = newlocale(LC_CTYPE_MASK, "C.utf8", static_cast<locale_t>(0));
    return l;
  }();
  return locale;
}

}  // namespace

std::u16string FoldName(const std::u16string& name) {
  std::u16string folded(name);
  locale_t locale = UnicodeLocale();
  for (char16_t& c : folded) {
    if (c < 0x80) {
      if (c >= u'a' && c <= u'z') c = static_cast<char16_t>(c - 0x20);
    } else if (locale != static_cast<locale_t>(0) && (c < 0xD800 || c > 0xDFFF)) {
      wint_t upper = towupper_l(static_cast<wint_t>(c), locale);
      if (upper < 0x10000 && (upper < 0xD800 || upper > 0xDFFF)) c = static_cast<char16_t>(upper);
    }
  }
  return folded;
}

// ---- Statement ------------------------------------------------------------------------------

Statement::Statement(StateStore& store, const char* sql) { m_stmt = store.Prepare(sql, m_rc); }

Statement::~Statement() {
  if (m_stmt != nullptr) {
    sqlite3_reset(m_stmt);
    sqlite3_clear_bindings(m_stmt);
  }
}

void Statement::Bind(int index, std::int64_t value) { sqlite3_bind_int64(m_stmt, index, value); }

void Statement::Bind(int index, const std::u16string& text) {
  BindBlob(index, text.data(), text.size() * sizeof(char16_t));
}

void Statement::BindBlob(int index, const void* data, size_t size) {
  // A zero-length blob is still a blob (not NULL), so that empty names compare equal.
  static const char kEmpty = 0;
  sqlite3_bind_blob64(m_stmt, index, size == 0 ? &kEmpty : data, size, SQLITE_TRANSIENT);
}

void Statement::BindUtf8(int index, const std::string& text) {
  sqlite3_bind_text64(m_stmt, index, text.data(), text.size(), SQLITE_TRANSIENT, SQLITE_UTF8);
}

int Statement::Step() { return m_stmt == nullptr ? m_rc : sqlite3_step(m_stmt); }

std::int64_t Statement::Int(int column) const { return sqlite3_column_int64(m_stmt, column); }

std::u16string Statement::Text(int column) const {
  size_t size = 0;
  const void* data = Blob(column, size);
  std::u16string text(size / sizeof(char16_t), u'\0');
  if (!text.empty()) std::memcpy(text.data(), data, text.size() * sizeof(char16_t));
  return text;
}

const void* Statement::Blob(int column, size_t& size) const {
  const void* data = sqlite3_column_blob(m_stmt, column);
  size = static_cast<size_t>(sqlite3_column_bytes(m_stmt, column));
  return data;
}

// ---- StateStore -----------------------------------------------------------------------------

StateStore::StateStore(const char* fileName, const char* schema, DWORD corruptError, Sync sync)
    : m_fileName(fileName), m_schema(schema), m_corruptError(corruptError), m_sync(sync) {}

StateStore::~StateStore() {
  std::lock_guard<std::recursive_mutex> guard(m_lock);
  Close();
}

void StateStore::Close() {
  if (m_db != nullptr && m_pid == static_cast<long>(getpid())) {
    for (auto& entry : m_statements) sqlite3_finalize(entry.second);
    sqlite3_close_v2(m_db);
  }
  // A connection inherited through fork belongs to the parent: it is abandoned, never closed,
  // since closing it here would release the parent's file locks.
  m_statements.clear();
  m_db = nullptr;
  m_path.clear();
  m_reopen = false;
}

DWORD StateStore::Error(int rc) {
  switch (rc & 0xFF) {
    case SQLITE_OK:
    case SQLITE_ROW:
    case SQLITE_DONE:
      return ERROR_SUCCESS;
    case SQLITE_CORRUPT:
    case SQLITE_NOTADB:
    case SQLITE_FORMAT:
    case SQLITE_SCHEMA:
    case SQLITE_ERROR:  // a statement the store's tables cannot serve: not our schema
    case SQLITE_MISMATCH:
      m_reopen = true;
      return m_corruptError;
    case SQLITE_BUSY:
    case SQLITE_LOCKED:
      return ERROR_BUSY;
    case SQLITE_NOMEM:
      return ERROR_NOT_ENOUGH_MEMORY;
    case SQLITE_READONLY:
    case SQLITE_PERM:
    case SQLITE_AUTH:
      return ERROR_ACCESS_DENIED;
    case SQLITE_FULL:
      return ERROR_DISK_FULL;
    case SQLITE_TOOBIG:
    case SQLITE_RANGE:
      return ERROR_INVALID_PARAMETER;
    case SQLITE_CANTOPEN:
    case SQLITE_IOERR: {
      m_reopen = true;
      int error = m_db != nullptr ? sqlite3_system_errno(m_db) : 0;
      if (error != 0) return Win32ErrorFromErrno(error);
      return (rc & 0xFF) == SQLITE_CANTOPEN ? static_cast<DWORD>(ERROR_CANTOPEN) : static_cast<DWORD>(ERROR_IO_DEVICE);
    }
    default:
      m_reopen = true;
      return m_corruptError;
  }
}

sqlite3_stmt* StateStore::Prepare(const char* sql, int& rc) {
  auto found = m_statements.find(sql);
  if (found != m_statements.end()) {
    rc = SQLITE_OK;
    return found->second;
  }
  sqlite3_stmt* stmt = nullptr;
  rc = sqlite3_prepare_v3(m_db, sql, -1, SQLITE_PREPARE_PERSISTENT, &stmt, nullptr);
  if (rc != SQLITE_OK) {
    sqlite3_finalize(stmt);
    return nullptr;
  }
  m_statements.emplace(sql, stmt);
  return stmt;
}

DWORD StateStore::Open() {
  std::string directory;
  if (!NativeStateDirectory(directory)) return GetLastError();
  const std::string path = directory + "/" + m_fileName;
  if (m_db != nullptr && !m_reopen && path == m_path && m_pid == static_cast<long>(getpid())) return ERROR_SUCCESS;
  Close();

  sqlite3* db = nullptr;
  int rc = sqlite3_open_v2(path.c_str(), &db, SQLITE_OPEN_READWRITE | SQLITE_OPEN_CREATE | SQLITE_OPEN_NOMUTEX, nullptr);
  m_db = db;
  m_pid = static_cast<long>(getpid());
  m_path = path;
  if (rc == SQLITE_OK) {
    sqlite3_busy_timeout(db, kBusyTimeoutMs);
    sqlite3_extended_result_codes(db, 0);
    rc = sqlite3_exec(db,
                      m_sync == Sync::Full ? "PRAGMA journal_mode=WAL; PRAGMA synchronous=FULL; PRAGMA foreign_keys=ON;"
                                           : "PRAGMA journal_mode=WAL; PRAGMA synchronous=NORMAL; PRAGMA foreign_keys=ON;",
                      nullptr, nullptr, nullptr);
  }
  if (rc == SQLITE_OK) rc = sqlite3_exec(db, "BEGIN IMMEDIATE", nullptr, nullptr, nullptr);
  if (rc == SQLITE_OK) {
    rc = sqlite3_exec(db, m_schema, nullptr, nullptr, nullptr);
    int end = sqlite3_exec(db, rc == SQLITE_OK ? "COMMIT" : "ROLLBACK", nullptr, nullptr, nullptr);
    if (rc == SQLITE_OK) rc = end;
  }
  if (rc != SQLITE_OK) {
    DWORD error = Error(rc);
    if (error == ERROR_SUCCESS) error = m_corruptError;
    Close();
    return error;
  }
  return ERROR_SUCCESS;
}

DWORD StateStore::Run(const Work& work, bool write) {
  std::lock_guard<std::recursive_mutex> guard(m_lock);
  // A nested call joins the transaction of its caller, which retries as a whole.
  if (m_db != nullptr && sqlite3_get_autocommit(m_db) == 0) return Attempt(work, write);
  // SQLite's busy handler does not cover every wait: switching a new database to WAL, recovering
  // a WAL left by a killed writer and some lock upgrades answer SQLITE_BUSY at once. Such an
  // attempt changed nothing, so it is simply made again, within the same time limit.
  const auto deadline = std::chrono::steady_clock::now() + std::chrono::milliseconds(kBusyTimeoutMs);
  for (int attempt = 0;; ++attempt) {
    DWORD error = Attempt(work, write);
    if (error != ERROR_BUSY || std::chrono::steady_clock::now() >= deadline) return error;
    std::this_thread::sleep_for(std::chrono::milliseconds(1 + (attempt % 8) * (1 + getpid() % 3)));
  }
}

DWORD StateStore::Attempt(const Work& work, bool write) {
  DWORD error = Open();
  if (error != ERROR_SUCCESS) return error;
  // A nested call (a store operation made by the work of another) joins the open transaction.
  const bool outermost = sqlite3_get_autocommit(m_db) != 0;
  if (outermost) {
    int rc = sqlite3_exec(m_db, write ? "BEGIN IMMEDIATE" : "BEGIN", nullptr, nullptr, nullptr);
    if (rc != SQLITE_OK) return Error(rc);
  }
  try {
    error = work(*this);
  } catch (const std::bad_alloc&) {
    error = ERROR_NOT_ENOUGH_MEMORY;
  } catch (...) {
    error = ERROR_GEN_FAILURE;
  }
  if (!outermost) return error;
  if (error == ERROR_SUCCESS) {
    int rc = sqlite3_exec(m_db, "COMMIT", nullptr, nullptr, nullptr);
    if (rc != SQLITE_OK) {
      error = Error(rc);
      sqlite3_exec(m_db, "ROLLBACK", nullptr, nullptr, nullptr);
    }
  } else {
    sqlite3_exec(m_db, "ROLLBACK", nullptr, nullptr, nullptr);
  }
  if (m_reopen) Close();
  return error;
}

DWORD StateStore::Write(const Work& work) { return Run(work, true); }
DWORD StateStore::Read(const Work& work) { return Run(work, false); }

}  // namespace Platform::posix

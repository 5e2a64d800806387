// POSIX backend: the SQLite databases in the state directory that back the registry and the
// event log. Not part of the platform interface; only the posix backend includes this.
//
// A StateStore is one database file, shared by every thread of the process through one
// connection under one lock, and by other processes through SQLite's own locking: the journal is
// a write-ahead log, a busy peer is waited for (busy timeout), every write is one IMMEDIATE
// transaction. A store whose file is corrupt or not a database makes
// the calls fail with the store's corruption code; the connection is then dropped, so that a
// repaired or replaced file is picked up by the next call.
#pragma once

#include <sqlite3.h>

#include <cstdint>
#include <functional>
#include <mutex>
#include <string>
#include <unordered_map>

#include "owutils/WinTypes.h"

namespace Platform::posix {

// The state folder as a native path, created when missing (see platform/StateDirectory.h).
bool NativeStateDirectory(std::string& path);

// Upper-case form of a UTF-16 name, for comparing names without regard to case as Windows does
// (each unit mapped on its own, as the system's upcase table does).
std::u16string FoldName(const std::u16string& name);

class StateStore;

// A prepared statement of the store's connection, reset when it goes out of scope. Text is bound
// and read as UTF-16 blobs, so that names and strings keep their exact units.
class Statement {
 public:
  Statement(StateStore& store, const char* sql);
  ~Statement();
  Statement(const Statement&) = delete;
  Statement& operator=(const Statement&) = delete;

  // The SQLite result of preparing (SQLITE_OK when usable).
  int Prepared() const noexcept { return m_rc; }
  void Bind(int index, std::int64_t value);
  void Bind(int index, const std::u16string& text);
  void BindBlob(int index, const void* data, size_t size);
  void BindUtf8(int index, const std::string& text);
  // SQLITE_ROW, SQLITE_DONE or an error.
  int Step();
  std::int64_t Int(int column) const;
  std::u16string Text(int column) const;
  const void* Blob(int column, size_t& size) const;

 private:
  sqlite3_stmt* m_stmt = nullptr;
  int m_rc;
};

class StateStore {
 public:
  // How a commit reaches the disk. Full: the write-ahead log is synced at every commit, so a
  // committed write survives a power failure. Normal: a committed write is in the write-ahead
  // log (survives a crash of the writing process) and reaches the disk at the next checkpoint;
  // a power failure may lose the last commits but never damages the store.
  enum class Sync { Full, Normal };

  // `fileName` inside the state folder; `schema` is run once per connection inside a write
  // transaction (CREATE ... IF NOT EXISTS); `corruptError` is the Win32 code for a damaged store.
  StateStore(const char* fileName, const char* schema, DWORD corruptError, Sync sync = Sync::Full);
  ~StateStore();

  using Work = std::function<DWORD(StateStore&)>;
  // Runs `work` in one write transaction (BEGIN IMMEDIATE ... COMMIT); a non-zero result of
  // `work` rolls it back. Returns ERROR_SUCCESS or the Win32 code of the failure.
  DWORD Write(const Work& work);
  // Runs `work` in one read transaction, seeing one consistent state of the store.
  DWORD Read(const Work& work);

  // Maps a SQLite result to a Win32 code (and marks the connection for reopening when the store
  // turned out to be damaged).
  DWORD Error(int rc);

  sqlite3* Connection() const noexcept { return m_db; }
  sqlite3_stmt* Prepare(const char* sql, int& rc);

 private:
  DWORD Run(const Work& work, bool write);
  DWORD Attempt(const Work& work, bool write);
  DWORD Open();
  void Close();

  const char* m_fileName;
  const char* m_schema;
  DWORD m_corruptError;
  Sync m_sync;
  std::recursive_mutex m_lock;
  sqlite3* m_db = nullptr;
  std::string m_path;   // file the connection is open on
  long m_pid = 0;       // process that opened it; a forked child opens its own
  bool m_reopen = false;
  std::unordered_map<const char*, sqlite3_stmt*> m_statements;  // by SQL text pointer
};

}  // namespace Platform::posix

// POSIX backend: the registry as the SQLite store "registry.db" in the state folder.
//
// Schema: a tree of keys (each row names its parent; the hives are the rows 1 and 2 with parent
// 0) and the values of each key. Names are kept twice as UTF-16 blobs: as written and upper-cased
// for lookup, so that names compare without regard to case and keep their exact units.
#include "owutils/Registry.h"

#include <cstring>
#include <mutex>
#include <string>
#include <unordered_set>
#include <vector>

#include "platform/Errors.h"
#include "platform/posix/StateStore.h"

namespace Platform {
namespace {

using posix::FoldName;
using posix::StateStore;
using posix::Statement;

constexpr const char* kSchema = R"sql(
CREATE TABLE IF NOT EXISTS reg_keys(
  id     INTEGER PRIMARY KEY AUTOINCREMENT,
  parent INTEGER NOT NULL,
  name   BLOB NOT NULL,
  fold   BLOB NOT NULL,
  UNIQUE(parent, fold));
CREATE TABLE IF NOT EXISTS reg_values(
  key  INTEGER NOT NULL REFERENCES reg_keys(id) ON DELETE CASCADE,
  fold BLOB NOT NULL,
  name BLOB NOT NULL,
  type INTEGER NOT NULL,
  data BLOB NOT NULL,
  PRIMARY KEY(key, fold)) WITHOUT ROWID;
INSERT OR IGNORE INTO reg_keys(id, parent, name, fold) VALUES
  (1, 0, CAST('HKEY_LOCAL_MACHINE' AS BLOB), CAST('HKEY_LOCAL_MACHINE' AS BLOB)),
  (2, 0, CAST('HKEY_CURRENT_USER' AS BLOB), CAST('HKEY_CURRENT_USER' AS BLOB));
)sql";

constexpr std::int64_t kMachineHive = 1;
constexpr std::int64_t kUserHive = 2;
constexpr std::uint32_t kKeyMagic = 0x4F574B59;  // "OWKY"

StateStore& Store() {
  // Never destroyed: handles may be used by other static objects until the process ends.
  static StateStore* store = new StateStore("registry.db", kSchema, ERROR_REGISTRY_CORRUPT);
  return *store;
}

// An open key handle.
struct OpenKey {
  std::uint32_t magic = kKeyMagic;
  std::int64_t id = 0;
  REGSAM access = 0;
};

std::mutex g_handleLock;
std::unordered_set<OpenKey*>& Handles() {
  static auto* handles = new std::unordered_set<OpenKey*>();
  return *handles;
}

struct KeyRef {
  std::int64_t id = 0;
  REGSAM access = 0;
  bool hive = false;
};

// What a handle stands for; false for anything that is not a hive or an open key.
bool Resolve(HKEY key, KeyRef& ref) {
  if (key == HKEY_LOCAL_MACHINE || key == HKEY_CURRENT_USER) {
    ref.id = key == HKEY_LOCAL_MACHINE ? kMachineHive : kUserHive;
    ref.access = KEY_ALL_ACCESS;
    ref.hive = true;
    return true;
  }
  std::lock_guard<std::mutex> guard(g_handleLock);
  auto* open = reinterpret_cast<OpenKey*>(key);
  if (Handles().count(open) == 0) return false;
  ref.id = open->id;
  ref.access = open->access;
  ref.hive = false;
  return true;
}

HKEY NewHandle(std::int64_t id, REGSAM access) {
  auto* open = new OpenKey;
  open->id = id;
  open->access = access;
  std::lock_guard<std::mutex> guard(g_handleLock);
  Handles().insert(open);
  return reinterpret_cast<HKEY>(open);
}

// Splits a key path at its backslashes. A single trailing backslash is allowed; any other empty
// component makes the path bad.
bool SplitPath(const char16_t* path, std::vector<std::u16string>& parts) {
  parts.clear();
  if (path == nullptr || *path == 0) return true;
  std::u16string whole(path);
  if (whole.back() == u'\\') whole.pop_back();
  size_t start = 0;
  while (true) {
    size_t end = whole.find(u'\\', start);
    std::u16string part = whole.substr(start, end == std::u16string::npos ? std::u16string::npos : end - start);
    if (part.empty()) return false;
    parts.push_back(std::move(part));
    if (end == std::u16string::npos) return true;
    start = end + 1;
  }
}

// The key a handle names must still exist (the hives always do).
DWORD CheckExists(StateStore& store, const KeyRef& ref) {
  if (ref.hive) return ERROR_SUCCESS;
  Statement q(store, "SELECT 1 FROM reg_keys WHERE id = ?1");
  if (q.Prepared() != SQLITE_OK) return store.Error(q.Prepared());
  q.Bind(1, ref.id);
  int rc = q.Step();
  if (rc == SQLITE_ROW) return ERROR_SUCCESS;
  if (rc == SQLITE_DONE) return ERROR_KEY_DELETED;
  return store.Error(rc);
}

DWORD FindChild(StateStore& store, std::int64_t parent, const std::u16string& name, std::int64_t& id) {
  Statement q(store, "SELECT id FROM reg_keys WHERE parent = ?1 AND fold = ?2");
  if (q.Prepared() != SQLITE_OK) return store.Error(q.Prepared());
  q.Bind(1, parent);
  q.Bind(2, FoldName(name));
  int rc = q.Step();
  if (rc == SQLITE_ROW) {
    id = q.Int(0);
    return ERROR_SUCCESS;
  }
  return rc == SQLITE_DONE ? static_cast<DWORD>(ERROR_FILE_NOT_FOUND) : store.Error(rc);
}

// Walks `parts` from `start`; `create` adds the missing keys. `created` tells whether any was.
DWORD Walk(StateStore& store, std::int64_t start, const std::vector<std::u16string>& parts, bool create,
           REGSAM parentAccess, std::int64_t& id, bool& created) {
  id = start;
  created = false;
  for (const std::u16string& part : parts) {
    std::int64_t child = 0;
    DWORD error = FindChild(store, id, part, child);
    if (error == ERROR_FILE_NOT_FOUND && create) {
      if (!created && (parentAccess & KEY_CREATE_SUB_KEY) == 0) return ERROR_ACCESS_DENIED;
      Statement insert(store, "INSERT INTO reg_keys(parent, name, fold) VALUES(?1, ?2, ?3)");
      if (insert.Prepared() != SQLITE_OK) return store.Error(insert.Prepared());
      insert.Bind(1, id);
      insert.Bind(2, part);
      insert.Bind(3, FoldName(part));
      int rc = insert.Step();
      if (rc != SQLITE_DONE) return store.Error(rc);
      child = sqlite3_last_insert_rowid(store.Connection());
      created = true;
    } else if (error != ERROR_SUCCESS) {
      return error;
    }
    id = child;
  }
  return ERROR_SUCCESS;
}

std::u16string ValueName(const char16_t* name) { return name == nullptr ? std::u16string() : std::u16string(name); }

}  // namespace

namespace {

// Opens `subKey` below `key` (creating the missing parts when `create`) as a new handle.
LONG OpenOrCreateKey(HKEY key, const char16_t* subKey, REGSAM access, bool create, HKEY* result, bool& created) {
  if (result == nullptr) return ERROR_INVALID_PARAMETER;
  *result = nullptr;
  KeyRef ref;
  if (!Resolve(key, ref)) return ERROR_INVALID_HANDLE;
  std::vector<std::u16string> parts;
  if (!SplitPath(subKey, parts)) return ERROR_BAD_PATHNAME;
  std::int64_t id = 0;
  auto work = [&](StateStore& store) {
    DWORD e = CheckExists(store, ref);
    if (e != ERROR_SUCCESS) return e;
    return Walk(store, ref.id, parts, create, ref.access, id, created);
  };
  DWORD error = create ? Store().Write(work) : Store().Read(work);
  if (error != ERROR_SUCCESS) return static_cast<LONG>(error);
  *result = NewHandle(id, access);
  return ERROR_SUCCESS;
}

}  // namespace

LONG RegCreateKeyExW(HKEY key, const char16_t* subKey, DWORD, char16_t*, DWORD, REGSAM access, void*, HKEY* result,
                     DWORD* disposition) {
  bool created = false;
  LONG error = OpenOrCreateKey(key, subKey, access, true, result, created);
  if (error == ERROR_SUCCESS && disposition != nullptr) {
    *disposition = created ? REG_CREATED_NEW_KEY : REG_OPENED_EXISTING_KEY;
  }
  return error;
}

LONG RegOpenKeyExW(HKEY key, const char16_t* subKey, DWORD, REGSAM access, HKEY* result) {
  bool created = false;
  return OpenOrCreateKey(key, subKey, access, false, result, created);
}

LONG RegQueryValueExW(HKEY key, const char16_t* name, DWORD*, DWORD* type, BYTE* data, DWORD* size) {
  KeyRef ref;
  if (!Resolve(key, ref)) return ERROR_INVALID_HANDLE;
  if (data != nullptr && size == nullptr) return ERROR_INVALID_PARAMETER;
  if ((ref.access & KEY_QUERY_VALUE) == 0) return ERROR_ACCESS_DENIED;
  const std::u16string fold = FoldName(ValueName(name));
  DWORD valueType = 0;
  std::vector<BYTE> bytes;
  DWORD error = Store().Read([&](StateStore& store) {
    DWORD e = CheckExists(store, ref);
    if (e != ERROR_SUCCESS) return e;
    Statement q(store, "SELECT type, data FROM reg_values WHERE key = ?1 AND fold = ?2");
    if (q.Prepared() != SQLITE_OK) return store.Error(q.Prepared());
    q.Bind(1, ref.id);
    q.Bind(2, fold);
    int rc = q.Step();
    if (rc == SQLITE_DONE) return static_cast<DWORD>(ERROR_FILE_NOT_FOUND);
    if (rc != SQLITE_ROW) return store.Error(rc);
    valueType = static_cast<DWORD>(q.Int(0));
    size_t length = 0;
    const void* blob = q.Blob(1, length);
    bytes.assign(static_cast<const BYTE*>(blob), static_cast<const BYTE*>(blob) + length);
    return static_cast<DWORD>(ERROR_SUCCESS);
  });
  if (error != ERROR_SUCCESS) return static_cast<LONG>(error);
  if (type != nullptr) *type = valueType;
  const DWORD needed = static_cast<DWORD>(bytes.size());
  if (data == nullptr) {
    if (size != nullptr) *size = needed;
    return ERROR_SUCCESS;
  }
  if (*size < needed) {
    *size = needed;
    return ERROR_MORE_DATA;
  }
  if (needed != 0) std::memcpy(data, bytes.data(), needed);
  *size = needed;
  return ERROR_SUCCESS;
}

LONG RegSetValueExW(HKEY key, const char16_t* name, DWORD, DWORD type, const BYTE* data, DWORD size) {
  KeyRef ref;
  if (!Resolve(key, ref)) return ERROR_INVALID_HANDLE;
  if (data == nullptr && size != 0) return ERROR_NOACCESS;
  if ((ref.access & KEY_SET_VALUE) == 0) return ERROR_ACCESS_DENIED;
  const std::u16string valueName = ValueName(name);
  DWORD error = Store().Write([&](StateStore& store) {
    DWORD e = CheckExists(store, ref);
    if (e != ERROR_SUCCESS) return e;
    Statement q(store,
                "INSERT INTO reg_values(key, fold, name, type, data) VALUES(?1, ?2, ?3, ?4, ?5) "
                "ON CONFLICT(key, fold) DO UPDATE SET name = excluded.name, type = excluded.type, data = excluded.data");
    if (q.Prepared() != SQLITE_OK) return store.Error(q.Prepared());
    q.Bind(1, ref.id);
    q.Bind(2, FoldName(valueName));
    q.Bind(3, valueName);
    q.Bind(4, static_cast<std::int64_t>(type));
    q.BindBlob(5, data, size);
    int rc = q.Step();
    return rc == SQLITE_DONE ? static_cast<DWORD>(ERROR_SUCCESS) : store.Error(rc);
  });
  return static_cast<LONG>(error);
}

LONG RegDeleteValueW(HKEY key, const char16_t* name) {
  KeyRef ref;
  if (!Resolve(key, ref)) return ERROR_INVALID_HANDLE;
  if ((ref.access & KEY_SET_VALUE) == 0) return ERROR_ACCESS_DENIED;
  const std::u16string fold = FoldName(ValueName(name));
  DWORD error = Store().Write([&](StateStore& store) {
    DWORD e = CheckExists(store, ref);
    if (e != ERROR_SUCCESS) return e;
    Statement q(store, "DELETE FROM reg_values WHERE key = ?1 AND fold = ?2");
    if (q.Prepared() != SQLITE_OK) return store.Error(q.Prepared());
    q.Bind(1, ref.id);
    q.Bind(2, fold);
    int rc = q.Step();
    if (rc != SQLITE_DONE) return store.Error(rc);
    return sqlite3_changes(store.Connection()) == 0 ? static_cast<DWORD>(ERROR_FILE_NOT_FOUND)
                                                    : static_cast<DWORD>(ERROR_SUCCESS);
  });
  return static_cast<LONG>(error);
}

LONG RegDeleteKeyW(HKEY key, const char16_t* subKey) {
  KeyRef ref;
  if (!Resolve(key, ref)) return ERROR_INVALID_HANDLE;
  if (subKey == nullptr || *subKey == 0) return ERROR_INVALID_PARAMETER;
  std::vector<std::u16string> parts;
  if (!SplitPath(subKey, parts)) return ERROR_BAD_PATHNAME;
  DWORD error = Store().Write([&](StateStore& store) {
    DWORD e = CheckExists(store, ref);
    if (e != ERROR_SUCCESS) return e;
    std::int64_t id = 0;
    bool created = false;
    e = Walk(store, ref.id, parts, false, ref.access, id, created);
    if (e != ERROR_SUCCESS) return e;
    Statement children(store, "SELECT 1 FROM reg_keys WHERE parent = ?1 LIMIT 1");
    if (children.Prepared() != SQLITE_OK) return store.Error(children.Prepared());
    children.Bind(1, id);
    int rc = children.Step();
    if (rc == SQLITE_ROW) return static_cast<DWORD>(ERROR_ACCESS_DENIED);
    if (rc != SQLITE_DONE) return store.Error(rc);
    Statement values(store, "DELETE FROM reg_values WHERE key = ?1");
    if (values.Prepared() != SQLITE_OK) return store.Error(values.Prepared());
    values.Bind(1, id);
    rc = values.Step();
    if (rc != SQLITE_DONE) return store.Error(rc);
    Statement remove(store, "DELETE FROM reg_keys WHERE id = ?1");
    if (remove.Prepared() != SQLITE_OK) return store.Error(remove.Prepared());
    remove.Bind(1, id);
    rc = remove.Step();
    return rc == SQLITE_DONE ? static_cast<DWORD>(ERROR_SUCCESS) : store.Error(rc);
  });
  return static_cast<LONG>(error);
}

LONG RegCloseKey(HKEY key) {
  if (key == HKEY_LOCAL_MACHINE || key == HKEY_CURRENT_USER || key == HKEY_CLASSES_ROOT || key == HKEY_USERS)
    return ERROR_SUCCESS;
  auto* open = reinterpret_cast<OpenKey*>(key);
  {
    std::lock_guard<std::mutex> guard(g_handleLock);
    if (Handles().erase(open) == 0) return ERROR_INVALID_HANDLE;
  }
  delete open;
  return ERROR_SUCCESS;
}

}  // namespace Platform

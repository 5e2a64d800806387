// The registry store: Win32 result codes, case rules, typed values, several processes.
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdlib>
#include <cstring>
#include <fstream>
#include <string>
#include <thread>
#include <vector>

#include "owutils/Registry.h"
#include "platform/StateDirectory.h"
#include "support/TestEnvironment.h"

using namespace Platform;

namespace {

// Each test works below a key of its own.
std::u16string TestKey(const char* name) { return u"Software\\OWUtilsTests\\" + OwTest::Widen(name); }

struct Key {
  HKEY h = nullptr;
  ~Key() {
    if (h != nullptr) RegCloseKey(h);
  }
};

LONG Create(const std::u16string& path, Key& key, DWORD* disposition = nullptr, REGSAM access = KEY_ALL_ACCESS) {
  return RegCreateKeyExW(HKEY_CURRENT_USER, path.c_str(), 0, nullptr, 0, access, nullptr, &key.h, disposition);
}

LONG SetDword(HKEY key, const char16_t* name, DWORD value) {
  return RegSetValueExW(key, name, 0, REG_DWORD, reinterpret_cast<const BYTE*>(&value), sizeof value);
}

// Points the state folder elsewhere for the life of the object.
class StateDirOverride {
 public:
  explicit StateDirOverride(const std::string& dir) : m_old(std::getenv("OWUTILS_STATE_DIR")) {
    setenv("OWUTILS_STATE_DIR", dir.c_str(), 1);
  }
  ~StateDirOverride() { setenv("OWUTILS_STATE_DIR", m_old.c_str(), 1); }

 private:
  std::string m_old;
};

}  // namespace

TEST(Registry, CreateOpenAndCaseOfKeyAndValueNames) {
  Key created;
  DWORD disposition = 0;
  ASSERT_EQ(Create(TestKey("Case\\Deep\\Path"), created, &disposition), ERROR_SUCCESS);
  EXPECT_EQ(disposition, static_cast<DWORD>(REG_CREATED_NEW_KEY));
  Key again;
  ASSERT_EQ(Create(TestKey("CASE\\deep\\PATH\\"), again, &disposition), ERROR_SUCCESS);
  EXPECT_EQ(disposition, static_cast<DWORD>(REG_OPENED_EXISTING_KEY));

  ASSERT_EQ(SetDword(created.h, u"LanguageId", 0x407), ERROR_SUCCESS);
  Key opened;
  ASSERT_EQ(RegOpenKeyExW(HKEY_CURRENT_USER, TestKey("case\\DEEP\\path").c_str(), 0, KEY_READ, &opened.h), ERROR_SUCCESS);
  DWORD type = 0, value = 0, size = sizeof value;
  ASSERT_EQ(RegQueryValueExW(opened.h, u"LANGUAGEID", nullptr, &type, reinterpret_cast<BYTE*>(&value), &size),
            ERROR_SUCCESS);
  EXPECT_EQ(type, static_cast<DWORD>(REG_DWORD));
  EXPECT_EQ(value, 0x407u);
  EXPECT_EQ(size, 4u);

  // Hives are separate trees.
  Key other;
  EXPECT_EQ(RegOpenKeyExW(HKEY_LOCAL_MACHINE, TestKey("Case").c_str(), 0, KEY_READ, &other.h), ERROR_FILE_NOT_FOUND);
  EXPECT_EQ(other.h, nullptr);
  // An empty sub-key opens the key itself.
  Key self;
  EXPECT_EQ(RegOpenKeyExW(opened.h, u"", 0, KEY_READ, &self.h), ERROR_SUCCESS);
}

TEST(Registry, TypedValuesKeepTypeAndExactBytes) {
  Key key;
  ASSERT_EQ(Create(TestKey("Typed"), key), ERROR_SUCCESS);
  const char16_t sz[] = u"C:\\Program Files\\x";
  const char16_t multi[] = u"one\0two\0";  // with the final terminator: 9 units
  const BYTE binary[] = {0, 1, 2, 0xFF, 0, 0x80};
  const char16_t noTerminator[] = {u'a', u'b'};
  struct Case {
    const char16_t* name;
    DWORD type;
    const void* data;
    DWORD size;
  } cases[] = {
      {u"sz", REG_SZ, sz, sizeof sz},
      {u"expand", REG_EXPAND_SZ, u"%HOME%\\x", 18},
      {u"multi", REG_MULTI_SZ, multi, sizeof multi},
      {u"binary", REG_BINARY, binary, sizeof binary},
      {u"unterminated", REG_SZ, noTerminator, sizeof noTerminator},
      {u"empty", REG_BINARY, nullptr, 0},
      {nullptr, REG_SZ, u"default", 16},
  };
  for (const Case& c : cases) {
    ASSERT_EQ(RegSetValueExW(key.h, c.name, 0, c.type, static_cast<const BYTE*>(c.data), c.size), ERROR_SUCCESS);
  }
  for (const Case& c : cases) {
    SCOPED_TRACE(c.name == nullptr ? "(default)" : OwTest::Narrow(c.name));
    DWORD type = 0, size = 0;
    ASSERT_EQ(RegQueryValueExW(key.h, c.name, nullptr, &type, nullptr, &size), ERROR_SUCCESS);
    EXPECT_EQ(type, c.type);
    ASSERT_EQ(size, c.size);
    std::vector<BYTE> buffer(size + 4, 0xCC);
    DWORD got = static_cast<DWORD>(buffer.size());
    ASSERT_EQ(RegQueryValueExW(key.h, c.name, nullptr, nullptr, buffer.data(), &got), ERROR_SUCCESS);
    EXPECT_EQ(got, c.size);
    if (c.size != 0) {
      EXPECT_EQ(std::memcmp(buffer.data(), c.data, c.size), 0);
    }
    EXPECT_EQ(buffer[c.size], 0xCC);  // nothing written past the value
  }
  // The empty name and the null name are both the default value.
  DWORD size = 0;
  EXPECT_EQ(RegQueryValueExW(key.h, u"", nullptr, nullptr, nullptr, &size), ERROR_SUCCESS);
  EXPECT_EQ(size, 16u);
}

TEST(Registry, ResultCodes) {
  Key key;
  ASSERT_EQ(Create(TestKey("Codes"), key), ERROR_SUCCESS);
  ASSERT_EQ(RegSetValueExW(key.h, u"v", 0, REG_SZ, reinterpret_cast<const BYTE*>(u"hello"), 12), ERROR_SUCCESS);

  BYTE small[4];
  DWORD size = sizeof small, type = 0;
  EXPECT_EQ(RegQueryValueExW(key.h, u"v", nullptr, &type, small, &size), ERROR_MORE_DATA);
  EXPECT_EQ(size, 12u);
  EXPECT_EQ(RegQueryValueExW(key.h, u"missing", nullptr, &type, nullptr, &size), ERROR_FILE_NOT_FOUND);
  EXPECT_EQ(RegQueryValueExW(key.h, u"v", nullptr, &type, small, nullptr), ERROR_INVALID_PARAMETER);
  Key none;
  EXPECT_EQ(RegOpenKeyExW(HKEY_CURRENT_USER, TestKey("NoSuchKey").c_str(), 0, KEY_READ, &none.h), ERROR_FILE_NOT_FOUND);
  EXPECT_EQ(RegOpenKeyExW(HKEY_CURRENT_USER, u"Software\\\\Double", 0, KEY_READ, &none.h), ERROR_BAD_PATHNAME);
  EXPECT_EQ(RegOpenKeyExW(HKEY_CURRENT_USER, u"\\Leading", 0, KEY_READ, &none.h), ERROR_BAD_PATHNAME);

  // Rights of the handle.
  Key readOnly;
  ASSERT_EQ(RegOpenKeyExW(HKEY_CURRENT_USER, TestKey("Codes").c_str(), 0, KEY_READ, &readOnly.h), ERROR_SUCCESS);
  EXPECT_EQ(SetDword(readOnly.h, u"x", 1), ERROR_ACCESS_DENIED);
  EXPECT_EQ(RegDeleteValueW(readOnly.h, u"v"), ERROR_ACCESS_DENIED);
  Key created;
  EXPECT_EQ(RegCreateKeyExW(readOnly.h, u"Sub", 0, nullptr, 0, KEY_ALL_ACCESS, nullptr, &created.h, nullptr),
            ERROR_ACCESS_DENIED);
  Key writeOnly;
  ASSERT_EQ(RegOpenKeyExW(HKEY_CURRENT_USER, TestKey("Codes").c_str(), 0, KEY_SET_VALUE, &writeOnly.h), ERROR_SUCCESS);
  EXPECT_EQ(RegQueryValueExW(writeOnly.h, u"v", nullptr, nullptr, nullptr, &size), ERROR_ACCESS_DENIED);

  // Handles that are not open keys.
  int notAKey = 0;
  EXPECT_EQ(RegQueryValueExW(reinterpret_cast<HKEY>(&notAKey), u"v", nullptr, nullptr, nullptr, &size),
            ERROR_INVALID_HANDLE);
  EXPECT_EQ(RegCloseKey(reinterpret_cast<HKEY>(&notAKey)), ERROR_INVALID_HANDLE);
  EXPECT_EQ(RegOpenKeyExW(HKEY_USERS, u"x", 0, KEY_READ, &none.h), ERROR_INVALID_HANDLE);
  EXPECT_EQ(RegCloseKey(HKEY_LOCAL_MACHINE), ERROR_SUCCESS);
}

TEST(Registry, DeleteValuesAndKeys) {
  Key parent, child;
  ASSERT_EQ(Create(TestKey("Delete"), parent), ERROR_SUCCESS);
  ASSERT_EQ(Create(TestKey("Delete\\Child"), child), ERROR_SUCCESS);
  ASSERT_EQ(SetDword(child.h, u"Value", 7), ERROR_SUCCESS);

  EXPECT_EQ(RegDeleteValueW(child.h, u"VALUE"), ERROR_SUCCESS);
  EXPECT_EQ(RegDeleteValueW(child.h, u"Value"), ERROR_FILE_NOT_FOUND);
  ASSERT_EQ(SetDword(child.h, u"Value", 7), ERROR_SUCCESS);

  // A key with subkeys stays.
  EXPECT_EQ(RegDeleteKeyW(HKEY_CURRENT_USER, TestKey("Delete").c_str()), ERROR_ACCESS_DENIED);
  EXPECT_EQ(RegDeleteKeyW(parent.h, u"child"), ERROR_SUCCESS);
  EXPECT_EQ(RegDeleteKeyW(parent.h, u"child"), ERROR_FILE_NOT_FOUND);
  // The handle still open on the deleted key reports so.
  DWORD size = 0;
  EXPECT_EQ(RegQueryValueExW(child.h, u"Value", nullptr, nullptr, nullptr, &size), ERROR_KEY_DELETED);
  EXPECT_EQ(SetDword(child.h, u"Value", 1), ERROR_KEY_DELETED);
  // Recreated, it starts without the old values.
  Key fresh;
  ASSERT_EQ(Create(TestKey("Delete\\Child"), fresh), ERROR_SUCCESS);
  EXPECT_EQ(RegQueryValueExW(fresh.h, u"Value", nullptr, nullptr, nullptr, &size), ERROR_FILE_NOT_FOUND);
}

TEST(Registry, ProcessesSeeEachOthersWritesAndLoseNothing) {
  Key key;
  ASSERT_EQ(Create(TestKey("Processes"), key), ERROR_SUCCESS);
  ASSERT_EQ(SetDword(key.h, u"FromParent", 1), ERROR_SUCCESS);
  constexpr int kChildren = 4;
  constexpr int kValues = 40;
  std::vector<pid_t> children;
  for (int c = 0; c < kChildren; ++c) {
    pid_t pid = fork();
    ASSERT_NE(pid, -1);
    if (pid == 0) {
      // The child opens the key the parent created and adds values of its own.
      HKEY h = nullptr;
      int failures = 0;
      if (RegOpenKeyExW(HKEY_CURRENT_USER, TestKey("processes").c_str(), 0, KEY_ALL_ACCESS, &h) != ERROR_SUCCESS) _exit(2);
      DWORD type = 0, v = 0, size = sizeof v;
      if (RegQueryValueExW(h, u"FromParent", nullptr, &type, reinterpret_cast<BYTE*>(&v), &size) != 0 || v != 1) {
        _exit(3);
      }
      for (int i = 0; i < kValues; ++i) {
        std::u16string name = u"c" + OwTest::Widen(std::to_string(c)) + u"_" + OwTest::Widen(std::to_string(i));
        if (SetDword(h, name.c_str(), static_cast<DWORD>(c * 1000 + i)) != ERROR_SUCCESS) ++failures;
      }
      RegCloseKey(h);
      _exit(failures == 0 ? 0 : 1);
    }
    children.push_back(pid);
  }
  for (pid_t pid : children) {
    int status = 0;
    ASSERT_EQ(waitpid(pid, &status, 0), pid);
    EXPECT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0) << status;
  }
  for (int c = 0; c < kChildren; ++c) {
    for (int i = 0; i < kValues; ++i) {
      std::u16string name = u"C" + OwTest::Widen(std::to_string(c)) + u"_" + OwTest::Widen(std::to_string(i));
      DWORD v = 0, size = sizeof v;
      ASSERT_EQ(RegQueryValueExW(key.h, name.c_str(), nullptr, nullptr, reinterpret_cast<BYTE*>(&v), &size),
                ERROR_SUCCESS);
      EXPECT_EQ(v, static_cast<DWORD>(c * 1000 + i));
    }
  }
}

TEST(Registry, ConcurrencyThreadsCreateAndWrite) {
  constexpr int kThreads = 4;
  constexpr int kValues = 25;
  std::vector<std::thread> threads;
  std::vector<int> failures(kThreads, 0);
  for (int t = 0; t < kThreads; ++t) {
    threads.emplace_back([t, &failures] {
      for (int i = 0; i < kValues; ++i) {
        HKEY h = nullptr;
        if (RegCreateKeyExW(HKEY_CURRENT_USER, TestKey("Threads\\Shared").c_str(), 0, nullptr, 0, KEY_ALL_ACCESS,
                            nullptr, &h, nullptr) != ERROR_SUCCESS) {
          ++failures[t];
          continue;
        }
        std::u16string name = OwTest::Widen("t" + std::to_string(t) + "_" + std::to_string(i));
        if (SetDword(h, name.c_str(), static_cast<DWORD>(i)) != ERROR_SUCCESS) ++failures[t];
        RegCloseKey(h);
      }
    });
  }
  for (auto& thread : threads) thread.join();
  for (int t = 0; t < kThreads; ++t) EXPECT_EQ(failures[t], 0);
  Key key;
  ASSERT_EQ(RegOpenKeyExW(HKEY_CURRENT_USER, TestKey("Threads\\Shared").c_str(), 0, KEY_READ, &key.h), ERROR_SUCCESS);
  for (int t = 0; t < kThreads; ++t) {
    for (int i = 0; i < kValues; ++i) {
      std::u16string name = OwTest::Widen("t" + std::to_string(t) + "_" + std::to_string(i));
      DWORD size = 0;
      EXPECT_EQ(RegQueryValueExW(key.h, name.c_str(), nullptr, nullptr, nullptr, &size), ERROR_SUCCESS);
    }
  }
}

TEST(Registry, DamagedStoreFailsWithCodeAndRecovers) {
  const std::string dir = OwTest::MakeTempDirectory("corrupt");
  {
    std::ofstream garbage(dir + "/registry.db", std::ios::binary);
    std::string junk(8192, '\0');
    for (size_t i = 0; i < junk.size(); ++i) junk[i] = static_cast<char>((i * 131 + 7) & 0xFF);
    garbage << junk;
  }
  StateDirOverride state(dir);
  Key key;
  EXPECT_EQ(RegOpenKeyExW(HKEY_CURRENT_USER, u"Software", 0, KEY_READ, &key.h), ERROR_REGISTRY_CORRUPT);
  EXPECT_EQ(RegCreateKeyExW(HKEY_CURRENT_USER, u"Software", 0, nullptr, 0, KEY_ALL_ACCESS, nullptr, &key.h, nullptr),
            ERROR_REGISTRY_CORRUPT);
  EXPECT_EQ(key.h, nullptr);
  // Once the file is replaced, the store works again.
  std::remove((dir + "/registry.db").c_str());
  EXPECT_EQ(RegCreateKeyExW(HKEY_CURRENT_USER, u"Software", 0, nullptr, 0, KEY_ALL_ACCESS, nullptr, &key.h, nullptr),
            ERROR_SUCCESS);
}

TEST(StateDirectory, VariableThenXdgThenHomeAndFailure) {
  const std::string old = std::getenv("OWUTILS_STATE_DIR");
  const char* oldXdg = std::getenv("XDG_STATE_HOME");
  const std::string savedXdg = oldXdg == nullptr ? "" : oldXdg;
  const std::string oldHome = std::getenv("HOME") == nullptr ? "" : std::getenv("HOME");
  const std::string base = OwTest::MakeTempDirectory("statedir");
  std::u16string path;

  setenv("OWUTILS_STATE_DIR", (base + "/explicit/deeper").c_str(), 1);
  ASSERT_TRUE(GetStateDirectory(path));
  EXPECT_EQ(OwTest::Narrow(path), base + "/explicit/deeper");
  struct stat st;
  ASSERT_EQ(stat((base + "/explicit/deeper").c_str(), &st), 0);
  EXPECT_EQ(st.st_mode & 0777, 0700u);

  // The defaults of other users (root's, /var/lib/owutils, is not touched here).
  if (geteuid() != 0) {
    unsetenv("OWUTILS_STATE_DIR");
    setenv("XDG_STATE_HOME", (base + "/xdg").c_str(), 1);
    ASSERT_TRUE(GetStateDirectory(path));
    EXPECT_EQ(OwTest::Narrow(path), base + "/xdg/owutils");

    unsetenv("XDG_STATE_HOME");
    setenv("HOME", (base + "/home").c_str(), 1);
    ASSERT_TRUE(GetStateDirectory(path));
    EXPECT_EQ(OwTest::Narrow(path), base + "/home/.local/state/owutils");
  }

  // A state folder that cannot be made: the stores fail with the system's code.
  { std::ofstream file(base + "/file"); }
  setenv("OWUTILS_STATE_DIR", (base + "/file/sub").c_str(), 1);
  EXPECT_FALSE(GetStateDirectory(path));
  HKEY key = nullptr;
  EXPECT_EQ(RegOpenKeyExW(HKEY_CURRENT_USER, u"Software", 0, KEY_READ, &key), ERROR_PATH_NOT_FOUND);

  setenv("HOME", oldHome.c_str(), 1);
  if (oldXdg != nullptr) setenv("XDG_STATE_HOME", savedXdg.c_str(), 1);
  setenv("OWUTILS_STATE_DIR", old.c_str(), 1);
}

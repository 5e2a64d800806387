// POSIX backend: modules over the system loader (dlopen), and the resource tables that
// resource modules export.
#include "platform/Modules.h"

#include <dlfcn.h>
#include <link.h>
#include <sys/stat.h>

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <cstdint>
#include <mutex>
#include <string>
#include <unordered_map>

#include "owutils/ResourceModule.h"
#include "platform/posix/NativeText.h"
#include "platform/Errors.h"
#include "platform/PathMap.h"
#include "platform/Text.h"

namespace Platform {
namespace {

constexpr std::uintptr_t kDatafileBit = 1;

// References taken through LoadLibraryW / LoadLibraryExW, by loader handle. FreeLibrary only
// releases what was taken here, so a stray handle fails instead of corrupting the loader.
std::mutex g_modulesMutex;
std::unordered_map<void*, int>& References() {
  static std::unordered_map<void*, int> references;
  return references;
}

std::atomic<HINSTANCE> g_resourceHandle{nullptr};

void* LoaderHandle(HMODULE module) noexcept {
  return reinterpret_cast<void*>(reinterpret_cast<std::uintptr_t>(module) & ~kDatafileBit);
}

bool IsDatafile(HMODULE module) noexcept {
  return (reinterpret_cast<std::uintptr_t>(module) & kDatafileBit) != 0;
}

void* MainProgram() noexcept {
  static void* const main = [] {
    void* self = dlopen(nullptr, RTLD_LAZY | RTLD_NOLOAD);
    if (self != nullptr) dlclose(self);
    return self;
  }();
  return main;
}

// Resource tables already found, for modules loaded here (only FreeLibrary can unload those,
// and it forgets the entry with the last reference).
std::unordered_map<void*, const OwResourceTable*>& KnownTables() {
  static std::unordered_map<void*, const OwResourceTable*> tables;
  return tables;
}

const OwResourceTable* LookUpResourceTable(void* handle) noexcept;

// The resource table of `module`, or null with the last error set.
const OwResourceTable* ResourceTable(HMODULE module) noexcept {
  void* handle = LoaderHandle(module);
  if (handle == nullptr) handle = MainProgram();
  if (handle == nullptr) {
    SetLastError(ERROR_INVALID_HANDLE);
    return nullptr;
  }
  try {
    std::lock_guard<std::mutex> lock(g_modulesMutex);
    auto known = KnownTables().find(handle);
    if (known != KnownTables().end()) return known->second;
    const OwResourceTable* table = LookUpResourceTable(handle);
    if (table != nullptr && References().count(handle) != 0) KnownTables()[handle] = table;
    return table;
  } catch (...) {
    SetLastError(ERROR_NOT_ENOUGH_MEMORY);
    return nullptr;
  }
}

const OwResourceTable* LookUpResourceTable(void* handle) noexcept {
  dlerror();
  void* symbol = dlsym(handle, OWUTILS_RESOURCE_TABLE_SYMBOL);
  link_map* own = nullptr;
  link_map* holder = nullptr;
  Dl_info info;
  if (symbol == nullptr || dlinfo(handle, RTLD_DI_LINKMAP, &own) != 0 ||
      dladdr1(symbol, &info, reinterpret_cast<void**>(&holder), RTLD_DL_LINKMAP) == 0 ||
      holder != own) {
    SetLastError(ERROR_RESOURCE_DATA_NOT_FOUND);
    return nullptr;
  }
  auto* table = static_cast<const OwResourceTable*>(symbol);
  if (table->magic != kOwResourceMagic || table->version != kOwResourceVersion) {
    SetLastError(ERROR_RESOURCE_DATA_NOT_FOUND);
    return nullptr;
  }
  return table;
}

template <typename Entry>
const Entry* FindEntry(const Entry* entries, std::uint32_t count, std::uint32_t id) noexcept {
  if (entries == nullptr) return nullptr;
  const Entry* end = entries + count;
  const Entry* it =
      std::lower_bound(entries, end, id, [](const Entry& e, std::uint32_t v) { return e.id < v; });
  return it != end && it->id == id ? it : nullptr;
}

}  // namespace

const char16_t* ModuleFileSuffix() noexcept { return u".so"; }

HMODULE LoadLibraryW(const char16_t* path) noexcept { return LoadLibraryExW(path, nullptr, 0); }

HMODULE LoadLibraryExW(const char16_t* path, HANDLE file, DWORD flags) noexcept {
  try {
    if (path == nullptr || *path == 0 || file != nullptr) {
      SetLastError(ERROR_INVALID_PARAMETER);
      return nullptr;
    }
    // A bare name is left to the system loader's search; anything else maps through the drive map.
    std::string native;
    std::u16string text(path);
    if (text.find_first_of(u"\\/:") == std::u16string::npos) {
      native = Posix::ToUtf8(path);
    } else if (!MapToNative(path, native)) {
      return nullptr;
    }
    if (native.find('/') != std::string::npos) {
      struct stat st;
      if (stat(native.c_str(), &st) != 0) {
        int error = errno;
        SetLastError(error == ENOENT || error == ENOTDIR ? ERROR_MOD_NOT_FOUND
                                                         : Win32ErrorFromErrno(error));
        return nullptr;
      }
      if (!S_ISREG(st.st_mode)) {
        SetLastError(S_ISDIR(st.st_mode) ? ERROR_ACCESS_DENIED : ERROR_BAD_EXE_FORMAT);
        return nullptr;
      }
    }
    // Resource modules carry no code to run; a data-file load differs from a normal one only in
    // what its handle allows.
    void* handle = dlopen(native.c_str(), RTLD_NOW | RTLD_LOCAL);
    if (handle == nullptr) {
      SetLastError(native.find('/') != std::string::npos ? ERROR_BAD_EXE_FORMAT : ERROR_MOD_NOT_FOUND);
      return nullptr;
    }
    {
      std::lock_guard<std::mutex> lock(g_modulesMutex);
      ++References()[handle];
    }
    bool datafile = (flags & (kLoadLibraryAsDatafile | kLoadLibraryAsImageResource |
                              kLoadLibraryAsDatafileExclusive)) != 0;
    auto bits = reinterpret_cast<std::uintptr_t>(handle) | (datafile ? kDatafileBit : 0);
    SetLastError(ERROR_SUCCESS);
    return reinterpret_cast<HMODULE>(bits);
  } catch (...) {
    SetLastError(ERROR_NOT_ENOUGH_MEMORY);
    return nullptr;
  }
}

BOOL FreeLibrary(HMODULE module) noexcept {
  void* handle = LoaderHandle(module);
  if (handle == nullptr) {
    SetLastError(ERROR_INVALID_HANDLE);
    return FALSE;
  }
  if (handle == MainProgram()) return TRUE;
  {
    std::lock_guard<std::mutex> lock(g_modulesMutex);
    auto it = References().find(handle);
    if (it == References().end()) {
      SetLastError(ERROR_INVALID_HANDLE);
      return FALSE;
    }
    if (--it->second == 0) {
      References().erase(it);
      KnownTables().erase(handle);
      // The current resource module must not outlive its last reference.
      HINSTANCE current = g_resourceHandle.load();
      if (current != nullptr && LoaderHandle(current) == handle) g_resourceHandle.store(nullptr);
    }
  }
  dlclose(handle);
  return TRUE;
}

void* GetProcAddress(HMODULE module, const char* name) noexcept {
  if (module == nullptr || IsDatafile(module)) {
    SetLastError(ERROR_INVALID_HANDLE);
    return nullptr;
  }
  if (name == nullptr) {
    SetLastError(ERROR_PROC_NOT_FOUND);
    return nullptr;
  }
  void* handle = LoaderHandle(module);
  dlerror();
  void* symbol = dlsym(handle, name);
  link_map* own = nullptr;
  link_map* holder = nullptr;
  Dl_info info;
  // dlsym also searches the module's dependencies; an export must be the module's own.
  if (symbol == nullptr || dlinfo(handle, RTLD_DI_LINKMAP, &own) != 0 ||
      dladdr1(symbol, &info, reinterpret_cast<void**>(&holder), RTLD_DL_LINKMAP) == 0 ||
      holder != own) {
    SetLastError(ERROR_PROC_NOT_FOUND);
    return nullptr;
  }
  return symbol;
}

HMODULE GetModuleHandleW(const char16_t* name) noexcept {
  if (name == nullptr) {
    void* self = MainProgram();
    if (self == nullptr) SetLastError(ERROR_MOD_NOT_FOUND);
    return reinterpret_cast<HMODULE>(self);
  }
  try {
    std::string native;
    std::u16string text(name);
    if (text.find_first_of(u"\\/:") == std::u16string::npos) {
      native = Posix::ToUtf8(name);
    } else if (!MapToNative(name, native)) {
      SetLastError(ERROR_MOD_NOT_FOUND);
      return nullptr;
    }
    if (native.empty()) {
      SetLastError(ERROR_MOD_NOT_FOUND);
      return nullptr;
    }
    struct Search {
      std::string wanted;
      bool byName;
      std::string found;
    } search{native, native.find('/') == std::string::npos, {}};
    dl_iterate_phdr(
        [](dl_phdr_info* info, size_t, void* data) -> int {
          auto* s = static_cast<Search*>(data);
          if (info->dlpi_name == nullptr || *info->dlpi_name == 0) return 0;
          std::string path = info->dlpi_name;
          std::string candidate = path;
          if (s->byName) {
            size_t slash = path.rfind('/');
            if (slash != std::string::npos) candidate = path.substr(slash + 1);
          }
          if (candidate == s->wanted) {
            s->found = path;
            return 1;
          }
          return 0;
        },
        &search);
    if (search.found.empty()) {
      SetLastError(ERROR_MOD_NOT_FOUND);
      return nullptr;
    }
    void* handle = dlopen(search.found.c_str(), RTLD_LAZY | RTLD_NOLOAD);
    if (handle == nullptr) {
      SetLastError(ERROR_MOD_NOT_FOUND);
      return nullptr;
    }
    dlclose(handle);  // NOLOAD took a reference; GetModuleHandleW takes none
    return reinterpret_cast<HMODULE>(handle);
  } catch (...) {
    SetLastError(ERROR_NOT_ENOUGH_MEMORY);
    return nullptr;
  }
}

int LoadStringW(HINSTANCE module, UINT id, char16_t* buffer, int bufferSize) noexcept {
  if (buffer == nullptr || bufferSize < 0) {
    SetLastError(ERROR_INVALID_PARAMETER);
    return 0;
  }
  if (bufferSize > 0) buffer[0] = 0;
  const OwResourceTable* table = ResourceTable(module);
  if (table == nullptr) return 0;
  const OwResourceString* entry = FindEntry(table->strings, table->stringCount, id);
  if (entry == nullptr || entry->length == 0 || entry->text == nullptr) {
    SetLastError(ERROR_RESOURCE_NAME_NOT_FOUND);
    return 0;
  }
  if (bufferSize == 0) {
    *reinterpret_cast<const char16_t**>(buffer) = entry->text;
    return static_cast<int>(entry->length);
  }
  int count = static_cast<int>(std::min<std::uint32_t>(entry->length,
                                                       static_cast<std::uint32_t>(bufferSize - 1)));
  std::copy(entry->text, entry->text + count, buffer);
  buffer[count] = 0;
  return count;
}

bool FindMessageTemplate(HMODULE module, DWORD id, LANGID languageId, std::u16string& text) {
  if (module == nullptr) {
    SetLastError(ERROR_INVALID_HANDLE);
    return false;
  }
  const OwResourceTable* table = ResourceTable(module);
  if (table == nullptr) return false;
  if (languageId != 0 && table->language != 0 && languageId != table->language) {
    SetLastError(ERROR_RESOURCE_LANG_NOT_FOUND);
    return false;
  }
  const OwResourceMessage* entry = FindEntry(table->messages, table->messageCount, id);
  if (entry == nullptr || entry->text == nullptr) {
    SetLastError(ERROR_MR_MID_NOT_FOUND);
    return false;
  }
  text.assign(entry->text, entry->length);
  return true;
}

LANGID GetModuleResourceLanguage(HMODULE module) noexcept {
  const OwResourceTable* table = ResourceTable(module);
  return table != nullptr ? table->language : 0;
}

HINSTANCE GetResourceHandle() noexcept {
  HINSTANCE current = g_resourceHandle.load();
  return current != nullptr ? current : reinterpret_cast<HINSTANCE>(MainProgram());
}

void SetResourceHandle(HINSTANCE module) noexcept { g_resourceHandle.store(module); }

}  // namespace Platform

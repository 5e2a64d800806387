// POSIX backend: modules over the system loader (dlopen), and the resource tables that
// resource modules export.
#include "platform/Modules.h"

#include <dlfcn.h>
#include <link.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <cctype>
#include <cerrno>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <mutex>
#include <string>
#include <unordered_map>

#include "owutils/ResourceModule.h"
#include "platform/Errors.h"
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

std::string Utf8(const char16_t* text) {
  std::string result;
  int n = WideCharToMultiByte(kCodePageUtf8, 0, text, -1, nullptr, 0, nullptr, nullptr);
  if (n <= 0) return result;
  result.resize(static_cast<size_t>(n));
  WideCharToMultiByte(kCodePageUtf8, 0, text, -1, result.data(), n, nullptr, nullptr);
  result.resize(static_cast<size_t>(n - 1));
  return result;
}

// Turns a module path in Windows syntax into a native one: drops the long-path prefix, maps a
// drive letter through OWUTILS_DRIVES ("C=/;D=/mnt/data", default C=/) and a UNC path under
// OWUTILS_UNC_ROOT, and turns backslashes into slashes. A name without directory stays a name,
// for the system loader to search.
// TODO(paths): use the file layer's native path mapping once it is shared by the platform layer.
bool NativeModulePath(const std::string& path, std::string& native) {
  std::string p = path;
  bool unc = false;
  if (p.rfind("\\\\?\\UNC\\", 0) == 0) {
    p = p.substr(8);
    unc = true;
  } else if (p.rfind("\\\\?\\", 0) == 0) {
    p = p.substr(4);
  } else if (p.rfind("\\\\", 0) == 0) {
    p = p.substr(2);
    unc = true;
  }
  std::replace(p.begin(), p.end(), '\\', '/');
  if (unc) {
    const char* root = std::getenv("OWUTILS_UNC_ROOT");
    if (root == nullptr || *root == 0) {
      SetLastError(ERROR_BAD_NETPATH);
      return false;
    }
    native = std::string(root) + "/" + p;
    return true;
  }
  if (p.size() >= 2 && p[1] == ':' && std::isalpha(static_cast<unsigned char>(p[0]))) {
    char drive = static_cast<char>(std::toupper(static_cast<unsigned char>(p[0])));
    std::string target;
    const char* map = std::getenv("OWUTILS_DRIVES");
    std::string drives = map != nullptr && *map != 0 ? map : "C=/";
    size_t start = 0;
    while (start <= drives.size()) {
      size_t end = drives.find(';', start);
      if (end == std::string::npos) end = drives.size();
      std::string item = drives.substr(start, end - start);
      if (item.size() >= 2 && item[1] == '=' &&
          std::toupper(static_cast<unsigned char>(item[0])) == drive) {
        target = item.substr(2);
        break;
      }
      start = end + 1;
    }
    if (target.empty()) {
      SetLastError(ERROR_PATH_NOT_FOUND);
      return false;
    }
    std::string rest = p.substr(2);
    while (!rest.empty() && rest.front() == '/') rest.erase(0, 1);
    while (target.size() > 1 && target.back() == '/') target.pop_back();
    native = target == "/" ? "/" + rest : target + "/" + rest;
    return true;
  }
  native = p;
  return true;
}

// The reverse of NativeModulePath: the drive whose target holds `native` (the longest target
// wins), then backslashes. False when no drive holds it.
bool WindowsModulePath(const std::string& native, std::string& path) {
  const char* map = std::getenv("OWUTILS_DRIVES");
  std::string drives = map != nullptr && *map != 0 ? map : "C=/";
  size_t bestLength = 0;
  bool found = false;
  size_t start = 0;
  while (start <= drives.size()) {
    size_t end = drives.find(';', start);
    if (end == std::string::npos) end = drives.size();
    std::string item = drives.substr(start, end - start);
    start = end + 1;
    if (item.size() < 3 || item[1] != '=') continue;
    std::string target = item.substr(2);
    if (char* resolved = realpath(target.c_str(), nullptr)) {
      target = resolved;
      std::free(resolved);
    }
    while (target.size() > 1 && target.back() == '/') target.pop_back();
    bool holds = target == "/" ? !native.empty() && native[0] == '/'
                               : native == target || native.rfind(target + "/", 0) == 0;
    if (!holds || (found && target.size() <= bestLength)) continue;
    std::string rest = target == "/" ? native.substr(1) : native.substr(std::min(native.size(), target.size() + 1));
    std::replace(rest.begin(), rest.end(), '/', '\\');
    path = std::string(1, static_cast<char>(std::toupper(static_cast<unsigned char>(item[0])))) + ":\\" + rest;
    bestLength = target.size();
    found = true;
  }
  return found;
}

// The resource table of `module`, or null with the last error set.
const OwResourceTable* ResourceTable(HMODULE module) noexcept {
  void* handle = LoaderHandle(module);
  if (handle == nullptr) handle = MainProgram();
  if (handle == nullptr) {
    SetLastError(ERROR_INVALID_HANDLE);
    return nullptr;
  }
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
    std::string native;
    if (!NativeModulePath(Utf8(path), native)) return nullptr;
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
    if (*name == 0 || !NativeModulePath(Utf8(name), native)) {
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

BOOL GetModuleHandleExW(DWORD flags, const void* address, HMODULE* module) noexcept {
  if (module == nullptr) {
    SetLastError(ERROR_INVALID_PARAMETER);
    return FALSE;
  }
  *module = nullptr;
  if ((flags & kGetModuleHandleExFromAddress) == 0 || address == nullptr) {
    SetLastError(ERROR_INVALID_PARAMETER);
    return FALSE;
  }
  Dl_info info;
  link_map* holder = nullptr;
  if (dladdr1(address, &info, reinterpret_cast<void**>(&holder), RTLD_DL_LINKMAP) == 0 ||
      holder == nullptr) {
    SetLastError(ERROR_MOD_NOT_FOUND);
    return FALSE;
  }
  // The loader's handle of an object is its link map.
  void* handle = holder;
  if ((flags & kGetModuleHandleExUnchangedRefcount) == 0 && handle != MainProgram()) {
    void* again = dlopen(holder->l_name, RTLD_LAZY | RTLD_NOLOAD);
    if (again == nullptr) {
      SetLastError(ERROR_MOD_NOT_FOUND);
      return FALSE;
    }
    std::lock_guard<std::mutex> lock(g_modulesMutex);
    ++References()[again];
    handle = again;
  }
  *module = reinterpret_cast<HMODULE>(handle);
  return TRUE;
}

DWORD GetModuleFileNameW(HMODULE module, char16_t* buffer, DWORD size) noexcept {
  try {
    void* handle = module != nullptr ? LoaderHandle(module) : MainProgram();
    link_map* map = nullptr;
    std::string native;
    if (handle == nullptr || dlinfo(handle, RTLD_DI_LINKMAP, &map) != 0 || map == nullptr) {
      SetLastError(ERROR_MOD_NOT_FOUND);
      return 0;
    }
    if (map->l_name != nullptr && *map->l_name != 0) {
      native = map->l_name;
    } else {
      char self[4096];
      ssize_t n = readlink("/proc/self/exe", self, sizeof self - 1);
      if (n <= 0) {
        SetLastError(ERROR_MOD_NOT_FOUND);
        return 0;
      }
      native.assign(self, static_cast<size_t>(n));
    }
    if (char* resolved = realpath(native.c_str(), nullptr)) {
      native = resolved;
      std::free(resolved);
    }
    std::string windows;
    if (!WindowsModulePath(native, windows)) {
      SetLastError(ERROR_MOD_NOT_FOUND);
      return 0;
    }
    std::u16string path;
    int n = MultiByteToWideChar(kCodePageUtf8, 0, windows.c_str(), -1, nullptr, 0);
    if (n <= 0) {
      SetLastError(ERROR_NO_UNICODE_TRANSLATION);
      return 0;
    }
    path.resize(static_cast<size_t>(n));
    MultiByteToWideChar(kCodePageUtf8, 0, windows.c_str(), -1, path.data(), n);
    path.pop_back();
    if (buffer == nullptr || size == 0) {
      SetLastError(ERROR_INSUFFICIENT_BUFFER);
      return 0;
    }
    if (path.size() >= size) {
      std::copy(path.begin(), path.begin() + (size - 1), buffer);
      buffer[size - 1] = 0;
      SetLastError(ERROR_INSUFFICIENT_BUFFER);
      return size;
    }
    std::copy(path.begin(), path.end(), buffer);
    buffer[path.size()] = 0;
    SetLastError(ERROR_SUCCESS);
    return static_cast<DWORD>(path.size());
  } catch (...) {
    SetLastError(ERROR_NOT_ENOUGH_MEMORY);
    return 0;
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

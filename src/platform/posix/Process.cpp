// POSIX backend: module files, command line, current directory, temporary files
// (see platform/Process.h).
#include "platform/Process.h"

#include <dlfcn.h>
#include <fcntl.h>
#include <link.h>
#include <sys/random.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <iterator>
#include <mutex>
#include <new>
#include <string>
#include <vector>

#include "platform/Errors.h"
#include "platform/FaultInjection.h"
#include "platform/PathMap.h"
#include "platform/posix/NativeText.h"

namespace Platform {
namespace {

using FaultInjection::Check;

std::string ProgramFile() {
  std::vector<char> buffer(4096);
  for (;;) {
    ssize_t n = ::readlink("/proc/self/exe", buffer.data(), buffer.size());
    if (n < 0) return std::string();
    if (static_cast<size_t>(n) < buffer.size()) return std::string(buffer.data(), static_cast<size_t>(n));
    buffer.resize(buffer.size() * 2);
  }
}

std::string CurrentNativeDirectory() {
  std::vector<char> buffer(4096);
  for (;;) {
    if (::getcwd(buffer.data(), buffer.size()) != nullptr) return std::string(buffer.data());
    if (errno != ERANGE) return std::string();
    buffer.resize(buffer.size() * 2);
  }
}

// Win32 buffer convention: copies `text` with its terminator when it fits and returns its
// length; otherwise returns the size needed including the terminator.
DWORD CopyOut(const std::u16string& text, char16_t* buffer, DWORD size) {
  if (buffer == nullptr || size <= text.size()) return static_cast<DWORD>(text.size() + 1);
  std::memcpy(buffer, text.data(), text.size() * sizeof(char16_t));
  buffer[text.size()] = 0;
  return static_cast<DWORD>(text.size());
}

bool IsBlank(char16_t c) { return c == u' ' || c == u'\t'; }

// Quotes one argument so that CommandLineToArgvW gives it back.
void AppendQuoted(std::u16string& line, const std::u16string& argument, bool program) {
  bool needsQuotes = argument.empty() || argument.find_first_of(u" \t\"") != std::u16string::npos;
  if (!needsQuotes) {
    line += argument;
    return;
  }
  if (program) {
    // The program name takes backslashes literally and cannot hold a quote.
    line += u'"';
    for (char16_t c : argument) {
      if (c != u'"') line += c;
    }
    line += u'"';
    return;
  }
  line += u'"';
  size_t backslashes = 0;
  for (char16_t c : argument) {
    if (c == u'\\') {
      ++backslashes;
      continue;
    }
    if (c == u'"') {
      line.append(backslashes * 2 + 1, u'\\');
    } else {
      line.append(backslashes, u'\\');
    }
    backslashes = 0;
    line += c;
  }
  line.append(backslashes * 2, u'\\');
  line += u'"';
}

std::u16string BuildCommandLine() {
  std::ifstream in("/proc/self/cmdline", std::ios::binary);
  std::string raw((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
  std::u16string line;
  size_t start = 0;
  bool first = true;
  while (start < raw.size()) {
    size_t end = raw.find('\0', start);
    if (end == std::string::npos) end = raw.size();
    if (!first) line += u' ';
    AppendQuoted(line, Posix::ToUtf16(raw.substr(start, end - start)), first);
    first = false;
    start = end + 1;
  }
  return line;
}

std::vector<std::u16string> SplitCommandLine(const char16_t* p) {
  std::vector<std::u16string> args;
  // The program name: up to the closing quote, or up to the first blank.
  std::u16string program;
  if (*p == u'"') {
    ++p;
    while (*p != 0 && *p != u'"') program += *p++;
    if (*p == u'"') ++p;
  } else {
    while (*p != 0 && !IsBlank(*p)) program += *p++;
  }
  args.push_back(program);
  for (;;) {
    while (IsBlank(*p)) ++p;
    if (*p == 0) break;
    std::u16string arg;
    bool quoted = false;
    while (*p != 0 && (quoted || !IsBlank(*p))) {
      if (*p == u'\\') {
        size_t backslashes = 0;
        while (*p == u'\\') {
          ++backslashes;
          ++p;
        }
        if (*p == u'"') {
          arg.append(backslashes / 2, u'\\');
          if (backslashes % 2 == 1) {
            arg += u'"';
            ++p;
          }
        } else {
          arg.append(backslashes, u'\\');
        }
      } else if (*p == u'"') {
        if (quoted && p[1] == u'"') {
          // Two quotes inside quotes: a literal quote.
          arg += u'"';
          p += 2;
        } else {
          quoted = !quoted;
          ++p;
        }
      } else {
        arg += *p++;
      }
    }
    args.push_back(arg);
  }
  return args;
}

}  // namespace

// --- Modules ----------------------------------------------------------------------------------

DWORD GetModuleFileNameW(HMODULE module, char16_t* buffer, DWORD size) noexcept {
  if (Check("GetModuleFileName")) return 0;
  std::string native;
  if (module != nullptr) {
    // A module handle is the loader's handle (its link map), possibly tagged in its low bits (a
    // module loaded as data file). Only a handle of a loaded module is looked at.
    auto* wanted = reinterpret_cast<struct link_map*>(reinterpret_cast<std::uintptr_t>(module) & ~std::uintptr_t{7});
    struct link_map* map = _r_debug.r_map;
    while (map != nullptr && map != wanted) map = map->l_next;
    if (map == nullptr) {
      SetLastError(ERROR_MOD_NOT_FOUND);
      return 0;
    }
    if (map->l_name != nullptr) native = map->l_name;
  }
  if (native.empty()) native = ProgramFile();  // the main program has no name in its link map
  if (native.empty()) {
    SetLastError(ERROR_MOD_NOT_FOUND);
    return 0;
  }
  if (native[0] != '/') native = CurrentNativeDirectory() + "/" + native;
  std::u16string path = MapFromNative(native);
  if (buffer == nullptr || size == 0) {
    SetLastError(ERROR_INSUFFICIENT_BUFFER);
    return 0;
  }
  if (path.size() >= size) {
    std::memcpy(buffer, path.data(), (size - 1) * sizeof(char16_t));
    buffer[size - 1] = 0;
    SetLastError(ERROR_INSUFFICIENT_BUFFER);
    return size;
  }
  std::memcpy(buffer, path.data(), path.size() * sizeof(char16_t));
  buffer[path.size()] = 0;
  SetLastError(ERROR_SUCCESS);
  return static_cast<DWORD>(path.size());
}

HMODULE GetModuleHandleFromAddress(const void* address, bool addReference) noexcept {
  Dl_info info;
  if (address == nullptr || ::dladdr(address, &info) == 0) {
    SetLastError(ERROR_MOD_NOT_FOUND);
    return nullptr;
  }
  void* handle = info.dli_fname != nullptr ? ::dlopen(info.dli_fname, RTLD_LAZY | RTLD_NOLOAD) : nullptr;
  if (handle == nullptr) {
    // Only the main program cannot be found again by its file name.
    handle = ::dlopen(nullptr, RTLD_LAZY | RTLD_NOLOAD);
  }
  if (handle == nullptr) {
    SetLastError(ERROR_MOD_NOT_FOUND);
    return nullptr;
  }
  if (!addReference) ::dlclose(handle);
  return reinterpret_cast<HMODULE>(handle);
}

// --- Command line -----------------------------------------------------------------------------

const char16_t* GetCommandLineW() noexcept {
  static const std::u16string* line = [] {
    try {
      return new std::u16string(BuildCommandLine());
    } catch (...) {
      return new std::u16string();
    }
  }();
  return line->c_str();
}

char16_t** CommandLineToArgvW(const char16_t* commandLine, int* count) noexcept {
  if (Check("CommandLineToArgv")) return nullptr;
  if (count == nullptr) {
    SetLastError(ERROR_INVALID_PARAMETER);
    return nullptr;
  }
  try {
    std::vector<std::u16string> args;
    if (commandLine == nullptr || commandLine[0] == 0) {
      std::string program = ProgramFile();
      args.push_back(MapFromNative(program));
    } else {
      args = SplitCommandLine(commandLine);
    }
    size_t pointers = (args.size() + 1) * sizeof(char16_t*);
    size_t characters = 0;
    for (const auto& a : args) characters += a.size() + 1;
    auto* block = static_cast<char*>(std::malloc(pointers + characters * sizeof(char16_t)));
    if (block == nullptr) {
      SetLastError(ERROR_NOT_ENOUGH_MEMORY);
      return nullptr;
    }
    auto** argv = reinterpret_cast<char16_t**>(block);
    auto* text = reinterpret_cast<char16_t*>(block + pointers);
    for (size_t i = 0; i < args.size(); ++i) {
      argv[i] = text;
      std::memcpy(text, args[i].data(), args[i].size() * sizeof(char16_t));
      text[args[i].size()] = 0;
      text += args[i].size() + 1;
    }
    argv[args.size()] = nullptr;
    *count = static_cast<int>(args.size());
    return argv;
  } catch (...) {
    SetLastError(ERROR_NOT_ENOUGH_MEMORY);
    return nullptr;
  }
}

void* LocalFree(void* block) noexcept {
  std::free(block);
  return nullptr;
}

// --- Current directory ------------------------------------------------------------------------

DWORD GetCurrentDirectoryW(DWORD size, char16_t* buffer) noexcept {
  if (Check("GetCurrentDirectory")) return 0;
  try {
    std::string native = CurrentNativeDirectory();
    if (native.empty()) {
      SetLastErrorFromErrno(errno);
      return 0;
    }
    return CopyOut(MapFromNative(native), buffer, size);
  } catch (...) {
    SetLastError(ERROR_NOT_ENOUGH_MEMORY);
    return 0;
  }
}

BOOL SetCurrentDirectoryW(const char16_t* path) noexcept {
  if (Check("SetCurrentDirectory")) return FALSE;
  std::string native;
  if (!MapToNative(path, native)) return FALSE;
  struct stat st;
  if (::stat(native.c_str(), &st) == 0 && !S_ISDIR(st.st_mode)) {
    SetLastError(ERROR_DIRECTORY);
    return FALSE;
  }
  if (::chdir(native.c_str()) != 0) {
    SetLastError(errno == ENOENT || errno == ENOTDIR ? ERROR_PATH_NOT_FOUND : Win32ErrorFromErrno(errno));
    return FALSE;
  }
  return TRUE;
}

// --- Temporary files --------------------------------------------------------------------------

DWORD GetTempPathW(DWORD size, char16_t* buffer) noexcept {
  if (Check("GetTempPath")) return 0;
  try {
    const char* tmp = std::getenv("TMPDIR");
    std::string native = (tmp != nullptr && tmp[0] == '/') ? tmp : "/tmp";
    std::u16string path = MapFromNative(native);
    if (path.empty() || path.back() != u'\\') path += u'\\';
    return CopyOut(path, buffer, size);
  } catch (...) {
    SetLastError(ERROR_NOT_ENOUGH_MEMORY);
    return 0;
  }
}

UINT GetTempFileNameW(const char16_t* directory, const char16_t* prefix, UINT unique, char16_t* buffer) noexcept {
  if (Check("GetTempFileName")) return 0;
  if (directory == nullptr || buffer == nullptr) {
    SetLastError(ERROR_INVALID_PARAMETER);
    return 0;
  }
  try {
    std::u16string base(directory);
    if (!base.empty() && base.back() != u'\\' && base.back() != u'/') base += u'\\';
    if (prefix != nullptr) base += std::u16string(prefix).substr(0, 3);
    auto nameOf = [&base](UINT number) {
      char hex[16];
      std::snprintf(hex, sizeof hex, "%X", number & 0xFFFFu);
      std::u16string name = base;
      for (const char* h = hex; *h != 0; ++h) name += static_cast<char16_t>(*h);
      name += u".TMP";
      return name;
    };
    auto store = [buffer](const std::u16string& name) {
      if (name.size() >= MAX_PATH) {
        SetLastError(ERROR_BUFFER_OVERFLOW);
        return false;
      }
      std::memcpy(buffer, name.data(), name.size() * sizeof(char16_t));
      buffer[name.size()] = 0;
      return true;
    };
    if (unique != 0) return store(nameOf(unique)) ? (unique & 0xFFFFu) : 0;
    unsigned short start = 0;
    if (::getrandom(&start, sizeof start, GRND_NONBLOCK) != static_cast<ssize_t>(sizeof start)) {
      start = static_cast<unsigned short>(::getpid() ^ static_cast<unsigned>(::time(nullptr)));
    }
    for (UINT i = 0; i < 0xFFFFu; ++i) {
      UINT number = (start + i) % 0xFFFFu + 1;  // 1 .. 0xFFFF
      std::u16string name = nameOf(number);
      if (name.size() >= MAX_PATH) {
        SetLastError(ERROR_BUFFER_OVERFLOW);
        return 0;
      }
      std::string native;
      if (!MapToNative(name.c_str(), native)) return 0;
      int fd = ::open(native.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0600);
      if (fd < 0) {
        if (errno == EEXIST) continue;
        SetLastError(errno == ENOENT || errno == ENOTDIR ? ERROR_PATH_NOT_FOUND : Win32ErrorFromErrno(errno));
        return 0;
      }
      ::close(fd);
      store(name);
      return number;
    }
    SetLastError(ERROR_FILE_EXISTS);
    return 0;
  } catch (...) {
    SetLastError(ERROR_NOT_ENOUGH_MEMORY);
    return 0;
  }
}

}  // namespace Platform

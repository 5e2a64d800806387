// POSIX backend: the WOW64 lookups (see platform/Wow64.h).
#include "platform/Wow64.h"

#include <sys/utsname.h>

#include <cstring>
#include <map>
#include <mutex>
#include <string>

namespace Platform {
namespace {

std::mutex g_lock;
std::map<std::string, void*>& Overrides() {
  static auto* overrides = new std::map<std::string, void*>();
  return *overrides;
}

bool KernelIs64Bit() {
  struct utsname name;
  if (::uname(&name) != 0) return false;
  return std::strstr(name.machine, "64") != nullptr || std::strcmp(name.machine, "s390x") == 0;
}

BOOL IsWow64ProcessOnPosix(HANDLE, BOOL* isWow64) {
  if (isWow64 != nullptr) *isWow64 = TRUE;
  return TRUE;
}

}  // namespace

void* FindKernelFunction(const char* name) noexcept {
  if (name == nullptr) return nullptr;
  {
    std::lock_guard<std::mutex> guard(g_lock);
    auto found = Overrides().find(name);
    if (found != Overrides().end()) return found->second;
  }
  // A 32-bit process on a 64-bit kernel is what WOW64 means; there is no redirection to switch.
  if (sizeof(void*) == 4 && std::strcmp(name, "IsWow64Process") == 0 && KernelIs64Bit()) {
    return reinterpret_cast<void*>(&IsWow64ProcessOnPosix);
  }
  return nullptr;
}

HANDLE GetCurrentProcess() noexcept { return reinterpret_cast<HANDLE>(static_cast<std::intptr_t>(-1)); }

void SetKernelFunctionOverride(const char* name, void* function) {
  std::lock_guard<std::mutex> guard(g_lock);
  Overrides()[name] = function;
}

void ClearKernelFunctionOverrides() {
  std::lock_guard<std::mutex> guard(g_lock);
  Overrides().clear();
}

}  // namespace Platform

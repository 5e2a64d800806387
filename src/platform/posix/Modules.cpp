// POSIX backend: modules and string resources.
#include "platform/Modules.h"

#include <dlfcn.h>

#include "platform/Errors.h"

namespace Platform {

HMODULE GetModuleHandleW(const char16_t* name) noexcept {
  if (name == nullptr) {
    // The main program: dlopen(NULL) hands out its handle without loading anything.
    void* self = dlopen(nullptr, RTLD_LAZY | RTLD_NOLOAD);
    if (self == nullptr) {
      SetLastError(ERROR_MOD_NOT_FOUND);
      return nullptr;
    }
    dlclose(self);
    return reinterpret_cast<HMODULE>(self);
  }
  SetLastError(ERROR_MOD_NOT_FOUND);
  return nullptr;
}

int LoadStringW(HINSTANCE module, UINT, char16_t*, int) noexcept {
  // Modules carry no string tables until the resource loader provides them.
  SetLastError(module == nullptr ? ERROR_INVALID_HANDLE : ERROR_RESOURCE_NAME_NOT_FOUND);
  return 0;
}

bool FindMessageTemplate(HMODULE module, DWORD, LANGID, std::u16string&) {
  // Modules carry no message tables until the resource loader provides them.
  SetLastError(module == nullptr ? ERROR_INVALID_HANDLE : ERROR_MR_MID_NOT_FOUND);
  return false;
}

}  // namespace Platform

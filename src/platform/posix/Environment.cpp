// POSIX backend: environment variables and console streams.
#include "owutils/Environment.h"

#include <unistd.h>

#include <cstdlib>
#include <string>

#include "platform/Errors.h"
#include "platform/posix/NativeText.h"

namespace Platform {

DWORD GetEnvironmentVariableW(const char16_t* name, char16_t* buffer, DWORD size) noexcept {
  try {
    const std::string native = Posix::ToUtf8(name);
    const char* value = native.empty() ? nullptr : std::getenv(native.c_str());
    if (value == nullptr) {
      SetLastError(ERROR_ENVVAR_NOT_FOUND);
      return 0;
    }
    const std::u16string wide = Posix::ToUtf16(value);
    if (buffer == nullptr || size <= wide.size()) return static_cast<DWORD>(wide.size() + 1);
    wide.copy(buffer, wide.size());
    buffer[wide.size()] = 0;
    return static_cast<DWORD>(wide.size());
  } catch (...) {
    SetLastError(ERROR_NOT_ENOUGH_MEMORY);
    return 0;
  }
}

BOOL SetEnvironmentVariableW(const char16_t* name, const char16_t* value) noexcept {
  try {
    const std::string native = Posix::ToUtf8(name);
    if (native.empty() || native.find('=') != std::string::npos) {
      SetLastError(ERROR_INVALID_PARAMETER);
      return FALSE;
    }
    const int rc = value == nullptr ? ::unsetenv(native.c_str()) : ::setenv(native.c_str(), Posix::ToUtf8(value).c_str(), 1);
    if (rc != 0) {
      SetLastErrorFromErrno(errno);
      return FALSE;
    }
    return TRUE;
  } catch (...) {
    SetLastError(ERROR_NOT_ENOUGH_MEMORY);
    return FALSE;
  }
}

BOOL IsConsoleStream(DWORD which) noexcept {
  const int fd = which == STD_INPUT_HANDLE ? 0 : which == STD_OUTPUT_HANDLE ? 1 : which == STD_ERROR_HANDLE ? 2 : -1;
  return fd >= 0 && ::isatty(fd) != 0 ? TRUE : FALSE;
}

}  // namespace Platform

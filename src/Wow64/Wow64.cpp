// Wow64: the run-time looked-up WOW64 functions.
#include "owutils/Wow64.h"

#include "owutils/Exceptions.h"
#include "platform/Wow64.h"

namespace Wow64 {

bool IsWow64() {
  try {
    auto function = reinterpret_cast<Platform::IsWow64ProcessFunction>(Platform::FindKernelFunction("IsWow64Process"));
    if (function == nullptr) return false;
    BOOL isWow64 = FALSE;
    if (!function(Platform::GetCurrentProcess(), &isWow64)) THROW_AT(LumoException::Win32Error(u"IsWow64Process"));
    return isWow64 != FALSE;
  } catch (LumoException::Exception& e) {
    THROW_AT(Wow64Exception(u"Wow64::IsWow64", e));
  }
}

void DisableWow64FsRedirection(PVOID* oldValue) {
  try {
    auto function = reinterpret_cast<Platform::Wow64DisableWow64FsRedirectionFunction>(
        Platform::FindKernelFunction("Wow64DisableWow64FsRedirection"));
    if (function == nullptr) return;
    if (!function(oldValue)) THROW_AT(LumoException::Win32Error(u"Wow64DisableWow64FsRedirection"));
  } catch (LumoException::Exception& e) {
    THROW_AT(Wow64Exception(u"Wow64::DisableWow64FsRedirection", e));
  }
}

void RevertWow64FsRedirection(PVOID* oldValue) {
  try {
    auto function = reinterpret_cast<Platform::Wow64RevertWow64FsRedirectionFunction>(
        Platform::FindKernelFunction("Wow64RevertWow64FsRedirection"));
    if (function == nullptr) return;
    if (!function(oldValue != nullptr ? *oldValue : nullptr)) {
      THROW_AT(LumoException::Win32Error(u"Wow64RevertWow64FsRedirection"));
    }
  } catch (LumoException::Exception& e) {
    THROW_AT(Wow64Exception(u"Wow64::RevertWow64FsRedirection", e));
  }
}

}  // namespace Wow64

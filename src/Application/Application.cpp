// Application: module paths and the command line.
#include "owutils/Application.h"

#include <vector>

#include "owutils/Exceptions.h"
#include "owutils/Paths.h"
#include "platform/Errors.h"
#include "platform/Files.h"
#include "platform/Process.h"

namespace Application {
namespace {

constexpr DWORD kLongPathCapacity = 32767;

// The directory part of a module path: a root keeps its backslash, anything else loses the text
// from its last backslash on.
CString DirectoryOf(const CString& path) {
  CString copy = path + u"\\";
  if (Paths::GetRootLength(copy) == copy.GetLength()) return copy;
  copy = path;
  int last = copy.ReverseFind(u'\\');
  return last == -1 ? copy : copy.Left(last);
}

HMODULE ResolveModule(HMODULE module) { return module != nullptr ? module : GetOwnModuleHandle(); }

}  // namespace

HMODULE GetOwnModuleHandle() {
  // The address of a function of this library names the library, not the program that loaded it.
  // The module stays loaded while its code runs, so no reference is taken.
  return Platform::GetModuleHandleFromAddress(reinterpret_cast<const void*>(&GetOwnModuleHandle), false);
}

CString GetModulePath(HMODULE module) {
  module = ResolveModule(module);
  char16_t buffer[MAX_PATH] = {0};
  DWORD length = Platform::GetModuleFileNameW(module, buffer, MAX_PATH);
  if (length == 0) THROW_AT(LumoException::Win32Error(u"GetModuleFileName"));
  if (length == MAX_PATH && Platform::GetLastError() == ERROR_INSUFFICIENT_BUFFER) {
    THROW_AT(LumoException::Win32ErrorCode(u"GetModuleFileName", ERROR_INSUFFICIENT_BUFFER));
  }
  DWORD dwSize = Platform::GetLongPathNameW(buffer, buffer, MAX_PATH);
  if (dwSize == 0) THROW_AT(LumoException::Win32Error(u"GetLongPathName"));
  ASSERTION1(dwSize <= MAX_PATH, dwSize);
  return CString(buffer, static_cast<int>(dwSize));
}

CString GetModuleLongPath(HMODULE module) {
  module = ResolveModule(module);
  std::vector<char16_t> buffer(kLongPathCapacity, 0);
  DWORD length = Platform::GetModuleFileNameW(module, buffer.data(), kLongPathCapacity);
  if (length == 0) THROW_AT(LumoException::Win32Error(u"GetModuleFileName"));
  CString path(buffer.data(), static_cast<int>(length));
  DWORD needed = Platform::GetLongPathNameW(path, nullptr, 0);
  if (needed != 0) {
    std::vector<char16_t> converted(needed + 1, 0);
    DWORD done = Platform::GetLongPathNameW(path, converted.data(), needed + 1);
    if (done == 0 || done > needed) THROW_AT(LumoException::Win32Error(u"GetLongPathName"));
    path = CString(converted.data(), static_cast<int>(done));
  }
  CHECKPOINT_TRY
    return Paths::ToLongPath(path);
  CHECKPOINT_CATCH
}

CString GetModuleLongName(HMODULE module) {
  CHECKPOINT_TRY
    CString path = GetModuleLongPath(module);
    int last = path.ReverseFind(u'\\');
    return last == -1 ? path : path.Mid(last + 1);
  CHECKPOINT_CATCH
}

CString GetModuleLongDirectory(HMODULE module) {
  CHECKPOINT_TRY
    return DirectoryOf(GetModuleLongPath(module));
  CHECKPOINT_CATCH
}

CString GetModuleDirectory(HMODULE module) {
  CHECKPOINT_TRY
    return DirectoryOf(GetModulePath(module));
  CHECKPOINT_CATCH
}

CString GetCommandLine() { return CString(Platform::GetCommandLineW()); }

CString GetCommandLineArguments() {
  try {
    int count = 0;
    char16_t** arguments = Platform::CommandLineToArgvW(Platform::GetCommandLineW(), &count);
    if (arguments == nullptr) THROW_AT(LumoException::Win32Error(u"CommandLineToArgvW"));
    CString result;
    for (int i = 1; i < count; ++i) {
      result += arguments[i];
      result += u' ';
    }
    if (!result.IsEmpty()) result.Delete(result.GetLength() - 1);
    Platform::LocalFree(arguments);
    return result;
  } catch (LumoException::Win32Error& e) {
    THROW_AT(LumoException::Exception(u"Application::GetCommandLineArguments failed", e));
  }
}

}  // namespace Application

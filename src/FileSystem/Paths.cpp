// Paths: long-path forms, roots, existence and free space.
#include "owutils/Paths.h"

#include <vector>

#include "owutils/Exceptions.h"
#include "platform/Errors.h"
#include "platform/Files.h"
#include "platform/PathMap.h"
#include "platform/Text.h"

namespace Paths {
namespace {

constexpr const char16_t* kLongPrefix = u"\\\\?\\";
constexpr const char16_t* kUncLongPrefix = u"\\\\?\\UNC\\";

bool StartsWithTwoBackslashes(const CString& path) {
  return path.GetLength() >= 2 && path[0] == u'\\' && path[1] == u'\\';
}

}  // namespace

bool Exists(const CString& strPath) {
  PRECONDITION(!strPath.IsEmpty());
  CHECKPOINT_TRY
    return Platform::GetFileAttributesW(ToLongPath(strPath)) != INVALID_FILE_ATTRIBUTES;
  CHECKPOINT_CATCH
}

bool Exists(const CString& strPath, bool& isDirectory) {
  PRECONDITION(!strPath.IsEmpty());
  CHECKPOINT_TRY
    DWORD attributes = Platform::GetFileAttributesW(ToLongPath(strPath));
    if (attributes == INVALID_FILE_ATTRIBUTES) return false;
    if ((attributes & FILE_ATTRIBUTE_DIRECTORY) != 0) isDirectory = true;
    return true;
  CHECKPOINT_CATCH
}

bool IsDirectory(const CString& strPath) {
  CHECKPOINT_TRY
    bool isDirectory = false;
    return Exists(strPath, isDirectory) && isDirectory;
  CHECKPOINT_CATCH
}

bool IsLongPath(const CString& strPath) {
  PRECONDITION(!strPath.IsEmpty());
  return strPath.Find(kLongPrefix) != -1;
}

CString ToLongPath(const CString& strPath) {
  PRECONDITION(!strPath.IsEmpty());
  CHECKPOINT_TRY
    CString path(strPath);
    if (IsLongPath(path)) return path;
    CString result;
    if (path.Find(u":\\") != -1) {
      result.Format(u"\\\\?\\%s", path.GetString());
      return result;
    }
    if (StartsWithTwoBackslashes(path)) path = path.Mid(2);
    result.Format(u"\\\\?\\UNC\\%s", path.GetString());
    return result;
  CHECKPOINT_CATCH
}

CString FromLongPath(const CString& strPath) {
  PRECONDITION(!strPath.IsEmpty());
  if (!IsLongPath(strPath)) return strPath;
  if (strPath.Find(kUncLongPrefix) == 0) return CString(u"\\\\") + strPath.Mid(8);
  return strPath.Mid(4);
}

CString GetShortPathName(const CString& strLongPath) {
  PRECONDITION(!strLongPath.IsEmpty());
  std::vector<char16_t> buffer(MAX_PATH, 0);
  DWORD length = Platform::GetShortPathNameW(strLongPath, buffer.data(), MAX_PATH);
  if (length >= MAX_PATH) {
    // The short form needs more room: ask again with the size the platform reported.
    buffer.assign(length + 1, 0);
    length = Platform::GetShortPathNameW(strLongPath, buffer.data(), static_cast<DWORD>(buffer.size()));
    if (length >= buffer.size()) length = 0;
  }
  if (length == 0) THROW_AT(LumoException::Win32Error(u"GetShortPathName"));
  return CString(buffer.data(), static_cast<int>(length));
}

CString GetLongPathName(const CString& strPath) {
  PRECONDITION(!strPath.IsEmpty());
  DWORD size = Platform::GetLongPathNameW(strPath, nullptr, 0);
  if (size == 0) THROW_AT(LumoException::Win32Error(u"GetLongPathName"));
  std::vector<char16_t> buffer(size + 1, 0);
  DWORD length = Platform::GetLongPathNameW(strPath, buffer.data(), static_cast<DWORD>(buffer.size()));
  if (length == 0 || length >= buffer.size()) {
    if (length != 0) Platform::SetLastError(ERROR_INSUFFICIENT_BUFFER);
    THROW_AT(LumoException::Win32Error(u"GetLongPathName"));
  }
  return CString(buffer.data(), static_cast<int>(length));
}

int GetRootLength(const CString& strPath) {
  PRECONDITION(!strPath.IsEmpty());
  const int length = strPath.GetLength();
  int colon = strPath.Find(u':');
  if (colon != -1) {
    if (colon + 1 >= length) THROW_AT(InvalidUncPath(strPath.str()));
    return colon + 2;
  }
  int serverStart;
  if (strPath.Find(kUncLongPrefix) == 0) {
    serverStart = 8;
  } else if (StartsWithTwoBackslashes(strPath)) {
    serverStart = 2;
  } else {
    THROW_AT(InvalidUncPath(strPath.str()));
  }
  int serverEnd = strPath.Find(u'\\', serverStart);
  if (serverEnd == -1) THROW_AT(InvalidUncPath(strPath.str()));
  if (serverEnd + 2 >= length) THROW_AT(InvalidUncPath(strPath.str()));
  int shareEnd = strPath.Find(u'\\', serverEnd + 1);
  if (shareEnd == -1) shareEnd = length - 1;
  return shareEnd + 1;
}

CString GetRoot(const CString& strPath) {
  CHECKPOINT_TRY
    return strPath.Left(GetRootLength(strPath));
  CHECKPOINT_CATCH
}

CString Combine(const CString& first, const CString& second) {
  CString result(first);
  if (!first.IsEmpty() && !second.IsEmpty()) {
    if (result[result.GetLength() - 1] != u'\\') result += u'\\';
  }
  result += second;
  return result;
}

CString& AppendPath(CString& path, const CString& piece) {
  path = Combine(path, piece);
  return path;
}

ULONGLONG GetFreeDiskSpace(const CString& strPath, bool powerOfTwoUnits) {
  CString path(strPath);
  // A UNC root must end with a backslash for the platform call.
  if (StartsWithTwoBackslashes(path) && path[path.GetLength() - 1] != u'\\') path += u'\\';
  ULARGE_INTEGER freeToCaller{};
  if (!Platform::GetDiskFreeSpaceExW(path, &freeToCaller, nullptr, nullptr)) {
    THROW_AT(FailedToGetDiskFreeSpaceEx(path.str(), static_cast<int>(Platform::GetLastError())));
  }
  const ULONGLONG unit = powerOfTwoUnits ? 1048576ull : 1000000ull;
  return freeToCaller.QuadPart / unit;
}

CString FromNativePath(const CString& strNativePath) {
  PRECONDITION(!strNativePath.IsEmpty());
  const std::u16string& wide = strNativePath.str();
  int n = Platform::WideCharToMultiByte(Platform::kCodePageUtf8, 0, wide.data(), static_cast<int>(wide.size()),
                                        nullptr, 0, nullptr, nullptr);
  std::string native(n > 0 ? static_cast<size_t>(n) : 0, '\0');
  if (n > 0) {
    Platform::WideCharToMultiByte(Platform::kCodePageUtf8, 0, wide.data(), static_cast<int>(wide.size()),
                                  native.data(), n, nullptr, nullptr);
  }
  return CString(Platform::MapFromNative(native));
}

CString ToNativePath(const CString& strPath) {
  PRECONDITION(!strPath.IsEmpty());
  std::string native;
  if (!Platform::MapToNative(strPath, native)) {
    THROW_AT(LumoException::Win32ErrorCode(u"ToNativePath", static_cast<int>(Platform::GetLastError())));
  }
  std::u16string wide;
  int n = Platform::MultiByteToWideChar(Platform::kCodePageUtf8, 0, native.data(), static_cast<int>(native.size()),
                                        nullptr, 0);
  if (n > 0) {
    wide.resize(static_cast<size_t>(n));
    Platform::MultiByteToWideChar(Platform::kCodePageUtf8, 0, native.data(), static_cast<int>(native.size()),
                                  wide.data(), n);
  }
  return CString(std::move(wide));
}

}  // namespace Paths

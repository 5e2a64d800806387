// Files: single-file operations.
#include "owutils/Files.h"

#include <exception>

#include "FileSystem/FileSystemInternal.h"
#include "FileSystem/TextFile.h"
#include "owutils/Directories.h"
#include "owutils/Exceptions.h"
#include "owutils/Paths.h"
#include "platform/Errors.h"
#include "platform/Files.h"
#include "platform/Process.h"

namespace FileSystemInternal {

bool GetIdentity(const CString& longPath, Identity& identity) {
  HANDLE h = Platform::CreateFileW(longPath, 0, FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE, nullptr,
                                   OPEN_EXISTING, FILE_FLAG_BACKUP_SEMANTICS, nullptr);
  if (h == INVALID_HANDLE_VALUE) return false;
  BY_HANDLE_FILE_INFORMATION info{};
  bool ok = Platform::GetFileInformationByHandle(h, &info) != FALSE;
  Platform::CloseHandle(h);
  if (!ok) return false;
  identity.volume = info.dwVolumeSerialNumber;
  identity.indexHigh = info.nFileIndexHigh;
  identity.indexLow = info.nFileIndexLow;
  return true;
}

bool SameFile(const CString& longPathA, const CString& longPathB) {
  DWORD saved = Platform::GetLastError();
  Identity a, b;
  bool same = GetIdentity(longPathA, a) && GetIdentity(longPathB, b) && a == b;
  Platform::SetLastError(saved);
  return same;
}

}  // namespace FileSystemInternal

namespace Files {

using FileSystemInternal::SameFile;

bool TryCopyFile(const CString& strSourceFile, const CString& strDestinationFile, bool overwrite) {
  PRECONDITION(!strSourceFile.IsEmpty());
  PRECONDITION(!strDestinationFile.IsEmpty());
  CHECKPOINT_TRY
    if (!Directories::TryCreateDirectories(Directories::GetParentDirectory(strDestinationFile))) return false;
    return Platform::CopyFileW(Paths::ToLongPath(strSourceFile), Paths::ToLongPath(strDestinationFile),
                               overwrite ? FALSE : TRUE) != FALSE;
  CHECKPOINT_CATCH
}

void CopyFile(const CString& strSourceFile, const CString& strDestinationFile) {
  PRECONDITION(!strSourceFile.IsEmpty());
  PRECONDITION(!strDestinationFile.IsEmpty());
  CString source = Paths::ToLongPath(strSourceFile);
  CString destination = Paths::ToLongPath(strDestinationFile);
  try {
    // The file system decides whether both names are one file; names differing only in case
    // are two files on a case-sensitive system.
    if (Platform::GetFileAttributesW(destination) != INVALID_FILE_ATTRIBUTES && SameFile(source, destination)) return;
    Directories::CreateDirectories(Directories::GetParentDirectory(destination));
    if (!Platform::CopyFileW(source, destination, FALSE)) {
      THROW_AT(LumoException::Win32ErrorCode(u"CopyFile", static_cast<int>(Platform::GetLastError())));
    }
  } catch (LumoException::Exception& e) {
    THROW_AT(UnableToCopyFile(source.str(), destination.str(), e));
  }
}

bool Exists(const CString& strFile) {
  PRECONDITION(!strFile.IsEmpty());
  CHECKPOINT_TRY
    return Paths::Exists(strFile);
  CHECKPOINT_CATCH
}

ULONGLONG GetSize(const CString& strFile) {
  PRECONDITION(!strFile.IsEmpty());
  CHECKPOINT_TRY
    WIN32_FIND_DATAW data;
    AutoFindClose find(Platform::FindFirstFileW(Paths::ToLongPath(strFile), &data));
    if (!find.IsValid()) return 0;
    return (static_cast<ULONGLONG>(data.nFileSizeHigh) << 32) + data.nFileSizeLow;
  CHECKPOINT_CATCH
}

bool IsInUse(const CString& strFileName) {
  PRECONDITION(!strFileName.IsEmpty());
  CHECKPOINT_TRY
    if (!Paths::Exists(strFileName)) THROW_AT(FileDoesNotExist(strFileName.str()));
    HANDLE h = Platform::CreateFileW(Paths::ToLongPath(strFileName), FILE_ALL_ACCESS, 0, nullptr, OPEN_EXISTING, 0,
                                     nullptr);
    if (h == INVALID_HANDLE_VALUE) return true;
    Platform::CloseHandle(h);
    return false;
  CHECKPOINT_CATCH
}

bool TryMoveFile(const CString& strSourceFileName, const CString& strDestinationFileName) {
  PRECONDITION(!strSourceFileName.IsEmpty());
  PRECONDITION(!strDestinationFileName.IsEmpty());
  CHECKPOINT_TRY
    return Platform::MoveFileW(Paths::ToLongPath(strSourceFileName), Paths::ToLongPath(strDestinationFileName)) == 1;
  CHECKPOINT_CATCH
}

void MoveFile(const CString& strSourceFileName, const CString& strDestinationFileName) {
  PRECONDITION(!strSourceFileName.IsEmpty());
  PRECONDITION(!strDestinationFileName.IsEmpty());
  try {
    if (Platform::MoveFileW(Paths::ToLongPath(strSourceFileName), Paths::ToLongPath(strDestinationFileName)) != 1) {
      THROW_AT(LumoException::Win32Error(u"MoveFile"));
    }
  } catch (LumoException::Exception& e) {
    THROW_AT(UnableToMoveFile(strSourceFileName.str(), strDestinationFileName.str(), e));
  }
}

bool TryMoveFileEx(const CString& strSourceFileName, const CString& strDestinationFileName, DWORD flags) {
  PRECONDITION(!strSourceFileName.IsEmpty());
  PRECONDITION(!strDestinationFileName.IsEmpty());
  CHECKPOINT_TRY
    return Platform::MoveFileExW(Paths::ToLongPath(strSourceFileName), Paths::ToLongPath(strDestinationFileName),
                                 flags) == 1;
  CHECKPOINT_CATCH
}

void MoveFileEx(const CString& strSourceFileName, const CString& strDestinationFileName, DWORD flags) {
  PRECONDITION(!strSourceFileName.IsEmpty());
  PRECONDITION(!strDestinationFileName.IsEmpty());
  try {
    if (Platform::MoveFileExW(Paths::ToLongPath(strSourceFileName), Paths::ToLongPath(strDestinationFileName),
                              flags) != 1) {
      THROW_AT(LumoException::Win32Error(u"MoveFileEx"));
    }
  } catch (LumoException::Exception& e) {
    THROW_AT(UnableToMoveFile(strSourceFileName.str(), strDestinationFileName.str(), e));
  }
}

bool TryDeleteFile(const CString& strFile) {
  PRECONDITION(!strFile.IsEmpty());
  CHECKPOINT_TRY
    return Platform::DeleteFileW(Paths::ToLongPath(strFile)) == 1;
  CHECKPOINT_CATCH
}

void DeleteFile(const CString& strFile) {
  PRECONDITION(!strFile.IsEmpty());
  try {
    if (Platform::DeleteFileW(Paths::ToLongPath(strFile)) == 0) THROW_AT(LumoException::Win32Error(u"DeleteFile"));
  } catch (LumoException::Exception& e) {
    THROW_AT(UnableToDeleteFile(strFile.str(), e));
  }
}

bool TryGetAttributesEx(const CString& strFileName, WIN32_FILE_ATTRIBUTE_DATA& data) {
  PRECONDITION(!strFileName.IsEmpty());
  CHECKPOINT_TRY
    return Platform::GetFileAttributesExW(Paths::ToLongPath(strFileName), GetFileExInfoStandard, &data) == 1;
  CHECKPOINT_CATCH
}

DWORD TryGetAttributes(const CString& strFileName) {
  PRECONDITION(!strFileName.IsEmpty());
  CHECKPOINT_TRY
    return Platform::GetFileAttributesW(Paths::ToLongPath(strFileName));
  CHECKPOINT_CATCH
}

DWORD GetAttributes(const CString& strFileName) {
  PRECONDITION(!strFileName.IsEmpty());
  try {
    DWORD attributes = Platform::GetFileAttributesW(Paths::ToLongPath(strFileName));
    if (attributes == INVALID_FILE_ATTRIBUTES) THROW_AT(LumoException::Win32Error(u"GetFileAttributes"));
    return attributes;
  } catch (LumoException::Exception& e) {
    THROW_AT(UnableToGetAttributes(strFileName.str(), e));
  }
}

bool TrySetAttributes(const CString& strFileName, DWORD attributes) {
  PRECONDITION(!strFileName.IsEmpty());
  CHECKPOINT_TRY
    return Platform::SetFileAttributesW(Paths::ToLongPath(strFileName), attributes) == 1;
  CHECKPOINT_CATCH
}

void SetAttributes(const CString& strFileName, DWORD attributes) {
  PRECONDITION(!strFileName.IsEmpty());
  try {
    if (Platform::SetFileAttributesW(Paths::ToLongPath(strFileName), attributes) == 0) {
      THROW_AT(LumoException::Win32Error(u"SetFileAttributes"));
    }
  } catch (LumoException::Exception& e) {
    THROW_AT(UnableToSetAttributes(strFileName.str(), e));
  }
}

HANDLE CreateFile(const CString& strFileName, DWORD access, DWORD shareMode, SECURITY_ATTRIBUTES* security,
                  DWORD disposition, DWORD flagsAndAttributes, HANDLE templateFile) {
  PRECONDITION(!strFileName.IsEmpty());
  CHECKPOINT_TRY
    CString parent = Directories::GetParentDirectory(strFileName);
    if (!Directories::TryCreateDirectories(parent)) THROW_AT(UnableToCreateDirectory(parent.str()));
    return Platform::CreateFileW(Paths::ToLongPath(strFileName), access, shareMode, security, disposition,
                                 flagsAndAttributes, templateFile);
  CHECKPOINT_CATCH
}

CString ReadTextFile(const CString& path) {
  FileSystemInternal::TextFile file;
  if (!file.Open(path)) {
    DWORD error = Platform::GetLastError();
    int cause = error == ERROR_FILE_NOT_FOUND ? 2 : error == ERROR_PATH_NOT_FOUND ? 3
              : error == ERROR_ACCESS_DENIED ? 5 : error == ERROR_SHARING_VIOLATION ? 7 : 1;
    CFileException fileException(cause, static_cast<LONG>(error), path.GetString());
    THROW_AT(UnableToOpenFile(path.str(), LumoException::MFCException(&fileException)));
  }
  file.SeekToBegin();
  CString text;
  CString line;
  while (file.ReadString(line)) text += line;
  if (file.Failed()) {
    // A read that broke off is not a whole file.
    LumoException::Win32Error cause(u"ReadFile");
    THROW_AT(UnableToOpenFile(path.str(), cause));
  }
  file.Close();
  return text;
}

CString GetTempFileName() {
  try {
    constexpr DWORD kTempPathCapacity = 246;
    char16_t directory[kTempPathCapacity] = {0};
    DWORD length = Platform::GetTempPathW(kTempPathCapacity, directory);
    if (length == 0) THROW_AT(LumoException::Win32Error(u"::GetTempPath() failed"));
    if (length >= kTempPathCapacity) {
      // The directory did not fit: the buffer holds nothing usable.
      THROW_AT(LumoException::Win32ErrorCode(u"::GetTempPath() failed", ERROR_INSUFFICIENT_BUFFER));
    }
    char16_t name[MAX_PATH] = {0};
    if (Platform::GetTempFileNameW(directory, u"", 0, name) == 0) {
      THROW_AT(LumoException::Win32Error(u"::GetTempFileName() failed"));
    }
    return CString(name);
  } catch (LumoException::Exception& e) {
    THROW_AT(FileSystemException(u"Unable to get temporary file", e));
  }
}

namespace {

bool FindInTree(const CString& strDirectory, const CString& strFileName, const CString& suffix, CString& foundPath) {
  CString directory = Directories::RemoveTrailingBackslash(strDirectory);
  CString pattern;
  pattern.Format(u"%s\\*.*", directory.GetString());
  WIN32_FIND_DATAW data;
  AutoFindClose find(Platform::FindFirstFileW(pattern, &data));
  if (!find.IsValid()) return false;
  bool candidateTested = false;
  do {
    CString name(data.cFileName);
    if (Directories::IsDotsName(name)) continue;
    if ((data.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) != 0) {
      if ((data.dwFileAttributes & FILE_ATTRIBUTE_REPARSE_POINT) != 0) continue;  // never leave the tree
      if (FindInTree(directory + u"\\" + name, strFileName, suffix, foundPath)) return true;
    } else if (!candidateTested) {
      candidateTested = true;
      CString candidate;
      candidate.Format(u"%s\\%s%s", directory.GetString(), strFileName.GetString(), suffix.GetString());
      WIN32_FIND_DATAW candidateData;
      AutoFindClose second(Platform::FindFirstFileW(candidate, &candidateData));
      if (second.IsValid()) {
        foundPath = candidate;
        return true;
      }
    }
  } while (Platform::FindNextFileW(find.Get(), &data));
  return false;
}

}  // namespace

bool FindFileInTree(const CString& strDirectory, const CString& strFileName, const CString& suffix, CString& foundPath) {
  PRECONDITION(!strDirectory.IsEmpty());
  PRECONDITION(!strFileName.IsEmpty());
  CHECKPOINT_TRY
    return FindInTree(strDirectory, strFileName, suffix, foundPath);
  CHECKPOINT_CATCH
}

CString GetFileName(const CString& strPathFileName) {
  PRECONDITION(!strPathFileName.IsEmpty());
  int last = strPathFileName.ReverseFind(u'\\');
  return last == -1 ? strPathFileName : strPathFileName.Mid(last + 1);
}

CString GetExtension(const CString& strPathFileName) {
  PRECONDITION(!strPathFileName.IsEmpty());
  int dot = strPathFileName.ReverseFind(u'.');
  return dot == -1 ? CString() : strPathFileName.Mid(dot + 1);
}

CString RemoveExtension(const CString& strFileName) {
  PRECONDITION(!strFileName.IsEmpty());
  int dot = strFileName.ReverseFind(u'.');
  int slash = strFileName.ReverseFind(u'\\');
  return dot != -1 && dot > slash ? strFileName.Left(dot) : strFileName;
}

}  // namespace Files

AutoDeleteFile::~AutoDeleteFile() {
  if (m_strPath.IsEmpty()) return;
  const int tryLine = __LINE__;
  try {
    Files::DeleteFile(m_strPath);
  } catch (LumoException::Exception& e) {
    LumoException::detail::ReportUnexpected(&e, OW_WIDE_FILE, __LINE__, tryLine);
  } catch (const ComError& e) {
    try {
      LumoException::COMException wrapped(e);
      LumoException::detail::ReportUnexpected(&wrapped, OW_WIDE_FILE, __LINE__, tryLine);
    } catch (...) {
    }
  } catch (const std::exception& e) {
    try {
      LumoException::STLException wrapped(e);
      LumoException::detail::ReportUnexpected(&wrapped, OW_WIDE_FILE, __LINE__, tryLine);
    } catch (...) {
    }
  } catch (CException* e) {
    try {
      LumoException::MFCException wrapped(e);
      LumoException::detail::ReportUnexpected(&wrapped, OW_WIDE_FILE, __LINE__, tryLine);
    } catch (...) {
    }
  } catch (...) {
    LumoException::detail::ReportUnexpected(nullptr, OW_WIDE_FILE, __LINE__, tryLine);
  }
}

void AutoFindClose::Close() noexcept {
  if (m_hFind != INVALID_HANDLE_VALUE) Platform::FindClose(m_hFind);
  m_hFind = INVALID_HANDLE_VALUE;
}

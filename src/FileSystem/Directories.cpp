// Directories: directory paths, the current directory, chains, deletion, copy and walks.
#include "owutils/Directories.h"

#include <vector>

#include "FileSystem/FileSystemInternal.h"
#include "owutils/Exceptions.h"
#include "owutils/Files.h"
#include "owutils/Paths.h"
#include "platform/Errors.h"
#include "platform/Files.h"
#include "platform/Process.h"

namespace Directories {
namespace {

bool IsDots(const char16_t* name) {
  return name[0] == u'.' && (name[1] == 0 || (name[1] == u'.' && name[2] == 0));
}

bool IsLink(DWORD attributes) { return (attributes & FILE_ATTRIBUTE_REPARSE_POINT) != 0; }

// A directory to descend into: a real directory, not a link to one.
bool IsTreeDirectory(DWORD attributes) {
  return (attributes & FILE_ATTRIBUTE_DIRECTORY) != 0 && !IsLink(attributes);
}

CString FormatPath(const char16_t* format, const CString& path) {
  CString text;
  text.Format(format, path.GetString());
  return text;
}

}  // namespace

// --- Path text --------------------------------------------------------------------------------

void AddTrailingBackslash(CString& strDirectory) {
  PRECONDITION(!strDirectory.IsEmpty());
  if (strDirectory[strDirectory.GetLength() - 1] != u'\\') strDirectory += u'\\';
}

CString RemoveTrailingBackslash(const CString& strDirectory) {
  PRECONDITION(!strDirectory.IsEmpty());
  if (strDirectory[strDirectory.GetLength() - 1] == u'\\') return strDirectory.Left(strDirectory.GetLength() - 1);
  return strDirectory;
}

bool IsRoot(const CString& strPath) {
  PRECONDITION(!strPath.IsEmpty());
  CHECKPOINT_TRY
    CString path(strPath);
    AddTrailingBackslash(path);
    return Paths::GetRootLength(path) == path.GetLength();
  CHECKPOINT_CATCH
}

CString GetParentDirectory(const CString& strFileName) {
  PRECONDITION(!strFileName.IsEmpty());
  CHECKPOINT_TRY
    CString path(strFileName);
    AddTrailingBackslash(path);
    if (IsRoot(path)) return path;
    path = path.Left(path.GetLength() - 1);
    int last = path.ReverseFind(u'\\');
    return last == -1 ? path : path.Left(last);
  CHECKPOINT_CATCH
}

CString GetContainingPath(const CString& strPath) {
  CHECKPOINT_TRY
    if (IsRoot(strPath)) return CString();
    int last = strPath.ReverseFind(u'\\');
    return last == -1 ? strPath : strPath.Left(last);
  CHECKPOINT_CATCH
}

CString GetDirectoryName(const CString& strDirectory) {
  PRECONDITION(!strDirectory.IsEmpty());
  CHECKPOINT_TRY
    if (IsRoot(strDirectory)) THROW_AT(FileSystemException(u"Directory is a root path"));
    CString directory = RemoveTrailingBackslash(strDirectory);
    int last = directory.ReverseFind(u'\\');
    return last == -1 ? directory : directory.Mid(last + 1);
  CHECKPOINT_CATCH
}

CString GetDrive(const CString& strDirectory) {
  PRECONDITION(!strDirectory.IsEmpty());
  int colon = strDirectory.Find(u':');
  return colon == -1 ? CString() : strDirectory.Left(colon);
}

CString StripDrive(const CString& strDirectory) {
  PRECONDITION(!strDirectory.IsEmpty());
  CString directory = RemoveTrailingBackslash(strDirectory);
  int first = directory.Find(u'\\');
  return first == -1 ? directory : directory.Mid(first);
}

bool IsDotsName(const CString& strDirectory) {
  PRECONDITION(!strDirectory.IsEmpty());
  return IsDots(strDirectory.GetString());
}

// --- Current directory ------------------------------------------------------------------------

CString GetCurrentDirectory() {
  DWORD size = Platform::GetCurrentDirectoryW(0, nullptr);
  if (size == 0) THROW_AT(LumoException::Win32Error(u"GetCurrentDirectory"));
  std::vector<char16_t> buffer(size + 1, 0);
  DWORD length = Platform::GetCurrentDirectoryW(static_cast<DWORD>(buffer.size()), buffer.data());
  if (length == 0 || length >= buffer.size()) {
    if (length != 0) Platform::SetLastError(ERROR_INSUFFICIENT_BUFFER);
    THROW_AT(LumoException::Win32Error(u"GetCurrentDirectory"));
  }
  CHECKPOINT_TRY
    return Paths::ToLongPath(CString(buffer.data(), static_cast<int>(length)));
  CHECKPOINT_CATCH
}

void SetCurrentDirectory(const CString& path) {
  try {
    if (!Platform::SetCurrentDirectoryW(path)) THROW_AT(LumoException::Win32Error(u"SetCurrentDirectory"));
  } catch (LumoException::Exception& e) {
    THROW_AT(UnableToSetWorkingDirectory(path.str(), e));
  }
}

ScopedCurrentDirectory::ScopedCurrentDirectory(const char16_t* pNewCwd) {
  PRECONDITION(pNewCwd != NULL);
  CHECKPOINT_TRY
    m_strSaved = GetCurrentDirectory();
    SetCurrentDirectory(pNewCwd);
    m_bRestore = true;
  CHECKPOINT_CATCH
}

ScopedCurrentDirectory::~ScopedCurrentDirectory() {
  if (!m_bRestore) return;
  CHECKPOINT_TRY
    if (!Platform::SetCurrentDirectoryW(m_strSaved)) THROW_AT(LumoException::Win32Error(u"SetCurrentDirectory"));
  CATCH_AND_REPORT
}

// --- Tests and creation -----------------------------------------------------------------------

bool Exists(const CString& cstrDirectory) {
  PRECONDITION(!cstrDirectory.IsEmpty());
  CHECKPOINT_TRY
    CString directory = RemoveTrailingBackslash(cstrDirectory);
    if (directory.IsEmpty()) directory = cstrDirectory;
    // A drive root keeps its backslash: "C:" alone names no directory.
    if (directory[directory.GetLength() - 1] == u':') directory += u'\\';
    return Paths::IsDirectory(directory);
  CHECKPOINT_CATCH
}

bool HasEntries(const CString& strDirectory) {
  PRECONDITION(!strDirectory.IsEmpty());
  CHECKPOINT_TRY
    CString pattern = Paths::ToLongPath(RemoveTrailingBackslash(strDirectory) + u"\\*.*");
    WIN32_FIND_DATAW data;
    AutoFindClose find(Platform::FindFirstFileW(pattern, &data));
    if (!find.IsValid()) return false;
    do {
      if (!IsDots(data.cFileName)) return true;
    } while (Platform::FindNextFileW(find.Get(), &data));
    return false;
  CHECKPOINT_CATCH
}

bool TryCreateDirectories(const CString& cstrDirectory) {
  PRECONDITION(!cstrDirectory.IsEmpty());
  CHECKPOINT_TRY
    if (IsRoot(cstrDirectory)) {
      CString root(cstrDirectory);
      AddTrailingBackslash(root);
      return Paths::Exists(root);
    }
    CString path = Paths::ToLongPath(RemoveTrailingBackslash(cstrDirectory));
    bool isDirectory = false;
    if (Paths::Exists(path, isDirectory)) {
      if (!isDirectory) Platform::SetLastError(ERROR_ALREADY_EXISTS);
      return isDirectory;
    }
    int position = Paths::GetRootLength(path);
    for (;;) {
      int separator = path.Find(u'\\', position);
      if (separator == -1) break;
      CString prefix = path.Left(separator);
      if (prefix != u"\\" && !Platform::CreateDirectoryW(prefix, nullptr) &&
          Platform::GetLastError() != ERROR_ALREADY_EXISTS) {
        return false;
      }
      position = separator + 1;
    }
    return Platform::CreateDirectoryW(path, nullptr) || Platform::GetLastError() == ERROR_ALREADY_EXISTS;
  CHECKPOINT_CATCH
}

void CreateDirectories(const CString& cstrDirectory) {
  PRECONDITION(!cstrDirectory.IsEmpty());
  try {
    if (IsRoot(cstrDirectory)) {
      CString root(cstrDirectory);
      AddTrailingBackslash(root);
      if (!Paths::Exists(root)) {
        THROW_AT(FileSystemException(FormatPath(u"Cannot create root directory '%s'", cstrDirectory)));
      }
      return;
    }
    CString path = Paths::ToLongPath(RemoveTrailingBackslash(cstrDirectory));
    bool isDirectory = false;
    if (Paths::Exists(path, isDirectory)) {
      if (!isDirectory) {
        THROW_AT(FileSystemException(FormatPath(u"Cannot create directory '%s', exists as file", cstrDirectory)));
      }
      return;
    }
    int position = Paths::GetRootLength(path);
    for (;;) {
      int separator = path.Find(u'\\', position);
      CString prefix = separator == -1 ? path : path.Left(separator);
      if (prefix != u"\\" && !Platform::CreateDirectoryW(prefix, nullptr)) {
        DWORD error = Platform::GetLastError();
        if (error != ERROR_ALREADY_EXISTS) {
          THROW_AT(LumoException::Win32ErrorCode(u"CreateDirectory", static_cast<int>(error)));
        }
      }
      if (separator == -1) break;
      position = separator + 1;
    }
  } catch (FileSystemException& e) {
    e.RecordThrow(OW_WIDE_FILE, __LINE__);
    throw;
  } catch (LumoException::Exception& e) {
    THROW_AT(FileSystemException(FormatPath(u"Cannot create directory '%s'", cstrDirectory), e));
  }
}

// --- Deletion ---------------------------------------------------------------------------------


bool TryDeleteFiles(const CString& strDirectory, const CString& strFilePatternMatch) {
  PRECONDITION(!strDirectory.IsEmpty());
  PRECONDITION(!strFilePatternMatch.IsEmpty());
  CHECKPOINT_TRY
    CString base = Paths::ToLongPath(strDirectory);
    AddTrailingBackslash(base);
    WIN32_FIND_DATAW data;
    AutoFindClose find(Platform::FindFirstFileW(base + strFilePatternMatch, &data));
    if (!find.IsValid()) return true;
    do {
      if (IsDots(data.cFileName)) continue;
      CString path = base + data.cFileName;
      if ((data.dwFileAttributes & FILE_ATTRIBUTE_READONLY) != 0) {
        Platform::SetFileAttributesW(path, data.dwFileAttributes & ~FILE_ATTRIBUTE_READONLY);
      }
      if (IsLink(data.dwFileAttributes)) {
        // The link goes; what it points to is not part of this tree.
        if ((data.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) != 0) {
          Platform::RemoveDirectoryW(path);
        } else {
          Platform::DeleteFileW(path);
        }
      } else if ((data.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) != 0) {
        TryRemoveDirectoryTree(path);
      } else {
        Files::TryDeleteFile(path);
      }
    } while (Platform::FindNextFileW(find.Get(), &data));
    return true;
  CHECKPOINT_CATCH
}

void DeleteFiles(const CString& strDirectory, const CString& strFilePatternMatch) {
  PRECONDITION(!strDirectory.IsEmpty());
  PRECONDITION(!strFilePatternMatch.IsEmpty());
  try {
    CString base = Paths::ToLongPath(strDirectory);
    AddTrailingBackslash(base);
    WIN32_FIND_DATAW data;
    AutoFindClose find(Platform::FindFirstFileW(base + strFilePatternMatch, &data));
    if (!find.IsValid()) return;
    do {
      if (IsDots(data.cFileName)) continue;
      CString path = base + data.cFileName;
      if ((data.dwFileAttributes & FILE_ATTRIBUTE_READONLY) != 0) {
        Platform::SetFileAttributesW(path, data.dwFileAttributes & ~FILE_ATTRIBUTE_READONLY);
      }
      if (IsLink(data.dwFileAttributes)) {
        if ((data.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) != 0) {
          if (!Platform::RemoveDirectoryW(path)) THROW_AT(LumoException::Win32Error(u"RemoveDirectory"));
        } else {
          Files::DeleteFile(path);
        }
      } else if ((data.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) != 0) {
        RemoveDirectoryTree(path);
      } else {
        Files::DeleteFile(path);
      }
    } while (Platform::FindNextFileW(find.Get(), &data));
  } catch (LumoException::Exception& e) {
    THROW_AT(UnableToDeleteFiles(strFilePatternMatch.str(), strDirectory.str(), e));
  }
}

bool TryRemoveDirectory(const CString& strDirectory) {
  PRECONDITION(!strDirectory.IsEmpty());
  CHECKPOINT_TRY
    if (Platform::RemoveDirectoryW(Paths::ToLongPath(RemoveTrailingBackslash(strDirectory)))) return true;
    return Platform::GetLastError() == ERROR_PATH_NOT_FOUND;
  CHECKPOINT_CATCH
}

bool TryRemoveDirectoryTree(const CString& strDirectory) {
  PRECONDITION(!strDirectory.IsEmpty());
  CHECKPOINT_TRY
    // A directory that is itself a link loses the link only.
    DWORD attributes = Platform::GetFileAttributesW(Paths::ToLongPath(RemoveTrailingBackslash(strDirectory)));
    if (attributes == INVALID_FILE_ATTRIBUTES || !IsLink(attributes)) TryDeleteFiles(strDirectory, u"*.*");
    return TryRemoveDirectory(strDirectory);
  CHECKPOINT_CATCH
}

void RemoveDirectoryTree(const CString& strDirectory) {
  PRECONDITION(!strDirectory.IsEmpty());
  try {
    CString path = Paths::ToLongPath(RemoveTrailingBackslash(strDirectory));
    DWORD attributes = Platform::GetFileAttributesW(path);
    if (attributes == INVALID_FILE_ATTRIBUTES || !IsLink(attributes)) DeleteFiles(strDirectory, u"*.*");
    if (!Platform::RemoveDirectoryW(path)) THROW_AT(LumoException::Win32Error(u"RemoveDirectory"));
  } catch (LumoException::Exception& e) {
    THROW_AT(UnableToDeleteDirectory(strDirectory.str(), e));
  }
}

// --- Copy and walk ----------------------------------------------------------------------------

namespace {

using FileSystemInternal::Identity;

// Copies a link as a link, replacing what is at `destination`.
BOOL CopyLink(const CString& source, const CString& destination) {
  DWORD existing = Platform::GetFileAttributesW(destination);
  if (existing != INVALID_FILE_ATTRIBUTES) {
    BOOL removed = IsTreeDirectory(existing) ? FALSE
                 : (existing & FILE_ATTRIBUTE_DIRECTORY) != 0 ? Platform::RemoveDirectoryW(destination)
                                                               : Platform::DeleteFileW(destination);
    if (!removed) {
      if (IsTreeDirectory(existing)) Platform::SetLastError(ERROR_ALREADY_EXISTS);
      return FALSE;
    }
  }
  return Platform::CopyFileExW(source, destination, nullptr, nullptr, nullptr,
                               COPY_FILE_COPY_SYMLINK | COPY_FILE_FAIL_IF_EXISTS);
}

// A source directory that is the copy's own destination (a tree copied into itself) is skipped,
// so the copy cannot feed on its own output.
bool IsDestinationRoot(const CString& path, const Identity* destinationRoot) {
  Identity identity;
  return destinationRoot != nullptr && FileSystemInternal::GetIdentity(path, identity) && identity == *destinationRoot;
}

DWORD TryCopyTree(const CString& source, const CString& destination, const Identity* destinationRoot) {
  if (!TryCreateDirectories(destination)) {
    DWORD error = Platform::GetLastError();
    return error != ERROR_SUCCESS ? error : static_cast<DWORD>(ERROR_CANNOT_MAKE);
  }
  Identity rootIdentity;
  if (destinationRoot == nullptr && FileSystemInternal::GetIdentity(destination, rootIdentity)) {
    destinationRoot = &rootIdentity;
  }
  WIN32_FIND_DATAW data;
  AutoFindClose find(Platform::FindFirstFileW(source + u"\\*.*", &data));
  if (!find.IsValid()) return ERROR_SUCCESS;
  do {
    if (IsDots(data.cFileName)) continue;
    CString sourceItem = source + u"\\" + data.cFileName;
    CString destinationItem = destination + u"\\" + data.cFileName;
    if (IsLink(data.dwFileAttributes)) {
      if (!CopyLink(sourceItem, destinationItem)) return Platform::GetLastError();
    } else if ((data.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) != 0) {
      if (IsDestinationRoot(sourceItem, destinationRoot)) continue;
      DWORD result = TryCopyTree(sourceItem, destinationItem, destinationRoot);
      if (result != ERROR_SUCCESS) return result;
    } else {
      if (Files::Exists(destinationItem)) {
        // A file copied onto itself stays as it is; deleting it first would lose it.
        if (FileSystemInternal::SameFile(sourceItem, destinationItem)) continue;
        if (!Platform::DeleteFileW(destinationItem)) return Platform::GetLastError();
      }
      if (!Platform::CopyFileW(sourceItem, destinationItem, TRUE)) return Platform::GetLastError();
    }
  } while (Platform::FindNextFileW(find.Get(), &data));
  DWORD error = Platform::GetLastError();
  find.Close();
  return error == ERROR_NO_MORE_FILES ? static_cast<DWORD>(ERROR_SUCCESS) : error;
}

void CopyTree(const CString& source, const CString& destination, const Identity* destinationRoot) {
  try {
    CString pattern = Paths::Combine(Paths::ToLongPath(source), u"*.*");
    CreateDirectories(destination);
    Identity rootIdentity;
    if (destinationRoot == nullptr && FileSystemInternal::GetIdentity(Paths::ToLongPath(destination), rootIdentity)) {
      destinationRoot = &rootIdentity;
    }
    WIN32_FIND_DATAW data;
    AutoFindClose find(Platform::FindFirstFileW(pattern, &data));
    if (!find.IsValid()) THROW_AT(LumoException::Win32Error(u"FindFirstFile"));
    do {
      if (IsDots(data.cFileName)) continue;
      CString sourceItem = Paths::Combine(source, data.cFileName);
      CString destinationItem = Paths::Combine(destination, data.cFileName);
      if (IsLink(data.dwFileAttributes)) {
        if (!CopyLink(Paths::ToLongPath(sourceItem), Paths::ToLongPath(destinationItem))) {
          THROW_AT(LumoException::Win32ErrorCode(u"CopyFile", static_cast<int>(Platform::GetLastError())));
        }
      } else if ((data.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) != 0) {
        if (IsDestinationRoot(Paths::ToLongPath(sourceItem), destinationRoot)) continue;
        CopyTree(sourceItem, destinationItem, destinationRoot);
      } else {
        Files::CopyFile(sourceItem, destinationItem);
      }
    } while (Platform::FindNextFileW(find.Get(), &data));
    DWORD error = Platform::GetLastError();
    if (error != ERROR_NO_MORE_FILES) THROW_AT(LumoException::Win32ErrorCode(u"FindNextFile", static_cast<int>(error)));
  } catch (LumoException::Exception& e) {
    THROW_AT(UnableToCopyDirectory(source.str(), destination.str(), e));
  }
}

}  // namespace

DWORD TryCopyDirectory(const CString& cstrSourceDirectory, const CString& cstrDestinationDirectory) {
  PRECONDITION(!cstrSourceDirectory.IsEmpty());
  PRECONDITION(!cstrDestinationDirectory.IsEmpty());
  CHECKPOINT_TRY
    CString source = Paths::ToLongPath(RemoveTrailingBackslash(cstrSourceDirectory));
    CString destination = Paths::ToLongPath(RemoveTrailingBackslash(cstrDestinationDirectory));
    return TryCopyTree(source, destination, nullptr);
  CHECKPOINT_CATCH
}

void CopyDirectory(const CString& strSourceDirectoryIn, const CString& strDestinationDirectoryIn) {
  PRECONDITION(!strSourceDirectoryIn.IsEmpty());
  PRECONDITION(!strDestinationDirectoryIn.IsEmpty());
  // Every level of the copy wraps what went wrong below it into UnableToCopyDirectory.
  CopyTree(strSourceDirectoryIn, strDestinationDirectoryIn, nullptr);
}

namespace {

void Walk(const CString& dir, EnumerateCallback callback, void* context, bool& stop, bool recursive) {
  WIN32_FIND_DATAW data;
  AutoFindClose find(Platform::FindFirstFileW(Paths::Combine(dir, u"*.*"), &data));
  if (!find.IsValid()) return;
  do {
    if (stop) return;
    if (IsDots(data.cFileName)) continue;
    CString path = Paths::Combine(dir, data.cFileName);
    if (!callback(path, data, context)) {
      stop = true;
      return;
    }
    if (recursive && IsTreeDirectory(data.dwFileAttributes)) {
      Walk(path, callback, context, stop, recursive);
    }
  } while (Platform::FindNextFileW(find.Get(), &data));
}

bool AddSize(const char16_t*, const WIN32_FIND_DATAW& data, void* context) {
  if (context != nullptr && (data.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) == 0) {
    *static_cast<ULONGLONG*>(context) += (static_cast<ULONGLONG>(data.nFileSizeHigh) << 32) + data.nFileSizeLow;
  }
  return true;
}

struct Counts {
  ULONGLONG* directories;
  ULONGLONG* files;
};

// The walk of CountEntries: the walk of Enumerate with the counting callback built in, asking
// only for names and types, and building paths only for the directories it descends into.
void CountWalk(const CString& dir, bool recursive, bool& stop, Counts& counts) {
  WIN32_FIND_DATAW data;
  AutoFindClose find(Platform::FindFirstFileExW(Paths::Combine(dir, u"*.*"), Platform::kFindExInfoNamesAndTypes, &data,
                                                FindExSearchNameMatch, nullptr, 0));
  if (!find.IsValid()) return;
  do {
    if (stop) return;
    if (IsDots(data.cFileName)) continue;
    if ((data.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) == 0) {
      ++*counts.files;
      continue;
    }
    ++*counts.directories;
    if (recursive && !IsLink(data.dwFileAttributes)) CountWalk(Paths::Combine(dir, data.cFileName), recursive, stop, counts);
  } while (Platform::FindNextFileW(find.Get(), &data));
}

}  // namespace

void Enumerate(const CString& strDir, EnumerateCallback pCallback, void* context, bool& stop, bool recursive) {
  PRECONDITION(pCallback != nullptr);
  PRECONDITION(!strDir.IsEmpty());
  CHECKPOINT_TRY
    Walk(strDir, pCallback, context, stop, recursive);
  CHECKPOINT_CATCH
}

ULONGLONG GetTreeSize(const CString& strDir, bool& stop) {
  ULONGLONG total = 0;
  CHECKPOINT_TRY
    Enumerate(strDir, &AddSize, &total, stop, true);
  CHECKPOINT_CATCH
  return total;
}

void CountEntries(const CString& strDir, bool recursive, bool& stop, ULONGLONG& directories, ULONGLONG& files) {
  directories = 0;
  files = 0;
  Counts counts{&directories, &files};
  PRECONDITION(!strDir.IsEmpty());
  CHECKPOINT_TRY
    CountWalk(strDir, recursive, stop, counts);
  CHECKPOINT_CATCH
}

}  // namespace Directories

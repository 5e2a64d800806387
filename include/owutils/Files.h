// Files: single-file operations over the platform file API.
//
// Copy, move, delete, attributes, existence and size, the exclusive-open test, a search in a
// directory tree, name dissection, opening with automatic creation of the parent directory,
// reading a whole text file and temporary file names. Most operations come in two flavours:
//
//   if (!Files::TryDeleteFile(path)) { ... }   // the platform's verdict; last error left set
//   Files::DeleteFile(path);                    // raises UnableToDeleteFile, cause Win32Error
//
// Both check their preconditions first (an empty path raises LumoException::PreconditionFailed0)
// and hand the platform the long-path form of every path (Paths::ToLongPath). Library exceptions
// raised on the way inside a Try operation pass through with the operation's place added.
#pragma once

#include "owutils/CString.h"
#include "owutils/Export.h"
#include "owutils/WinTypes.h"

namespace Files {

// Creates the destination's parent directory chain, then copies; false when either fails.
// Without `overwrite` an existing destination is left alone (false).
OWUTILS_API bool TryCopyFile(const CString& strSourceFile, const CString& strDestinationFile, bool overwrite);
// Copies, overwriting; creates the destination's directory chain first. A destination that is
// the source itself (the same file, whatever its name) is left as it is. Raises UnableToCopyFile
// with the long forms of both paths.
OWUTILS_API void CopyFile(const CString& strSourceFile, const CString& strDestinationFile);

OWUTILS_API bool Exists(const CString& strFile);
// The size (0 when the file cannot be found).
OWUTILS_API ULONGLONG GetSize(const CString& strFile);
// True when the file cannot be opened exclusively (locked by someone or access denied); raises
// FileDoesNotExist for a missing file. A snapshot only.
OWUTILS_API bool IsInUse(const CString& strFileName);

OWUTILS_API bool TryMoveFile(const CString& strSourceFileName, const CString& strDestinationFileName);
// Raises UnableToMoveFile (cause Win32Error naming "MoveFile").
OWUTILS_API void MoveFile(const CString& strSourceFileName, const CString& strDestinationFileName);
// `flags`: MOVEFILE_REPLACE_EXISTING, MOVEFILE_COPY_ALLOWED, MOVEFILE_WRITE_THROUGH.
OWUTILS_API bool TryMoveFileEx(const CString& strSourceFileName, const CString& strDestinationFileName, DWORD flags);
// Raises UnableToMoveFile (cause Win32Error naming "MoveFileEx").
OWUTILS_API void MoveFileEx(const CString& strSourceFileName, const CString& strDestinationFileName, DWORD flags);

OWUTILS_API bool TryDeleteFile(const CString& strFile);
// Raises UnableToDeleteFile (cause Win32Error naming "DeleteFile").
OWUTILS_API void DeleteFile(const CString& strFile);

OWUTILS_API bool TryGetAttributesEx(const CString& strFileName, WIN32_FILE_ATTRIBUTE_DATA& data);
// The raw attributes; INVALID_FILE_ATTRIBUTES on failure.
OWUTILS_API DWORD TryGetAttributes(const CString& strFileName);
// Raises UnableToGetAttributes (cause Win32Error naming "GetFileAttributes").
OWUTILS_API DWORD GetAttributes(const CString& strFileName);
OWUTILS_API bool TrySetAttributes(const CString& strFileName, DWORD attributes);
// Raises UnableToSetAttributes (cause Win32Error naming "SetFileAttributes").
OWUTILS_API void SetAttributes(const CString& strFileName, DWORD attributes);

// Creates the parent directory chain (UnableToCreateDirectory when that fails), then opens the
// file with the caller's arguments. A failed open returns INVALID_HANDLE_VALUE (last error set);
// close the handle with the platform's CloseHandle.
OWUTILS_API HANDLE CreateFile(const CString& strFileName, DWORD access, DWORD shareMode, SECURITY_ATTRIBUTES* security,
                              DWORD disposition, DWORD flagsAndAttributes, HANDLE templateFile);

// The whole text file, its lines joined without their line ends (UTF-8; a byte-order mark is
// skipped). Raises UnableToOpenFile with the path.
OWUTILS_API CString ReadTextFile(const CString& path);

// A new, empty temporary file in the temporary directory, created so that nobody else can take
// its name; returns its path. Raises FileSystemException "Unable to get temporary file".
OWUTILS_API CString GetTempFileName();

// Searches `strDirectory` and its subdirectories for strFileName + suffix. In each directory the
// subdirectories met before its first file are searched first; the directory's own candidate is
// tested when its first file is met (a directory without files is never tested). Symbolic links
// are not followed. Sets foundPath ("<directory>\<file name><suffix>") and returns true on a hit.
OWUTILS_API bool FindFileInTree(const CString& strDirectory, const CString& strFileName, const CString& suffix,
                                CString& foundPath);

// The text after the last backslash (the whole path without one).
OWUTILS_API CString GetFileName(const CString& strPathFileName);
// The text after the last dot, empty without a dot (a dot in a directory name counts).
OWUTILS_API CString GetExtension(const CString& strPathFileName);
// The text before the last dot when that dot follows the last backslash; else the whole text.
OWUTILS_API CString RemoveExtension(const CString& strFileName);

}  // namespace Files

// Deletes its file when it goes out of scope (nothing for an empty path). A failure is reported
// as an unexpected failure, never raised.
class OWUTILS_API AutoDeleteFile {
 public:
  explicit AutoDeleteFile(const CString& path = CString()) : m_strPath(path) {}
  AutoDeleteFile(const AutoDeleteFile&) = delete;
  AutoDeleteFile& operator=(const AutoDeleteFile&) = delete;
  ~AutoDeleteFile();
  const CString& GetPath() const noexcept { return m_strPath; }
  void SetPath(const CString& path) { m_strPath = path; }
  // Keeps the file: the path is forgotten.
  void Release() noexcept { m_strPath.Empty(); }

 private:
  CString m_strPath;
};

// Owns a find handle and closes it (unless it is INVALID_HANDLE_VALUE).
class OWUTILS_API AutoFindClose {
 public:
  explicit AutoFindClose(HANDLE find = INVALID_HANDLE_VALUE) noexcept : m_hFind(find) {}
  AutoFindClose(const AutoFindClose&) = delete;
  AutoFindClose& operator=(const AutoFindClose&) = delete;
  ~AutoFindClose() { Close(); }
  HANDLE Get() const noexcept { return m_hFind; }
  bool IsValid() const noexcept { return m_hFind != INVALID_HANDLE_VALUE; }
  // Closes the handle now; later calls do nothing.
  void Close() noexcept;
  // Closes the handle it holds and takes `find`.
  void Reset(HANDLE find) noexcept {
    Close();
    m_hFind = find;
  }

 private:
  HANDLE m_hFind;
};

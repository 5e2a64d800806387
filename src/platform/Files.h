// Platform service: files, directories and volumes.
//
// The Win32 file API the library is written against, with its error codes. Paths are the
// library's Windows-form paths (drive letters, backslashes, long-path prefixes); each function
// maps them through platform/PathMap.h, so an unmapped drive fails with ERROR_PATH_NOT_FOUND and
// a UNC path without a UNC root with ERROR_BAD_NETPATH. Failures return the Win32 failure value
// (FALSE, INVALID_HANDLE_VALUE, INVALID_FILE_ATTRIBUTES, 0) and set the last error.
//
// Attributes on POSIX: FILE_ATTRIBUTE_DIRECTORY for directories; FILE_ATTRIBUTE_READONLY when
// the owner may not write (setting it removes every write permission bit, clearing it gives the
// owner write permission back); FILE_ATTRIBUTE_REPARSE_POINT for a symbolic link (with
// FILE_ATTRIBUTE_DIRECTORY too when it points at a directory, as for a Windows directory link);
// FILE_ATTRIBUTE_NORMAL for a file with none of these. A missing path fails with
// ERROR_FILE_NOT_FOUND (2), or ERROR_PATH_NOT_FOUND (3) when its directory is missing as well.
//
// Every function checks the fault-injection switch (platform/FaultInjection.h) under the name
// given in its comment before doing anything else.
#pragma once

#include <cstdint>

#include "owutils/WinTypes.h"

namespace Platform {

// The root of every object a HANDLE of this layer points to, so that CloseHandle can close any
// of them. A backend that hands out another kind of handle derives from it.
class HandleObject {
 public:
  static constexpr std::uint32_t kMagic = 0x4F574844;  // "OWHD"
  HandleObject() = default;
  HandleObject(const HandleObject&) = delete;
  HandleObject& operator=(const HandleObject&) = delete;
  virtual ~HandleObject() { m_magic = 0; }
  // Releases the object's resources; false (with the last error set) when that failed.
  virtual bool Close() = 0;
  bool IsValid() const noexcept { return m_magic == kMagic; }

 private:
  std::uint32_t m_magic = kMagic;
};

// --- Handles ----------------------------------------------------------------------------------

// CreateFileW ("CreateFile"). Access: GENERIC_READ / FILE_READ_DATA read, GENERIC_WRITE /
// FILE_WRITE_DATA / FILE_APPEND_DATA write, GENERIC_ALL / FILE_ALL_ACCESS both, 0 neither (the
// handle then serves only for queries). Dispositions CREATE_NEW (ERROR_FILE_EXISTS, 80, when the
// file exists), CREATE_ALWAYS and OPEN_ALWAYS (success with last error ERROR_ALREADY_EXISTS, 183,
// when the file existed, else 0), OPEN_EXISTING, TRUNCATE_EXISTING (needs write access); other
// values fail with ERROR_INVALID_PARAMETER. A directory opens only with
// FILE_FLAG_BACKUP_SEMANTICS and without write access, else ERROR_ACCESS_DENIED. A new file made
// with FILE_ATTRIBUTE_READONLY is read-only. FILE_FLAG_WRITE_THROUGH writes synchronously;
// FILE_FLAG_DELETE_ON_CLOSE deletes the file when the handle is closed.
// Sharing: a handle opened with share mode 0 holds an exclusive lock of its open file description
// for its lifetime, every other handle a shared one: while an exclusive handle lives, no other
// handle to the file can be opened, and an exclusive handle cannot be opened while any other is
// open; either attempt fails with ERROR_SHARING_VIOLATION (32). Finer share modes are not
// enforced. Security attributes and the template are ignored.
HANDLE CreateFileW(const char16_t* fileName, DWORD access, DWORD shareMode, SECURITY_ATTRIBUTES* security,
                   DWORD disposition, DWORD flagsAndAttributes, HANDLE templateFile) noexcept;

// ReadFile ("ReadFile", short reads through FaultInjection::LimitTransfer): reads up to `toRead`
// bytes at the file position; fewer only at the end of the file (0 there, with TRUE). Overlapped
// I/O is not supported (must be null).
BOOL ReadFile(HANDLE file, void* buffer, DWORD toRead, DWORD* read, void* overlapped) noexcept;

// WriteFile ("WriteFile", short writes through LimitTransfer): writes all `toWrite` bytes or
// fails (ERROR_DISK_FULL, 112, when the device is full); `*written` holds what was written
// either way.
BOOL WriteFile(HANDLE file, const void* buffer, DWORD toWrite, DWORD* written, void* overlapped) noexcept;

// SetFilePointerEx ("SetFilePointer"): moves by `distance` from FILE_BEGIN, FILE_CURRENT or
// FILE_END; a position before the start fails with ERROR_NEGATIVE_SEEK (131).
BOOL SetFilePointerEx(HANDLE file, LARGE_INTEGER distance, LARGE_INTEGER* newPosition, DWORD method) noexcept;

// SetEndOfFile ("SetEndOfFile"): the file ends at the current position (cut or extended).
BOOL SetEndOfFile(HANDLE file) noexcept;

// GetFileSizeEx ("GetFileSize").
BOOL GetFileSizeEx(HANDLE file, LARGE_INTEGER* size) noexcept;

// FlushFileBuffers ("FlushFileBuffers"): the file's data reaches the device.
BOOL FlushFileBuffers(HANDLE file) noexcept;

// GetFileInformationByHandle ("GetFileInformationByHandle"): the volume serial number and file
// index identify the file on this system (device and inode), whatever name it was opened by.
BOOL GetFileInformationByHandle(HANDLE file, BY_HANDLE_FILE_INFORMATION* info) noexcept;

// GetFileTime / SetFileTime ("GetFileTime" / "SetFileTime"); null pointers leave a time alone.
// The creation time cannot be set here and is ignored.
BOOL GetFileTime(HANDLE file, FILETIME* creation, FILETIME* lastAccess, FILETIME* lastWrite) noexcept;
BOOL SetFileTime(HANDLE file, const FILETIME* creation, const FILETIME* lastAccess,
                 const FILETIME* lastWrite) noexcept;

// CloseHandle ("CloseHandle"): closes any handle of this layer; ERROR_INVALID_HANDLE for null,
// INVALID_HANDLE_VALUE and anything that is not a live handle object.
BOOL CloseHandle(HANDLE handle) noexcept;

// --- Files by name ----------------------------------------------------------------------------

// CopyFileW ("CopyFile"): copies the content, the read-only attribute and the last-write time.
// With `failIfExists` an existing destination fails with ERROR_FILE_EXISTS (80). A read-only
// destination fails with ERROR_ACCESS_DENIED; a source that is a directory too. Copying a file
// onto itself (any name of the same file) fails with ERROR_SHARING_VIOLATION and leaves it
// intact. A destination left incomplete by a failure is removed.
BOOL CopyFileW(const char16_t* source, const char16_t* destination, BOOL failIfExists) noexcept;

// CopyFileExW ("CopyFile") without progress routine or cancel flag: COPY_FILE_FAIL_IF_EXISTS as
// above; with COPY_FILE_COPY_SYMLINK a symbolic link is copied as a link, not its target.
BOOL CopyFileExW(const char16_t* source, const char16_t* destination, void* progress, void* data,
                 BOOL* cancel, DWORD flags) noexcept;

// MoveFileW ("MoveFile"): renames a file or directory; an existing destination fails with
// ERROR_ALREADY_EXISTS (183). A file moves across file systems (copied, then deleted); a
// directory does not (ERROR_NOT_SAME_DEVICE, 17).
BOOL MoveFileW(const char16_t* source, const char16_t* destination) noexcept;

// MoveFileExW ("MoveFile"): MOVEFILE_REPLACE_EXISTING replaces an existing destination file
// (never a directory: ERROR_ACCESS_DENIED); MOVEFILE_COPY_ALLOWED lets a file move across file
// systems; MOVEFILE_WRITE_THROUGH returns only once the move is on the device. Without
// MOVEFILE_COPY_ALLOWED a move across file systems fails with ERROR_NOT_SAME_DEVICE (17).
BOOL MoveFileExW(const char16_t* source, const char16_t* destination, DWORD flags) noexcept;

// DeleteFileW ("DeleteFile"): deletes a file or a symbolic link to a file. A read-only file and a
// directory (or a link to one) fail with ERROR_ACCESS_DENIED.
BOOL DeleteFileW(const char16_t* fileName) noexcept;

// GetFileAttributesW ("GetFileAttributes"): the attributes of the path itself (a symbolic link is
// not followed); INVALID_FILE_ATTRIBUTES on failure.
DWORD GetFileAttributesW(const char16_t* fileName) noexcept;

// GetFileAttributesExW ("GetFileAttributes"): attributes, times and size; only the level
// GetFileExInfoStandard (0), others fail with ERROR_INVALID_PARAMETER.
BOOL GetFileAttributesExW(const char16_t* fileName, int infoLevel, void* information) noexcept;

// SetFileAttributesW ("SetFileAttributes"): only FILE_ATTRIBUTE_READONLY has an effect here.
BOOL SetFileAttributesW(const char16_t* fileName, DWORD attributes) noexcept;

// --- Searching --------------------------------------------------------------------------------

// FindFirstFileW ("FindFirstFile"): the entries of a directory whose names match the last name of
// `pattern` by the Windows wildcard rules: * any run of characters, ? any one character, a
// pattern ending in ".*" also matches names without a dot ("*.*" matches every name). Names are
// compared as they are (the file system is case-sensitive). Entries come in a stable order
// (sorted by name), "." and ".." included when the pattern matches them. Symbolic links are
// reported as links (see the attributes above), never followed. No match fails with
// ERROR_FILE_NOT_FOUND, a missing directory with ERROR_PATH_NOT_FOUND.
HANDLE FindFirstFileW(const char16_t* pattern, WIN32_FIND_DATAW* data) noexcept;

// FindFirstFileExW ("FindFirstFile") with FindExInfoStandard or FindExInfoBasic and
// FindExSearchNameMatch works as FindFirstFileW. This layer adds the level
// kFindExInfoNamesAndTypes: only the name and the directory and reparse-point attributes are
// filled (no sizes, times or read-only flag), as cheaply as the system lists a directory, for
// walks that only need to tell directories from the rest. Other levels or operations fail with
// ERROR_INVALID_PARAMETER.
constexpr int kFindExInfoNamesAndTypes = 0x100;
HANDLE FindFirstFileExW(const char16_t* pattern, int infoLevel, WIN32_FIND_DATAW* data, int searchOp, void* filter,
                        DWORD flags) noexcept;

// FindNextFileW ("FindNextFile"): the next entry; FALSE with ERROR_NO_MORE_FILES (18) at the end.
// An entry removed since the search started is skipped.
BOOL FindNextFileW(HANDLE find, WIN32_FIND_DATAW* data) noexcept;

// FindClose ("FindClose").
BOOL FindClose(HANDLE find) noexcept;

// --- Directories and volumes ------------------------------------------------------------------

// CreateDirectoryW ("CreateDirectory"): ERROR_ALREADY_EXISTS (183) when the path exists (as
// anything), ERROR_PATH_NOT_FOUND (3) when its parent is missing. Security is ignored.
BOOL CreateDirectoryW(const char16_t* path, SECURITY_ATTRIBUTES* security) noexcept;

// RemoveDirectoryW ("RemoveDirectory"): removes an empty directory, or a symbolic link to a
// directory (the link, not the target). ERROR_PATH_NOT_FOUND (3) when missing,
// ERROR_DIR_NOT_EMPTY (145) when not empty, ERROR_DIRECTORY (267) for a file.
BOOL RemoveDirectoryW(const char16_t* path) noexcept;

// GetDiskFreeSpaceExW ("GetDiskFreeSpaceEx"): the bytes of the volume holding the directory
// `path`: free to the caller, total, free in all; null pointers are not filled.
BOOL GetDiskFreeSpaceExW(const char16_t* path, ULARGE_INTEGER* freeToCaller, ULARGE_INTEGER* total,
                         ULARGE_INTEGER* totalFree) noexcept;

// GetLongPathNameW / GetShortPathNameW ("GetLongPathName" / "GetShortPathName"). There are no
// short (8.3) names here, so both give the path as written once it exists; a missing path fails
// with 2 or 3. Result as Win32: the length without terminator, or, when `bufferSize` is too
// small, the size needed including it (and nothing is written). `buffer` may be `path` itself.
DWORD GetLongPathNameW(const char16_t* path, char16_t* buffer, DWORD bufferSize) noexcept;
DWORD GetShortPathNameW(const char16_t* path, char16_t* buffer, DWORD bufferSize) noexcept;

}  // namespace Platform

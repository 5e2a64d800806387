// Directories: directory paths, the current directory, directory chains, deletion by pattern,
// whole trees (delete, copy, walk) and totals.
//
//   Directories::CreateDirectories(u"C:\\data\\a\\b");           // the whole chain
//   Directories::CopyDirectory(u"C:\\data", u"D:\\backup");      // raises UnableToCopyDirectory
//   bool stop = false;
//   ULONGLONG bytes = Directories::GetTreeSize(u"C:\\data", stop);
//   {
//     Directories::ScopedCurrentDirectory cwd(u"C:\\work");     // back when the scope ends
//   }
//
// As in Files, operations come as a Try flavour (a result value) and a raising flavour (the
// operation's own exception class with the platform error as cause). The walks, deletions and
// copies never follow a symbolic link out of the tree: a link is removed or copied as a link and
// its target is left alone. The current directory is process-wide: ScopedCurrentDirectory and
// SetCurrentDirectory affect every thread.
#pragma once

#include "owutils/CString.h"
#include "owutils/Export.h"
#include "owutils/WinTypes.h"

namespace Directories {

// --- Path text --------------------------------------------------------------------------------

// Appends a backslash unless the last character is one.
OWUTILS_API void AddTrailingBackslash(CString& strDirectory);
// A copy without one final backslash.
OWUTILS_API CString RemoveTrailingBackslash(const CString& strDirectory);
// True for "C:\", "C:", "\\srv\share" and the like; malformed roots raise InvalidUncPath.
OWUTILS_API bool IsRoot(const CString& strPath);
// 'C:\dir\file.txt' gives 'C:\dir'; 'C:\dir\' gives 'C:'; a root ('C:\') stays itself.
OWUTILS_API CString GetParentDirectory(const CString& strFileName);
// Empty for a root; otherwise the text before the last backslash.
OWUTILS_API CString GetContainingPath(const CString& strPath);
// The last name of a directory path ('C:\a\b\' gives 'b'); a root raises FileSystemException
// "Directory is a root path".
OWUTILS_API CString GetDirectoryName(const CString& strDirectory);
// The text before the first colon (empty without one).
OWUTILS_API CString GetDrive(const CString& strDirectory);
// Without trailing backslash, from its first backslash on; the whole text without one.
OWUTILS_API CString StripDrive(const CString& strDirectory);
// True for "." and "..".
OWUTILS_API bool IsDotsName(const CString& strDirectory);

// --- Current directory ------------------------------------------------------------------------

// The current directory in long-path form (Win32Error naming "GetCurrentDirectory").
OWUTILS_API CString GetCurrentDirectory();
// Raises UnableToSetWorkingDirectory (cause Win32Error naming "SetCurrentDirectory").
OWUTILS_API void SetCurrentDirectory(const CString& path);

// Switches the current directory for its lifetime. A failed switch raises and restores nothing;
// a failed restore is reported as an unexpected failure, never raised.
class OWUTILS_API ScopedCurrentDirectory {
 public:
  explicit ScopedCurrentDirectory(const char16_t* pNewCwd);
  ScopedCurrentDirectory(const ScopedCurrentDirectory&) = delete;
  ScopedCurrentDirectory& operator=(const ScopedCurrentDirectory&) = delete;
  ~ScopedCurrentDirectory();

 private:
  CString m_strSaved;
  bool m_bRestore = false;
};

// --- Tests and creation -----------------------------------------------------------------------

// True when the directory exists (as a directory).
OWUTILS_API bool Exists(const CString& cstrDirectory);
// True when the directory holds an entry other than "." and ".."; false when empty or unreadable.
OWUTILS_API bool HasEntries(const CString& strDirectory);
// Creates every missing directory of the chain. False (last error set) when one cannot be made,
// when the path exists as a file (ERROR_ALREADY_EXISTS) or when its root does not exist.
OWUTILS_API bool TryCreateDirectories(const CString& cstrDirectory);
// As TryCreateDirectories, raising FileSystemException: "Cannot create root directory '%s'",
// "Cannot create directory '%s', exists as file", or "Cannot create directory '%s'" with the
// platform error (Win32ErrorCode naming "CreateDirectory") as cause.
OWUTILS_API void CreateDirectories(const CString& cstrDirectory);

// --- Deletion ---------------------------------------------------------------------------------

// Deletes the entries of the directory matching the pattern (Windows wildcards), clearing
// read-only flags; matching subdirectories go as whole trees. Always true: leftovers show only
// when the directory itself is removed.
OWUTILS_API bool TryDeleteFiles(const CString& strDirectory, const CString& strFilePatternMatch);
// As TryDeleteFiles, raising UnableToDeleteFiles at the first failure.
OWUTILS_API void DeleteFiles(const CString& strDirectory, const CString& strFilePatternMatch);
// Removes the empty directory; true also when it does not exist.
OWUTILS_API bool TryRemoveDirectory(const CString& strDirectory);
// Removes the directory and everything in it; true also when it does not exist. A directory that
// is a symbolic link loses the link only.
OWUTILS_API bool TryRemoveDirectoryTree(const CString& strDirectory);
// As TryRemoveDirectoryTree, raising UnableToDeleteDirectory (also for a missing directory).
OWUTILS_API void RemoveDirectoryTree(const CString& strDirectory);

// --- Copy and walk ----------------------------------------------------------------------------

// Copies the tree into `destination` (created when missing), replacing files of the same names.
// 0 on success, otherwise the platform error; a missing source gives 0 and an empty destination.
OWUTILS_API DWORD TryCopyDirectory(const CString& cstrSourceDirectory, const CString& cstrDestinationDirectory);
// As TryCopyDirectory, raising UnableToCopyDirectory (also for a missing source).
OWUTILS_API void CopyDirectory(const CString& strSourceDirectoryIn, const CString& strDestinationDirectoryIn);

// Called for every entry of a walk with its full path, its find data and the caller's context;
// returns false to stop the whole walk.
using EnumerateCallback = bool (*)(const char16_t* path, const WIN32_FIND_DATAW& data, void* context);

// Calls `pCallback` for every entry of the directory other than "." and "..", in name order, and
// with `recursive` for the entries of its subdirectories too, a directory before its content.
// Returns at once when `stop` is true, and sets it when the callback returns false.
OWUTILS_API void Enumerate(const CString& strDir, EnumerateCallback pCallback, void* context, bool& stop,
                           bool recursive);
// The sum of the sizes of all files of the tree.
OWUTILS_API ULONGLONG GetTreeSize(const CString& strDir, bool& stop);
// Counts directories and other entries (both set to 0 first).
OWUTILS_API void CountEntries(const CString& strDir, bool recursive, bool& stop, ULONGLONG& directories,
                              ULONGLONG& files);

}  // namespace Directories

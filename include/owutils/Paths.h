// Paths: long-path forms, roots, existence, free space, and the bridge to native paths.
//
// The library's paths are CString values in Windows form ("C:\data\file.txt",
// "\\server\share\dir"). Before a path reaches the platform, file and directory operations turn
// it into long-path form with ToLongPath, so that it works beyond the classic 260-character limit:
//
//   CString p = Paths::ToLongPath(u"C:\\data");         // "\\?\C:\data"
//   CString q = Paths::ToLongPath(u"\\\\srv\\share\\f"); // "\\?\UNC\srv\share\f"
//   Paths::FromLongPath(q);                              // "\\srv\share\f"
//   Paths::Combine(u"C:\\data", u"file.txt");            // "C:\data\file.txt"
//
// Every operation that takes a path raises LumoException::PreconditionFailed0 for an empty one.
// On POSIX the platform maps drive letters and UNC paths onto native folders (OWUTILS_DRIVES,
// OWUTILS_UNC_ROOT); ToNativePath and FromNativePath convert for tools and client programs that
// hold native paths.
#pragma once

#include "owutils/CString.h"
#include "owutils/Export.h"
#include "owutils/WinTypes.h"

namespace Paths {

// True when the path exists (as anything).
OWUTILS_API bool Exists(const CString& strPath);
// As Exists; when the path is a directory also sets isDirectory to true (otherwise leaves it).
OWUTILS_API bool Exists(const CString& strPath, bool& isDirectory);
// True when the path exists and is a directory; false for a file and for a missing path.
OWUTILS_API bool IsDirectory(const CString& strPath);

// True when the path contains "\\?\" anywhere.
OWUTILS_API bool IsLongPath(const CString& strPath);
// The long-path form: unchanged when already long; "\\?\" + path for a path holding ":\";
// otherwise the path is taken as a network path: "\\?\UNC\" + the path without its two leading
// backslashes (so a relative path without a colon gets the network prefix too).
OWUTILS_API CString ToLongPath(const CString& strPath);
// The path without its long-path prefix ("\\?\UNC\srv\x" gives "\\srv\x").
OWUTILS_API CString FromLongPath(const CString& strPath);

// The platform's short form and long form of an existing path; LumoException::Win32Error
// naming "GetShortPathName" / "GetLongPathName" when the platform fails.
OWUTILS_API CString GetShortPathName(const CString& strLongPath);
OWUTILS_API CString GetLongPathName(const CString& strPath);

// Length of the root: "C:\x" has root "C:\" (3); "\\srv\share\dir" has "\\srv\share\" (12);
// "\\srv\share" is its own root. Raises InvalidUncPath for "C:", "\\srv", "\\srv\s", "srv\x".
OWUTILS_API int GetRootLength(const CString& strPath);
// The first GetRootLength characters.
OWUTILS_API CString GetRoot(const CString& strPath);

// first, a backslash unless first ends with one (only when both are non-empty), then second.
OWUTILS_API CString Combine(const CString& first, const CString& second);
// path = Combine(path, piece); returns path.
OWUTILS_API CString& AppendPath(CString& path, const CString& piece);

// Free bytes available to the caller on the volume of the directory `path`, in whole units of
// 1,048,576 bytes (powerOfTwoUnits) or 1,000,000 bytes. Raises FailedToGetDiskFreeSpaceEx.
OWUTILS_API ULONGLONG GetFreeDiskSpace(const CString& strPath, bool powerOfTwoUnits);

// A native path of this system ("/srv/data/x") in the library's form ("C:\srv\data\x" with the
// default drive map), and back. ToNativePath raises LumoException::Win32ErrorCode naming
// "ToNativePath" for a path the map cannot place (unknown drive, UNC path without UNC root).
OWUTILS_API CString FromNativePath(const CString& strNativePath);
OWUTILS_API CString ToNativePath(const CString& strPath);

}  // namespace Paths

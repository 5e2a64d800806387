// Platform service: the path mapping between the library's Windows-form paths and native ones.
//
// Every path above the platform layer keeps Windows syntax (drive letters, backslashes, the
// "\\?\" and "\\?\UNC\" long-path prefixes). The backend turns such a path into a native one
// at the last moment, in one place, here:
//
//   - a long-path prefix ("\\?\", "\\?\UNC\", and the device form "\\.\") is stripped;
//   - "X:\rest" maps through the drive map, the environment variable OWUTILS_DRIVES
//     ("C=/;D=/mnt/data"; letters in any case; "C=/" when unset or empty). A letter the map does
//     not name fails with ERROR_PATH_NOT_FOUND (3), like a drive that does not exist;
//   - "\\server\share\rest" maps to OWUTILS_UNC_ROOT/server/share/rest; without OWUTILS_UNC_ROOT,
//     or without a server name, it fails with ERROR_BAD_NETPATH (53), without a share name with
//     ERROR_BAD_NET_NAME (67);
//   - "\rest" is taken on the drive of the current directory; a relative path stays relative to
//     the process's current directory;
//   - backslashes and slashes both separate; "." and ".." are resolved on the text, as Windows
//     does, and never climb above a drive root or a UNC share, so a path cannot leave its drive;
//   - a name holding a control character or one of < > " | :, or (unless the caller allows
//     wildcards in the last name) * or ?, fails with ERROR_INVALID_NAME (123).
//
// The native file system stays what it is (case-sensitive on Linux): identity questions are
// answered by the file system, never by comparing mapped names.
//
// The inverse, for paths the library hands out (its module file, the current directory,
// temporary names), picks the longest drive root or UNC root that contains the native path. The
// native root "/" is always reachable: through the drive that maps it, or else through the last
// letter from Z down that the map leaves free, which then also maps forward to "/".
#pragma once

#include <string>

#include "owutils/WinTypes.h"

namespace Platform {

// Maps the library path `path` to the native path `native` (UTF-8 on POSIX). Returns false with
// the last error set as described above. With `allowWildcards`, the last name may hold * and ?.
bool MapToNative(const char16_t* path, std::string& native, bool allowWildcards = false);

// Maps the native path `native` to the library's form (drive or UNC form, backslashes, no
// long-path prefix). A relative native path only has its separators turned.
std::u16string MapFromNative(const std::string& native);

}  // namespace Platform

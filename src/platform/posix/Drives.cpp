// POSIX backend: drive kinds from the mount table (/proc/self/mountinfo) and the block devices'
// attributes in sysfs.
#include "platform/Drives.h"

#include <sys/stat.h>
#include <sys/sysmacros.h>

#include <climits>
#include <cstdlib>
#include <fstream>
#include <initializer_list>
#include <sstream>
#include <string>

#include "platform/Errors.h"
#include "platform/PathMap.h"

namespace Platform {
namespace {

struct Mount {
  std::string fsType;
  std::string mountPoint;
  unsigned major = 0;
  unsigned minor = 0;
};

constexpr unsigned kFloppyMajor = 2;
constexpr unsigned kScsiCdRomMajor = 11;

bool IsOctal(char c) { return c >= '0' && c <= '7'; }

// Undoes the octal escapes (\040 for a blank...) of mountinfo paths.
std::string Unescape(const std::string& text) {
  std::string out;
  for (size_t i = 0; i < text.size(); ++i) {
    if (text[i] == '\\' && i + 3 < text.size() && IsOctal(text[i + 1]) && IsOctal(text[i + 2]) &&
        IsOctal(text[i + 3])) {
      out.push_back(static_cast<char>(((text[i + 1] - '0') << 6) | ((text[i + 2] - '0') << 3) | (text[i + 3] - '0')));
      i += 3;
    } else {
      out.push_back(text[i]);
    }
  }
  return out;
}

bool ParseMountLine(const std::string& line, Mount& mount) {
  // "36 35 98:0 /root /mnt/point options... - fstype source superoptions"
  std::istringstream fields(line);
  std::string id, parent, device, root, mountPoint, field;
  if (!(fields >> id >> parent >> device >> root >> mountPoint)) return false;
  while (fields >> field && field != "-") {
  }
  if (field != "-" || !(fields >> mount.fsType)) return false;
  const size_t colon = device.find(':');
  if (colon == std::string::npos) return false;
  mount.major = static_cast<unsigned>(std::strtoul(device.c_str(), nullptr, 10));
  mount.minor = static_cast<unsigned>(std::strtoul(device.c_str() + colon + 1, nullptr, 10));
  mount.mountPoint = Unescape(mountPoint);
  return true;
}

bool IsUnder(const std::string& path, const std::string& mountPoint) {
  if (mountPoint == "/") return true;
  return path.compare(0, mountPoint.size(), mountPoint) == 0 &&
         (path.size() == mountPoint.size() || path[mountPoint.size()] == '/');
}

// The mount holding the folder `native`: the entry of its device, else the deepest mount point
// above it. Later entries win, as a later mount hides an earlier one at the same place.
bool FindMount(const std::string& native, Mount& found) {
  struct stat info {};
  if (stat(native.c_str(), &info) != 0) return false;
  char resolved[PATH_MAX];
  const std::string real = realpath(native.c_str(), resolved) != nullptr ? std::string(resolved) : native;

  std::ifstream table("/proc/self/mountinfo");
  std::string line;
  bool byDevice = false;
  size_t bestLength = 0;
  bool any = false;
  while (std::getline(table, line)) {
    Mount mount;
    if (!ParseMountLine(line, mount)) continue;
    const bool sameDevice = mount.major == major(info.st_dev) && mount.minor == minor(info.st_dev);
    const bool under = IsUnder(real, mount.mountPoint);
    if (sameDevice && under) {
      if (!byDevice || mount.mountPoint.size() >= bestLength) {
        found = mount;
        bestLength = mount.mountPoint.size();
      }
      byDevice = true;
      any = true;
    } else if (!byDevice && under && mount.mountPoint.size() >= bestLength) {
      found = mount;
      bestLength = mount.mountPoint.size();
      any = true;
    }
  }
  return any;
}

std::string SysBlockPath(const Mount& mount, const char* attribute) {
  return "/sys/dev/block/" + std::to_string(mount.major) + ":" + std::to_string(mount.minor) + "/" + attribute;
}

// A numeric attribute of the mount's block device; a partition takes it from its disk.
bool ReadBlockAttribute(const Mount& mount, const char* attribute, bool fromDisk, unsigned long long& value) {
  std::ifstream file(SysBlockPath(mount, attribute));
  if (!file && fromDisk) file.open(SysBlockPath(mount, (std::string("../") + attribute).c_str()));
  return static_cast<bool>(file >> value);
}

bool IsRemovableDevice(const Mount& mount) {
  unsigned long long removable = 0;
  return mount.major != 0 && ReadBlockAttribute(mount, "removable", true, removable) && removable == 1;
}

bool IsOneOf(const std::string& value, std::initializer_list<const char*> names) {
  for (const char* name : names) {
    if (value == name) return true;
  }
  return false;
}

UINT Classify(const Mount& mount) {
  const std::string& fs = mount.fsType;
  if (IsOneOf(fs, {"nfs", "nfs4", "cifs", "smb3", "smbfs", "ncpfs", "afs", "9p", "ceph", "glusterfs", "lustre",
                   "coda", "davfs", "fuse.sshfs", "fuse.glusterfs", "fuse.davfs2", "fuse.rclone", "fuse.s3fs"})) {
    return kDriveRemote;
  }
  if (IsOneOf(fs, {"iso9660", "udf"}) || mount.major == kScsiCdRomMajor) return kDriveCdRom;
  if (IsOneOf(fs, {"tmpfs", "ramfs"})) return kDriveRamDisk;
  if (IsRemovableDevice(mount)) return kDriveRemovable;
  return kDriveFixed;
}

// The native folder of a drive root; false with the last error set.
bool RootFolder(const char16_t* root, std::string& native) {
  if (root == nullptr) {
    native = ".";
    return true;
  }
  if (root[0] != 0 && root[1] == u':') {
    const char16_t drive[] = {root[0], u':', u'\\', 0};
    return MapToNative(drive, native);
  }
  return MapToNative(root, native);
}

bool IsUncRoot(const char16_t* root) {
  return root != nullptr && (root[0] == u'\\' || root[0] == u'/') && (root[1] == u'\\' || root[1] == u'/') &&
         root[2] != u'?' && root[2] != u'.';
}

}  // namespace

UINT GetDriveTypeW(const char16_t* root) noexcept {
  try {
    std::string native;
    struct stat info {};
    if (!RootFolder(root, native) || stat(native.c_str(), &info) != 0 || !S_ISDIR(info.st_mode)) {
      return kDriveNoRootDir;
    }
    if (IsUncRoot(root)) return kDriveRemote;
    Mount mount;
    if (!FindMount(native, mount)) return kDriveUnknown;
    return Classify(mount);
  } catch (...) {
    return kDriveUnknown;
  }
}

bool GetDriveMediaType(char16_t letter, DWORD* mediaType) noexcept {
  try {
    const char16_t root[] = {letter, u':', u'\\', 0};
    std::string native;
    if (!RootFolder(root, native)) {
      SetLastError(ERROR_PATH_NOT_FOUND);
      return false;
    }
    Mount mount;
    if (!FindMount(native, mount)) {
      SetLastError(ERROR_PATH_NOT_FOUND);
      return false;
    }
    unsigned long long sectors = 0;
    if (mount.major == 0 || !ReadBlockAttribute(mount, "size", false, sectors)) {
      SetLastError(ERROR_INVALID_FUNCTION);
      return false;
    }
    if (sectors == 0) {
      SetLastError(ERROR_NOT_READY);
      return false;
    }
    DWORD type = kMediaFixed;
    if (mount.major == kFloppyMajor) {
      type = kMediaF3_1Pt44_512;
    } else if (IsRemovableDevice(mount)) {
      type = kMediaRemovable;
    }
    if (mediaType != nullptr) *mediaType = type;
    return true;
  } catch (...) {
    SetLastError(ERROR_NOT_ENOUGH_MEMORY);
    return false;
  }
}

}  // namespace Platform

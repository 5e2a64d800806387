// Platform service: drive kinds and removable media.
//
// Drives are the letters of the drive map (see PathMap.h). What kind of device lies behind a
// letter is answered from what the system knows about the file system mounted there.
#pragma once

#include "owutils/WinTypes.h"

namespace Platform {

// Results of GetDriveTypeW (DRIVE_*).
constexpr UINT kDriveUnknown = 0;
constexpr UINT kDriveNoRootDir = 1;
constexpr UINT kDriveRemovable = 2;
constexpr UINT kDriveFixed = 3;
constexpr UINT kDriveRemote = 4;
constexpr UINT kDriveCdRom = 5;
constexpr UINT kDriveRamDisk = 6;

// Media types reported by GetDriveMediaType (MEDIA_TYPE).
constexpr DWORD kMediaF3_1Pt44_512 = 2;  // 3.5-inch, 1.44 MB floppy
constexpr DWORD kMediaRemovable = 11;    // RemovableMedia
constexpr DWORD kMediaFixed = 12;        // FixedMedia

// GetDriveTypeW: the kind of drive whose root is `root` ("D:\\"; a UNC root
// "\\\\server\\share\\" is a remote drive; null: the drive of the current directory).
// DRIVE_NO_ROOT_DIR when the letter is not in the drive map or its folder does not exist;
// DRIVE_UNKNOWN when the mount cannot be determined. Otherwise, from the file system mounted
// there: network file systems give DRIVE_REMOTE, optical ones (and optical devices)
// DRIVE_CDROM, tmpfs and ramfs DRIVE_RAMDISK, a block device the system flags as removable
// DRIVE_REMOVABLE, everything else DRIVE_FIXED.
UINT GetDriveTypeW(const char16_t* root) noexcept;

// The media type of the first medium in the device of drive `letter`, as opening "\\\\.\\X:" and
// sending IOCTL_DISK_GET_MEDIA_TYPES gives it: kMediaRemovable for a removable device holding a
// medium, kMediaF3_1Pt44_512 for a floppy drive holding one, kMediaFixed for a fixed device.
// False with ERROR_NOT_READY when the device holds no medium, ERROR_PATH_NOT_FOUND when the
// letter is not mapped, ERROR_INVALID_FUNCTION when no block device lies behind the drive.
bool GetDriveMediaType(char16_t letter, DWORD* mediaType) noexcept;

}  // namespace Platform

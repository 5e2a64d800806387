// Shared by Files and Directories: file identity as the file system sees it.
#pragma once

#include "owutils/CString.h"
#include "owutils/WinTypes.h"

namespace FileSystemInternal {

struct Identity {
  DWORD volume = 0;
  DWORD indexHigh = 0;
  DWORD indexLow = 0;
  bool operator==(const Identity& other) const {
    return volume == other.volume && indexHigh == other.indexHigh && indexLow == other.indexLow;
  }
};

// The volume and file index of an existing path (the target of a link); false when it cannot be
// opened for a query.
bool GetIdentity(const CString& longPath, Identity& identity);

// True when both paths exist and name the same file (device and inode), whatever the names.
bool SameFile(const CString& longPathA, const CString& longPathB);

}  // namespace FileSystemInternal

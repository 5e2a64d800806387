// Platform service: fault injection, a process-wide test switch.
//
// Tests use it to make a platform call fail the way the operating system would let it fail (disk
// full, I/O error, access denied, an interrupted call...), or to make a read or write transfer
// fewer bytes than asked, without needing a full disk or a broken device. A backend function
// asks the switch at its entry, by the Win32 name of the operation it implements:
//
//   // in a backend (src/platform/<backend>/...):
//   BOOL WriteFile(HANDLE h, const void* data, DWORD size, DWORD* written, void*) {
//     if (FaultInjection::Check("WriteFile")) return FALSE;   // last error already set
//     size = FaultInjection::LimitTransfer("WriteFile", size); // a short write when armed
//     ...
//
//   // in a test:
//   Platform::FaultInjection::ScopedFault full("WriteFile", ERROR_DISK_FULL, /*skip*/ 2);
//   ...  // the third WriteFile of the process fails with 112, later ones succeed again
//
// Names are the Win32 function names without the W/A suffix ("CreateFile", "ReadFile",
// "WriteFile", "SetEndOfFile", "FlushFileBuffers", "MoveFile", "CopyFile", "DeleteFile",
// "CreateDirectory", "RemoveDirectory", "FindFirstFile", "FindNextFile", "GetFileAttributes",
// "SetFileAttributes", "GetDiskFreeSpaceEx", "GetTempFileName", "RegSetValueEx"...); each backend
// function's comment says which name it checks. Several faults may be armed at once (up to
// kMaxFaults); each counts its own matching calls.
//
// Disarmed, Check and LimitTransfer cost one relaxed atomic load. Armed, they take a lock. The
// switch is process-wide: tests that arm it must not run platform calls on other threads that
// they do not expect to fail.
#pragma once

#include <cstddef>

#include "owutils/WinTypes.h"

namespace Platform::FaultInjection {

constexpr unsigned kForever = 0;   // `times` value: every matching call fails until disarmed
constexpr size_t kMaxFaults = 8;   // faults armed at the same time

// Arms a failure: after `skip` matching calls have been let through, the next `times` calls of
// `operation` fail with `error` as their last error (kForever: all of them). Returns false when
// kMaxFaults faults are already armed. `operation` must outlive the fault (use a literal).
bool Arm(const char* operation, DWORD error, unsigned skip = 0, unsigned times = 1);

// Arms a short transfer: after `skip` matching calls, the next `times` calls of `operation`
// (a read or a write) transfer at most `maxBytes` bytes and report success, as a read at the end
// of a file or a write to an almost full device does.
bool ArmShort(const char* operation, DWORD maxBytes, unsigned skip = 0, unsigned times = 1);

// Removes every armed fault and resets the hit counter.
void Disarm();

// For a backend: true when this call of `operation` must fail. The last error is then set to
// the armed error; the backend returns its failure value without doing anything else.
bool Check(const char* operation) noexcept;

// For a backend's read and write functions: `requested`, or less when a short transfer is armed
// for this call of `operation`.
DWORD LimitTransfer(const char* operation, DWORD requested) noexcept;

// How many calls were failed or shortened since the last Arm/Disarm: lets a test tell that the
// fault it armed was really reached.
unsigned Hits() noexcept;

// Arms one failure for its lifetime and disarms everything when it ends.
class ScopedFault {
 public:
  ScopedFault(const char* operation, DWORD error, unsigned skip = 0, unsigned times = 1) {
    Arm(operation, error, skip, times);
  }
  ScopedFault(const ScopedFault&) = delete;
  ScopedFault& operator=(const ScopedFault&) = delete;
  ~ScopedFault() { Disarm(); }
};

}  // namespace Platform::FaultInjection

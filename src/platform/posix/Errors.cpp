// POSIX backend: the per-thread last error, the errno table and the system message texts.
#include "platform/Errors.h"

#include <cerrno>
#include <cstring>

#include "platform/posix/NativeText.h"

namespace Platform {
namespace {

thread_local DWORD t_lastError = ERROR_SUCCESS;

struct ErrnoMapping {
  int error;
  DWORD win32;
};

// The one table from errno to Win32 codes.
constexpr ErrnoMapping kErrnoTable[] = {
    {0, ERROR_SUCCESS},
    {EPERM, ERROR_ACCESS_DENIED},
    {ENOENT, ERROR_FILE_NOT_FOUND},
    {ESRCH, ERROR_NOT_FOUND},
    {EINTR, ERROR_OPERATION_ABORTED},
    {EIO, ERROR_IO_DEVICE},
    {ENXIO, ERROR_FILE_NOT_FOUND},
    {E2BIG, ERROR_INVALID_PARAMETER},
    {ENOEXEC, ERROR_BAD_EXE_FORMAT},
    {EBADF, ERROR_INVALID_HANDLE},
    {EAGAIN, ERROR_SHARING_VIOLATION},
    {ENOMEM, ERROR_NOT_ENOUGH_MEMORY},
    {EACCES, ERROR_ACCESS_DENIED},
    {EFAULT, ERROR_NOACCESS},
    {EBUSY, ERROR_BUSY},
    {EEXIST, ERROR_ALREADY_EXISTS},
    {EXDEV, ERROR_NOT_SAME_DEVICE},
    {ENODEV, ERROR_FILE_NOT_FOUND},
    {ENOTDIR, ERROR_PATH_NOT_FOUND},
    {EISDIR, ERROR_ACCESS_DENIED},
    {EINVAL, ERROR_INVALID_PARAMETER},
    {ENFILE, ERROR_TOO_MANY_OPEN_FILES},
    {EMFILE, ERROR_TOO_MANY_OPEN_FILES},
    {ETXTBSY, ERROR_SHARING_VIOLATION},
    {EFBIG, ERROR_DISK_FULL},
    {ENOSPC, ERROR_DISK_FULL},
    {ESPIPE, ERROR_SEEK},
    {EROFS, ERROR_WRITE_PROTECT},
    {EMLINK, ERROR_TOO_MANY_LINKS},
    {EPIPE, ERROR_BROKEN_PIPE},
    {ERANGE, ERROR_INSUFFICIENT_BUFFER},
    {EDEADLK, ERROR_LOCK_VIOLATION},
    {ENAMETOOLONG, ERROR_FILENAME_EXCED_RANGE},
    {ENOLCK, ERROR_LOCK_VIOLATION},
    {ENOSYS, ERROR_CALL_NOT_IMPLEMENTED},
    {ENOTEMPTY, ERROR_DIR_NOT_EMPTY},
    {ELOOP, ERROR_CANT_RESOLVE_FILENAME},
    {EILSEQ, ERROR_NO_UNICODE_TRANSLATION},
    {EDQUOT, ERROR_DISK_FULL},
    {ENOTSUP, ERROR_NOT_SUPPORTED},
    {ETIMEDOUT, ERROR_TIMEOUT},
    {ECONNREFUSED, ERROR_CONNECTION_REFUSED},
    {ENETUNREACH, ERROR_NETWORK_UNREACHABLE},
    {EHOSTUNREACH, ERROR_HOST_UNREACHABLE},
    {ECANCELED, ERROR_OPERATION_ABORTED},
    {EWOULDBLOCK == EAGAIN ? -1 : EWOULDBLOCK, ERROR_SHARING_VIOLATION},
};

struct MessageText {
  DWORD code;
  const char16_t* text;
};

// Our own wording for the codes the library and its platform layer produce.
constexpr MessageText kMessages[] = {
    {ERROR_SUCCESS, u"The operation succeeded."},
    {ERROR_INVALID_FUNCTION, u"The function is not valid for this object."},
    {ERROR_FILE_NOT_FOUND, u"The file cannot be found."},
    {ERROR_PATH_NOT_FOUND, u"The path cannot be found."},
    {ERROR_TOO_MANY_OPEN_FILES, u"Too many files are open."},
    {ERROR_ACCESS_DENIED, u"Access is denied."},
    {ERROR_INVALID_HANDLE, u"The handle is not valid."},
    {ERROR_NOT_ENOUGH_MEMORY, u"There is not enough memory to complete the operation."},
    {ERROR_INVALID_DATA, u"The data is not valid."},
    {ERROR_OUTOFMEMORY, u"There is not enough storage to complete the operation."},
    {ERROR_INVALID_DRIVE, u"The drive cannot be found."},
    {ERROR_CURRENT_DIRECTORY, u"The current directory cannot be removed."},
    {ERROR_NOT_SAME_DEVICE, u"The file cannot be moved to a different disk drive."},
    {ERROR_NO_MORE_FILES, u"There are no more files."},
    {ERROR_WRITE_PROTECT, u"The medium is write protected."},
    {ERROR_NOT_READY, u"The device is not ready."},
    {ERROR_CRC, u"Data error (cyclic redundancy check)."},
    {ERROR_SEEK, u"The position cannot be set on the device."},
    {ERROR_WRITE_FAULT, u"The device cannot be written to."},
    {ERROR_READ_FAULT, u"The device cannot be read from."},
    {ERROR_GEN_FAILURE, u"A device attached to the system is not working."},
    {ERROR_SHARING_VIOLATION, u"The file is in use by another process."},
    {ERROR_LOCK_VIOLATION, u"A part of the file is locked by another process."},
    {ERROR_HANDLE_EOF, u"The end of the file has been reached."},
    {ERROR_HANDLE_DISK_FULL, u"The disk is full."},
    {ERROR_NOT_SUPPORTED, u"The request is not supported."},
    {ERROR_BAD_NETPATH, u"The network path was not found."},
    {ERROR_NETNAME_DELETED, u"The network name is no longer available."},
    {ERROR_NETWORK_ACCESS_DENIED, u"Network access is denied."},
    {ERROR_BAD_NET_NAME, u"The network name cannot be found."},
    {ERROR_FILE_EXISTS, u"The file exists."},
    {ERROR_CANNOT_MAKE, u"The directory or file cannot be created."},
    {ERROR_INVALID_PARAMETER, u"The parameter is not valid."},
    {ERROR_BROKEN_PIPE, u"The pipe has been ended."},
    {ERROR_OPEN_FAILED, u"The system cannot open the device or file specified."},
    {ERROR_BUFFER_OVERFLOW, u"The file name is too long."},
    {ERROR_DISK_FULL, u"There is not enough space on the disk."},
    {ERROR_CALL_NOT_IMPLEMENTED, u"This function is not supported on this system."},
    {ERROR_SEM_TIMEOUT, u"The wait period expired."},
    {ERROR_INSUFFICIENT_BUFFER, u"The data area passed to a system call is too small."},
    {ERROR_INVALID_NAME, u"The file name, directory name or volume label syntax is not valid."},
    {ERROR_MOD_NOT_FOUND, u"The module cannot be found."},
    {ERROR_PROC_NOT_FOUND, u"The procedure cannot be found."},
    {ERROR_DIR_NOT_EMPTY, u"The directory is not empty."},
    {ERROR_NOT_LOCKED, u"The segment is already unlocked."},
    {ERROR_BUSY, u"The requested resource is in use."},
    {ERROR_ALREADY_EXISTS, u"A file that already exists cannot be created."},
    {ERROR_BAD_EXE_FORMAT, u"The file is not a valid executable module."},
    {ERROR_ENVVAR_NOT_FOUND, u"The environment variable cannot be found."},
    {ERROR_FILENAME_EXCED_RANGE, u"The file name or extension is too long."},
    {ERROR_MORE_DATA, u"More data is available."},
    {ERROR_NO_MORE_ITEMS, u"No more data is available."},
    {ERROR_DIRECTORY, u"The directory name is not valid."},
    {ERROR_NOT_OWNER, u"An attempt was made to release a lock not owned by the caller."},
    {ERROR_MR_MID_NOT_FOUND, u"No text exists for this message number."},
    {ERROR_INVALID_ADDRESS, u"The memory address is not valid."},
    {ERROR_ARITHMETIC_OVERFLOW, u"The arithmetic result exceeded 32 bits."},
    {ERROR_OPERATION_ABORTED, u"The I/O operation was aborted."},
    {ERROR_IO_INCOMPLETE, u"The I/O event is not in a signaled state."},
    {ERROR_NOACCESS, u"An invalid memory location was accessed."},
    {ERROR_INVALID_FLAGS, u"The flags are not valid."},
    {ERROR_CANTOPEN, u"The registry key cannot be opened."},
    {ERROR_CANTREAD, u"The registry key cannot be read."},
    {ERROR_CANTWRITE, u"The registry key cannot be written."},
    {ERROR_REGISTRY_CORRUPT, u"The registry store is corrupt."},
    {ERROR_KEY_DELETED, u"The registry key has been marked for deletion."},
    {ERROR_NO_UNICODE_TRANSLATION, u"No mapping for the Unicode character exists in the target code page."},
    {ERROR_DLL_INIT_FAILED, u"A dynamic link library failed to initialize."},
    {ERROR_IO_DEVICE, u"The request failed because of an I/O device error."},
    {ERROR_TOO_MANY_LINKS, u"Too many links or symbolic links were followed."},
    {ERROR_NOT_FOUND, u"The element cannot be found."},
    {ERROR_CONNECTION_REFUSED, u"The remote computer refused the network connection."},
    {ERROR_NETWORK_UNREACHABLE, u"The network cannot be reached."},
    {ERROR_HOST_UNREACHABLE, u"The remote host cannot be reached."},
    {ERROR_PRIVILEGE_NOT_HELD, u"The caller does not hold a required privilege."},
    {ERROR_NO_SYSTEM_RESOURCES, u"System resources are insufficient to complete the service."},
    {ERROR_TIMEOUT, u"The operation returned because the time-out period expired."},
    {ERROR_EVENTLOG_FILE_CORRUPT, u"The event log file is corrupted."},
    {ERROR_EVENTLOG_CANT_START, u"No event log file could be opened."},
    {ERROR_LOG_FILE_FULL, u"The event log file is full."},
    {ERROR_INVALID_USER_BUFFER, u"The supplied user buffer is not valid for the requested operation."},
    {ERROR_RESOURCE_DATA_NOT_FOUND, u"The resource data cannot be found in the module."},
    {ERROR_RESOURCE_TYPE_NOT_FOUND, u"The resource type cannot be found in the module."},
    {ERROR_RESOURCE_NAME_NOT_FOUND, u"The resource name cannot be found in the module."},
    {ERROR_RESOURCE_LANG_NOT_FOUND, u"The resource language cannot be found in the module."},
    {ERROR_DEVICE_IN_USE, u"The device is in use by an active process."},
    {ERROR_CANT_RESOLVE_FILENAME, u"The name of the file cannot be resolved."},
    {ERROR_INTERNET_TIMEOUT, u"The internet operation timed out."},
    {ERROR_INTERNET_INVALID_URL, u"The URL is not valid."},
    {ERROR_INTERNET_NAME_NOT_RESOLVED, u"The server name or address cannot be resolved."},
    {ERROR_INTERNET_CANNOT_CONNECT, u"The attempt to connect to the server failed."},
    {static_cast<DWORD>(E_FAIL), u"Unspecified error."},
};

}  // namespace

DWORD GetLastError() noexcept { return t_lastError; }
void SetLastError(DWORD error) noexcept { t_lastError = error; }

DWORD Win32ErrorFromErrno(int error) noexcept {
  for (const auto& m : kErrnoTable) {
    if (m.error == error) return m.win32;
  }
  return ERROR_GEN_FAILURE;
}

DWORD SetLastErrorFromErrno(int error) noexcept {
  DWORD code = Win32ErrorFromErrno(error);
  t_lastError = code;
  return code;
}

bool GetSystemMessage(DWORD code, std::u16string& text) {
  DWORD lookup = code;
  if ((code & 0xFFFF0000u) == 0x80070000u) lookup = code & 0xFFFFu;
  for (const auto& m : kMessages) {
    if (m.code == lookup) {
      text = m.text;
      text += u"\r\n";
      return true;
    }
  }
  t_lastError = ERROR_MR_MID_NOT_FOUND;
  return false;
}

std::u16string ErrnoText(int error) {
  char buffer[256];
  // The GNU strerror_r returns the text, which may or may not live in `buffer`.
  return Posix::ToUtf16(strerror_r(error, buffer, sizeof buffer));
}

}  // namespace Platform

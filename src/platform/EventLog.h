// Platform service: the event log.
//
// The calls the library makes on the Windows event log, with their Win32 behaviour:
// - RegisterEventSourceW / DeregisterEventSource: a handle for writing as a named source. The
//   source writes to the log under whose registry key
//   "SYSTEM\CurrentControlSet\Services\EventLog\<log>\<source>" (HKEY_LOCAL_MACHINE) it is
//   registered, and to "Application" otherwise.
// - ReportEventW: appends one record (type, category, event id, insertion strings, binary data,
//   time generated and written, source and computer name) and numbers it: record numbers of a
//   log start at 1 and only grow, also across processes and after ClearEventLogW.
// - OpenEventLogW / CloseEventLog for "Application", "Security" and "System" (any other name
//   opens "Application", as Windows does for a log it does not know).
// - ReadEventLogW: whole EVENTLOGRECORD records into the caller's buffer, sequentially or from a
//   given record number (EVENTLOG_SEEK_READ), forwards or backwards. Fails with
//   ERROR_INSUFFICIENT_BUFFER (122) and the size of the next record in *minBytesNeeded when not
//   even one record fits; ERROR_HANDLE_EOF (38) when there is no further record;
//   ERROR_INVALID_PARAMETER (87) for a seek to a record number that does not exist or bad flags.
// Calls fail with FALSE or a null handle and the Win32 code as last error. A damaged store fails
// with ERROR_EVENTLOG_FILE_CORRUPT (1500); an unreadable one with the code of the system error.
//
// On POSIX the event log is the SQLite database "eventlog.db" in the state folder
// (platform/StateDirectory.h), shared by every process of the user. A record is committed when
// ReportEventW returns: a writer killed at any point leaves every committed record readable. The
// store reaches the disk at its checkpoints, so a power failure may lose the last records (never
// the store itself).
// With OWUTILS_EVENTLOG_SYSLOG=1 each record is also sent to syslog.
#pragma once

#include "owutils/WinTypes.h"

#if !defined(_WIN32)
#define EVENTLOG_SEQUENTIAL_READ 0x0001
#define EVENTLOG_SEEK_READ 0x0002
#define EVENTLOG_FORWARDS_READ 0x0004
#define EVENTLOG_BACKWARDS_READ 0x0008

#define EVENTLOG_SUCCESS 0x0000
#define EVENTLOG_ERROR_TYPE 0x0001
#define EVENTLOG_WARNING_TYPE 0x0002
#define EVENTLOG_INFORMATION_TYPE 0x0004
#define EVENTLOG_AUDIT_SUCCESS 0x0008
#define EVENTLOG_AUDIT_FAILURE 0x0010

// One record as ReadEventLogW delivers it. The variable part follows the fixed part: source name
// and computer name (NUL-terminated UTF-16), padding to a 4-byte boundary, the user SID
// (UserSidLength bytes at UserSidOffset), the insertion strings (NumStrings NUL-terminated
// UTF-16 strings from StringOffset), the data (DataLength bytes at DataOffset), padding, and the
// record length again as the last DWORD. Offsets count from the start of the record.
struct EVENTLOGRECORD {
  DWORD Length;
  DWORD Reserved;  // 0x654C664C, "LfLe"
  DWORD RecordNumber;
  DWORD TimeGenerated;  // seconds since 1970-01-01 UTC
  DWORD TimeWritten;
  DWORD EventID;
  WORD EventType;
  WORD NumStrings;
  WORD EventCategory;
  WORD ReservedFlags;
  DWORD ClosingRecordNumber;
  DWORD StringOffset;
  DWORD UserSidLength;
  DWORD UserSidOffset;
  DWORD DataLength;
  DWORD DataOffset;
};
static_assert(sizeof(EVENTLOGRECORD) == 56, "EVENTLOGRECORD layout");
#endif

#ifndef ERROR_BAD_PATHNAME
#define ERROR_BAD_PATHNAME 161
#endif

namespace Platform {

// `server` must be null or empty (the local computer); `source` must not be empty.
HANDLE RegisterEventSourceW(const char16_t* server, const char16_t* source);
BOOL DeregisterEventSource(HANDLE source);
// `strings` holds `numStrings` non-null strings; `data` `dataSize` bytes. `userSid` is not kept.
BOOL ReportEventW(HANDLE source, WORD type, WORD category, DWORD eventId, void* userSid, WORD numStrings,
                  DWORD dataSize, const char16_t** strings, void* data);

HANDLE OpenEventLogW(const char16_t* server, const char16_t* logName);
BOOL CloseEventLog(HANDLE log);
BOOL ReadEventLogW(HANDLE log, DWORD flags, DWORD recordOffset, void* buffer, DWORD bytesToRead, DWORD* bytesRead,
                   DWORD* minBytesNeeded);
BOOL GetNumberOfEventLogRecords(HANDLE log, DWORD* count);
// Number of the oldest record (0 for an empty log).
BOOL GetOldestEventLogRecord(HANDLE log, DWORD* oldest);
// Removes every record of the log; numbering continues where it was. `backupFile` must be null.
BOOL ClearEventLogW(HANDLE log, const char16_t* backupFile);

}  // namespace Platform

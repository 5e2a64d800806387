// Crash reporting: installs the outside crash-reporting component for a client program, with the
// same handlers, report address and language file for every program.
//
//   if (!LmCrashReportingInit(u"Backup Agent", u"https://reports.example/receive", nullptr,
//                             kEventCrashReporting, /*interactive*/ true)) { ... }
//   LmCrashReportingAddProperty(u"session", sessionId);
//   LmCrashReportingAddFile(logPath, u"agent log");
//   ...
//   LmCrashReportingDeinit();
//
// The component is the module "CrashRpt1403" with the platform's module suffix
// (CrashRpt1403.so, CrashRpt1403.dll), looked for beside this library first and then through
// the system loader's search. It is loaded by the first LmCrashReportingInit and must export
// the five calls declared at the end of this header under their plain names. A machine without
// it runs as before: LmCrashReportingInit reports why the component could not be loaded and
// returns false, and the other three do nothing (LmCrashReportingAddProperty returns false).
//
// Failures are reported as warnings to the event logger registered as "LM_EVENT_HANDLER", with
// the event identifier given to LmCrashReportingInit.
#pragma once

#include <cstdint>

#include "owutils/CString.h"
#include "owutils/Export.h"
#include "owutils/WinTypes.h"

// Called by the component when a crash is being reported; passed through unchanged.
using LmCrashCallback = int (*)(void* info);

// Installs the component. `url` is the report receiver's address without a query part; the
// query added to it names the OEM and the version ("?cn=<OEM name>&maj=..&min=..&bld=.."). A
// non-interactive program sends its reports without showing the component's dialog.
OWUTILS_API bool LmCrashReportingInit(const CString& appName, const CString& url, LmCrashCallback callback,
                                      long eventId, bool interactive);
// Adds a file to every future report.
OWUTILS_API void LmCrashReportingAddFile(const CString& file, const CString& description);
// Adds a named text property to every future report. False (after reporting) when the
// component refuses it or is not loaded.
OWUTILS_API bool LmCrashReportingAddProperty(const CString& name, const CString& value);
// Removes the crash handlers again.
OWUTILS_API void LmCrashReportingDeinit();

// ---- The component's interface ---------------------------------------------------------------

// The install record handed to crInstallW. Fields not set by the library are zero.
struct LmCrashInstallInfo {
  std::uint16_t cb;                    // sizeof(LmCrashInstallInfo)
  const char16_t* pszAppName;          // the application name
  const char16_t* pszAppVersion;       // "major.minor.build.0"
  const char16_t* pszEmailTo;          // not used: 0
  const char16_t* pszEmailSubject;     // not used: 0
  const char16_t* pszUrl;              // the report address with its query
  const char16_t* pszCrashSenderPath;  // 0: the component's default
  LmCrashCallback pfnCrashCallback;    // the caller's callback, or null
  UINT uPriorities[5];                 // delivery priorities: HTTP 0, SMTP and Simple MAPI -1 (not used)
  DWORD dwFlags;                       // kLmCrashFlagsInteractive or kLmCrashFlagsSilent
  const char16_t* pszPrivacyPolicyURL;   // 0
  const char16_t* pszDebugHelpDLL;       // 0: the component's default
  ULONG uMiniDumpType;                   // 0: a normal mini-dump
  const char16_t* pszErrorReportSaveDir;  // 0: the component's default
  const char16_t* pszRestartCmdLine;      // 0: no restart
  const char16_t* pszLangFilePath;        // the language file beside this library
  const void* apvReserved[6];             // 0
};

// Delivery priorities, by channel.
constexpr int kLmCrashPriorityHttp = 0;
constexpr int kLmCrashPrioritySmtp = 1;
constexpr int kLmCrashPrioritySimpleMapi = 2;
constexpr UINT kLmCrashPriorityNotUsed = static_cast<UINT>(-1);

// All of the component's handler bits, plus binary encoding for HTTP delivery; without a GUI
// for programs that are not interactive.
constexpr DWORD kLmCrashAllHandlers = 0x1FFF;
constexpr DWORD kLmCrashNoGui = 0x2000;
constexpr DWORD kLmCrashHttpBinaryEncoding = 0x4000;
constexpr DWORD kLmCrashFlagsInteractive = kLmCrashAllHandlers | kLmCrashHttpBinaryEncoding;           // 0x5FFF
constexpr DWORD kLmCrashFlagsSilent = kLmCrashAllHandlers | kLmCrashHttpBinaryEncoding | kLmCrashNoGui;  // 0x7FFF

// The calls the component exports (extern "C", under these names). Install and add-property
// answer 0 for success; the error text is at most `size` units including its terminator.
extern "C" {
using crInstallW_t = int (*)(const LmCrashInstallInfo* info);
using crUninstall_t = int (*)();
using crAddFile2W_t = int (*)(const char16_t* file, const char16_t* destinationName, const char16_t* description,
                              DWORD flags);
using crAddPropertyW_t = int (*)(const char16_t* name, const char16_t* value);
using crGetLastErrorMsgW_t = int (*)(char16_t* buffer, UINT size);
}

// The exported utilities of the library: what a client program calls. Including this header
// declares every export, each with its own unit's header:
//
//   AsciiToBits, BitsToAscii, BitsToDecimal                      owutils/BitCodecs.h
//   FormatSize, FormatTime, GetLastDayOfMonth, GetErrorMessage    owutils/LmFormat.h
//   GetAppLangFromRegistry, GetLanguageId, GetLanguageIdString,
//   LoadResourceModule, LoadAppResources, LoadEngineResources,
//   LoadLFResources, LoadMessageResources, GetAppResourceHandle,
//   GetEngineResourceHandle, LVXSS_get                            owutils/LmResources.h
//   GetOEMDataTextPtr, GetOEMEmailInfoTextPtr, GetOEMDataTCHAR    owutils/LmOem.h
//   LmCrashReportingInit, LmCrashReportingAddFile,
//   LmCrashReportingAddProperty, LmCrashReportingDeinit           owutils/LmCrashReporting.h
//   LmHasInternetConnection, LmInternetCheckConnection,
//   GetDriveDeviceType, LmGetExchangeWriterNameForVssQvr,
//   ParseToDomainAndUser, IsWow64, IsQRWApp                       owutils/LmProbes.h
//   LmObjectAdd, LmObjectDel, LmObjectGet                         owutils/NamedObjects.h
//   VerifySecretKey (and MakeSecretKeyCode)                       owutils/SecretKey.h
//
// The library frame: when the library is loaded it builds, in this order, the named-object
// table and its lock, then the default event logger (debugger output only), which it installs
// and registers as "LM_EVENT_HANDLER"; when it is unloaded it takes them down in the reverse
// order. Nothing may call into the library once unloading has begun. The event logger the
// exports report through is declared in owutils/EventLogger.h.
#pragma once

#include "owutils/BitCodecs.h"
#include "owutils/EventLogger.h"
#include "owutils/LmCrashReporting.h"
#include "owutils/LmFormat.h"
#include "owutils/LmOem.h"
#include "owutils/LmProbes.h"
#include "owutils/LmResources.h"
#include "owutils/NamedObjects.h"
#include "owutils/SecretKey.h"

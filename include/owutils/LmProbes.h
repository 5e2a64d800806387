// Environment probes: small exports through which client programs ask about their surroundings.
//
//   if (LmHasInternetConnection() && LmInternetCheckConnection(u"https://reports.example:8443/")) ...
//   switch (GetDriveDeviceType(u"D:\\")) { case LmDriveRemovable: ... }
//   Lumo::String domain, user;
//   ParseToDomainAndUser(u"CORP\\alice", domain, user);       // "CORP", "alice"
//   const char16_t* writer = LmGetExchangeWriterNameForVssQvr(Exchange2016);  // "ms-ex2016"
//
// None of them throws, except LmGetExchangeWriterNameForVssQvr for a version it does not know
// (UnexpectedValue). Failures of the system queries give false or LmDriveUnknown; IsWow64 reports
// a failure to the event logger registered as "LM_EVENT_HANDLER" and answers 0.
#pragma once

#include <cstdint>

#include "owutils/Export.h"
#include "owutils/tstring.h"

// The kind of device a drive is.
enum LmDriveType : std::int32_t {
  LmDriveUnknown = 0,    // not determined, and every failure
  LmDriveFixed = 1,      // fixed disk, or removable drive reporting fixed media
  LmDriveRemovable = 2,  // removable drive with removable media other than a floppy disk
  LmDriveRemote = 3,     // network drive
  LmDriveCdRom = 4,      // optical drive
  LmDriveRamDisk = 5,    // RAM disk
  LmDriveFloppy35 = 6,   // 3.5-inch floppy media (and the high-capacity media of that size)
  LmDriveFloppy525 = 7,  // 5.25-inch floppy media
  LmDriveFloppy8 = 8,    // 8-inch floppy media
};

enum ExchangeServerVersion : std::int32_t {
  Exchange2010 = 1,
  Exchange2013 = 2,
  Exchange2016 = 3,
};

// True when the system has a connection to the outside: a network interface that is up, has a
// routable address other than loopback, and carries a default route.
OWUTILS_API bool LmHasInternetConnection();

// True when a connection to the host and port of `url` can be made now (connect only, nothing
// is sent; the wait is bounded). False for a malformed or null address.
OWUTILS_API bool LmInternetCheckConnection(const char16_t* url);

// The kind of the drive whose root is `root` ("D:\\"; only the first character, the drive
// letter, is looked at). Drives that are not mapped, and every failure, give LmDriveUnknown.
OWUTILS_API LmDriveType GetDriveDeviceType(const char16_t* root);

// The name of the Exchange server's shadow-copy writer for `version` (a constant owned by the
// library). Raises UnexpectedValue for versions not listed in ExchangeServerVersion.
OWUTILS_API const char16_t* LmGetExchangeWriterNameForVssQvr(ExchangeServerVersion version);

// Splits "DOMAIN\user" (or, without a backslash, "DOMAIN/user") at the first separator. Without
// either separator (for instance "user@domain") `domain` and `user` are left as they were.
OWUTILS_API void ParseToDomainAndUser(const Lumo::String& account, Lumo::String& domain, Lumo::String& user);

// 1 when the process runs under WOW64, else 0.
OWUTILS_API int IsWow64();

// True exactly for application kind 2.
OWUTILS_API bool IsQRWApp(int kind);

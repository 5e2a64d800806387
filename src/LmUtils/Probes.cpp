// Environment probes: internet reachability, drive kinds, Exchange writer names, account names.
//
// Each probe is a thin layer over one platform query or one fixed table. The platform queries
// here read system tables and make connections; none of them dereferences caller memory beyond
// the NUL-terminated text it is given, so there is no access violation for a guard to catch.
#include "owutils/LmProbes.h"

#include "ErrorHandler/Reporting.h"
#include "owutils/Exceptions.h"
#include "owutils/Wow64.h"
#include "platform/Drives.h"
#include "platform/Network.h"

namespace {

// The drive kind for the first media type a removable drive reports (MEDIA_TYPE values).
LmDriveType FromMediaType(DWORD mediaType) {
  switch (mediaType) {
    case 1: case 6: case 7: case 8: case 9: case 10: case 15: case 16: case 19:
      return LmDriveFloppy525;
    case 2: case 3: case 4: case 5: case 13: case 14: case 17: case 18: case 20: case 21: case 23: case 24: case 25:
      return LmDriveFloppy35;
    case 11:
      return LmDriveRemovable;
    case 12:
      return LmDriveFixed;
    case 22:
      return LmDriveFloppy8;
    default:
      return LmDriveUnknown;
  }
}

}  // namespace

bool LmHasInternetConnection() {
  DWORD flags = 0;
  return Platform::InternetGetConnectedState(&flags, 0) == TRUE;
}

bool LmInternetCheckConnection(const char16_t* url) {
  return Platform::InternetCheckConnectionW(url, Platform::kFlagIccForceConnection, 0) == TRUE;
}

LmDriveType GetDriveDeviceType(const char16_t* root) {
  switch (Platform::GetDriveTypeW(root)) {
    case Platform::kDriveFixed: return LmDriveFixed;
    case Platform::kDriveRemote: return LmDriveRemote;
    case Platform::kDriveCdRom: return LmDriveCdRom;
    case Platform::kDriveRamDisk: return LmDriveRamDisk;
    case Platform::kDriveRemovable: break;
    default: return LmDriveUnknown;
  }
  // A removable drive is classified by the medium in it; without a drive letter there is no
  // device to ask.
  if (root == nullptr || root[0] == 0) return LmDriveUnknown;
  DWORD mediaType = 0;
  if (!Platform::GetDriveMediaType(root[0], &mediaType)) return LmDriveUnknown;
  return FromMediaType(mediaType);
}

const char16_t* LmGetExchangeWriterNameForVssQvr(ExchangeServerVersion version) {
  switch (version) {
    case Exchange2010: return u"MS-EX2010";
    case Exchange2013: return u"MS-EX2013";
    case Exchange2016: return u"ms-ex2016";
  }
  THROW_AT(LumoException::UnexpectedValue(Lumo::String(u"Exchange server version"), static_cast<int>(version)));
}

void ParseToDomainAndUser(const Lumo::String& account, Lumo::String& domain, Lumo::String& user) {
  size_t separator = account.find(u'\\');
  if (separator == Lumo::String::npos) separator = account.find(u'/');
  if (separator == Lumo::String::npos) return;
  // Built first, so that the outputs may be the very string being split.
  Lumo::String before = account.substr(0, separator);
  Lumo::String after = account.substr(separator + 1);
  domain = std::move(before);
  user = std::move(after);
}

int IsWow64() {
  try {
    return Wow64::IsWow64() ? 1 : 0;
  } catch (LumoException::Exception& e) {
    LumoException::detail::ReportToEventHandler(e, u"IsWow64");
    return 0;
  }
}

bool IsQRWApp(int kind) { return kind == 2; }

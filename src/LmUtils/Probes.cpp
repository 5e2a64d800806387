// Environment probes: internet reachability, drive kinds, Exchange writer names, account names.
//
// Each probe is a thin layer over one platform query or one fixed table. The platform queries
// here read system tables and make connections; none of them dereferences caller memory beyond
// the NUL-terminated text it is given, so there is no access violation for a guard to catch.
#include "owutils/LmProbes.h"

#include "owutils/Exceptions.h"
#include "platform/Network.h"

bool LmHasInternetConnection() {
  DWORD flags = 0;
  return Platform::InternetGetConnectedState(&flags, 0) == TRUE;
}

bool LmInternetCheckConnection(const char16_t* url) {
  return Platform::InternetCheckConnectionW(url, Platform::kFlagIccForceConnection, 0) == TRUE;
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

bool IsQRWApp(int kind) { return kind == 2; }

// ParseToDomainAndUser over arbitrary account text.
//
// Properties: with a backslash, the domain is the text before the first one and the user the
// text after it; without one but with a slash, the same at the first slash; without either,
// domain and user keep what they held. Nothing is lost: domain + separator + user is the text.
#include "FuzzSupport.h"
#include "owutils/LmProbes.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  FuzzedDataProvider input(data, size);
  const bool ascii = input.ConsumeBool();
  const std::string bytes = input.ConsumeRemainingBytesAsString();
  const Lumo::String account(OwFuzz::UpToNul(ascii ? OwFuzz::Latin1(bytes) : OwFuzz::Units(bytes)));

  Lumo::String domain(u"old domain");
  Lumo::String user(u"old user");
  ParseToDomainAndUser(account, domain, user);

  size_t at = account.find(u'\\');
  if (at == Lumo::String::npos) at = account.find(u'/');
  if (at == Lumo::String::npos) {
    FUZZ_CHECK(domain == u"old domain");
    FUZZ_CHECK(user == u"old user");
  } else {
    FUZZ_CHECK(domain == account.substr(0, at));
    FUZZ_CHECK(user == account.substr(at + 1));
  }

  // The same strings as account and results.
  Lumo::String same(account);
  ParseToDomainAndUser(same, same, user);
  return 0;
}

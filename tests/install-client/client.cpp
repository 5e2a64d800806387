// A tiny client program of OWUtils, built against an installed tree: formats a string, throws
// and catches one of the library's exceptions across the library boundary, and digests a text.
#include <cstdio>

#include "owutils/CEncrypt.h"
#include "owutils/Exceptions.h"
#include "owutils/tstring.h"

int main() {
  Lumo::String text;
  text.Format(u"%s %d", u"client", 19);
  std::printf("%s\n", text.ToUtf8().Get());
  try {
    PRECONDITION(text.empty());
  } catch (LumoException::PreconditionFailed0& e) {
    std::printf("caught %s\n", Lumo::String(e.GetType().name).ToUtf8().Get());
  }
  CEncrypt sha(DIGEST_SHA1, TRUE);
  sha.DigestString(CString(u"abc"));
  std::printf("sha1(abc) %s\n", Lumo::String(sha.GetDigestResultString().str()).ToUtf8().Get());
  return 0;
}

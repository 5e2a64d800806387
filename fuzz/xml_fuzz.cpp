// The XML exchange form: RemoteException read from arbitrary text, and ToXml of what it read.
//
// Properties: reading never throws and never crashes, whatever the text (malformed XML, deep
// nesting, odd attributes, long chains); what was read, written with ToXml and read again, has
// the same type, message, user message, history and causes, and writes the same XML again: the
// exchange form loses nothing that it carries.
#include "FuzzSupport.h"
#include "owutils/Exceptions.h"
#include "owutils/RemoteException.h"

namespace {

void CheckSame(const LumoException::Exception& a, const LumoException::Exception& b) {
  const LumoException::ExceptionType& ta = a.GetType();
  const LumoException::ExceptionType& tb = b.GetType();
  FUZZ_CHECK(Lumo::String(ta.name) == Lumo::String(tb.name));
  FUZZ_CHECK(Lumo::String(ta.module) == Lumo::String(tb.module));
  FUZZ_CHECK(ta.code == tb.code);
  FUZZ_CHECK(a.GetMessage() == b.GetMessage());
  FUZZ_CHECK(a.GetUserMessage() == b.GetUserMessage());
  FUZZ_CHECK(a.GetHistory().size() == b.GetHistory().size());
  FUZZ_CHECK((a.GetCause() == nullptr) == (b.GetCause() == nullptr));
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  if (size > 0 && (data[0] & 1) == 1) {
    // UTF-16 units, for text outside ASCII and unpaired surrogates.
    const std::u16string text = OwFuzz::UpToNul(OwFuzz::Units(std::string(reinterpret_cast<const char*>(data) + 1, size - 1)));
    LumoException::RemoteException remote{Lumo::String(text)};
    (void)LumoException::ToXml(remote);
    return 0;
  }
  // Bytes as characters: the markup is found much sooner.
  const std::u16string text = OwFuzz::UpToNul(OwFuzz::Latin1(std::string(reinterpret_cast<const char*>(data), size)));
  LumoException::RemoteException first{Lumo::String(text)};
  const Lumo::String xml = LumoException::ToXml(first);
  FUZZ_CHECK(!xml.empty());
  (void)first.ToString();

  LumoException::RemoteException second(xml);
  CheckSame(first, second);
  const Lumo::String xml2 = LumoException::ToXml(second);
  LumoException::RemoteException third(xml2);
  CheckSame(second, third);
  FUZZ_CHECK(LumoException::ToXml(third) == xml2);
  FUZZ_CHECK(third.ToString() == second.ToString());

  const LumoException::Exception* a = first.GetCause();
  const LumoException::Exception* b = third.GetCause();
  for (; a != nullptr && b != nullptr; a = a->GetCause(), b = b->GetCause()) CheckSame(*a, *b);
  return 0;
}

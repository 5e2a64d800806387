// The XML exchange form of exceptions, for passing an exception to another process.
//
// ToXml writes an exception, its history (newest first) and its whole cause chain as one
// `exception` element:
//
//   <exception name="PreconditionFailed0" module="Base" code="4">
//     <message>precondition violation for expression 'p != NULL'</message>
//     <usermessage>...</usermessage>            (only when set and not empty)
//     <history>
//       <event type="0" filename="Strings\tstring.cpp" linenumber="42"/>
//     </history>
//     <exception ...>...</exception>            (the cause, when there is one)
//   </exception>
//
// RemoteException re-creates an exception from such text on the receiving side. It reports the
// class name, module, code, message, user message, history and causes that were written, so its
// text and event-log forms read like those of the original:
//
//   try { ... } catch (LumoException::Exception& e) { SendToPeer(LumoException::ToXml(e)); }
//   ...
//   LumoException::RemoteException remote(ReceiveFromPeer());
//   remote.Report(u"peer");
//
// Neither direction throws. The received text is untrusted: text that is not XML, or that holds
// no `exception` element, leaves the whole text as the message and the class name
// "RemoteException"; at most 64 nested `exception` levels are read (deeper ones are ignored like
// a second cause), and text nested deeper than the reader is prepared to walk is not parsed.
#pragma once

#include <cstdint>
#include <memory>

#include "owutils/Exception.h"
#include "owutils/Export.h"
#include "owutils/tstring.h"

namespace LumoException {

// The XML text of `e` and its causes. A failure while writing ends the text where it happened
// (an empty text when it happened before printing started).
OWUTILS_API Lumo::String ToXml(const Exception& e);

class OWUTILS_API RemoteException : public Exception {
 public:
  // How many `exception` elements, counting the outermost, are read into a cause chain.
  static constexpr int kMaxChainDepth = 64;

  explicit RemoteException(const Lumo::String& xml);
  RemoteException(RemoteException&& other);
  ~RemoteException() override;

  // The type that was read from the XML, or the static "RemoteException" type when no name was.
  const ExceptionType& GetType() const override;
  [[noreturn]] void Throw(const char16_t* file, int line) override;
  RemoteException* Clone() override;

  static const ExceptionType& StaticType();

 private:
  struct EmptyTag {};
  explicit RemoteException(EmptyTag);

  // Points m_type at the names read, or at the static type while no name was read.
  void UpdateType() noexcept;
  template <typename Node>
  void ReadElement(const Node& element, int depth);

  // Owned copies of the names read, with stable addresses for m_type.
  std::unique_ptr<char16_t[]> m_pModule;
  std::unique_ptr<char16_t[]> m_pName;
  std::int32_t m_code = 0;
  ExceptionType m_type{u"", u"RemoteException", 0};
};

}  // namespace LumoException

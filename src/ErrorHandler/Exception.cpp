// The exception root: construction, the post-cloned state, history, text form and reporting.
#include "owutils/Exception.h"

#include <new>

#include "ErrorHandler/Reporting.h"
#include "owutils/Exceptions.h"
#include "platform/Debug.h"

namespace LumoException {
namespace {

// The shared state of every exception that was cloned or moved from. Built on first use and
// never destroyed, so that exceptions outliving static destruction still read correctly.
Lumo::String* PostClonedMessage() {
  static Lumo::String* message = new Lumo::String(u"invalid use of post-cloned exception");
  return message;
}
ExceptionHistory* PostClonedHistory() {
  static ExceptionHistory* history = new ExceptionHistory();
  return history;
}
const Lumo::String& EmptyString() {
  static const Lumo::String* empty = new Lumo::String();
  return *empty;
}

// Built while the library loads, before any client call can reach an exception.
[[maybe_unused]] const bool g_sharedStateBuilt = (PostClonedMessage(), PostClonedHistory(), EmptyString(), true);

constexpr ExceptionType kRootType{u"", u"Exception", 0};

}  // namespace

Exception::Exception() : m_pMessage(new Lumo::String()), m_pHistory(new ExceptionHistory()) {}

Exception::Exception(const char16_t* message)
    : m_pMessage(new Lumo::String(message)), m_pHistory(new ExceptionHistory()) {}

Exception::Exception(const char16_t* message, const Exception& cause) : Exception(detail::DeriveTag{}, &cause) {
  *m_pMessage = message;
}

Exception::Exception(detail::DeriveTag, const Exception* cause) : m_pMessage(nullptr), m_pHistory(nullptr) {
  // The cause is cloned first; the clone empties the caller's object, which is the documented
  // contract of wrapping (a const reference is taken so that temporaries can be wrapped too).
  if (cause != nullptr) m_pCause = const_cast<Exception*>(cause)->Clone();
  try {
    m_pMessage = new Lumo::String();
    m_pHistory = new ExceptionHistory();
  } catch (...) {
    delete m_pCause;
    delete m_pMessage;
    throw;
  }
}

Exception::Exception(Exception&& other)
    : m_pCause(other.m_pCause),
      m_pMessage(other.m_pMessage),
      m_pHistory(other.m_pHistory),
      m_pUserMessage(other.m_pUserMessage) {
  other.m_pCause = nullptr;
  other.m_pMessage = PostClonedMessage();
  other.m_pHistory = PostClonedHistory();
  other.m_pUserMessage = nullptr;
}

Exception::~Exception() {
  delete m_pCause;
  if (m_pMessage != PostClonedMessage()) delete m_pMessage;
  if (m_pHistory != PostClonedHistory()) delete m_pHistory;
  delete m_pUserMessage;
}

const Lumo::String& Exception::GetMessage() const { return *m_pMessage; }

const ExceptionType& Exception::StaticType() { return kRootType; }
const ExceptionType& Exception::GetType() const { return kRootType; }

void Exception::Throw(const char16_t* file, int line) {
  RecordThrow(file, line);
  throw Exception(std::move(*this));
}

Exception* Exception::Clone() { return new Exception(std::move(*this)); }

bool Exception::IsPostCloned() const noexcept { return m_pHistory == PostClonedHistory(); }

void Exception::RecordEvent(const char16_t* file, int line, std::int32_t kind) {
  // A post-cloned exception shares its empty history with every other one: drop the event.
  if (IsPostCloned()) return;
  m_pHistory->insert(m_pHistory->begin(), ExceptionEvent{ShortFileName(file), line, kind});
}

void Exception::AppendHistoryEvent(const ExceptionEvent& event) {
  if (IsPostCloned()) return;
  m_pHistory->push_back(event);
}

void Exception::AdoptCause(Exception* cause) noexcept {
  if (m_pCause != nullptr || IsPostCloned()) {
    delete cause;
    return;
  }
  m_pCause = cause;
}

void Exception::RecordThrow(const char16_t* file, int line) { RecordEvent(file, line, Thrown); }
void Exception::RecordCheckpoint(const char16_t* file, int line) { RecordEvent(file, line, Checkpointed); }

void Exception::SetMessage(const char16_t* text) {
  if (m_pMessage == PostClonedMessage()) {
    m_pMessage = new Lumo::String(text);
  } else {
    *m_pMessage = text;
  }
}

void Exception::FormatMessageText(const char16_t* format, ...) {
  Lumo::String text;
  va_list args;
  va_start(args, format);
  try {
    text.FormatV(format, args);
  } catch (...) {
    va_end(args);
    throw;
  }
  va_end(args);
  SetMessage(text.c_str());
}

void Exception::SetUserMessage(const char16_t* text) {
  if (m_pUserMessage == nullptr) {
    m_pUserMessage = new Lumo::String(text);
  } else {
    *m_pUserMessage = text;
  }
}

const Lumo::String& Exception::GetUserMessage() const {
  return m_pUserMessage != nullptr ? *m_pUserMessage : EmptyString();
}

void Exception::GetUserMessages(Lumo::StringList& messages) const {
  messages.clear();
  for (const Exception* e = this; e != nullptr; e = e->m_pCause) {
    if (e->m_pUserMessage != nullptr && !e->m_pUserMessage->empty()) messages.push_back(*e->m_pUserMessage);
  }
}

Lumo::String Exception::GetRootCauseId() const {
  const Exception* root = this;
  while (root->m_pCause != nullptr) root = root->m_pCause;
  Lumo::String id;
  id.Format(u"%s:%d", root->GetType().module, static_cast<int>(root->GetType().code));
  return id;
}

Lumo::String Exception::ToString() const {
  try {
    Lumo::String text;
    text.Format(u"exception %s : %s\n", GetType().name, GetMessage().c_str());
    for (const ExceptionEvent& event : GetHistory()) {
      text += event.kind == Thrown         ? u"    thrown from "
              : event.kind == Checkpointed ? u"    checkpointed at "
                                           : u"    unknown event at ";
      text.AppendFormat(u"%s (%d)\n", event.file.c_str(), static_cast<int>(event.line));
    }
    if (m_pCause != nullptr) {
      text += u"caused by ";
      text += m_pCause->ToString();
    }
    return text;
  } catch (...) {
    return Lumo::String(u"*** unable to format exception ***\n");
  }
}

void Exception::Report(const char16_t* text) const {
  if (detail::ReportToInstalledLogger(*this, text)) return;
  if (text != nullptr) Platform::OutputDebugStringW(text);
  Platform::OutputDebugStringW(ToString().c_str());
}

void Exception::ReportUnexpectedFailure(const char16_t* file, int catchLine, int tryLine) {
  RecordCheckpoint(file, tryLine);
  Lumo::String text;
  const Lumo::String shortFile = GetHistory().empty() ? ShortFileName(file) : GetHistory().front().file;
  text.Format(u"%s(%d) unexpected failure", shortFile.c_str(), catchLine);
  Report(text.c_str());
}

Lumo::String Exception::ShortFileName(const char16_t* path) {
  if (path == nullptr) return Lumo::String();
  const Lumo::String whole(path);
  auto isSeparator = [](char16_t c) { return c == u'\\' || c == u'/'; };
  size_t last = Lumo::String::npos;
  for (size_t i = whole.size(); i-- > 0;) {
    if (isSeparator(whole[i])) {
      last = i;
      break;
    }
  }
  if (last == Lumo::String::npos) return whole;
  // Search backwards from the character before the last separator, never looking at the first
  // character of the path.
  if (last >= 2) {
    for (size_t i = last - 1; i >= 1; --i) {
      if (isSeparator(whole[i])) return whole.substr(i + 1);
    }
  }
  return whole.substr(last + 1);
}

const char16_t* StructuredExceptionName(DWORD code) {
  switch (code) {
    case 0x80000001u: return u"GUARD_PAGE";
    case 0x80000002u: return u"DATATYPE_MISALIGNMENT";
    case 0x80000003u: return u"BREAKPOINT";
    case 0x80000004u: return u"SINGLE_STEP";
    case 0xC0000005u: return u"ACCESS_VIOLATION";
    case 0xC0000006u: return u"IN_PAGE_ERROR";
    case 0xC0000008u: return u"INVALID_HANDLE";
    case 0xC000001Du: return u"ILLEGAL_INSTRUCTION";
    case 0xC0000025u: return u"NONCONTINUABLE_EXCEPTION";
    case 0xC0000026u: return u"INVALID_DISPOSITION";
    case 0xC000008Cu: return u"ARRAY_BOUNDS_EXCEEDED";
    case 0xC000008Du: return u"FLT_DENORMAL_OPERAND";
    case 0xC000008Eu: return u"FLT_DIVIDE_BY_ZERO";
    case 0xC000008Fu: return u"FLT_INEXACT_RESULT";
    case 0xC0000090u: return u"FLT_INVALID_OPERATION";
    case 0xC0000091u: return u"FLT_OVERFLOW";
    case 0xC0000092u: return u"FLT_STACK_CHECK";
    case 0xC0000093u: return u"FLT_UNDERFLOW";
    case 0xC0000094u: return u"INT_DIVIDE_BY_ZERO";
    case 0xC0000095u: return u"INT_OVERFLOW";
    case 0xC0000096u: return u"PRIV_INSTRUCTION";
    case 0xC00000FDu: return u"STACK_OVERFLOW";
    default: return u"Unknown";
  }
}

int AccessViolationFilter(DWORD code, EXCEPTION_POINTERS* pointers, const char16_t* text) {
  if (code != EXCEPTION_ACCESS_VIOLATION) return EXCEPTION_CONTINUE_SEARCH;
  if (pointers == nullptr) return EXCEPTION_EXECUTE_HANDLER;
  try {
    AccessViolation violation(pointers);
    detail::ReportToEventHandler(violation, text);
  } catch (...) {
    // A filter must not throw; the violation is still claimed.
  }
  return EXCEPTION_EXECUTE_HANDLER;
}

namespace detail {

void ReportUnexpected(Exception* e, const char16_t* file, int catchLine, int tryLine) noexcept {
  try {
    if (e != nullptr) {
      e->ReportUnexpectedFailure(file, catchLine, tryLine);
    } else {
      UnhandledException unhandled;
      unhandled.ReportUnexpectedFailure(file, catchLine, tryLine);
    }
  } catch (...) {
    // Reporting is the last resort of destructors and cleanup blocks: it never raises.
  }
}

}  // namespace detail
}  // namespace LumoException

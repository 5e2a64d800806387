// LumoException::Exception, the root of every exception the library throws, and the macros
// through which all code throws, checks, passes on and reports them.
//
// An exception carries a message, an optional user message, an owned cause and a history of the
// source places it passed (newest first). Exceptions are thrown by value through the macros and
// caught by reference:
//
//   PRECONDITION(path != nullptr);
//   CHECKPOINT_TRY
//     DoWork();
//   CHECKPOINT_CATCH   // adds "checkpointed at" and "thrown from" entries, rethrows
//
//   try { ... } catch (LumoException::Exception& e) {
//     THROW_AT(UnableToCopyFile(from, to, e));   // wraps e as the cause; e is now post-cloned
//   }
//
// Cloning and moving leave the source "post-cloned": it then reads as the message
// "invalid use of post-cloned exception" with no history, cause or user message.
//
// The classes of the catalogue are in owutils/Exceptions.h.
#pragma once

#include <cstdint>
#include <vector>

#include "owutils/Export.h"
#include "owutils/WinTypes.h"
#include "owutils/tstring.h"

// The source file of the current translation unit, as a UTF-16 literal.
#define OW_WIDE_FILE (u"" __FILE__)

namespace LumoException {

// The static, immutable identity of an exception class.
struct ExceptionType {
  const char16_t* module;  // group the class belongs to; empty for the root class
  const char16_t* name;    // class name as shown in texts, logs and XML
  std::int32_t code;       // number of the class within its group
};

enum EventKind : std::int32_t { Thrown = 0, Checkpointed = 1 };

// One entry of an exception's history.
struct ExceptionEvent {
  Lumo::String file;  // shortened by Exception::ShortFileName
  std::int32_t line;
  std::int32_t kind;  // EventKind; other values print as "unknown event at"
};

using ExceptionHistory = std::vector<ExceptionEvent>;  // newest first

namespace detail {
struct DeriveTag {};  // selects the constructor through which catalogue classes build their root
}  // namespace detail

class OWUTILS_API Exception {
 public:
  Exception();
  explicit Exception(const char16_t* message);
  // Clones `cause` (leaving it post-cloned) and keeps the clone as this exception's cause.
  Exception(const char16_t* message, const Exception& cause);
  // Takes everything over; the source is left post-cloned.
  Exception(Exception&& other);
  Exception(const Exception&) = delete;
  Exception& operator=(const Exception&) = delete;
  Exception& operator=(Exception&&) = delete;
  virtual ~Exception();

  virtual const Lumo::String& GetMessage() const;
  virtual const ExceptionType& GetType() const;
  // Records the throw place, moves this object into a temporary of the same class and throws it.
  [[noreturn]] virtual void Throw(const char16_t* file, int line);
  // A new heap object of the same class, moved from this one (which is left post-cloned).
  virtual Exception* Clone();

  static const ExceptionType& StaticType();

  const Exception* GetCause() const noexcept { return m_pCause; }
  const ExceptionHistory& GetHistory() const noexcept { return *m_pHistory; }
  // True once the exception was cloned or moved from.
  bool IsPostCloned() const noexcept;

  void RecordThrow(const char16_t* file, int line);
  void RecordCheckpoint(const char16_t* file, int line);

  void SetMessage(const char16_t* text);
  void SetUserMessage(const char16_t* text);
  // The user message, or an empty string when none was set.
  const Lumo::String& GetUserMessage() const;
  // The non-empty user messages of this exception and its causes, outermost first.
  void GetUserMessages(Lumo::StringList& messages) const;
  // "module:code" of the innermost exception of the cause chain.
  Lumo::String GetRootCauseId() const;

  // The text form: "exception <name> : <message>\n", the history lines, then
  // "caused by " and the cause's own text form.
  Lumo::String ToString() const;

  // Hands the exception to the installed event logger, or without one writes `text` (when not
  // null) and the text form to the debugger output.
  void Report(const char16_t* text) const;
  // Records a checkpoint at `tryLine`, then reports "<file>(<catchLine>) unexpected failure".
  void ReportUnexpectedFailure(const char16_t* file, int catchLine, int tryLine);

  // The last directory name and the file name of a source path ("Strings\\tstring.cpp").
  // Both '\\' and '/' separate.
  static Lumo::String ShortFileName(const char16_t* path);

 protected:
  // Empty message; `cause`, when not null, is cloned and kept as the cause.
  Exception(detail::DeriveTag, const Exception* cause);

  // Replaces the message with formatted text (Lumo::String::Format conventions).
  void FormatMessageText(const char16_t* format, ...);

  // For exceptions re-created from another form (the XML exchange): appends `event` at the
  // oldest end of the history exactly as given, and adopts the heap object `cause` as the cause
  // (deleting it instead when there already is one). Both do nothing on a post-cloned exception.
  void AppendHistoryEvent(const ExceptionEvent& event);
  void AdoptCause(Exception* cause) noexcept;

 private:
  void RecordEvent(const char16_t* file, int line, std::int32_t kind);

  Exception* m_pCause = nullptr;
  Lumo::String* m_pMessage;
  ExceptionHistory* m_pHistory;
  Lumo::String* m_pUserMessage = nullptr;
};

// The fixed name of a structured-exception code ("ACCESS_VIOLATION"...), or "Unknown".
OWUTILS_API const char16_t* StructuredExceptionName(DWORD code);

// Structured-exception filter for access violations: code other than 0xC0000005 gives
// EXCEPTION_CONTINUE_SEARCH; otherwise the violation is reported as an AccessViolation to the
// logger registered as "LM_EVENT_HANDLER" (when `pointers` is not null) with `text`, and the
// result is EXCEPTION_EXECUTE_HANDLER.
OWUTILS_API int AccessViolationFilter(DWORD code, EXCEPTION_POINTERS* pointers, const char16_t* text);

}  // namespace LumoException

// --- Source-place macros ---------------------------------------------------------------------

#define THROW_AT(e) (e).Throw(OW_WIDE_FILE, __LINE__)

// The expression text is taken where the macro is written, before its macros (NULL...) expand.
#define OW_CHECK_(expr, text, Class, ...)                                                  \
  do {                                                                                     \
    if (!(expr)) {                                                                         \
      THROW_AT(::LumoException::Class(::Lumo::String(text) __VA_OPT__(, ) __VA_ARGS__));   \
    }                                                                                      \
  } while (false)

#define OW_VALUE_(v) static_cast<INT_PTR>(v)

#define PRECONDITION(expr) OW_CHECK_(expr, u"" #expr, PreconditionFailed0)
#define PRECONDITION1(expr, v) OW_CHECK_(expr, u"" #expr, PreconditionFailed1, OW_VALUE_(v))
#define PRECONDITION2(expr, a, b) OW_CHECK_(expr, u"" #expr, PreconditionFailed2, OW_VALUE_(a), OW_VALUE_(b))
#define ASSERTION(expr) OW_CHECK_(expr, u"" #expr, AssertionFailed0)
#define ASSERTION1(expr, v) OW_CHECK_(expr, u"" #expr, AssertionFailed1, OW_VALUE_(v))
#define ASSERTION2(expr, a, b) OW_CHECK_(expr, u"" #expr, AssertionFailed2, OW_VALUE_(a), OW_VALUE_(b))

// CHECKPOINT_TRY opens a block and remembers its line. CHECKPOINT_CATCH closes it: a library
// exception gets a "checkpointed at" entry for the opening line and a "thrown from" entry for
// the closing line, and travels on; other exception types pass through untouched.
// CATCH_AND_REPORT closes it instead by reporting the exception as an unexpected failure (a
// foreign one as UnhandledException) and continuing after the block; it never throws.
#define CHECKPOINT_TRY                  \
  {                                     \
    const int owCheckpointLine_ = __LINE__; \
    try {

#define CHECKPOINT_CATCH                                                \
  }                                                                     \
  catch (::LumoException::Exception & owCaught_) {                      \
    owCaught_.RecordCheckpoint(OW_WIDE_FILE, owCheckpointLine_);        \
    owCaught_.RecordThrow(OW_WIDE_FILE, __LINE__);                      \
    throw;                                                              \
  }                                                                     \
  }

#define CATCH_AND_REPORT                                                                       \
  }                                                                                            \
  catch (::LumoException::Exception & owCaught_) {                                             \
    ::LumoException::detail::ReportUnexpected(&owCaught_, OW_WIDE_FILE, __LINE__, owCheckpointLine_); \
  }                                                                                            \
  catch (...) {                                                                                \
    ::LumoException::detail::ReportUnexpected(nullptr, OW_WIDE_FILE, __LINE__, owCheckpointLine_); \
  }                                                                                            \
  }

namespace LumoException::detail {
// The body of CATCH_AND_REPORT: reports `e`, or a new UnhandledException when `e` is null.
// Swallows any failure of the report itself.
OWUTILS_API void ReportUnexpected(Exception* e, const char16_t* file, int catchLine, int tryLine) noexcept;
}  // namespace LumoException::detail

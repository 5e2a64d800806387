// The event logger: delivers exceptions and messages to the event log, the debugger output and
// message boxes, registers event sources, and reads event-log records back as display texts.
//
// One logger per process is the installed one; LumoException::Exception::Report hands
// exceptions to it. The library installs its own default logger when it is loaded, an
// LmDefaultEventLogger that writes to the debugger output only, and registers it in the
// named-object registry as "LM_EVENT_HANDLER" (owutils/NamedObjects.h); the library's exports
// report through whatever is registered there.
//
//   auto* logger = static_cast<LumoException::EventLogger*>(LmObjectGet(u"LM_EVENT_HANDLER"));
//   logger->ReportMessage(EVENTLOG_WARNING_TYPE, u"%1!s!", u"disk almost full");
//   try { ... } catch (LumoException::Exception& e) { logger->ReportException(e, u"Backup"); }
//
//   Lumo::StringList records;
//   DWORD next = 0;                       // 0: start at the oldest (or newest) record
//   logger->ReadEventLog(1, 10, true, records, next);   // ten records of "Application"
//
// A logger that writes event-log records needs a source: the full constructor with a source
// name registers it (and installs the logger), or a subclass sets it up with RegisterSource.
// All reporting and reading holds the logger's re-entrant lock, so texts from different threads
// are never interleaved.
#pragma once

#include <atomic>
#include <cstdarg>
#include <cstdint>
#include <mutex>
#include <thread>

#include "owutils/Exception.h"
#include "owutils/Export.h"
#include "owutils/WinTypes.h"
#include "owutils/tstring.h"

namespace LumoException {

// Where reports go; a logger has one set for exceptions and one for messages.
enum EventTargets : std::int32_t { ToEventLog = 1, ToDebugger = 2, ToMessageBox = 4 };

// A re-entrant lock with a hold count. Lock enters and counts; Unlock, when the calling thread
// holds the lock, uncounts and leaves (an Unlock without a matching Lock does nothing).
class OWUTILS_API CountedLock {
 public:
  CountedLock() = default;
  CountedLock(const CountedLock&) = delete;
  CountedLock& operator=(const CountedLock&) = delete;

  void Lock();
  void Unlock();
  // How often the calling thread holds the lock (0 when another thread or none holds it).
  int GetDepth() const;

 private:
  std::recursive_mutex m_cs;
  std::atomic<std::thread::id> m_owner{};
  int m_nDepth = 0;  // changed only by the owner
};

// Holds a CountedLock for a scope.
class CountedLockGuard {
 public:
  explicit CountedLockGuard(CountedLock& lock) : m_lock(lock) { m_lock.Lock(); }
  ~CountedLockGuard() { m_lock.Unlock(); }
  CountedLockGuard(const CountedLockGuard&) = delete;
  CountedLockGuard& operator=(const CountedLockGuard&) = delete;

 private:
  CountedLock& m_lock;
};

class OWUTILS_API EventLogger {
 public:
  // Size in units of the buffers texts are built in.
  static constexpr size_t kTextBufferSize = 6144;

  // Stores owner and source name, then Init(...): registers the source when a name is given and
  // installs this logger. Fails with AssertionFailed0 ("m_pEventLogger == NULL") while another
  // logger is installed.
  EventLogger(int exceptionTargets, int messageTargets, const char16_t* sourceName, const char16_t* messageFile,
              HWND owner, int exceptionEventId);
  // No targets, no source, not installed.
  EventLogger();
  EventLogger(const char16_t* sourceName, HWND owner);
  // Deregisters the source; uninstalls this logger when it is the installed one.
  virtual ~EventLogger();
  EventLogger(const EventLogger&) = delete;
  EventLogger& operator=(const EventLogger&) = delete;

  // Hooks for subclasses, called after each message and exception report; nothing here.
  virtual void OnMessage(const char16_t* text);
  virtual void OnException(const Exception& e, const char16_t* text);

  // --- Reporting -------------------------------------------------------------------------------
  // The event text (BuildEventText) to the exception targets; never throws for a failed delivery.
  void ReportException(const Exception& e, const char16_t* text);
  // FormatMessageW templates with inserts ("%1!s!"), laid out by WrapText, to the message
  // targets. Without an event id the id is 0xC0000000.
  void ReportMessage(WORD type, const char16_t* format, ...);
  void ReportMessage(WORD type, DWORD dataSize, void* data, const char16_t* format, ...);
  void ReportMessage(WORD type, DWORD eventId, const char16_t* format, ...);
  void ReportMessage(WORD type, DWORD eventId, DWORD dataSize, void* data, const char16_t* format, ...);
  void ReportMessageV(WORD type, DWORD eventId, DWORD dataSize, void* data, const char16_t* format, va_list args);
  // At most the first 16 strings as inserts of message `eventId` of the message file (debugger
  // and message box), and one event-log record. False when the record could not be written.
  bool ReportStrings(WORD type, DWORD eventId, const Lumo::StringList& strings, DWORD dataSize, void* data);
  bool ReportError(DWORD eventId, const Lumo::StringList& strings);
  // The system's text for `error`; false without a registered source or without a text.
  bool ReportSystemError(DWORD error);

  // --- Registration and reading ------------------------------------------------------------------
  // Writes the source's registry values (best effort) and registers it; raises
  // PreconditionFailed0 for empty arguments, Win32Error("RegisterEventSource").
  HANDLE RegisterSource(const Lumo::String& appName, const Lumo::String& msgFilePath);
  // The message file registered for `appName` in the Application log, or an empty string.
  Lumo::String GetEventMessageFile(const Lumo::String& appName);
  // Up to `maxRecords` records of log 1 "Application", 2 "Security" or 3 "System" as texts
  // "[source - time - type]\ntext". `recordNumber` 0 starts at the oldest (forwards) or newest
  // record, otherwise at that record; afterwards it names the record to continue with. Raises
  // EventLogFailure for "OpenEventLog" and "ReadEventLog" failures.
  void ReadEventLog(int logType, unsigned maxRecords, bool forwards, Lumo::StringList& records, DWORD& recordNumber);

  // --- Texts -----------------------------------------------------------------------------------
  // The event-log form of an exception: "Exception '<module:code>'" (with "(<text>)"), then per
  // exception of the cause chain its class and message and its history ("THROWN FROM",
  // "RETHROWN FROM", "CHECKPOINTED AT"), newest first.
  static Lumo::String BuildEventText(const Exception& e, const char16_t* text);
  // Breaks `in` into lines of at most 90 units; continuation lines are indented by 20 blanks.
  // `out` holds `outSize` units; text that does not fit is cut.
  static void WrapText(const char16_t* in, char16_t* out, size_t outSize = kTextBufferSize);
  // "[source - time - type]\ntext", the time in the form of ctime without its line end.
  static Lumo::String FormatRecord(const char16_t* pEventSrcName, DWORD timeGenerated, const char16_t* pFormattedText,
                                   WORD eventType);
  // The same with the insertion strings, one per line, as the text.
  static Lumo::String FormatRecordFromInserts(const char16_t* pEventSrcName, DWORD timeGenerated,
                                              const char16_t* const* pStrings, size_t count, WORD eventType);

  // The installed logger, or null.
  static EventLogger* GetInstalledLogger() noexcept { return m_pEventLogger.load(); }

 protected:
  void Init(int exceptionTargets, int messageTargets, const char16_t* messageFile, int exceptionEventId);
  // Installs `logger` (null: none) in place of the installed one, for hosts that take reporting
  // over; returns the logger installed before.
  static EventLogger* SetInstalledLogger(EventLogger* logger) noexcept { return m_pEventLogger.exchange(logger); }

  std::int32_t m_nExceptionTargets = 0;
  std::int32_t m_nMessageTargets = 0;
  HWND m_hOwnerWindow = nullptr;
  HANDLE m_hEventSource = nullptr;
  Lumo::String m_strSourceName;
  Lumo::String m_strMessageFile;
  std::int32_t m_nExceptionEventId = 0;
  CountedLock m_lock;

 private:
  static std::atomic<EventLogger*> m_pEventLogger;
};

// The library's default logger: exceptions and messages to the debugger output only.
class OWUTILS_API LmDefaultEventLogger : public EventLogger {
 public:
  LmDefaultEventLogger();
  ~LmDefaultEventLogger() override;
};

}  // namespace LumoException

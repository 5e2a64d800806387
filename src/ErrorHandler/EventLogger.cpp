// The event logger: exception and message reports, source registration, reading the event log.
#include "owutils/EventLogger.h"

#include <cstdio>
#include <cstring>
#include <map>
#include <memory>
#include <vector>

#include "owutils/Exceptions.h"
#include "platform/Debug.h"
#include "platform/Errors.h"
#include "platform/EventLog.h"
#include "platform/Messages.h"
#include "platform/Modules.h"
#include "owutils/Registry.h"

namespace LumoException {

std::atomic<EventLogger*> EventLogger::m_pEventLogger{nullptr};

namespace {

// Where backwards reading goes on after the oldest record: a number no record has.
constexpr DWORD kPastOldestRecord = 0xFFFFFFFFu;

constexpr size_t kMaxWriteInserts = 16;
constexpr size_t kMaxReadInserts = 50;
constexpr size_t kSystemTextSize = 2048;
constexpr size_t kReadBufferSize = 4096;
constexpr size_t kMaxPath = 260;
constexpr DWORD kDefaultEventId = 0xC0000000u;
constexpr DWORD kSystemErrorEventId = 0xC0000001u;
constexpr UINT kStyleError = 0x1010;        // MB_ICONHAND | MB_SYSTEMMODAL
constexpr UINT kStyleWarning = 0x1030;      // MB_ICONEXCLAMATION | MB_SYSTEMMODAL
constexpr UINT kStyleInformation = 0x1040;  // MB_ICONASTERISK | MB_SYSTEMMODAL
constexpr UINT kStylePlain = 0x1000;        // MB_SYSTEMMODAL
constexpr int kWrapWidth = 90;
constexpr int kWrapIndent = 20;

const char16_t* const kSourceKeyFormat = u"SYSTEM\\CurrentControlSet\\Services\\EventLog\\%s\\%s";

UINT MessageBoxStyle(WORD type) {
  switch (type) {
    case EVENTLOG_ERROR_TYPE:
    case EVENTLOG_AUDIT_FAILURE:
      return kStyleError;
    case EVENTLOG_WARNING_TYPE:
      return kStyleWarning;
    case EVENTLOG_INFORMATION_TYPE:
    case EVENTLOG_AUDIT_SUCCESS:
      return kStyleInformation;
    default:
      return kStylePlain;
  }
}

// FormatMessageW from a string with an argument array, into the rest of a buffer; 0 when the
// piece does not fit (or cannot be formatted), which then writes nothing.
DWORD FormatPiece(char16_t* at, size_t room, const char16_t* format, std::initializer_list<DWORD_PTR> inserts) {
  std::vector<DWORD_PTR> args(inserts);
  return Platform::FormatMessageW(FORMAT_MESSAGE_FROM_STRING | FORMAT_MESSAGE_ARGUMENT_ARRAY, format, 0, 0, at,
                                  static_cast<DWORD>(room), reinterpret_cast<va_list*>(args.data()));
}

DWORD_PTR Arg(const char16_t* text) { return reinterpret_cast<DWORD_PTR>(text); }

std::string ToNarrow(const Lumo::String& text) {
  try {
    Lumo::CharArrayHolder utf8 = text.ToUtf8();
    return utf8.Get() == nullptr ? std::string() : std::string(utf8.Get());
  } catch (...) {
    return std::string();
  }
}

// Closes a registry key at the end of a scope.
struct AutoRegKey {
  HKEY key = nullptr;
  ~AutoRegKey() {
    if (key != nullptr) Platform::RegCloseKey(key);
  }
};

// Reads a string value of at most `maxUnits` units (with its terminator); false when missing,
// too long or not a string.
bool ReadStringValue(HKEY key, const char16_t* name, size_t maxUnits, Lumo::String& value) {
  std::vector<char16_t> buffer(maxUnits + 1, u'\0');
  DWORD size = static_cast<DWORD>(maxUnits * sizeof(char16_t));
  DWORD type = 0;
  if (Platform::RegQueryValueExW(key, name, nullptr, &type, reinterpret_cast<BYTE*>(buffer.data()), &size) !=
      ERROR_SUCCESS) {
    return false;
  }
  if (type != REG_SZ && type != REG_EXPAND_SZ) return false;
  // The stored bytes need not end in a terminator: the spare unit of the buffer gives one.
  value.assign(buffer.data());
  return !value.empty();
}

constexpr DWORD kDontResolveDllReferences = 0x00000001;  // DONT_RESOLVE_DLL_REFERENCES

// Message modules are loaded as data files: for their message tables, running none of their code.
HMODULE LoadMessageModule(const Lumo::String& path) {
  return Platform::LoadLibraryExW(path.c_str(), nullptr, kDontResolveDllReferences | Platform::kLoadLibraryAsDatafile);
}

void FreeMessageModule(HMODULE module) { Platform::FreeLibrary(module); }

// The message module of a log's source, located through the source's registry key: its
// "EventMessageFile", or the "MessageFileName" of the publisher its "ProviderGuid" names.
// The path of the module, or empty.
Lumo::String MessageModulePath(const char16_t* logName, const Lumo::String& source) {
  Lumo::String keyName;
  keyName.Format(kSourceKeyFormat, logName, source.c_str());
  AutoRegKey key;
  if (Platform::RegOpenKeyExW(HKEY_LOCAL_MACHINE, keyName.c_str(), 0, KEY_READ, &key.key) != ERROR_SUCCESS) return {};
  Lumo::String path;
  if (!ReadStringValue(key.key, u"EventMessageFile", kMaxPath, path)) {
    Lumo::String guid;
    if (!ReadStringValue(key.key, u"ProviderGuid", kMaxPath, guid)) return {};
    Lumo::String publisherName;
    publisherName.Format(u"SOFTWARE\\Microsoft\\Windows\\CurrentVersion\\WINEVT\\Publishers\\%s", guid.c_str());
    AutoRegKey publisher;
    if (Platform::RegOpenKeyExW(HKEY_LOCAL_MACHINE, publisherName.c_str(), 0, KEY_READ, &publisher.key) != ERROR_SUCCESS)
      return {};
    if (!ReadStringValue(publisher.key, u"MessageFileName", kMaxPath, path)) return {};
  }
  char16_t expanded[kMaxPath];
  DWORD n = Platform::ExpandEnvironmentStringsW(path.c_str(), expanded, kMaxPath);
  if (n != 0 && n <= kMaxPath) path = expanded;
  return path;
}

const char16_t* LogName(int logType) {
  switch (logType) {
    case 1: return u"Application";
    case 2: return u"Security";
    case 3: return u"System";
    default: return nullptr;
  }
}

}  // namespace

// ---- CountedLock ------------------------------------------------------------------------------

void CountedLock::Lock() {
  m_cs.lock();
  m_owner.store(std::this_thread::get_id(), std::memory_order_relaxed);
  ++m_nDepth;
}

void CountedLock::Unlock() {
  // Only the holder may release; a stray release by another thread must not leave the
  // critical section it does not own.
  if (m_owner.load(std::memory_order_relaxed) != std::this_thread::get_id() || m_nDepth <= 0) return;
  if (--m_nDepth == 0) m_owner.store(std::thread::id(), std::memory_order_relaxed);
  m_cs.unlock();
}

int CountedLock::GetDepth() const {
  return m_owner.load(std::memory_order_relaxed) == std::this_thread::get_id() ? m_nDepth : 0;
}

// ---- Construction -----------------------------------------------------------------------------

EventLogger::EventLogger(int exceptionTargets, int messageTargets, const char16_t* sourceName,
                         const char16_t* messageFile, HWND owner, int exceptionEventId)
    : m_hOwnerWindow(owner), m_strSourceName(sourceName) {
  Init(exceptionTargets, messageTargets, messageFile, exceptionEventId);
}

EventLogger::EventLogger() = default;

EventLogger::EventLogger(const char16_t* sourceName, HWND owner) : m_hOwnerWindow(owner), m_strSourceName(sourceName) {}

EventLogger::~EventLogger() {
  if (m_hEventSource != nullptr) Platform::DeregisterEventSource(m_hEventSource);
  // Only this logger's own installation ends with it: a logger that was never installed leaves
  // the installed one in place.
  EventLogger* self = this;
  m_pEventLogger.compare_exchange_strong(self, nullptr);
}

void EventLogger::Init(int exceptionTargets, int messageTargets, const char16_t* messageFile, int exceptionEventId) {
  ASSERTION(m_pEventLogger == NULL);
  m_nExceptionTargets = exceptionTargets;
  m_nMessageTargets = messageTargets;
  CHECKPOINT_TRY
    try {
      if (messageFile != nullptr) m_strMessageFile = messageFile;
      if (!m_strSourceName.empty()) {
        m_hEventSource = RegisterSource(m_strSourceName, m_strMessageFile);
        m_nExceptionEventId = exceptionEventId;
      }
      if (((exceptionTargets | messageTargets) & ToMessageBox) != 0 && m_hOwnerWindow != nullptr &&
          !Platform::IsWindow(m_hOwnerWindow)) {
        THROW_AT(Exception(u"Handle is not a window"));
      }
    } catch (Exception& e) {
      if (m_hEventSource != nullptr) {
        Platform::DeregisterEventSource(m_hEventSource);
        m_hEventSource = nullptr;
      }
      Platform::OutputDebugStringW(u"\r\nFailed to create EventLogger!\r\n");
      Platform::OutputDebugStringW(e.GetMessage().c_str());
      Platform::OutputDebugStringW(u"\r\n");
      std::fputs("Failed to create EventLogger!\n", stdout);
      std::fprintf(stdout, "%s\n", ToNarrow(e.GetMessage()).c_str());
      std::fflush(stdout);
      throw;
    }
  CHECKPOINT_CATCH
  m_pEventLogger = this;
}

void EventLogger::OnMessage(const char16_t*) {}
void EventLogger::OnException(const Exception&, const char16_t*) {}

// ---- Registration -----------------------------------------------------------------------------

HANDLE EventLogger::RegisterSource(const Lumo::String& appName, const Lumo::String& msgFilePath) {
  if (appName.empty()) THROW_AT(PreconditionFailed0(Lumo::String(u"!appName.IsEmpty()")));
  if (msgFilePath.empty()) THROW_AT(PreconditionFailed0(Lumo::String(u"!msgFilePath.IsEmpty()")));
  Lumo::String keyName;
  keyName.Format(kSourceKeyFormat, u"Application", appName.c_str());
  AutoRegKey key;
  DWORD disposition = 0;
  // The values are best effort: registration goes on without them.
  if (Platform::RegCreateKeyExW(HKEY_LOCAL_MACHINE, keyName.c_str(), 0, nullptr, REG_OPTION_NON_VOLATILE,
                                KEY_QUERY_VALUE | KEY_SET_VALUE, nullptr, &key.key, &disposition) == ERROR_SUCCESS) {
    Platform::RegSetValueExW(key.key, u"EventMessageFile", 0, REG_SZ, reinterpret_cast<const BYTE*>(msgFilePath.c_str()),
                             static_cast<DWORD>((msgFilePath.size() + 1) * sizeof(char16_t)));
    const DWORD types = 7;
    Platform::RegSetValueExW(key.key, u"TypesSupported", 0, REG_DWORD, reinterpret_cast<const BYTE*>(&types),
                             sizeof types);
  }
  HANDLE source = Platform::RegisterEventSourceW(nullptr, appName.c_str());
  if (source == nullptr) THROW_AT(Win32Error(u"RegisterEventSource"));
  return source;
}

Lumo::String EventLogger::GetEventMessageFile(const Lumo::String& appName) {
  if (appName.empty()) THROW_AT(PreconditionFailed0(Lumo::String(u"!appName.IsEmpty()")));
  Lumo::String keyName;
  keyName.Format(kSourceKeyFormat, u"Application", appName.c_str());
  AutoRegKey key;
  if (Platform::RegOpenKeyExW(HKEY_LOCAL_MACHINE, keyName.c_str(), 0, KEY_READ, &key.key) != ERROR_SUCCESS) return {};
  DWORD type = 0, size = 0;
  if (Platform::RegQueryValueExW(key.key, u"EventMessageFile", nullptr, &type, nullptr, &size) != ERROR_SUCCESS ||
      type != REG_SZ) {
    return {};
  }
  std::vector<char16_t> buffer(size / sizeof(char16_t) + 1, u'\0');
  if (Platform::RegQueryValueExW(key.key, u"EventMessageFile", nullptr, &type, reinterpret_cast<BYTE*>(buffer.data()),
                                 &size) != ERROR_SUCCESS) {
    return {};
  }
  return Lumo::String(buffer.data());
}

// ---- Texts ------------------------------------------------------------------------------------

Lumo::String EventLogger::BuildEventText(const Exception& e, const char16_t* text) {
  std::vector<char16_t> buffer(kTextBufferSize, u'\0');
  size_t length = 0;
  // Adds one piece; false when building is to stop (nothing written at all, or a full buffer).
  auto add = [&](const char16_t* format, std::initializer_list<DWORD_PTR> inserts) {
    length += FormatPiece(buffer.data() + length, kTextBufferSize - length, format, inserts);
    return length != 0 && length + 1 < kTextBufferSize;
  };
  const Lumo::String id = e.GetRootCauseId();
  bool going = text == nullptr || *text == 0
                   ? add(u"Exception '%1!s!'\r\n\r\n", {Arg(id.c_str())})
                   : add(u"Exception '%1!s!'\r\n(%2!s!)\r\n\r\n", {Arg(id.c_str()), Arg(text)});
  for (const Exception* current = &e; going && current != nullptr; current = current->GetCause()) {
    going = add(current == &e ? u"%1!s! : %2!s!\r\n" : u"CAUSED BY %1!s! : %2!s!\r\n",
                {Arg(current->GetType().name), Arg(current->GetMessage().c_str())});
    const ExceptionHistory& history = current->GetHistory();
    // The oldest "thrown" entry is where the exception was first thrown; every later one rethrew.
    size_t oldestThrow = history.size();
    for (size_t i = history.size(); i-- > 0;) {
      if (history[i].kind == Thrown) {
        oldestThrow = i;
        break;
      }
    }
    for (size_t i = 0; going && i < history.size(); ++i) {
      const ExceptionEvent& event = history[i];
      const char16_t* prefix = event.kind == Thrown         ? (i == oldestThrow ? u"THROWN FROM " : u"RETHROWN FROM ")
                               : event.kind == Checkpointed ? u"CHECKPOINTED AT "
                                                            : u"UNKNOWN EVENT AT ";
      going = add(u"    --> %1!s! %2!s!(%3!d!)\r\n",
                  {Arg(prefix), Arg(event.file.c_str()), static_cast<DWORD_PTR>(static_cast<DWORD>(event.line))});
    }
  }
  // A text that filled the buffer keeps the whole pieces that fitted.
  return Lumo::String(buffer.data(), length);
}

void EventLogger::WrapText(const char16_t* in, char16_t* out, size_t outSize) {
  if (out == nullptr || outSize == 0) return;
  out[0] = 0;
  if (in == nullptr) return;
  Lumo::String lineBreak;
  Lumo::String indentFormat;
  indentFormat.Format(u"\r\n%%%ds", kWrapIndent);
  lineBreak.Format(indentFormat.c_str(), u"");

  size_t length = 0;
  bool full = false;
  auto put = [&](const char16_t* s, size_t n) {
    for (size_t i = 0; i < n && !full; ++i) {
      if (length + 1 >= outSize) {
        full = true;  // cut at the last unit
        break;
      }
      out[length++] = s[i];
    }
  };
  auto putWord = [&](const char16_t* word) {
    put(word, std::char_traits<char16_t>::length(word));
    put(u" ", 1);
  };

  Lumo::WhitespaceTokenizer tokens(in);
  int budget = kWrapWidth;
  bool wroteWord = false;
  for (size_t t = 0; t < tokens.GetTokenCount() && !full; ++t) {
    const char16_t* token = tokens.GetToken(t);
    if (Lumo::WhitespaceTokenizer::IsSeparator(token[0])) {
      if (token[0] == u'\n') {
        put(lineBreak.c_str(), lineBreak.size());
        budget = kWrapWidth;
      }
      continue;
    }
    const int cost = static_cast<int>(std::char_traits<char16_t>::length(token)) + 1;
    budget -= cost;
    if (budget < 1) {
      put(lineBreak.c_str(), lineBreak.size());
      budget = kWrapWidth;
      if (cost < kWrapWidth) {
        putWord(token);
        budget -= cost;
      } else {
        putWord(token);
        put(lineBreak.c_str(), lineBreak.size());
      }
    } else {
      putWord(token);
    }
    wroteWord = true;
  }
  if (!full && wroteWord) put(u"\r\n", 2);
  out[length] = 0;
}

Lumo::String EventLogger::FormatRecord(const char16_t* pEventSrcName, DWORD timeGenerated,
                                       const char16_t* pFormattedText, WORD eventType) {
  ASSERTION(pEventSrcName != NULL);
  ASSERTION(pFormattedText != NULL);
  std::u16string time;
  if (!Platform::CTimeText(static_cast<std::int64_t>(timeGenerated), time)) time.clear();
  const size_t end = time.find(u'\n');
  if (end != std::u16string::npos) time.erase(end);
  const char16_t* typeName = eventType == EVENTLOG_ERROR_TYPE           ? u"Error"
                             : eventType == EVENTLOG_WARNING_TYPE       ? u"Warning"
                             : eventType == EVENTLOG_INFORMATION_TYPE   ? u"Information"
                             : eventType == EVENTLOG_AUDIT_SUCCESS      ? u"Audit Success"
                             : eventType == EVENTLOG_AUDIT_FAILURE      ? u"Audit Failure"
                                                                        : u"Unknown";
  // Built by concatenation: a record's text has no length limit of its own.
  Lumo::String record(u"[");
  record += pEventSrcName;
  record += u" - ";
  record += time;
  record += u" - ";
  record += typeName;
  record += u"]\n";
  record += pFormattedText;
  return record;
}

Lumo::String EventLogger::FormatRecordFromInserts(const char16_t* pEventSrcName, DWORD timeGenerated,
                                                  const char16_t* const* pStrings, size_t count, WORD eventType) {
  ASSERTION(pStrings != NULL);
  Lumo::String joined;
  for (size_t i = 0; i < count; ++i) {
    ASSERTION(pStrings[i] != NULL);
    if (i != 0) joined += u"\n";
    joined += pStrings[i];
  }
  return FormatRecord(pEventSrcName, timeGenerated, joined.c_str(), eventType);
}

// ---- Reporting --------------------------------------------------------------------------------

void EventLogger::ReportException(const Exception& e, const char16_t* text) {
  CountedLockGuard guard(m_lock);
  if ((m_nExceptionTargets & (ToEventLog | ToDebugger | ToMessageBox)) != 0) {
    try {
      const Lumo::String eventText = BuildEventText(e, text);
      if ((m_nExceptionTargets & ToEventLog) != 0) {
        ReportStrings(EVENTLOG_ERROR_TYPE, static_cast<DWORD>(m_nExceptionEventId), Lumo::StringList{eventText}, 0,
                      nullptr);
      }
      if ((m_nExceptionTargets & ToMessageBox) != 0) {
        Platform::MessageBoxW(m_hOwnerWindow, eventText.c_str(), nullptr, kStyleError);
      }
      if ((m_nExceptionTargets & ToDebugger) != 0) Platform::OutputDebugStringW(eventText.c_str());
    } catch (...) {
      // A report that cannot be delivered is dropped; reporting never raises.
    }
  }
  OnException(e, text);
}

void EventLogger::ReportMessage(WORD type, const char16_t* format, ...) {
  va_list args;
  va_start(args, format);
  ReportMessageV(type, kDefaultEventId, 0, nullptr, format, args);
  va_end(args);
}

void EventLogger::ReportMessage(WORD type, DWORD dataSize, void* data, const char16_t* format, ...) {
  va_list args;
  va_start(args, format);
  ReportMessageV(type, kDefaultEventId, dataSize, data, format, args);
  va_end(args);
}

void EventLogger::ReportMessage(WORD type, DWORD eventId, const char16_t* format, ...) {
  va_list args;
  va_start(args, format);
  ReportMessageV(type, eventId, 0, nullptr, format, args);
  va_end(args);
}

void EventLogger::ReportMessage(WORD type, DWORD eventId, DWORD dataSize, void* data, const char16_t* format, ...) {
  va_list args;
  va_start(args, format);
  ReportMessageV(type, eventId, dataSize, data, format, args);
  va_end(args);
}

void EventLogger::ReportMessageV(WORD type, DWORD eventId, DWORD dataSize, void* data, const char16_t* format,
                                 va_list args) {
  CountedLockGuard guard(m_lock);
  if (format == nullptr) return;
  std::vector<char16_t> text(kTextBufferSize, u'\0');
  std::vector<char16_t> laidOut(kTextBufferSize, u'\0');
  va_list copy;
  va_copy(copy, args);
  DWORD n = Platform::FormatMessageW(FORMAT_MESSAGE_FROM_STRING, format, 0, 0, text.data(),
                                     static_cast<DWORD>(kTextBufferSize), &copy);
  va_end(copy);
  if (n == 0) return;
  try {
    WrapText(text.data(), laidOut.data(), kTextBufferSize);
  } catch (...) {
    return;
  }
  if ((m_nMessageTargets & ToMessageBox) != 0) {
    Platform::MessageBoxW(m_hOwnerWindow, laidOut.data(), m_strSourceName.c_str(), MessageBoxStyle(type));
  }
  if ((m_nMessageTargets & ToDebugger) != 0) Platform::OutputDebugStringW(laidOut.data());
  OnMessage(laidOut.data());
  if ((m_nMessageTargets & ToEventLog) != 0 && m_hEventSource != nullptr) {
    const char16_t* strings[] = {laidOut.data()};
    Platform::ReportEventW(m_hEventSource, type, 0, eventId, nullptr, 1, dataSize, strings, data);
  }
}

bool EventLogger::ReportStrings(WORD type, DWORD eventId, const Lumo::StringList& strings, DWORD dataSize, void* data) {
  CountedLockGuard guard(m_lock);
  const size_t count = strings.size() < kMaxWriteInserts ? strings.size() : kMaxWriteInserts;
  std::vector<const char16_t*> inserts(count);
  for (size_t i = 0; i < count; ++i) inserts[i] = strings[i].c_str();

  if ((m_nMessageTargets & (ToDebugger | ToMessageBox)) != 0) {
    HMODULE module = m_strMessageFile.empty() ? nullptr : LoadMessageModule(m_strMessageFile);
    // The message may name inserts the caller did not pass: those read as empty strings.
    std::vector<DWORD_PTR> args(99, Arg(u""));
    for (size_t i = 0; i < count; ++i) args[i] = Arg(inserts[i]);
    std::vector<char16_t> text(kTextBufferSize, u'\0');
    DWORD n = module == nullptr
                  ? 0
                  : Platform::FormatMessageW(FORMAT_MESSAGE_FROM_HMODULE | FORMAT_MESSAGE_ARGUMENT_ARRAY, module, eventId,
                                             0, text.data(), static_cast<DWORD>(kTextBufferSize),
                                             reinterpret_cast<va_list*>(args.data()));
    if (n != 0) {
      if ((m_nMessageTargets & ToDebugger) != 0) Platform::OutputDebugStringW(text.data());
      if ((m_nMessageTargets & ToMessageBox) != 0) {
        Platform::MessageBoxW(m_hOwnerWindow, text.data(), m_strSourceName.c_str(), MessageBoxStyle(type));
      }
    } else {
      if ((m_nMessageTargets & ToDebugger) != 0) {
        for (const char16_t* s : inserts) Platform::OutputDebugStringW(s);
      }
      if ((m_nMessageTargets & ToMessageBox) != 0) {
        Lumo::String all;
        for (const char16_t* s : inserts) all += s;
        Platform::MessageBoxW(m_hOwnerWindow, all.c_str(), m_strSourceName.c_str(), MessageBoxStyle(type));
      }
    }
    if (module != nullptr) FreeMessageModule(module);
  }
  if ((m_nMessageTargets & ToEventLog) == 0) return true;
  if (m_hEventSource == nullptr) return false;
  return Platform::ReportEventW(m_hEventSource, type, 0, eventId, nullptr, static_cast<WORD>(count), dataSize,
                                inserts.data(), data) != FALSE;
}

bool EventLogger::ReportError(DWORD eventId, const Lumo::StringList& strings) {
  return ReportStrings(EVENTLOG_ERROR_TYPE, eventId, strings, 0, nullptr);
}

bool EventLogger::ReportSystemError(DWORD error) {
  CountedLockGuard guard(m_lock);
  if (m_hEventSource == nullptr) return false;
  std::vector<char16_t> text(kSystemTextSize, u'\0');
  if (Platform::FormatMessageW(FORMAT_MESSAGE_FROM_SYSTEM | FORMAT_MESSAGE_IGNORE_INSERTS, nullptr, error, 0,
                               text.data(), static_cast<DWORD>(kSystemTextSize), nullptr) == 0) {
    return false;
  }
  if ((m_nMessageTargets & ToMessageBox) != 0) {
    Platform::MessageBoxW(m_hOwnerWindow, text.data(), u"System Event", kStyleError);
  }
  if ((m_nMessageTargets & ToDebugger) != 0) Platform::OutputDebugStringW(text.data());
  OnMessage(text.data());
  return ReportStrings(EVENTLOG_ERROR_TYPE, kSystemErrorEventId, Lumo::StringList{Lumo::String(text.data())}, 0, nullptr);
}

// ---- Reading ----------------------------------------------------------------------------------

void EventLogger::ReadEventLog(int logType, unsigned maxRecords, bool forwards, Lumo::StringList& records,
                               DWORD& recordNumber) {
  records.clear();
  // Scope-bound holders: the lock, the open log and the loaded message modules are released on
  // every way out.
  struct LogCloser {
    HANDLE log = nullptr;
    ~LogCloser() {
      if (log != nullptr) Platform::CloseEventLog(log);
    }
  };
  struct ModuleCache {
    std::map<Lumo::String, HMODULE> modules;  // by source; null when the source has none
    ~ModuleCache() {
      for (auto& entry : modules) {
        if (entry.second != nullptr) FreeMessageModule(entry.second);
      }
    }
  };
  try {
    CHECKPOINT_TRY
      const char16_t* logName = LogName(logType);
      if (logName == nullptr) THROW_AT(UnexpectedValue(u"EventLogType", logType));
      CountedLockGuard guard(m_lock);
      LogCloser log;
      log.log = Platform::OpenEventLogW(nullptr, logName);
      if (log.log == nullptr) THROW_AT(EventLogFailure(u"OpenEventLog", static_cast<int>(Platform::GetLastError())));

      std::vector<BYTE> buffer(kReadBufferSize);
      ModuleCache cache;
      DWORD flags = (recordNumber != 0 ? EVENTLOG_SEEK_READ : EVENTLOG_SEQUENTIAL_READ) |
                    (forwards ? EVENTLOG_FORWARDS_READ : EVENTLOG_BACKWARDS_READ);
      const DWORD direction = forwards ? EVENTLOG_FORWARDS_READ : EVENTLOG_BACKWARDS_READ;
      bool collected = false;
      while (records.size() < maxRecords) {
        DWORD read = 0, needed = 0;
        if (!Platform::ReadEventLogW(log.log, flags, recordNumber, buffer.data(), static_cast<DWORD>(buffer.size()),
                                     &read, &needed)) {
          const DWORD error = Platform::GetLastError();
          if (error == ERROR_INSUFFICIENT_BUFFER && needed > buffer.size()) {
            buffer.resize(needed);
            continue;
          }
          if (error == ERROR_HANDLE_EOF || error == ERROR_INVALID_PARAMETER) break;
          THROW_AT(EventLogFailure(u"ReadEventLog", static_cast<int>(error)));
        }
        flags = EVENTLOG_SEQUENTIAL_READ | direction;
        for (DWORD at = 0; at + sizeof(EVENTLOGRECORD) <= read && records.size() < maxRecords;) {
          EVENTLOGRECORD head;
          std::memcpy(&head, buffer.data() + at, sizeof head);
          if (head.Length < sizeof head || at + head.Length > read) break;
          const BYTE* record = buffer.data() + at;
          recordNumber = head.RecordNumber;
          collected = true;

          const char16_t* source = reinterpret_cast<const char16_t*>(record + sizeof head);
          std::vector<const char16_t*> strings;
          const char16_t* s = reinterpret_cast<const char16_t*>(record + head.StringOffset);
          for (WORD i = 0; i < head.NumStrings && i < kMaxReadInserts; ++i) {
            strings.push_back(s);
            s += std::char_traits<char16_t>::length(s) + 1;
          }
          auto found = cache.modules.find(source);
          if (found == cache.modules.end()) {
            const Lumo::String path = MessageModulePath(logName, source);
            found = cache.modules.emplace(source, path.empty() ? nullptr : LoadMessageModule(path)).first;
          }
          // A message may name more inserts than the record has: those read as empty strings.
          std::vector<DWORD_PTR> args(99, Arg(u""));
          for (size_t i = 0; i < strings.size(); ++i) args[i] = Arg(strings[i]);
          char16_t* text = nullptr;
          DWORD flagsFormat = FORMAT_MESSAGE_ALLOCATE_BUFFER | FORMAT_MESSAGE_FROM_SYSTEM | FORMAT_MESSAGE_ARGUMENT_ARRAY |
                              (found->second != nullptr ? FORMAT_MESSAGE_FROM_HMODULE : 0);
          DWORD n = Platform::FormatMessageW(flagsFormat, found->second, head.EventID, 0, reinterpret_cast<char16_t*>(&text),
                                             static_cast<DWORD>(kTextBufferSize), reinterpret_cast<va_list*>(args.data()));
          std::unique_ptr<char16_t, void* (*)(void*) noexcept> owned(n != 0 ? text : nullptr, &Platform::LocalFree);
          if (n != 0) {
            records.push_back(FormatRecord(source, head.TimeGenerated, text, head.EventType));
          } else {
            records.push_back(
                FormatRecordFromInserts(source, head.TimeGenerated, strings.data(), strings.size(), head.EventType));
          }
          at += head.Length;
        }
      }
      if (collected) {
        // One record on. Backwards from record 1 there is nothing left; the number 0 would mean
        // "start at the newest" and send a caller paging backwards round the log for ever, so the
        // next call is aimed past the oldest record instead and returns nothing.
        recordNumber = forwards ? recordNumber + 1 : recordNumber > 1 ? recordNumber - 1 : kPastOldestRecord;
      }
    CHECKPOINT_CATCH
  } catch (EventLogFailure&) {
    throw;
  } catch (Exception& e) {
    // Other failures end the reading: the records collected so far are the result. The
    // failure is wrapped as the reading's own and not raised.
    EventLogFailure discarded(u"LumoException::EventLogger::ReadEventLogW", 0, e);
  }
}

// ---- The library's default logger -------------------------------------------------------------

LmDefaultEventLogger::LmDefaultEventLogger() : EventLogger(ToDebugger, ToDebugger, nullptr, nullptr, nullptr, 0) {}

LmDefaultEventLogger::~LmDefaultEventLogger() = default;

}  // namespace LumoException

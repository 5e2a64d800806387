// The event logger: event texts, layout, reports to each target, reading the event log back.
#include <gtest/gtest.h>

#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include "ErrorHandler/Reporting.h"
#include "owutils/EventLogger.h"
#include "owutils/Exceptions.h"
#include "owutils/NamedObjects.h"
#include "platform/Debug.h"
#include "platform/EventLog.h"
#include "owutils/Registry.h"
#include "support/TestEnvironment.h"

using LumoException::EventLogger;
using LumoException::Exception;

namespace {

// Captures debugger output and message boxes while alive.
class Capture {
 public:
  Capture() {
    Platform::SetOutputHook([this](const char* kind, const std::u16string& text) {
      std::lock_guard<std::mutex> guard(m_lock);
      (std::string(kind) == "debug" ? debug : boxes).push_back(text);
    });
  }
  ~Capture() { Platform::SetOutputHook(nullptr); }
  std::vector<std::u16string> debug, boxes;

 private:
  std::mutex m_lock;
};

// A logger set up the way a host program would: targets and a registered source, not installed.
class TestLogger : public EventLogger {
 public:
  TestLogger(int exceptionTargets, int messageTargets, const char16_t* source = nullptr)
      : EventLogger(source, nullptr) {
    m_nExceptionTargets = exceptionTargets;
    m_nMessageTargets = messageTargets;
    if (source != nullptr) {
      m_strMessageFile = u"/nonexistent/OWTestMessages.so";
      m_hEventSource = RegisterSource(source, m_strMessageFile);
    }
  }
  static EventLogger* Install(EventLogger* logger) { return SetInstalledLogger(logger); }
  std::vector<std::u16string> hooked;
  void OnMessage(const char16_t* text) override { hooked.emplace_back(text); }
};

// A fresh state folder per test: its own registry and event log.
class EventLoggerTest : public ::testing::Test {
 protected:
  void SetUp() override {
    const char* old = std::getenv("OWUTILS_STATE_DIR");
    m_old = old == nullptr ? "" : old;
    m_dir = OwTest::MakeTempDirectory("logger");
    setenv("OWUTILS_STATE_DIR", m_dir.c_str(), 1);
  }
  void TearDown() override { setenv("OWUTILS_STATE_DIR", m_old.c_str(), 1); }

  std::string m_dir;
  std::string m_old;
};

bool Contains(const std::u16string& text, const std::u16string& part) { return text.find(part) != std::u16string::npos; }

int ThrowLine = 0;
void ThrowPrecondition() {
  ThrowLine = __LINE__ + 1;
  PRECONDITION(ThrowLine < 0);
}

}  // namespace

TEST(EventText, WrappedPreconditionNamesTheInnermostCause) {
  try {
    ThrowPrecondition();
    FAIL();
  } catch (Exception& e) {
    LumoException::Win32ErrorCode outer(u"CopyFile", 5, e);
    const Lumo::String text = EventLogger::BuildEventText(outer, u"Backup");
    const std::u16string expectedStart =
        u"Exception 'Base:4'\r\n(Backup)\r\n\r\nWin32ErrorCode : " + outer.GetMessage() +
        u"\r\nCAUSED BY PreconditionFailed0 : precondition failed for expression 'ThrowLine < 0'\r\n"
        u"    --> THROWN FROM  ErrorHandler/EventLogger_test.cpp(" +
        OwTest::Widen(std::to_string(ThrowLine)) + u")\r\n";
    EXPECT_EQ(text, expectedStart);
  }
  // Without a text, the header has no second line; an exception never thrown has no history.
  Exception plain(u"plain");
  EXPECT_EQ(EventLogger::BuildEventText(plain, nullptr), u"Exception ':0'\r\n\r\nException : plain\r\n");
}

TEST(EventText, ThrownCheckpointedRethrownInThatOrder) {
  Lumo::String text;
  try {
    CHECKPOINT_TRY
      ThrowPrecondition();
    CHECKPOINT_CATCH
  } catch (Exception& e) {
    text = EventLogger::BuildEventText(e, u"");
  }
  const size_t rethrown = text.find(u"    --> RETHROWN FROM  ");
  const size_t checkpointed = text.find(u"    --> CHECKPOINTED AT  ");
  const size_t thrown = text.find(u"    --> THROWN FROM  ");
  ASSERT_NE(rethrown, std::u16string::npos) << OwTest::Narrow(text);
  ASSERT_NE(checkpointed, std::u16string::npos);
  ASSERT_NE(thrown, std::u16string::npos);
  EXPECT_LT(rethrown, checkpointed);
  EXPECT_LT(checkpointed, thrown);
  EXPECT_EQ(text.find(u"Exception 'Base:4'\r\n\r\n"), 0u);
}

TEST(EventText, HugeExceptionKeepsTheWholePiecesThatFit) {
  Exception big(std::u16string(5000, u'm').c_str());
  Exception outer(std::u16string(3000, u'o').c_str(), big);
  const Lumo::String text = EventLogger::BuildEventText(outer, nullptr);
  // The cause's line does not fit and is left out; the text is not lost.
  EXPECT_EQ(text.find(u"Exception ':0'"), 0u);
  EXPECT_TRUE(Contains(text, std::u16string(3000, u'o')));
  EXPECT_FALSE(Contains(text, u"CAUSED BY"));
  EXPECT_LT(text.size(), EventLogger::kTextBufferSize);
}

TEST(WrapText, LinesOfNinetyWithIndentedContinuations) {
  const std::u16string lineBreak = u"\r\n" + std::u16string(20, u' ');
  char16_t out[EventLogger::kTextBufferSize];
  const std::u16string word(100, u'w');
  EventLogger::WrapText(word.c_str(), out);
  EXPECT_EQ(std::u16string(out), lineBreak + word + u" " + lineBreak + u"\r\n");

  EventLogger::WrapText(u"one  two\tthree\r\nfour", out);
  EXPECT_EQ(std::u16string(out), u"one two three " + lineBreak + u"four \r\n");

  // Twenty words of nine letters cost ten each: the ninth word empties the budget and opens the
  // next line.
  std::u16string many;
  for (int i = 0; i < 20; ++i) many += u"abcdefghi ";
  EventLogger::WrapText(many.c_str(), out);
  std::u16string eight;
  for (int i = 0; i < 8; ++i) eight += u"abcdefghi ";
  EXPECT_EQ(std::u16string(out), eight + lineBreak + eight + lineBreak + u"abcdefghi abcdefghi abcdefghi abcdefghi \r\n");

  // Cut at the end of a small buffer, without the final line end.
  char16_t small[8];
  EventLogger::WrapText(u"abcdefghijkl", small, 8);
  EXPECT_EQ(std::u16string(small), u"abcdefg");
  EventLogger::WrapText(u"", out);
  EXPECT_EQ(std::u16string(out), u"");
}

TEST(DefaultLogger, ReportsToTheDebuggerOnlyAndTouchesNoStore) {
  const std::string dir = OwTest::MakeTempDirectory("untouched");
  const std::string old = std::getenv("OWUTILS_STATE_DIR");
  setenv("OWUTILS_STATE_DIR", dir.c_str(), 1);
  {
    Capture capture;
    auto* logger = static_cast<EventLogger*>(LmObjectGet(u"LM_EVENT_HANDLER"));
    ASSERT_NE(logger, nullptr);
    Exception e(u"boom");
    logger->ReportException(e, u"Context");
    logger->ReportMessage(2, u"%1!s! of %2!d!", u"part", 3);
    ASSERT_EQ(capture.debug.size(), 2u);
    EXPECT_EQ(capture.debug[0], u"Exception ':0'\r\n(Context)\r\n\r\nException : boom\r\n");
    EXPECT_EQ(capture.debug[1], u"part of 3 \r\n");
    EXPECT_TRUE(capture.boxes.empty());
    // Report of the exception core goes to the installed logger: the event-log form.
    e.Report(u"Reported");
    ASSERT_EQ(capture.debug.size(), 3u);
    EXPECT_EQ(capture.debug[2].find(u"Exception ':0'\r\n(Reported)"), 0u);
  }
  EXPECT_TRUE(std::filesystem::is_empty(dir));
  setenv("OWUTILS_STATE_DIR", old.c_str(), 1);
}

TEST(DefaultLogger, EventHandlerReportsAreSkippedWhenTheEntryIsDeleted) {
  void* handler = LmObjectGet(u"LM_EVENT_HANDLER");
  Capture capture;
  Exception e(u"first");
  LumoException::detail::ReportToEventHandler(e, u"LoadResourceModule");
  LumoException::detail::ReportWarningToEventHandler(u"100% done, %1 stays");
  ASSERT_EQ(capture.debug.size(), 2u);
  EXPECT_TRUE(Contains(capture.debug[0], u"(LoadResourceModule)"));
  EXPECT_EQ(capture.debug[1], u"100% done, %1 stays \r\n");  // a finished text, not a template

  ASSERT_TRUE(LmObjectDel(u"LM_EVENT_HANDLER"));
  LumoException::detail::ReportToEventHandler(e, u"IsWow64");
  LumoException::detail::ReportWarningToEventHandler(u"lost");
  EXCEPTION_RECORD record{};
  record.ExceptionCode = EXCEPTION_ACCESS_VIOLATION;
  EXCEPTION_POINTERS pointers{&record, nullptr};
  EXPECT_EQ(LumoException::AccessViolationFilter(EXCEPTION_ACCESS_VIOLATION, &pointers, u"probe"), 1);
  EXPECT_EQ(capture.debug.size(), 2u);
  ASSERT_TRUE(LmObjectAdd(u"LM_EVENT_HANDLER", handler));

  EXPECT_EQ(LumoException::AccessViolationFilter(EXCEPTION_ACCESS_VIOLATION, &pointers, u"probe"), 1);
  ASSERT_EQ(capture.debug.size(), 3u);
  EXPECT_TRUE(Contains(capture.debug[2], u"AccessViolation : "));
}

TEST_F(EventLoggerTest, FullConstructorRegistersInstallsAndUninstalls) {
  // While the default logger is installed, a second one is refused.
  try {
    EventLogger second(1, 1, nullptr, nullptr, nullptr, 0);
    FAIL();
  } catch (LumoException::AssertionFailed0& e) {
    EXPECT_EQ(e.m_expression, u"m_pEventLogger == NULL");
  }
  EventLogger* saved = TestLogger::Install(nullptr);
  {
    EventLogger logger(3, 3, u"OWFull", u"/opt/ow/OWMessages.so", nullptr, 77);
    EXPECT_EQ(EventLogger::GetInstalledLogger(), &logger);
    EXPECT_EQ(logger.GetEventMessageFile(u"owfull"), u"/opt/ow/OWMessages.so");
    EXPECT_EQ(logger.GetEventMessageFile(u"OWOther"), u"");
    HKEY key = nullptr;
    ASSERT_EQ(Platform::RegOpenKeyExW(HKEY_LOCAL_MACHINE, u"SYSTEM\\CurrentControlSet\\Services\\EventLog\\Application\\OWFull",
                                      0, KEY_READ, &key),
              ERROR_SUCCESS);
    DWORD types = 0, size = sizeof types, type = 0;
    EXPECT_EQ(Platform::RegQueryValueExW(key, u"TypesSupported", nullptr, &type, reinterpret_cast<BYTE*>(&types), &size),
              ERROR_SUCCESS);
    EXPECT_EQ(types, 7u);
    Platform::RegCloseKey(key);
    // A logger that was never installed leaves the installation alone when it goes.
    { EventLogger bystander(u"x", nullptr); }
    EXPECT_EQ(EventLogger::GetInstalledLogger(), &logger);
  }
  EXPECT_EQ(EventLogger::GetInstalledLogger(), nullptr);

  // A source without a message file fails the construction, with the messages of a failed start.
  {
    Capture capture;
    EXPECT_THROW(EventLogger(1, 1, u"OWNoFile", nullptr, nullptr, 0), LumoException::PreconditionFailed0);
    ASSERT_GE(capture.debug.size(), 2u);
    EXPECT_EQ(capture.debug[0], u"\r\nFailed to create EventLogger!\r\n");
    EXPECT_EQ(capture.debug[1], u"precondition failed for expression '!msgFilePath.IsEmpty()'");
  }
  // Message boxes for an owner that is not a window.
  try {
    EventLogger boxes(4, 0, nullptr, nullptr, reinterpret_cast<HWND>(0x1234), 0);
    FAIL();
  } catch (Exception& e) {
    EXPECT_EQ(e.GetMessage(), u"Handle is not a window");
  }
  EXPECT_EQ(EventLogger::GetInstalledLogger(), nullptr);
  TestLogger::Install(saved);
}

TEST_F(EventLoggerTest, ReportStringsPassesAtMostSixteenInserts) {
  TestLogger logger(0, LumoException::ToEventLog | LumoException::ToDebugger, u"OWStrings");
  Lumo::StringList strings;
  for (int i = 0; i < 20; ++i) strings.push_back(OwTest::Widen("s" + std::to_string(i)));
  Capture capture;
  EXPECT_TRUE(logger.ReportStrings(4, 1000, strings, 0, nullptr));
  // No message text: each string goes to the debugger on its own.
  ASSERT_EQ(capture.debug.size(), 16u);
  EXPECT_EQ(capture.debug[15], u"s15");

  HANDLE log = Platform::OpenEventLogW(nullptr, u"Application");
  std::vector<BYTE> buffer(4096);
  DWORD read = 0, needed = 0;
  ASSERT_TRUE(Platform::ReadEventLogW(log, EVENTLOG_SEQUENTIAL_READ | EVENTLOG_FORWARDS_READ, 0, buffer.data(), 4096,
                                      &read, &needed));
  EVENTLOGRECORD head;
  std::memcpy(&head, buffer.data(), sizeof head);
  EXPECT_EQ(head.NumStrings, 16);
  EXPECT_EQ(head.EventID, 1000u);
  EXPECT_EQ(head.EventType, 4);
  Platform::CloseEventLog(log);

  // The event log as a target, but no source.
  TestLogger noSource(0, LumoException::ToEventLog);
  EXPECT_FALSE(noSource.ReportStrings(1, 1, strings, 0, nullptr));
  EXPECT_FALSE(noSource.ReportSystemError(5));
  TestLogger quiet(0, 0);
  EXPECT_TRUE(quiet.ReportStrings(1, 1, strings, 0, nullptr));
}

TEST_F(EventLoggerTest, MessagesAndSystemErrorsReachEveryTarget) {
  TestLogger logger(0, 7, u"OWTargets");
  Capture capture;
  logger.ReportMessage(2, 42, u"Disk %1!s! is %2!d!%% full", u"C:", 93);
  ASSERT_EQ(capture.boxes.size(), 1u);
  EXPECT_EQ(capture.boxes[0], u"OWTargets: Disk C: is 93% full \r\n");
  EXPECT_EQ(capture.debug.back(), u"Disk C: is 93% full \r\n");
  ASSERT_EQ(logger.hooked.size(), 1u);
  // A template that cannot be formatted reports nothing.
  logger.ReportMessage(2, u"%1!f!", 1.5);
  logger.ReportMessage(2, nullptr);
  EXPECT_EQ(logger.hooked.size(), 1u);

  EXPECT_TRUE(logger.ReportSystemError(ERROR_ACCESS_DENIED));
  // The system text's own box, then the one of the record's strings.
  ASSERT_GE(capture.boxes.size(), 3u);
  EXPECT_EQ(capture.boxes[capture.boxes.size() - 2], u"System Event: Access is denied.\r\n");
  EXPECT_EQ(capture.boxes.back(), u"OWTargets: Access is denied.\r\n");
  EXPECT_FALSE(logger.ReportSystemError(0x7FFF1234));

  Lumo::StringList records;
  DWORD next = 0;
  logger.ReadEventLog(1, 10, true, records, next);
  ASSERT_EQ(records.size(), 2u);
  EXPECT_EQ(next, 3u);
  // The first record's text is the laid-out message; the second the system text.
  EXPECT_EQ(records[0].find(u"[OWTargets - "), 0u);
  EXPECT_TRUE(Contains(records[0], u" - Warning]\nDisk C: is 93% full \r\n")) << OwTest::Narrow(records[0]);
  EXPECT_TRUE(Contains(records[1], u" - Error]\nAccess is denied.\r\n"));
}

TEST_F(EventLoggerTest, ReadEventLogPagesInBothDirections) {
  TestLogger logger(0, LumoException::ToEventLog, u"OWPages");
  for (int i = 1; i <= 5; ++i) {
    ASSERT_TRUE(logger.ReportStrings(2, 0x20000000u + i, {OwTest::Widen("line" + std::to_string(i)), u"second"}, 0, nullptr));
  }
  Lumo::StringList records;
  DWORD next = 0;
  logger.ReadEventLog(1, 0, true, records, next);
  EXPECT_TRUE(records.empty());
  EXPECT_EQ(next, 0u);

  logger.ReadEventLog(1, 2, true, records, next);
  ASSERT_EQ(records.size(), 2u);
  EXPECT_EQ(next, 3u);
  // Without a message for the event, the inserts, one per line, after the head line.
  const size_t head = records[0].find(u"]\n");
  ASSERT_NE(head, std::u16string::npos);
  EXPECT_EQ(records[0].substr(head), u"]\nline1\nsecond");
  EXPECT_TRUE(Contains(records[0], u" - Warning]"));
  logger.ReadEventLog(1, 10, true, records, next);
  ASSERT_EQ(records.size(), 3u);
  EXPECT_TRUE(Contains(records[0], u"line3"));
  EXPECT_EQ(next, 6u);
  logger.ReadEventLog(1, 10, true, records, next);
  EXPECT_TRUE(records.empty());
  EXPECT_EQ(next, 6u);

  next = 0;
  logger.ReadEventLog(1, 2, false, records, next);
  ASSERT_EQ(records.size(), 2u);
  EXPECT_TRUE(Contains(records[0], u"line5"));
  EXPECT_TRUE(Contains(records[1], u"line4"));
  EXPECT_EQ(next, 3u);
  logger.ReadEventLog(1, 10, false, records, next);
  ASSERT_EQ(records.size(), 3u);
  EXPECT_TRUE(Contains(records[2], u"line1"));
  // Paging backwards ends after the oldest record instead of starting again at the newest.
  logger.ReadEventLog(1, 10, false, records, next);
  EXPECT_TRUE(records.empty());

  // Another log, and a log type that does not exist: no records, no failure.
  next = 0;
  logger.ReadEventLog(3, 10, true, records, next);
  EXPECT_TRUE(records.empty());
  logger.ReadEventLog(9, 10, true, records, next);
  EXPECT_TRUE(records.empty());
}

// The shipped English message module, copied onto drive C of the test's drive map.
bool InstallMessageModule(const char16_t*& windowsPath) {
  std::error_code error;
  const auto exe = std::filesystem::read_symlink("/proc/self/exe", error);
  if (error) return false;
  const auto module = exe.parent_path().parent_path() / "lib" / "OWAppMsg409.so";
  if (!std::filesystem::exists(module)) return false;
  std::filesystem::create_directories(OwTest::SandboxDirectory() + "/drive-c/Messages");
  std::filesystem::copy_file(module, OwTest::SandboxDirectory() + "/drive-c/Messages/OWAppMsg409.so",
                             std::filesystem::copy_options::overwrite_existing, error);
  windowsPath = u"C:\\Messages\\OWAppMsg409.so";
  return !error;
}

TEST_F(EventLoggerTest, MessagesOfTheSourcesMessageModule) {
  const char16_t* messageFile = nullptr;
  if (!InstallMessageModule(messageFile)) GTEST_SKIP() << "the message module is not built";
  class ModuleLogger : public TestLogger {
   public:
    ModuleLogger(const char16_t* file) : TestLogger(0, LumoException::ToEventLog | LumoException::ToDebugger) {
      m_strSourceName = u"OWWithMessages";
      m_strMessageFile = file;
      m_hEventSource = RegisterSource(m_strSourceName, m_strMessageFile);
    }
  } logger(messageFile);
  Capture capture;
  // The message takes one insert; a second one is ignored, a missing one reads as empty.
  ASSERT_TRUE(logger.ReportStrings(1, 0xE0001002, {u"D:\\", u"unused"}, 0, nullptr));
  ASSERT_TRUE(logger.ReportStrings(1, 0xE0001004, {}, 0, nullptr));
  ASSERT_TRUE(logger.ReportStrings(1, 0x12345, {u"no such message"}, 0, nullptr));
  ASSERT_EQ(capture.debug.size(), 3u);
  EXPECT_EQ(capture.debug[0], u"There is not enough free space on D:\\.\r\n");
  EXPECT_EQ(capture.debug[1], u"The connection to the server  was lost.\r\n");
  EXPECT_EQ(capture.debug[2], u"no such message");

  Lumo::StringList records;
  DWORD next = 0;
  logger.ReadEventLog(1, 10, true, records, next);
  ASSERT_EQ(records.size(), 3u);
  EXPECT_TRUE(Contains(records[0], u" - Error]\nThere is not enough free space on D:\\.\r\n")) << OwTest::Narrow(records[0]);
  EXPECT_TRUE(Contains(records[2], u" - Error]\nno such message"));

  // A source that names its publisher instead of a message file.
  HKEY key = nullptr;
  ASSERT_EQ(Platform::RegCreateKeyExW(HKEY_LOCAL_MACHINE,
                                      u"SYSTEM\\CurrentControlSet\\Services\\EventLog\\Application\\OWPublished", 0,
                                      nullptr, 0, KEY_ALL_ACCESS, nullptr, &key, nullptr),
            ERROR_SUCCESS);
  const char16_t guid[] = u"{6B1A3F2E-0000-4000-8000-000000000001}";
  Platform::RegSetValueExW(key, u"ProviderGuid", 0, REG_SZ, reinterpret_cast<const BYTE*>(guid), sizeof guid);
  Platform::RegCloseKey(key);
  ASSERT_EQ(Platform::RegCreateKeyExW(HKEY_LOCAL_MACHINE,
                                      u"SOFTWARE\\Microsoft\\Windows\\CurrentVersion\\WINEVT\\Publishers\\"
                                      u"{6B1A3F2E-0000-4000-8000-000000000001}",
                                      0, nullptr, 0, KEY_ALL_ACCESS, nullptr, &key, nullptr),
            ERROR_SUCCESS);
  const std::u16string file(messageFile);
  Platform::RegSetValueExW(key, u"MessageFileName", 0, REG_EXPAND_SZ, reinterpret_cast<const BYTE*>(file.c_str()),
                           static_cast<DWORD>((file.size() + 1) * 2));
  Platform::RegCloseKey(key);
  HANDLE source = Platform::RegisterEventSourceW(nullptr, u"OWPublished");
  const char16_t* strings[] = {u"E:\\"};
  ASSERT_TRUE(Platform::ReportEventW(source, 2, 0, 0xE0001002, nullptr, 1, 0, strings, nullptr));
  Platform::DeregisterEventSource(source);
  logger.ReadEventLog(1, 10, true, records, next);
  ASSERT_EQ(records.size(), 1u);
  EXPECT_TRUE(Contains(records[0], u"[OWPublished - "));
  EXPECT_TRUE(Contains(records[0], u" - Warning]\nThere is not enough free space on E:\\.\r\n"));
}

TEST_F(EventLoggerTest, WarningsWithAnEventIdReachTheRegisteredLogger) {
  TestLogger logger(0, LumoException::ToEventLog, u"OWWarnings");
  void* handler = LmObjectGet(u"LM_EVENT_HANDLER");
  ASSERT_TRUE(LmObjectAdd(u"LM_EVENT_HANDLER", static_cast<EventLogger*>(&logger)));
  LumoException::detail::ReportWarningToEventHandler(0x40001234, u"Crash reporting: 50% of %1");
  LumoException::detail::ReportWarningToEventHandler(u"plain");
  ASSERT_TRUE(LmObjectAdd(u"LM_EVENT_HANDLER", handler));

  HANDLE log = Platform::OpenEventLogW(nullptr, u"Application");
  std::vector<BYTE> buffer(4096);
  DWORD read = 0, needed = 0;
  ASSERT_TRUE(Platform::ReadEventLogW(log, EVENTLOG_SEQUENTIAL_READ | EVENTLOG_FORWARDS_READ, 0, buffer.data(), 4096,
                                      &read, &needed));
  Platform::CloseEventLog(log);
  EVENTLOGRECORD first, second;
  std::memcpy(&first, buffer.data(), sizeof first);
  std::memcpy(&second, buffer.data() + first.Length, sizeof second);
  EXPECT_EQ(first.EventID, 0x40001234u);
  EXPECT_EQ(first.EventType, 2);
  EXPECT_EQ(std::u16string(reinterpret_cast<const char16_t*>(buffer.data() + first.StringOffset)),
            u"Crash reporting: 50% of %1 \r\n");
  EXPECT_EQ(second.EventID, 0xC0000000u);
}

TEST_F(EventLoggerTest, DamagedStoreIsAnEventLogFailure) {
  {
    std::ofstream garbage(m_dir + "/eventlog.db", std::ios::binary);
    garbage << std::string(4096, '\x17');
  }
  TestLogger logger(0, 0);
  Lumo::StringList records{u"stale"};
  DWORD next = 4;
  try {
    logger.ReadEventLog(1, 0, true, records, next);
    FAIL();
  } catch (LumoException::EventLogFailure& e) {
    EXPECT_EQ(e.m_method, u"OpenEventLog");
    EXPECT_EQ(e.m_error, ERROR_EVENTLOG_FILE_CORRUPT);
  }
  EXPECT_TRUE(records.empty());
  EXPECT_EQ(next, 4u);
}

TEST_F(EventLoggerTest, ConcurrencyReportsFromManyThreadsStayWhole) {
  TestLogger logger(LumoException::ToDebugger, LumoException::ToDebugger | LumoException::ToEventLog, u"OWThreads");
  Capture capture;
  constexpr int kThreads = 4;
  constexpr int kReports = 25;
  std::vector<std::thread> threads;
  for (int t = 0; t < kThreads; ++t) {
    threads.emplace_back([&logger, t] {
      const std::u16string id = OwTest::Widen(std::to_string(t));
      for (int i = 0; i < kReports; ++i) {
        // Three pieces of output per report: they must come out together.
        logger.ReportStrings(4, 1, {id + u"a", id + u"b", id + u"c"}, 0, nullptr);
        Exception e(id.c_str());
        logger.ReportException(e, nullptr);
      }
    });
  }
  for (auto& thread : threads) thread.join();
  ASSERT_EQ(capture.debug.size(), static_cast<size_t>(kThreads * kReports * 4));
  for (size_t i = 0; i < capture.debug.size();) {
    const std::u16string& first = capture.debug[i];
    if (first.size() == 2 && first[1] == u'a') {
      EXPECT_EQ(capture.debug[i + 1], first.substr(0, 1) + u"b");
      EXPECT_EQ(capture.debug[i + 2], first.substr(0, 1) + u"c");
      i += 3;
    } else {
      EXPECT_EQ(first.find(u"Exception ':0'\r\n\r\nException : "), 0u);
      ++i;
    }
  }
  HANDLE log = Platform::OpenEventLogW(nullptr, u"Application");
  DWORD count = 0;
  Platform::GetNumberOfEventLogRecords(log, &count);
  Platform::CloseEventLog(log);
  EXPECT_EQ(count, static_cast<DWORD>(kThreads * kReports));
}

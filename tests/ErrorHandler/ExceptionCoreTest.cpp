// The exception root: post-cloned state, wrapping, history, text form, reporting, the
// structured-exception classes and filter.
#include <gtest/gtest.h>

#include <mutex>
#include <vector>

#include "owutils/EventLogger.h"
#include "owutils/Exceptions.h"
#include "platform/Debug.h"
#include "platform/Errors.h"
#include "support/TestEnvironment.h"

using LumoException::Exception;
using OwTest::Narrow;

namespace {

// Captures debugger output for one test.
class DebugCapture {
 public:
  DebugCapture() {
    Platform::SetOutputHook([this](const char* kind, const std::u16string& text) {
      std::lock_guard<std::mutex> lock(m_mutex);
      m_lines.push_back(std::string(kind) + ":" + Narrow(text));
    });
  }
  ~DebugCapture() { Platform::SetOutputHook(nullptr); }
  std::vector<std::string> Lines() {
    std::lock_guard<std::mutex> lock(m_mutex);
    return m_lines;
  }

 private:
  std::mutex m_mutex;
  std::vector<std::string> m_lines;
};

// Takes the installed event logger (the library's default one) out for one test, so that Report
// takes its path for a process without a logger.
class WithoutInstalledLogger : public LumoException::EventLogger {
 public:
  WithoutInstalledLogger() : m_saved(SetInstalledLogger(nullptr)) {}
  ~WithoutInstalledLogger() override { SetInstalledLogger(m_saved); }

 private:
  EventLogger* m_saved;
};

std::vector<std::string> Lines(const Lumo::String& text) {
  std::vector<std::string> lines;
  std::string all = Narrow(text);
  size_t start = 0;
  for (size_t pos; (pos = all.find('\n', start)) != std::string::npos; start = pos + 1) {
    lines.push_back(all.substr(start, pos - start));
  }
  EXPECT_EQ(start, all.size()) << "text form must end in a line feed";
  return lines;
}

void ThrowPrecondition(int* lineOut) {
  *lineOut = __LINE__ + 1;
  PRECONDITION(lineOut == nullptr);
}

}  // namespace

TEST(ExceptionCore, NullMessageAndNoHistoryGiveTheSingleFirstLine) {
  Exception e(static_cast<const char16_t*>(nullptr));
  EXPECT_TRUE(e.GetMessage().empty());
  EXPECT_EQ(Narrow(e.ToString()), "exception Exception : \n");
  EXPECT_EQ(Narrow(e.GetRootCauseId()), ":0");
}

TEST(ExceptionCore, CloneLeavesTheSourcePostCloned) {
  Exception e(u"original");
  e.SetUserMessage(u"for the user");
  e.RecordThrow(u"a\\b\\c.cpp", 10);
  std::unique_ptr<Exception> clone(e.Clone());
  EXPECT_EQ(Narrow(clone->GetMessage()), "original");
  EXPECT_EQ(Narrow(clone->GetUserMessage()), "for the user");
  ASSERT_EQ(clone->GetHistory().size(), 1u);
  EXPECT_EQ(Narrow(e.GetMessage()), "invalid use of post-cloned exception");
  EXPECT_TRUE(e.GetHistory().empty());
  EXPECT_TRUE(e.GetUserMessage().empty());
  EXPECT_EQ(e.GetCause(), nullptr);
}

TEST(ExceptionCore, EventsRecordedIntoPostClonedExceptionsAreDropped) {
  Exception first(u"one");
  std::unique_ptr<Exception> keep(first.Clone());
  first.RecordThrow(u"x.cpp", 1);
  first.RecordCheckpoint(u"x.cpp", 2);
  Exception second(u"two");
  std::unique_ptr<Exception> keep2(second.Clone());
  EXPECT_TRUE(first.GetHistory().empty());
  EXPECT_TRUE(second.GetHistory().empty());
  EXPECT_EQ(Narrow(second.ToString()), "exception Exception : invalid use of post-cloned exception\n");
}

TEST(ExceptionCore, WrappingKeepsACloneOfTheCause) {
  LumoException::NotImplemented inner(u"Fast path");
  inner.SetUserMessage(u"inner text");
  inner.RecordThrow(u"..\\Strings\\tstring.cpp", 99);
  UnableToOpenFile outer(u"C:\\f.txt", inner);
  outer.SetUserMessage(u"outer text");
  EXPECT_TRUE(inner.IsPostCloned());
  std::vector<std::string> lines = Lines(outer.ToString());
  ASSERT_EQ(lines.size(), 3u);
  EXPECT_EQ(lines[0], "exception UnableToOpenFile : Unable to open file 'C:\\f.txt'");
  EXPECT_EQ(lines[1], "caused by exception NotImplemented : Fast path is not implemented");
  EXPECT_EQ(lines[2], "    thrown from Strings\\tstring.cpp (99)");
  EXPECT_EQ(Narrow(outer.GetRootCauseId()), "Base:13");
  Lumo::StringList messages;
  messages.push_back(u"stale");
  outer.GetUserMessages(messages);
  ASSERT_EQ(messages.size(), 2u);
  EXPECT_EQ(Narrow(messages[0]), "outer text");
  EXPECT_EQ(Narrow(messages[1]), "inner text");
}

TEST(ExceptionCore, ThrownCheckpointedRethrownTextFormLineByLine) {
  int throwLine = 0, tryLine = 0, catchLine = 0, wrapLine = 0;
  try {
    try {
      tryLine = __LINE__ + 1;
      CHECKPOINT_TRY
        catchLine = __LINE__ + 2;
        ThrowPrecondition(&throwLine);
      CHECKPOINT_CATCH
    } catch (Exception& e) {
      wrapLine = __LINE__ + 1;
      THROW_AT(UnableToCopyFile(u"a", u"b", e));
    }
    FAIL() << "no exception";
  } catch (UnableToCopyFile& e) {
    const std::string file = "ErrorHandler/ExceptionCoreTest.cpp";
    std::vector<std::string> lines = Lines(e.ToString());
    ASSERT_EQ(lines.size(), 6u) << Narrow(e.ToString());
    EXPECT_EQ(lines[0], "exception UnableToCopyFile : Unable to copy file from 'a' to 'b'");
    EXPECT_EQ(lines[1], "    thrown from " + file + " (" + std::to_string(wrapLine) + ")");
    EXPECT_EQ(lines[2], "caused by exception PreconditionFailed0 : precondition failed for expression 'lineOut == nullptr'");
    EXPECT_EQ(lines[3], "    thrown from " + file + " (" + std::to_string(catchLine) + ")");
    EXPECT_EQ(lines[4], "    checkpointed at " + file + " (" + std::to_string(tryLine) + ")");
    EXPECT_EQ(lines[5], "    thrown from " + file + " (" + std::to_string(throwLine) + ")");
    EXPECT_EQ(Narrow(e.GetRootCauseId()), "Base:4");
  }
}

TEST(ExceptionCore, CheckpointLetsForeignExceptionsPassUntouched) {
  EXPECT_THROW(
      {
        CHECKPOINT_TRY
          throw std::runtime_error("foreign");
        CHECKPOINT_CATCH
      },
      std::runtime_error);
}

TEST(ExceptionCore, ThrowKeepsTheDynamicClass) {
  std::unique_ptr<Exception> held(new FileDoesNotExist(u"C:\\x"));
  try {
    THROW_AT(*held);
  } catch (FileSystemException& e) {
    EXPECT_EQ(Narrow(e.GetType().name), "FileDoesNotExist");
    EXPECT_EQ(Narrow(static_cast<FileDoesNotExist&>(e).m_path), "C:\\x");
  }
  EXPECT_TRUE(held->IsPostCloned());
  // Fields are copied, not moved, by the move that Throw and Clone use.
  EXPECT_EQ(Narrow(static_cast<FileDoesNotExist&>(*held).m_path), "C:\\x");
}

TEST(ExceptionCore, ShortFileName) {
  EXPECT_EQ(Narrow(Exception::ShortFileName(u"secure.cpp")), "secure.cpp");
  EXPECT_EQ(Narrow(Exception::ShortFileName(u"..\\Strings\\tstring.cpp")), "Strings\\tstring.cpp");
  EXPECT_EQ(Narrow(Exception::ShortFileName(u"..\\ErrorHandler\\EventLogger.cpp")), "ErrorHandler\\EventLogger.cpp");
  EXPECT_EQ(Narrow(Exception::ShortFileName(nullptr)), "");
  EXPECT_EQ(Narrow(Exception::ShortFileName(u"\\a.cpp")), "a.cpp");
  EXPECT_EQ(Narrow(Exception::ShortFileName(u"x\\a.cpp")), "a.cpp");
  EXPECT_EQ(Narrow(Exception::ShortFileName(u"\\x\\a.cpp")), "a.cpp");  // only the first character precedes
  // Build paths on POSIX: never leak the build machine's absolute path.
  EXPECT_EQ(Narrow(Exception::ShortFileName(u"/home/build/src/ErrorHandler/EventLogger.cpp")),
            "ErrorHandler/EventLogger.cpp");
}

TEST(ExceptionCore, ReportWithoutLoggerWritesToDebuggerOutput) {
  WithoutInstalledLogger noLogger;
  DebugCapture capture;
  Exception e(u"lost");
  e.Report(u"context");
  e.Report(nullptr);
  std::vector<std::string> lines = capture.Lines();
  ASSERT_EQ(lines.size(), 3u);
  EXPECT_EQ(lines[0], "debug:context");
  EXPECT_EQ(lines[1], "debug:exception Exception : lost\n");
  EXPECT_EQ(lines[2], lines[1]);
}

TEST(ExceptionCore, CatchAndReportReportsAndContinues) {
  WithoutInstalledLogger noLogger;
  DebugCapture capture;
  int catchLine = 0;
  int tryLine = __LINE__ + 1;
  CHECKPOINT_TRY
    catchLine = __LINE__ + 2;
    THROW_AT(LumoException::NotImplemented(u"x"));
  CATCH_AND_REPORT
  CHECKPOINT_TRY
    throw 42;
  CATCH_AND_REPORT
  std::vector<std::string> lines = capture.Lines();
  ASSERT_EQ(lines.size(), 4u);
  EXPECT_EQ(lines[0], "debug:ErrorHandler/ExceptionCoreTest.cpp(" + std::to_string(catchLine) + ") unexpected failure");
  EXPECT_NE(lines[1].find("checkpointed at ErrorHandler/ExceptionCoreTest.cpp (" + std::to_string(tryLine) + ")"),
            std::string::npos);
  EXPECT_NE(lines[3].find("exception UnhandledException : Caught an unhandled exception"), std::string::npos);
}

TEST(StructuredExceptions, NamesAndMessages) {
  EXPECT_EQ(Narrow(LumoException::StructuredExceptionName(0xC0000005u)), "ACCESS_VIOLATION");
  EXPECT_EQ(Narrow(LumoException::StructuredExceptionName(0xC00000FDu)), "STACK_OVERFLOW");
  EXPECT_EQ(Narrow(LumoException::StructuredExceptionName(0x80000003u)), "BREAKPOINT");
  EXPECT_EQ(Narrow(LumoException::StructuredExceptionName(0x12345678u)), "Unknown");

  EXCEPTION_RECORD record{};
  record.ExceptionCode = 0xC0000005u;
  record.ExceptionAddress = reinterpret_cast<void*>(static_cast<uintptr_t>(0x1000));
  record.NumberParameters = 2;
  record.ExceptionInformation[0] = 1;
  record.ExceptionInformation[1] = 0x20;
  EXCEPTION_POINTERS pointers{&record, nullptr};
  const std::string address = std::string(2 * sizeof(void*) - 4, '0') + "1000";
  const std::string target = std::string(2 * sizeof(void*) - 2, '0') + "20";
  LumoException::AccessViolation write(&pointers);
  EXPECT_EQ(Narrow(write.GetMessage()), "ACCESS_VIOLATION (0xc0000005) at address 0x" + address +
                                            ". Attempting to write to address 0x" + target + ".");
  record.ExceptionInformation[0] = 0;
  LumoException::AccessViolation read(&pointers);
  EXPECT_NE(Narrow(read.GetMessage()).find("Attempting to read from"), std::string::npos);
  record.ExceptionCode = 0xC0000094u;
  LumoException::StructuredException divide(&pointers);
  EXPECT_EQ(Narrow(divide.GetMessage()), "INT_DIVIDE_BY_ZERO (0xc0000094) at address 0x" + address + ".");
  EXPECT_EQ(divide.m_pRecord, &record);
}

TEST(StructuredExceptions, AccessViolationFilter) {
  EXCEPTION_RECORD record{};
  record.ExceptionCode = 0xC0000005u;
  EXCEPTION_POINTERS pointers{&record, nullptr};
  EXPECT_EQ(LumoException::AccessViolationFilter(0xC0000094u, &pointers, u"x"), EXCEPTION_CONTINUE_SEARCH);
  EXPECT_EQ(LumoException::AccessViolationFilter(0xC0000005u, nullptr, u"x"), EXCEPTION_EXECUTE_HANDLER);
  EXPECT_EQ(LumoException::AccessViolationFilter(0xC0000005u, &pointers, u"x"), EXCEPTION_EXECUTE_HANDLER);
}

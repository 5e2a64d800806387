// Helpers of the crash-reporting tests: the test component's call log, and the reports that
// reach the debugger output through the default event logger.
#pragma once

#include <gtest/gtest.h>

#include <cstdlib>
#include <fstream>
#include <mutex>
#include <string>
#include <vector>

#include "platform/Debug.h"
#include "support/TestEnvironment.h"

namespace CrashTest {

// Points the test component's log at a fresh file and clears its answers.
class ComponentLog {
 public:
  ComponentLog() : m_path(OwTest::MakeTempDirectory("crash") + "/calls.log") {
    setenv("OWTEST_CRASHRPT_LOG", m_path.c_str(), 1);
    unsetenv("OWTEST_CRASHRPT_INSTALL_RESULT");
    unsetenv("OWTEST_CRASHRPT_ERROR");
    unsetenv("OWTEST_CRASHRPT_PROPERTY_RESULT");
  }
  ~ComponentLog() { unsetenv("OWTEST_CRASHRPT_LOG"); }

  std::vector<std::string> Lines() const {
    std::vector<std::string> lines;
    std::ifstream file(m_path);
    for (std::string line; std::getline(file, line);) lines.push_back(line);
    return lines;
  }

 private:
  std::string m_path;
};

// Collects what is written to the debugger output (where the default event logger reports).
class CapturedOutput {
 public:
  CapturedOutput() {
    Platform::SetOutputHook([this](const char*, const std::u16string& text) {
      std::lock_guard<std::mutex> lock(m_lock);
      m_text += OwTest::Narrow(text);
    });
  }
  ~CapturedOutput() { Platform::SetOutputHook({}); }

  std::string Text() {
    std::lock_guard<std::mutex> lock(m_lock);
    return m_text;
  }
  size_t Count(const std::string& piece) {
    const std::string text = Text();
    size_t count = 0;
    for (size_t at = text.find(piece); at != std::string::npos; at = text.find(piece, at + piece.size())) ++count;
    return count;
  }

 private:
  std::mutex m_lock;
  std::string m_text;
};

// The value of `key=` in a component log line, up to the next " key=" of the record or the end.
inline std::string Field(const std::string& line, const std::string& key) {
  const std::string marker = " " + key + "=";
  size_t at = line.find(marker);
  if (at == std::string::npos) return "<missing " + key + ">";
  at += marker.size();
  size_t end = line.size();
  for (const char* next : {" app=", " version=", " url=", " callback=", " prio=", " flags=", " dump=", " others=",
                           " lang=", " dest=", " desc=", " value="}) {
    const size_t found = line.find(next, at);
    if (found != std::string::npos && found < end) end = found;
  }
  return line.substr(at, end - at);
}

inline int TestCallback(void*) { return 42; }

}  // namespace CrashTest

// Helpers for the file-system tests: folders on drive C (mapped into the sandbox by the test
// support), native file access for arranging and checking, and exception matchers.
#pragma once

#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <string>

#include "owutils/CString.h"
#include "owutils/Exceptions.h"
#include "support/TestEnvironment.h"

namespace FsTest {

// A fresh folder on drive C.
struct Folder {
  Folder() {
    static int n = 0;
    name = "fs" + std::to_string(n++);
    native = OwTest::SandboxDirectory() + "/drive-c/" + name;
    std::filesystem::create_directories(native);
    path = CString(u"C:\\") + CString(OwTest::Widen(name));
  }
  CString operator/(const char16_t* child) const { return path + u"\\" + child; }
  std::string Native(const std::string& child) const { return native + "/" + child; }
  std::string name, native;
  CString path;
};

inline void Write(const std::string& native, const std::string& text) {
  std::filesystem::create_directories(std::filesystem::path(native).parent_path());
  std::ofstream(native, std::ios::binary) << text;
}
inline std::string Read(const std::string& native) {
  std::ifstream in(native, std::ios::binary);
  return std::string((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
}
inline bool NativeExists(const std::string& native) {
  std::error_code ec;
  return std::filesystem::exists(std::filesystem::symlink_status(native, ec));
}

inline std::string Text(const LumoException::Exception& e) { return OwTest::Narrow(e.GetMessage()); }

// Runs `body`, expects it to throw E, and returns the caught exception's message and its
// cause's type name and message ("" when there is none).
struct Caught {
  bool thrown = false;
  std::string message, causeName, causeMessage;
  int causeError = -1;
};

template <typename E, typename F>
Caught Catch(F&& body) {
  Caught c;
  try {
    body();
  } catch (E& e) {
    c.thrown = true;
    c.message = Text(e);
    if (const auto* cause = e.GetCause()) {
      c.causeName = OwTest::Narrow(cause->GetType().name);
      c.causeMessage = Text(*cause);
      if (const auto* w = dynamic_cast<const LumoException::Win32Error*>(cause)) c.causeError = w->m_error;
      if (const auto* w = dynamic_cast<const LumoException::Win32ErrorCode*>(cause)) c.causeError = w->m_error;
    }
  }
  return c;
}

}  // namespace FsTest

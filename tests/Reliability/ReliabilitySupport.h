// Helpers of the reliability tests: files in the sandbox seen both natively and as library
// paths, byte patterns, and a capture of what the library reports.
#pragma once

#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

#include "owutils/CString.h"
#include "owutils/Paths.h"
#include "platform/Debug.h"
#include "support/TestEnvironment.h"

namespace OwTest {

using Bytes = std::vector<unsigned char>;

inline Bytes Pattern(size_t size, unsigned seed = 1) {
  Bytes data(size);
  for (size_t i = 0; i < size; ++i) data[i] = static_cast<unsigned char>(i * 131 + i / 251 + seed * 17);
  return data;
}

inline void WriteNative(const std::string& native, const Bytes& data) {
  std::filesystem::create_directories(std::filesystem::path(native).parent_path());
  std::ofstream(native, std::ios::binary | std::ios::trunc)
      .write(reinterpret_cast<const char*>(data.data()), static_cast<std::streamsize>(data.size()));
}

inline Bytes ReadNative(const std::string& native) {
  std::ifstream in(native, std::ios::binary);
  return Bytes(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
}

// The library's form of a native path.
inline CString LibraryPath(const std::string& native) { return Paths::FromNativePath(CString(Widen(native))); }

// Collects the debugger output (where the library's reports end up) while it lives.
class ReportCapture {
 public:
  ReportCapture() {
    Platform::SetOutputHook([this](const char*, const std::u16string& text) { m_text += text; });
  }
  ~ReportCapture() { Platform::SetOutputHook({}); }
  ReportCapture(const ReportCapture&) = delete;
  ReportCapture& operator=(const ReportCapture&) = delete;

  const std::u16string& Text() const { return m_text; }
  std::string Narrow() const { return OwTest::Narrow(m_text); }
  void Clear() { m_text.clear(); }

 private:
  std::u16string m_text;
};

}  // namespace OwTest

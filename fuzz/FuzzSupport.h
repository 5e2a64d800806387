// Shared helpers of the fuzz programs.
//
// Every program runs hermetically: before the first input, the library's state directory and
// drive map point into a fresh temporary folder (removed at exit), as the tests do. Inputs are
// cut into pieces with FuzzedDataProvider; UTF-16 text comes from pairs of input bytes.
#pragma once

#include <fuzzer/FuzzedDataProvider.h>

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <string>
#include <unistd.h>

namespace OwFuzz {

// Creates the sandbox once and points OWUTILS_STATE_DIR and OWUTILS_DRIVES into it.
inline const std::string& Sandbox() {
  // Never destroyed: the exit handler below still needs it.
  static const std::string* const dir = [] {
    std::string pattern = (std::filesystem::temp_directory_path() / "owfuzz-XXXXXX").string();
    if (mkdtemp(pattern.data()) == nullptr) {
      std::perror("mkdtemp");
      std::abort();
    }
    std::filesystem::create_directories(pattern + "/state");
    std::filesystem::create_directories(pattern + "/c");
    ::setenv("OWUTILS_STATE_DIR", (pattern + "/state").c_str(), 1);
    ::setenv("OWUTILS_DRIVES", ("C=" + pattern + "/c").c_str(), 1);
    ::setenv("OWUTILS_DEBUG_OUTPUT", "", 1);
    std::atexit([] {
      std::error_code ignored;
      std::filesystem::remove_all(Sandbox(), ignored);
    });
    return new std::string(pattern);
  }();
  return *dir;
}

// UTF-16 units from pairs of bytes (little-endian); an odd last byte is dropped.
inline std::u16string Units(const std::string& bytes) {
  std::u16string text;
  text.reserve(bytes.size() / 2);
  for (size_t i = 0; i + 1 < bytes.size(); i += 2) {
    text.push_back(static_cast<char16_t>(static_cast<unsigned char>(bytes[i]) |
                                         (static_cast<unsigned char>(bytes[i + 1]) << 8)));
  }
  return text;
}

// Bytes widened one to one (Latin-1): handy for ASCII-shaped inputs such as XML, paths and codes.
inline std::u16string Latin1(const std::string& bytes) {
  std::u16string text;
  text.reserve(bytes.size());
  for (unsigned char c : bytes) text.push_back(c);
  return text;
}

// The text up to its first NUL, as the library's NUL-terminated interfaces see it.
inline std::u16string UpToNul(std::u16string text) {
  size_t end = text.find(u'\0');
  if (end != std::u16string::npos) text.resize(end);
  return text;
}
inline std::string UpToNul(std::string text) {
  size_t end = text.find('\0');
  if (end != std::string::npos) text.resize(end);
  return text;
}

// Stops the program with a message: libFuzzer records the input as a crash.
[[noreturn]] inline void Fail(const char* what) {
  std::fprintf(stderr, "property violated: %s\n", what);
  std::abort();
}

}  // namespace OwFuzz

#define FUZZ_CHECK(condition)                         \
  do {                                                \
    if (!(condition)) ::OwFuzz::Fail(#condition);     \
  } while (0)
